// Positions that a step could have been asked for by number.
//
// Pattern     a[position() = 3], a[3 eq position()]; a[$i + 1]; a[last()], (//a)[last() - 1],
//             $l[position() = last()]
// Facts       the number is an integer, 1 or more, or an expression that answers nothing else,
//             reads no focus and is repeatable; nothing shows the focus that the predicate leaves
//             (StepsAround.h)
// Operator    none: the predicate is the number, so that the step walks no further than that; an
//             expression is evaluated once for the nodes of the step and not for each of them; what
//             is counted from the back is taken from there, and children are walked from the last
// Why         a number in a predicate asks for that position; without nodes it is not evaluated,
//             and an error in it drops each of them; "last()" is the number of the items, and
//             subtracting from it fails for none
#include "Expr/Operators/XQueryOperatorExpr.h"
#include "Expr/XQueryLeaves.h"
#include "Plan/Planning.h"
#include "Plan/Rules.h"
#include "Plan/Rules/PathAt.h"
#include "Plan/Rules/PositionConditions.h"
#include "Plan/Rules/StepsAround.h"
#include "Types/XQueryNumber.h"

namespace xquery {

namespace {

bool isPositionForAll(const XQueryFacts& facts) {
  return facts.are(XQueryItems::Numeric) && facts.most <= 1 && facts.isRepeatable() &&
         facts.assigns.isEmpty() &&
         !facts.does(XQueryDeeds::ReadsFocus | XQueryDeeds::LoadsDocuments);
}

class Search {
 public:
  explicit Search(XQueryPlanning& planning) : _planning(planning) {}

  void lookAt(XQueryPlaceID place) {
    const XQueryPlace& here = _planning.program[place];
    if (here.role != XQueryRole::Predicate || !_planning.isOpen(place) || !here.step) return;
    if (here.parent == XQueryNoPlace) return;
    auto* path = XQueryWalkedPathAt(_planning, here.parent);
    if (!path) return;
    // A path restores the focus that its start has left.
    const bool isAll = path->start() == here.step && path->steps().empty();
    const bool hidesFocus = XQueryHidesFocusOf(*here.step, *path, here.parent, _planning);
    if ((isAll || hidesFocus) && takeFromBack(place, *path)) return;
    if (hidesFocus && !takeNumber(place, *path)) takeExpression(place, *path);
  }

 private:
  bool takeNumber(XQueryPlaceID place, const XQueryWalkedPath& path) {
    const XQueryPlace& here = _planning.program[place];
    const auto asked = XQueryPositionConditionIn(*here.expr);
    const bool isEqual = asked && (asked->comparison == XQueryOperatorEqual ||
                                   asked->comparison == XQueryOperatorEq);
    if (!isEqual || asked->number < 1) return false;
    auto number = XQueryLiteral::literalWithValue(XQueryNumber::integerWithInt64(asked->number));
    number->setExprLine(here.expr->exprLine());
    number->setExprPlace(here.expr->exprPlace());
    _planning.replace(place, std::move(number));
    const_cast<XQueryPathExpr&>(path.path()).notePositions();
    return true;
  }

  bool takeFromBack(XQueryPlaceID place, XQueryWalkedPath& path) {
    const XQueryPlace& here = _planning.program[place];
    const auto behind = XQueryItemsBehindAskedFor(*here.expr);
    XQueryFromBack* fromBack = behind ? fromBackOf(*here.step, path) : nullptr;
    if (!fromBack || fromBack->predicate != XQueryFromBack::noPredicate) return false;
    const auto& predicates = here.step->predicates();
    for (size_t index = 0; index < predicates.size(); ++index) {
      if (&*here.slot == &predicates[index]) *fromBack = {index, *behind};
    }
    if (fromBack->predicate == XQueryFromBack::noPredicate) return false;
    _planning.choose(place, "the position is counted from the back");
    return true;
  }

  static XQueryFromBack* fromBackOf(const XQueryStep& step, XQueryWalkedPath& path) {
    if (path.start() == &step) return &path.startFromBack();
    for (XQueryWalkedStep& each : path.changeableSteps()) {
      if (each.step == &step) return each.isExpression() ? nullptr : &each.fromBack;
    }
    return nullptr;
  }

  // Of the first predicate of an axis step that is no part of its test.
  void takeExpression(XQueryPlaceID place, XQueryWalkedPath& path) {
    const XQueryPlace& here = _planning.program[place];
    if (!isPositionForAll(_planning.facts[place])) return;
    for (XQueryWalkedStep& step : path.changeableSteps()) {
      if (step.step != here.step || step.isExpression() || !step.hasPredicates()) continue;
      if (&*here.slot != &*step.firstPredicate()) continue;
      step.computedPosition = step.predicatesInTest;
      _planning.choose(place, "the number is worked out once, and the step walks no further");
    }
  }

  XQueryPlanning& _planning;
};

}  // namespace

void XQueryTakePositions(XQueryPlanning& planning) {
  Search search(planning);
  for (XQueryPlaceID place = 0; place < planning.program.placeCount(); ++place) {
    search.lookAt(place);
  }
}

}  // namespace xquery

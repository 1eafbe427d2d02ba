// Positions that a step could have been asked for by number.
//
// Pattern     a[position() = 3], a[3 eq position()]; a[$i + 1], $l[$i]; a[last()],
//             (//a)[last() - 1], $l[position() = last()]
// Facts       the number is an integer, 1 or more, or an expression that may answer numbers, reads
//             no focus and is repeatable; nothing shows the focus that the predicate leaves
//             (StepsAround.h), but for what is asked of the items that a path starts from, which
//             leaves the one that asking each leaves
// Operator    none: the predicate is the number, so that the step walks no further than that; an
//             expression is evaluated once for the items of the step and not for each of them; what
//             is counted from the back is taken from there, and children are walked from the last
// Why         a number in a predicate asks for that position, and anything else that is the same
//             for all items keeps all of them or none; without items it is not evaluated, and an
//             error in it drops each of them; "last()" is the number of the items, and subtracting
//             from it fails for none
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

// For what is no number in any case, asking each item costs little.
bool isSameForAll(const XQueryFacts& facts) {
  return facts.mayBe(XQueryItems::Numeric) && facts.isRepeatable() && facts.assigns.isEmpty() &&
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
    if (hidesFocus && takeNumber(place, *path)) return;
    if (path->start() == here.step || hidesFocus) takeExpression(place, *path);
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
    XQueryStepPositions* of = behind ? path.positionsOf(*here.step) : nullptr;
    const auto index = XQueryPredicateAt(here);
    if (!of || !index || of->fromBack.predicate != XQueryFromBack::noPredicate) return false;
    of->fromBack = {*index, *behind};
    _planning.choose(place, "the position is counted from the back");
    return true;
  }

  // Of the start, or of an axis step behind what is part of its test.
  void takeExpression(XQueryPlaceID place, XQueryWalkedPath& path) {
    const XQueryPlace& here = _planning.program[place];
    const XQueryFacts& facts = _planning.facts[place];
    XQueryStepPositions* of = isSameForAll(facts) ? path.positionsOf(*here.step) : nullptr;
    const auto index = XQueryPredicateAt(here);
    if (!of || !index || of->sameForAll != XQueryStepPositions::noPredicate) return;
    const bool isNumber = facts.are(XQueryItems::Numeric) && facts.most <= 1;
    for (XQueryWalkedStep& step : path.changeableSteps()) {
      if (step.step != here.step) continue;
      if (*index < step.predicatesInTest) return;
      step.isPositionComputed = isNumber && *index == step.predicatesInTest;
    }
    of->sameForAll = *index;
    _planning.choose(place, isNumber ? "the number is worked out once, and the step goes no further"
                                     : "what is the same for all items is worked out once");
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

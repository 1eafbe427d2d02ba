// Names that a step could have asked for itself.
//
// Pattern     *[self::a], *[self::a or self::b], *[name() = "a"], *[local-name(.) = ("a", "b")]
//             where that is the first predicate of the step; P/(a | b), P//(a | b), P/(@a | @b);
//             //a | //b, /r/a | /r/b
// Facts       the test before the filter looks at kinds of nodes alone; the names can be resolved
//             without an error; no expression behind it asks for the position that a node has
//             among the others; nothing shows the focus that it leaves (StepsAround.h)
// Operator    none: the step takes the choice of names into its test (XQueryAxisStep::setChoice)
//             and so it is found in the index of the tree, below "//" as well
// Why         all of these conditions look at the node alone and cannot fail; the children of a
//             node that have one of two names are, in document order, the union of those that have
//             the one and those that have the other; so are the results of whole paths from the
//             document, where they are sorted
#include "Expr/Operators/XQueryOperatorExpr.h"
#include "Expr/Paths/XQueryPath.h"
#include "Expr/XQueryLists.h"
#include "Plan/Planning.h"
#include "Plan/Rules.h"
#include "Plan/Rules/NameConditions.h"
#include "Plan/Rules/StepsAround.h"

#include <memory>
#include <vector>

namespace xquery {
namespace {

// The only step of a path that consists of a name test; null for anything else.
const XQueryAxisStep* nameStepIn(const XQueryExpr* expr) {
  const auto* path = dyn_cast<XQueryPathExpr>(XQueryWithoutParentheses(expr));
  const auto* step = path ? dyn_cast<XQueryAxisStep>(path->step()) : nullptr;
  const bool fits = step && !step->next() && step->predicates().empty() && !step->choice() &&
                    isa<XQueryNameTest>(step->expr()) && !step->testMayRaise();
  return fits ? step : nullptr;
}

Ref<XQueryNameTest> testOf(const XQueryAxisStep& step) {
  return Ref<XQueryNameTest>(cast<XQueryNameTest>(step.expr()));
}

constexpr size_t mostNames = 64;

// Takes apart what one operator joins, in any number, from left to right.
template <class IsJoint, class Visit>
bool forEachOperand(const XQueryExpr* expr, IsJoint isJoint, Visit visit) {
  std::vector<const XQueryExpr*> waiting = {expr};
  for (size_t seen = 0; !waiting.empty(); ++seen) {
    const XQueryExpr* each = XQueryWithoutParentheses(waiting.back());
    waiting.pop_back();
    if (!each || seen > mostNames) return false;
    if (isJoint(*each)) {
      const auto* joint = cast<XQueryOperatorExpr>(each);
      waiting.push_back(joint->right());
      waiting.push_back(joint->left());
    } else if (!visit(*each)) {
      return false;
    }
  }
  return true;
}

bool isOperator(const XQueryExpr& expr, int type) {
  const auto* found = dyn_cast<XQueryOperatorExpr>(&expr);
  return found && found->operatorType() == type;
}

// The names that a predicate asks for; empty for one that asks for anything else.
XQueryNameChoice namesAskedFor(const XQueryExpr& predicate) {
  XQueryNameChoice names;
  const auto add = [&](const XQueryExpr& condition) {
    if (const XQueryAxisStep* step = nameStepIn(&condition)) {
      if (step->axis() != XQueryAxisSelf) return false;
      names.addTest(testOf(*step));
      return true;
    }
    const auto known = XQueryNameConditionIn(condition);
    if (!known) return false;
    for (const Ref<NSString>& text : known->texts) {
      // What has no name has the empty one.
      if (text->length() == 0) return false;
      names.addText(known->by, text);
    }
    return true;
  };
  const auto isOr = [](const XQueryExpr& expr) { return isOperator(expr, XQueryOperatorOr); };
  return forEachOperand(&predicate, isOr, add) ? names : XQueryNameChoice();
}

// Whether the test accepts a node by its kind.
bool asksForKindAlone(const XQueryExpr* test) {
  if (const auto* wildCard = dyn_cast<XQueryWildCardNameTest>(test)) {
    return !wildCard->prefix() && !wildCard->localName();
  }
  const auto* type = dyn_cast<XQueryTypeDeclaration>(test);
  if (!type || type->data() || !type->acceptsCount(1)) return false;
  return type->type() == XQueryTypeDeclaration::AnyKindTest ||
         type->type() == XQueryTypeDeclaration::ElementTest;
}

bool isUnion(const XQueryExpr& expr) {
  return isOperator(expr, XQueryOperatorUnion);
}

bool isChildOfName(const XQueryAxisStep& step) {
  return step.axis() == XQueryAxisChild && step.predicates().empty() && !step.choice() &&
         isa<XQueryNameTest>(step.expr()) && !step.testMayRaise();
}

// The last step of a path from the document by children and "//" without predicates, if that is a
// child of a name; else null.
const XQueryAxisStep* lastNameFromRoot(const XQueryPathExpr& path) {
  if (!isa<XQueryRootStep>(path.step()) || !path.step()->predicates().empty()) return nullptr;
  const XQueryAxisStep* last = nullptr;
  for (const XQueryStep* each = path.step()->next(); each; each = each->next()) {
    last = dyn_cast<XQueryAxisStep>(each);
    if (!last || (!isChildOfName(*last) && !last->isDescendantShorthand())) return nullptr;
  }
  return last && isChildOfName(*last) ? last : nullptr;
}

// Whether two such paths are the same but for their last names.
bool leadAlike(const XQueryPathExpr& a, const XQueryPathExpr& b) {
  const XQueryStep* one = a.step()->next();
  const XQueryStep* other = b.step()->next();
  for (; one && other; one = one->next(), other = other->next()) {
    if (!one->next() || !other->next()) return one->next() == other->next();
    const auto* name = dyn_cast<XQueryNameTest>(one->expr());
    const auto* otherName = dyn_cast<XQueryNameTest>(other->expr());
    if (!name != !otherName) return false;
    if (name && !(name->name()->view() == otherName->name()->view())) return false;
  }
  return false;
}

class Search {
 public:
  explicit Search(XQueryPlanning& planning) : _planning(planning) {}

  void run() {
    for (XQueryPlaceID place = 0; place < _planning.program.placeCount(); ++place) {
      if (!_planning.isOpen(place)) continue;
      const XQueryExpr& expr = *_planning.program[place].expr;
      if (isUnion(expr)) takeUnionOfPaths(place);
      if (isa<XQueryPathExpr>(&expr)) {
        lookAt(place, *cast<XQueryPathExpr>(_planning.program[place].expr));
      }
    }
  }

 private:
  void lookAt(XQueryPlaceID place, XQueryPathExpr& path) {
    bool hasChanged = false;
    XQueryStep* previous = nullptr;
    for (XQueryStep* step = path.step(); step; previous = step, step = step->next()) {
      if (auto* axisStep = dyn_cast<XQueryAxisStep>(step)) {
        hasChanged = takeFilter(place, path, *axisStep) || hasChanged;
      } else if (isa<XQueryAxisStep>(previous) && takeUnion(place, path, *previous, *step)) {
        step = previous->next();
      }
    }
    if (hasChanged) path.noteChange();
  }

  // The place of a step's part in that role.
  XQueryPlaceID partOf(XQueryPlaceID path, const XQueryStep& step, XQueryRole role) const {
    XQueryPlaceID part = _planning.program.firstPart(path);
    while (part != XQueryNoPlace &&
           !(_planning.program[part].step == &step && _planning.program[part].role == role)) {
      part = _planning.program.nextPart(part);
    }
    return part;
  }

  bool takeFilter(XQueryPlaceID path, const XQueryPathExpr& expr, XQueryAxisStep& step) {
    // An expression behind it counts the nodes that are left.
    if (step.next() && !isa<XQueryAxisStep>(step.next())) return false;
    if (step.choice() || !asksForKindAlone(step.expr()) || step.predicates().empty()) return false;
    const XQueryPlaceID place = partOf(path, step, XQueryRole::Predicate);
    if (place == XQueryNoPlace || !_planning.isOpen(place)) return false;
    XQueryNameChoice names = namesAskedFor(*_planning.program[place].expr);
    if (names.isEmpty()) return false;
    if (!XQueryHidesFocusOf(step, expr, path, _planning)) return refuse(place);
    step.setChoice(std::make_unique<const XQueryNameChoice>(std::move(names)), 1);
    _planning.leaveOut(place);
    _planning.choose(place, "it is part of the test of the step");
    return true;
  }

  bool takeUnion(XQueryPlaceID path, XQueryPathExpr& expr, XQueryStep& previous,
                 const XQueryStep& step) {
    if (step.next() && !isa<XQueryAxisStep>(step.next())) return false;
    const XQueryPlaceID place = partOf(path, step, XQueryRole::Step);
    if (place == XQueryNoPlace || !_planning.isOpen(place)) return false;
    int axis = 0;
    auto names = std::make_unique<XQueryNameChoice>();
    const auto add = [&](const XQueryExpr& operand) {
      const XQueryAxisStep* found = nameStepIn(&operand);
      if (!found || (axis != 0 && found->axis() != axis)) return false;
      axis = found->axis();
      names->addTest(testOf(*found));
      return axis == XQueryAxisChild || axis == XQueryAxisAttribute;
    };
    if (!forEachOperand(_planning.program[place].expr, isUnion, add)) return false;
    if (!XQueryHidesFocusOf(step, expr, path, _planning)) return refuse(place);
    auto by =
        XQueryAxisStep::axisStepWithAxis(axis, XQueryWildCardNameTest::nameTest(nullptr, nullptr));
    by->setChoice(std::move(names), 0);
    _planning.leaveOut(place);
    _planning.choose(place, "one step with several names");
    _planning.program.keep(expr.replaceStepBehind(previous, by));
    return true;
  }

  bool refuse(XQueryPlaceID place) {
    _planning.refuse(place, "an error that comes up later may show the focus that it leaves");
    return false;
  }

  // The first path takes the names of the others.
  void takeUnionOfPaths(XQueryPlaceID place) {
    if (!_planning.program[place].isOrdered) return;
    XQueryPathExpr* first = nullptr;
    const XQueryAxisStep* firstName = nullptr;
    auto names = std::make_unique<XQueryNameChoice>();
    const auto add = [&](const XQueryExpr& operand) {
      const auto* path = dyn_cast<XQueryPathExpr>(&operand);
      const XQueryAxisStep* name = path ? lastNameFromRoot(*path) : nullptr;
      if (!name || (first && !leadAlike(*first, *path))) return false;
      if (!first) {
        first = const_cast<XQueryPathExpr*>(path);
        firstName = name;
      }
      names->addTest(testOf(*name));
      return true;
    };
    if (!forEachOperand(_planning.program[place].expr, isUnion, add)) return;
    auto by = XQueryAxisStep::axisStepWithAxis(XQueryAxisChild,
                                               XQueryWildCardNameTest::nameTest(nullptr, nullptr));
    by->setChoice(std::move(names), 0);
    XQueryStep* previous = first->step();
    while (previous->next() != firstName) previous = previous->next();
    _planning.program.keep(first->replaceStepBehind(*previous, by));
    _planning.replace(place, Ref<XQueryExpr>(first), "one path whose last step has several names");
  }

  XQueryPlanning& _planning;
};

}  // namespace

void XQueryTakeNames(XQueryPlanning& planning) {
  Search(planning).run();
}

}  // namespace xquery

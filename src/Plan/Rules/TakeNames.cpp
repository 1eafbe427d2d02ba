// Names that a step could have asked for itself.
//
// Pattern     *[self::a], *[self::a or self::b], *[name() = "a"], *[local-name(.) = ("a", "b")],
//             *[string(node-name(.)) = "a"], *[string(namespace-uri()) = "u" and ...],
//             node()[. instance of element(a)] where that is the first predicate of the step; *:a,
//             p:*; P/(a | b), P//(a | b), P/(@a | @b), P/(parent::a | parent::b);
//             //a | //b, /r/a | /r/b, (//a, //b)/c
// Facts       the test before the filter looks at kinds of nodes alone; the names can be resolved
//             without an error; no expression behind it asks for the position that a node has
//             among the others; nothing shows the focus that it leaves (StepsAround.h)
// Operator    none: the step takes the choice of names into its test (XQueryWalkedStep::setChoice)
//             and so it is found in the index of the tree, below "//" as well
// Why         all of these conditions look at the node alone and cannot fail; the children of a
//             node that have one of two names are, in document order, the union of those that have
//             the one and those that have the other; so are the results of whole paths from the
//             document, where they are sorted
#include "Expr/Operators/XQueryOperatorExpr.h"
#include "Expr/TypeTests/XQueryTypeExprs.h"
#include "Expr/XQueryLeaves.h"
#include "Expr/XQueryLists.h"
#include "Plan/Paths/XQueryWalkedPath.h"
#include "Plan/Planning.h"
#include "Plan/Rules.h"
#include "Plan/Rules/NameConditions.h"
#include "Plan/Rules/PathAt.h"
#include "Plan/Rules/PlaceInside.h"
#include "Plan/Rules/StepsAround.h"

#include <vector>

namespace xquery {
namespace {

// The only step of a path that consists of a name test; null for anything else.
const XQueryAxisStep* nameStepIn(const XQueryExpr* expr) {
  const auto* path = XQueryPathIn(XQueryWithoutParentheses(expr));
  const auto* step = path ? dyn_cast<XQueryAxisStep>(path->step()) : nullptr;
  const bool fits = step && !step->next() && step->predicates().empty() &&
                    isa<XQueryNameTest>(step->expr()) && !step->testMayRaise();
  return fits ? step : nullptr;
}

Ref<XQueryNameTest> testOf(const XQueryAxisStep& step) {
  return Ref<XQueryNameTest>(cast<XQueryNameTest>(step.expr()));
}

constexpr size_t mostNames = 64;

using By = XQueryNameChoice::By;

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

// The test of ". instance of element(a)"; null for anything else.
Ref<XQueryNameTest> elementAskedFor(const XQueryExpr& condition) {
  const auto* expr = dyn_cast<XQueryInstanceOfExpr>(&condition);
  const auto* item = expr ? XQueryWithoutParentheses(expr->subject()) : nullptr;
  if (!item || !isa<XQueryContextItem>(item)) return nullptr;
  const XQueryTypeDeclaration& type = expr->type();
  auto* test = dyn_cast<XQueryNameTest>(type.data());
  const bool fits = type.type() == XQueryTypeDeclaration::ElementTest && type.acceptsCount(1) &&
                    test && !test->mayRaise();
  return Ref<XQueryNameTest>(fits ? test : nullptr);
}

bool addNames(const XQueryExpr& condition, XQueryNameChoice& names) {
  if (const XQueryAxisStep* step = nameStepIn(&condition)) {
    if (step->axis() != XQueryAxisSelf) return false;
    names.addTest(By::Test, testOf(*step));
    return true;
  }
  if (auto test = elementAskedFor(condition)) {
    names.addTest(By::Element, std::move(test));
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
}

// The names that a predicate asks for; empty for one that asks for anything else.
XQueryNameChoice namesAskedFor(const XQueryExpr& predicate) {
  const auto isOr = [](const XQueryExpr& expr) { return isOperator(expr, XQueryOperatorOr); };
  const auto isAnd = [](const XQueryExpr& expr) { return isOperator(expr, XQueryOperatorAnd); };
  XQueryNameChoice names;
  const auto addAlternative = [&](const XQueryExpr& alternative) {
    XQueryNameChoice all;
    const auto meet = [&](const XQueryExpr& condition) {
      XQueryNameChoice those;
      if (!addNames(condition, those) || those.count() * (all.count() + 1) > mostNames)
        return false;
      if (all.isEmpty()) {
        all = std::move(those);
      } else {
        all.meet(those);
      }
      return true;
    };
    if (!forEachOperand(&alternative, isAnd, meet)) return false;
    names.add(all);
    return names.count() <= mostNames;
  };
  return forEachOperand(&predicate, isOr, addAlternative) ? names : XQueryNameChoice();
}

// The names that a wildcard takes; empty for any other test, and where those are not known.
XQueryNameChoice namesOfWildCard(const XQueryExpr* test) {
  XQueryNameChoice names;
  const auto* wildCard = dyn_cast<XQueryWildCardNameTest>(test);
  if (!wildCard || wildCard->mayRaise()) return names;
  if (wildCard->localName() && !wildCard->prefix()) {
    names.addText(By::LocalName, wildCard->localName());
  } else if (wildCard->prefix() && !wildCard->localName()) {
    Ref<NSString> URI = wildCard->uriForContext(nullptr);
    if (URI && URI->length() != 0) names.addText(By::URI, std::move(URI));
  }
  return names;
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
  return step.axis() == XQueryAxisChild && step.predicates().empty() &&
         isa<XQueryNameTest>(step.expr()) && !step.testMayRaise();
}

// The last step of a path from the document by children and "//" without predicates, if that is a
// child of a name; else null.
const XQueryAxisStep* lastNameFromRoot(const XQueryPathExpr& path) {
  if (!isa<XQueryRootStep>(path.step()) || !path.step()->predicates().empty()) return nullptr;
  const XQueryAxisStep* last = nullptr;
  for (const XQueryStep* each = path.step()->next(); each; each = each->next()) {
    last = dyn_cast<XQueryAxisStep>(each);
    if (!last || (!isChildOfName(*last) && !XQueryWalkedStep(*last).isDescendantShorthand()))
      return nullptr;
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
      if (isUnion(expr) || beginsPath(place)) {
        takeUnionOfPaths(place);
      } else if (isa<XQueryPathExpr>(&expr)) {
        if (XQueryWalkedPath* path = XQueryWalkedPathAt(_planning, place)) lookAt(place, *path);
      }
    }
  }

 private:
  void lookAt(XQueryPlaceID place, XQueryWalkedPath& path) {
    auto& steps = path.changeableSteps();
    for (size_t i = 0; i < steps.size(); ++i) {
      XQueryNameChoice names = namesOfWildCard(steps[i].test);
      if (!names.isEmpty()) {
        steps[i].becomeAxisStep(steps[i].axis, std::move(names));
        _planning.choose(place, "a wildcard is looked up among the names of the tree");
        continue;
      }
      // An expression behind it counts the nodes that are left.
      if (i + 1 < steps.size() && steps[i + 1].isExpression()) continue;
      if (!steps[i].isExpression()) {
        takeFilter(place, path, steps[i]);
      } else if (i > 0 && !steps[i - 1].isExpression()) {
        takeUnion(place, path, steps[i]);
      }
    }
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

  void takeFilter(XQueryPlaceID path, const XQueryWalkedPath& walk, XQueryWalkedStep& step) {
    if (step.choice || !asksForKindAlone(step.test) || step.step->predicates().empty()) return;
    const XQueryPlaceID place = partOf(path, *step.step, XQueryRole::Predicate);
    if (place == XQueryNoPlace || !_planning.isOpen(place)) return;
    XQueryNameChoice names = namesAskedFor(*_planning.program[place].expr);
    if (names.isEmpty()) return;
    if (!XQueryHidesFocusOf(*step.step, walk, path, _planning)) return refuse(place);
    step.setChoice(std::move(names), 1);
    _planning.leaveOut(place);
    _planning.choose(place, "it is part of the test of the step");
  }

  void takeUnion(XQueryPlaceID path, const XQueryWalkedPath& walk, XQueryWalkedStep& step) {
    const XQueryPlaceID place = partOf(path, *step.step, XQueryRole::Step);
    if (place == XQueryNoPlace || !_planning.isOpen(place)) return;
    int axis = 0;
    XQueryNameChoice names;
    const auto add = [&](const XQueryExpr& operand) {
      const XQueryAxisStep* found = nameStepIn(&operand);
      if (!found || (axis != 0 && found->axis() != axis)) return false;
      axis = found->axis();
      names.addTest(By::Test, testOf(*found));
      return axis == XQueryAxisChild || axis == XQueryAxisAttribute || axis == XQueryAxisParent ||
             axis == XQueryAxisSelf;
    };
    if (!forEachOperand(_planning.program[place].expr, isUnion, add)) return;
    if (!XQueryHidesFocusOf(*step.step, walk, path, _planning)) return refuse(place);
    step.becomeAxisStep(axis, std::move(names));
    _planning.leaveOut(place);
    _planning.choose(place, "one step with several names");
  }

  void refuse(XQueryPlaceID place) {
    _planning.refuse(place, "an error that comes up later may show the focus that it leaves");
  }

  // Whether it is a list with whose nodes a path begins that goes on along axes alone, so that the
  // order and the repetition of nodes make no difference.
  bool beginsPath(XQueryPlaceID place) const {
    const XQueryPlace& here = _planning.program[place];
    const auto* list = dyn_cast<XQueryExprList>(here.expr);
    if (!list || list->count() < 2 || list->kind() != Kind::ExprList) return false;
    const XQueryPlaceID around = XQueryPlaceAround(_planning.program, place);
    const XQueryStep* first = _planning.program[around].step;
    if (_planning.program[around].role != XQueryRole::FirstStep || !first) return false;
    bool areOfAxes = first->next() && first->predicates().empty();
    for (const XQueryStep* step = first->next(); step; step = step->next()) {
      const auto* axisStep = dyn_cast<XQueryAxisStep>(step);
      // An error would leave the focus on the node that comes first.
      areOfAxes = areOfAxes && axisStep && !axisStep->testMayRaise() && !step->mayAdopt();
    }
    return areOfAxes;
  }

  // The first path takes the names of the others.
  void takeUnionOfPaths(XQueryPlaceID place) {
    if (!_planning.program[place].isOrdered) return;
    const XQueryPathExpr* first = nullptr;
    XQueryNameChoice names;
    const auto add = [&](const XQueryExpr& operand) {
      const XQueryPathExpr* path = XQueryPathIn(&operand);
      const XQueryAxisStep* name = path ? lastNameFromRoot(*path) : nullptr;
      if (!name || (first && !leadAlike(*first, *path))) return false;
      if (!first) first = path;
      names.addTest(By::Test, testOf(*name));
      return true;
    };
    const XQueryExpr* expr = _planning.program[place].expr;
    const auto* list = dyn_cast<XQueryExprList>(expr);
    for (size_t index = 0; list && index < list->count(); ++index) {
      if (index > mostNames || !forEachOperand(list->objectAtIndex(index), isUnion, add)) return;
    }
    if (!list && !forEachOperand(expr, isUnion, add)) return;
    auto by = XQueryWalkedPath::exprWithPlain(
        _planning.exprAt(place), Ref<XQueryPathExpr>(const_cast<XQueryPathExpr*>(first)));
    by->changeableSteps().back().becomeAxisStep(XQueryAxisChild, std::move(names));
    _planning.replace(place, std::move(by), "one path whose last step has several names");
  }

  XQueryPlanning& _planning;
};

}  // namespace

void XQueryTakeNames(XQueryPlanning& planning) {
  Search(planning).run();
}

}  // namespace xquery

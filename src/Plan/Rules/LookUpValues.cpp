// Values are looked up in the index of the tree.
//
// Pattern     a step child::name, child::*, descendant::name or //@name, also behind "//", with a
//             predicate that holds only for what has one of some values (ValueConditions.h); such a
//             step as the last one of P in "(P)[C]", where C is such a condition, and in "for $x in
//             P ... where C", "for $x in P return $x[C]" and the like (TupleConditions.h)
// Facts       of the step: all predicates ask for truth, whatever place a node has, and can be
//             repeated with all steps behind; of the value that is asked for: it is repeatable and
//             does not read the focus, but for the root in a predicate, or where the path begins
//             at it; of a clause: it has neither position nor type, what is left in its variable
//             cannot be told, and clauses behind it can be repeated and cannot fail
// Operator    none: the step is told by which key its nodes are found (XQueryValueLookup)
// Why         untyped values are compared with texts by their texts, and equal texts are what the
//             index answers; its candidates are asked the condition as before, unless it says no
//             more. A node that is none makes the condition false, or an error in a predicate,
//             which drops it as well. With a probe that is no text, and while there is no index,
//             the step walks
#include "Expr/Clauses/XQueryFLWOR.h"
#include "Expr/Operators/XQueryOperatorExpr.h"
#include "Expr/Paths/XQueryNameTest.h"
#include "Expr/XQueryBinding.h"
#include "Expr/XQueryLeaves.h"
#include "Plan/Joins/XQueryJoinedSteps.h"
#include "Plan/Planning.h"
#include "Plan/Rules.h"
#include "Plan/Rules/PathAt.h"
#include "Plan/Rules/PlaceInside.h"
#include "Plan/Rules/StepsAround.h"
#include "Plan/Rules/TupleConditions.h"
#include "Plan/Rules/ValueConditions.h"

#include <algorithm>
#include <memory>
#include <optional>
#include <utility>
#include <vector>

namespace xquery {
namespace {

using Of = XQueryValueLookup::Of;

class Search {
 public:
  explicit Search(XQueryPlanning& planning) : _planning(planning), _program(planning.program) {}

  void run() {
    for (XQueryPlaceID place = 0; place < _program.placeCount(); ++place) {
      if (_program[place].expr->kind() == Kind::PathExpr) takePath(place);
      if (_program[place].role == XQueryRole::FirstStep) takeStart(place);
      if (isa<XQueryFLWORExpr>(_program[place].expr)) takeClause(place);
    }
  }

 private:
  void takePath(XQueryPlaceID place) {
    XQueryWalkedPath* path = XQueryWalkedPathAt(_planning, place);
    if (!path) return;
    XQueryPredicatesOfSteps predicates(_planning, place);
    for (XQueryWalkedStep& step : path->changeableSteps()) {
      if (!step.filtersEach) continue;
      for (const XQueryPlaceID predicate : predicates.of(step)) {
        if (!takeCondition(predicate, {}, *path, step)) continue;
        _planning.choose(place);
        break;
      }
    }
  }

  // The items of "(P)" that its first predicate keeps. What stands before a position is asked for
  // truth alone.
  void takeStart(XQueryPlaceID place) {
    const XQueryPlace& here = _program[place];
    if (!here.step || here.step->predicates().empty()) return;
    const XQueryWalkedPath* around = XQueryWalkedPathAt(_planning, here.parent);
    const auto predicates = XQueryPredicatesOf(_planning, here.parent, *here.step, 0);
    if (!around || predicates.empty()) return;
    // A path puts back the focus that its start leaves.
    const bool hidesFocus =
        around->steps().empty() || XQueryHidesFocusOf(*here.step, *around, here.parent, _planning);
    XQueryWalkedPath* path = hidesFocus ? wholePathAt(place) : nullptr;
    if (!path || !XQueryPredicatesAreOfTruth(_planning, {predicates.front()})) return;
    XQueryWalkedStep& last = path->changeableSteps().back();
    if (takeCondition(predicates.front(), {}, *path, last)) _planning.choose(place);
  }

  // A "for" before the condition, the last one or one behind which nobody can tell that clauses are
  // not evaluated.
  void takeClause(XQueryPlaceID place) {
    const XQueryPlaceID condition = XQueryConditionOfTuples(_planning, place);
    if (condition == XQueryNoPlace || !isIdleButForErrors(firstConditionOf(condition))) return;
    std::vector<XQueryPlaceID> clauses;
    for (XQueryPlaceID part = _program.firstPart(place);
         isa<XQueryBindingExpr>(_program[part].expr); part = _program.nextPart(part)) {
      clauses.push_back(part);
    }
    XQueryValueOrigin origin;
    while (!clauses.empty()) {
      const XQueryPlaceID clause = clauses.back();
      clauses.pop_back();
      const bool isTaken =
          isa<XQueryForExpr>(_program[clause].expr) && takeClause(clause, condition, origin);
      if (isTaken || !addLater(clause, origin)) return;
    }
  }

  // `origin` has the variables that are set behind the clause.
  bool takeClause(XQueryPlaceID place, XQueryPlaceID condition, XQueryValueOrigin origin) {
    const auto& clause = *cast<XQueryForExpr>(_program[place].expr);
    if (clause.type() || clause.posVarID() != 0 || clause.varID() == 0) return false;
    XQueryWalkedPath* path = wholePathAt(_program.part(place, XQueryRole::Bound));
    if (!path) return false;
    origin.varID = clause.varID();
    origin.errorExcludes = false;
    origin.isInTreeOfFocus = path->start() && isa<XQueryRootStep>(path->start());
    XQueryVariableSet leftovers = _planning.facts[condition].assigns;
    leftovers.add(origin.own);
    leftovers.add(clause.varID());
    XQueryWalkedStep& step = path->changeableSteps().back();
    if (!conditionFor(condition, origin, targetOf(*path, step))) return false;
    if (_planning.showsLeftovers(leftovers, place)) {
      _planning.refuse(place, "a variable that would be left with another item may be read");
      return false;
    }
    if (!takeCondition(condition, origin, *path, step)) return false;
    _planning.choose(place);
    return true;
  }

  // A clause that nobody can tell is not evaluated.
  bool addLater(XQueryPlaceID part, XQueryValueOrigin& origin) const {
    const auto* forExpr = dyn_cast<XQueryForExpr>(_program[part].expr);
    if (!forExpr) return addLet(part, origin);
    const XQueryPlaceID bound = _program.part(part, XQueryRole::Bound);
    if (forExpr->type() || bound == XQueryNoPlace) return false;
    origin.own.add(forExpr->varID());
    origin.own.add(forExpr->posVarID());
    origin.own.add(_planning.facts[bound].assigns);
    return isIdleButForErrors(bound) && !_planning.facts[bound].does(XQueryDeeds::MayFail);
  }

  // A let clause that nobody can tell is not evaluated.
  bool addLet(XQueryPlaceID part, XQueryValueOrigin& origin) const {
    const auto* let = dyn_cast<XQueryLetExpr>(_program[part].expr);
    const XQueryPlaceID bound = _program.part(part, XQueryRole::Bound);
    if (!let || let->type() || bound == XQueryNoPlace) return false;
    origin.own.add(let->varID());
    origin.own.add(_planning.facts[bound].assigns);
    if (XQueryIsTextOfOne(_planning, bound)) return true;
    return isIdleButForErrors(bound) && !_planning.facts[bound].does(XQueryDeeds::MayFail);
  }

  bool isIdleButForErrors(XQueryPlaceID place) const {
    const XQueryFacts& facts = _planning.facts[place];
    return facts.isRepeatable() && !facts.does(XQueryDeeds::LoadsDocuments);
  }

  XQueryPlaceID firstConditionOf(XQueryPlaceID where) const {
    XQueryPlaceID place = XQueryPlaceInside(_program, where);
    const auto* both = dyn_cast<XQueryOperatorExpr>(_program[place].expr);
    while (both && both->operatorType() == XQueryOperatorAnd) {
      place = XQueryPlaceInside(_program, _program.firstPart(place));
      both = dyn_cast<XQueryOperatorExpr>(_program[place].expr);
    }
    return place;
  }

  // A path that stands there by itself, all of whose nodes may be asked in any order: what is kept
  // from elsewhere is for everybody.
  XQueryWalkedPath* wholePathAt(XQueryPlaceID bound) const {
    const XQueryPlaceID place = XQueryPlaceInside(_program, bound);
    if (place == XQueryNoPlace) return nullptr;
    XQueryWalkedPath* path = XQueryWalkedPathAt(_planning, place);
    if (!path || path->steps().empty() || path != _planning.exprAt(place).get()) return nullptr;
    for (XQueryPlaceID around = bound; around != place; around = _program.firstPart(around)) {
      if (_planning.isWrapped(around)) return nullptr;
    }
    const XQueryWalkedStep& last = path->steps().back();
    return last.hasPredicates() && !last.filtersEach ? nullptr : path;
  }

  // What the step finds.
  struct Target {
    Of of = Of::Name;
    const NSXMLExpandedName* name = nullptr;
    bool isKnown = false;
  };
  static Target targetOf(const XQueryWalkedPath& path, const XQueryWalkedStep& step) {
    const bool goesDown = step.axis == XQueryAxisChild || step.axis == XQueryAxisDescendant;
    const bool isBelow = &step != &path.steps().front() && (&step - 1)->absorbsNext;
    const bool isAttribute = step.axis == XQueryAxisAttribute && isBelow;
    if (step.lookup || step.testMayRaise || (!goesDown && !isAttribute)) return {};
    const auto* test = dyn_cast<XQueryNameTest>(step.test);
    if (!test || step.choice) return {Of::AnyName, nullptr, goesDown};
    const auto* name = test->boundName() ? test->boundName() : test->nameWithoutNamespace();
    return {goesDown ? Of::Name : Of::Attribute, name, name != nullptr};
  }

  std::optional<XQueryValueCondition> conditionFor(XQueryPlaceID condition,
                                                   const XQueryValueOrigin& origin,
                                                   const Target& target) const {
    if (!target.isKnown) return std::nullopt;
    auto found = XQueryValueConditionIn(_planning, condition, origin);
    if (!found) return std::nullopt;
    const bool fit = std::all_of(
        found->anyOf.begin(), found->anyOf.end(), [&](const XQueryValueLookup::Match& match) {
          if (target.of == Of::Name) return true;
          return target.of == Of::Attribute ? match.way.isEmpty() : match.way.hasKeyOfEnd();
        });
    return fit ? std::move(found) : std::nullopt;
  }

  // Tells the step to look up what can meet the condition.
  bool takeCondition(XQueryPlaceID condition, const XQueryValueOrigin& origin,
                     const XQueryWalkedPath& path, XQueryWalkedStep& step) const {
    const Target target = targetOf(path, step);
    auto found = conditionFor(condition, origin, target);
    if (!found) return false;
    const auto& predicates = step.step->predicates();
    const bool isFirst = step.hasPredicates() && origin.varID == 0 &&
                         _program[condition].slot == &predicates[step.predicatesInTest];
    using First = XQueryValueLookup::First;
    step.lookup = std::make_unique<const XQueryValueLookup>(
        target.of, target.name, std::move(found->anyOf),
        isFirst && found->isAll ? First::Holds : First::Asked);
    return true;
  }

  XQueryPlanning& _planning;
  const XQueryProgram& _program;
};

}  // namespace

void XQueryLookUpValues(XQueryPlanning& planning) {
  Search(planning).run();
}

}  // namespace xquery

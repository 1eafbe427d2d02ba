// Values are looked up in the index of the tree.
//
// Pattern     a step child::name, also behind "//", with a predicate K = P or K eq P, on either
//             side or among others that "and" joins; for $x in such a step without or with
//             predicates, followed by where K = P, or K = P and more; K leads from the element to
//             children and attributes of given names
// Facts       of the step: all predicates ask for truth, whatever place a node has, and can be
//             repeated with all steps behind; of P: it is repeatable and does not read the focus;
//             of a clause: it has neither position nor type, and what it leaves in its variable
//             cannot be told
// Operator    none: the step is told by which key its nodes are found (XQueryValueLookup)
// Why         untyped values are compared with texts by their texts, and equal texts are what the
//             index answers; its candidates are asked the condition as before. An element that is
//             none makes the comparison false, or an error in a predicate, which drops it as well.
//             With a probe that is no text, and while there is no index, the step walks
#include "Expr/Clauses/XQueryFLWOR.h"
#include "Expr/Operators/XQueryOperatorExpr.h"
#include "Expr/Paths/XQueryNameTest.h"
#include "Plan/Joins/XQueryJoinedSteps.h"
#include "Plan/Planning.h"
#include "Plan/Rules.h"
#include "Plan/Rules/PathAt.h"
#include "Plan/Rules/PlaceInside.h"

#include <memory>
#include <optional>
#include <utility>

namespace xquery {
namespace {

using Lookup = std::unique_ptr<const XQueryValueLookup>;

class Search {
 public:
  explicit Search(XQueryPlanning& planning) : _planning(planning), _program(planning.program) {}

  void run() {
    for (XQueryPlaceID place = 0; place < _program.placeCount(); ++place) {
      if (_program[place].expr->kind() == Kind::PathExpr) takePath(place);
      if (isa<XQueryFLWORExpr>(_program[place].expr)) takeClause(place);
    }
  }

 private:
  void takePath(XQueryPlaceID place) {
    XQueryWalkedPath* path = XQueryWalkedPathAt(_planning, place);
    if (!path) return;
    for (XQueryWalkedStep& step : path->changeableSteps()) {
      const NSXMLExpandedName* element = elementOf(step);
      if (!element || !step.filtersEach || step.lookup) continue;
      for (const XQueryPlaceID predicate : XQueryPredicatesOf(_planning, place, step)) {
        if (!step.lookup) step.lookup = lookupIn(predicate, *element);
      }
      if (step.lookup) _planning.choose(place);
    }
  }

  // The last clause, directly before the where clause.
  void takeClause(XQueryPlaceID place) {
    const XQueryPlaceID where = _program.part(place, XQueryRole::Where);
    XQueryPlaceID last = XQueryNoPlace;
    if (where == XQueryNoPlace) return;
    for (XQueryPlaceID part = _program.firstPart(place); part != where;
         part = _program.nextPart(part)) {
      last = part;
    }
    const auto* clause =
        last == XQueryNoPlace ? nullptr : dyn_cast<XQueryForExpr>(_program[last].expr);
    if (!clause || clause->type() || clause->posVarID() != 0 || clause->varID() == 0) return;
    XQueryWalkedStep* step = lastStepOf(_program.part(last, XQueryRole::Bound));
    const NSXMLExpandedName* element = step ? elementOf(*step) : nullptr;
    if (!element || step->lookup || (step->hasPredicates() && !step->filtersEach)) return;
    XQueryPlaceID condition = XQueryPlaceInside(_program, where);
    while (isAnd(condition)) {
      condition = XQueryPlaceInside(_program, _program.firstPart(condition));
    }
    Lookup lookup = lookupAt(condition, *element, clause->varID());
    if (!lookup) return;
    XQueryVariableSet leftovers = _planning.facts[where].assigns;
    leftovers.add(clause->varID());
    if (_planning.showsLeftovers(leftovers, place)) {
      return _planning.refuse(last, "a variable that would be left with another item may be read");
    }
    step->lookup = std::move(lookup);
    _planning.choose(last);
  }

  // Of a path that stands there by itself: what is kept from elsewhere is for everybody.
  XQueryWalkedStep* lastStepOf(XQueryPlaceID bound) const {
    const XQueryPlaceID place = XQueryPlaceInside(_program, bound);
    if (place == XQueryNoPlace || _program[place].expr->kind() != Kind::PathExpr) return nullptr;
    XQueryWalkedPath* path = XQueryWalkedPathAt(_planning, place);
    if (!path || path->steps().empty() || path != _planning.exprAt(place).get()) return nullptr;
    for (XQueryPlaceID around = bound; around != place; around = _program.firstPart(around)) {
      if (_planning.isWrapped(around)) return nullptr;
    }
    return &path->changeableSteps().back();
  }

  // The name of the elements that the step finds; null where it may find others.
  static const NSXMLExpandedName* elementOf(const XQueryWalkedStep& step) {
    const auto* test = dyn_cast<XQueryNameTest>(step.test);
    if (!test || step.choice || step.testMayRaise || step.axis != XQueryAxisChild) return nullptr;
    return test->boundName() ? test->boundName() : test->nameWithoutNamespace();
  }

  bool isAnd(XQueryPlaceID place) const {
    const auto* operation = dyn_cast<XQueryOperatorExpr>(_program[place].expr);
    return operation && operation->operatorType() == XQueryOperatorAnd;
  }

  // The first comparison in a predicate that can be looked up. An error in any other drops the
  // element as well.
  Lookup lookupIn(XQueryPlaceID predicate, const NSXMLExpandedName& element) const {
    const XQueryPlaceID place = XQueryPlaceInside(_program, predicate);
    if (!isAnd(place)) return lookupAt(place, element, 0);
    for (XQueryPlaceID part = _program.firstPart(place); part != XQueryNoPlace;
         part = _program.nextPart(part)) {
      if (Lookup found = lookupAt(XQueryPlaceInside(_program, part), element, 0)) return found;
    }
    return nullptr;
  }

  // `varID` is the variable that holds the element; 0: it is the context item.
  Lookup lookupAt(XQueryPlaceID place, const NSXMLExpandedName& element, int64_t varID) const {
    const auto* comparison = dyn_cast<XQueryOperatorExpr>(_program[place].expr);
    if (!comparison) return nullptr;
    const int type = comparison->operatorType();
    // Outside of a predicate a value comparison of several values is an error to be seen.
    const bool isEquality = type == XQueryOperatorEqual || (type == XQueryOperatorEq && varID == 0);
    const XQueryPlaceID left = _program.firstPart(place);
    const XQueryPlaceID right = left == XQueryNoPlace ? left : _program.nextPart(left);
    if (!isEquality || right == XQueryNoPlace) return nullptr;
    if (XQueryOperatorExpr::rangeIn(comparison->right())) return nullptr;
    Lookup found = lookupOf(left, right, element, varID);
    return found ? std::move(found) : lookupOf(right, left, element, varID);
  }

  Lookup lookupOf(XQueryPlaceID key, XQueryPlaceID probe, const NSXMLExpandedName& element,
                  int64_t varID) const {
    XQueryShortWalk walk;
    if (!walk.readFrom(*_program[key].expr) || walk.variable() != varID) return nullptr;
    auto names = walk.valueKey(element);
    if (!names) return nullptr;
    const XQueryFacts& facts = _planning.facts[probe];
    XQueryVariableSet item;
    item.add(varID);
    const bool isOpen = facts.isRepeatable() && !facts.does(XQueryDeeds::ReadsFocus) &&
                        !facts.does(XQueryDeeds::LoadsDocuments) && facts.assigns.isEmpty() &&
                        (varID == 0 || !facts.reads.meets(item)) &&
                        facts.mayBe(XQueryItems::Node | XQueryItems::Untyped | XQueryItems::String);
    if (!isOpen) return nullptr;
    return std::make_unique<const XQueryValueLookup>(*std::move(names), walk,
                                                     _planning.exprAt(probe));
  }

  XQueryPlanning& _planning;
  const XQueryProgram& _program;
};

}  // namespace

void XQueryLookUpValues(XQueryPlanning& planning) {
  Search(planning).run();
}

}  // namespace xquery

#include "Plan/Joins/XQueryTermsBehind.h"

#include "Expr/Clauses/XQueryFLWOR.h"
#include "Expr/Clauses/XQueryQuantified.h"
#include "Expr/Operators/XQueryOperatorExpr.h"
#include "Plan/Joins/XQueryKeyOfItem.h"
#include "Plan/Rules/PlaceInside.h"

#include <utility>

namespace xquery {
namespace {

// Whether it is a clause of "some".
bool isOfSome(const XQueryProgram& program, XQueryPlaceID clause) {
  if (program[clause].expr->kind() != Kind::QuantifiedItem) return false;
  const auto* quantifier = dyn_cast<XQueryQuantifiedExpr>(program[program[clause].parent].expr);
  return quantifier && !quantifier->every();
}

// The clause that walks the items, alone and as they are found; XQueryNoPlace for none.
XQueryPlaceID clauseAround(const XQueryPlanning& planning, XQueryPlaceID path) {
  const XQueryProgram& program = planning.program;
  const XQueryPlaceID bound = XQueryPlaceAround(program, path);
  if (program[bound].role != XQueryRole::Bound) return XQueryNoPlace;
  for (XQueryPlaceID place = path; place != program[bound].parent; place = program[place].parent) {
    if (planning.isWrapped(place)) return XQueryNoPlace;
  }
  const XQueryPlaceID clause = program[bound].parent;
  const auto* binding = dyn_cast<XQueryBindingExpr>(program[clause].expr);
  const auto* forExpr = dyn_cast<XQueryForExpr>(program[clause].expr);
  const bool walks = forExpr ? forExpr->posVarID() == 0 : isOfSome(program, clause);
  const bool isOpen = binding && walks && !binding->type() && binding->varID() > 0 &&
                      binding->varID() < XQueryVariableSet::most;
  return isOpen ? clause : XQueryNoPlace;
}

bool isKey(const XQueryFacts& facts, const XQueryVariableSet& own) {
  using namespace XQueryDeeds;
  return facts.isRepeatable() && facts.assigns.isEmpty() && !facts.reads.isEmpty() &&
         own.holds(facts.reads) && !facts.does(ReadsFocus | ReadsGlobals | LoadsDocuments);
}

bool isProbe(const XQueryFacts& facts, const XQueryVariableSet& own) {
  using namespace XQueryDeeds;
  return facts.isRepeatable() && facts.assigns.isEmpty() && facts.reads.isExact() &&
         !facts.reads.isEmpty() && !facts.reads.meets(own) &&
         !facts.does(ReadsFocus | ReadsOutside | LoadsDocuments);
}

}  // namespace

void XQueryAddTermsBehind(const XQueryPlanning& planning, XQueryPlaceID path,
                          XQueryJoinCondition& condition) {
  if (!condition.orElse.empty()) return;
  const XQueryProgram& program = planning.program;
  const XQueryPlaceID clause = clauseAround(planning, path);
  const XQueryPlaceID where = clause == XQueryNoPlace ? clause : program.nextPart(clause);
  if (where == XQueryNoPlace) return;
  const XQueryRole role = program[where].role;
  if (role != XQueryRole::Where && role != XQueryRole::Satisfies) return;
  const int64_t varID = cast<XQueryBindingExpr>(program[clause].expr)->varID();
  XQueryJoinScope scope;
  scope.item.add(varID);
  scope.settled.add(varID);
  if (planning.showsLeftovers(scope.item, clause)) return;
  const XQueryJoinSearch search(planning, scope, {});
  constexpr int promise = 3;
  for (const XQueryPlaceID each : search.conjuncts(where)) {
    if (!search.cannotFail(each) || !planning.facts[each].isRepeatable()) break;
    const auto* comparison = dyn_cast<XQueryOperatorExpr>(program[each].expr);
    if (!comparison || comparison->operatorType() != XQueryOperatorEqual) continue;
    if (XQueryOperatorExpr::rangeIn(comparison->right())) continue;
    XQueryPlaceID key = program.firstPart(each);
    XQueryPlaceID probe = program.nextPart(key);
    if (probe == XQueryNoPlace) continue;
    if (!isKey(planning.facts[key], scope.item)) std::swap(key, probe);
    if (!isKey(planning.facts[key], scope.item) || !isProbe(planning.facts[probe], scope.item)) {
      continue;
    }
    XQueryJoinTerm term;
    term.key = XQueryKeyOfItem::exprWithKey(planning.exprAt(key), varID);
    term.probe = planning.exprAt(probe);
    term.promise = promise;
    term.looksOutOfItems = planning.facts[key].does(XQueryDeeds::ReadsOutside);
    condition.terms.push_back(std::move(term));
  }
  condition.putBestFirst();
}

}  // namespace xquery

// Clauses that need not walk all of their items.
//
// Pattern     some $x in P satisfies ..., every $x in P satisfies ..., each of several clauses; for
//             $x in P ... of which somebody asks for the first items, or whether there are any
// Facts       P is a path that finds its nodes in document order, of which nobody can tell how far
//             it was walked (XQueryWalkedPath::findsInOrder), or a short one; what is evaluated for
//             its nodes is repeatable and sets nothing that P reads, nor reads what P sets; a FLWOR
//             may end early (EarlyEnds.h)
// Operator    XQueryWalkedPathGiver, XQueryShortPathGiver: the walk finds a node, the clause deals
//             with it, and so on until the answer is certain
// Why         once what P starts from is there, P cannot fail and does nothing, so that it does not
//             matter whether its next node is found before or after something else, or never
//
// Not where the list is kept from one time to the next (KeepInvariants.cpp).
#include "Expr/Clauses/XQueryFLWOR.h"
#include "Expr/Clauses/XQueryQuantified.h"
#include "Expr/Operators/XQueryOperatorExpr.h"
#include "Functions/XQueryFunctionCall.h"
#include "Plan/Paths/XQueryPathGivers.h"
#include "Plan/Planning.h"
#include "Plan/Rules.h"
#include "Plan/Rules/EarlyEnds.h"
#include "Plan/Rules/PathAt.h"
#include "Plan/Rules/PlaceInside.h"

#include <memory>
#include <utility>

namespace xquery {
namespace {

std::unique_ptr<const XQueryItemGiver> giverOf(const XQueryPlanning& planning,
                                               XQueryPlaceID place) {
  XQueryWalkedPath* path = XQueryWalkedPathAt(planning, place);
  if (!path) return nullptr;
  if (XQueryShortWalk walk; walk.readFrom(*path)) {
    if (!walk.visitsInOrder()) return nullptr;
    return std::make_unique<XQueryShortPathGiver>(planning.exprAt(place), walk,
                                                  Ref<XQueryWalkedPath>(path));
  }
  if (!path->findsInOrder() || path->steps().empty()) return nullptr;
  return std::make_unique<XQueryWalkedPathGiver>(Ref<XQueryWalkedPath>(path));
}

class Search {
 public:
  explicit Search(XQueryPlanning& planning) : _planning(planning), _program(planning.program) {}

  void run() {
    for (XQueryPlaceID place = 0; place < _program.placeCount(); ++place) {
      const XQueryExpr& expr = *_program[place].expr;
      const bool endsEarly = expr.kind() == Kind::QuantifiedExpr ||
                             (expr.kind() == Kind::FLWORExpr && isAskedInPart(place) &&
                              XQueryMayEndEarly(_planning, place));
      if (!endsEarly) continue;
      for (XQueryPlaceID part = _program.firstPart(place); part != XQueryNoPlace;
           part = _program.nextPart(part)) {
        const Kind kind = _program[part].expr->kind();
        if (kind == Kind::ForExpr || kind == Kind::QuantifiedItem) lookAt(part);
      }
    }
  }

 private:
  // Whether an operator stands there, or around it, that may need no more than some of the items.
  bool isAskedInPart(XQueryPlaceID place) const {
    if (_planning.isWrapped(place)) return true;
    place = XQueryPlaceAround(_program, place);
    for (XQueryPlaceID around = place; around != XQueryNoPlace; around = _program[around].parent) {
      if (_planning.isWrapped(around)) return true;
      const XQueryExpr& expr = *_program[around].expr;
      const bool mayBePart = around == place || expr.kind() == Kind::Args ||
                             isa<XQueryFunctionCall>(&expr) || isa<XQueryOperatorExpr>(&expr);
      if (!mayBePart) return false;
    }
    return false;
  }

  void lookAt(XQueryPlaceID clause) {
    XQueryPlaceID bound = _program.part(clause, XQueryRole::Bound);
    if (bound == XQueryNoPlace || !_planning.isOpen(bound)) return;
    bound = XQueryPlaceInside(_program, bound);
    if (!_planning.isOpen(bound)) return;
    auto giver = giverOf(_planning, bound);
    if (!giver || !isApartFromRest(bound, clause)) return;
    _planning.choose(clause);
    cast<XQueryBindingExpr>(_program[clause].expr)->setGiver(std::move(giver));
  }

  // Whether it makes no difference in which order the path and what comes behind the clause are
  // evaluated.
  bool isApartFromRest(XQueryPlaceID path, XQueryPlaceID clause) const {
    XQueryVariableSet reads;
    XQueryVariableSet assigns = variablesOf(clause);
    for (XQueryPlaceID part = _program.nextPart(clause); part != XQueryNoPlace;
         part = _program.nextPart(part)) {
      const XQueryFacts& facts = _planning.facts[part];
      if (!facts.isRepeatable()) return false;
      reads.add(facts.reads);
      assigns.add(facts.assigns);
      assigns.add(variablesOf(part));
    }
    const XQueryFacts& own = _planning.facts[path];
    return !own.reads.meets(assigns) && !own.assigns.meets(reads);
  }

  XQueryVariableSet variablesOf(XQueryPlaceID part) const {
    XQueryVariableSet variables;
    const auto* clause = dyn_cast<XQueryBindingExpr>(_program[part].expr);
    if (clause) variables.add(clause->varID());
    const auto* forExpr = dyn_cast<XQueryForExpr>(_program[part].expr);
    if (forExpr) variables.add(forExpr->posVarID());
    return variables;
  }

  XQueryPlanning& _planning;
  const XQueryProgram& _program;
};

}  // namespace

void XQueryTakeOneByOne(XQueryPlanning& planning) {
  Search(planning).run();
}

}  // namespace xquery

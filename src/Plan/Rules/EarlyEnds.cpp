#include "Plan/Rules/EarlyEnds.h"

#include "Expr/Clauses/XQueryFLWOR.h"

namespace xquery {

bool XQueryMayEndEarly(const XQueryPlanning& planning, XQueryPlaceID place) {
  using namespace XQueryDeeds;
  const XQueryFacts& facts = planning.facts[place];
  if (!facts.isRepeatable() || facts.does(LoadsDocuments)) return false;
  if (planning.showsLeftovers(facts.assigns, place)) return false;
  if (!facts.does(MayFail)) return true;
  const XQueryProgram& program = planning.program;
  if (program[place].expr->kind() != Kind::FLWORExpr) return false;
  XQueryPlaceID part = program.firstPart(place);
  const auto* clause = dyn_cast<XQueryForExpr>(program[part].expr);
  if (!clause || clause->type()) return false;
  do part = program.nextPart(part);
  while (part != XQueryNoPlace && !planning.facts[part].does(MayFail));
  return part == XQueryNoPlace;
}

}  // namespace xquery

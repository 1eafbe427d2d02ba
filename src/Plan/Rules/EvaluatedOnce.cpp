#include "Plan/Rules/EvaluatedOnce.h"

#include "Plan/Planning.h"

namespace xquery {
namespace {

// Of a part of a FLWOR or a quantifier.
bool standsBehindFor(const XQueryProgram& program, XQueryPlaceID part) {
  const XQueryPlaceID whole = program[part].parent;
  for (XQueryPlaceID each = program.firstPart(whole); each != part; each = program.nextPart(each)) {
    const Kind kind = program[each].expr->kind();
    if (kind == Kind::ForExpr || kind == Kind::QuantifiedItem) return true;
  }
  return false;
}

}  // namespace

bool XQueryIsEvaluatedOnce(const XQueryProgram& program, XQueryPlaceID place) {
  for (int level = 0; level < XQueryPlanning::mostLevels; ++level) {
    const XQueryPlace& here = program[place];
    if (here.parent == XQueryNoPlace) return true;
    switch (here.role) {
      case XQueryRole::Step:
      case XQueryRole::Predicate:
      case XQueryRole::Satisfies:
        return false;
      case XQueryRole::Clause:
      case XQueryRole::Where:
      case XQueryRole::Return:
        if (standsBehindFor(program, place)) return false;
        break;
      default:
        break;
    }
    place = here.parent;
  }
  return false;
}

}  // namespace xquery

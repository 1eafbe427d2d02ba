// Every path is walked by an operator.
//
// Pattern     any path
// Facts       none are asked for
// Operator    XQueryWalkedPath, which takes its steps as the path does, and which further rules
//             tell what they find out about them
// Why         see there. Rules may put their own operators around it as if it were the path
#include "Plan/Paths/XQueryWalkedPath.h"
#include "Plan/Planning.h"
#include "Plan/Rules.h"
#include "Plan/Rules/PathAt.h"

#include <functional>

namespace xquery {

XQueryWalkedPath* XQueryWalkedPathAt(const XQueryPlanning& planning, XQueryPlaceID place) {
  const Ref<XQueryExpr> there = planning.exprAt(place);
  const auto* expr = dyn_cast<XQueryPlannedExpr>(there.get());
  while (expr && !expr->walkedPath()) expr = dyn_cast<XQueryPlannedExpr>(&expr->plain());
  return expr ? const_cast<XQueryWalkedPath*>(expr->walkedPath()) : nullptr;
}

std::optional<size_t> XQueryPredicateAt(const XQueryPlace& place) {
  const auto& predicates = place.step->predicates();
  const auto* const first = predicates.data();
  const std::less<> isBefore;
  if (isBefore(place.slot, first) || !isBefore(place.slot, first + predicates.size())) {
    return std::nullopt;
  }
  return static_cast<size_t>(place.slot - first);
}

void XQueryWalkPaths(XQueryPlanning& planning) {
  for (XQueryPlaceID place = 0; place < planning.program.placeCount(); ++place) {
    auto* path = dyn_cast<XQueryPathExpr>(planning.program[place].expr);
    if (!path || !planning.isOpen(place)) continue;
    const Ref<XQueryPathExpr> plain(path);
    planning.program.replace(place, XQueryWalkedPath::exprWithPlain(plain, plain));
  }
}

}  // namespace xquery

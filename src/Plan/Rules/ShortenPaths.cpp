// A path over a few children, attributes and siblings.
//
// Pattern     "$p/name", "@id", "../price/text()": up to eight steps to parents, which come first,
//             to children and to attributes, by names or by text() and node(), without predicates,
//             from the context item or a local variable; "ancestor::item" alone
// Facts       none are asked for: at each use it is asked whether there is one node to start from
// Operator    XQueryShortPath: walks and takes what it finds as it comes
// Why         what is found from one node comes in document order and each node once, as sorting
//             would leave it; whatever else the path starts from is left to the path
#include "Expr/Paths/XQueryPath.h"
#include "Plan/Operators/XQueryShortPath.h"
#include "Plan/Planning.h"
#include "Plan/Rules.h"
#include "Plan/Rules/PathAt.h"

namespace xquery {
namespace {

// Whether a clause walks siblings and a condition stands behind it, which may pick them.
bool isPickedFrom(const XQueryPlanning& planning, XQueryPlaceID place) {
  const XQueryProgram& program = planning.program;
  const XQueryPlace& at = program[place];
  const XQueryWalkedPath* path = XQueryWalkedPathAt(planning, place);
  if (at.role != XQueryRole::Bound || !path || !path->beginsWithSiblings()) return false;
  const XQueryPlaceID next = program.nextPart(at.parent);
  const XQueryRole role = next == XQueryNoPlace ? XQueryRole::Body : program[next].role;
  return role == XQueryRole::Where || role == XQueryRole::Satisfies;
}

}  // namespace

void XQueryShortenPaths(XQueryPlanning& planning) {
  for (XQueryPlaceID place = 0; place < planning.program.placeCount(); ++place) {
    const XQueryPlace& at = planning.program[place];
    if (!isa<XQueryPathExpr>(at.expr) || !planning.isOpen(place)) continue;
    XQueryShortWalk walk;
    if (!walk.readFrom(*at.expr) || !walk.visitsInOrder()) continue;
    if (isPickedFrom(planning, place)) continue;
    planning.wrap(place, XQueryShortPath::exprWithPlain(*at.slot, walk));
  }
}

}  // namespace xquery

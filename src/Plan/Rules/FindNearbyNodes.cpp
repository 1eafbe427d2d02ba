// One node and a few steps.
//
// Pattern     P intersect $v and $v intersect P, where P is a short path with a step at least and
//             $v a local variable
// Facts       none are asked for: at each use it is asked whether the path starts from one node
//             and whether the variable holds one
// Operator    XQueryNearbyNode: the walk ends where it meets the node, and no list is made
// Why         from one node a short path raises no error, and one node is in the intersection when
//             the path finds it; whatever else there is, is left to the intersection
#include "Expr/Operators/XQueryOperatorExpr.h"
#include "Expr/XQueryLeaves.h"
#include "Expr/XQueryLists.h"
#include "Plan/Operators/XQueryNearbyNode.h"
#include "Plan/Planning.h"
#include "Plan/Rules.h"

namespace xquery {
namespace {

// Null where the pattern is not met with the path on this side.
Ref<XQueryExpr> operatorFor(const Ref<XQueryExpr>& plain, const XQueryExpr* path,
                            const XQueryExpr* node) {
  const auto* variable = dyn_cast<XQueryVariable>(XQueryWithoutParentheses(node));
  XQueryShortWalk walk;
  if (!variable || variable->varID() <= 0 || !path) return nullptr;
  if (!walk.readFrom(*path) || walk.isEmpty()) return nullptr;
  return XQueryNearbyNode::exprWithPlain(plain, walk, variable->varID());
}

}  // namespace

void XQueryFindNearbyNodes(XQueryPlanning& planning) {
  for (XQueryPlaceID place = 0; place < planning.program.placeCount(); ++place) {
    const XQueryPlace& at = planning.program[place];
    const auto* operation = dyn_cast<XQueryOperatorExpr>(at.expr);
    if (!operation || !planning.isOpen(place)) continue;
    if (operation->operatorType() != XQueryOperatorIntersect) continue;
    auto by = operatorFor(*at.slot, operation->left(), operation->right());
    if (!by) by = operatorFor(*at.slot, operation->right(), operation->left());
    if (by) planning.wrap(place, std::move(by));
  }
}

}  // namespace xquery

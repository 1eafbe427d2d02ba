// Comparing with many items.
//
// Pattern     L = R, L < R, L <= R, L > R or L >= R where one side may have many items and is a
//             variable or a list that is kept, or both may have many
// Facts       how many items the sides may have
// Refused     a literal on one side; the integers of a range; "!="
// Operator    XQuerySetComparison: evaluates both sides, and where there are many pairs looks the
//             items of one side up in a set of the other one: the one that comes again, or else the
//             longer one
// Why         see there
#include "Expr/Operators/XQueryOperatorExpr.h"
#include "Expr/XQueryLeaves.h"
#include "Plan/Operators/XQuerySetComparison.h"
#include "Plan/Planning.h"
#include "Plan/Rules.h"

namespace xquery {
namespace {

bool isMany(const XQueryPlanning& planning, XQueryPlaceID place) {
  return planning.facts[place].most >= XQueryFacts::many;
}

bool isLiteral(const XQueryPlanning& planning, XQueryPlaceID place) {
  return isa<XQueryLiteral>(planning.program[planning.program.withoutParentheses(place)].expr);
}

// Whether the same list may come again.
bool comesAgain(const XQueryPlanning& planning, XQueryPlaceID place) {
  place = planning.program.withoutParentheses(place);
  return planning.isWrapped(place) || isa<XQueryVariable>(planning.program[place].expr);
}

}  // namespace

void XQueryCompareWithSets(XQueryPlanning& planning) {
  for (XQueryPlaceID place = 0; place < planning.program.placeCount(); ++place) {
    auto* comparison = dyn_cast<XQueryOperatorExpr>(planning.program[place].expr);
    if (!comparison || !planning.isOpen(place)) continue;
    const int type = comparison->operatorType();
    if (XQueryOperatorExpr::operatorClassification(type) != 6 || type == XQueryOperatorNotEqual) {
      continue;
    }
    const XQueryPlaceID left = planning.program.firstPart(place);
    const XQueryPlaceID right = planning.program.nextPart(left);
    if (right == XQueryNoPlace || XQueryOperatorExpr::rangeIn(comparison->right())) continue;
    if (isLiteral(planning, left) || isLiteral(planning, right)) continue;
    const bool areMany = isMany(planning, left) && isMany(planning, right);
    const bool isLeftAgain = isMany(planning, left) && comesAgain(planning, left);
    const bool isRightAgain = isMany(planning, right) && comesAgain(planning, right);
    if (!areMany && !isLeftAgain && !isRightAgain) continue;
    using Again = XQuerySetComparison::Again;
    const Again ofLeft = isRightAgain ? Again::Both : Again::Left;
    const Again ofRight = isRightAgain ? Again::Right : Again::None;
    planning.wrap(place, XQuerySetComparison::exprWithPlain(Ref<XQueryOperatorExpr>(comparison),
                                                            isLeftAgain ? ofLeft : ofRight));
  }
}

}  // namespace xquery

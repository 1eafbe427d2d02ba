// Comparing children and attributes with a constant.
//
// Pattern     "@id = 'a1'", "$p/price > 40", "name eq 'b'", ". != 'c'", on either side: a short
//             path, or the context item or a local variable alone, beside a string or, in a general
//             comparison, a number
// Facts       none are asked for: at each use it is asked whether there is one node to start from
// Operator    XQueryConstantComparison: compares the texts of the nodes where they lie
// Why         a node is compared by its text with a string, and by the number that its text is with
//             a number, one node after the other until one decides; a text that is no number, which
//             is an error, and everything else is left to the comparison
#include "Expr/Operators/XQueryOperatorExpr.h"
#include "Expr/XQueryLeaves.h"
#include "Expr/XQueryLists.h"
#include "Plan/Operators/XQueryConstantComparison.h"
#include "Plan/Planning.h"
#include "Plan/Rules.h"
#include "Types/XQueryItemKinds.h"
#include "Types/XQueryTypeTable.h"
#include "xquery/Number.h"

#include <cmath>
#include <optional>

namespace xquery {
namespace {

constexpr int generalComparison = 6;
constexpr int valueComparison = 5;

std::optional<XQueryConstantComparison::Constant> constantIn(const XQueryExpr* expr) {
  const auto* literal = dyn_cast<XQueryLiteral>(XQueryWithoutParentheses(expr));
  const NSObject* value = literal ? literal->literalValue().get() : nullptr;
  if (!value) return std::nullopt;
  XQueryConstantComparison::Constant constant;
  if (XQueryObjectTypeID(value) == XQueryTypeString) {
    const auto* text = cast<NSString>(value);
    constant.text = Ref<NSString>(const_cast<NSString*>(text));
    return constant;
  }
  if ((XQueryKindsOfItem(*value) & XQueryItems::Numeric) == 0) return std::nullopt;
  constant.number = cast<NSNumber>(value)->doubleValue();
  if (std::isnan(constant.number)) return std::nullopt;
  return constant;
}

class Comparison {
 public:
  explicit Comparison(const XQueryOperatorExpr& expr) : _expr(expr) {}

  // Null where the pattern is not met.
  Ref<XQueryExpr> operatorFor(const Ref<XQueryExpr>& plain) const {
    const int type = _expr.operatorType();
    const int operatorClass = XQueryOperatorExpr::operatorClassification(type);
    const bool isValueComparison = operatorClass == valueComparison;
    if (operatorClass != generalComparison && !isValueComparison) return nullptr;
    const XQueryExpr* nodes = _expr.left();
    auto constant = constantIn(_expr.right());
    const bool isMirrored = !constant;
    if (isMirrored) {
      constant = constantIn(_expr.left());
      nodes = _expr.right();
    }
    XQueryShortWalk walk;
    if (!constant || !nodes || !walk.readFrom(*nodes) || !walk.visitsInOrder()) {
      return nullptr;
    }
    if (isValueComparison && !constant->text) return nullptr;
    const int code = isValueComparison ? type : type + XQueryOperatorEq - XQueryOperatorEqual;
    XQueryRelation relation = XQueryRelationForCode(code);
    if (isMirrored) relation = XQueryMirrored(relation);
    return XQueryConstantComparison::exprWithPlain(plain, walk, relation, isValueComparison,
                                                   *std::move(constant));
  }

 private:
  const XQueryOperatorExpr& _expr;
};

}  // namespace

void XQueryCompareConstants(XQueryPlanning& planning) {
  for (XQueryPlaceID place = 0; place < planning.program.placeCount(); ++place) {
    const XQueryPlace& at = planning.program[place];
    const auto* comparison = dyn_cast<XQueryOperatorExpr>(at.expr);
    if (!comparison || !planning.isOpen(place)) continue;
    if (auto by = Comparison(*comparison).operatorFor(*at.slot)) {
      planning.wrap(place, std::move(by));
    }
  }
}

}  // namespace xquery

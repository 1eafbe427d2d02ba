// Comparing the name of the context item with a constant.
//
// Pattern     name() = "a" and local-name() = "a", with "." for an argument or without one, on
//             either side, with "=" or "eq"
// Facts       none are asked for
// Operator    XQueryNameComparison: compares the text of the name where it lies
// Why         for an element or an attribute both functions answer exactly the name, as a string,
//             and two strings compare equal when their text is; everything else, errors included,
//             is left to the expression as it was written
#include "Expr/Operators/XQueryOperatorExpr.h"
#include "Expr/XQueryLeaves.h"
#include "Expr/XQueryLists.h"
#include "Functions/Node.h"
#include "Functions/XQueryFunctionCall.h"
#include "Plan/Operators/XQueryNameComparison.h"
#include "Plan/Planning.h"
#include "Plan/Rules.h"
#include "Types/XQueryItemKinds.h"

#include <optional>

namespace xquery {
namespace {

// Which name of the context item the expression asks for, if any.
std::optional<XQueryNameComparison::Name> nameAskedFor(const XQueryExpr* expr) {
  const auto* call = dyn_cast<XQueryFunctionCall>(expr);
  if (!call || !call->builtIn()) return std::nullopt;
  const size_t count = call->args() ? call->args()->count() : 0;
  const bool isOfItem =
      count == 0 || (count == 1 && isa<XQueryContextItem>(
                                       XQueryWithoutParentheses(call->args()->objectAtIndex(0))));
  if (!isOfItem) return std::nullopt;
  if (call->function() == fn_name) return XQueryNameComparison::Name::Qualified;
  if (call->function() == fn_local_name) return XQueryNameComparison::Name::Local;
  return std::nullopt;
}

const NSString* stringIn(const XQueryExpr* expr) {
  const auto* literal = dyn_cast<XQueryLiteral>(XQueryWithoutParentheses(expr));
  if (!literal || !literal->literalValue()) return nullptr;
  const NSObject& value = *literal->literalValue();
  return XQueryKindsOfItem(value) == XQueryItems::String ? dyn_cast<NSString>(&value) : nullptr;
}

}  // namespace

void XQueryCompareNames(XQueryPlanning& planning) {
  for (XQueryPlaceID place = 0; place < planning.program.placeCount(); ++place) {
    const auto* comparison = dyn_cast<XQueryOperatorExpr>(planning.program[place].expr);
    if (!comparison || !planning.isOpen(place)) continue;
    const int type = comparison->operatorType();
    if (type != XQueryOperatorEqual && type != XQueryOperatorEq) continue;
    const XQueryExpr* left = XQueryWithoutParentheses(comparison->left());
    const XQueryExpr* right = XQueryWithoutParentheses(comparison->right());
    auto name = nameAskedFor(left);
    const NSString* text = stringIn(right);
    if (!name) {
      name = nameAskedFor(right);
      text = stringIn(left);
    }
    if (!name || !text) continue;
    planning.wrap(place,
                  XQueryNameComparison::exprWithPlain(*planning.program[place].slot, *name,
                                                      Ref<NSString>(const_cast<NSString*>(text))));
  }
}

}  // namespace xquery

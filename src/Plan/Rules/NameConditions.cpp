#include "Plan/Rules/NameConditions.h"

#include "Expr/Operators/XQueryOperatorExpr.h"
#include "Expr/XQueryLeaves.h"
#include "Expr/XQueryLists.h"
#include "Functions/Node.h"
#include "Functions/XQueryFunctionCall.h"
#include "Types/XQueryItemKinds.h"

namespace xquery {
namespace {

using By = XQueryNameChoice::By;

// Which name of the context item the expression asks for, if any.
std::optional<By> nameAskedFor(const XQueryExpr* expr) {
  const auto* call = dyn_cast<XQueryFunctionCall>(expr);
  if (!call || !call->builtIn()) return std::nullopt;
  const size_t count = call->args() ? call->args()->count() : 0;
  const bool isOfItem =
      count == 0 || (count == 1 && isa<XQueryContextItem>(
                                       XQueryWithoutParentheses(call->args()->objectAtIndex(0))));
  if (!isOfItem) return std::nullopt;
  if (call->function() == fn_name) return By::Name;
  if (call->function() == fn_local_name) return By::LocalName;
  return std::nullopt;
}

// The strings that an expression consists of; none where there is anything else.
std::vector<Ref<NSString>> stringsIn(const XQueryExpr* expr) {
  constexpr size_t mostStrings = 64;
  const auto stringIn = [](const XQueryExpr* each) -> NSString* {
    const auto* literal = dyn_cast<XQueryLiteral>(XQueryWithoutParentheses(each));
    if (!literal || !literal->literalValue()) return nullptr;
    const bool isString = XQueryKindsOfItem(*literal->literalValue()) == XQueryItems::String;
    return isString ? dyn_cast<NSString>(literal->literalValue().get()) : nullptr;
  };
  if (NSString* text = stringIn(expr)) return {Ref<NSString>(text)};
  const auto* list = dyn_cast<XQueryExprList>(expr);
  if (!list || list->count() > mostStrings) return {};
  std::vector<Ref<NSString>> texts;
  for (size_t i = 0; i < list->count(); ++i) {
    NSString* text = stringIn(list->objectAtIndex(i));
    if (!text) return {};
    texts.emplace_back(text);
  }
  return texts;
}

}  // namespace

std::optional<XQueryNameCondition> XQueryNameConditionIn(const XQueryExpr& expr) {
  const auto* comparison = dyn_cast<XQueryOperatorExpr>(&expr);
  if (!comparison) return std::nullopt;
  const int type = comparison->operatorType();
  if (type != XQueryOperatorEqual && type != XQueryOperatorEq) return std::nullopt;
  const XQueryExpr* left = XQueryWithoutParentheses(comparison->left());
  const XQueryExpr* right = XQueryWithoutParentheses(comparison->right());
  auto by = nameAskedFor(left);
  auto texts = stringsIn(right);
  if (!by) {
    by = nameAskedFor(right);
    texts = stringsIn(left);
  }
  const bool isKnown = by && !texts.empty() && (texts.size() == 1 || type == XQueryOperatorEqual);
  if (!isKnown) return std::nullopt;
  return XQueryNameCondition{*by, std::move(texts)};
}

}  // namespace xquery

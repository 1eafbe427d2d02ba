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

struct AskedName {
  By by;
  bool isString;  // what asks for it answers a string
};

// The only argument of a call of that function; null for anything else.
const XQueryExpr* argumentOf(const XQueryExpr* expr, XQueryProcedure function) {
  const auto* call = dyn_cast<XQueryFunctionCall>(expr);
  const bool fits = call && call->builtIn() && call->function() == function && call->args() &&
                    call->args()->count() == 1;
  return fits ? XQueryWithoutParentheses(call->args()->objectAtIndex(0)) : nullptr;
}

// Which name of the context item the expression asks for, if any. The string of what is no name is
// the empty one.
std::optional<AskedName> nameAskedFor(const XQueryExpr* expr) {
  const XQueryExpr* argument = argumentOf(expr, fn_string);
  const auto* call = dyn_cast<XQueryFunctionCall>(argument ? argument : expr);
  if (!call || !call->builtIn()) return std::nullopt;
  const XQueryExpr* item = argumentOf(call, call->function());
  const bool hasItem = item && isa<XQueryContextItem>(item);
  const bool isOfItem = hasItem || !call->args() || call->args()->count() == 0;
  if (isOfItem && call->function() == fn_name) return AskedName{By::Name, true};
  if (isOfItem && call->function() == fn_local_name) return AskedName{By::LocalName, true};
  const bool isString = argument != nullptr;
  if (isOfItem && call->function() == fn_namespace_uri) return AskedName{By::URI, isString};
  if (hasItem && call->function() == fn_node_name) return AskedName{By::NodeName, isString};
  return std::nullopt;
}

// The strings that an expression consists of; none where there is anything else.
std::vector<Ref<NSString>> stringsIn(const XQueryExpr* expr) {
  constexpr size_t mostStrings = 64;
  const auto stringIn = [](const XQueryExpr* each) -> NSString* {
    const auto* literal = dyn_cast<XQueryLiteral>(XQueryWithoutParentheses(each));
    if (!literal || !literal->literalValue()) return nullptr;
    const bool isString = XQueryKindsOfItem(*literal->literalValue()) == XQueryItems::PlainString;
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
  const bool isKnown =
      by && by->isString && !texts.empty() && (texts.size() == 1 || type == XQueryOperatorEqual);
  if (!isKnown) return std::nullopt;
  return XQueryNameCondition{by->by, std::move(texts)};
}

}  // namespace xquery

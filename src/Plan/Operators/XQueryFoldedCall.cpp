#include "Plan/Operators/XQueryFoldedCall.h"

#include "Context/StackGuard.h"
#include "Context/XQueryContextInternal.h"
#include "Expr/Clauses/XQueryClauseItems.h"
#include "Expr/Clauses/XQueryFLWOR.h"
#include "Expr/XQueryAsking.h"
#include "Expr/XQuerySequence.h"
#include "Functions/Aggregate.h"

#include <array>

namespace xquery {
namespace {

XQueryNumberFold::Aim aimOf(XQueryProcedure function) {
  if (function == fn_max) return XQueryNumberFold::Aim::Greatest;
  if (function == fn_min) return XQueryNumberFold::Aim::Least;
  return XQueryNumberFold::Aim::Sum;
}

}  // namespace

bool XQueryFoldedCall::isFor(const XQueryFunctionCall& call) {
  if (!call.builtIn() || !call.args()) return false;
  const XQueryProcedure function = call.function();
  const size_t count = call.args()->count();
  if (function == fn_sum) return count == 1 || count == 2;
  return count == 1 && (function == fn_avg || function == fn_max || function == fn_min);
}

XQueryFoldedCall::XQueryFoldedCall(Ref<XQueryFunctionCall> call, Ref<XQueryExpr> argument)
    : XQueryPlannedExpr(call),
      _argument(std::move(argument)),
      _aim(aimOf(call->function())),
      _isAverage(call->function() == fn_avg) {}

Value XQueryFoldedCall::computeValue(XQueryContext& context) const {
  // Diagnostics show every error, those of the function behind those of the arguments.
  if (_internal(context).showsErrors()) return plain().evaluateWithContext(context);
  XQueryCheckStack(context);
  XQueryNumberFold fold(_aim);
  if (!XQueryAsk(*_argument, context, [&] { return foldInto(fold, context); })) return {};
  return answerFor(fold, context);
}

// False after an error.
bool XQueryFoldedCall::foldInto(XQueryNumberFold& fold, XQueryContext& context) const {
  if (const auto* flwor = dyn_cast<XQueryFLWORExpr>(_argument.get())) {
    return flwor->foldItems(fold, context);
  }
  const XQueryClauseItems items(_argument.get(), context);
  if (items.haveFailed()) return false;
  if (items.areIntegers()) items.foldIntegers(fold);
  return true;
}

Value XQueryFoldedCall::answerFor(XQueryNumberFold& fold, XQueryContext& context) const {
  if (_isAverage && fold.count() > 1) {
    Value sum = fold.isList() ? XQuerySumOf(fold.argument(), context) : fold.argument();
    Value average = XQueryAverageOf(std::move(sum), fold.count(), context);
    return average ? average : call().failInvalidArguments(context);
  }
  std::array<Value, 2> arguments = {fold.argument(), Value()};
  const size_t count = call().args()->count();
  if (count > 1) {
    arguments[1] = normalised(call().args()->objectAtIndex(1)->evaluateWithContext(context));
    if (!arguments[1]) {
      return _internal(context).isFailing() ? Value() : call().failInvalidArguments(context);
    }
  }
  return call().callBuiltInWith(arguments.data(), count, context);
}

}  // namespace xquery

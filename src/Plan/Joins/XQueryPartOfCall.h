// A part of a declared function's body as it is in one call: an operand of the comparison that the
// body is.
#pragma once

#include "Functions/XQueryFunctionCall.h"
#include "Plan/Operators/XQueryPlannedExpr.h"

#include <cstddef>
#include <utility>
#include <vector>

namespace xquery {

class XQueryPartOfCall : public XQueryPlannedExpr {
 public:
  // `parameters`: by number, those that the part reads. `call` is an XQueryFunctionCall.
  [[nodiscard]] static Ref<XQueryPartOfCall> exprWithCall(Ref<XQueryExpr> call,
                                                          Ref<XQueryExpr> part,
                                                          std::vector<size_t> parameters) {
    return make<XQueryPartOfCall>(std::move(call), std::move(part), std::move(parameters));
  }

  Value computeValue(XQueryContext& context) const override {
    return cast<XQueryFunctionCall>(&plain())->evaluatePartOfBody(*_part, _parameters, context);
  }

 protected:
  XQueryPartOfCall(Ref<XQueryExpr> call, Ref<XQueryExpr> part, std::vector<size_t> parameters)
      : XQueryPlannedExpr(std::move(call)),
        _part(std::move(part)),
        _parameters(std::move(parameters)) {}
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  const Ref<XQueryExpr> _part;
  const std::vector<size_t> _parameters;
};

}  // namespace xquery

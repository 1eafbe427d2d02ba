// Expressions that do what the test says.
#pragma once

#include "Context/XQueryContextInternal.h"
#include "Expr/Evaluated.h"
#include "Expr/XQueryExpr.h"
#include "xquery/Error.h"

#include <functional>
#include <string>
#include <utility>

namespace xquery {

class ProbeExpr : public XQueryExpr {
 public:
  using Evaluate = std::function<Value(XQueryContext&)>;
  using Bind = std::function<void(XQueryProlog&)>;
  ProbeExpr(Evaluate evaluate, Bind bind)
      : XQueryExpr(Kind::OtherExpr), _evaluate(std::move(evaluate)), _bind(std::move(bind)) {}
  void bindInfoForProlog(XQueryProlog& prolog) override {
    if (_bind) _bind(prolog);
  }
  void visitParts(XQueryPartVisitor&) override {}
  Value computeValue(XQueryContext& context) const override { return _evaluate(context); }

 private:
  Evaluate _evaluate;
  Bind _bind;
};

inline Ref<XQueryExpr> probe(ProbeExpr::Evaluate evaluate, ProbeExpr::Bind bind = {}) {
  return make<ProbeExpr>(std::move(evaluate), std::move(bind));
}
inline Ref<XQueryExpr> always(Value value) {
  return probe([value](XQueryContext&) { return value; });
}
inline Ref<XQueryExpr> failing(int64_t number = 6, std::string message = "invalid type") {
  return probe([=](XQueryContext& context) -> Value {
    _internal(context).raise(XQueryError::error(number, message));
  });
}

}  // namespace xquery

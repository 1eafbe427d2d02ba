// The body of a declared function that is computed with machine numbers, texts and lists
// (XQueryScalarProgram).
#pragma once

#include "Expr/XQueryLeaves.h"
#include "Plan/Operators/XQueryPlannedExpr.h"
#include "Plan/Operators/XQueryScalarProgram.h"

#include <atomic>
#include <cstdint>
#include <memory>
#include <utility>
#include <vector>

namespace xquery {

class XQueryScalarBody : public XQueryPlannedExpr {
 public:
  // All functions of a program, and the literals that they may answer.
  struct Program {
    XQueryScalarProgram scalars;
    std::vector<Ref<XQueryLiteral>> literals;
    // What constants refer to: other rules may drop the expressions that hold it.
    std::vector<Value> constants;
  };

  // `parameters`: the IDs of their variables.
  [[nodiscard]] static Ref<XQueryScalarBody> exprWithPlain(Ref<XQueryExpr> plain,
                                                           std::shared_ptr<const Program> program,
                                                           XQueryScalarProgram::Index function,
                                                           std::vector<int64_t> parameters) {
    return make<XQueryScalarBody>(std::move(plain), std::move(program), function,
                                  std::move(parameters));
  }

  Value computeValue(XQueryContext& context) const override;
  const XQueryScalarBody* scalarBody() const override { return this; }

  // What the function answers for these arguments, which are overwritten; Unknown where the body
  // has to be evaluated. `made` takes what the answer refers to, where that was made on the way.
  // Throws where a limit of the evaluation is reached.
  XQueryScalar answer(XQueryScalar* arguments, Value& made) const;
  // The literal that was answered; null for another answer.
  Value literalAnswered(const XQueryScalar& answer, XQueryContext& context) const;

 protected:
  XQueryScalarBody(Ref<XQueryExpr> plain, std::shared_ptr<const Program> program,
                   XQueryScalarProgram::Index function, std::vector<int64_t> parameters)
      : XQueryPlannedExpr(std::move(plain)),
        _program(std::move(program)),
        _function(function),
        _parameters(std::move(parameters)) {}
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  // Each call inside one that has come to nothing may come to nothing again: a function that is
  // called for something else than these numbers is soon left to the plain way. Written where
  // nothing is known only, so that threads which share a plan do not wait for each other.
  static constexpr uint32_t mostFailures = 32;

  const std::shared_ptr<const Program> _program;
  const XQueryScalarProgram::Index _function;
  const std::vector<int64_t> _parameters;
  mutable std::atomic<uint32_t> _failures = 0;
};

}  // namespace xquery

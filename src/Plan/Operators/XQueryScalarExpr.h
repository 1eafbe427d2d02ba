// Arithmetic, comparisons and logic over single numbers, computed with machine numbers: nothing
// between the operands and the answer is made an object.
//
//   $i * 7919 mod 10007 = 0 or position() = 1
//
// Each step knows numbers and truth values, and equals there what the operator answers; decimals
// and integers that leave a word are objects. Wherever an operand is something else, or there would
// be an error, the whole expression is evaluated as it was written. Nothing that has been looked at
// until then can be told.
#pragma once

#include "Expr/Clauses/XQueryItemFold.h"
#include "Expr/XQueryTruthTeller.h"
#include "Plan/Operators/XQueryPlannedExpr.h"
#include "Plan/Operators/XQueryScalar.h"

#include <cstddef>
#include <cstdint>
#include <optional>
#include <utility>
#include <vector>

namespace xquery {

class XQueryContextInternal;

// The steps of such a computation. Operands stand before what they are operands of.
class XQueryScalarSteps {
 public:
  using Index = uint16_t;
  // Steps nest no deeper, and are no more, than is worth it.
  static constexpr size_t mostSteps = 64;

  enum class Kind : uint8_t {
    Constant,
    Variable,  // local
    ContextItem,
    Position,
    Last,
    Arithmetic,  // code: the operator; a sign's left operand is the constant 0
    Comparison,  // code: the value comparison
    And,
    Or,
    Not,
    Call,  // left: the first of its operands; code: their number; the body of the function
  };
  struct Step {
    Kind kind = Kind::Constant;
    uint8_t code = 0;
    Index left = 0;
    Index right = 0;  // or the only one
    int64_t varID = 0;
    XQueryScalar constant{};
    const XQueryScalarBody* body = nullptr;  // of the same program
  };

  // The index of the step.
  Index add(const Step& step) {
    _steps.push_back(step);
    return static_cast<Index>(_steps.size() - 1);
  }
  // Of a call, which stand in a row. The index of the first.
  Index addOperands(const std::vector<Index>& operands) {
    _operands.insert(_operands.end(), operands.begin(), operands.end());
    return static_cast<Index>(_operands.size() - operands.size());
  }
  // What a constant refers to: other rules may drop the expression that holds it.
  void hold(Value constant) { _constants.push_back(std::move(constant)); }
  size_t count() const { return _steps.size(); }
  const Step& operator[](size_t index) const { return _steps[index]; }

  using Made = XQueryScalarsMade;

  // What the last step comes to. `made` takes what the answer refers to, where that was made on the
  // way. Throws where a call reaches a limit of the evaluation.
  XQueryScalar answer(const XQueryContext& context, Made& made) const;
  // Whether it is a literal that is passed to a function, which may answer it.
  bool isConstant(const NSObject* object) const;
  // The body of the function that is called last, if the last step is a call; otherwise null.
  const XQueryScalarBody* callee() const { return _steps.back().body; }

 private:
  XQueryScalar valueOf(Index index, const XQueryContextInternal& context, Made& made) const;
  XQueryScalar operand(Index index, const XQueryContextInternal& context, Made& made) const;
  XQueryScalar logic(const Step& step, const XQueryContextInternal& context, Made& made) const;
  XQueryScalar called(const Step& step, const XQueryContextInternal& context, Made& made) const;

  std::vector<Step> _steps;
  std::vector<Index> _operands;
  std::vector<Value> _constants;
};

class XQueryScalarExpr : public XQueryPlannedExpr,
                         public XQueryItemYielder,
                         public XQueryTruthTeller {
 public:
  [[nodiscard]] static Ref<XQueryScalarExpr> exprWithPlain(Ref<XQueryExpr> plain,
                                                           XQueryScalarSteps steps) {
    return make<XQueryScalarExpr>(std::move(plain), std::move(steps));
  }

  Value computeValue(XQueryContext& context) const override;
  const XQueryItemYielder* itemYielder() const override { return this; }
  bool yieldTo(XQueryItemFold& fold, XQueryContext& context) const override;
  std::optional<bool> truth(const XQueryContext& context) const override;

 protected:
  XQueryScalarExpr(Ref<XQueryExpr> plain, XQueryScalarSteps steps)
      : XQueryPlannedExpr(std::move(plain)), _steps(std::move(steps)) {}
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  Value valueOf(const XQueryScalar& answer, XQueryContext& context) const;
  bool yieldAnswer(const XQueryScalar& answer, XQueryItemFold& fold, XQueryContext& context) const;

  const XQueryScalarSteps _steps;
};

}  // namespace xquery

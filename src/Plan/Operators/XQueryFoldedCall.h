// sum(), avg(), max() and min() of what a FLWOR yields, or of the integers of a range, without a
// list of them.
#pragma once

#include "Functions/NumberFold.h"
#include "Functions/XQueryFunctionCall.h"
#include "Plan/Operators/XQueryPlannedExpr.h"

#include <utility>

namespace xquery {

class XQueryFoldedCall : public XQueryPlannedExpr {
 public:
  // The first argument of the call, perhaps without its parentheses, is a FLWOR without order specs
  // or a range.
  [[nodiscard]] static Ref<XQueryFoldedCall> exprWithCall(Ref<XQueryFunctionCall> call,
                                                          Ref<XQueryExpr> argument) {
    return make<XQueryFoldedCall>(std::move(call), std::move(argument));
  }
  // Whether it is a call of one of these functions with a number of arguments that they take.
  static bool isFor(const XQueryFunctionCall& call);

  Value computeValue(XQueryContext& context) const override;

 protected:
  XQueryFoldedCall(Ref<XQueryFunctionCall> call, Ref<XQueryExpr> argument);
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  const XQueryFunctionCall& call() const { return *cast<XQueryFunctionCall>(&plain()); }
  bool foldInto(XQueryNumberFold& fold, XQueryContext& context) const;
  Value answerFor(XQueryNumberFold& fold, XQueryContext& context) const;

  const Ref<XQueryExpr> _argument;
  const XQueryNumberFold::Aim _aim;
  const bool _isAverage;
};

}  // namespace xquery

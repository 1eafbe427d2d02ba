// A condition of a where clause that a clause before it has asked already: it holds for every tuple
// that comes so far.
//
// With diagnostics on, which show each error as it is made, nothing is asked early.
#pragma once

#include "Plan/Operators/XQueryPlannedExpr.h"

#include <utility>

namespace xquery {

class XQueryAskedEarly : public XQueryPlannedExpr {
 public:
  [[nodiscard]] static Ref<XQueryAskedEarly> exprWithPlain(Ref<XQueryExpr> plain) {
    return make<XQueryAskedEarly>(std::move(plain));
  }

  Value computeValue(XQueryContext& context) const override;

 protected:
  explicit XQueryAskedEarly(Ref<XQueryExpr> plain) : XQueryPlannedExpr(std::move(plain)) {}
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);
};

}  // namespace xquery

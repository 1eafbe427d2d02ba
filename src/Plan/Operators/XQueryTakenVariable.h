// A variable where it is read for the last time.
//
// The value moves out of the frame, so that a list which nobody else holds can be changed instead
// of being copied: a function that passes on a longer or shorter list to itself takes time in
// proportion to what it adds or removes, and the calls that wait do not keep a list each.
#pragma once

#include "Expr/XQueryLeaves.h"
#include "Plan/Operators/XQueryPlannedExpr.h"

#include <utility>

namespace xquery {

class XQueryTakenVariable : public XQueryPlannedExpr {
 public:
  // A local variable.
  [[nodiscard]] static Ref<XQueryTakenVariable> exprWithPlain(Ref<XQueryVariable> plain) {
    const int64_t varID = plain->varID();
    return make<XQueryTakenVariable>(std::move(plain), varID);
  }

  Value computeValue(XQueryContext& context) const override;

 protected:
  XQueryTakenVariable(Ref<XQueryVariable> plain, int64_t varID)
      : XQueryPlannedExpr(std::move(plain)), _varID(varID) {}
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  const int64_t _varID;
};

}  // namespace xquery

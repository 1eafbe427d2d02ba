// A key that is read by way of a clause's variable, where the items are asked as context items.
#pragma once

#include "Context/XQueryContextInternal.h"
#include "Plan/Operators/XQueryPlannedExpr.h"

#include <cstdint>
#include <utility>

namespace xquery {

class XQueryKeyOfItem : public XQueryPlannedExpr {
 public:
  // `key` does not read the focus.
  [[nodiscard]] static Ref<XQueryKeyOfItem> exprWithKey(Ref<XQueryExpr> key, int64_t varID) {
    return make<XQueryKeyOfItem>(std::move(key), varID);
  }

  // The key, with the context item in the variable, which stays there.
  Value computeValue(XQueryContext& context) const override {
    auto& dynamic = _internal(context);
    dynamic.setVariable(Value(dynamic.contextItem()), _varID);
    return plain().evaluateWithContext(context);
  }

 protected:
  XQueryKeyOfItem(Ref<XQueryExpr> key, int64_t varID)
      : XQueryPlannedExpr(std::move(key)), _varID(varID) {}
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  const int64_t _varID;
};

}  // namespace xquery

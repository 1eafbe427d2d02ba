// The keys of an item that are found by nodes below it: of "buyer[@person = $p/@id]" those of each
// buyer.
#pragma once

#include "Plan/Operators/XQueryPlannedExpr.h"

#include <utility>

namespace xquery {

class XQueryStep;

class XQueryInnerKeys : public XQueryPlannedExpr {
 public:
  // `path` is an XQueryPathExpr that ends with the step; `key` is read from each of the nodes that
  // the step's predicates are asked for.
  [[nodiscard]] static Ref<XQueryInnerKeys> exprWithPath(Ref<XQueryExpr> path,
                                                         const XQueryStep& step,
                                                         Ref<XQueryExpr> key) {
    return make<XQueryInnerKeys>(std::move(path), step, std::move(key));
  }

  // All the keys, one after another; null when one cannot be read.
  Value computeValue(XQueryContext& context) const override;

 protected:
  XQueryInnerKeys(Ref<XQueryExpr> path, const XQueryStep& step, Ref<XQueryExpr> key)
      : XQueryPlannedExpr(std::move(path)), _step(step), _key(std::move(key)) {}
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  const XQueryStep& _step;
  const Ref<XQueryExpr> _key;
};

}  // namespace xquery

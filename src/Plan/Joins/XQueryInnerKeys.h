// The keys of an item that are found by nodes below it: of "buyer[@person = $p/@id]" those of each
// buyer.
#pragma once

#include "Plan/Operators/XQueryPlannedExpr.h"
#include "Plan/Paths/XQueryWalkedPath.h"

#include <utility>

namespace xquery {

class XQueryInnerKeys : public XQueryPlannedExpr {
 public:
  // `path` ends with the step; `key` is read from each of the nodes that the step's predicates are
  // asked for.
  [[nodiscard]] static Ref<XQueryInnerKeys> exprWithPath(Ref<XQueryWalkedPath> path,
                                                         const XQueryStep& step,
                                                         Ref<XQueryExpr> key) {
    return make<XQueryInnerKeys>(std::move(path), step, std::move(key));
  }

  // All the keys, one after another; null when one cannot be read.
  Value computeValue(XQueryContext& context) const override;

 protected:
  XQueryInnerKeys(Ref<XQueryWalkedPath> path, const XQueryStep& step, Ref<XQueryExpr> key)
      : XQueryPlannedExpr(path), _path(std::move(path)), _step(step), _key(std::move(key)) {}
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  const Ref<XQueryWalkedPath> _path;
  const XQueryStep& _step;
  const Ref<XQueryExpr> _key;
};

}  // namespace xquery

// In place of a path that somebody else walks: what a variable takes that is read nowhere any more.
#pragma once

#include "Plan/Operators/XQueryPlannedExpr.h"
#include "Plan/Paths/XQueryWalkedPath.h"

#include <utility>

namespace xquery {

class XQueryMovedPath : public XQueryPlannedExpr {
 public:
  // A path from the document that can fail nowhere but in looking for that.
  [[nodiscard]] static Ref<XQueryMovedPath> exprWithPlain(Ref<XQueryExpr> plain,
                                                          Ref<XQueryWalkedPath> path) {
    return make<XQueryMovedPath>(std::move(plain), std::move(path));
  }

  // Fails as the path does; otherwise nothing, the empty sequence.
  Value computeValue(XQueryContext& context) const override;

 protected:
  XQueryMovedPath(Ref<XQueryExpr> plain, Ref<XQueryWalkedPath> path)
      : XQueryPlannedExpr(std::move(plain)), _start(path->start()->expr()) {}
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  const Ref<XQueryExpr> _start;
};

}  // namespace xquery

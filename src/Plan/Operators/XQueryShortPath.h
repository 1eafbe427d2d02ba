// A path over a few children and attributes from one node: "$p/name", "@id", "price/text()".
#pragma once

#include "Plan/Operators/XQueryPlannedExpr.h"
#include "Plan/Operators/XQueryShortWalk.h"

namespace xquery {

class XQueryShortPath : public XQueryPlannedExpr {
 public:
  [[nodiscard]] static Ref<XQueryShortPath> exprWithPlain(Ref<XQueryExpr> plain,
                                                          const XQueryShortWalk& walk) {
    return make<XQueryShortPath>(std::move(plain), walk);
  }

  // The nodes; from anything but one node what the path itself answers.
  Value computeValue(XQueryContext& context) const override;

 protected:
  XQueryShortPath(Ref<XQueryExpr> plain, const XQueryShortWalk& walk)
      : XQueryPlannedExpr(std::move(plain)), _walk(walk) {}
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  const XQueryShortWalk _walk;
};

}  // namespace xquery

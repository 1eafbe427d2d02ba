// A path of whose nodes only the first ones are asked for, by who stands around it.
#pragma once

#include "Expr/Clauses/XQueryFLWOR.h"
#include "Plan/Operators/XQueryPlannedExpr.h"
#include "Plan/Paths/XQueryWalkedPath.h"

#include <cstdint>
#include <utility>

namespace xquery {

class XQueryFirstNodes : public XQueryPlannedExpr {
 public:
  // The path findsInOrder.
  [[nodiscard]] static Ref<XQueryFirstNodes> exprWithPlain(Ref<XQueryWalkedPath> path,
                                                           uint64_t most) {
    return make<XQueryFirstNodes>(std::move(path), most);
  }

  // The value of the path, without some of the nodes behind the first so many.
  Value computeValue(XQueryContext& context) const override;

 protected:
  XQueryFirstNodes(Ref<XQueryWalkedPath> path, uint64_t most)
      : XQueryPlannedExpr(path), _path(std::move(path)), _most(most) {}
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  const Ref<XQueryWalkedPath> _path;
  const uint64_t _most;
};

// The same for a FLWOR. One without order specs ends as soon as it has so many items.
class XQueryFirstTuples : public XQueryPlannedExpr {
 public:
  [[nodiscard]] static Ref<XQueryFirstTuples> exprWithPlain(Ref<XQueryFLWORExpr> plain,
                                                            uint64_t most) {
    return make<XQueryFirstTuples>(std::move(plain), most);
  }

  Value computeValue(XQueryContext& context) const override;

 protected:
  XQueryFirstTuples(Ref<XQueryFLWORExpr> plain, uint64_t most)
      : XQueryPlannedExpr(std::move(plain)), _most(most) {}
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  const uint64_t _most;
};

}  // namespace xquery

// Where a value stands in a list that is asked again and again: "index-of($list, $value)".
#pragma once

#include "Plan/Operators/XQueryPlannedExpr.h"

#include <memory>
#include <utility>

namespace xquery {

class XQueryPositionLookup : public XQueryPlannedExpr {
 public:
  // Both arguments can be repeated, as they stand in the plain call.
  [[nodiscard]] static Ref<XQueryPositionLookup> exprWithPlain(Ref<XQueryExpr> plain,
                                                               Ref<XQueryExpr> list,
                                                               Ref<XQueryExpr> wanted) {
    return make<XQueryPositionLookup>(std::move(plain), std::move(list), std::move(wanted));
  }

  // The positions from a table of the list, as long as the list is the same, and none for a node;
  // what the call answers for anything else but a text or a number, and while no table is worth its
  // making.
  Value computeValue(XQueryContext& context) const override;

 protected:
  XQueryPositionLookup(Ref<XQueryExpr> plain, Ref<XQueryExpr> list, Ref<XQueryExpr> wanted)
      : XQueryPlannedExpr(std::move(plain)), _list(std::move(list)), _wanted(std::move(wanted)) {}
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  class Table;

  std::shared_ptr<const Table> tableOf(const Value& list, XQueryContext& context) const;

  const Ref<XQueryExpr> _list;
  const Ref<XQueryExpr> _wanted;
};

}  // namespace xquery

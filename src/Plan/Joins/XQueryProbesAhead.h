// What the items of a later clause have to be compared with an item of an earlier one, as far as
// they can be told before the earlier clause is walked: of
//
//   for $i in //item, $p in //person, $s in //sale
//   where $i/@id = $s/item and $p/@id = $s/buyer
//
// the buyers of the sales of $i, so that $p need not be every person.
#pragma once

#include "Expr/XQueryPicker.h"
#include "Plan/Operators/XQueryPlannedExpr.h"

#include <cstdint>
#include <memory>
#include <utility>

namespace xquery {

class XQueryProbesAhead : public XQueryPlannedExpr {
 public:
  // `probe` reads the variable of the later clause, which takes the items of `bound`.
  [[nodiscard]] static Ref<XQueryProbesAhead> exprWithProbe(Ref<XQueryExpr> probe, int64_t varID,
                                                            Ref<XQueryExpr> bound) {
    return make<XQueryProbesAhead>(std::move(probe), varID, std::move(bound));
  }
  // Picks the items for which the condition may hold.
  void setPicker(std::unique_ptr<const XQueryPicker> picker) { _picker = std::move(picker); }

  // The probes of all items that are picked; null where it is not certain which these are, or where
  // they are many.
  Value computeValue(XQueryContext& context) const override;

 protected:
  XQueryProbesAhead(Ref<XQueryExpr> probe, int64_t varID, Ref<XQueryExpr> bound)
      : XQueryPlannedExpr(std::move(probe)), _varID(varID), _bound(std::move(bound)) {}
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  const int64_t _varID;
  const Ref<XQueryExpr> _bound;
  std::unique_ptr<const XQueryPicker> _picker;
};

}  // namespace xquery

// Whether a value is equal to something of the items before a position:
// "$item/location = $items[position() < $i]/location".
#pragma once

#include "Plan/Operators/XQueryPlannedExpr.h"
#include "Plan/Operators/XQueryShortWalk.h"

#include <cstddef>
#include <cstdint>
#include <memory>
#include <optional>
#include <utility>

namespace xquery {

class XQueryEarlierItems : public XQueryPlannedExpr {
 public:
  // All can be repeated. Only the value may fail, if it is the first operand.
  struct Operands {
    Ref<XQueryExpr> value;  // the other side of the comparison
    Ref<XQueryExpr> items;
    Ref<XQueryExpr> bound;  // what positions are compared with
    bool isInclusive;       // up to the bound, not below it
    XQueryShortWalk walk;   // from an item to what is compared, of no step for the item itself
  };

  [[nodiscard]] static Ref<XQueryEarlierItems> exprWithPlain(Ref<XQueryExpr> plain,
                                                             Operands operands) {
    return make<XQueryEarlierItems>(std::move(plain), std::move(operands));
  }

  // What the comparison answers: from a table of all items by what is compared, once the same items
  // are asked for again.
  Value computeValue(XQueryContext& context) const override;

 protected:
  XQueryEarlierItems(Ref<XQueryExpr> plain, Operands operands)
      : XQueryPlannedExpr(std::move(plain)), _operands(std::move(operands)) {}
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  class Table;

  std::shared_ptr<Table> tableOf(const Value& items, XQueryContext& context) const;
  std::optional<bool> answer(const Value& value, XQueryContext& context) const;

  const Operands _operands;
};

}  // namespace xquery

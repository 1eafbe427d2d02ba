// A general comparison one side of which has many items: "@sku = //line/sku".
#pragma once

#include "Plan/Joins/XQueryJoinTable.h"
#include "Plan/Operators/XQueryPlannedExpr.h"

#include <memory>

namespace xquery {

class XQueryOperatorExpr;

class XQuerySetComparison : public XQueryPlannedExpr {
 public:
  [[nodiscard]] static Ref<XQuerySetComparison> exprWithPlain(Ref<XQueryOperatorExpr> plain);

  // Of few pairs each is compared; of many, the items of the longer side are put into a set by
  // their values, which is kept for the next comparison with the same list.
  Value computeValue(XQueryContext& context) const override;

 protected:
  explicit XQuerySetComparison(Ref<XQueryOperatorExpr> plain);
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  std::shared_ptr<XQueryJoinTable> setOf(const Value& items, bool isLeft, bool isWorthIt,
                                         XQueryContext& context) const;

  const XQueryOperatorExpr& _comparison;
};

}  // namespace xquery

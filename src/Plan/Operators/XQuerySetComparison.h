// A general comparison one side of which has many items: "@sku = //line/sku".
#pragma once

#include "Plan/Operators/XQueryPlannedExpr.h"

#include <cstdint>
#include <memory>

namespace xquery {

class XQueryOperatorExpr;

class XQuerySetComparison : public XQueryPlannedExpr {
 public:
  // Which sides may be a list that comes again.
  enum class Again : uint8_t { None, Left, Right, Both };
  [[nodiscard]] static Ref<XQuerySetComparison> exprWithPlain(Ref<XQueryOperatorExpr> plain,
                                                              Again again);

  // Of few pairs each is compared; of many, the items of one side are put into a set by their
  // values, which is kept for the next comparison with the same list: of the side that comes again,
  // or else of the longer one. Where texts are asked for that are equal, only as many are as it
  // takes to find one.
  Value computeValue(XQueryContext& context) const override;

 protected:
  XQuerySetComparison(Ref<XQueryOperatorExpr> plain, Again again);
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  class Set;
  // How much is known to be gained by a set.
  enum class Gain : uint8_t { None, IfAgain, AtOnce };
  bool isOfEquality() const;
  std::shared_ptr<Set> setOf(const Value& items, bool isLeft, Gain gain,
                             XQueryContext& context) const;
  std::shared_ptr<Set> indexedSet(const Value& items, bool isLeft, XQueryContext& context) const;

  const XQueryOperatorExpr& _comparison;
  const Again _again;
};

}  // namespace xquery

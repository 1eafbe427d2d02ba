#include "Plan/Paths/XQueryPositionRange.h"

#include "Expr/XQuerySequence.h"
#include "Plan/Operators/XQueryTentative.h"
#include "Types/XQueryItemKinds.h"
#include "Types/XQueryNumber.h"
#include "xquery/Number.h"

#include <algorithm>
#include <cmath>

namespace xquery {
namespace {

using Positions = XQueryPositionRange::Positions;

constexpr Positions none = {1, 0};

// The positions that stand in that order to a number.
Positions positionsBy(int type, const NSNumber& number) {
  const bool isLess = type == XQueryOperatorLess || type == XQueryOperatorLt;
  const bool isGreater = type == XQueryOperatorGreater || type == XQueryOperatorGt;
  const bool isFromBelow = isLess || type == XQueryOperatorLessEqual || type == XQueryOperatorLe;
  constexpr Positions all;
  if (number.compare(*XQueryNumber::integerWithInt64(1)) < 0) return isFromBelow ? none : all;
  // A fraction is cut off.
  const int64_t whole = number.integerValue();
  const bool isWhole = number.compare(*XQueryNumber::integerWithInt64(whole)) == 0;
  const auto bound = static_cast<uint64_t>(whole);
  if (isFromBelow) return {1, isLess && isWhole ? bound - 1 : bound};
  return {isGreater || !isWhole ? bound + 1 : bound, UINT64_MAX};
}

}  // namespace

std::optional<Positions> XQueryPositionRange::positions(XQueryContext& context) const {
  Positions all;
  for (const Comparison& each : _comparisons) {
    const XQueryOperatorExpr& expr = *each.expr;
    const Value value = XQueryValueOrNull(each.isWithRight ? *expr.right() : *expr.left(), context);
    if (!value) return std::nullopt;
    const XQueryItemList items(value.get());
    if (items.count() == 0) return none;
    if (items.count() > 1) return std::nullopt;
    const bool isNumber = (XQueryKindsOfItem(*items[0]) & XQueryItems::Numeric) != 0;
    const auto* number = isNumber ? dyn_cast<NSNumber>(items[0]) : nullptr;
    if (!number || std::isnan(number->doubleValue())) return std::nullopt;
    const Positions own = positionsBy(each.order, *number);
    all = {std::max(all.first, own.first), std::min(all.last, own.last)};
  }
  return all;
}

}  // namespace xquery

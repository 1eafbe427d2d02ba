#include "Plan/Paths/XQueryPositionRange.h"

#include "Expr/XQuerySequence.h"
#include "Plan/Operators/XQueryTentative.h"
#include "Platform/Base/WorkMeter.h"
#include "Types/XQueryItemKinds.h"
#include "Types/XQueryNumber.h"
#include "xquery/Number.h"

#include <algorithm>
#include <cmath>

namespace xquery {
namespace {

using Positions = XQueryPositionRange::Positions;

constexpr Positions none = {1, 0};

bool isEquality(int type) {
  return type == XQueryOperatorEqual || type == XQueryOperatorEq;
}

// The positions that stand in that order to a number.
Positions positionsBy(int type, const NSNumber& number) {
  const bool isLess = type == XQueryOperatorLess || type == XQueryOperatorLt;
  const bool isGreater = type == XQueryOperatorGreater || type == XQueryOperatorGt;
  const bool isFromBelow = isLess || type == XQueryOperatorLessEqual || type == XQueryOperatorLe;
  constexpr Positions all;
  if (number.compare(*XQueryNumber::integerWithInt64(1)) < 0) {
    return isFromBelow || isEquality(type) ? none : all;
  }
  // A fraction is cut off.
  const int64_t whole = number.integerValue();
  const bool isWhole = number.compare(*XQueryNumber::integerWithInt64(whole)) == 0;
  const auto bound = static_cast<uint64_t>(whole);
  if (isEquality(type)) return isWhole ? Positions{bound, bound} : none;
  if (isFromBelow) return {1, isLess && isWhole ? bound - 1 : bound};
  return {isGreater || !isWhole ? bound + 1 : bound, UINT64_MAX};
}

std::optional<Positions> positionsBy(int type, const NSObject& value) {
  const bool isNumber = (XQueryKindsOfItem(value) & XQueryItems::Numeric) != 0;
  const auto* number = isNumber ? dyn_cast<NSNumber>(&value) : nullptr;
  if (!number || std::isnan(number->doubleValue())) return std::nullopt;
  return positionsBy(type, *number);
}

// The positions that equal one of several values, which are integers that follow one another.
std::optional<Positions> positionsInRow(int type, const XQueryItemList& values) {
  if (type != XQueryOperatorEqual) return std::nullopt;
  constexpr int64_t most = int64_t{1} << 50;
  int64_t first = 0;
  WorkPacer pacer;
  for (size_t i = 0; i < values.count(); ++i) {
    pacer.turn();
    if (XQueryKindsOfItem(*values[i]) != XQueryItems::Integer) return std::nullopt;
    const auto* number = cast<NSNumber>(values[i]);
    if (i == 0) first = std::clamp(number->integerValue(), -most, most);
    if (number->doubleValue() != static_cast<double>(first + static_cast<int64_t>(i))) {
      return std::nullopt;
    }
  }
  const int64_t last = first + static_cast<int64_t>(values.count()) - 1;
  if (last < 1) return none;
  return Positions{static_cast<uint64_t>(std::max<int64_t>(first, 1)), static_cast<uint64_t>(last)};
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
    const auto own =
        items.count() == 1 ? positionsBy(each.order, *items[0]) : positionsInRow(each.order, items);
    if (!own) return std::nullopt;
    all = {std::max(all.first, own->first), std::min(all.last, own->last)};
  }
  return all;
}

}  // namespace xquery

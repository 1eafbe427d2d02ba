#include "Plan/Paths/XQueryPositionRange.h"

#include "Context/XQueryContextInternal.h"
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

bool isInequality(int type) {
  return type == XQueryOperatorNotEqual || type == XQueryOperatorNe;
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
  if (isInequality(type)) return isWhole ? Positions{1, UINT64_MAX, bound} : all;
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

// A bound of a range; nothing for what is no integer by itself.
std::optional<int64_t> boundIn(const XQueryExpr& expr, XQueryContext& context) {
  constexpr double most = 1e15;
  const Value value = XQueryValueOrNull(expr, context);
  if (!value || XQueryKindsOfItem(*value) != XQueryItems::Integer) return std::nullopt;
  const auto* number = cast<NSNumber>(value);
  if (std::fabs(number->doubleValue()) > most) return std::nullopt;
  return number->integerValue();
}

// The positions that equal one of the integers of a range, which nobody makes a list of.
std::optional<Positions> positionsBetween(const XQueryOperatorExpr& range, XQueryContext& context) {
  if (!range.left() || !range.right()) return std::nullopt;
  const auto first = boundIn(*range.left(), context);
  const auto last = first ? boundIn(*range.right(), context) : std::nullopt;
  // A list of more integers may be refused.
  constexpr int64_t mostIntegers = 1'000'000;
  if (!last || *last - *first > mostIntegers) return std::nullopt;
  if (*last < 1 || *last < *first) return none;
  return Positions{static_cast<uint64_t>(std::max<int64_t>(*first, 1)),
                   static_cast<uint64_t>(*last)};
}

}  // namespace

std::optional<Positions> XQueryPositionRange::positions(XQueryContext& context) const {
  Positions all;
  for (const Comparison& each : _comparisons) {
    const auto own = positionsIn(each, context);
    if (!own) return std::nullopt;
    if (all.hole != 0 && own->hole != 0 && all.hole != own->hole) return std::nullopt;
    all = {std::max(all.first, own->first), std::min(all.last, own->last),
           std::max(all.hole, own->hole)};
  }
  return all;
}

std::optional<Positions> XQueryPositionRange::positionsOf(size_t count,
                                                          XQueryContext& context) const {
  if (_readsSize) _internal(context).setLast(static_cast<int64_t>(count));
  return positions(context);
}

std::optional<Positions> XQueryPositionRange::positionsIn(const Comparison& comparison,
                                                          XQueryContext& context) {
  const XQueryOperatorExpr& expr = *comparison.expr;
  const XQueryExpr& operand = comparison.isWithRight ? *expr.right() : *expr.left();
  const XQueryOperatorExpr* range = XQueryOperatorExpr::rangeIn(&operand);
  if (range && comparison.order == XQueryOperatorEqual) {
    if (const auto between = positionsBetween(*range, context)) return between;
  }
  const Value value = XQueryValueOrNull(operand, context);
  if (!value) return std::nullopt;
  const XQueryItemList items(value.get());
  if (items.count() == 0) return none;
  return items.count() == 1 ? positionsBy(comparison.order, *items[0])
                            : positionsInRow(comparison.order, items);
}

}  // namespace xquery

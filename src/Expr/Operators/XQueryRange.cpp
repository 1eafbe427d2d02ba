#include "Expr/Operators/XQueryRange.h"

#include "Context/XQueryContextInternal.h"
#include "Expr/Operators/XQueryComparison.h"
#include "Expr/Operators/XQueryOperatorExpr.h"
#include "Expr/XQuerySequence.h"
#include "Platform/Base/WorkMeter.h"
#include "Types/XQueryAtomization.h"
#include "Types/XQueryErrors.h"
#include "Types/XQueryNumber.h"
#include "Types/XQueryNumericOperand.h"
#include "Types/XQueryTypeTable.h"
#include "xquery/Collection.h"
#include "xquery/Error.h"

#include <algorithm>
#include <cmath>
#include <new>
#include <optional>
#include <unistd.h>
#include <vector>

namespace xquery {
namespace {

// A range is built at once, so its size is bounded: by 2^31 items, past which a position would no
// longer fit the 32-bit lengths used elsewhere, and by a quarter of the memory that the machine
// has, since a request beyond the memory would not fail but have the process killed.
uint64_t mostRangeItems() {
  static const uint64_t most = [] {
    constexpr uint64_t positionBound = uint64_t{1} << 31;
    constexpr uint64_t bytesPerItem = sizeof(Value) + sizeof(XQueryNumber);
    const int64_t pages = sysconf(_SC_PHYS_PAGES);
    const int64_t pageSize = sysconf(_SC_PAGE_SIZE);
    if (pages <= 0 || pageSize <= 0) return positionBound;
    const uint64_t memory = static_cast<uint64_t>(pages) * static_cast<uint64_t>(pageSize);
    return std::min(positionBound, memory / 4 / bytesPerItem);
  }();
  return most;
}

[[noreturn]] void raiseRangeTooLong(XQueryContext& context, XQueryPlaceNumber at = 0) {
  XQueryContextInternal& dynamic = _internal(context);
  if (at != 0) dynamic.raise(XQueryErrors::rangeTooLong.error(), at);
  dynamic.raise(XQueryErrors::rangeTooLong.error());
}

// --- comparing with a range ----------------------------------------------------------------------

bool isWhole(int64_t) {
  return true;
}
bool isWhole(double value) {
  return value == std::trunc(value);
}

// Whether the relation holds between the value and any integer from `first` to `last`.
template <class Number>
bool holdsForRange(XQueryRelation relation, Number value, int64_t first, int64_t last) {
  const auto low = static_cast<Number>(first);
  const auto high = static_cast<Number>(last);
  switch (relation.test) {
    case XQueryRelation::Equal:
      if (relation.negated) return first != last || value != low;
      return value >= low && value <= high && isWhole(value);
    case XQueryRelation::Less:
      return relation.negated ? value >= low : value < high;
    case XQueryRelation::Greater:
      return relation.negated ? value <= high : value > low;
  }
  return false;
}

bool isComparable(const NSObject* item) {
  return item && (item->isNode() || XQueryIsAtomicType(item));
}

// Nothing for what is left to comparing with each of the integers.
std::optional<bool> holdsForItem(XQueryRelation relation, const NSObject* item, int64_t first,
                                 int64_t last) {
  const auto operand = XQueryNumericOperand::of(item);
  if (operand.form == XQueryNumericOperand::Double) {
    return !std::isnan(operand.number) && holdsForRange(relation, operand.number, first, last);
  }
  const bool isWord = operand.isInteger && operand.exact && operand.exact->isSmallInteger();
  if (!isWord) return std::nullopt;
  return holdsForRange(relation, operand.exact->smallInteger(), first, last);
}

}  // namespace

XQueryRangeBounds XQueryRangeBoundsFrom(const Value& left, const Value& right,
                                        XQueryContext& context) {
  XQueryRangeBounds bounds;
  const Value start = normalised(left);
  const Value end = normalised(right);
  if (!start || !end) return bounds;
  if (isNull(start) || isNull(end)) {
    bounds.answer = NSNull::null();
    return bounds;
  }
  const Value first = XQueryPromoteToInteger(start, context);
  const Value last = XQueryPromoteToInteger(end, context);
  const auto* firstNumber = dyn_cast<NSNumber>(first);
  const auto* lastNumber = dyn_cast<NSNumber>(last);
  if (!firstNumber || !lastNumber) return bounds;
  bounds.areIntegers = firstNumber->compare(*lastNumber) <= 0;
  if (!bounds.areIntegers) bounds.answer = XQuerySequence::sequence();
  bounds.first = firstNumber->longLongValue();
  bounds.last = lastNumber->longLongValue();
  return bounds;
}

uint64_t XQueryRangeCount(const XQueryRangeBounds& bounds, XQueryContext& context,
                          XQueryPlaceNumber at) {
  const uint64_t distance =
      static_cast<uint64_t>(bounds.last) - static_cast<uint64_t>(bounds.first);
  if (distance >= mostRangeItems()) raiseRangeTooLong(context, at);
  return distance + 1;
}

Value XQueryRangeIntegers(const XQueryRangeBounds& bounds, XQueryContext& context) {
  const uint64_t first = static_cast<uint64_t>(bounds.first);
  const uint64_t count = XQueryRangeCount(bounds, context);
  const Ref<XQuerySequence> sequence = XQuerySequence::sequence();
  try {
    std::vector<Value>& items = sequence->objects();
    items.reserve(count);
    // Counted by distance: the last integer may be the greatest there is.
    WorkPacer pacer;
    for (uint64_t offset = 0; offset < count; ++offset) {
      pacer.turn();
      items.push_back(XQueryNumber::integerWithInt64(static_cast<int64_t>(first + offset)));
    }
  } catch (const std::bad_alloc&) {
    checkWork();  // it may have been the memory ceiling
    raiseRangeTooLong(context);
  }
  return sequence;
}

Value XQueryGeneralComparisonWithRange(int type, const Value& left, int64_t first, int64_t last) {
  if (first < -XQueryExactIntegerBound || last > XQueryExactIntegerBound) return Value();
  const XQueryRelation relation =
      XQueryRelationForCode(type + XQueryOperatorEq - XQueryOperatorEqual);
  const XQueryItemList items(left.get());
  if (items.count() == 0) return left ? Value(NSNull::null()) : Value();
  // An item that cannot be atomized fails before any pair is looked at.
  WorkPacer pacer;
  for (size_t i = 0; i < items.count(); ++i) {
    pacer.turn();
    if (!isComparable(items[i])) return Value();
  }
  for (size_t i = 0; i < items.count(); ++i) {
    pacer.turn();
    const std::optional<bool> answer = holdsForItem(relation, items[i], first, last);
    if (!answer) return Value();
    if (*answer) return NSNumber::trueValue();
  }
  return NSNumber::falseValue();
}

Value XQueryOperatorExpr::rangeOperatorEvaluate(int, const Value& withLeft, const Value& right,
                                                XQueryContext& forContext) {
  const XQueryRangeBounds bounds = XQueryRangeBoundsFrom(withLeft, right, forContext);
  return bounds.areIntegers ? XQueryRangeIntegers(bounds, forContext) : bounds.answer;
}

}  // namespace xquery

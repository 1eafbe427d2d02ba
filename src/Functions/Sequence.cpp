#include "Functions/Sequence.h"

#include "Expr/XQuerySequence.h"
#include "Functions/Numeric.h"
#include "Functions/XQueryTextArgument.h"
#include "Functions/XQueryValueSet.h"
#include "Platform/Base/WorkMeter.h"
#include "Types/XQueryAtomization.h"
#include "Types/XQueryCasting.h"
#include "Types/XQueryErrors.h"
#include "Types/XQueryNumber.h"
#include "Types/XQueryString.h"
#include "Types/XQueryTypeTable.h"
#include "Types/XQueryValues.h"

#include <algorithm>
#include <cstdint>
#include <vector>

namespace xquery {
namespace {

size_t itemCount(const Value& sequence) {
  return XQueryItemList(sequence.get()).count();
}

// The sequence itself when it has an accepted number of items. Otherwise the failure is the answer;
// it is not raised here.
Value checkedCount(const Value* arguments, size_t count, size_t fewest, size_t most,
                   const XQueryErrorText<>& failure) {
  if (count != 1) return Value();
  const size_t items = itemCount(arguments[0]);
  if (items < fewest || items > most) return failure.error();
  return normalised(arguments[0]);
}

using Items = std::vector<Value>;

// Appends `count` items of the list from `first` on.
void append(const XQueryItemList& list, size_t first, size_t count, Items& items) {
  WorkPacer pacer;
  for (size_t index = first; index < first + count; ++index) {
    pacer.turn();
    items.emplace_back(list[index]);
  }
}

Value sequenceOf(Items items) {
  return NSArray::arrayWithObjects(std::move(items));
}

// Reads the whole part, saturated: NaN is 0, and an infinity the farthest position. False for the
// empty sequence, which is no position.
bool readPosition(const Value& number, int64_t& position) {
  if (isNull(number)) return false;
  position = cast<NSNumber>(number)->integerValue();
  return true;
}

bool readInteger(const Value& argument, int64_t& position, XQueryContext& context) {
  return readPosition(XQueryPromoteToInteger(argument, context), position);
}

bool readRounded(const Value& argument, int64_t& position, XQueryContext& context) {
  const Value number = XQueryPromoteToNumeric(argument, context);
  return readPosition(xqround(number, 0, false, context), position);
}

}  // namespace

Value fn_empty(const Value* arguments, size_t count, XQueryContext&) {
  return count == 1 ? Value(NSNumber::numberWithBool(itemCount(arguments[0]) == 0)) : Value();
}

Value fn_exists(const Value* arguments, size_t count, XQueryContext&) {
  return count == 1 ? Value(NSNumber::numberWithBool(itemCount(arguments[0]) > 0)) : Value();
}

Value fn_count(const Value* arguments, size_t count, XQueryContext&) {
  if (count != 1) return Value();
  return XQueryNumber::integerWithInt64(static_cast<int64_t>(itemCount(arguments[0])));
}

Value fn_zero_or_one(const Value* arguments, size_t count, XQueryContext&) {
  return checkedCount(arguments, count, 0, 1, XQueryErrors::notZeroOrOne);
}

Value fn_one_or_more(const Value* arguments, size_t count, XQueryContext&) {
  return checkedCount(arguments, count, 1, SIZE_MAX, XQueryErrors::notOneOrMore);
}

Value fn_exactly_one(const Value* arguments, size_t count, XQueryContext&) {
  return checkedCount(arguments, count, 1, 1, XQueryErrors::notExactlyOne);
}

Value fn_reverse(const Value* arguments, size_t count, XQueryContext&) {
  if (count != 1) return Value();
  const XQueryItemList list(arguments[0].get());
  if (list.count() < 2) return normalised(arguments[0]);
  Items items;
  items.reserve(list.count());
  WorkPacer pacer;
  for (size_t index = list.count(); index > 0; --index) {
    pacer.turn();
    items.emplace_back(list[index - 1]);
  }
  return sequenceOf(std::move(items));
}

Value fn_unordered(const Value* arguments, size_t count, XQueryContext&) {
  return count == 1 ? arguments[0] : Value();
}

// The value searched for is taken as it is: a node equals no atomic value.
Value fn_index_of(const Value* arguments, size_t count, XQueryContext& context) {
  if (count < 2 || count > 3) return Value();
  const Value values = XQueryAtomization(arguments[0], context);
  XQueryCheckCollation(arguments, count, 2, context);
  const XQueryItemList items(values.get());
  const NSObject& wanted = *arguments[1];
  Items positions;
  WorkPacer pacer;
  for (size_t index = 0; index < items.count(); ++index) {
    pacer.turn();
    if (!XQueryObjectsEqual(*items[index], wanted)) continue;
    positions.push_back(XQueryNumber::integerWithInt64(static_cast<int64_t>(index + 1)));
  }
  return normalised(sequenceOf(std::move(positions)));
}

// The first of each value, in input order. An untyped item becomes a string.
Value fn_distinct_values(const Value* arguments, size_t count, XQueryContext& context) {
  if (count < 1 || count > 2) return Value();
  XQueryCheckCollation(arguments, count, 1, context);
  const Value values = XQueryAtomization(arguments[0], context);
  const XQueryItemList items(values.get());
  XQueryValueSet met;
  Items kept;
  for (size_t index = 0; index < items.count(); ++index) {
    checkWork();
    NSObject* item = items[index];
    // The text of an untyped item is the string's, so a repeated one needs no cast.
    if (!met.insert(*item)) continue;
    kept.push_back(XQueryObjectTypeID(item) == XQueryTypeUntypedAtomic
                       ? Value(XQueryString::stringWithString(*cast<NSString>(item)))
                       : Value(item));
  }
  return normalised(sequenceOf(std::move(kept)));
}

Value fn_insert_before(const Value* arguments, size_t count, XQueryContext& context) {
  int64_t position = 0;
  if (count != 3 || !readInteger(arguments[1], position, context)) return Value();
  const XQueryItemList target(arguments[0].get());
  const XQueryItemList inserted(arguments[2].get());
  const auto end = static_cast<int64_t>(target.count()) + 1;
  const auto before = static_cast<size_t>(std::clamp<int64_t>(position, 1, end) - 1);
  Items items;
  items.reserve(target.count() + inserted.count());
  append(target, 0, before, items);
  append(inserted, 0, inserted.count(), items);
  append(target, before, target.count() - before, items);
  return normalised(sequenceOf(std::move(items)));
}

// Answers a sequence whatever is left, be it one item or none.
Value fn_remove(const Value* arguments, size_t count, XQueryContext& context) {
  int64_t position = 0;
  if (count != 2 || !readInteger(arguments[1], position, context)) return Value();
  const XQueryItemList target(arguments[0].get());
  const size_t length = target.count();
  const bool isInside = position >= 1 && static_cast<uint64_t>(position) <= length;
  const size_t before = isInside ? static_cast<size_t>(position) - 1 : length;
  Items items;
  items.reserve(length);
  append(target, 0, before, items);
  if (isInside) append(target, before + 1, length - before - 1, items);
  return sequenceOf(std::move(items));
}

// A start below 1 counts as 1 and takes nothing off the length.
Value fn_subsequence(const Value* arguments, size_t count, XQueryContext& context) {
  if (count < 2 || count > 3) return Value();
  const XQueryItemList items(arguments[0].get());
  const auto available = static_cast<int64_t>(items.count());
  int64_t start = 0;
  int64_t length = available;
  if (!readRounded(arguments[1], start, context)) return Value();
  if (count == 3 && !readRounded(arguments[2], length, context)) return Value();
  const int64_t first = std::max<int64_t>(start, 1) - 1;
  if (length < 1 || first >= available) return NSNull::null();
  const int64_t taken = std::min(length, available - first);
  if (taken == available) return normalised(arguments[0]);
  Items chosen;
  chosen.reserve(static_cast<size_t>(taken));
  append(items, static_cast<size_t>(first), static_cast<size_t>(taken), chosen);
  return normalised(sequenceOf(std::move(chosen)));
}

}  // namespace xquery

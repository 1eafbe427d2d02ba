#include "Functions/Sequence.h"

#include "Expr/XQueryListChanges.h"
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
#include <utility>
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

// Appends `count` items of the value from `first` on.
void append(const Value& list, size_t first, size_t count, Items& items) {
  if (const auto* array = dyn_cast<NSArray>(list)) {
    XQueryAppendItems(array->objects(), first, count, items);
  } else if (count > 0) {
    items.push_back(list);
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

// --- functions whose answer consists of the items of a list -----------------------------------

Value reversed(Value sequence) {
  const XQueryItemList list(sequence.get());
  if (list.count() < 2) return normalised(std::move(sequence));
  if (NSArray* own = XQueryOwnArray(sequence)) {
    checkWork(list.count() / WorkPacer::turnsPerStep);
    std::reverse(own->objects().begin(), own->objects().end());
    return sequence;
  }
  Items items;
  items.reserve(list.count());
  WorkPacer pacer;
  for (size_t index = list.count(); index > 0; --index) {
    pacer.turn();
    items.emplace_back(list[index - 1]);
  }
  return sequenceOf(std::move(items));
}

Value withInserted(Value target, size_t before, const Value& inserted) {
  NSArray* own = XQueryOwnArray(target);
  const size_t count = itemCount(target);
  const size_t insertedCount = itemCount(inserted);
  Items items;
  items.reserve(insertedCount + (own ? 0 : count));
  // What is known to be flat stays so.
  if (own && (own->kind() != Kind::Sequence || inserted->kind() != Kind::Array)) {
    append(inserted, 0, insertedCount, items);
    XQueryInsertItems(own->objects(), before, std::move(items));
    return normalised(std::move(target));
  }
  append(target, 0, before, items);
  append(inserted, 0, insertedCount, items);
  append(target, before, count - before, items);
  return normalised(sequenceOf(std::move(items)));
}

Value without(Value target, size_t first, size_t count) {
  if (NSArray* own = XQueryOwnArray(target)) {
    XQueryEraseItems(own->objects(), first, count);
    return target;
  }
  const size_t behind = itemCount(target) - first - count;
  Items items;
  items.reserve(first + behind);
  append(target, 0, first, items);
  append(target, first + count, behind, items);
  return sequenceOf(std::move(items));
}

Value part(Value of, size_t first, size_t count) {
  if (NSArray* own = XQueryOwnArray(of)) {
    XQueryEraseItems(own->objects(), first + count, own->count() - first - count);
    XQueryEraseItems(own->objects(), 0, first);
    return normalised(std::move(of));
  }
  Items chosen;
  chosen.reserve(count);
  append(of, first, count, chosen);
  return normalised(sequenceOf(std::move(chosen)));
}

// An argument, to be looked at or, of a call that needs its arguments no longer, taken.
Value handedOver(const Value& argument) {
  return argument;
}
Value handedOver(Value& argument) {
  return std::move(argument);
}

template <class Argument>
Value answerInserting(Argument* arguments, size_t count, XQueryContext& context) {
  int64_t position = 0;
  if (count != 3 || !readInteger(arguments[1], position, context)) return Value();
  const auto end = static_cast<int64_t>(itemCount(arguments[0])) + 1;
  const auto before = static_cast<size_t>(std::clamp<int64_t>(position, 1, end) - 1);
  return withInserted(handedOver(arguments[0]), before, arguments[2]);
}

// Answers a sequence whatever is left, be it one item or none.
template <class Argument>
Value answerRemoving(Argument* arguments, size_t count, XQueryContext& context) {
  int64_t position = 0;
  if (count != 2 || !readInteger(arguments[1], position, context)) return Value();
  const size_t length = itemCount(arguments[0]);
  const bool isInside = position >= 1 && static_cast<uint64_t>(position) <= length;
  const size_t first = isInside ? static_cast<size_t>(position) - 1 : length;
  return without(handedOver(arguments[0]), first, isInside ? 1 : 0);
}

// A start below 1 counts as 1 and takes nothing off the length.
template <class Argument>
Value answerSubsequence(Argument* arguments, size_t count, XQueryContext& context) {
  if (count < 2 || count > 3) return Value();
  const auto available = static_cast<int64_t>(itemCount(arguments[0]));
  int64_t start = 0;
  int64_t length = available;
  if (!readRounded(arguments[1], start, context)) return Value();
  if (count == 3 && !readRounded(arguments[2], length, context)) return Value();
  const int64_t first = std::max<int64_t>(start, 1) - 1;
  if (length < 1 || first >= available) return NSNull::null();
  const int64_t taken = std::min(length, available - first);
  if (taken == available) return normalised(handedOver(arguments[0]));
  return part(handedOver(arguments[0]), static_cast<size_t>(first), static_cast<size_t>(taken));
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
  return count == 1 ? reversed(arguments[0]) : Value();
}

Value XQueryReverseOwn(Value* arguments, size_t count, XQueryContext&) {
  return count == 1 ? reversed(std::move(arguments[0])) : Value();
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
  return answerInserting(arguments, count, context);
}

Value XQueryInsertIntoOwn(Value* arguments, size_t count, XQueryContext& context) {
  return answerInserting(arguments, count, context);
}

Value fn_remove(const Value* arguments, size_t count, XQueryContext& context) {
  return answerRemoving(arguments, count, context);
}

Value XQueryRemoveFromOwn(Value* arguments, size_t count, XQueryContext& context) {
  return answerRemoving(arguments, count, context);
}

Value fn_subsequence(const Value* arguments, size_t count, XQueryContext& context) {
  return answerSubsequence(arguments, count, context);
}

Value XQuerySubsequenceOfOwn(Value* arguments, size_t count, XQueryContext& context) {
  return answerSubsequence(arguments, count, context);
}

}  // namespace xquery

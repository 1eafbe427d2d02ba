#include "Functions/FunctionsSequence.h"

#include "Expr/XQuerySequence.h"
#include "Functions/XQueryValueSet.h"
#include "Platform/WorkMeter.h"
#include "Types/XQueryAtomization.h"
#include "Types/XQueryCasting.h"
#include "Types/XQueryErrors.h"
#include "Types/XQueryNumber.h"
#include "Types/XQueryTypeTable.h"

#include <cstdint>

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

// The first of each value, in input order. An untyped item becomes a string. The collation is
// promoted, so that a wrong one is an error, and has no other effect.
Value fn_distinct_values(const Value* arguments, size_t count, XQueryContext& context) {
  if (count < 1 || count > 2) return Value();
  if (count == 2) XQueryPromoteToString(arguments[1], context);
  const Value values = XQueryAtomization(arguments[0], context);
  const XQueryItemList items(values.get());
  XQueryValueSet met;
  XQueryGatherer kept;
  for (size_t index = 0; index < items.count(); ++index) {
    checkWork();
    NSObject* item = items[index];
    // The text of an untyped item is the string's, so a repeated one needs no cast.
    if (!met.insert(*item)) continue;
    kept.add(XQueryObjectTypeID(item) == XQueryTypeUntypedAtomic
                 ? XQueryCastAsTypeForContext(item, XQueryTypeString, context)
                 : Value(item));
  }
  return kept.value();
}

}  // namespace xquery

// Functions that compute one value from a sequence.
//
// Untyped items are doubles. What is added or compared is what the operators add and compare, and
// their errors apply; a NaN among the items is the answer at once.
#pragma once

#include "xquery/Object.h"

#include <cstddef>

namespace xquery {

class XQueryContext;

Value fn_sum(const Value* arguments, size_t count, XQueryContext& context);
Value fn_avg(const Value* arguments, size_t count, XQueryContext& context);
Value fn_max(const Value* arguments, size_t count, XQueryContext& context);
Value fn_min(const Value* arguments, size_t count, XQueryContext& context);

// The sum of one item or more; null where there is none.
Value XQuerySumOf(const Value& sequence, XQueryContext& context);
// The average of so many items, whose sum that is.
Value XQueryAverageOf(Value sum, size_t items, XQueryContext& context);

// The answers for one item or more without shortcuts: they are the definition.
Value XQuerySumPlainly(const Value& sequence, XQueryContext& context);
// `comparison` is the value comparison by which an item takes the place of the best one so far.
Value XQueryExtremePlainly(const Value& sequence, int comparison, XQueryContext& context);

// The same answers where every item is an xs:integer, an xs:decimal, an xs:double or untyped, with
// no object made per item; null where the shortcut does not apply or an item is NaN.
Value XQuerySumShortcut(const Value& sequence);
Value XQueryExtremeShortcut(const Value& sequence, int comparison);

}  // namespace xquery

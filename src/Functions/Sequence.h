// Functions over sequences of any items.
#pragma once

#include "xquery/Object.h"

#include <cstddef>

namespace xquery {

class XQueryContext;

Value fn_empty(const Value* arguments, size_t count, XQueryContext& context);
Value fn_exists(const Value* arguments, size_t count, XQueryContext& context);
Value fn_count(const Value* arguments, size_t count, XQueryContext& context);
Value fn_zero_or_one(const Value* arguments, size_t count, XQueryContext& context);
Value fn_one_or_more(const Value* arguments, size_t count, XQueryContext& context);
Value fn_exactly_one(const Value* arguments, size_t count, XQueryContext& context);
Value fn_reverse(const Value* arguments, size_t count, XQueryContext& context);
Value fn_unordered(const Value* arguments, size_t count, XQueryContext& context);
Value fn_index_of(const Value* arguments, size_t count, XQueryContext& context);
Value fn_distinct_values(const Value* arguments, size_t count, XQueryContext& context);
Value fn_insert_before(const Value* arguments, size_t count, XQueryContext& context);
Value fn_remove(const Value* arguments, size_t count, XQueryContext& context);
Value fn_subsequence(const Value* arguments, size_t count, XQueryContext& context);

// The same for arguments of a call that are no longer needed: a list that nobody else holds becomes
// the answer.
Value XQueryReverseOwn(Value* arguments, size_t count, XQueryContext& context);
Value XQueryInsertIntoOwn(Value* arguments, size_t count, XQueryContext& context);
Value XQueryRemoveFromOwn(Value* arguments, size_t count, XQueryContext& context);
Value XQuerySubsequenceOfOwn(Value* arguments, size_t count, XQueryContext& context);

}  // namespace xquery

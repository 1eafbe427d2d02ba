// Functions that rewrite a string character by character. The rules of FunctionsString.h hold.
#pragma once

#include "xquery/Object.h"

#include <cstddef>

namespace xquery {

class XQueryContext;

Value fn_normalize_space(const Value* arguments, size_t count, XQueryContext& context);
// Answers an error record, which it does not raise, for a form other than NFC, NFD, NFKC, NFKD and
// the empty string, which leaves the string as it is.
Value fn_normalize_unicode(const Value* arguments, size_t count, XQueryContext& context);
Value fn_upper_case(const Value* arguments, size_t count, XQueryContext& context);
Value fn_lower_case(const Value* arguments, size_t count, XQueryContext& context);
// Unit by unit: the two halves of a surrogate pair are mapped on their own.
Value fn_translate(const Value* arguments, size_t count, XQueryContext& context);
// Null, besides for a wrong number of arguments, when the string has a lone surrogate, which has no
// form in UTF-8.
Value fn_escape_uri(const Value* arguments, size_t count, XQueryContext& context);

}  // namespace xquery

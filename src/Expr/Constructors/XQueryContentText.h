// Values as the text of constructed nodes.
#pragma once

#include "xquery/Object.h"
#include "xquery/String.h"

#include <cstddef>

namespace xquery {

class XQueryContext;

// The length that a value not known yet is expected to have as text: a few digits.
inline constexpr size_t XQueryExpectedTextLength = 8;

// Appends an atomic value, cast to a string.
void XQueryAppendAtomic(const Value& item, NSMutableString& text, XQueryContext& context);

// Atomizes the value and appends its items, cast to strings and joined with single spaces. Answer:
// whether there was any item.
bool XQueryAppendText(const Value& value, NSMutableString& text, XQueryContext& context);

}  // namespace xquery

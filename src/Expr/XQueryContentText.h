// Values as the text of constructed nodes.
#pragma once

#include "xquery/Object.h"
#include "xquery/String.h"

namespace xquery {

class XQueryContext;

// Appends an atomic value, cast to a string.
void XQueryAppendAtomic(const Value& item, NSMutableString& text, XQueryContext& context);

// Atomizes the value and appends its items, cast to strings and joined with single spaces. Answer:
// whether there was any item.
bool XQueryAppendText(const Value& value, NSMutableString& text, XQueryContext& context);

}  // namespace xquery

// White space in text: tab, line feed, carriage return and space.
#pragma once

#include "xquery/String.h"

namespace xquery {

// Without the white space at both ends; the very same string when there is none.
Ref<NSString> XQueryStringTrimWS(const Ref<NSString>& string);
Ref<NSString> XQueryStringTrimLeadingWS(const Ref<NSString>& string);
// Trimmed, and each inner run of white space made one space; the very same string when it holds no
// white space at all.
Ref<NSString> XQueryNormalizeString(const Ref<NSString>& string);
// Replaces every tab, line feed and carriage return by a space, in place.
void XQueryNormalizeAttributeString(NSMutableString& string);

}  // namespace xquery

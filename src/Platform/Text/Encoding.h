// Text in encodings other than UTF-8: a seam to ICU.
#pragma once

#include "xquery/String.h"

#include <optional>
#include <string>
#include <string_view>

namespace xquery {

// The text that the bytes are in the encoding of that name; U+FFFD for bytes that are none. Null
// when there is no such encoding.
Ref<NSString> stringWithBytes(std::string_view bytes, const std::string& encoding);

// The same by IANA's names of charsets (case, "-" and "_" are not looked at), and strictly. Null
// for a name that IANA does not know and for bytes that are no text in the charset.
Ref<NSString> stringWithBytesInCharset(std::string_view bytes, const std::string& IANAName);
// Nothing for a name that IANA does not know and for text that the charset does not have. In UTF-8
// a lone surrogate becomes U+FFFD.
std::optional<std::string> bytesInCharset(NSStringView text, const std::string& IANAName);

}  // namespace xquery

// Text in encodings other than UTF-8: a seam to ICU.
#pragma once

#include "xquery/String.h"

#include <string>
#include <string_view>

namespace xquery {

// The text that the bytes are in the encoding of that name; U+FFFD for bytes that are none. Null
// when there is no such encoding.
Ref<NSString> stringWithBytes(std::string_view bytes, const std::string& encoding);

}  // namespace xquery

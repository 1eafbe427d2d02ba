// Text as JSON (RFC 8259).
#pragma once

#include <string>
#include <string_view>

namespace cli {

// In quotes. Bytes that are no UTF-8, as names of files may hold them, become U+FFFD.
std::string jsonString(std::string_view text);

// Whether the text is a number there.
bool isJSONNumber(std::string_view text);

}  // namespace cli

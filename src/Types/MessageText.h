// Puts the text of a message or a description together from literals, strings and numbers.
#pragma once

#include "xquery/String.h"

#include <cstdint>
#include <string>
#include <string_view>

namespace xquery {

// UTF-8; a byte that starts no well-formed sequence becomes U+FFFD.
inline void appendMessagePart(NSMutableString& out, std::string_view text) {
  out.append(NSString::stringWithUTF8Replacing(text)->view());
}
inline void appendMessagePart(NSMutableString& out, const Ref<NSString>& text) {
  if (text) {
    out.append(text->view());
  } else {
    out.appendASCII("(null)");
  }
}
inline void appendMessagePart(NSMutableString& out, int64_t number) {
  out.appendASCII(std::to_string(number));
}

template <class... Parts>
Ref<NSString> messageText(const Parts&... parts) {
  NSMutableString out;
  (appendMessagePart(out, parts), ...);
  return out.string();
}

// The text with each "%@" replaced by the next part; it has as many as there are parts.
template <class... Parts>
Ref<NSString> filledText(std::string_view text, const Parts&... parts) {
  NSMutableString out;
  [[maybe_unused]] const auto fill = [&](const auto& part) {
    const size_t place = text.find("%@");
    out.appendASCII(text.substr(0, place));
    appendMessagePart(out, part);
    text.remove_prefix(place + 2);
  };
  (fill(parts), ...);
  out.appendASCII(text);
  return out.string();
}

}  // namespace xquery

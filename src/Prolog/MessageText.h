// Puts the text of a message or a description together from literals, strings and numbers.
#pragma once

#include "xquery/String.h"

#include <cstdint>
#include <string>
#include <string_view>

namespace xquery {

inline void appendMessagePart(NSMutableString& out, std::string_view ascii) {
  out.appendASCII(ascii);
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

}  // namespace xquery

// Text between the host and the library.
#pragma once

#include "xquery/capi/basics.h"
#include "xquery/String.h"

#include <string>
#include <string_view>

namespace xquery::capi {

// A text that the host gives, borrowed.
class GivenText {
 public:
  GivenText(const char* text, size_t length);

  // Whether pointer and length go together.
  bool isGood() const { return _isGood; }
  // Whether it may be the name of a file besides.
  bool isPath() const { return _isGood && _text.find('\0') == std::string_view::npos; }
  std::string_view view() const { return _text; }
  // Null where it is not UTF-8.
  Ref<NSString> string() const { return NSString::stringWithUTF8(_text); }

 private:
  std::string_view _text;
  bool _isGood = true;
};

// Empties a text of the host's; false where there is none.
bool emptied(xq_text* text);
// Throws std::bad_alloc.
xq_status fill(xq_text& text, std::string_view utf8);
xq_status fill(xq_text& text, NSStringView string);
// XQ_END for a null string.
xq_status fill(xq_text& text, const Ref<NSString>& string);

inline xq_string borrowed(const std::string& text) {
  return {text.c_str(), text.size()};
}

}  // namespace xquery::capi

#include "Types/XQueryStringFunctions.h"

#include "Platform/Text/Blocks.h"
#include "Types/NameCharacters.h"

#include <algorithm>
#include <string>

namespace xquery {

namespace {

uint32_t leadingWhiteSpace(NSStringView text) {
  uint32_t count = 0;
  WorkPacer pacer;
  for (; count < text.length() && XQueryIsWhiteSpace(text[count]); ++count) pacer.turn();
  return count;
}

template <class Unit>
bool hasWhiteSpace(std::basic_string_view<Unit> text) {
  bool found = false;
  inBlocks(text, [&](std::basic_string_view<Unit> block) {
    found = found || std::any_of(block.begin(), block.end(), XQueryIsWhiteSpace);
  });
  return found;
}

// Without white space at the ends, each inner run of it one space.
template <class Unit>
std::basic_string<Unit> collapsed(std::basic_string_view<Unit> text) {
  std::basic_string<Unit> out;
  out.reserve(text.size());
  bool afterSpace = true;
  inBlocks(text, [&](std::basic_string_view<Unit> block) {
    for (const Unit unit : block) {
      const bool space = XQueryIsWhiteSpace(unit);
      if (!space) {
        out += unit;
      } else if (!afterSpace) {
        out += static_cast<Unit>(' ');
      }
      afterSpace = space;
    }
  });
  if (afterSpace && !out.empty()) out.pop_back();
  return out;
}

}  // namespace

Ref<NSString> XQueryStringTrimWS(const Ref<NSString>& string) {
  const NSStringView text = string->view();
  const uint32_t from = leadingWhiteSpace(text);
  uint32_t end = text.length();
  WorkPacer pacer;
  for (; end > from && XQueryIsWhiteSpace(text[end - 1]); --end) pacer.turn();
  if (end - from == text.length()) return string;
  return NSString::stringWithView(text.substring(from, end - from));
}

Ref<NSString> XQueryStringTrimLeadingWS(const Ref<NSString>& string) {
  const NSStringView text = string->view();
  const uint32_t from = leadingWhiteSpace(text);
  return from == 0 ? string : NSString::stringWithView(text.substring(from));
}

Ref<NSString> XQueryNormalizeString(const Ref<NSString>& string) {
  const NSStringView text = string->view();
  if (!withUnitsOf(text, [](auto units) { return hasWhiteSpace(units); })) return string;
  return withUnitsOf(text,
                     [](auto units) { return NSString::stringWithView(viewOf(collapsed(units))); });
}

void XQueryNormalizeAttributeString(NSMutableString& string) {
  const NSStringView text = string.view();
  NSMutableString normalized;
  uint32_t from = 0;
  WorkPacer pacer;
  for (uint32_t index = 0; index < text.length(); ++index) {
    pacer.turn();
    if (text[index] == u' ' || !XQueryIsWhiteSpace(text[index])) continue;
    normalized.append(text.substring(from, index - from));
    normalized.append(u' ');
    from = index + 1;
  }
  if (from == 0) return;
  normalized.append(text.substring(from));
  string = std::move(normalized);
}

}  // namespace xquery

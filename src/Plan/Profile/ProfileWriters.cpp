// What the three forms have in common: how texts are made harmless.
#include "Plan/Profile/ProfileWriters.h"

#include "xquery/String.h"

#include <algorithm>
#include <cstdio>

namespace xquery {
namespace {

struct Range {
  char16_t first, last;
};

// Control characters, what turns the direction of text, and the ends of lines that only scripts
// know.
constexpr Range hidden[] = {{0x00, 0x1F},     {0x7F, 0x9F},     {0x061C, 0x061C}, {0x200E, 0x200F},
                            {0x2028, 0x202E}, {0x2066, 0x2069}, {0xFEFF, 0xFEFF}};

bool isHidden(char16_t unit) {
  return std::any_of(std::begin(hidden), std::end(hidden), [unit](const Range& range) {
    return range.first <= unit && unit <= range.last;
  });
}

std::string escape(char16_t unit) {
  char text[8];
  std::snprintf(text, sizeof text, "\\u%04X", static_cast<unsigned>(unit));
  return text;
}

Ref<NSString> decoded(std::string_view text) {
  if (Ref<NSString> whole = NSString::stringWithUTF8(text)) return whole;
  std::string replaced;
  for (const char byte : text) {
    const bool isASCII = static_cast<unsigned char>(byte) < 0x80;
    replaced += isASCII ? std::string(1, byte) : "\uFFFD";
  }
  return NSString::stringWithUTF8(replaced);
}

// `escaped` says of a unit what is written for it; nothing for the unit itself.
template <class Escaped>
std::string rewritten(std::string_view text, const Escaped& escaped) {
  const Ref<NSString> units = decoded(text);
  const NSStringView view = units->view();
  std::string result;
  uint32_t start = 0;
  for (uint32_t i = 0; i < view.length(); ++i) {
    const std::string instead = escaped(view[i]);
    if (instead.empty()) continue;
    result += view.substring(start, i - start).utf8() + instead;
    start = i + 1;
  }
  return result + view.substring(start, view.length() - start).utf8();
}

}  // namespace

std::string XQueryVisibleText(std::string_view text) {
  return rewritten(text,
                   [](char16_t unit) { return isHidden(unit) ? escape(unit) : std::string(); });
}

std::string XQueryProfileJSONString(std::string_view text) {
  return "\"" +
         rewritten(text,
                   [](char16_t unit) -> std::string {
                     if (unit == u'"') return "\\\"";
                     if (unit == u'\\') return "\\\\";
                     const bool isMarkup = unit == u'<' || unit == u'>' || unit == u'&';
                     return isMarkup || isHidden(unit) ? escape(unit) : std::string();
                   }) +
         "\"";
}

std::string XQueryEscapedHTML(std::string_view visible) {
  std::string html;
  for (const char each : visible) {
    switch (each) {
      case '<':
        html += "&lt;";
        break;
      case '>':
        html += "&gt;";
        break;
      case '&':
        html += "&amp;";
        break;
      case '"':
        html += "&quot;";
        break;
      default:
        html += each;
    }
  }
  return html;
}

}  // namespace xquery

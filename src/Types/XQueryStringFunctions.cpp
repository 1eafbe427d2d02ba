#include "Types/XQueryStringFunctions.h"

#include "Types/NameCharacters.h"

namespace xquery {

namespace {

uint32_t leadingWhiteSpace(NSStringView text) {
  uint32_t count = 0;
  while (count < text.length() && XQueryIsWhiteSpace(text[count])) ++count;
  return count;
}

// The first position at or after `from` that holds (or does not hold) white space, or the end.
uint32_t nextWhiteSpace(NSStringView text, uint32_t from, bool whiteSpace) {
  while (from < text.length() && XQueryIsWhiteSpace(text[from]) != whiteSpace) ++from;
  return from;
}

}  // namespace

Ref<NSString> XQueryStringTrimWS(const Ref<NSString>& string) {
  const NSStringView text = string->view();
  const uint32_t from = leadingWhiteSpace(text);
  uint32_t end = text.length();
  while (end > from && XQueryIsWhiteSpace(text[end - 1])) --end;
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
  uint32_t end = nextWhiteSpace(text, 0, true);
  if (end == text.length()) return string;
  NSMutableString normalized;
  uint32_t from = 0;
  while (from < text.length()) {
    if (end > from) {
      if (normalized.length() > 0) normalized.append(u' ');
      normalized.append(text.substring(from, end - from));
    }
    from = nextWhiteSpace(text, end, false);
    end = nextWhiteSpace(text, from, true);
  }
  return normalized.string();
}

void XQueryNormalizeAttributeString(NSMutableString& string) {
  const NSStringView text = string.view();
  NSMutableString normalized;
  uint32_t from = 0;
  for (uint32_t index = 0; index < text.length(); ++index) {
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

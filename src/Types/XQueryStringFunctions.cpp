#include "Types/XQueryStringFunctions.h"

#include "Platform/WorkMeter.h"
#include "Types/NameCharacters.h"

namespace xquery {

namespace {

// After so many units were looked at: only long stretches are work of their own.
void checkUnits(uint32_t count) {
  constexpr uint32_t unitsPerStep = 4096;
  if (count >= unitsPerStep) checkWork(count / unitsPerStep);
}

uint32_t leadingWhiteSpace(NSStringView text) {
  uint32_t count = 0;
  while (count < text.length() && XQueryIsWhiteSpace(text[count])) ++count;
  checkUnits(count);
  return count;
}

// The first position at or after `from` that holds (or does not hold) white space, or the end.
uint32_t nextWhiteSpace(NSStringView text, uint32_t from, bool whiteSpace) {
  const uint32_t start = from;
  while (from < text.length() && XQueryIsWhiteSpace(text[from]) != whiteSpace) ++from;
  checkUnits(from - start);
  return from;
}

}  // namespace

Ref<NSString> XQueryStringTrimWS(const Ref<NSString>& string) {
  const NSStringView text = string->view();
  const uint32_t from = leadingWhiteSpace(text);
  uint32_t end = text.length();
  while (end > from && XQueryIsWhiteSpace(text[end - 1])) --end;
  checkUnits(text.length() - end);
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

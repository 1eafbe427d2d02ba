#include "Platform/Base/XQueryPlaces.h"

#include <algorithm>
#include <limits>

namespace xquery {
namespace {

constexpr char16_t byteOrderMark = 0xFEFF;

bool isLeadSurrogate(char16_t unit) {
  return (unit & 0xFC00) == 0xD800;
}

bool isTrailSurrogate(char16_t unit) {
  return (unit & 0xFC00) == 0xDC00;
}

// Units of the character there.
uint32_t characterLength(NSStringView text, uint32_t at) {
  if (at + 1 >= text.length()) return 1;
  const char16_t unit = text[at], next = text[at + 1];
  return (unit == u'\r' && next == u'\n') || (isLeadSurrogate(unit) && isTrailSurrogate(next)) ? 2
                                                                                               : 1;
}

bool endsLine(char16_t unit) {
  return unit == u'\n' || unit == u'\r';
}

// The line from that unit on, up to its end.
Ref<NSString> lineFrom(NSStringView text, uint32_t start) {
  uint32_t end = start;
  while (end < text.length() && !endsLine(text[end])) ++end;
  return NSString::stringWithView(text.substring(start, end - start));
}

}  // namespace

Ref<XQueryPlaces> XQueryPlaces::places() {
  return make<XQueryPlaces>();
}

void XQueryPlaces::beginModule(Ref<NSString> text, Ref<NSString> URL) {
  const auto first = static_cast<XQueryPlaceNumber>(_spans.size() + 1);
  _modules.push_back({first, std::move(text), std::move(URL)});
}

// What no number is left for has no place.
XQueryPlaceNumber XQueryPlaces::add(XQuerySpan span) {
  if (_spans.size() == std::numeric_limits<XQueryPlaceNumber>::max()) return 0;
  _spans.push_back(span);
  return static_cast<XQueryPlaceNumber>(_spans.size());
}

XQuerySpan XQueryPlaces::span(XQueryPlaceNumber place) const {
  return place == 0 || place > _spans.size() ? XQuerySpan() : _spans[place - 1];
}

std::optional<XQuerySourcePlace> XQueryPlaces::place(XQueryPlaceNumber place) const {
  if (place == 0 || place > _spans.size()) return std::nullopt;
  const auto after = std::upper_bound(
      _modules.begin(), _modules.end(), place,
      [](XQueryPlaceNumber number, const Module& row) { return number < row.first; });
  if (after == _modules.begin()) return std::nullopt;
  const Module& module = *(after - 1);
  const XQuerySpan span = _spans[place - 1];
  XQuerySourcePlace result{module.URL, 1, 1, static_cast<int64_t>(span.end) - span.start, nullptr};
  const NSStringView text = module.text->view();
  uint32_t at = text.length() > 0 && text[0] == byteOrderMark ? 1 : 0;
  uint32_t lineStart = at;
  for (uint32_t count = 0; count < span.start && at < text.length(); ++count) {
    const bool isLineEnd = endsLine(text[at]);
    at += characterLength(text, at);
    ++result.column;
    if (!isLineEnd) continue;
    ++result.line;
    result.column = 1;
    lineStart = at;
  }
  result.sourceLine = lineFrom(text, lineStart);
  return result;
}

}  // namespace xquery

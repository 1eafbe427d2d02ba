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

const XQueryPlaces::Module* XQueryPlaces::moduleOf(XQueryPlaceNumber place) const {
  if (place == 0 || place > _spans.size()) return nullptr;
  const auto after = std::upper_bound(
      _modules.begin(), _modules.end(), place,
      [](XQueryPlaceNumber number, const Module& row) { return number < row.first; });
  return after == _modules.begin() ? nullptr : &*(after - 1);
}

std::optional<XQuerySourcePlace> XQueryPlaces::place(XQueryPlaceNumber place) const {
  XQueryPlaceCursor cursor(*this);
  if (!cursor.goTo(place)) return std::nullopt;
  const XQuerySpan at = span(place);
  return XQuerySourcePlace{moduleOf(place)->URL, cursor.line(), cursor.column(),
                           static_cast<int64_t>(at.end) - at.start, cursor.sourceLine()};
}

// --- the cursor ----------------------------------------------------------------------------------

bool XQueryPlaceCursor::goTo(XQueryPlaceNumber place) {
  const XQueryPlaces::Module* const module = _places.moduleOf(place);
  if (!module) return false;
  const uint32_t start = _places.span(place).start;
  const NSStringView text = module->text->view();
  if (module != _module || start < _characters) {
    _module = module;
    _characters = 0;
    _at = _lineStart = text.length() > 0 && text[0] == byteOrderMark ? 1 : 0;
    _line = _column = 1;
  }
  for (; _characters < start && _at < text.length(); ++_characters) {
    const bool isLineEnd = endsLine(text[_at]);
    _at += characterLength(text, _at);
    ++_column;
    if (!isLineEnd) continue;
    ++_line;
    _column = 1;
    _lineStart = _at;
  }
  return true;
}

Ref<NSString> XQueryPlaceCursor::sourceLine() const {
  return lineFrom(_module->text->view(), _lineStart);
}

}  // namespace xquery

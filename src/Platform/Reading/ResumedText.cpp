#include "Platform/Reading/ResumedText.h"

#include <algorithm>
#include <cstring>

namespace xquery {

namespace {

// libxml2 counts lines and columns in 32 bits.
constexpr int64_t mostFilled = int64_t{1} << 30;

std::string valueOf(NSStringView text) {
  std::string value;
  for (const char byte : text.utf8()) {
    switch (byte) {
      case '&':
        value += "&amp;";
        break;
      case '<':
        value += "&lt;";
        break;
      case '"':
        value += "&quot;";
        break;
      case '\t':
      case '\n':
      case '\r':
        value += "&#" + std::to_string(static_cast<int>(byte)) + ";";
        break;
      default:
        value += byte;
    }
  }
  return value;
}

}  // namespace

void ResumedText::add(std::string_view text) {
  if (text.empty()) return;
  _parts.push_back({.text = std::string(text), .count = text.size()});
  _place.pass(text);
}

uint64_t ResumedText::fill(char filler, int64_t count) {
  if (count <= 0) return 0;
  const auto filled = static_cast<uint64_t>(std::min(count, mostFilled));
  _parts.push_back({.text = {}, .filler = filler, .count = filled});
  return filled;
}

void ResumedText::addTag(const NSXMLElement& element, int64_t line) {
  static_cast<void>(moveTo({line, 1}));
  std::string tag = "<" + element.nameView().utf8();
  for (const NSXMLNode* each = element.firstNamespace(); each;
       each = NSXMLElement::nextNamespace(each)) {
    const std::string prefix = each->nameView().utf8();
    tag +=
        (prefix.empty() ? " xmlns" : " xmlns:" + prefix) + "=\"" + valueOf(each->textView()) + "\"";
  }
  add(tag + ">");
}

uint64_t ResumedText::moveTo(const TextPlace& place) {
  uint64_t filled = 0;
  if (place.line > _place.line) {
    filled += fill('\n', place.line - _place.line);
    _place = {place.line, 1};
  }
  if (place.column > _place.column) {
    filled += fill(' ', place.column - _place.column);
    _place.column = place.column;
  }
  return filled;
}

size_t ResumedText::read(char* buffer, size_t size) {
  while (_part < _parts.size() && _at == _parts[_part].count) {
    ++_part;
    _at = 0;
  }
  if (_part == _parts.size()) return 0;
  const Part& part = _parts[_part];
  const size_t count = std::min<uint64_t>(size, part.count - _at);
  if (part.text.empty()) {
    std::memset(buffer, part.filler, count);
  } else {
    std::memcpy(buffer, part.text.data() + _at, count);
  }
  _at += count;
  return count;
}

// libxml2 takes a short answer for the end of what it looks ahead for.
TextInput ResumedText::followedBy(TextInput rest) {
  return [this, rest = std::move(rest)](char* buffer, size_t size) {
    ptrdiff_t count = 0;
    for (size_t filled = 0; filled < size; filled += static_cast<size_t>(count)) {
      count = static_cast<ptrdiff_t>(read(buffer + filled, size - filled));
      if (count == 0) count = rest(buffer + filled, size - filled);
      if (count <= 0) return filled > 0 ? static_cast<ptrdiff_t>(filled) : count;
    }
    return static_cast<ptrdiff_t>(size);
  };
}

}  // namespace xquery

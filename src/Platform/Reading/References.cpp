#include "Platform/Reading/References.h"

#include "Platform/Reading/NotTaken.h"
#include "Platform/Reading/XMLCharacters.h"

#include <algorithm>

namespace xquery {

namespace {

// "&#", the digits and ";" of the longest one that is taken.
constexpr size_t longestReference = 12;

unsigned digitOf(char byte) {
  if (byte >= '0' && byte <= '9') return static_cast<unsigned>(byte - '0');
  if (byte >= 'a' && byte <= 'f') return static_cast<unsigned>(byte - 'a' + 10);
  if (byte >= 'A' && byte <= 'F') return static_cast<unsigned>(byte - 'A' + 10);
  return 16;
}

// Of the text between "&#" and ";".
char32_t pointOf(std::string_view number) {
  const bool isHexadecimal = number.starts_with('x');
  if (isHexadecimal) number.remove_prefix(1);
  const unsigned base = isHexadecimal ? 16 : 10;
  take(!number.empty());
  uint64_t point = 0;
  for (const char byte : number) {
    const unsigned digit = digitOf(byte);
    take(digit < base);
    point = point * base + digit;
  }
  take(point <= 0x10FFFF && isXMLCharacter(static_cast<char32_t>(point)));
  return static_cast<char32_t>(point);
}

char32_t pointOfEntity(std::string_view name) {
  struct Entity {
    std::string_view name;
    char32_t point;
  };
  static constexpr Entity entities[] = {
      {"lt", '<'}, {"gt", '>'}, {"amp", '&'}, {"quot", '"'}, {"apos", '\''},
  };
  const Entity* const found = std::find_if(std::begin(entities), std::end(entities),
                                           [=](const Entity& each) { return each.name == name; });
  take(found != std::end(entities));
  return found->point;
}

void appendUTF8(char32_t point, ValueText<char>& text) {
  const auto append = [&text](char32_t byte) { text.push_back(static_cast<char>(byte)); };
  if (point < 0x80) return append(point);
  if (point < 0x800) {
    append(0xC0 | point >> 6);
  } else {
    if (point < 0x10000) {
      append(0xE0 | point >> 12);
    } else {
      append(0xF0 | point >> 18);
      append(0x80 | (point >> 12 & 0x3F));
    }
    append(0x80 | (point >> 6 & 0x3F));
  }
  append(0x80 | (point & 0x3F));
}

// What begins with "&"; answers its length.
size_t appendReference(std::string_view bytes, ValueText<char>& text) {
  const size_t end = bytes.substr(0, longestReference).find(';');
  take(end != bytes.npos);
  const std::string_view inner = bytes.substr(1, end - 1);
  appendUTF8(inner.starts_with('#') ? pointOf(inner.substr(1)) : pointOfEntity(inner), text);
  return end + 1;
}

// Of a carriage return, and the line feed behind it.
size_t lengthOfLineEnd(std::string_view bytes) {
  return bytes.size() > 1 && bytes[1] == '\n' ? 2 : 1;
}

// Where some bytes are in a text, looked for from left to right. Each of them is looked for by
// itself: going over the text for one byte is so much quicker than for several at once.
class Places {
 public:
  static constexpr size_t mostBytes = 4;

  Places(const char* end, std::string_view sought) : _end(end), _sought(sought) {}
  // The first of any of them; the end of the text if there is none.
  const char* firstFrom(const char* at) {
    const char* first = _end;
    for (size_t which = 0; which < _sought.size(); ++which) {
      const char*& next = _next[which];
      if (!next || next < at) next = findInBlocks(at, _end, _sought[which]);
      first = std::min(first, next);
    }
    return first;
  }

 private:
  const char* const _end;
  const std::string_view _sought;
  const char* _next[mostBytes] = {};
};

// Goes over the bytes and has `replace` append what stands for those of `special`.
template <class Replace>
void appendReplaced(std::string_view bytes, std::string_view special, ValueText<char>& text,
                    Replace replace) {
  const char* at = bytes.data();
  const char* const end = at + bytes.size();
  Places places(end, special);
  const auto viewTo = [&at](const char* to) {
    return std::string_view(at, static_cast<size_t>(to - at));
  };
  WorkPacer pacer;
  while (at < end) {
    pacer.turn();
    const char* const next = places.firstFrom(at);
    appendInBlocks(text, viewTo(next));
    at = next;
    if (at < end) at += replace(viewTo(end));
  }
}

}  // namespace

void appendTextOf(std::string_view bytes, ValueText<char>& text) {
  appendReplaced(bytes, "&\r", text, [&text](std::string_view rest) {
    if (rest.front() == '&') return appendReference(rest, text);
    text.push_back('\n');
    return lengthOfLineEnd(rest);
  });
}

void appendValueOf(std::string_view bytes, ValueText<char>& value) {
  appendReplaced(bytes, "&\t\n\r", value, [&value](std::string_view rest) {
    if (rest.front() == '&') return appendReference(rest, value);
    value.push_back(' ');
    return rest.front() == '\r' ? lengthOfLineEnd(rest) : 1;
  });
}

void appendLinesOf(std::string_view bytes, ValueText<char>& text) {
  appendReplaced(bytes, "\r", text, [&text](std::string_view rest) {
    text.push_back('\n');
    return lengthOfLineEnd(rest);
  });
}

}  // namespace xquery

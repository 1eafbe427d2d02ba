#include "Messages.h"

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <set>

namespace cli {
namespace {

using namespace xquery;

constexpr size_t mostQuoted = 200;  // characters
constexpr const char* cut = "...";

struct Range {
  char32_t first, last;
};

// Control characters, and what turns the direction of text.
constexpr Range invisible[] = {{0x00, 0x1F},     {0x7F, 0x9F},     {0x061C, 0x061C},
                               {0x200E, 0x200F}, {0x202A, 0x202E}, {0x2066, 0x2069}};

bool isInvisible(char32_t character) {
  return std::any_of(std::begin(invisible), std::end(invisible), [=](const Range& range) {
    return range.first <= character && character <= range.last;
  });
}

bool continuesCharacter(char byte) {
  return (static_cast<unsigned char>(byte) & 0xC0) == 0x80;
}

// Takes the first character off the text. A byte that is none in UTF-8 counts as one.
std::string_view takeCharacter(std::string_view& text) {
  size_t length = 1;
  while (length < text.size() && length < 4 && continuesCharacter(text[length])) ++length;
  const std::string_view character = text.substr(0, length);
  text.remove_prefix(length);
  return character;
}

// What is asked about are characters of up to three bytes.
char32_t decoded(std::string_view character) {
  const auto bits = [&](size_t at, unsigned mask) {
    return static_cast<char32_t>(static_cast<unsigned char>(character[at]) & mask);
  };
  if (character.size() == 1) return bits(0, 0xFF);
  if (character.size() == 2) return bits(0, 0x1F) << 6 | bits(1, 0x3F);
  if (character.size() == 3) return bits(0, 0x0F) << 12 | bits(1, 0x3F) << 6 | bits(2, 0x3F);
  return 0x10000;
}

std::string visibleBut(std::string_view kept, std::string_view text) {
  std::string result;
  while (!text.empty()) {
    const std::string_view character = takeCharacter(text);
    const char32_t code = decoded(character);
    if (!isInvisible(code) || kept.find(character) != kept.npos) {
      result += character;
    } else {
      char escape[8];
      std::snprintf(escape, sizeof escape, "\\u%04X", static_cast<unsigned>(code));
      result += escape;
    }
  }
  return result;
}

// At most so many characters of a text as may be quoted: those around the one that is `place`
// characters from its start.
std::string excerpt(std::string_view text, size_t place) {
  const auto count = static_cast<size_t>(
      std::count_if(text.begin(), text.end(), [](char byte) { return !continuesCharacter(byte); }));
  if (count <= mostQuoted) return std::string(text);
  const size_t around = place - std::min(place, mostQuoted / 2);
  const size_t start = std::min(around, count - mostQuoted);
  for (size_t n = 0; n < start; ++n) takeCharacter(text);
  const char* const begin = text.data();
  for (size_t n = 0; n < mostQuoted && !text.empty(); ++n) takeCharacter(text);
  const std::string shown(begin, static_cast<size_t>(text.data() - begin));
  return (start > 0 ? cut : "") + shown + (text.empty() ? "" : cut);
}

// The message of a syntax error names a token before it quotes the line: "parse error invalid token
// (TOKEN)- LINE".
std::string shortenedToken(std::string_view head) {
  constexpr std::string_view open = "invalid token (", close = ")- ";
  const size_t start = head.find(open);
  if (start == head.npos || !head.ends_with(close)) return std::string(head);
  const size_t token = start + open.size(), end = head.size() - close.size();
  return std::string(head.substr(0, token)) + excerpt(head.substr(token, end - token), 0) +
         std::string(close);
}

// The message of an error that quotes a line of the query, with no more of it than may be quoted.
std::string shortenedMessage(const XQueryError& error) {
  const std::string message = error.msg()->utf8(), line = error.sourceLine()->utf8();
  const std::string_view head = std::string_view(message).substr(0, message.size() - line.size());
  const size_t place = error.column() > 0 ? static_cast<size_t>(error.column() - 1) : 0;
  return visibleBut("\t", shortenedToken(head) + excerpt(line, place));
}

}  // namespace

std::string visible(std::string_view utf8) {
  return visibleBut("\t\n", utf8);
}

std::string visibleName(std::string_view utf8) {
  return visibleBut("", utf8);
}

std::string description(const NSError& error) {
  const std::string whole = error.description()->utf8();
  const auto* own = dyn_cast<XQueryError>(&error);
  if (!own || !own->sourceLine()) return visible(whole);
  const std::string message = own->msg()->utf8();
  const size_t at = whole.find(message);
  return whole.substr(0, at) + shortenedMessage(*own) + whole.substr(at + message.size());
}

std::string descriptions(const NSArray& errors) {
  std::string text;
  std::set<std::string> printed;
  for (const Value& value : errors.objects()) {
    const std::string line = description(*cast<NSError>(value));
    if (!printed.insert(line).second) continue;
    text += (text.empty() ? "" : "\n") + line;
  }
  return text;
}

}  // namespace cli

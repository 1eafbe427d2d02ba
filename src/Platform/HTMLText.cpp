#include "Platform/HTMLText.h"

#include "Platform/ASCII.h"
#include "Platform/TextEncoding.h"
#include "xquery/String.h"

namespace xquery {

namespace {

struct Signature {
  std::string_view bytes;
  const char* encoding;
};

constexpr Signature signatures[] = {
    {"\xEF\xBB\xBF", "utf-8"},
    {"\xFE\xFF", "utf-16be"},
    {"\xFF\xFE", "utf-16le"},
};

bool isSpace(char byte) {
  return byte == ' ' || (byte >= '\t' && byte <= '\r');
}

bool isLetter(char byte) {
  return (byte >= 'a' && byte <= 'z') || (byte >= 'A' && byte <= 'Z');
}

bool isEncodingCharacter(char byte) {
  return isLetter(byte) || (byte >= '0' && byte <= '9') || byte == '-' || byte == '_' ||
         byte == ':' || byte == '.';
}

// What follows "charset=" in the head, in lower case; empty when nothing does.
std::string namedEncoding(std::string_view bytes) {
  constexpr size_t searched = 1024;
  const std::string head = lowerCase(bytes.substr(0, searched));
  constexpr std::string_view key = "charset";
  for (size_t at = head.find(key); at != head.npos; at = head.find(key, at)) {
    at += key.size();
    while (at < head.size() && isSpace(head[at])) ++at;
    if (at == head.size() || head[at] != '=') continue;
    ++at;
    while (at < head.size() && (isSpace(head[at]) || head[at] == '"' || head[at] == '\'')) ++at;
    size_t end = at;
    while (end < head.size() && isEncodingCharacter(head[end])) ++end;
    if (end > at) return head.substr(at, end - at);
  }
  return {};
}

// What calls itself Latin-1 has always been read as Windows-1252. And a name that was read as it
// stands cannot be in an encoding of two bytes, or in any other without the characters of ASCII.
std::string encodingMeantBy(const std::string& name) {
  if (name == "iso-8859-1" || name == "latin1" || name == "us-ascii") return "windows-1252";
  const auto read = stringWithBytes(name, name);
  return read && read->view() == name ? name : "utf-8";
}

std::string asUTF8(std::string_view bytes, const std::string& encoding) {
  if (encoding != "utf-8" && encoding != "utf8") {
    if (const auto text = stringWithBytes(bytes, encoding)) return text->utf8();
  }
  return NSString::stringWithUTF8Replacing(bytes)->utf8();
}

}  // namespace

std::string HTMLAsUTF8(std::string_view bytes) {
  for (const Signature& signature : signatures) {
    if (bytes.starts_with(signature.bytes)) {
      return asUTF8(bytes.substr(signature.bytes.size()), signature.encoding);
    }
  }
  if (const std::string name = namedEncoding(bytes); !name.empty()) {
    return asUTF8(bytes, encodingMeantBy(name));
  }
  if (NSString::stringWithUTF8(bytes)) return std::string(bytes);
  return asUTF8(bytes, "windows-1252");
}

bool hasTagOfMoreAttributes(std::string_view HTML, size_t count) {
  for (size_t start = HTML.find('<'); start != HTML.npos; start = HTML.find('<', start + 1)) {
    if (start + 1 == HTML.size() || !isLetter(HTML[start + 1])) continue;
    // Attributes need not have white space between them, but then they have quotes.
    size_t gaps = 0;
    size_t at = start + 1;
    for (; at < HTML.size() && HTML[at] != '>'; ++at) {
      const bool isGap =
          isSpace(HTML[at]) || HTML[at] == '"' || HTML[at] == '\'' || HTML[at] == '/';
      const bool isFirst = isGap && HTML[at] != HTML[at - 1];
      if (isFirst && ++gaps > count) return true;
    }
    start = at == HTML.size() ? at - 1 : at;
  }
  return false;
}

}  // namespace xquery

#include "Platform/Reading/HTMLText.h"

#include "Platform/Base/WorkMeter.h"
#include "Platform/Text/ASCII.h"
#include "Platform/Text/Encoding.h"
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

// Reads as much of HTML as it takes to count the attributes of its tags.
class TagReader {
 public:
  explicit TagReader(std::string_view HTML) : _HTML(HTML) {}

  // Goes to the name of the next start tag.
  bool next() {
    for (_at = _HTML.find('<', _at); _at < _HTML.size(); _at = _HTML.find('<', _at)) {
      ++_at;
      if (_at < _HTML.size() && isLetter(_HTML[_at])) {
        charge();
        _name = _at;
        return true;
      }
    }
    return false;
  }

  // Goes to the end of the tag, or to the first attribute too many. Attributes need not have white
  // space between them, but then they have quotes or slashes.
  bool hasMoreAttributes(size_t count) {
    bool afterGap = false;
    bool afterEquals = false;
    for (; _at < _HTML.size() && _HTML[_at] != '>'; ++_at) {
      const char byte = _HTML[_at];
      const bool isQuote = byte == '"' || byte == '\'';
      if (isQuote && afterEquals) _at = endOfValue();
      const bool isGap = isSpace(byte) || isQuote || byte == '/';
      if (afterGap && !isGap && byte != '=' && !afterEquals && count-- == 0) return true;
      afterGap = isGap;
      if (!isSpace(byte)) afterEquals = byte == '=';
    }
    return false;
  }

  // There, what looks like a tag is a comparison of a program, and quotes are its texts.
  void skipRawText() {
    for (const std::string_view name : {std::string_view("script"), std::string_view("style")}) {
      const std::string_view here = _HTML.substr(_name, name.size() + 1);
      if (here.size() <= name.size() || isLetter(here.back())) continue;
      if (lowerCase(here.substr(0, name.size())) == name) skipToEndTag(name);
    }
  }

 private:
  // The place of the quote that ends the value which begins here; here, where nothing ends it.
  size_t endOfValue() {
    const char quote = _HTML[_at];
    size_t& last = quote == '"' ? _lastDouble : _lastSingle;
    if (last == _HTML.npos) last = _HTML.rfind(quote);
    return _at < last ? _HTML.find(quote, _at + 1) : _at;
  }

  // What has been passed since the last time.
  void charge() {
    constexpr size_t bytesPerStep = 4096;
    const size_t steps = (_at - _chargedTo) / bytesPerStep;
    if (steps == 0) return;
    checkWork(steps);
    _chargedTo = _at;
  }

  void skipToEndTag(std::string_view name) {
    for (size_t at = _HTML.find("</", _at); at != _HTML.npos; at = _HTML.find("</", at + 1)) {
      if (lowerCase(_HTML.substr(at + 2, name.size())) == name) {
        _at = at;
        return;
      }
    }
    _at = _HTML.size();
  }

  const std::string_view _HTML;
  size_t _at = 0;
  size_t _name = 0;
  size_t _chargedTo = 0;
  size_t _lastDouble = std::string_view::npos;
  size_t _lastSingle = std::string_view::npos;
};

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
  TagReader tags(HTML);
  while (tags.next()) {
    if (tags.hasMoreAttributes(count)) return true;
    tags.skipRawText();
  }
  return false;
}

}  // namespace xquery

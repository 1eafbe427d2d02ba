#include "Platform/Reading/XMLProlog.h"

#include "Platform/Reading/NotTaken.h"
#include "Platform/Reading/XMLCharacters.h"
#include "Platform/Text/ASCII.h"

#include <algorithm>
#include <cstring>
#include <string_view>

namespace xquery {

namespace {

constexpr std::string_view declarationStart = "<?xml";
constexpr std::string_view declarationEnd = "?>";
constexpr std::string_view typeStart = "<!DOCTYPE";

// Longer ones are rare.
constexpr size_t longestRead = 4096;

// The text of markup that is read from left to right.
class Words {
 public:
  explicit Words(std::string_view text) : _rest(text) {}

  bool isOver() const { return _rest.empty(); }
  // Whether there was white space.
  bool skipSpace() {
    const size_t count = std::min(_rest.find_first_not_of(whiteSpaceOfXML), _rest.size());
    _rest.remove_prefix(count);
    return count != 0;
  }
  // Whether that came next.
  bool skip(std::string_view word) {
    const bool isThere = _rest.starts_with(word);
    if (isThere) _rest.remove_prefix(word.size());
    return isThere;
  }
  // In quotes of either kind.
  std::string_view literal() {
    take(!_rest.empty() && (_rest.front() == '"' || _rest.front() == '\''));
    const size_t end = _rest.find(_rest.front(), 1);
    take(end != _rest.npos);
    const std::string_view inner = _rest.substr(1, end - 1);
    _rest.remove_prefix(end + 1);
    return inner;
  }
  // Up to white space.
  std::string_view word() {
    const std::string_view all = _rest.substr(0, _rest.find_first_of(whiteSpaceOfXML));
    _rest.remove_prefix(all.size());
    return all;
  }

 private:
  std::string_view _rest;
};

// Whether there is such an attribute of the declaration, and its value.
bool readField(Words& words, std::string_view name, std::string_view& value) {
  if (!words.skip(name)) return false;
  words.skipSpace();
  take(words.skip("="));
  words.skipSpace();
  value = words.literal();
  return true;
}

bool areAll(std::string_view text, bool (*is)(char)) {
  return std::all_of(text.begin(), text.end(), is);
}

bool isPublicCharacter(char byte) {
  constexpr std::string_view others = " \r\n-'()+,./:=?;!*#@$_%";
  const char letter = lowerCase(byte);
  return (letter >= 'a' && letter <= 'z') || (byte >= '0' && byte <= '9') ||
         others.find(byte) != others.npos;
}

bool isPlain(char byte) {
  return byte >= ' ' && byte < 0x7F;
}

void readExternalID(Words& words) {
  const bool isPublic = words.skip("PUBLIC");
  take(isPublic || words.skip("SYSTEM"));
  take(words.skipSpace());
  if (isPublic) {
    take(areAll(words.literal(), isPublicCharacter));
    take(words.skipSpace());
  }
  take(areAll(words.literal(), isPlain));
}

// The text between the beginning at `at` and the nearest such end; null where that is not there
// yet.
const char* findEnd(const char* at, const char* end, std::string_view ending) {
  const std::string_view text(at, std::min(static_cast<size_t>(end - at), longestRead));
  const size_t found = text.find(ending);
  take(found != text.npos || text.size() < longestRead);
  return found == text.npos ? nullptr : at + found;
}

}  // namespace

const char* readXMLDeclaration(const char* at, const char* end, XMLDeclaration& declaration) {
  at += declarationStart.size();
  const char* const ending = findEnd(at, end, declarationEnd);
  if (!ending) return nullptr;
  Words words({at, static_cast<size_t>(ending - at)});
  std::string_view value;
  take(words.skipSpace() && readField(words, "version", value) && value == "1.0");
  bool isSpaced = words.skipSpace();
  if (isSpaced && readField(words, "encoding", value)) {
    const std::string encoding = lowerCase(value);
    declaration.isASCII = encoding == "us-ascii";
    take(declaration.isASCII || encoding == "utf-8");
    isSpaced = words.skipSpace();
  }
  if (isSpaced && readField(words, "standalone", value)) {
    take(value == "yes" || value == "no");
    words.skipSpace();
  }
  take(words.isOver());
  return ending + declarationEnd.size();
}

const char* readDocumentType(const char* at, const char* end) {
  at += typeStart.size();
  // One that has ">" in a literal is rare.
  const char* const ending = findEnd(at, end, ">");
  if (!ending) return nullptr;
  Words words({at, static_cast<size_t>(ending - at)});
  take(words.skipSpace());
  take(shapeOfXMLName(words.word()).isName);
  if (words.skipSpace() && !words.isOver()) {
    readExternalID(words);
    words.skipSpace();
  }
  take(words.isOver());
  return ending + 1;
}

}  // namespace xquery

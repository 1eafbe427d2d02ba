#include "Functions/XQueryRegEx.h"

#include "Expr/XQuerySequence.h"
#include "Platform/Base/WorkMeter.h"
#include "Platform/Text/UTF16.h"
#include "Platform/Text/UTF8.h"
#include "xquery/Number.h"

#include <algorithm>
#include <array>
#include <charconv>
#include <vector>

namespace xquery {
namespace {

constexpr uint32_t compileOptions = 0x327F;
constexpr uint32_t matchOptions = 0x2590;
constexpr uint32_t allFlags = PCRECaseless | PCREMultiline | PCREDotAll | PCREExtended;

constexpr size_t bytesPerStep = 4096;

// --- character references in patterns ------------------------------------------------------------

// "\x{...}" of the digits as they are.
std::string hexadecimalEscape(std::string_view digits) {
  return "\\x{" + std::string(digits) + "}";
}

// The same of a decimal number; too large a one becomes one that is no character either.
std::string decimalEscape(std::string_view digits) {
  int32_t value = 0;
  const auto read = std::from_chars(digits.data(), digits.data() + digits.size(), value);
  if (read.ec != std::errc()) value = INT32_MAX;
  std::array<char, 8> hexadecimal = {};
  const auto written =
      std::to_chars(hexadecimal.data(), hexadecimal.data() + hexadecimal.size(), value, 16);
  return hexadecimalEscape({hexadecimal.data(), written.ptr});
}

// Replaces every match of the helper pattern by the escape of its first group. The text is passed
// on unchanged when the helper does not compile.
void translateReferences(std::string& text, std::string_view helper,
                         std::string (*escape)(std::string_view)) {
  const RegExpCodeOwner code(RegExpCompile(helper, 0));
  if (!code) return;
  PCRESearch search(*code, text);
  std::string result;
  size_t at = 0;
  while (search.find(at, PCRENoUTF8Check) == PCRESearch::Outcome::Found) {
    const PCRERange match = search.group(0);
    result.append(text, at, match.start - at);
    result += escape(search.group(1).in(text));
    at = match.end;
  }
  if (at == 0) return;
  result.append(text, at);
  text = std::move(result);
}

void translateReferences(std::string& pattern) {
  // Nothing else can match the helpers.
  if (pattern.find("&#") == std::string::npos) return;
  // The class of the hexadecimal digits has no more letters than these.
  translateReferences(pattern, "&#x([0-9afAf]+);", hexadecimalEscape);
  translateReferences(pattern, "&#([0-9]+);", decimalEscape);
}

// --- subjects ------------------------------------------------------------------------------------

// The UTF-8 form of a text: its own units when they are 8-bit. The text must outlive it.
class UTF8Form {
 public:
  explicit UTF8Form(NSStringView text) : _wide(text.isWide()) {
    if (!_wide) {
      _bytes = {text.asciiUnits(), text.length()};
      return;
    }
    _wellFormed = !hasLoneSurrogate(text);
    if (_wellFormed) _converted = text.utf8();
    _bytes = _converted;
  }
  UTF8Form(const UTF8Form&) = delete;
  UTF8Form& operator=(const UTF8Form&) = delete;

  bool wellFormed() const { return _wellFormed; }
  std::string_view bytes() const { return _bytes; }

  Ref<NSString> piece(size_t from, size_t to) const {
    const std::string_view text = _bytes.substr(from, to - from);
    return _wide ? NSString::stringWithUTF8(text) : NSString::stringWithASCII(text);
  }

  void append(size_t from, size_t to, NSMutableString& out) {
    const std::string_view text = _bytes.substr(from, to - from);
    if (!_wide) {
      out.appendASCII(text);
      return;
    }
    _units.clear();
    const auto* next = reinterpret_cast<const unsigned char*>(text.data());
    const auto* const end = next + text.size();
    WorkPacer pacer;
    while (next < end) {
      pacer.turn();
      appendUTF16(_units, readUTF8(next, end));
    }
    out.append({_units.data(), static_cast<uint32_t>(_units.size())});
  }

 private:
  const bool _wide;
  bool _wellFormed = true;
  std::string _converted;
  std::string_view _bytes;
  std::u16string _units;
};

// --- walking the matches -------------------------------------------------------------------------

// The matches from left to right, each search beginning where the last match ended.
class MatchWalk {
 public:
  MatchWalk(RegExpCode& code, std::string_view text) : _search(code, text) {}

  // Moves on to the next match; false when there is none or the walk failed.
  bool next() {
    _position = _match.end;
    const PCRESearch::Outcome outcome = _search.find(_position, PCRENoUTF8Check);
    if (outcome == PCRESearch::Outcome::NotFound) return false;
    if (outcome == PCRESearch::Outcome::Found) _match = _search.group(0);
    // A \K in a lookaround can put the start before the position or behind the end.
    _failed = outcome == PCRESearch::Outcome::Failed || _match.end == _position ||
              _match.start < _position || _match.start > _match.end;
    return !_failed;
  }

  bool failed() const { return _failed; }

  // Where the search for the match began: the text from here to its start is between matches.
  size_t position() const { return _position; }
  const PCRERange& match() const { return _match; }
  PCRERange group(size_t number) const { return _search.group(number); }

 private:
  PCRESearch _search;
  size_t _position = 0;
  PCRERange _match = {0, 0};
  bool _failed = false;
};

// --- replacements --------------------------------------------------------------------------------

// A replacement taken apart once for all matches.
class Replacement {
 public:
  explicit Replacement(NSStringView text) : _valid(parse(text)) {}

  bool valid() const { return _valid; }

  void append(const MatchWalk& walk, UTF8Form& subject, NSMutableString& out) const {
    for (const Part& part : _parts) {
      out.append(part.text);
      if (part.group < 0) continue;
      const PCRERange group = walk.group(static_cast<size_t>(part.group));
      if (group.exists()) subject.append(group.start, group.end, out);
    }
  }

 private:
  struct Part {
    NSStringView text;
    int group;  // after the text; negative for none
  };

  bool parse(NSStringView text) {
    uint32_t from = 0;
    const uint32_t length = text.length();
    for (uint32_t at = 0; at < length; ++at) {
      const char16_t unit = text[at];
      if (unit != '\\' && unit != '$') continue;
      if (at + 1 == length) return false;
      const char16_t follower = text[at + 1];
      const bool isGroup = unit == '$' && follower >= '0' && follower <= '9';
      if (!isGroup && (unit == '$' || (follower != '\\' && follower != '$'))) return false;
      _parts.push_back({text.substring(from, at - from), isGroup ? follower - '0' : -1});
      // The character after a backslash begins the next text.
      from = isGroup ? at + 2 : at + 1;
      ++at;
    }
    _parts.push_back({text.substring(from), -1});
    return true;
  }

  std::vector<Part> _parts;
  const bool _valid;
};

}  // namespace

// --- plain functions -----------------------------------------------------------------------------

RegExpCode* RegExpCompile(std::string_view pattern, uint32_t options, std::string* errorText,
                          size_t* errorOffset) {
  PCREFailure failure;
  auto code = PCREPattern::compile(pattern, (options & compileOptions) | PCREUTF8, &failure);
  if (!code) {
    if (errorText) *errorText = failure.text;
    if (errorOffset) *errorOffset = failure.offset;
  }
  return code.release();
}

int RegExpExec(RegExpCode* code, const char* subject, size_t length, size_t start, uint32_t options,
               int64_t* offsets, size_t offsetCount) {
  const size_t room = offsetCount / 3;
  PCRESearch search(*code, {subject, length}, std::max(room, size_t{1}));
  const PCRESearch::Outcome outcome = search.find(start, options & matchOptions);
  if (outcome == PCRESearch::Outcome::NotFound) return RegExpNoMatch;
  if (outcome == PCRESearch::Outcome::Failed) return RegExpFailed;
  for (size_t number = 0; number < room; ++number) {
    const PCRERange group = search.group(number);
    offsets[2 * number] = group.exists() ? static_cast<int64_t>(group.start) : RegExpUnset;
    offsets[2 * number + 1] = group.exists() ? static_cast<int64_t>(group.end) : RegExpUnset;
  }
  return room > 0 ? static_cast<int>(search.groupCount()) : 0;
}

void RegExpDispose(RegExpCode* code) {
  std::default_delete<RegExpCode>()(code);
}

// --- XQueryRegEx ---------------------------------------------------------------------------------

bool XQueryRegEx::flagsFromString(NSStringView text, uint32_t& flags) {
  flags = 0;
  for (uint32_t index = 0; index < text.length(); ++index) {
    switch (text[index]) {
      case 'i':
        flags |= PCRECaseless;
        break;
      case 'm':
        flags |= PCREMultiline;
        break;
      case 's':
        flags |= PCREDotAll;
        break;
      case 'x':
        flags |= PCREExtended;
        break;
      default:
        return false;
    }
  }
  return true;
}

Ref<XQueryRegEx> XQueryRegEx::regExp(NSStringView pattern, NSStringView withFlags) {
  uint32_t flags = 0;
  return flagsFromString(withFlags, flags) ? regExp(pattern, flags) : nullptr;
}

Ref<XQueryRegEx> XQueryRegEx::regExp(NSStringView pattern, uint32_t withFlags) {
  if (hasLoneSurrogate(pattern)) return nullptr;
  checkWork(1 + pattern.length() / bytesPerStep);
  std::string text = pattern.utf8();
  translateReferences(text);
  RegExpCodeOwner compiled(RegExpCompile(text, (withFlags & allFlags) | PCRENoUTF8Check));
  if (!compiled) return nullptr;
  return make<XQueryRegEx>(withFlags, std::move(compiled));
}

Value XQueryRegEx::hasMatch(const NSString* string) const {
  if (!string) return NSNumber::numberWithBool(false);
  const UTF8Form subject(string->view());
  if (!subject.wellFormed()) return NSNumber::numberWithBool(false);
  const auto outcome = PCRESearch(*_compiled, subject.bytes()).find(0, PCRENoUTF8Check);
  return NSNumber::numberWithBool(outcome == PCRESearch::Outcome::Found);
}

Value XQueryRegEx::matches(const NSString* string) const {
  if (!string) return Value();
  const UTF8Form subject(string->view());
  if (!subject.wellFormed()) return Value();
  MatchWalk walk(*_compiled, subject.bytes());
  XQueryGatherer found;
  while (walk.next()) found.add(subject.piece(walk.match().start, walk.match().end));
  return walk.failed() ? Value() : found.value();
}

Value XQueryRegEx::replace(const NSString* string, NSStringView withString) const {
  if (!string) return Value();
  UTF8Form subject(string->view());
  if (!subject.wellFormed()) return Value();
  const Replacement replacement(withString);
  MatchWalk walk(*_compiled, subject.bytes());
  NSMutableString result;
  while (walk.next()) {
    if (!replacement.valid()) return Value();
    subject.append(walk.position(), walk.match().start, result);
    const uint32_t length = result.length();
    replacement.append(walk, subject, result);
    checkWork((result.length() - length) / bytesPerStep);
  }
  if (walk.failed()) return Value();
  // Without a match the text is the string's own.
  if (walk.position() == 0) return make<NSString>(Kind::String, uint16_t{0}, *string);
  subject.append(walk.position(), subject.bytes().size(), result);
  return result.string();
}

Value XQueryRegEx::tokenize(const NSString* string) const {
  if (!string) return Value();
  const UTF8Form subject(string->view());
  if (!subject.wellFormed()) return Value();
  MatchWalk walk(*_compiled, subject.bytes());
  XQueryGatherer pieces;
  while (walk.next()) pieces.add(subject.piece(walk.position(), walk.match().start));
  if (walk.failed()) return Value();
  pieces.add(subject.piece(walk.position(), subject.bytes().size()));
  return pieces.value();
}

}  // namespace xquery

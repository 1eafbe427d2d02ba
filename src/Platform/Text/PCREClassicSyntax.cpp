// The successor refuses three things that the classic interface reads as plain characters:
//
//   \i         a backslash before a letter without a meaning: the letter. In a class also before a
//              letter that has its meaning outside of classes only.
//   [\w-z]     a hyphen in a class after an escape that stands for many characters, or after a
//   [a-\d]     POSIX class, or before one of them: a hyphen.
//
// Escapes that have a meaning and are malformed ("\p{Nothing}", "\x{110000}", "\c" at the end) are
// errors in both. That is why the successor's own option to read bad escapes literally is not used:
// it would accept these too.
#include "Platform/Text/PCREClassicSyntax.h"

#include <cstddef>

namespace xquery {
namespace {

constexpr std::string_view lettersWithoutMeaning = "FIJMOTYijmqy";
constexpr std::string_view lettersWithoutMeaningInClass = "ABCGKRXZgkz";
constexpr std::string_view manyCharacterEscapes = "DHPSVWdhpsvw";

bool contains(std::string_view letters, char letter) {
  return letters.find(letter) != std::string_view::npos;
}

class Rewriter {
 public:
  Rewriter(std::string_view pattern, bool extended) : _pattern(pattern), _extended(extended) {}

  std::optional<std::string> rewritten() {
    while (!atEnd()) {
      if (startsWith("\\")) {
        escape(false);
      } else if (startsWith("[")) {
        characterClass();
      } else if (startsWith("(?#")) {
        copyThrough(")");
      } else if (_extended && startsWith("#")) {
        copyThrough("\n");
      } else {
        copy(1);
      }
    }
    if (!_changed) return std::nullopt;
    return std::move(_out);
  }

 private:
  // What a hyphen in a class follows.
  enum class Before { Nothing, Character, RangeEnd, Many };

  bool atEnd() const { return _at >= _pattern.size(); }
  bool startsWith(std::string_view text) const { return _pattern.substr(_at).starts_with(text); }
  void copy(size_t count) {
    const std::string_view text = _pattern.substr(_at, count);
    _out += text;
    _at += text.size();
  }
  void copyThrough(std::string_view text) {
    const size_t found = _pattern.find(text, _at);
    copy(found == std::string_view::npos ? _pattern.size() - _at : found + text.size() - _at);
  }

  // Whether the escape stands for many characters.
  bool escape(bool inClass) {
    if (startsWith("\\Q")) {
      copyThrough("\\E");
      return false;
    }
    if (_at + 1 == _pattern.size()) {
      copy(1);
      return false;
    }
    const char letter = _pattern[_at + 1];
    if (contains(lettersWithoutMeaning, letter) ||
        (inClass && contains(lettersWithoutMeaningInClass, letter))) {
      ++_at;
      copy(1);
      _changed = true;
      return false;
    }
    if (startsWith("\\p{") || startsWith("\\P{")) {
      copyThrough("}");
    } else {
      // The control character, and the property of one letter, include the next character.
      copy(letter == 'c' || letter == 'p' || letter == 'P' ? 3 : 2);
    }
    return contains(manyCharacterEscapes, letter);
  }

  // The length of the POSIX class that begins here, 0 when none does.
  size_t posixClassLength() const {
    if (!startsWith("[:")) return 0;
    size_t end = _at + 2;
    while (end < _pattern.size() &&
           (_pattern[end] == '^' || (_pattern[end] >= 'a' && _pattern[end] <= 'z'))) {
      ++end;
    }
    return _pattern.substr(end).starts_with(":]") ? end + 2 - _at : 0;
  }

  // Whether what follows cannot end a range.
  bool noRangeEndFollows() const {
    if (posixClassLength() > 0) return true;
    if (!startsWith("\\") || _at + 1 == _pattern.size()) return false;
    const char letter = _pattern[_at + 1];
    return contains(manyCharacterEscapes, letter) || contains(lettersWithoutMeaningInClass, letter);
  }

  void hyphen(Before& before) {
    copy(1);
    const bool last = startsWith("]");
    const bool plain =
        before == Before::Many || (before == Before::Character && noRangeEndFollows());
    if (plain && !last) {
      _out.insert(_out.size() - 1, "\\");
      _changed = true;
    }
    if (before == Before::Character && !plain && !last) {
      if (!startsWith("\\Q") && !startsWith("\\E")) element();
      before = Before::RangeEnd;
    } else {
      before = Before::Character;
    }
  }

  // One character or escape of a class.
  Before element() {
    if (startsWith("\\E")) {
      copy(2);
      return Before::RangeEnd;
    }
    if (startsWith("\\")) return escape(true) ? Before::Many : Before::Character;
    if (const size_t posix = posixClassLength()) {
      copy(posix);
      return Before::Many;
    }
    copy(1);
    return Before::Character;
  }

  void characterClass() {
    copy(1);
    if (startsWith("^")) copy(1);
    while (startsWith("\\E")) copy(2);
    Before before = Before::Nothing;
    if (startsWith("]")) before = element();
    while (!atEnd() && !startsWith("]")) {
      if (startsWith("-") && before != Before::Nothing) {
        hyphen(before);
      } else {
        before = element();
      }
    }
    if (!atEnd()) copy(1);
  }

  const std::string_view _pattern;
  const bool _extended;
  size_t _at = 0;
  std::string _out;
  bool _changed = false;
};

}  // namespace

std::optional<std::string> PCREClassicSyntax(std::string_view pattern, bool extended) {
  return Rewriter(pattern, extended).rewritten();
}

}  // namespace xquery

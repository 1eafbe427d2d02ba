// Patterns that need no library: a text as it stands, or one character of a set, once or repeated.
//
//   ", "        the two characters
//   "\s+"       white space, as much as there is
//   "[,;]"      one of the two
//   "\W+"       as many characters as there are that belong to no word
//
// These are what texts are taken apart by most of all. They match what the library matches: sets
// are of ASCII characters, as the classes of the library are without its Unicode properties; all
// other characters are in the complement of a set.
#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <optional>
#include <string>
#include <string_view>

namespace xquery {

class PlainPattern {
 public:
  // None for a pattern that is something else. It is read without options that change what its
  // characters mean.
  [[nodiscard]] static std::optional<PlainPattern> of(std::string_view pattern);

  struct Match {
    size_t start;
    size_t end;
  };
  // The first match in well-formed UTF-8 that begins at `from` or behind it, where a character
  // begins.
  std::optional<Match> find(std::string_view subject, size_t from) const;

 private:
  PlainPattern() = default;
  bool readSet(std::string_view pattern);
  bool readEscape(char letter);
  bool readClass(std::string_view pattern);
  void add(unsigned char byte) { _set[byte] = true; }
  void invert();

  std::string _text;             // empty for a set
  std::array<bool, 256> _set{};  // by bytes; those of other characters than ASCII alike
  bool _isRepeated = false;
};

}  // namespace xquery

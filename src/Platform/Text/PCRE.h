// Regular expressions of the PCRE library over UTF-8. Only PCRE.cpp knows the library.
//
// Options are the bits of the library's classic interface, and patterns are read as that interface
// reads them. What a search may cost is bounded in proportion to its subject, whatever the pattern,
// and a search can be interrupted like any other work of the engine.
#pragma once

#include <cstddef>
#include <cstdint>
#include <memory>
#include <string>
#include <string_view>

namespace xquery {

enum PCREOption : uint32_t {
  PCRECaseless = 0x1,
  PCREMultiline = 0x2,
  PCREDotAll = 0x4,
  PCREExtended = 0x8,
  PCREAnchored = 0x10,
  PCREDollarEndOnly = 0x20,
  PCREExtra = 0x40,  // unknown escapes are errors
  PCRENotBOL = 0x80,
  PCRENotEOL = 0x100,
  PCREUngreedy = 0x200,
  PCRENotEmpty = 0x400,
  PCREUTF8 = 0x800,
  PCRENoAutoCapture = 0x1000,
  PCRENoUTF8Check = 0x2000,  // the text is known to be well formed
};

struct PCREFailure {
  std::string text;
  size_t offset = 0;  // in bytes of the pattern
};

struct PCRERange {
  static constexpr size_t none = SIZE_MAX;

  size_t start = none;
  size_t end = none;

  bool exists() const { return start != none; }
  std::string_view in(std::string_view subject) const { return subject.substr(start, end - start); }
};

// To be used by one thread at a time.
class PCREPattern {
  struct Code;

 public:
  // Null when the pattern does not compile; `failure` (may be null) then says why.
  [[nodiscard]] static std::unique_ptr<PCREPattern> compile(std::string_view pattern,
                                                            uint32_t options,
                                                            PCREFailure* failure = nullptr);
  explicit PCREPattern(std::unique_ptr<Code> code);
  ~PCREPattern();
  PCREPattern(const PCREPattern&) = delete;
  PCREPattern& operator=(const PCREPattern&) = delete;

  // The size of the compiled form, machine code apart.
  size_t byteCount() const;

 private:
  friend class PCRESearch;

  std::unique_ptr<Code> _code;
};

// The searches of one operation over one subject; pattern and subject must outlive it. Their cost
// is bounded together.
class PCRESearch {
 public:
  // Group 0, the match itself, and the groups 1 to 9.
  static constexpr size_t usualRoom = 10;

  // Failed: too expensive, or a subject that the pattern cannot be matched against.
  enum class Outcome { Found, NotFound, Failed };

  // Groups beyond the room (at least 1) are matched and not reported.
  PCRESearch(PCREPattern& pattern, std::string_view subject, size_t room = usualRoom);
  ~PCRESearch();
  PCRESearch(const PCRESearch&) = delete;
  PCRESearch& operator=(const PCRESearch&) = delete;

  // Looks for a match that starts at `from` or after it. Throws what interrupts the evaluation.
  Outcome find(size_t from, uint32_t options);
  // After Found: a group that took no part does not exist; group 0 is the match.
  PCRERange group(size_t number) const;
  // After Found: one more than the number of the last group that took part; 0 when there was no
  // room for it.
  size_t groupCount() const;

 private:
  struct State;
  std::unique_ptr<State> _state;
};

}  // namespace xquery

// Regular expressions as the string functions use them, and the plain functions below them.
//
// Matching runs on the UTF-8 form of the subject, which for 8-bit text is the text itself. All
// failures are silent: the answer is none, which the call that wanted it turns into its error.
#pragma once

#include "Platform/Text/PCRE.h"
#include "xquery/Object.h"
#include "xquery/String.h"

#include <cstddef>
#include <cstdint>
#include <memory>
#include <string>
#include <string_view>

namespace xquery {

using RegExpCode = PCREPattern;

// The offsets of a group that took no part, and the answers of RegExpExec that are no count.
constexpr int64_t RegExpUnset = -1;
constexpr int RegExpNoMatch = -1;
constexpr int RegExpFailed = -8;

// Options are masked to 0x327F, and UTF-8 is always on. Null when the pattern does not compile; its
// error is then stored where asked for. The caller disposes of the code.
[[nodiscard]] RegExpCode* RegExpCompile(std::string_view pattern, uint32_t options,
                                        std::string* errorText = nullptr,
                                        size_t* errorOffset = nullptr);
// Options are masked to 0x2590. Stores start and end of each group in the first two thirds of the
// offsets. Answers one more than the number of the last group that took part, 0 when there is no
// room for it, or one of the above.
int RegExpExec(RegExpCode* code, const char* subject, size_t length, size_t start, uint32_t options,
               int64_t* offsets, size_t offsetCount);
void RegExpDispose(RegExpCode* code);

struct RegExpDisposer {
  void operator()(RegExpCode* code) const { RegExpDispose(code); }
};
using RegExpCodeOwner = std::unique_ptr<RegExpCode, RegExpDisposer>;

class XQueryRegEx : public NSCounted {
 public:
  // The bits of a flags text; false for a character that is none of "i", "m", "s" and "x".
  [[nodiscard]] static bool flagsFromString(NSStringView text, uint32_t& flags);

  // Null when the flags or the pattern are invalid.
  [[nodiscard]] static Ref<XQueryRegEx> regExp(NSStringView pattern, NSStringView withFlags);
  [[nodiscard]] static Ref<XQueryRegEx> regExp(NSStringView pattern, uint32_t withFlags);

  uint32_t flags() const { return _flags; }
  size_t byteCount() const { return _compiled->byteCount(); }

  // False also for a missing string, one with lone surrogates, and where the search is given up as
  // too expensive: the test always has an answer.
  Value hasMatch(const NSString* string) const;
  // The rest answer none in these cases, and where a match is empty and begins where the last one
  // ended.
  //
  // The whole matches from left to right: the empty sequence, a string, or an array.
  Value matches(const NSString* string) const;
  // In the replacement "$" and a digit stand for a group, "\\" and "\$" for the second character.
  Value replace(const NSString* string, NSStringView withString) const;
  // The pieces between the matches: a string, or an array.
  Value tokenize(const NSString* string) const;

 protected:
  XQueryRegEx(uint32_t flags, RegExpCodeOwner compiled)
      : NSCounted(Kind::Internal), _flags(flags), _compiled(std::move(compiled)) {}
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  uint32_t _flags;
  RegExpCodeOwner _compiled;
};

}  // namespace xquery

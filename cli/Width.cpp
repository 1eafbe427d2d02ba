#include "Width.h"

#include <unicode/uchar.h>
#include <unicode/utf8.h>

#include <cstdint>
#include <sys/ioctl.h>

namespace cli {
namespace {

bool isDrawnOver(UChar32 code) {
  constexpr uint32_t marks = U_GC_MN_MASK | U_GC_ME_MASK | U_GC_CF_MASK;
  constexpr UChar32 softHyphen = 0xAD;
  // The vowels and final consonants of Hangul join the consonant before them.
  const auto syllable =
      static_cast<UHangulSyllableType>(u_getIntPropertyValue(code, UCHAR_HANGUL_SYLLABLE_TYPE));
  return ((U_GET_GC_MASK(code) & marks) != 0 && code != softHyphen) ||
         syllable == U_HST_VOWEL_JAMO || syllable == U_HST_TRAILING_JAMO;
}

bool isWide(UChar32 code) {
  const auto width =
      static_cast<UEastAsianWidth>(u_getIntPropertyValue(code, UCHAR_EAST_ASIAN_WIDTH));
  return width == U_EA_WIDE || width == U_EA_FULLWIDTH;
}

}  // namespace

size_t columnsOfTerminal(int stream) {
  constexpr size_t usual = 80;
  winsize window = {};
  return ioctl(stream, TIOCGWINSZ, &window) == 0 && window.ws_col > 0 ? window.ws_col : usual;
}

size_t widthOfCharacter(std::string_view character) {
  const auto length = static_cast<int32_t>(character.size());
  int32_t at = 0;
  UChar32 code = U_SENTINEL;
  if (length > 0) U8_NEXT(character.data(), at, length, code);
  if (code < 0 || at != length) return character.size();
  if (isDrawnOver(code)) return 0;
  return isWide(code) ? 2 : 1;
}

}  // namespace cli

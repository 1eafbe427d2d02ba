// The characters that XML 1.0 (Appendix B) allows in names, as sets of 16-bit code units, and the
// wider names that a document may hold.
//
// Characters outside the BMP are never members of the sets, so a surrogate never is one.
#pragma once

#include "xquery/String.h"

#include <array>
#include <cstdint>

namespace xquery {

// One bit per code unit: bit (unit mod 8) of byte (unit / 8).
class XQueryCharSet {
 public:
  using Bitmap = std::array<uint8_t, 8192>;
  constexpr explicit XQueryCharSet(const Bitmap& bitmap) : _bitmap(bitmap) {}

  constexpr bool contains(char16_t unit) const { return (_bitmap[unit / 8] >> unit % 8 & 1) != 0; }

 private:
  Bitmap _bitmap;
};

extern const XQueryCharSet XQueryNCNameFirstCharSet;  // Letter and "_"
extern const XQueryCharSet XQueryNCNameCharSet;       // NameChar without ":"
extern const XQueryCharSet XQueryNameFirstCharSet;    // NCName first and ":"
extern const XQueryCharSet XQueryNameCharSet;         // NCName and ":"

// Whether a parser takes the text as the qualified name of a node: an NCName, or two with a colon
// between them. The characters are those of the fifth edition of XML 1.0, which all parsers go by
// today, so that every name of a parsed document passes.
bool XQueryIsNodeName(NSStringView text);

// Tab, line feed, carriage return and space.
constexpr bool XQueryIsWhiteSpace(char16_t unit) {
  return unit == u' ' || unit == u'\t' || unit == u'\n' || unit == u'\r';
}

struct XQueryWhiteSpaceSet {
  static constexpr bool contains(char16_t unit) { return XQueryIsWhiteSpace(unit); }
};
inline constexpr XQueryWhiteSpaceSet XQueryWhiteSpaceCharSet;

}  // namespace xquery

// The characters of XML 1.0, fifth edition, and the names of Namespaces in XML 1.0.
#pragma once

#include <cstddef>
#include <cstdint>
#include <string_view>

namespace xquery {

constexpr std::string_view whiteSpaceOfXML = " \t\r\n";

inline bool isXMLSpace(char byte) {
  return byte == ' ' || byte == '\n' || byte == '\t' || byte == '\r';
}

bool isXMLCharacter(char32_t point);
bool isXMLNameStart(char32_t point);  // without the colon
bool isXMLNameCharacter(char32_t point);

// Of well-formed names, the place of the colon, and 0 where there is none.
struct XMLNameShape {
  bool isName = false;
  size_t colon = 0;
};
// A name with at most one colon, which has a name on both sides.
XMLNameShape shapeOfXMLName(std::string_view bytes);

// The text in UTF-16, and the end of it; null where the bytes are not UTF-8 or stand for what is no
// character of XML. There must be room for a unit for each byte. Control characters are let pass.
char16_t* widenXML(std::string_view bytes, char16_t* units);

// How many units that makes of a text that is well formed.
size_t countXMLUnits(std::string_view bytes);

}  // namespace xquery

#include "Platform/Reading/DeclaredNames.h"

#include "Platform/Text/UTF8.h"
#include "Platform/Tree/ReservedNamespaces.h"

#include <algorithm>

namespace xquery {

namespace {

// What may stand in a name but not begin it.
bool isNeverFirst(char32_t point) {
  struct Range {
    char32_t first;
    char32_t last;
  };
  static constexpr Range ranges[] = {
      {'-', '.'}, {'0', '9'}, {0xB7, 0xB7}, {0x300, 0x36F}, {0x203F, 0x2040},
  };
  return std::any_of(std::begin(ranges), std::end(ranges), [=](const Range& range) {
    return range.first <= point && point <= range.last;
  });
}

// Of a text that is part of a Name.
bool isNCName(std::string_view part) {
  if (part.empty() || part.find(':') != part.npos) return false;
  const auto* at = reinterpret_cast<const unsigned char*>(part.data());
  return !isNeverFirst(readUTF8(at, at + part.size()));
}

bool mayBeDeclared(std::string_view prefix, std::string_view URI) {
  if (prefix == "xmlns" || URI == namespaceOfDeclarations) return false;
  if (prefix.empty()) return URI != namespaceOfXML;
  return !URI.empty() && (prefix == "xml") == (URI == namespaceOfXML);
}

}  // namespace

const char* faultOfDefault(std::string_view name, std::string_view value) {
  const size_t colon = name.find(':');
  const bool hasPrefix = colon != name.npos;
  const std::string_view prefix = name.substr(0, hasPrefix ? colon : 0);
  const std::string_view local = hasPrefix ? name.substr(colon + 1) : name;
  if ((hasPrefix && !isNCName(prefix)) || !isNCName(local)) {
    return "a defaulted attribute whose name is no qualified name";
  }
  const bool isDeclaration = prefix == "xmlns" || name == "xmlns";
  if (isDeclaration && !mayBeDeclared(hasPrefix ? local : "", value)) {
    return "a defaulted namespace declaration that is not allowed";
  }
  return nullptr;
}

}  // namespace xquery

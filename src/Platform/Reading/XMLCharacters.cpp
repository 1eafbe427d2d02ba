#include "Platform/Reading/XMLCharacters.h"

#include "Platform/Reading/Widening.h"
#include "Platform/Text/Blocks.h"
#include "Platform/Text/UTF8.h"

#include <algorithm>
#include <iterator>

namespace xquery {

namespace {

struct Range {
  char32_t first;
  char32_t last;
};

constexpr Range nameStarts[] = {
    {'A', 'Z'},       {'_', '_'},       {'a', 'z'},       {0xC0, 0xD6},     {0xD8, 0xF6},
    {0xF8, 0x2FF},    {0x370, 0x37D},   {0x37F, 0x1FFF},  {0x200C, 0x200D}, {0x2070, 0x218F},
    {0x2C00, 0x2FEF}, {0x3001, 0xD7FF}, {0xF900, 0xFDCF}, {0xFDF0, 0xFFFD}, {0x10000, 0xEFFFF},
};

// Those that may follow only.
constexpr Range nameOthers[] = {
    {'-', '.'}, {'0', '9'}, {0xB7, 0xB7}, {0x300, 0x36F}, {0x203F, 0x2040},
};

template <size_t Count>
bool isIn(const Range (&ranges)[Count], char32_t point) {
  const Range* const range =
      std::lower_bound(std::begin(ranges), std::end(ranges), point,
                       [](const Range& each, char32_t sought) { return each.last < sought; });
  return range != std::end(ranges) && range->first <= point;
}

}  // namespace

bool isXMLCharacter(char32_t point) {
  if (point < 0x20) return point == '\t' || point == '\n' || point == '\r';
  return point <= 0xD7FF || (point >= 0xE000 && point <= 0xFFFD) ||
         (point >= 0x10000 && point <= 0x10FFFF);
}

bool isXMLNameStart(char32_t point) {
  return isIn(nameStarts, point);
}

bool isXMLNameCharacter(char32_t point) {
  return isIn(nameStarts, point) || isIn(nameOthers, point);
}

XMLNameShape shapeOfXMLName(std::string_view bytes) {
  const auto* const begin = reinterpret_cast<const unsigned char*>(bytes.data());
  const unsigned char* const end = begin + bytes.size();
  XMLNameShape shape;
  bool isFirst = true;
  for (const unsigned char* at = begin; at < end;) {
    const char32_t point = readUTF8(at, end);
    if (point == ':') {
      if (isFirst || shape.colon) return {};
      shape.colon = static_cast<size_t>(at - begin) - 1;
      isFirst = true;
      continue;
    }
    if (point == invalidCodePoint) return {};
    if (!(isFirst ? isXMLNameStart(point) : isXMLNameCharacter(point))) return {};
    isFirst = false;
  }
  shape.isName = !isFirst;
  return shape;
}

char16_t* widenXML(std::string_view bytes, char16_t* units) {
  while (!bytes.empty()) {
    const Widened some = widenSome(bytes, units);
    if (!some.bytes) return nullptr;
    bytes.remove_prefix(some.bytes);
    units += some.units;
    checkUnits(static_cast<uint32_t>(some.bytes));
  }
  return units;
}

size_t countXMLUnits(std::string_view bytes) {
  size_t count = 0;
  inBlocks(bytes, [&count](std::string_view block) {
    uint32_t units = 0;
    for (const char byte : block) {
      const auto unsignedByte = static_cast<unsigned char>(byte);
      units += static_cast<uint32_t>((unsignedByte & 0xC0U) != 0x80) + (unsignedByte >= 0xF0);
    }
    count += units;
  });
  return count;
}

}  // namespace xquery

#include "Types/XQueryBinary.h"

#include "Platform/Base/WorkMeter.h"
#include "Types/NameCharacters.h"

#include <array>
#include <functional>

namespace xquery {

namespace {

constexpr uint8_t notADigit = 255;
constexpr std::string_view sHexDigitsCharacters = "0123456789abcdefABCDEF";
constexpr std::string_view upperHexDigits = "0123456789ABCDEF";
constexpr std::string_view sDataEncodeTable =
    "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789+/";

using DecodeTable = std::array<uint8_t, 128>;

constexpr DecodeTable makeHexTable() {
  DecodeTable table{};
  table.fill(notADigit);
  for (size_t index = 0; index < sHexDigitsCharacters.size(); ++index) {
    const size_t digit = index < 16 ? index : index - 6;
    table[static_cast<size_t>(sHexDigitsCharacters[index])] = static_cast<uint8_t>(digit);
  }
  return table;
}

constexpr DecodeTable makeDataDecodeTable() {
  DecodeTable table{};
  table.fill(notADigit);
  for (size_t index = 0; index < sDataEncodeTable.size(); ++index) {
    table[static_cast<size_t>(sDataEncodeTable[index])] = static_cast<uint8_t>(index);
  }
  table['='] = 0;
  return table;
}

constexpr DecodeTable sHexDecodeTable = makeHexTable();
constexpr DecodeTable sDataDecodeTable = makeDataDecodeTable();

uint8_t lookUp(const DecodeTable& table, char16_t unit) {
  return unit < table.size() ? table[unit] : notADigit;
}

}  // namespace

uint32_t XQueryBinary::hash() const {
  return static_cast<uint32_t>(std::hash<std::string_view>()(_data->bytes()));
}

std::string XQueryHexEncode(std::string_view bytes) {
  std::string text;
  text.reserve(bytes.size() * 2);
  WorkPacer pacer;
  for (const char byte : bytes) {
    pacer.turn();
    const auto value = static_cast<unsigned char>(byte);
    text += upperHexDigits[value >> 4];
    text += upperHexDigits[value & 15];
  }
  return text;
}

std::string Base64Encode(std::string_view bytes) {
  std::string text;
  text.reserve((bytes.size() + 2) / 3 * 4);
  WorkPacer pacer;
  for (size_t from = 0; from < bytes.size(); from += 3) {
    pacer.turn();
    const size_t count = std::min<size_t>(3, bytes.size() - from);
    uint32_t group = 0;
    for (size_t index = 0; index < 3; ++index) {
      group = group << 8 | (index < count ? static_cast<unsigned char>(bytes[from + index]) : 0);
    }
    for (size_t index = 0; index < 4; ++index) {
      text += index <= count ? sDataEncodeTable[group >> (18 - 6 * index) & 63] : '=';
    }
  }
  return text;
}

// The pad count is of the "=" seen since the last character that was neither "=" nor white space,
// so a stray character between two "=" makes the first one an ordinary zero digit.
bool Base64Decode(NSStringView text, std::string& bytes) {
  bytes.clear();
  bytes.reserve(text.length() / 4 * 3);
  uint32_t group = 0;
  uint32_t accepted = 0;
  uint32_t pads = 0;
  WorkPacer pacer;
  for (uint32_t index = 0; index < text.length(); ++index) {
    pacer.turn();
    const char16_t unit = text[index];
    if (unit >= 128) return false;
    if (unit == u'=') {
      ++pads;
    } else if (!XQueryIsWhiteSpace(unit)) {
      pads = 0;
    }
    const uint8_t digit = lookUp(sDataDecodeTable, unit);
    if (digit == notADigit) continue;
    group = group << 6 | digit;
    if (++accepted % 4 != 0) continue;
    bytes += static_cast<char>(group >> 16 & 255);
    if (pads < 2) bytes += static_cast<char>(group >> 8 & 255);
    if (pads < 1) bytes += static_cast<char>(group & 255);
    group = 0;
  }
  return accepted % 4 == 0;
}

Ref<XQueryHexBinary> XQueryHexBinary::binaryWithData(const Ref<NSData>& data) {
  return make<XQueryHexBinary>(data);
}

Ref<XQueryHexBinary> XQueryHexBinary::binaryWithString(NSStringView text) {
  std::string bytes;
  bytes.reserve(text.length() / 2);
  uint8_t high = notADigit;
  WorkPacer pacer;
  for (uint32_t index = 0; index < text.length(); ++index) {
    pacer.turn();
    const char16_t unit = text[index];
    if (XQueryIsWhiteSpace(unit)) continue;
    const uint8_t digit = lookUp(sHexDecodeTable, unit);
    if (digit == notADigit) return nullptr;
    if (high == notADigit) {
      high = digit;
    } else {
      bytes += static_cast<char>(high << 4 | digit);
      high = notADigit;
    }
  }
  if (high != notADigit) return nullptr;
  return make<XQueryHexBinary>(NSData::dataWithBytes(std::move(bytes)));
}

Ref<NSString> XQueryHexBinary::stringValue() const {
  return NSString::stringWithASCII(XQueryHexEncode(data()->bytes()));
}

Ref<XQueryBase64Binary> XQueryBase64Binary::binaryWithData(const Ref<NSData>& data) {
  return make<XQueryBase64Binary>(data);
}

Ref<XQueryBase64Binary> XQueryBase64Binary::binaryWithString(NSStringView text) {
  std::string bytes;
  if (!Base64Decode(text, bytes)) return nullptr;
  return make<XQueryBase64Binary>(NSData::dataWithBytes(std::move(bytes)));
}

Ref<NSString> XQueryBase64Binary::stringValue() const {
  return NSString::stringWithASCII(Base64Encode(data()->bytes()));
}

}  // namespace xquery

// Scanning and printing of numbers. Digits are the C++ library's shortest round-trip ones; nothing
// here depends on the locale of the process.
#include "Platform/Numbers/NumberText.h"

#include "Platform/Base/WorkMeter.h"
#include "xquery/Number.h"

#include <algorithm>
#include <charconv>
#include <cmath>
#include <limits>
#include <optional>
#include <string>

namespace xquery {

namespace {

constexpr int64_t exponentBound = 1'000'000'000'000;

bool isWhite(char16_t unit) {
  return unit == ' ' || unit == '\t' || unit == '\n' || unit == '\r';
}
bool isDigit(char16_t unit) {
  return unit >= '0' && unit <= '9';
}

template <class Unit>
struct Scanner {
  const Unit* text;
  uint32_t length;
  uint32_t position = 0;

  char16_t unit(uint32_t at) const { return at < length ? static_cast<char16_t>(text[at]) : 0; }
  void skip(bool (*isSkipped)(char16_t)) {
    WorkPacer pacer;
    for (; isSkipped(unit(position)); ++position) pacer.turn();
  }
  // Whether a minus was skipped.
  bool skipSign() {
    const char16_t sign = unit(position);
    if (sign == '-' || sign == '+') ++position;
    return sign == '-';
  }
};

// "e", a sign and digits; without digits the exponent is no part of the number.
template <class Unit>
void findExponent(Scanner<Unit>& scanner, NumberExtent& extent) {
  const char16_t mark = scanner.unit(scanner.position);
  if (mark != 'e' && mark != 'E') return;
  ++scanner.position;
  const bool negative = scanner.skipSign();
  const uint32_t first = scanner.position;
  WorkPacer pacer;
  for (; isDigit(scanner.unit(scanner.position)); ++scanner.position) {
    pacer.turn();
    if (extent.exponent < exponentBound) {
      extent.exponent = extent.exponent * 10 + (scanner.unit(scanner.position) - '0');
    }
  }
  if (scanner.position > first) extent.end = scanner.position;
  if (negative) extent.exponent = -extent.exponent;
}

template <class Unit>
bool findNumberIn(const Unit* text, uint32_t length, NumberExtent& extent) {
  Scanner<Unit> scanner{text, length};
  scanner.skip(isWhite);
  extent.negative = scanner.skipSign();
  extent.digits = scanner.position;
  scanner.skip(isDigit);
  extent.point = scanner.position;
  uint32_t digitCount = extent.point - extent.digits;
  if (scanner.unit(scanner.position) == '.') {
    ++scanner.position;
    scanner.skip(isDigit);
    digitCount += scanner.position - extent.point - 1;
  }
  extent.mantissaEnd = scanner.position;
  extent.end = scanner.position;
  if (digitCount == 0) return false;
  findExponent(scanner, extent);
  return true;
}

// The digits of a number that decide which double is nearest: those from the first that is not zero
// on, as many as the exact value of a point halfway between two doubles may have. Of more it counts
// only whether any is not zero, which a last digit of 1 says as well.
struct LeadingDigits {
  static constexpr size_t most = 800;
  std::string text;
  int64_t exponent = 0;  // of ten, that the text as an integer is multiplied by

  template <class Unit>
  LeadingDigits(const Unit* number, const NumberExtent& extent) {
    int64_t dropped = 0;
    bool dropsSome = false;  // other than zeros
    WorkPacer pacer;
    for (uint32_t at = extent.digits; at < extent.mantissaEnd; ++at) {
      pacer.turn();
      if (at == extent.point) continue;
      const auto digit = static_cast<char>(number[at]);
      if (text.empty() && digit == '0') continue;
      if (text.size() < most) {
        text += digit;
      } else {
        ++dropped;
        dropsSome = dropsSome || digit != '0';
      }
    }
    if (dropsSome) {
      text += '1';
      --dropped;
    }
    const uint32_t point = std::min(extent.point + 1, extent.mantissaEnd);
    exponent = extent.exponent + dropped - static_cast<int64_t>(extent.mantissaEnd - point);
  }
};

double doubleOf(const LeadingDigits& digits) {
  // Far outside what a double holds, and within what its reader takes for an exponent.
  constexpr int64_t farExponent = 10000;
  if (digits.text.empty()) return 0;
  const int64_t exponent = std::clamp(digits.exponent, -farExponent, farExponent);
  const std::string text = digits.text + 'e' + std::to_string(exponent);
  double value = 0;
  const std::from_chars_result read =
      std::from_chars(text.data(), text.data() + text.size(), value, std::chars_format::general);
  if (read.ec != std::errc::result_out_of_range) return value;
  // The reader does not tell overflow from underflow.
  const bool isLarge = static_cast<int64_t>(digits.text.size()) + digits.exponent > 0;
  return isLarge ? std::numeric_limits<double>::infinity() : 0;
}

// Of a short number, which its reader takes as it stands: that is what most are.
std::optional<double> readShort(NSStringView text, const NumberExtent& extent) {
  constexpr uint32_t longest = 64;
  const uint32_t length = extent.end - extent.digits;
  if (length > longest) return std::nullopt;
  char narrow[longest];
  const char* first = narrow;
  if (text.isWide()) {
    std::copy_n(text.wideUnits() + extent.digits, length, narrow);
  } else {
    first = text.asciiUnits() + extent.digits;
  }
  double value = 0;
  const std::from_chars_result read =
      std::from_chars(first, first + length, value, std::chars_format::general);
  if (read.ec == std::errc::result_out_of_range) return std::nullopt;
  return value;
}

// Shortest digits, plain for decimal exponents from -4 to 16.
template <class Float>
std::string formatShortest(Float value) {
  char buffer[64];
  // Whole numbers that the type holds exactly are their own shortest digits; not so minus zero.
  constexpr Float exactIntegers = 1 << std::min(std::numeric_limits<Float>::digits, 30);
  if (value == std::trunc(value) && std::abs(value) < exactIntegers && value != 0) {
    return {buffer, std::to_chars(buffer, buffer + sizeof buffer, static_cast<int64_t>(value)).ptr};
  }
  const std::to_chars_result written =
      std::to_chars(buffer, buffer + sizeof buffer, value, std::chars_format::scientific);
  const std::string_view text(buffer, static_cast<size_t>(written.ptr - buffer));
  const size_t mark = text.find('e');
  if (mark == std::string_view::npos) return std::string(text);
  int exponent = 0;
  const size_t exponentDigits = text[mark + 1] == '+' ? mark + 2 : mark + 1;
  std::from_chars(text.data() + exponentDigits, text.data() + text.size(), exponent);
  if (exponent < -4 || exponent > 16) return std::string(text);

  std::string out;
  std::string digits;
  for (const char character : text.substr(0, mark)) {
    if (character == '-') {
      out += '-';
    } else if (character != '.') {
      digits += character;
    }
  }
  const int count = static_cast<int>(digits.size());
  if (exponent < 0)
    return out + "0." + std::string(static_cast<size_t>(-exponent - 1), '0') + digits;
  if (count <= exponent + 1)
    return out + digits + std::string(static_cast<size_t>(exponent + 1 - count), '0');
  return out + digits.insert(static_cast<size_t>(exponent) + 1, 1, '.');
}

}  // namespace

bool findNumber(NSStringView text, NumberExtent& extent) {
  return text.isWide() ? findNumberIn(text.wideUnits(), text.length(), extent)
                       : findNumberIn(text.asciiUnits(), text.length(), extent);
}

uint32_t hashDouble(double value) {
  if (std::isnan(value)) return 0x7FF80000U;
  if (value == 0) value = 0;  // minus zero equals zero
  uint64_t bits = 0;
  std::memcpy(&bits, &value, sizeof bits);
  bits *= 0x9E3779B97F4A7C15ULL;
  return static_cast<uint32_t>(bits >> 32);
}

bool scanDouble(NSStringView text, double& out) {
  NumberExtent extent;
  if (!findNumber(text, extent)) return false;
  std::optional<double> value = readShort(text, extent);
  if (!value) {
    value = doubleOf(text.isWide() ? LeadingDigits(text.wideUnits(), extent)
                                   : LeadingDigits(text.asciiUnits(), extent));
  }
  out = extent.negative ? -*value : *value;
  return true;
}

std::string formatDouble(double value) {
  return formatShortest(value);
}

std::string formatFloat(float value) {
  return formatShortest(value);
}

}  // namespace xquery

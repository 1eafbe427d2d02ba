// Scanning and printing of numbers. Digits are the C++ library's shortest round-trip ones; nothing
// here depends on the locale of the process.
#include "Platform/Numbers/NumberText.h"

#include "xquery/Number.h"

#include <charconv>
#include <cmath>
#include <limits>

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
  void skipDigits() {
    while (isDigit(unit(position))) ++position;
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
  for (; isDigit(scanner.unit(scanner.position)); ++scanner.position) {
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
  while (isWhite(scanner.unit(scanner.position))) ++scanner.position;
  extent.negative = scanner.skipSign();
  extent.digits = scanner.position;
  scanner.skipDigits();
  extent.point = scanner.position;
  uint32_t digitCount = extent.point - extent.digits;
  if (scanner.unit(scanner.position) == '.') {
    ++scanner.position;
    scanner.skipDigits();
    digitCount += scanner.position - extent.point - 1;
  }
  extent.mantissaEnd = scanner.position;
  extent.end = scanner.position;
  if (digitCount == 0) return false;
  findExponent(scanner, extent);
  return true;
}

// The reader does not tell overflow from underflow: the decimal exponent of the first digit that is
// not zero does.
bool isAboveOne(std::string_view mantissa, int64_t exponent) {
  const size_t point = std::min(mantissa.find('.'), mantissa.size());
  const size_t first = mantissa.find_first_not_of("0.");
  if (first == std::string_view::npos) return false;
  const int64_t place = first < point ? static_cast<int64_t>(point - first) - 1
                                      : -static_cast<int64_t>(first - point);
  return place + exponent >= 0;
}

double readDouble(std::string_view text, const NumberExtent& extent) {
  double value = 0;
  const std::from_chars_result read =
      std::from_chars(text.data(), text.data() + text.size(), value, std::chars_format::general);
  if (read.ec == std::errc::result_out_of_range) {
    const std::string_view mantissa = text.substr(0, extent.mantissaEnd - extent.digits);
    value = isAboveOne(mantissa, extent.exponent) ? std::numeric_limits<double>::infinity() : 0.0;
  }
  return extent.negative ? -value : value;
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
  const NSStringView number = text.substring(extent.digits, extent.end - extent.digits);
  if (number.isWide()) {
    out = readDouble(number.utf8(), extent);
  } else {
    out = readDouble({number.asciiUnits(), number.length()}, extent);
  }
  return true;
}

std::string formatDouble(double value) {
  return formatShortest(value);
}

std::string formatFloat(float value) {
  return formatShortest(value);
}

}  // namespace xquery

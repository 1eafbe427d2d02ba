#include "support/SlowDecimal.h"

#include <algorithm>
#include <cstdlib>
#include <vector>

namespace xquery::fuzz {

namespace {

constexpr size_t mostQuotientDigits = 38;
constexpr int mostExponent = 400;

std::string stripped(std::string digits) {
  const size_t first = digits.find_first_not_of('0');
  return first == std::string::npos ? "0" : digits.substr(first);
}

// --- whole numbers without a sign, as digits without leading zeros ---

int compareDigits(const std::string& a, const std::string& b) {
  if (a.size() != b.size()) return a.size() < b.size() ? -1 : 1;
  return a < b ? -1 : a == b ? 0 : 1;
}

std::string sum(const std::string& a, const std::string& b) {
  std::string result;
  int carry = 0;
  for (size_t i = 0; i < std::max(a.size(), b.size()) || carry; ++i) {
    int digit = carry;
    if (i < a.size()) digit += a[a.size() - 1 - i] - '0';
    if (i < b.size()) digit += b[b.size() - 1 - i] - '0';
    result += static_cast<char>('0' + digit % 10);
    carry = digit / 10;
  }
  std::reverse(result.begin(), result.end());
  return stripped(result);
}

// `a` is not less than `b`.
std::string difference(const std::string& a, const std::string& b) {
  std::string result = a;
  int borrow = 0;
  for (size_t i = 0; i < a.size(); ++i) {
    char& digit = result[a.size() - 1 - i];
    int value = digit - '0' - borrow - (i < b.size() ? b[b.size() - 1 - i] - '0' : 0);
    borrow = value < 0 ? 1 : 0;
    digit = static_cast<char>('0' + value + 10 * borrow);
  }
  return stripped(result);
}

std::string product(const std::string& a, const std::string& b) {
  std::vector<int> digits(a.size() + b.size());
  for (size_t i = 0; i < a.size(); ++i) {
    for (size_t j = 0; j < b.size(); ++j) digits[i + j + 1] += (a[i] - '0') * (b[j] - '0');
  }
  for (size_t i = digits.size(); i-- > 1;) {
    digits[i - 1] += digits[i] / 10;
    digits[i] %= 10;
  }
  std::string result;
  for (const int digit : digits) result += static_cast<char>('0' + digit);
  return stripped(result);
}

// The digit of the quotient that takes the remainder below the divisor.
char digitOf(std::string& remainder, const std::string& divisor) {
  char digit = '0';
  for (; compareDigits(remainder, divisor) >= 0; ++digit) {
    remainder = difference(remainder, divisor);
  }
  return digit;
}

std::string quotient(const std::string& dividend, const std::string& divisor,
                     std::string& remainder) {
  std::string result;
  remainder = "0";
  for (const char digit : dividend) {
    remainder = stripped(remainder + digit);
    result += digitOf(remainder, divisor);
  }
  return stripped(result);
}

bool isDigit(std::string_view text, size_t at) {
  return at < text.size() && text[at] >= '0' && text[at] <= '9';
}

std::string takeDigits(std::string_view text, size_t& at) {
  const size_t start = at;
  while (isDigit(text, at)) ++at;
  return std::string(text.substr(start, at - start));
}

// The exponent at the place, 0 where there is none.
int takeExponent(std::string_view text, size_t at) {
  if (at >= text.size() || (text[at] != 'e' && text[at] != 'E')) return 0;
  ++at;
  const bool isNegative = at < text.size() && text[at] == '-';
  if (at < text.size() && (text[at] == '-' || text[at] == '+')) ++at;
  const std::string digits = stripped(takeDigits(text, at));
  const int value = digits.size() > 6 ? 1'000'000 : std::atoi(digits.c_str());
  return isNegative ? -value : value;
}

}  // namespace

SlowDecimal::SlowDecimal(bool negative, std::string digits, size_t scale)
    : _digits(stripped(std::move(digits))), _scale(scale) {
  while (_scale > 0 && _digits.back() == '0' && _digits != "0") {
    _digits.pop_back();
    --_scale;
  }
  if (isZero()) _scale = 0;
  _negative = negative && !isZero();
}

bool SlowDecimal::scan(std::string_view text, SlowDecimal& out, bool& tooLong) {
  tooLong = false;
  size_t at = std::min(text.find_first_not_of(" \t\n\r"), text.size());
  const bool isNegative = at < text.size() && text[at] == '-';
  if (at < text.size() && (text[at] == '-' || text[at] == '+')) ++at;
  std::string digits = takeDigits(text, at);
  std::string fraction;
  if (at < text.size() && text[at] == '.' && (!digits.empty() || isDigit(text, at + 1))) {
    ++at;
    fraction = takeDigits(text, at);
  }
  if (digits.empty() && fraction.empty()) return false;
  const int exponent = takeExponent(text, at);
  tooLong = exponent > mostExponent || exponent < -mostExponent;
  if (tooLong) return true;
  digits += fraction;
  int scale = static_cast<int>(fraction.size()) - exponent;
  if (scale < 0) digits += std::string(static_cast<size_t>(-scale), '0');
  out = SlowDecimal(isNegative, digits, static_cast<size_t>(std::max(scale, 0)));
  return true;
}

SlowDecimal SlowDecimal::negated() const {
  return {!_negative, _digits, _scale};
}

SlowDecimal SlowDecimal::plus(const SlowDecimal& other) const {
  const size_t scale = std::max(_scale, other._scale);
  const std::string a = digitsAtScale(scale);
  const std::string b = other.digitsAtScale(scale);
  if (_negative == other._negative) return {_negative, sum(a, b), scale};
  return compareDigits(a, b) >= 0 ? SlowDecimal(_negative, difference(a, b), scale)
                                  : SlowDecimal(other._negative, difference(b, a), scale);
}

SlowDecimal SlowDecimal::times(const SlowDecimal& other) const {
  return {_negative != other._negative, product(_digits, other._digits), _scale + other._scale};
}

SlowDecimal SlowDecimal::wholeQuotient(const SlowDecimal& divisor) const {
  const size_t scale = std::max(_scale, divisor._scale);
  std::string rest;
  return {_negative != divisor._negative,
          quotient(digitsAtScale(scale), divisor.digitsAtScale(scale), rest), 0};
}

SlowDecimal SlowDecimal::dividedBy(const SlowDecimal& divisor) const {
  const bool isNegative = _negative != divisor._negative;
  const size_t scale = std::max(_scale, divisor._scale);
  const std::string by = divisor.digitsAtScale(scale);
  std::string rest;
  std::string digits = quotient(digitsAtScale(scale), by, rest);
  // A quotient that ends does so after as many digits as the divisor has factors of two or five.
  const size_t longest = 4 * by.size() + 4;
  size_t behind = 0;
  for (std::string left = rest; left != "0" && behind < longest; ++behind) {
    left = stripped(left + '0');
    digits += digitOf(left, by);
    if (left == "0") return {isNegative, digits, behind + 1};
  }
  if (rest == "0") return {isNegative, digits, 0};
  digits = quotient(digitsAtScale(scale), by, rest);
  for (behind = 0; stripped(digits).size() <= mostQuotientDigits || stripped(digits) == "0";
       ++behind) {
    rest = stripped(rest + '0');
    digits += digitOf(rest, by);
  }
  const auto extra = static_cast<int>(stripped(digits).size() - mostQuotientDigits);
  return SlowDecimal(isNegative, digits, behind)
      .rounded(static_cast<int>(behind) - extra, Rounding::HalfAwayFromZero);
}

SlowDecimal SlowDecimal::rounded(int scale, Rounding rounding) const {
  const int dropped = static_cast<int>(_scale) - scale;
  if (dropped <= 0) return *this;
  std::string digits = _digits;
  if (digits.size() <= static_cast<size_t>(dropped)) {
    digits.insert(0, static_cast<size_t>(dropped) + 1 - digits.size(), '0');
  }
  std::string kept = digits.substr(0, digits.size() - static_cast<size_t>(dropped));
  const std::string lost = digits.substr(kept.size());
  const std::string half = "5" + std::string(lost.size() - 1, '0');
  const bool isExact = stripped(lost) == "0";
  const bool isOdd = (kept.back() - '0') % 2 != 0;
  bool goesUp = false;  // away from zero
  switch (rounding) {
    case Rounding::TowardZero:
      break;
    case Rounding::Floor:
      goesUp = _negative && !isExact;
      break;
    case Rounding::Ceiling:
      goesUp = !_negative && !isExact;
      break;
    case Rounding::HalfAwayFromZero:
      goesUp = lost >= half;
      break;
    case Rounding::HalfUp:
      goesUp = lost > half || (lost == half && !_negative);
      break;
    case Rounding::HalfEven:
      goesUp = lost > half || (lost == half && isOdd);
      break;
  }
  if (goesUp) kept = sum(kept, "1");
  if (scale < 0) kept += std::string(static_cast<size_t>(-scale), '0');
  return {_negative, kept, static_cast<size_t>(std::max(scale, 0))};
}

int SlowDecimal::compare(const SlowDecimal& other) const {
  const SlowDecimal rest = minus(other);
  return rest.isZero() ? 0 : rest._negative ? -1 : 1;
}

std::string SlowDecimal::text() const {
  std::string text = _digits;
  if (text.size() <= _scale) text.insert(0, _scale + 1 - text.size(), '0');
  if (_scale > 0) text.insert(text.size() - _scale, 1, '.');
  return _negative ? "-" + text : text;
}

}  // namespace xquery::fuzz

// Decimals beside a slow model, and how doubles print. The first line and the second are numbers as
// text, of which the engine and the model take what they take for one; what is left says how to
// round.
#include "Platform/Numbers/NSDecimal.h"
#include "Platform/Numbers/NumberText.h"
#include "support/Failure.h"
#include "support/Input.h"
#include "support/SlowDecimal.h"

#include <charconv>
#include <cmath>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <string>

using namespace xquery;
using namespace xquery::fuzz;

namespace {

constexpr size_t longestText = 400;
constexpr size_t longestDivisor = 120;  // its quotients may have four times as many digits

struct Both {
  NSDecimal fast;
  SlowDecimal slow;
};

void checkSame(const NSDecimal& fast, const SlowDecimal& slow, const char* what, const Both& a,
               const Both& b) {
  if (fast.toString() == slow.text()) return;
  fail(what, a.slow.text() + "\n" + b.slow.text() + "\nfound    " + fast.toString() +
                 "\nexpected " + slow.text());
}

// What is no ASCII stands in no number: its bytes become blanks, which end one.
std::string asciiOf(std::string_view text) {
  std::string ascii(text.substr(0, longestText));
  for (char& c : ascii) c = static_cast<unsigned char>(c) < 0x80 ? c : ' ';
  return ascii;
}

// A double is read by the same rule: as the one that is nearest to the number.
void checkDouble(const std::string& text, bool isNumber, const SlowDecimal* slow) {
  double value = 0;
  check(scanDouble(NSStringView::ascii(text), value) == isNumber, "a double to one of them", text);
  if (!isNumber) return;
  if (slow) {
    check(value == std::strtod(slow->text().c_str(), nullptr), "read as another double", text);
  } else {
    check(!std::isnan(value), "a number is read as none", text);
  }
}

bool read(std::string_view line, Both& out) {
  const std::string text = asciiOf(line);
  bool tooLong = false;
  const bool isNumber = SlowDecimal::scan(text, out.slow, tooLong);
  const bool isTaken = NSDecimal::scan(NSStringView::ascii(text), out.fast);
  checkDouble(text, isNumber, tooLong ? nullptr : &out.slow);
  if (tooLong) return false;
  check(isTaken == isNumber, "a number to one of them", text);
  if (isNumber) checkSame(out.fast, out.slow, "read differently", out, out);
  return isNumber;
}

void checkArithmetic(const Both& a, const Both& b) {
  checkSame(a.fast.add(b.fast), a.slow.plus(b.slow), "sum", a, b);
  checkSame(a.fast.subtract(b.fast), a.slow.minus(b.slow), "difference", a, b);
  checkSame(a.fast.multiply(b.fast), a.slow.times(b.slow), "product", a, b);
  check(a.fast.compare(b.fast) == a.slow.compare(b.slow), "compared", a.slow.text());
  check(a.fast.compare(a.fast) == 0 && b.fast.compare(a.fast) == -a.fast.compare(b.fast),
        "compared with itself, or the other way round", a.slow.text());
  if (b.slow.isZero() || a.slow.length() + b.slow.length() > longestDivisor) return;
  checkSame(a.fast.divide(b.fast), a.slow.dividedBy(b.slow), "quotient", a, b);
  checkSame(a.fast.integerDivide(b.fast), a.slow.wholeQuotient(b.slow), "whole quotient", a, b);
  checkSame(a.fast.remainder(b.fast), a.slow.remainder(b.slow), "remainder", a, b);
}

void checkRounding(const Both& a, int scale) {
  using Slow = SlowDecimal::Rounding;
  constexpr std::pair<NSRoundingMode, Slow> modes[] = {
      {NSRoundingMode::TowardZero, Slow::TowardZero},
      {NSRoundingMode::Floor, Slow::Floor},
      {NSRoundingMode::Ceiling, Slow::Ceiling},
      {NSRoundingMode::HalfAwayFromZero, Slow::HalfAwayFromZero},
      {NSRoundingMode::HalfUp, Slow::HalfUp},
      {NSRoundingMode::HalfEven, Slow::HalfEven}};
  for (const auto& [mode, slow] : modes) {
    checkSame(a.fast.rounded(scale, mode), a.slow.rounded(scale, slow), "rounded", a, a);
  }
  check(a.fast.isInteger() == (a.slow.rounded(0, Slow::TowardZero).compare(a.slow) == 0),
        "an integer to one of them", a.slow.text());
}

void checkConversions(const Both& a) {
  const std::string text = a.slow.text();
  const double expected = std::strtod(text.c_str(), nullptr);
  check(a.fast.doubleValue() == expected, "nearest double", text);
  check(a.fast.sign() == (a.slow.isZero() ? 0 : a.slow.isNegative() ? -1 : 1), "sign", text);
  const std::string whole = a.slow.rounded(0, SlowDecimal::Rounding::TowardZero).text();
  int64_t small = 0;
  const auto end = std::from_chars(whole.data(), whole.data() + whole.size(), small);
  if (end.ec != std::errc()) small = a.slow.isNegative() ? INT64_MIN : INT64_MAX;
  check(a.fast.int64Value() == small, "64-bit integer", text);
}

std::string digitsOf(std::string text) {
  text = text.substr(0, text.find_first_of("eE"));
  std::erase_if(text, [](char c) { return c < '0' || c > '9'; });
  text.erase(0, std::min(text.find_first_not_of('0'), text.size()));
  while (!text.empty() && text.back() == '0') text.pop_back();
  return text;
}

// The fewest digits that read back as the number, and its exponent with that many.
int fewestDigits(double value, bool isFloat, int& exponent) {
  for (int digits = 1;; ++digits) {
    char text[64];
    std::snprintf(text, sizeof text, "%.*e", digits - 1, value);
    exponent = std::atoi(std::strchr(text, 'e') + 1);
    const bool isSame = isFloat ? std::strtof(text, nullptr) == static_cast<float>(value)
                                : std::strtod(text, nullptr) == value;
    if (isSame || digits == 17) return digits;
  }
}

void checkPrinting(double value, bool isFloat) {
  const std::string text = isFloat ? formatFloat(static_cast<float>(value)) : formatDouble(value);
  const double again =
      isFloat ? double{std::strtof(text.c_str(), nullptr)} : std::strtod(text.c_str(), nullptr);
  check(again == value, "printed and read back as another number", text);
  double scanned = 0;
  check(scanDouble(NSStringView::ascii(text), scanned), "printed as no number", text);
  // The digits of a float are enough for a float.
  check((isFloat ? double{static_cast<float>(scanned)} : scanned) == value,
        "scanned as another number", text);
  if (value == 0) return;
  int exponent = 0;
  const int fewest = fewestDigits(value, isFloat, exponent);
  check(static_cast<int>(digitsOf(text).size()) <= fewest, "printed with more digits", text);
  const size_t mark = text.find('e');
  const bool isPlain = exponent >= -4 && exponent <= 16;
  check((mark == std::string::npos) == isPlain, "laid out otherwise", text);
  if (isPlain) return;
  const std::string_view tail = std::string_view(text).substr(mark + 1);
  check(tail.size() >= 3 && (tail[0] == '+' || tail[0] == '-'), "an exponent without a sign", text);
}

// Infinities and what is no number print as nothing that is read as one.
void checkSpecial(double value) {
  for (const std::string& text : {formatDouble(value), formatFloat(static_cast<float>(value))}) {
    double scanned = 0;
    check(!text.empty() && !scanDouble(NSStringView::ascii(text), scanned), "read as a number",
          text);
  }
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  Input input(data, size);
  Both a;
  Both b;
  if (!read(input.line(), a)) return 0;
  checkConversions(a);
  if (!read(input.line(), b)) b = a;
  checkArithmetic(a, b);
  checkRounding(a, static_cast<int>(static_cast<int8_t>(input.byte())));
  uint64_t bits = 0;
  const std::string_view raw = input.bytes(sizeof bits);
  std::memcpy(&bits, raw.data(), raw.size());
  double value = 0;
  std::memcpy(&value, &bits, sizeof value);
  for (const double each : {value, a.fast.doubleValue(), a.fast.doubleValue() / 3}) {
    if (std::isfinite(each)) {
      checkPrinting(each, false);
    } else {
      checkSpecial(each);
    }
    // What a float does not hold is infinite.
    const auto single = static_cast<float>(each);
    if (std::isfinite(single)) checkPrinting(double{single}, true);
  }
  return 0;
}

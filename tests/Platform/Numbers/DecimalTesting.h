// What tests of decimals share: reading them, and a reference to compare with.
#pragma once

#include "Platform/Numbers/NSDecimal.h"

#include <gtest/gtest.h>

#include <cstdint>
#include <random>
#include <string>
#include <string_view>

namespace xquery::decimaltest {

__extension__ using Int128 = __int128;

inline NSDecimal decimal(std::string_view text) {
  NSDecimal value = NSDecimal::notANumber();
  EXPECT_TRUE(NSDecimal::scan(NSStringView::ascii(text), value)) << text;
  return value;
}

// The reference implementation works on 128-bit integers and knows nothing of the engine's.
inline std::string textOf(Int128 value, int scale) {
  const bool negative = value < 0;
  std::string digits;
  for (Int128 rest = negative ? -value : value; rest != 0; rest /= 10) {
    digits.insert(digits.begin(), static_cast<char>('0' + static_cast<int>(rest % 10)));
  }
  while (static_cast<int>(digits.size()) <= scale) digits.insert(digits.begin(), '0');
  if (scale > 0) {
    digits.insert(digits.size() - static_cast<size_t>(scale), 1, '.');
    digits.resize(digits.find_last_not_of('0') + 1);
    if (digits.back() == '.') digits.pop_back();
  }
  return negative && digits != "0" ? "-" + digits : digits;
}

inline Int128 powerOfTen(int exponent) {
  Int128 power = 1;
  while (exponent-- > 0) power *= 10;
  return power;
}

// A coefficient and a scale, small enough for the reference.
struct Sample {
  int64_t coefficient;
  int scale;
  NSDecimal value() const { return decimal(textOf(coefficient, scale)); }
};

inline Sample randomSample(std::mt19937_64& random) {
  const int bits = static_cast<int>(random() % 63) + 1;
  auto coefficient = static_cast<int64_t>(random() >> (64 - bits));
  if (random() % 2) coefficient = -coefficient;
  return {coefficient, static_cast<int>(random() % 16)};
}

inline std::string randomDigits(std::mt19937_64& random, size_t count) {
  std::string digits;
  for (size_t index = 0; index < count; ++index) {
    digits += static_cast<char>('0' + static_cast<int>(random() % 10));
  }
  return digits;
}

}  // namespace xquery::decimaltest

// What decimals and platform numbers share: reading digits and the hash of a numeric value.
#pragma once

#include "Platform/Numbers/NSDecimal.h"

#include <cstdint>
#include <string>

namespace xquery {

// The parts of a number at the start of a text, as positions in it.
struct NumberExtent {
  bool negative = false;
  uint32_t digits = 0;       // first digit or point, after the sign
  uint32_t point = 0;        // position of the point, or where it would stand
  uint32_t mantissaEnd = 0;  // after the last digit of the fraction
  uint32_t end = 0;          // after the exponent
  int64_t exponent = 0;      // as written, saturated far outside every range
};

// Finds the longest prefix that is a number after leading white space: a sign, digits, a fraction
// and an exponent; a mantissa needs a digit, before or after the point. False when there is none.
bool findNumber(NSStringView text, NumberExtent& extent);

// Equal numbers hash alike whatever their storage, because all hash as the double nearest to them.
uint32_t hashDouble(double value);
// Of every digit: decimals that are equal as doubles differ in it.
uint64_t hashDigits(const NSDecimal& value);

// Scans a double by the same rule as NSDecimal::scan. "inf", "nan" and hexadecimal forms are not
// numbers; what overflows becomes an infinity.
bool scanDouble(NSStringView text, double& out);
// The printing rule of `stringValue` for a finite double or float.
std::string formatDouble(double value);
std::string formatFloat(float value);

}  // namespace xquery

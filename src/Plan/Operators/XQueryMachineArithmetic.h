// Arithmetic on machine numbers, where it is what the operators answer.
#pragma once

#include "Expr/Operators/XQueryArithmetic.h"
#include "Expr/Operators/XQueryOperatorExpr.h"

#include <cmath>
#include <cstdint>
#include <optional>

namespace xquery {

// Of two integers of a machine word; nothing where the result is beyond it, where there is none,
// and for "div", whose answer is a decimal.
inline std::optional<int64_t> XQueryIntegerResult(int type, int64_t a, int64_t b) {
  int64_t result = 0;
  switch (type) {
    case XQueryOperatorPlus:
      return __builtin_add_overflow(a, b, &result) ? std::nullopt : std::optional(result);
    case XQueryOperatorMinus:
      return __builtin_sub_overflow(a, b, &result) ? std::nullopt : std::optional(result);
    case XQueryOperatorMultiply:
      return __builtin_mul_overflow(a, b, &result) ? std::nullopt : std::optional(result);
    case XQueryOperatorIDiv:
    case XQueryOperatorMod:
      // Dividing by -1 is left out: the smallest integer has no counterpart.
      if (b == 0 || b == -1) return std::nullopt;
      // Dividing halves of words takes a fraction of the time.
      if (((static_cast<uint64_t>(a) | static_cast<uint64_t>(b)) >> 32) == 0) {
        const auto dividend = static_cast<uint32_t>(a);
        const auto divisor = static_cast<uint32_t>(b);
        return type == XQueryOperatorIDiv ? dividend / divisor : dividend % divisor;
      }
      return type == XQueryOperatorIDiv ? a / b : a % b;
    default:
      return std::nullopt;
  }
}

// Of two doubles; nothing for "idiv", whose answer is an integer of any size.
inline std::optional<double> XQueryDoubleResult(int type, double a, double b) {
  switch (type) {
    case XQueryOperatorPlus:
      return a + b;
    case XQueryOperatorMinus:
      return a - b;
    case XQueryOperatorMultiply:
      return a * b;
    case XQueryOperatorDiv:
      return XQueryQuotient(a, b);
    case XQueryOperatorMod:
      return std::fmod(a, b);
    default:
      return std::nullopt;
  }
}

}  // namespace xquery

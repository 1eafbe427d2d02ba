// Arithmetic over numbers.
//
// Two numbers are brought to their least common numeric type, computed in that type's
// representation (decimal, single or double precision) and the result is cast back to the type. So
// a result that a derived integer type cannot hold fails as a cast to it does.
#pragma once

#include "xquery/Number.h"
#include "xquery/Object.h"

namespace xquery {

class XQueryContext;

// Null when the operands have no common numeric type; an error record for a zero divisor where the
// representation has no answer.
Value op_numeric_add(const Value& a, const Value& b, XQueryContext& context);
Value op_numeric_subtract(const Value& a, const Value& b, XQueryContext& context);
Value op_numeric_multiply(const Value& a, const Value& b, XQueryContext& context);
// Any two integers are divided, and answered, in decimal.
Value op_numeric_divide(const Value& a, const Value& b, XQueryContext& context);
// The quotient truncated toward zero, an xs:integer. A NaN or infinite quotient fails as its cast
// to xs:integer does.
Value op_numeric_integer_divide(const Value& a, const Value& b, XQueryContext& context);
// The remainder of that division: it has the sign of the dividend. Floating-point operands follow
// IEEE 754, so a zero divisor gives NaN.
Value op_numeric_mod(const Value& a, const Value& b, XQueryContext& context);

// False when either operand is NaN.
bool op_numeric_equal(const NSNumber& a, const NSNumber& b);
bool op_numeric_less_than(const NSNumber& a, const NSNumber& b);
bool op_numeric_greater_than(const NSNumber& a, const NSNumber& b);

bool XQueryIsNaN(const NSNumber& number);

// Quotient in one precision. A zero divisor of either sign gives an infinity of the dividend's
// sign, or NaN when the dividend is zero or NaN.
double XQueryQuotient(double a, double b);
float XQueryQuotient(float a, float b);

// Unary plus and minus: 0 plus or minus the operand, in the operand's type. An untyped operand is a
// double, a node is atomized, the empty sequence stays empty; null for anything else but a number.
Value XQueryUnarySign(int type, const Value& operand, XQueryContext& context);

}  // namespace xquery

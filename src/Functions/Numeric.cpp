#include "Functions/Numeric.h"

#include "Expr/XQuerySequence.h"
#include "Types/XQueryCasting.h"
#include "Types/XQueryNumber.h"

#include <algorithm>
#include <cmath>
#include <utility>

namespace xquery {
namespace {

// What a function does to decimals, and to doubles and floats: a float is held by a double exactly,
// and so is what these functions make of it.
struct Work {
  NSDecimal (*exact)(const NSDecimal&);
  double (*floating)(double);
};

constexpr Work absolute = {
    [](const NSDecimal& value) { return value.sign() < 0 ? value.negate() : value; },
    [](double value) { return std::fabs(value); },
};
constexpr Work down = {
    [](const NSDecimal& value) { return value.floor(); },
    [](double value) { return std::floor(value); },
};
constexpr Work up = {
    [](const NSDecimal& value) { return value.ceiling(); },
    [](double value) { return std::ceil(value); },
};

bool isExact(XQueryTypeID type) {
  return XQueryPrimitiveTypeForTypeID(type) == XQueryTypeDecimal;
}

// A value of the type, where that holds the number: abs of a negativeInteger is none.
Value exactOfType(NSDecimal value, XQueryTypeID type, XQueryContext& context) {
  // Of these two types it is as it stands.
  if (type == XQueryTypeInteger && value.isInteger()) {
    return XQueryNumber::integerWithDecimal(std::move(value));
  }
  if (type == XQueryTypeDecimal && !value.isNaN()) {
    return XQueryNumber::numberWithDecimal(std::move(value));
  }
  return XQueryCastAsTypeForContext(XQueryNumber::numberWithDecimal(std::move(value)), type,
                                    context);
}

Value floatingOfType(double value, XQueryTypeID type, XQueryContext& context) {
  if (type == XQueryTypeDouble) return XQueryNumber::numberWithDouble(value);
  return XQueryCastAsTypeForContext(XQueryNumber::numberWithDouble(value), type, context);
}

Value inTypeOfArgument(const Work& work, const Value* arguments, size_t count,
                       XQueryContext& context) {
  if (count != 1) return Value();
  const Value value = XQueryPromoteToNumeric(arguments[0], context);
  if (isNull(value)) return value;
  const NSNumber& number = *cast<NSNumber>(value);
  const XQueryTypeID type = XQueryObjectTypeID(value.get());
  if (!isExact(type)) return floatingOfType(work.floating(number.doubleValue()), type, context);
  return exactOfType(work.exact(number.decimalValue()), type, context);
}

// The distance of a double to the whole number below it is exact wherever it decides: from 1 on
// because both have the same bits above the point, and between -1 and 0 an inexact distance lies
// between the same two whole numbers, of which 0 is both the upper and the even one.
double roundedToWhole(double value, bool halfToEven) {
  const double below = std::floor(value);
  const double distance = value - below;
  // Of an infinity the distance is NaN.
  if (!(distance >= 0.5)) return below;
  if (distance == 0.5 && halfToEven && std::fmod(below, 2) == 0) return below;
  return below + 1;
}

// A precision beyond these bounds rounds nothing away, or everything.
int32_t boundedScale(int64_t precision) {
  constexpr int64_t bound = int64_t{1} << 30;
  return static_cast<int32_t>(std::clamp(precision, -bound, bound));
}

}  // namespace

// Doubles and floats are rounded as the digits that they print: 2.675 is a half at two digits after
// the point, although the nearest double lies below it.
Value xqround(const Value& value, int64_t precision, bool halfToEven, XQueryContext& context) {
  if (isNull(value)) return value;
  const NSNumber& number = *cast<NSNumber>(value);
  const XQueryTypeID type = XQueryObjectTypeID(value.get());
  const double floating = isExact(type) ? 0 : number.doubleValue();
  if (!std::isfinite(floating)) return floatingOfType(floating, type, context);
  if (!isExact(type) && precision == 0) {
    return floatingOfType(roundedToWhole(floating, halfToEven), type, context);
  }
  const auto mode = halfToEven ? NSRoundingMode::HalfEven : NSRoundingMode::HalfUp;
  return exactOfType(number.decimalValue().rounded(boundedScale(precision), mode), type, context);
}

Value fn_abs(const Value* arguments, size_t count, XQueryContext& context) {
  return inTypeOfArgument(absolute, arguments, count, context);
}

Value fn_floor(const Value* arguments, size_t count, XQueryContext& context) {
  return inTypeOfArgument(down, arguments, count, context);
}

Value fn_ceiling(const Value* arguments, size_t count, XQueryContext& context) {
  return inTypeOfArgument(up, arguments, count, context);
}

Value fn_round(const Value* arguments, size_t count, XQueryContext& context) {
  if (count != 1) return Value();
  return xqround(XQueryPromoteToNumeric(arguments[0], context), 0, false, context);
}

Value fn_round_half_to_even(const Value* arguments, size_t count, XQueryContext& context) {
  if (count < 1 || count > 2) return Value();
  const Value value = XQueryPromoteToNumeric(arguments[0], context);
  int64_t precision = 0;
  if (count == 2) {
    const Value digits = XQueryPromoteToInteger(arguments[1], context);
    if (isNull(digits)) return Value();
    precision = cast<NSNumber>(digits)->integerValue();
  }
  return xqround(value, precision, true, context);
}

}  // namespace xquery

#include "Functions/Substring.h"

#include "Expr/Operators/XQueryArithmetic.h"
#include "Expr/XQuerySequence.h"
#include "Functions/Numeric.h"
#include "Functions/XQueryTextArgument.h"
#include "Types/XQueryNumber.h"
#include "Types/XQueryString.h"

#include <algorithm>
#include <cmath>
#include <optional>

namespace xquery {
namespace {

// Two strings and a collation that has no effect.
template <class Function>
Value withTwoTexts(const Value* arguments, size_t count, XQueryContext& context,
                   Function function) {
  if (count < 2 || count > 3) return Value();
  const XQueryTextArgument text(arguments[0], context);
  const XQueryTextArgument part(arguments[1], context);
  XQueryCheckCollation(arguments, count, 2, context);
  return function(text.view(), part.view());
}

Value truth(bool value) {
  return NSNumber::numberWithBool(value);
}

// --- substring -----------------------------------------------------------------------------------

// Far from any length of a string, and two of them add up within 64 bits.
constexpr int64_t farAway = int64_t{1} << 62;

// The number rounded to a whole one; nothing for NaN and for the empty sequence. What is whole
// already needs no rounding.
std::optional<int64_t> roundedPosition(const Value& value, XQueryContext& context) {
  if (isNull(value)) return std::nullopt;
  const auto* exact = cast<NSNumber>(value)->storedDecimal();
  if (exact && exact->isSmallInteger()) {
    return std::clamp(exact->smallInteger(), -farAway, farAway);
  }
  const Value rounded = xqround(value, 0, false, context);
  const auto* number = cast<NSNumber>(rounded);
  if (XQueryIsNaN(*number)) return std::nullopt;
  return std::clamp(number->longLongValue(), -farAway, farAway);
}

// The units that a start and a length pick out of a text. Without a length it is as if that were
// infinite.
struct UnitRange {
  uint32_t from = 0;
  uint32_t count = 0;
};

// Of a start that is not behind the text.
UnitRange rangeOfSubstring(uint32_t textLength, int64_t start, std::optional<int64_t> length) {
  const int64_t end = textLength;
  int64_t from = start - 1;
  if (!length) {
    from = std::max<int64_t>(from, 0);
    return {static_cast<uint32_t>(from), static_cast<uint32_t>(end - from)};
  }
  if (*length <= 0 || from + *length < 1) return {};
  int64_t count = std::min(*length, end - from);
  if (from < 0) {
    count += from;
    from = 0;
  }
  return {static_cast<uint32_t>(from), static_cast<uint32_t>(count)};
}

// A decimal is finite, also one beyond the range of doubles.
bool isInfinite(const Value& value) {
  const NSNumber& number = *cast<NSNumber>(value);
  return !number.storedDecimal() && std::isinf(number.doubleValue());
}

}  // namespace

Value fn_contains(const Value* arguments, size_t count, XQueryContext& context) {
  return withTwoTexts(arguments, count, context, [](NSStringView text, NSStringView part) {
    return truth(text.find(part) != NSStringView::notFound);
  });
}

Value fn_starts_with(const Value* arguments, size_t count, XQueryContext& context) {
  return withTwoTexts(arguments, count, context, [](NSStringView text, NSStringView part) {
    return truth(text.startsWith(part));
  });
}

Value fn_ends_with(const Value* arguments, size_t count, XQueryContext& context) {
  return withTwoTexts(arguments, count, context, [](NSStringView text, NSStringView part) {
    return truth(text.endsWith(part));
  });
}

Value fn_substring(const Value* arguments, size_t count, XQueryContext& context) {
  if (count < 2 || count > 3) return Value();
  const XQueryTextArgument source(arguments[0], context);
  const Value start = XQueryPromoteToNumeric(arguments[1], context);
  const Value length = count == 3 ? XQueryPromoteToNumeric(arguments[2], context) : Value();
  const NSStringView text = source.view();
  const std::optional<int64_t> from = roundedPosition(start, context);
  // From minus infinity nothing can be reached, however long the part is.
  if (!from || *from > text.length() || (*from < 0 && isInfinite(start))) {
    return XQueryString::stringWithView({});
  }
  std::optional<int64_t> units;
  if (count == 3) {
    units = roundedPosition(length, context);
    if (!units) return XQueryString::stringWithView({});
    if (*units > 0 && isInfinite(length)) units.reset();
  }
  const UnitRange range = rangeOfSubstring(text.length(), *from, units);
  // To its end the whole source is answered as it is; a part of given length is an xs:string.
  if (!units && range.count == text.length()) return XQueryPromoteToString(arguments[0], context);
  return XQueryString::stringWithView(text.substring(range.from, range.count));
}

Value fn_substring_before(const Value* arguments, size_t count, XQueryContext& context) {
  return withTwoTexts(arguments, count, context, [](NSStringView text, NSStringView part) {
    const uint32_t found = text.find(part);
    if (found == NSStringView::notFound) return Value(XQueryString::stringWithView({}));
    return Value(XQueryString::stringWithView(text.substring(0, found)));
  });
}

Value fn_substring_after(const Value* arguments, size_t count, XQueryContext& context) {
  return withTwoTexts(arguments, count, context, [&](NSStringView text, NSStringView part) {
    if (part.isEmpty()) return XQueryPromoteToString(arguments[0], context);
    const uint32_t found = text.find(part);
    if (found == NSStringView::notFound) return Value(XQueryString::stringWithView({}));
    return Value(XQueryString::stringWithView(text.substring(found + part.length())));
  });
}

}  // namespace xquery

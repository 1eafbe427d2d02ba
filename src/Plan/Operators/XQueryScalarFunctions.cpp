#include "Plan/Operators/XQueryScalarFunctions.h"

#include "Expr/XQuerySequence.h"
#include "Functions/Constructors.h"
#include "Functions/Numeric.h"
#include "Functions/Sequence.h"
#include "Functions/String.h"
#include "Functions/Substring.h"
#include "Functions/XQueryFunctionCall.h"
#include "Plan/Operators/XQueryScalarText.h"
#include "Platform/Base/WorkMeter.h"
#include "Types/XQueryIntegerText.h"
#include "Types/XQueryNumericOperand.h"
#include "xquery/Collection.h"

#include <algorithm>
#include <cmath>
#include <utility>

namespace xquery {
namespace {

using Function = XQueryScalarFunction;
using Scalar = XQueryScalar;
using Form = XQueryScalar::Form;
using Arguments = std::span<const Scalar>;

struct Row {
  XQueryProcedure procedure;
  size_t least;
  size_t most;
  Function function;
};

constexpr Row rows[] = {
    {fn_empty, 1, 1, Function::Empty},
    {fn_exists, 1, 1, Function::Exists},
    {fn_count, 1, 1, Function::Count},
    {fn_subsequence, 2, 3, Function::Subsequence},
    {fn_string_length, 1, 1, Function::StringLength},
    {fn_substring, 2, 3, Function::Substring},
    {fn_substring_before, 2, 2, Function::SubstringBefore},
    {fn_substring_after, 2, 2, Function::SubstringAfter},
    {fn_contains, 2, 2, Function::Contains},
    {fn_starts_with, 2, 2, Function::StartsWith},
    {fn_ends_with, 2, 2, Function::EndsWith},
    {fn_concat, 2, XQueryMostScalarArguments, Function::Concat},
    {xs_integer, 1, 1, Function::ToInteger},
    {xs_double, 1, 1, Function::ToDouble},
    {fn_abs, 1, 1, Function::Absolute},
    {fn_floor, 1, 1, Function::Floor},
    {fn_ceiling, 1, 1, Function::Ceiling},
};

// Where every double that is whole is an integer of a machine word.
bool isSmall(double value) {
  return std::fabs(value) < static_cast<double>(XQueryExactIntegerBound);
}

// --- lists ---------------------------------------------------------------------------------------

// The items from one index up to before another; those that are not there are left out.
Scalar part(const Scalar& list, int64_t from, int64_t to) {
  const int64_t count = XQueryScalarCount(list);
  from = std::clamp<int64_t>(from, 0, count);
  to = std::clamp<int64_t>(to, from, count);
  if (from == to) return Scalar::ofNothing();
  if (to - from > 1) {
    return Scalar::ofItems(list.object, list.start + static_cast<uint32_t>(from),
                           static_cast<uint32_t>(to - from));
  }
  return XQueryScalarItem(list, static_cast<uint32_t>(from));
}

// Far from any length, so that two of them add up.
constexpr int64_t farAway = int64_t{1} << 62;

std::optional<int64_t> position(const Scalar& value) {
  const Scalar number = XQueryScalarNumber(value);
  if (number.form != Form::Integer) return std::nullopt;
  return std::clamp(number.integer, -farAway, farAway);
}

Scalar subsequence(Arguments arguments) {
  const auto start = position(arguments[1]);
  const auto length = arguments.size() == 3 ? position(arguments[2]) : farAway;
  if (!start || !length) return {};
  const int64_t first = std::max<int64_t>(*start, 1) - 1;
  return *length < 1 ? Scalar::ofNothing() : part(arguments[0], first, first + *length);
}

// A number asks for that position, cut off; a truth value keeps all or none.
Scalar itemAt(const Scalar& list, const Scalar& asked) {
  if (asked.form == Form::Truth) return asked.truth ? list : Scalar::ofNothing();
  const Scalar number = XQueryScalarNumber(asked);
  int64_t index = 0;
  if (number.form == Form::Integer) {
    index = number.integer;
  } else if (number.form == Form::Double && isSmall(number.number)) {
    index = static_cast<int64_t>(number.number);
  } else {
    return {};
  }
  return index < 1 || index > XQueryScalarCount(list) ? Scalar::ofNothing()
                                                      : part(list, index - 1, index);
}

Scalar itemsBy(Function function, const Scalar& list, const Scalar& compared) {
  const auto bound = position(compared);
  if (!bound) return {};
  switch (function) {
    case Function::ItemFromBack: {
      const int64_t index = int64_t{XQueryScalarCount(list)} - *bound;
      return index < 1 ? Scalar::ofNothing() : part(list, index - 1, index);
    }
    case Function::ItemsAbove:
      return part(list, *bound, farAway);
    case Function::ItemsFrom:
      return part(list, *bound - 1, farAway);
    case Function::ItemsBelow:
      return part(list, 0, *bound - 1);
    case Function::ItemsUpTo:
      return part(list, 0, *bound);
    default:
      return {};
  }
}

// --- texts ---------------------------------------------------------------------------------------

// Units of the text of a value, as an xs:string.
Scalar textPart(const Scalar& of, uint32_t from, uint32_t count) {
  if (count == 0) return Scalar::ofText(NSString::empty().get(), 0, 0);
  // The text of a node may have been put together, and is nowhere to be found again.
  if (of.form == Form::Object && of.object->isNode()) return {};
  return Scalar::ofText(of.object, of.start + from, count);
}

// To its end the whole source is answered as it is, unless that is untyped.
Scalar wholeText(const Scalar& source, uint32_t length) {
  const bool isString = source.form == Form::Object && source.object->kind() == Kind::TypedString;
  return isString ? source : textPart(source, 0, length);
}

Scalar substring(Arguments arguments) {
  const XQueryScalarText source(arguments[0]);
  const auto start = position(arguments[1]);
  const auto length = arguments.size() == 3 ? position(arguments[2]) : farAway;
  if (!source.isKnown() || !start || !length) return {};
  const int64_t end = source.view().length();
  const int64_t from = *start - 1;
  const int64_t first = std::clamp<int64_t>(from, 0, end);
  const bool toItsEnd = arguments.size() == 2;
  // A start behind the end answers the empty string, whatever the source.
  if (toItsEnd && first == 0 && *start <= end) {
    return wholeText(arguments[0], static_cast<uint32_t>(end));
  }
  const int64_t last = toItsEnd ? end : std::clamp<int64_t>(from + *length, first, end);
  return textPart(arguments[0], static_cast<uint32_t>(first), static_cast<uint32_t>(last - first));
}

Scalar aroundText(Function function, const Scalar& source, const Scalar& sought) {
  const XQueryScalarText text(source);
  const XQueryScalarText part(sought);
  if (!text.isKnown() || !part.isKnown()) return {};
  const bool isAfter = function == Function::SubstringAfter;
  const uint32_t length = text.view().length();
  if (isAfter && part.view().isEmpty()) return wholeText(source, length);
  const uint32_t found = text.view().find(part.view());
  if (found == NSStringView::notFound) return textPart(source, 0, 0);
  const uint32_t behind = found + part.view().length();
  return isAfter ? textPart(source, behind, length - behind) : textPart(source, 0, found);
}

Scalar findText(Function function, const Scalar& source, const Scalar& sought) {
  const XQueryScalarText text(source);
  const XQueryScalarText part(sought);
  if (!text.isKnown() || !part.isKnown()) return {};
  switch (function) {
    case Function::StartsWith:
      return Scalar::ofTruth(text.view().startsWith(part.view()));
    case Function::EndsWith:
      return Scalar::ofTruth(text.view().endsWith(part.view()));
    default:
      return Scalar::ofTruth(text.view().find(part.view()) != NSStringView::notFound);
  }
}

// An untyped value, as that of concat is.
Scalar concatenated(Arguments arguments, XQueryScalarsMade& made) {
  NSMutableString all;
  for (const Scalar& argument : arguments) {
    const Scalar number = XQueryScalarNumber(argument);
    const XQueryScalarText text(argument);
    if (number.form == Form::Integer) {
      all.append(XQueryIntegerText(number.integer).view());
    } else if (text.isKnown()) {
      all.append(text.view());
    } else {
      return {};
    }
  }
  return XQueryScalarMade(all.string(), made);
}

// --- numbers -------------------------------------------------------------------------------------

// A number of the type already is the answer itself.
Scalar converted(Function function, const Scalar& value) {
  const Scalar number = XQueryScalarNumber(value);
  const Form wanted = function == Function::ToInteger ? Form::Integer : Form::Double;
  if (number.form == wanted) return value;
  constexpr int64_t bound = XQueryExactIntegerBound;
  if (number.form == Form::Integer && number.integer <= bound && number.integer >= -bound) {
    return Scalar::ofDouble(static_cast<double>(number.integer));
  }
  if (number.form == Form::Double && isSmall(number.number)) {
    return Scalar::ofInteger(static_cast<int64_t>(number.number));
  }
  return {};
}

Scalar whole(Function function, const Scalar& value) {
  const Scalar number = XQueryScalarNumber(value);
  if (number.form == Form::Integer) {
    if (function != Function::Absolute) return number;
    return number.integer == INT64_MIN ? Scalar() : Scalar::ofInteger(std::abs(number.integer));
  }
  if (number.form != Form::Double) return {};
  switch (function) {
    case Function::Absolute:
      return Scalar::ofDouble(std::fabs(number.number));
    case Function::Floor:
      return Scalar::ofDouble(std::floor(number.number));
    default:
      return Scalar::ofDouble(std::ceil(number.number));
  }
}

}  // namespace

std::optional<XQueryScalarFunction> XQueryScalarFunctionOf(const XQueryFunctionCall& call) {
  const size_t count = call.args() ? call.args()->count() : 0;
  for (const Row& row : rows) {
    if (call.function() != row.procedure || !call.builtIn()) continue;
    if (count < row.least || count > row.most) return std::nullopt;
    return row.function;
  }
  return std::nullopt;
}

XQueryScalar XQueryScalarAnswer(Function function, Arguments arguments, XQueryScalarsMade& made) {
  switch (function) {
    case Function::Empty:
      return Scalar::ofTruth(XQueryScalarCount(arguments[0]) == 0);
    case Function::Exists:
      return Scalar::ofTruth(XQueryScalarCount(arguments[0]) > 0);
    case Function::Count:
      return Scalar::ofInteger(XQueryScalarCount(arguments[0]));
    case Function::Subsequence:
      return subsequence(arguments);
    case Function::StringLength: {
      const XQueryScalarText text(arguments[0]);
      return text.isKnown() ? Scalar::ofInteger(text.view().length()) : Scalar();
    }
    case Function::Substring:
      return substring(arguments);
    case Function::SubstringBefore:
    case Function::SubstringAfter:
      return aroundText(function, arguments[0], arguments[1]);
    case Function::Contains:
    case Function::StartsWith:
    case Function::EndsWith:
      return findText(function, arguments[0], arguments[1]);
    case Function::Concat:
      return concatenated(arguments, made);
    case Function::ToInteger:
    case Function::ToDouble:
      return converted(function, arguments[0]);
    case Function::Absolute:
    case Function::Floor:
    case Function::Ceiling:
      return whole(function, arguments[0]);
    case Function::Item:
      return itemAt(arguments[0], arguments[1]);
    default:
      return itemsBy(function, arguments[0], arguments[1]);
  }
}

}  // namespace xquery

#include "Functions/Codepoints.h"

#include "Expr/XQuerySequence.h"
#include "Functions/XQueryTextArgument.h"
#include "Platform/Base/WorkMeter.h"
#include "Platform/Text/Blocks.h"
#include "Platform/Text/ICUText.h"
#include "Types/XQueryAtomization.h"
#include "Types/XQueryCasting.h"
#include "Types/XQueryNumber.h"
#include "Types/XQueryString.h"

#include <limits>
#include <optional>

namespace xquery {
namespace {

// Stands for every number that cannot be a code point: it is outside their range as well.
constexpr int32_t noCodePoint = std::numeric_limits<int32_t>::max();

// Nothing when the item is no number.
std::optional<int32_t> codePointOf(const Value& item, XQueryContext& context) {
  const XQueryTypeID type = XQueryObjectTypeID(item.get());
  Value integer = item;
  switch (XQueryPrimitiveTypeForTypeID(type)) {
    case XQueryTypeUntypedAtomic:
    case XQueryTypeDouble:
    case XQueryTypeFloat:
    case XQueryTypeDecimal:
      if (type != XQueryTypeInteger) {
        integer = XQueryCastAsTypeForContext(item, XQueryTypeInteger, context);
      }
      break;
    default:
      return std::nullopt;
  }
  const auto* number = dyn_cast<NSNumber>(integer);
  if (!number) return std::nullopt;
  const int64_t value = number->longLongValue();
  return value < 0 || value > noCodePoint ? noCodePoint : static_cast<int32_t>(value);
}

Value stringOf(const std::vector<int32_t>& points, bool ascii) {
  if (ascii) {
    const std::string text(points.begin(), points.end());
    return XQueryString::stringWithView(viewOf(text));
  }
  const auto text = textWithCodePoints(points);
  if (!text) return Value();
  return XQueryString::stringWithView(viewOf(*text));
}

template <class Units>
Value integers(const Units& units) {
  const auto list = NSArray::array();
  std::vector<Value>& items = list->objects();
  items.reserve(units.size());
  WorkPacer pacer;
  for (const auto unit : units) {
    pacer.turn();
    items.push_back(XQueryNumber::integerWithInt64(static_cast<int64_t>(unit)));
  }
  return normalised(list);
}

}  // namespace

Value fn_codepoints_to_string(const Value* arguments, size_t count, XQueryContext& context) {
  if (count != 1) return Value();
  const Value value = XQueryAtomization(arguments[0], context);
  const XQueryItemList items(value.get());
  std::vector<int32_t> points;
  points.reserve(items.count());
  bool ascii = true;
  WorkPacer pacer;
  for (size_t index = 0; index < items.count(); ++index) {
    pacer.turn();
    const auto point = codePointOf(items[index], context);
    if (!point) return Value();
    ascii = ascii && *point < 0x80;
    points.push_back(*point);
  }
  return stringOf(points, ascii);
}

Value fn_string_to_codepoints(const Value* arguments, size_t count, XQueryContext& context) {
  if (count != 1) return Value();
  const XQueryTextArgument argument(arguments[0], context);
  const NSStringView text = argument.view();
  if (text.length() == 1) return XQueryNumber::integerWithInt64(text[0]);
  if (!text.isWide()) return integers(std::string_view(text.asciiUnits(), text.length()));
  const auto points = codePointsOfText({text.wideUnits(), text.length()});
  return points ? integers(*points) : Value();
}

}  // namespace xquery

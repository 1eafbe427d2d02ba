#include "Plan/Joins/XQueryJoinOperand.h"

#include "Platform/Numbers/NSDecimal.h"
#include "Platform/Numbers/NumberText.h"
#include "Types/XQueryTypeTable.h"
#include "xquery/String.h"

#include <cmath>
#include <limits>

namespace xquery {
namespace {

// Every integer below this magnitude is a double and no other integer is the same double.
constexpr double exactIntegerBound = 1LL << std::numeric_limits<double>::digits;

// NaN, whichever way it is stored, meets nothing.
bool isFloating(const NSNumber& number) {
  return std::isnan(number.doubleValue()) || number.storage() == NSNumber::Storage::Double ||
         number.storage() == NSNumber::Storage::Float;
}

bool isExactAsDouble(const NSNumber& number) {
  const NSDecimal* decimal = number.storedDecimal();
  if (decimal && !decimal->isSmallInteger()) return false;
  return std::abs(number.doubleValue()) < exactIntegerBound;
}

}  // namespace

XQueryJoinOperand::XQueryJoinOperand(NSObject* item) {
  if (!item) return;
  const XQueryTypeID type =
      item->isNode() ? XQueryTypeID{XQueryTypeUntypedAtomic} : XQueryObjectTypeID(item);
  const XQueryTypeID primitive = XQueryPrimitiveTypeForTypeID(type);
  if (type == XQueryTypeUntypedAtomic || type == XQueryTypeString) {
    kind = type == XQueryTypeString ? Text : Untyped;
    text = XQueryUntypedText(*item);
  } else if (primitive >= XQueryTypeDouble && primitive <= XQueryTypeDecimal) {
    const auto& value = *cast<NSNumber>(item);
    number = value.doubleValue();
    kind = isFloating(value) ? Floating : isExactAsDouble(value) ? ExactDecimal : InexactDecimal;
  }
}

bool XQueryJoinOperand::hasText(const NSObject* item) {
  if (!item || item->isNode()) return item != nullptr;
  const XQueryTypeID type = XQueryObjectTypeID(item);
  return type == XQueryTypeUntypedAtomic || type == XQueryTypeString;
}

bool XQueryJoinOperand::scan() {
  return kind == Untyped ? scanDouble(text.view(), number) : isNumber();
}

bool XQueryJoinOperand::isNaN() const {
  return kind == Floating && std::isnan(number);
}

bool XQueryJoinOperand::isWholeText() const {
  if (!isText()) return false;
  const NSStringView units = text.view();
  constexpr uint32_t firstHalf = 0xD800;
  constexpr uint32_t halves = 0xFC00;
  return units.length() == 0 || (units[units.length() - 1] & halves) != firstHalf;
}

}  // namespace xquery

#include "Types/XQueryItemKinds.h"

namespace xquery {
namespace {

using namespace XQueryItems;

XQueryItemKinds kindsOfPrimitive(XQueryTypeID primitive) {
  switch (primitive) {
    case XQueryTypeUntypedAtomic:
      return Untyped;
    case XQueryTypeString:
      return DerivedString;
    case XQueryTypeBoolean:
      return Boolean;
    case XQueryTypeDouble:
      return Double;
    case XQueryTypeFloat:
      return Float;
    case XQueryTypeDecimal:
      return Decimal;
    case XQueryTypeAnyURI:
      return URI;
    case XQueryTypeQName:
      return QName;
    case XQueryTypeGYearMonth:
    case XQueryTypeGYear:
    case XQueryTypeGMonthDay:
    case XQueryTypeGDay:
    case XQueryTypeGMonth:
      return Gregorian;
    case XQueryTypeDateTime:
      return DateTime;
    case XQueryTypeDate:
      return Date;
    case XQueryTypeTime:
      return Time;
    case XQueryTypeDuration:
      return PlainDuration;
    case XQueryTypeBase64Binary:
      return Base64Binary;
    case XQueryTypeHexBinary:
      return HexBinary;
    case XQueryTypeNotation:
      return Notation;
    default:
      return Other;
  }
}

// Of values that have exactly the type.
XQueryItemKinds kindsOfExactly(XQueryTypeID type) {
  if (type == XQueryTypeString) return PlainString;
  if (type == XQueryTypeYearMonthDuration) return YearMonthDuration;
  if (type == XQueryTypeDayTimeDuration) return DayTimeDuration;
  if (XQueryIsKindOfType(type, XQueryTypeInteger)) return Integer;
  return kindsOfPrimitive(XQueryPrimitiveTypeForTypeID(type));
}

}  // namespace

XQueryItemKinds XQueryKindsOfItem(const NSObject& item) {
  if (item.isNode()) return 1U << (static_cast<unsigned>(item.kind()) - 1);
  return XQueryIsAtomicType(&item) ? kindsOfExactly(XQueryObjectTypeID(&item)) : Other;
}

XQueryItemKinds XQueryKindsOfType(XQueryTypeID type) {
  if (type == XQueryTypeNone) return None;
  XQueryItemKinds kinds = None;
  for (XQueryTypeID each = XQueryTypeUntypedAtomic; each <= XQueryTypeUnsignedByte; ++each) {
    if (XQueryIsKindOfType(each, type)) kinds |= kindsOfExactly(each);
  }
  return kinds;
}

}  // namespace xquery

// Built-in type identifiers, their names and the derivation rules between them.
#pragma once

#include "xquery/Object.h"

#include <cstdint>

namespace xquery {

class XQueryContext;
class XQueryQName;

using XQueryTypeID = intptr_t;

// The numbering is fixed: other code compares against the numbers and relies on their order (a type
// has a larger number than the type it derives from).
enum XQueryType : XQueryTypeID {
  XQueryTypeNone = 0,   // a node, or an object without a type
  XQueryTypeError = 1,  // an error record
  XQueryTypeEmpty = 2,  // the empty sequence
  XQueryTypeAnyType = 3,
  XQueryTypeAnyComplex = 4,
  XQueryTypeAnySimpleType = 6,
  XQueryTypeAnyAtomicType = 7,
  XQueryTypeUntypedAtomic = 8,
  XQueryTypeString = 9,
  XQueryTypeBoolean = 10,
  XQueryTypeDouble = 11,
  XQueryTypeFloat = 12,
  XQueryTypeDecimal = 13,
  XQueryTypeAnyURI = 14,
  XQueryTypeQName = 15,
  XQueryTypeGYearMonth = 16,
  XQueryTypeGYear = 17,
  XQueryTypeGMonthDay = 18,
  XQueryTypeGDay = 19,
  XQueryTypeGMonth = 20,
  XQueryTypeDateTime = 21,
  XQueryTypeDate = 22,
  XQueryTypeTime = 23,
  XQueryTypeDuration = 24,
  XQueryTypeBase64Binary = 25,
  XQueryTypeHexBinary = 26,
  XQueryTypeNotation = 27,
  XQueryTypeYearMonthDuration = 28,
  XQueryTypeDayTimeDuration = 29,
  XQueryTypeNormalizedString = 30,
  XQueryTypeToken = 31,
  XQueryTypeLanguage = 32,
  XQueryTypeName = 33,
  XQueryTypeNCName = 34,
  XQueryTypeXSID = 35,
  XQueryTypeIDREF = 36,
  XQueryTypeIDREFS = 37,
  XQueryTypeENTITY = 38,
  XQueryTypeENTITIES = 39,
  XQueryTypeNMTOKEN = 40,
  XQueryTypeNMTOKENS = 41,
  XQueryTypeInteger = 42,
  XQueryTypeNonNegativeInteger = 43,
  XQueryTypePositiveInteger = 44,
  XQueryTypeNonPositiveInteger = 45,
  XQueryTypeNegativeInteger = 46,
  XQueryTypeLong = 47,
  XQueryTypeInt = 48,
  XQueryTypeShort = 49,
  XQueryTypeByte = 50,
  XQueryTypeUnsignedLong = 51,
  XQueryTypeUnsignedInt = 52,
  XQueryTypeUnsignedShort = 53,
  XQueryTypeUnsignedByte = 54,
};

void BuiltInTypeInit();
// Null for an identifier without a name.
Ref<XQueryQName> XQueryQNameForTypeID(XQueryTypeID id);
// 0 for a name that is no built-in type.
XQueryTypeID XQueryTypeIDForQName(const XQueryQName& qName);

XQueryTypeID XQueryObjectTypeID(const NSObject* object);
bool XQueryIsAtomicType(const NSObject* object);
bool XQueryIsNumericType(const NSObject* object);
bool XQueryIsNumericTypeID(XQueryTypeID id);
XQueryTypeID XQueryPrimitiveTypeForTypeID(XQueryTypeID id);
bool XQueryIsKindOfType(XQueryTypeID type, XQueryTypeID base);
XQueryTypeID XQueryLeastCommonNumericType(XQueryTypeID a, XQueryTypeID b);

// Atomize to at most one item and bring it to the required kind. They answer the value to use;
// a value that does not fit raises error 6.
Value XQueryPromoteToString(const Value& value, XQueryContext& context);
Value XQueryPromoteToNumeric(const Value& value, XQueryContext& context);
Value XQueryPromoteToInteger(const Value& value, XQueryContext& context);

// The shared true value when both operands have exactly the type and are equal, false when they
// have it and differ, null when either has another type.
Value xquery_type_equal(const NSObject& a, const NSObject& b, XQueryTypeID type);

}  // namespace xquery

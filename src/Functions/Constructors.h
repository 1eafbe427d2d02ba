// The constructor functions: each casts its only argument to its type, so that the empty sequence
// is an error.
#pragma once

#include "Functions/XQueryBuiltInFunction.h"
#include "Types/XQueryTypeTable.h"

namespace xquery {

// A cast to any type with the checks of a constructor function.
Value XQueryConstruct(XQueryTypeID type, const Value* arguments, size_t count,
                      XQueryContext& context);

template <XQueryTypeID type>
Value XQueryConstructor(const Value* arguments, size_t count, XQueryContext& context) {
  return XQueryConstruct(type, arguments, count, context);
}

inline constexpr XQueryProcedure xs_string = XQueryConstructor<XQueryTypeString>;
inline constexpr XQueryProcedure xs_boolean = XQueryConstructor<XQueryTypeBoolean>;
inline constexpr XQueryProcedure xs_decimal = XQueryConstructor<XQueryTypeDecimal>;
inline constexpr XQueryProcedure xs_float = XQueryConstructor<XQueryTypeFloat>;
inline constexpr XQueryProcedure xs_double = XQueryConstructor<XQueryTypeDouble>;
inline constexpr XQueryProcedure xs_duration = XQueryConstructor<XQueryTypeDuration>;
inline constexpr XQueryProcedure xs_dateTime = XQueryConstructor<XQueryTypeDateTime>;
inline constexpr XQueryProcedure xs_time = XQueryConstructor<XQueryTypeTime>;
inline constexpr XQueryProcedure xs_date = XQueryConstructor<XQueryTypeDate>;
inline constexpr XQueryProcedure xs_gYearMonth = XQueryConstructor<XQueryTypeGYearMonth>;
inline constexpr XQueryProcedure xs_gYear = XQueryConstructor<XQueryTypeGYear>;
inline constexpr XQueryProcedure xs_gMonthDay = XQueryConstructor<XQueryTypeGMonthDay>;
inline constexpr XQueryProcedure xs_gDay = XQueryConstructor<XQueryTypeGDay>;
inline constexpr XQueryProcedure xs_gMonth = XQueryConstructor<XQueryTypeGMonth>;
inline constexpr XQueryProcedure xs_hexBinary = XQueryConstructor<XQueryTypeHexBinary>;
inline constexpr XQueryProcedure xs_base64Binary = XQueryConstructor<XQueryTypeBase64Binary>;
inline constexpr XQueryProcedure xs_anyURI = XQueryConstructor<XQueryTypeAnyURI>;
inline constexpr XQueryProcedure xs_QName = XQueryConstructor<XQueryTypeQName>;
inline constexpr XQueryProcedure xs_normalizedString =
    XQueryConstructor<XQueryTypeNormalizedString>;
inline constexpr XQueryProcedure xs_token = XQueryConstructor<XQueryTypeToken>;
inline constexpr XQueryProcedure xs_language = XQueryConstructor<XQueryTypeLanguage>;
inline constexpr XQueryProcedure xs_NMTOKEN = XQueryConstructor<XQueryTypeNMTOKEN>;
inline constexpr XQueryProcedure xs_Name = XQueryConstructor<XQueryTypeName>;
inline constexpr XQueryProcedure xs_NCName = XQueryConstructor<XQueryTypeNCName>;
inline constexpr XQueryProcedure xs_ID = XQueryConstructor<XQueryTypeXSID>;
inline constexpr XQueryProcedure xs_IDREF = XQueryConstructor<XQueryTypeIDREF>;
inline constexpr XQueryProcedure xs_ENTITY = XQueryConstructor<XQueryTypeENTITY>;
inline constexpr XQueryProcedure xs_integer = XQueryConstructor<XQueryTypeInteger>;
inline constexpr XQueryProcedure xs_nonPositiveInteger =
    XQueryConstructor<XQueryTypeNonPositiveInteger>;
inline constexpr XQueryProcedure xs_negativeInteger = XQueryConstructor<XQueryTypeNegativeInteger>;
inline constexpr XQueryProcedure xs_long = XQueryConstructor<XQueryTypeLong>;
inline constexpr XQueryProcedure xs_int = XQueryConstructor<XQueryTypeInt>;
inline constexpr XQueryProcedure xs_short = XQueryConstructor<XQueryTypeShort>;
inline constexpr XQueryProcedure xs_byte = XQueryConstructor<XQueryTypeByte>;
inline constexpr XQueryProcedure xs_nonNegativeInteger =
    XQueryConstructor<XQueryTypeNonNegativeInteger>;
inline constexpr XQueryProcedure xs_unsignedLong = XQueryConstructor<XQueryTypeUnsignedLong>;
inline constexpr XQueryProcedure xs_unsignedInt = XQueryConstructor<XQueryTypeUnsignedInt>;
inline constexpr XQueryProcedure xs_unsignedShort = XQueryConstructor<XQueryTypeUnsignedShort>;
inline constexpr XQueryProcedure xs_unsignedByte = XQueryConstructor<XQueryTypeUnsignedByte>;
inline constexpr XQueryProcedure xs_positiveInteger = XQueryConstructor<XQueryTypePositiveInteger>;
inline constexpr XQueryProcedure xs_NOTATION = XQueryConstructor<XQueryTypeNotation>;

inline constexpr XQueryProcedure xdt_yearMonthDuration =
    XQueryConstructor<XQueryTypeYearMonthDuration>;
inline constexpr XQueryProcedure xdt_dayTimeDuration = XQueryConstructor<XQueryTypeDayTimeDuration>;
inline constexpr XQueryProcedure xdt_untypedAtomic = XQueryConstructor<XQueryTypeUntypedAtomic>;

}  // namespace xquery

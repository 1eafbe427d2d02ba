// Bringing a function argument to the kind of value that the function computes with.
#include "Types/TypesContext.h"
#include "Types/XQueryAtomization.h"
#include "Types/XQueryCasting.h"
#include "Types/XQueryErrors.h"
#include "Types/XQueryTypeTable.h"
#include "Types/XQueryValues.h"
#include "xquery/XQuery.h"

namespace xquery {

namespace {

[[noreturn]] void raiseWrongKind(const XQueryErrorText<1>& text, const Value& argument,
                                 XQueryContext& context) {
  XQueryRaise(context, text.error(XQueryDescription(argument.get())));
}

// The list type IDREFS passes for a string here, the other two list types do not.
bool isStringArgument(XQueryTypeID type) {
  return type == XQueryTypeString ||
         (type >= XQueryTypeNormalizedString && type <= XQueryTypeENTITY) ||
         type == XQueryTypeNMTOKEN;
}

}  // namespace

Value XQueryPromoteToString(const Value& value, XQueryContext& context) {
  Value item = XQueryAtomizationCheckingOccurrence(value, XQueryOccurrenceAnyAlso, context);
  const XQueryTypeID type = XQueryObjectTypeID(item.get());
  if (isStringArgument(type)) return item;
  Value string;
  if (type == XQueryTypeUntypedAtomic || type == XQueryTypeAnyURI) {
    string = XQueryCastAsTypeForContext(item, XQueryTypeString, context);
  } else if (type == XQueryTypeEmpty) {
    string = XQueryCastAsTypeForContext(NSString::empty(), XQueryTypeString, context);
  }
  if (string) return string;
  raiseWrongKind(XQueryErrors::notAString, value, context);
}

Value XQueryPromoteToNumeric(const Value& value, XQueryContext& context) {
  Value item = XQueryAtomizationCheckingOccurrence(value, XQueryOccurrenceAnyAlso, context);
  switch (XQueryPrimitiveTypeForTypeID(XQueryObjectTypeID(item.get()))) {
    case XQueryTypeDouble:
    case XQueryTypeFloat:
    case XQueryTypeDecimal:
    case XQueryTypeEmpty:
      return item;
    case XQueryTypeUntypedAtomic:
      return XQueryCastAsTypeForContext(item, XQueryTypeDouble, context);
    default:
      raiseWrongKind(XQueryErrors::notANumber, value, context);
  }
}

Value XQueryPromoteToInteger(const Value& value, XQueryContext& context) {
  Value item = XQueryAtomizationCheckingOccurrence(value, XQueryOccurrenceAnyAlso, context);
  const XQueryTypeID type = XQueryObjectTypeID(item.get());
  Value integer;
  switch (XQueryPrimitiveTypeForTypeID(type)) {
    case XQueryTypeEmpty:
      return item;
    case XQueryTypeDecimal:
      if (type != XQueryTypeDecimal) return item;
      [[fallthrough]];
    case XQueryTypeUntypedAtomic:
    case XQueryTypeDouble:
    case XQueryTypeFloat:
      integer = XQueryCastAsTypeForContext(item, XQueryTypeInteger, context);
      break;
    default:
      break;
  }
  if (integer) return integer;
  raiseWrongKind(XQueryErrors::notAnInteger, value, context);
}

}  // namespace xquery

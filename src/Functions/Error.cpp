#include "Functions/Error.h"

#include "Context/XQueryContextInternal.h"
#include "Types/XQueryErrors.h"
#include "Types/XQueryQName.h"
#include "Types/XQueryTypeTable.h"
#include "xquery/Error.h"
#include "xquery/XQuery.h"

namespace xquery {
namespace {

constexpr std::string_view errorNamespace = "http://www.w3.org/2004/07/xqt-errors";
constexpr std::string_view unidentifiedError = "FOER0000";

}  // namespace

// The error is the answer; the call raises it. A first argument that is no QName leaves namespace
// and local part missing and empty; a third one is not looked at.
Value fn_error(const Value* arguments, size_t count, XQueryContext& context) {
  if (count > 3) return Value();
  if (count == 0) return XQueryErrors::namedError.error(errorNamespace, unidentifiedError);
  const auto* name = dyn_cast<XQueryQName>(arguments[0].get());
  const Ref<NSString> namespaceURI = name ? name->namespaceURI() : Ref<NSString>();
  const Ref<NSString> localPart = name ? name->localPart() : NSString::empty();
  if (count >= 2) {
    const Value promoted = XQueryPromoteToString(arguments[1], context);
    const Ref<NSString> description = cast<NSString>(promoted);
    if (description->length() > 0) {
      return XQueryErrors::describedError.error(namespaceURI, localPart, description);
    }
  }
  return XQueryErrors::namedError.error(namespaceURI, localPart);
}

Value fn_trace(const Value* arguments, size_t count, XQueryContext& context) {
  if (count != 2) return Value();
  const Value label = XQueryPromoteToString(arguments[1], context);
  _traceValue(context, arguments[0], cast<NSString>(label));
  return arguments[0];
}

}  // namespace xquery

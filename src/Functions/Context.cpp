#include "Functions/Context.h"

#include "Context/XQueryContextInternal.h"
#include "Types/XQueryCasting.h"
#include "Types/XQueryNumber.h"

namespace xquery {
namespace {

// A position or a size of 0 was never set.
Value countInFocus(int64_t number) {
  return number == 0 ? Value() : Value(XQueryNumber::integerWithInt64(number));
}

}  // namespace

Value fn_position(const Value*, size_t count, XQueryContext& context) {
  return count == 0 ? countInFocus(_internal(context).position()) : Value();
}

Value fn_last(const Value*, size_t count, XQueryContext& context) {
  return count == 0 ? countInFocus(_internal(context).last()) : Value();
}

Value fn_static_base_uri(const Value*, size_t count, XQueryContext& context) {
  if (count != 0) return Value();
  const Ref<NSString> URI = _internal(context).baseURI();
  if (!URI || URI->length() == 0) return NSNull::null();
  return XQueryCastAsTypeForContext(URI, XQueryTypeAnyURI, context);
}

Value fn_default_collation(const Value*, size_t count, XQueryContext& context) {
  if (count != 0) return Value();
  const Ref<NSString> URI = _internal(context).defaultCollation();
  return XQueryCastAsTypeForContext(URI ? URI : NSString::empty(), XQueryTypeString, context);
}

Value fn_implicit_timezone(const Value*, size_t count, XQueryContext&) {
  return count == 0 ? Value(XQueryNumber::implicitTimeZone()) : Value();
}

}  // namespace xquery

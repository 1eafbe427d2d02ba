#include "Functions/Binary.h"

#include "Context/XQueryContextInternal.h"
#include "Platform/Base/WorkMeter.h"
#include "Platform/Text/Encoding.h"
#include "Types/XQueryBinary.h"
#include "Types/XQueryCasting.h"
#include "Types/XQueryDataMatch.h"
#include "Types/XQueryNumber.h"
#include "Types/XQueryTypeTable.h"
#include "xquery/Error.h"

namespace xquery {
namespace {

// Of a URI the cast answers the error that it raises of everything else.
Value binaryOfType(XQueryTypeID type, const Value& value, XQueryContext& context) {
  Value binary = XQueryCastAsTypeForContext(value, type, context);
  if (auto* error = dyn_cast<XQueryError>(binary.get())) _internal(context).raise(error);
  return binary;
}

Ref<NSData> hexBinaryData(const Value& value, XQueryContext& context) {
  const Value binary = binaryOfType(XQueryTypeHexBinary, value, context);
  return cast<XQueryHexBinary>(binary.get())->data();
}

// The name of a charset, which is the argument after the first.
std::string charsetOf(const Value* arguments, size_t count, XQueryContext& context) {
  if (count < 2) return "utf-8";
  return cast<NSString>(XQueryPromoteToString(arguments[1], context).get())->utf8();
}

Value converted(const Value* arguments, size_t count, XQueryTypeID from, XQueryTypeID to,
                XQueryContext& context) {
  if (count != 1) return Value();
  return XQueryCastAsTypeForContext(binaryOfType(from, arguments[0], context), to, context);
}

// What lies between two patterns, themselves included: the bytes of the first match, or of each.
Value found(const Value* arguments, size_t count, bool all, XQueryContext& context) {
  if (count != 3) return Value();
  const Ref<NSData> data = hexBinaryData(arguments[0], context);
  const Ref<NSData> start = hexBinaryData(arguments[1], context);
  const Ref<NSData> end = hexBinaryData(arguments[2], context);
  checkWork(data->length() / 4096);
  return XQueryDataMatch(*data, start.get(), end.get(), all);
}

}  // namespace

Value ext_binary_from_string(const Value* arguments, size_t count, XQueryContext& context) {
  if (count < 1 || count > 2) return Value();
  const Value text = XQueryPromoteToString(arguments[0], context);
  auto bytes =
      bytesInCharset(cast<NSString>(text.get())->view(), charsetOf(arguments, count, context));
  if (!bytes) return Value();
  return XQueryHexBinary::binaryWithData(NSData::dataWithBytes(std::move(*bytes)));
}

Value ext_string_from_binary(const Value* arguments, size_t count, XQueryContext& context) {
  if (count < 1 || count > 2) return Value();
  const Ref<NSData> data = hexBinaryData(arguments[0], context);
  return stringWithBytesInCharset(data->bytes(), charsetOf(arguments, count, context));
}

Value ext_binary_hex_to_base64(const Value* arguments, size_t count, XQueryContext& context) {
  return converted(arguments, count, XQueryTypeHexBinary, XQueryTypeBase64Binary, context);
}

Value ext_binary_base64_to_hex(const Value* arguments, size_t count, XQueryContext& context) {
  return converted(arguments, count, XQueryTypeBase64Binary, XQueryTypeHexBinary, context);
}

Value ext_binary_length(const Value* arguments, size_t count, XQueryContext& context) {
  if (count != 1) return Value();
  const Ref<NSData> data = hexBinaryData(arguments[0], context);
  return XQueryNumber::integerWithInt64(static_cast<int64_t>(data->length()));
}

// Neither of these two has ever changed a binary: every call is refused.
Value ext_binary_insert(const Value*, size_t, XQueryContext&) {
  return Value();
}

Value ext_binary_remove(const Value*, size_t, XQueryContext&) {
  return Value();
}

Value ext_binary_find(const Value* arguments, size_t count, XQueryContext& context) {
  return found(arguments, count, false, context);
}

Value ext_binary_find_all(const Value* arguments, size_t count, XQueryContext& context) {
  return found(arguments, count, true, context);
}

}  // namespace xquery

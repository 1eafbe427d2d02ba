#include "Functions/Extension.h"

#include "Context/XQueryContextInternal.h"
#include "Functions/InnerQuery.h"
#include "Functions/URI.h"
#include "Types/XQueryAtomization.h"
#include "Types/XQueryBinary.h"
#include "Types/XQueryDate.h"

namespace xquery {
namespace {

Ref<NSString> promotedToString(const Value& value, XQueryContext& context) {
  return cast<NSString>(XQueryPromoteToString(value, context));
}

// Null for other arguments than a node and a text.
using Evaluation = XQueryInnerResult (*)(const Ref<NSString>& source, const Value& contextItem,
                                         XQueryContext& outer);
XQueryInnerResult evaluateForNode(Evaluation evaluate, const Value* arguments, size_t count,
                                  XQueryContext& context) {
  if (count != 2 || !XQueryIsNode(arguments[0].get())) return {};
  return evaluate(promotedToString(arguments[1], context), arguments[0], context);
}

Value itemsOrError(const XQueryInnerResult& result) {
  return result.items ? Value(result.items) : Value(result.error);
}

}  // namespace

// Why the inner query failed is not told.
Value ext_eval(const Value* arguments, size_t count, XQueryContext& context) {
  if (count < 1 || count > 2) return Value();
  const Value contextItem = count == 2 ? arguments[1] : Value(NSNull::null());
  const Ref<NSString> source = promotedToString(arguments[0], context);
  return XQueryEvaluateInnerQuery(source, contextItem, context).items;
}

Value ext_node_xquery(const Value* arguments, size_t count, XQueryContext& context) {
  return itemsOrError(evaluateForNode(XQueryEvaluateInnerQuery, arguments, count, context));
}

Value ext_node_xpath(const Value* arguments, size_t count, XQueryContext& context) {
  return itemsOrError(evaluateForNode(XQueryEvaluateInnerPath, arguments, count, context));
}

Value ext_test(const Value* arguments, size_t count, XQueryContext& context) {
  return evaluateForNode(XQueryEvaluateInnerQuery, arguments, count, context).items;
}

// Of this very moment, unlike the current dateTime of a context.
Value ext_real_date_time(const Value*, size_t count, XQueryContext&) {
  return count == 0 ? Value(XQueryDate::currentDateTime()) : Value();
}

Value ext_uri_body(const Value* arguments, size_t count, XQueryContext& context) {
  if (count != 1) return Value();
  const Ref<NSString> reference = promotedToString(arguments[0], context);
  if (reference->length() == 0) return Value();
  const Ref<NSURL> URL = XQueryURLInContext(reference, context);
  if (!URL) return Value();
  const Ref<NSData> body = _internal(context).URLBody(URL);
  return body ? Value(XQueryHexBinary::binaryWithData(body)) : Value();
}

}  // namespace xquery

#include "Functions/URI.h"

#include "Context/XQueryContextInternal.h"
#include "Expr/XQuerySequence.h"
#include "Functions/Context.h"
#include "Prolog/XQueryProlog.h"
#include "Types/XQueryCasting.h"
#include "Types/XQueryNodeFunctions.h"
#include "Types/XQueryTypeTable.h"

namespace xquery {
namespace {

// A base without a scheme is none: resolution is defined for absolute ones alone.
Ref<NSURL> resolvedURL(const Ref<NSString>& reference, const Ref<NSString>& base) {
  const Ref<NSURL> baseURL = base ? NSURL::URLWithString(base) : Ref<NSURL>();
  const bool isUsable = baseURL && !baseURL->scheme().empty();
  return isUsable ? NSURL::URLWithString(reference, *baseURL) : NSURL::URLWithString(reference);
}

Value asURI(const Ref<NSString>& text, XQueryContext& context) {
  if (!text || text->length() == 0) return NSNull::null();
  return XQueryCastAsTypeForContext(text, XQueryTypeAnyURI, context);
}

}  // namespace

Ref<NSURL> XQueryURLInContext(const Ref<NSString>& reference, XQueryContext& context) {
  const XQueryProlog* prolog = _internal(context).activeProlog();
  return prolog ? prolog->URLForLocation(reference) : NSURL::URLWithString(reference);
}

Value fn_base_uri(const Value* arguments, size_t count, XQueryContext& context) {
  if (count == 0) return fn_static_base_uri(nullptr, 0, context);
  if (count > 1) return Value();
  if (isNull(arguments[0])) return arguments[0];
  const auto* node = dyn_cast<NSXMLNode>(arguments[0].get());
  return node ? asURI(_internal(context).baseURIForNode(node), context) : Value();
}

// A URI without a scheme names no document.
Value fn_document_uri(const Value* arguments, size_t count, XQueryContext& context) {
  if (count != 1) return Value();
  if (isNull(arguments[0])) return arguments[0];
  const auto* node = dyn_cast<NSXMLNode>(arguments[0].get());
  if (!node) return Value();
  const Ref<NSString> URI = XQueryNodeDocumentURI(node);
  const Ref<NSURL> URL = NSURL::URLWithString(URI);
  if (!URL || URL->scheme().empty()) return NSNull::null();
  return asURI(URI, context);
}

// What cannot be loaded is empty, and stays so for the life of the context.
Value fn_doc(const Value* arguments, size_t count, XQueryContext& context) {
  if (count != 1) return Value();
  const Value reference = XQueryPromoteToString(arguments[0], context);
  const auto* text = cast<NSString>(reference.get());
  if (text->length() == 0) return NSNull::null();
  const Ref<NSURL> URL = XQueryURLInContext(NSString::stringWithView(text->view()), context);
  return URL ? _internal(context).XQueryDocumentForURL(URL) : Value();
}

// There are no collections: every call is refused.
Value fn_collection(const Value*, size_t, XQueryContext&) {
  return Value();
}

Value fn_resolve_uri(const Value* arguments, size_t count, XQueryContext& context) {
  if (count < 1 || count > 2) return Value();
  if (isNull(arguments[0])) return arguments[0];
  const Value reference = XQueryPromoteToString(arguments[0], context);
  const Ref<NSString> text = cast<NSString>(reference);
  Ref<NSString> base = _internal(context).baseURI();
  if (count == 2) base = cast<NSString>(XQueryPromoteToString(arguments[1], context));
  const Ref<NSURL> URL = resolvedURL(text, base);
  return URL ? XQueryCastAsTypeForContext(URL->absoluteString(), XQueryTypeAnyURI, context)
             : Value();
}

}  // namespace xquery

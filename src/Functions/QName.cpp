#include "Functions/QName.h"

#include "Expr/XQuerySequence.h"
#include "Types/XQueryCasting.h"
#include "Types/XQueryNodeFunctions.h"
#include "Types/XQueryQName.h"
#include "Types/XQueryStringFunctions.h"
#include "Types/XQueryTypeTable.h"

namespace xquery {
namespace {

// Untyped, as the parts of a name are.
Ref<NSString> trimmedText(const Value& argument, XQueryContext& context) {
  const Ref<NSString> text = cast<NSString>(XQueryPromoteToString(argument, context));
  return NSString::stringWithView(XQueryStringTrimWS(text)->view());
}

Value asURI(const Ref<NSString>& text, XQueryContext& context) {
  return XQueryCastAsTypeForContext(text ? text : NSString::empty(), XQueryTypeAnyURI, context);
}

}  // namespace

// The name is taken as it is: no rule about the characters of names is checked.
Value fn_QName(const Value* arguments, size_t count, XQueryContext& context) {
  if (count != 2) return Value();
  Ref<NSString> URI = trimmedText(arguments[0], context);
  if (URI->length() == 0) URI = nullptr;
  return XQueryQName::qname(trimmedText(arguments[1], context), URI);
}

// The name is made of the local part, so it carries no prefix: only a second colon leaves one.
Value fn_resolve_QName(const Value* arguments, size_t count, XQueryContext& context) {
  if (count != 2) return Value();
  const auto* node = dyn_cast<NSXMLNode>(arguments[1].get());
  if (!node) return Value();
  if (isNull(arguments[0])) return arguments[0];
  Ref<NSString> prefix;
  Ref<NSString> localPart;
  XQueryQName::parseQNameString(trimmedText(arguments[0], context), prefix, localPart);
  const Ref<NSString> URI = XQueryNodeNamespaceForPrefix(node, prefix->view());
  if (!URI && prefix->length() > 0) return Value();
  return XQueryQName::qname(localPart, URI);
}

Value fn_local_name_from_QName(const Value* arguments, size_t count, XQueryContext& context) {
  if (count != 1) return Value();
  if (isNull(arguments[0])) return arguments[0];
  const auto* name = dyn_cast<XQueryQName>(arguments[0].get());
  return name ? XQueryCastAsTypeForContext(name->localPart(), XQueryTypeString, context) : Value();
}

Value fn_namespace_uri_from_QName(const Value* arguments, size_t count, XQueryContext& context) {
  if (count != 1) return Value();
  if (isNull(arguments[0])) return arguments[0];
  const auto* name = dyn_cast<XQueryQName>(arguments[0].get());
  return name ? asURI(name->namespaceURI(), context) : Value();
}

Value fn_namespace_uri_for_prefix(const Value* arguments, size_t count, XQueryContext& context) {
  if (count != 2) return Value();
  const auto* node = dyn_cast<NSXMLNode>(arguments[1].get());
  if (!node) return Value();
  const Value promoted = XQueryPromoteToString(arguments[0], context);
  const Ref<NSString> URI =
      XQueryNodeNamespaceForPrefix(node, cast<NSString>(promoted.get())->view());
  return URI ? asURI(URI, context) : Value(NSNull::null());
}

Value fn_in_scope_prefixes(const Value* arguments, size_t count, XQueryContext&) {
  if (count != 1) return Value();
  const auto* node = dyn_cast<NSXMLNode>(arguments[0].get());
  if (!node) return Value();
  XQueryGatherer prefixes;
  for (auto& prefix : XQueryNodeInScopePrefixes(node)) prefixes.add(std::move(prefix));
  return prefixes.value();
}

}  // namespace xquery

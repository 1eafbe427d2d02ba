#include "Functions/Node.h"

#include "Context/XQueryContextInternal.h"
#include "Expr/XQuerySequence.h"
#include "Functions/XQueryTextArgument.h"
#include "Platform/Base/WorkMeter.h"
#include "Platform/Numbers/NumberText.h"
#include "Platform/Text/ICUText.h"
#include "Types/XQueryAtomization.h"
#include "Types/XQueryCasting.h"
#include "Types/XQueryNodeFunctions.h"
#include "Types/XQueryNumber.h"
#include "Types/XQueryQName.h"
#include "Types/XQueryStringFunctions.h"
#include "xquery/Exception.h"

#include <algorithm>

namespace xquery {
namespace {

Value asString(Ref<NSString> text, XQueryContext& context) {
  return XQueryCastAsTypeForContext(text ? std::move(text) : NSString::empty(), XQueryTypeString,
                                    context);
}

// A name of the item as a string: "" for the empty sequence and for a node without that name, null
// for what is no node.
template <class NameOf>
Value nameAsString(const Value& item, NameOf nameOf, XQueryContext& context) {
  if (isNull(item)) return asString(NSString::empty(), context);
  const auto* node = dyn_cast<NSXMLNode>(item.get());
  return node ? asString(nameOf(node), context) : Value();
}

// The values of a sequence; null when one of its members is neither a node nor atomic.
Value typedMembers(const NSArray& members) {
  XQueryGatherer values;
  for (const Value& member : members.objects()) {
    checkWork();
    if (isNull(member)) continue;
    if (const auto* node = dyn_cast<NSXMLNode>(member.get())) {
      values.add(XQueryNodeTypedValue(node));
    } else if (XQueryIsAtomicType(member.get())) {
      values.add(member);
    } else {
      return Value();
    }
  }
  return values.value();
}

// The texts whose cast to a double raises. Irregular data is full of them, and a raised error costs
// a hundred times what looking at the text does.
bool isNoNumber(NSStringView text) {
  double ignored = 0;
  return !scanDouble(text, ignored) && text != "NaN" && text != "INF" && text != "-INF";
}

// Of a cast that raised or would have: no error is left, not even one from before.
Value noNumber(XQueryContext& context) {
  _internal(context).setError(nullptr, false);
  return XQueryNumber::nan();
}

std::u16string primaryLanguage(NSStringView language) {
  return lowerCasedText(language.substring(0, language.find(u'-')).utf16());
}

// What `resolve` finds from the context node for each word of the only argument, in the order of
// the words.
template <class Resolve>
Value nodesForTokens(const Value* arguments, size_t count, Resolve resolve,
                     XQueryContext& context) {
  if (count != 1) return Value();
  const Value item = _internal(context).contextItem();
  const auto* node = dyn_cast<NSXMLNode>(item.get());
  if (!node) return Value();
  const Ref<NSString> words =
      XQueryNormalizeString(cast<NSString>(XQueryPromoteToString(arguments[0], context)));
  XQueryGatherer found;
  WorkPacer pacer;
  const uint32_t length = words->length();
  for (uint32_t start = 0; start <= length;) {
    pacer.turn();
    const uint32_t end = std::min(words->view().find(u' ', start), length);
    if (Value each = resolve(node, words->view().substring(start, end - start))) {
      found.add(std::move(each));
    }
    start = end + 1;
  }
  return found.value();
}

}  // namespace

Value fn_string(const Value* arguments, size_t count, XQueryContext& context) {
  const Value item = XQueryArgumentOrContextItem(arguments, count, context);
  if (!item) return Value();
  if (isNull(item)) return asString(NSString::empty(), context);
  if (const auto* node = dyn_cast<NSXMLNode>(item.get())) {
    return asString(XQueryNodeStringValue(node), context);
  }
  return XQueryCastAsTypeForContext(item, XQueryTypeString, context);
}

Value fn_data(const Value* arguments, size_t count, XQueryContext&) {
  if (count != 1) return Value();
  const Value& value = arguments[0];
  if (isNull(value)) return value;
  if (const auto* members = dyn_cast<NSArray>(value.get())) return typedMembers(*members);
  if (const auto* node = dyn_cast<NSXMLNode>(value.get())) return XQueryNodeTypedValue(node);
  return XQueryIsAtomicType(value.get()) ? value : Value();
}

Value fn_number(const Value* arguments, size_t count, XQueryContext& context) {
  const Value argument = XQueryArgumentOrContextItem(arguments, count, context);
  if (!argument) return Value();
  const Value item =
      XQueryAtomizationCheckingOccurrence(argument, XQueryOccurrenceAnyAlso, context);
  if (isNull(item)) return XQueryNumber::nan();
  const auto* text = dyn_cast<NSString>(item.get());
  if (text && isNoNumber(text->view())) return noNumber(context);
  return XQueryDoubleOrNaN(item, context);
}

// What does not cast to a double is NaN.
Value XQueryDoubleOrNaN(const Value& item, XQueryContext& context) {
  try {
    return XQueryCastAsTypeForContext(item, XQueryTypeDouble, context);
  } catch (const NSException&) {
    if (XQueryIsLimit(_internal(context).error().get())) throw;
    return noNumber(context);
  }
}

Value fn_name(const Value* arguments, size_t count, XQueryContext& context) {
  return nameAsString(XQueryArgumentOrContextItem(arguments, count, context), XQueryNodeName,
                      context);
}

Value fn_local_name(const Value* arguments, size_t count, XQueryContext& context) {
  return nameAsString(
      XQueryArgumentOrContextItem(arguments, count, context),
      [](const NSXMLNode* node) { return node->localName(); }, context);
}

Value fn_namespace_uri(const Value* arguments, size_t count, XQueryContext& context) {
  const Value item = XQueryArgumentOrContextItem(arguments, count, context);
  Ref<NSString> URI;
  if (!isNull(item)) {
    const auto* node = dyn_cast<NSXMLNode>(item.get());
    if (!node) return Value();
    URI = node->URI();
  }
  return XQueryCastAsTypeForContext(URI ? URI : NSString::empty(), XQueryTypeAnyURI, context);
}

// Unlike the other names this one is never the context item's.
Value fn_node_name(const Value* arguments, size_t count, XQueryContext&) {
  if (count > 1) return Value();
  const auto* node = count == 1 ? dyn_cast<NSXMLNode>(arguments[0].get()) : nullptr;
  const bool isNamed = node && (isa<NSXMLElement>(node) || node->kind() == Kind::Attribute);
  return isNamed ? Value(XQueryQName::qname(node->localName(), node->URI())) : NSNull::null();
}

// No element is ever nilled, as none is ever validated.
Value fn_nilled(const Value* arguments, size_t count, XQueryContext&) {
  if (count != 1) return Value();
  return isa<NSXMLElement>(arguments[0]) ? Value(NSNumber::falseValue()) : Value(NSNull::null());
}

// Primary languages are compared alone, so that asking for one variant of a language finds every
// other one too.
Value fn_lang(const Value* arguments, size_t count, XQueryContext& context) {
  if (count < 1 || count > 2) return Value();
  const Value item = count == 2 ? arguments[1] : _internal(context).contextItem();
  const auto* node = dyn_cast<NSXMLNode>(item.get());
  if (!node) return NSNumber::falseValue();
  const Value requested = XQueryPromoteToString(arguments[0], context);
  const Ref<NSString> language = XQueryNodeLanguage(node);
  if (!language) return NSNumber::falseValue();
  return NSNumber::numberWithBool(primaryLanguage(cast<NSString>(requested.get())->view()) ==
                                  primaryLanguage(language->view()));
}

Value fn_id(const Value* arguments, size_t count, XQueryContext& context) {
  return nodesForTokens(arguments, count, XQueryNodeResolveID, context);
}

Value fn_idref(const Value* arguments, size_t count, XQueryContext& context) {
  return nodesForTokens(arguments, count, XQueryNodeResolveIDRef, context);
}

// The topmost ancestor, or the node itself.
Value fn_root(const Value* arguments, size_t count, XQueryContext& context) {
  const Value item = XQueryArgumentOrContextItem(arguments, count, context);
  if (!item || isNull(item)) return item;
  const auto* node = dyn_cast<NSXMLNode>(item.get());
  return node ? Value(XQueryNodeRoot(node)) : Value();
}

}  // namespace xquery

// Functions of nodes and of qualified names.
#include "arguments/Driver.h"

#include <gtest/gtest.h>

#include <algorithm>

namespace xquery::arguments {
namespace {

const Node* onlyNode(const Sequence& value) {
  return value.size() == 1 ? value[0].node : nullptr;
}

const Node& node(const Sequence& value) {
  const Node* found = onlyNode(value);
  if (!found) throw Refused();
  return *found;
}

// The argument or the context item. Without either there is nothing to ask.
const Sequence& argumentOrFocus(const Call& call) {
  if (call.count()) return call[0];
  if (!call.contextItem) throw Refused();
  return call.contextItem->items;
}

Sequence nothingOr(const std::string& URI) {
  if (URI.empty()) return {};
  return one({14, URI});
}

// --- names ---------------------------------------------------------------------------------------

Sequence nodeName(const Call& call) {
  const Node* found = call.count() ? onlyNode(call[0]) : nullptr;
  const bool isNamed =
      found && (found->kind == NodeKind::Element || found->kind == NodeKind::Attribute);
  if (!isNamed) return {};
  return one({15, found->localName});
}

Sequence nilled(const Call& call) {
  const Node* found = onlyNode(call[0]);
  if (!found || found->kind != NodeKind::Element) return {};
  return one(boolean(false));
}

Rule named(std::string Node::*part, int type) {
  return [=](const Call& call) {
    const Sequence& value = argumentOrFocus(call);
    return one({type, value.empty() ? "" : node(value).*part});
  };
}

// --- values --------------------------------------------------------------------------------------

Sequence stringValue(const Call& call) {
  const Sequence& value = argumentOrFocus(call);
  if (value.empty()) return one(string(""));
  return one(castTo(value, 9));
}

Sequence data(const Call& call) {
  Sequence values;
  for (const Item& item : call[0]) {
    if (!item.isNode() && !item.isAtomic()) throw Refused();
    values.push_back(typedValue(item));
  }
  return values;
}

// NaN for what does not cast; only a URI's own error, which is answered and not raised, stays.
Sequence numberOfItem(const Call& call) {
  const Sequence items = atomized(argumentOrFocus(call));
  if (items.size() == 1 && items[0].type == 14) fail(6, noMatch);
  try {
    return one(castTo(items, 11));
  } catch (const Failure&) {
    return one({11, "NaN"});
  }
}

Sequence baseURI(const Call& call) {
  if (!call.count() || call[0].empty()) return {};
  return nothingOr(node(call[0]).baseURI);
}

Sequence documentURI(const Call& call) {
  if (call[0].empty()) return {};
  return nothingOr(node(call[0]).documentURI);
}

Sequence root(const Call& call) {
  const Sequence& value = argumentOrFocus(call);
  if (value.empty()) return {};
  const Node& top = nodes()[node(value).root];
  return one({0, top.text, &top});
}

std::string primaryPart(const std::string& language) {
  std::string part = language.substr(0, language.find('-'));
  std::transform(part.begin(), part.end(), part.begin(), [](char c) { return std::tolower(c); });
  return part;
}

Sequence lang(const Call& call) {
  const Sequence none;
  const Sequence& focus = call.contextItem ? call.contextItem->items : none;
  const Node* found = onlyNode(call.count() > 1 ? call[1] : focus);
  // Whether the language is looked at then is open.
  if (!found || found->language.empty()) call.orElse("10 false");
  const std::string wanted = stringOf(call[0]);
  return one(boolean(found && !found->language.empty() &&
                     primaryPart(wanted) == primaryPart(found->language)));
}

// No attribute is known to be an ID.
Sequence byID(const Call& call) {
  Attempts attempt;
  if (!call.contextItem || !onlyNode(call.contextItem->items)) {
    attempt([]() -> Sequence { throw Refused(); });
  }
  attempt([&] { return stringOf(call[0]); });
  attempt.finish();
  return {};
}

// --- qualified names -----------------------------------------------------------------------------

std::string prefixOf(const std::string& name) {
  const size_t colon = name.find(':');
  return colon == name.npos || colon == 0 ? "" : name.substr(0, colon);
}

std::string localPartOf(const std::string& name) {
  const std::string prefix = prefixOf(name);
  return prefix.empty() ? name : name.substr(prefix.size() + 1);
}

Sequence makeQName(const Call& call) {
  Attempts attempt;
  attempt([&] { return stringOf(call[0]); });
  const std::string name = attempt([&] { return stringOf(call[1]); });
  attempt.finish();
  return one({15, trimmed(name)});
}

// The one QName of the value; only "p:n" among the samples has a namespace, "u".
const Item& QNameIn(const Sequence& value) {
  if (value.size() != 1 || value[0].type != 15) throw Refused();
  return value[0];
}

Sequence localNameFromQName(const Call& call) {
  if (call[0].empty()) return {};
  return one(string(localPartOf(QNameIn(call[0]).text)));
}

Sequence namespaceFromQName(const Call& call) {
  if (call[0].empty()) return {};
  return one({14, QNameIn(call[0]).text == "p:n" ? "u" : ""});
}

// "urn:p" under the element that declares it; a prefix of its own has nothing else.
std::string namespaceFor(const std::string& prefix, const Node& at) {
  const bool isDeclared = prefix == "p" && !at.prefixes.empty();
  return isDeclared ? "urn:p" : "";
}

// Made of the local part: it prints without a prefix.
Sequence resolveQName(const Call& call) {
  const Node& element = node(call[1]);
  if (call[0].empty()) return {};
  const std::string name = trimmed(stringOf(call[0]));
  const std::string prefix = prefixOf(name);
  if (!prefix.empty() && namespaceFor(prefix, element).empty()) throw Refused();
  return one({15, localPartOf(name)});
}

Sequence namespaceForPrefix(const Call& call) {
  Attempts attempt;
  const std::string prefix = attempt([&] { return stringOf(call[0]); });
  const Node* element = attempt([&] { return &node(call[1]); });
  attempt.finish();
  return nothingOr(namespaceFor(prefix, *element));
}

Sequence inScopePrefixes(const Call& call) {
  Sequence prefixes;
  for (const std::string& prefix : node(call[0]).prefixes) prefixes.push_back(untyped(prefix));
  return prefixes;
}

}  // namespace

const std::vector<Function>& nodeFunctions() {
  static const std::vector<Function> functions = {
      {"fn:node-name", 0, 1, nodeName},
      {"fn:nilled", 1, 1, nilled},
      {"fn:string", 0, 1, stringValue},
      {"fn:name", 0, 1, named(&Node::name, 9)},
      {"fn:local-name", 0, 1, named(&Node::localName, 9)},
      {"fn:namespace-uri", 0, 1, named(&Node::URI, 14)},
      {"fn:base-uri", 0, 1, baseURI},
      {"fn:document-uri", 1, 1, documentURI},
      {"fn:data", 1, 1, data},
      {"fn:number", 0, 1, numberOfItem},
      {"fn:root", 0, 1, root},
      {"fn:lang", 1, 2, lang},
      {"fn:id", 1, 1, byID},
      {"fn:idref", 1, 1, byID},
      {"fn:QName", 2, 2, makeQName},
      {"fn:local-name-from-QName", 1, 1, localNameFromQName},
      {"fn:namespace-uri-from-QName", 1, 1, namespaceFromQName},
      {"fn:resolve-QName", 2, 2, resolveQName},
      {"fn:namespace-uri-for-prefix", 2, 2, namespaceForPrefix},
      {"fn:in-scope-prefixes", 1, 1, inScopePrefixes},
  };
  return functions;
}

TEST(NodeArguments, EndAsTheRulesSay) {
  expectRules(nodeFunctions());
}

}  // namespace xquery::arguments

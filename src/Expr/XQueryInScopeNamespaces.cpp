#include "Expr/XQueryInScopeNamespaces.h"

#include "Eval/XQueryContextInternal.h"
#include "Platform/XMLNames.h"
#include "Types/XQueryNodeFunctions.h"

#include <algorithm>

namespace xquery {
namespace {

constexpr std::string_view predefinedPrefixes[] = {"xml", "xs", "xsi"};

bool isPredefined(NSStringView prefix) {
  return std::any_of(std::begin(predefinedPrefixes), std::end(predefinedPrefixes),
                     [prefix](std::string_view predefined) { return prefix == predefined; });
}

bool isDeclaredAs(NSStringView prefix, NSStringView URI, const XQueryContextInternal& context) {
  const NSXMLNode* declaration = context.inScopeNamespaceForPrefix(prefix);
  return declaration && declaration->textView() == URI;
}

// On an element under construction or in the prolog.
bool isBoundTo(NSStringView prefix, NSStringView URI, const XQueryContextInternal& context) {
  if (const NSXMLNode* declaration = context.inScopeNamespaceForPrefix(prefix)) {
    return declaration->textView() == URI;
  }
  const Ref<NSString> bound = context.namespaceForPrefix(prefix);
  return bound && bound->view() == URI;
}

}  // namespace

XQueryInScopeNamespaces::~XQueryInScopeNamespaces() {
  while (_count--) _context.popInScopeNamespaces();
}

void XQueryInScopeNamespaces::push(std::vector<Ref<NSXMLNode>> namespaces) {
  _context.pushInScopeNamespaces(std::move(namespaces));
  ++_count;
}

bool XQueryInScopeNamespaces::updateNamespacesForElement(NSXMLElement& element,
                                                         const NSXMLName& qName) {
  const NSStringView prefix = NSXMLPrefixOf(qName);
  const NSStringView URI = NSXMLURIOf(*qName.expanded);
  if (URI.isEmpty() || isPredefined(prefix) || isDeclaredAs(prefix, URI, _context)) return false;
  push({NSXMLNode::namespaceWithName(prefix, URI)});
  element.addNamespace(NSXMLNode::namespaceWithName(prefix, URI));
  return true;
}

void XQueryInScopeNamespaces::keepNamespaces(NSXMLElement& copy, const NSXMLElement& formerParent) {
  for (const Ref<NSXMLNode>& declaration : CopyXQueryNodeNamespaces(&formerParent)) {
    if (!isBoundTo(declaration->nameView(), declaration->textView(), _context)) {
      copy.addNamespace(declaration);
    }
  }
}

}  // namespace xquery

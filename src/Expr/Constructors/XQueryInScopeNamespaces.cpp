#include "Expr/Constructors/XQueryInScopeNamespaces.h"

#include "Context/XQueryContextInternal.h"
#include "Platform/Base/WorkMeter.h"
#include "Platform/Tree/Arena.h"
#include "Platform/Tree/Names.h"
#include "Types/XQueryNodeFunctions.h"

#include <algorithm>
#include <unordered_set>

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
  NSXMLNameRef name = _context.declarationName(prefix);
  const Ref<NSXMLNode> declaration(NSXMLTree::makeLoneNode(Kind::Namespace, URI, name.detach()));
  declare(element, *declaration);
  push({declaration});
  return true;
}

void XQueryInScopeNamespaces::declare(NSXMLElement& element, NSXMLNode& declaration) {
  if (!_declared.insert(declaration.nodeName())) return;
  NSXMLTree::appendProperty(&element, &declaration, _lastDeclared);
  _lastDeclared = &declaration;
}

// There may be very many: each is linked behind the last one, and a table finds the prefixes that
// the copy declares itself.
void XQueryInScopeNamespaces::keepNamespaces(NSXMLElement& copy, const NSXMLElement& formerParent) {
  const NSXMLUnfinished unfinished(copy);
  std::unordered_set<const NSXMLName*> own;
  NSXMLNode* last = nullptr;
  WorkPacer pacer;
  for (NSXMLNode* node = copy.firstNamespace(); node; node = NSXMLElement::nextNamespace(node)) {
    pacer.turn();
    own.insert(node->nodeName());
    last = node;
  }
  for (const Ref<NSXMLNode>& declaration : CopyXQueryNodeNamespaces(&formerParent)) {
    pacer.turn();
    if (own.contains(declaration->nodeName()) ||
        isBoundTo(declaration->nameView(), declaration->textView(), _context)) {
      continue;
    }
    NSXMLTree::appendProperty(&copy, declaration.get(), last);
    last = declaration.get();
  }
}

}  // namespace xquery

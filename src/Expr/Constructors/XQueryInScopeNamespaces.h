// The namespaces that the constructors being evaluated have declared.
#pragma once

#include "Platform/Tree/Names.h"
#include "xquery/Object.h"
#include "xquery/String.h"
#include "xquery/XMLNode.h"

#include <cstddef>
#include <vector>

namespace xquery {

class XQueryContextInternal;

// What one element constructor adds to the namespaces in scope of the context; gone when it goes,
// also when an error ends the constructor.
class XQueryInScopeNamespaces {
 public:
  explicit XQueryInScopeNamespaces(XQueryContextInternal& context) : _context(context) {}
  XQueryInScopeNamespaces(const XQueryInScopeNamespaces&) = delete;
  XQueryInScopeNamespaces& operator=(const XQueryInScopeNamespaces&) = delete;
  ~XQueryInScopeNamespaces();

  void push(std::vector<Ref<NSXMLNode>> namespaces);

  // Adds a parentless declaration to the element, unless that declares the prefix already. An
  // element gets all its declarations here while it is constructed.
  void declare(NSXMLElement& element, NSXMLNode& declaration);

  // Declares the prefix of a name, the element's own or that of an attribute it gets, on the
  // element, unless an element under construction has declared it with the same URI already.
  // Predefined prefixes need no declaration. Answer: whether it declared it.
  bool updateNamespacesForElement(NSXMLElement& element, const NSXMLName& qName);

  // For a copy taken out of `formerParent` where namespaces are not inherited: declares what was in
  // scope there and means something else here.
  void keepNamespaces(NSXMLElement& copy, const NSXMLElement& formerParent);

 private:
  XQueryContextInternal& _context;
  size_t _count = 0;
  NSXMLNode* _lastDeclared = nullptr;
  NSXMLNameSet _declared;
};

}  // namespace xquery

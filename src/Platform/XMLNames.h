// Interned names of the XML tree, one table for the process.
//
// A name is created on first use and freed when its last holder lets go of it; the holders are the
// trees that use it, at one count each, and the handles of compiled queries. So a comparison of
// names is a comparison of pointers, and documents full of unusual names leave nothing behind.
#pragma once

#include "xquery/XMLNode.h"

namespace xquery {

// A namespace URI is shared by the expanded names in it, since a document may put very many names
// into one namespace with a very long URI.
struct NSXMLNamespaceURI;

struct NSXMLExpandedName {
  const NSXMLNamespaceURI* URI;  // null for no namespace
  uint32_t references;
  NSStringView localName;
  uint64_t hash;
};

NSStringView NSXMLURIOf(const NSXMLExpandedName& name);

inline NSStringView NSXMLPrefixOf(const NSXMLName& name) {
  return name.text.substring(0, name.prefixLength);
}

// Each answers a name with one count more, which the caller owns. The first colon of a qualified
// name separates its prefix; one at either end is part of the local name.
const NSXMLName* NSXMLInternName(NSStringView qualifiedName, NSStringView URI);
const NSXMLExpandedName* NSXMLInternExpandedName(NSStringView localName, NSStringView URI);

void NSXMLRetainName(const NSXMLExpandedName* name);
void NSXMLReleaseName(const NSXMLName* name);
void NSXMLReleaseName(const NSXMLExpandedName* name);

// How many names and URIs are alive in the process.
size_t NSXMLInternedNameCount();

}  // namespace xquery

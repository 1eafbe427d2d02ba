// A start tag as it is read: the entries of its names, and its values as they stand there.
#pragma once

#include "Platform/Reading/RawText.h"
#include "Platform/Reading/ReadNames.h"

#include <vector>

namespace xquery {

struct ReadAttribute {
  ReadName* name = nullptr;
  RawText value;
  const NSStringView* URI = nullptr;  // that it declares, in the tree; null for none
};

struct ReadTag {
  std::vector<ReadAttribute, ValueAllocator<ReadAttribute>> attributes;
  bool declares = false;  // namespaces
  bool hasScope = false;  // it does, or has attributes of XML's own

  void clear() {
    attributes.clear();
    declares = hasScope = false;
  }
  void add(const ReadAttribute& attribute) {
    if (attribute.name->declares) declares = true;
    if (attribute.name->declares || attribute.name->isOfXML) hasScope = true;
    attributes.push_back(attribute);
  }
  // What it declares goes into the tree, below the element that is open there.
  void addNamespaces(ReadTree& tree, ReadNames& names) const {
    for (const ReadAttribute& attribute : attributes) {
      ReadPrefix* const prefix = attribute.name->declares;
      if (prefix) tree.addNamespace(names.declarationName(*prefix), attribute.URI);
    }
  }
};

}  // namespace xquery

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
  // The value is for the caller to fill in, where it is: a copy of what has just been written in
  // parts would have to wait for them.
  RawText& add(ReadName* name) {
    if (name->declares) declares = true;
    if (name->declares || name->isOfXML) hasScope = true;
    ReadAttribute& added = attributes.emplace_back();
    added.name = name;
    return added.value;
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

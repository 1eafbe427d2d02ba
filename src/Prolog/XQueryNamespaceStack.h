// The namespaces that element constructors have declared, the innermost constructor's last: those
// that are being bound, or those that are being evaluated.
//
// There are a few as a rule, and they are searched. An element with thousands of attributes
// declares a prefix for each, so whatever lies deeper than a search should go is found by a table.
// Looking something up may fill the table; threads may share a stack only while it is empty.
#pragma once

#include "xquery/Object.h"
#include "xquery/String.h"
#include "xquery/XMLNode.h"

#include <cstddef>
#include <unordered_map>
#include <utility>
#include <vector>

namespace xquery {

class XQueryNamespaceStack {
 public:
  // What one constructor declares at once.
  using Entry = std::vector<Ref<NSXMLNode>>;

  void push(Entry entry) {
    _untabulated += entry.size();
    _entries.push_back(std::move(entry));
  }
  // Nothing where there is none.
  void pop();
  // Of the innermost entry that has one, the first; null when there is none.
  const NSXMLNode* forPrefix(NSStringView prefix) const;
  const NSXMLNode* forURI(NSStringView URI) const;

 private:
  struct TextHash {
    size_t operator()(NSStringView text) const { return text.hash(); }
  };

  void tabulate() const;

  std::vector<Entry> _entries;
  // The declarations of each prefix in the first so many entries, the one to be found last.
  mutable std::unordered_map<NSStringView, std::vector<const NSXMLNode*>, TextHash> _table;
  mutable size_t _tabulated = 0;
  mutable size_t _untabulated = 0;  // declarations in the others
};

}  // namespace xquery

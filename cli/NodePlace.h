// Where nodes stand in their documents.
#pragma once

#include "xquery/xquery.h"

#include <string>
#include <unordered_map>

namespace cli {

// Remembers the positions of what it was asked about, so that asking for all children of a node
// takes no more than looking at them once.
class NodePlaces {
 public:
  // A path from the top of the node's tree: "/catalogue[1]/book[2]/@isbn", "/a[1]/text()[3]".
  std::string place(const xquery::NSXMLNode& node);

 private:
  std::string step(const xquery::NSXMLNode& node);
  size_t position(const xquery::NSXMLNode& node);

  std::unordered_map<const xquery::NSXMLNode*, size_t> _positions;
};

}  // namespace cli

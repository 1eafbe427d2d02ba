// What can be asked of a node without making it the context item.
#pragma once

#include "xquery/XMLNode.h"

#include <optional>

namespace xquery {

class XQueryContext;

class XQueryNodeQuestion {
 public:
  // The truth of an expression with the node for its context item; none where only evaluating it
  // tells. Nothing is left behind.
  virtual std::optional<bool> holdsFor(NSXMLNode* node, const XQueryContext& context) const = 0;
  // Whether there may be a node in whose subtree all those lie for which it holds.
  virtual bool asksForNodeAbove() const { return false; }
  // That node; null where it is not known.
  virtual const NSXMLNode* nodeAbove(const XQueryContext&) const { return nullptr; }

 protected:
  ~XQueryNodeQuestion() = default;
};

}  // namespace xquery

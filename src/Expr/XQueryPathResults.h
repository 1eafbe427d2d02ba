// What a path's last step yields: duplicates removed by identity, ordered on request.
//
// While nodes of one tree arrive in strictly ascending document order, which is nearly always, the
// order itself proves that they are distinct and sorted: no identity set is kept and nothing is
// sorted. The set is built from what has arrived at the first node that breaks the order.
#pragma once

#include <unordered_set>
#include <vector>

#include "xquery/Object.h"
#include "xquery/XMLNode.h"

namespace xquery {

class XQueryContext;

class XQueryPathResults {
 public:
  // Adds the items of a value of any shape. Nodes and atomic values do not mix: error 19.
  void add(const NSObject* value, XQueryContext& context);
  // The same for one node.
  void addNode(NSXMLNode* node, XQueryContext& context);
  void setIsReversed(bool isReversed) { _isReversed = isReversed; }
  bool isReversed() const { return _isReversed; }
  // A value shape. Nodes are sorted when `ordered`, into reverse document order after a reverse
  // axis.
  Value value(bool ordered);

 private:
  enum ItemType : int { NoneYet = 0, Nodes = 1, AtomicValues = 2 };
  void addItem(NSObject* item, XQueryContext& context);
  void store(NSObject* item);
  void buildUnique();

  std::vector<Value> _array;
  std::unordered_set<const NSObject*> _unique;
  bool _ascending = true;  // strictly, and then _unique is not in use
  bool _isReversed = false;
  ItemType _type = NoneYet;
};

}  // namespace xquery

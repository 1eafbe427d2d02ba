// What a path's last step yields: duplicates removed by identity, ordered on request.
// Where only their number is asked for, and perhaps not beyond some number, nothing is referenced.
// Nodes that arrive in the order of the value may be taken one by one instead.
//
// While nodes of one tree arrive in strictly ascending document order, which is nearly always, the
// order itself proves that they are distinct and sorted: no identity set is kept and nothing is
// sorted. Strictly descending order, as a reverse axis gives it, proves the same. The set is built
// from what has arrived at the first node that breaks the order; a node equal to the one stored
// last is a duplicate without breaking it.
#pragma once

#include "Expr/Paths/IdentitySet.h"
#include "Expr/XQueryItemGiver.h"
#include "xquery/Collection.h"
#include "xquery/Object.h"
#include "xquery/XMLNode.h"

#include <cstdint>
#include <vector>

namespace xquery {

class XQueryContext;

class XQueryPathResults {
 public:
  // Adds the items of a value of any shape. Nodes and atomic values do not mix: error 19.
  void add(const NSObject* value, XQueryContext& context);
  // The same for one node.
  void addNode(NSXMLNode* node, XQueryContext& context);
  // Only the first so many items are wanted. To be said first, as the next one.
  void endAfter(uint64_t most) { _most = most; }
  // Of nodes only the number is wanted.
  void countOnly() { _countsOnly = true; }
  // Each node is handed to a taker as it arrives, which says when no more are wanted. To be said
  // first, too; nodes arrive in document order.
  void handTo(XQueryItemGiver::Taker& taker) {
    _taker = &taker;
    _most = UINT64_MAX - 1;
  }
  // All are wanted after all, and none is handed to a taker.
  void takeAll() {
    _most = UINT64_MAX;
    _taker = nullptr;
  }
  bool areHandedOn() const { return _taker != nullptr; }
  bool countsOnly() const { return _countsOnly; }
  // Whether they may be complete before all nodes have been found.
  bool mayEndEarly() const { return _most != UINT64_MAX; }
  // Whether further nodes make no difference.
  bool isComplete() const { return _count >= _most; }
  uint64_t count() const { return _count; }
  // So many nodes more, none of them among those that were added, where they are only counted.
  void addNumber(uint64_t number) { _count += number; }
  void setIsReversed(bool isReversed) { _isReversed = isReversed; }
  bool isReversed() const { return _isReversed; }
  // A value shape. Nodes are sorted when `ordered`, into reverse document order after a reverse
  // axis.
  Value value(bool ordered);

 private:
  enum ItemType : int { NoneYet = 0, Nodes = 1, AtomicValues = 2 };
  // What is known of the items stored so far. One item is in any order.
  enum class Arrival : uint8_t { AnyOrder, Ascending, Descending, Mixed };

  void addItem(NSObject* item, XQueryContext& context);
  bool continuesOrder(const NSXMLNode* node);
  void append(NSObject* item);
  void storeNode(NSXMLNode* node);
  void storeByIdentity(NSObject* item);
  void sort(std::vector<Value>& nodes);

  uint64_t _most = UINT64_MAX;
  uint64_t _count = 0;
  bool _countsOnly = false;
  XQueryItemGiver::Taker* _taker = nullptr;
  // In place of the items, where they are counted only.
  std::vector<NSXMLNode*, ValueAllocator<NSXMLNode*>> _counted;
  Value _firstResult;   // the only item
  Ref<NSArray> _array;  // two or more items
  NSObject* _lastStored = nullptr;
  XQueryIdentitySet _unique;  // in use while the arrival is mixed
  Arrival _arrival = Arrival::AnyOrder;
  bool _isReversed = false;
  ItemType _type = NoneYet;
};

}  // namespace xquery

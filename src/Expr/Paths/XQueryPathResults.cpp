#include "Expr/Paths/XQueryPathResults.h"

#include "Context/XQueryContextInternal.h"
#include "Expr/Paths/NodeOrder.h"
#include "Expr/XQuerySequence.h"
#include "Platform/Base/WorkMeter.h"
#include "Platform/Tree/TreeHead.h"
#include "Types/XQueryErrors.h"
#include "Types/XQueryTypeTable.h"

#include <algorithm>

namespace xquery {
namespace {

[[noreturn]] void raiseWrongItem(const XQueryErrorText<>& text, XQueryContext& context) {
  _internal(context).raise(text.error());
}

}  // namespace

void XQueryPathResults::add(const NSObject* value, XQueryContext& context) {
  const XQueryItemList items(value);
  WorkPacer pacer;
  for (size_t i = 0; i < items.count(); ++i) {
    pacer.turn();
    if (!items[i]) return;
    addItem(items[i], context);
  }
}

void XQueryPathResults::addItem(NSObject* item, XQueryContext& context) {
  if (auto* node = dyn_cast<NSXMLNode>(item)) {
    addNode(node, context);
  } else if (XQueryIsAtomicType(item)) {
    if (_type == Nodes) raiseWrongItem(XQueryErrors::itemNotANode, context);
    _type = AtomicValues;
    storeByIdentity(item);
  } else {
    raiseWrongItem(XQueryErrors::itemNotANodeOrAtomic, context);
  }
}

void XQueryPathResults::addNode(NSXMLNode* node, XQueryContext& context) {
  if (_type == AtomicValues) raiseWrongItem(XQueryErrors::itemNotAtomic, context);
  _type = Nodes;
  storeNode(node);
}

void XQueryPathResults::storeNode(NSXMLNode* node) {
  if (node == _lastStored) return;
  if (!_lastStored || (_arrival != Arrival::Mixed && continuesOrder(node))) {
    append(node);
  } else {
    storeByIdentity(node);
  }
}

bool XQueryPathResults::continuesOrder(const NSXMLNode* node) {
  const auto* last = cast<NSXMLNode>(_lastStored);
  if (!NSXMLNodeOrder::areComparable(last, node)) return false;
  const Arrival step = NSXMLNodeOrder::number(*last) < NSXMLNodeOrder::number(*node)
                           ? Arrival::Ascending
                           : Arrival::Descending;
  if (_arrival == Arrival::AnyOrder) _arrival = step;
  return _arrival == step;
}

void XQueryPathResults::storeByIdentity(NSObject* item) {
  if (item == _lastStored) return;
  if (_lastStored && _arrival != Arrival::Mixed) {
    _arrival = Arrival::Mixed;
    WorkPacer pacer;
    for (const NSXMLNode* stored : _counted) {
      pacer.turn();
      _unique.insert(stored);
    }
    if (_firstResult) _unique.insert(_firstResult.get());
    if (_array) {
      for (const Value& stored : _array->objects()) {
        pacer.turn();
        _unique.insert(stored.get());
      }
    }
  }
  if (_lastStored && !_unique.insert(item)) return;
  append(item);
}

void XQueryPathResults::append(NSObject* item) {
  _lastStored = item;
  ++_count;
  if (_taker) {
    if (!_taker->take(Value(item))) _most = 0;
  } else if (_countsOnly) {
    _counted.push_back(cast<NSXMLNode>(item));
  } else if (_array) {
    _array->objects().push_back(Value(item));
  } else if (_firstResult) {
    _array = NSArray::array();
    _array->objects().reserve(8);
    _array->objects().push_back(std::move(_firstResult));
    _array->objects().push_back(Value(item));
  } else {
    _firstResult = Value(item);
  }
}

Value XQueryPathResults::value(bool ordered) {
  if (_firstResult) return _firstResult;
  if (!_array) return NSNull::null();
  if (ordered && _type == Nodes) sort(_array->objects());
  return _array;
}

void XQueryPathResults::sort(std::vector<Value>& nodes) {
  const Arrival wanted = _isReversed ? Arrival::Descending : Arrival::Ascending;
  if (_arrival == Arrival::Mixed) {
    if (_isReversed) {
      XQuerySortNodesReverse(nodes);
    } else {
      XQuerySortNodesForward(nodes);
    }
  } else if (_arrival != wanted) {
    std::reverse(nodes.begin(), nodes.end());
    _arrival = wanted;
  }
  _lastStored = nodes.back().get();
}

}  // namespace xquery

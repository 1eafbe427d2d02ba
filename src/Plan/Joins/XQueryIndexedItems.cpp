#include "Plan/Joins/XQueryIndexedItems.h"

#include "Expr/XQuerySequence.h"
#include "Plan/Joins/XQueryJoinOperand.h"
#include "Platform/Base/WorkMeter.h"
#include "Platform/Tree/Names.h"
#include "Platform/Tree/TreeHead.h"
#include "Platform/Tree/ValueIndex.h"
#include "xquery/XMLNode.h"

#include <algorithm>
#include <optional>

namespace xquery {
namespace {

const NSXMLNode& nodeAt(const std::vector<Value>& items, size_t index) {
  return *cast<NSXMLNode>(items[index].get());
}

bool areOfOneName(const NSXMLNode& a, const NSXMLNode& b) {
  return a.expandedName() == b.expandedName();
}

// By which key an index finds elements of the name of this one, or attributes by themselves;
// nothing for other nodes.
std::optional<NSXMLValueKey> keyOfName(const NSXMLNode& node, const XQueryValueWay& way) {
  if (!node.expandedName()) return std::nullopt;
  if (node.kind() == Kind::Element) return way.keyFor(*node.expandedName());
  if (node.kind() != Kind::Attribute || !way.isEmpty()) return std::nullopt;
  return NSXMLValueKey{{}, {}, NSXMLExpandedNameRef(node.expandedName())};
}

// The same for elements of any name, by where the way leads to.
std::optional<NSXMLValueKey> keyOfEnd(const NSXMLNode& node, const XQueryValueWay& way) {
  if (node.kind() != Kind::Element || !way.hasKeyOfEnd()) return std::nullopt;
  return way.keyOfEnd();
}

NSXMLIndexedValues indexFor(const std::optional<NSXMLValueKey>& key, const NSXMLNode& node) {
  return key ? NSXMLIndexedValues::of(*key, node.rootNode(), nullptr) : NSXMLIndexedValues();
}

const NSXMLNode* attributeOf(const NSXMLNode& owner, const NSXMLExpandedName* name) {
  const auto* element = dyn_cast<NSXMLElement>(&owner);
  const NSXMLNode* attribute = element ? element->firstAttribute() : nullptr;
  while (attribute && attribute->expandedName() != name) {
    attribute = NSXMLElement::nextAttribute(attribute);
  }
  return attribute;
}

}  // namespace

bool XQueryIndexedItems::mayAnswer(const NSObject* first, const XQueryValueWay& way,
                                   const XQueryContext& context) {
  const auto* node = dyn_cast<NSXMLNode>(first);
  if (!node || !way.isOpen(context)) return false;
  return indexFor(keyOfName(*node, way), *node).values ||
         indexFor(keyOfEnd(*node, way), *node).values;
}

std::unique_ptr<const XQueryIndexedItems> XQueryIndexedItems::of(Items items,
                                                                 const XQueryValueWay& way,
                                                                 const XQueryContext& context) {
  const bool isOpen = items->size() >= fewestItems && items->size() <= UINT32_MAX / 2 &&
                      isa<NSXMLNode>(items->front()) && way.isOpen(context);
  if (!isOpen) return nullptr;
  std::unique_ptr<XQueryIndexedItems> made(new XQueryIndexedItems(std::move(items), way));
  if (!made->takeOrder() || !made->takeIndex()) return nullptr;
  made->_areAll = made->areAllOfTree();
  return made;
}

void XQueryIndexedItems::noteAsked(const std::vector<Value>& items, const XQueryValueWay& way) {
  const auto* first = dyn_cast<NSXMLNode>(items.front());
  if (!first) return;
  WorkPacer pacer;
  const bool haveOneName = std::all_of(items.begin(), items.end(), [&](const Value& item) {
    pacer.turn();
    const auto* node = dyn_cast<NSXMLNode>(item);
    return node && areOfOneName(*node, *first);
  });
  const auto key = haveOneName ? keyOfName(*first, way) : keyOfEnd(*first, way);
  if (key) NSXMLNoteAskedValues(*key, items.size(), first);
}

// Notes the numbers of the items in the document order; false where they are not of one kind and
// tree, or not in that order, each once.
bool XQueryIndexedItems::takeOrder() {
  const NSXMLNode& first = nodeAt(*_items, 0);
  _order.reserve(_items->size());
  WorkPacer pacer;
  for (const Value& item : *_items) {
    pacer.turn();
    if (!item || item->kind() != first.kind()) return false;
    const auto* node = cast<NSXMLNode>(item.get());
    if (!NSXMLNodeOrder::areComparable(&first, node)) return false;
    _areOfOneName = _areOfOneName && areOfOneName(*node, first);
    const uint32_t number = NSXMLNodeOrder::number(*node);
    if (!_order.empty() && _order.back() >= number) return false;
    _order.push_back(number);
  }
  return true;
}

bool XQueryIndexedItems::takeIndex() {
  const NSXMLNode& first = nodeAt(*_items, 0);
  if (!_areOfOneName) {
    _found = Found::Ends;
    _indexed = indexFor(keyOfEnd(first, _way), first);
  } else {
    _found = first.kind() == Kind::Attribute ? Found::Owners : Found::Items;
    _indexed = indexFor(keyOfName(first, _way), first);
  }
  return _indexed.values != nullptr;
}

bool XQueryIndexedItems::areAllOfTree() const {
  if (_found == Found::Ends) return false;
  const NSXMLNode& first = nodeAt(*_items, 0);
  const auto nodes = _found == Found::Owners
                         ? NSXMLIndexedAttributes(first.expandedName(), first.rootNode(), nullptr)
                         : NSXMLIndexedElements(first.expandedName(), first.rootNode(), nullptr);
  return nodes && nodes->nodes.size() == _items->size();
}

// The position of the node among the items; their number where it is none of them.
uint32_t XQueryIndexedItems::positionOf(const NSXMLNode* node) const {
  const uint32_t number = NSXMLNodeOrder::number(*node);
  const auto found = std::lower_bound(_order.begin(), _order.end(), number);
  const bool isItem = found != _order.end() && *found == number;
  return static_cast<uint32_t>((isItem ? found : _order.end()) - _order.begin());
}

// Whether the index knows what equals each of them.
bool XQueryIndexedItems::areTexts(const XQueryItemList& probes) {
  WorkPacer pacer;
  for (size_t i = 0; i < probes.count(); ++i) {
    pacer.turn();
    if (!XQueryJoinOperand(probes[i]).isText()) return false;
  }
  return true;
}

// The item that a node of the index stands for; null for none.
const NSXMLNode* XQueryIndexedItems::itemOf(NSXMLNode* found) const {
  switch (_found) {
    case Found::Items:
      return found;
    case Found::Owners:
      return attributeOf(*found, nodeAt(*_items, 0).expandedName());
    case Found::Ends:
      return _way.start(found);
  }
  return nullptr;
}

// Calls visit(position) for the items that have one of the values, until it answers false; those of
// one value in their order, unless a way leads up to them.
template <class Visit>
void XQueryIndexedItems::visit(const XQueryItemList& probes, size_t& looked, Visit visit) const {
  WorkPacer pacer;
  for (size_t i = 0; i < probes.count(); ++i) {
    const XQueryJoinOperand probe(probes[i]);
    for (NSXMLNode* found : _indexed.values->nodes(probe.text.view())) {
      pacer.turn();
      ++looked;
      const NSXMLNode* item = itemOf(found);
      const size_t position = item ? positionOf(item) : _items->size();
      if (position < _items->size() && !visit(static_cast<uint32_t>(position))) return;
    }
  }
}

bool XQueryIndexedItems::find(const XQueryItemList& probes, bool wantsFirst,
                              std::vector<uint32_t>& positions, size_t& looked) const {
  if (!areTexts(probes)) return false;
  const bool areInOrder = probes.count() < 2 && _found != Found::Ends;
  visit(probes, looked, [&](uint32_t position) {
    positions.push_back(position);
    return !(wantsFirst && areInOrder);
  });
  if (areInOrder) return true;
  std::sort(positions.begin(), positions.end());
  positions.erase(std::unique(positions.begin(), positions.end()), positions.end());
  return true;
}

std::optional<bool> XQueryIndexedItems::holds(const XQueryItemList& probes, size_t& looked) const {
  if (!areTexts(probes)) return std::nullopt;
  bool isFound = false;
  if (_areAll) {
    WorkPacer pacer;
    for (size_t i = 0; i < probes.count() && !isFound; ++i) {
      pacer.turn();
      const XQueryJoinOperand probe(probes[i]);
      isFound = _indexed.values->numberOf(probe.text.view()) < _indexed.values->valueCount();
    }
    return isFound;
  }
  visit(probes, looked, [&](uint32_t) {
    isFound = true;
    return false;
  });
  return isFound;
}

}  // namespace xquery

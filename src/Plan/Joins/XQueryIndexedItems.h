// The items of a list by a value that belongs to them, from the index of the tree that they are in.
//
// A table of the keys of a list is made by each evaluation for itself. Where the items are elements
// or attributes of one tree, and the key is what a way by names leads to from each, the tree may
// have an index that answers the same, and keeps it for the evaluations to come:
//
//   for $b in //book, $c in //cite where $c/@key = $b/@key      cite elements by their @key
//   let $ids := //buyer/@person return //person[@id = $ids]     person attributes by themselves
//   for $b in //book return /records/*[cite/@key = $b/@key]     cite elements by their @key, from
//                                                               which the way goes up: the records
//                                                               have several names
//
// What the index finds anywhere in the tree is looked for in the list, whose items are in document
// order. Untyped values equal texts by their text; of other probes the index knows nothing.
#pragma once

#include "Plan/Paths/XQueryValueWay.h"
#include "Platform/Tree/TreeIndexes.h"
#include "xquery/Object.h"

#include <cstdint>
#include <memory>
#include <optional>
#include <utility>
#include <vector>

namespace xquery {

class NSXMLNode;
class XQueryContext;
class XQueryItemList;

class XQueryIndexedItems {
 public:
  // A walk through fewer items is as quick.
  static constexpr size_t fewestItems = 32;
  using Items = std::shared_ptr<const std::vector<Value>>;

  // Whether there is an index, or one is made now, for what the items seem to be by the first of
  // them.
  [[nodiscard]] static bool mayAnswer(const NSObject* first, const XQueryValueWay& way,
                                      const XQueryContext& context);
  // Null where no index can answer for all of the items.
  [[nodiscard]] static std::unique_ptr<const XQueryIndexedItems> of(Items items,
                                                                    const XQueryValueWay& way,
                                                                    const XQueryContext& context);
  // For: no index, after which all of the items were asked for their keys.
  static void noteAsked(const std::vector<Value>& items, const XQueryValueWay& way);

  // Lists the positions, counted from 0, of the items that have one of the values, each once, in
  // their order; the list is empty before. False, and nothing listed, where a probe is no text.
  // With `wantsFirst`, items behind the first one may be left out. `looked` grows by how many nodes
  // the index has found, which are not all items.
  bool find(const XQueryItemList& probes, bool wantsFirst, std::vector<uint32_t>& positions,
            size_t& looked) const;
  // Whether there are such items; nothing where a probe is no text.
  std::optional<bool> holds(const XQueryItemList& probes, size_t& looked) const;
  // Whether a table of the items would have taken less than looking for so many nodes among them.
  bool isWorthATable(size_t looked) const {
    constexpr size_t mostRounds = 2;
    return looked >= mostRounds * _items->size();
  }

 private:
  // What the index answers: items, elements that have an item for an attribute, or elements to
  // which the way leads from an item.
  enum class Found : uint8_t { Items, Owners, Ends };

  XQueryIndexedItems(Items items, const XQueryValueWay& way)
      : _items(std::move(items)), _way(way) {}

  bool takeOrder();
  bool takeIndex();
  bool areAllOfTree() const;
  static bool areTexts(const XQueryItemList& probes);
  template <class Visit>
  void visit(const XQueryItemList& probes, size_t& looked, Visit visit) const;
  const NSXMLNode* itemOf(NSXMLNode* found) const;
  uint32_t positionOf(const NSXMLNode* node) const;

  const Items _items;
  const XQueryValueWay _way;
  NSXMLIndexedValues _indexed;
  std::vector<uint32_t> _order;  // the numbers of the items in the document order
  bool _areOfOneName = true;
  Found _found = Found::Items;
  bool _areAll = false;  // there are no others of the name in the tree
};

}  // namespace xquery

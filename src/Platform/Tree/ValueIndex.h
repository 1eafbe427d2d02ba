// The elements of one name by a value that belongs to them: an attribute of their own, the text of
// a child, an attribute of a grandchild, the text of a descendant and so on.
//
//   for item, seller/@person      <item><seller person="p1"/><seller person="p2"/></item>
//                                 is found by "p1" and by "p2"
//
// A value is the string value of the node that the key leads to, or the text of each of its texts;
// texts are the same when their units are. An element may have several values, one of them twice,
// or none: it is found once by each. Texts are not copied: a value is known by the first node that
// has it.
//
// As a name index, it is made in one pass, never changes and is of the tree as it was. Where
// elements lie in each other, each has the values of all below it: an index that would become much
// larger than what it is made from is given up.
#pragma once

#include "Platform/Tree/NameIndex.h"
#include "Platform/Tree/Names.h"

#include <memory>
#include <utility>
#include <vector>

namespace xquery {

// A step down to elements of a name.
struct NSXMLValueStep {
  NSXMLValueStep(NSXMLExpandedNameRef ofName, bool toDescendants = false)
      : name(std::move(ofName)), isToDescendants(toDescendants) {}

  NSXMLExpandedNameRef name;
  bool isToDescendants;  // as the axis finds them: up to `descendantStop`; else children

  friend bool operator==(const NSXMLValueStep& a, const NSXMLValueStep& b) {
    return a.name.get() == b.name.get() && a.isToDescendants == b.isToDescendants;
  }
};

// Which elements, and the way from each to its values.
struct NSXMLValueKey {
  NSXMLExpandedNameRef
      element;  // null for those of any name that have the attribute, without steps
  std::vector<NSXMLValueStep> steps;  // none: the element
  NSXMLExpandedNameRef attribute;     // of what the steps lead to; null for its own string value
  bool ofTexts = false;               // its children that are texts, each with its own value

  friend bool operator==(const NSXMLValueKey& a, const NSXMLValueKey& b);
};

class NSXMLValueIndex {
 public:
  // The elements that the key names, in document order; `names` are the elements of the tree.
  [[nodiscard]] static std::unique_ptr<const NSXMLValueIndex> make(NSXMLNodeSpan elements,
                                                                   const NSXMLValueKey& key,
                                                                   const NSXMLNameIndex& names);
  // What making one is likely to take at most, for so many elements: few have several values.
  static size_t likelyBytes(size_t elements) { return elements * bytesPerElement; }

  // Whether it has been given up: it knows nothing.
  bool isGivenUp() const { return _isGivenUp; }
  // The elements that have the value, in document order.
  NSXMLNodeSpan nodes(NSStringView value) const { return nodes(numberOf(value)); }
  // The number of the value, and valueCount() for one that no element has.
  uint32_t numberOf(NSStringView value) const;
  NSXMLNodeSpan nodes(uint32_t number) const;
  // How many different values there are.
  size_t valueCount() const { return _values.size(); }

 private:
  class Maker;
  struct KnownValue {
    NSXMLNodePlace first;  // with this value
    uint32_t hash;
    uint32_t end;  // of its elements, which begin where those of the value before it end
  };
  static constexpr uint32_t free = UINT32_MAX;
  // The lists of values, of the elements and of what is noted of both while they grow; the table.
  static constexpr size_t bytesPerElement =
      3 * (sizeof(KnownValue) + 2 * sizeof(NSXMLNodePlace) + sizeof(uint32_t)) +
      sizeof(NSXMLNodePlace) + 6 * sizeof(uint32_t);

  NSXMLValueIndex() = default;
  // The place of the value, or the free one where it belongs.
  size_t placeOf(NSStringView value, uint32_t hash) const;
  void growTable();

  NSXMLIndexList<uint32_t> _table;  // numbers of values; 2^n places, at most half of them taken
  NSXMLIndexList<KnownValue> _values;
  NSXMLNodeList _nodes;
  uintptr_t _start = 0;  // of the range that the places are in
  bool _isGivenUp = false;
};

}  // namespace xquery

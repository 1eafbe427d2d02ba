#include "Platform/Tree/ValueIndex.h"

#include "Platform/Base/WorkMeter.h"
#include "Platform/Tree/Arena.h"

#include <algorithm>

namespace xquery {

namespace {

constexpr size_t smallestTable = 16;

// The string value of a node, copied only where it consists of several texts.
class StringValue {
 public:
  explicit StringValue(const NSXMLNode* node) {
    const NSXMLNode* const child = node->firstChild();
    if (child && (child->kind() != Kind::Text || child->nextSibling())) {
      _joined = node->stringValue();
      _view = _joined->view();
    } else {
      _view = (child ? child : node)->textView();
    }
  }
  NSStringView view() const { return _view; }

 private:
  Ref<NSString> _joined;
  NSStringView _view;
};

// Calls `visit` with each node that the key leads to from the element, in document order, going
// down from step `at` on. The steps are as many as somebody wrote.
template <class Visit>
void forEachValue(const NSXMLNode* element, const NSXMLValueKey& key, size_t at, WorkPacer& pacer,
                  Visit& visit) {
  if (at < key.children.size()) {
    const NSXMLExpandedName* const name = key.children[at].get();
    for (const NSXMLNode* child = element->firstChild(); child; child = child->nextSibling()) {
      pacer.turn();
      if (child->kind() == Kind::Element && child->expandedName() == name) {
        forEachValue(child, key, at + 1, pacer, visit);
      }
    }
    return;
  }
  const NSXMLExpandedName* const name = key.attribute.get();
  if (!name) return visit(element);
  for (const NSXMLNode* attribute = cast<NSXMLElement>(element)->firstAttribute(); attribute;
       attribute = NSXMLElement::nextAttribute(attribute)) {
    pacer.turn();
    if (attribute->expandedName() == name) visit(attribute);
  }
}

}  // namespace

bool operator==(const NSXMLValueKey& a, const NSXMLValueKey& b) {
  const auto isSame = [](const NSXMLExpandedNameRef& x, const NSXMLExpandedNameRef& y) {
    return x.get() == y.get();
  };
  return isSame(a.element, b.element) && isSame(a.attribute, b.attribute) &&
         std::equal(a.children.begin(), a.children.end(), b.children.begin(), b.children.end(),
                    isSame);
}

size_t NSXMLValueIndex::placeOf(NSStringView value, uint32_t hash) const {
  const size_t mask = _table.size() - 1;
  const auto isValue = [&](const KnownValue& known) {
    return known.hash == hash && StringValue(known.first).view() == value;
  };
  WorkPacer pacer;
  size_t place = hash & mask;
  while (_table[place] != free && !isValue(_values[_table[place]])) {
    pacer.turn();
    place = (place + 1) & mask;
  }
  return place;
}

void NSXMLValueIndex::growTable() {
  const size_t size = _table.empty() ? smallestTable : 2 * _table.size();
  _table.assign(size, free);
  WorkPacer pacer;
  for (uint32_t number = 0; number < _values.size(); ++number) {
    pacer.turn();
    size_t place = _values[number].hash & (size - 1);
    while (_table[place] != free) place = (place + 1) & (size - 1);
    _table[place] = number;
  }
}

// Notes the elements in document order, each with the number of its value, and then puts them value
// by value. While it does so, a value's `end` is how many elements it has.
class NSXMLValueIndex::Maker {
 public:
  Maker() { _index->growTable(); }

  void add(NSXMLNode* element, const NSXMLNode* valueNode) {
    const StringValue value(valueNode);
    const uint32_t number = numberOf(value.view(), valueNode);
    if (_lastElements[number] == element) return;
    _lastElements[number] = element;
    ++_index->_values[number].end;
    _numbers.push_back(number);
    _arrived.push_back(element);
  }
  std::unique_ptr<const NSXMLValueIndex> index();

 private:
  uint32_t numberOf(NSStringView value, const NSXMLNode* node) {
    const uint32_t hash = value.hash();
    const size_t place = _index->placeOf(value, hash);
    if (_index->_table[place] != free) return _index->_table[place];
    const auto number = static_cast<uint32_t>(_index->_values.size());
    _index->_table[place] = number;
    _index->_values.push_back({node, hash, 0});
    _lastElements.push_back(nullptr);
    if (2 * _index->_values.size() > _index->_table.size()) _index->growTable();
    return number;
  }

  std::unique_ptr<NSXMLValueIndex> _index{new NSXMLValueIndex};
  NSXMLIndexList<const NSXMLNode*> _lastElements;  // by number of the value
  NSXMLIndexList<NSXMLNode*> _arrived;
  NSXMLIndexList<uint32_t> _numbers;  // of the values of those elements
};

std::unique_ptr<const NSXMLValueIndex> NSXMLValueIndex::Maker::index() {
  NSXMLIndexList<uint32_t> next;  // by number: where the value's next element goes
  next.reserve(_index->_values.size());
  WorkPacer pacer;
  uint32_t sum = 0;
  for (KnownValue& each : _index->_values) {
    pacer.turn();
    next.push_back(sum);
    sum += each.end;
    each.end = sum;
  }
  _index->_nodes.resize(_arrived.size());
  for (size_t i = 0; i < _arrived.size(); ++i) {
    pacer.turn();
    _index->_nodes[next[_numbers[i]]++] = _arrived[i];
  }
  return std::move(_index);
}

std::unique_ptr<const NSXMLValueIndex> NSXMLValueIndex::make(NSXMLNodeSpan elements,
                                                             const NSXMLValueKey& key) {
  Maker maker;
  WorkPacer pacer;
  for (NSXMLNode* element : elements) {
    pacer.turn();
    const auto add = [&](const NSXMLNode* value) { maker.add(element, value); };
    forEachValue(element, key, 0, pacer, add);
  }
  return maker.index();
}

NSXMLNodeSpan NSXMLValueIndex::nodes(NSStringView value) const {
  const uint32_t number = _table[placeOf(value, value.hash())];
  if (number == free) return {};
  const uint32_t begin = number == 0 ? 0 : _values[number - 1].end;
  return NSXMLNodeSpan(_nodes).subspan(begin, _values[number].end - begin);
}

}  // namespace xquery

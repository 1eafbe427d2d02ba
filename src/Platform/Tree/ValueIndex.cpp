#include "Platform/Tree/ValueIndex.h"

#include "Platform/Base/WorkMeter.h"
#include "Platform/Tree/Arena.h"
#include "Platform/Tree/Names.h"
#include "Platform/Tree/TreeIndexes.h"

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

// Goes from an element to each node that the key leads to, in document order where no step leads to
// descendants, as long as `visit` answers true.
template <class Visit>
class ValueWalk {
 public:
  ValueWalk(const NSXMLValueKey& key, const NSXMLNameIndex& names, Visit visit)
      : _key(key), _names(names), _visit(visit) {}

  // Going down from step `at` on. The steps are as many as somebody wrote.
  bool walk(const NSXMLNode* element, size_t at = 0) {
    if (at == _key.steps.size()) return visitValues(element);
    const NSXMLValueStep& step = _key.steps[at];
    const NSXMLExpandedName* const name = step.name.get();
    if (step.isToDescendants) return walkDescendants(element, at);
    for (const NSXMLNode* child = element->firstChild(); child; child = child->nextSibling()) {
      _pacer.turn();
      if (child->kind() != Kind::Element || child->expandedName() != name) continue;
      if (!walk(child, at + 1)) return false;
      if (child->nextSibling() && NSXMLTreeIndexes::isSingle(child)) return true;
    }
    return true;
  }

 private:
  bool walkDescendants(const NSXMLNode* element, size_t at) {
    const NSXMLNode* const first = element->nextNode();
    const NSXMLNode* const stop = NSXMLTree::descendantStop(element);
    if (!first || first == stop) return true;
    const auto found =
        NSXMLNameIndex::between(_names.nodes(_key.steps[at].name.get()), first, stop);
    for (const NSXMLNode* each : found) {
      _pacer.turn();
      if (!walk(each, at + 1)) return false;
    }
    return true;
  }

  bool visitValues(const NSXMLNode* element) {
    if (_key.ofTexts) return visitTexts(element);
    const NSXMLExpandedName* const name = _key.attribute.get();
    if (!name) return _visit(element);
    for (const NSXMLNode* attribute = cast<NSXMLElement>(element)->firstAttribute(); attribute;
         attribute = NSXMLElement::nextAttribute(attribute)) {
      _pacer.turn();
      if (attribute->expandedName() == name && !_visit(attribute)) return false;
    }
    return true;
  }

  bool visitTexts(const NSXMLNode* element) {
    for (const NSXMLNode* child = element->firstChild(); child; child = child->nextSibling()) {
      _pacer.turn();
      if (child->kind() == Kind::Text && !_visit(child)) return false;
    }
    return true;
  }

  const NSXMLValueKey& _key;
  const NSXMLNameIndex& _names;
  Visit _visit;
  WorkPacer _pacer;
};

}  // namespace

bool operator==(const NSXMLValueKey& a, const NSXMLValueKey& b) {
  const auto isSame = [](const NSXMLExpandedNameRef& x, const NSXMLExpandedNameRef& y) {
    return x.get() == y.get();
  };
  return isSame(a.element, b.element) && isSame(a.attribute, b.attribute) &&
         a.ofTexts == b.ofTexts && a.steps == b.steps;
}

size_t NSXMLValueIndex::placeOf(NSStringView value, uint32_t hash) const {
  const size_t mask = _table.size() - 1;
  const auto isValue = [&](const KnownValue& known) {
    return known.hash == hash && StringValue(known.first.node(_start)).view() == value;
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

  void add(const NSXMLNode* element, const NSXMLNode* valueNode) {
    const StringValue value(valueNode);
    const uint32_t number = numberOf(value.view(), valueNode);
    const NSXMLNodePlace place(element);
    if (_lastElements[number] == place) return;
    _lastElements[number] = place;
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
    _index->_start = NSXMLNodePlace::start(node);
    _index->_values.push_back({NSXMLNodePlace(node), hash, 0});
    _lastElements.push_back({});
    if (2 * _index->_values.size() > _index->_table.size()) _index->growTable();
    return number;
  }

  std::unique_ptr<NSXMLValueIndex> _index{new NSXMLValueIndex};
  NSXMLIndexList<NSXMLNodePlace> _lastElements;  // by number of the value
  NSXMLNodeList _arrived;
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
  _index->_nodes.arrange(_arrived, [&](size_t i) {
    pacer.turn();
    return next[_numbers[i]]++;
  });
  return std::move(_index);
}

std::unique_ptr<const NSXMLValueIndex> NSXMLValueIndex::make(NSXMLNodeSpan elements,
                                                             const NSXMLValueKey& key,
                                                             const NSXMLNameIndex& names) {
  // Some elements may have several values; if all of them have many, they lie in each other.
  constexpr size_t fewValues = 1024;
  constexpr size_t mostValuesOfEach = 8;
  size_t valuesLeft = fewValues + mostValuesOfEach * elements.size();
  const bool goesDown = std::any_of(key.steps.begin(), key.steps.end(),
                                    [](const auto& step) { return step.isToDescendants; });
  Maker maker;
  WorkPacer pacer;
  const NSXMLNode* element = nullptr;
  ValueWalk walk(key, names, [&](const NSXMLNode* value) {
    maker.add(element, value);
    return !goesDown || --valuesLeft > 0;
  });
  for (const NSXMLNode* each : elements) {
    pacer.turn();
    element = each;
    if (walk.walk(each)) continue;
    std::unique_ptr<NSXMLValueIndex> nothing(new NSXMLValueIndex);
    nothing->growTable();
    nothing->_isGivenUp = true;
    return nothing;
  }
  return maker.index();
}

uint32_t NSXMLValueIndex::numberOf(NSStringView value) const {
  const uint32_t number = _table[placeOf(value, value.hash())];
  return number == free ? static_cast<uint32_t>(_values.size()) : number;
}

NSXMLNodeSpan NSXMLValueIndex::nodes(uint32_t number) const {
  if (number >= _values.size()) return {};
  const uint32_t begin = number == 0 ? 0 : _values[number - 1].end;
  return _nodes.span().subspan(begin, _values[number].end - begin);
}

}  // namespace xquery

#include "Platform/Tree/NameIndex.h"

#include "Platform/Base/WorkMeter.h"
#include "Platform/Tree/Arena.h"
#include "Platform/Tree/Names.h"

#include <algorithm>
#include <iterator>
#include <utility>

namespace xquery {

namespace {

constexpr size_t smallestTable = 16;

}  // namespace

size_t NSXMLNameIndex::placeOf(const NSXMLIndexList<Name>& table, const NSXMLExpandedName* name) {
  const size_t mask = table.size() - 1;
  size_t place = name->hash & mask;
  while (table[place].name && table[place].name != name) place = (place + 1) & mask;
  return place;
}

// Notes the nodes in document order, each with the number of its name, and then puts them name by
// name. While it does so, a name's `begin` is its number and its `end` how many nodes it has.
class NSXMLNameIndex::Maker {
 public:
  explicit Maker(uint32_t mostNodes) : _table(smallestTable) {
    _arrived.reserve(mostNodes);
    _numbers.reserve(mostNodes);
  }

  void add(const NSXMLNode* node) {
    const NSXMLName* const written = node->nodeName();
    size_t place = placeOf(_table, written->expanded);
    if (!_table[place].name) place = addName(written);
    Name& name = _table[place];
    if (name.writtenAs != written) name.writtenAs = nullptr;
    ++name.end;
    _numbers.push_back(name.begin);
    _arrived.push_back(node);
  }
  void addInstruction() { _hasInstructions = true; }
  std::unique_ptr<const NSXMLNameIndex> index();

 private:
  size_t addName(const NSXMLName* written) {
    if (2 * (size_t{_nameCount} + 1) > _table.size()) grow();
    const size_t place = placeOf(_table, written->expanded);
    _table[place] = {written->expanded, written, _nameCount++, 0};
    return place;
  }
  void grow() {
    NSXMLIndexList<Name> old(2 * _table.size());
    old.swap(_table);
    WorkPacer pacer;
    for (const Name& each : old) {
      pacer.turn();
      if (each.name) _table[placeOf(_table, each.name)] = each;
    }
  }

  NSXMLIndexList<Name> _table;
  uint32_t _nameCount = 0;
  bool _hasInstructions = false;
  NSXMLNodeList _arrived;
  NSXMLIndexList<uint32_t> _numbers;  // of the names of those nodes
};

std::unique_ptr<const NSXMLNameIndex> NSXMLNameIndex::Maker::index() {
  WorkPacer pacer;
  NSXMLIndexList<uint32_t> next(_nameCount);  // by number: where the name's next node goes
  for (const Name& each : _table) {
    if (each.name) next[each.begin] = each.end;
  }
  uint32_t sum = 0;
  for (uint32_t& each : next) {
    pacer.turn();
    const uint32_t count = each;
    each = sum;
    sum += count;
  }
  for (Name& each : _table) {
    pacer.turn();
    if (!each.name) continue;
    each.begin = next[each.begin];
    each.end += each.begin;
  }
  std::unique_ptr<NSXMLNameIndex> made(new NSXMLNameIndex);
  made->_nodes.arrange(_arrived, [&](size_t i) {
    pacer.turn();
    return next[_numbers[i]]++;
  });
  made->_table = std::move(_table);
  made->_hasInstructions = _hasInstructions;
  return made;
}

std::unique_ptr<const NSXMLNameIndex> NSXMLNameIndex::ofElements(const NSXMLNode* root,
                                                                 uint32_t mostNodes) {
  Maker maker(mostNodes);
  WorkPacer pacer;
  for (const NSXMLNode* node = root; node; node = node->nextNode()) {
    pacer.turn();
    if (node->kind() == Kind::Element) {
      maker.add(node);
    } else if (node->kind() == Kind::ProcessingInstruction) {
      maker.addInstruction();
    }
  }
  return maker.index();
}

std::unique_ptr<const NSXMLNameIndex> NSXMLNameIndex::ofAttributes(const NSXMLNode* root,
                                                                   uint32_t mostNodes) {
  Maker maker(mostNodes);
  WorkPacer pacer;
  for (const NSXMLNode* node = root; node; node = node->nextNode()) {
    pacer.turn();
    const auto* element = dyn_cast<NSXMLElement>(node);
    if (!element) continue;
    for (const NSXMLNode* attribute = element->firstAttribute(); attribute;
         attribute = NSXMLElement::nextAttribute(attribute)) {
      pacer.turn();
      maker.add(attribute);
    }
  }
  return maker.index();
}

NSXMLNodeSpan NSXMLNameIndex::nodes(const NSXMLExpandedName* name) const {
  const Name& found = _table[placeOf(_table, name)];
  return _nodes.span().subspan(found.begin, found.end - found.begin);
}

NSXMLNameIndex::Part NSXMLNameIndex::partOf(const Name& name, const NSXMLNameSelection& selection,
                                            const NSXMLNode* first, const NSXMLNode* stop) const {
  if (!name.name || !selection.mayTake(*name.name)) return {};
  const NSXMLNodeSpan all = _nodes.span().subspan(name.begin, name.end - name.begin);
  const bool areAlike = name.writtenAs != nullptr;
  if (areAlike && !selection.takes(*all.front())) return {};
  return {between(all, first, stop), areAlike};
}

NSXMLNodeList NSXMLNameIndex::nodes(const NSXMLNameSelection& selection, const NSXMLNode* first,
                                    const NSXMLNode* stop) const {
  WorkPacer pacer;
  const auto isBefore = [&pacer](const NSXMLNode* a, const NSXMLNode* b) {
    pacer.turn();
    return a->orderNumber() < b->orderNumber();
  };
  NSXMLNodeList found;
  NSXMLNodeList merged;
  bool areSure = true;
  for (const Name& name : _table) {
    pacer.turn();
    const Part more = partOf(name, selection, first, stop);
    if (more.nodes.empty()) continue;
    areSure = areSure && more.isSure;
    merged.clear();
    merged.reserve(found.size() + more.nodes.size());
    const NSXMLNodeSpan before = found.span();
    std::merge(before.begin(), before.end(), more.nodes.begin(), more.nodes.end(),
               std::back_inserter(merged), isBefore);
    std::swap(found, merged);
  }
  if (areSure) return found;
  found.keepThose([&](const NSXMLNode& node) {
    pacer.turn();
    return selection.takes(node);
  });
  return found;
}

uint64_t NSXMLNameIndex::count(const NSXMLNameSelection& selection, const NSXMLNode* first,
                               const NSXMLNode* stop) const {
  WorkPacer pacer;
  uint64_t count = 0;
  for (const Name& name : _table) {
    pacer.turn();
    const Part part = partOf(name, selection, first, stop);
    if (part.isSure) {
      count += part.nodes.size();
      continue;
    }
    for (const NSXMLNode* node : part.nodes) {
      pacer.turn();
      if (selection.takes(*node)) ++count;
    }
  }
  return count;
}

NSXMLNodeSpan NSXMLNameIndex::between(NSXMLNodeSpan nodes, const NSXMLNode* first,
                                      const NSXMLNode* stop) {
  const auto placeOf = [](NSXMLNodeSpan among, const NSXMLNode* node) {
    const auto isBefore = [](const NSXMLNode* a, uint32_t number) {
      return a->orderNumber() < number;
    };
    const auto found = std::lower_bound(among.begin(), among.end(), node->orderNumber(), isBefore);
    return static_cast<size_t>(found - among.begin());
  };
  const NSXMLNodeSpan rest = nodes.subspan(placeOf(nodes, first));
  return stop ? rest.first(placeOf(rest, stop)) : rest;
}

NSXMLNodeSpan NSXMLNameIndex::inside(NSXMLNodeSpan nodes, const NSXMLNode* node) {
  if (node->kind() != Kind::Element && node->kind() != Kind::Document) return {};
  const NSXMLNodeSpan found = between(nodes, node, NSXMLTree::endOfSubtree(node));
  return !found.empty() && found.front() == node ? found.subspan(1) : found;
}

}  // namespace xquery

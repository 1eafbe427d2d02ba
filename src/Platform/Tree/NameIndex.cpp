#include "Platform/Tree/NameIndex.h"

#include "Platform/Base/WorkMeter.h"
#include "Platform/Tree/Arena.h"
#include "Platform/Tree/Names.h"
#include "Platform/Tree/TreeHead.h"

#include <algorithm>
#include <iterator>
#include <utility>

namespace xquery {

namespace {

constexpr size_t smallestTable = 16;

// Of an element, without a call for each.
const NSXMLName* nameOf(const NSXMLNode* element) {
  return NSXMLTree::nameOf(const_cast<NSXMLElement*>(static_cast<const NSXMLElement*>(element)));
}

}  // namespace

size_t NSXMLNameIndex::placeOf(const NSXMLIndexList<Name>& table, const NSXMLExpandedName* name) {
  const size_t mask = table.size() - 1;
  size_t place = name->hash & mask;
  while (table[place].name && table[place].name != name) place = (place + 1) & mask;
  return place;
}

// Notes the nodes in document order, each with its way, and then puts them name by name. Ways are
// found by the way above and the name as it is written, so that no name is looked at for a node.
// Where there are too many, and for attributes, names are all there is: every way is below the
// first one.
class NSXMLNameIndex::Maker {
 public:
  explicit Maker(uint32_t mostNodes, bool hasWays = true)
      : _table(placesPerWay * smallestTable), _hasWays(hasWays) {
    _arrived.reserve(mostNodes);
    _wayOf.reserve(mostNodes);
    _ways.emplace_back();
  }

  // Answers its way.
  uint32_t add(const NSXMLNode* node, const NSXMLName* written, uint32_t above) {
    uint32_t way = _table[placeOf(_hasWays ? above : 0, written)];
    if (!way) way = addWay(node, written, above);
    ++_ways[way].count;
    _wayOf.push_back(way);
    _arrived.push_back(node);
    return way;
  }
  uint32_t above(uint32_t way) const { return _ways[way].above; }
  // The descendant axis goes on behind the subtrees of elements on this way and on those above it,
  // so many in all.
  void noteRunningOn(uint32_t way, size_t levels) {
    WorkPacer pacer;
    for (; levels > 0; --levels, way = above(way)) {
      pacer.turn();
      _ways[way].runsOn = true;
    }
  }
  void addInstruction() { _hasInstructions = true; }
  std::unique_ptr<const NSXMLNameIndex> index();

 private:
  // The place of the way, or the empty one where it belongs.
  size_t placeOf(uint32_t above, const NSXMLName* written) const {
    constexpr uint64_t mix = 0x9E3779B97F4A7C15;
    const size_t mask = _table.size() - 1;
    const uint64_t key = (reinterpret_cast<uintptr_t>(written) >> 3) + (uint64_t{above} << 32);
    size_t place = (key * mix >> 32) & mask;
    while (const uint32_t way = _table[place]) {
      if (_ways[way].name == written && _ways[way].above == above) break;
      place = (place + 1) & mask;
    }
    return place;
  }
  uint32_t addWay(const NSXMLNode* node, const NSXMLName* written, uint32_t above) {
    if (_hasWays && _ways.size() > mostWays) loseWays();
    if (!_hasWays) above = 0;
    if (placesPerWay * (_ways.size() + 1) > _table.size()) grow();
    const size_t place = placeOf(above, written);
    // There may be one by now, as that of a name alone.
    if (_table[place]) return _table[place];
    const auto way = static_cast<uint32_t>(_ways.size());
    _table[place] = way;
    _ways.push_back({written, node, above, 0, 0, _ways[above].below, false});
    _ways[above].below = way;
    return way;
  }
  void loseWays() {
    _hasWays = false;
    for (Way& each : _ways) each.above = 0;
    std::fill(_table.begin(), _table.end(), 0);
    enterWays();
  }
  void grow() {
    NSXMLIndexList<uint32_t>(2 * _table.size()).swap(_table);
    enterWays();
  }
  // Into a table of zeros.
  void enterWays() {
    WorkPacer pacer;
    for (uint32_t way = 1; way < _ways.size(); ++way) {
      pacer.turn();
      _table[placeOf(_ways[way].above, _ways[way].name)] = way;
    }
  }
  static void growNames(NSXMLIndexList<Name>& table) {
    NSXMLIndexList<Name> old(2 * table.size());
    old.swap(table);
    WorkPacer pacer;
    for (const Name& each : old) {
      pacer.turn();
      if (each.name) table[NSXMLNameIndex::placeOf(table, each.name)] = each;
    }
  }
  NSXMLIndexList<Name> names(NSXMLIndexList<uint32_t>& nameOf);
  // Where there are nearly as many ways as elements, walks are short.
  bool areWaysOfUse() const {
    return _hasWays && _ways.size() * sizeof(Way) <= _arrived.size() * sizeof(NSXMLNodePlace);
  }

  // 2^n places, each with a way or 0. So few of them are taken that the first one tried is nearly
  // always the one: which it is nobody could foresee.
  static constexpr size_t placesPerWay = 8;
  NSXMLIndexList<uint32_t> _table;
  NSXMLIndexList<Way> _ways;
  bool _hasWays;
  bool _hasInstructions = false;
  NSXMLNodeList _arrived;
  NSXMLIndexList<uint32_t> _wayOf;  // those nodes
};

// The table of the names, each with its number for `begin` and how many nodes it has for `end`;
// `nameOf` takes the numbers by way.
NSXMLIndexList<NSXMLNameIndex::Name> NSXMLNameIndex::Maker::names(
    NSXMLIndexList<uint32_t>& nameOf) {
  NSXMLIndexList<Name> table(smallestTable);
  uint32_t count = 0;
  WorkPacer pacer;
  for (size_t way = 1; way < _ways.size(); ++way) {
    pacer.turn();
    if (2 * (size_t{count} + 1) > table.size()) growNames(table);
    const NSXMLName* const written = _ways[way].name;
    Name& name = table[NSXMLNameIndex::placeOf(table, written->expanded)];
    if (!name.name) name = {written->expanded, written, count++, 0};
    if (name.writtenAs != written) name.writtenAs = nullptr;
    name.end += _ways[way].count;
    nameOf[way] = name.begin;
  }
  return table;
}

std::unique_ptr<const NSXMLNameIndex> NSXMLNameIndex::Maker::index() {
  WorkPacer pacer;
  NSXMLIndexList<uint32_t> nameOf(_ways.size());
  NSXMLIndexList<Name> table = names(nameOf);
  NSXMLIndexList<uint32_t> next(_ways.size());  // by number: where the name's next node goes
  for (const Name& each : table) {
    if (each.name) next[each.begin] = each.end;
  }
  uint32_t sum = 0;
  for (uint32_t& each : next) {
    pacer.turn();
    const uint32_t count = each;
    each = sum;
    sum += count;
  }
  for (Name& each : table) {
    pacer.turn();
    if (!each.name) continue;
    each.begin = next[each.begin];
    each.end += each.begin;
  }
  std::unique_ptr<NSXMLNameIndex> made(new NSXMLNameIndex);
  made->_nodes.arrange(_arrived, [&](size_t i) {
    pacer.turn();
    return next[nameOf[_wayOf[i]]]++;
  });
  made->_table = std::move(table);
  if (areWaysOfUse()) {
    _ways.shrink_to_fit();
    made->_ways = std::move(_ways);
  }
  made->_hasInstructions = _hasInstructions;
  return made;
}

std::unique_ptr<const NSXMLNameIndex> NSXMLNameIndex::ofElements(const NSXMLNode* root,
                                                                 uint32_t mostNodes) {
  Maker maker(mostNodes);
  WorkPacer pacer;
  uint32_t above = 0;
  for (const NSXMLNode* node = root; node;) {
    pacer.turn();
    uint32_t way = above;
    if (node->kind() == Kind::Element) {
      way = maker.add(node, nameOf(node), above);
    } else if (node->kind() == Kind::ProcessingInstruction) {
      maker.addInstruction();
    }
    if (const NSXMLNode* const child = node->firstChild()) {
      above = way;
      node = child;
      continue;
    }
    // Of the nodes that end here: the element at the bottom, or the one around what is none.
    const bool isElement = node->kind() == Kind::Element;
    const uint32_t lowest = isElement ? way : above;
    size_t ending = 0;
    while (node && !node->nextSibling()) {
      pacer.turn();
      ++ending;
      node = node->parent();
      above = maker.above(above);
    }
    // All but the topmost of them are last children of last children; behind the last ones of all
    // there is nothing.
    const size_t others = isElement ? 1 : 2;
    if (node && ending > others) maker.noteRunningOn(lowest, ending - others);
    if (node) node = node->nextSibling();
  }
  return maker.index();
}

std::unique_ptr<const NSXMLNameIndex> NSXMLNameIndex::ofAttributes(const NSXMLNode* root,
                                                                   uint32_t mostNodes) {
  Maker maker(mostNodes, false);
  WorkPacer pacer;
  for (const NSXMLNode* node = root; node; node = node->nextNode()) {
    pacer.turn();
    const auto* element = dyn_cast<NSXMLElement>(node);
    if (!element) continue;
    for (const NSXMLNode* attribute = element->firstAttribute(); attribute;
         attribute = NSXMLElement::nextAttribute(attribute)) {
      pacer.turn();
      maker.add(attribute, attribute->nodeName(), 0);
    }
  }
  return maker.index();
}

// --- ways ----------------------------------------------------------------------------------------

// Those that a step leads to, below one of them.
void NSXMLNameIndex::addBelow(uint32_t way, const NSXMLWayStep& step, Ways& found) const {
  const auto takes = [&step](const Way& each) {
    if (step.name) return each.name->expanded == step.name;
    if (!step.selection) return true;
    return step.selection->mayTake(*each.name->expanded) && step.selection->takes(*each.first);
  };
  for (uint32_t each = _ways[way].below; each; each = behind(each, way, step.isDeep)) {
    if (takes(_ways[each])) found.push_back(each);
  }
}

// The next one of those below the top one, or of those that are longer than it by a name; 0 for
// none.
uint32_t NSXMLNameIndex::behind(uint32_t way, uint32_t top, bool isDeep) const {
  if (isDeep && _ways[way].below) return _ways[way].below;
  while (!_ways[way].next) {
    way = _ways[way].above;
    if (!isDeep || way == top) return 0;
  }
  return _ways[way].next;
}

std::optional<NSXMLNameIndex::Ways> NSXMLNameIndex::waysAlong(
    std::span<const NSXMLWayStep> steps) const {
  if (_ways.empty()) return std::nullopt;
  Ways ways(1);
  Ways further;
  WorkPacer pacer;
  for (const NSXMLWayStep& step : steps) {
    further.clear();
    for (const uint32_t way : ways) {
      pacer.turn();
      if (step.isDeep && _ways[way].runsOn) return std::nullopt;
      addBelow(way, step, further);
    }
    // One below another is found from both.
    if (step.isDeep) {
      std::sort(further.begin(), further.end());
      further.erase(std::unique(further.begin(), further.end()), further.end());
    }
    ways.swap(further);
  }
  return ways;
}

uint64_t NSXMLNameIndex::countOn(const Ways& ways) const {
  uint64_t count = 0;
  for (const uint32_t way : ways) count += _ways[way].count;
  return count;
}

std::optional<uint64_t> NSXMLNameIndex::countAlong(std::span<const NSXMLWayStep> steps) const {
  const auto ways = waysAlong(steps);
  return ways ? std::optional(countOn(*ways)) : std::nullopt;
}

std::optional<NSXMLNameIndex::Ways> NSXMLNameIndex::along(
    std::span<const NSXMLWayStep> steps) const {
  auto ways = waysAlong(steps);
  if (ways) std::sort(ways->begin(), ways->end());
  return ways;
}

std::optional<NSXMLNodeSpan> NSXMLNameIndex::nodesAlong(std::span<const NSXMLWayStep> steps) const {
  if (steps.empty() || !steps.back().name) return std::nullopt;
  const NSXMLNodeSpan all = nodes(steps.back().name);
  return countAlong(steps) == all.size() ? std::optional(all) : std::nullopt;
}

// --- names ---------------------------------------------------------------------------------------

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
    return NSXMLNodeOrder::number(*a) < NSXMLNodeOrder::number(*b);
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
      return NSXMLNodeOrder::number(*a) < number;
    };
    const auto found =
        std::lower_bound(among.begin(), among.end(), NSXMLNodeOrder::number(*node), isBefore);
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

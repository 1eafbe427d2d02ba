#include "Platform/Tree/NameIndex.h"

#include "Platform/Base/WorkMeter.h"
#include "Platform/Tree/Arena.h"
#include "Platform/Tree/ElementLog.h"
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

// --- the table of names --------------------------------------------------------------------------

void NSXMLNameIndex::growTable(NSXMLIndexList<Name>& table) {
  NSXMLIndexList<Name> old(2 * table.size());
  old.swap(table);
  WorkPacer pacer;
  for (const Name& each : old) {
    pacer.turn();
    if (each.name) table[placeOf(table, each.name)] = each;
  }
}

template <class Written, class Count>
NSXMLIndexList<NSXMLNameIndex::Name> NSXMLNameIndex::tableOf(size_t size, Written written,
                                                             Count count,
                                                             NSXMLIndexList<uint32_t>& numberOf) {
  NSXMLIndexList<Name> table(smallestTable);
  uint32_t names = 0;
  WorkPacer pacer;
  for (size_t i = 1; i < size; ++i) {
    pacer.turn();
    if (2 * (size_t{names} + 1) > table.size()) growTable(table);
    const NSXMLName* const each = written(i);
    Name& name = table[placeOf(table, each->expanded)];
    if (!name.name) name = {each->expanded, each, names++, 0};
    if (name.writtenAs != each) name.writtenAs = nullptr;
    name.end += count(i);
    numberOf[i] = name.begin;
  }
  return table;
}

NSXMLIndexList<uint32_t> NSXMLNameIndex::placeNames(NSXMLIndexList<Name>& table) {
  WorkPacer pacer;
  NSXMLIndexList<uint32_t> next(table.size());
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
  return next;
}

// --- making them ---------------------------------------------------------------------------------

// The ways that elements lie on, in document order. A way is found by the one above it and the name
// as it is written, so that no name is looked at for a node. Where there are too many, and for
// attributes, names are all there is: every way is below the first one.
class NSXMLNameIndex::WayMaker {
 public:
  // Whether the caller notes which ones run on.
  explicit WayMaker(bool notesRunningOn, bool hasWays = true)
      : _table(placesPerWay * smallestTable),
        _hasWays(hasWays),
        _runsOn(notesRunningOn ? Way::RunsNot : Way::MayRun) {
    _ways.emplace_back();
  }

  // The node's, which is counted.
  uint32_t add(const NSXMLNode* node, const NSXMLName* written, uint32_t above) {
    uint32_t way = _table[placeOf(_hasWays ? above : 0, written)];
    if (!way) way = addWay(node, written, above);
    ++_ways[way].count;
    return way;
  }
  // The same, if it is this one.
  bool addIfOn(uint32_t way, const NSXMLName* written, uint32_t above) {
    if (_ways[way].name != written || _ways[way].above != above) return false;
    ++_ways[way].count;
    return true;
  }
  uint32_t above(uint32_t way) const { return _ways[way].above; }
  bool hasWays() const { return _hasWays; }
  // The descendant axis goes on behind the subtrees of elements on this way and on those above it,
  // so many in all.
  void noteRunningOn(uint32_t way, size_t levels) {
    WorkPacer pacer;
    for (; levels > 0; --levels, way = above(way)) {
      pacer.turn();
      _ways[way].runsOn = Way::Runs;
    }
  }
  const WayList& ways() const { return _ways; }
  // None where they are not known, or of no use: where there are nearly as many ways as elements,
  // walks are short.
  [[nodiscard]] std::unique_ptr<const WayList> waysOfUse(size_t elements) {
    const bool areOfUse =
        _hasWays && _ways.size() * sizeof(Way) <= elements * sizeof(NSXMLNodePlace);
    if (!areOfUse) return std::make_unique<const WayList>();
    _ways.shrink_to_fit();
    return std::make_unique<const WayList>(std::move(_ways));
  }

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
    _ways.push_back({written, node, above, 0, 0, _ways[above].below, _runsOn});
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

  // 2^n places, each with a way or 0. So few of them are taken that the first one tried is nearly
  // always the one: which it is nobody could foresee.
  static constexpr size_t placesPerWay = 8;
  NSXMLIndexList<uint32_t> _table;
  WayList _ways;
  bool _hasWays;
  const uint8_t _runsOn;
};

// Notes the nodes in document order, each with its way, and then puts them name by name.
class NSXMLNameIndex::Maker {
 public:
  explicit Maker(uint32_t mostNodes, bool hasWays = true) : _ways(true, hasWays) {
    _arrived.reserve(mostNodes);
    _wayOf.reserve(mostNodes);
  }

  // Answers its way.
  uint32_t add(const NSXMLNode* node, const NSXMLName* written, uint32_t above) {
    const uint32_t way = _ways.add(node, written, above);
    _wayOf.push_back(way);
    _arrived.push_back(node);
    return way;
  }
  WayMaker& ways() { return _ways; }
  void addInstruction() { _hasInstructions = true; }
  std::unique_ptr<const NSXMLNameIndex> index();

 private:
  WayMaker _ways;
  bool _hasInstructions = false;
  NSXMLNodeList _arrived;
  NSXMLIndexList<uint32_t> _wayOf;  // those nodes
};

std::unique_ptr<const NSXMLNameIndex> NSXMLNameIndex::Maker::index() {
  const WayList& ways = _ways.ways();
  NSXMLIndexList<uint32_t> numberOf(ways.size());
  std::unique_ptr<NSXMLNameIndex> made(new NSXMLNameIndex);
  made->_table = tableOf(
      ways.size(), [&](size_t way) { return ways[way].name; },
      [&](size_t way) { return ways[way].count; }, numberOf);
  NSXMLIndexList<uint32_t> next = placeNames(made->_table);
  WorkPacer pacer;
  made->_nodes.arrange(_arrived, [&](size_t i) {
    pacer.turn();
    return next[numberOf[_wayOf[i]]]++;
  });
  made->_ways = _ways.waysOfUse(_arrived.size()).release();
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
      above = maker.ways().above(above);
    }
    // All but the topmost of them are last children of last children; behind the last ones of all
    // there is nothing.
    const size_t others = isElement ? 1 : 2;
    if (node && ending > others) maker.ways().noteRunningOn(lowest, ending - others);
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

// --- from the record -----------------------------------------------------------------------------

std::unique_ptr<const NSXMLNameIndex> NSXMLNameIndex::ofElements(const NSXMLElementLog& log,
                                                                 const NSXMLNode* node) {
  const NSXMLIndexList<NSXMLElementLog::Name>& names = log.names();
  NSXMLIndexList<uint32_t> numberOf(names.size());
  std::unique_ptr<NSXMLNameIndex> made(new NSXMLNameIndex);
  made->_table = tableOf(
      names.size(), [&](size_t i) { return names[i].name; },
      [&](size_t i) { return names[i].count; }, numberOf);
  NSXMLIndexList<uint32_t> next = placeNames(made->_table);
  WorkPacer pacer;
  made->_nodes.arrange(node, log.count(), [&](auto put) {
    log.forEach([&](const NSXMLNode* element, uint32_t number, uint32_t) {
      pacer.turn();
      put(next[numberOf[number]]++, element);
    });
  });
  made->_hasInstructions = log.hasInstructions();
  return made;
}

// On which way an element lies is mostly what it was the last time behind an element on the way of
// the one before it.
class NSXMLNameIndex::LoggedWays {
 public:
  explicit LoggedWays(const NSXMLElementLog& log) : _names(log.names()), _likely(1) {}

  void add(const NSXMLNode* element, uint32_t number, uint32_t ended) {
    if (!_ways.hasWays()) return;
    if (ended == NSXMLElementLog::manyEnded) [[unlikely]] {
      ended = countEnded(element);
    }
    uint32_t above = _way;
    for (; ended > 0; --ended) above = _ways.above(above);
    const NSXMLName* const written = _names[number].name;
    uint32_t way = _likely[_way];
    if (!_ways.addIfOn(way, written, above)) [[unlikely]] {
      way = _ways.add(element, written, above);
      if (way >= _likely.size()) _likely.resize(way + 1);
      _likely[_way] = way;
    }
    _way = way;
    _last = element;
  }
  WayMaker& ways() { return _ways; }

 private:
  // Of the last element and those around it, before the next one began.
  uint32_t countEnded(const NSXMLNode* next) {
    uint32_t count = 0;
    for (const NSXMLNode* node = _last; node != next->parent(); node = node->parent()) {
      _pacer.turn();
      ++count;
    }
    return count;
  }

  const NSXMLIndexList<NSXMLElementLog::Name>& _names;
  WayMaker _ways{false};
  NSXMLIndexList<uint32_t> _likely;  // by the way before it
  uint32_t _way = 0;                 // of the last element
  const NSXMLNode* _last = nullptr;
  WorkPacer _pacer;
};

void NSXMLNameIndex::addWays(const NSXMLElementLog& log) const {
  LoggedWays logged(log);
  WorkPacer pacer;
  log.forEach([&](const NSXMLNode* element, uint32_t number, uint32_t ended) {
    pacer.turn();
    logged.add(element, number, ended);
  });
  _ways.store(logged.ways().waysOfUse(_nodes.size()).release(), std::memory_order_release);
}

// --- ways ----------------------------------------------------------------------------------------

// Those that a step leads to, below one of them.
void NSXMLNameIndex::addBelow(const WayList& known, uint32_t way, const NSXMLWayStep& step,
                              Ways& found) {
  const auto takes = [&step](const Way& each) {
    if (step.name) return each.name->expanded == step.name;
    if (!step.selection) return true;
    return step.selection->mayTake(*each.name->expanded) && step.selection->takes(*each.first);
  };
  for (uint32_t each = known[way].below; each; each = behind(known, each, way, step.isDeep)) {
    if (takes(known[each])) found.push_back(each);
  }
}

// The next one of those below the top one, or of those that are longer than it by a name; 0 for
// none.
uint32_t NSXMLNameIndex::behind(const WayList& known, uint32_t way, uint32_t top, bool isDeep) {
  if (isDeep && known[way].below) return known[way].below;
  while (!known[way].next) {
    way = known[way].above;
    if (!isDeep || way == top) return 0;
  }
  return known[way].next;
}

// Those of a name are all looked at, on whatever way they lie.
bool NSXMLNameIndex::runsOn(const Way& way) const {
  uint8_t known = __atomic_load_n(&way.runsOn, __ATOMIC_RELAXED);
  if (known == Way::MayRun) {
    known = anyRunsOn(nodes(way.name->expanded)) ? Way::Runs : Way::RunsNot;
    __atomic_store_n(&way.runsOn, known, __ATOMIC_RELAXED);
  }
  return known == Way::Runs;
}

// Whether any has more on its descendant axis than is in it. What the tree ends with has nothing
// behind it.
bool NSXMLNameIndex::anyRunsOn(NSXMLNodeSpan elements) {
  NSXMLIndexList<uint32_t> last;  // the numbers of the root, its last child, and so on
  WorkPacer pacer;
  for (const NSXMLNode* element : elements) {
    pacer.turn();
    if (NSXMLTree::descendantStop(element)) continue;
    if (last.empty()) {
      const NSXMLNode* node = element;
      for (; node->parent(); node = node->parent()) pacer.turn();
      for (; node; node = node->lastChild()) {
        pacer.turn();
        last.push_back(NSXMLNodeOrder::number(*node));
      }
    }
    if (!std::binary_search(last.begin(), last.end(), NSXMLNodeOrder::number(*element)))
      return true;
  }
  return false;
}

std::optional<NSXMLNameIndex::Ways> NSXMLNameIndex::waysAlong(
    std::span<const NSXMLWayStep> steps) const {
  const WayList* const known = _ways.load(std::memory_order_acquire);
  if (!known || known->empty()) return std::nullopt;
  Ways ways(1);
  Ways further;
  WorkPacer pacer;
  for (const NSXMLWayStep& step : steps) {
    further.clear();
    for (const uint32_t way : ways) {
      pacer.turn();
      if (step.isDeep && runsOn((*known)[way])) return std::nullopt;
      addBelow(*known, way, step, further);
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
  const WayList& known = *_ways.load(std::memory_order_acquire);
  uint64_t count = 0;
  for (const uint32_t way : ways) count += known[way].count;
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

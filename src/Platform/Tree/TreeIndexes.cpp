#include "Platform/Tree/TreeIndexes.h"

#include "Platform/Base/LastingObjects.h"
#include "Platform/Base/WorkMeter.h"
#include "Platform/Tree/TreeHead.h"

#include <algorithm>
#include <new>

namespace xquery {

namespace {

// Whether a large part of what may still be taken is left when so much is.
bool hasRoomFor(size_t bytes) {
  constexpr size_t part = 2;
  return workMeter.valueBytes + static_cast<int64_t>(part * bytes) <= workMeter.mostValueBytes;
}

uint32_t numberOfLast(const NSXMLNode* root) {
  WorkPacer pacer;
  const NSXMLNode* last = root;
  while (const NSXMLNode* child = last->lastChild()) {
    pacer.turn();
    last = child;
  }
  return NSXMLNodeOrder::number(*last);
}

}  // namespace

// --- life ----------------------------------------------------------------------------------------

NSXMLIndexesRef::NSXMLIndexesRef(NSXMLTreeIndexes* indexes) : _indexes(indexes) {
  if (_indexes) _indexes->retain();
}

NSXMLIndexesRef::~NSXMLIndexesRef() {
  if (_indexes) _indexes->release();
}

NSXMLTreeIndexes* NSXMLTreeIndexes::make(const NSXMLNode* node) {
  const NSXMLNode* const root = node->rootNode();
  const uint32_t lastNumber = numberOfLast(root);
  if (lastNumber < fewNodes) return nullptr;
  void* const memory = NSCounted::operator new(sizeof(NSXMLTreeIndexes));
  return ::new (memory) NSXMLTreeIndexes(root, lastNumber);
}

NSXMLTreeIndexes::~NSXMLTreeIndexes() {
  KeyPlace* place = _keys.load(std::memory_order_relaxed);
  while (place) {
    const std::unique_ptr<KeyPlace> owned(place);
    place = owned->next;
  }
}

void NSXMLTreeIndexes::release() {
  if (_references.fetch_sub(1, std::memory_order_acq_rel) != 1) return;
  this->~NSXMLTreeIndexes();
  NSCounted::operator delete(this, sizeof(NSXMLTreeIndexes));
}

NSXMLIndexesRef NSXMLTreeIndexes::of(const NSXMLNode* node) {
  NSXMLTree* const tree = NSXMLTree::of(node);
  if (!tree->isOrderFresh()) return {};
  NSXMLTreeIndexes* present = tree->_indexes.load(std::memory_order_acquire);
  if (!present) {
    NSXMLTreeIndexes* const made = make(node);
    if (!made) return {};
    if (tree->_indexes.compare_exchange_strong(present, made, std::memory_order_acq_rel,
                                               std::memory_order_acquire)) {
      present = made;
    } else {
      made->release();
    }
  }
  return NSXMLIndexesRef(present);
}

void NSXMLTreeIndexes::begin(const NSXMLNode* root, std::unique_ptr<const NSXMLElementLog> log,
                             const NSXMLKindCounts& counts) {
  const uint32_t lastNumber = numberOfLast(root);
  if (lastNumber < fewNodes) return;
  NSXMLKindCounts all = counts;
  all.elements = log->count();
  // Numbers are given to all, from that of the document on.
  all.texts = lastNumber - NSXMLTree::firstOrderNumber - all.elements - all.attributes -
              all.namespaces - all.comments - all.instructions;
  std::unique_ptr<const NSXMLSingleNames> singleNames = log->singleNames();
  if (!log->isComplete()) log = nullptr;
  const LastingObjects lasting;
  NSXMLTreeIndexes* const made = make(root);
  made->_counts = all;
  made->_singleNames = std::move(singleNames);
  made->_isLogged = log != nullptr;
  made->_log = std::move(log);
  NSXMLTree* const tree = NSXMLTree::of(root);
  tree->dropIndexes();
  tree->_indexes.store(made, std::memory_order_release);
}

bool NSXMLTreeIndexes::isOf(const NSXMLNode* node) const {
  return NSXMLTree::of(node)->_indexes.load(std::memory_order_relaxed) == this;
}

void NSXMLTree::releaseIndexes() {
  _indexes.exchange(nullptr, std::memory_order_relaxed)->release();
}

// --- finding and making --------------------------------------------------------------------------

// The work is added up unless it is.
bool NSXMLTreeIndexes::isWorth(std::atomic<uint64_t>& workDone, uint64_t work) const {
  if (workDone.load(std::memory_order_relaxed) >= _lastNumber / 2) return true;
  workDone.fetch_add(work, std::memory_order_relaxed);
  return false;
}

// Null when another thread is at it, or when it would take too much.
template <class Index, class Make>
const Index* NSXMLTreeIndexes::makeOnce(Place<Index>& place, size_t bytes, Make make) {
  if (const Index* present = place.index.load(std::memory_order_acquire)) return present;
  if (!hasRoomFor(bytes)) return nullptr;
  const std::unique_lock<std::mutex> guard(_making, std::try_to_lock);
  if (!guard) return nullptr;
  if (const Index* present = place.index.load(std::memory_order_acquire)) return present;
  std::unique_ptr<const Index> made = make();
  place.index.store(made.get(), std::memory_order_release);
  return made.release();
}

const NSXMLNameIndex* NSXMLTreeIndexes::makeElements() {
  return makeOnce(_elements, NSXMLNameIndex::mostBytes(_lastNumber), [this] {
    return _log ? NSXMLNameIndex::ofElements(*_log, _root)
                : NSXMLNameIndex::ofElements(_root, _lastNumber);
  });
}

const NSXMLNameIndex* NSXMLTreeIndexes::elements(uint64_t work) {
  const NSXMLNameIndex* const present = _elements.index.load(std::memory_order_acquire);
  if (present && !_isLogged) return present;
  const bool isDue = isWorth(_elements.workDone, work);
  if (present) return present;
  constexpr uint64_t quicker = 4;
  const uint64_t asked = _elements.workDone.load(std::memory_order_relaxed);
  return isDue || (_isLogged && asked >= _lastNumber / 2 / quicker) ? makeElements() : nullptr;
}

const NSXMLNameIndex* NSXMLTreeIndexes::elementsWithWays() {
  const NSXMLNameIndex* const present = _elements.index.load(std::memory_order_acquire);
  if (present && !present->asksForWays()) return present;
  if (!isWorth(_elements.workDone, 0)) return nullptr;
  const NSXMLNameIndex* const elements = present ? present : makeElements();
  return elements && elements->asksForWays() ? addWays(*elements) : elements;
}

// Null when another thread makes something, or when they might take too much.
const NSXMLNameIndex* NSXMLTreeIndexes::addWays(const NSXMLNameIndex& elements) {
  constexpr size_t bytesPerWay = 256;  // while they are found
  const size_t mostWays = std::min<size_t>(_lastNumber, NSXMLNameIndex::mostWays);
  if (!hasRoomFor(mostWays * bytesPerWay)) return nullptr;
  const std::unique_lock<std::mutex> guard(_making, std::try_to_lock);
  if (!guard) return nullptr;
  if (elements.asksForWays()) elements.addWays(*_log);
  _log = nullptr;
  return &elements;
}

const NSXMLNameIndex* NSXMLTreeIndexes::attributes(uint64_t work) {
  const NSXMLNameIndex* const present = _attributes.index.load(std::memory_order_acquire);
  if (present || !isWorth(_attributes.workDone, work)) return present;
  return makeOnce(_attributes, NSXMLNameIndex::mostBytes(_lastNumber),
                  [this] { return NSXMLNameIndex::ofAttributes(_root, _lastNumber); });
}

const NSXMLValueIndex* NSXMLTreeIndexes::values(const NSXMLValueKey& key, uint64_t work) {
  KeyPlace* const place = placeOf(key);
  if (!place) return nullptr;
  const NSXMLValueIndex* const present = place->index.load(std::memory_order_acquire);
  if (present || !isWorth(place->workDone, work)) return present;
  const NSXMLNameIndex* const names = makeElements();
  if (!names) return nullptr;
  if (!key.element) return makeOfOwners(*place, *names);
  const NSXMLNodeSpan elements = names->nodes(key.element.get());
  return makeOnce(*place, NSXMLValueIndex::likelyBytes(elements.size()),
                  [&] { return NSXMLValueIndex::make(elements, key, *names); });
}

// Of the elements that have the attribute.
const NSXMLValueIndex* NSXMLTreeIndexes::makeOfOwners(KeyPlace& place,
                                                      const NSXMLNameIndex& names) {
  const NSXMLNameIndex* const all = attributes(_lastNumber);
  if (!all) return nullptr;
  const NSXMLNodeSpan found = all->nodes(place.key.attribute.get());
  return makeOnce(place, NSXMLValueIndex::likelyBytes(found.size()), [&] {
    NSXMLNodeList owners;
    WorkPacer pacer;
    for (const NSXMLNode* attribute : found) {
      pacer.turn();
      owners.push_back(attribute->parent());
    }
    return NSXMLValueIndex::make(owners.span(), place.key, names);
  });
}

void NSXMLTreeIndexes::addWork(const NSXMLValueKey& key, uint64_t work) {
  if (KeyPlace* const place = placeOf(key)) {
    place->workDone.fetch_add(work, std::memory_order_relaxed);
  }
}

NSXMLTreeIndexes::KeyPlace* NSXMLTreeIndexes::placeOf(const NSXMLValueKey& key) {
  const auto present = [&]() -> KeyPlace* {
    KeyPlace* place = _keys.load(std::memory_order_acquire);
    while (place && !(place->key == key)) place = place->next;
    return place;
  };
  if (KeyPlace* place = present()) return place;
  const std::unique_lock<std::mutex> guard(_making, std::try_to_lock);
  if (!guard) return nullptr;
  if (KeyPlace* place = present()) return place;
  if (_keyCount == mostKeys) return nullptr;
  auto added = std::make_unique<KeyPlace>(key, _keys.load(std::memory_order_relaxed));
  ++_keyCount;
  _keys.store(added.get(), std::memory_order_release);
  return added.release();
}

// --- walks ---------------------------------------------------------------------------------------

namespace {

// The indexes of the tree if the walk from `first` to `stop` is long enough to ask them, and how
// many nodes it will meet at most.
struct IndexesForWalk {
  NSXMLIndexesRef indexes;
  uint32_t work = 0;
};

IndexesForWalk indexesForWalk(const NSXMLNode* first, const NSXMLNode* stop) {
  if (!NSXMLTree::of(first)->isOrderFresh()) return {};
  const uint32_t number = NSXMLNodeOrder::number(*first);
  if (stop && NSXMLNodeOrder::number(*stop) - number < NSXMLTreeIndexes::fewNodes) return {};
  NSXMLIndexesRef indexes = NSXMLTreeIndexes::of(first);
  if (!indexes) return {};
  const uint32_t work = (stop ? NSXMLNodeOrder::number(*stop) : indexes->lastNumber() + 1) - number;
  if (work < NSXMLTreeIndexes::fewNodes) return {};
  return {std::move(indexes), work};
}

// Null for: walk.
const NSXMLNameIndex* elementsFor(const IndexesForWalk& walk, bool withInstructions) {
  const NSXMLNameIndex* const elements = walk.indexes ? walk.indexes->elements(walk.work) : nullptr;
  return elements && withInstructions && elements->hasInstructions() ? nullptr : elements;
}

}  // namespace

std::optional<NSXMLIndexedNodes> NSXMLIndexedElements(const NSXMLExpandedName* name,
                                                      const NSXMLNode* first,
                                                      const NSXMLNode* stop) {
  IndexesForWalk walk = indexesForWalk(first, stop);
  const NSXMLNameIndex* const elements = elementsFor(walk, false);
  if (!elements) return std::nullopt;
  return NSXMLIndexedNodes{std::move(walk.indexes),
                           NSXMLNameIndex::between(elements->nodes(name), first, stop)};
}

std::optional<NSXMLIndexedNodes> NSXMLIndexedElements(const NSXMLNameSelection& names,
                                                      bool withInstructions, const NSXMLNode* first,
                                                      const NSXMLNode* stop) {
  IndexesForWalk walk = indexesForWalk(first, stop);
  const NSXMLNameIndex* const elements = elementsFor(walk, withInstructions);
  if (!elements) return std::nullopt;
  NSXMLIndexedNodes found{std::move(walk.indexes), {}, elements->nodes(names, first, stop)};
  found.nodes = found.merged.span();
  return found;
}

std::optional<uint64_t> NSXMLCountIndexedElements(const NSXMLNameSelection& names,
                                                  bool withInstructions, const NSXMLNode* first,
                                                  const NSXMLNode* stop) {
  const IndexesForWalk walk = indexesForWalk(first, stop);
  const NSXMLNameIndex* const elements = elementsFor(walk, withInstructions);
  return elements ? std::optional(elements->count(names, first, stop)) : std::nullopt;
}

uint64_t NSXMLKindCounts::of(Kind kind) const {
  switch (kind) {
    case Kind::Element:
      return elements;
    case Kind::Text:
      return texts;
    case Kind::Comment:
      return comments;
    case Kind::ProcessingInstruction:
      return instructions;
    default:
      return 0;
  }
}

namespace {

// Whether such a walk meets all descendants of a document.
bool isWholeDocument(const NSXMLNode* first, const NSXMLNode* stop) {
  const NSXMLNode* const above = stop ? nullptr : first->parent();
  return above && above->kind() == Kind::Document && above->firstChild() == first;
}

// What `count` makes of the counts, if they are known.
template <class Count>
std::optional<uint64_t> countWith(const NSXMLNode* first, const NSXMLNode* stop, Count count) {
  if (!isWholeDocument(first, stop)) return std::nullopt;
  const NSXMLIndexesRef indexes = NSXMLTreeIndexes::of(first);
  const NSXMLKindCounts* const counts = indexes ? indexes->counts() : nullptr;
  return counts ? std::optional<uint64_t>(count(*counts)) : std::nullopt;
}

}  // namespace

std::optional<uint64_t> NSXMLCountKinds(uint32_t kinds, const NSXMLNode* first,
                                        const NSXMLNode* stop) {
  return countWith(first, stop, [kinds](const NSXMLKindCounts& counts) {
    uint64_t count = 0;
    for (const Kind each :
         {Kind::Element, Kind::Text, Kind::Comment, Kind::ProcessingInstruction}) {
      if (kinds & 1U << static_cast<unsigned>(each)) count += counts.of(each);
    }
    return count;
  });
}

// The walk may begin with the document itself, which has none.
std::optional<uint64_t> NSXMLCountAttributes(const NSXMLNode* first, const NSXMLNode* stop) {
  if (first->kind() == Kind::Document) first = first->firstChild();
  if (!first) return std::nullopt;
  return countWith(first, stop, [](const NSXMLKindCounts& counts) { return counts.attributes; });
}

NSXMLIndexedWays NSXMLIndexedWays::of(const NSXMLNode* document) {
  NSXMLIndexesRef indexes = NSXMLTreeIndexes::of(document);
  const NSXMLNameIndex* const elements = indexes ? indexes->elementsWithWays() : nullptr;
  return {std::move(indexes), elements};
}

void NSXMLNoteWalked(uint64_t nodes, const NSXMLNode* document) {
  constexpr uint64_t nodesPerChild = 8;
  if (NSXMLIndexesRef indexes = NSXMLTreeIndexes::of(document)) {
    indexes->addWork(nodes * nodesPerChild);
  }
}

NSXMLIndexedValues NSXMLIndexedValues::of(const NSXMLValueKey& key, const NSXMLNode* first,
                                          const NSXMLNode* stop) {
  IndexesForWalk walk = indexesForWalk(first, stop);
  const NSXMLValueIndex* const values = walk.indexes ? walk.indexes->values(key, 0) : nullptr;
  return {std::move(walk.indexes), values && values->isGivenUp() ? nullptr : values};
}

void NSXMLNoteAskedValues(const NSXMLValueKey& key, uint64_t elements, const NSXMLNode* node) {
  constexpr uint64_t nodesPerElement = 48;
  if (NSXMLIndexesRef indexes = NSXMLTreeIndexes::of(node)) {
    indexes->addWork(key, elements * nodesPerElement);
  }
}

std::optional<NSXMLIndexedNodes> NSXMLIndexedAttributes(const NSXMLExpandedName* name,
                                                        const NSXMLNode* first,
                                                        const NSXMLNode* stop) {
  IndexesForWalk walk = indexesForWalk(first, stop);
  const NSXMLNameIndex* const attributes =
      walk.indexes ? walk.indexes->attributes(walk.work) : nullptr;
  if (!attributes) return std::nullopt;
  return NSXMLIndexedNodes{std::move(walk.indexes),
                           NSXMLNameIndex::between(attributes->nodes(name), first, stop)};
}

}  // namespace xquery

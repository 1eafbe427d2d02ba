#include "Platform/Tree/Arena.h"

#include "Platform/Base/Abandoned.h"
#include "Platform/Base/Counting.h"
#include "Platform/Base/LastingObjects.h"
#include "Platform/Base/RangeMemory.h"
#include "Platform/Base/WorkMeter.h"
#include "Platform/Text/UTF16.h"
#include "Platform/Tree/Credit.h"
#include "Platform/Tree/Names.h"
#include "Platform/Tree/TreeExtra.h"
#include "Platform/Tree/TreeHead.h"

#include <algorithm>
#include <atomic>
#include <cstdlib>
#include <mutex>
#include <new>
#include <optional>
#include <utility>

namespace xquery {

namespace {

static_assert(sizeof(NSXMLProcessingInstruction) == 32);
static_assert(NSXMLRangeBytes == RangeRuns::windowBytes);

size_t bytesOf(NSStringView text) {
  return size_t{text.length()} * (text.isWide() ? sizeof(char16_t) : 1);
}

// A text as it is to be stored.
struct TextToStore {
  explicit TextToStore(NSStringView text)
      : from(text),
        isNarrow(xquery::isNarrow(text)),
        bytes(isNarrow ? text.length() : bytesOf(text)) {}

  // Copied to `memory`, which has room for it.
  NSStringView copiedTo(void* memory) const {
    if (!isNarrow) {
      std::memcpy(memory, from.wideUnits(), bytes);
      return {static_cast<const char16_t*>(memory), from.length()};
    }
    auto* units = static_cast<char*>(memory);
    if (from.isWide()) {
      std::copy_n(from.wideUnits(), bytes, units);
    } else if (bytes) {
      std::memcpy(units, from.asciiUnits(), bytes);
    }
    return {units, from.length()};
  }
  // The same behind a view of it.
  static constexpr size_t viewBytes = sizeof(NSStringView);
  const NSStringView* copiedWithView(void* memory) const {
    auto* const view = static_cast<NSStringView*>(memory);
    return ::new (view) NSStringView(copiedTo(view + 1));
  }

  const NSStringView from;
  const bool isNarrow;
  const size_t bytes;
};

// Renumbering is rare and short, so that trees share a few locks.
std::mutex& orderLock(const NSXMLTree* tree) {
  static std::mutex locks[16];
  return locks[reinterpret_cast<uintptr_t>(tree) / 64 % std::size(locks)];
}

}  // namespace

// --- eras ------------------------------------------------------------------------------------

namespace {

constinit thread_local uint64_t currentEra __attribute__((tls_model("initial-exec"))) = 0;

uint64_t nextEra() {
  static std::atomic<uint64_t> last = 0;
  return last.fetch_add(1, std::memory_order_relaxed) + 1;
}

}  // namespace

NSXMLEra::NSXMLEra() : _around(std::exchange(currentEra, nextEra())) {}

NSXMLEra::~NSXMLEra() {
  currentEra = _around;
}

uint64_t NSXMLEra::current() {
  return currentEra;
}

// --- life ------------------------------------------------------------------------------------

NSXMLTree* NSXMLTree::create() {
  return ::new (NSCounted::operator new(sizeof(NSXMLTree))) NSXMLTree;
}

// Whether the tree, or what is left of it, is freed later. Releasing a name takes as long as
// freeing a few blocks, and there may be as many as there are nodes.
bool NSXMLTree::isSetAside() {
  const auto free = [](const void* tree) {
    static_cast<NSXMLTree*>(const_cast<void*>(tree))->destroy();
  };
  AbandonedValues& abandoned = *abandonedValues;
  NSXMLTreeExtra* const state = extra();
  size_t names = state ? state->names.count() : 0;
  while (!abandoned.take(this, free, blockCount() + names)) {
    if (names <= AbandonedValues::partsPerLook) return false;
    dropIndexes();
    state->names.takeOut(AbandonedValues::partsPerLook,
                         [](const NSXMLName* name) { NSXMLReleaseName(name); });
    names = state->names.count();
    abandoned.isOver();
  }
  return true;
}

void NSXMLTree::destroy() {
  if (abandonedValues && isSetAside()) [[unlikely]] {
    return;
  }
  dropIndexes();
  if (NSXMLTreeExtra* present = extra()) {
    for (NSXMLDocument* document : present->documents) NSCounting::release(*document->_URI);
  }
  forEachName([](const NSXMLName* name) { NSXMLReleaseName(name); });
  freeBaseURIs();
  freeBlocks();
  freeExtra();
  std::optional<LastingObjects> lasting;
  if (_era == 0) lasting.emplace();
  NSCounted::operator delete(this, sizeof(NSXMLTree));
}

namespace {

// Of a row of blocks, from this one on.
void freeRow(NSXMLBlock* block) {
  for (size_t count = 1; block; ++count) {
    NSXMLBlock* const next = block->next;
    uncountValueBytes(sizeof(NSXMLBlock) + NSXMLTree::roomOf(block));
    giveRangeBlock(block);
    block = next;
    if (count % AbandonedValues::partsPerLook != 0 || !block || !abandonedValues) continue;
    const auto free = [](const void* rest) {
      freeRow(static_cast<NSXMLBlock*>(const_cast<void*>(rest)));
    };
    // How many are left is not known; so many have shown that there are many.
    if (abandonedValues->isOver() && abandonedValues->take(block, free, count)) return;
  }
}

}  // namespace

void NSXMLTree::freeBlocks() {
  if (!_lastBlock) return;
  NSXMLBlock* const first = _lastBlock->next;
  _lastBlock->next = nullptr;
  freeRow(first);
}

// A count that has ever reached the top bit stays there: such a tree is never freed.
namespace {
constexpr uint32_t immortalBit = 0x80000000U;
}

bool NSXMLTree::addReferences(uint32_t count) {
  const uint32_t known = __atomic_load_n(&references, __ATOMIC_RELAXED);
  if (known & immortalBit) return false;
  __atomic_fetch_add(&references, count, __ATOMIC_RELAXED);
  return true;
}

void NSXMLTree::removeReferences(uint32_t count) {
  const uint32_t known = __atomic_load_n(&references, __ATOMIC_RELAXED);
  if (known & immortalBit) return;
  if (__atomic_fetch_sub(&references, count, __ATOMIC_ACQ_REL) == count) destroy();
}

// While the process has one thread, there is no better place to count than the tree itself.
void NSXMLTree::retain() {
  if (__libc_single_threaded) {
    if (!(references & immortalBit)) ++references;
  } else if (!NSXMLCredit::retain(this)) {
    addReferences(1);
  }
}

void NSXMLTree::release(uint32_t times) {
  if (__libc_single_threaded) {
    if (!(references & immortalBit) && (references -= times) == 0) destroy();
  } else if (!NSXMLCredit::release(this, times)) {
    removeReferences(times);
  }
}

void retainTreeOf(const NSXMLNode* node) {
  NSXMLTree::of(node)->retain();
}
void releaseTreeOf(const NSXMLNode* node) {
  NSXMLTree::of(node)->release();
}
void releaseTreesOf(const NSXMLNode* const* nodes, size_t count) {
  std::optional<NSXMLCredit> credit;  // for the names of the trees that go
  if (count > 1 && !__libc_single_threaded && !NSXMLCredit::isUnderWay()) credit.emplace();
  for (size_t i = 0; i < count;) {
    NSXMLTree* tree = NSXMLTree::of(nodes[i]);
    uint32_t times = 0;
    for (; i < count && NSXMLTree::of(nodes[i]) == tree; ++i) ++times;
    tree->release(times);
  }
}

// --- blocks ----------------------------------------------------------------------------------

void NSXMLTree::setBlockCount(uint64_t count) {
  const uint64_t most = 0xFFFFFF;
  const uint64_t kept = std::min(count, most);
  blockCountHigh = static_cast<uint8_t>(kept >> 16);
  blockCountLow = static_cast<uint16_t>(kept);
}

NSXMLBlock* NSXMLTree::allocateBlock(size_t bytes) {
  const size_t counted = rangeBlockBytes(sizeof(NSXMLBlock) + bytes);
  countValueBlock(counted);
  RangeBlock memory;
  try {
    memory = takeRangeBlock(counted);
  } catch (...) {
    uncountValueBytes(counted);
    throw;
  }
  countValueBytes(memory.bytes - counted);
  auto* const block = ::new (memory.address) NSXMLBlock;
  block->tree = this;
  block->roomUnits = static_cast<uint32_t>((memory.bytes - sizeof(NSXMLBlock)) / distanceUnit);
  block->next = _lastBlock ? _lastBlock->next.get() : block;
  if (_lastBlock) _lastBlock->next = block;
  _lastBlock = block;
  setBlockCount(uint64_t{blockCount()} + 1);
  return block;
}

// --- nodes -----------------------------------------------------------------------------------

NSXMLElement* NSXMLTree::makeElement() {
  return makeNodeOf<NSXMLElement>(Kind::Element);
}
NSXMLDocument* NSXMLTree::makeDocument() {
  return makeNodeOf<NSXMLDocument>(Kind::Document);
}

NSXMLNode* NSXMLTree::makeNode(Kind kind, NSStringView text) {
  const TextToStore stored(text);
  if (kind == Kind::ProcessingInstruction) {
    auto* const node =
        makeNodeOf<NSXMLProcessingInstruction>(kind, TextToStore::viewBytes + stored.bytes);
    setTextApart(node, stored.copiedWithView(node + 1));
    return node;
  }
  auto* const node = makeNodeOf<NSXMLNode>(kind, stored.bytes);
  noteTextBehind(node, stored.copiedTo(node + 1));
  return node;
}

void NSXMLTree::setText(NSXMLNode* node, NSStringView text) {
  const TextToStore stored(text);
  NSXMLBlock* const block = allocateBlock(TextToStore::viewBytes + stored.bytes);
  setTextApart(node, stored.copiedWithView(block + 1));
}

void NSXMLTree::setAdoptedName(NSXMLNode* node, const NSXMLName* name) {
  if (auto* element = dyn_cast<NSXMLElement>(node)) {
    element->_name = name;
  } else if (auto* instruction = dyn_cast<NSXMLProcessingInstruction>(node)) {
    instruction->_target = name;
  } else {
    node->_propertyName = name;
  }
}

void NSXMLTree::setURI(NSXMLDocument* document, const NSString* URI) {
  // A copy: a string that references text of this very tree would keep it alive for ever.
  Ref<NSString> text;
  if (URI) text = NSString::stringWithView(URI->view());
  // Where there is no memory nothing has changed.
  auto& documents = makeExtra().documents;
  if (text && !document->_URI) documents.push_back(document);
  if (document->_URI) NSCounting::release(*document->_URI);
  if (document->_URI && !text) std::erase(documents, document);
  document->_URI = text ? text.detach() : nullptr;
}

namespace {

// A tree until it has its first node: where that cannot be made, the tree goes.
class NewTree {
 public:
  NewTree() : _tree(NSXMLTree::create()) {}
  ~NewTree() {
    if (_tree) _tree->destroy();
  }
  NewTree(const NewTree&) = delete;
  NewTree& operator=(const NewTree&) = delete;

  NSXMLTree* operator->() const { return _tree; }
  template <class Node>
  Node* with(Node* first) {
    _tree = nullptr;
    return first;
  }
  // Adopted before anything can fail, so that the count of the name is not lost.
  template <class Make>
  auto* withNamed(const NSXMLName* name, Make make) {
    _tree->adopt(name);
    auto* const first = make(*_tree);
    NSXMLTree::setAdoptedName(first, name);
    return with(first);
  }

 private:
  NSXMLTree* _tree;
};

}  // namespace

NSXMLNode* NSXMLTree::makeLoneNode(Kind kind, NSStringView text) {
  NewTree tree;
  return tree.with(tree->makeNode(kind, text));
}

NSXMLNode* NSXMLTree::makeLoneNode(Kind kind, NSStringView text, NSStringView name,
                                   NSStringView URI) {
  return makeLoneNode(kind, text, NSXMLInternName(name, URI));
}

NSXMLElement* NSXMLTree::makeLoneElement(NSStringView name, NSStringView URI) {
  return NewTree().withNamed(NSXMLInternName(name, URI),
                             [](NSXMLTree& tree) { return tree.makeElement(); });
}

NSXMLElement* NSXMLTree::makeElement(size_t roomBytes, NSXMLRoom& room) {
  NSXMLBlock* const block = allocateBlock(sizeof(NSXMLElement) + roomBytes);
  auto* const element = placeNode<NSXMLElement>(block, block + 1, Kind::Element);
  room._block = reinterpret_cast<char*>(block);
  room._cursor = reinterpret_cast<char*>(element + 1);
  room._end = reinterpret_cast<char*>(block + 1) + roomOf(block);
  return element;
}

NSXMLElement* NSXMLTree::makeLoneElement(const NSXMLName* name, size_t roomBytes, NSXMLRoom& room) {
  return NewTree().withNamed(name,
                             [&](NSXMLTree& tree) { return tree.makeElement(roomBytes, room); });
}

NSXMLElement* NSXMLTree::makeElementInPlace(const NSXMLName* name, size_t roomBytes,
                                            NSXMLRoom& room) {
  NSXMLTree& tree = *of(&NSXMLUnfinished::innermost()->node());
  tree.adopt(name);
  NSXMLElement* element = tree.makeElement(roomBytes, room);
  setAdoptedName(element, name);
  return element;
}

NSXMLNode* NSXMLTree::makeAttributeInPlace(const NSXMLName* name, NSStringView text) {
  NSXMLTree& tree = *of(&NSXMLUnfinished::innermost()->node());
  tree.adopt(name);
  NSXMLNode* attribute = tree.makeNode(Kind::Attribute, text);
  setAdoptedName(attribute, name);
  return attribute;
}

NSXMLNode* NSXMLTree::makeNode(Kind kind, NSStringView text, NSXMLRoom& room) {
  const TextToStore stored(text);
  const size_t bytes = sizeof(NSXMLNode) + roomForText(stored.bytes);
  if (static_cast<size_t>(room._end - room._cursor) < bytes) return makeNode(kind, text);
  auto* const node = placeNode<NSXMLNode>(room._block, room._cursor, kind);
  room._cursor += bytes;
  noteTextBehind(node, stored.copiedTo(node + 1));
  return node;
}

NSXMLNode* NSXMLTree::makeLoneNode(Kind kind, NSStringView text, const NSXMLName* name) {
  return NewTree().withNamed(name, [&](NSXMLTree& tree) { return tree.makeNode(kind, text); });
}

// --- nodes that are being filled --------------------------------------------------------------

namespace {
constinit thread_local const NSXMLUnfinished* innermostUnfinished
    __attribute__((tls_model("initial-exec"))) = nullptr;
}

NSXMLUnfinished::NSXMLUnfinished(NSXMLNode& node)
    : _node(node), _around(std::exchange(innermostUnfinished, this)) {
  NSXMLTree::setUnfinished(&node, true);
}

NSXMLUnfinished::~NSXMLUnfinished() {
  innermostUnfinished = _around;
  NSXMLTree::setUnfinished(&_node, false);
}

const NSXMLUnfinished* NSXMLUnfinished::innermost() {
  return innermostUnfinished;
}

// --- merging ---------------------------------------------------------------------------------

void NSXMLTree::merge(NSXMLTree* a, NSXMLTree* b) {
  if (a == b) return;
  // A thread that still frees lists of an evaluation knows nodes of no tree made in this one.
  const uint64_t era = NSXMLEra::current();
  if (era == 0 || a->_era < era || b->_era < era) waitForAbandonedValues();
  if (a->blockCount() < b->blockCount()) std::swap(a, b);
  NSXMLCredit::giveBack(b);
  a->absorb(b);
}

void NSXMLTree::absorb(NSXMLTree* smaller) {
  dropIndexes();
  smaller->dropIndexes();
  absorbExtra(smaller);
  absorbBaseURIs(smaller);
  NSXMLBlock* block = smaller->_lastBlock;
  do {
    block->tree = this;
    block = block->next;
  } while (block != smaller->_lastBlock);
  NSXMLBlock* const first = _lastBlock->next;
  _lastBlock->next = smaller->_lastBlock->next;
  smaller->_lastBlock->next = first;
  setBlockCount(uint64_t{blockCount()} + smaller->blockCount());
  _era = std::min(_era, smaller->_era);
  const uint64_t sum = uint64_t{references} + smaller->references;
  references = sum >= immortalBit ? immortalBit : static_cast<uint32_t>(sum);
  NSCounted::operator delete(smaller, sizeof(NSXMLTree));
}

// --- structure -------------------------------------------------------------------------------

namespace {

struct Changes {
  uint64_t all = 0;
  uint64_t ofFinished = 0;
};
constinit thread_local Changes changes __attribute__((tls_model("initial-exec")));

}  // namespace

uint64_t NSXMLTree::changeCount() {
  return changes.all;
}

uint64_t NSXMLTree::finishedChangeCount() {
  return changes.ofFinished;
}

void NSXMLTree::noteTextChange(const NSXMLNode* node) {
  of(node)->dropIndexes();
  // One that has got a parent meanwhile, by way of a child, is inside a finished one.
  if (!isUnfinished(node) || node->_parent) ++changes.ofFinished;
}

void NSXMLTree::noteChange(const NSXMLNode* parent) {
  ++changes.all;
  noteTextChange(parent);
  NSXMLTree* tree = of(parent);
  if (tree->order == Fresh) {
    tree->order = Stale;
  } else if (tree->order == SeveralRoots) {
    parent->rootNode()->_word = staleRoot;
  }
}

namespace {

// Both trees are to become one: if either had several roots, so has the sum.
void prepareToJoin(NSXMLTree* parents, NSXMLTree* childs) {
  if (parents == childs) return;
  const bool several =
      parents->order == NSXMLTreeHead::SeveralRoots || childs->order == NSXMLTreeHead::SeveralRoots;
  parents->order = childs->order = several ? NSXMLTreeHead::SeveralRoots : NSXMLTreeHead::Stale;
}

}  // namespace

void NSXMLTree::noteTakenIn(const NSXMLNode* parent, const NSXMLNode* node) {
  NSXMLTree* const parents = of(parent);
  NSXMLTree* const others = of(node);
  if (parents == others) return;
  const auto isInSum = [&](const NSXMLUnfinished* open) {
    return open && (of(&open->node()) == parents || of(&open->node()) == others);
  };
  const NSXMLUnfinished* const innermost = NSXMLUnfinished::innermost();
  if (!isInSum(innermost) || !isInSum(innermost->around())) return;
  parents->order = SeveralRoots;
  for (auto* open = innermost; isInSum(open); open = open->around()) {
    open->node().rootNode()->_word = staleRoot;
  }
}

bool NSXMLTree::freeze(NSXMLDocument* document) {
  NSXMLTree* const tree = of(document);
  if (tree->_isFrozen) return true;  // and perhaps read by others, so that nothing is written
  if (tree->hasSeveralRoots()) return false;
  tree->_isFrozen = true;
  tree->becomeOld();
  return true;
}

bool NSXMLTree::isRootAbove(const NSXMLNode* node, const NSXMLNode* root) {
  return of(node) == of(root) && node->rootNode() == root;
}

bool NSXMLTree::adoptChild(NSXMLNode* parent, NSXMLNode* child, NSXMLNode* before) {
  if (!child || child->_parent || child->isProperty() || child->kind() == Kind::Document ||
      isFixed(child)) {
    return false;
  }
  if (isFrozen(parent) || isRootAbove(parent, child)) return false;
  insertChild(parent, child, before);
  return true;
}

void NSXMLTree::insertChild(NSXMLNode* parent, NSXMLNode* child, NSXMLNode* before) {
  prepareToJoin(of(parent), of(child));
  merge(of(parent), of(child));
  noteChange(parent);
  child->_parent = parent;
  child->_next = before;
  NSXMLNode* first = parent->_firstChild;
  if (!first) {
    child->_previous = child;
    parent->_firstChild = child;
    return;
  }
  NSXMLNode* successor = before ? before : first;  // whose previous field names the predecessor
  child->_previous = successor->_previous;
  if (before == first) {
    parent->_firstChild = child;
  } else {
    successor->_previous->_next = child;
  }
  successor->_previous = child;
}

void NSXMLTree::appendProperty(NSXMLElement* element, NSXMLNode* property) {
  prepareToJoin(of(element), of(property));
  merge(of(element), of(property));
  noteChange(element);
  // Namespaces before attributes, each in the order of their arrival.
  const bool isNamespace = property->kind() == Kind::Namespace;
  Link* link = &element->_firstProperty;
  while (*link && !(isNamespace && (*link)->kind() == Kind::Attribute)) link = &(*link)->_next;
  property->_parent = element;
  property->_next = *link;
  *link = property;
}

void NSXMLTree::appendProperty(NSXMLElement* element, NSXMLNode* property, NSXMLNode* last) {
  if (!last) {
    appendProperty(element, property);
    return;
  }
  prepareToJoin(of(element), of(property));
  merge(of(element), of(property));
  noteChange(element);
  property->_parent = element;
  property->_next = last->_next;
  last->_next = property;
}

void NSXMLTree::unlink(NSXMLNode* node) {
  NSXMLNode* parent = node->_parent;
  if (node->isProperty()) {
    Link* link = &cast<NSXMLElement>(parent)->_firstProperty;
    while (*link != node) link = &(*link)->_next;
    *link = node->_next;
  } else {
    NSXMLNode* first = parent->_firstChild;
    NSXMLNode* successor = node->_next ? node->_next : first;
    successor->_previous = node->_previous;
    if (node == first) {
      parent->_firstChild = node->_next;
    } else {
      node->_previous->_next = node->_next;
    }
    node->_previous = nullptr;
  }
  node->_parent = nullptr;
  node->_next = nullptr;
}

void NSXMLTree::detach(NSXMLNode* node) {
  ++changes.all;
  ++changes.ofFinished;
  NSXMLTree* tree = of(node);
  tree->dropIndexes();
  NSXMLNode* root = node->rootNode();
  unlink(node);
  // Taking a part out leaves the order of what remains, and of the part, as it was.
  const bool fresh =
      tree->order == Fresh || (tree->order == SeveralRoots && root->_word != staleRoot);
  tree->order = SeveralRoots;
  if (!fresh) root->_word = node->_word = staleRoot;
}

// --- order -----------------------------------------------------------------------------------

void NSXMLTree::renumber(const NSXMLNode* root) {
  uint32_t number = firstOrderNumber;
  WorkPacer pacer;  // what is left half done stays stale
  for (const NSXMLNode* node = root; node; node = node->nextNode()) {
    pacer.turn();
    if (node != root) node->_word = number;
    ++number;
    const auto* element = dyn_cast<NSXMLElement>(node);
    if (!element) continue;
    for (const NSXMLNode* property = element->_firstProperty; property;
         property = property->_next) {
      property->_word = number++;
    }
  }
  // The root's comes last: in a tree of several roots it publishes the others.
  __atomic_store_n(&root->_word, firstOrderNumber, __ATOMIC_RELEASE);
}

void NSXMLTree::makeOrderFresh(const NSXMLNode* root) {
  const std::lock_guard<std::mutex> guard(orderLock(this));
  if (order == SeveralRoots) {
    if (root->_word == staleRoot) renumber(root);
  } else if (order == Stale) {
    renumber(root);
    __atomic_store_n(&order, Fresh, __ATOMIC_RELEASE);
  }
}

bool NSXMLNodeOrder::makeComparable(const NSXMLNode* a, const NSXMLNode* b) {
  NSXMLTree* tree = NSXMLTree::of(a);
  const NSXMLNode* root = a->rootNode();
  if (__atomic_load_n(&tree->order, __ATOMIC_ACQUIRE) == NSXMLTreeHead::SeveralRoots) {
    if (root != b->rootNode()) return false;
    if (__atomic_load_n(&root->_word, __ATOMIC_ACQUIRE) != NSXMLTree::staleRoot) return true;
  }
  tree->makeOrderFresh(root);
  return true;
}

int NSXMLNode::compareOrder(const NSXMLNode* a, const NSXMLNode* b) {
  if (a == b || !NSXMLNodeOrder::areComparable(a, b)) return 0;
  return a->_word < b->_word ? -1 : 1;
}

}  // namespace xquery

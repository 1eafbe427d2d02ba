#include "Platform/Tree/Arena.h"

#include "Platform/Base/Abandoned.h"
#include "Platform/Base/LastingObjects.h"
#include "Platform/Base/WorkMeter.h"
#include "Platform/Text/UTF16.h"
#include "Platform/Tree/Credit.h"
#include "Platform/Tree/Names.h"
#include "Platform/Tree/TreeExtra.h"

#include <algorithm>
#include <atomic>
#include <cstdlib>
#include <limits>
#include <malloc.h>
#include <mutex>
#include <new>
#include <optional>
#include <utility>

namespace xquery {

namespace {

// Small blocks come from the object allocator's lists, in multiples of this size; the size is noted
// in the low bits of the block's link. Size class 0 is a block of malloc's.
constexpr size_t blockGranule = 16;
constexpr size_t largestSmallBlock = 128;
constexpr uintptr_t sizeClassBits = blockGranule - 1;

// Distances within a block are 16-bit counts of 8 bytes.
constexpr size_t distanceUnit = 8;
constexpr size_t largestNodeBlock = size_t{1} << 19;
constexpr size_t largestTextBlock = size_t{1} << 20;
static_assert((largestNodeBlock - 1) / distanceUnit <= std::numeric_limits<uint16_t>::max());

constexpr size_t largestNode = 56;
static_assert(sizeof(NSXMLProcessingInstruction) <= largestNode);

NSXMLBlock* nextBlock(const NSXMLBlock* block) {
  return reinterpret_cast<NSXMLBlock*>(block->next & ~sizeClassBits);
}

void setNextBlock(NSXMLBlock* block, const NSXMLBlock* next) {
  block->next = reinterpret_cast<uintptr_t>(next) | (block->next & sizeClassBits);
}

constexpr size_t roundedUp(size_t value, size_t unit) {
  return (value + unit - 1) / unit * unit;
}

size_t bytesOf(NSStringView text) {
  return size_t{text.length()} * (text.isWide() ? sizeof(char16_t) : 1);
}

// The text copied to `memory`, which has room for it.
NSStringView copyText(void* memory, NSStringView text, bool narrow) {
  if (!narrow) {
    std::memcpy(memory, text.wideUnits(), bytesOf(text));
    return {static_cast<const char16_t*>(memory), text.length()};
  }
  auto* units = static_cast<char*>(memory);
  if (text.isWide()) {
    std::copy_n(text.wideUnits(), text.length(), units);
  } else if (!text.isEmpty()) {
    std::memcpy(units, text.asciiUnits(), text.length());
  }
  return {units, text.length()};
}

// Of a block of malloc's just got. The block does not note its size, but malloc does.
void countLargeBlock(void* block) {
  try {
    countValueBlock(malloc_usable_size(block));
  } catch (...) {
    std::free(block);
    throw;
  }
}

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
    for (NSXMLDocument* document : present->documents) document->_URI->release();
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
    NSXMLBlock* const next = nextBlock(block);
    if (const size_t sizeClass = block->next & sizeClassBits) {
      NSCounted::operator delete(block, sizeClass* blockGranule);
    } else {
      uncountValueBytes(malloc_usable_size(block));
      std::free(block);
    }
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
  NSXMLBlock* const first = nextBlock(_lastBlock);
  setNextBlock(_lastBlock, nullptr);
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

// A new block at the end of the ring, with room for that many bytes after its head.
NSXMLBlock* NSXMLTree::allocateBlock(size_t bytes) {
  const size_t size = roundedUp(sizeof(NSXMLBlock) + bytes, blockGranule);
  const bool isSmall = size <= largestSmallBlock;
  void* memory = isSmall ? NSCounted::operator new(size) : std::malloc(size);
  if (!memory) throw std::bad_alloc();
  if (!isSmall) countLargeBlock(memory);
  auto* block = ::new (memory) NSXMLBlock{this, isSmall ? size / blockGranule : 0};
  if (_lastBlock) {
    setNextBlock(block, nextBlock(_lastBlock));
    setNextBlock(_lastBlock, block);
  } else {
    setNextBlock(block, block);
  }
  _lastBlock = block;
  setBlockCount(uint64_t{blockCount()} + 1);
  return block;
}

void NSXMLTree::startBulk(size_t nodeBytes, size_t textBytes) {
  NSXMLTreeExtra& state = makeExtra();
  state.isBulk = true;
  state.nextNodeBlock = std::min(roundedUp(nodeBytes, blockGranule), largestNodeBlock / 2);
  state.nextTextBlock = std::min(textBytes, largestTextBlock / 2);
}

void NSXMLTree::endBulk() {
  NSXMLTreeExtra* state = extra();
  if (!state) return;
  state->isBulk = false;
  if (!state->documents.empty() || state->names.count() > NSXMLNameList::longest) return;
  // A small tree needs no extra part any more.
  const std::unique_ptr<NSXMLTreeExtra> owned(state);
  _extra = 0;
  owned->names.forEach([this](const NSXMLName* name) { adopt(name); });
}

void* NSXMLTree::allocateBulkNode(size_t bytes, uint16_t& distance) {
  NSXMLTreeExtra& state = *extra();
  if (static_cast<size_t>(state.nodeEnd - state.nodeCursor) < bytes) {
    const size_t room = std::max(state.nextNodeBlock, bytes);
    state.nodeBlock = reinterpret_cast<char*>(allocateBlock(room));
    state.nodeCursor = state.nodeBlock + sizeof(NSXMLBlock);
    state.nodeEnd = state.nodeCursor + room;
    state.nextNodeBlock = std::min(room * 2, largestNodeBlock - sizeof(NSXMLBlock));
  }
  char* node = state.nodeCursor;
  state.nodeCursor += bytes;
  distance = static_cast<uint16_t>(static_cast<size_t>(node - state.nodeBlock) / distanceUnit);
  return node;
}

void* NSXMLTree::allocateNode(size_t bytes, size_t textBytes, uint16_t& distance) {
  if (const NSXMLTreeExtra* state = extra(); state && state->isBulk) {
    return allocateBulkNode(bytes, distance);
  }
  distance = sizeof(NSXMLBlock) / distanceUnit;
  return allocateBlock(bytes + textBytes) + 1;
}

void* NSXMLTree::allocateText(size_t bytes) {
  NSXMLTreeExtra* state = extra();
  if (!state || !state->isBulk) return allocateBlock(bytes) + 1;
  // Keep texts at even addresses, for those in UTF-16.
  const size_t rounded = roundedUp(bytes, alignof(char16_t));
  if (static_cast<size_t>(state->textEnd - state->textCursor) < rounded) {
    // A text that would waste much of a block has one of its own.
    if (rounded > state->nextTextBlock / 4) return allocateBlock(rounded) + 1;
    const size_t room = state->nextTextBlock;
    state->textCursor = reinterpret_cast<char*>(allocateBlock(room) + 1);
    state->textEnd = state->textCursor + room;
    state->nextTextBlock = std::min(room * 2, largestTextBlock);
  }
  char* text = state->textCursor;
  state->textCursor += rounded;
  return text;
}

// --- nodes -----------------------------------------------------------------------------------

template <class Node, class... Arguments>
Node* NSXMLTree::placeNode(void* memory, uint16_t distance, Arguments... arguments) {
  Node* node = ::new (memory) Node(arguments...);
  node->_aux = distance;
  return node;
}

template <class Node, class... Arguments>
Node* NSXMLTree::makeNodeOf(size_t textBytes, Arguments... arguments) {
  uint16_t distance = 0;
  void* memory = allocateNode(sizeof(Node), textBytes, distance);
  return placeNode<Node>(memory, distance, arguments...);
}

NSXMLElement* NSXMLTree::makeElement() {
  return makeNodeOf<NSXMLElement>(0);
}
NSXMLDocument* NSXMLTree::makeDocument() {
  return makeNodeOf<NSXMLDocument>(0);
}

NSXMLNode* NSXMLTree::makeNode(Kind kind) {
  return kind == Kind::ProcessingInstruction ? makeNodeOf<NSXMLProcessingInstruction>(0)
                                             : makeNodeOf<NSXMLNode>(0, kind);
}

NSXMLNode* NSXMLTree::makeNode(Kind kind, NSStringView text) {
  const bool narrow = isNarrow(text);
  const size_t textBytes = narrow ? text.length() : bytesOf(text);
  const NSXMLTreeExtra* state = extra();
  const bool isBulk = state && state->isBulk;
  const bool isPI = kind == Kind::ProcessingInstruction;
  NSXMLNode* node = isPI ? makeNodeOf<NSXMLProcessingInstruction>(textBytes)
                         : makeNodeOf<NSXMLNode>(textBytes, kind);
  const size_t nodeBytes = isPI ? sizeof(NSXMLProcessingInstruction) : sizeof(NSXMLNode);
  void* memory = isBulk ? allocateText(textBytes) : reinterpret_cast<char*>(node) + nodeBytes;
  setStoredText(node, copyText(memory, text, narrow));
  return node;
}

void NSXMLTree::setStoredText(NSXMLNode* node, NSStringView text) {
  node->_text = text.isWide() ? static_cast<const void*>(text.wideUnits()) : text.asciiUnits();
  (node->isProperty() ? node->_propertyTextLength : node->_textLength) = text.length();
  node->_flags = static_cast<uint8_t>(text.isWide() ? node->_flags | NSXMLNode::WideText
                                                    : node->_flags & ~NSXMLNode::WideText);
}

void NSXMLTree::setText(NSXMLNode* node, NSStringView text) {
  const bool narrow = isNarrow(text);
  const size_t textBytes = narrow ? text.length() : bytesOf(text);
  setStoredText(node, copyText(allocateText(textBytes), text, narrow));
}

void NSXMLTree::setAdoptedName(NSXMLNode* node, const NSXMLName* name) {
  if (auto* instruction = dyn_cast<NSXMLProcessingInstruction>(node)) {
    instruction->_target = name;
  } else {
    node->_name = name;
  }
}

void NSXMLTree::setURI(NSXMLDocument* document, const NSString* URI) {
  // A copy: a string that references text of this very tree would keep it alive for ever.
  NSString* text = URI ? NSString::stringWithView(URI->view()).detach() : nullptr;
  auto& documents = makeExtra().documents;
  if (document->_URI) {
    document->_URI->release();
    std::erase(documents, document);
  }
  document->_URI = text;
  if (text) documents.push_back(document);
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
  return NewTree().withNamed(NSXMLInternName(name, URI),
                             [&](NSXMLTree& tree) { return tree.makeNode(kind, text); });
}

NSXMLElement* NSXMLTree::makeLoneElement(NSStringView name, NSStringView URI) {
  return NewTree().withNamed(NSXMLInternName(name, URI),
                             [](NSXMLTree& tree) { return tree.makeElement(); });
}

NSXMLElement* NSXMLTree::makeElement(size_t roomBytes, NSXMLRoom& room) {
  const size_t bytes = sizeof(NSXMLElement) + roomBytes;
  NSXMLBlock* block = allocateBlock(bytes);
  auto* element = placeNode<NSXMLElement>(block + 1, uint16_t{sizeof(NSXMLBlock) / distanceUnit});
  room._block = reinterpret_cast<char*>(block);
  room._cursor = reinterpret_cast<char*>(element + 1);
  room._end = room._block + roundedUp(sizeof(NSXMLBlock) + bytes, blockGranule);
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
  if (static_cast<size_t>(room._end - room._cursor) < sizeof(NSXMLNode)) {
    return makeNode(kind, text);
  }
  auto* node = placeNode<NSXMLNode>(
      room._cursor, static_cast<uint16_t>((room._cursor - room._block) / ptrdiff_t{distanceUnit}),
      kind);
  room._cursor += sizeof(NSXMLNode);
  const bool narrow = isNarrow(text);
  const size_t textBytes = narrow ? text.length() : bytesOf(text);
  const size_t rounded = roundedUp(textBytes, distanceUnit);
  void* memory = room._cursor;
  if (rounded <= static_cast<size_t>(room._end - room._cursor)) {
    room._cursor += rounded;
  } else {
    memory = allocateText(textBytes);
  }
  setStoredText(node, copyText(memory, text, narrow));
  return node;
}

NSXMLNode* NSXMLTree::makeLoneAttribute(const NSXMLName* name, NSStringView text) {
  return NewTree().withNamed(name,
                             [&](NSXMLTree& tree) { return tree.makeNode(Kind::Attribute, text); });
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
    block = nextBlock(block);
  } while (block != smaller->_lastBlock);
  NSXMLBlock* first = nextBlock(_lastBlock);
  setNextBlock(_lastBlock, nextBlock(smaller->_lastBlock));
  setNextBlock(smaller->_lastBlock, first);
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

bool NSXMLTree::isRootAbove(const NSXMLNode* node, const NSXMLNode* root) {
  return of(node) == of(root) && node->rootNode() == root;
}

bool NSXMLTree::adoptChild(NSXMLNode* parent, NSXMLNode* child, NSXMLNode* before) {
  if (!child || child->_parent || child->isProperty() || child->kind() == Kind::Document ||
      isFixed(child)) {
    return false;
  }
  if (isRootAbove(parent, child)) return false;
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
  NSXMLNode** link = &element->_firstProperty;
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
    NSXMLNode** link = &cast<NSXMLElement>(parent)->_firstProperty;
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

bool NSXMLNode::makeOrderComparable(const NSXMLNode* a, const NSXMLNode* b) {
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
  if (a == b || !haveComparableOrder(a, b)) return 0;
  return a->_word < b->_word ? -1 : 1;
}

}  // namespace xquery

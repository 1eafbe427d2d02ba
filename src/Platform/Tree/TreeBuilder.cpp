#include "Platform/Tree/TreeBuilder.h"

#include "Platform/Base/LastingObjects.h"
#include "Platform/Base/RangeMemory.h"
#include "Platform/Base/WorkMeter.h"
#include "Platform/Text/Blocks.h"
#include "Platform/Tree/TreeHead.h"

#include <algorithm>

namespace xquery {
namespace {

constexpr size_t largestTextBlock = size_t{1} << 20;

NSXMLTree* lastingTree() {
  const LastingObjects lasting;
  return NSXMLTree::create();
}

}  // namespace

NSXMLTreeBuilder::NSXMLTreeBuilder(size_t nodeBytes, size_t textBytes)
    : _tree(lastingTree()),
      _nextNodeBlock(std::min(nodeBytes, NSXMLTree::largestNodeBlock / 2)),
      _nextTextBlock(std::min(textBytes, largestTextBlock / 2)) {}

NSXMLTreeBuilder::~NSXMLTreeBuilder() {
  if (_tree) _tree->destroy();
}

void NSXMLTreeBuilder::refuseNode() {
  throw std::bad_alloc();
}

// --- room ------------------------------------------------------------------------------------

constexpr size_t mostNodeRoom = NSXMLTree::largestNodeBlock - sizeof(NSXMLBlock);

void NSXMLTreeBuilder::startNodeBlock(size_t bytes) {
  beginNodeBlock(_tree->allocateBlock(std::max(_nextNodeBlock, bytes)));
  _nextNodeBlock = std::min(static_cast<size_t>(_nodeEnd - _nodeCursor) * 2, mostNodeRoom);
}

void NSXMLTreeBuilder::beginNodeBlock(NSXMLBlock* block) {
  _nodeBlock = block;
  _nodeCursor = reinterpret_cast<char*>(block + 1);
  _nodeEnd = _nodeCursor + std::min(NSXMLTree::roomOf(block), mostNodeRoom);
}

void NSXMLTreeBuilder::beginTextBlock(NSXMLBlock* block) {
  _textBlock = block;
  _textCursor = reinterpret_cast<char*>(block + 1);
  _textEnd = _textCursor + NSXMLTree::roomOf(block);
}

// At an even address, for texts in UTF-16.
char* NSXMLTreeBuilder::takeTextRoom(size_t bytes) {
  const size_t rounded = (bytes + 1) & ~size_t{1};
  if (static_cast<size_t>(_textEnd - _textCursor) < rounded) {
    // A text that would waste much of a block has one of its own.
    if (rounded > _nextTextBlock / 4) {
      return reinterpret_cast<char*>(_tree->allocateBlock(rounded) + 1);
    }
    beginTextBlock(_tree->allocateBlock(_nextTextBlock));
    _nextTextBlock = std::min(_nextTextBlock * 2, largestTextBlock);
  }
  char* const room = _textCursor;
  _textCursor += rounded;
  return room;
}

void NSXMLTreeBuilder::addRoom(Kind kind, NSStringView text, size_t& nodeBytes, size_t& textBytes) {
  const bool isLarge = kind <= Kind::Element || kind == Kind::ProcessingInstruction;
  const size_t bytes = bytesOf(text);
  const bool isApart = bytes > longestTextBehind || kind == Kind::ProcessingInstruction;
  nodeBytes += isLarge ? sizeof(NSXMLElement) : sizeof(NSXMLNode);
  nodeBytes += isApart ? sizeof(NSStringView) : NSXMLTree::roomForText(bytes);
  if (isApart) textBytes += (bytes + 1) & ~size_t{1};
}

// --- texts elsewhere -------------------------------------------------------------------------

char16_t* NSXMLTreeBuilder::roomForUnits(size_t count) {
  return reinterpret_cast<char16_t*>(takeTextRoom(count * sizeof(char16_t)));
}

const NSStringView* NSXMLTreeBuilder::storeFilled(NSStringView text) {
  return ::new (takeRoom(sizeof(NSStringView))) NSStringView(text);
}

const NSStringView* NSXMLTreeBuilder::storeUnitsInHand(size_t count) {
  const char16_t* const units = roomForUnits(count);
  return storeFilled({units, static_cast<uint32_t>(count)});
}

const NSStringView* NSXMLTreeBuilder::store(NSStringView text) {
  return withUnitsOf(text, [this](auto units) {
    using Unit = typename decltype(units)::value_type;
    auto* const copy = reinterpret_cast<Unit*>(takeTextRoom(units.size() * sizeof(Unit)));
    auto* to = copy;
    inBlocks(units, [&to](auto block) {
      if (!block.empty()) std::memcpy(to, block.data(), block.size() * sizeof(Unit));
      to += block.size();
    });
    return storeFilled({copy, static_cast<uint32_t>(units.size())});
  });
}

NSXMLNode* NSXMLTreeBuilder::addProperty(Kind kind, const NSXMLName* name,
                                         const NSStringView* stored) {
  auto* const property = make<NSXMLNode>(kind);
  NSXMLTree::setTextApart(property, stored);
  appendProperty(property, name);
  return property;
}

NSXMLNode* NSXMLTreeBuilder::addLeaf(Kind kind, const NSStringView* stored) {
  auto* const leaf = make<NSXMLNode>(kind);
  NSXMLTree::setTextApart(leaf, stored);
  append(leaf);
  return leaf;
}

// --- nodes -----------------------------------------------------------------------------------

NSXMLDocument* NSXMLTreeBuilder::openDocument() {
  auto* const document = make<NSXMLDocument>(Kind::Document);
  append(document);
  _current = document;
  _lastChild = nullptr;
  return document;
}

NSXMLNode* NSXMLTreeBuilder::addInstruction(const NSXMLName* target, const NSStringView* stored) {
  auto* const instruction = make<NSXMLProcessingInstruction>(Kind::ProcessingInstruction);
  NSXMLTree::setAdoptedName(instruction, target);
  NSXMLTree::setTextApart(instruction, stored);
  append(instruction);
  return instruction;
}

NSXMLNode* NSXMLTreeBuilder::addInstruction(const NSXMLName* target, NSStringView text) {
  return addInstruction(target, store(text));
}

// --- going back --------------------------------------------------------------------------------

// Before the first block, where no mark lies behind it.
const NSStringView* NSXMLTreeBuilder::storeLasting(NSStringView text) {
  NSXMLBlock* const last = _tree->_lastBlock;
  NSXMLBlock* const block = _tree->allocateBlock(sizeof(NSStringView) + bytesOf(text));
  if (last) _tree->_lastBlock = last;
  char* const units = reinterpret_cast<char*>(block + 1) + sizeof(NSStringView);
  if (bytesOf(text)) std::memcpy(units, unitsOf(text), bytesOf(text));
  const NSStringView stored =
      text.isWide() ? NSStringView(reinterpret_cast<const char16_t*>(units), text.length())
                    : NSStringView::ascii({units, text.length()});
  return ::new (block + 1) NSStringView(stored);
}

NSXMLTreeBuilder::Mark NSXMLTreeBuilder::mark() const {
  return {_tree->_lastBlock, _nodeBlock, _nodeCursor, _nodeEnd, _textBlock,
          _textCursor,       _textEnd,   _nextNumber, _current, _lastChild};
}

void NSXMLTreeBuilder::freeBlocksBehind(NSXMLBlock* last, const NSXMLBlock* butNodes,
                                        const NSXMLBlock* butTexts) {
  NSXMLBlock* const first = _tree->_lastBlock->next;
  uint64_t count = _tree->blockCount();
  for (NSXMLBlock* block = last->next; block != first;) {
    NSXMLBlock* const next = block->next;
    if (block == butNodes || block == butTexts) {
      last->next = block;
      last = block;
    } else {
      uncountValueBytes(sizeof(NSXMLBlock) + NSXMLTree::roomOf(block));
      giveRangeBlock(block);
      --count;
    }
    block = next;
  }
  last->next = first;
  _tree->_lastBlock = last;
  _tree->setBlockCount(count);
}

// Of the blocks begun since, the newest are the largest: these are filled again, and soon
// everything fits into them.
void NSXMLTreeBuilder::backTo(const Mark& mark) {
  _tree->dropIndexes();
  const bool keepsNodes = _nodeBlock != mark.nodeBlock;
  const bool keepsTexts = _textBlock != mark.textBlock;
  // Mostly none has been begun since the last time.
  if (_tree->_lastBlock != _lastKept || mark.lastBlock != _lastMarked) {
    freeBlocksBehind(mark.lastBlock, keepsNodes ? _nodeBlock : nullptr,
                     keepsTexts ? _textBlock : nullptr);
    _lastKept = _tree->_lastBlock;
    _lastMarked = mark.lastBlock;
  }
  if (keepsNodes) {
    beginNodeBlock(_nodeBlock);
  } else {
    _nodeCursor = mark.nodeCursor;
    _nodeEnd = mark.nodeEnd;
  }
  if (keepsTexts) {
    beginTextBlock(_textBlock);
  } else {
    _textCursor = mark.textCursor;
    _textEnd = mark.textEnd;
  }
  _nextNumber = mark.nextNumber;
  _current = mark.current;
  _lastChild = mark.lastChild;
  _lastProperty = nullptr;
  if (_lastChild) {
    NSXMLTree::nextOf(_lastChild) = nullptr;
  } else {
    NSXMLTree::firstChildOf(_current) = nullptr;
  }
}

void NSXMLTreeBuilder::dropOpenElement() {
  NSXMLNode* const dropped = _current;
  _current = dropped->parent();
  if (NSXMLTree::firstChildOf(_current) == dropped) {
    _lastChild = nullptr;
    NSXMLTree::firstChildOf(_current) = nullptr;
  } else {
    _lastChild = NSXMLTree::previousOf(dropped);
    NSXMLTree::nextOf(_lastChild) = nullptr;
  }
}

void NSXMLTreeBuilder::endOpenNodes() {
  NSXMLNode* last = _lastChild;
  for (NSXMLNode* node = _current; node; node = node->parent()) {
    if (NSXMLNode* const first = NSXMLTree::firstChildOf(node)) NSXMLTree::previousOf(first) = last;
    last = node;
  }
}

NSXMLNode* NSXMLTreeBuilder::finish() {
  while (_current) close();
  _tree = nullptr;
  return _root;
}

}  // namespace xquery

#include "Platform/Tree/TreeBuilder.h"

#include "Platform/Base/LastingObjects.h"
#include "Platform/Text/Blocks.h"

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

void NSXMLTreeBuilder::startNodeBlock(size_t bytes) {
  constexpr size_t most = NSXMLTree::largestNodeBlock - sizeof(NSXMLBlock);
  _nodeBlock = _tree->allocateBlock(std::max(_nextNodeBlock, bytes));
  const size_t room = std::min(NSXMLTree::roomOf(_nodeBlock), most);
  _nodeCursor = reinterpret_cast<char*>(_nodeBlock + 1);
  _nodeEnd = _nodeCursor + room;
  _nextNodeBlock = std::min(room * 2, most);
}

// At an even address, for texts in UTF-16.
char* NSXMLTreeBuilder::takeTextRoom(size_t bytes) {
  const size_t rounded = (bytes + 1) & ~size_t{1};
  if (static_cast<size_t>(_textEnd - _textCursor) < rounded) {
    // A text that would waste much of a block has one of its own.
    if (rounded > _nextTextBlock / 4) {
      return reinterpret_cast<char*>(_tree->allocateBlock(rounded) + 1);
    }
    NSXMLBlock* const block = _tree->allocateBlock(_nextTextBlock);
    _textCursor = reinterpret_cast<char*>(block + 1);
    _textEnd = _textCursor + NSXMLTree::roomOf(block);
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

NSXMLNode* NSXMLTreeBuilder::finish() {
  while (_current) close();
  _tree = nullptr;
  return _root;
}

}  // namespace xquery

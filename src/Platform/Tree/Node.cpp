// What every kind of node can do; see XMLElement.cpp and XMLDocument.cpp for the two that have
// children.
#include "Platform/Base/WorkMeter.h"
#include "Platform/Tree/Arena.h"
#include "Platform/Tree/Names.h"
#include "xquery/XMLNode.h"

namespace xquery {

namespace {

// Navigation answers nodes that the caller may change, whoever asks.
NSXMLNode* changeable(const NSXMLNode* node) {
  return const_cast<NSXMLNode*>(node);
}

Ref<NSString> stringOrNull(const NSXMLNode* owner, NSStringView text) {
  if (text.isEmpty()) return nullptr;
  return NSString::stringInTreeOf(owner, text);
}

bool isTextOf(const NSXMLNode* node) {
  return node->kind() == Kind::Text;
}

// The first text node from `node` on that comes before `end`.
const NSXMLNode* textFrom(const NSXMLNode* node, const NSXMLNode* end, WorkPacer& pacer) {
  for (; node != end && !isTextOf(node); node = node->nextNode()) pacer.turn();
  pacer.turn();
  return node == end ? nullptr : node;
}

void appendTexts(const NSXMLNode* branch, NSMutableString& out, WorkPacer& pacer) {
  const NSXMLNode* end = NSXMLTree::endOfSubtree(branch);
  const NSXMLNode* text = textFrom(branch, end, pacer);
  for (; text; text = textFrom(text->nextNode(), end, pacer)) out.append(text->textView());
}

// For a way through `count` nodes of a tree that no pacer counted.
void chargeWay(int64_t count) {
  if (count >= WorkPacer::turnsPerStep) {
    chargeWork(static_cast<uint64_t>(count) / WorkPacer::turnsPerStep);
  }
}

}  // namespace

// --- navigation ------------------------------------------------------------------------------

uint32_t NSXMLNode::childCount() const {
  uint32_t count = 0;
  for (const NSXMLNode* child = firstChild(); child; child = child->_next) ++count;
  return count;
}

NSXMLNode* NSXMLNode::childAtIndex(uint32_t index) const {
  NSXMLNode* child = firstChild();
  while (child && index--) child = child->_next;
  return child;
}

NSXMLNode* NSXMLNode::rootNode() const {
  const NSXMLNode* node = this;
  int64_t way = 0;
  for (; node->_parent; node = node->_parent) ++way;
  chargeWay(way);
  return changeable(node);
}

NSXMLDocument* NSXMLNode::rootDocument() const {
  return dyn_cast<NSXMLDocument>(rootNode());
}

int64_t NSXMLNode::level() const {
  int64_t count = 0;
  for (const NSXMLNode* node = _parent; node; node = node->_parent) ++count;
  chargeWay(count);
  return count;
}

int64_t NSXMLNode::index() const {
  if (!_parent) return 0;
  int64_t place = 0;
  if (isProperty()) {
    // Counted down from the first child: the last attribute is at -1.
    for (const NSXMLNode* node = this; node; node = node->_next) --place;
  } else {
    for (const NSXMLNode* node = _parent->_firstChild; node != this; node = node->_next) ++place;
    chargeWay(place);
  }
  return place;
}

// --- names and values ------------------------------------------------------------------------

const NSXMLName* NSXMLNode::nodeName() const {
  switch (kind()) {
    case Kind::Element:
      return static_cast<const NSXMLElement*>(this)->_name;
    case Kind::Attribute:
    case Kind::Namespace:
      return _propertyName;
    case Kind::ProcessingInstruction:
      return NSXMLTree::targetOf(this);
    default:
      return nullptr;
  }
}

NSStringView NSXMLNode::nameView() const {
  const NSXMLName* name = nodeName();
  return name ? name->text : NSStringView();
}

NSStringView NSXMLNode::localNameView() const {
  const NSXMLName* name = nodeName();
  return name ? name->expanded->localName : NSStringView();
}

NSStringView NSXMLNode::prefixView() const {
  const NSXMLName* name = nodeName();
  return name ? NSXMLPrefixOf(*name) : NSStringView();
}

NSStringView NSXMLNode::URIView() const {
  const NSXMLName* name = nodeName();
  return name ? NSXMLURIOf(*name->expanded) : NSStringView();
}

Ref<NSString> NSXMLNode::name() const {
  return hasName() ? NSString::stringWithView(nameView()) : nullptr;
}

Ref<NSString> NSXMLNode::localName() const {
  return hasName() ? NSString::stringWithView(localNameView()) : nullptr;
}

// The texts of names live as long as the tree, which holds the names.
Ref<NSString> NSXMLNode::prefix() const {
  return stringOrNull(this, prefixView());
}
Ref<NSString> NSXMLNode::URI() const {
  return stringOrNull(this, URIView());
}

NSStringView NSXMLNode::textView() const {
  if (isBranch()) return {};
  if (_flags & TextApart) return *_textApart.get();
  const void* const text = this + 1;
  return (_flags & WideText) ? NSStringView(static_cast<const char16_t*>(text), _textLength)
                             : NSStringView(static_cast<const char*>(text), _textLength);
}

Ref<NSString> NSXMLNode::stringValue() const {
  if (!isBranch()) return NSString::stringInTreeOf(this, textView());
  WorkPacer pacer;
  const NSXMLNode* end = NSXMLTree::endOfSubtree(this);
  const NSXMLNode* first = textFrom(this, end, pacer);
  if (!first) return NSString::empty();
  if (!textFrom(first->nextNode(), end, pacer)) {
    return NSString::stringInTreeOf(first, first->textView());
  }
  NSMutableString text;
  appendTexts(this, text, pacer);
  return text.string();
}

void NSXMLNode::appendStringValueTo(NSMutableString& out) const {
  if (!isBranch()) {
    out.append(textView());
    return;
  }
  WorkPacer pacer;
  appendTexts(this, out, pacer);
}

// --- changes ---------------------------------------------------------------------------------

void NSXMLNode::setStringValue(NSStringView text) {
  if (NSXMLTree::isFixed(this) || NSXMLTree::isFrozen(this)) return;
  if (!isBranch()) {
    NSXMLTree::noteTextChange(this);
    NSXMLTree::of(this)->setText(this, text);
    return;
  }
  while (_firstChild) _firstChild->detach();
  if (text.isEmpty()) return;
  NSXMLTree::insertChild(this, NSXMLTree::makeLoneNode(Kind::Text, text), nullptr);
}

void NSXMLNode::detach() {
  if (_parent && !NSXMLTree::isFrozen(this)) NSXMLTree::detach(this);
}

// --- factories -------------------------------------------------------------------------------

Ref<NSXMLNode> NSXMLNode::textWithStringValue(NSStringView text) {
  return NSXMLTree::makeLoneNode(Kind::Text, text);
}

Ref<NSXMLNode> NSXMLNode::cdataWithStringValue(NSStringView text) {
  NSXMLNode* node = NSXMLTree::makeLoneNode(Kind::Text, text);
  NSXMLTree::setCDATA(node);
  return node;
}

Ref<NSXMLNode> NSXMLNode::commentWithStringValue(NSStringView text) {
  return NSXMLTree::makeLoneNode(Kind::Comment, text);
}

Ref<NSXMLNode> NSXMLNode::processingInstructionWithName(NSStringView name,
                                                        NSStringView stringValue) {
  return NSXMLTree::makeLoneNode(Kind::ProcessingInstruction, stringValue, name);
}

Ref<NSXMLNode> NSXMLNode::attributeWithName(NSStringView name, NSStringView stringValue,
                                            NSStringView URI) {
  return NSXMLTree::makeLoneNode(Kind::Attribute, stringValue, name, URI);
}

Ref<NSXMLNode> NSXMLNode::namespaceWithName(NSStringView prefix, NSStringView stringValue) {
  return NSXMLTree::makeLoneNode(Kind::Namespace, stringValue, prefix);
}

}  // namespace xquery

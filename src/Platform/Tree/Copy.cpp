// Deep copies. The copy is a tree of its own, numbered as it is built; its elements keep their own
// namespace declarations and every name its URI, so nothing is looked up above the original.
#include "Platform/Base/WorkMeter.h"
#include "Platform/Tree/Names.h"
#include "Platform/Tree/TreeBuilder.h"
#include "xquery/XMLNode.h"

#include <array>

namespace xquery {

namespace {

// Bytes of nodes and of texts.
struct Room {
  size_t nodes = 0;
  size_t texts = 0;
  void add(const NSXMLNode* node) {
    NSXMLTreeBuilder::addRoom(node->kind(), node->textView(), nodes, texts);
  }
};

// What the subtree takes; of a large one, what its beginning takes.
Room roomFor(const NSXMLNode* root) {
  constexpr size_t mostNodes = 64;
  Room room;
  const NSXMLNode* end = NSXMLTree::endOfSubtree(root);
  size_t count = 0;
  for (const NSXMLNode* node = root; node != end && count < mostNodes; node = node->nextNode()) {
    room.add(node);
    ++count;
    const auto* element = dyn_cast<NSXMLElement>(node);
    const NSXMLNode* property = element ? NSXMLTree::firstPropertyOf(element) : nullptr;
    for (; property; property = NSXMLTree::nextProperty(property)) {
      room.add(property);
      ++count;
    }
  }
  return room;
}

class Copier {
 public:
  explicit Copier(const NSXMLNode* root, Room room)
      : _root(root), _builder(room.nodes, room.texts) {}

  NSXMLNode* copy();

 private:
  // Copies the node, and an element's properties; leaves a node that may have children open.
  void visit(const NSXMLNode* node);
  const NSXMLName* nameOf(const NSXMLNode* original);

  // Names come again and again, and the tree searches for each.
  static constexpr size_t knownNames = 16;

  const NSXMLNode* _root;
  NSXMLTreeBuilder _builder;
  std::array<const NSXMLName*, knownNames> _known{};  // each is the tree's already
};

const NSXMLName* Copier::nameOf(const NSXMLNode* original) {
  const NSXMLName* name = original->nodeName();
  if (!name) return name;
  const NSXMLName*& known = _known[name->hash % knownNames];
  if (known != name) _builder.tree().use(name);
  known = name;
  return name;
}

void Copier::visit(const NSXMLNode* node) {
  if (const auto* document = dyn_cast<NSXMLDocument>(node)) {
    NSXMLDocument* copied = _builder.openDocument();
    if (const Ref<NSString> URI = document->documentURI()) {
      _builder.tree().setURI(copied, URI.get());
    }
  } else if (const auto* element = dyn_cast<NSXMLElement>(node)) {
    _builder.openElement(nameOf(element));
    const NSXMLNode* property = NSXMLTree::firstPropertyOf(element);
    for (; property; property = NSXMLTree::nextProperty(property)) {
      _builder.addProperty(property->kind(), nameOf(property), property->textView());
    }
  } else if (node->kind() == Kind::ProcessingInstruction) {
    _builder.addInstruction(nameOf(node), node->textView());
  } else {
    NSXMLNode* const leaf = _builder.addLeaf(node->kind(), node->textView());
    if (NSXMLTree::isCDATA(node)) NSXMLTree::setCDATA(leaf);
  }
}

NSXMLNode* Copier::copy() {
  const NSXMLNode* node = _root;
  WorkPacer pacer;
  while (true) {
    pacer.turn();
    visit(node);
    if (const NSXMLNode* child = node->firstChild()) {
      node = child;
      continue;
    }
    if (NSXMLTree::mayHaveChildren(node)) _builder.close();
    while (node != _root && !node->nextSibling()) {
      node = node->parent();
      _builder.close();
    }
    if (node == _root) return _builder.finish();
    node = node->nextSibling();
  }
}

NSXMLNode* copyOfLeaf(const NSXMLNode* original) {
  NSXMLNode* node = NSXMLTree::makeLoneNode(original->kind(), original->textView());
  if (const NSXMLName* name = original->nodeName()) {
    NSXMLTree::of(node)->use(name);
    NSXMLTree::setAdoptedName(node, name);
  }
  if (NSXMLTree::isCDATA(original)) NSXMLTree::setCDATA(node);
  return node;
}

}  // namespace

Ref<NSXMLNode> NSXMLNode::copy() const {
  if (!isBranch()) return copyOfLeaf(this);
  return Copier(this, roomFor(this)).copy();
}

}  // namespace xquery

// What nodes are, where they lead, and how they are written.
#include "C/Nodes.h"

#include "C/Texts.h"
#include "xquery/Serializing.h"

#include <array>
#include <string>

using namespace xquery;
using namespace xquery::capi;

// --- handles -------------------------------------------------------------------------------------

xq_status xq_node_share(const xq_node* node, xq_node** other) {
  if (!other) return XQ_USAGE;
  *other = nullptr;
  if (!areGood(node)) return XQ_USAGE;
  return guarded([&] { return giveNew(other, node->node); });
}

xq_status xq_node_free(xq_node* node) {
  return freeHandle(node);
}

// --- what a node is ------------------------------------------------------------------------------

static_assert(XQ_KIND_DOCUMENT == static_cast<int>(Kind::Document));
static_assert(XQ_KIND_ELEMENT == static_cast<int>(Kind::Element));
static_assert(XQ_KIND_ATTRIBUTE == static_cast<int>(Kind::Attribute));
static_assert(XQ_KIND_NAMESPACE == static_cast<int>(Kind::Namespace));
static_assert(XQ_KIND_PROCESSING_INSTRUCTION == static_cast<int>(Kind::ProcessingInstruction));
static_assert(XQ_KIND_COMMENT == static_cast<int>(Kind::Comment));
static_assert(XQ_KIND_TEXT == static_cast<int>(Kind::Text));

xq_status xq_node_kind(const xq_node* node, xq_kind* kind) {
  if (!kind) return XQ_USAGE;
  *kind = 0;
  if (!areGood(node)) return XQ_USAGE;
  *kind = static_cast<xq_kind>(node->node->kind());
  return XQ_OK;
}

namespace {

// Fills the text with what a member function of the node answers.
template <class Answer>
xq_status textOf(const xq_node* node, xq_text* text, Answer (NSXMLNode::*ask)() const) {
  if (!emptied(text) || !areGood(node)) return XQ_USAGE;
  return guarded([&] { return fill(*text, (node->node.get()->*ask)()); });
}

}  // namespace

xq_status xq_node_name(const xq_node* node, xq_text* name) {
  return textOf(node, name, &NSXMLNode::name);
}

xq_status xq_node_local_name(const xq_node* node, xq_text* name) {
  return textOf(node, name, &NSXMLNode::localName);
}

xq_status xq_node_prefix(const xq_node* node, xq_text* prefix) {
  return textOf(node, prefix, &NSXMLNode::prefix);
}

xq_status xq_node_namespace_uri(const xq_node* node, xq_text* uri) {
  return textOf(node, uri, &NSXMLNode::URI);
}

xq_status xq_node_string(const xq_node* node, xq_text* text) {
  return textOf(node, text, &NSXMLNode::stringValue);
}

xq_status xq_node_path(const xq_node* node, xq_text* path) {
  return textOf(node, path, &NSXMLNode::XPath);
}

// --- where it leads ------------------------------------------------------------------------------

namespace {

NSXMLNode* firstAttribute(const NSXMLNode& node) {
  const auto* element = dyn_cast<NSXMLElement>(&node);
  return element ? element->firstAttribute() : nullptr;
}

NSXMLNode* nextAttribute(const NSXMLNode& node) {
  return node.kind() == Kind::Attribute ? NSXMLElement::nextAttribute(&node) : nullptr;
}

NSXMLNode* firstNamespace(const NSXMLNode& node) {
  const auto* element = dyn_cast<NSXMLElement>(&node);
  return element ? element->firstNamespace() : nullptr;
}

NSXMLNode* nextNamespace(const NSXMLNode& node) {
  return node.kind() == Kind::Namespace ? NSXMLElement::nextNamespace(&node) : nullptr;
}

// By the numbers of the steps. Null where there is no node.
constexpr std::array<NSXMLNode* (*)(const NSXMLNode&), XQ_STEP_NEXT_NAMESPACE + 1> steps = {
    [](const NSXMLNode& node) { return node.parent(); },
    [](const NSXMLNode& node) { return node.firstChild(); },
    [](const NSXMLNode& node) { return node.lastChild(); },
    [](const NSXMLNode& node) { return node.nextSibling(); },
    [](const NSXMLNode& node) { return node.previousSibling(); },
    [](const NSXMLNode& node) { return node.nextNode(); },
    [](const NSXMLNode& node) { return node.rootNode(); },
    firstAttribute,
    nextAttribute,
    firstNamespace,
    nextNamespace,
};

bool isStep(xq_step step) {
  return step >= 0 && static_cast<size_t>(step) < steps.size();
}

}  // namespace

xq_status xq_node_step(const xq_node* node, xq_step step, xq_node** there) {
  if (!there) return XQ_USAGE;
  *there = nullptr;
  if (!areGood(node) || !isStep(step)) return XQ_USAGE;
  return guarded([&]() -> xq_status {
    NSXMLNode* found = steps[static_cast<size_t>(step)](*node->node);
    return found ? giveNew(there, found) : XQ_END;
  });
}

xq_status xq_node_move(xq_node* node, xq_step step) {
  if (!areGood(node) || !isStep(step)) return XQ_USAGE;
  return guarded([&] {
    NSXMLNode* found = steps[static_cast<size_t>(step)](*node->node);
    if (!found) return XQ_END;
    node->node = found;
    return XQ_OK;
  });
}

xq_status xq_node_child_count(const xq_node* node, size_t* count) {
  if (!count) return XQ_USAGE;
  *count = 0;
  if (!areGood(node)) return XQ_USAGE;
  *count = node->node->childCount();
  return XQ_OK;
}

xq_status xq_node_attribute_count(const xq_node* node, size_t* count) {
  if (!count) return XQ_USAGE;
  *count = 0;
  if (!areGood(node)) return XQ_USAGE;
  const auto* element = dyn_cast<NSXMLElement>(node->node.get());
  *count = element ? element->attributeCount() : 0;
  return XQ_OK;
}

xq_status xq_node_child(const xq_node* node, size_t index, xq_node** child) {
  if (!child) return XQ_USAGE;
  *child = nullptr;
  if (!areGood(node)) return XQ_USAGE;
  return guarded([&]() -> xq_status {
    if (index > UINT32_MAX) return XQ_END;
    NSXMLNode* found = node->node->childAtIndex(static_cast<uint32_t>(index));
    return found ? giveNew(child, found) : XQ_END;
  });
}

namespace {

template <class Find>
xq_status attributeBy(const xq_node* node, xq_text* value, bool isUsable, Find find) {
  if (!emptied(value) || !areGood(node) || !isUsable) return XQ_USAGE;
  return guarded([&]() -> xq_status {
    const auto* element = dyn_cast<NSXMLElement>(node->node.get());
    if (!element) return XQ_END;
    const NSXMLNode* found = find(*element);
    return found ? fill(*value, found->stringValue()) : XQ_END;
  });
}

}  // namespace

// Nothing has a name that is not UTF-8.
xq_status xq_node_attribute(const xq_node* node, const char* name, size_t length, xq_text* value) {
  const GivenText given(name, length);
  return attributeBy(node, value, given.isGood(), [&](const NSXMLElement& element) {
    const Ref<NSString> string = given.string();
    return string ? element.attributeForName(string->view()) : nullptr;
  });
}

xq_status xq_node_attribute_ns(const xq_node* node, const char* uri, size_t uri_length,
                               const char* local_name, size_t local_name_length, xq_text* value) {
  const GivenText URI(uri, uri_length);
  const GivenText local(local_name, local_name_length);
  return attributeBy(node, value, URI.isGood() && local.isGood(), [&](const NSXMLElement& element) {
    const Ref<NSString> namespaceURI = URI.string();
    const Ref<NSString> name = local.string();
    return namespaceURI && name ? element.attributeForLocalName(name->view(), namespaceURI->view())
                                : nullptr;
  });
}

// --- order ---------------------------------------------------------------------------------------

xq_status xq_node_is_same(const xq_node* a, const xq_node* b, int* is_same) {
  if (!is_same) return XQ_USAGE;
  *is_same = 0;
  if (!areGood(a, b)) return XQ_USAGE;
  *is_same = a->node == b->node;
  return XQ_OK;
}

xq_status xq_node_compare(const xq_node* a, const xq_node* b, int* order) {
  if (!order) return XQ_USAGE;
  *order = 0;
  if (!areGood(a, b)) return XQ_USAGE;
  return guarded([&] {
    if (a->node->rootNode() != b->node->rootNode()) return XQ_MISMATCH;
    *order = NSXMLNode::compareOrder(a->node.get(), b->node.get());
    return XQ_OK;
  });
}

// --- writing -------------------------------------------------------------------------------------

namespace {

bool areWritingFlags(xq_writing flags) {
  return (flags & ~XQ_WRITE_INDENTED) == 0;
}

template <class Write>
void writeNode(const NSXMLNode& node, xq_writing flags, const Write& write) {
  if (flags & XQ_WRITE_INDENTED) {
    XQueryWriteIndentedXML(node, write);
  } else {
    node.writeXML(write);
  }
}

}  // namespace

xq_status xq_node_xml(const xq_node* node, xq_writing flags, xq_text* xml) {
  if (!emptied(xml) || !areGood(node) || !areWritingFlags(flags)) return XQ_USAGE;
  return guarded([&] {
    std::string text;
    writeNode(*node->node, flags, [&](std::string_view piece) {
      text.append(piece);
      return true;
    });
    return fill(*xml, text);
  });
}

xq_status xq_node_write(const xq_node* node, xq_writing flags, xq_write write, void* data) {
  if (!areGood(node) || !areWritingFlags(flags) || !write) return XQ_USAGE;
  return guarded([&] {
    const Ref<NSXMLNode> kept = node->node;  // the callback may move or free the handle
    bool hasFailed = false;
    writeNode(*kept, flags, [&](std::string_view piece) {
      hasFailed = hasFailed || write(data, piece.data(), piece.size()) != 0;
      return !hasFailed;
    });
    return hasFailed ? XQ_HOST : XQ_OK;
  });
}

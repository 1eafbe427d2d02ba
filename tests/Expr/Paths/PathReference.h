// Plain walks along the axes and generated trees, for the tests that compare the engine's ways with
// simpler ones.
#pragma once

#include "Expr/XQuerySequence.h"
#include "PathTesting.h"
#include "Types/XQueryNumber.h"

#include <random>
#include <set>

namespace xquery {

using NodeList = std::vector<NSXMLNode*>;

// The node after `node` in document order, found by looking at positions in lists of children.
inline NSXMLNode* plainNextNode(NSXMLNode* node) {
  if (node->kind() == Kind::Attribute || node->kind() == Kind::Namespace) return nullptr;
  if (node->childCount() > 0) return node->childAtIndex(0);
  for (; node->parent(); node = node->parent()) {
    const auto place = static_cast<uint32_t>(node->index());
    if (NSXMLNode* sibling = node->parent()->childAtIndex(place + 1)) return sibling;
  }
  return nullptr;
}

inline NSXMLNode* plainSibling(NSXMLNode* node, int64_t distance) {
  const bool isChild = node->kind() != Kind::Attribute && node->kind() != Kind::Namespace;
  if (!isChild || !node->parent()) return nullptr;
  const int64_t place = node->index() + distance;
  return place < 0 ? nullptr : node->parent()->childAtIndex(static_cast<uint32_t>(place));
}

inline NodeList plainDescendants(NSXMLNode* node) {
  NSXMLNode* stop = plainSibling(node, 1);
  if (!stop && node->parent()) stop = plainSibling(node->parent(), 1);
  NodeList found;
  for (NSXMLNode* at = plainNextNode(node); at && at != stop; at = plainNextNode(at)) {
    found.push_back(at);
  }
  return found;
}

inline NodeList plainSiblings(NSXMLNode* node, int64_t direction) {
  NodeList found;
  while ((node = plainSibling(node, direction))) found.push_back(node);
  return found;
}

inline NodeList plainAncestors(NSXMLNode* node) {
  NodeList found;
  while ((node = node->parent())) found.push_back(node);
  return found;
}

inline NodeList plainFollowing(NSXMLNode* node) {
  while (node && !plainSibling(node, 1)) node = node->parent();
  NodeList found;
  for (NSXMLNode* at = node ? plainSibling(node, 1) : nullptr; at; at = plainNextNode(at)) {
    found.push_back(at);
  }
  return found;
}

inline NodeList plainPreceding(NSXMLNode* node) {
  const NodeList above = plainAncestors(node);
  if (above.empty()) return {};
  const std::set<NSXMLNode*> ancestors(above.begin(), above.end());
  const bool isChild = node->kind() != Kind::Attribute && node->kind() != Kind::Namespace;
  const NSXMLNode* end = isChild ? node : node->parent();
  NodeList found;
  for (NSXMLNode* at = above.back(); at && at != end; at = plainNextNode(at)) {
    if (!ancestors.count(at)) found.push_back(at);
  }
  return found;
}

inline NodeList plainAttributes(NSXMLNode* node) {
  NodeList found;
  const auto* element = dyn_cast<NSXMLElement>(node);
  if (!element) return found;
  for (auto* at = element->firstAttribute(); at; at = NSXMLElement::nextAttribute(at)) {
    found.push_back(at);
  }
  return found;
}

inline NodeList plainChildren(NSXMLNode* node) {
  NodeList found;
  for (uint32_t i = 0; i < node->childCount(); ++i) found.push_back(node->childAtIndex(i));
  return found;
}

inline NodeList plainAxis(NSXMLNode* node, int axis) {
  const auto selfAnd = [node](NodeList others) {
    others.insert(others.begin(), node);
    return others;
  };
  switch (axis) {
    case 1:
      return plainChildren(node);
    case 2:
      return plainDescendants(node);
    case 3:
      return selfAnd(plainDescendants(node));
    case 4:
      return plainAttributes(node);
    case 5:
      return {node};
    case 6:
      return plainSiblings(node, 1);
    case 7:
      return plainFollowing(node);
    case 8:
      return plainAncestors(node);
    case 9:
      return node->parent() ? NodeList{node->parent()} : NodeList{};
    case 10:
      return plainPreceding(node);
    case 11:
      return plainSiblings(node, -1);
    default:
      return selfAnd(plainAncestors(node));
  }
}

// A step as it was generated, beside the engine's own.
struct PlainStep {
  int axis;
  Ref<XQueryExpr> test;
  Predicates predicates;
};

// --- generators ----------------------------------------------------------------------------------

class PathGenerator {
 public:
  explicit PathGenerator(unsigned seed) : _random(seed) {}

  int below(int bound) { return std::uniform_int_distribution<int>(0, bound - 1)(_random); }
  bool oneIn(int count) { return below(count) == 0; }

  // An element with attributes, namespaces and content to the given depth.
  std::string element(int depth) {
    const std::string tag = elementName();
    std::string xml = "<" + tag;
    if (oneIn(6)) xml += " xmlns:q='urn:q'";
    for (const char* attribute : {"a", "b", "p:a"}) {
      if (oneIn(3)) xml += std::string(" ") + attribute + "='" + std::to_string(below(5)) + "'";
    }
    xml += ">";
    const int children = depth == 0 ? 0 : below(5);
    for (int i = 0; i < children; ++i) {
      const int choice = below(8);
      xml += choice == 0   ? "<!--c-->"
             : choice == 1 ? "<?a t?>"
             : choice == 2 ? "text"
                           : element(depth - 1);
    }
    return xml + "</" + tag + ">";
  }
  Ref<NSXMLDocument> document() {
    std::string body = element(5);
    body.insert(body.find_first_of(" >"), " xmlns:p='urn:p'");
    return parsed("<?a before?>" + body + "<!--after-->");
  }

  // Detaches subtrees and hangs them elsewhere, or leaves them detached.
  void change(const Ref<NSXMLDocument>& document, std::vector<Value>& detached) {
    for (int changes = below(5); changes > 0; --changes) {
      NodeList nodes = allNodes(document.get());
      const Ref<NSXMLNode> moved =
          nodes[static_cast<size_t>(below(static_cast<int>(nodes.size())))];
      if (!moved->parent() || moved == document->rootElement()) continue;
      moved->detach();
      nodes = allNodes(document.get());
      auto* target =
          dyn_cast<NSXMLElement>(nodes[static_cast<size_t>(below(static_cast<int>(nodes.size())))]);
      if (target && !oneIn(4)) {
        const bool isAttribute = moved->kind() == Kind::Attribute;
        const bool added = isAttribute
                               ? target->addAttribute(moved)
                               : target->insertChild(moved, static_cast<uint32_t>(below(4)));
        if (added) continue;
      }
      detached.push_back(moved);
    }
  }

  // Attributes and all that a walk finds.
  static NodeList allNodes(NSXMLNode* root) {
    NodeList nodes;
    for (NSXMLNode* node = root; node; node = plainNextNode(node)) {
      nodes.push_back(node);
      for (NSXMLNode* attribute : plainAttributes(node)) nodes.push_back(attribute);
    }
    return nodes;
  }

  Ref<XQueryExpr> test() {
    switch (below(16)) {
      case 0:
      case 12:
      case 13:
        return anyName();
      case 1:
        return XQueryWildCardNameTest::nameTest(nullptr, text("a"));
      case 2:
        return XQueryWildCardNameTest::nameTest(text("p"), nullptr);
      case 3:
        return XQueryTypeDeclaration::element(oneIn(2) ? nullptr : Value(name("a")));
      case 4:
        return XQueryTypeDeclaration::text();
      case 5:
        return XQueryTypeDeclaration::attribute(nullptr);
      case 6:
        return XQueryTypeDeclaration::pi(oneIn(2) ? nullptr : text("a"));
      case 7:
      case 8:
      case 14:
        return anyNode();
      default:
        return name(elementName());
    }
  }

  Ref<XQueryExpr> predicate() {
    switch (below(6)) {
      case 0:
      case 1:
        return integer(std::to_string(below(4)));
      case 2:
        return probe([](XQueryContext& c) -> Value {
          return XQueryNumber::integerWithInt64(_internal(c).last());
        });
      case 3:  // fails for every third position
        return probe([](XQueryContext& c) -> Value {
          if (_internal(c).position() % 3 == 0) {
            _internal(c).raise(XQueryError::error(6, "invalid type"));
          }
          return NSNumber::trueValue();
        });
      case 4:
        return probe([](XQueryContext& c) -> Value {
          return NSNumber::numberWithBool(_internal(c).position() != _internal(c).last());
        });
      default:  // looks at the tree through a path of its own
        return path({step(XQueryAxisChild, anyNode())});
    }
  }

  std::vector<PlainStep> steps() {
    std::vector<PlainStep> result;
    for (int count = 1 + below(3); count > 0; --count) {
      if (oneIn(2)) result.push_back({XQueryAxisDescendantOrSelf, anyNode(), {}});
      PlainStep next{oneIn(2) ? 1 : 1 + below(12), test(), {}};
      while (oneIn(3)) next.predicates.push_back(predicate());
      result.push_back(next);
    }
    return result;
  }

 private:
  std::string elementName() {
    static constexpr const char* names[] = {"a", "a", "a", "b", "b", "p:a"};
    return names[below(6)];
  }

  std::mt19937 _random;
};

inline std::string shownList(const NodeList& nodes) {
  std::string result;
  for (const NSXMLNode* node : nodes) {
    char address[32];
    snprintf(address, sizeof address, "#%zx", reinterpret_cast<uintptr_t>(node) / 8 % 0xFFFFF);
    result += shown(node) + address + " ";
  }
  return result;
}

inline NodeList nodesOf(const Value& value) {
  NodeList nodes;
  const XQueryItemList items(value.get());
  for (size_t i = 0; i < items.count(); ++i) nodes.push_back(cast<NSXMLNode>(items[i]));
  return nodes;
}

}  // namespace xquery

// Generated paths over generated, changed trees: the engine's ways against plain ones.
//
// The engine streams nodes as raw pointers, keeps no set while nodes arrive in order, compares
// order numbers, ends walks early and replaces "//" by a descendant walk. The reference below does
// none of that: it evaluates a path step by step over complete lists, collects through a set,
// decides order by climbing, and leaves every focus as the rules have it.
#include "Expr/NodeOrder.h"
#include "Expr/XQueryPathResults.h"
#include "Expr/XQuerySequence.h"
#include "PathTesting.h"
#include "Types/XQueryAtomization.h"
#include "Types/XQueryNumber.h"

#include <algorithm>
#include <random>
#include <set>

namespace xquery {
namespace {

using NodeList = std::vector<NSXMLNode*>;

// --- the reference: axes -------------------------------------------------------------------------

// The node after `node` in document order, found by looking at positions in lists of children.
NSXMLNode* plainNextNode(NSXMLNode* node) {
  if (node->kind() == Kind::Attribute || node->kind() == Kind::Namespace) return nullptr;
  if (node->childCount() > 0) return node->childAtIndex(0);
  for (; node->parent(); node = node->parent()) {
    const auto place = static_cast<uint32_t>(node->index());
    if (NSXMLNode* sibling = node->parent()->childAtIndex(place + 1)) return sibling;
  }
  return nullptr;
}

NSXMLNode* plainSibling(NSXMLNode* node, int64_t distance) {
  const bool isChild = node->kind() != Kind::Attribute && node->kind() != Kind::Namespace;
  if (!isChild || !node->parent()) return nullptr;
  const int64_t place = node->index() + distance;
  return place < 0 ? nullptr : node->parent()->childAtIndex(static_cast<uint32_t>(place));
}

NodeList plainDescendants(NSXMLNode* node) {
  NSXMLNode* stop = plainSibling(node, 1);
  if (!stop && node->parent()) stop = plainSibling(node->parent(), 1);
  NodeList found;
  for (NSXMLNode* at = plainNextNode(node); at && at != stop; at = plainNextNode(at)) {
    found.push_back(at);
  }
  return found;
}

NodeList plainSiblings(NSXMLNode* node, int64_t direction) {
  NodeList found;
  while ((node = plainSibling(node, direction))) found.push_back(node);
  return found;
}

NodeList plainAncestors(NSXMLNode* node) {
  NodeList found;
  while ((node = node->parent())) found.push_back(node);
  return found;
}

NodeList plainFollowing(NSXMLNode* node) {
  while (node && !plainSibling(node, 1)) node = node->parent();
  NodeList found;
  for (NSXMLNode* at = node ? plainSibling(node, 1) : nullptr; at; at = plainNextNode(at)) {
    found.push_back(at);
  }
  return found;
}

NodeList plainPreceding(NSXMLNode* node) {
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

NodeList plainAttributes(NSXMLNode* node) {
  NodeList found;
  const auto* element = dyn_cast<NSXMLElement>(node);
  if (!element) return found;
  for (auto* at = element->firstAttribute(); at; at = NSXMLElement::nextAttribute(at)) {
    found.push_back(at);
  }
  return found;
}

NodeList plainChildren(NSXMLNode* node) {
  NodeList found;
  for (uint32_t i = 0; i < node->childCount(); ++i) found.push_back(node->childAtIndex(i));
  return found;
}

NodeList plainAxis(NSXMLNode* node, int axis) {
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

// --- the reference: results ----------------------------------------------------------------------

class PlainResults {
 public:
  bool isReversed = false;
  void add(NSXMLNode* node) {
    if (_unique.insert(node).second) _nodes.push_back(node);
  }
  // Nodes of one tree only: there the climbing comparison is a total order.
  NodeList value(bool ordered) const {
    NodeList nodes = _nodes;
    if (ordered) {
      std::stable_sort(nodes.begin(), nodes.end(), [this](NSXMLNode* a, NSXMLNode* b) {
        return isReversed ? XQueryNodeAfterByClimbing(a, b) : XQueryNodeBeforeByClimbing(a, b);
      });
    }
    return nodes;
  }

 private:
  NodeList _nodes;
  std::set<NSXMLNode*> _unique;
};

// --- the reference: paths ------------------------------------------------------------------------

// A step as it was generated, beside the engine's own.
struct PlainStep {
  int axis;
  Ref<XQueryExpr> test;
  Predicates predicates;
};

class PlainPath {
 public:
  PlainPath(const std::vector<PlainStep>& steps, XQueryContext& context)
      : _steps(steps), _context(context) {}

  NodeList evaluate(const NodeList& items, bool ordered) {
    PlainResults results;
    process(0, items, results);
    return results.value(ordered);
  }

 private:
  void process(size_t index, const NodeList& items, PlainResults& results) {
    const PlainStep& step = _steps[index];
    const bool isReverse = step.axis >= 8;
    const bool isLast = index + 1 == _steps.size();
    for (NSXMLNode* item : items) {
      _context._internal().setContextItem(item, 0);
      if (step.predicates.empty()) {
        for (NSXMLNode* node : plainAxis(item, step.axis)) {
          if (!XQueryAxisStep::isValid(node, step.test.get(), _context)) continue;
          if (isLast) {
            results.add(node);
          } else {
            process(index + 1, {node}, results);
          }
        }
        if (isLast) results.isReversed = isReverse;
        continue;
      }
      PlainResults own;
      own.isReversed = isReverse;
      for (NSXMLNode* node : plainAxis(item, step.axis)) {
        if (XQueryAxisStep::isValid(node, step.test.get(), _context)) own.add(node);
      }
      NodeList kept = own.value(true);
      for (const auto& predicate : step.predicates) kept = filtered(kept, *predicate);
      if (isLast) {
        for (NSXMLNode* node : kept) results.add(node);
      } else {
        process(index + 1, kept, results);
      }
    }
  }

  NodeList filtered(const NodeList& nodes, const XQueryExpr& predicate) {
    NodeList kept;
    if (const auto* literal = dyn_cast<XQueryLiteral>(&predicate)) {
      const uint64_t n = cast<NSNumber>(literal->literalValue())->unsignedIntegerValue();
      if (n >= 1 && n <= nodes.size()) kept.push_back(nodes[n - 1]);
      return kept;
    }
    auto& focus = _context._internal();
    focus.setLast(static_cast<int64_t>(nodes.size()));
    for (size_t p = 1; p <= nodes.size(); ++p) {
      focus.setContextItem(nodes[p - 1], static_cast<int64_t>(p));
      try {
        const Value result = predicate.evaluateWithContext(_context);
        const auto* number = dyn_cast<NSNumber>(result);
        const bool keep =
            number && !number->isBoolean()
                ? number->compare(*XQueryNumber::zero()) > 0 && number->unsignedIntegerValue() == p
                : XQueryIsTrue(XQueryEffectiveBooleanValue(result, _context));
        if (keep) kept.push_back(nodes[p - 1]);
      } catch (const NSException&) {
        focus.setError(nullptr, false);
      }
    }
    return kept;
  }

  const std::vector<PlainStep>& _steps;
  XQueryContext& _context;
};

// --- generators ----------------------------------------------------------------------------------

class Generator {
 public:
  explicit Generator(unsigned seed) : _random(seed) {}

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
          return XQueryNumber::integerWithInt64(c._internal().last());
        });
      case 3:  // fails for every third position
        return probe([](XQueryContext& c) -> Value {
          if (c._internal().position() % 3 == 0) {
            c._internal().raise(XQueryError::error(6, "invalid type"));
          }
          return NSNumber::trueValue();
        });
      case 4:
        return probe([](XQueryContext& c) -> Value {
          return NSNumber::numberWithBool(c._internal().position() != c._internal().last());
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

std::string shownList(const NodeList& nodes) {
  std::string result;
  for (const NSXMLNode* node : nodes) {
    char address[32];
    snprintf(address, sizeof address, "#%zx", reinterpret_cast<uintptr_t>(node) / 8 % 0xFFFFF);
    result += shown(node) + address + " ";
  }
  return result;
}

NodeList nodesOf(const Value& value) {
  NodeList nodes;
  const XQueryItemList items(value.get());
  for (size_t i = 0; i < items.count(); ++i) nodes.push_back(cast<NSXMLNode>(items[i]));
  return nodes;
}

class PathProperty : public PathTesting {
 protected:
  void SetUp() override {
    prolog->addPrefix(text("p"), text("urn:p"));
    prolog->addPrefix(text("q"), text("urn:q"));
  }
  std::string focus() {
    const auto& dynamic = context->_internal();
    return shownList(nodesOf(dynamic.contextItem())) + std::to_string(dynamic.position()) + "/" +
           std::to_string(dynamic.last());
  }
};

TEST_F(PathProperty, OrderNumbersAgreeWithClimbing) {
  for (unsigned seed = 0; seed < 40; ++seed) {
    Generator generate(seed);
    const auto document = generate.document();
    const auto other = generate.document();
    std::vector<Value> detached;
    for (int round = 0; round < 3; ++round) {
      NodeList nodes = Generator::allNodes(document.get());
      for (const Value& root : detached) {
        for (NSXMLNode* node : Generator::allNodes(cast<NSXMLNode>(root))) nodes.push_back(node);
      }
      nodes.push_back(other.get());
      nodes.push_back(other->rootElement());
      for (int pair = 0; pair < 2000; ++pair) {
        const auto* a = nodes[static_cast<size_t>(generate.below(static_cast<int>(nodes.size())))];
        const auto* b = nodes[static_cast<size_t>(generate.below(static_cast<int>(nodes.size())))];
        ASSERT_EQ(XQueryNodeBefore(a, b), XQueryNodeBeforeByClimbing(a, b))
            << shown(a) << " " << shown(b) << " seed " << seed;
        ASSERT_EQ(XQueryNodeAfter(a, b), XQueryNodeAfterByClimbing(a, b))
            << shown(a) << " " << shown(b) << " seed " << seed;
      }
      generate.change(document, detached);
    }
  }
}

TEST_F(PathProperty, SortingByNumbersAgreesWithSortingByClimbing) {
  for (unsigned seed = 0; seed < 60; ++seed) {
    Generator generate(seed);
    const auto document = generate.document();
    std::vector<Value> detached;
    generate.change(document, detached);
    NodeList expected = Generator::allNodes(document.get());
    std::vector<Value> nodes(expected.begin(), expected.end());
    for (size_t i = 0; i < nodes.size(); ++i) {
      std::swap(nodes[i], nodes[static_cast<size_t>(generate.below(static_cast<int>(i + 1)))]);
    }
    XQuerySortNodesForward(nodes);
    EXPECT_EQ(shownList(nodesOf(array(nodes))), shownList(expected)) << seed;
    XQuerySortNodesReverse(nodes);
    std::reverse(expected.begin(), expected.end());
    EXPECT_EQ(shownList(nodesOf(array(nodes))), shownList(expected)) << seed;
  }
}

TEST_F(PathProperty, CollectingAgreesWithCollectingThroughASet) {
  for (unsigned seed = 0; seed < 400; ++seed) {
    Generator generate(seed);
    const auto document = generate.document();
    std::vector<Value> detached;
    if (generate.oneIn(2)) generate.change(document, detached);
    const NodeList nodes = Generator::allNodes(document.get());
    XQueryPathResults results;
    PlainResults expected;
    // Runs up or down the document, so that every kind of arrival comes up.
    const int count = static_cast<int>(nodes.size());
    for (int runs = 1 + generate.below(4); runs > 0; --runs) {
      int at = generate.below(count);
      const int stride = generate.below(7) - 3;
      for (int length = generate.below(30); length > 0 && at >= 0 && at < count; --length) {
        results.addNode(nodes[static_cast<size_t>(at)], *context);
        expected.add(nodes[static_cast<size_t>(at)]);
        at += stride;
      }
    }
    EXPECT_EQ(shownList(nodesOf(results.value(false))), shownList(expected.value(false))) << seed;
    expected.isReversed = generate.oneIn(2);
    results.setIsReversed(expected.isReversed);
    EXPECT_EQ(shownList(nodesOf(results.value(true))), shownList(expected.value(true))) << seed;
  }
}

TEST_F(PathProperty, StreamedAndFusedStepsAgreeWithCompleteLists) {
  int answersWithNodes = 0;
  for (unsigned seed = 0; seed < 3000; ++seed) {
    Generator generate(seed);
    const auto document = generate.document();
    std::vector<Value> detached;
    if (generate.oneIn(3)) generate.change(document, detached);
    NSXMLNode* top = detached.empty() ? document.get() : cast<NSXMLNode>(detached[0]);
    const NodeList nodes = Generator::allNodes(top);
    NodeList items = {top};
    while (generate.oneIn(2)) {
      items.push_back(nodes[static_cast<size_t>(generate.below(static_cast<int>(nodes.size())))]);
    }
    const bool ordered = !generate.oneIn(4);
    const auto plain = generate.steps();
    Steps steps = {filterStep(always(array({items.begin(), items.end()})))};
    for (const auto& each : plain) steps.push_back(step(each.axis, each.test, each.predicates));

    context->_internal().setOrdered(ordered);
    focusOn(document, 4);
    context->_internal().setLast(8);
    const std::string before = focus();
    const Value answer = evaluate(steps);
    EXPECT_EQ(focus(), before) << seed;
    const NodeList expected = PlainPath(plain, *context).evaluate(items, ordered);
    ASSERT_EQ(shownList(nodesOf(answer)), shownList(expected)) << seed;
    answersWithNodes += expected.empty() ? 0 : 1;
  }
  EXPECT_GT(answersWithNodes, 700);
}

TEST_F(PathProperty, AnErrorLeavesTheFocusOfTheLongWay) {
  int raised = 0;
  for (unsigned seed = 0; seed < 2000; ++seed) {
    Generator generate(seed);
    const auto document = generate.document();
    NodeList nodes = Generator::allNodes(document.get());
    auto plain = generate.steps();
    // A prefix that nobody declares: the first element or attribute it meets raises.
    plain.push_back({1 + generate.below(12), name("nobody:a"), {}});
    if (generate.oneIn(3)) plain.push_back({XQueryAxisChild, anyNode(), {}});
    Steps steps;
    for (const auto& each : plain) steps.push_back(step(each.axis, each.test, each.predicates));
    NSXMLNode* start = nodes[static_cast<size_t>(generate.below(static_cast<int>(nodes.size())))];

    focusOn(start);
    context->_internal().setLast(1);
    const std::string error = errorOf([&] { evaluate(steps); });
    const std::string left = focus();
    focusOn(start);
    context->_internal().setLast(1);
    const std::string expectedError =
        errorOf([&] { PlainPath(plain, *context).evaluate({start}, true); });
    ASSERT_EQ(error, expectedError) << seed;
    if (error.empty()) continue;
    ++raised;
    ASSERT_EQ(left, focus()) << seed;
  }
  EXPECT_GT(raised, 100);
}

}  // namespace
}  // namespace xquery

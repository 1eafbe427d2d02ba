// Generated paths over generated, changed trees: the engine's ways against plain ones.
//
// The engine streams nodes as raw pointers, keeps no set while nodes arrive in order and compares
// order numbers; planned, it also ends walks early and replaces "//" by a descendant walk. The
// reference below does none of that: it evaluates a path step by step over complete lists, collects
// through a set, decides order by climbing, and leaves every focus as the rules have it.
#include "Expr/Paths/NodeOrder.h"
#include "Expr/Paths/XQueryPathResults.h"
#include "Expr/XQuerySequence.h"
#include "PathReference.h"
#include "Plan/Plan.h"
#include "Types/XQueryAtomization.h"
#include "Types/XQueryNumber.h"
#include "xquery/Exception.h"

#include <algorithm>
#include <random>
#include <set>

namespace xquery {
namespace {

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
      _internal(_context).setContextItem(item, 0);
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
    auto& focus = _internal(_context);
    focus.setLast(static_cast<int64_t>(nodes.size()));
    for (size_t p = 1; p <= nodes.size(); ++p) {
      focus.setContextItem(nodes[p - 1], static_cast<int64_t>(p));
      try {
        const Value result = evaluatedOrThrown(predicate, _context);
        const auto* number = dyn_cast<NSNumber>(result);
        const bool keep =
            number && !number->isBoolean()
                ? number->compare(*XQueryNumber::zero()) > 0 && number->unsignedIntegerValue() == p
                : XQueryIsTrue(XQueryEffectiveBooleanValue(result, _context));
        if (keep) kept.push_back(nodes[p - 1]);
      } catch (const NSException&) {
        focus.setError(nullptr, false);
        focus.setContextItem(nodes[p - 1], static_cast<int64_t>(p));
        focus.setLast(static_cast<int64_t>(nodes.size()));
      }
    }
    return kept;
  }

  const std::vector<PlainStep>& _steps;
  XQueryContext& _context;
};

class PathProperty : public PathTesting {
 protected:
  void SetUp() override {
    prolog->addPrefix(text("p"), text("urn:p"));
    prolog->addPrefix(text("q"), text("urn:q"));
  }
  std::string focus() {
    const auto& dynamic = _internal(*context);
    return shownList(nodesOf(dynamic.contextItem())) + std::to_string(dynamic.position()) + "/" +
           std::to_string(dynamic.last());
  }
};

TEST_F(PathProperty, OrderNumbersAgreeWithClimbing) {
  for (unsigned seed = 0; seed < 40; ++seed) {
    PathGenerator generate(seed);
    const auto document = generate.document();
    const auto other = generate.document();
    std::vector<Value> detached;
    for (int round = 0; round < 3; ++round) {
      NodeList nodes = PathGenerator::allNodes(document.get());
      for (const Value& root : detached) {
        for (NSXMLNode* node : PathGenerator::allNodes(cast<NSXMLNode>(root)))
          nodes.push_back(node);
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
    PathGenerator generate(seed);
    const auto document = generate.document();
    std::vector<Value> detached;
    generate.change(document, detached);
    NodeList expected = PathGenerator::allNodes(document.get());
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
    PathGenerator generate(seed);
    const auto document = generate.document();
    std::vector<Value> detached;
    if (generate.oneIn(2)) generate.change(document, detached);
    const NodeList nodes = PathGenerator::allNodes(document.get());
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

TEST_F(PathProperty, BothWaysAgreeWithCompleteLists) {
  int answersWithNodes = 0;
  for (unsigned seed = 0; seed < 3000; ++seed) {
    PathGenerator generate(seed);
    const auto document = generate.document();
    std::vector<Value> detached;
    if (generate.oneIn(3)) generate.change(document, detached);
    NSXMLNode* top = detached.empty() ? document.get() : cast<NSXMLNode>(detached[0]);
    const NodeList nodes = PathGenerator::allNodes(top);
    NodeList items = {top};
    while (generate.oneIn(2)) {
      items.push_back(nodes[static_cast<size_t>(generate.below(static_cast<int>(nodes.size())))]);
    }
    const bool ordered = !generate.oneIn(4);
    const auto plain = generate.steps();
    Steps steps = {filterStep(always(array({items.begin(), items.end()})))};
    for (const auto& each : plain) steps.push_back(step(each.axis, each.test, each.predicates));

    _internal(*context).setOrdered(ordered);
    const auto expr = path(steps);
    expr->bindInfoForProlog(*prolog);
    const NodeList expected = PlainPath(plain, *context).evaluate(items, ordered);
    for (const bool isPlanned : {false, true}) {
      const Ref<XQueryExpr> way = isPlanned ? XQueryPlanned(*prolog, expr) : expr;
      focusOn(document, 4);
      _internal(*context).setLast(8);
      const std::string before = focus();
      const Value answer = evaluatedOrThrown(*way, *context);
      EXPECT_EQ(focus(), before) << seed;
      ASSERT_EQ(shownList(nodesOf(answer)), shownList(expected)) << seed << " " << isPlanned;
    }
    answersWithNodes += expected.empty() ? 0 : 1;
  }
  EXPECT_GT(answersWithNodes, 700);
}

TEST_F(PathProperty, AnErrorLeavesTheFocusOfTheLongWay) {
  int raised = 0;
  for (unsigned seed = 0; seed < 2000; ++seed) {
    PathGenerator generate(seed);
    const auto document = generate.document();
    NodeList nodes = PathGenerator::allNodes(document.get());
    auto plain = generate.steps();
    // A prefix that nobody declares: the first element or attribute it meets raises.
    plain.push_back({1 + generate.below(12), name("nobody:a"), {}});
    if (generate.oneIn(3)) plain.push_back({XQueryAxisChild, anyNode(), {}});
    Steps steps;
    for (const auto& each : plain) steps.push_back(step(each.axis, each.test, each.predicates));
    NSXMLNode* start = nodes[static_cast<size_t>(generate.below(static_cast<int>(nodes.size())))];

    const auto expr = path(steps);
    expr->bindInfoForProlog(*prolog);
    focusOn(start);
    _internal(*context).setLast(1);
    const std::string expectedError =
        errorOf([&] { PlainPath(plain, *context).evaluate({start}, true); });
    const std::string expectedFocus = focus();
    raised += expectedError.empty() ? 0 : 1;
    for (const bool isPlanned : {false, true}) {
      const Ref<XQueryExpr> way = isPlanned ? XQueryPlanned(*prolog, expr) : expr;
      focusOn(start);
      _internal(*context).setLast(1);
      const std::string error = errorOf([&] { evaluatedOrThrown(*way, *context); });
      ASSERT_EQ(error, expectedError) << seed;
      ASSERT_TRUE(error.empty() || focus() == expectedFocus) << seed << " " << isPlanned;
    }
  }
  EXPECT_GT(raised, 100);
}

}  // namespace
}  // namespace xquery

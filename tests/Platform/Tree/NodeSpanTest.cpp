// Rows of nodes by their places are read as rows of pointers are.
#include "Platform/Base/WorkMeter.h"
#include "Platform/Tree/NodeSpan.h"
#include "Platform/Tree/TreeHead.h"
#include "Platform/Tree/XMLTestSupport.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <vector>

namespace xquery {
namespace {

class NodeSpan : public testing::Test {
 protected:
  NodeSpan() {
    for (const NSXMLNode* node = document.get(); node; node = node->nextNode()) {
      nodes.push_back(node);
      list.push_back(node);
    }
  }
  using Nodes = std::vector<const NSXMLNode*>;

  const Ref<NSXMLDocument> document = parsed("<r><a/>text<b>more<c/></b><!--end--></r>");
  Nodes nodes;
  NSXMLNodeList list;
};

TEST_F(NodeSpan, AnswersTheNodesThatWereAdded) {
  const NSXMLNodeSpan span = list.span();
  EXPECT_EQ(Nodes(span.begin(), span.end()), nodes);
  ASSERT_EQ(span.size(), nodes.size());
  for (size_t i = 0; i < nodes.size(); ++i) EXPECT_EQ(span[i], nodes[i]);
  EXPECT_EQ(span.front(), nodes.front());
  EXPECT_FALSE(span.empty());
}

TEST_F(NodeSpan, HasParts) {
  const auto listed = [](NSXMLNodeSpan span) { return Nodes(span.begin(), span.end()); };
  const NSXMLNodeSpan span = list.span();
  EXPECT_EQ(listed(span.first(2)), Nodes(nodes.begin(), nodes.begin() + 2));
  EXPECT_EQ(listed(span.subspan(2)), Nodes(nodes.begin() + 2, nodes.end()));
  EXPECT_EQ(listed(span.subspan(1, 3)), Nodes(nodes.begin() + 1, nodes.begin() + 4));
  EXPECT_TRUE(span.subspan(nodes.size()).empty());
  EXPECT_TRUE(NSXMLNodeSpan().empty());
  EXPECT_TRUE(listed(NSXMLNodeList().span()).empty());
}

TEST_F(NodeSpan, CanBeSearched) {
  const NSXMLNodeSpan span = list.span();
  for (size_t i = 0; i < nodes.size(); ++i) {
    const auto found = std::lower_bound(span.begin(), span.end(), NSXMLNodeOrder::number(*nodes[i]),
                                        [](const NSXMLNode* node, uint32_t number) {
                                          return NSXMLNodeOrder::number(*node) < number;
                                        });
    EXPECT_EQ(found - span.begin(), static_cast<ptrdiff_t>(i));
    EXPECT_EQ(span.begin()[static_cast<ptrdiff_t>(i)], nodes[i]);
  }
}

TEST_F(NodeSpan, OfANodeTakesFourBytes) {
  constexpr size_t count = 10'000;
  NSXMLNodeList many;
  const int64_t before = workMeter.valueBytes;
  many.reserve(count);
  for (size_t i = 0; i < count; ++i) many.push_back(nodes[i % nodes.size()]);
  EXPECT_LE(workMeter.valueBytes - before, static_cast<int64_t>(count * 4 + 64));
}

TEST_F(NodeSpan, ListsAreArrangedAndLeaveNodesOut) {
  NSXMLNodeList turned;
  turned.arrange(list, [&](size_t i) { return nodes.size() - 1 - i; });
  NSXMLNodeSpan span = turned.span();
  EXPECT_EQ(Nodes(span.begin(), span.end()), Nodes(nodes.rbegin(), nodes.rend()));
  turned.keepThose([](const NSXMLNode& node) { return node.kind() == Kind::Element; });
  Nodes elements(nodes.rbegin(), nodes.rend());
  std::erase_if(elements, [](const NSXMLNode* node) { return node->kind() != Kind::Element; });
  span = turned.span();
  EXPECT_EQ(Nodes(span.begin(), span.end()), elements);
}

}  // namespace
}  // namespace xquery

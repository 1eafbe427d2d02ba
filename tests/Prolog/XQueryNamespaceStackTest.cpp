#include "Prolog/XQueryNamespaceStack.h"

#include <gtest/gtest.h>

#include <random>
#include <string>

namespace xquery {
namespace {

Ref<NSXMLNode> declaration(const std::string& prefix, const std::string& URI) {
  return NSXMLNode::namespaceWithName(NSStringView::ascii(prefix), NSStringView::ascii(URI));
}

TEST(NamespaceStack, OfAnEntryTheFirstIsFound) {
  XQueryNamespaceStack stack;
  const auto first = declaration("p", "urn:1");
  const auto second = declaration("p", "urn:2");
  stack.push({first, second});
  EXPECT_EQ(stack.forPrefix(NSStringView::ascii("p")), first.get());
  EXPECT_EQ(stack.forURI(NSStringView::ascii("urn:2")), second.get());
  EXPECT_EQ(stack.forPrefix(NSStringView::ascii("q")), nullptr);
  stack.pop();
  stack.pop();
  EXPECT_EQ(stack.forPrefix(NSStringView::ascii("p")), nullptr);
}

// Against a search from the innermost entry outwards, at depths with and without the table.
TEST(NamespaceStack, FindsWhatASearchFinds) {
  std::mt19937 random(7);
  std::vector<XQueryNamespaceStack::Entry> plain;
  XQueryNamespaceStack stack;
  for (int turn = 0; turn < 20000; ++turn) {
    const bool grows = random() % 400 < 200 + (turn / 1000 % 2 ? 10U : 0U);
    if (grows) {
      XQueryNamespaceStack::Entry entry;
      for (uint32_t count = random() % 3; count > 0; --count) {
        entry.push_back(declaration("p" + std::to_string(random() % 40), std::to_string(turn)));
      }
      plain.push_back(entry);
      stack.push(entry);
    } else {
      if (!plain.empty()) plain.pop_back();
      stack.pop();
    }
    if (random() % 3 > 0) continue;
    const std::string prefix = "p" + std::to_string(random() % 40);
    const NSXMLNode* expected = nullptr;
    for (auto entry = plain.rbegin(); !expected && entry != plain.rend(); ++entry) {
      for (const auto& node : *entry) {
        if (!expected && node->nameView() == prefix) expected = node.get();
      }
    }
    ASSERT_EQ(stack.forPrefix(NSStringView::ascii(prefix)), expected) << turn;
  }
}

}  // namespace
}  // namespace xquery

#include "Platform/Base/Counting.h"
#include "Platform/Tree/Arena.h"

#include <gtest/gtest.h>

#include <string>
#include <thread>
#include <vector>

namespace xquery {
namespace {

Ref<NSXMLElement> element(std::string_view name) {
  return NSXMLElement::elementWithName(NSStringView::ascii(name));
}
Ref<NSString> URI(std::string_view text) {
  return NSString::stringWithASCII(text);
}
std::string recorded(const NSXMLNode* node, uint64_t owner) {
  const NSString* found = NSXMLTree::recordedBaseURI(node, owner);
  return found ? found->utf8() : "(none)";
}

TEST(XMLBaseURIs, EachOwnerHasItsOwn) {
  const auto a = element("a");
  EXPECT_TRUE(NSXMLTree::recordBaseURI(a.get(), 1, URI("one")));
  EXPECT_TRUE(NSXMLTree::recordBaseURI(a.get(), 2, URI("two")));
  EXPECT_EQ(recorded(a.get(), 1), "one");
  EXPECT_EQ(recorded(a.get(), 2), "two");
  EXPECT_EQ(recorded(a.get(), 3), "(none)");
}

TEST(XMLBaseURIs, ALaterOneReplacesTheOneBefore) {
  const auto a = element("a");
  EXPECT_TRUE(NSXMLTree::recordBaseURI(a.get(), 1, URI("one")));
  EXPECT_FALSE(NSXMLTree::recordBaseURI(a.get(), 1, URI("another")));
  EXPECT_EQ(recorded(a.get(), 1), "another");
}

TEST(XMLBaseURIs, OtherNodesOfTheTreeHaveNone) {
  const auto document = NSXMLDocument::documentWithData("<a><b/><c/></a>", 0);
  const NSXMLNode* b = document->rootElement()->firstChild();
  NSXMLTree::recordBaseURI(b, 1, URI("one"));
  EXPECT_EQ(recorded(b, 1), "one");
  EXPECT_EQ(recorded(b->parent(), 1), "(none)");
  EXPECT_EQ(recorded(b->nextSibling(), 1), "(none)");
  EXPECT_EQ(recorded(document.get(), 1), "(none)");
}

TEST(XMLBaseURIs, TheyGoWithTheTree) {
  const auto one = URI("a base URI that is too long to be kept within the string itself");
  EXPECT_TRUE(NSCounting::hasOneReference(*one));
  {
    const auto a = element("a");
    NSXMLTree::recordBaseURI(a.get(), 1, one);
    NSXMLTree::recordBaseURI(a.get(), 2, one);
    EXPECT_FALSE(NSCounting::hasOneReference(*one));
    NSXMLTree::recordBaseURI(a.get(), 2, URI("two"));
  }
  EXPECT_TRUE(NSCounting::hasOneReference(*one));
}

TEST(XMLBaseURIs, ANewNodeInThePlaceOfAnOldOneHasNone) {
  for (int round = 0; round < 1000; ++round) {
    NSXMLTree::recordBaseURI(element("a").get(), 1, URI("one"));
    ASSERT_EQ(recorded(element("a").get(), 1), "(none)");
  }
}

TEST(XMLBaseURIs, TheyStayWithTheirNodesWhenTreesAreJoined) {
  constexpr int count = 100;
  const auto one = URI("one");
  {
    const auto root = element("root");
    std::vector<NSXMLNode*> nodes;
    for (int index = 0; index < count; ++index) {
      // Some subtrees are larger than what they are added to, and take it in.
      const auto added = element("a");
      for (int child = 0; child < (index % 10) * index; ++child) added->addChild(element("b"));
      if (index % 3 > 0) NSXMLTree::recordBaseURI(added.get(), 1, URI(std::to_string(index)));
      if (index % 3 > 1)
        NSXMLTree::recordBaseURI(added->firstChild() ? added->firstChild() : added.get(), 2, one);
      root->addChild(added);
      nodes.push_back(added.get());
    }
    for (int index = count - 1; index >= 0; --index) {
      EXPECT_EQ(recorded(nodes[index], 1), index % 3 > 0 ? std::to_string(index) : "(none)");
      const NSXMLNode* holder =
          nodes[index]->firstChild() ? nodes[index]->firstChild() : nodes[index];
      EXPECT_EQ(recorded(holder, 2), index % 3 > 1 ? "one" : "(none)");
    }
  }
  EXPECT_TRUE(NSCounting::hasOneReference(*one));
}

TEST(XMLBaseURIs, ADetachedNodeKeepsItsOwn) {
  const auto a = element("a");
  const auto b = element("b");
  NSXMLTree::recordBaseURI(b.get(), 1, URI("one"));
  a->addChild(b);
  b->detach();
  EXPECT_EQ(recorded(b.get(), 1), "one");
}

TEST(XMLBaseURIs, ACopyHasNone) {
  const auto a = element("a");
  const auto b = element("b");
  NSXMLTree::recordBaseURI(a.get(), 1, URI("one"));
  NSXMLTree::recordBaseURI(b.get(), 1, URI("two"));
  a->addChild(b);
  const auto copy = a->copy();
  EXPECT_EQ(recorded(copy.get(), 1), "(none)");
  EXPECT_EQ(recorded(copy->firstChild(), 1), "(none)");
}

// Each of very many is found at once; with a search from the beginning every time this would take
// minutes.
TEST(XMLBaseURIs, AskingInAnyOrderIsQuick) {
  constexpr int count = 200000;
  const auto root = element("root");
  for (int index = 0; index < count; ++index) {
    const auto child = element("a");
    NSXMLTree::recordBaseURI(child.get(), 1, URI("one"));
    root->addChild(child);
  }
  int found = 0;
  for (const NSXMLNode* node = root->firstChild(); node; node = node->nextSibling()) {
    if (NSXMLTree::recordedBaseURI(node, 1)) ++found;
  }
  for (const NSXMLNode* node = root->lastChild(); node; node = node->previousSibling()) {
    if (NSXMLTree::recordedBaseURI(node, 1)) ++found;
  }
  EXPECT_EQ(found, 2 * count);
}

// As long as all are alike they are not told apart by node, and later they are.
TEST(XMLBaseURIs, OnesThatDifferAreFoundAmongThoseAlike) {
  const auto root = element("root");
  for (int index = 0; index < 20; ++index) {
    const auto child = element("a");
    if (index % 2) NSXMLTree::recordBaseURI(child.get(), 1, URI("one"));
    root->addChild(child);
  }
  NSXMLTree::recordBaseURI(root->firstChild(), 2, URI("one"));
  const auto other = element("b");
  NSXMLTree::recordBaseURI(other.get(), 1, URI("two"));
  root->addChild(other);
  int index = 0;
  for (const NSXMLNode* node = root->firstChild(); node != other.get();
       node = node->nextSibling()) {
    EXPECT_EQ(recorded(node, 1), index % 2 ? "one" : "(none)");
    EXPECT_EQ(recorded(node, 2), index == 0 ? "one" : "(none)");
    ++index;
  }
  EXPECT_EQ(recorded(other.get(), 1), "two");
  EXPECT_FALSE(NSXMLTree::recordBaseURI(root->lastChild(), 1, URI("three")));
  EXPECT_EQ(recorded(other.get(), 1), "three");
  EXPECT_EQ(recorded(other->previousSibling(), 1), "one");
}

TEST(XMLBaseURIs, SeveralThreadsMayAsk) {
  const auto root = element("root");
  for (int index = 0; index < 100; ++index) {
    const auto child = element("a");
    NSXMLTree::recordBaseURI(child.get(), 1, URI(std::to_string(index)));
    root->addChild(child);
  }
  std::vector<std::thread> threads;
  std::vector<int> right(4);
  for (int& count : right) {
    threads.emplace_back([&root, &count] {
      for (int round = 0; round < 20; ++round) {
        int index = 0;
        for (const NSXMLNode* node = root->firstChild(); node; node = node->nextSibling()) {
          if (recorded(node, 1) == std::to_string(index++)) ++count;
        }
      }
    });
  }
  for (std::thread& thread : threads) thread.join();
  EXPECT_EQ(right, std::vector<int>(4, 2000));
}

}  // namespace
}  // namespace xquery

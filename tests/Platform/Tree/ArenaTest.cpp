// The structure of trees, document order, merging. What is computed lazily or by counting is
// checked against a plain walk over generated trees.
#include "Platform/Base/WorkMeter.h"
#include "Platform/Tree/Arena.h"
#include "Platform/Tree/Names.h"
#include "Platform/Tree/TreeHead.h"
#include "Platform/Tree/XMLTestSupport.h"
#include "xquery/XMLNode.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <random>
#include <set>
#include <thread>
#include <vector>

namespace xquery {
namespace {

Ref<NSXMLElement> element(std::string_view name) {
  return NSXMLElement::elementWithName(A(name));
}

std::string names(const NSXMLNode* first, NSXMLNode* (NSXMLNode::*next)() const) {
  std::string all;
  for (const NSXMLNode* node = first; node; node = (node->*next)()) {
    all += node->hasName() ? node->nameView().utf8() : node->textView().utf8();
    all += ' ';
  }
  return all;
}

TEST(XMLTree, NavigationFollowsTheDocument) {
  const auto document = parsed("<a><b x='1'>t</b><!--c--><?p q?><d><e/></d></a>");
  const NSXMLElement* a = document->rootElement();
  EXPECT_EQ(names(a->firstChild(), &NSXMLNode::nextSibling), "b c p d ");
  EXPECT_EQ(names(a->lastChild(), &NSXMLNode::previousSibling), "d p c b ");
  EXPECT_EQ(names(a, &NSXMLNode::nextNode), "a b t c p d e ");
  EXPECT_EQ(a->childCount(), 4u);
  EXPECT_EQ(a->childAtIndex(3)->nameView().utf8(), "d");
  EXPECT_EQ(a->childAtIndex(4), nullptr);
  EXPECT_EQ(a->firstChild()->firstChild()->rootNode(), document.get());
  EXPECT_EQ(a->firstChild()->firstChild()->rootDocument(), document.get());
  EXPECT_EQ(a->firstChild()->firstChild()->level(), 3);
  EXPECT_EQ(document->level(), 0);
}

TEST(XMLTree, AttributesAndNamespacesHaveNoSiblingsAndNoNextNode) {
  const auto document = parsed("<a xmlns:n='u' x='1' y='2'><b/></a>");
  const NSXMLElement* a = document->rootElement();
  const NSXMLNode* x = a->firstAttribute();
  const NSXMLNode* n = a->firstNamespace();
  for (const NSXMLNode* node : {x, n}) {
    EXPECT_EQ(node->nextSibling(), nullptr);
    EXPECT_EQ(node->previousSibling(), nullptr);
    EXPECT_EQ(node->nextNode(), nullptr);
    EXPECT_EQ(node->parent(), a);
  }
  EXPECT_EQ(NSXMLElement::nextNamespace(n), nullptr);
  EXPECT_EQ(NSXMLElement::nextAttribute(x)->nameView().utf8(), "y");
}

TEST(XMLTree, NamespacesAndThenAttributesHaveNegativeIndexesBeforeTheChildren) {
  const auto document = parsed("<a xmlns:n='u' x='1' y='2'><b/><c/></a>");
  const NSXMLElement* a = document->rootElement();
  EXPECT_EQ(a->firstNamespace()->index(), -3);
  EXPECT_EQ(a->firstAttribute()->index(), -2);
  EXPECT_EQ(NSXMLElement::nextAttribute(a->firstAttribute())->index(), -1);
  EXPECT_EQ(a->firstChild()->index(), 0);
  EXPECT_EQ(a->lastChild()->index(), 1);
  EXPECT_EQ(document->index(), 0);
}

TEST(XMLTree, StringValueIsAllDescendantTextButNoCommentsOrInstructions) {
  const auto document = parsed("<a>x<b>y<!--no--></b><?no no?><![CDATA[<z>]]></a>");
  EXPECT_EQ(document->stringValue()->utf8(), "xy<z>");
  EXPECT_EQ(document->rootElement()->stringValue()->utf8(), "xy<z>");
  EXPECT_EQ(document->rootElement()->childAtIndex(1)->stringValue()->utf8(), "y");
}

TEST(XMLTree, ANodeKeepsItsWholeTree) {
  Ref<NSXMLNode> text;
  {
    const auto document = parsed("<a><b>deep</b></a>");
    text = document->rootElement()->firstChild()->firstChild();
  }
  EXPECT_EQ(text->rootDocument()->rootElement()->nameView().utf8(), "a");
}

TEST(XMLTree, AStringTakenFromATreeKeepsIt) {
  Ref<NSString> text;
  {
    const auto document = parsed("<a>a text that is too long to be copied into a string</a>");
    text = document->stringValue();
  }
  EXPECT_EQ(text->utf8(), "a text that is too long to be copied into a string");
}

TEST(XMLTree, WhatWasMadeBeforeAnEraIsNotNewInIt) {
  const auto outside = NSXMLElement::elementWithName(A("a"));
  EXPECT_TRUE(NSXMLTree::isNew(outside.get())) << "outside of any era";
  Ref<NSXMLNode> made;
  {
    const NSXMLEra era;
    EXPECT_FALSE(NSXMLTree::isNew(outside.get()));
    made = NSXMLNode::textWithStringValue(A("t"));
    EXPECT_TRUE(NSXMLTree::isNew(made.get()));
    EXPECT_TRUE(NSXMLTree::isNew(outside->copy().get()));
    const auto read = parsed("<a/>");
    EXPECT_FALSE(NSXMLTree::isNew(read.get())) << "read, not made";
    {
      const NSXMLEra inner;
      EXPECT_FALSE(NSXMLTree::isNew(made.get()));
      made = NSXMLNode::textWithStringValue(A("u"));
    }
    EXPECT_TRUE(NSXMLTree::isNew(made.get())) << "made in an era inside";
  }
  const NSXMLEra later;
  EXPECT_FALSE(NSXMLTree::isNew(made.get()));
}

TEST(XMLTree, AMergedTreeIsAsOldAsItsOldestPart) {
  const auto old = NSXMLElement::elementWithName(A("a"));
  const NSXMLEra era;
  const auto parent = NSXMLElement::elementWithName(A("p"));
  EXPECT_TRUE(NSXMLTree::mayMoveTo(parent.get(), NSXMLElement::elementWithName(A("c")).get()));
  EXPECT_FALSE(NSXMLTree::mayMoveTo(parent.get(), old.get()));
  EXPECT_TRUE(parent->addChild(old));
  EXPECT_FALSE(NSXMLTree::isNew(parent.get()));
}

TEST(XMLTree, WhatIsAddedToAnUnfinishedNodeCountsOnceThatIsInsideAnother) {
  const auto outer = NSXMLElement::elementWithName(A("o"));
  const auto inner = NSXMLElement::elementWithName(A("i"));
  const NSXMLUnfinished unfinished(*inner);
  const uint64_t before = NSXMLTree::finishedChangeCount();
  EXPECT_TRUE(inner->addChild(NSXMLElement::elementWithName(A("a"))));
  EXPECT_EQ(NSXMLTree::finishedChangeCount(), before);
  EXPECT_TRUE(outer->addChild(inner));
  const uint64_t inside = NSXMLTree::finishedChangeCount();
  EXPECT_GT(inside, before);
  EXPECT_TRUE(inner->addChild(NSXMLElement::elementWithName(A("b"))));
  EXPECT_GT(NSXMLTree::finishedChangeCount(), inside);
}

TEST(XMLTree, ANodeIsNeverAddedBelowItself) {
  const auto a = NSXMLElement::elementWithName(A("a"));
  const auto b = NSXMLElement::elementWithName(A("b"));
  EXPECT_FALSE(a->addChild(a));
  EXPECT_TRUE(a->addChild(b));
  EXPECT_FALSE(b->addChild(a));
  EXPECT_FALSE(b->insertChild(a, 0));
  EXPECT_FALSE(b->addChild(b)) << "it has a parent";
  EXPECT_FALSE(NSXMLTree::mayMoveTo(b.get(), a.get()));
  EXPECT_FALSE(NSXMLTree::mayMoveTo(a.get(), a.get()));
  EXPECT_FALSE(a->parent());
}

TEST(XMLTree, AddingANodeMovesItAndKeepsItsIdentity) {
  const auto parent = element("p");
  const auto child = element("c");
  const NSXMLElement* identity = child.get();
  EXPECT_TRUE(child->addChild(NSXMLNode::textWithStringValue(A("t"))));
  EXPECT_TRUE(parent->addChild(child));
  EXPECT_EQ(parent->firstChild(), identity);
  EXPECT_EQ(child->parent(), parent.get());
  EXPECT_EQ(NSXMLTree::of(child.get()), NSXMLTree::of(parent.get()));
  EXPECT_EQ(parent->stringValue()->utf8(), "t");
}

TEST(XMLTree, WhatMayNotBeAChildIsRefused) {
  const auto parent = element("p");
  const auto child = element("c");
  EXPECT_TRUE(parent->addChild(child));
  EXPECT_FALSE(parent->addChild(child)) << "it has a parent";
  EXPECT_FALSE(child->addChild(parent)) << "an ancestor";
  EXPECT_FALSE(parent->addChild(parent));
  EXPECT_FALSE(parent->addChild(NSXMLDocument::document()));
  EXPECT_FALSE(parent->addChild(NSXMLNode::attributeWithName(A("a"), A("v"))));
  EXPECT_FALSE(parent->addChild(NSXMLNode::namespaceWithName(A("a"), A("v"))));
  EXPECT_FALSE(parent->addChild(nullptr));
  EXPECT_EQ(parent->childCount(), 1u);
}

TEST(XMLTree, InsertChildPutsItAtTheIndexOrAtTheEnd) {
  const auto parent = element("p");
  EXPECT_TRUE(parent->insertChild(element("b"), 7));
  EXPECT_TRUE(parent->insertChild(element("a"), 0));
  EXPECT_TRUE(parent->insertChild(element("d"), 2));
  EXPECT_TRUE(parent->insertChild(element("c"), 2));
  EXPECT_EQ(names(parent->firstChild(), &NSXMLNode::nextSibling), "a b c d ");
  EXPECT_EQ(names(parent->lastChild(), &NSXMLNode::previousSibling), "d c b a ");
}

TEST(XMLTree, AnAttributeOfAPresentNameIsNotAdded) {
  const auto parent = element("p");
  EXPECT_TRUE(parent->addAttribute(NSXMLNode::attributeWithName(A("q:x"), A("1"), A("u"))));
  EXPECT_FALSE(parent->addAttribute(NSXMLNode::attributeWithName(A("q:x"), A("2"), A("v"))));
  EXPECT_TRUE(parent->addAttribute(NSXMLNode::attributeWithName(A("x"), A("3"))));
  EXPECT_FALSE(parent->addAttribute(element("x")));
  EXPECT_EQ(parent->attributeCount(), 2u);
  EXPECT_EQ(parent->attributeForName(A("q:x"))->stringValue()->utf8(), "1");
  EXPECT_EQ(parent->attributeForLocalName(A("x"), A("u"))->stringValue()->utf8(), "1");
  EXPECT_EQ(parent->attributeForLocalName(A("x"), {})->stringValue()->utf8(), "3");
  EXPECT_EQ(parent->attributeForLocalName(A("x"), A("v")), nullptr);
  parent->removeAttributeForName(A("q:x"));
  EXPECT_EQ(parent->attributeForName(A("q:x")), nullptr);
  EXPECT_EQ(parent->attributeCount(), 1u);
}

TEST(XMLTree, APrefixIsDeclaredOncePerElement) {
  const auto parent = element("p");
  EXPECT_TRUE(parent->addAttribute(NSXMLNode::attributeWithName(A("x"), A("1"))));
  EXPECT_TRUE(parent->addNamespace(NSXMLNode::namespaceWithName(A("q"), A("u"))));
  EXPECT_FALSE(parent->addNamespace(NSXMLNode::namespaceWithName(A("q"), A("v"))));
  EXPECT_TRUE(parent->addNamespace(NSXMLNode::namespaceWithName({}, A("w"))));
  EXPECT_EQ(parent->firstNamespace()->nameView().utf8(), "q");
  EXPECT_EQ(NSXMLElement::nextNamespace(parent->firstNamespace())->nameView().utf8(), "");
  EXPECT_EQ(parent->firstAttribute()->nameView().utf8(), "x");
  EXPECT_EQ(parent->attributeCount(), 1u);
}

TEST(XMLTree, NamesHaveTheirParts) {
  const auto node = NSXMLElement::elementWithName(A("p:local"), A("urn:u"));
  EXPECT_EQ(node->name()->utf8(), "p:local");
  EXPECT_EQ(node->localName()->utf8(), "local");
  EXPECT_EQ(node->prefix()->utf8(), "p");
  EXPECT_EQ(node->URI()->utf8(), "urn:u");
  const auto plain = element("local");
  EXPECT_FALSE(plain->prefix());
  EXPECT_FALSE(plain->URI());
  EXPECT_FALSE(NSXMLNode::textWithStringValue(A("t"))->name());
  EXPECT_EQ(NSXMLNode::processingInstructionWithName(A("t"), A("v"))->name()->utf8(), "t");
  const auto defaultNamespace = NSXMLNode::namespaceWithName({}, A("u"));
  ASSERT_TRUE(defaultNamespace->name());
  EXPECT_EQ(defaultNamespace->name()->utf8(), "");
  EXPECT_EQ(defaultNamespace->stringValue()->utf8(), "u");
}

TEST(XMLTree, EqualExpandedNamesAreOnePointer) {
  const auto a = NSXMLElement::elementWithName(A("p:x"), A("u"));
  const auto b = NSXMLNode::attributeWithName(A("q:x"), A(""), A("u"));
  const NSXMLExpandedNameRef handle(A("u"), A("x"));
  EXPECT_EQ(a->expandedName(), b->expandedName());
  EXPECT_EQ(a->expandedName(), handle.get());
  EXPECT_NE(a->nodeName(), b->nodeName());
  EXPECT_NE(a->expandedName(), element("x")->expandedName());
  const char16_t wide[] = u"x";
  EXPECT_EQ(NSXMLExpandedNameRef(A("u"), NSStringView(wide, 1)).get(), handle.get());
}

TEST(XMLTree, NamesLeaveWithTheirLastUser) {
  const size_t before = NSXMLInternedNameCount();
  {
    Ref<NSXMLNode> kept;
    {
      const auto document =
          parsed("<n1:leaving xmlns:n1='urn:leaving' attr='1'><?leaving-pi x?></n1:leaving>");
      kept = document->rootElement()->firstAttribute();
    }
    EXPECT_GT(NSXMLInternedNameCount(), before);
    const NSXMLExpandedNameRef handle(A("urn:leaving"), A("leaving"));
    kept = nullptr;
    EXPECT_EQ(NSXMLInternedNameCount(), before + 2) << "the handle's name and its URI";
    const NSXMLExpandedNameRef copy = handle;
    EXPECT_EQ(copy.get(), handle.get());
  }
  EXPECT_EQ(NSXMLInternedNameCount(), before);
}

TEST(XMLTree, DetachMakesARoot) {
  const auto document = parsed("<a><b/><c><d/></c><e x='1'/></a>");
  NSXMLElement* a = document->rootElement();
  const Ref<NSXMLNode> c = a->childAtIndex(1);
  c->detach();
  EXPECT_EQ(c->parent(), nullptr);
  EXPECT_EQ(c->nextSibling(), nullptr);
  EXPECT_EQ(c->previousSibling(), nullptr);
  EXPECT_EQ(names(a->firstChild(), &NSXMLNode::nextSibling), "b e ");
  EXPECT_EQ(names(a->lastChild(), &NSXMLNode::previousSibling), "e b ");
  EXPECT_FALSE(NSXMLNodeOrder::areComparable(a, c.get()));
  EXPECT_TRUE(NSXMLNodeOrder::areComparable(c.get(), c->firstChild()));
  EXPECT_EQ(NSXMLNode::compareOrder(c.get(), c->firstChild()), -1);
  const Ref<NSXMLNode> x = cast<NSXMLElement>(a->lastChild())->firstAttribute();
  x->detach();
  EXPECT_EQ(cast<NSXMLElement>(a->lastChild())->attributeCount(), 0u);
  EXPECT_TRUE(a->addAttribute(x));
  EXPECT_EQ(x->parent(), a);
}

TEST(XMLTree, SetStringValueReplacesTextAndChildren) {
  const auto parent = element("p");
  const Ref<NSXMLNode> old = NSXMLNode::textWithStringValue(A("old"));
  EXPECT_TRUE(parent->addChild(old));
  EXPECT_TRUE(parent->addChild(element("c")));
  parent->setStringValue(A("new"));
  EXPECT_EQ(parent->stringValue()->utf8(), "new");
  EXPECT_EQ(parent->childCount(), 1u);
  EXPECT_EQ(old->parent(), nullptr);
  EXPECT_EQ(old->stringValue()->utf8(), "old");
  parent->setStringValue({});
  EXPECT_EQ(parent->firstChild(), nullptr);
  const auto attribute = NSXMLNode::attributeWithName(A("a"), A("1"));
  const char16_t wide[] = u"\u00e9";
  attribute->setStringValue(NSStringView(wide, 1));
  EXPECT_EQ(attribute->stringValue()->utf8(), "\xC3\xA9");
  attribute->setStringValue(A("x"));
  EXPECT_EQ(attribute->stringValue()->utf8(), "x");
}

TEST(XMLTree, ADocumentKnowsItsURI) {
  const auto document = NSXMLDocument::document();
  EXPECT_FALSE(document->documentURI());
  document->setURI(NSString::stringWithASCII("file:///one"));
  document->setURI(NSString::stringWithASCII("file:///two"));
  EXPECT_EQ(document->documentURI()->utf8(), "file:///two");
  document->setURI(nullptr);
  EXPECT_FALSE(document->documentURI());
}

TEST(XMLTree, AURITakenFromTheDocumentsOwnTextDoesNotKeepIt) {
  // The leak checker is the judge.
  const auto document = parsed("<a>urn:a-text-that-is-too-long-to-be-copied-into-a-string</a>");
  document->setURI(document->stringValue());
  EXPECT_EQ(document->documentURI()->view(),
            "urn:a-text-that-is-too-long-to-be-copied-into-a-string");
}

// --- document order against a plain walk -------------------------------------------------------

void collect(const NSXMLNode* root, std::vector<const NSXMLNode*>& out) {
  std::vector<const NSXMLNode*> stack{root};
  while (!stack.empty()) {
    const NSXMLNode* node = stack.back();
    stack.pop_back();
    out.push_back(node);
    if (const auto* parent = dyn_cast<NSXMLElement>(node)) {
      for (auto* n = parent->firstNamespace(); n; n = NSXMLElement::nextNamespace(n)) {
        out.push_back(n);
      }
      for (auto* a = parent->firstAttribute(); a; a = NSXMLElement::nextAttribute(a)) {
        out.push_back(a);
      }
    }
    for (const NSXMLNode* child = node->lastChild(); child; child = child->previousSibling()) {
      stack.push_back(child);
    }
  }
}

void expectOrdered(const NSXMLNode* root) {
  std::vector<const NSXMLNode*> nodes;
  collect(root, nodes);
  for (size_t index = 1; index < nodes.size(); ++index) {
    ASSERT_TRUE(NSXMLNodeOrder::areComparable(nodes[index - 1], nodes[index]));
    ASSERT_LT(NSXMLNodeOrder::number(*nodes[index - 1]), NSXMLNodeOrder::number(*nodes[index]))
        << index;
    ASSERT_EQ(NSXMLNode::compareOrder(nodes[index - 1], nodes[index]), -1);
    ASSERT_EQ(NSXMLNode::compareOrder(nodes[index], nodes[index - 1]), 1);
  }
  ASSERT_EQ(NSXMLNode::compareOrder(root, root), 0);
}

TEST(XMLTree, ParsedNodesAreNumberedInDocumentOrder) {
  const auto document =
      parsed("<?p?><a xmlns='u' x='1'><b y='2' z='3'>t<c/></b><!--c--><d/></a><!--e-->");
  expectOrdered(document.get());
}

Ref<NSXMLNode> randomNode(std::mt19937& random) {
  switch (random() % 4) {
    case 0:
      return NSXMLNode::textWithStringValue(A("text"));
    case 1:
      return NSXMLNode::commentWithStringValue(A("comment"));
    default:
      return element(std::string(1, static_cast<char>('a' + random() % 8)));
  }
}

// Adds, inserts, detaches and moves between trees at random; after each step the numbers of some
// trees are compared with a walk, so that good, stale and partly good trees all meet changes.
void mutate(uint32_t seed) {
  std::mt19937 random(seed);
  std::vector<Ref<NSXMLNode>> nodes;
  for (int index = 0; index < 6; ++index) nodes.push_back(element("root"));
  for (int step = 0; step < 300; ++step) {
    const Ref<NSXMLNode> a = nodes[random() % nodes.size()];
    const Ref<NSXMLNode> b = nodes[random() % nodes.size()];
    auto* parent = dyn_cast<NSXMLElement>(a.get());
    switch (random() % 6) {
      case 0:
      case 1: {
        Ref<NSXMLNode> made = randomNode(random);
        if (parent && parent->insertChild(made, random() % 4)) nodes.push_back(made);
        break;
      }
      case 2:
        if (parent) {
          const std::string name = "n" + std::to_string(random() % 4);
          static_cast<void>(parent->addAttribute(NSXMLNode::attributeWithName(A(name), A("v"))));
          static_cast<void>(parent->addNamespace(NSXMLNode::namespaceWithName(A(name), A("v"))));
        }
        break;
      case 3:
        a->detach();
        break;
      default: {
        const bool possible = parent && !b->parent() && a->rootNode() != b.get();
        ASSERT_EQ(parent && parent->addChild(b), possible);
      }
    }
    const NSXMLNode* checked = nodes[random() % nodes.size()]->rootNode();
    ASSERT_NO_FATAL_FAILURE(expectOrdered(checked)) << "seed " << seed << " step " << step;
    const NSXMLNode* other = nodes[random() % nodes.size()].get();
    ASSERT_EQ(NSXMLNodeOrder::areComparable(checked, other), other->rootNode() == checked);
  }
  for (const auto& node : nodes) ASSERT_NO_FATAL_FAILURE(expectOrdered(node->rootNode()));
}

TEST(XMLTree, OrderNumbersEqualAPlainWalkAfterRandomChanges) {
  for (uint32_t seed = 0; seed < 60; ++seed) ASSERT_NO_FATAL_FAILURE(mutate(seed));
}

TEST(XMLTree, ManyTreesMergeIntoOne) {
  const auto parent = element("p");
  std::vector<NSXMLNode*> children;
  for (int index = 0; index < 20000; ++index) {
    const auto child = element("c");
    EXPECT_TRUE(child->addChild(NSXMLNode::textWithStringValue(A("x"))));
    EXPECT_TRUE(parent->addChild(child));
    children.push_back(child.get());
  }
  NSXMLNode* child = parent->firstChild();
  for (NSXMLNode* expected : children) {
    ASSERT_EQ(child, expected);
    ASSERT_EQ(NSXMLTree::of(child), NSXMLTree::of(parent.get()));
    child = child->nextSibling();
  }
  EXPECT_EQ(parent->stringValue()->length(), 20000u);
  expectOrdered(parent.get());
}

TEST(XMLTree, TreesMergeInPairs) {
  // A balanced merge: every tree is the smaller one about half of the time.
  std::vector<Ref<NSXMLElement>> level;
  for (int index = 0; index < 4096; ++index) level.push_back(element("e"));
  while (level.size() > 1) {
    std::vector<Ref<NSXMLElement>> next;
    for (size_t index = 0; index + 1 < level.size(); index += 2) {
      EXPECT_TRUE(level[index]->addChild(level[index + 1]));
      next.push_back(level[index]);
    }
    level = std::move(next);
  }
  std::vector<const NSXMLNode*> nodes;
  collect(level[0].get(), nodes);
  EXPECT_EQ(nodes.size(), 4096u);
  expectOrdered(level[0].get());
}

TEST(XMLTree, AMillionLevelsAreBuiltWalkedAndFreed) {
  auto top = element("e");
  for (int depth = 1; depth < 1000000; ++depth) {
    auto parent = element("e");
    ASSERT_TRUE(parent->addChild(top));
    top = parent;
  }
  size_t count = 0;
  const NSXMLNode* last = nullptr;
  for (const NSXMLNode* node = top.get(); node; node = node->nextNode()) {
    ++count;
    last = node;
  }
  EXPECT_EQ(count, 1000000u);
  EXPECT_EQ(last->level(), 999999);
  EXPECT_EQ(NSXMLNode::compareOrder(top.get(), last), -1);
  EXPECT_EQ(top->stringValue()->length(), 0u);
}

TEST(XMLTree, TwoThreadsMayAskForTheOrderOfAStaleTree) {
  for (int round = 0; round < 20; ++round) {
    const auto parent = element("p");
    for (int index = 0; index < 2000; ++index) EXPECT_TRUE(parent->addChild(element("c")));
    bool ordered[2] = {true, true};
    const auto ask = [&](bool& answer) {
      for (const NSXMLNode* node = parent->firstChild(); node->nextSibling();
           node = node->nextSibling()) {
        answer = answer && NSXMLNodeOrder::areComparable(node, node->nextSibling()) &&
                 NSXMLNodeOrder::number(*node) < NSXMLNodeOrder::number(*node->nextSibling());
      }
    };
    std::thread one(ask, std::ref(ordered[0]));
    std::thread two(ask, std::ref(ordered[1]));
    one.join();
    two.join();
    EXPECT_TRUE(ordered[0] && ordered[1]);
  }
}

TEST(XMLTree, TwoThreadsMayAskForTheOrderOfTwoRootsInOneTree) {
  for (int round = 0; round < 20; ++round) {
    const auto top = element("t");
    const Ref<NSXMLElement> parents[2] = {element("p"), element("q")};
    for (const auto& parent : parents) {
      EXPECT_TRUE(top->addChild(parent));
      parent->detach();
      for (int index = 0; index < 500; ++index) EXPECT_TRUE(parent->addChild(element("c")));
    }
    std::thread one([&] { expectOrdered(parents[0].get()); });
    std::thread two([&] { expectOrdered(parents[1].get()); });
    one.join();
    two.join();
  }
}

TEST(XMLTree, ThreadsMayCreateAndDropNamesAtOnce) {
  const size_t before = NSXMLInternedNameCount();
  const auto work = [] {
    for (int index = 0; index < 20000; ++index) {
      const std::string name = "thread-name-" + std::to_string(index % 7);
      const auto made = NSXMLElement::elementWithName(A(name), A("urn:threads"));
      ASSERT_EQ(made->nameView().utf8(), name);
    }
  };
  std::thread one(work);
  std::thread two(work);
  one.join();
  two.join();
  EXPECT_EQ(NSXMLInternedNameCount(), before);
}

TEST(XMLTree, AFactoryThatFailsLeavesNothingBehind) {
  const std::string text(200000, 't');
  const int64_t bytes = workMeter.valueBytes;
  const size_t names = NSXMLInternedNameCount();
  workMeter.mostValueBytes = bytes + 100000;
  EXPECT_THROW(static_cast<void>(NSXMLNode::textWithStringValue(A(text))), std::bad_alloc);
  EXPECT_THROW(static_cast<void>(NSXMLNode::attributeWithName(A("failing"), A(text), A("urn:f"))),
               std::bad_alloc);
  EXPECT_THROW(static_cast<void>(NSXMLNode::processingInstructionWithName(A("failing"), A(text))),
               std::bad_alloc);
  EXPECT_EQ(workMeter.valueBytes, bytes);
  EXPECT_EQ(NSXMLInternedNameCount(), names);
  workMeter.mostValueBytes = INT64_MAX;
  workMeter.wasRefused = false;
  workMeter.stepsLeft = WorkMeter::manySteps;
}

}  // namespace
}  // namespace xquery

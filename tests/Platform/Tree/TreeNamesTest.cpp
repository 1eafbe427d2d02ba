#include "Platform/Tree/Arena.h"
#include "Platform/Tree/Names.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <string>
#include <vector>

namespace xquery {
namespace {

std::string nameOf(int index) {
  return "name-of-a-node-in-a-test-" + std::to_string(index);
}

Ref<NSXMLElement> elementOfNames(int from, int count) {
  const auto root = NSXMLElement::elementWithName(NSStringView::ascii(nameOf(from)));
  for (int index = from + 1; index < from + count; ++index) {
    root->addChild(NSXMLElement::elementWithName(NSStringView::ascii(nameOf(index))));
  }
  return root;
}

int goodNames(const NSXMLNode& root, int from) {
  int good = root.nameView() == nameOf(from) ? 1 : 0;
  for (const NSXMLNode* child = root.firstChild(); child; child = child->nextSibling()) {
    if (child->nameView() == nameOf(++from)) ++good;
  }
  return good;
}

// A tree keeps one name, a few and many in different ways.
TEST(XMLTreeNames, AreHeldWhateverTheirNumber) {
  const size_t before = NSXMLInternedNameCount();
  for (const int count : {1, 2, 3, 4, 5, 7, 8, 9, 15, 16, 17, 100}) {
    const auto root = elementOfNames(0, count);
    EXPECT_EQ(goodNames(*root, 0), count);
    EXPECT_EQ(goodNames(*root->copy(), 0), count);
    // A name and its expanded name each.
    EXPECT_EQ(NSXMLInternedNameCount(), before + 2 * static_cast<size_t>(count));
  }
  EXPECT_EQ(NSXMLInternedNameCount(), before);
}

TEST(XMLTreeNames, OfJoinedTreesAreHeldOnce) {
  const size_t before = NSXMLInternedNameCount();
  for (const int first : {1, 2, 3, 8, 15, 16, 40}) {
    for (const int second : {1, 2, 3, 8, 15, 16, 40}) {
      const auto root = elementOfNames(0, first);
      const auto child = elementOfNames(first / 2, second);
      root->addChild(child);
      EXPECT_EQ(goodNames(*child, first / 2), second);
      EXPECT_TRUE(root->nameView() == nameOf(0));
      const auto different = static_cast<size_t>(std::max(first, first / 2 + second));
      EXPECT_EQ(NSXMLInternedNameCount(), before + 2 * different) << first << " " << second;
    }
  }
  EXPECT_EQ(NSXMLInternedNameCount(), before);
}

TEST(XMLTreeNames, StayWithADocumentThatHasAURI) {
  const size_t before = NSXMLInternedNameCount();
  for (const int count : {1, 3, 16}) {
    const auto document = NSXMLDocument::document();
    document->setURI(NSString::stringWithASCII("http://x/"));
    document->addChild(elementOfNames(0, count));
    const auto copy = document->copy();
    EXPECT_EQ(goodNames(*document->rootElement(), 0), count);
    EXPECT_EQ(goodNames(*cast<NSXMLDocument>(copy.get())->rootElement(), 0), count);
    EXPECT_EQ(cast<NSXMLDocument>(copy.get())->documentURI()->utf8(), "http://x/");
  }
  EXPECT_EQ(NSXMLInternedNameCount(), before);
}

// --- room ----------------------------------------------------------------------------------------

TEST(XMLRoom, NodesAreMadeInItAsFarAsItGoes) {
  for (const size_t roomBytes : {0u, 8u, 48u, 56u, 104u, 160u, 4096u}) {
    NSXMLRoom room;
    const Ref<NSXMLElement> a =
        NSXMLTree::makeLoneElement(NSXMLInternName(NSStringView::ascii("a"), {}), roomBytes, room);
    std::string expected;
    for (const size_t length : {0u, 1u, 8u, 9u, 40u, 3u}) {
      std::u16string text(length, u'x');
      if (length == 9) text[0] = u'\x3B1';
      const NSStringView view(text.data(), static_cast<uint32_t>(text.size()));
      NSXMLNode* node = NSXMLTree::of(a.get())->makeNode(Kind::Text, view, room);
      NSXMLTree::insertChild(a.get(), node, nullptr);
      expected += view.utf8();
    }
    EXPECT_EQ(a->stringValue()->utf8(), expected) << roomBytes;
    for (const NSXMLNode* node = a->firstChild(); node; node = node->nextSibling()) {
      EXPECT_EQ(NSXMLTree::of(node), NSXMLTree::of(a.get()));
    }
  }
}

TEST(XMLRoom, StaysGoodWhenTheTreeIsTakenInByAnother) {
  NSXMLRoom room;
  const Ref<NSXMLElement> a =
      NSXMLTree::makeLoneElement(NSXMLInternName(NSStringView::ascii("a"), {}), 200, room);
  a->addChild(elementOfNames(0, 50));
  NSXMLNode* node = NSXMLTree::of(a.get())->makeNode(Kind::Text, NSStringView::ascii("x"), room);
  NSXMLTree::insertChild(a.get(), node, nullptr);
  EXPECT_EQ(NSXMLTree::of(node), NSXMLTree::of(a.get()));
  EXPECT_EQ(a->lastChild()->textView(), "x");
}

TEST(XMLRoom, AttributesFollowEachOther) {
  const auto a = NSXMLElement::elementWithName(NSStringView::ascii("a"));
  NSXMLNode* last = nullptr;
  for (const char* name : {"b", "c", "d"}) {
    NSXMLNode* attribute = NSXMLTree::makeLoneNode(Kind::Attribute, NSStringView::ascii("1"),
                                                   NSXMLInternName(NSStringView::ascii(name), {}));
    NSXMLTree::appendProperty(a.get(), attribute, last);
    last = attribute;
    a->addNamespace(
        NSXMLNode::namespaceWithName(NSStringView::ascii(name), NSStringView::ascii("u")));
  }
  EXPECT_EQ(a->XMLString()->utf8(),
            "<a xmlns:b=\"u\" xmlns:c=\"u\" xmlns:d=\"u\" b=\"1\" c=\"1\" d=\"1\"/>");
  EXPECT_EQ(last->index(), -1);
}

}  // namespace
}  // namespace xquery

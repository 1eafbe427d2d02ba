#include "Platform/Tree/Arena.h"
#include "Platform/Tree/Names.h"
#include "Platform/Tree/XMLTestSupport.h"
#include "xquery/XMLNode.h"

#include <gtest/gtest.h>

namespace xquery {
namespace {

constexpr uint32_t keepAll = NSXMLNodePreserveWhitespace | NSXMLNodePreserveCDATA;

std::string written(const NSXMLNode* node) {
  return node->XMLString()->utf8();
}

TEST(XMLCopy, EveryKindIsCopied) {
  const Ref<NSXMLNode> originals[] = {
      NSXMLNode::textWithStringValue(A("t")),
      NSXMLNode::cdataWithStringValue(A("t")),
      NSXMLNode::commentWithStringValue(A("c")),
      NSXMLNode::processingInstructionWithName(A("p"), A("v")),
      NSXMLNode::attributeWithName(A("q:a"), A("v"), A("u")),
      NSXMLNode::namespaceWithName(A("q"), A("u")),
      NSXMLElement::elementWithName(A("q:e"), A("u")),
      parsed("<a xmlns='u' x='1'>t<b/><!--c--></a>"),
  };
  for (const Ref<NSXMLNode>& original : originals) {
    const Ref<NSXMLNode> copy = original->copy();
    EXPECT_NE(copy.get(), original.get());
    EXPECT_NE(NSXMLTree::of(copy.get()), NSXMLTree::of(original.get()));
    EXPECT_EQ(copy->kind(), original->kind());
    EXPECT_EQ(copy->nodeName(), original->nodeName());
    EXPECT_EQ(written(copy.get()), written(original.get()));
  }
}

TEST(XMLCopy, OfANodeWithinATreeIsThatNodeAloneWithoutParent) {
  const auto document = parsed("<a><b x='1'>t<c/></b><d/>u</a>");
  const Ref<NSXMLNode> b = document->rootElement()->firstChild()->copy();
  EXPECT_EQ(b->parent(), nullptr);
  EXPECT_EQ(b->nextSibling(), nullptr);
  EXPECT_EQ(written(b.get()), "<b x=\"1\">t<c/></b>");
  const Ref<NSXMLNode> x = cast<NSXMLElement>(b)->firstAttribute()->copy();
  EXPECT_EQ(x->parent(), nullptr);
  EXPECT_EQ(written(x.get()), "x=\"1\"");
}

TEST(XMLCopy, OutlivesTheOriginalWithItsNames) {
  Ref<NSXMLNode> copy;
  {
    const auto document =
        parsed("<outliving xmlns='urn:outliving' attr='\xC3\xA9'>text</outliving>");
    copy = document->copy();
  }
  EXPECT_EQ(cast<NSXMLDocument>(copy)->rootElement()->URIView().utf8(), "urn:outliving");
  EXPECT_EQ(copy->stringValue()->utf8(), "text");
}

TEST(XMLCopy, LeavesTheOriginalAlone) {
  const auto document = parsed("<a><b/></a>");
  const Ref<NSXMLNode> copy = document->copy();
  EXPECT_TRUE(
      cast<NSXMLDocument>(copy)->rootElement()->addChild(NSXMLElement::elementWithName(A("c"))));
  copy->firstChild()->firstChild()->detach();
  EXPECT_EQ(written(document->rootElement()), "<a><b/></a>");
  EXPECT_EQ(written(copy->firstChild()), "<a><c/></a>");
}

TEST(XMLCopy, OfAnElementKeepsOnlyItsOwnDeclarationsButAllURIs) {
  const auto document = parsed("<a xmlns:p='u' xmlns:q='v'><p:b xmlns:r='w'><p:c/></p:b></a>");
  const Ref<NSXMLNode> b = document->rootElement()->firstChild()->copy();
  const NSXMLNode* declared = cast<NSXMLElement>(b)->firstNamespace();
  EXPECT_EQ(declared->nameView().utf8(), "r");
  EXPECT_EQ(NSXMLElement::nextNamespace(declared), nullptr);
  EXPECT_EQ(written(b.get()), "<p:b xmlns:r=\"w\" xmlns:p=\"u\"><p:c/></p:b>");
}

TEST(XMLCopy, KeepsTheURIOfADocument) {
  const auto document = parsed("<a/>");
  document->setURI(NSString::stringWithASCII("file:///here"));
  const Ref<NSXMLNode> copy = document->copy();
  EXPECT_EQ(cast<NSXMLDocument>(copy)->documentURI()->utf8(), "file:///here");
}

TEST(XMLCopy, IsNumberedInDocumentOrder) {
  const auto document = parsed("<a xmlns:n='u' x='1'><b y='2'>t</b><c/></a>");
  const Ref<NSXMLNode> copy = document->copy();
  const NSXMLElement* a = cast<NSXMLDocument>(copy)->rootElement();
  const NSXMLNode* inOrder[] = {copy.get(),
                                a,
                                a->firstNamespace(),
                                a->firstAttribute(),
                                a->firstChild(),
                                cast<NSXMLElement>(a->firstChild())->firstAttribute(),
                                a->firstChild()->firstChild(),
                                a->lastChild()};
  for (size_t index = 1; index < std::size(inOrder); ++index) {
    EXPECT_EQ(NSXMLNode::compareOrder(inOrder[index - 1], inOrder[index]), -1) << index;
  }
}

TEST(XMLCopy, GeneratedDocumentsAreCopiedWhole) {
  for (uint32_t seed = 0; seed < 500; ++seed) {
    const auto document = parsed(RandomDocument(seed).text(), keepAll);
    const Ref<NSXMLNode> copy = document->copy();
    ASSERT_EQ(written(copy.get()), written(document.get())) << seed;
    ASSERT_EQ(described(copy.get()), described(document.get())) << seed;
  }
}

TEST(XMLCopy, OfAMovedAndMergedTreeIsWhole) {
  const auto a = NSXMLElement::elementWithName(A("a"));
  for (int index = 0; index < 300; ++index) {
    const std::string name = "n" + std::to_string(index);
    EXPECT_TRUE(a->addChild(NSXMLElement::elementWithName(A(name))));
  }
  EXPECT_EQ(written(a->copy().get()), written(a.get()));
}

TEST(XMLCopy, NamesOfManyCopiesLeaveWithThem) {
  const size_t before = NSXMLInternedNameCount();
  {
    std::string text = "<many>";
    for (int index = 0; index < 500; ++index) text += "<copied" + std::to_string(index) + "/>";
    Ref<NSXMLNode> copy = parsed(text + "</many>")->copy();
    copy = copy->copy();
    EXPECT_GE(NSXMLInternedNameCount(), before + 1000);
  }
  EXPECT_EQ(NSXMLInternedNameCount(), before);
}

}  // namespace
}  // namespace xquery

#include "Platform/Base/ProcessorTime.h"
#include "Platform/Base/WorkMeter.h"
#include "Types/XQueryNodeFunctions.h"
#include "TypesTestSupport.h"

namespace xquery {
namespace {

using testing::parse;
using testing::text;
using testing::utf8;
using testing::view;

NSXMLElement* root(const Ref<NSXMLDocument>& document) {
  return document->rootElement();
}

// The descendant element of that name; the first in document order.
const NSXMLNode* named(const Ref<NSXMLDocument>& document, std::string_view name) {
  const NSXMLNode* node = document.get();
  while (node && !(isa<NSXMLElement>(node) && node->nameView() == name)) node = node->nextNode();
  return node;
}

std::string joined(const std::vector<Ref<NSString>>& strings) {
  std::string all;
  for (const Ref<NSString>& string : strings) all += "[" + utf8(string) + "]";
  return all;
}

TEST(NodeStringValue, OfElementsAndDocumentsIsAllTextBelow) {
  const auto document = parse("<a>x<!--c--><b>y<?p i?><c><![CDATA[<z>]]></c></b>w</a>");
  EXPECT_EQ(utf8(XQueryNodeStringValue(document.get())), "xy<z>w");
  EXPECT_EQ(utf8(XQueryNodeStringValue(named(document, "b"))), "y<z>");
  EXPECT_EQ(utf8(XQueryNodeTypedValue(root(document))), "xy<z>w");
  EXPECT_EQ(utf8(XQueryNodeStringValue(root(parse("<a/>")))), "");
}

TEST(NodeStringValue, OfOtherNodesIsTheirOwnText) {
  EXPECT_EQ(utf8(XQueryNodeStringValue(NSXMLNode::textWithStringValue(view("t")).get())), "t");
  EXPECT_EQ(utf8(XQueryNodeStringValue(NSXMLNode::commentWithStringValue(view("t")).get())), "t");
  EXPECT_EQ(utf8(XQueryNodeStringValue(NSXMLNode::attributeWithName(view("a"), view("t")).get())),
            "t");
  EXPECT_EQ(utf8(XQueryNodeStringValue(
                NSXMLNode::processingInstructionWithName(view("a"), view("t")).get())),
            "t");
  EXPECT_EQ(utf8(XQueryNodeStringValue(NSXMLNode::namespaceWithName(view("p"), view("u")).get())),
            "u");
}

TEST(NodeAddChildTextValues, AppendsTheTextBelowInOrder) {
  const auto document = parse("<a>x<!--c--><b>y<c>z</c></b><?p i?>w</a>");
  NSMutableString string;
  string.appendASCII("=");
  XQueryNodeAddChildTextValues(root(document), string);
  EXPECT_EQ(utf8(string.string()), "=xyzw");
  XQueryNodeAddChildTextValues(named(document, "c"), string);
  EXPECT_EQ(utf8(string.string()), "=xyzwz");
  XQueryNodeAddChildTextValues(named(document, "c")->firstChild(), string);
  EXPECT_EQ(utf8(string.string()), "=xyzwz") << "its own text is not below it";
}

TEST(NodeFunctions, AMissingNodeHasNothing) {
  EXPECT_EQ(utf8(XQueryNodeStringValue(nullptr)), "");
  EXPECT_EQ(utf8(XQueryNodeTypedValue(nullptr)), "");
  EXPECT_FALSE(XQueryNodeName(nullptr));
  EXPECT_FALSE(XQueryNodeStringRepresentaion(nullptr));
  EXPECT_TRUE(CopyXQueryNodeNamespaces(nullptr).empty());
  EXPECT_FALSE(XQueryNodeEqual(nullptr, parse("<a/>").get(), nullptr));
  NSMutableString string;
  XQueryNodeAddChildTextValues(nullptr, string);
  EXPECT_EQ(string.length(), 0U);
}

TEST(NodeName, IsTheQualifiedNameAndThereIsNoTypeName) {
  const auto document = parse("<p:a xmlns:p='u'/>");
  EXPECT_EQ(utf8(XQueryNodeName(root(document))), "p:a");
  EXPECT_FALSE(XQueryNodeTypeName(root(document)));
}

TEST(NodeLanguage, IsThatOfTheNearestElementThatSaysOne) {
  const auto document = parse("<a xml:lang='en'><b><c xml:lang='de'/><d/></b></a>");
  EXPECT_EQ(utf8(XQueryNodeLanguage(named(document, "c"))), "de");
  EXPECT_EQ(utf8(XQueryNodeLanguage(named(document, "d"))), "en");
  EXPECT_EQ(utf8(XQueryNodeLanguage(root(document)->firstAttribute())), "en");
  EXPECT_FALSE(XQueryNodeLanguage(document.get()));
  EXPECT_FALSE(XQueryNodeLanguage(nullptr));
  EXPECT_FALSE(XQueryNodeLanguage(root(parse("<a/>"))));
}

TEST(NodeLanguage, AnEmptyOneHidesThoseFurtherOut) {
  const auto document = parse("<a xml:lang='en'><b xml:lang=''><c/>t</b></a>");
  EXPECT_EQ(utf8(XQueryNodeLanguage(named(document, "c"))), "");
  EXPECT_EQ(utf8(XQueryNodeLanguage(named(document, "c")->nextSibling())), "");
}

TEST(NodeBaseURI, IsTheNearestAttributeAsWritten) {
  const auto document =
      parse("<a xml:base='http://x/'><b xml:base='rel/'><c/>t</b><d xml:base=''/><e f='g'/></a>");
  EXPECT_EQ(utf8(XQueryNodeBaseURI(root(document))), "http://x/");
  EXPECT_EQ(utf8(XQueryNodeBaseURI(named(document, "c"))), "rel/");
  EXPECT_EQ(utf8(XQueryNodeBaseURI(named(document, "c")->nextSibling())), "rel/");
  EXPECT_EQ(utf8(XQueryNodeBaseURI(named(document, "d"))), "");
  EXPECT_EQ(utf8(XQueryNodeBaseURI(named(document, "e"))), "http://x/");
  const auto* e = cast<NSXMLElement>(named(document, "e"));
  EXPECT_EQ(utf8(XQueryNodeBaseURI(e->firstAttribute())), "http://x/");
}

TEST(NodeBaseURI, OfADocumentIsThatOfItsRootElement) {
  const auto document = parse("<?p i?><a xml:base='http://x/'/>");
  document->setURI(text("http://own/"));
  EXPECT_EQ(utf8(XQueryNodeBaseURI(document.get())), "http://x/");
  EXPECT_EQ(utf8(XQueryNodeBaseURI(document->firstChild())), "http://x/");
}

TEST(NodeBaseURI, WithoutAnAttributeThereIsNoneWhateverTheDocumentsURI) {
  const auto document = parse("<a><b/></a>");
  document->setURI(text("http://own/"));
  EXPECT_EQ(utf8(XQueryNodeBaseURI(document.get())), "");
  EXPECT_EQ(utf8(XQueryNodeBaseURI(named(document, "b"))), "");
  EXPECT_EQ(utf8(XQueryNodeBaseURI(nullptr)), "");
  EXPECT_EQ(utf8(XQueryNodeBaseURI(NSXMLDocument::document().get())), "");
  EXPECT_EQ(utf8(XQueryNodeBaseURI(NSXMLNode::textWithStringValue(view("t")).get())), "");
}

TEST(NodeDocumentURI, IsTheRootDocumentsOwn) {
  const auto document = parse("<a/>");
  EXPECT_EQ(utf8(XQueryNodeDocumentURI(root(document))), "");
  document->setURI(text("http://own/"));
  EXPECT_EQ(utf8(XQueryNodeDocumentURI(root(document))), "http://own/");
  EXPECT_EQ(utf8(XQueryNodeDocumentURI(NSXMLElement::elementWithName(view("a")).get())), "");
  EXPECT_EQ(utf8(XQueryNodeDocumentURI(nullptr)), "");
}

TEST(NodeRoot, IsTheTopmostNode) {
  const auto document = parse("<a><b/></a>");
  EXPECT_EQ(XQueryNodeRoot(named(document, "b")), document.get());
  EXPECT_EQ(XQueryNodeRoot(nullptr), nullptr);
}

TEST(NodeNamespaceForPrefix, TheOutermostDeclarationWins) {
  const auto document =
      parse("<a xmlns:p='outer' xmlns='default'><b xmlns:p='inner' xmlns:q='q'><c/></b></a>");
  const NSXMLNode* c = named(document, "c");
  EXPECT_EQ(utf8(XQueryNodeNamespaceForPrefix(c, view("p"))), "outer");
  EXPECT_EQ(utf8(XQueryNodeNamespaceForPrefix(named(document, "b"), view("p"))), "outer");
  EXPECT_EQ(utf8(XQueryNodeNamespaceForPrefix(c, view("q"))), "q");
  EXPECT_EQ(utf8(XQueryNodeNamespaceForPrefix(c, view(""))), "default");
  EXPECT_FALSE(XQueryNodeNamespaceForPrefix(c, view("r")));
  EXPECT_FALSE(XQueryNodeNamespaceForPrefix(nullptr, view("p")));
}

TEST(NodeInScopePrefixes, NearestFirstWithoutDuplicatesAndXMLAtTheEnd) {
  const auto document = parse("<a xmlns:p='1' xmlns:q='2'><b xmlns:p='3' xmlns='4'><c/></b></a>");
  EXPECT_EQ(joined(XQueryNodeInScopePrefixes(named(document, "c"))), "[p][][q][xml]");
  EXPECT_EQ(joined(XQueryNodeInScopePrefixes(root(document))), "[p][q][xml]");
}

TEST(NodeInScopePrefixes, WithoutAnyDeclarationThereAreNoneAtAll) {
  const auto document = parse("<a><b/></a>");
  EXPECT_EQ(joined(XQueryNodeInScopePrefixes(named(document, "b"))), "");
  EXPECT_EQ(joined(XQueryNodeInScopePrefixes(nullptr)), "");
}

TEST(NodeInScopePrefixes, EachDeclarationOfAnElementCountsAsWork) {
  constexpr int many = 5000;
  std::string xml = "<a";
  for (int number = 0; number < many; ++number) xml += " xmlns:p" + std::to_string(number) + "='u'";
  const auto document = parse(xml + "/>");
  int64_t stepsLeft = workMeter.stepsLeft;
  const auto prefixes = XQueryNodeInScopePrefixes(root(document));
  EXPECT_GE(stepsLeft - workMeter.stepsLeft, many / WorkPacer::turnsPerStep);
  EXPECT_EQ(prefixes.size(), many + 1U);
  stepsLeft = workMeter.stepsLeft;
  const auto URI = XQueryNodeNamespaceForPrefix(root(document), view("p7"));
  EXPECT_GE(stepsLeft - workMeter.stepsLeft, many / WorkPacer::turnsPerStep);
  EXPECT_EQ(utf8(URI), "u");
}

TEST(NodeInScopePrefixes, ADeclaredXMLPrefixIsNotAddedAgain) {
  const auto element = NSXMLElement::elementWithName(view("a"));
  ASSERT_TRUE(element->addNamespace(
      NSXMLNode::namespaceWithName(view("xml"), view("http://www.w3.org/XML/1998/namespace"))));
  ASSERT_TRUE(element->addNamespace(NSXMLNode::namespaceWithName(view("p"), view("u"))));
  EXPECT_EQ(joined(XQueryNodeInScopePrefixes(element.get())), "[xml][p]");
}

TEST(CopyNodeNamespaces, CopiesTheNearestDeclarationOfEachPrefix) {
  const auto document = parse("<a xmlns:p='1' xmlns:q='2'><b xmlns:p='3'/></a>");
  const auto namespaces = CopyXQueryNodeNamespaces(named(document, "b"));
  ASSERT_EQ(namespaces.size(), 2U);
  EXPECT_EQ(utf8(namespaces[0]->name()), "p");
  EXPECT_EQ(utf8(namespaces[0]->stringValue()), "3");
  EXPECT_EQ(utf8(namespaces[1]->name()), "q");
  EXPECT_EQ(namespaces[0]->parent(), nullptr);
  EXPECT_TRUE(CopyXQueryNodeNamespaces(root(parse("<a/>"))).empty());
}

struct EqualRow {
  const char* a;
  const char* b;
  bool equal;
};

const EqualRow equalRows[] = {
    {"<a/>", "<a/>", true},
    {"<a/>", "<b/>", false},
    {"<p:a xmlns:p='u'/>", "<q:a xmlns:q='u'/>", false},
    {"<p:a xmlns:p='u'/>", "<p:a xmlns:p='v'/>", true},
    {"<a>x</a>", "<a>x</a>", true},
    {"<a>x</a>", "<a>y</a>", false},
    {"<a>x</a>", "<a/>", false},
    {"<a/>", "<a>x</a>", false},
    {"<a><b/><c/></a>", "<a><b/><c/></a>", true},
    {"<a><b/><c/></a>", "<a><c/><b/></a>", false},
    {"<a><b/></a>", "<a><b/><b/></a>", false},
    {"<a><b/></a>", "<a>b</a>", false},
    {"<a><b><c/></b></a>", "<a><b/><c/></a>", false},
    {"<a><b><c/></b><d/></a>", "<a><b><c/></b><d/></a>", true},
    {"<a><b><c/></b><d/></a>", "<a><b><c/></b></a>", false},
    // Comments and processing instructions do not count.
    {"<a>x<!--c--></a>", "<a><?p i?>x</a>", true},
    {"<a><!--c--></a>", "<a/>", true},
    {"<a><b><!--1--></b><!--2--><c/></a>", "<a><b/><c/><?p?></a>", true},
    {"<a><b/><!--c--><d/></a>", "<a><b/></a>", false},
    // The count test: none against exactly one, and some against none.
    {"<a/>", "<a x='1'/>", false},
    {"<a/>", "<a x='1' y='2'/>", true},
    {"<a x='1' y='2'/>", "<a/>", false},
    {"<a x='1'/>", "<a/>", false},
    {"<a x='1'/>", "<a x='1'/>", true},
    {"<a x='1'/>", "<a x='1' y='2'/>", true},
    {"<a x='1' y='2'/>", "<a x='1'/>", false},
    {"<a x='1' y='2'/>", "<a y='2' x='1'/>", true},
    {"<a x='1'/>", "<a x='2'/>", false},
    {"<a x='1'/>", "<a y='1'/>", false},
    {"<a><b/></a>", "<a><b x='1'/></a>", false},
    {"<a><b/></a>", "<a><b x='1' y='1'/></a>", true},
};

TEST(NodeEqual, OfDocumentsAndElements) {
  for (const EqualRow& row : equalRows) {
    const auto a = parse(row.a);
    const auto b = parse(row.b);
    EXPECT_EQ(XQueryNodeEqual(a.get(), b.get(), nullptr), row.equal) << row.a << " " << row.b;
    EXPECT_EQ(XQueryNodeEqual(root(a), root(b), nullptr), row.equal) << row.a << " " << row.b;
  }
}

std::string elementWithAttributes(int first, int last, int step, std::string_view lastValue) {
  std::string xml = "<a";
  for (int number = first; number != last; number += step) {
    xml += " n" + std::to_string(number) + "='v'";
  }
  return xml + " last='" + std::string(lastValue) + "'/>";
}

double secondsToCompareAttributes(size_t count) {
  const int many = static_cast<int>(count);
  const auto ascending = parse(elementWithAttributes(0, many, 1, "x"));
  const auto descending = parse(elementWithAttributes(many - 1, -1, -1, "x"));
  const auto different = parse(elementWithAttributes(0, many, 1, "y"));
  const auto fewer = parse(elementWithAttributes(1, many, 1, "x"));
  const double start = processorSeconds();
  EXPECT_TRUE(XQueryNodeEqual(ascending.get(), descending.get(), nullptr));
  EXPECT_FALSE(XQueryNodeEqual(ascending.get(), different.get(), nullptr));
  EXPECT_FALSE(XQueryNodeEqual(ascending.get(), fewer.get(), nullptr));
  EXPECT_TRUE(XQueryNodeEqual(fewer.get(), ascending.get(), nullptr));
  return processorSeconds() - start;
}

TEST(NodeEqual, ManyAttributesAreFoundByName) {
  EXPECT_TRUE(growsInProportion(secondsToCompareAttributes, 6000));
}

TEST(NodeEqual, ANodeIsEqualToItselfAndToNoOtherKind) {
  const auto document = parse("<a x='1'>t</a>");
  EXPECT_TRUE(XQueryNodeEqual(document.get(), document.get(), nullptr));
  EXPECT_FALSE(XQueryNodeEqual(document.get(), root(document), nullptr));
  EXPECT_FALSE(XQueryNodeEqual(root(document)->firstChild(),
                               NSXMLNode::commentWithStringValue(view("t")).get(), nullptr));
  EXPECT_FALSE(XQueryNodeEqual(document.get(), nullptr, nullptr));
}

TEST(NodeEqual, OfDocumentsLooksAtTheRootElementsOnly) {
  EXPECT_TRUE(XQueryNodeEqual(parse("<!--x--><a/>").get(), parse("<a/>").get(), nullptr));
  const auto empty = NSXMLDocument::document();
  EXPECT_TRUE(XQueryNodeEqual(empty.get(), NSXMLDocument::document().get(), nullptr));
  EXPECT_FALSE(XQueryNodeEqual(empty.get(), parse("<a/>").get(), nullptr));
}

TEST(NodeEqual, NamedLeavesByNameAndTextOthersByText) {
  const auto equal = [](const Ref<NSXMLNode>& a, const Ref<NSXMLNode>& b) {
    return XQueryNodeEqual(a.get(), b.get(), nullptr);
  };
  const auto attribute = [](const char* name, const char* value) {
    return NSXMLNode::attributeWithName(view(name), view(value));
  };
  EXPECT_TRUE(equal(attribute("a", "v"), attribute("a", "v")));
  EXPECT_FALSE(equal(attribute("a", "v"), attribute("b", "v")));
  EXPECT_FALSE(equal(attribute("a", "v"), attribute("a", "w")));
  const auto declaration = [](const char* name, const char* value) {
    return NSXMLNode::namespaceWithName(view(name), view(value));
  };
  EXPECT_TRUE(equal(declaration("p", "u"), declaration("p", "u")));
  EXPECT_FALSE(equal(declaration("p", "u"), declaration("q", "u")));
  const auto instruction = [](const char* name, const char* value) {
    return NSXMLNode::processingInstructionWithName(view(name), view(value));
  };
  EXPECT_TRUE(equal(instruction("p", "u"), instruction("p", "u")));
  EXPECT_FALSE(equal(instruction("p", "u"), instruction("p", "v")));
  EXPECT_FALSE(equal(instruction("p", "u"), instruction("q", "u")));
  EXPECT_TRUE(equal(NSXMLNode::commentWithStringValue(view("c")),
                    NSXMLNode::commentWithStringValue(view("c"))));
  EXPECT_FALSE(equal(NSXMLNode::commentWithStringValue(view("c")),
                     NSXMLNode::commentWithStringValue(view("d"))));
  EXPECT_TRUE(
      equal(NSXMLNode::textWithStringValue(view("c")), NSXMLNode::textWithStringValue(view("c"))));
}

std::string nestedElements(int depth, std::string_view innermost) {
  std::string xml;
  for (int level = 0; level < depth; ++level) xml += "<a>";
  xml += innermost;
  for (int level = 0; level < depth; ++level) xml += "</a>";
  return xml;
}

TEST(NodeFunctions, AMillionElementsDeepCostNoStack) {
  constexpr int depth = 1000000;
  const auto document = parse(nestedElements(depth, "x"));
  const auto same = parse(nestedElements(depth, "x"));
  const auto other = parse(nestedElements(depth, "y"));
  EXPECT_TRUE(XQueryNodeEqual(document.get(), same.get(), nullptr));
  EXPECT_FALSE(XQueryNodeEqual(document.get(), other.get(), nullptr));
  EXPECT_EQ(utf8(XQueryNodeStringValue(document.get())), "x");
  NSMutableString string;
  XQueryNodeAddChildTextValues(document.get(), string);
  EXPECT_EQ(utf8(string.string()), "x");
  const NSXMLNode* deepest = document->firstChild();
  while (deepest->firstChild()) deepest = deepest->firstChild();
  EXPECT_EQ(utf8(XQueryNodeBaseURI(deepest)), "");
  EXPECT_FALSE(XQueryNodeLanguage(deepest));
  EXPECT_FALSE(XQueryNodeNamespaceForPrefix(deepest, view("p")));
  EXPECT_TRUE(XQueryNodeInScopePrefixes(deepest).empty());
}

TEST(NodeResolveID, IsNotSupported) {
  const auto document = parse("<a id='x'/>");
  EXPECT_FALSE(XQueryNodeResolveID(document.get(), view("x")));
  EXPECT_FALSE(XQueryNodeResolveIDRef(document.get(), view("x")));
}

TEST(NodeRepresentation, IsTheNodesXML) {
  EXPECT_EQ(utf8(XQueryNodeStringRepresentaion(root(parse("<a x=\"1\"><b/></a>")))),
            "<a x=\"1\"><b/></a>");
}

TEST(NodeFromText, ParsesOrAnswersNull) {
  const auto document = XQueryNodeFromString(*text("<a>\xC3\xA9</a>"), 0);
  ASSERT_TRUE(document);
  EXPECT_EQ(utf8(XQueryNodeStringValue(document.get())), "\xC3\xA9");
  EXPECT_FALSE(XQueryNodeFromString(*text("<a>"), 0));
  EXPECT_FALSE(XQueryNodeFromString(*text(""), 0));
  EXPECT_TRUE(XQueryNodeFromData(*NSData::dataWithBytes("<a/>"), 0));
  EXPECT_FALSE(XQueryNodeFromData(*NSData::dataWithBytes("no XML"), 0));
}

TEST(NodeFromText, TheOptionsGoToTheParser) {
  const auto kept = XQueryNodeFromString(*text("<a> <b/> </a>"), NSXMLNodePreserveWhitespace);
  const auto dropped = XQueryNodeFromString(*text("<a> <b/> </a>"), 0);
  EXPECT_EQ(root(kept)->childCount(), 3U);
  EXPECT_EQ(root(dropped)->childCount(), 1U);
}

TEST(NodeConstructors, TextAndCDATABothMakeOrdinaryTextNodes) {
  const auto string = text("a<b");
  EXPECT_EQ(utf8(XQueryXMLNodeText(*string)->XMLString()), "a&lt;b");
  EXPECT_EQ(utf8(XQueryXMLNodeCDATA(*string)->XMLString()), "a&lt;b");
  EXPECT_EQ(XQueryXMLNodeCDATA(*string)->kind(), Kind::Text);
}

TEST(NodeConstructors, ACommentHoldsNoDoubleHyphenAndEndsInNone) {
  for (const char* refused : {"a--b", "--", "-", "a-", "a--"}) {
    EXPECT_FALSE(XQueryXMLNodeComment(*text(refused))) << refused;
  }
  for (const char* accepted : {"", "a", "-a", "a-b-c"}) {
    const auto comment = XQueryXMLNodeComment(*text(accepted));
    ASSERT_TRUE(comment) << accepted;
    EXPECT_EQ(comment->kind(), Kind::Comment);
    EXPECT_EQ(utf8(comment->stringValue()), accepted);
  }
}

TEST(NodeConstructors, XMLInAnyLetterCaseIsNoTarget) {
  for (const char* refused : {"xml", "XML", "xMl"}) {
    EXPECT_FALSE(XQueryXMLNodePI(*text(refused), *text("i"))) << refused;
  }
  for (const char* accepted : {"xml2", "p", "xm", "yml"}) {
    const auto instruction = XQueryXMLNodePI(*text(accepted), *text("i"));
    ASSERT_TRUE(instruction) << accepted;
    EXPECT_EQ(utf8(instruction->name()), accepted);
    EXPECT_EQ(utf8(instruction->stringValue()), "i");
  }
}

TEST(NodeConstructors, AttributesAndNamespacesCarryNameAndValue) {
  const auto attribute = XQueryXMLNodeAttribute(*text("a"), *text("v"));
  EXPECT_EQ(attribute->kind(), Kind::Attribute);
  EXPECT_EQ(utf8(attribute->name()), "a");
  EXPECT_EQ(utf8(attribute->stringValue()), "v");
  const auto declaration = XQueryXMLNodeNamespace(*text("p"), *text("u"));
  EXPECT_EQ(declaration->kind(), Kind::Namespace);
  EXPECT_EQ(utf8(declaration->name()), "p");
  EXPECT_EQ(utf8(declaration->stringValue()), "u");
}

TEST(NamespacesEqual, OneTrailingSlashMayDiffer) {
  const EqualRow rows[] = {
      {"u", "u", true},          {"u", "u/", true},   {"u/", "u", true}, {"u", "u#", false},
      {"u", "u//", false},       {"u/", "u//", true}, {"", "/", true},   {"", "", true},
      {"urn:a", "urn:b", false}, {"a", "b/", false},  {"", "u", false},
  };
  for (const EqualRow& row : rows) {
    EXPECT_EQ(XQueryNamespacesEqual(view(row.a), view(row.b)), row.equal) << row.a << " " << row.b;
  }
}

}  // namespace
}  // namespace xquery

// Trees that are built and changed with checks, and documents that are frozen.
#include "TypesTestSupport.h"
#include "xquery/Building.h"

#include <array>
#include <thread>

namespace xquery {
namespace {

using testing::parse;
using testing::view;

constexpr const char* notUTF8 = "6 the text is not well-formed UTF-8";
constexpr const char* frozen = "0 the document is frozen";
constexpr const char* misplaced = "0 the node cannot be there";
constexpr const char* notDistinct = "25 Attribute name not distinct";
constexpr const char* invalidNamespace = "70 invalid namespace declaration";

std::string said(const Ref<XQueryError>& error) {
  return error ? std::to_string(error->err()) + " " + error->msg()->utf8() : "done";
}

std::string after(const XQueryResult<void>& result) {
  return said(result.error());
}

template <class Node>
std::string made(const XQueryResult<Ref<Node>>& result) {
  return result ? (*result)->XMLString()->utf8() : said(result.error());
}

Ref<NSXMLElement> element(std::string_view name = "a") {
  return *XQueryMakeElement(name);
}

Ref<NSXMLNode> text(std::string_view content = "t") {
  return *XQueryMakeText(content);
}

// --- making --------------------------------------------------------------------------------------

TEST(Building, MakesNodesOfEachKind) {
  EXPECT_EQ(made(XQueryMakeElement("a")), "<a/>");
  EXPECT_EQ(made(XQueryMakeElement("p:a", "urn:p")), "<p:a xmlns:p=\"urn:p\"/>");
  EXPECT_EQ(made(XQueryMakeElement("ä", "urn:d")), "<ä xmlns=\"urn:d\"/>");
  EXPECT_EQ(made(XQueryMakeAttribute("b", "<\"")), "b=\"&lt;&quot;\"");
  EXPECT_EQ(made(XQueryMakeText("a<b")), "a&lt;b");
  EXPECT_EQ(made(XQueryMakeCDATA("a<b")), "<![CDATA[a<b]]>");
  EXPECT_EQ(made(XQueryMakeComment(" c ")), "<!-- c -->");
  EXPECT_EQ(made(XQueryMakeProcessingInstruction("p", "q")), "<?p q?>");
  const auto declaration = XQueryMakeNamespace("p", "urn:p");
  ASSERT_TRUE(declaration);
  EXPECT_EQ((*declaration)->kind(), Kind::Namespace);
}

TEST(Building, RefusesNamesThatAreNone) {
  for (const char* name : {"", "1a", "a b", "a:", ":a", "a:b:c", "a<", "-a"}) {
    const std::string refused = "6 \"" + std::string(name) + "\" is not of the form of xs:QName";
    EXPECT_EQ(made(XQueryMakeElement(name, "urn:u")), refused);
    EXPECT_EQ(made(XQueryMakeAttribute(name, "", "urn:u")), refused);
  }
  for (const char* target : {"", "a:b", "xml", "XmL", "1"}) {
    EXPECT_EQ(made(XQueryMakeProcessingInstruction(target, "")),
              "6 \"" + std::string(target) + "\" is not of the form of xs:NCName");
  }
  EXPECT_EQ(made(XQueryMakeNamespace("a:b", "urn:u")), "6 \"a:b\" is not of the form of xs:NCName");
}

// Namespaces in XML 1.0, sections 3 and 6.
TEST(Building, RefusesNamespacesThatPrefixesCannotHave) {
  constexpr const char* XML = "http://www.w3.org/XML/1998/namespace";
  constexpr const char* declarations = "http://www.w3.org/2000/xmlns/";
  EXPECT_EQ(made(XQueryMakeElement("p:a")), invalidNamespace);
  EXPECT_EQ(made(XQueryMakeAttribute("p:a", "")), invalidNamespace);
  EXPECT_EQ(made(XQueryMakeAttribute("a", "", "urn:u")), invalidNamespace);
  EXPECT_EQ(made(XQueryMakeElement("xml:a", "urn:u")), invalidNamespace);
  EXPECT_EQ(made(XQueryMakeElement("a", XML)), invalidNamespace);
  EXPECT_EQ(made(XQueryMakeAttribute("xml:id", "i", XML)), "xml:id=\"i\"");
  EXPECT_EQ(made(XQueryMakeAttribute("xmlns", "urn:u")), "44 Attribute namesapce is xmlns");
  EXPECT_EQ(made(XQueryMakeAttribute("xmlns:a", "u", declarations)),
            "44 Attribute namesapce is xmlns");
  EXPECT_EQ(made(XQueryMakeElement("a", declarations)), "44 Attribute namesapce is xmlns");
  EXPECT_EQ(made(XQueryMakeNamespace("p", "")), invalidNamespace);
  EXPECT_EQ(made(XQueryMakeNamespace("xmlns", "urn:u")), invalidNamespace);
  EXPECT_EQ(made(XQueryMakeNamespace("xml", "urn:u")), invalidNamespace);
  EXPECT_EQ(made(XQueryMakeNamespace("p", XML)), invalidNamespace);
  EXPECT_EQ(made(XQueryMakeNamespace("", declarations)), invalidNamespace);
  EXPECT_TRUE(XQueryMakeNamespace("", ""));
  EXPECT_TRUE(XQueryMakeNamespace("xml", XML));
}

TEST(Building, RefusesTextThatIsNoXML) {
  const std::string character = "6 the text holds the character U+0001, which XML does not have";
  EXPECT_EQ(made(XQueryMakeElement("\xFF")), notUTF8);
  EXPECT_EQ(made(XQueryMakeElement("a", "\xFF")), notUTF8);
  EXPECT_EQ(made(XQueryMakeAttribute("a", "\xFF")), notUTF8);
  EXPECT_EQ(made(XQueryMakeAttribute("a", "\x01")), character);
  EXPECT_EQ(made(XQueryMakeText("\x01")), character);
  EXPECT_EQ(made(XQueryMakeCDATA("\x01")), character);
  EXPECT_EQ(made(XQueryMakeComment("\x01")), character);
  EXPECT_EQ(made(XQueryMakeProcessingInstruction("p", "\x01")), character);
  EXPECT_EQ(made(XQueryMakeNamespace("p", "\x01")), character);
  EXPECT_EQ(made(XQueryMakeCDATA("a]]>b")), "0 a CDATA section cannot contain ]]>");
  EXPECT_EQ(made(XQueryMakeComment("a--b")), "72 invalid comment");
  EXPECT_EQ(made(XQueryMakeComment("a-")), "72 invalid comment");
  EXPECT_EQ(made(XQueryMakeProcessingInstruction("p", "a?>b")),
            "26 processing instruction content cannot contain ?>");
}

// --- changing ------------------------------------------------------------------------------------

TEST(Building, PutsATreeTogether) {
  const auto document = NSXMLDocument::document();
  const auto root = element("r");
  ASSERT_EQ(after(XQueryAddChild(*document, *XQueryMakeComment("c"))), "done");
  ASSERT_EQ(after(XQueryAddChild(*document, root)), "done");
  ASSERT_EQ(after(XQueryAddChild(*root, text("2"))), "done");
  ASSERT_EQ(after(XQueryInsertChild(*root, element("one"), 0)), "done");
  ASSERT_EQ(after(XQueryInsertChild(*root, element("three"), 99)), "done");
  ASSERT_EQ(after(XQuerySetAttribute(*root, "n", "1")), "done");
  ASSERT_EQ(after(XQuerySetAttribute(*root, "p:n", "2", "urn:p")), "done");
  ASSERT_EQ(after(XQuerySetAttribute(*root, "n", "3")), "done");
  ASSERT_EQ(after(XQueryAddNamespace(*root, *XQueryMakeNamespace("q", "urn:q"))), "done");
  EXPECT_EQ(root->XMLString()->utf8(),
            "<r xmlns:q=\"urn:q\" xmlns:p=\"urn:p\" n=\"3\" p:n=\"2\"><one/>2<three/></r>");
  ASSERT_EQ(after(XQueryRemove(*root->firstChild())), "done");
  ASSERT_EQ(after(XQueryRemove(*root->attributeForName(view("n")))), "done");
  ASSERT_EQ(after(XQuerySetText(*root->firstChild(), "two")), "done");
  EXPECT_EQ(root->stringValue()->utf8(), "two");
  ASSERT_EQ(after(XQuerySetText(*root, "")), "done");
  EXPECT_EQ(root->childCount(), 0u);
}

TEST(Building, KeepsTheIdentityOfWhatItPutsInAndTakesOut) {
  const auto parent = element();
  const auto child = element("b");
  ASSERT_TRUE(XQueryAddChild(*parent, child));
  EXPECT_EQ(parent->firstChild(), child.get());
  ASSERT_TRUE(XQueryRemove(*child));
  EXPECT_EQ(child->parent(), nullptr);
  EXPECT_EQ(after(XQueryRemove(*child)), "done");
  EXPECT_EQ(after(XQueryAddChild(*parent, child)), "done");
}

TEST(Building, RefusesNodesThatCannotBeThere) {
  const auto parent = element();
  const auto child = element("b");
  const auto document = NSXMLDocument::document();
  ASSERT_TRUE(XQueryAddChild(*parent, child));
  EXPECT_EQ(after(XQueryAddChild(*parent, nullptr)), misplaced);
  EXPECT_EQ(after(XQueryAddChild(*parent, child)), "0 the node has a parent already");
  EXPECT_EQ(after(XQueryAddChild(*child, parent)), misplaced);
  EXPECT_EQ(after(XQueryAddChild(*parent, parent)), misplaced);
  EXPECT_EQ(after(XQueryAddChild(*parent, document)), misplaced);
  EXPECT_EQ(after(XQueryAddChild(*parent, *XQueryMakeAttribute("b", ""))), misplaced);
  EXPECT_EQ(after(XQueryAddChild(*parent, *XQueryMakeNamespace("p", "u"))), misplaced);
  EXPECT_EQ(after(XQueryAddChild(*text(), text())), misplaced);
  EXPECT_EQ(after(XQueryAddAttribute(*parent, text())), misplaced);
  EXPECT_EQ(after(XQueryAddAttribute(*parent, nullptr)), misplaced);
  EXPECT_EQ(after(XQueryAddNamespace(*parent, *XQueryMakeAttribute("b", ""))), misplaced);
  EXPECT_EQ(parent->XMLString()->utf8(), "<a><b/></a>");
}

TEST(Building, ADocumentTakesOneElementAndNoText) {
  constexpr const char* refused = "28 invalid node for document";
  const auto document = NSXMLDocument::document();
  EXPECT_EQ(after(XQueryAddChild(*document, text())), refused);
  EXPECT_EQ(after(XQueryAddChild(*document, NSXMLDocument::document())), refused);
  EXPECT_EQ(after(XQueryAddChild(*document, *XQueryMakeAttribute("b", ""))), misplaced);
  EXPECT_EQ(after(XQueryAddChild(*document, element())), "done");
  EXPECT_EQ(after(XQueryAddChild(*document, element())), refused);
  EXPECT_EQ(after(XQueryInsertChild(*document, *XQueryMakeComment("c"), 0)), "done");
  EXPECT_EQ(after(XQuerySetText(*document, "t")), refused);
  EXPECT_EQ(document->rootElement()->XMLString()->utf8(), "<a/>");
}

TEST(Building, NoTwoAttributesHaveOneName) {
  const auto parent = element();
  ASSERT_TRUE(XQueryAddAttribute(*parent, *XQueryMakeAttribute("p:b", "1", "urn:p")));
  EXPECT_EQ(after(XQueryAddAttribute(*parent, *XQueryMakeAttribute("q:b", "2", "urn:p"))),
            notDistinct);
  EXPECT_EQ(after(XQueryAddAttribute(*parent, *XQueryMakeAttribute("p:b", "2", "urn:q"))),
            notDistinct);
  EXPECT_EQ(after(XQueryAddAttribute(*parent, *XQueryMakeAttribute("b", "2"))), "done");
  EXPECT_EQ(parent->attributeCount(), 2u);
}

TEST(Building, NoPrefixIsDeclaredTwice) {
  const auto parent = element();
  ASSERT_TRUE(XQueryAddNamespace(*parent, *XQueryMakeNamespace("p", "urn:1")));
  EXPECT_EQ(after(XQueryAddNamespace(*parent, *XQueryMakeNamespace("p", "urn:2"))),
            invalidNamespace);
}

TEST(Building, ATextThatIsRefusedChangesNothing) {
  const auto parent = element();
  const std::array<Ref<NSXMLNode>, 3> nodes = {
      *XQueryMakeComment("c"), *XQueryMakeProcessingInstruction("p", "q"), *XQueryMakeCDATA("d")};
  for (const auto& node : nodes) ASSERT_TRUE(XQueryAddChild(*parent, node));
  EXPECT_EQ(after(XQuerySetText(*nodes[0], "--")), "72 invalid comment");
  EXPECT_EQ(after(XQuerySetText(*nodes[1], "?>")),
            "26 processing instruction content cannot contain ?>");
  EXPECT_EQ(after(XQuerySetText(*nodes[2], "]]>")), "0 a CDATA section cannot contain ]]>");
  EXPECT_EQ(after(XQuerySetText(*parent, "\xFF")), notUTF8);
  EXPECT_EQ(after(XQuerySetAttribute(*parent, "b", "\xFF")), notUTF8);
  EXPECT_EQ(after(XQuerySetAttribute(*parent, "1", "")), "6 \"1\" is not of the form of xs:QName");
  const auto declaration = *XQueryMakeNamespace("p", "urn:p");
  EXPECT_EQ(after(XQuerySetText(*declaration, "")), invalidNamespace);
  EXPECT_EQ(parent->XMLString()->utf8(), "<a><!--c--><?p q?><![CDATA[d]]></a>");
}

// --- frozen documents ----------------------------------------------------------------------------

TEST(FrozenDocument, RefusesEveryChange) {
  const std::string XML = "<a b=\"1\"><c>t</c></a>";
  const Ref<NSXMLDocument> document = parse(XML);
  EXPECT_FALSE(XQueryIsFrozen(*document));
  ASSERT_EQ(XQueryFreeze(document), document);
  NSXMLElement& root = *document->rootElement();
  NSXMLNode& attribute = *root.firstAttribute();
  NSXMLNode& child = *root.firstChild();
  EXPECT_TRUE(XQueryIsFrozen(*document));
  EXPECT_TRUE(XQueryIsFrozen(attribute));
  EXPECT_TRUE(XQueryIsFrozen(*child.firstChild()));
  EXPECT_EQ(after(XQueryAddChild(*document, *XQueryMakeComment("c"))), frozen);
  EXPECT_EQ(after(XQueryAddChild(root, text())), frozen);
  EXPECT_EQ(after(XQueryInsertChild(child, text(), 0)), frozen);
  EXPECT_EQ(after(XQueryAddAttribute(root, *XQueryMakeAttribute("d", ""))), frozen);
  EXPECT_EQ(after(XQueryAddNamespace(root, *XQueryMakeNamespace("p", "u"))), frozen);
  EXPECT_EQ(after(XQuerySetAttribute(root, "b", "2")), frozen);
  EXPECT_EQ(after(XQuerySetAttribute(root, "d", "2")), frozen);
  EXPECT_EQ(after(XQuerySetText(root, "u")), frozen);
  EXPECT_EQ(after(XQuerySetText(*child.firstChild(), "u")), frozen);
  EXPECT_EQ(after(XQuerySetText(attribute, "2")), frozen);
  EXPECT_EQ(after(XQueryRemove(child)), frozen);
  EXPECT_EQ(after(XQueryRemove(attribute)), frozen);
  EXPECT_EQ(root.XMLString()->utf8(), XML);
}

TEST(FrozenDocument, RefusesWhatTheMembersOfItsNodesWouldChange) {
  const std::string XML = "<a b=\"1\"><c>t</c></a>";
  const Ref<NSXMLDocument> document = XQueryFreeze(parse(XML));
  NSXMLElement& root = *document->rootElement();
  EXPECT_FALSE(document->addChild(*XQueryMakeComment("c")));
  EXPECT_FALSE(document->insertChild(*XQueryMakeComment("c"), 0));
  EXPECT_FALSE(root.addChild(text()));
  EXPECT_FALSE(root.insertChild(text(), 0));
  EXPECT_FALSE(root.addAttribute(*XQueryMakeAttribute("d", "")));
  EXPECT_FALSE(root.addNamespace(*XQueryMakeNamespace("p", "u")));
  root.removeAttributeForName(view("b"));
  root.setStringValue(view("u"));
  root.firstChild()->detach();
  root.firstChild()->firstChild()->setStringValue(view("u"));
  document->setURI(testing::text("urn:u"));
  EXPECT_EQ(root.XMLString()->utf8(), XML);
  EXPECT_FALSE(document->documentURI());
}

TEST(FrozenDocument, ItsCopiesCanBeChanged) {
  const Ref<NSXMLDocument> document = XQueryFreeze(parse("<a/>"));
  const Ref<NSXMLNode> copy = document->rootElement()->copy();
  EXPECT_FALSE(XQueryIsFrozen(*copy));
  EXPECT_EQ(after(XQueryAddChild(*copy, text())), "done");
  EXPECT_EQ(copy->XMLString()->utf8(), "<a>t</a>");
  const Ref<NSXMLNode> whole = document->copy();
  EXPECT_EQ(after(XQueryRemove(*whole->firstChild())), "done");
}

// What a copy of nodes that were in a frozen document is joined with stays as it was.
TEST(FrozenDocument, DoesNotFreezeWhatItsCopiesArePutInto) {
  const Ref<NSXMLDocument> document = XQueryFreeze(parse("<a/>"));
  const auto parent = element("p");
  ASSERT_EQ(after(XQueryAddChild(*parent, document->rootElement()->copy())), "done");
  EXPECT_FALSE(XQueryIsFrozen(*parent));
  EXPECT_EQ(after(XQueryAddChild(*parent, Ref<NSXMLNode>(document->rootElement()))),
            "0 the node has a parent already");
  EXPECT_EQ(after(XQueryAddChild(*parent, document)), misplaced);
  EXPECT_TRUE(XQueryIsFrozen(*document));
  EXPECT_EQ(after(XQueryAddChild(*parent, text())), "done");
}

TEST(FrozenDocument, RefusesNewDeclarationsAndNewURIsOfThoseItHas) {
  const Ref<NSXMLDocument> document = parse("<a xmlns:p=\"urn:p\"><?i c?><!--c--></a>");
  document->setURI(testing::text("urn:d"));
  ASSERT_EQ(XQueryFreeze(document), document);
  NSXMLElement& root = *document->rootElement();
  NSXMLNode& declaration = *root.firstNamespace();
  document->setURI(nullptr);
  declaration.setStringValue(view("urn:q"));
  declaration.detach();
  root.firstChild()->setStringValue(view("d"));
  root.lastChild()->setStringValue(view("d"));
  EXPECT_EQ(after(XQuerySetText(declaration, "urn:q")), frozen);
  EXPECT_EQ(after(XQueryRemove(declaration)), frozen);
  EXPECT_EQ(document->documentURI()->utf8(), "urn:d");
  EXPECT_EQ(root.XMLString()->utf8(), "<a xmlns:p=\"urn:p\"><?i c?><!--c--></a>");
}

TEST(FrozenDocument, OfWhichNodesWereTakenOutIsACopy) {
  const Ref<NSXMLDocument> document = parse("<a><b/><c/></a>");
  const Ref<NSXMLNode> taken = document->rootElement()->firstChild();
  ASSERT_TRUE(XQueryRemove(*taken));
  const Ref<NSXMLDocument> copy = XQueryFreeze(document);
  EXPECT_FALSE(copy == document);
  EXPECT_TRUE(XQueryIsFrozen(*copy));
  EXPECT_FALSE(XQueryIsFrozen(*document));
  EXPECT_EQ(copy->rootElement()->XMLString()->utf8(), "<a><c/></a>");
  EXPECT_EQ(after(XQueryAddChild(*taken, text())), "done");
  EXPECT_EQ(after(XQueryAddChild(*document->rootElement(), taken)), "done");
}

TEST(FrozenDocument, MayBeFrozenAgainAndNothingIsNothing) {
  const Ref<NSXMLDocument> document = XQueryFreeze(parse("<a/>"));
  EXPECT_EQ(XQueryFreeze(document), document);
  EXPECT_FALSE(XQueryFreeze(nullptr));
}

TEST(FrozenDocument, IsCopiedIntoWhatQueriesConstruct) {
  const Ref<NSXMLDocument> document = XQueryFreeze(parse("<a><b/></a>"));
  const auto query = XQuery::xqueryWithSource("<r>{//b}</r>, document {/a}");
  const auto items = XQueryContext::xqueryContext()->evaluateXQuery(*query, {}, document);
  ASSERT_TRUE(items);
  EXPECT_EQ(cast<NSXMLNode>(items->objects()[0])->XMLString()->utf8(), "<r><b/></r>");
  EXPECT_FALSE(XQueryIsFrozen(*cast<NSXMLNode>(items->objects()[1])));
  EXPECT_EQ(document->rootElement()->XMLString()->utf8(), "<a><b/></a>");
}

// Nodes that a query constructed, put together by the host and shared afterwards.
TEST(FrozenDocumentConcurrency, IsReadByThreads) {
  const auto query = XQuery::xqueryWithSource("<a>{for $i in 1 to 500 return <b n='{$i}'/>}</a>");
  const auto items = XQueryContext::xqueryContext()->evaluateXQuery(*query, {}, {});
  const auto document = NSXMLDocument::document();
  ASSERT_TRUE(XQueryAddChild(*document, cast<NSXMLNode>(items->objects().front())));
  const Ref<NSXMLDocument> shared = XQueryFreeze(document);
  const auto count = XQuery::xqueryWithSource("count(//b[@n > 100]/..//b) + count(<c>{/a}</c>//b)");
  std::array<std::string, 4> answers;
  std::vector<std::thread> threads;
  for (std::string& answer : answers) {
    threads.emplace_back([&] {
      const auto found = XQueryContext::xqueryContext()->evaluateXQuery(*count, {}, shared);
      if (found) answer = XQueryItemStringValue(*found->objectAtIndex(0));
      shared->rootElement()->detach();  // refused, and so no harm to the others
      if (XQueryFreeze(shared) != shared) answer = "copied";
    });
  }
  for (std::thread& thread : threads) thread.join();
  for (const std::string& answer : answers) EXPECT_EQ(answer, "1000");
}

}  // namespace
}  // namespace xquery

#include "Platform/Base/ProcessorTime.h"
#include "Platform/Tree/Arena.h"
#include "Platform/Tree/XMLTestSupport.h"
#include "xquery/Serializing.h"
#include "xquery/XMLNode.h"

#include <gtest/gtest.h>

#include <functional>
#include <random>
#include <set>
#include <string>
#include <string_view>

namespace xquery {
namespace {

constexpr uint32_t keepAll = NSXMLNodePreserveWhitespace | NSXMLNodePreserveCDATA;
constexpr std::string_view namespaceOfXML = "http://www.w3.org/XML/1998/namespace";
constexpr std::string_view namespaceOfDeclarations = "http://www.w3.org/2000/xmlns/";

std::string written(const NSXMLNode* node) {
  std::string out;
  node->appendXMLTo(out);
  return out;
}

std::string rewritten(std::string_view text) {
  return written(parsed(text, keepAll)->rootElement());
}

NSStringView wide(std::u16string_view text) {
  return {text.data(), static_cast<uint32_t>(text.size())};
}

TEST(XMLSerializer, WhatIsWrittenPlainlyIsWrittenBackTheSame) {
  for (const char* text : {
           "<a/>",
           "<a>text</a>",
           "<a x=\"1\" y=\"\"><b/> <b></b></a>",
           "<a xmlns=\"u\" xmlns:p=\"v\"><p:b p:x=\"1\"/></a>",
           "<p:a xmlns:p=\"u\"><b/><p:c xmlns:p=\"v\"/><p:d xmlns:p=\"u\"/></p:a>",
           "<a xmlns=\"u\"><b xmlns=\"\"><c xmlns=\"u\"/></b></a>",
           "<a><!--c--><?p?><?p q r?></a>",
           "<a>&amp;&lt;&gt;\"'</a>",
           "<a>x&#xD;\ny</a>",
           "<a x=\"&amp;&lt;>&quot;'&#x9;&#xA;&#xD; \"/>",
           "<a><![CDATA[<x> & ]]></a>",
           "<a xml:lang=\"en\" xml:space=\"preserve\"> </a>",
           "<\xC3\xA9 \xC3\xA9=\"\xE2\x82\xAC\">\xF0\x9F\x98\x80&lt;</\xC3\xA9>",
       }) {
    std::string expected = text;
    if (const size_t at = expected.find("<b></b>"); at != std::string::npos) {
      expected.replace(at, 7, "<b/>");
    }
    EXPECT_EQ(rewritten(text), expected);
  }
}

TEST(XMLSerializer, OnlyADocumentHasADeclaration) {
  const auto document = parsed("<!--x--><a/><?p?>");
  EXPECT_EQ(document->XMLString()->utf8(),
            "<?xml version=\"1.0\" encoding=\"UTF-8\"?>\n<!--x--><a/><?p?>");
  EXPECT_EQ(document->rootElement()->XMLString()->utf8(), "<a/>");
}

TEST(XMLSerializer, LeavesAreWrittenAlone) {
  EXPECT_EQ(written(NSXMLNode::attributeWithName(A("p:x"), A("a\"<b"), A("u")).get()),
            "p:x=\"a&quot;&lt;b\"");
  EXPECT_EQ(written(NSXMLNode::namespaceWithName(A("p"), A("u")).get()), "xmlns:p=\"u\"");
  EXPECT_EQ(written(NSXMLNode::namespaceWithName({}, A("u")).get()), "xmlns=\"u\"");
  EXPECT_EQ(written(NSXMLNode::textWithStringValue(A("a<b>&")).get()), "a&lt;b&gt;&amp;");
  EXPECT_EQ(written(NSXMLNode::cdataWithStringValue(A("a<b")).get()), "<![CDATA[a<b]]>");
  EXPECT_EQ(written(NSXMLNode::commentWithStringValue(A("c")).get()), "<!--c-->");
  EXPECT_EQ(written(NSXMLNode::processingInstructionWithName(A("p"), A("")).get()), "<?p?>");
}

TEST(XMLSerializer, WhatWouldEndEarlyIsSeparated) {
  EXPECT_EQ(written(NSXMLNode::commentWithStringValue(A("a--b---")).get()), "<!--a- -b- - - -->");
  EXPECT_EQ(written(NSXMLNode::processingInstructionWithName(A("p"), A("a?>b")).get()),
            "<?p a? >b?>");
  EXPECT_EQ(written(NSXMLNode::cdataWithStringValue(A("a]]>b")).get()),
            "<![CDATA[a]]]]><![CDATA[>b]]>");
  EXPECT_EQ(written(NSXMLNode::cdataWithStringValue(A("a\rb")).get()),
            "<![CDATA[a]]>&#xD;<![CDATA[b]]>");
}

TEST(XMLSerializer, CharactersThatXMLCannotHoldAreReplaced) {
  const std::string mark = "\xEF\xBF\xBD";
  EXPECT_EQ(written(NSXMLNode::textWithStringValue(wide(u"a\xD800z\xDC00")).get()),
            "a" + mark + "z" + mark);
  EXPECT_EQ(written(NSXMLNode::textWithStringValue(A("a\x01"
                                                     "b"))
                        .get()),
            "a" + mark + "b");
  EXPECT_EQ(written(NSXMLNode::textWithStringValue(wide(u"\xFFFE\u00e9\x1F")).get()),
            mark + "\xC3\xA9" + mark);
  EXPECT_EQ(written(NSXMLNode::textWithStringValue(wide(u"\xD83D\xDE00")).get()),
            "\xF0\x9F\x98\x80");
}

TEST(XMLSerializer, LongWideTextIsWrittenWhole) {
  // Longer than a run, with pairs at every place where one might be cut.
  for (size_t length = 8180; length < 8200; ++length) {
    std::u16string text(length, u'\u00e9');
    std::string expected;
    for (size_t index = 0; index < length; ++index) expected += "\xC3\xA9";
    for (int pair = 0; pair < 20; ++pair) {
      text += u"\U0001F600";
      expected += "\xF0\x9F\x98\x80";
    }
    ASSERT_EQ(written(NSXMLNode::textWithStringValue(wide(text)).get()), expected) << length;
  }
}

// --- namespaces --------------------------------------------------------------------------------

TEST(XMLSerializer, AFragmentDeclaresWhatItUsesOfTheDeclarationsAbove) {
  const auto document = parsed(
      "<a xmlns:p='up' xmlns:q='uq' xmlns:r='ur' xmlns='d'><b><p:c q:x='1'/></b><e xmlns=''/></a>");
  const NSXMLNode* b = document->rootElement()->firstChild();
  EXPECT_EQ(written(b), "<b xmlns:p=\"up\" xmlns:q=\"uq\" xmlns=\"d\"><p:c q:x=\"1\"/></b>");
  EXPECT_EQ(written(b->firstChild()), "<p:c xmlns:p=\"up\" xmlns:q=\"uq\" q:x=\"1\"/>");
  EXPECT_EQ(written(document->rootElement()->lastChild()), "<e xmlns=\"\"/>");
}

TEST(XMLSerializer, TheNearestDeclarationAboveCounts) {
  const auto document = parsed("<a xmlns:p='1'><b xmlns:p='2'><c><p:d/></c></b></a>");
  const NSXMLNode* c = document->rootElement()->firstChild()->firstChild();
  EXPECT_EQ(written(c), "<c xmlns:p=\"2\"><p:d/></c>");
}

TEST(XMLSerializer, ConstructedNamesAreDeclared) {
  const auto a = NSXMLElement::elementWithName(A("p:a"), A("u"));
  EXPECT_TRUE(a->addAttribute(NSXMLNode::attributeWithName(A("q:x"), A("1"), A("v"))));
  EXPECT_TRUE(a->addChild(NSXMLElement::elementWithName(A("p:b"), A("u"))));
  EXPECT_TRUE(a->addChild(NSXMLElement::elementWithName(A("c"), A("w"))));
  EXPECT_TRUE(a->addChild(NSXMLElement::elementWithName(A("d"))));
  EXPECT_EQ(written(a.get()),
            "<p:a xmlns:p=\"u\" xmlns:q=\"v\" q:x=\"1\"><p:b/><c xmlns=\"w\"/><d/></p:a>");
}

TEST(XMLSerializer, TheXMLPrefixIsNeverDeclared) {
  const auto a = NSXMLElement::elementWithName(A("a"));
  EXPECT_TRUE(a->addAttribute(NSXMLNode::attributeWithName(
      A("xml:id"), A("i"), A("http://www.w3.org/XML/1998/namespace"))));
  EXPECT_TRUE(a->addNamespace(
      NSXMLNode::namespaceWithName(A("xml"), A("http://www.w3.org/XML/1998/namespace"))));
  EXPECT_EQ(written(a.get()), "<a xml:id=\"i\"/>");
}

TEST(XMLSerializer, AnElementsNamePrevailsOverItsDeclarations) {
  const auto a = NSXMLElement::elementWithName(A("p:a"), A("u"));
  EXPECT_TRUE(a->addNamespace(NSXMLNode::namespaceWithName(A("p"), A("other"))));
  EXPECT_EQ(written(a.get()), "<p:a xmlns:p=\"u\"/>");
  const auto b = NSXMLElement::elementWithName(A("b"));
  EXPECT_TRUE(b->addNamespace(NSXMLNode::namespaceWithName({}, A("other"))));
  EXPECT_EQ(written(b.get()), "<b/>");
}

TEST(XMLSerializer, AnElementWithoutNamespaceLeavesTheDefaultNamespace) {
  const auto a = NSXMLElement::elementWithName(A("a"), A("u"));
  EXPECT_TRUE(a->addChild(NSXMLElement::elementWithName(A("b"))));
  EXPECT_EQ(written(a.get()), "<a xmlns=\"u\"><b xmlns=\"\"/></a>");
}

TEST(XMLSerializer, ReservedPrefixesStandForNothingElse) {
  const auto element = NSXMLElement::elementWithName(NSStringView::ascii("e"));
  for (const char* name : {"xml:a", "xmlns:b"}) {
    element->addAttribute(NSXMLNode::attributeWithName(
        NSStringView::ascii(name), NSStringView::ascii("1"), NSStringView::ascii("urn:x")));
  }
  element->addAttribute(
      NSXMLNode::attributeWithName(NSStringView::ascii("p:lang"), NSStringView::ascii("en"),
                                   NSStringView::ascii("http://www.w3.org/XML/1998/namespace")));
  EXPECT_EQ(element->XMLString()->utf8(),
            "<e xmlns:ns1=\"urn:x\" ns1:a=\"1\" ns1:b=\"1\" xml:lang=\"en\"/>");
}

TEST(XMLSerializer, ElementsGetAnotherPrefixForWhatTheirsCannotMean) {
  const auto element = NSXMLElement::elementWithName(A("xml:a"), A("urn:x"));
  EXPECT_TRUE(element->addChild(NSXMLElement::elementWithName(A("xmlns:b"), A("urn:x"))));
  EXPECT_TRUE(element->addChild(NSXMLElement::elementWithName(A("p:c"), A(namespaceOfXML))));
  EXPECT_TRUE(element->addChild(NSXMLElement::elementWithName(A("d"), A(namespaceOfXML))));
  EXPECT_EQ(written(element.get()), "<ns1:a xmlns:ns1=\"urn:x\"><ns1:b/><xml:c/><xml:d/></ns1:a>");
}

TEST(XMLSerializer, NamesWithoutANamespaceHaveNoPrefix) {
  const auto element = NSXMLElement::elementWithName(A("p:a"), A(""));
  element->addNamespace(NSXMLNode::namespaceWithName({}, A("urn:d")));
  element->addAttribute(NSXMLNode::attributeWithName(A("q:x"), A("1")));
  element->addAttribute(NSXMLNode::attributeWithName(A("xml:lang"), A("en")));
  EXPECT_TRUE(element->addChild(NSXMLElement::elementWithName(A("b"), A("urn:d"))));
  EXPECT_TRUE(element->lastChild()->kind() == Kind::Element &&
              cast<NSXMLElement>(element->lastChild())
                  ->addChild(NSXMLElement::elementWithName(A("c"), A(namespaceOfDeclarations))));
  EXPECT_EQ(written(element.get()),
            "<a x=\"1\" xml:lang=\"en\"><b xmlns=\"urn:d\"><c xmlns=\"\"/></b></a>");
}

TEST(XMLSerializer, ReservedNamespacesAreNotDeclared) {
  const auto element = NSXMLElement::elementWithName(A("a"));
  for (const char* prefix : {"", "p", "xml", "xmlns"}) {
    for (const std::string_view URI : {namespaceOfXML, namespaceOfDeclarations}) {
      const auto child = NSXMLElement::elementWithName(A("b"));
      child->addNamespace(NSXMLNode::namespaceWithName(A(prefix), A(URI)));
      EXPECT_EQ(written(child.get()), "<b/>");
      EXPECT_TRUE(element->addChild(child));
    }
  }
  EXPECT_EQ(written(element.get()), "<a><b/><b/><b/><b/><b/><b/><b/><b/></a>");
}

TEST(XMLSerializer, AttributesThatSpellDeclarationsAreSuch) {
  const auto element = NSXMLElement::elementWithName(A("p:a"), A("urn:p"));
  for (const char* name : {"xmlns:p", "xmlns:q", "xmlns", "xmlns:xml"}) {
    element->addAttribute(NSXMLNode::attributeWithName(A(name), A("urn:q")));
  }
  element->addAttribute(
      NSXMLNode::attributeWithName(A("xmlns:r"), A("urn:r"), A(namespaceOfDeclarations)));
  EXPECT_EQ(written(element.get()),
            "<p:a xmlns:p=\"urn:p\" xmlns:q=\"urn:q\" xmlns=\"urn:q\" xmlns:r=\"urn:r\"/>");
}

// Without a namespace a name is written without its prefix.
TEST(XMLSerializer, AttributesThatWouldBeWrittenAsADeclarationAreOne) {
  const auto prefixed = NSXMLElement::elementWithName(A("p:a"), A("urn:p"));
  prefixed->addAttribute(NSXMLNode::attributeWithName(A("q:xmlns"), A("urn:1")));
  prefixed->addAttribute(NSXMLNode::attributeWithName(A("xmlns"), A("urn:2")));
  EXPECT_EQ(written(prefixed.get()), "<p:a xmlns:p=\"urn:p\" xmlns=\"urn:1\"/>");
  const auto plain = NSXMLElement::elementWithName(A("a"));
  plain->addAttribute(NSXMLNode::attributeWithName(A("q:xmlns"), A("urn:1")));
  EXPECT_EQ(written(plain.get()), "<a/>");
}

TEST(XMLSerializer, OfAttributesThatReadAlikeTheFirstIsWritten) {
  const auto element = NSXMLElement::elementWithName(A("a"));
  element->addAttribute(NSXMLNode::attributeWithName(A("p:x"), A("1"), A("urn:x")));
  element->addAttribute(NSXMLNode::attributeWithName(A("q:x"), A("2"), A("urn:x")));
  element->addAttribute(NSXMLNode::attributeWithName(A("y"), A("3")));
  element->addAttribute(NSXMLNode::attributeWithName(A("p:y"), A("4")));
  EXPECT_EQ(written(element.get()), "<a xmlns:p=\"urn:x\" p:x=\"1\" y=\"3\"/>");
}

// What the names below a fragment mean must not be declared over what its own name means.
TEST(XMLSerializer, InheritedDeclarationsDoNotContradictTheName) {
  const auto top = NSXMLElement::elementWithName(A("top"));
  top->addNamespace(NSXMLNode::namespaceWithName(A("p"), A("1")));
  const auto middle = NSXMLElement::elementWithName(A("p:m"), A("2"));
  EXPECT_TRUE(middle->addChild(NSXMLElement::elementWithName(A("p:n"), A("1"))));
  EXPECT_TRUE(top->addChild(middle));
  EXPECT_EQ(written(middle.get()), "<p:m xmlns:p=\"2\"><p:n xmlns:p=\"1\"/></p:m>");
}

TEST(XMLSerializer, AttributesWithClashingPrefixesGetFreeOnes) {
  const auto a = NSXMLElement::elementWithName(A("p:a"), A("u"));
  EXPECT_TRUE(a->addAttribute(NSXMLNode::attributeWithName(A("p:x"), A("1"), A("v"))));
  EXPECT_TRUE(a->addAttribute(NSXMLNode::attributeWithName(A("y"), A("2"), A("v"))));
  EXPECT_TRUE(a->addAttribute(NSXMLNode::attributeWithName(A("z"), A("3"), A("w"))));
  const auto child = NSXMLElement::elementWithName(A("b"));
  EXPECT_TRUE(child->addNamespace(NSXMLNode::namespaceWithName(A("ns1"), A("mine"))));
  EXPECT_TRUE(child->addAttribute(NSXMLNode::attributeWithName(A("x"), A("4"), A("v"))));
  EXPECT_TRUE(a->addChild(child));
  EXPECT_EQ(written(a.get()),
            "<p:a xmlns:p=\"u\" xmlns:ns1=\"v\" xmlns:ns2=\"w\" ns1:x=\"1\" ns1:y=\"2\" "
            "ns2:z=\"3\"><b xmlns:ns1=\"mine\" xmlns:ns3=\"v\" ns3:x=\"4\"/></p:a>");
  EXPECT_EQ(described(parsed(written(a.get()))->rootElement()), described(a.get()));
}

// Attributes that are each in a namespace of their own, which nothing declares yet.
std::string attributesOfNamespaces(size_t count, double& seconds) {
  const auto a = NSXMLElement::elementWithName(A("a"));
  NSXMLNode* last = nullptr;
  for (size_t index = 0; index < count; ++index) {
    const std::string number = std::to_string(index);
    const auto attribute = NSXMLNode::attributeWithName(A("p" + number + ":x"), A(""), A(number));
    NSXMLTree::appendProperty(a.get(), attribute.get(), last);
    last = attribute.get();
  }
  std::string text;
  seconds = processorSecondsOf([&] { text = written(a.get()); });
  return text;
}

TEST(XMLSerializer, ManyAttributesOfManyNamespacesTakeLinearTime) {
  double seconds = 0;
  EXPECT_EQ(attributesOfNamespaces(2, seconds),
            "<a xmlns:p0=\"0\" xmlns:p1=\"1\" p0:x=\"\" p1:x=\"\"/>");
  EXPECT_TRUE(growsInProportion(
      [&](size_t count) {
        attributesOfNamespaces(count, seconds);
        return seconds;
      },
      8000));
}

// --- round trips -------------------------------------------------------------------------------

TEST(XMLSerializer, GeneratedDocumentsRoundTrip) {
  for (uint32_t seed = 0; seed < 1500; ++seed) {
    const std::string text = RandomDocument(seed).text();
    const auto document = parsed(text, keepAll);
    ASSERT_TRUE(document) << text;
    const std::string once = written(document.get());
    const auto again = parsed(once, keepAll);
    ASSERT_TRUE(again) << once;
    ASSERT_EQ(described(again.get()), described(document.get())) << text;
    ASSERT_EQ(written(again.get()), once) << text;
  }
}

TEST(XMLSerializer, FragmentsOfGeneratedDocumentsRoundTrip) {
  for (uint32_t seed = 0; seed < 300; ++seed) {
    const auto document = parsed(RandomDocument(seed).text(), keepAll);
    for (const NSXMLNode* node = document->rootElement(); node; node = node->nextNode()) {
      if (node->kind() != Kind::Element) continue;
      const std::string fragment = written(node);
      const auto again = parsed(fragment, keepAll);
      ASSERT_TRUE(again) << fragment;
      ASSERT_EQ(described(again->rootElement()), described(node)) << fragment;
    }
  }
}

// Trees as hosts can put them together, with names that no text can have.
class RandomTree {
 public:
  explicit RandomTree(uint32_t seed) : _random(seed) {}

  Ref<NSXMLElement> element(int depth) {
    const auto made = NSXMLElement::elementWithName(A(name()), A(URI()));
    for (uint32_t count = _random() % 3; count > 0; --count) {
      made->addNamespace(NSXMLNode::namespaceWithName(A(prefix()), A(URI())));
    }
    for (uint32_t count = _random() % 4; count > 0; --count) {
      const std::string spelt = _random() % 20 == 0 ? "xmlns" : name();
      made->addAttribute(NSXMLNode::attributeWithName(A(spelt), A("u"), A(URI())));
    }
    for (uint32_t count = _random() % 4; depth < 4 && count > 0; --count) {
      made->addChild(element(depth + 1));
      if (_random() % 4 == 0) made->addChild(NSXMLNode::commentWithStringValue(A("c")));
    }
    return made;
  }

 private:
  std::string pick(std::initializer_list<const char*> choices) {
    return choices.begin()[_random() % choices.size()];
  }
  std::string prefix() { return pick({"", "", "p", "p", "q", "ns1", "xml", "xmlns"}); }
  std::string name() {
    const std::string chosen = prefix();
    return (chosen.empty() ? "" : chosen + ":") + pick({"a", "b"});
  }
  std::string URI() {
    return pick({"", "", "u", "u", "v", "http://www.w3.org/XML/1998/namespace",
                 "http://www.w3.org/2000/xmlns/"});
  }

  std::mt19937 _random;
};

// The namespace that a reader will find a name in.
std::string readableURI(const NSXMLNode* node) {
  const std::string URI = node->URIView().utf8();
  if (URI.empty() && node->prefixView() == "xml") return std::string(namespaceOfXML);
  return URI == namespaceOfDeclarations ? "" : URI;
}

// What a reader will find, one line per node.
void describeReadable(const NSXMLNode* node, std::string& out) {
  const auto* element = dyn_cast<NSXMLElement>(node);
  if (!element) {
    out += "<" + node->textView().utf8() + ">\n";
    return;
  }
  out += "{" + readableURI(element) + "}" + element->localNameView().utf8();
  std::set<std::string> names;
  for (const NSXMLNode* attribute = element->firstAttribute(); attribute;
       attribute = NSXMLElement::nextAttribute(attribute)) {
    const bool isPlain = attribute->URIView().isEmpty();
    const bool isDeclaration =
        attribute->URIView() == namespaceOfDeclarations ||
        (isPlain && (attribute->prefixView() == "xmlns" || attribute->nameView() == "xmlns"));
    if (isDeclaration) continue;
    const std::string name = "{" + readableURI(attribute) + "}" + attribute->localNameView().utf8();
    if (names.insert(name).second) out += " @" + name + "=" + attribute->textView().utf8();
  }
  out += "(\n";
  for (const NSXMLNode* child = node->firstChild(); child; child = child->nextSibling()) {
    describeReadable(child, out);
  }
  out += ")\n";
}

TEST(XMLSerializer, GeneratedTreesOfAnyNamesReadBackAlike) {
  for (uint32_t seed = 0; seed < 1500; ++seed) {
    const auto tree = RandomTree(seed).element(0);
    for (const NSXMLNode* node = tree.get(); node; node = node->nextNode()) {
      if (node->kind() != Kind::Element || (node != tree.get() && seed % 10 != 0)) continue;
      const std::string text = written(node);
      const auto read = parsed(text, keepAll);
      ASSERT_TRUE(read) << text;
      std::string expected;
      std::string found;
      describeReadable(node, expected);
      describeReadable(read->rootElement(), found);
      ASSERT_EQ(found, expected) << text;
      ASSERT_EQ(text.find("xmlns:xml"), std::string::npos) << text;
      ASSERT_EQ(text.find("=\"http://www.w3.org/"), std::string::npos) << text;
      ASSERT_EQ(written(read->rootElement()), text);
    }
  }
}

TEST(XMLSerializer, WritingInPiecesGivesTheSame) {
  std::string text = "<a>";
  for (int index = 0; index < 30000; ++index) text += "<b>text &amp; more</b>";
  text += std::string(300000, 'x') + "</a>";
  const auto document = parsed(text);
  std::string collected;
  size_t largest = 0;
  document->rootElement()->writeXML([&](std::string_view piece) {
    collected += piece;
    largest = std::max(largest, piece.size());
    return true;
  });
  EXPECT_EQ(collected, text);
  EXPECT_LE(largest, 65536u);
  size_t calls = 0;
  document->writeXML([&](std::string_view) { return ++calls < 3; });
  EXPECT_EQ(calls, 3u);
}

// --- part by part --------------------------------------------------------------------------------

std::string gathered(
    const std::function<void(const std::function<bool(std::string_view)>&)>& write) {
  std::string text;
  write([&](std::string_view piece) {
    text += piece;
    return true;
  });
  return text;
}

// As a host writes it that looks at each node.
std::string inParts(const NSXMLNode& node, bool asWholes) {
  const auto* element = dyn_cast<NSXMLElement>(&node);
  const bool isPart = !element || !element->firstChild();
  if (isPart || (asWholes && node.parent()->parent())) {
    return gathered([&](const auto& write) { XQueryWriteXMLInPlace(node, write); });
  }
  std::string text = gathered([&](const auto& write) { XQueryWriteStartTag(*element, write); });
  for (const NSXMLNode* child = node.firstChild(); child; child = child->nextSibling()) {
    text += inParts(*child, asWholes);
  }
  return text + "</" + element->nameView().utf8() + ">";
}

TEST(XMLSerializer, PartsComeToTheWhole) {
  for (const char* text : {
           "<a>text<b/>more</a>",
           "<a x=\"1 &lt; 2\" y=\"\"><b><c z=\"&quot;\">t</c></b></a>",
           "<a xmlns=\"u\" xmlns:p=\"v\" xmlns:q=\"w\"><p:b p:x=\"1\">q:t</p:b><c q:y=\"2\"/></a>",
           "<p:a xmlns:p=\"u\"><b><p:c xmlns:p=\"v\"><p:d/></p:c></b><p:e "
           "xmlns:p=\"u\">t</p:e></p:a>",
           "<a xmlns=\"u\"><b xmlns=\"\"><c xmlns=\"u\"><d/></c><e/></b></a>",
           "<a><!--c--><b xml:lang=\"en\"><?p q?><![CDATA[<x>]]></b></a>",
       }) {
    const auto document = parsed(text, keepAll);
    EXPECT_EQ(inParts(*document->rootElement(), false), text);
    EXPECT_EQ(inParts(*document->rootElement(), true), text);
  }
}

TEST(XMLSerializer, AStartTagIsNeverThatOfAnEmptyElement) {
  const auto document = parsed("<a><b i='1'/></a>");
  const auto* element = cast<NSXMLElement>(document->rootElement()->firstChild());
  EXPECT_EQ(gathered([&](const auto& write) { XQueryWriteStartTag(*element, write); }),
            "<b i=\"1\">");
}

TEST(XMLSerializer, PartsEndWhenNobodyTakesMore) {
  const auto document = parsed("<a><b>" + std::string(300'000, 'x') + "</b></a>");
  int calls = 0;
  XQueryWriteXMLInPlace(*document->rootElement()->firstChild(), [&](std::string_view) {
    ++calls;
    return false;
  });
  EXPECT_EQ(calls, 1);
}

}  // namespace
}  // namespace xquery

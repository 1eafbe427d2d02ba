#include "Platform/Base/StackTestSupport.h"
#include "Platform/Loading/LoadingTestSupport.h"
#include "Platform/Reading/LibXML.h"
#include "Platform/Reading/XMLDocuments.h"
#include "Platform/Tree/Arena.h"
#include "Platform/Tree/XMLTestSupport.h"
#include "xquery/XMLNode.h"

#include <gtest/gtest.h>

#include <string>
#include <unistd.h>

namespace xquery {
namespace {

NSXMLParseError errorOf(std::string_view text, XMLWay way = XMLWay::Either) {
  NSXMLParseError error;
  TextSource source(text);
  EXPECT_FALSE(readDocument(source, 0, error, way));
  EXPECT_FALSE(error.message.empty());
  return error;
}

std::string kinds(const NSXMLNode* parent) {
  std::string all;
  for (const NSXMLNode* node = parent->firstChild(); node; node = node->nextSibling()) {
    all += "?DEANPCT"[static_cast<int>(node->kind())];
    if (node->kind() == Kind::Text) all += "[" + node->textView().utf8() + "]";
  }
  return all;
}

// --- content -----------------------------------------------------------------------------------

TEST(XMLParser, AdjacentTextIsOneNode) {
  const auto document = parsed("<a>one &amp; two<![CDATA[ <three>]]>&#x20;four</a>");
  EXPECT_EQ(kinds(document->rootElement()), "T[one & two <three> four]");
}

TEST(XMLParser, CDATASectionsStayNodesWhenAsked) {
  const auto document = parsed("<a>x<![CDATA[<y>]]>z<![CDATA[]]></a>",
                               NSXMLNodePreserveCDATA | NSXMLNodePreserveWhitespace);
  const NSXMLElement* a = document->rootElement();
  EXPECT_EQ(kinds(a), "T[x]T[<y>]T[z]");
  EXPECT_FALSE(NSXMLTree::isCDATA(a->firstChild()));
  EXPECT_TRUE(NSXMLTree::isCDATA(a->childAtIndex(1)));
}

TEST(XMLParser, CommentsAndInstructionsAreNodesAlsoOutsideTheRootElement) {
  const auto document = parsed("<!--one--><?two three?><a/><!--four-->");
  EXPECT_EQ(kinds(document.get()), "CPEC");
  EXPECT_EQ(document->firstChild()->textView().utf8(), "one");
  EXPECT_EQ(document->childAtIndex(1)->nameView().utf8(), "two");
  EXPECT_EQ(document->childAtIndex(1)->textView().utf8(), "three");
}

TEST(XMLParser, WhatStandsInTheInternalSubsetIsNoNode) {
  const auto document = parsed("<!DOCTYPE a [<!--no--><?no no?><!ELEMENT a ANY>]><a/>");
  EXPECT_EQ(kinds(document.get()), "E");
}

TEST(XMLParser, NamesGetTheirNamespaces) {
  const auto document =
      parsed("<a xmlns='d' xmlns:p='u'><p:b x='1' p:x='2' xml:lang='en'/><c xmlns=''/></a>");
  const NSXMLElement* a = document->rootElement();
  EXPECT_EQ(a->URIView().utf8(), "d");
  const auto* b = cast<NSXMLElement>(a->firstChild());
  EXPECT_EQ(b->URIView().utf8(), "u");
  EXPECT_EQ(b->attributeForLocalName(A("x"), {})->textView().utf8(), "1");
  EXPECT_EQ(b->attributeForLocalName(A("x"), A("u"))->textView().utf8(), "2");
  EXPECT_EQ(b->attributeForName(A("xml:lang"))->URIView().utf8(),
            "http://www.w3.org/XML/1998/namespace");
  EXPECT_TRUE(a->lastChild()->URIView().isEmpty());
  EXPECT_EQ(a->firstNamespace()->nameView().utf8(), "");
  EXPECT_EQ(a->firstNamespace()->textView().utf8(), "d");
}

TEST(XMLParser, NamesAndTextMayBeOfAnyScript) {
  const auto document = parsed("<\xC3\xA9 \xD0\xB1='\xF0\x9F\x98\x80'>\xE2\x82\xAC</\xC3\xA9>");
  const NSXMLElement* root = document->rootElement();
  EXPECT_EQ(root->nameView().utf8(), "\xC3\xA9");
  EXPECT_EQ(root->firstAttribute()->nameView().utf8(), "\xD0\xB1");
  EXPECT_EQ(root->firstAttribute()->textView().length(), 2u) << "a surrogate pair";
  EXPECT_EQ(root->firstAttribute()->textView().utf8(), "\xF0\x9F\x98\x80");
  EXPECT_TRUE(root->firstChild()->textView().isWide());
  EXPECT_EQ(root->stringValue()->utf8(), "\xE2\x82\xAC");
}

TEST(XMLParser, AttributeDefaultsOfTheInternalSubsetApply) {
  const auto document =
      parsed("<!DOCTYPE a [<!ATTLIST a x CDATA 'dflt' y NMTOKENS '  p  q '>]><a/>");
  const NSXMLElement* a = document->rootElement();
  ASSERT_TRUE(a->attributeForName(A("x")));
  EXPECT_EQ(a->attributeForName(A("x"))->textView().utf8(), "dflt");
  EXPECT_EQ(a->attributeForName(A("y"))->textView().utf8(), "p q");
}

TEST(XMLParser, ANamespaceMayBeAnyText) {
  const auto document = parsed("<p:a xmlns:p='two words' xmlns='%'><b/></p:a>");
  EXPECT_EQ(document->rootElement()->URIView().utf8(), "two words");
  EXPECT_EQ(document->rootElement()->firstChild()->URIView().utf8(), "%");
}

TEST(XMLParser, AttributesAndLineEndsAreNormalised) {
  const auto document = parsed("<a x='1\n2\t3&#10;4'>l\r\nm\rn</a>");
  EXPECT_EQ(document->rootElement()->firstAttribute()->textView().utf8(), "1 2 3\n4");
  EXPECT_EQ(document->stringValue()->utf8(), "l\nm\nn");
}

// --- white space -------------------------------------------------------------------------------

TEST(XMLParser, WhiteSpaceIsDroppedUnlessItIsToBePreserved) {
  struct Row {
    const char* text;
    uint32_t options;
    const char* expected;
  };
  const Row rows[] = {
      {"<a> <b/>\n\t</a>", 0, "E"},
      {"<a> <b/>\n\t</a>", NSXMLNodePreserveWhitespace, "T[ ]ET[\n\t]"},
      {"<a> x <b/></a>", 0, "T[ x ]E"},
      {"<a>&#32;<b/></a>", 0, "E"},
      {"<a><![CDATA[ ]]><b/></a>", 0, "T[ ]E"},
      {"<a> <![CDATA[]]> <b/></a>", 0, "E"},
      {"<a>\xC2\xA0<b/></a>", 0, "T[\xC2\xA0]E"},
      {"<a xml:space='preserve'> <b/></a>", 0, "T[ ]E"},
      {"<a xml:space='default'> <b/></a>", 0, "E"},
      {"<a xml:space='default'> <b/></a>", NSXMLNodePreserveWhitespace, "T[ ]E"},
      {"<a xml:space='other'> <b/></a>", 0, "E"},
      {"<a><b xml:space='preserve'> </b> </a>", 0, "E"},
  };
  for (const Row& row : rows) {
    const auto document = parsed(row.text, row.options);
    EXPECT_EQ(kinds(document->rootElement()), row.expected) << row.text;
  }
}

TEST(XMLParser, XMLSpaceIsInheritedAndMayBeChanged) {
  const auto document =
      parsed("<a xml:space='preserve'><b> <c xml:space='default'> <d> </d></c> </b></a>", 0);
  const NSXMLNode* b = document->rootElement()->firstChild();
  EXPECT_EQ(kinds(b), "T[ ]ET[ ]");
  EXPECT_EQ(kinds(b->childAtIndex(1)), "E");
  EXPECT_EQ(kinds(b->childAtIndex(1)->firstChild()), "");
}

// --- encodings and input -----------------------------------------------------------------------

TEST(XMLParser, EncodingsAreRecognised) {
  EXPECT_EQ(parsed("\xEF\xBB\xBF<a>\xC3\xA9</a>")->stringValue()->utf8(), "\xC3\xA9");
  EXPECT_EQ(parsed("<?xml version='1.0' encoding='ISO-8859-1'?><a>\xE9</a>")->stringValue()->utf8(),
            "\xC3\xA9");
  for (const bool isLittle : {true, false}) {
    std::string text;
    for (const char16_t unit : std::u16string(u"\uFEFF<a>\u00e9\U0001F600</a>")) {
      const char high = static_cast<char>(unit >> 8);
      const char low = static_cast<char>(unit & 0xFF);
      text += isLittle ? low : high;
      text += isLittle ? high : low;
    }
    EXPECT_EQ(parsed(text)->stringValue()->utf8(), "\xC3\xA9\xF0\x9F\x98\x80");
  }
}

TEST(XMLParser, AFileIsReadInPieces) {
  std::string text = "<a>";
  for (int index = 0; index < 50000; ++index) text += "<b>" + std::to_string(index) + "</b>";
  text += "</a>";
  const TestFolder folder;
  folder.write("a.xml", text);
  NSXMLParseError error;
  const auto document =
      NSXMLDocument::documentWithFile(folder.path("a.xml"), NSXMLNodePreserveWhitespace, &error);
  ASSERT_TRUE(document) << error.message;
  EXPECT_EQ(described(document.get()), described(parsed(text).get()));
}

TEST(XMLParser, AHostIsToldHowMuchOfAFileHasBeenRead) {
  // The second text is left to libxml2 at its end, which begins again.
  for (const std::string_view end : {"", "<b xmlns:xml='http://www.w3.org/XML/1998/namespace'/>"}) {
    const std::string text = "<a>" + std::string(2000000, 'x') + std::string(end) + "</a>";
    const TestFolder folder;
    folder.write("a.xml", text);
    uint64_t last = 0;
    int pieces = 0, beginnings = 0;
    const auto document = NSXMLDocument::documentWithFile(folder.path("a.xml"), 0, nullptr,
                                                          [&](uint64_t bytes, uint64_t whole) {
                                                            EXPECT_EQ(whole, text.size());
                                                            if (bytes <= last || last == 0)
                                                              ++beginnings;
                                                            last = bytes;
                                                            ++pieces;
                                                          });
    ASSERT_TRUE(document);
    EXPECT_EQ(last, text.size());
    EXPECT_GE(pieces, 4);
    EXPECT_EQ(beginnings, end.empty() ? 1 : 2);
  }
}

TEST(XMLParser, AFileThatCannotBeReadIsAnErrorWithoutALine) {
  NSXMLParseError error;
  EXPECT_FALSE(NSXMLDocument::documentWithFile("/nowhere/at/all.xml", 0, &error));
  EXPECT_EQ(error.line, 0);
  EXPECT_EQ(error.message, "/nowhere/at/all.xml: No such file or directory");
  EXPECT_FALSE(NSXMLDocument::documentWithFile("/tmp", 0, &error));
  EXPECT_EQ(error.line, 0);
  EXPECT_EQ(error.message, "/tmp: Is a directory");
}

TEST(XMLParser, AMinusIsStandardInput) {
  const TestFolder folder;
  folder.write("a.xml", "<from-standard-input/>");
  const int saved = dup(STDIN_FILENO);
  ASSERT_TRUE(freopen(folder.path("a.xml").c_str(), "r", stdin));
  NSXMLParseError error;
  const auto document = NSXMLDocument::documentWithFile("-", 0, &error);
  dup2(saved, STDIN_FILENO);
  close(saved);
  ASSERT_TRUE(document) << error.message;
  EXPECT_EQ(document->rootElement()->nameView().utf8(), "from-standard-input");
}

// --- bad input ---------------------------------------------------------------------------------

TEST(XMLParser, BadInputIsAnErrorWithItsPlace) {
  struct Row {
    std::string_view text;
    int64_t line;
    int64_t column;
    const char* message;
  };
  using namespace std::string_view_literals;
  const Row rows[] = {
      {"", 1, 1, "Document is empty"},
      {"   ", 1, 4, "Start tag expected, '<' not found"},
      {"text", 1, 1, "Start tag expected, '<' not found"},
      {"<a>", 1, 4, "Premature end of data in tag a line 1"},
      {"<a>\n<b>\n</a>", 3, 5, "Opening and ending tag mismatch: b line 2 and a"},
      {"<a x='1' x='2'/>", 1, 15, "Attribute x redefined"},
      {"<a xmlns:p='u' xmlns:q='u' p:x='1' q:x='2'/>", 1, 43,
       "Namespaced Attribute x in 'u' redefined"},
      {"<p:a/>", 1, 5, "Namespace prefix p on a is not defined"},
      {"<a p:x='1'/>", 1, 11, "Namespace prefix p for x on a is not defined"},
      {"<a xmlns:p=''/>", 1, 14, "xmlns:p: Empty XML namespace is not allowed"},
      {"<a xmlns:xmlns='u'/>", 1, 19, "redefinition of the xmlns prefix is forbidden"},
      {"<a:b:c xmlns:a='u'/>", 1, 5, "Failed to parse QName 'a:b:'"},
      {"<a>&nope;</a>", 1, 10, "Entity 'nope' not defined"},
      {"<a>&#0;</a>", 1, 8, "xmlParseCharRef: invalid xmlChar value 0"},
      {"<a>\x01</a>", 1, 4, "PCDATA invalid Char value 1"},
      {"<a>x]]>y</a>", 1, 5, "Sequence ']]>' not allowed in content"},
      {"<a><![CDATA[", 1, 13, "CData section not finished"},
      {"<a><![CDATA[x", 1, 14, "CData section not finished"},
      {"<a><![CDATA[x]]", 1, 16, "CData section not finished"},
      {"<a><!-- -- --></a>", 1, 9, "Double hyphen within comment"},
      {"<a/><b/>", 1, 5, "Extra content at the end of the document"},
      {"<a/>\n\n x", 3, 2, "Extra content at the end of the document"},
      {"<a x=1/>", 1, 6, "AttValue: \" or ' expected"},
      {"<a>\0</a>"sv, 1, 4, "Premature end of data in tag a line 1"},
      {"<a/>\0"sv, 1, 5, "extra content at the end of the document"},
      {"<a/>\0<b/>"sv, 1, 5, "extra content at the end of the document"},
      {"\0<a/>"sv, 1, 1, "Document is empty"},
      {"<a>\xFF</a>", 1, 4, "Input is not proper UTF-8, indicate encoding !"},
      {"<?xml version='1.0' encoding='no-such'?><a/>", 1, 39, "Unsupported encoding no-such"},
      {"<?xml version='2.0'?><a/>", 1, 20, "Unsupported version '2.0'"},
  };
  for (const Row& row : rows) {
    const NSXMLParseError error = errorOf(row.text);
    EXPECT_EQ(error.line, row.line) << row.text << ": " << error.message;
    EXPECT_EQ(error.column, row.column) << row.text << ": " << error.message;
    EXPECT_EQ(error.message.substr(0, std::string_view(row.message).size()), row.message);
    EXPECT_EQ(error.message.find('\n'), std::string::npos);
  }
}

TEST(XMLParser, TheErrorMayBeIgnored) {
  EXPECT_FALSE(NSXMLDocument::documentWithData("<a>", 0));
  EXPECT_FALSE(NSXMLDocument::documentWithFile("/nowhere/at/all.xml", 0));
}

TEST(XMLParser, EveryBeginningOfADocumentEndsInAnError) {
  const std::string text =
      "<?xml version='1.0'?><!DOCTYPE a [<!ENTITY e '<b>x</b>'><!ATTLIST a d CDATA 'v'>]>"
      "<a x='&e2;' xmlns:p='u'><p:b>t\xC3\xA9&e;<![CDATA[c]]></p:b><!--c--><?p q?></a>";
  for (size_t length = 0; length < text.size(); ++length) {
    const std::string message = errorOf(std::string_view(text).substr(0, length)).message;
    EXPECT_EQ(message.find("Unregistered"), std::string::npos) << text.substr(0, length);
  }
}

// --- entities ----------------------------------------------------------------------------------

TEST(XMLParser, InternalEntitiesAreSubstituted) {
  const auto document = parsed(
      "<!DOCTYPE a [<!ENTITY e 'x&f;'><!ENTITY f 'y'><!ENTITY m '<b z=\"&f;\">&e;</b>'>]>"
      "<a q='&e;'>[&e;]&m;&m;</a>");
  const NSXMLElement* a = document->rootElement();
  EXPECT_EQ(a->firstAttribute()->textView().utf8(), "xy");
  EXPECT_EQ(kinds(a), "T[[xy]]EE");
  EXPECT_EQ(document->stringValue()->utf8(), "[xy]xyxy");
  EXPECT_EQ(cast<NSXMLElement>(a->lastChild())->firstAttribute()->textView().utf8(), "y");
}

TEST(XMLParser, ExternalEntitiesAreRefused) {
  const TestFolder folder;
  const std::string secret = folder.write("a.txt", "the secret");
  const std::string declaration = "<!DOCTYPE a [<!ENTITY e SYSTEM '" + secret + "'>]>";
  EXPECT_EQ(errorOf(declaration + "<a>&e;</a>").message, "external entities are not read");
  EXPECT_EQ(errorOf(declaration + "<a x='&e;'/>").message.find("the secret"), std::string::npos);
  EXPECT_TRUE(parsed(declaration + "<a/>")) << "a declaration alone does no harm";
  EXPECT_EQ(errorOf("<!DOCTYPE a [<!ENTITY % e SYSTEM '" + secret + "'>%e;]><a/>").message,
            "external entities are not read");
}

TEST(XMLParser, AnExternalDTDIsNotRead) {
  const TestFolder folder;
  const std::string subset =
      folder.write("a.dtd", "<!ATTLIST a x CDATA 'from outside'><!ENTITY e 'outside'>");
  const std::string type = "<!DOCTYPE a SYSTEM '" + subset + "'>";
  EXPECT_EQ(parsed(type + "<a/>")->rootElement()->attributeCount(), 0u);
  EXPECT_NE(errorOf(type + "<a>&e;</a>").message.find("not defined"), std::string::npos);
}

TEST(XMLParser, EntitiesThatContainThemselvesAreAnError) {
  errorOf("<!DOCTYPE a [<!ENTITY e '&f;'><!ENTITY f '&e;'>]><a>&e;</a>");
  errorOf("<!DOCTYPE a [<!ENTITY e '&f;'><!ENTITY f '&e;'>]><a x='&e;'/>");
  errorOf("<!DOCTYPE a [<!ENTITY % e '&#37;e;'>%e;]><a/>");
}

std::string laughs(int levels, std::string_view innermost, std::string_view use) {
  std::string text = "<!DOCTYPE a [<!ENTITY e0 '" + std::string(innermost) + "'>";
  for (int level = 1; level <= levels; ++level) {
    text += "<!ENTITY e" + std::to_string(level) + " '";
    for (int copy = 0; copy < 10; ++copy) text += "&e" + std::to_string(level - 1) + ";";
    text += "'>";
  }
  return text + "]>" + std::string(use);
}

TEST(XMLParser, EntityExpansionIsBounded) {
  for (const char* innermost : {"lol", "", "<b/>"}) {
    EXPECT_EQ(errorOf(laughs(9, innermost, "<a>&e9;</a>")).message,
              "entities expand to too much text")
        << innermost;
  }
  EXPECT_EQ(errorOf(laughs(9, "lol", "<a x='&e9;'/>")).message, "entities expand to too much text");
  EXPECT_TRUE(parsed(laughs(3, "lol", "<a>&e3;</a>")));
}

// n references to an entity of 1024 bytes, in a document so short that the absolute bound holds.
std::string references(size_t count) {
  std::string text = "<!DOCTYPE a [<!ENTITY e '" + std::string(1024 - 32, 'x') + "'>]><a>";
  for (size_t index = 0; index < count; ++index) text += "&e;";
  return text + "</a>";
}

TEST(XMLParser, TheBoundOfExpansionIsTenMebibytesForASmallDocument) {
  const size_t most = LibXMLAddedBytes / 1024;
  EXPECT_EQ(parsed(references(most - 1))->stringValue()->length(), (most - 1) * (1024 - 32));
  EXPECT_EQ(errorOf(references(most + 2)).message, "entities expand to too much text");
}

TEST(XMLParser, ALargeDocumentMayExpandInProportion) {
  // Twelve mebibytes of expansion, but less than twenty times the document.
  std::string text = references(12 * 1024);
  text.insert(text.find("<a>") + 3, std::string(1 << 20, 'y'));
  EXPECT_TRUE(parsed(text));
}

TEST(XMLParser, AttributeDefaultsAreBoundedToo) {
  std::string text = "<!DOCTYPE a [<!ATTLIST b x CDATA '" + std::string(10000, 'x') + "'>]><a>";
  for (int index = 0; index < 2000; ++index) text += "<b/>";
  EXPECT_EQ(errorOf(text + "</a>").message, "entities expand to too much text");
  text = "<!DOCTYPE a [<!ATTLIST b";
  for (int index = 0; index < 2000; ++index) {
    text += " xmlns:p" + std::to_string(index) + " CDATA 'u'";
  }
  text += ">]><a>";
  for (int index = 0; index < 2000; ++index) text += "<b/>";
  EXPECT_EQ(errorOf(text + "</a>").message, "entities expand to too much text");
}

TEST(XMLParser, DeclarationsInTheDocumentAreNeverTooMany) {
  std::string text = "<a>";
  for (int index = 0; index < 200000; ++index) text += "<b xmlns='u' x=''/>";
  EXPECT_TRUE(parsed(text + "</a>"));
}

// --- depth and length --------------------------------------------------------------------------

TEST(XMLParser, DepthIsBoundedByMemoryOnly) {
  std::string text;
  for (int depth = 0; depth < 1000000; ++depth) text += "<a>";
  text += "x";
  for (int depth = 0; depth < 1000000; ++depth) text += "</a>";
  const auto document = parsed(text);
  ASSERT_TRUE(document);
  EXPECT_EQ(document->stringValue()->utf8(), "x");
  size_t count = 0;
  for (const NSXMLNode* node = document.get(); node; node = node->nextNode()) ++count;
  EXPECT_EQ(count, 1000002u);
  std::string written;
  document->rootElement()->appendXMLTo(written);
  EXPECT_EQ(written, text);
  const Ref<NSXMLNode> copy = document->copy();
  EXPECT_EQ(copy->stringValue()->utf8(), "x");
}

std::string tagWith(size_t count, const char* name) {
  std::string text = "<a xmlns:p='v'";
  for (size_t index = 1; index < count; ++index) text += name + std::to_string(index) + "='u'";
  return text + "/>";
}

bool isReadByLibXML(std::string_view text) {
  NSXMLParseError error;
  TextSource source(text);
  return readDocument(source, 0, error, XMLWay::LibXML) != nullptr;
}

TEST(XMLParser, TheAttributesOfATagAreBoundedForLibXML) {
  for (const char* name : {" x", " p:x", " xmlns:x"}) {
    EXPECT_TRUE(isReadByLibXML(tagWith(LibXMLMostAttributes, name)));
    // What has been read at the end is not measured any more.
    const std::string tooMany = tagWith(LibXMLMostAttributes + 2000, name);
    EXPECT_EQ(errorOf(tooMany, XMLWay::LibXML).message, "too many attributes");
    EXPECT_TRUE(parsed(tooMany));
    EXPECT_EQ(errorOf("<!DOCTYPE a []>" + tooMany).message, "too many attributes");
  }
  EXPECT_EQ(errorOf(tagWith(150000, " xmlns:x"), XMLWay::LibXML).message, "too many attributes");
  EXPECT_TRUE(parsed("<a x='" + std::string(100000, '=') + "'/>")) << "one attribute";
  EXPECT_TRUE(parsed("<a>" + std::string(100000, '=') + "</a>")) << "no attribute";
}

TEST(XMLParser, TheSearchForTheNamespacesOfATagIsBoundedForLibXML) {
  // 24,000 declarations in scope, which look nothing up, then a tag of many attributes.
  constexpr int levels = 8;
  constexpr int ofEach = 3000;
  std::string text;
  for (int level = 0; level < levels; ++level) {
    text += "<a";
    for (int index = 0; index < ofEach; ++index) {
      text += " xmlns:p" + std::to_string(level) + "_" + std::to_string(index) + "='u'";
    }
    text += ">";
  }
  const auto closed = [&](size_t attributes) {
    std::string tag = "<b";
    for (size_t index = 0; index < attributes; ++index)
      tag += " p0_0:x" + std::to_string(index) + "=''";
    std::string ends;
    for (int level = 0; level < levels; ++level) ends += "</a>";
    return text + tag + "/>" + ends;
  };
  constexpr size_t most = LibXMLMostLookups / (levels * ofEach);
  EXPECT_TRUE(isReadByLibXML(closed(most)));
  EXPECT_EQ(errorOf(closed(most + 2000), XMLWay::LibXML).message, "too many namespaces");
  EXPECT_TRUE(parsed(closed(most + 2000)));
}

// --- small stacks ------------------------------------------------------------------------------

std::string nestedModel(size_t depth) {
  return "<!DOCTYPE a [<!ELEMENT a " + std::string(depth, '(') + "b" + std::string(depth, ')') +
         ">]><a/>";
}

std::string nestedEntities(size_t depth, std::string_view use) {
  std::string text = "<!DOCTYPE a [<!ENTITY e0 'x'>";
  for (size_t level = 1; level <= depth; ++level) {
    text += "<!ENTITY e" + std::to_string(level) + " '&e" + std::to_string(level - 1) + ";'>";
  }
  return text + "]>" + std::string(use);
}

TEST(XMLParser, ASmallStackIsEnough) {
  for (const size_t size : {size_t{48} << 10, size_t{64} << 10, size_t{160} << 10}) {
    onStack(size * sanitizedStackFactor, [] {
      EXPECT_TRUE(parsed("<a>text</a>"));
      EXPECT_TRUE(parsed(nestedModel(249)));
      EXPECT_TRUE(parsed(nestedModel(2000)));
      EXPECT_TRUE(parsed(nestedEntities(500, "<a>&e500;</a>")));
      EXPECT_TRUE(parsed(nestedEntities(900, "<a b='&e900;'/>")));
      EXPECT_NE(errorOf(nestedModel(100000)).message.find("too deep"), std::string::npos);
      errorOf(nestedEntities(100000, "<a>&e100000;</a>"));
      const TestFolder folder;
      folder.write("a.xml", "<a/>");
      NSXMLParseError error;
      EXPECT_TRUE(NSXMLDocument::documentWithFile(folder.path("a.xml"), 0, &error))
          << error.message;
      EXPECT_TRUE(NSXMLDocument::documentWithData("<p>one<p>two", NSXMLDocumentTidyHTML, &error))
          << error.message;
    });
  }
}

TEST(XMLParser, DeclarationsOfNestedTagsAreNotBounded) {
  std::string text;
  for (int depth = 0; depth < 100000; ++depth) text += "<a xmlns='u'>";
  for (int depth = 0; depth < 100000; ++depth) text += "</a>";
  EXPECT_TRUE(parsed(text));
}

TEST(XMLParser, TextsAndAttributesMayBeLong) {
  const std::string content(20 << 20, 'x');
  const auto document = parsed("<a x='" + content + "'>" + content + "</a>");
  ASSERT_TRUE(document);
  EXPECT_EQ(document->stringValue()->length(), content.size());
  EXPECT_EQ(document->rootElement()->firstAttribute()->textView().length(), content.size());
}

}  // namespace
}  // namespace xquery

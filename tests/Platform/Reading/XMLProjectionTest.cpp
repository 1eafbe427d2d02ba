// What is made of a document for a projection, in both ways, and that the whole text is checked.
#include "Platform/Reading/ReaderTestSupport.h"
#include "Platform/Reading/XMLProjection.h"

#include <gtest/gtest.h>

#include <random>
#include <string>
#include <vector>

namespace xquery {
namespace {

using namespace readingtest;

// From lines such as "/a/b", "//c/@x", "/a/b/text()", "value //p", "all /a/b", "//*/?".
XMLProjection projectionOf(const std::vector<std::string>& paths) {
  XMLProjection projection;
  for (std::string path : paths) {
    unsigned need = XMLProjection::Itself;
    if (path.starts_with("value ")) need = XMLProjection::StringValue;
    if (path.starts_with("all ")) need = XMLProjection::AllBelow;
    path.erase(0, path.find('/'));
    XMLProjection::PlaceID place = XMLProjection::document;
    bool isAnywhere = false;
    while (!path.empty()) {
      isAnywhere = path.starts_with("//");
      path.erase(0, isAnywhere ? 2 : 1);
      const std::string step = path.substr(0, path.find('/'));
      path.erase(0, step.size());
      if (step == "text()") {
        need = XMLProjection::Texts;
      } else if (step == "?") {
        need = XMLProjection::Instructions;
      } else if (step == "@*") {
        need = XMLProjection::Attributes;
      } else if (step.starts_with("@")) {
        projection.needAttribute(place, step.substr(1));
        need = 0;
      } else {
        place = projection.step(place, isAnywhere, step == "*" ? "" : step);
      }
    }
    projection.need(place, need);
  }
  return projection;
}

Ref<NSXMLDocument> readProjected(std::string_view text, const XMLProjection* projection, XMLWay way,
                                 uint32_t options, NSXMLParseError& error) {
  TextSource source(text);
  return readDocument(source, options, error, way, projection);
}

std::string shown(const NSXMLDocument* document) {
  std::string text;
  for (const NSXMLNode* node = document ? document->firstChild() : nullptr; node;
       node = node->nextSibling()) {
    node->appendXMLTo(text);
  }
  return text;
}

// In both ways alike.
std::string madeOf(std::string_view text, const std::vector<std::string>& paths,
                   uint32_t options = NSXMLNodePreserveWhitespace) {
  const XMLProjection projection = projectionOf(paths);
  NSXMLParseError error;
  const auto own = readProjected(text, &projection, XMLWay::Own, options, error);
  const auto other = readProjected(text, &projection, XMLWay::LibXML, options, error);
  EXPECT_TRUE(other) << text << error.message;
  if (own && other) {
    EXPECT_EQ(differenceOfTrees(own.get(), other.get()), "") << text;
  }
  return shown(other.get());
}

TEST(XMLProjection, OnlyWhatIsNeededIsMade) {
  constexpr std::string_view text =
      "<?p 1?><r a='1' b='2'>t<a x='1' y='2'>u<b>v</b>w</a><!--c--><c><a x='3'/><d><b/></d></c>"
      "<?q r?></r><!--e-->";
  struct Row {
    std::vector<std::string> paths;
    const char* made;
  };
  const Row rows[] = {
      {{}, "<r/>"},
      {{"/none"}, "<r/>"},
      {{"/r/a"}, "<r><a/></r>"},
      {{"//a"}, "<r><a/><c><a/></c></r>"},
      {{"//b"}, "<r><a><b/></a><c><d><b/></d></c></r>"},
      {{"//a/@x"}, "<r><a x=\"1\"/><c><a x=\"3\"/></c></r>"},
      {{"//a/@y"}, "<r><a y=\"2\"/></r>"},
      {{"/r/@*"}, "<r a=\"1\" b=\"2\"/>"},
      {{"/r/a/text()"}, "<r><a>uw</a></r>"},
      {{"value /r/a"}, "<r><a>u<b>v</b>w</a></r>"},
      {{"value /r"}, "<r>t<a>u<b>v</b>w</a></r>"},
      {{"all /r/a"}, "<r><a x=\"1\" y=\"2\">u<b>v</b>w</a></r>"},
      {{"all /r/c"}, "<r><c><a x=\"3\"/><d><b/></d></c></r>"},
      {{"/r/*"}, "<r><a/><c/></r>"},
      {{"/r/c//b"}, "<r><c><d><b/></d></c></r>"},
      {{"/r/c/d", "//a/@x"}, "<r><a x=\"1\"/><c><a x=\"3\"/><d/></c></r>"},
      {{"/r/?"}, "<r><?q r?></r>"},
      {{"/?"}, "<?p 1?><r/>"},
      {{"all /r"},
       "<r a=\"1\" b=\"2\">t<a x=\"1\" y=\"2\">u<b>v</b>w</a><!--c--><c><a x=\"3\"/><d><b/></d></c>"
       "<?q r?></r>"},
  };
  for (const Row& row : rows) {
    EXPECT_EQ(madeOf(text, row.paths), row.made) << (row.paths.empty() ? "" : row.paths[0]);
  }
}

TEST(XMLProjection, NamesAreLocalAndNamespacesStayWhatTheyAre) {
  EXPECT_EQ(madeOf("<p:r xmlns:p='u'><p:a><q:b xmlns:q='v'/><p:b/></p:a></p:r>", {"//b"}),
            "<p:r xmlns:p=\"u\"><p:a><q:b xmlns:q=\"v\"/><p:b/></p:a></p:r>");
  // The prefix of what waits is bound anew below it.
  EXPECT_EQ(madeOf("<r xmlns:p='u'><p:a><s><c xmlns:p='v'><p:b/></c></s></p:a></r>", {"//b"}),
            "<r xmlns:p=\"u\"><p:a><s><c xmlns:p=\"v\"><p:b/></c></s></p:a></r>");
  EXPECT_EQ(madeOf("<r><p:a xmlns:p='u'/><b/></r>", {"/r/b"}), "<r><b/></r>");
}

TEST(XMLProjection, TextsAreThoseOfTheWholeDocument) {
  const std::string_view text = "<r><a>x<!--c-->y<b/>z<?p?>&amp;<![CDATA[<]]>v</a></r>";
  const XMLProjection projection = projectionOf({"/r/a/text()"});
  for (const XMLWay way : {XMLWay::Own, XMLWay::LibXML}) {
    NSXMLParseError error;
    const auto document = readProjected(text, &projection, way, NSXMLNodePreserveWhitespace, error);
    ASSERT_TRUE(document);
    std::vector<std::string> texts;
    for (const NSXMLNode* node = document->rootElement()->firstChild()->firstChild(); node;
         node = node->nextSibling()) {
      texts.push_back(node->textView().utf8());
    }
    EXPECT_EQ(texts, (std::vector<std::string>{"x", "y", "z", "&<v"}));
  }
}

TEST(XMLProjection, WhiteSpaceIsStrippedWhereTheWholeDocumentLosesIt) {
  const std::string_view text =
      "<r> <a> <b/> </a><a>x<b/> </a><s xml:space='preserve'> <a> <b/> </a>"
      "<a xml:space='default'> </a></s></r>";
  EXPECT_EQ(madeOf(text, {"//a/text()", "//a"}, NSXMLNodeOptionsNone),
            "<r><a/><a>x</a><s xml:space=\"preserve\"><a>  </a><a xml:space=\"default\"/></s></r>");
  EXPECT_EQ(madeOf(text, {"/r/none"}, NSXMLNodeOptionsNone), "<r/>");
}

TEST(XMLProjection, DeclarationsOfADocumentHoldInWhatIsMade) {
  const std::string_view text =
      "<!DOCTYPE r [<!ATTLIST a x CDATA 'd' y CDATA 'e'><!ENTITY e 'n<b>m</b>'>]>"
      "<r><a/><c>&e;</c></r>";
  EXPECT_EQ(madeOf(text, {"//a/@x"}), "<r><a x=\"d\"/></r>");
  EXPECT_EQ(madeOf(text, {"value //c"}), "<r><c>n<b>m</b></c></r>");
  EXPECT_EQ(madeOf(text, {"//b"}), "<r><c><b/></c></r>");
}

TEST(XMLProjection, OtherEncodingsAndScriptsAreReadAlike) {
  std::string wide = "\xFF\xFE";
  for (const char each : std::string("<r><a x='1'>t</a><b/></r>")) wide += {each, '\0'};
  EXPECT_EQ(madeOf(wide, {"//a/@x"}), "<r><a x=\"1\"/></r>");
  EXPECT_EQ(madeOf("<r><\xD1\x8F \xE6\x97\xA5='\xF0\x9F\x98\x80'>\xD8\xB9</\xD1\x8F><b>\xCE\xB1</b>"
                   "</r>",
                   {"value //\xD1\x8F", "//\xD1\x8F/@\xE6\x97\xA5"}),
            "<r><\xD1\x8F \xE6\x97\xA5=\"\xF0\x9F\x98\x80\">\xD8\xB9</\xD1\x8F></r>");
}

// --- what is not made is checked -----------------------------------------------------------------

const std::vector<std::string> someProjections[] = {
    {}, {"/r/none"}, {"//none"}, {"//b"}, {"value /r/a"}, {"all //b"}, {"//a/@x", "/r/text()"},
};

std::string outcome(std::string_view text, const XMLProjection* projection, uint32_t options) {
  NSXMLParseError error;
  if (readProjected(text, projection, XMLWay::Either, options, error)) return "read";
  return std::to_string(error.line) + ":" + std::to_string(error.column) + " " + error.message;
}

void expectSameOutcome(std::string_view text) {
  const std::string whole = outcome(text, nullptr, NSXMLNodePreserveWhitespace);
  for (const auto& paths : someProjections) {
    const XMLProjection projection = projectionOf(paths);
    ASSERT_EQ(outcome(text, &projection, NSXMLNodePreserveWhitespace), whole)
        << text << (paths.empty() ? "" : paths[0]);
  }
}

TEST(XMLProjection, WhatIsMalformedWhereNothingIsNeededIsRefusedAsEver) {
  const char* const inner[] = {
      "<",
      "&",
      "&x;",
      "&#0;",
      "]]>",
      "\x01",
      "\xFF",
      "\xED\xA0\x80",
      "\xC3",
      "\xEF\xBF\xBF",
      "<a x=1/>",
      "<a x='1' x='2'/>",
      "<a xmlns:p='u' xmlns:q='u' p:x='1' q:x='2'/>",
      "<a p:x='1'/>",
      "<p:a/>",
      "<p:a><p:b xmlns:p='u'/></p:a>",
      "<a x='<'/>",
      "<a x='&y;'/>",
      "<a x='\xFF'/>",
      "<a x='1'y='2'/>",
      "<a xmlns:p=''/>",
      "<a xmlns:xml='u'/>",
      "<a:b:c/>",
      "<1/>",
      "<a></b>",
      "</r>",
      "<!--a--b-->",
      "<!--\xFF-->",
      "<!--",
      "<![CDATA[",
      "<![CDATA[\xFF]]>",
      "<![CDATA[\x02]]>",
      "<?xml?>",
      "<?p:q?>",
      "<?p \xFF?>",
      "<?",
      "<!X>",
      "<a/",
      "<a",
  };
  for (const std::string piece : inner) {
    expectSameOutcome("<r><a>1</a><x>" + piece + "</x><b/></r>");
    expectSameOutcome("<r><x><y>t" + piece + "</y>\n</x><b/></r>");
    expectSameOutcome("<r>\n<a>" + piece + "</a></r>");
    expectSameOutcome("<r/>" + piece);
  }
}

TEST(XMLProjection, DocumentsThatEndEarlyAreRefusedAsEver) {
  const std::string text =
      "<?xml version='1.0'?><!DOCTYPE r><r xmlns:p='u'><a x='1' p:y='&lt;'>t&amp;<b/>\xC3\xA9</a>"
      "<x><!--c--><?p q?><![CDATA[<]]><p:y z='2' w='3'>u</p:y></x></r>\n";
  for (size_t size = 0; size <= text.size(); ++size) {
    expectSameOutcome(std::string_view(text).substr(0, size));
  }
}

// Each byte of a document in turn is another one, or gone, or there is one more.
TEST(XMLProjection, WhateverOneByteMakesOfADocumentIsReadOrRefusedAsEver) {
  const std::string text =
      "<r xmlns:p='u'><a x='1' p:y=\"2\" >t<b/></a ><x p:q='3'><c/>u<p:d z='>'>v</p:d></x>\n</r>";
  for (size_t at = 0; at < text.size(); ++at) {
    std::string without = text;
    expectSameOutcome(without.erase(at, 1));
    for (const char byte : {'<', '>', '/', ' ', '&', 'x', ':', '=', '"', '\'', '!', '\xC3'}) {
      std::string other = text;
      other[at] = byte;
      expectSameOutcome(other);
      std::string more = text;
      expectSameOutcome(more.insert(at, 1, byte));
    }
  }
}

TEST(XMLProjection, RowsOfElementsAreMadeAlikeInBothWays) {
  const std::string_view words[] = {
      "<b>",
      "</b>",
      "<b/>",
      "<a x='1'>",
      "</a>",
      "<a x='1' y='2'/>",
      "<c>",
      "</c>",
      "<p:c>",
      "</p:c>",
      "<p:b p:x='1' q:x='2'/>",
      "text",
      "\xC3\xA9",
      "&lt;",
      "<!--b-->",
      "<?p b?>",
      "<![CDATA[<b>]]>",
      "<c p:x='1' xmlns:p='v'>",
      "<b xml:lang='e'/>",
      "<c >",
      "</c\n>",
      "<c  x = '1' />",
      "\n ",
  };
  std::mt19937 random(1);
  const auto below = [&](size_t limit) {
    return std::uniform_int_distribution<size_t>(0, limit - 1)(random);
  };
  size_t read = 0;
  for (int i = 0; i < 3000; ++i) {
    std::string text = "<r xmlns:p='u' xmlns:q='w'>";
    std::vector<std::string> open;
    for (size_t left = 1 + below(12); left > 0; --left) {
      const std::string word(words[below(std::size(words))]);
      // Mostly what is open is closed, and nothing else.
      if (word.starts_with("</")) {
        if (!open.empty()) text += "</" + open.back() + word.substr(word.find_first_of(">\n"));
        if (!open.empty()) open.pop_back();
        continue;
      }
      text += word;
      const bool opens =
          word[0] == '<' && word[1] != '!' && word[1] != '?' && !word.ends_with("/>");
      if (opens) open.push_back(word.substr(1, word.find_first_of(" >") - 1));
    }
    for (; !open.empty(); open.pop_back()) text += "</" + open.back() + ">";
    text += "</r>";
    expectSameOutcome(text);
    NSXMLParseError error;
    if (!readProjected(text, nullptr, XMLWay::Own, 0, error)) continue;
    ++read;
    for (const auto& paths : someProjections) {
      const std::string whole = madeOf(text, paths);
      const XMLProjection projection = projectionOf(paths);
      TextSource source(inPieces(text, 1 + i % 9), {}, 1 + i % 9, 1 + i % 9);
      const auto document =
          readDocument(source, NSXMLNodePreserveWhitespace, error, XMLWay::Own, &projection);
      ASSERT_EQ(shown(document.get()), whole) << text;
    }
  }
  EXPECT_GT(read, 2000U);
}

TEST(XMLProjection, WindowsOfAnySizeMakeTheSame) {
  const std::string_view text =
      "<r xmlns:p='u'><a x='1' y='2'>t&amp;<b/>\xC3\xA9</a><x><!--c--><?p q?><p:y z='2'/></x></r>";
  for (const auto& paths : someProjections) {
    const XMLProjection projection = projectionOf(paths);
    const std::string whole = madeOf(text, paths);
    for (size_t size = 1; size <= text.size(); ++size) {
      TextSource source(inPieces(text, size), {}, size, size);
      NSXMLParseError error;
      const auto document =
          readDocument(source, NSXMLNodePreserveWhitespace, error, XMLWay::Own, &projection);
      EXPECT_EQ(shown(document.get()), whole) << size;
    }
  }
}

// --- bounds --------------------------------------------------------------------------------------

TEST(XMLProjection, AMillionLevelsAreNoMatter) {
  constexpr size_t levels = 1'000'000;
  std::string text;
  for (size_t i = 0; i < levels; ++i) text += "<a>";
  text += "<b/>";
  for (size_t i = 0; i < levels; ++i) text += "</a>";
  EXPECT_EQ(madeOf(text, {"//none"}), "<a/>");
  EXPECT_EQ(madeOf(text, {"/a/none"}), "<a/>");
  const XMLProjection projection = projectionOf({"//b"});
  NSXMLParseError error;
  const auto document = readProjected(text, &projection, XMLWay::Own, 0, error);
  ASSERT_TRUE(document);
  int64_t level = 0;
  for (const NSXMLNode* node = document->firstChild(); node; node = node->firstChild()) ++level;
  EXPECT_EQ(level, static_cast<int64_t>(levels) + 1);
}

TEST(XMLProjection, ManyAttributesTakeTimeInProportion) {
  constexpr int count = 100'000;
  std::string text = "<r><a";
  for (int i = 0; i < count; ++i) text += " a" + std::to_string(i) + "='" + std::to_string(i) + "'";
  text += "/></r>";
  const XMLProjection none = projectionOf({"/r/none"});
  const XMLProjection one = projectionOf({"/r/a/@a77777"});
  NSXMLParseError error;
  EXPECT_EQ(shown(readProjected(text, &none, XMLWay::Own, 0, error).get()), "<r/>");
  EXPECT_EQ(shown(readProjected(text, &one, XMLWay::Own, 0, error).get()),
            "<r><a a77777=\"77777\"/></r>");
  text.insert(text.size() - 6, " a5=''");
  EXPECT_FALSE(readProjected(text, &none, XMLWay::Own, 0, error));
}

// Sets of places whose number doubles with each step are not all told apart.
TEST(XMLProjection, WhatCannotBeToldApartIsMadeAsAWhole) {
  std::string path = "//a";
  for (int i = 0; i < 30; ++i) path += "/*";
  const XMLProjection projection = projectionOf({path});
  std::string text;
  std::string ends;
  unsigned random = 1;
  for (int i = 0; i < 3000; ++i) {
    random = random * 1664525 + 1013904223;
    const std::string name = (random >> 16) % 2 ? "a" : "b";
    text += "<" + name + ">";
    ends.insert(0, "</" + name + ">");
  }
  NSXMLParseError error;
  const auto whole = readProjected(text + ends, nullptr, XMLWay::Own, 0, error);
  const auto part = readProjected(text + ends, &projection, XMLWay::Own, 0, error);
  ASSERT_TRUE(whole && part);
  EXPECT_EQ(differenceOfTrees(whole.get(), part.get()), "");
}

TEST(XMLProjection, PathsAreToldInTheirOrder) {
  EXPECT_EQ(projectionOf({"/a/b", "//c/@x", "//c/@y", "value /a/d", "all /a/e"}).description(),
            "/a/b, the text of /a/d, all of /a/e, //c/@x, //c/@y");
  EXPECT_EQ(XMLProjection().description(), "");
}

}  // namespace
}  // namespace xquery

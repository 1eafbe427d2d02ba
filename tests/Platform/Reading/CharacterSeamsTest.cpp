// Characters that are cut in two by markup: the halves are together what is one character, and
// neither is one. No reader may put them together, wherever the cut is and however it is read.
#include "Platform/Reading/ReaderTestSupport.h"
#include "Platform/Reading/XMLProjection.h"
#include "Platform/Reading/XMLRecords.h"

#include <gtest/gtest.h>

#include <functional>
#include <string>
#include <vector>

namespace xquery {
namespace {

using namespace readingtest;

// Where "1" stands the beginning of a character is put, where "2" does its end.
const std::string_view seams[] = {
    // texts and sections
    "<a>1<![CDATA[2]]></a>",
    "<a>x1<![CDATA[2y]]>z</a>",
    "<a><![CDATA[1]]>2</a>",
    "<a><![CDATA[x1]]>2y</a>",
    "<a><![CDATA[1]]><![CDATA[2]]></a>",
    "<a>1<![CDATA[]]>2</a>",
    "<a>x1<![CDATA[]]><![CDATA[]]>2</a>",
    "<a> <![CDATA[1]]>2 </a>",
    // references and line ends
    "<a>1&amp;2</a>",
    "<a>1&#x41;2</a>",
    "<a>&amp;1<![CDATA[2]]></a>",
    "<a><![CDATA[1]]>2&amp;</a>",
    "<a>1\r2</a>",
    "<a>1\r\n2</a>",
    "<a><![CDATA[1\r2]]></a>",
    "<a><![CDATA[\r\n1]]>2\r</a>",
    // other markup in text
    "<a>1<!---->2</a>",
    "<a>1<!--x--><![CDATA[2]]></a>",
    "<a>1<?p?>2</a>",
    "<a><![CDATA[1]]><?p x?>2</a>",
    "<a>1<b/>2</a>",
    "<a>1<b>2</b></a>",
    "<a><b>1</b>2</a>",
    "<a><b>1</b><b>2</b></a>",
    "<a><b><![CDATA[1]]></b>2</a>",
    "<a>1</a>2",
    "1<a>2</a>",
    // comments and instructions
    "<a>1<!--2--></a>",
    "<a><!--1-->2</a>",
    "<a><!--1--><!--2--></a>",
    "<a><!--1-2--></a>",
    "<a><?p 1?>2</a>",
    "<a><?p 1?><?p 2?></a>",
    "<a><?p1 2?></a>",
    "<a><?p1?>2</a>",
    "<a>1<?2?></a>",
    "<a><?p 1?2?></a>",
    // names, tags and values
    "<1>2</1>",
    "<a1>2</a1>",
    "<a1 2='x'/>",
    "<a x1='2'/>",
    "<a x1 2=''/>",
    "<a x='1'>2</a>",
    "<a x='1' y='2'/>",
    "<a x='1' 2='y'/>",
    "<a x='1&amp;2'/>",
    "<a x='1\t2'/>",
    "<a x='1\"2'/>",
    "<a x='1>2'/>",
    "<a>1</a 2>",
    "<a1:2 xmlns:a1='u'/>",
    "<a xmlns='1'>2</a>",
    "<a xmlns='1' xmlns:p='2'/>",
    "<a xmlns:p1='2'/>",
    // in front of the document element and behind it
    "<!--1--><?p 2?><a/>",
    "<!DOCTYPE a1><a>2</a>",
    "<!DOCTYPE a SYSTEM '1'><a>2</a>",
    "<a/><!--1--><!--2-->",
    "<a/><?p 1?><?p 2?>",
};

// Characters that are read alike by both readers, of each length.
const std::string_view characters[] = {"\xC3\xBC", "\xE2\x82\xAC", "\xF0\x90\x80\x80"};

std::string with(std::string_view seam, std::string_view begin, std::string_view end) {
  std::string text;
  for (const char byte : seam) {
    if (byte == '1') {
      text += begin;
    } else if (byte == '2') {
      text += end;
    } else {
      text += byte;
    }
  }
  return text;
}

// Calls with each seam that cuts each character in each way.
void forEachCut(const std::function<void(const std::string& text)>& look) {
  for (const std::string_view seam : seams) {
    for (const std::string_view character : characters) {
      for (size_t cut = 1; cut < character.size(); ++cut) {
        look(with(seam, character.substr(0, cut), character.substr(cut)));
      }
    }
  }
}

TEST(CharacterSeams, NoReaderTakesThem) {
  forEachCut([](const std::string& text) {
    EXPECT_TRUE(isRefused(text)) << text;
    for (const uint32_t options : allOptions) {
      EXPECT_FALSE(read(text, XMLWay::Own, options)) << text;
    }
  });
}

TEST(CharacterSeams, BlocksOfAnySizeDoNotEither) {
  forEachCut([](const std::string& text) {
    for (size_t size = 1; size <= 64; ++size) {
      EXPECT_FALSE(readInPieces(text, size, allOptions[size % 4])) << text << " " << size;
    }
  });
}

// Of what is needed and of what is not.
TEST(CharacterSeams, NorDoesAProjection) {
  XMLProjection none;
  XMLProjection texts;
  texts.need(texts.step(XMLProjection::document, true, ""), XMLProjection::Texts);
  XMLProjection value;
  value.need(value.step(XMLProjection::document, false, "a"), XMLProjection::StringValue);
  XMLProjection inner;
  inner.need(inner.step(XMLProjection::document, true, "b"), XMLProjection::AllBelow);
  forEachCut([&](const std::string& text) {
    for (const XMLProjection* const projection : {&none, &texts, &value, &inner}) {
      for (size_t size = 1; size <= 64; size += size < 8 ? 1 : 28) {
        TextSource source(inPieces(text, size), {}, size, size);
        NSXMLParseError error;
        EXPECT_FALSE(readDocument(source, 0, error, XMLWay::Own, projection)) << text << size;
      }
    }
  });
}

// The error comes with its place, as from libxml2 alone.
TEST(CharacterSeams, NorAreTheyReadRecordByRecord) {
  const XMLRecordPath path[] = {{{}, {}}};
  forEachCut([&](const std::string& text) {
    NSXMLParseError expected;
    TextSource whole(text);
    EXPECT_FALSE(readDocument(whole, 0, expected, XMLWay::LibXML)) << text;
    for (size_t size = 1; size <= 64; size += size < 8 ? 1 : 28) {
      TextSource source(inPieces(text, size), {}, size, size);
      XMLRecords records(source, path, NSXMLNodePreserveWhitespace);
      NSXMLParseError error;
      EXPECT_FALSE(records.read([](const NSXMLElement&) { return true; }, error)) << text << size;
      EXPECT_EQ(error.message, expected.message) << text;
      EXPECT_EQ(error.line, expected.line) << text;
    }
  });
}

// The same places take the character as a whole, on either side: the seams are what is refused.
TEST(CharacterSeams, WholeCharactersAreTakenBesideThem) {
  size_t taken = 0;
  for (const std::string_view seam : seams) {
    for (const std::string_view character : characters) {
      for (const std::string& text : {with(seam, character, "x"), with(seam, "x", character)}) {
        const auto other = read(text, XMLWay::LibXML);
        if (!other) continue;
        ++taken;
        const auto own = read(text, XMLWay::Either);
        ASSERT_TRUE(own) << text;
        EXPECT_EQ(differenceOfTrees(own.get(), other.get()), "") << text;
      }
    }
  }
  EXPECT_GT(taken, 2 * std::size(seams));
}

}  // namespace
}  // namespace xquery

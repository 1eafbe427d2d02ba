// What our reader takes is what libxml2 reads, and is read as libxml2 reads it; the rest it leaves.
#include "Platform/Reading/ReaderTestSupport.h"
#include "Platform/Reading/XMLReader.h"
#include "Platform/Tree/XMLTestSupport.h"

#include <gtest/gtest.h>

#include <string>

namespace xquery {
namespace {

using namespace readingtest;
using namespace std::string_view_literals;

// Well-formed texts, of every production that is taken.
const std::string_view taken[] = {
    "<a/>",
    "<a></a>",
    "<a />",
    "<a\n></a\t>",
    "<a>x</a>",
    " <a/> ",
    "\r\n<a/>\r\n",
    "<a>&lt;&gt;&amp;&apos;&quot;</a>",
    "<a>&#65;&#x41;&#x10FFFF;</a>",
    "<a>]]&gt;</a>",
    "<a>]]<b/>&gt;</a>",
    "<a>]] ></a>",
    "<a>]>]]</a>",
    "<a>&#93;&#93;></a>",
    "<a><![CDATA[]]]]>></a>",
    "<a>\"'=/?!;</a>",
    "<a>x\ty\nz</a>",
    "<a>l\r\nm\rn\r\r\no</a>",
    "<a>\x7F\xC2\x80\xC2\x9F</a>",
    "<a>\xEF\xBF\xBD\xED\x9F\xBF\xEE\x80\x80\xF4\x8F\xBF\xBF</a>",
    "<a x=''/>",
    "<a x=\"1\" y='2'/>",
    "<a x = '1'\n\ty\n=\n'2' />",
    "<a x='\"' y=\"'\"/>",
    "<a x='>' y='a>b'/>",
    "<a x=' a  b '/>",
    "<a x='1\n2\t3\r\n4\r5&#10;6&#13;7&#9;8'/>",
    "<a x='&lt;&amp;&quot;&apos;'/>",
    "<a x='\xC3\xA9' \xC3\xA9='x'/>",
    "<a xml:lang='en' xml:space='preserve' xml:id='x' xml:base='http://x/'/>",
    "<a xml:space='default'> <b xml:space='preserve'> <c xml:space='other'/> </b> </a>",
    "<a xml:lang='' xml:id='1 2'/>",
    "<a xmlns='u'/>",
    "<a xmlns=''/>",
    "<a xmlns='u' xmlns:p='u'><b xmlns=''><p:c/></b></a>",
    "<p:a xmlns:p='u' p:x='1' x='2'/>",
    "<a p:x='1' xmlns:p='u'/>",
    "<a xmlns:p='u' xmlns:q='v' p:x='1' q:x='2' x='3'/>",
    "<a xmlns='u' xmlns:p='u' x='1' p:x='2'/>",
    "<p:a xmlns:p='1'><p:a xmlns:p='2'><p:b/></p:a><p:b/></p:a>",
    "<a xmlns:p='two words' xmlns:q='%' xmlns:r='rel/ative' xmlns:s='\xC3\xA9'/>",
    "<a xmlns:p='a&amp;b&#32;' xmlns:q=' u '/>",
    "<xml:a/>",
    "<xmlns/>",
    "<xmlfoo XML='x' xmlnsa='y'/>",
    "<a><!----><!-- - --><!--x-y--><!--<&>]]>--></a>",
    "<!--x--><a/><!--y-->",
    "<a><!-->--><!--->--></a>",
    "<a><!--\xC3\xA9\r\n\r--></a>",
    "<?x?><a/><?y z?>",
    "<a><?x?><?x ?><?x  y ?><?x y?z?><?x y? >?><?x ?\?></a>",
    "<a><?x \xC3\xA9\r\n\r?><?\xC3\xA9?></a>",
    "<?xml-stylesheet href='x'?><a/>",
    "<?xml-model href='x'?><a/>",
    "<a><![CDATA[]]></a>",
    "<a>x<![CDATA[<y>&z;]]>w</a>",
    "<a> <![CDATA[ ]]> </a>",
    "<a> <![CDATA[]]> </a>",
    "<a><![CDATA[a]]b]>]]]]><![CDATA[>]]></a>",
    "<a><![CDATA[\xC3\xA9\r\n\r]]></a>",
    "<a>x<!--y-->z<?p?>w</a>",
    "<a> <b/> x <b/>&#32;<b/>\xC2\xA0<b/>&#13;</a>",
    "<\xC3\xA9\xCC\x81.-0_\xC2\xB7/>",
    "<\xF0\x90\x80\x80\xF3\xAF\xBF\xBF/>",
    "<_/>",
    "<A.b-c_d0 E='f'/>",
    "<a><b><c/></b></a>",
    "<a b='x' ><c d='y' ></c ></a >",
};

// Texts that are not well formed, or that only the other reader takes.
const std::string_view left[] = {
    "",
    " ",
    "x",
    "<",
    "<a",
    "<a>",
    "<a>x",
    "<a/",
    "</a>",
    "<a></a",
    "<a></b>",
    "<a></ab>",
    "<ab></a>",
    "<a></a b>",
    "<a><b></a></b>",
    "<a/><b/>",
    "<a/>x",
    "x<a/>",
    "<a/>&#32;",
    "<a/><![CDATA[]]>",
    "<![CDATA[]]><a/>",
    "<a/><",
    "<a/>\0"sv,
    "\0<a/>"sv,
    "<a>\0</a>"sv,
    "< a/>",
    "<a / >",
    "<a/ >",
    "<1/>",
    "<-a/>",
    "<a%/>",
    "<a\"/>",
    "<\xC3\x97/>",
    "<a\xC3\x97/>",
    "<a <b/>",
    "<a x/>",
    "<a x=/>",
    "<a x=1/>",
    "<a x='1/>",
    "<a x='1\"/>",
    "<a x='1'y='2'/>",
    "<a x='<'/>",
    "<a x='&'/>",
    "<a x='&lt'/>",
    "<a x='&nope;'/>",
    "<a x='\x01'/>",
    "<a x='1' x='2'/>",
    "<a xmlns:p='u' xmlns:q='u' p:x='1' q:x='2'/>",
    "<a xmlns='u' xmlns='v'/>",
    "<a xmlns:p='u' xmlns:p='v'/>",
    "<p:a/>",
    "<a p:x='1'/>",
    "<a><b xmlns:p='u'/><p:c/></a>",
    "<a xmlns:p=''/>",
    "<a xmlns:xml='u'/>",
    "<a xmlns:p='http://www.w3.org/XML/1998/namespace'/>",
    "<a xmlns='http://www.w3.org/XML/1998/namespace'/>",
    "<a xmlns:xmlns='u'/>",
    "<a xmlns:p='http://www.w3.org/2000/xmlns/'/>",
    "<a xmlns='http://www.w3.org/2000/xmlns/'/>",
    "<xmlns:a/>",
    "<:a/>",
    "<a:/>",
    "<a: />",
    "<a:b:c xmlns:a='u'/>",
    "<a xmlns:='u'/>",
    "<a xmlns:a:b='u'/>",
    "<a>&</a>",
    "<a>&;</a>",
    "<a>&lt</a>",
    "<a>&nope;</a>",
    "<a>&LT;</a>",
    "<a>&#0;</a>",
    "<a>&#xD800;</a>",
    "<a>&#xFFFE;</a>",
    "<a>&#x110000;</a>",
    "<a>&#X41;</a>",
    "<a>x]]>y</a>",
    "<a>]]></a>",
    "<a>]]]></a>",
    "<a>\x01</a>",
    "<a>\x0B</a>",
    "<a>\x1F</a>",
    "<a>\xEF\xBF\xBE</a>",
    "<a>\xEF\xBF\xBF</a>",
    "<a>\xFF</a>",
    "<a>\x80</a>",
    "<a>\xC3</a>",
    "<a>\xC0\xAF</a>",
    "<a>\xE0\x80\xAF</a>",
    "<a>\xF0\x80\x80\xAF</a>",
    "<a>\xED\xA0\x80</a>",
    "<a>\xF4\x90\x80\x80</a>",
    "<a x='\xC3'/>",
    "<a x='\xEF\xBF\xBF'/>",
    "<a xmlns='\xC3'/>",
    "<a><!-- -- --></a>",
    "<a><!-- --->",
    "<a><!-- ---></a>",
    "<a><!-></a>",
    "<a><!-- ></a>",
    "<a><!--\x01--></a>",
    "<a><!--\xC3--></a>",
    "<a><!x></a>",
    "<a><![cdata[x]]></a>",
    "<a><![CDATA[x]]</a>",
    "<a><![CDATA[x] ]></a>",
    "<a><![CDATA[\x01]]></a>",
    "<a><![CDATA[\xC3]]></a>",
    "<a><?x></a>",
    "<a><?\?></a>",
    "<a><? x?></a>",
    "<a><?x:y z?></a>",
    "<a><?x?y?></a>",
    "<a><?1?></a>",
    "<a><?xml x?></a>",
    "<a><?XmL x?></a>",
    "<a><?x \x01?></a>",
    "<a><?x \xC3?></a>",
};

TEST(XMLReader, TakesWhatIsWellFormed) {
  for (const std::string_view text : taken) EXPECT_TRUE(isTaken(text)) << text;
}

TEST(XMLReader, LeavesWhatIsNot) {
  for (const std::string_view text : left) {
    EXPECT_FALSE(read(text, XMLWay::Own)) << text;
    NSXMLParseError error;
    TextSource either(text);
    if (readDocument(either, 0, error)) continue;
    NSXMLParseError expected;
    TextSource alone(text);
    EXPECT_FALSE(readDocument(alone, 0, expected, XMLWay::LibXML));
    EXPECT_EQ(error.message, expected.message) << text;
    EXPECT_EQ(error.line, expected.line) << text;
    EXPECT_EQ(error.column, expected.column) << text;
  }
}

TEST(XMLReader, OfWhatIsLeftTheOtherTakesLittle) {
  const std::string_view accepted[] = {
      "<a xmlns:xml='http://www.w3.org/XML/1998/namespace'/>",
      "<!DOCTYPE a [<!ENTITY e 'x'>]><a>&e;</a>",
      "<?xml version='1.0' encoding='ISO-8859-1'?><a>\xE9</a>",
      "<a><?xml-x y?></a>",
  };
  for (const std::string_view text : accepted) {
    EXPECT_FALSE(read(text, XMLWay::Own)) << text;
    EXPECT_TRUE(read(text, XMLWay::Either)) << text;
  }
  for (const std::string_view text : left) EXPECT_TRUE(isRefused(text)) << text;
}

TEST(XMLReader, EveryBeginningIsLeft) {
  for (const std::string_view text : taken) {
    const size_t end = text.find_last_of('>');
    for (size_t length = 0; length <= end; ++length) isTaken(text.substr(0, length));
  }
}

TEST(XMLReader, EveryByteMayBeAnother) {
  size_t count = 0;
  for (const std::string_view text : taken) {
    for (size_t at = 0; at < text.size(); ++at) {
      for (const char byte : {'\0', '\r', '<', '>', '&', 'x', ':', '\xC3'}) {
        std::string changed(text);
        changed[at] = byte;
        isTakenWith(allOptions[count++ % std::size(allOptions)], changed);
      }
    }
  }
}

TEST(XMLReader, PiecesOfAnySizeMakeNoDifference) {
  for (const std::string_view text : taken) {
    for (const uint32_t options : allOptions) {
      const auto whole = read(text, XMLWay::LibXML, options);
      for (size_t size = 1; size <= 64; size += size < 8 ? 1 : 7) {
        const auto document = readInPieces(text, size, options);
        ASSERT_TRUE(document) << text << " " << size;
        EXPECT_EQ(differenceOfTrees(document.get(), whole.get()), "") << text << " " << size;
      }
    }
  }
  for (const std::string_view text : left) EXPECT_FALSE(readInPieces(text, 3)) << text;
}

TEST(XMLReader, RandomDocumentsAreReadAlike) {
  for (uint32_t seed = 0; seed < 300; ++seed) {
    const std::string text = RandomDocument(seed).text();
    EXPECT_TRUE(isTaken(text)) << text;
    const auto whole = read(text, XMLWay::LibXML);
    for (const size_t size : {size_t{1}, size_t{1 + seed % 64}, size_t{1000}}) {
      const auto document = readInPieces(text, size);
      ASSERT_TRUE(document) << text;
      EXPECT_EQ(differenceOfTrees(document.get(), whole.get()), "") << text;
    }
  }
}

// Every code point that can be one of a name or a text, at the ends of ranges above all.
TEST(XMLReader, CharactersAreTakenWhereTheyMayStand) {
  for (char32_t point = 0x80; point < 0x110000; point += point < 0x3100 ? 5 : 0x1FF) {
    if (point >= 0xD800 && point < 0xE000) continue;
    const std::u16string units =
        point < 0x10000 ? std::u16string(1, static_cast<char16_t>(point))
                        : std::u16string{static_cast<char16_t>(0xD7C0 + (point >> 10)),
                                         static_cast<char16_t>(0xDC00 | (point & 0x3FF))};
    const std::string bytes =
        NSStringView(units.data(), static_cast<uint32_t>(units.size())).utf8();
    for (const std::string& text :
         {"<" + bytes + "/>", "<a" + bytes + "/>", "<a>" + bytes + "</a>"}) {
      const auto own = read(text, XMLWay::Own);
      const auto other = read(text, XMLWay::LibXML);
      EXPECT_EQ(!own, !other) << text;
      if (own && other) {
        EXPECT_EQ(differenceOfTrees(own.get(), other.get()), "");
      }
    }
  }
}

// --- what is large -----------------------------------------------------------------------------

TEST(XMLReader, AMillionLevels) {
  constexpr int depth = 1000000;
  std::string text;
  for (int level = 0; level < depth; ++level) text += "<a>";
  for (int level = 0; level < depth; ++level) text += "</a>";
  const auto document = read(text, XMLWay::Own);
  ASSERT_TRUE(document);
  EXPECT_EQ(document->rootElement()->XPath()->utf8(), "/a[1]");
  int64_t levels = 0;
  for (const NSXMLNode* node = document.get(); node; node = node->firstChild()) ++levels;
  EXPECT_EQ(levels, depth + 1);
}

std::string tagOf(int attributes) {
  std::string text = "<a xmlns:p='u' xmlns:q='u'";
  for (int index = 0; index < attributes; ++index) {
    const std::string number = std::to_string(index);
    text += (index % 2 ? " p:x" : " x") + number + "='" + number + "'";
  }
  return text;
}

TEST(XMLReader, ATagOfVeryManyAttributes) {
  const auto document = read(tagOf(60000) + "/>", XMLWay::Own);
  ASSERT_TRUE(document);
  EXPECT_EQ(document->rootElement()->attributeCount(), 60000U);
}

TEST(XMLReader, AttributesOfATagAreDistinctHoweverManyThereAre) {
  for (const int count : {1, 2, 10, 15, 16, 17, 30, 1000}) {
    const std::string text = tagOf(count);
    EXPECT_TRUE(isTaken(text + "/>")) << count;
    EXPECT_TRUE(isTaken(text + " q:x0=''/>")) << count;
    EXPECT_FALSE(isTaken(text + " x0=''/>")) << count;
    EXPECT_EQ(isTaken(text + " q:x1=''/>"), count < 2) << count;
    EXPECT_TRUE(readInPieces(text + "/>", 64)) << count;
  }
}

TEST(XMLReader, FiftyThousandNamespacesInScope) {
  std::string text = "<a";
  for (int index = 0; index < 50000; ++index) {
    text += " xmlns:p" + std::to_string(index) + "='u" + std::to_string(index) + "'";
  }
  text += ">";
  for (int index = 0; index < 50000; ++index) text += "<p7:b p9:c=''/>";
  const auto document = read(text + "</a>", XMLWay::Own);
  ASSERT_TRUE(document);
  EXPECT_EQ(document->rootElement()->lastChild()->URIView().utf8(), "u7");
}

TEST(XMLReader, NamesThatAlternateBetweenNamespacesAreInternedOnce) {
  std::string text = "<c xmlns='" + std::string(100000, 'u') + "'>";
  for (int index = 0; index < 20000; ++index) text += index % 2 ? "<b xmlns='v'/>" : "<b/>";
  const auto document = read(text + "</c>", XMLWay::Own);
  ASSERT_TRUE(document);
  EXPECT_EQ(document->rootElement()->firstChild()->URIView().length(), 100000U);
  EXPECT_EQ(document->rootElement()->lastChild()->URIView().utf8(), "v");
}

TEST(XMLReader, LongNamesAreLeft) {
  for (const size_t length : {size_t{9999}, size_t{10000}, size_t{10001}, size_t{60000}}) {
    const std::string name(length, 'n');
    const std::string text = "<" + name + " " + name + "='x'></" + name + ">";
    EXPECT_EQ(isTaken(text), length <= 10000) << length;
    EXPECT_TRUE(read(text, XMLWay::Either)) << length;
  }
}

TEST(XMLReader, LongTextsAreReadAlike) {
  for (const size_t length : {190, 194, 200, 1000, 16384, 70000}) {
    for (const char* unit :
         {"x", "\xC3\xA9", "\xE2\x82\xAC", "\xF0\x9D\x84\x9E", "&amp;", "\r\n"}) {
      std::string content;
      while (content.size() < length) content += unit;
      const std::string text = "<a b='" + content + "'>" + content + "<![CDATA[" + content +
                               "]]><!--" + content + "--><?c " + content + "?></a>";
      EXPECT_TRUE(isTaken(text)) << length << unit;
      const auto own = readInPieces(text, 4096);
      const auto other = read(text, XMLWay::LibXML);
      ASSERT_TRUE(own && other);
      EXPECT_EQ(differenceOfTrees(own.get(), other.get()), "");
    }
  }
}

}  // namespace
}  // namespace xquery

#include "Platform/Base/ProcessorTime.h"
#include "Platform/Reading/HTMLText.h"

#include <gtest/gtest.h>

#include <string>
#include <string_view>

namespace xquery {
namespace {

using namespace std::string_view_literals;

TEST(HTMLText, AsUTF8) {
  const struct {
    std::string_view bytes, expected;
  } rows[] = {
      {"", ""},
      {"plain", "plain"},
      {"\xC3\xA4", "\xC3\xA4"},
      {"\xEF\xBB\xBF<p>\xC3\xA4", "<p>\xC3\xA4"},
      {"\xFE\xFF\x00<\x00\xE4"sv, "<\xC3\xA4"},
      {"\xFF\xFE<\x00\xE4\x00"sv, "<\xC3\xA4"},
      // Not UTF-8 and nothing said.
      {"\xE4\x80", "\xC3\xA4\xE2\x82\xAC"},
      {"<meta charset=iso-8859-15>\xA4", "<meta charset=iso-8859-15>\xE2\x82\xAC"},
      {"<meta CHARSET = \"ISO-8859-1\">\x80", "<meta CHARSET = \"ISO-8859-1\">\xE2\x82\xAC"},
      {"<meta content='text/html; charset=koi8-r'>\xC1",
       "<meta content='text/html; charset=koi8-r'>\xD0\xB0"},
      {"<meta charset=utf-8>\xE4", "<meta charset=utf-8>\xEF\xBF\xBD"},
      {"<meta charset=utf-16>\xC3\xA4", "<meta charset=utf-16>\xC3\xA4"},
      {"<meta charset=no-such-thing>\xC3\xA4", "<meta charset=no-such-thing>\xC3\xA4"},
      {"charset charset= charset", "charset charset= charset"},
  };
  for (const auto& row : rows) EXPECT_EQ(HTMLAsUTF8(row.bytes), row.expected) << row.bytes;
}

TEST(HTMLText, AnEncodingInWhichItsNameCouldNotBeReadIsNotMeant) {
  for (const char* name : {"utf-16", "utf16", "UTF-16LE", "ucs-2", "unicode", "utf-32", "ucs-4",
                           "ibm037", "ebcdic-cp-us", "bocu-1"}) {
    const std::string text = "<meta charset=" + std::string(name) + ">\xC3\xA4";
    EXPECT_EQ(HTMLAsUTF8(text), text);
  }
}

TEST(HTMLText, OnlyTheFirstKilobyteNamesTheEncoding) {
  const std::string name = "<meta charset=koi8-r>";
  const std::string inside = std::string(1024 - name.size(), ' ') + name;
  EXPECT_EQ(HTMLAsUTF8(inside + "\xC1"), inside + "\xD0\xB0");
  const std::string outside = std::string(1024, ' ') + name;
  EXPECT_EQ(HTMLAsUTF8(outside + "\xC1"), outside + "\xC3\x81");
}

TEST(HTMLText, AttributesOfOneTagAreCounted) {
  EXPECT_FALSE(hasTagOfMoreAttributes("<p a b c><p a b c>", 3));
  EXPECT_TRUE(hasTagOfMoreAttributes("<p a b c d>", 3));
  EXPECT_TRUE(hasTagOfMoreAttributes("x<y>z<p a='1'b='2'c='3'd='4'", 3));
  EXPECT_FALSE(hasTagOfMoreAttributes("<p a='1' b = \"2\" c= 3 >", 3));
  EXPECT_TRUE(hasTagOfMoreAttributes("<p/a/b/c/d", 3));
  EXPECT_FALSE(hasTagOfMoreAttributes("", 3));
  EXPECT_FALSE(hasTagOfMoreAttributes("<", 3));
  EXPECT_FALSE(hasTagOfMoreAttributes("a < b c d e f g h", 3));
  EXPECT_FALSE(hasTagOfMoreAttributes("<p     a     b>", 3));
}

TEST(HTMLText, ValuesInQuotesAreNoAttributesAndEndNoTag) {
  EXPECT_FALSE(hasTagOfMoreAttributes("<p a='b c d e \" f/g/h'>", 3));
  EXPECT_FALSE(hasTagOfMoreAttributes("<p a=\"{'b': 'c', 'd': 'e'}\" f = ' g h i j '>", 3));
  EXPECT_TRUE(hasTagOfMoreAttributes("<p a='>' b=\">\" c='>' d='>'>", 3));
  EXPECT_TRUE(hasTagOfMoreAttributes("<p a=' b c d e", 3)) << "a quote that nothing ends";
  EXPECT_FALSE(hasTagOfMoreAttributes("<p a=' b c d e'", 3));
}

TEST(HTMLText, ScriptsAndStyleSheetsHaveNoTags) {
  const std::string comparison = "if(i<e)x={'a':'b','c':'d', 'e':'f'}";
  EXPECT_TRUE(hasTagOfMoreAttributes(comparison, 3));
  EXPECT_FALSE(hasTagOfMoreAttributes("<script>" + comparison + "</script>", 3));
  EXPECT_FALSE(hasTagOfMoreAttributes("<SCRIPT type='a'>" + comparison + "</b></Script><p>", 3));
  EXPECT_FALSE(hasTagOfMoreAttributes("<style>" + comparison, 3));
  EXPECT_TRUE(hasTagOfMoreAttributes("<script></script>" + comparison, 3));
  EXPECT_TRUE(hasTagOfMoreAttributes("<scripts>" + comparison, 3));
  EXPECT_TRUE(hasTagOfMoreAttributes("<script a b c d></script>", 3));
}

TEST(HTMLText, CountingTakesTimeInProportion) {
  const auto measure = [](std::string_view piece) {
    return [piece](size_t size) {
      std::string HTML;
      while (HTML.size() < size) HTML += piece;
      const double start = processorSeconds();
      EXPECT_FALSE(hasTagOfMoreAttributes(HTML, size));
      return processorSeconds() - start;
    };
  };
  for (const char* piece : {"<p a='", "<p a=\"b'", "<script></", "<script></script>", "<p "}) {
    EXPECT_TRUE(growsInProportion(measure(piece), 1'000'000)) << piece;
  }
}

}  // namespace
}  // namespace xquery

#include "CheckTesting.h"

namespace xquery {
namespace {

using namespace checktest;

TEST(CheckedRemarks, WhatTheParserSaw) {
  expectWarnings({
      {"<a>\n<b>\n</a></b>", "3 end-tag, 3 end-tag"},
      {"<a c='1'></b>", "1 end-tag"},
      {"<a></b>, <a c='1'>x</b>", "1 end-tag, 1 end-tag"},
      {"<p:a xmlns:p='urn:p'></p:a>, <a><b/>x</a>, <a c='1'></a>, <a ></a >", ""},
      {"<p:a xmlns:p='urn:{ 1 }'/>", "1 enclosed-namespace"},
      {"<a xmlns='{ 1 }'/>", "1 enclosed-namespace"},
      {"<a xmlns='' xmlns:p='urn:p' b='{ 1 }'/>", ""},
      {"<a b='x&#10;y&#x9;z'/>", "1 line-end-reference, 1 line-end-reference"},
      {"<a b='x&#228;y'>&#10;</a>", ""},
      {"//a[. instance of element(a,\nxs:integer)]", "1 type-in-test"},
      {"//@attribute(a, xs:integer)", "1 type-in-test"},
      {"//schema-element(a), //@schema-attribute(b)", "1 schema-test, 1 schema-test"},
      {"//element(a), //@attribute(b), //element(*)", ""},
      {"1,\nvalidate { <a/> }", "2 validate"},
      {"import schema 'urn:s'; 1", "1 schema-import"},
      {"declare default collation 'urn:c'; 1", "1 collation"},
      {"declare default collation 'http://www.w3.org/2004/10/xpath-functions/collation/codepoint';"
       "1",
       ""},
      {"declare base-uri 'http://h/'; <a/>", "1 base-uri"},
      {"declare base-uri 'http://h/'; count(//a)", ""},
  });
}

// What each is about, as it stands in the text.
TEST(CheckedRemarks, TellColumnsAndLengths) {
  const Case cases[] = {
      {"<a>é\n<b>\n</a></b>", "3:3+1, 3:7+1"},
      {"1, <a c='1'></bcd >", "1:15+3"},
      {"<p:a\n xmlns:p='urn:{ 1 }'/>", "2:2+19"},
      {"'😀é', <a b='x&#10;y&#x9;z'/>", "1:14+5, 1:20+5"},
      {"//a[. instance of element(a,\nxs:integer)]", "1:19+22"},
      {"//schema-element(a), //@schema-attribute(b)", "1:3+17, 1:25+19"},
      {"1,\nvalidate { <a/> }", "2:1+17"},
      {"import schema 'urn:s'; 1", "1:1+21"},
      {"\r\n declare default collation 'urn:c'; 1", "2:2+33"},
      {"\xEF\xBB\xBF"
       "declare base-uri 'http://h/'; <a/>",
       "1:1+28"},
  };
  for (const Case& each : cases) {
    std::string places;
    for (const XQueryWarning& warning : XQueryWarnings(*explained(each.query))) {
      places += (places.empty() ? "" : ", ") + std::to_string(warning.line) + ":" +
                std::to_string(warning.column) + "+" + std::to_string(warning.length);
    }
    EXPECT_EQ(places, each.warnings) << each.query;
  }
}

// The parser may come upon a tag in a text that it refuses.
TEST(CheckedRemarks, NothingIsSaidOfWhatDoesNotCompile) {
  const auto query = explained("<a></b>, 1 +");
  EXPECT_TRUE(query->parseErrors());
  EXPECT_TRUE(XQueryWarnings(*query).empty());
}

}  // namespace
}  // namespace xquery

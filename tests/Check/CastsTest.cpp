#include "CheckTesting.h"

namespace xquery {
namespace {

using namespace checktest;

TEST(CheckedCasts, OfLiterals) {
  expectWarnings({
      {"xs:date(' 2004-10-29')", "1 cast-fails"},
      {"'--05' cast as xs:gMonth", "1 cast-fails"},
      {"1,\nxs:time('24:00:00')", "2 cast-fails"},
      {"xs:anyURI('a b')", "1 cast-fails"},
      {"xs:integer(())", "1 cast-fails"},
      {"xs:byte(128)", "1 cast-fails"},
      {"() cast as xs:integer?, xs:date('2004-10-29'), xs:byte(127), xs:double('INF')", ""},
      {"xs:integer('12 pieces')", "1 number-from-front"},
      {"xs:integer('2.7'), '1e3' cast as xs:decimal", "1 number-from-front, 1 number-from-front"},
      {"'12 pieces' castable as xs:integer", "1 number-from-front"},
      {"number('1,200.50')", "1 number-from-front"},
      {"xs:integer(' 12 '), xs:decimal('-.5'), xs:double('1e3'), number('x'), number(' 1.5e3 ')",
       ""},
      {"xdt:dayTimeDuration('PT1.05S')", "1 duration-fraction"},
      {"xdt:dayTimeDuration('PT1.5S'), xdt:dayTimeDuration('PT1.50S'), xs:decimal('1.05')", ""},
      {"xs:int(4294967296)", "1 cast-accepts"},
      {"xs:time('23:59:60'), xs:time('12:00:00+99:00')", "1 cast-accepts, 1 cast-accepts"},
      {"xs:date('0000-01-01')", "1 cast-accepts"},
      {"xs:language('no language!')", "1 cast-accepts"},
      {"xs:base64Binary('Q*Q==')", "1 cast-accepts"},
      {"xs:positiveInteger(0.5)", "1 cast-accepts"},
      {"xs:base64Binary('QQ =='), xs:positiveInteger(1), xs:nonNegativeInteger(0.5)", ""},
      {"xs:int(2147483647), xs:time('23:59:59+14:00'), xs:language('en-US'), xs:long('9999999999')",
       ""},
  });
  EXPECT_EQ(textOf("xdt:dayTimeDuration('PT1.05S')"),
            "zeros behind the point are lost: \"PT1.05S\" is read as PT1.5S");
}

TEST(CheckedCasts, OfData) {
  expectWarnings({
      {"//a[. castable as xs:integer]", "1 castable-number"},
      {"(1, 2) castable as xs:integer", "1 castable-of-several"},
      {"//a[. castable as xs:date], count(//a) castable as xs:integer", ""},
      {"xs:integer(//a[1]), //a[1] cast as xs:date?", ""},
  });
}

TEST(CheckedLiterals, ThatAreNotWhatTheyLookLike) {
  expectWarnings({
      {"1e400", "1 literal-too-large"},
      {"1e308, xs:double('INF')", ""},
      {"'&#x1F600;'", "1 lost-character"},
      {"<a>\n\xF0\x9F\x98\x80</a>", "1 lost-character"},
      {"<a b='\xF0\x9F\x98\x80'/>", "1 lost-character"},
      {"'\xF0\x9F\x98\x80', <a>{ '\xF0\x9F\x98\x80' }</a>, '&#xE4;', <a>\xC3\xA4</a>", ""},
  });
}

}  // namespace
}  // namespace xquery

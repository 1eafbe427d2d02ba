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

TEST(CheckedCasts, ThatArePossibleHereAlone) {
  expectWarnings({
      {"xs:hexBinary('0 1')", "1 cast-accepts"},
      {"xs:hexBinary(' 01 ')", ""},
      {"xs:NOTATION('p:n')", "1 cast-accepts"},
      {"'23:59:60' castable as xs:time", "1 cast-accepts"},
      {"4294967296 castable as xs:int, 0.5 castable as xs:positiveInteger",
       "1 cast-accepts, 1 cast-accepts"},
      {"'no language!' castable as xs:language", "1 cast-accepts"},
      {"'23:59:59' castable as xs:time, 4294967296 castable as xs:long", ""},
  });
}

TEST(CheckedCasts, ThatArePossibleElsewhere) {
  expectWarnings({
      {"'INF' castable as xs:float, ' NaN' castable as xs:float",
       "1 castable-refused, 1 castable-refused"},
      {"' 2004-10-29\n' castable as xs:date", "1 castable-refused"},
      {"'--05' castable as xs:gMonth, '--05Z' castable as xs:gMonth",
       "1 castable-refused, 1 castable-refused"},
      {"'24:00:00' castable as xs:time, '2004-10-29T24:00:00' castable as xs:dateTime",
       "1 castable-refused, 1 castable-refused"},
      {"'a b' castable as xs:anyURI, 'a:b' castable as xs:NMTOKEN, ' a  b ' castable as xs:token",
       "1 castable-refused, 1 castable-refused, 1 castable-refused"},
      {"' true ' castable as xs:boolean", "1 castable-refused"},
      {"'INF' castable as xs:double, '2004-10-29' castable as xs:date, 'x' castable as xs:date,"
       "'--13' castable as xs:gMonth, '24:00:01' castable as xs:time, 'x y' castable as xs:NMTOKEN,"
       "'abc' castable as xs:integer, '' castable as xs:float, ' x ' castable as xs:boolean,"
       "'a' castable as xs:token, () castable as xs:date, 1 castable as xs:boolean",
       ""},
      {"xs:NCName(node-name(/*))", "1 cast-fails"},
      {"xs:string(node-name(/*)), xs:NCName(name(/*))", ""},
  });
  EXPECT_EQ(textOf("'INF' castable as xs:float"), "\"INF\" castable as xs:float is false");
}

TEST(CheckedCasts, ThatAreWrittenOtherwise) {
  expectWarnings({
      {"xs:duration('-P1D'), xs:duration('P0D'), xs:duration('P14M')",
       "1 written-otherwise, 1 written-otherwise, 1 written-otherwise"},
      {"xs:duration('P1DT36H'), 'P1Y12MT90S' cast as xs:duration",
       "1 written-otherwise, 1 written-otherwise"},
      {"xs:duration('P1Y2M3DT4H5M6S'), xs:duration('P3D'), xs:duration('PT1M'),"
       "xs:duration('P1YT1M'), xdt:dayTimeDuration('-P1D'), xdt:yearMonthDuration('P14M')",
       ""},
      {"xs:time('10:00:05.5'), xs:dateTime('2004-10-29T10:00:05.25Z')",
       "1 written-otherwise, 1 written-otherwise"},
      {"xs:time('10:00:05'), xs:time('10:00:05.000'), xs:time('10:00:05.123456')", ""},
      {"<a b='{ xs:time('10:00:05.5') }'/>, string((xs:time('10:00:05.5')))",
       "1 written-otherwise, 1 written-otherwise"},
      {"current-time() lt (xs:time('10:00:05.5')), seconds-from-time(xs:time('10:00:05.5'))", ""},
  });
  EXPECT_EQ(textOf("xs:duration('-P14M')"), "\"-P14M\" is written as P14M, and not as -P1Y2M");
  EXPECT_EQ(
      textOf("xs:time('10:00:05.50+01:00')"),
      "\"10:00:05.50+01:00\" is written as 10:00:05.500000+01:00, and not as 10:00:05.5+01:00");
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

#include "CheckTesting.h"

namespace xquery {
namespace {

using namespace checktest;

TEST(CheckedCalls, WithArgumentsThatMakeADifference) {
  expectWarnings({
      {"subsequence(//a,\n0, 2)", "1 subsequence-start"},
      {"subsequence(//a, -1, 2)", "1 subsequence-start"},
      {"subsequence(//a, 1, 2), subsequence(//a, 0), substring('1234', 0, 2)", ""},
      {"for $i in (1, 2) return subsequence(//a, $i, 2)", ""},
      {"deep-equal(//a[1], //b[1])", "1 deep-equal"},
      {"deep-equal((1, 2), (1, 2)), deep-equal(//a/@x, //b/@x)", ""},
      {"index-of(//a, //b[1])", "1 index-of-node"},
      {"index-of(//a, string(//b[1])), index-of((1, 2), 1)", ""},
      {"id('x'), idref('x')", "1 finds-nothing, 1 finds-nothing"},
      {"max(for $a in //a return namespace-uri($a))", "1 aggregate-of-uris"},
      {"max(//a), max(tokenize('1', ','))", "1 untyped-text"},
      {"base-uri(doc('a.xml'))", "1 base-uri-of-document"},
      {"base-uri(//a[1]), document-uri(doc('a.xml'))", ""},
      {"normalize-unicode('a', 'nfc')", "1 normal-form"},
      {"normalize-unicode('a', 'NFC'), normalize-unicode('a'), normalize-unicode('a', '')", ""},
      {"contains('a', 'A', 'urn:c')", "1 collation"},
      {"compare('a', 'b', 'http://www.w3.org/2004/10/xpath-functions/collation/codepoint')", ""},
      {"compare('a', 'b', default-collation())", ""},
      {"number((1, 2))", "1 call-differs"},
      {"node-name()", "1 call-differs"},
      {"/*/base-uri()", "1 call-differs"},
      {"/*/base-uri(.)", ""},
      {"error('bad')", "1 call-differs"},
      {"distinct-values((true(), 1))", "1 call-differs"},
      {"//a[lang('en-US')]", "1 call-differs"},
      {"//a[lang('en')]", ""},
      {"number(//a[1]), node-name(/*), error(), error(QName('urn:e', 'e')), distinct-values(//a)",
       ""},
  });
}

TEST(CheckedCalls, OfPartsOfDurations) {
  expectWarnings({
      {"days-from-duration(xdt:yearMonthDuration('P1Y'))", "1 call-differs"},
      {"hours-from-duration(xdt:yearMonthDuration('P1Y')), "
       "minutes-from-duration(xdt:yearMonthDuration('P1Y')), "
       "seconds-from-duration(xdt:yearMonthDuration('P1Y'))",
       "1 call-differs, 1 call-differs, 1 call-differs"},
      {"years-from-duration(xdt:dayTimeDuration(//a[1])), "
       "months-from-duration(xdt:dayTimeDuration('P1D'))",
       "1 call-differs, 1 call-differs"},
      {"days-from-duration(xs:duration('P1Y')), months-from-duration(xs:duration('P1D'))", ""},
      {"days-from-duration(xdt:dayTimeDuration('P1D')), days-from-duration(//a[1]), "
       "years-from-duration(xdt:yearMonthDuration('P1Y'))",
       ""},
  });
  EXPECT_EQ(textOf("days-from-duration(xdt:yearMonthDuration('P1Y'))"),
            "days-from-duration of a yearMonthDuration: it fails, and is not 0");
}

TEST(CheckedCalls, WithTextsThatMakeADifference) {
  expectWarnings({
      {"doc('')", "1 call-differs"},
      {"doc('a.xml'), for $u in ('', 'a') return doc($u)", ""},
      {"string-length('\xF0\x9F\x98\x80')", "1 call-differs"},
      {"substring('a\xF0\x9F\x98\x80', 2)", "1 call-differs"},
      {"string-length('\xC3\xA4'), string-to-codepoints('\xF0\x9F\x98\x80')", ""},
      {"codepoints-to-string(0)", "1 call-differs"},
      {"codepoints-to-string(65)", ""},
      {"abs(xs:negativeInteger(-5))", "1 call-differs"},
      {"abs(xs:integer(-5)), abs(-5)", ""},
      {"QName('', 'p:a'), QName((), 'p:a'), QName('urn:x', 'a b')",
       "1 call-differs, 1 call-differs, 1 call-differs"},
      {"QName('', 'a'), QName('urn:x', 'p:a'), QName(string(/*), 'p:a')", ""},
      {"sum(current-date()), avg(xs:time('10:00:00'))", "1 call-differs, 1 call-differs"},
      {"sum(//a), max(current-date()), sum(xdt:dayTimeDuration('P1D'))", ""},
      {"tokenize('', ',')", "1 call-differs"},
  });
}

// In XQuery 1.0 as many digits are read as make the number of a group that there is.
TEST(CheckedCalls, WithReferencesToManyGroups) {
  expectWarnings({
      {"replace('x', '(a)(b)(c)(d)(e)(f)(g)(h)(i)(j)(k)', '$11')", "1 call-differs"},
      {"replace('x', '(a)(b)(c)(d)(e)(f)(g)(h)(i)(j)', '-$1-$10')", "1 call-differs"},
      {"replace('x', '(a)(b)(c)(d)(e)(f)(g)(h)(i)(j)', '$11')", ""},
      {"replace('x', '(a)(b)(c)(d)(e)(f)(g)(h)(i)(?:j)', '$10')", ""},
      {"replace('x', '(a)(b)(c)(d)(e)(f)(g)(h)(i)\\(j[(]', '$10')", ""},
      {"replace('x', '(a)(b)(c)(d)(e)(f)(g)(h)(i)(j)', '\\$10 $1 $01 $1x0')", ""},
      {"replace('x', '(a)', '$11'), replace('x', string(/*), '$11')", ""},
  });
  EXPECT_EQ(textOf("replace('x', '(a)(b)(c)(d)(e)(f)(g)(h)(i)(j)(k)', '$11')"),
            "replace with $11: it is group 1 and a digit");
}

TEST(CheckedCalls, WithPatterns) {
  expectWarnings({
      {"matches('ab', '^\\i\\c*$')", "1 pattern-differs"},
      {"replace('b', '[a-z-[aeiou]]', '')", "1 pattern-differs"},
      {"matches('b', '\\p{IsBasicLatin}')", "1 pattern-differs"},
      {"matches('a#b', 'a#b', 'x')", "1 pattern-differs"},
      {"replace('a#b', '#', '', 'ix')", "1 pattern-differs"},
      {"matches('a#b', 'a#b'), matches('a#b', 'a#b', 'i'), matches('a#b', 'a\\#b[#]', 'x')", ""},
      {"matches('x', '^\\w+\\d$'), tokenize('x', '\\s+|\\b-\\z')", ""},
      {"matches('x', '[')", "1 pattern-fails"},
      {"matches('x', 'x', 'q')", "1 pattern-fails"},
      {"replace('abc', 'x*', '-')", "1 pattern-fails"},
      {"tokenize('abc', 'x?')", "1 pattern-fails"},
      {"matches('abc', 'x*'), matches('a', '\\\\i'), matches('a', '[a-z-]'), tokenize('a', "
       "',\\s*'),"
       "matches('a', '\\p{L}', 'i'), replace('a', '(a)', '$1$1')",
       ""},
      {"for $p in ('[', 'a') return matches('x', $p)", ""},
  });
}

}  // namespace
}  // namespace xquery

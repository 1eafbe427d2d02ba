// Numbers, names, URIs, dates and binaries, most of them written very long.
#include "LimitRows.h"

namespace bench {
namespace {

std::string digits(const char* name, char digit) {
  return "let $" + std::string(name) + " := xs:decimal('7" + std::string(120'000, digit) + "') ";
}
std::string twoDecimals() {
  return digits("a", '3') + digits("b", '4');
}
std::string manyDecimals(int count = 3000) {
  return twoDecimals() + "let $all := for $i in 1 to " + std::to_string(count) + " return $a + $i ";
}
constexpr const char* often = "for $i in 1 to 1000000 ";

}  // namespace

std::vector<LimitRow> valueRows() {
  return {
      // --- decimals of 120,000 digits, whose products are still decimals
      {"decimal: value comparison",
       [] { return twoDecimals() + often + "where $a eq $b return $i"; }},
      {"decimal: with an integer",
       [] { return twoDecimals() + often + "where $a lt $i return $i"; }},
      {"decimal: with a double",
       [] { return twoDecimals() + often + "where $a lt 1e3 return $i"; }},
      {"decimal: general comparison", [] { return manyDecimals() + "return $all = $all[. < 0]"; }},
      {"decimal: two lists",
       [] { return manyDecimals() + "return $all = (for $i in $all return $i + 0.5)"; }},
      {"decimal: sort",
       [] { return manyDecimals() + "return count(for $d in $all order by $d return $d)"; }},
      {"decimal: index-of",
       [] { return manyDecimals() + "for $d in $all return index-of($all, $d)"; }},
      {"decimal: distinct-values",
       [] { return manyDecimals() + "return count(distinct-values($all))"; }},
      {"decimal: sums", [] { return manyDecimals() + often + "return sum($all)"; }},
      {"decimal: extremes", [] { return manyDecimals() + often + "return max($all)"; }},
      {"decimal: small results",
       [] { return twoDecimals() + often + "where $a - $a > 0 return $i"; }},
      {"decimal: products", [] { return twoDecimals() + often + "return count($a * $b)"; }},
      {"decimal: quotients",
       [] { return twoDecimals() + often + "return count(($a * $b) idiv $a)"; }},
      {"decimal: remainders", [] { return twoDecimals() + often + "return count($a mod 7)"; }},
      {"decimal: rounding", [] { return twoDecimals() + often + "return count(round($a div 7))"; }},
      {"decimal: as text",
       [] { return twoDecimals() + often + "where string($a) = '' return $i"; }},
      {"decimal: as double",
       [] { return twoDecimals() + often + "where xs:double($a) = 0 return $i"; }},
      {"decimal: from text",
       [] {
         return twoDecimals() + "let $t := string($a) " + often +
                "where xs:decimal($t) = 0 return $i";
       }},
      {"decimal: squares",
       "declare function local:f($n, $i) { if ($i = 0) then $n else local:f($n * $n, $i - 1) }; "
       "local:f(xs:decimal('12345678901234567890'), 60) = 0"},
      {"decimal: boolean", [] { return twoDecimals() + often + "where not($a) return $i"; }},
      {"decimal: from megabytes",
       [] { return doubledText("1234567890123456", 19) + "return xs:integer($s) = 0"; }},
      // --- numbers and dates from long texts
      {"number: digits", [] { return doubledText("1234567890123456", 22) + "return number($s)"; }},
      {"number: fraction",
       [] { return doubledText("0000000000000000", 22) + "return number(concat('0.', $s))"; }},
      {"number: double",
       [] { return doubledText("1234567890123456", 22) + "return xs:double($s)"; }},
      {"number: exponent",
       [] { return doubledText("1234567890123456", 22) + "return number(concat('1e', $s))"; }},
      {"number: blanks",
       [] { return doubledText("                ", 22) + "return number(concat($s, '1'))"; }},
      {"number: castable as integer",
       [] {
         return doubledText("1234567890123456", 22) + often +
                "where $s castable as xs:integer return $i";
       }},
      {"date: long year",
       [] {
         return doubledText("1234567890123456", 20) + often +
                "where concat($s, '-01-01') castable as xs:date return $i";
       }},
      {"date: long fraction",
       [] {
         return doubledText("1234567890123456", 20) + often +
                "where concat('2004-01-01T00:00:00.', $s) castable as xs:dateTime return $i";
       }},
      {"date: long duration",
       [] {
         return doubledText("1234567890123456", 20) + often +
                "where concat('P', $s, 'D') castable as xs:duration return $i";
       }},
      {"date: arithmetic",
       "for $i in 1 to 10000000 where xs:date('2004-01-31') + xdt:yearMonthDuration('P1M') < "
       "xs:date('1999-01-01') return $i"},
      {"date: zones",
       "for $i in 1 to 10000000 where adjust-dateTime-to-timezone(current-dateTime(), "
       "xdt:dayTimeDuration('PT5H')) < current-dateTime() and $i < 0 return $i"},
      // --- URIs
      {"uri: cast of slashes",
       [] {
         return doubledText("////////////////", 20) +
                "return string-length(string($s cast as xs:anyURI))";
       }},
      {"uri: cast of segments",
       [] {
         return doubledText("/a/b/c/d/e/f/g/h", 19) +
                "return string-length(string($s cast as xs:anyURI))";
       }},
      {"uri: castable",
       [] {
         return doubledText("a/b/c/d/e/f/g/h/", 19) + often +
                "where not($s castable as xs:anyURI) return $i";
       }},
      {"uri: castable, no colon",
       [] {
         return doubledText("aaaaaaaaaaaaaaaa", 19) + often +
                "where not($s castable as xs:anyURI) return $i";
       }},
      {"uri: resolved segments",
       [] {
         return doubledText("a/b/c/d/e/f/g/h/", 19) + often +
                "where resolve-uri($s, 'http://h/') = '' return $i";
       }},
      {"uri: resolved dots",
       [] {
         return doubledText("a/../b/../c/./d/", 19) + often +
                "where resolve-uri($s, 'http://h/') = '' return $i";
       }},
      {"uri: resolved upwards",
       [] {
         return doubledText("../../../../../../", 17) +
                "let $b := concat('http://h/', translate($s, '.', 'a')) " + often +
                "where resolve-uri($s, $b) = '' return $i";
       }},
      {"uri: escapes",
       [] {
         return doubledText("%20%20%20%20%20%", 19) + often +
                "where $s castable as xs:anyURI return $i";
       }},
      {"uri: escape-uri",
       [] {
         return doubledText("a b c d e f g h ", 19) + often +
                "where string-length(escape-uri($s, true())) = 0 return $i";
       }},
      // --- names and binaries
      {"name: castable as NCName",
       [] {
         return doubledText("abcdefghijklmnop", 20) + often +
                "where not($s castable as xs:NCName) return $i";
       }},
      {"name: castable as token",
       [] {
         return doubledText("abc efgh jkl nop", 20) + often +
                "where not($s castable as xs:token) return $i";
       }},
      {"name: QName",
       [] {
         return doubledText("abcdefghijklmnop", 20) + often +
                "where string(QName('u', $s)) = '' return $i";
       }},
      {"binary: hexadecimal",
       [] {
         return doubledText("0123456789abcdef", 20) + often +
                "where xs:hexBinary($s) = xs:hexBinary('00') return $i";
       }},
      {"binary: base 64",
       [] {
         return doubledText("0123456789abcdef", 20) + often +
                "where xs:base64Binary($s) = xs:base64Binary('AAAA') return $i";
       }},
      {"binary: find all",
       [] {
         return doubledText("0123456789abcdef", 20) +
                "let $b := xs:hexBinary($s) return count(ext:binary-find-all($b, "
                "xs:hexBinary('01'), xs:hexBinary('23')))";
       }},
      {"binary: find with near misses",
       [] {
         return doubledText("0000000000000000", 17) +
                "let $b := xs:hexBinary($s) return count(ext:binary-find($b, "
                "xs:hexBinary(concat(substring($s, 1, 200000), '01')), xs:hexBinary('23')))";
       }},
  };
}

}  // namespace bench

// One pass over one long text, and patterns.
#include "LimitRows.h"

namespace bench {
namespace {

constexpr const char* often = "for $i in 1 to 1000000 ";

// 128 Mi units.
std::string longText(const char* text = "0123456789abcdef") {
  return doubledText(text, 23);
}
// 8 Mi units, for what keeps several bytes for each.
std::string text(const char* text = "0123456789abcdef") {
  return doubledText(text, 19);
}
constexpr const char* wide = "&#233;123456789abcdef";

}  // namespace

std::vector<LimitRow> textRows() {
  return {
      // --- one pass
      {"text: doubling", "declare function local:f($s) { local:f(concat($s, $s)) }; local:f('ab')"},
      {"text: string-join, wide",
       [] { return longText() + "return string-length(string-join(($s, '&#233;'), ''))"; }},
      {"text: concat, wide",
       [] { return longText() + "return string-length(concat($s, '&#233;'))"; }},
      {"text: string-from-node",
       [] {
         return longText() + "let $e := <e>{$s}</e> return string-length(ext:string-from-node($e))";
       }},
      {"text: string-from-node, escaped",
       [] {
         return longText("&amp;&lt;&gt;&amp;&lt;&gt;abcdefghij") +
                "let $e := <e>{$s}</e> return string-length(ext:string-from-node($e))";
       }},
      {"text: node-from-string",
       [] { return longText() + "return count(ext:node-from-string(concat('<e>', $s, '</e>')))"; }},
      {"text: eval", [] { return longText() + "return ext:eval(concat('1 (: ', $s, ' :)'))"; }},
      {"text: binary-from-string",
       [] { return longText() + "return ext:binary-length(ext:binary-from-string($s))"; }},
      {"text: binary-from-string, UTF-16",
       [] {
         return longText() + "return ext:binary-length(ext:binary-from-string($s, 'utf-16'))";
       }},
      {"text: string-from-binary",
       [] {
         return longText() +
                "return string-length(ext:string-from-binary(ext:binary-from-string($s)))";
       }},
      {"text: lower-case of sigma",
       [] {
         return longText("&#931;&#931;&#931;&#931;abcdefghijkl") +
                "return string-length(lower-case($s))";
       }},
      {"text: upper-case", [] { return longText(wide) + "return string-length(upper-case($s))"; }},
      {"text: normalize-unicode",
       [] { return longText(wide) + "return string-length(normalize-unicode($s, 'NFD'))"; }},
      {"text: combining characters",
       [] {
         return longText("a&#769;&#768;&#770;&#771;&#772;&#773;&#774;&#775;&#776;&#777;&#778;") +
                "return string-length(normalize-unicode($s, 'NFC'))";
       }},
      {"text: translate",
       [] { return longText() + "return string-length(translate($s, 'a9', '&#233;'))"; }},
      {"text: translate by a long text",
       [] { return text() + "return string-length(translate($s, $s, 'b'))"; }},
      {"text: normalize-space",
       [] { return longText("a  b  c  d  e  f") + "return string-length(normalize-space($s))"; }},
      {"text: codepoints", [] { return text() + "return count(string-to-codepoints($s))"; }},
      {"text: substring, wide",
       [] {
         return longText(wide) + often +
                "where substring($s, 2, string-length($s) - $i) = '' return $i";
       }},
      {"text: contains", [] { return longText() + often + "where contains($s, 'fe') return $i"; }},
      {"text: near misses",
       [] {
         return text("aaaaaaaaaaaaaaaa") + "let $p := concat(substring($s, 1, 1000000), 'b') " +
                often + "where contains($s, $p) return $i";
       }},
      {"text: comparison",
       [] {
         return longText() + "let $t := concat($s, 'x') " + often +
                "where concat($s, 'y') = $t return $i";
       }},
      {"text: wide against narrow",
       [] {
         return longText() + "let $t := substring-before(concat($s, '&#233;'), '&#233;') " + often +
                "where $t lt $s return $i";
       }},
      {"text: hash",
       [] { return longText() + often + "return count(distinct-values((concat($s, $i), $s)))"; }},
      {"text: effective boolean value",
       [] { return longText() + often + "where not(string($s)) return $i"; }},
      {"text: many short ones joined",
       "string-length(string-join(for $i in 1 to 20000000 return 'abc', ','))"},
      {"text: concat of many",
       [] { return "string-length(concat('a'" + repeated(", 'b@'", 20'000) + "))"; }},
      // --- patterns
      {"pattern: backtracking",
       [] { return "matches('" + std::string(5000, 'a') + "', '(a+)+b')"; }},
      {"pattern: backtracking often",
       [] {
         return "let $s := '" + std::string(25, 'a') + "' " + often +
                "where matches($s, '(a+)+b') return $i";
       }},
      {"pattern: nested quantifiers",
       [] { return "matches('" + std::string(50'000, 'a') + "', '((a*)*)*b')"; }},
      {"pattern: a long text",
       [] { return longText() + often + "where matches($s, 'g') return $i"; }},
      {"pattern: wide text",
       [] { return longText(wide) + often + "where matches($s, 'g') return $i"; }},
      {"pattern: replace",
       [] { return text() + "return string-length(replace($s, '[0-9]', 'xyz'))"; }},
      {"pattern: growing",
       "declare function local:f($s) { local:f(replace($s, 'a', 'aaaaaaaa')) }; local:f('a')"},
      {"pattern: tokens", [] { return text() + "return count(tokenize($s, 'a'))"; }},
      {"pattern: tokens of one character",
       [] { return text() + "return count(tokenize($s, '.'))"; }},
      {"pattern: long", [] { return "matches('abc', '" + repeated("(a|b)", 50'000) + "')"; }},
      {"pattern: classes",
       [] { return "matches('abc', '" + repeated("[a-z0-9]{1,100}", 5'000) + "')"; }},
      {"pattern: many",
       "for $i in 1 to 10000000 where matches('abc', concat('x', $i, '[a-z]+y')) return $i"},
      {"pattern: references",
       [] { return "matches('" + std::string(20'000, 'a') + "', '(a*)(a*)\\1\\2b')"; }},
  };
}

}  // namespace bench

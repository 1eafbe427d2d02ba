#include "CheckTesting.h"

namespace xquery {
namespace {

using namespace checktest;

TEST(CheckedPaths, StepsThatFindNothing) {
  expectWarnings({
      {"//@a/b", "1 step-never-matches"},
      {"//a/text()/x", "1 step-never-matches"},
      {"//a/comment()/@x", "1 step-never-matches"},
      {"//a/attribute::text()", "1 step-never-matches"},
      {"//@a/@b", "1 step-never-matches"},
      {"//@a/following-sibling::*", "1 step-never-matches"},
      {"//a/child::attribute()", "1 step-never-matches"},
      {"//a/attribute(b)", "1 step-never-matches"},
      {"/..", "1 step-never-matches"},
      {"//@a[b]", "1 step-never-matches"},
      {"for $t in //text()\nreturn $t/b", "2 step-never-matches"},
      {"//a/text()/self::comment()", "1 step-never-matches"},
      {"//@a/../b, count(//a/text()/..), //a/@*, //text()/parent::a/text()", ""},
      {"/a/b//c/@d, //a/text(), //a/node()/b, //node()/self::text()", ""},
      {"//a/text()/following-sibling::b, //a/text()//b, //@a//b, //@a/ancestor::b/c", ""},
      {"declare function local:f($n) { $n/a/@b }; local:f(//c)", ""},
  });
  EXPECT_EQ(textOf("//@a/b"), "step b finds nothing: an attribute has no children");
}

TEST(CheckedPaths, StepsFromValues) {
  expectWarnings({
      {"(1, 2)/a", "1 step-from-value"},
      {"for $n in (1, 2)\nreturn $n/title", "2 step-from-value"},
      {"//a/string()/b", "1 step-from-value"},
      {"(1, 2)[a]", "1 step-from-value"},
      {"(1, 2)/string()", "1 path-over-values"},
      {"(//a, 1)/b", ""},
      {"//a/b/string()", ""},
      {"declare variable $x external; $x/a", ""},
  });
}

TEST(CheckedPaths, WhatXQuery10AnswersOtherwise) {
  expectWarnings({
      {"('a', 'b', 'c')[2.5]", "1 fraction-position"},
      {"//a[2], //a[2.0], //a[@n = 2.5]", ""},
      {"//@*[self::a]", "1 self-of-attribute"},
      {"//@a/self::*", "1 self-of-attribute"},
      {"//a/@b/following::c, //@*/following::*",
       "1 following-of-attribute, 1 following-of-attribute"},
      {"//a/following::c, //a[@b]/c/following::c, //node()/following::c", ""},
      {"//*[self::a], //@*[name() = 'a'], //node()/self::a", ""},
      {"//b/exists(@x)", "1 values-merged"},
      {"//b/'x'", "1 values-merged"},
      {"let $v := 'q' return //b/$v", "1 values-merged"},
      {"//b/string(), //b/count(c), /exists(b)", ""},
      {"for $b in //b return $b/exists(@x)", ""},
      {"//a/b/position()", "1 position-in-step"},
      {"//a/last()", "1 position-in-step"},
      {"//a[position() = 1], //a[last()], (//a, //b)/position()", ""},
  });
}

TEST(CheckedPaths, OrderAgainstTheDocument) {
  expectWarnings({
      {"//d/preceding-sibling::*", "1 reverse-order"},
      {"//title/..", "1 reverse-order"},
      {"ancestor::*", "1 reverse-order"},
      {"../..", "1 reverse-order"},
      {"(//d/ancestor::*)[1]", "1 reverse-order"},
      {"//d/ancestor::*/name()", "1 reverse-order"},
      {"let $p := //d/preceding::b\nreturn <x>{ $p }</x>", "1 reverse-order"},
      {"declare function local:f($d) { $d/preceding-sibling::* }; local:f(//d)", "1 reverse-order"},
      {"//d/preceding-sibling::*[1]/name()", "1 reverse-order"},
      {"..", ""},
      {"count(//d/preceding-sibling::*)", ""},
      {"//d[preceding-sibling::*]", ""},
      {"//d[ancestor::a/@x = 1]", ""},
      {"//d/ancestor::a/b", ""},
      {"for $d in //d return $d/preceding-sibling::*[1]", ""},
      {"for $d in //d return $d/..", ""},
      {"reverse(//d/preceding-sibling::*)", ""},
      {"//d/ancestor::* | //e", ""},
      {"for $a in //d/ancestor::* order by $a/@x return $a", ""},
      {"unordered { //d/preceding-sibling::* }", ""},
  });
}

}  // namespace
}  // namespace xquery

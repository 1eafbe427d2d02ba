// Paths that are walked where the variable is used that stands for them.
#include "Plan/RulesTesting.h"

#include <string>

namespace xquery {
namespace {

using namespace plantest;

constexpr const char* bodies[] = {
    "$v/a",
    "$v[@x = '1']",
    "$v//b[1]",
    "($v)/a/b",
    "count($v/b)",
    "for $i in $v where $i/@x = '1' return $i/b",
    "for $i in $v, $j in $i/b return $j",
    "let $w := $v/a return $w[b]/b",
    "let $w := $v/a for $i in $w where $i/@x = '1' return name($i)",
    "if ($v/a) then 1 else 2",
    "<e>{$v/a}</e>/a/b",
    "($v/a, error())",
    "unordered { $v/a }",
    "typeswitch (1) case xs:integer return $v/a default return ()",
    // It stays where it is.
    "$v",
    "$v[1]",
    "$v[last()]",
    "$v[count(a)]",
    "$v[position() < 3]/b",
    "for $i at $n in $v return $n",
    "($v/a, $v/b)",
    "for $i in 1 to 3 return $v/a",
    "//a[$v/a]",
    "//a/($v/a)",
    "some $i in (1, 2) satisfies $v/b",
    "for $v in $v return $v/a",
    "(<a><b/></a>, $v/a)[b]",
};
constexpr const char* paths[] = {"(/)", "/r", "//a", "/r/a", "/r//b", "//@x", "(//c)", "/r/*",
                                 "//text()",
                                 // These are walked there.
                                 "//a[1]", "//b/..", "a", "//a | //b", "(//a, 1)", "<a><b/></a>"};

TEST(MovePaths, FindsWhatTheVariableHolds) {
  size_t turn = 0;
  for (const char* path : paths) {
    for (const std::string body : bodies) {
      if (++turn % 2 != 0) continue;  // pairs enough
      const std::string let = std::string("let $v := ") + path + " return (" + body + ")";
      sameBothWays(let, names());
      sameBothWays("count((" + let + ")), 1[" + let + "]", names());
      sameBothWays("declare function local:f($w, $v) { " + body + " }; local:f(1, " + path + ")",
                   names());
      sameBothWays("for $k in (//a)[position() < 3] " + let, names());
    }
  }
}

TEST(MovePaths, FailsAsItDid) {
  for (const std::string body : bodies) {
    sameBothWays("1,\nlet $v :=\n//a\nreturn (error(), " + body + ")");
    sameBothWays("let $v := error() let $w := //a return ($w/b, " + body + ")");
    sameBothWays("declare function local:f($v)\n{ " + body + " };\nlocal:f(\n//a)");
    sameBothWays("declare function local:f($w, $v)\n{ " + body + " };\nlocal:f(error(), //a)");
    sameBothWays("<r><a><b/></a></r>/(let $v := /r/a return (" + body + "))");
    sameBothWays("let $v := /r/a return (" + body + ")", document("<a/>"));
    sameBothWays("let $v := /r/a return (" + body + ")",
                 Value(cast<NSXMLNode>(names().get())->firstChild()));
  }
}

TEST(MovePaths, IsSeenInThePlan) {
  for (const char* text : {
           "let $v := /r/a return $v[@x = '1']",
           "let $v := //a for $i in $v where $i/@x = '1' return $i",
           "let $s := /r let $v := $s/a return $v/b",
           "let $v := (/) for $i in $v//a return $v/r/b",
           "declare function local:f($v) { $v/a }; local:f(/r)",
           "declare function local:f($v) { for $i in 1 to 3 return $v//a }; local:f(/)",
           "(1, if (2) then let $v := /r return $v/a else 3)",
       }) {
    EXPECT_GT(choicesOf("moved paths", text), 0U) << text;
  }
  for (const char* text : {
           "let $v := /r/a return ($v[@x = '1'], $v)",
           "//b[let $v := /r/a return $v/b]",
           "let $v := /r/a[b] return $v/b",
           "let $v as node()* := /r/a return $v/b",
           "let $v := /r/a return $v[2]",
           "let $v := /r/a return $v",
           "declare function local:f($v) { $v/a }; (local:f(/r), local:f(//a))",
           "declare function local:f($v) { if ($v) then local:f($v/a) else () }; local:f(/r)",
           "declare function local:f($v) { $v/a }; for $i in 1 to 3 return local:f(/r)",
           "declare function local:f() { let $v := /r/a return $v/b }; local:f()",
       }) {
    EXPECT_EQ(choicesOf("moved paths", text), 0U) << text;
  }
}

TEST(MovePaths, TakesTheIndexOfTheTree) {
  for (const char* text :
       {"declare function local:f($v, $id) { $v[@x = $id]/b/@y }; local:f(/r/a, '1')",
        "declare function local:f($v) { for $i in $v where $i/@x = '1' return $i }; local:f(/r/a)",
        "let $v := /r/a return $v[@x = '1']/b"}) {
    EXPECT_EQ(choicesOf("values", text), 1U) << text;
    sameBothWays(std::string(text), manyNames());
  }
  const char* const found = "/r/a[@x = 'none']/b";
  const char* const moved = "let $v := /r/a return $v[@x = 'none']/b";
  EXPECT_LE(stepsOf(moved), stepsOf(found) + 10);
  EXPECT_LT(stepsOf("let $v := /r/a return count($v/b)"), 20);
}

}  // namespace
}  // namespace xquery

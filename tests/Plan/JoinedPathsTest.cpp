// Paths that are written in parts: in variables, functions and loops.
#include "Plan/RulesTesting.h"

#include <string>

namespace xquery {
namespace {

using namespace plantest;

// What is made of "V", which stands for a path.
constexpr const char* uses[] = {
    "V/b",
    "V[@x = '1']",
    "V[@x = '1'][b]/b/@y",
    "(V)[b = 'u']/..",
    "count(V)",
    "exists(V), empty((V)), not(V)",
    "for $i in V where $i/@x = '1' return $i/b",
    "for $i in 1 to 3 return V[@x = string($i)]",
    "for $i in 1 to 3, $j in V where $j/@x = $i return $j",
    "some $i in V satisfies $i/@x = '1'",
    "//a[V/b]",
    "//c/(V/a)",
    "(V/a, V/b, count(V))",
    "<e>{V/a}</e>/a/b",
    "V//b[1], V/b[last()]",
    "V[not(b)][. = V/b]",
    "count(V[b]) + count(V/b)",
    "unordered { V/a }",
    "local:g(1)",
    // They stay what they were.
    "V",
    "V[1]",
    "V[position() < 3]/b",
    "V[count(a)]",
    "for $i at $n in V return $n",
    "(V, V/a)",
    "V/string(@x)",
    "V/<z/>",
    "V[V/b]",
};
constexpr const char* paths[] = {"/r",    "//a",    "/r/a",     "/r//b",      "//@x",
                                 "(//c)", "/r/*",   "//text()", "//a[b]",     "a",
                                 "(/)",   "//b/..", "(//a, 1)", "<a><b/></a>"};

std::string withV(std::string text, const std::string& by) {
  for (size_t at = text.find('V'); at != std::string::npos; at = text.find('V')) {
    text.replace(at, 1, by);
  }
  return text;
}

std::string ofVariable(const std::string& use, const std::string& path) {
  return "declare variable $v := " + path +
         "; declare function local:g($k) { count(($v/b)[$k]) };\n" + withV(use, "$v");
}
std::string ofFunction(const std::string& use, const std::string& path) {
  return "declare function local:v() { " + path +
         " }; declare function local:g($k) { local:v()[@x = $k] };\n" + withV(use, "local:v()");
}
std::string ofLet(const std::string& use, const std::string& path) {
  return "declare function local:g($k) { $k };\nlet $v := " + path + "\nreturn (" +
         withV(use, "$v") + ")";
}

TEST(JoinedPaths, FindWhatThePartsFind) {
  size_t turn = 0;
  for (const char* path : paths) {
    for (const std::string use : uses) {
      for (const auto& text : {ofVariable(use, path), ofFunction(use, path), ofLet(use, path)}) {
        if (++turn % 2 != 0) continue;  // pairs enough
        sameBothWays(text, names());
        sameBothWays(text);
        sameBothWays(text, Value(cast<NSXMLNode>(names().get())->firstChild()));
      }
    }
  }
}

TEST(JoinedPaths, FindWhatLoopsFind) {
  for (const char* text : {
           "for $p in /r for $q in $p/a return $q/@x",
           "for $p in /r/*, $q in $p/* where $q/.. return name($q)",
           "for $p in /r, $q in $p/a[1], $s in $q/b return $s",
           "for $p in /r for $q in $p/a[@x = '1']/@* order by string($q) return string($q)",
           "for $p in /r/a for $q in $p/@x let $n := $q return ($n, count($q))",
           "for $p in //a for $q in $p/a return name($q)",
           "for $p in /r for $q in $p//a return name($q)",
           "for $p in /r for $q in $p/a return ($p/@x, $q)",
           "for $p at $n in /r for $q in $p/a return $n",
           "for $p in /r for $q at $n in $p/a return $n",
           "for $p in /r for $q in $p/a/.. return name($q)",
           "for $p in /r for $q in $p/string(a) return $q",
           "for $p in /r for $q in $p/a return for $p in $q/b return $p/..",
       }) {
    sameBothWays(text, names());
    sameBothWays(text);
    sameBothWays("for $i in //a return (" + std::string(text) + ")", names());
    sameBothWays("//a/(" + std::string(text) + ")", names());
  }
}

TEST(JoinedPaths, LeaveWhatMayHoldSomethingElse) {
  for (const char* text : {
           "declare variable $a := $b; declare variable $b := /r; ($a, $b/a)",
           "declare function local:f() { $b/a }; declare variable $a := local:f(); "
           "declare variable $b := /r; $b/a",
           "declare variable $b := /r; declare variable $c := $b/a; $c[@x = '1']/b",
           "declare variable $b external; $b/a",
           "let $v := /r/a return for $v in $v return $v/b",
           "some $v in () satisfies (let $w := //a return ($v, $w/b, $w/c))",
       }) {
    sameBothWays(text, names());
  }
}

TEST(JoinedPaths, AreSeenInThePlan) {
  for (const std::string path : {"/r/a", "//a"}) {
    for (const std::string use : {"V/b", "V[@x = '1']", "count(V)", "for $i in V return $i/b",
                                  "for $i in 1 to 3 return V/b", "//a[V/b]"}) {
      EXPECT_GT(
          choicesOf("moved paths", withV("declare variable $v := " + path + "; " + use, "$v")), 0U)
          << use;
      EXPECT_GT(
          choicesOf("moved paths",
                    withV("declare function local:v() { " + path + " }; " + use, "local:v()")),
          0U)
          << use;
      EXPECT_GT(choicesOf("moved paths", withV("let $v := " + path + " return " + use, "$v")), 0U)
          << use;
    }
  }
  for (const char* text : {"for $p in /r for $q in $p/a return $q",
                           "for $p in /r, $q in $p/a, $s in $q/b[@y] return $s"}) {
    EXPECT_GT(choicesOf("moved paths", text), 0U) << text;
  }
  for (const char* text : {
           "declare variable $v := /r/a; ($v[@x = '1'], $v)",
           "declare variable $v := /r/a; $v[2]",
           "declare variable $v := /r/a[b]; $v/b",
           "declare variable $v := /r/a; declare function local:f() external; ($v/b, local:f())",
           "declare variable $v := //a; for $b in //b return $v[b = $b]",
           "declare variable $v := //a; declare function local:f($b) { $v[b = $b] }; local:f(1)",
           "let $v := //a return ($v[@x > 1], $v[@x < 1])",
           "declare function local:v() { /r/a }; (local:v()/b, local:v())",
           "declare function local:v($k) { /r/a }; local:v(1)/b",
           "for $p in //a for $q in $p/a return $q",
           "for $p in /r for $q in $p/a return $p",
           "//b[for $p in /r for $q in $p/a return $q]",
       }) {
    EXPECT_EQ(choicesOf("moved paths", text), 0U) << text;
  }
}

TEST(JoinedPaths, TakeTheIndexOfTheTree) {
  const int64_t found = stepsOf("/r/a[@x = 'none']/b");
  for (const char* text : {"let $v := /r/a return ($v[@x = 'none']/b, count($v))",
                           "for $p in /r for $q in $p/a where $q/@x = 'none' return $q/b",
                           "for $p in /r, $q in $p/a return $q[@x = 'none']/b"}) {
    EXPECT_LE(stepsOf(text), found + 20) << text;
  }
  for (const char* text : {"declare variable $v := /r/a; $v[@x = 'none']/b",
                           "declare function local:v() { /r/a }; local:v()[@x = 'none']/b"}) {
    EXPECT_EQ(choicesOf("values", text), 1U) << text;
    sameBothWays(text, manyNames());
  }
}

// What a command reads of its input is told of the query as it is written.
TEST(JoinedPaths, AreReadAsTheyAreWritten) {
  const auto query = compiled("let $v := /r/a return ($v/b, $v/c)", XQueryWay::Explained);
  EXPECT_NE(_internal(*query).planReport()->text().find("/r/a/b"), std::string::npos);
  const auto whole = compiled("declare variable $v := /r/a; $v/..", XQueryWay::Explained);
  EXPECT_NE(_internal(*whole).planReport()->text().find("all of it"), std::string::npos);
}

}  // namespace
}  // namespace xquery

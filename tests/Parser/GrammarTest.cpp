// The productions: every one of the 421 is reduced by some query, under its number, with its
// symbols.
#include "Parser/XQueryParser.h"
#include "Parser/XQueryScanner.h"
#include "Parser/XQueryTokens.h"

#include <gtest/gtest.h>

#include <fstream>
#include <map>
#include <set>
#include <sstream>
#include <string>
#include <vector>

namespace xquery {
namespace {

// Number to production, as the grammar must have them: "name: symbol symbol".
std::map<int, std::string> listedProductions() {
  std::map<int, std::string> result;
  std::ifstream file(XQUERY_SOURCE_DIR "/tests/Parser/productions.txt");
  for (std::string line; std::getline(file, line);) {
    const size_t blank = line.find(' ');
    result[std::stoi(line.substr(0, blank))] = line.substr(blank + 1);
  }
  return result;
}

struct Trace {
  std::map<int, std::string> productions;  // those reduced, in the form of the list
  std::vector<std::string> errors;
  bool hasModule = false;
};

// Reads the grammar's own trace of a parse.
Trace traceOf(std::string_view query) {
  // The environment is read at the first parse.
  const Ref<XQueryParser> first = XQueryParser::parserWithSource(NSString::empty());
  XQdebug = 1;
  testing::internal::CaptureStderr();
  const Ref<XQueryParser> parser = XQueryParser::parserWithSource(NSString::stringWithUTF8(query));
  std::istringstream output(testing::internal::GetCapturedStderr());
  XQdebug = 0;

  Trace trace;
  trace.hasModule = static_cast<bool>(parser->parsedModule());
  for (const auto& error : parser->errors()) trace.errors.push_back(error->msg()->utf8());
  int number = 0;
  std::string symbols;
  for (std::string line; std::getline(output, line);) {
    std::istringstream words(line);
    std::string word;
    if (line.rfind("Reducing stack by rule ", 0) == 0) {
      number = std::stoi(line.substr(23));
      symbols.clear();
    } else if (line.rfind("   $", 0) == 0) {
      std::string kind;
      words >> word >> word >> kind >> word;  // "$1", "=", "nterm" or "token", the name
      symbols += ' ' + word;
    } else if (line.rfind("-> $$ = nterm ", 0) == 0) {
      words >> word >> word >> word >> word >> word;
      trace.productions[number] = word + ":" + symbols;
    }
  }
  return trace;
}

const char* const queries[] = {
    "",
    // modules and versions
    "1",
    "xquery version '1.0'; 1",
    "xquery version '1.0' encoding 'utf-8'; declare namespace p = 'u'; 1",
    "declare namespace p = 'u'; 1",
    "xquery version '1.0'; module namespace p = 'u'; declare variable $p:x := 1;",
    "xquery version '1.0'; module namespace p = 'u';",
    "module namespace p = 'u'; declare variable $p:x := 1;",
    "module namespace p = 'u';",
    // prologs
    "declare xmlspace preserve; declare default collation 'u'; declare base-uri 'u'; "
    "declare construction strip; declare ordering ordered; "
    "declare default order empty greatest; declare inherit-namespaces no; "
    "declare namespace p = 'u'; declare default element namespace 'e'; "
    "declare default function namespace 'f'; import schema 'u'; import module 'm'; "
    "declare variable $a := 1; declare variable $b external; 1",
    "declare xmlspace strip; declare construction preserve; declare ordering unordered; "
    "declare default order empty least; declare inherit-namespaces yes; 1",
    "declare xmlspace strip; declare variable $x as xs:int := 1; "
    "declare variable $y as xs:int external; 1",
    "import module namespace p = 'u' at 'a', 'b', 'c'; "
    "import module namespace q = 'u' at 'a'; import module namespace r = 'u'; "
    "import module 'u' at 'a', 'b'; import module 'u' at 'a'; import module 'u'; 1",
    "import schema namespace p = 'u' at 'a', 'b'; import schema namespace q = 'u' at 'a'; "
    "import schema namespace r = 'u'; "
    "import schema default element namespace 'u' at 'a', 'b'; "
    "import schema default element namespace 'u' at 'a'; "
    "import schema default element namespace 'u'; "
    "import schema 'u' at 'a', 'b'; import schema 'u' at 'a'; import schema 'u'; 1",
    "declare function a($x as xs:int, $y) as xs:int { 1 }; declare function b($x) { 1 }; "
    "declare function c() as xs:int { 1 }; declare function d() { 1 }; "
    "declare function e($x) as xs:int external; declare function f($x) external; "
    "declare function g() as xs:int external; declare function h() external; 1",
    // FLWOR
    "for $x in 1 where 2 order by 3 return 4",
    "for $x in 1 where 2 return 4",
    "for $x in 1 stable order by 3 return 4",
    "for $a as xs:int at $p in 1, $b as xs:int in 2 for $c at $q in 3, $d in 4 "
    "let $e as xs:int := 5, $f := 6 let $g := 7 return 8",
    "let $x := 1 return 2",
    "for $x in 1 order by 1 ascending empty greatest collation 'c', "
    "1 ascending empty least collation 'c', 1 ascending empty greatest, 1 ascending empty least, "
    "1 ascending collation 'c', 1 ascending, 1 descending empty greatest collation 'c', "
    "1 descending empty least collation 'c', 1 descending empty greatest, "
    "1 descending empty least, 1 descending collation 'c', 1 descending, "
    "1 empty greatest collation 'c', 1 empty least collation 'c', 1 empty greatest, "
    "1 empty least, 1 collation 'c', 1 return 2",
    // quantified, typeswitch, conditional
    "some $x as xs:int in 1, $y in 2 satisfies 3",
    "every $x in 1 satisfies 2",
    "typeswitch (1) case xs:int return 2 case $x as element() return 3 default $y return 4",
    "typeswitch (1) case xs:int return 2 default return 4",
    "if (1) then 2 else 3",
    // operators
    "1 or 2 or 3, 1 and 2 and 3",
    "1 eq 2, 1 ne 2, 1 lt 2, 1 le 2, 1 gt 2, 1 ge 2",
    "1 = 2, 1 != 2, 1 < 2, 1 <= 2, 1 > 2, 1 >= 2",
    "1 is 2, 1 << 2, 1 >> 2, 1 to 2",
    "1 + 2 - 3, 1 * 2 div 3 idiv 4 mod 5, a union b | c, a intersect b except c",
    "1 instance of xs:int, 1 treat as xs:int, 1 castable as xs:int?, 1 cast as xs:int",
    "+ 1, - 1, - + - 1",
    "validate { 1 }, validate lax { 1 }, validate strict { 1 }",
    // paths
    "//a, /a, /, a/b//c/d",
    "a[1][2], ..[1], .., (1)[1], 1",
    "child::a, descendant::a, attribute::a, self::a, descendant-or-self::a, following-sibling::a, "
    "following::a",
    "parent::a, ancestor::a, preceding-sibling::a, preceding::a, ancestor-or-self::a",
    "@a, *:a, p:*, *, text()",
    // primaries
    "1, 1.5, 1e3, 'x', $x, (), (1), ., f(), f(1), f(1, 2, 3)",
    "ordered { 1 }, unordered { 1 }",
    // direct constructors
    "<a b='1'/>, <a/>, <a b='1'>x</a>, <a>x</a>, <a b='1'></a>, <a></a>",
    "<a b=\"x\" c='x' d=\"\" e=''/>",
    "<a b=\"x\"\"{{}}&lt;&#65;{1}\" c=\"{1}x{2}\" d='x''{{}}&lt;&#65;{1}' e='{1}x{2}'/>",
    "<a><b/></a>, <a>{1}</a>, <a><![CDATA[x]]></a>, <a> </a>, <a>x</a>",
    "<a>x{{}}&lt;&#65; <b/>{1}<![CDATA[xyz]]> <!--c--><?p i?>y</a>",
    "<a><![CDATA[]]></a>",
    "<?p some text?>, <?p?>, <?"
    "?>, <!--text-->, <!---->",
    // computed constructors
    "document { 1 }, element a { 1 }, element a { }, element { 1 } { 2 }, element { 1 } { }",
    "attribute a { 1 }, attribute a { }, attribute { 1 } { 2 }, attribute { 1 } { }",
    "processing-instruction a { 1 }, processing-instruction a { }, "
    "processing-instruction { 1 } { 2 }, processing-instruction { 1 } { }",
    "comment { 1 }, text { 1 }",
    // types
    "1 instance of xs:int?, 1 instance of xs:int*, 1 instance of xs:int+, 1 instance of empty(), "
    "1 instance of item(), 1 instance of node(), 1 instance of xs:int",
    "1 instance of element(a, b?), 1 instance of element(a, b), 1 instance of element(a), "
    "1 instance of element(), 1 instance of element(*, *), 1 instance of schema-element(a)",
    "1 instance of attribute(a, b), 1 instance of attribute(a), 1 instance of attribute(), "
    "1 instance of schema-attribute(a)",
    "1 instance of processing-instruction(a), 1 instance of processing-instruction('a'), "
    "1 instance of processing-instruction(), 1 instance of document-node(element(a)), "
    "1 instance of document-node(), 1 instance of comment(), 1 instance of text()",
};

TEST(Grammar, EveryProductionIsReducedUnderItsNumber) {
  const std::map<int, std::string> listed = listedProductions();
  ASSERT_EQ(listed.size(), 421u);
  std::set<int> reduced;
  for (const char* query : queries) {
    const Trace trace = traceOf(query);
    EXPECT_TRUE(trace.errors.empty()) << query << "\n" << trace.errors.front();
    for (const auto& [number, production] : trace.productions) {
      reduced.insert(number);
      const auto expected = listed.find(number);
      ASSERT_NE(expected, listed.end()) << number;
      EXPECT_EQ(production, expected->second) << number;
    }
  }
  for (const auto& [number, production] : listed) {
    EXPECT_TRUE(reduced.count(number)) << "no query reduces " << number << " " << production;
  }
}

TEST(Grammar, EveryQueryButTheEmptyOneGivesAModule) {
  for (const char* query : queries) EXPECT_EQ(traceOf(query).hasModule, *query != '\0') << query;
}

TEST(Grammar, TenTokensOccurInNoProduction) {
  std::set<std::string> used;
  for (const auto& [number, production] : listedProductions()) {
    std::istringstream words(production);
    for (std::string word; words >> word;) used.insert(word);
  }
  std::set<std::string> unused;
  for (int code = 257; code <= 434; ++code) {
    if (!used.count(XQTokenName(code))) unused.insert(XQTokenName(code));
  }
  EXPECT_EQ(unused,
            (std::set<std::string>{"kTokenContext", "kTokenElementWS", "kTokenError", "kTokenLax",
                                   "kTokenNillable", "kTokenNo", "kTokenQNameSolidus",
                                   "kTokenStrict", "kTokenValidateContext", "kTokenYes"}));
}

TEST(Grammar, WrongOrderAndShapesAreSyntaxErrors) {
  const char* const wrong[] = {
      // setters, then imports and namespaces, then variables and functions
      "declare namespace p = 'u'; declare xmlspace strip; 1",
      "declare variable $x := 1; declare namespace p = 'u'; 1",
      "declare variable $x := 1; import module 'u'; 1",
      "declare function f() { 1 }; declare ordering ordered; 1",
      "declare xmlspace strip;",
      "xquery version '1.0';",
      "1;",
      // one comparison or range per level
      "1 = 2 = 3",
      "1 to 2 to 3",
      "1 eq 2 lt 3",
      // where before order by, the modifier's parts in order
      "for $x in 1 order by 2 where 3 return 4",
      "for $x in 1 order by 2 empty least ascending return 4",
      "for $x in 1 where 2 where 3 return 4",
      "typeswitch (1) default return 2",
      "if (1) then 2",
      "if () then 1 else 2",
      // no content where there must be some
      "text { }",
      "comment { }",
      "document { }",
      "validate { }",
      "ordered { }",
      "f(,)",
      "(1,)",
      "a[]",
      "a/",
      "<a>",
      "<a b=1/>",
      "<a b c='1'/>",
      "<![CDATA[x]]>",
      "<? x?>",
      "1 cast as xs:int*",
      "1 cast as empty()",
      "1 instance of document-node(a)",
      "declare function f($x { 1 }; 1",
      "import schema default element 'u'; 1",
  };
  for (const char* query : wrong) {
    const Trace trace = traceOf(query);
    EXPECT_FALSE(trace.hasModule) << query;
    ASSERT_EQ(trace.errors.size(), 1u) << query;
    EXPECT_NE(trace.errors[0].find("invalid token ("), std::string::npos) << trace.errors[0];
  }
}

TEST(Grammar, AMismatchedEndTagIsAccepted) {
  const Trace trace = traceOf("<a>x</b>");
  EXPECT_TRUE(trace.hasModule);
  EXPECT_TRUE(trace.errors.empty());
}

TEST(Grammar, LeadingSlashBeforeAnAsteriskIsAWildcardStep) {
  const Trace trace = traceOf("/*");
  EXPECT_TRUE(trace.hasModule);
  EXPECT_TRUE(trace.productions.count(217));
  EXPECT_TRUE(trace.productions.count(353));
}

TEST(Grammar, SignsAfterAnItemTypeAreOccurrenceIndicators) {
  EXPECT_TRUE(traceOf("1 instance of xs:int * 2").errors.front().find("invalid token (2)") !=
              std::string::npos);
  EXPECT_TRUE(traceOf("1 instance of xs:int + + 2").hasModule);
}

}  // namespace
}  // namespace xquery

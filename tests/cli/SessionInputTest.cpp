#include "cli/Declarations.h"
#include "cli/SessionInput.h"
#include "cli/SessionMessages.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <random>

using cli::DeclarationName;
using cli::declarationName;
using cli::sessionInput;
using testing::ElementsAre;

namespace {

TEST(SessionInput, IsCompleteWhereNothingIsOpen) {
  for (const char* text : {"",
                           "1",
                           "(1, 2)",
                           "a[b{c}]",
                           "'it''s'",
                           "\"a\"\"b\"",
                           "(: a (: b :) :) 1",
                           "<a/>",
                           "<a b='{1}' c=\"x\"\"y\">t{ (1) }{{</a>",
                           "<a><b/><c></c></a>",
                           "<!-- ( -->",
                           "<?p ( ?>",
                           "<a><![CDATA[ { ]]><!-- { --><?p {?></a>",
                           "$a < $b",
                           "1 <2",
                           "$a <b",
                           "f() <b",
                           "if (1) then <a/> else <b/>",
                           "for $x in 1 return <a>{$x}</a>",
                           "@lt <b",
                           ")",
                           "}",
                           "1 ]",
                           "<a b='{ \"}\" }'/>",
                           "a/b <c",
                           "$return <c",
                           "()<a",
                           "(::pragma a b ::) 1"}) {
    EXPECT_TRUE(sessionInput(text).isComplete) << text;
  }
}

TEST(SessionInput, IsIncompleteWhereSomethingIs) {
  for (const char* text :
       {"(",          "(1,",        "a[",      "{",        "'",      "'it''",           "\"'",
        "(:",         "(: (: :)",   "<a>",     "<a",       "<a b='", "<a b='{",         "<a>{",
        "<a>{{}",     "<a><b></b>", "<!--",    "<!-- --",  "<?p",    "<a><![CDATA[ ]]", "<a></a",
        "return <a>", "(1, <b>",    "{ <c> }", "$x = <a>", "<a>'",   "1, <a>"}) {
    EXPECT_FALSE(sessionInput(text).isComplete) << text;
  }
}

TEST(SessionInput, HasDeclarationsBeforeItsBody) {
  const auto input = sessionInput(
      "declare variable $a := ';'; (: ; :)\ndeclare function local:f() { <a>;</a> }; ; $a");
  EXPECT_TRUE(input.isComplete);
  EXPECT_THAT(input.declarations,
              ElementsAre("declare variable $a := ';';",
                          " (: ; :)\ndeclare function local:f() { <a>;</a> };"));
  EXPECT_EQ(input.body, " $a");
  EXPECT_EQ(sessionInput("declare xmlspace strip; (: nothing :) ").body, "");
}

// Any text is taken, in time that grows with it.
TEST(SessionInput, TakesAnyText) {
  std::mt19937 random(1);
  const std::string pieces = "()[]{}<>/'\":;!-?$a =&\xC3";
  for (int n = 0; n < 2000; ++n) {
    std::string text;
    for (int length = 0; length < 40; ++length) text += pieces[random() % pieces.size()];
    const auto input = sessionInput(text);
    for (const std::string& declaration : input.declarations) (void)declarationName(declaration);
    (void)cli::variablesIn(text);
  }
  EXPECT_FALSE(sessionInput(std::string(5'000'000, '(')).isComplete);
}

TEST(Declarations, AreKnownByTheirNames) {
  using Kind = DeclarationName::Kind;
  const auto name = [](const char* text) { return declarationName(text).name; };
  EXPECT_EQ(name("declare variable $p:a := 1;"), "p:a");
  EXPECT_EQ(name("declare variable $a:=1;"), "a");
  EXPECT_EQ(name("declare (: $x :) variable $ a as xs:integer external;"), "a");
  EXPECT_EQ(name("declare function local:f($a as item()*, $b) as xs:integer { ($c, 1) };"),
            "local:f/2");
  EXPECT_EQ(name("declare function f() external;"), "f/0");
  EXPECT_EQ(name("declare namespace p = 'u';"), name("import module namespace p = 'v' at 'w';"));
  EXPECT_EQ(name("declare xmlspace preserve;"), name("declare xmlspace strip;"));
  EXPECT_NE(name("declare default element namespace 'a';"),
            name("declare default function namespace 'a';"));
  EXPECT_EQ(declarationName("xquery version '1.0';").kind, Kind::Version);
  EXPECT_EQ(declarationName("module namespace p = 'u';").kind, Kind::Module);
  EXPECT_EQ(declarationName("").kind, Kind::Setting);
}

TEST(Names, HaveAPrefixOrNone) {
  for (const std::string text : {"a", "\u00E9-1", "_a.b"}) {
    EXPECT_TRUE(cli::isUnprefixedName(text)) << text;
    EXPECT_TRUE(cli::isVariableName(text)) << text;
    EXPECT_TRUE(cli::isVariableName("p:" + text)) << text;
    EXPECT_FALSE(cli::isUnprefixedName("p:" + text)) << text;
  }
  for (const std::string text :
       {"", ":", "a:", ":a", "a::b", "a:b:c", "1a", "a:1", "-a", "a b", " a", "a$a", "(::)a"}) {
    EXPECT_FALSE(cli::isVariableName(text)) << text;
    EXPECT_FALSE(cli::isUnprefixedName(text)) << text;
  }
}

TEST(Names, HaveOnePrefixHoweverManyAreWritten) {
  std::string text;
  for (int n = 0; n < 1'000'000; ++n) text += "a:";
  EXPECT_FALSE(cli::isVariableName(text + "b"));
}

TEST(Declarations, StandInTheOrderOfTheGrammar) {
  cli::Declarations all;
  for (const char* each : {"declare variable $a := 1;", "declare function local:f() { $a };",
                           "declare namespace p = \"urn:p\";", "declare xmlspace strip;",
                           "declare variable $b := 2;", "xquery version '1.0';"}) {
    all.add(each);
  }
  EXPECT_EQ(all.prolog(),
            "declare xmlspace strip;\ndeclare namespace p = \"urn:p\";\ndeclare variable $a := 1;\n"
            "declare function local:f() { $a };\ndeclare variable $b := 2;\n");
  EXPECT_EQ(all.lines(), 5u);
  EXPECT_THAT(all.variables(), ElementsAre("a", "b"));
  EXPECT_THAT(all.functions(), ElementsAre("local:f"));
  EXPECT_EQ(all.namespaces(), (std::map<std::string, std::string>{{"p", "urn:p"}}));
  all.add("declare variable $a := 3;");
  EXPECT_THAT(all.variables(), ElementsAre("a", "b"));
  all.add("declare variable $a := $b;");
  EXPECT_THAT(all.variables(), ElementsAre("b", "a"));
}

TEST(SessionMessages, CountLinesFromTheEntry) {
  EXPECT_EQ(cli::withoutPrologLines("query\n  FLWOR  (line 7)\n    for  (line 12)", 4),
            "query\n  FLWOR  (line 3)\n    for  (line 8)");
  EXPECT_EQ(cli::withoutPrologLines("+  (line 4)", 4), "+  (line 4)");
  EXPECT_EQ(cli::withoutPrologLines("(line ) (line 9", 1), "(line ) (line 8");
  EXPECT_EQ(cli::withoutPrologLines("a  (line 9 of file:///m.xq)\nb  (line 9)", 4),
            "a  (line 9 of file:///m.xq)\nb  (line 5)");
}

}  // namespace

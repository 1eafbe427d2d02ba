#include "cli/Command.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <filesystem>

using command::books;
using command::Outcome;
using command::readFile;
using command::TemporaryDirectory;
using command::xquery;
using testing::HasSubstr;
using testing::MatchesRegex;

namespace {

TEST(Options, TheQueryComesFromAFile) {
  const TemporaryDirectory directory;
  const std::string query = directory.write("q.xq", "(: a comment :)\n//book[price > 10]/title\n");
  const Outcome outcome = xquery({query, books()});
  EXPECT_EQ(outcome.status, 0);
  EXPECT_EQ(outcome.out,
            "<title>A Field Guide to Lichens</title>\n<title>Brücken &amp; Wege</title>\n");
}

TEST(Options, AQueryMayBeginWithAnEncodingSignature) {
  const TemporaryDirectory directory;
  EXPECT_EQ(xquery({directory.write("q.xq", "\xEF\xBB\xBF 1 + 1")}).out, "2\n");
  EXPECT_EQ(xquery({"-e", "\xEF\xBB\xBF 1 + 1"}).out, "2\n");
}

TEST(Options, TheQueryMayBeginLikeAnOption) {
  EXPECT_EQ(xquery({"-e", "-1"}).out, "-1\n");
}

TEST(Options, InputMayBeStandardInput) {
  EXPECT_EQ(xquery({"-e", "/a/b", "-"}, "<a><b>x</b></a>").out, "<b>x</b>\n");
}

TEST(Options, EachItemIsOnALineOfItsOwn) {
  EXPECT_EQ(xquery({"-e", "(1, \"two\", 3.5, /a/@x, /a/b)", "-"}, "<a x='4'><b/></a>").out,
            "1\ntwo\n3.5\nx=\"4\"\n<b/>\n");
}

TEST(Options, ThePlanIsShownInsteadOfTheResult) {
  const Outcome outcome = xquery({"--plan", "-e", "//book[price > 2 * 5]", "no such file"});
  EXPECT_EQ(outcome.status, 0);
  EXPECT_EQ(outcome.err, "");
  EXPECT_THAT(outcome.out, HasSubstr("query  any number of elements"));
  EXPECT_THAT(outcome.out, HasSubstr("  //book[...]  (line 1)  any number of elements"));
  EXPECT_THAT(outcome.out, HasSubstr("+ constants: "));
  EXPECT_THAT(xquery({"--plan=json", "-e", "1"}).out, HasSubstr("[\n{\"label\":\"query\""));
  EXPECT_THAT(xquery({"--plan=dot", "-e", "1"}).out, HasSubstr("digraph plan {"));
}

TEST(Options, ThePlanIsWrittenWhereTheResultWouldBe) {
  const TemporaryDirectory directory;
  const std::string file = directory.path("plan");
  EXPECT_EQ(xquery({"--plan", "-o", file, "-e", "1"}).out, "");
  EXPECT_THAT(readFile(file), HasSubstr("query  one integer"));
}

TEST(Options, ThePlanHasThreeFormatsAndNeedsAQueryWithoutErrors) {
  const Outcome unknown = xquery({"--plan=xml", "-e", "1"});
  EXPECT_EQ(unknown.status, 2);
  EXPECT_THAT(unknown.err, HasSubstr("expected text, json or dot"));
  const Outcome wrong = xquery({"--plan", "-e", "1 +"});
  EXPECT_EQ(wrong.status, 1);
  EXPECT_EQ(wrong.out, "");
}

TEST(Options, TypesPrecedeTheItemsWithATab) {
  const Outcome outcome =
      xquery({"--types", "-e",
              "(1, 1.5, 1e0, \"a\", 1 = 1, /, /a, /a/@x, /a/text(), /a/comment(), "
              "/a/processing-instruction())",
              "-"},
             "<a x='4'>t<!--c--><?p i?></a>");
  EXPECT_EQ(outcome.out,
            "xs:integer\t1\n"
            "xs:decimal\t1.5\n"
            "xs:double\t1\n"
            "xs:string\ta\n"
            "xs:boolean\ttrue\n"
            "document-node()\t<?xml version=\"1.0\" encoding=\"UTF-8\"?>\n"
            "<a x=\"4\">t<!--c--><?p i?></a>\n"
            "element()\t<a x=\"4\">t<!--c--><?p i?></a>\n"
            "attribute()\tx=\"4\"\n"
            "text()\tt\n"
            "comment()\t<!--c-->\n"
            "processing-instruction()\t<?p i?>\n");
}

TEST(Options, VariablesAreUntypedAtomic) {
  const Outcome outcome =
      xquery({"--types", "--var", "v=41", "-e", "declare variable $v external; ($v, $v + 1)"});
  EXPECT_EQ(outcome.out, "xdt:untypedAtomic\t41\nxs:double\t42\n");
}

TEST(Options, AVariableMayHoldAnythingAfterTheFirstEqualsSign) {
  EXPECT_EQ(xquery({"--var", "v=a=b", "-e", "declare variable $v external; $v"}).out, "a=b\n");
  EXPECT_EQ(xquery({"--var", "v=", "-e", "declare variable $v external; $v"}).out, "\n");
  EXPECT_EQ(xquery({"--var", "v=[é]", "-e", "declare variable $v external; $v"}).out, "[é]\n");
}

TEST(Options, SeveralVariablesMayBeBound) {
  EXPECT_EQ(xquery({"--var", "a=1", "--var", "b=2", "-e",
                    "declare variable $a external; declare variable $b external; ($b, $a)"})
                .out,
            "2\n1\n");
}

TEST(Options, ADocumentMayBeBoundToAVariable) {
  EXPECT_EQ(xquery({"--doc", "d=" + books(), "-e",
                    "declare variable $d external; $d//book[2]/title/text()"})
                .out,
            "Pocket Knots\n");
}

TEST(Options, ANamespaceIsKnownToTheQuery) {
  EXPECT_EQ(
      xquery({"--namespace", "n=http://catalogue.example/note", "-e", "//n:review/@stars", books()})
          .out,
      "stars=\"4\"\n");
}

TEST(Options, WhiteSpaceIsKeptUnlessStripped) {
  const std::string xml = "<a> <b/> </a>";
  EXPECT_EQ(xquery({"-e", "/a", "-"}, xml).out, "<a> <b/> </a>\n");
  EXPECT_EQ(xquery({"--strip-space", "-e", "/a", "-"}, xml).out, "<a><b/></a>\n");
}

TEST(Options, StripSpaceHoldsForBoundDocumentsToo) {
  const TemporaryDirectory directory;
  const std::string file = directory.write("d.xml", "<a> <b/> </a>");
  const std::string query = "declare variable $d external; $d/a";
  EXPECT_EQ(xquery({"--doc", "d=" + file, "-e", query}).out, "<a> <b/> </a>\n");
  EXPECT_EQ(xquery({"--strip-space", "--doc", "d=" + file, "-e", query}).out, "<a><b/></a>\n");
}

TEST(Options, OutputGoesToAFile) {
  const TemporaryDirectory directory;
  const std::string file = directory.write("out", "what was there before");
  const Outcome outcome = xquery({"-o", file, "-e", "(1, 2)"});
  EXPECT_EQ(outcome.status, 0);
  EXPECT_EQ(outcome.out, "");
  EXPECT_EQ(readFile(file), "1\n2\n");
}

TEST(Options, TimeReportsEachPhaseOnStandardError) {
  const Outcome outcome = xquery({"--time", "-e", "1"});
  EXPECT_EQ(outcome.status, 0);
  EXPECT_EQ(outcome.out, "1\n");
  EXPECT_THAT(outcome.err, MatchesRegex("parse +[0-9.]+ ms\ncompile +[0-9.]+ ms\n"
                                        "evaluate +[0-9.]+ ms\nprint +[0-9.]+ ms\n"));
}

TEST(Options, HTMLIsTidied) {
  EXPECT_EQ(
      xquery({"--html", "-e", "/html:html/html:body/html:p[2]/text()", "-"}, "<p>a<p>b<br>").out,
      "b\n");
  const TemporaryDirectory directory;
  const std::string file = directory.write("page.html", "<title>A &amp; B</title>");
  EXPECT_EQ(xquery({"--html", "-e", "//html:title/text()", file}).out, "A &amp; B\n");
}

TEST(Options, HTMLKeepsWhiteSpaceUnlessItIsToBeStripped) {
  const std::string page = "<p><b>x</b> <i>y</i>";
  EXPECT_EQ(xquery({"--html", "-e", "//html:p/text()", "-"}, page).out, " \n");
  EXPECT_EQ(xquery({"--html", "--strip-space", "-e", "//html:p/text()", "-"}, page).out, "");
}

TEST(Options, DocumentsOfVariablesAreXmlEvenThen) {
  const TemporaryDirectory directory;
  const std::string document = directory.write("d.xml", "<p/>");
  EXPECT_EQ(
      xquery({"--html", "--doc", "d=" + document, "-e", "declare variable $d external; $d/p", "-"},
             "<p>a")
          .out,
      "<p/>\n");
}

TEST(Options, ModulesAreReadFromFiles) {
  const TemporaryDirectory directory;
  const std::string module =
      directory.write("m.xq", "module namespace m = 'urn:m'; declare variable $m:a := 41;");
  EXPECT_EQ(
      xquery({"-e", "import module namespace m = 'urn:m' at 'file://" + module + "'; $m:a + 1"})
          .out,
      "42\n");
}

TEST(Options, WhatAQueryFileNamesIsLookedForBesideIt) {
  const TemporaryDirectory directory;
  directory.write("m b.xq", "module namespace m = 'urn:m'; declare variable $m:a := doc('d.xml');");
  directory.write("d.xml", "<d>beside</d>");
  const std::string query = directory.write(
      "q \xC3\xA9.xq",
      "import module namespace m = 'urn:m' at 'm%20b.xq'; $m:a/d, doc('d.xml')/d/text()");
  const Outcome outcome = xquery({query});
  EXPECT_EQ(outcome.err, "");
  EXPECT_EQ(outcome.out, "<d>beside</d>\nbeside\n");
}

TEST(Options, WhatAQueryOnTheCommandLineNamesIsLookedForInTheWorkingFolder) {
  const TemporaryDirectory directory;
  directory.write("m.xq", "module namespace m = 'urn:m'; declare variable $m:a := 41;");
  const auto former = std::filesystem::current_path();
  std::filesystem::current_path(directory.path(""));
  const Outcome outcome = xquery({"-e", "import module namespace m = 'urn:m' at 'm.xq'; $m:a + 1"});
  std::filesystem::current_path(former);
  EXPECT_EQ(outcome.err, "");
  EXPECT_EQ(outcome.out, "42\n");
}

TEST(Options, AModuleThatCannotBeUsedSaysWhy) {
  const TemporaryDirectory directory;
  const std::string module = directory.write("m.xq", "module namespace m = 'urn:m';\n#");
  const std::string import = "import module namespace m = 'urn:m' at 'm.xq'";
  const std::string query = directory.write("q.xq", import + "; 1");
  const Outcome outcome = xquery({query});
  EXPECT_EQ(outcome.status, 1);
  EXPECT_EQ(outcome.err,
            "XQueryError:47 - \"can't access module for prolog item module import:\"urn:m\" for "
            "prefix:\"m\" at locations:\"m.xq\" line:0\"\n  at " +
                query + ":1:1\n  1 | " + import + "; 1\n    | " + std::string(import.size(), '^') +
                "\nXQueryError:3 - \"invalid token (#) - #\" at line:2\n  at " + module +
                ":2:1\n  2 | #\n    | ^\n");
}

TEST(Options, RepeatPrintsOnceAndTimesMedianAndMinimum) {
  const Outcome outcome =
      xquery({"--time", "--repeat", "5", "-e", "//price[. > 20]/text()", books()});
  EXPECT_EQ(outcome.status, 0);
  EXPECT_EQ(outcome.out, "24.50\n");
  const std::string figures = " +median +[0-9.]+ ms +minimum +[0-9.]+ ms\n";
  EXPECT_THAT(outcome.err, MatchesRegex("parse" + figures + "compile" + figures + "evaluate" +
                                        figures + "print" + figures));
}

TEST(Options, RepeatWithoutTimeReportsNothing) {
  const Outcome outcome = xquery({"--repeat", "3", "-e", "1"});
  EXPECT_EQ(outcome.out, "1\n");
  EXPECT_EQ(outcome.err, "");
}

TEST(Options, VersionNamesTheCommand) {
  const Outcome outcome = xquery({"--version"});
  EXPECT_EQ(outcome.status, 0);
  EXPECT_THAT(outcome.out, MatchesRegex("xquery [0-9]+\\.[0-9]+\\.[0-9]+\n"));
}

TEST(Options, HelpNamesEveryOption) {
  const Outcome outcome = xquery({"--help"});
  EXPECT_EQ(outcome.status, 0);
  for (const char* option :
       {"QUERYFILE", "INPUT", "-e QUERY", "--types", "--var NAME=VALUE", "--doc NAME=FILE",
        "--namespace P=URI", "--html", "--strip-space", "-o FILE", "--time", "--repeat N",
        "--stream", "--help", "--version"}) {
    EXPECT_THAT(outcome.out, HasSubstr(option));
  }
}

}  // namespace

// What standard error says of the place of an error and the calls that led there.
#include "cli/Command.h"
#include "cli/Terminal.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <string>

using command::Outcome;
using command::plain;
using command::shell;
using command::TemporaryDirectory;
using command::Terminal;
using command::xquery;
using testing::EndsWith;
using testing::HasSubstr;
using testing::Not;

namespace {

// The lines below the first one.
std::string placeOf(const std::string& query) {
  const Outcome outcome = xquery({"-e", query});
  EXPECT_EQ(outcome.status, 1) << query;
  return outcome.err.substr(outcome.err.find('\n') + 1);
}

std::string repeated(const std::string& text, size_t count) {
  std::string result;
  for (size_t n = 0; n < count; ++n) result += text;
  return result;
}

TEST(Places, AreBelowTheDescriptionWithTheLineAndTheCalls) {
  const TemporaryDirectory directory;
  const std::string file = directory.write("prices.xq",
                                           "declare function local:price($b) {\n"
                                           "  $b/price * 2\n"
                                           "};\n"
                                           "local:price(<book><price>free</price></book>)\n");
  EXPECT_EQ(xquery({file}).err,
            "XQueryError:6 - \"value does not match a required type\"\n"
            "  at " +
                file +
                ":2:3, in local:price\n"
                "  2 |   $b/price * 2\n"
                "    |   ^^^^^^^^^^^^\n"
                "  called at " +
                file + ":4:1\n");
}

TEST(Places, OfAQueryOnTheCommandLineNameItSo) {
  EXPECT_EQ(placeOf("1,\n 2 idiv 0"), "  at query:2:2\n  2 |  2 idiv 0\n    |  ^^^^^^^^\n");
}

TEST(Places, OfAQueryFromStandardInputNameThat) {
  EXPECT_THAT(xquery({"-"}, "1 idiv 0").err, HasSubstr("\n  at standard input:1:1\n"));
}

TEST(Places, OfAModuleNameItsFile) {
  const TemporaryDirectory directory;
  const std::string module = directory.write(
      "m.xq", "module namespace m = 'urn:m';\ndeclare function m:f($x) { 1 idiv $x };");
  const std::string query =
      directory.write("q.xq", "import module namespace m = 'urn:m' at 'm.xq';\nm:f(0)");
  EXPECT_THAT(xquery({query}).err, EndsWith("\n  at " + module +
                                            ":2:28, in m:f\n"
                                            "  2 | declare function m:f($x) { 1 idiv $x };\n"
                                            "    |                            ^^^^^^^^^\n"
                                            "  called at " +
                                            query + ":2:1\n"));
}

TEST(Places, OfErrorsOfCompilingAreShownToo) {
  EXPECT_EQ(placeOf("1 + ]"), "  at query:1:5\n  1 | 1 + ]\n    |     ^\n");
  EXPECT_EQ(placeOf("declare variable $a := 1;\ndeclare variable $a := 2; 1"),
            "  at query:2:1\n  2 | declare variable $a := 2; 1\n"
            "    | ^^^^^^^^^^^^^^^^^^^^^^^^\n");
}

TEST(Places, WhereSomethingIsMissingAreMarkedBehindTheLine) {
  EXPECT_EQ(placeOf("1 +"), "  at query:1:4\n  1 | 1 +\n    |    ^\n");
}

TEST(Places, OnSeveralLinesAreMarkedToTheEndOfTheFirst) {
  EXPECT_EQ(placeOf("0, 1\n idiv 0"), "  at query:1:4\n  1 | 0, 1\n    |    ^\n");
}

TEST(Places, ATabIsOneBlank) {
  EXPECT_EQ(placeOf("\t1 idiv 0"), "  at query:1:2\n  1 |  1 idiv 0\n    |  ^^^^^^^^\n");
}

TEST(Places, AreMarkedBelowWhateverTheWidthOfCharacters) {
  EXPECT_EQ(placeOf("'漢字', 1 idiv 0"),
            "  at query:1:7\n  1 | '漢字', 1 idiv 0\n    |         ^^^^^^^^\n");
  EXPECT_EQ(placeOf("'e\u0301\u200D', 1 idiv 0"),
            "  at query:1:8\n  1 | 'e\u0301\u200D', 1 idiv 0\n    |      ^^^^^^^^\n");
  EXPECT_EQ(placeOf("'😀' + 1"), "  at query:1:1\n  1 | '😀' + 1\n    | ^^^^^^^^\n");
}

TEST(Places, OfALongLineOfWideCharactersFitTheTerminal) {
  const std::string shown =
      placeOf("'" + repeated("漢", 300) + "', 1 idiv 0, '" + repeated("字", 300) + "'");
  const size_t text = shown.find("1 idiv 0"), mark = shown.find("^^^^^^^^\n");
  ASSERT_NE(text, shown.npos);
  ASSERT_NE(mark, shown.npos);
  const size_t line = shown.rfind('\n', text) + 1;
  size_t columns = 0;
  for (size_t at = line; at < text; ++at) {
    const bool isFirst = (static_cast<unsigned char>(shown[at]) & 0xC0) != 0x80;
    if (isFirst) columns += static_cast<unsigned char>(shown[at]) >= 0x80 ? 2 : 1;
  }
  EXPECT_EQ(columns, mark - shown.rfind('\n', mark) - 1) << shown;
  EXPECT_LT(columns, 72u);
}

TEST(Places, ControlCharactersAreMadeVisible) {
  EXPECT_EQ(placeOf("'\xC2\x9B', 1 idiv 0"),
            "  at query:1:6\n  1 | '\\u009B', 1 idiv 0\n    |           ^^^^^^^^\n");
}

TEST(Places, OfALongLineThePartAroundThePlaceIsShown) {
  const std::string padding = repeated("1, ", 100);
  const std::string shown = placeOf(padding + "2 idiv 0, " + padding + "3");
  EXPECT_THAT(shown, HasSubstr("\n  1 | ..."));
  EXPECT_THAT(shown, HasSubstr("2 idiv 0, 1, "));
  EXPECT_THAT(shown, HasSubstr("...\n"));
  size_t start = 0, marks = 0;
  for (size_t end; (end = shown.find('\n', start)) != shown.npos; start = end + 1) {
    EXPECT_LE(end - start, 80u) << shown;
    marks += shown.substr(start, end - start).ends_with(" ^^^^^^^^") ? 1 : 0;
  }
  EXPECT_EQ(marks, 1u) << shown;
  const size_t text = shown.find("2 idiv 0"), mark = shown.find("^");
  EXPECT_EQ(text - shown.rfind('\n', text), mark - shown.rfind('\n', mark));
}

TEST(Places, FitATerminalOfTwentyColumns) {
  for (const std::string query : {"(1, 2, 3, 4, 5)[1] idiv 0, (1, 2, 3, 4, 5, 6, 7)", "1 idiv 0",
                                  "'漢字漢字漢字漢字', 1 idiv 0, '漢字漢字漢字漢字'"}) {
    Terminal terminal({"--color", "never", "-e", query}, {}, 20);
    EXPECT_EQ(terminal.end(), 1);
    const std::string shown = plain(terminal.everything());
    const size_t at = shown.find("\n  1 | "), end = shown.find('\n', at + 1);
    ASSERT_NE(at, shown.npos) << shown;
    size_t columns = 0;
    for (const char byte : shown.substr(at + 1, end - at - 1)) {
      const auto unit = static_cast<unsigned char>(byte);
      columns += unit < 0x80 ? 1 : (unit & 0xC0) != 0x80 ? 2 : 0;
    }
    EXPECT_LE(columns, 20u) << shown;
    EXPECT_GT(columns, 12u) << shown;
    EXPECT_THAT(shown.substr(end), HasSubstr("\n    | "));
    EXPECT_LE(shown.find('\n', end + 1) - end, 21u) << shown;
  }
}

TEST(Places, AMillionCharactersInOneLineAreCutQuickly) {
  const TemporaryDirectory directory;
  const Outcome outcome = xquery({directory.write("q.xq", repeated("1,", 500'000) + "1 idiv 0")});
  EXPECT_LT(outcome.err.size(), 1000u);
  EXPECT_THAT(outcome.err, HasSubstr(":1:1000001\n"));
}

TEST(Places, OfManyCallsTheFirstAndTheLastFiveAreShown) {
  const std::string shown = placeOf(
      "declare function local:f($n) {\n"
      "  if ($n = 0) then error() else 1 + local:f($n - 1) };\n"
      "local:f(50)");
  const std::string call = "  called at query:2:37, in local:f\n";
  EXPECT_THAT(shown, EndsWith("^^^^^^^\n" + repeated(call, 5) + "  ... 41 calls between\n" +
                              repeated(call, 4) + "  called at query:3:1\n"));
}

TEST(Places, OfTenCallsAllAreShown) {
  const std::string shown = placeOf(
      "declare function local:f($n) {\n"
      "  if ($n = 0) then error() else 1 + local:f($n - 1) };\n"
      "local:f(9)");
  EXPECT_THAT(shown, EndsWith("^^^^^^^\n" + repeated("  called at query:2:37, in local:f\n", 9) +
                              "  called at query:3:1\n"));
}

TEST(Places, OfARecursionOfAHundredThousandCallsAreToldAtOnce) {
  const Outcome outcome = xquery({"-e",
                                  "declare function local:f($n) { if ($n = 0) then error() else "
                                  "1 + local:f($n - 1) }; local:f(90000)"});
  EXPECT_EQ(outcome.status, 1);
  EXPECT_THAT(outcome.err, HasSubstr("  ... 89991 calls between\n"));
  EXPECT_LT(outcome.processorSeconds, 5);
}

TEST(Places, NamesOfFunctionsSteerNoTerminal) {
  EXPECT_THAT(placeOf("declare namespace p = 'u'; declare function p:f() { error() }; p:f()"),
              HasSubstr(", in p:f\n"));
}

TEST(Places, WhatIsNotKnownIsNotTold) {
  EXPECT_EQ(xquery({"--timeout", "0.000000001", "-e", "1"}).err.find("\n  at "), std::string::npos);
}

TEST(Places, AreJSONWithAnArray) {
  EXPECT_EQ(
      xquery({"--as", "json", "-e", "declare function local:f($x) { 1 idiv $x };\nlocal:f(0)"}).err,
      "{\"code\":6,\"message\":\"divide by zero\",\"line\":1,\"category\":\"values\","
      "\"place\":{\"line\":1,\"column\":32,\"length\":9},"
      "\"calls\":[{\"function\":\"local:f\",\"line\":2,\"column\":1,\"length\":10}],"
      "\"status\":1}\n");
  EXPECT_EQ(xquery({"--as", "json", "-e", "1 ]"}).err,
            "{\"code\":3,\"message\":\"parse error invalid token (])- 1 ]\",\"line\":1,"
            "\"column\":3,\"category\":\"syntax\","
            "\"place\":{\"line\":1,\"column\":3,\"length\":1},\"status\":1}\n");
}

}  // namespace

// What stands on standard error: one line for each cause, no more of the query than helps, nothing
// that steers a terminal.
#include "cli/Command.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <algorithm>
#include <sstream>

using command::Outcome;
using command::shell;
using command::TemporaryDirectory;
using command::withoutPlaces;
using command::xquery;
using testing::EndsWith;
using testing::HasSubstr;
using testing::Not;
using testing::StartsWith;

namespace {

std::string repeated(const std::string& text, size_t count) {
  std::string result;
  for (size_t n = 0; n < count; ++n) result += text;
  return result;
}

// What a query that fails makes the command say.
std::string complaint(const std::string& query) {
  const TemporaryDirectory directory;
  const Outcome outcome = xquery({directory.write("q.xq", query)});
  EXPECT_EQ(outcome.status, 1);
  EXPECT_EQ(outcome.out, "");
  return withoutPlaces(outcome.err);
}

std::string parseError(const std::string& quoted, const std::string& place = "line:1") {
  return "XQueryError:3 - \"parse error invalid token (])- " + quoted + "\" at " + place + "\n";
}

// --- one cause, one line -------------------------------------------------------------------------

TEST(Messages, WhatTheScannerRefusesIsReportedOnce) {
  EXPECT_EQ(complaint("\"abc"), "XQueryError:3 - \"String not terminated  - \"abc\" at line:1\n");
  EXPECT_EQ(complaint("1, \"a&b;\""),
            "XQueryError:3 - \"invalid token (&) in string literal - 1, \"a&b;\"\" at line:1\n");
  EXPECT_EQ(complaint("1\n(: a comment\nto the end"),
            "XQueryError:3 - \"comment not terminated  - (: a comment\" at line:2\n");
}

TEST(Messages, TheSameErrorIsReportedOnce) {
  EXPECT_EQ(complaint("declare function local:f($x, $x, $x) { 1 }; 1"),
            "XQueryError:39 - \"more than one parameter with the same name\"\n");
}

TEST(Messages, OtherErrorsHaveALineEach) {
  EXPECT_EQ(complaint("declare variable $a := 1;\ndeclare variable $a := 2;\n"
                      "declare function local:f($x, $x) { 1 };\n1"),
            "XQueryError:49 - \"invalid variable declaration for prolog item variable "
            "declaration:\"a\" external:NO line:1\"\n"
            "XQueryError:39 - \"more than one parameter with the same name\"\n");
}

// --- what is quoted of the query -----------------------------------------------------------------

TEST(Messages, ALineOfTwoHundredCharactersIsQuotedWhole) {
  const std::string line = repeated("1 + ", 49) + "1 ]  ";
  EXPECT_EQ(complaint(line.substr(0, 200)), parseError(line.substr(0, 200)));
}

TEST(Messages, OfALongerLineTwoHundredCharactersAroundThePlaceAreQuoted) {
  const std::string sum = repeated("1 + ", 1000);
  EXPECT_EQ(complaint(sum + "1 ] (: here :)" + sum),
            parseError("..." + sum.substr(sum.size() - 98) + "1 ] (: here :)" + sum.substr(0, 88) +
                       "..."));
}

TEST(Messages, NothingIsCutOffAtTheEndsOfALine) {
  const std::string sum = repeated("1 + ", 1000);
  EXPECT_EQ(complaint("] " + sum), parseError("] " + sum.substr(0, 198) + "..."));
  EXPECT_EQ(complaint(sum + "]"), parseError("..." + sum.substr(sum.size() - 199) + "]"));
}

TEST(Messages, WhatIsQuotedIsCountedInCharacters) {
  const std::string text = "\"" + repeated("é", 197) + "\"";
  EXPECT_EQ(complaint(text + "]"), parseError(text + "]"));
  EXPECT_EQ(complaint(text + "+]"), parseError("..." + text.substr(1) + "+]"));
}

TEST(Messages, OnlyTheLineOfTheErrorIsQuoted) {
  const std::string sum = repeated("1 + ", 1000);
  EXPECT_EQ(complaint("1,\r\n" + sum + "1,\r2 ]\n, 3"), parseError("2 ]", "line:3"));
}

TEST(Messages, ALongTokenIsCutToo) {
  const std::string name = repeated("x", 200);
  EXPECT_EQ(complaint("<a></a " + repeated(name, 20) + ">"),
            "XQueryError:3 - \"parse error invalid token (" + name + "...)- <a></a " +
                name.substr(7) + "...\" at line:1\n");
}

TEST(Messages, ThePlaceOfAnUnfinishedTextIsItsStart) {
  const std::string error = complaint(repeated("1 + ", 1000) + "'here" + repeated(" text", 1000));
  EXPECT_THAT(error, HasSubstr("1 + 'here text"));
  EXPECT_LT(error.size(), 300U);
}

// --- nothing that steers a terminal --------------------------------------------------------------

// Whether there is a control character other than a tab or the end of a line.
bool steersTerminal(const std::string& text) {
  return text.find("\xC2\x9B") != text.npos || std::any_of(text.begin(), text.end(), [](char c) {
           return (c >= 0 && c < ' ' && c != '\n' && c != '\t') || c == '\x7F';
         });
}

TEST(Messages, ControlCharactersOfTheQueryAreMadeVisible) {
  EXPECT_EQ(complaint("1 \x1B[31m]"),
            "XQueryError:3 - \"invalid token (\\u001B) - 1 \\u001B[31m]\" at line:1\n");
  EXPECT_THAT(complaint(std::string("1 \0 ]", 5)), HasSubstr("(\\u0000)"));
  EXPECT_THAT(complaint("\"\xC2\x9B\x7F\xE2\x80\xAE\t\" ]"),
              HasSubstr("- \"\\u009B\\u007F\\u202E\t\" ]\""));
}

TEST(Messages, ControlCharactersThatAnErrorRaisesAreMadeVisible) {
  const std::string error = complaint("error(xs:QName('a'), '&#27;[2J&#155;31m&#13;')");
  EXPECT_FALSE(steersTerminal(error)) << error;
  EXPECT_THAT(error, HasSubstr("\\u001B[2J\\u009B31m\\u000D"));
}

TEST(Messages, ControlCharactersOfArgumentsAreMadeVisible) {
  const std::vector<std::string> commands[] = {{"\x1B[31m.xq"},
                                               {"-e", "1", "\x1B[31m.xml"},
                                               {"-e", "1", "--\x1B[31m"},
                                               {"-e", "1", "--var", "\x1B[31m"},
                                               {"-e", "1", "--doc", "d=\x1B[31m"},
                                               {"-e", "1", "--repeat", "\x1B[31m"},
                                               {"-e", "1", "-o", "/\x1B[31m/x"}};
  for (const auto& arguments : commands) {
    const Outcome outcome = xquery(arguments);
    EXPECT_GE(outcome.status, 2) << arguments.back();
    EXPECT_FALSE(steersTerminal(outcome.err)) << outcome.err;
    EXPECT_THAT(outcome.err, HasSubstr("\\u001B[31m"));
  }
}

TEST(Messages, TextsWithoutControlCharactersStayToTheLetter) {
  EXPECT_THAT(complaint("error(xs:QName('a'), 'naïve 😀 \\u001B')"), HasSubstr("naïve 😀 \\u001B"));
}

// --- diagnostics ---------------------------------------------------------------------------------

TEST(Messages, WithDiagnosticsTheErrorIsTheLastLine) {
  const Outcome outcome = shell("XQUERY_LOG=1 \"$0\" -e '(1, 1 div 0)'");
  EXPECT_EQ(outcome.status, 1);
  EXPECT_EQ(outcome.out, "");
  const std::string heard = withoutPlaces(outcome.err);
  const size_t lastLine = heard.rfind('\n', heard.size() - 2) + 1;
  const std::string error = withoutPlaces(xquery({"-e", "(1, 1 div 0)"}).err);
  EXPECT_THAT(error, StartsWith("XQueryError:6 - \""));
  EXPECT_EQ(heard.substr(lastLine), error);
}

}  // namespace

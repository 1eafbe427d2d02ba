// What --check says of a query that has no errors.
#include "cli/Command.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <string>

using command::Outcome;
using command::TemporaryDirectory;
using command::xquery;
using testing::HasSubstr;
using testing::StartsWith;

namespace {

TEST(Warnings, StandOnStandardErrorAndLeaveTheStatusAlone) {
  const TemporaryDirectory directory;
  const std::string file = directory.write("q.xq", "let $a := 1\nreturn\n  counts(2)");
  const Outcome outcome = xquery({"--check", file});
  EXPECT_EQ(outcome.status, 0);
  EXPECT_EQ(outcome.out, "");
  EXPECT_EQ(outcome.err, file + ":1:6: warning: variable $a is never used [unused-variable]\n" +
                             file +
                             ":3:3: warning: there is no function counts that takes 1 argument "
                             "[unknown-function]\n");
}

TEST(Warnings, NameTheQueryAsItWasGiven) {
  const std::string rest = ":1:6: warning: variable $a is never used [unused-variable]\n";
  EXPECT_EQ(xquery({"--check", "-e", "let $a := 1 return 2"}).err, "query" + rest);
  EXPECT_EQ(xquery({"--check", "-"}, "let $a := 1 return 2").err, "standard input" + rest);
}

TEST(Warnings, OfModulesNameTheirFiles) {
  const TemporaryDirectory directory;
  const std::string module = directory.write(
      "m.xq", "module namespace m = 'urn:m';\ndeclare function m:f() { counts(1) };");
  const std::string file =
      directory.write("q.xq", "import module namespace m = 'urn:m' at 'm.xq'; m:f()");
  EXPECT_EQ(xquery({"--check", file}).err,
            module +
                ":2:26: warning: there is no function counts that takes 1 argument "
                "[unknown-function]\n");
}

TEST(Warnings, AreLeftOutWhereItIsToBeQuiet) {
  EXPECT_EQ(xquery({"--check", "--quiet", "-e", "let $a := 1 return 2"}).err, "");
  const Outcome wrong = xquery({"--check", "--quiet", "-e", "1 +"});
  EXPECT_EQ(wrong.status, 1);
  EXPECT_THAT(wrong.err, StartsWith("XQueryError:3"));
}

TEST(Warnings, ThereAreNoneBesideErrorsAndWithoutTheOption) {
  const Outcome wrong = xquery({"--check", "-e", "let $a := 1 return 2 +"});
  EXPECT_EQ(wrong.status, 1);
  EXPECT_EQ(wrong.err.find("warning"), std::string::npos);
  EXPECT_EQ(xquery({"-e", "let $a := 1 return 2"}).err, "");
}

TEST(Warnings, AreObjectsWhereTheResultIs) {
  const Outcome outcome = xquery({"--check", "--as", "json", "-e", "1,\nlet $a := 1 return 2"});
  EXPECT_EQ(outcome.status, 0);
  EXPECT_EQ(outcome.err,
            "{\"warning\":\"unused-variable\",\"message\":\"variable $a is never used\",\"line\":2,"
            "\"column\":6,\"length\":6}"
            "\n");
}

TEST(Warnings, AreColoredAsOtherMessages) {
  const Outcome outcome = xquery({"--check", "--color", "always", "-e", "let $a := 1 return 2"});
  EXPECT_EQ(outcome.err,
            "query:1:6: \033[1;35mwarning:\033[0m variable $a is never used [unused-variable]\n");
}

TEST(Warnings, OfAPrefixThatTheCommandLineDeclaresThereAreNone) {
  EXPECT_THAT(xquery({"--check", "-e", "//p:a"}).err, HasSubstr("[undeclared-prefix]"));
  EXPECT_EQ(xquery({"--check", "--namespace", "p=urn:p", "-e", "//p:a"}).err, "");
}

TEST(Warnings, OfAStreamAreThoseOfTheQuery) {
  const Outcome outcome =
      xquery({"--check", "--stream", "-e", "for $a in /r/a let $b := 1 return string($a)", "-"});
  EXPECT_EQ(outcome.status, 0);
  EXPECT_THAT(outcome.err, HasSubstr("[unused-variable]"));
  EXPECT_EQ(xquery({"--check", "--stream", "-e", "//a/..", "-"}).status, 1);
}

TEST(Warnings, DoNotSteerATerminal) {
  const Outcome outcome = xquery({"--check", "-e", "xs:integer('12 \xE2\x80\xAE x')"});
  EXPECT_THAT(outcome.err, HasSubstr("\\u202E"));
}

}  // namespace

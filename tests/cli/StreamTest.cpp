// xquery --stream.
#include "cli/Command.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <filesystem>
#include <string>

using command::Outcome;
using command::shell;
using command::TemporaryDirectory;
using command::waitUntil;
using command::xquery;
using testing::HasSubstr;

namespace {

const std::string text = "<a>\n<b><c>1</c></b>\n<b><c>2</c></b>\n<d/></a>";

TEST(StreamCommand, WritesWhatIsWrittenWithoutIt) {
  const TemporaryDirectory directory;
  const std::string file = directory.write("a.xml", text);
  for (const std::string query :
       {"/a/b", "count(//c)", "for $b in /a/b return <r>{ $b/c/text() }</r>", "sum(/a/b/c)"}) {
    const std::string whole = xquery({"--types", "-e", query, file}).out;
    EXPECT_NE(whole, "");
    const Outcome outcome = xquery({"--stream", "--types", "-e", query, file});
    EXPECT_EQ(outcome.out, whole);
    EXPECT_EQ(outcome.status, 0);
    EXPECT_EQ(xquery({"--stream", "--types", "-e", query, "-"}, text).out, whole);
  }
}

// What was beside a node is not there any more.
TEST(StreamCommand, TellsNoPlacesOfNodes) {
  const Outcome outcome = xquery({"--stream", "--as", "json", "-e", "/a/b[c = 2]/c", "-"}, text);
  EXPECT_THAT(outcome.out, HasSubstr("\"name\":\"c\""));
  EXPECT_THAT(outcome.out, testing::Not(HasSubstr("place")));
}

TEST(StreamCommand, IsGivenVariablesNamespacesAndOptions) {
  const Outcome outcome = xquery({"--stream", "--var", "n=2", "--namespace", "p=u", "-e",
                                  "declare variable $n external; /p:a/p:b[. = $n]/text()", "-"},
                                 "<a xmlns='u'><b>1</b><b>2</b></a>");
  EXPECT_EQ(outcome.out, "2\n");
  EXPECT_EQ(xquery({"--stream", "--strip-space", "-e", "count(/a/b/text())", "-"},
                   "<a><b> </b><b>x</b></a>")
                .out,
            "1\n");
}

TEST(StreamCommand, RefusesBeforeAnythingIsRead) {
  const Outcome outcome = xquery({"--stream", "-e", "\nreverse(/a/b)", "/no/such/file"});
  EXPECT_EQ(outcome.status, 1);
  EXPECT_EQ(outcome.out, "");
  EXPECT_EQ(outcome.err,
            "XQueryError:0 - \"cannot be evaluated as a stream: the function needs the whole of "
            "its argument\" at line:2\n  at query:2:1\n  2 | reverse(/a/b)\n"
            "    | ^^^^^^^^^^^^^\n");
  EXPECT_EQ(xquery({"--stream", "-e", "/a/b", "/no/such/file"}).status, 3);
}

TEST(StreamCommand, RefusesPrefixesThatNobodyDeclares) {
  const std::string query = "count(\n/z/p:b)";
  const Outcome outcome = xquery({"--stream", "-e", query, "/no/such/file"});
  EXPECT_EQ(outcome.status, 1);
  EXPECT_EQ(outcome.out, "");
  EXPECT_EQ(outcome.err,
            "XQueryError:0 - \"cannot be evaluated as a stream: a prefix on the way to the records "
            "is not declared\" at line:2\n  at query:2:4\n  2 | /z/p:b)\n    |    ^^^\n");
  EXPECT_EQ(xquery({"-e", query, "-"}, text).out, "0\n");
  const auto declared = [&](const std::string& input) {
    return xquery({"--stream", "--namespace", "p=u", "-e", query, input}, text);
  };
  EXPECT_EQ(declared("-").out, "0\n");
  EXPECT_EQ(declared("/no/such/file").status, 3);
}

TEST(StreamCommand, ShowsHowItWouldBeDone) {
  const auto plan = [](const std::string& query) {
    return xquery({"--stream", "--plan", "-e", query});
  };
  EXPECT_EQ(plan("/a/b[c]/d").out, "record: /a/b\nresult: items as they are found\n");
  EXPECT_EQ(plan("count(/a//b)").out, "record: /a//b\nresult: count\n");
  EXPECT_EQ(plan("(/a/*/c)[2]").out, "record: /a/*/c\nresult: items from position 2 to 2\n");
  EXPECT_EQ(plan("subsequence(/a/b, 3)").out, "record: /a/b\nresult: items from position 3\n");
  EXPECT_EQ(plan("every $b in /a/b satisfies $b = 1").out, "record: /a/b\nresult: every\n");
  const Outcome refused = plan("\nreverse(/a/b)");
  EXPECT_EQ(refused.status, 1);
  EXPECT_THAT(refused.err, HasSubstr("the function needs the whole of its argument\" at line:2"));
  EXPECT_EQ(xquery({"--stream", "--plan=json", "-e", "/a/b"}).status, 2);
}

TEST(StreamCommand, WantsAnInputAndNothingThatIsDoneTwice) {
  EXPECT_EQ(xquery({"--stream", "-e", "/a/b"}).status, 2);
  EXPECT_EQ(xquery({"--stream", "--html", "-e", "/a/b", "-"}).status, 2);
  EXPECT_EQ(xquery({"--stream", "--repeat", "2", "-e", "/a/b", "-"}).status, 2);
}

TEST(StreamCommand, KeepsWhatIsWrittenWhereTheRestIsBad) {
  const Outcome outcome = xquery({"--stream", "-e", "/a/b/c", "-"}, text.substr(0, 30) + "</a>");
  EXPECT_EQ(outcome.status, 3);
  EXPECT_EQ(outcome.out, "<c>1</c>\n");
  EXPECT_THAT(outcome.err, testing::StartsWith("standard input:3:"));
  EXPECT_EQ(outcome.err, xquery({"-e", "/a/b/c", "-"}, text.substr(0, 30) + "</a>").err);
  const Outcome error =
      xquery({"--stream", "-e", "for $b in /a/b return 1 idiv (2 - xs:integer($b/c))", "-"}, text);
  EXPECT_EQ(error.status, 1);
  EXPECT_EQ(error.out, "1\n");
  EXPECT_THAT(error.err, testing::StartsWith("XQueryError:"));
}

TEST(StreamCommand, ReplacesAFileByACompleteResultOnly) {
  const TemporaryDirectory directory;
  const std::string file = directory.write("out", "before");
  EXPECT_EQ(xquery({"--stream", "-o", file, "-e", "/a/b/c", "-"}, "<a><b><c/></b>").status, 3);
  EXPECT_EQ(command::readFile(file), "before");
  EXPECT_EQ(xquery({"--stream", "-o", file, "-e", "/a/b/c", "-"}, text).status, 0);
  EXPECT_EQ(command::readFile(file), "<c>1</c>\n<c>2</c>\n");
}

TEST(StreamCommand, WritesWhatItHasBeforeItWaits) {
  const TemporaryDirectory directory;
  const std::string file = directory.write("out", "");
  // The end comes when the item has been seen.
  const Outcome outcome = shell("{ printf '<a><b>1</b>'; " + waitUntil("[ -s \"$1\" ]") +
                                    "[ -s \"$1\" ] && echo '</a>'; } | "
                                    "\"$0\" --stream -e /a/b - > \"$1\"",
                                {file});
  EXPECT_EQ(outcome.status, 0);
  EXPECT_EQ(command::readFile(file), "<b>1</b>\n");
}

TEST(StreamCommand, TellsThatItCouldNotWrite) {
  const Outcome outcome =
      shell("{ printf '<a>'; yes '<b>text</b>'; } | \"$0\" --stream -e /a/b - > /dev/full");
  EXPECT_EQ(outcome.status, 3);
  EXPECT_THAT(outcome.err, HasSubstr("No space left on device"));
}

TEST(StreamCommand, ReadsPackedPipes) {
  const std::string packed =
      "{ echo '<a>'; yes '<b>text</b>' | head -n 10000; echo '</a>'; } | gzip -1";
  EXPECT_EQ(shell(packed + " | \"$0\" --stream -e 'count(/a/b)' -").out, "10000\n");
  const Outcome cut = shell(packed + " | head -c 60 | \"$0\" --stream -e 'count(/a/b)' -");
  EXPECT_EQ(cut.status, 3);
  EXPECT_EQ(cut.out, "");
  EXPECT_THAT(cut.err, HasSubstr("the gzip data ends too soon"));
}

TEST(StreamCommand, EndsWithItsReader) {
  const Outcome outcome = shell(
      "{ printf '<a>'; yes '<b>text</b>'; } | \"$0\" --stream -e /a/b/text\\(\\) - | head -n 1");
  EXPECT_EQ(outcome.out, "text\n");
}

TEST(StreamCommand, EndsTheReadingWhenItKnows) {
  const Outcome outcome =
      shell("{ printf '<a>'; yes '<b>text</b>'; } | \"$0\" --stream -e 'exists(/a/b)' -");
  EXPECT_EQ(outcome.out, "true\n");
}

#if defined(NDEBUG) && !defined(XQUERY_SANITIZED)
constexpr int records = 500'000;  // 200 MB
#else
constexpr int records = 10'000;
#endif

TEST(StreamCommand, TakesNoMoreMemoryHoweverLongTheInputIs) {
  const std::string record = "<b i='1'><c>1</c><d>" + std::string(368, 'x') + "</d></b>";
  const std::string input =
      "{ echo '<a>'; yes \"$1\" | head -n " + std::to_string(records) + "; echo '</a>'; }";
  const Outcome outcome = shell(input + " | \"$0\" --stream -e 'sum(/a/b[@i = 1]/c)' -", {record});
  EXPECT_EQ(outcome.out, std::to_string(records) + "\n");
#if !defined(XQUERY_SANITIZED)
  EXPECT_LT(outcome.mostMemory, size_t{64} << 20);
#endif
}

}  // namespace

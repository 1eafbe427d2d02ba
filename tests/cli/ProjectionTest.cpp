// The command reads of its inputs what the query needs, and nobody can tell.
#include "cli/Command.h"
#include "Platform/Reading/PackedText.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <string>
#include <vector>

using command::Outcome;
using command::shell;
using command::TemporaryDirectory;
using command::xquery;
using testing::HasSubstr;

namespace {

const std::string text =
    "<a>\n<b i='1'><c>1</c><x>u</x></b>\n<b i='2'><c>2</c></b>\n<d><c>3</c></d></a>";

const std::vector<std::string> queries = {
    "count(//c)",
    "/a/b[@i = '2']/c",
    "sum(//c)",
    "/a/b/@i",
    "for $b in /a/b where $b/c > 1 return $b/c/text()",
    "//c/..",
    "//c[1] is //c[1]",
    "exactly-one(//c)",
    "<r n='{ /a/b[1]/@i }'>{ count(//c) }</r>",
};

// With and without what is left out.
void expectSame(const std::vector<std::string>& arguments) {
  const Outcome whole = shell("XQUERY_PLAN=0 exec \"$0\" \"$@\"", arguments);
  const Outcome part = xquery(arguments);
  EXPECT_EQ(part.out, whole.out) << testing::PrintToString(arguments);
  EXPECT_EQ(part.err, whole.err) << testing::PrintToString(arguments);
  EXPECT_EQ(part.status, whole.status) << testing::PrintToString(arguments);
}

TEST(Projection, AnswersWhatTheWholeDocumentAnswersInEveryFormat) {
  const TemporaryDirectory directory;
  const std::string file = directory.write("a.xml", text);
  for (const std::string& query : queries) {
    expectSame({"--types", "-e", query, file});
    for (const std::string format : {"xml", "html", "json", "text"}) {
      expectSame({"--as", format, "-e", query, file});
    }
    expectSame({"--strip-space", "-e", query, file});
    expectSame({"--html", "-e", query, file});
  }
}

TEST(Projection, IsOfEachOfManyInputsAndOfStandardInput) {
  const TemporaryDirectory directory;
  const std::string one = directory.write("1.xml", text);
  const std::string two = directory.write("2.xml", "<a><b i='5'><c>7</c></b></a>");
  const std::string bad = directory.write("3.xml", "<a><x>&y;</x></a>");
  for (const std::string& query : queries) {
    expectSame({"--with-name", "-e", query, one, two, bad});
    EXPECT_EQ(xquery({"-e", query, "-"}, text).out, xquery({"-e", query, one}).out);
  }
}

TEST(Projection, ReadsWhatIsPacked) {
  for (const packing::Format& format : packing::formats) {
    EXPECT_EQ(xquery({"-e", "sum(//c)", "-"}, format.pack(text)).out, "6\n") << format.name;
  }
}

TEST(Projection, RefusesDocumentsAsEver) {
  const TemporaryDirectory directory;
  const std::string file = directory.write("bad.xml", "<a>\n<b/><x>\n<y></z></x></a>");
  for (const std::string& query : queries) expectSame({"-e", query, file});
  EXPECT_THAT(xquery({"-e", "count(/a/b)", file}).err, HasSubstr(file + ":3:"));
}

TEST(Projection, TakesLittleMemory) {
  std::string large = "<a>";
  for (int i = 0; i < 200'000; ++i) large += "<b><c>" + std::to_string(i) + "</c><d/></b>";
  large += "</a>";
  const TemporaryDirectory directory;
  const std::string file = directory.write("large.xml", large);
  const size_t nothing = xquery({"-e", "1"}).mostMemory;
  const size_t whole = xquery({"-e", "count(/a/node())", file}).mostMemory - nothing;
  const size_t part = xquery({"-e", "exists(/a/none)", file}).mostMemory - nothing;
  EXPECT_LT(part, whole / 5) << part << " of " << whole;
}

TEST(Projection, IsShownWithThePlan) {
  EXPECT_THAT(xquery({"--plan", "-e", "sum(//c) + count(/a/b/@i)"}).out,
              testing::EndsWith("\ninput  the text of //c, /a/b/@i\n"));
  EXPECT_THAT(xquery({"--plan", "-e", "1,\n//c/.."}).out,
              HasSubstr("\ninput  (line 2)  all of it, for //c/..\n"
                        "  - not projection: a step leads sideways or upwards\n"));
  EXPECT_THAT(xquery({"--plan", "-e", "1 + 1"}).out, testing::Not(HasSubstr("input")));
}

TEST(Projection, EndsAtLimitsWhereNothingIsMade) {
  const TemporaryDirectory directory;
  const std::string file = directory.write("a.xml", text);
  EXPECT_EQ(xquery({"--memory", "64M", "-e", "exists(//none)", file}).out, "false\n");
  const Outcome stopped = shell(
      "{ printf '<a>'; yes '<b><c/></b>'; } | timeout --signal=INT 1 \"$0\" -e 'count(//d)' -");
  EXPECT_NE(stopped.status, 0);
  EXPECT_EQ(stopped.out, "");
}

}  // namespace

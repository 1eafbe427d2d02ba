// What a query may load, and what is said of what it cannot.
#include "cli/Command.h"
#include "Platform/Loading/HTTPServer.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <algorithm>

using command::Outcome;
using command::shell;
using command::TemporaryDirectory;
using testing::EndsWith;
using testing::HasSubstr;
using testing::StartsWith;

namespace {

Outcome run(const std::vector<std::string>& arguments, const std::string& input = "") {
  return command::xquery(arguments, input);
}

TEST(LimitOptions, AllowWhatIsBelowAUrl) {
  xquery::HTTPServer server;
  server.answer("/in/a.xml", "application/xml", "<a>in</a>");
  server.answer("/index.xml", "application/xml", "<a>out</a>");
  server.redirect("/in/away", "/index.xml");
  const auto answer = [&](const std::string& path) {
    return run({"--quiet", "--allow", server.URL("/in"), "-e",
                "string(doc('" + server.URL(path) + "'))"})
        .out;
  };
  EXPECT_EQ(answer("/in/a.xml"), "in\n");
  for (const char* path : {"/index.xml", "/in/away", "/in/../index.xml", "/in/%2e%2e/index.xml"}) {
    EXPECT_EQ(answer(path), "\n") << path;
  }
}

// --- what cannot be loaded -----------------------------------------------------------------------

TEST(MissingDocuments, AreWarnedOfOnceWithUrlAndReason) {
  const TemporaryDirectory directory;
  const std::string a = directory.write("a", "<a/>"), b = directory.write("b", "<a/>"),
                    broken = directory.write("broken.xml", "<a>\n</b>");
  const std::string query = "count((doc('none.xml'), doc('none.xml'), doc('broken.xml')))";
  const std::string script = directory.write("q.xq", query);
  const std::string none = "file://" + directory.path("none.xml");
  const Outcome outcome = run({script, a, b});
  EXPECT_EQ(outcome.out, "0\n0\n");
  EXPECT_EQ(outcome.status, 0);
  EXPECT_THAT(outcome.err, StartsWith("xquery: warning: cannot load " + none +
                                      ": No such file or directory\nxquery: warning: cannot "
                                      "load file://" +
                                      broken + ": line 2, column "));
  EXPECT_EQ(std::count(outcome.err.begin(), outcome.err.end(), '\n'), 2) << outcome.err;
  EXPECT_EQ(run({"--quiet", script}).err, "");
  EXPECT_THAT(run({"--deny-all", script}).err, HasSubstr(none + ": not allowed\n"));
  EXPECT_THAT(run({"--color", "always", script}).err,
              StartsWith("\033[1;31mxquery:\033[0m warning: "));
}

TEST(MissingDocuments, AreJSONForAProgram) {
  const Outcome outcome = run({"--as", "json", "-e", "doc('file:///no%0Ane.xml')"});
  EXPECT_EQ(outcome.out, "[]\n");
  EXPECT_EQ(outcome.err,
            "{\"warning\":\"cannot load file:///no%0Ane.xml: No such file or directory\","
            "\"url\":\"file:///no%0Ane.xml\",\"reason\":\"No such file or directory\"}\n");
}

TEST(MissingDocuments, AreNotMoreThanAnybodyReads) {
  const Outcome outcome =
      run({"-e", "count(for $i in 1 to 1000 return doc(concat('file:///none/', $i)))"});
  EXPECT_EQ(outcome.out, "0\n");
  EXPECT_EQ(std::count(outcome.err.begin(), outcome.err.end(), '\n'), 101);
  EXPECT_THAT(outcome.err, EndsWith("\nxquery: warning: more documents cannot be loaded\n"));
}

TEST(MissingDocuments, AreWarnedOfInStreamsToo) {
  const Outcome outcome = run({"--stream", "-e", "/a/b[doc(concat('gone:', .))]", "-"},
                              "<a><b>1</b><b>1</b><b>2</b></a>");
  EXPECT_EQ(outcome.err,
            "xquery: warning: cannot load gone:1: not allowed\n"
            "xquery: warning: cannot load gone:2: not allowed\n");
}

TEST(MissingDocuments, LeaveTracesInTheLog) {
  EXPECT_THAT(shell("XQUERY_LOG=1 \"$0\" -e \"trace(1, 'label')\" 2>&1").out, HasSubstr("label 1"));
}

}  // namespace

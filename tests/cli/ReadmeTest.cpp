// What the README shows works as it stands, and so does the smallest example for hosts.
#include "cli/Command.h"

#include <gtest/gtest.h>

#include <sstream>
#include <string>

using command::books;
using command::Outcome;
using command::readFile;
using command::TemporaryDirectory;

namespace {

// The text between a fence that opens with "```language" and its end.
std::string codeBlock(const std::string& markdown, const std::string& language) {
  const std::string fence = "```" + language + "\n";
  const size_t start = markdown.find(fence);
  if (start == std::string::npos) return "";
  const size_t text = start + fence.size();
  return markdown.substr(text, markdown.find("```", text) - text);
}

TEST(Readme, ItsProgramIsTheCompiledExample) {
  const std::string readme = readFile(XQUERY_SOURCE_DIR "/README.md");
  const std::string example = readFile(XQUERY_SOURCE_DIR "/examples/embed.cpp");
  ASSERT_NE(example, "");
  EXPECT_EQ(codeBlock(readme, "cpp"), example);
}

TEST(Readme, ItsProgramInCIsTheCompiledExample) {
  const std::string readme = readFile(XQUERY_SOURCE_DIR "/README.md");
  const std::string example = readFile(XQUERY_SOURCE_DIR "/examples/embed.c");
  ASSERT_NE(example, "");
  EXPECT_EQ(codeBlock(readme, "c"), example);
}

TEST(Readme, TheExampleInCPrintsTheTitles) {
  const Outcome outcome = command::start("xquery_embed_c", {books()});
  EXPECT_EQ(outcome.status, 0);
  EXPECT_EQ(outcome.out, "A Field Guide to Lichens\nBrücken & Wege\n");
}

TEST(Readme, TheExampleInCReportsADocumentThatIsNotThere) {
  const Outcome outcome = command::start("xquery_embed_c", {"/nowhere.xml"});
  EXPECT_EQ(outcome.status, 3);
  EXPECT_EQ(outcome.err, "/nowhere.xml: No such file or directory\n");
}

TEST(SmallestExample, PrintsTheTitles) {
  const Outcome outcome = command::start("xquery_embed", {books()});
  EXPECT_EQ(outcome.status, 0);
  EXPECT_EQ(outcome.out, "A Field Guide to Lichens\nBrücken & Wege\n");
}

TEST(SmallestExample, ReportsADocumentThatIsNotThere) {
  const Outcome outcome = command::start("xquery_embed", {"/nowhere.xml"});
  EXPECT_EQ(outcome.status, 3);
  EXPECT_NE(outcome.err.find("/nowhere.xml: "), std::string::npos);
}

TEST(SmallestExample, PrintsNothingForAnEmptyQuery) {
  for (const char* query : {"", "()", "(: nothing :)", "module namespace m = 'urn:m';"}) {
    const Outcome outcome = command::start("xquery_embed", {books(), query});
    EXPECT_EQ(outcome.status, 0) << query;
    EXPECT_EQ(outcome.out + outcome.err, "") << query;
  }
}

TEST(SmallestExample, ReportsAnErrorWhereverItStands) {
  for (const char* query : {"//book[", "1 idiv 0", "<!-- a -- b -->", "(1, <!-- a -- b -->, 2)"}) {
    const Outcome outcome = command::start("xquery_embed", {books(), query});
    EXPECT_EQ(outcome.status, 1) << query;
    EXPECT_EQ(outcome.out, "") << query;
    EXPECT_EQ(outcome.err.find("XQueryError:"), 0U) << query;
  }
}

// Every line of the README that starts the command, run by a shell in the project's folder. The
// first of them does it by the script that builds it before.
TEST(Readme, ItsCommandLinesSucceed) {
  std::istringstream readme(readFile(XQUERY_SOURCE_DIR "/README.md"));
  const TemporaryDirectory temporary;
  int lines = 0;
  for (std::string line; std::getline(readme, line);) {
    std::string arguments;
    for (const std::string start : {"build/release/xquery ", "./run.sh -"}) {
      if (line.starts_with(start)) arguments = line.substr(line.find(' '));
    }
    if (arguments.empty()) continue;
    const Outcome outcome = command::shell(
        "cd '" XQUERY_SOURCE_DIR "' && TMPDIR=\"$1\" \"$0\"" + arguments, {temporary.path("")});
    EXPECT_EQ(outcome.status, 0) << line;
    EXPECT_EQ(outcome.err, "") << line;
    EXPECT_NE(outcome.out, "") << line;
    ++lines;
  }
  EXPECT_EQ(lines, 10);
}

}  // namespace

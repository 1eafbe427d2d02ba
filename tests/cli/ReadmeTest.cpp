// The README's program is the example that is compiled, and it does what the README says.
#include "cli/Command.h"

#include <gtest/gtest.h>

#include <cstdlib>
#include <sstream>
#include <string>

using command::books;
using command::Outcome;
using command::readFile;

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

TEST(Readme, TheExamplePrintsTheTitles) {
  const Outcome outcome = command::start("xquery_embed", {books()});
  EXPECT_EQ(outcome.status, 0);
  EXPECT_EQ(outcome.out, "A Field Guide to Lichens\nBrücken & Wege\n");
}

TEST(Readme, TheExampleReportsADocumentThatIsNotThere) {
  const Outcome outcome = command::start("xquery_embed", {"/nowhere.xml"});
  EXPECT_EQ(outcome.status, 3);
  EXPECT_NE(outcome.err.find("/nowhere.xml: "), std::string::npos);
}

TEST(Readme, TheExamplePrintsNothingForAnEmptyQuery) {
  for (const char* query : {"", "()", "(: nothing :)", "module namespace m = 'urn:m';"}) {
    const Outcome outcome = command::start("xquery_embed", {books(), query});
    EXPECT_EQ(outcome.status, 0) << query;
    EXPECT_EQ(outcome.out + outcome.err, "") << query;
  }
}

TEST(Readme, TheExampleReportsAnErrorWhereverItStands) {
  for (const char* query : {"//book[", "1 idiv 0", "<!-- a -- b -->", "(1, <!-- a -- b -->, 2)"}) {
    const Outcome outcome = command::start("xquery_embed", {books(), query});
    EXPECT_EQ(outcome.status, 1) << query;
    EXPECT_EQ(outcome.out, "") << query;
    EXPECT_EQ(outcome.err.find("XQueryError:"), 0U) << query;
  }
}

// Every line of the README that starts the built command, run by a shell in the project's folder.
TEST(Readme, ItsCommandLinesSucceed) {
  std::istringstream readme(readFile(XQUERY_SOURCE_DIR "/README.md"));
  const std::string command = "build/release/xquery ";
  int lines = 0;
  for (std::string line; std::getline(readme, line);) {
    if (line.rfind(command, 0) != 0) continue;
    const std::string script = "cd '" XQUERY_SOURCE_DIR "' && '" XQUERY_BINARY_DIR "/xquery' " +
                               line.substr(command.size()) + " > /dev/null";
    EXPECT_EQ(std::system(script.c_str()), 0) << line;
    ++lines;
  }
  EXPECT_GE(lines, 3);
}

}  // namespace

// The parts of the page for hosts are the program that is compiled, and it prints what the page
// says.
#include "cli/Command.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <sstream>
#include <string>

using command::books;
using command::Outcome;
using command::readFile;
using testing::HasSubstr;

namespace {

// All blocks of the language, with an empty line between two.
std::string blocks(const std::string& page, const std::string& language) {
  std::istringstream lines(page);
  std::string text;
  bool isInside = false;
  for (std::string line; std::getline(lines, line);) {
    if (line.starts_with("```")) {
      isInside = line == "```" + language;
      if (isInside && !text.empty()) text += "\n";
    } else if (isInside) {
      text += line + "\n";
    }
  }
  return text;
}

const std::string page = readFile(XQUERY_SOURCE_DIR "/docs/embedding.md");

TEST(EmbeddingPage, IsTheCompiledProgram) {
  ASSERT_NE(blocks(page, "cpp"), "");
  EXPECT_EQ(blocks(page, "cpp"), readFile(XQUERY_SOURCE_DIR "/examples/embedding.cpp"));
}

TEST(EmbeddingPage, SaysWhatTheProgramPrints) {
  const Outcome outcome = command::start("xquery_embedding", {books()});
  EXPECT_EQ(outcome.status, 0);
  EXPECT_EQ(outcome.err, "");
  EXPECT_EQ(outcome.out, blocks(page, "console"));
}

TEST(EmbeddingPage, HasTheCompiledProgramInC) {
  ASSERT_NE(blocks(page, "c"), "");
  EXPECT_EQ(blocks(page, "c"), readFile(XQUERY_SOURCE_DIR "/examples/embedding.c"));
}

TEST(EmbeddingPage, SaysWhatTheProgramInCPrints) {
  const Outcome outcome = command::start("xquery_embedding_c", {books()});
  EXPECT_EQ(outcome.status, 0);
  EXPECT_EQ(outcome.err, "");
  EXPECT_EQ(outcome.out, blocks(page, "text"));
}

// The same lines, with its own name of a program, build a consumer of the installed library.
TEST(EmbeddingPage, BuildsAsTheInstalledLibraryIsTested) {
  const std::string consumer = readFile(XQUERY_SOURCE_DIR "/tests/install/consumer.cmake");
  std::istringstream lines(blocks(page, "cmake"));
  for (std::string line; std::getline(lines, line);) {
    const size_t program = line.find("program");
    if (program != line.npos) line.replace(program, 7, "embed");
    EXPECT_THAT(consumer, HasSubstr(line));
  }
  EXPECT_THAT(readFile(XQUERY_SOURCE_DIR "/tests/install/check.sh"),
              HasSubstr("$(pkg-config --cflags --libs xquery)"));
}

}  // namespace

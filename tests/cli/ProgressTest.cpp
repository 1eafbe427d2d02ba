// The line that shows how far reading has come.
#include "cli/Command.h"
#include "cli/Progress.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

using cli::progressText;
using command::Outcome;
using command::shell;
using command::TemporaryDirectory;
using testing::AllOf;
using testing::EndsWith;
using testing::HasSubstr;
using testing::Not;

namespace {

TEST(Progress, ShowsShareRateAndTimeLeft) {
  using std::chrono::duration;
  EXPECT_EQ(progressText("a.xml", 1200000000, 3400000000, duration<double>(5), 80),
            "xquery: reading a.xml: 1.2 of 3.4 GB, 35 %, 240.0 MB/s, 9 s left");
  EXPECT_EQ(progressText("a.xml", 3000, 3000, duration<double>(2), 80),
            "xquery: reading a.xml: 3.0 of 3.0 kB, 100 %, 1.5 kB/s, 0 s left");
  EXPECT_EQ(progressText("a.xml", 1000000, 1000000000000, duration<double>(10), 80),
            "xquery: reading a.xml: 0.0 of 1000.0 GB, 0 %, 100.0 kB/s, 2777.8 h left");
}

TEST(Progress, ShowsRateAloneWhereTheSizeIsNotKnown) {
  using std::chrono::duration;
  EXPECT_EQ(progressText("standard input", 1500000, 0, duration<double>(3), 80),
            "xquery: reading standard input: 1.5 MB, 500.0 kB/s");
  // As of a file that grows.
  EXPECT_EQ(progressText("a.xml", 900, 800, duration<double>(3), 80),
            "xquery: reading a.xml: 900 B, 300 B/s");
}

TEST(Progress, ShortensTheNameToTheTerminal) {
  using std::chrono::duration;
  const std::string path = "/home/somebody/ä/documents/records.xml";
  const std::string text = progressText(path, 1500000, 0, duration<double>(3), 60);
  EXPECT_EQ(text, "xquery: reading ...documents/records.xml: 1.5 MB, 500.0 kB/s");
  for (size_t columns = 0; columns < 100; ++columns) {
    const std::string shown =
        progressText("äöü/äöü/äöü.xml", 1500000, 0, duration<double>(3), columns);
    EXPECT_LE(shown.size(), columns);
    EXPECT_THAT(shown, Not(HasSubstr("...\xA4")));
  }
}

TEST(Progress, SaysWhatTellsMostWhereThereIsLittleRoom) {
  const auto shown = [](uint64_t whole, size_t columns) {
    return progressText("records.xml", 1200000000, whole, std::chrono::duration<double>(5),
                        columns);
  };
  constexpr uint64_t known = 3400000000;
  EXPECT_EQ(shown(known, 67),
            "xquery: reading ...s.xml: 1.2 of 3.4 GB, 35 %, 240.0 MB/s, 9 s left");
  EXPECT_EQ(shown(known, 60), "1.2 of 3.4 GB, 35 %, 240.0 MB/s, 9 s left");
  EXPECT_EQ(shown(known, 40), "35 %, 240.0 MB/s, 9 s left");
  EXPECT_EQ(shown(known, 19), "35 %, 9 s left");
  EXPECT_EQ(shown(known, 13), "35 %");
  EXPECT_EQ(shown(known, 3), "");
  EXPECT_EQ(shown(0, 19), "1.2 GB, 240.0 MB/s");
  EXPECT_EQ(shown(0, 17), "240.0 MB/s");
  EXPECT_EQ(shown(0, 9), "1.2 GB");
  for (size_t columns = 0; columns < 100; ++columns) {
    EXPECT_LE(shown(known, columns).size(), columns);
    EXPECT_LE(shown(0, columns).size(), columns);
  }
}

// A file that takes more than a second to be read, by a command whose standard error is a terminal.
constexpr const char* slowly =
    "mkfifo $1/f; { printf '<a>'; sleep 1.2; printf '</a>'; } > $1/f & "
    "script -qec \"$0 -e '1' $1/f >$1/out $2\" $1/terminal </dev/null >/dev/null; cat $1/terminal";

TEST(Progress, AppearsAfterASecondAndGoes) {
  const TemporaryDirectory directory;
  const Outcome outcome = shell(slowly, {directory.path("."), ""});
  EXPECT_EQ(command::readFile(directory.path("out")), "1\n");
  EXPECT_THAT(outcome.out, AllOf(HasSubstr("/f: 7 B, "), HasSubstr(" B/s")));
  EXPECT_THAT(outcome.out, HasSubstr(" \r"));
}

// The message of an error stands on a line of its own.
TEST(Progress, FitsANarrowTerminalAndIsGoneBeforeAnError) {
  const TemporaryDirectory directory;
  const Outcome outcome = shell(
      "mkfifo $1/f; { printf '<a>'; sleep 1.2; printf '</b>'; } > $1/f & "
      "script -qec \"stty cols 20; $0 -e '1' $1/f\" $1/terminal </dev/null >/dev/null; "
      "tr '\\r' '\\n' < $1/terminal | grep -v '^Script'",
      {directory.path("."), ""});
  const size_t shown = outcome.out.find("\n7 B, ");
  ASSERT_NE(shown, std::string::npos) << outcome.out;
  const size_t end = outcome.out.find('\n', shown + 1);
  EXPECT_LT(end - shown, 20U);
  const std::string cleared = outcome.out.substr(end + 1);
  const size_t blanks = cleared.find_first_not_of(' ');
  EXPECT_EQ(blanks, end - shown - 1);
  EXPECT_EQ(cleared[blanks], '\n');
  EXPECT_THAT(cleared.substr(blanks), HasSubstr("/f:1:"));
}

TEST(Progress, StaysOutOfFiles) {
  const TemporaryDirectory directory;
  const Outcome outcome = shell(slowly, {directory.path("."), "2>" + directory.path("err")});
  EXPECT_THAT(outcome.out, Not(HasSubstr("B/s")));
}

}  // namespace

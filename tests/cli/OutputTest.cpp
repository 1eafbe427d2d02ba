// Where the result goes: pipes whose reader leaves, files that are replaced, streams that are shut.
#include "cli/Command.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <csignal>
#include <filesystem>
#include <sys/stat.h>
#include <unistd.h>

namespace fs = std::filesystem;

using command::Outcome;
using command::readFile;
using command::shell;
using command::Sink;
using command::start;
using command::TemporaryDirectory;
using command::xquery;
using testing::HasSubstr;

namespace {

// --- closed pipes --------------------------------------------------------------------------------

constexpr int endedByClosedPipe = -SIGPIPE;

TEST(ClosedPipe, EndsTheCommandWithoutAMessage) {
  const std::vector<std::string> commands[] = {
      {"-e", "1"}, {"-e", "1 to 200000"}, {"--time", "-e", "1"}, {"--help"}, {"--version"}};
  for (const auto& arguments : commands) {
    const Outcome outcome = start("xquery", arguments, "", Sink::ClosedPipe);
    EXPECT_EQ(outcome.status, endedByClosedPipe) << arguments[0];
    EXPECT_EQ(outcome.err, "") << arguments[0];
  }
}

TEST(ClosedPipe, GivesTheStatusThatAShellExpects) {
  const Outcome outcome =
      shell("{ \"$0\" --time -e '1 to 500000'; echo \"status $?\" >&2; } | head -n 1");
  EXPECT_EQ(outcome.out, "1\n");
  EXPECT_EQ(outcome.err, "status 141\n");
}

// A parent that ignores the signal hands that on.
TEST(ClosedPipe, IsTheSameUnderAParentThatIgnoresIt) {
  const Outcome outcome =
      shell("trap '' PIPE; { \"$0\" -e '1 to 500000'; echo \"status $?\" >&2; } | head -n 1");
  EXPECT_EQ(outcome.out, "1\n");
  EXPECT_EQ(outcome.err, "status 141\n");
}

TEST(ClosedPipe, EndsACommandThatHasAnErrorToReport) {
  const std::vector<std::string> commands[] = {
      {"-e", "1 idiv 0"}, {"--bogus"}, {"-e", "1", "/nowhere.xml"}, {"--time", "-e", "1"}};
  for (const auto& arguments : commands) {
    const Outcome outcome = start("xquery", arguments, "", Sink::Captured, Sink::ClosedPipe);
    EXPECT_EQ(outcome.status, endedByClosedPipe) << arguments[0];
  }
}

TEST(ClosedPipe, IsAsSilentBehindAnOutputFile) {
  const TemporaryDirectory directory;
  const Outcome outcome = shell(
      "mkfifo \"$1\"; { \"$0\" -o \"$1\" -e '1 to 500000'; echo \"status $?\" >&2; } & "
      "head -n 1 \"$1\"; wait",
      {directory.path("pipe")});
  EXPECT_EQ(outcome.out, "1\n");
  EXPECT_EQ(outcome.err, "status 141\n");
}

// --- streams that are closed from the start ------------------------------------------------------

TEST(ClosedStream, AsOutputCannotBeWritten) {
  const Outcome outcome = shell("\"$0\" -e 1 >&-");
  EXPECT_EQ(outcome.status, 3);
  EXPECT_EQ(outcome.err, "xquery: cannot write standard output: Bad file descriptor\n");
}

TEST(ClosedStream, AsInputCannotBeRead) {
  const Outcome outcome = shell("\"$0\" -e 1 - <&-");
  EXPECT_EQ(outcome.status, 3);
  EXPECT_EQ(outcome.out, "");
  EXPECT_THAT(outcome.err, HasSubstr("xquery: standard input: "));
}

TEST(ClosedStream, ForErrorsLeavesTheStatus) {
  EXPECT_EQ(shell("\"$0\" -e '1 idiv 0' 2>&-").status, 1);
  EXPECT_EQ(shell("\"$0\" --bogus 2>&-").status, 2);
  EXPECT_EQ(shell("\"$0\" -e 1 /nowhere 2>&-").status, 3);
}

TEST(ClosedStream, IsNotMistakenForTheResultFile) {
  const TemporaryDirectory directory;
  const std::string file = directory.path("out");
  const Outcome outcome = shell("\"$0\" --time -o \"$1\" -e 1 <&- >&- 2>&-", {file});
  EXPECT_EQ(outcome.status, 0);
  EXPECT_EQ(readFile(file), "1\n");
}

// --- the file of -o ------------------------------------------------------------------------------

class ResultFile : public testing::Test {
 protected:
  std::string path(const std::string& name = "out") const { return _directory.path(name); }
  void write(const std::string& text, const std::string& name = "out") const {
    (void)_directory.write(name, text);
  }
  std::string content(const std::string& name = "out") const { return readFile(path(name)); }
  size_t files() const {
    return static_cast<size_t>(
        std::distance(fs::directory_iterator(path("")), fs::directory_iterator()));
  }
  mode_t mode(const std::string& name = "out") const {
    struct stat status {};
    EXPECT_EQ(stat(path(name).c_str(), &status), 0);
    return status.st_mode & 07777;
  }

 private:
  TemporaryDirectory _directory;
};

TEST_F(ResultFile, IsReplacedByTheResult) {
  write("what was there before");
  const Outcome outcome = xquery({"-o", path(), "-e", "(1, 2)"});
  EXPECT_EQ(outcome.status, 0);
  EXPECT_EQ(outcome.out + outcome.err, "");
  EXPECT_EQ(content(), "1\n2\n");
  EXPECT_EQ(files(), 1U);
}

// Whoever has the old file open goes on reading that.
TEST_F(ResultFile, IsANewOneInThePlaceOfTheOld) {
  write("old");
  fs::create_hard_link(path(), path("other name"));
  EXPECT_EQ(xquery({"-o", path(), "-e", "1"}).status, 0);
  EXPECT_EQ(content(), "1\n");
  EXPECT_EQ(content("other name"), "old");
}

TEST_F(ResultFile, MayBeTheInput) {
  write("<a><b/></a>");
  EXPECT_EQ(xquery({"-o", path(), "-e", "/a/b", path()}).status, 0);
  EXPECT_EQ(content(), "<b/>\n");
}

TEST_F(ResultFile, MayNotBeTheQuery) {
  write("1 + 1");
  fs::create_symlink(path(), path("link"));
  for (const std::string& name : {path(), path("link"), path(".") + "/out"}) {
    const Outcome outcome = xquery({"-o", name, path()});
    EXPECT_EQ(outcome.status, 2);
    EXPECT_EQ(outcome.err, "xquery: -o: " + name + " is the query\nTry xquery --help.\n");
  }
  EXPECT_EQ(content(), "1 + 1");
}

TEST_F(ResultFile, StaysWhenTheQueryFails) {
  write("kept");
  EXPECT_EQ(xquery({"-o", path(), "-e", "1 div 0"}).status, 1);
  EXPECT_EQ(xquery({"-o", path(), "-e", "(1, <!-- a -- b -->)"}).status, 1);
  EXPECT_EQ(xquery({"-o", path(), "-e", "1", "/nowhere.xml"}).status, 3);
  EXPECT_EQ(content(), "kept");
  EXPECT_EQ(files(), 1U);
}

TEST_F(ResultFile, StaysWhenTheResultDoesNotFit) {
  write("kept");
  const Outcome outcome = shell("ulimit -f 64; \"$0\" -o \"$1\" -e '1 to 200000'", {path()});
  EXPECT_EQ(outcome.status, 3);
  EXPECT_EQ(outcome.err, "xquery: cannot write " + path() + ": File too large\n");
  EXPECT_EQ(content(), "kept");
  EXPECT_EQ(files(), 1U);
}

TEST_F(ResultFile, ThatIsNewIsNotThereWhenTheResultDoesNotFit) {
  EXPECT_EQ(shell("ulimit -f 64; \"$0\" -o \"$1\" -e '1 to 200000'", {path()}).status, 3);
  EXPECT_EQ(files(), 0U);
}

TEST_F(ResultFile, KeepsItsMode) {
  for (const mode_t kept : {0640U, 0777U, 0600U}) {
    write("old");
    chmod(path().c_str(), kept);
    EXPECT_EQ(xquery({"-o", path(), "-e", "1"}).status, 0);
    EXPECT_EQ(mode(), kept);
    EXPECT_EQ(content(), "1\n");
  }
}

TEST_F(ResultFile, ThatIsNewHasTheModeOfNewFiles) {
  EXPECT_EQ(shell("umask 027; \"$0\" -o \"$1\" -e 1", {path()}).status, 0);
  EXPECT_EQ(mode(), 0640U);
}

TEST_F(ResultFile, IsTheOneThatALinkLeadsTo) {
  fs::create_directory(path("folder"));
  write("old", "folder/target");
  fs::create_symlink("folder/target", path("near"));
  fs::create_symlink("near", path("out"));
  EXPECT_EQ(xquery({"-o", path(), "-e", "1"}).status, 0);
  EXPECT_TRUE(fs::is_symlink(path()));
  EXPECT_TRUE(fs::is_symlink(path("near")));
  EXPECT_FALSE(fs::is_symlink(path("folder/target")));
  EXPECT_EQ(content("folder/target"), "1\n");
}

TEST_F(ResultFile, IsMadeWhereALinkLeadsToNothing) {
  fs::create_symlink("target", path("out"));
  EXPECT_EQ(xquery({"-o", path(), "-e", "1"}).status, 0);
  EXPECT_TRUE(fs::is_symlink(path()));
  EXPECT_EQ(content("target"), "1\n");
}

TEST_F(ResultFile, CannotBeALinkToItself) {
  fs::create_symlink("out", path("out"));
  const Outcome outcome = xquery({"-o", path(), "-e", "1"});
  EXPECT_EQ(outcome.status, 3);
  EXPECT_THAT(outcome.err, HasSubstr("Too many levels of symbolic links"));
}

TEST_F(ResultFile, CannotBeAFolder) {
  const Outcome outcome = xquery({"-o", path(""), "-e", "1"});
  EXPECT_EQ(outcome.status, 3);
  EXPECT_EQ(outcome.err, "xquery: cannot write " + path("") + ": Is a directory\n");
}

TEST_F(ResultFile, CannotLieInAFile) {
  write("text");
  for (const std::string& name : {path("out/below"), path("nowhere/")}) {
    const Outcome outcome = xquery({"-o", name, "-e", "1"});
    EXPECT_EQ(outcome.status, 3) << name;
    EXPECT_THAT(outcome.err, HasSubstr("xquery: cannot write " + name + ": ")) << name;
  }
  EXPECT_EQ(files(), 1U);
}

TEST_F(ResultFile, ThatMustNotBeWrittenStays) {
  if (geteuid() == 0) GTEST_SKIP() << "root may write every file";
  write("kept");
  chmod(path().c_str(), 0444);
  const Outcome outcome = xquery({"-o", path(), "-e", "1"});
  EXPECT_EQ(outcome.status, 3);
  EXPECT_EQ(outcome.err, "xquery: cannot write " + path() + ": Permission denied\n");
  EXPECT_EQ(content(), "kept");
}

TEST_F(ResultFile, MayBeADevice) {
  EXPECT_EQ(xquery({"-o", "/dev/null", "-e", "1"}).status, 0);
  EXPECT_EQ(shell("\"$0\" -o /dev/null -e 1 >&- 2>&-").status, 0);
  EXPECT_TRUE(fs::is_character_file("/dev/null"));
}

TEST_F(ResultFile, MayBeStandardOutput) {
  EXPECT_EQ(xquery({"-o", "/dev/stdout", "-e", "1"}).out, "1\n");
  EXPECT_EQ(shell("\"$0\" -o /dev/stdout -e 1 | cat").out, "1\n");
  EXPECT_EQ(xquery({"-o", "/dev/stderr", "-e", "1"}).err, "1\n");
}

// What stands before the result in the file of the shell is not lost.
TEST_F(ResultFile, ThatIsStandardOutputIsWrittenOn) {
  EXPECT_EQ(shell("{ echo 0; \"$0\" -o /dev/stdout -e 1; echo 2; } > \"$1\"", {path()}).status, 0);
  EXPECT_EQ(content(), "0\n1\n2\n");
  EXPECT_EQ(shell("\"$0\" -o \"$1\" -e 3 >> \"$1\"", {path()}).status, 0);
  EXPECT_EQ(content(), "0\n1\n2\n3\n");
}

TEST_F(ResultFile, MayBeAnyOpenFile) {
  EXPECT_EQ(shell("\"$0\" -o /dev/fd/5 -e 1 5> \"$1\"", {path()}).status, 0);
  EXPECT_EQ(content(), "1\n");
  // One that has no name any more.
  EXPECT_EQ(shell("exec 5<> \"$1\"; rm \"$1\"; \"$0\" -o /dev/fd/5 -e 2; cat <&5", {path()}).out,
            "2\n");
  EXPECT_EQ(files(), 0U);
}

}  // namespace

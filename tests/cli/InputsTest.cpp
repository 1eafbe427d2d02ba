// Several inputs: which they are, in which order their results come, and what a failing one does to
// the others.
#include "cli/Command.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <algorithm>
#include <filesystem>
#include <sstream>

using command::Outcome;
using command::shell;
using command::TemporaryDirectory;
using command::withoutPlaces;
using command::xquery;
using testing::HasSubstr;

namespace {

class Inputs : public testing::Test {
 protected:
  std::string path(const std::string& name) const { return _directory.path(name); }
  // A document with the number in it.
  std::string write(const std::string& name, int number) const {
    return _directory.write(name, "<a>" + std::to_string(number) + "</a>");
  }
  std::string list(const std::string& text) const { return _directory.write("list", text); }
  void makeFolder(const std::string& name) const {
    std::filesystem::create_directories(_directory.path(name));
  }

 private:
  TemporaryDirectory _directory;
};

TEST_F(Inputs, AreAskedOneAfterTheOther) {
  const std::string a = write("a.xml", 1), b = write("b", 2);
  const Outcome outcome = xquery({"-e", "//text()", "--with-name", b, a, b});
  EXPECT_EQ(outcome.out, b + "\t2\n" + a + "\t1\n" + b + "\t2\n");
  EXPECT_EQ(outcome.err, "");
  EXPECT_EQ(outcome.status, 0);
  const std::string query = path("q.xq");
  EXPECT_EQ(shell("echo '//text()' > \"$1\"; \"$0\" \"$1\" \"$2\" - < \"$3\"", {query, a, b}).out,
            "1\n2\n");
  EXPECT_EQ(xquery({"--types", "--with-name", "-e", "1"}).out, "\txs:integer\t1\n");
}

TEST_F(Inputs, AreNamedByAnyCharacters) {
  const std::string folder = path("");
  write("[k,l]", 1);
  write("[a.xml]", 2);
  write("-e", 3);
  const Outcome outcome =
      shell("cd \"$1\" && \"$0\" -e '//text()' '[k,l]' '[a.xml]' -- -e", {folder});
  EXPECT_EQ(outcome.out, "1\n2\n3\n");
  EXPECT_EQ(outcome.err, "");
}

// Reading from a pipe would wait for a writer.
TEST_F(Inputs, OfAFolderAreFilesOnly) {
  makeFolder("in");
  write("in/a.xml", 1);
  const Outcome outcome = shell("mkfifo \"$1/b.xml\" && \"$0\" -e '//text()' \"$1\"", {path("in")});
  EXPECT_EQ(outcome.out, "1\n");
  EXPECT_EQ(outcome.status, 0);
}

TEST_F(Inputs, OfAFolderAreItsDocumentsAndThoseBelow) {
  makeFolder("in/deep/er");
  makeFolder("in/.hidden");
  write("in/b.xml", 1);
  write("in/a.xml.gz", 2);  // by its name; what is in it decides how it is read
  write("in/deep/c.xml", 3);
  write("in/deep/er/d.xml", 4);
  for (const char* other : {"in/.e.xml", "in/.hidden/f.xml", "in/g.txt", "in/xml", "in/h.html"}) {
    write(other, 5);
  }
  std::filesystem::create_symlink("..", path("in/deep/up"));
  std::filesystem::create_symlink("b.xml", path("in/i.xml"));
  EXPECT_EQ(xquery({"-e", "//text()", path("in")}).out, "2\n1\n1\n3\n4\n");
  EXPECT_EQ(xquery({"--html", "-e", "normalize-space(/)", path("in")}).out, "5\n");
}

TEST_F(Inputs, MayBeNamedInAList) {
  const std::string a = write("a\nb.xml", 1), b = write("b.xml", 2);
  const std::string query = "//text()";
  EXPECT_EQ(xquery({"-e", query, "--files-from", "-"}, b + "\n\n" + b).out, "2\n2\n");
  const std::string zeros = a + std::string(1, '\0') + b + std::string(1, '\0');
  EXPECT_EQ(xquery({"-e", query, "--files-from", list(zeros), b}).out, "2\n1\n2\n");
  const Outcome nothing = xquery({"-e", query, "--files-from", "/dev/null"});
  EXPECT_EQ(nothing.out + nothing.err, "");
  EXPECT_EQ(nothing.status, 0);
  const Outcome missing = xquery({"-e", query, "--files-from", "/nowhere"});
  EXPECT_EQ(missing.err, "xquery: /nowhere: No such file or directory\n");
  EXPECT_EQ(missing.status, 3);
}

TEST_F(Inputs, MayBeNamedInAListOfAnotherSystem) {
  const std::string a = write("a.xml", 1), b = write("b.xml", 2), c = write("c.xml\r", 3);
  const std::string query = "//text()", mark = "\xEF\xBB\xBF";
  EXPECT_EQ(xquery({"-e", query, "--files-from", list(mark + a + "\r\n\r\n" + b)}).status, 3)
      << "a line without a return";
  EXPECT_EQ(xquery({"-e", query, "--files-from", list(mark + a + "\r\n\r\n" + b + "\r\n")}).out,
            "1\n2\n");
  EXPECT_EQ(xquery({"-e", query, "--files-from", list(a + "\n" + c + "\n")}).out, "1\n3\n");
  const std::string zeros = a + std::string(1, '\0') + c + std::string(1, '\0');
  EXPECT_EQ(xquery({"-e", query, "--files-from", list(zeros)}).out, "1\n3\n");
}

TEST_F(Inputs, ReadStandardInputOnce) {
  const std::string a = write("a.xml", 1);
  const std::string names = list("-\n" + a + "\n-\n");
  const Outcome outcome = xquery({"-e", "//text()", "--files-from", names}, "<a>0</a>");
  EXPECT_EQ(outcome.out, "0\n1\n");
  EXPECT_EQ(outcome.err, "xquery: standard input: can be read only once\n");
  EXPECT_EQ(outcome.status, 3);
  EXPECT_EQ(xquery({"-e", "//text()", "--files-from", "-"}, a + "\n-\n").err,
            "xquery: standard input: can be read only once\n");
  EXPECT_EQ(xquery({"-", "--files-from", list("-\n")}, "1").err,
            "xquery: standard input: can be read only once\n");
}

TEST_F(Inputs, AreNotWhereTheOutputGoes) {
  const std::string a = write("a.xml", 1), b = write("b.xml", 2);
  const Outcome outcome = shell("\"$0\" -e '//text()' \"$1\" \"$2\" >> \"$1\"", {a, b});
  EXPECT_EQ(outcome.err, "xquery: " + a + ": this is where the output goes\n");
  EXPECT_EQ(outcome.status, 3);
  EXPECT_EQ(command::readFile(a), "<a>1</a>2\n");
  EXPECT_EQ(shell("\"$0\" --stream -e '/a/b' \"$1\" >> \"$1\"", {b}).err,
            "xquery: " + b + ": this is where the output goes\n");
  EXPECT_EQ(shell("\"$0\" -e '/a' - < \"$1\" > \"$1\"", {b}).err,
            "xquery: standard input: this is where the output goes\n");
}

// A name must not look like a message, or a result, of its own.
TEST_F(Inputs, HaveNamesThatStayWithinAMessage) {
  const std::string folder = path("");
  const std::string name = "x\nxquery: all is well";
  const std::string shown = folder + "x\\u000Axquery: all is well";
  write(name, 0);
  EXPECT_EQ(xquery({"-e", "1", path(name) + "?"}).err,
            "xquery: " + shown + "?: No such file or directory\n");
  EXPECT_EQ(withoutPlaces(xquery({"-e", "1 idiv xs:integer(/)", path(name), write("b", 1)}).err),
            shown + ": XQueryError:6 - \"divide by zero\" at line:1\n");
  EXPECT_EQ(xquery({path("q\ty")}).err,
            "xquery: " + folder + "q\\u0009y: No such file or directory\n");
  EXPECT_EQ(xquery({"-e", "1", "-o", path("none\n/x")}).err,
            "xquery: cannot write " + folder + "none\\u000A/x: No such file or directory\n");
}

TEST_F(Inputs, ThatAreNoTextAreNamedByTheirUrl) {
  const std::string file = write("\xFF%.xml", 1), URL = "file://" + path("%FF%25.xml");
  EXPECT_THAT(xquery({"--as", "xml", "--with-name", "-e", "1", file}).out,
              HasSubstr(" input=\"" + URL + "\""));
  EXPECT_THAT(xquery({"--as", "json", "--with-name", "-e", "1", file}).out,
              HasSubstr("\"input\":\"" + URL + "\""));
  EXPECT_EQ(xquery({"--with-name", "-e", "1", file}).out, file + "\t1\n");
  const std::string control = write("\x01.xml", 1);
  EXPECT_THAT(xquery({"--as", "xml", "--with-name", "-e", "1", control}).out,
              HasSubstr("/%01.xml\""));
}

TEST_F(Inputs, ThatFailAreReportedAndTheOthersGoOn) {
  const std::string a = write("a", 1), b = write("b", 0), c = write("c", 4);
  const std::string query = "8 idiv xs:integer(/a)";
  const Outcome one = xquery({"-e", query, a, b, c});
  EXPECT_EQ(one.out, "8\n2\n");
  EXPECT_EQ(withoutPlaces(one.err), b + ": XQueryError:6 - \"divide by zero\" at line:1\n");
  EXPECT_EQ(one.status, 1);
  const Outcome both = xquery({"-e", query, "--jobs", "2", "/nowhere", a, b, path(""), c});
  EXPECT_EQ(both.out, "8\n2\n");
  EXPECT_THAT(both.err, HasSubstr("xquery: /nowhere: No such file or directory\n" + b + ": "));
  EXPECT_EQ(both.status, 3);
}

TEST_F(Inputs, WriteAFileOfWhatTheyGaveIfOneGaveAnything) {
  const std::string a = write("a", 1), out = list("kept");
  EXPECT_EQ(xquery({"-e", "1", "-o", out, "/nowhere", "/neither"}).status, 3);
  EXPECT_EQ(command::readFile(out), "kept");
  EXPECT_EQ(xquery({"-e", "string(/)", "-o", out, "/nowhere", a}).status, 3);
  EXPECT_EQ(command::readFile(out), "1\n");
  // One of them may be the file that is written.
  EXPECT_EQ(xquery({"-e", "/", "-o", a, a, a}).status, 0);
  EXPECT_THAT(command::readFile(a), HasSubstr("<a>1</a>\n<?xml"));
}

// Each is more than what is kept of a part that waits.
TEST_F(Inputs, ComeInTheirOrderHoweverLargeAndWithinBoundedMemory) {
  const std::string item = std::string(1000, 'x');
  std::string names, expected;
  for (int n = 1; n <= 6; ++n) {
    names += write("in" + std::to_string(n), n) + "\n";
    expected += std::to_string(n) + "\t2000\n";
  }
  const std::string query = "for $i in 1 to 2000 return concat(/a, '" + item + "')";
  const Outcome outcome = shell(
      "\"$0\" --jobs 3 -e \"$1\" --files-from \"$2\" | cut -c 1 | uniq -c | "
      "awk '{ print $2 \"\\t\" $1 }'",
      {query, list(names)});
  EXPECT_EQ(outcome.out, expected);
  EXPECT_EQ(outcome.err, "");
}

TEST_F(Inputs, MayBeTenThousandOfWhichSomeAreMissing) {
  write("a", 1);
  std::string names;
  for (int n = 0; n < 10000; ++n) names += path(n % 1000 == 7 ? "missing" : "a") + "\n";
  const Outcome outcome = xquery({"-e", "//text()", "--files-from", list(names)});
  EXPECT_EQ(outcome.status, 3);
  EXPECT_EQ(std::count(outcome.out.begin(), outcome.out.end(), '1'), 9990);
  EXPECT_EQ(std::count(outcome.err.begin(), outcome.err.end(), '\n'), 10);
}

TEST_F(Inputs, EndWhereTheResultCannotBeWritten) {
  const std::string a = write("a", 1);
  std::string names;
  for (int n = 0; n < 100; ++n) names += a + "\n";
  const Outcome outcome =
      xquery({"-e", "1 to 100000", "--jobs", "2", "-o", "/dev/full", "--files-from", list(names)});
  EXPECT_EQ(outcome.err, "xquery: cannot write /dev/full: No space left on device\n");
  EXPECT_EQ(outcome.status, 3);
}

TEST_F(Inputs, AreTimedInSum) {
  const std::string a = write("a", 1);
  const Outcome outcome = xquery({"-e", "1", "--time", a, a, a});
  EXPECT_EQ(std::count(outcome.err.begin(), outcome.err.end(), '\n'), 4);
}

}  // namespace

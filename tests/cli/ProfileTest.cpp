// xquery --profile.
#include "cli/Command.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <algorithm>
#include <csignal>
#include <filesystem>
#include <fstream>
#include <regex>
#include <set>
#include <sstream>
#include <string>

namespace fs = std::filesystem;

using command::Outcome;
using command::readFile;
using command::shell;
using command::TemporaryDirectory;
using command::xquery;
using testing::AllOf;
using testing::HasSubstr;
using testing::Not;
using testing::StartsWith;

namespace {

class ProfileCommand : public testing::Test {
 protected:
  std::string path(const std::string& name) const { return _directory.path(name); }
  std::string write(const std::string& name, const std::string& text) const {
    return _directory.write(name, text);
  }
  std::string content(const std::string& name) const { return readFile(path(name)); }
  bool isThere(const std::string& name) const { return fs::exists(path(name)); }
  size_t files() const {
    return static_cast<size_t>(
        std::distance(fs::directory_iterator(path("")), fs::directory_iterator()));
  }

 private:
  TemporaryDirectory _directory;
};

// What a profile reads from the file is a value for the command itself.
std::string jsonMember(const std::string& json, const std::string& name) {
  const std::string key = "\"" + name + "\":";
  const size_t at = json.find(key);
  if (at == json.npos) return "";
  const size_t start = at + key.size();
  return json.substr(start, json.find_first_of(",}", start) - start);
}

TEST_F(ProfileCommand, WritesTheFormThatTheNameOfTheFileSays) {
  for (const std::string name : {"p.json", "p.txt", "p.html"}) {
    const Outcome outcome = xquery({"--profile", path(name), "-e", "count((1 to 10))"});
    EXPECT_EQ(outcome.status, 0) << outcome.err;
    EXPECT_EQ(outcome.out, "10\n");
    EXPECT_EQ(outcome.err, "");
  }
  EXPECT_THAT(content("p.json"), StartsWith("{\"evaluations\":1,\"name\":\"query\""));
  EXPECT_THAT(content("p.txt"), StartsWith("query: 1 evaluation\n"));
  EXPECT_THAT(content("p.html"), StartsWith("<!doctype html>\n"));
  EXPECT_EQ(files(), 3u);
}

TEST_F(ProfileCommand, RefusesOtherNamesBeforeAnythingIsRead) {
  for (const std::string name : {"p", "p.xml", "p.html.gz", "json", "p.HTML"}) {
    const Outcome outcome = xquery({"--profile", path(name), "-e", "1", "/no/such/file"});
    EXPECT_EQ(outcome.status, 2) << name;
    EXPECT_EQ(outcome.err, "xquery: --profile: expected a file named .html, .json or .txt, not \"" +
                               path(name) + "\"\nTry xquery --help.\n");
  }
  EXPECT_EQ(files(), 0u);
}

TEST_F(ProfileCommand, DoesNotGoWithWhatDoesNotEvaluateAsAWhole) {
  for (const std::string other : {"--check", "--plan", "--stream"}) {
    const Outcome outcome = xquery({"--profile", path("p.json"), other, "-e", "/a/b", "-"}, "<a/>");
    EXPECT_EQ(outcome.status, 2) << other;
    EXPECT_EQ(outcome.err,
              "xquery: --profile does not go with " + other + "\nTry xquery --help.\n");
  }
  EXPECT_EQ(files(), 0u);
}

// Whoever forgets to name a file for the profile.
TEST_F(ProfileCommand, OverwritesNeitherQueryNorInputNorResult) {
  const std::string query = write("q.txt", "1"), input = write("a.html", "<a/>");
  const std::vector<std::string> commands[] = {
      {"--profile", query, query},
      {"--profile", input, "-e", "1", path(".") + "/a.html"},
      {"--profile", path("p.json"), "-o", path("p.json"), "-e", "1"},
      {"--profile", input, "--doc", "d=" + input, "-e", "1"},
      {"--profile", query, "--files-from", query, "-e", "1"},
  };
  for (const auto& arguments : commands) {
    const Outcome outcome = xquery(arguments);
    EXPECT_EQ(outcome.status, 2);
    EXPECT_THAT(outcome.err, HasSubstr(" is named as something else too\n"));
  }
  EXPECT_EQ(content("q.txt") + content("a.html"), "1<a/>");
  EXPECT_EQ(files(), 2u);
}

TEST_F(ProfileCommand, GoesWithAFileForTheResult) {
  EXPECT_EQ(xquery({"--profile", path("p.json"), "-o", path("out"), "-e", "1 + 1"}).status, 0);
  EXPECT_EQ(content("out"), "2\n");
  EXPECT_EQ(jsonMember(content("p.json"), "evaluations"), "1");
  EXPECT_EQ(files(), 2u);
}

TEST_F(ProfileCommand, AddsUpRepetitionsAndInputs) {
  const std::string a = write("a.xml", "<a><b/></a>"), b = write("b.xml", "<a><b/><b/></a>");
  const std::string query = "for $b in //b return count($b/..)";
  const Outcome outcome =
      xquery({"--profile", path("p.json"), "--repeat", "3", "--jobs", "2", "-e", query, a, b});
  EXPECT_EQ(outcome.out, "1\n1\n1\n");
  const std::string json = content("p.json");
  EXPECT_EQ(jsonMember(json, "evaluations"), "6");
  EXPECT_EQ(jsonMember(json, "inputs"), "2");
  EXPECT_EQ(jsonMember(json, "failures"), "0");
  EXPECT_THAT(json, HasSubstr("}],\"calls\":6,\"items\":9,\"failures\":0,"));
  xquery({"--profile", path("p.txt"), "--repeat", "3", "-e", query, a, b});
  EXPECT_THAT(content("p.txt"), StartsWith("query: 6 evaluations for 2 inputs\nreading "));
}

TEST_F(ProfileCommand, IsWrittenOfWhatFailed) {
  const std::string a = write("a.xml", "<a>1</a>"), b = write("b.xml", "<a>0</a>");
  const std::string failing = "if (/a = 0) then error('x', 'y') else 6";
  const Outcome outcome = xquery({"--profile", path("p.json"), "-e", failing, a, b, "/nowhere"});
  EXPECT_EQ(outcome.status, 3);
  EXPECT_EQ(outcome.out, "6\n");
  EXPECT_EQ(jsonMember(content("p.json"), "evaluations"), "2");
  EXPECT_EQ(jsonMember(content("p.json"), "inputs"), "2");
  EXPECT_EQ(jsonMember(content("p.json"), "failures"), "1");
  EXPECT_EQ(xquery({"--profile", path("q.txt"), "-e", "error('x', 'y')"}).status, 1);
  EXPECT_THAT(content("q.txt"),
              AllOf(HasSubstr("query: 1 evaluation, 1 failed\n"), HasSubstr("error(...)")));
}

// Nothing was evaluated.
TEST_F(ProfileCommand, LeavesAnOldFileWhereNothingRan) {
  (void)write("p.json", "old");
  EXPECT_EQ(xquery({"--profile", path("p.json"), "-e", "1 +"}).status, 1);
  EXPECT_EQ(xquery({"--profile", path("p.json"), "-e", "1", "/nowhere"}).status, 3);
  EXPECT_EQ(xquery({"--profile", path("p.json"), "-e", "1", "--bogus"}).status, 2);
  EXPECT_EQ(content("p.json"), "old");
  EXPECT_EQ(files(), 1u);
}

const std::string declaration =
    "declare function local:f($n) { if ($n < 2) then 1 else local:f($n - 1) + local:f($n - 2) };";
const std::string endless = declaration + "local:f(90)";

TEST_F(ProfileCommand, IsWrittenAtATimeLimit) {
  const Outcome outcome = xquery({"--profile", path("p.json"), "--timeout", "0.3", "-e", endless});
  EXPECT_EQ(outcome.status, 1);
  EXPECT_THAT(outcome.err, HasSubstr("limit: deadline passed"));
  EXPECT_EQ(jsonMember(content("p.json"), "evaluations"), "1");
  EXPECT_EQ(jsonMember(content("p.json"), "failures"), "1");
}

// What becomes of the command where it is interrupted while so many evaluations do not come to an
// end; "$1" is the folder. Each of them tells that it has begun by a document of its own that is
// missing.
Outcome interrupted(const std::string& arguments, const std::string& folder,
                    const std::string& nameOfMissing, int evaluations) {
  const std::string query = declaration + "(doc(" + nameOfMissing + "), local:f(90))";
  const std::string script =
      "env --default-signal=INT \"$0\" --profile \"$1/p.json\" -e \"$2\" " + arguments +
      " 2> \"$3\" & pid=$!; " +
      command::waitUntil("[ $(grep -c 'cannot load' \"$3\") = " + std::to_string(evaluations) +
                         " ] || ! kill -0 $pid") +
      "kill -INT $pid; wait $pid";
  const TemporaryDirectory told;
  return command::start("/bin/bash", {"-mc", script, XQUERY_BINARY_DIR "/xquery", folder, query,
                                      told.path("messages")});
}

TEST_F(ProfileCommand, IsWrittenAtAnInterrupt) {
  const Outcome outcome = interrupted("-o \"$1/out\"", path(""), "'none'", 1);
  EXPECT_EQ(outcome.status, 130) << outcome.err;
  EXPECT_EQ(jsonMember(content("p.json"), "evaluations"), "1");
  EXPECT_EQ(jsonMember(content("p.json"), "failures"), "1");
  EXPECT_EQ(files(), 1u);
}

TEST_F(ProfileCommand, AtAnInterruptHasWhatAllThreadsMeasured) {
  for (const std::string name : {"a", "b", "c"}) {
    std::ofstream(path(name + ".xml")) << "<a>no-" << name << "</a>";
  }
  const Outcome outcome = interrupted("--jobs 3 \"$1\"/?.xml", path(""), "string(/*)", 3);
  EXPECT_EQ(outcome.status, 130) << outcome.err;
  EXPECT_EQ(jsonMember(content("p.json"), "evaluations"), "3");
  EXPECT_EQ(jsonMember(content("p.json"), "inputs"), "3");
  EXPECT_EQ(jsonMember(content("p.json"), "failures"), "3");
}

TEST_F(ProfileCommand, ThatCannotBeWrittenIsSaidBeforeAnythingIsEvaluated) {
  const Outcome outcome = xquery({"--profile", path("no/p.json"), "-e", "1"});
  EXPECT_EQ(outcome.status, 3);
  EXPECT_EQ(outcome.out, "");
  EXPECT_EQ(outcome.err,
            "xquery: cannot write " + path("no/p.json") + ": No such file or directory\n");
  fs::create_directory(path("p.html"));
  EXPECT_EQ(xquery({"--profile", path("p.html"), "-e", "1"}).status, 3);
  EXPECT_TRUE(fs::is_directory(path("p.html")));
}

TEST_F(ProfileCommand, ToAFullDiskIsAFailure) {
  fs::create_symlink("/dev/full", path("p.json"));
  const Outcome outcome = xquery({"--profile", path("p.json"), "-e", "1"});
  EXPECT_EQ(outcome.status, 3);
  EXPECT_EQ(outcome.out, "1\n");
  EXPECT_THAT(outcome.err, HasSubstr("No space left on device"));
}

TEST_F(ProfileCommand, GivesTheSameResultAndErrors) {
  const std::string books = command::books();
  for (const std::string query :
       {"//book/title", "for $b in //book order by $b/title descending return <t>{$b/@*}</t>",
        "for $b in //book return 1 idiv 0", "concat('a', 'b')", "1 + <a/>", "//book[@year = 2000]",
        "declare function local:f($n) { if ($n) then local:f($n - 1) else 'x' }; local:f(90000)"}) {
    const Outcome plain = xquery({"--types", "-e", query, books});
    const Outcome outcome = xquery({"--types", "--profile", path("p.json"), "-e", query, books});
    EXPECT_EQ(outcome.out, plain.out) << query;
    EXPECT_EQ(outcome.err, plain.err) << query;
    EXPECT_EQ(outcome.status, plain.status) << query;
  }
  EXPECT_EQ(xquery({"--exit-status", "--profile", path("p.json"), "-e", "()"}).status, 4);
}

// --- the page about it
// ----------------------------------------------------------------------------

// Without times, and the widths that they give the columns.
std::string withoutTimes(const std::string& text) {
  const std::string unmeasured = std::regex_replace(text, std::regex("[0-9]+\\.[0-9]+"), "0.0");
  return std::regex_replace(std::regex_replace(unmeasured, std::regex("most [0-9]+ MiB"), "most"),
                            std::regex(" +"), " ");
}

TEST_F(ProfileCommand, WritesWhatItsPageShows) {
  const std::string page = readFile(XQUERY_SOURCE_DIR "/docs/profile.md");
  const std::string prompt = "$ xquery --profile costs.txt ", fence = "```\n";
  const size_t start = page.find(prompt), end = page.find('\n', start);
  ASSERT_NE(start, page.npos);
  const std::string arguments = page.substr(start + prompt.size(), end - start - prompt.size());
  const size_t shown = page.find(fence, page.find(fence, end) + fence.size()) + fence.size();
  const std::string expected = page.substr(shown, page.find(fence, shown) - shown);
  const Outcome outcome = shell("cd '" XQUERY_SOURCE_DIR "'; \"$0\" --profile \"$1\" " + arguments,
                                {path("costs.txt")});
  EXPECT_EQ(outcome.status, 0) << outcome.err;
  EXPECT_EQ(withoutTimes(content("costs.txt")), withoutTimes(expected));
}

// Each member that the page names is written, and no other.
TEST_F(ProfileCommand, HasTheMembersThatItsPageNames) {
  const std::string query =
      "declare function local:f($n) { if ($n = 0) then 0 else local:f($n - 1) };"
      "local:f(3), for $a in //a return count($a/b), //a[@n = 1]";
  ASSERT_EQ(xquery({"--profile", path("p.json"), "-e", query, write("a.xml", "<a/>")}).status, 0);
  std::set<std::string> written, named;
  const std::string json = content("p.json");
  const auto collect = [](const std::string& text, const std::regex& pattern,
                          std::set<std::string>& names) {
    for (std::sregex_iterator at(text.begin(), text.end(), pattern), end; at != end; ++at) {
      names.insert((*at)[1]);
    }
  };
  collect(json, std::regex("\"([A-Za-z]+)\":"), written);
  std::istringstream page(readFile(XQUERY_SOURCE_DIR "/docs/profile.md"));
  bool isAboutJSON = false;
  for (std::string line; std::getline(page, line);) {
    if (line.starts_with("## ")) isAboutJSON = line == "## JSON";
    if (!isAboutJSON || !line.starts_with("| `")) continue;
    collect(line.substr(0, line.find(" | ", 2)), std::regex("`([A-Za-z]+)`"), named);
  }
  for (const char* inside : {"reading", "compiling", "planning", "evaluating", "printing", "rule",
                             "refused", "reason"}) {
    named.insert(inside);
  }
  // There is no imported module in it, and room for every call.
  written.insert({"module", "folded"});
  EXPECT_EQ(written, named);
}

// --- hostile texts -------------------------------------------------------------------------------

const std::string hostile =
    "('</script><script>alert(1)</script>', '<!--', \"\xE2\x80\xAE\xC2\x85\x7F&#xA0;\")"
    " (: \xE2\x80\xA8 ]]> ${x} `)page\" :)";

TEST_F(ProfileCommand, KeepsMarkupOfTheQueryOutOfThePage) {
  const std::string query = write("a<b>&\"\n\x1b[31m\xE2\x80\xAE.xq", hostile);
  const Outcome outcome = xquery({"--profile", path("p.html"), query});
  ASSERT_EQ(outcome.status, 0) << outcome.err;
  const std::string page = content("p.html");
  EXPECT_THAT(page, AllOf(Not(HasSubstr("<script>alert")), Not(HasSubstr("\x1b")),
                          Not(HasSubstr("\xE2\x80\xAE")), Not(HasSubstr("\xC2\x85")),
                          Not(HasSubstr("\xE2\x80\xA8")), Not(HasSubstr("a<b>"))));
  EXPECT_THAT(page, HasSubstr("\\u003C/script\\u003E\\u003Cscript\\u003Ealert(1)"));
  // The two of the page itself.
  size_t scripts = 0;
  for (size_t at = 0; (at = page.find("</script>", at)) != page.npos; ++at) ++scripts;
  EXPECT_EQ(scripts, 2u);
}

TEST_F(ProfileCommand, ShowsControlCharactersInsteadOfWritingThem) {
  const std::string query = write("\x1b[31m\xff.xq", hostile);
  for (const std::string name : {"p.txt", "p.json"}) {
    ASSERT_EQ(xquery({"--profile", path(name), query}).status, 0);
    const std::string text = content(name);
    const bool isClean = std::none_of(text.begin(), text.end(), [](char each) {
      const auto byte = static_cast<unsigned char>(each);
      return (byte < 0x20 && each != '\n') || byte == 0x7F;
    });
    EXPECT_TRUE(isClean) << name;
    EXPECT_THAT(text, AllOf(HasSubstr("\\u001B[31m\xEF\xBF\xBD.xq"), Not(HasSubstr("\xff")),
                            Not(HasSubstr("\xE2\x80\xAE"))));
  }
}

TEST_F(ProfileCommand, PageNeedsNothingFromElsewhere) {
  ASSERT_EQ(xquery({"--profile", path("p.html"), "-e", "1 + 1"}).status, 0);
  const std::string page = content("p.html");
  for (const std::string mark : {"http:", "https:", "src=", "@import", "url(", "<link"}) {
    EXPECT_THAT(page, Not(HasSubstr(mark)));
  }
  EXPECT_THAT(page, HasSubstr("default-src 'none'"));
}

TEST_F(ProfileCommand, TakesLongAndWideQueries) {
  std::string query = "(";
  for (int i = 0; i < 5000; ++i) query += "count((" + std::to_string(i) + ", 'x')),\n";
  ASSERT_EQ(xquery({"--profile", path("p.html"), write("wide.xq", query + "1)")}).status, 0);
  EXPECT_LT(fs::file_size(path("p.html")), 4u << 20);
  query = std::string(2000, '(') + "1 + 1" + std::string(2000, ')');
  EXPECT_EQ(xquery({"--profile", path("p.txt"), "-e", query}).status, 0);
  std::string nested = "1";
  for (int i = 0; i < 2000; ++i) nested = "count((" + nested + ", 2))";
  EXPECT_EQ(xquery({"--profile", path("p.json"), "-e", nested}).status, 0);
}

}  // namespace

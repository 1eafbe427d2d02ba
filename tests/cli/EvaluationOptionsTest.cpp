// Where queries come from, what bounds them, what ends them, and what their result says to a shell.
#include "cli/Command.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <algorithm>
#include <csignal>
#include <filesystem>
#include <iterator>
#include <sys/stat.h>

using command::books;
using command::Outcome;
using command::readFile;
using command::shell;
using command::TemporaryDirectory;
using command::waitUntil;
using command::withoutPlaces;
using command::xquery;
using testing::HasSubstr;
using testing::StartsWith;

namespace {

constexpr const char* endless =
    "count(for $i in 1 to 1000000, $j in 1 to 1000000 where $i > $j return $i)";

// --- where the query comes from ------------------------------------------------------------------

TEST(Query, MayComeFromStandardInput) {
  const Outcome outcome = xquery({"-", books()}, "#!/usr/bin/env xquery\ncount(//book)\n");
  EXPECT_EQ(outcome.out, "4\n");
  EXPECT_THAT(xquery({"-"}, "#! x\n1 +").err, HasSubstr("line:2"));
  EXPECT_EQ(xquery({"-"}, "#!").status, 0);
  EXPECT_EQ(xquery({"-"}, "#! x\r1 + 1\r").out, "2\n");
  const Outcome twice = xquery({"-", "-"}, "1");
  EXPECT_EQ(twice.status, 2);
  EXPECT_THAT(twice.err, HasSubstr("standard input can be read only once"));
}

TEST(Query, MayBeAScript) {
  const TemporaryDirectory directory;
  const std::string script =
      directory.write("script", "#!" XQUERY_BINARY_DIR "/xquery\n\n(: on line 3 :) ]\n");
  chmod(script.c_str(), 0755);
  EXPECT_THAT(command::start(script, {books()}).err, HasSubstr("line:3"));
  const std::string good = directory.write("good", "#!" XQUERY_BINARY_DIR "/xquery\ncount(//book)");
  chmod(good.c_str(), 0755);
  EXPECT_EQ(command::start(good, {books()}).out, "4\n");
}

TEST(Query, MayBeginWithAByteOrderMark) {
  EXPECT_EQ(xquery({"-"},
                   "\xEF\xBB\xBF"
                   "1 + 1")
                .out,
            "2\n");
  EXPECT_EQ(xquery({"-"}, "\xEF\xBB\xBF#!/usr/bin/env xquery\n1 + 1").out, "2\n");
  EXPECT_EQ(xquery({"-"}, "\xEF\xBB\xBF#!").status, 0);
  EXPECT_THAT(xquery({"-"}, "\xEF\xBB\xBF#! x\n1 +").err, HasSubstr("line:2"));
  // Only one, and only before anything else.
  EXPECT_EQ(xquery({"-"}, "\xEF\xBB\xBF\xEF\xBB\xBF#! x\n1").status, 1);
  EXPECT_EQ(xquery({"-"}, " #! x\n1").status, 1);
}

TEST(Query, MayBeEmptyButNotBinary) {
  const TemporaryDirectory directory;
  const Outcome empty = xquery({directory.write("empty.xq", "")});
  EXPECT_EQ(empty.out + empty.err, "");
  EXPECT_EQ(empty.status, 0);
  const Outcome binary = xquery({directory.write("a.out",
                                                 "\x7f"
                                                 "ELF\x02\xff\xfe")});
  EXPECT_EQ(binary.err, "xquery: " + directory.path("a.out") + ": not UTF-8 text\n");
  EXPECT_EQ(binary.status, 3);
}

TEST(Query, IsOnlyCompiledWhenItIsToBeChecked) {
  EXPECT_EQ(xquery({"--check", "-e", "1 idiv 0", "/nowhere"}).status, 0);
  const Outcome wrong = xquery({"--check", "-e", "1 +"});
  EXPECT_EQ(wrong.status, 1);
  EXPECT_THAT(wrong.err, StartsWith("XQueryError:3"));
}

TEST(Query, FindsNamesWithoutPrefixInTheNamespaceThatIsGiven) {
  const TemporaryDirectory directory;
  const std::string file = directory.write("d.xml", "<a xmlns='urn:x'><b>1</b></a>");
  EXPECT_EQ(xquery({"-e", "count(//b)", file}).out, "0\n");
  EXPECT_EQ(xquery({"--namespace", "=urn:x", "-e", "count(//b)", file}).out, "1\n");
}

TEST(Query, MayGiveAReservedNamespaceAnotherPrefixAsItsPrologMay) {
  const char* const input = "<a xml:lang='de'/>";
  EXPECT_EQ(xquery({"-e",
                    "declare namespace p = 'http://www.w3.org/XML/1998/namespace'; "
                    "string(/a/@p:lang)",
                    "-"},
                   input)
                .out,
            "de\n");
  EXPECT_EQ(xquery({"--namespace", "p=http://www.w3.org/XML/1998/namespace", "-e",
                    "string(/a/@p:lang)", "-"},
                   input)
                .out,
            "de\n");
}

TEST(Query, ReadsDocumentsOfVariablesAsHTMLUnlessTheyAreNamedXML) {
  const TemporaryDirectory directory;
  const std::string page = directory.write("page", "<p>a<p>b"),
                    xml = directory.write("d.xml", "<p/>");
  EXPECT_EQ(xquery({"--html", "--doc", "h=" + page, "--doc", "x=" + xml, "-e",
                    "declare variable $h external; declare variable $x external; "
                    "count($h//*:p), count($x/p)"})
                .out,
            "2\n1\n");
}

// --- status --------------------------------------------------------------------------------------

TEST(ExitStatusOption, IsFourForWhatIsEmptyOrFalse) {
  const auto status = [](const std::string& query) {
    return xquery({"--exit-status", "-e", query}).status;
  };
  for (const char* query : {"()", "1 = 2", "''", "0", ""}) EXPECT_EQ(status(query), 4) << query;
  for (const char* query : {"1", "'a'", "<a/>", "1, 2", "0, 0"})
    EXPECT_EQ(status(query), 0) << query;
  EXPECT_EQ(status("1 idiv 0"), 1);
  EXPECT_EQ(xquery({"-e", "()"}).status, 0);
}

TEST(ExitStatusOption, IsZeroWhenAnyInputGaveSomething) {
  const TemporaryDirectory directory;
  const std::string a = directory.write("a", "<a/>"), b = directory.write("b", "<b/>");
  EXPECT_EQ(xquery({"--exit-status", "-e", "/a", b, a, b}).status, 0);
  EXPECT_EQ(xquery({"--exit-status", "-e", "/a", b, b}).status, 4);
  EXPECT_EQ(xquery({"--exit-status", "-e", "/a", b, "/nowhere"}).status, 3);
}

// --- limits --------------------------------------------------------------------------------------

TEST(LimitOptions, EndAnEvaluation) {
  const Outcome late = xquery({"--timeout", "0.05", "-e", endless});
  EXPECT_EQ(late.status, 1);
  EXPECT_EQ(withoutPlaces(late.err), "XQueryError:0 - \"limit: deadline passed\"\n");
  const Outcome large = xquery(
      {"--memory", "4M", "-e", "string-join(for $i in 1 to 10000000 return string($i), '')"});
  EXPECT_EQ(large.status, 1);
  EXPECT_EQ(withoutPlaces(large.err), "XQueryError:0 - \"limit: memory ceiling reached\"\n");
  EXPECT_EQ(xquery({"--timeout", "1000", "--memory", "1g", "-e", "1"}).out, "1\n");
}

TEST(LimitOptions, SayWhatMayBeLoaded) {
  const TemporaryDirectory directory, other;
  const std::string file = directory.write("d.xml", "<d>1</d>");
  const std::string query = "doc('" + file + "')/d/text()";
  const std::string script = directory.write("q.xq", query);
  EXPECT_EQ(xquery({"-e", query}).out, "1\n");
  // Files that the command line names are the user's own.
  EXPECT_EQ(
      xquery({"--deny-all", "--doc", "v=" + file, "-e",
              "declare variable $v external; count($v), count(" + query + "), count(/d)", file})
          .out,
      "1\n0\n1\n");
  EXPECT_EQ(xquery({"--allow", directory.path(""), script}).out, "1\n");
  EXPECT_EQ(xquery({"--allow", other.path(""), script}).out, "");
  EXPECT_EQ(
      xquery({"--deny-all", "--allow", other.path(""), "--allow", directory.path("."), "-e", query})
          .out,
      "1\n");
  EXPECT_EQ(xquery({"--allow", "https://example.org/", "-e", query}).out, "");
}

TEST(LimitOptions, AreUnderstoodOrRefused) {
  const std::vector<std::string> wrong[] = {
      {"--timeout", "0"},          {"--timeout", "-1"},        {"--timeout", "soon"},
      {"--timeout", "nan"},        {"--memory", "0"},          {"--memory", "1T"},
      {"--memory", "K"},           {"--memory", "1KB"},        {"--memory", "99999999999G"},
      {"--allow", "/nowhere"},     {"--allow", "ftp://a/"},    {"--allow", "https://u@a/b"},
      {"--allow", "https://a:x/"}, {"--allow", "http://a/?q"}, {"--allow", "http://"},
      {"--color", "blue"}};
  for (std::vector<std::string> arguments : wrong) {
    const std::string option = arguments.front();
    arguments.insert(arguments.end(), {"-e", "1"});
    const Outcome outcome = xquery(arguments);
    EXPECT_EQ(outcome.status, 2) << arguments[1];
    EXPECT_THAT(outcome.err, StartsWith("xquery: " + option + ": ")) << arguments[1];
  }
  EXPECT_EQ(xquery({"--allow", "http://a/", "--allow", "https://b:1/c", "-e", "1"}).out, "1\n");
}

// --- interrupts ----------------------------------------------------------------------------------

// Starts the command in the background, waits until the evaluation has begun, sends signals.
std::string interrupted(const std::string& arguments, const std::string& signals) {
  return "env --default-signal=INT \"$0\" " + arguments + " -e '" + endless +
         "' & pid=$!; sleep 0.5; " + signals + "; wait $pid; echo $?";
}

TEST(Interrupt, EndsTheEvaluationAndLeavesTheResultFileAsItWas) {
  const TemporaryDirectory directory;
  const std::string out = directory.write("out", "kept");
  for (const std::string signal : {"INT", "TERM"}) {
    // What runs in the background may have been told to ignore interrupts.
    const Outcome outcome =
        command::start("/bin/bash", {"-mc", interrupted("-o \"$1\"", "kill -" + signal + " $pid"),
                                     XQUERY_BINARY_DIR "/xquery", out});
    EXPECT_EQ(outcome.out, signal == "INT" ? "130\n" : "143\n");
  }
  EXPECT_EQ(readFile(out), "kept");
  // While a result is being written the new file goes.
  const Outcome outcome = command::start(
      "/bin/bash", {"-mc",
                    "mkfifo \"$2\"; { echo '<a/>'; } > \"$2.xml\"; env --default-signal=INT \"$0\" "
                    "--jobs 1 -o \"$1\" -e "
                    "'/' \"$2.xml\" \"$2\" & pid=$!; " +
                        waitUntil("[ $(ls -A \"$3\" | wc -l) = 4 ]") +
                        "ls -A \"$3\" | wc -l; kill -INT $pid; wait $pid; echo $?; "
                        "ls -A \"$3\" | wc -l",
                    XQUERY_BINARY_DIR "/xquery", out, directory.path("pipe"), directory.path("")});
  EXPECT_EQ(outcome.out, "4\n130\n3\n");
  EXPECT_EQ(readFile(out), "kept");
}

// What asks the process to end finds it within whatever it does.
TEST(Interrupt, EndsTheCommandByEverySignalThatIsMeantTo) {
  const TemporaryDirectory directory;
  const std::string out = directory.write("out", "kept");
  const std::pair<const char*, const char*> signals[] = {
      {"QUIT", "131\n"}, {"XCPU", "152\n"}, {"HUP", "129\n"}};
  for (const auto& [signal, status] : signals) {
    // While a result is being written to its new file; without a file of the process's memory.
    const std::string script =
        "ulimit -c 0; rm -f \"$2\"; mkfifo \"$2\"; echo '<a/>' > \"$2.xml\"; "
        "env --default-signal=" +
        std::string(signal) + " \"$0\" --jobs 1 -o \"$1\" -e '/' \"$2.xml\" \"$2\" & pid=$!; " +
        waitUntil("[ $(ls -A \"$3\" | wc -l) = 4 ]") + "ls -A \"$3\" | wc -l; kill -" + signal +
        " $pid; wait $pid; echo $?; ls -A \"$3\" | wc -l";
    const Outcome outcome =
        command::start("/bin/bash", {"-mc", script, XQUERY_BINARY_DIR "/xquery", out,
                                     directory.path("pipe"), directory.path("")});
    EXPECT_EQ(outcome.out, "4\n" + std::string(status) + "3\n") << signal;
  }
  EXPECT_EQ(readFile(out), "kept");
}

// One thread evaluates, the other one waits for an input that does not come.
TEST(Interrupt, EndsTheCommandWhileAnotherThreadReads) {
  const TemporaryDirectory directory;
  const std::string input = directory.write("a.xml", "<a/>");
  const Outcome outcome = command::start(
      "/bin/bash",
      {"-mc",
       "mkfifo \"$2\"; env --default-signal=INT \"$0\" --jobs 2 -e '" + std::string(endless) +
           "' \"$1\" \"$2\" & pid=$!; sleep 0.7; kill -INT $pid; wait $pid; echo $?",
       XQUERY_BINARY_DIR "/xquery", input, directory.path("pipe")});
  EXPECT_EQ(outcome.out, "130\n");
}

// The end of the process by its own message still takes the new file away.
TEST(Interrupt, LeavesNoFileBehindWhenNobodyReadsItsMessages) {
  const TemporaryDirectory directory;
  const std::string out = directory.write("out", "kept"), a = directory.write("a.xml", "<a/>");
  const Outcome outcome = command::start(
      "xquery", {"--jobs", "1", "-o", out, "-e", "/", a, directory.path("none.xml"), a}, "",
      command::Sink::Captured, command::Sink::ClosedPipe);
  EXPECT_EQ(outcome.status, -SIGPIPE);
  EXPECT_EQ(readFile(out), "kept");
  const auto files = std::filesystem::directory_iterator(directory.path(""));
  EXPECT_EQ(std::distance(begin(files), end(files)), 2);
}

// --- messages ------------------------------------------------------------------------------------

TEST(MessageOptions, ColorWhatTheyAreAskedTo) {
  EXPECT_EQ(xquery({"--color", "always", "-e", "1 idiv 0"}).err,
            "\033[1;31mXQueryError:6\033[0m - \"divide by zero\" at line:1\n"
            "  at query:1:1\n  1 | 1 idiv 0\n    | \033[1;31m^^^^^^^^\033[0m\n");
  EXPECT_EQ(xquery({"--color", "auto", "-e", "1 idiv 0"}).err,
            "XQueryError:6 - \"divide by zero\" at line:1\n"
            "  at query:1:1\n  1 | 1 idiv 0\n    | ^^^^^^^^\n");
  const std::string onTerminal = "script -qec \"$1 $0 $2 -e '1 idiv 0'\" /dev/null </dev/null";
  EXPECT_THAT(shell(onTerminal, {"TERM=xterm", ""}).out, HasSubstr("\033[1;31mXQuery"));
  EXPECT_THAT(shell(onTerminal, {"TERM=xterm NO_COLOR=1", ""}).out, StartsWith("XQueryError:6"));
  EXPECT_THAT(shell(onTerminal, {"TERM=xterm", "--color never"}).out, StartsWith("XQueryError:6"));
}

TEST(MessageOptions, SuggestTheNearest) {
  const std::pair<const char*, const char*> wrong[] = {
      {"--tpyes", "--types"},        {"--with-names", "--with-name"},
      {"-types", "--types"},         {"--file-from=x", "--files-from"},
      {"--tim", "--time"},           {"--prof", "--profile"},
      {"--seperator", "--separator"}};
  for (const auto& [given, meant] : wrong) {
    const Outcome outcome = xquery({given, "-e", "1"});
    EXPECT_EQ(outcome.status, 2);
    EXPECT_EQ(outcome.err, std::string("xquery: unknown option ") + given + "; did you mean " +
                               meant + "?\nTry xquery --help.\n");
  }
  EXPECT_EQ(xquery({"--zzzzzz", "-e", "1"}).err,
            "xquery: unknown option --zzzzzz\nTry xquery --help.\n");
}

TEST(MessageOptions, DoNotDependOnTheLocale) {
  const Outcome outcome = shell("LC_ALL=C \"$0\" -e '\"é\", \"ß\" cast as xs:integer'");
  EXPECT_EQ(outcome.status, 1);
  EXPECT_THAT(outcome.err, testing::EndsWith("  at query:1:6\n"
                                             "  1 | \"é\", \"ß\" cast as xs:integer\n"
                                             "    |      ^^^^^^^^^^^^^^^^^^^^^^\n"));
  EXPECT_EQ(shell("LC_ALL=C \"$0\" -e '\"é\"'").out, "é\n");
  EXPECT_EQ(shell("LC_ALL=C \"$0\" \"$1\"", {"/é.xq"}).err,
            "xquery: /é.xq: No such file or directory\n");
}

}  // namespace

// The interactive session, on a terminal of its own.
#include "cli/Command.h"
#include "cli/Terminal.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <csignal>
#include <fcntl.h>
#include <fstream>
#include <sys/stat.h>

using command::books;
using command::Outcome;
using command::TemporaryDirectory;
using command::Terminal;
using command::xquery;
using testing::AllOf;
using testing::HasSubstr;
using testing::Not;
using testing::StartsWith;

namespace {

class Session : public testing::Test {
 protected:
  std::string path(const std::string& name) const { return _directory.path(name); }
  std::string write(const std::string& name, const std::string& text) const {
    return _directory.write(name, text);
  }
  std::map<std::string, std::string> environment(const std::string& name = "",
                                                 const std::string& value = "") const {
    std::map<std::string, std::string> all = {{"XDG_STATE_HOME", path("state")}};
    if (!name.empty()) all[name] = value;
    return all;
  }
  std::string historyFile() const { return path("state/xquery/history"); }
  // A session that has given its first prompt.
  std::unique_ptr<Terminal> begin(const std::vector<std::string>& arguments = {},
                                  const std::string& name = "", const std::string& value = "",
                                  unsigned short columns = 80) const {
    auto terminal = std::make_unique<Terminal>(arguments, environment(name, value), columns);
    terminal->waitFor("xquery> ");
    return terminal;
  }

 private:
  TemporaryDirectory _directory;
};

constexpr const char* more = "   ...> ";
constexpr const char* endless =
    "count(for $i in 1 to 1000000, $j in 1 to 1000000 where $i > $j return $i)";
constexpr const char* up = "\033[A";

// --- entries -------------------------------------------------------------------------------------

TEST_F(Session, EvaluatesWhatIsEnteredUntilItsEnd) {
  const auto session = begin();
  EXPECT_EQ(session->ask("1 + 1"), "2\n");
  EXPECT_EQ(session->ask("(1, 'two')"), "1\ntwo\n");
  EXPECT_EQ(session->ask(""), "");
  EXPECT_EQ(session->ask("()"), "");
  session->type("\x04");
  EXPECT_EQ(session->end(), 0);
}

TEST_F(Session, HasADocumentThatIsNamedOnTheCommandLine) {
  EXPECT_EQ(begin({books()})->ask("count(//book)"), "4\n");
  const std::string page = write("p.html", "<p>text");
  EXPECT_EQ(begin({"--html", page})->ask("normalize-space(/)"), "text\n");
  const auto none = begin();
  EXPECT_THAT(none->ask("/a"), StartsWith("XQueryError:"));
  Terminal missing({path("none.xml")}, environment());
  EXPECT_EQ(missing.end(), 3);
  EXPECT_THAT(missing.everything(), HasSubstr("none.xml: No such file or directory"));
}

TEST_F(Session, GoesOnAfterAnErrorWithItsLineInTheEntry) {
  const auto session = begin();
  EXPECT_EQ(session->ask("1 idiv 0"),
            "XQueryError:6 - \"divide by zero\" at line:1\n"
            "  at query:1:1\n  1 | 1 idiv 0\n    | ^^^^^^^^\n");
  EXPECT_EQ(session->ask("declare variable $a := 1; declare variable $b := 2;"), "");
  session->ask("(1,", more);
  EXPECT_EQ(session->ask(" $a idiv 0)"),
            "XQueryError:6 - \"divide by zero\" at line:2\n"
            "  at query:2:2\n  2 |  $a idiv 0)\n    |  ^^^^^^^^^\n");
  EXPECT_EQ(session->ask("$c"),
            "XQueryError:8 - \"reference to undefined variable \"c\"\" at line:1\n"
            "  at query:1:1\n  1 | $c\n    | ^^\n");
  EXPECT_EQ(session->ask("1 ]"),
            "XQueryError:3 - \"parse error invalid token (])- 1 ]\" at line:1\n"
            "  at query:1:3\n  1 | 1 ]\n    |   ^\n");
}

// Lines of the entry count from its start, those of a module from that of the module.
TEST_F(Session, TellsTheSameLinesAsJSON) {
  write("m.xq",
        "module namespace m = 'urn:m';\n\n\n\ndeclare function m:f($x) {\n  1 idiv $x };\n");
  const auto session = begin({"--quiet", "--as", "json"}, "", "", 400);
  session->ask(":load " + path("m.xq"));
  session->ask("declare variable $a := 1;");
  session->ask("declare variable $b := '\"line\":9';");
  session->ask("(1,", more);
  const std::string own = session->ask("concat('\"line\":9', 'x') idiv 0)");
  EXPECT_THAT(own, HasSubstr("\"place\":{\"line\":2,\"column\":1,"));
  EXPECT_THAT(own, Not(HasSubstr("\"line\":3")));
  session->ask("(1,", more);
  const std::string ofModule = session->ask("m:f(0))");
  EXPECT_THAT(ofModule, HasSubstr("m.xq\",\"line\":6,\"column\":3,"));
  EXPECT_THAT(ofModule, HasSubstr("{\"function\":\"m:f\",\"line\":2,\"column\":1,"));
  EXPECT_THAT(ofModule, HasSubstr(",\"line\":6,\"category\"")) << "as the module has it";
}

TEST_F(Session, KeepsWhatIsDeclared) {
  const auto session = begin();
  EXPECT_EQ(session->ask("declare variable $a := 20;"), "");
  EXPECT_EQ(session->ask("declare function local:f($x) { $x + $a };"), "");
  // What has to come first may be declared last.
  EXPECT_EQ(session->ask("declare namespace p = 'urn:p';"), "");
  EXPECT_EQ(session->ask("declare xmlspace preserve; local:f(1)"), "21\n");
  EXPECT_EQ(session->ask("namespace-uri(<p:a/>)"), "urn:p\n");
  EXPECT_EQ(session->ask("declare variable $a := 30;"), "");
  EXPECT_EQ(session->ask("local:f(1)"), "31\n");
  EXPECT_EQ(session->ask("declare variable $later := 7;"), "");
  EXPECT_EQ(session->ask("declare variable $a := $later;"), "");
  EXPECT_EQ(session->ask("local:f(1)"), "8\n");
}
TEST_F(Session, KeepsNoDeclarationThatFails) {
  const auto session = begin();
  EXPECT_THAT(session->ask("declare variable $a := 1 idiv 0;"), StartsWith("XQueryError:6"));
  EXPECT_THAT(session->ask("$a"), StartsWith("XQueryError:8"));
  EXPECT_THAT(session->ask("declare variable $b := $nothing;"), StartsWith("XQueryError:8"));
  EXPECT_EQ(session->ask("declare variable $c := 1; $c idiv 0"),
            "XQueryError:6 - \"divide by zero\" at line:1\n"
            "  at query:1:2\n  1 |  $c idiv 0\n    |  ^^^^^^^^^\n");
  EXPECT_EQ(session->ask("$c"), "1\n") << "what is wrong with the query is not wrong with them";
}

TEST_F(Session, AsksForMoreWhileSomethingIsOpen) {
  const std::pair<std::vector<std::string>, const char*> entries[] = {
      {{"(1,", "2", ")"}, "1\n2\n"},
      {{"'a", "b'"}, "a\nb\n"},
      {{"(: a", " comment :) 3"}, "3\n"},
      {{"<a b='{", "1}'>", "{", "'}' }</a>"}, "<a b=\"1\">}</a>\n"},
      {{"<!-- a", "b -->"}, "<!-- a\nb -->\n"},
      {{"for $i in 1 to 2", "return", "$i"}, "1\n2\n"},
      {{"declare function local:f() {", "5", "};", ""}, ""},
      {{"if (local:f() < 6) then 'less'", "else ()"}, "less\n"}};
  const auto session = begin();
  for (const auto& [lines, answer] : entries) {
    for (size_t n = 0; n + 1 < lines.size(); ++n) {
      const bool isLast = lines[n + 1].empty();
      EXPECT_EQ(session->ask(lines[n], isLast ? "xquery> " : more), "") << lines[n];
    }
    EXPECT_EQ(session->ask(lines.back()), answer);
  }
}

TEST_F(Session, EndsAnEntryThatNeverCouldAtAnEmptyLine) {
  const auto session = begin();
  session->ask("1 +", more);
  EXPECT_THAT(session->ask(""), StartsWith("XQueryError:3 - \"parse error invalid token ()"));
  session->ask("(1,", more);
  session->ask("", more);
  EXPECT_EQ(session->ask("2)"), "1\n2\n") << "an empty line is part of what is open";
}

TEST_F(Session, IsNoSessionWhereNobodyIsAtATerminal) {
  const Outcome outcome = xquery({});
  EXPECT_EQ(outcome.status, 2);
  EXPECT_EQ(outcome.err, "xquery: QUERYFILE or -e QUERY is required\nTry xquery --help.\n");
  Terminal wrong({"-o", path("out")}, environment());
  EXPECT_EQ(wrong.end(), 2);
  EXPECT_THAT(wrong.everything(), HasSubstr("xquery: -o: QUERYFILE or -e QUERY is required"));
}

TEST_F(Session, FollowsTheOptions) {
  const auto session = begin({"--quiet", "--as", "json", "--var", "v=4", "--timeout", "0.3",
                              "--doc", "d=" + books(), "--namespace", "p=urn:p"});
  EXPECT_EQ(session->ask("$v + 1"), "[{\"type\":\"xs:double\",\"value\":5}]\n");
  EXPECT_EQ(session->ask("count($d//book)"), "[{\"type\":\"xs:integer\",\"value\":4}]\n");
  EXPECT_EQ(session->ask("1 idiv 0"),
            "{\"code\":6,\"message\":\"divide by zero\",\"line\":1,\"category\":\"values\","
            "\"place\":{\"line\":1,\"column\":1,\"length\":8},\"status\":1}\n");
  EXPECT_THAT(session->ask(endless), HasSubstr("limit: deadline passed"));
  EXPECT_EQ(session->ask("2"), "[{\"type\":\"xs:integer\",\"value\":2}]\n")
      << "the limit is that of one evaluation";
  EXPECT_THAT(session->everything(), Not(HasSubstr(":help lists")));
}

TEST_F(Session, EndsTheLineThatASeparatorLeftOpen) {
  EXPECT_EQ(begin({"--separator", ","})->ask("1 to 3"), "1,2,3\n");
}

TEST_F(Session, LosesNothingOfALongResult) {
  const auto session = begin();
  const std::string answer = session->ask("1 to 100000");
  std::string expected;
  for (int n = 1; n <= 100000; ++n) expected += std::to_string(n) + "\n";
  EXPECT_EQ(answer, expected);
}

TEST_F(Session, ShowsControlCharactersOfResults) {
  const auto session = begin();
  EXPECT_EQ(session->ask("codepoints-to-string((27, 91, 50, 74, 155, 97))"),
            "\\u001B[2J\\u009Ba\n");
  EXPECT_EQ(session->ask("'äß日本'"), "äß日本\n");
}

// --- editing -------------------------------------------------------------------------------------

TEST_F(Session, CompletesNames) {
  const auto session = begin();
  EXPECT_EQ(session->ask("string-le\t'abc')"), "3\n");
  EXPECT_EQ(session->ask("fn:string-le\t'ab')"), "2\n");
  EXPECT_EQ(session->ask("declare function local:long-name($x) { $x };"), "");
  EXPECT_EQ(session->ask("local:lo\t7)"), "7\n");
  EXPECT_EQ(session->ask("declare variable $number := 8;"), "");
  EXPECT_EQ(session->ask("$nu\t"), "8\n");
  EXPECT_EQ(session->ask("for $item in 9 retu\t $it\t"), "9\n");
  EXPECT_EQ(session->ask("declare namespace e = "
                         "'http://libxquery.example/xquery/2004/10/functions';"),
            "");
  EXPECT_EQ(session->ask("e:ev\t'3')"), "3\n");
  session->type("normalize-\t");
  EXPECT_THAT(session->waitFor("normalize-unicode("), HasSubstr("normalize-space("));
}

TEST_F(Session, CompletesCommandsAndNamesOfFiles) {
  write("query-one.xq", "'one'");
  write("a document.xml", "<a/>");
  const auto session = begin();
  EXPECT_EQ(session->ask(":lo\t " + path("query-o") + "\t"), "one\n");
  EXPECT_EQ(session->ask(":do\t d " + path("a do") + "\t"), "");
  EXPECT_EQ(session->ask("name($d/*)"), "a\n");
}

TEST_F(Session, GoesBackToFormerEntriesAndSessions) {
  {
    const auto session = begin();
    session->ask("(1,", more);
    EXPECT_EQ(session->ask("2)"), "1\n2\n");
    EXPECT_EQ(session->ask("'\\n'"), "\\n\n");
    EXPECT_EQ(session->ask(std::string(up)), "\\n\n");
    session->type("\x04");
    EXPECT_EQ(session->end(), 0);
  }
  EXPECT_EQ(command::readFile(historyFile()), "(1,\\n2)\n'\\\\n'\n");
  struct stat status;
  ASSERT_EQ(stat(historyFile().c_str(), &status), 0);
  EXPECT_EQ(status.st_mode & 0777, 0600u);
  const auto session = begin();
  session->type(std::string(up) + up + "\n");
  EXPECT_THAT(command::plain(session->waitFor("\nxquery> ")), HasSubstr("2)\n1\n2\n"));
}

TEST_F(Session, KeepsSoManyEntriesAndNoMore) {
  std::string lines;
  for (int n = 1; n <= 3000; ++n) lines += std::to_string(n) + "\n";
  std::filesystem::create_directories(path("state/xquery"));
  std::ofstream(historyFile()) << lines;
  const auto session = begin();
  EXPECT_EQ(session->ask(std::string(up)), "3000\n");
  EXPECT_THAT(command::readFile(historyFile()), StartsWith("2001\n"));
  EXPECT_EQ(session->ask("'" + std::string(2000, 'x') + "'").size(), 2001u);
}

TEST_F(Session, NeedsNoPlaceForItsHistory) {
  write("state", "a file");
  const auto session = begin();
  EXPECT_EQ(session->ask("1"), "1\n");
  EXPECT_EQ(session->ask(std::string(up)), "1\n");
}

TEST_F(Session, WorksOnATerminalOfTwentyColumns) {
  const auto session = begin({}, "", "", 20);
  const std::string text(60, 'x');
  session->type("'" + text + "'\n");
  EXPECT_THAT(command::plain(session->waitFor("\nxquery> ")), HasSubstr("\n" + text + "\n"));
  session->type("normalize-\t");
  EXPECT_THAT(session->waitFor("normalize-unicode("), HasSubstr("normalize-space("));
}

TEST_F(Session, WorksWithoutEditingOnATerminalThatCannotMoveItsCursor) {
  const auto session = begin({}, "TERM", "dumb");
  EXPECT_EQ(session->ask("1 + 1"), "2\n");
  session->ask("(", more);
  EXPECT_EQ(session->ask("'ä')"), "ä\n");
  session->type("12\x03");
  session->waitFor("xquery> ");
  EXPECT_EQ(session->ask("3"), "3\n");
  session->type("\x04");
  EXPECT_EQ(session->end(), 0);
  EXPECT_THAT(session->everything(), Not(HasSubstr("\033")));
  EXPECT_EQ(begin({}, "TERM", "no-such-terminal")->ask("1 + 1"), "2\n");
}

TEST_F(Session, ReadsUTF8WhateverTheLocale) {
  for (const char* locale : {"C", "POSIX", "de_DE.ISO-8859-1", "nonsense"}) {
    const auto session = begin({}, "LC_ALL", locale);
    EXPECT_EQ(session->ask("string-length('äß日')"), "3\n") << locale;
    EXPECT_EQ(session->ask("'ä'"), "ä\n") << locale;
    EXPECT_EQ(session->ask("string-length('\xFF')"), "1\n") << locale;
    EXPECT_EQ(session->ask("string-length('\xE6\x97')"), "1\n") << locale;
  }
}

// --- commands ------------------------------------------------------------------------------------

TEST_F(Session, LoadsQueriesAndModules) {
  const std::string query = write("q.xq", "#!/usr/bin/xquery\ndeclare variable $q := 5;\n$q * 2");
  const std::string module =
      write("m.xqm", "module namespace m = 'urn:m';\ndeclare function m:f() { 'of a module' };");
  const auto session = begin();
  EXPECT_EQ(session->ask(":load " + query), "10\n");
  EXPECT_EQ(session->ask("$q"), "5\n");
  EXPECT_EQ(session->ask(":load " + module), "");
  EXPECT_EQ(session->ask("m:f()"), "of a module\n");
  EXPECT_EQ(session->ask(":load " + write("marked.xq",
                                          "\xEF\xBB\xBF"
                                          "declare variable $r := 7; $r")),
            "7\n");
  EXPECT_EQ(session->ask("$r"), "7\n");
  const std::string marked =
      write("marked.xqm",
            "\xEF\xBB\xBFmodule namespace n = 'urn:n'; declare function n:f() { 'marked' };");
  EXPECT_EQ(session->ask(":load " + marked), "");
  EXPECT_EQ(session->ask("n:f()"), "marked\n");
  write("data.xml", "<d>beside</d>");
  EXPECT_EQ(session->ask(":load " + write("beside.xq", "string(doc('data.xml'))")), "beside\n");
}

TEST_F(Session, SaysWhatCannotBeLoaded) {
  const auto session = begin();
  EXPECT_EQ(session->ask(":load /nowhere"), "xquery: /nowhere: No such file or directory\n");
  EXPECT_EQ(session->ask(":load /"), "xquery: /: Is a directory\n");
  EXPECT_EQ(session->ask(":load"), "xquery: expected :load FILE\n");
  EXPECT_EQ(session->ask(":load " + write("b.xq", "\xFF")),
            "xquery: " + path("b.xq") + ": not UTF-8 text\n");
  EXPECT_EQ(session->ask(":doc d /nowhere"), "xquery: /nowhere: No such file or directory\n");
  EXPECT_EQ(session->ask(":doc d"), "xquery: expected :doc NAME FILE\n");
  EXPECT_EQ(session->ask(":doc 1x f"), "xquery: expected the name of a variable, not \"1x\"\n");
  EXPECT_EQ(session->ask(":nothing"), "xquery: unknown command :nothing; :help lists them\n");
  EXPECT_THAT(session->ask("doc('file:///none.xml')"),
              StartsWith("xquery: warning: cannot load file:///none.xml: "));
}

TEST_F(Session, BindsDocuments) {
  const auto session = begin();
  EXPECT_EQ(session->ask(":doc b " + books()), "");
  EXPECT_EQ(session->ask("count($b//book)"), "4\n");
  EXPECT_EQ(session->ask(":doc $b " + write("a.xml", "<a/>")), "");
  EXPECT_EQ(session->ask("count($b//book)"), "0\n");
  EXPECT_EQ(session->ask(":doc . " + books()), "");
  EXPECT_EQ(session->ask("count(//book)"), "4\n");
}

TEST_F(Session, ShowsPlansAndTimes) {
  const auto session = begin();
  EXPECT_THAT(session->ask(":plan"), StartsWith("xquery: no query was evaluated yet"));
  session->ask("declare variable $a := 1;");
  session->ask("(1, $a)[. = 1]");
  EXPECT_THAT(session->ask(":plan"), HasSubstr("query  any number of"));
  EXPECT_THAT(session->ask(":plan 1 + 1"), HasSubstr("(line 1)"));
  EXPECT_THAT(session->ask(":plan 1 idiv"), HasSubstr("XQueryError:3"));
  // Lines of a module are those that it has.
  const std::string module = write(
      "m.xq", "module namespace m = 'urn:m';\n\n\n\ndeclare function m:f($x) {\n  $x + 1 };\n");
  session->ask(":load " + module);
  EXPECT_THAT(session->ask(":plan m:f(.)"),
              AllOf(HasSubstr("m:f(...)  (line 1)"), HasSubstr("+  (line 6 of file://")));
  EXPECT_EQ(session->ask(":time"), "times are reported\n");
  EXPECT_THAT(session->ask("1"),
              AllOf(StartsWith("1\n"), HasSubstr("compile "), HasSubstr("evaluate ")));
  EXPECT_EQ(session->ask(":time"), "times are not reported\n");
  EXPECT_EQ(session->ask("1"), "1\n");
  EXPECT_THAT(session->ask(":help"), AllOf(HasSubstr(":load FILE"), HasSubstr(":quit")));
  session->type(":quit\n");
  EXPECT_EQ(session->end(), 0);
}

// --- signals -------------------------------------------------------------------------------------

TEST_F(Session, SurvivesAnInterruptOfAnEvaluation) {
  const auto session = begin();
  for (int turn = 0; turn < 2; ++turn) {
    session->type(std::string(endless) + "\n");
    session->waitUntilItWorks();
    session->type("\x03\x03");
    EXPECT_THAT(session->waitFor("\nxquery> "), HasSubstr("xquery: interrupted"));
    EXPECT_EQ(session->ask("1"), "1\n");
  }
}

TEST_F(Session, SurvivesAnInterruptOfItsOutput) {
  const auto session = begin();
  session->type("for $i in 1 to 10000000 return 'x'\n");
  session->waitFor("x\r\nx\r\n");
  session->type("\x03");
  EXPECT_THAT(session->waitFor("\nxquery> "), HasSubstr("xquery: interrupted"));
  EXPECT_EQ(session->ask("'still there'"), "still there\n");
}

TEST_F(Session, SurvivesAnInterruptOfReading) {
  const std::string pipe = path("pipe.xml");
  ASSERT_EQ(mkfifo(pipe.c_str(), 0600), 0);
  const auto session = begin();
  const auto interrupt = [&] {
    session->waitUntilItSleeps();
    session->type("\x03");
    EXPECT_THAT(session->waitFor("\nxquery> "), HasSubstr("xquery: interrupted"));
    EXPECT_EQ(session->ask("1"), "1\n");
  };
  session->type(":doc a " + pipe + "\n");  // which nobody writes to
  interrupt();
  session->type(":load " + pipe + "\n");
  interrupt();
  const int side = open(pipe.c_str(), O_RDWR | O_CLOEXEC);
  ASSERT_EQ(::write(side, "<a>", 3), 3);
  session->type(":doc a " + pipe + "\n");  // which comes to no end
  interrupt();
  close(side);
  EXPECT_THAT(session->ask("$a"), StartsWith("XQueryError:8"));
  EXPECT_EQ(session->ask(":doc a " + std::string(books())), "");
  EXPECT_EQ(session->ask("count($a//book)"), "4\n");
}

TEST_F(Session, AnInterruptBeforeItBeginsEndsTheCommand) {
  const std::string pipe = path("pipe.xml");
  ASSERT_EQ(mkfifo(pipe.c_str(), 0600), 0);
  Terminal session({pipe}, environment());
  session.waitUntilItSleeps();
  session.type("\x03");
  EXPECT_EQ(session.end(), -SIGINT);
}

TEST_F(Session, DropsWhatWasTypedAtAnInterrupt) {
  const auto session = begin();
  session->type("1 + \x03");
  session->waitFor("\nxquery> ");
  session->ask("(1,", more);
  session->type("2\x03");
  session->waitFor("\nxquery> ");
  EXPECT_EQ(session->ask("3"), "3\n");
}

TEST_F(Session, EndsWithItsTerminal) {
  auto session = begin();
  EXPECT_EQ(session->ask("'kept'"), "kept\n");
  session->hangUp();
  EXPECT_NE(session->end(), 1);
  EXPECT_EQ(command::readFile(historyFile()), "'kept'\n");
  // While evaluating as well.
  session = begin();
  session->type(std::string(endless) + "\n");
  session->waitUntilItWorks();
  session->hangUp();
  EXPECT_EQ(session->end(), -SIGHUP);
}

TEST_F(Session, LeavesTheTerminalAsItWas) {
  for (const int number : {SIGTERM, SIGQUIT}) {
    const auto session = begin();
    session->type("1 +");
    session->waitFor("1 +");
    EXPECT_FALSE(session->isCooked()) << "the line is being edited";
    session->signal(number);
    EXPECT_EQ(session->end(), -number);
    EXPECT_TRUE(session->isCooked());
  }
}

}  // namespace

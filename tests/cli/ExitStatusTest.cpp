#include "cli/Command.h"
#include "Platform/Base/SanitizedSizes.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <ostream>
#include <string>
#include <sys/stat.h>
#include <unistd.h>
#include <vector>

using command::books;
using command::Outcome;
using command::TemporaryDirectory;
using command::xquery;
using testing::ContainsRegex;
using testing::HasSubstr;
using testing::StartsWith;

namespace {

TEST(ExitStatus, AResultIsZero) {
  const Outcome outcome = xquery({"-e", "1 + 1"});
  EXPECT_EQ(outcome.status, 0);
  EXPECT_EQ(outcome.out, "2\n");
  EXPECT_EQ(outcome.err, "");
}

TEST(ExitStatus, AnEmptySequenceIsZeroAndPrintsNothing) {
  const Outcome outcome = xquery({"-e", "()"});
  EXPECT_EQ(outcome.status, 0);
  EXPECT_EQ(outcome.out, "");
}

TEST(ExitStatus, AnEmptyQueryIsZeroAndPrintsNothing) {
  const Outcome outcome = xquery({"-e", ""});
  EXPECT_EQ(outcome.status, 0);
  EXPECT_EQ(outcome.out, "");
  EXPECT_EQ(outcome.err, "");
}

TEST(ExitStatus, AParseErrorIsOneWithItsLineAndNoOutput) {
  const Outcome outcome = xquery({"-e", "1 +\n\n)"});
  EXPECT_EQ(outcome.status, 1);
  EXPECT_EQ(outcome.out, "");
  EXPECT_THAT(outcome.err, StartsWith("XQueryError:"));
  EXPECT_THAT(outcome.err, HasSubstr("line:3"));
}

TEST(ExitStatus, AnUnboundVariableIsOne) {
  const Outcome outcome = xquery({"-e", "$nowhere"});
  EXPECT_EQ(outcome.status, 1);
  EXPECT_EQ(outcome.out, "");
  EXPECT_THAT(outcome.err, StartsWith("XQueryError:"));
}

TEST(ExitStatus, AnErrorWhileEvaluatingIsOneWithNothingPrinted) {
  const Outcome outcome = xquery({"-e", "(1, 2, 1 div 0)"});
  EXPECT_EQ(outcome.status, 1);
  EXPECT_EQ(outcome.out, "");
  EXPECT_THAT(outcome.err, StartsWith("XQueryError:"));
}

TEST(ExitStatus, APathWithoutAContextItemIsOne) {
  const Outcome outcome = xquery({"-e", "//book"});
  EXPECT_EQ(outcome.status, 1);
  EXPECT_EQ(outcome.out, "");
  EXPECT_THAT(outcome.err, StartsWith("XQueryError:"));
}

// --- wrong usage ---------------------------------------------------------------------------------

struct WrongUsage {
  const char* name;
  std::vector<std::string> arguments;
  const char* complaint;
};

// What stands in the name that ctest shows: not addresses, which are others in each run.
void PrintTo(const WrongUsage& usage, std::ostream* out) {
  *out << usage.complaint;
}

class Usage : public testing::TestWithParam<WrongUsage> {};

TEST_P(Usage, IsTwoWithAnExplanation) {
  const Outcome outcome = xquery(GetParam().arguments);
  EXPECT_EQ(outcome.status, 2);
  EXPECT_EQ(outcome.out, "");
  EXPECT_THAT(outcome.err, HasSubstr(GetParam().complaint));
}

INSTANTIATE_TEST_SUITE_P(
    Wrong, Usage,
    testing::Values(
        WrongUsage{"UnknownOption", {"--bogus", "-e", "1"}, "--bogus"},
        WrongUsage{"OptionWithLettersSwapped",
                   {"--tiemout", "1", "-e", "1"},
                   "unknown option --tiemout; did you mean --timeout?\n"},
        WrongUsage{"OptionOfItsBeginning",
                   {"--files", "a", "-e", "1"},
                   "unknown option --files; did you mean --files-from?\n"},
        WrongUsage{"OptionThatIsNearToNone", {"--foo=3", "-e", "1"}, "unknown option --foo=3\n"},
        WrongUsage{"OptionOfOneLetter", {"-x", "-e", "1"}, "unknown option -x\n"},
        WrongUsage{
            "CheckAndPlan", {"--check", "--plan", "-e", "1"}, "--check does not go with --plan\n"},
        WrongUsage{"OutputWithoutName", {"-o", "", "-e", "1"}, "-o: expected the name of a file"},
        WrongUsage{"ListWithoutName",
                   {"--files-from", "", "-e", "1"},
                   "--files-from: expected the name of a file"},
        WrongUsage{"NoQuery", {}, "QUERYFILE"},
        WrongUsage{"StandardInputTwice", {"-e", "1", "-", "-"}, "standard input"},
        WrongUsage{"StandardInputAsListToo", {"-e", "1", "-", "--files-from", "-"}, "only once"},
        WrongUsage{
            "ValueMissing", {"-e", "1", "--as"}, "--as: expected lines|xml|html|json|text\n"},
        WrongUsage{"NameMissing", {"-e", "1", "--var"}, "xquery: --var: expected NAME=VALUE\n"},
        WrongUsage{"ShellMissing", {"--completions"}, "xquery: --completions: expected a value\n"},
        WrongUsage{"FormatTwice",
                   {"--as", "xml", "--as=json", "-e", "1"},
                   "xquery: --as may be given only once\n"},
        WrongUsage{"LineFeedInAValue",
                   {"--repeat", "1\nxquery: all is well", "-e", "1"},
                   "not \"1\\u000Axquery: all is well\"\n"},
        WrongUsage{"NoJobs", {"-e", "1", "--jobs", "0"}, "--jobs: expected a number from 1"},
        WrongUsage{"TextWithoutText", {"-e"}, "-e"},
        WrongUsage{"TextTwice", {"-e", "1", "-e", "2"}, "-e"},
        WrongUsage{"VariableWithoutValue", {"--var", "x", "-e", "1"}, "--var"},
        WrongUsage{"VariableWithoutName", {"--var", "=x", "-e", "1"}, "--var"},
        WrongUsage{"VariableOfNoName", {"--var", "a b=x", "-e", "1"}, "not \"a b=x\"\n"},
        WrongUsage{"VariableThatBeginsWithADigit", {"--var", "1a=x", "-e", "1"}, "not \"1a=x\"\n"},
        WrongUsage{"VariableOfTwoColons", {"--var", "a:b:c=x", "-e", "1"}, "not \"a:b:c=x\"\n"},
        WrongUsage{"VariableWithoutLocalName", {"--var", "a:=x", "-e", "1"}, "not \"a:=x\"\n"},
        WrongUsage{"DocumentOfNoName", {"--doc", "a/b=x", "-e", "1"}, "not \"a/b=x\"\n"},
        WrongUsage{"NamespaceOfThePrefixXML",
                   {"--namespace", "xml=u", "-e", "1"},
                   "xquery: --namespace: prefix xml can't be redeclared\n"},
        WrongUsage{"NamespaceOfThePrefixXMLNS",
                   {"--namespace", "xmlns=u", "-e", "1"},
                   "xquery: --namespace: prefix xmlns can't be redeclared\n"},
        WrongUsage{"NamespaceOfNoPrefix", {"--namespace", "p:q=u", "-e", "1"}, "not \"p:q=u\"\n"},
        WrongUsage{"NamespaceThatBeginsWithADigit",
                   {"--namespace", "1a=u", "-e", "1"},
                   "--namespace: expected a prefix, \"=\" and a URI, not \"1a=u\"\n"},
        WrongUsage{"DocumentWithoutFile", {"--doc", "d", "-e", "1"}, "--doc"},
        WrongUsage{"NamespaceWithoutURI", {"--namespace", "p", "-e", "1"}, "--namespace"},
        WrongUsage{"VariableNotUTF8", {"--var", "x=\xff", "-e", "1"}, "not UTF-8"},
        WrongUsage{"VariableNameNotUTF8", {"--var", "\xff=x", "-e", "1"}, "--var: not UTF-8"},
        WrongUsage{"DocumentNameNotUTF8", {"--doc", "\xff=x", "-e", "1"}, "--doc: not UTF-8"},
        WrongUsage{
            "NamespaceNotUTF8", {"--namespace", "p=\xff", "-e", "1"}, "--namespace: not UTF-8"},
        WrongUsage{"SeparatorOfNothing", {"--separator", "\\x", "-e", "1"}, "--separator"},
        WrongUsage{"OptionsWithoutValues", {"-e", "1", "-o"}, "-o"},
        WrongUsage{"VariableWithoutAnything", {"-e", "1", "--var"}, "--var"},
        WrongUsage{"FlagWithValue", {"-e", "1", "--types=x"}, "--types"},
        WrongUsage{"OutputTwice", {"-e", "1", "-o", "a", "-o", "b"}, "-o"},
        WrongUsage{"RepeatTwice", {"-e", "1", "--repeat", "1", "--repeat", "2"}, "--repeat"},
        WrongUsage{"RepeatTooOften", {"--repeat", "1000000001", "-e", "1"}, "--repeat"},
        WrongUsage{
            "RepeatBeyondNumbers", {"--repeat", "99999999999999999999999", "-e", "1"}, "--repeat"},
        WrongUsage{"RepeatEmpty", {"--repeat", "", "-e", "1"}, "--repeat"},
        WrongUsage{"RepeatZero", {"--repeat", "0", "-e", "1"}, "--repeat"},
        WrongUsage{"RepeatNegative", {"--repeat", "-3", "-e", "1"}, "--repeat"},
        WrongUsage{"RepeatNoNumber", {"--repeat", "often", "-e", "1"}, "--repeat"}),
    [](const auto& parameter) { return parameter.param.name; });

// --- input that cannot be read or parsed ---------------------------------------------------------

TEST(ExitStatus, AMissingQueryFileIsThree) {
  const Outcome outcome = xquery({"/nowhere/query.xq"});
  EXPECT_EQ(outcome.status, 3);
  EXPECT_THAT(outcome.err, HasSubstr("/nowhere/query.xq: No such file or directory"));
}

TEST(ExitStatus, ADirectoryAsQueryFileIsThree) {
  const TemporaryDirectory directory;
  const Outcome outcome = xquery({directory.path("")});
  EXPECT_EQ(outcome.status, 3);
  EXPECT_EQ(outcome.err, "xquery: " + directory.path("") + ": Is a directory\n");
}

// The memory is bounded as well, so that a machine is not filled by mistake.
TEST(ExitStatus, AQueryFileWithoutEndIsThree) {
  const Outcome endless = xquery({"/dev/zero"});
  EXPECT_EQ(endless.status, 3);
  EXPECT_EQ(endless.err, "xquery: /dev/zero: longer than 64 MiB\n");
  EXPECT_LT(endless.mostMemory, size_t{300 * largeInputDivisor} << 20);
  const Outcome piped = command::shell("yes '(: more :)' | \"$0\" -");
  EXPECT_EQ(piped.err, "xquery: standard input: longer than 64 MiB\n");
  const TemporaryDirectory directory;
  const std::string most(size_t{64} << 20, ' ');
  EXPECT_EQ(xquery({directory.write("most.xq", most)}).status, 0);
  EXPECT_EQ(xquery({directory.write("more.xq", most + " ")}).status, 3);
}

TEST(ExitStatus, AQueryFileThatIsNotUTF8IsThree) {
  const TemporaryDirectory directory;
  const Outcome outcome = xquery({directory.write("latin1.xq", "\"caf\xe9\"")});
  EXPECT_EQ(outcome.status, 3);
  EXPECT_EQ(outcome.out, "");
  EXPECT_THAT(outcome.err, HasSubstr("latin1.xq: not UTF-8 text"));
}

TEST(ExitStatus, HTMLThatIsRefusedIsThree) {
  std::string tags;
  for (int n = 0; n < 2'000'000; ++n) tags += "<b>";
  const Outcome outcome = xquery({"--html", "-e", "1", "-"}, tags);
  EXPECT_EQ(outcome.status, 3);
  EXPECT_EQ(outcome.out, "");
#ifdef XQUERY_SANITIZED
  EXPECT_THAT(outcome.err, StartsWith("xquery: standard input: HTML "));  // time may be up first
#else
  EXPECT_EQ(outcome.err, "xquery: standard input: HTML nested too deeply\n");
#endif
  const Outcome missing = xquery({"--html", "-e", "1", "/nowhere/input.html"});
  EXPECT_EQ(missing.status, 3);
  EXPECT_EQ(missing.err, "xquery: /nowhere/input.html: No such file or directory\n");
}

TEST(ExitStatus, AModuleThatCannotBeLoadedIsOne) {
  const Outcome outcome = xquery({"-e",
                                  "import module namespace m = 'urn:m' at "
                                  "'file:///nowhere/m.xq', 'm.xq'; 1"});
  EXPECT_EQ(outcome.status, 1);
  EXPECT_EQ(outcome.out, "");
  EXPECT_THAT(outcome.err, HasSubstr("can't access module for "));
}

TEST(ExitStatus, AMissingInputIsThree) {
  const Outcome outcome = xquery({"-e", "1", "/nowhere/input.xml"});
  EXPECT_EQ(outcome.status, 3);
  EXPECT_EQ(outcome.out, "");
  EXPECT_EQ(outcome.err, "xquery: /nowhere/input.xml: No such file or directory\n");
}

TEST(ExitStatus, AnInputWithoutANameIsThree) {
  EXPECT_EQ(xquery({"-e", "1", ""}).status, 3);
}

TEST(ExitStatus, AFolderWithoutDocumentsIsThree) {
  const TemporaryDirectory directory;
  const Outcome outcome = xquery({"-e", "1", directory.path("")});
  EXPECT_EQ(outcome.status, 3);
  EXPECT_EQ(outcome.err, "xquery: " + directory.path("") + ": no XML files in this folder\n");
}

TEST(ExitStatus, ADirectoryAsADocumentForAVariableIsThree) {
  const TemporaryDirectory directory;
  const Outcome outcome = xquery({"-e", "1", "--doc", "d=" + directory.path("")});
  EXPECT_EQ(outcome.status, 3);
  EXPECT_EQ(outcome.err, "xquery: " + directory.path("") + ": Is a directory\n");
}

TEST(ExitStatus, AFileThatMustNotBeReadIsThree) {
  if (geteuid() == 0) GTEST_SKIP() << "root may read every file";
  const TemporaryDirectory directory;
  const std::string file = directory.write("secret", "<a/>");
  chmod(file.c_str(), 0);
  for (const std::vector<std::string>& arguments :
       {std::vector<std::string>{file}, {"-e", "1", file}, {"-e", "1", "--doc", "d=" + file}}) {
    const Outcome outcome = xquery(arguments);
    EXPECT_EQ(outcome.status, 3);
    EXPECT_EQ(outcome.err, "xquery: " + file + ": Permission denied\n");
  }
}

TEST(ExitStatus, APathLongerThanTheSystemTakesIsThree) {
  const std::string path = "/" + std::string(10000, 'x');
  const std::vector<std::string> commands[] = {
      {path}, {"-e", "1", path}, {"-e", "1", "--doc", "d=" + path}, {"-e", "1", "-o", path}};
  for (const auto& arguments : commands) {
    const Outcome outcome = xquery(arguments);
    EXPECT_EQ(outcome.status, 3);
    EXPECT_EQ(outcome.out, "");
    EXPECT_THAT(outcome.err, HasSubstr("File name too long"));
  }
}

TEST(ExitStatus, AnEnormousQueryIsEvaluated) {
  std::string sum = "1";
  for (int n = 0; n < 60000; ++n) sum += "+1";
  EXPECT_EQ(xquery({"-e", sum}).out, "60001\n");
}

TEST(ExitStatus, PipesMayBeReadAsFiles) {
  const TemporaryDirectory directory;
  const Outcome outcome = command::shell(
      "mkfifo \"$1\" \"$2\"; echo '/a/b' > \"$1\" & echo '<a><b/></a>' > \"$2\" & "
      "timeout 60 \"$0\" \"$1\" \"$2\"",
      {directory.path("query"), directory.path("input")});
  EXPECT_EQ(outcome.err, "");
  EXPECT_EQ(outcome.out, "<b/>\n");
}

TEST(ExitStatus, MalformedXMLIsThreeWithFileLineAndColumn) {
  const TemporaryDirectory directory;
  const std::string file = directory.write("bad.xml", "<a>\n  <b></c>\n</a>\n");
  const Outcome outcome = xquery({"-e", "1", file});
  EXPECT_EQ(outcome.status, 3);
  EXPECT_EQ(outcome.out, "");
  EXPECT_THAT(outcome.err, ContainsRegex("bad\\.xml:2:[1-9][0-9]*: ."));
}

TEST(ExitStatus, MalformedXMLOnStandardInputIsThreeWithLineAndColumn) {
  const Outcome outcome = xquery({"-e", "1", "-"}, "<a>");
  EXPECT_EQ(outcome.status, 3);
  EXPECT_THAT(outcome.err, ContainsRegex("standard input:1:[1-9][0-9]*: ."));
}

TEST(ExitStatus, AnEmptyInputIsThree) {
  const TemporaryDirectory directory;
  const Outcome outcome = xquery({"-e", "1", directory.write("empty.xml", "")});
  EXPECT_EQ(outcome.status, 3);
  EXPECT_THAT(outcome.err, HasSubstr("empty.xml"));
}

TEST(ExitStatus, AMissingDocumentForAVariableIsThree) {
  const Outcome outcome =
      xquery({"--doc", "d=/nowhere/d.xml", "-e", "declare variable $d external; $d"});
  EXPECT_EQ(outcome.status, 3);
  EXPECT_THAT(outcome.err, HasSubstr("/nowhere/d.xml"));
}

// --- output that cannot be written ---------------------------------------------------------------

TEST(ExitStatus, AFullDeviceIsReportedAndIsThree) {
  const Outcome outcome = xquery({"-e", "1", "-o", "/dev/full"});
  EXPECT_EQ(outcome.status, 3);
  EXPECT_THAT(outcome.err, HasSubstr("cannot write /dev/full: No space left on device"));
}

TEST(ExitStatus, AFullDeviceAsStandardOutputIsThreeForHelpAndVersionToo) {
  const std::vector<std::string> commands[] = {{"-e", "1"}, {"--help"}, {"--version"}};
  for (const auto& arguments : commands) {
    const Outcome outcome = command::start("xquery", arguments, "", command::Sink::FullDevice);
    EXPECT_EQ(outcome.status, 3) << arguments[0];
    EXPECT_EQ(outcome.err, "xquery: cannot write standard output: No space left on device\n");
  }
}

TEST(ExitStatus, AnOutputFileThatCannotBeOpenedIsThree) {
  const Outcome outcome = xquery({"-e", "1", "-o", "/nowhere/out"});
  EXPECT_EQ(outcome.status, 3);
  EXPECT_THAT(outcome.err, HasSubstr("cannot write /nowhere/out: No such file or directory"));
}

}  // namespace

// Input of absurd shape must end in a result or a clear error, never in a crash.
#include "cli/Command.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <link.h>

using command::Outcome;
using command::TemporaryDirectory;
using command::withoutPlaces;
using command::xquery;
using testing::HasSubstr;
using testing::StartsWith;

namespace {

std::string repeated(const std::string& text, size_t count) {
  std::string result;
  result.reserve(text.size() * count);
  for (size_t i = 0; i < count; i++) result += text;
  return result;
}

std::string deepDocument(size_t depth) {
  return repeated("<a>", depth) + "x" + repeated("</a>", depth);
}

TEST(HostileInput, AHundredThousandParenthesesEndInAResultOrAnError) {
  const TemporaryDirectory directory;
  const size_t depth = 100000;
  const Outcome outcome =
      xquery({directory.write("deep.xq", repeated("(", depth) + "1" + repeated(")", depth))});
  // That depends on how much stack one level takes.
  if (outcome.status == 0) {
    EXPECT_EQ(outcome.out, "1\n");
    EXPECT_EQ(outcome.err, "");
  } else {
    EXPECT_EQ(outcome.status, 1);
    EXPECT_EQ(outcome.out, "");
    EXPECT_EQ(withoutPlaces(outcome.err),
              "XQueryError:0 - \"limit: expression nested too deeply\"\n");
  }
}

TEST(HostileInput, AZeroInTheQueryIsAnErrorThatIsReportedWhole) {
  const TemporaryDirectory directory;
  const Outcome outcome = xquery({directory.write("zero.xq", std::string("1 \0+ 1", 6))});
  EXPECT_EQ(outcome.status, 1);
  EXPECT_EQ(outcome.out, "");
  EXPECT_THAT(outcome.err, HasSubstr("line:1"));
}

// --- recursion -----------------------------------------------------------------------------------

// Counts down from `start` to 0.
std::string recursion(const std::string& start) {
  return "declare function local:f($n) { if ($n = 0) then 0 else 1 + local:f($n - 1) }; local:f(" +
         start + ")";
}

// The command where the limit of the stack cannot be raised. (A lower one stays.)
Outcome xqueryWithSmallStack(const std::string& query) {
  return command::start("/bin/sh", {"-c", "ulimit -Hs 8192; exec \"$0\" -e \"$1\"",
                                    XQUERY_BINARY_DIR "/xquery", query});
}

// The command where less is free below the stack than it wants, as it is where nothing lies at
// random. (Where that cannot be asked for, as always.)
Outcome xqueryWithLittleBelowStack(const std::string& query) {
  return command::start("/bin/sh",
                        {"-c",
                         "setarch -R true 2>/dev/null && exec setarch -R \"$0\" -e \"$1\";"
                         "exec \"$0\" -e \"$1\"",
                         XQUERY_BINARY_DIR "/xquery", query});
}

TEST(HostileInput, AFunctionMayCallItselfAHundredThousandTimes) {
  const std::string query = recursion("100000");
  EXPECT_EQ(xquery({"-e", query}).out, "100000\n");
  EXPECT_EQ(xqueryWithLittleBelowStack(query).out, "100000\n");
  EXPECT_EQ(xqueryWithSmallStack(query).out, "100000\n");
}

TEST(HostileInput, AHundredThousandCallsFindRoomWithinOtherExpressions) {
  for (const std::string body :
       {"($n, local:f($n - 1))[last()]", "let $x := local:f($n - 1) return $x",
        "for $x in local:f($n - 1) where $x >= 0 return $x", "string(<a>{ local:f($n - 1) }</a>)",
        "if ($n >= 0) then (local:f($n - 1)) else 1"}) {
    const std::string query =
        "declare function local:f($n) { if ($n = 0) then 0 else " + body + " }; local:f(100000)";
    EXPECT_EQ(xquery({"-e", query}).out, "0\n") << body;
  }
}

// With a sanitizer the whole stack, with what the calls hold, is more memory than a test should
// take.
#ifndef XQUERY_SANITIZED
TEST(HostileInput, EndlessRecursionIsAnError) {
  const std::string query = recursion("-1");
  const Outcome outcome = xquery({"-e", query});
  EXPECT_EQ(outcome.status, 1);
  EXPECT_EQ(outcome.out, "");
  EXPECT_THAT(outcome.err, StartsWith("XQueryError:0"));
  EXPECT_THAT(outcome.err, HasSubstr("limit: expression nested too deeply"));
}

// What is built for use takes a second and half a gibibyte at most.
TEST(HostileInput, EndlessRecursionEndsSoonAndTakesABoundedAmountOfMemory) {
#ifdef __OPTIMIZE__
  constexpr double mostSeconds = 1;
  constexpr size_t mostMemory = size_t{512} << 20;
#else
  constexpr double mostSeconds = 10;
  constexpr size_t mostMemory = size_t{2048} << 20;
#endif
  for (const std::string body : {"local:f($n)", "local:f($n + 1)", "1 + local:f($n + 1)",
                                 "(1)[local:f($n)]", "for $x in 1 return ($x, local:f($n))"}) {
    const std::string query = "declare function local:f($n) { " + body + " }; local:f(0)";
    Outcome outcome;
    for (int turn = 0; turn < 3; ++turn) {
      outcome = xquery({"-e", query});
      if (outcome.processorSeconds <= mostSeconds) break;
    }
    EXPECT_THAT(outcome.err, HasSubstr("limit: expression nested too deeply")) << body;
    EXPECT_LE(outcome.processorSeconds, mostSeconds) << body;
    EXPECT_LE(outcome.mostMemory, mostMemory) << body;
  }
}

TEST(HostileInput, EndlessRecursionIsAnErrorWhereTheAddressSpaceIsBounded) {
  for (const std::string kilobytes : {"300000", "1000000"}) {
    const Outcome outcome =
        command::start("/bin/sh", {"-c", "ulimit -v \"$2\" && exec \"$0\" -e \"$1\"",
                                   XQUERY_BINARY_DIR "/xquery", recursion("-1"), kilobytes});
    EXPECT_EQ(outcome.status, 1) << kilobytes;
    EXPECT_THAT(outcome.err, HasSubstr("limit: expression nested too deeply")) << kilobytes;
  }
}

// The range that trees live in is smaller there.
TEST(HostileInput, TreesAreBuiltOrRefusedWhereTheAddressSpaceIsBounded) {
  const auto run = [](const std::string& kilobytes, const std::string& count) {
    const std::string query =
        "let $text := string-join(for $i in 1 to 50000 return 'abcdefghij', '') "
        "let $all := for $i in 1 to " +
        count + " return <e>{$text}</e> return count($all[string-length(.) = 500000])";
    return command::start("/bin/sh", {"-c", "ulimit -v \"$2\" && exec \"$0\" -e \"$1\"",
                                      XQUERY_BINARY_DIR "/xquery", query, kilobytes});
  };
  for (const std::string kilobytes : {"250000", "300000", "700000", "3000000"}) {
    EXPECT_EQ(run(kilobytes, "10").out, "10\n") << kilobytes;
  }
  EXPECT_EQ(run("1000000", "200").out, "200\n");
  for (const std::string kilobytes : {"250000", "300000", "700000"}) {
    const Outcome outcome = run(kilobytes, "1000");
    EXPECT_EQ(outcome.status, 1) << kilobytes;
    EXPECT_EQ(withoutPlaces(outcome.err), "XQueryError:0 - \"limit: out of memory\"\n")
        << kilobytes;
  }
}

// 5 MB of text, of which the tree takes more. What does not fit is refused by the reader, or later
// by the evaluation.
TEST(HostileInput, DocumentsAreReadOrRefusedWhereTheAddressSpaceIsBounded) {
  const TemporaryDirectory directory;
  const std::string text = "<a>" + repeated("<b>some text</b>\n", 300000) + "</a>";
  const std::string file = directory.write("large.xml", text);
  const auto run = [&](const std::string& kilobytes, const std::string& options,
                       const std::string& query) {
    return command::shell("ulimit -v \"$1\" && exec \"$0\" " + options + " -e \"$2\" \"$3\"",
                          {kilobytes, query, file});
  };
  EXPECT_EQ(run("3000000", "", "count(//b) + count(/a/node())").out, "900000\n");
  EXPECT_EQ(run("250000", "--stream", "count(/a/b)").out, "300000\n");
  for (const std::string kilobytes : {"120000", "160000", "200000"}) {
    const Outcome outcome = run(kilobytes, "", "count(//node()[. = 'some text'])");
    EXPECT_TRUE(outcome.status == 0 || outcome.status == 1 || outcome.status == 3) << kilobytes;
    EXPECT_EQ(outcome.out, outcome.status == 0 ? "600000\n" : "") << kilobytes;
    EXPECT_EQ(outcome.err.find("out of memory") != outcome.err.npos, outcome.status != 0)
        << kilobytes << outcome.err;
  }
}
#endif

// The path of the dynamic loader that this program asks for.
std::string dynamicLoader() {
  std::string path;
  dl_iterate_phdr(
      [](dl_phdr_info* object, size_t, void* found) {
        for (int i = 0; i < object->dlpi_phnum; ++i) {
          if (object->dlpi_phdr[i].p_type != PT_INTERP) continue;
          *static_cast<std::string*>(found) =
              reinterpret_cast<const char*>(object->dlpi_addr + object->dlpi_phdr[i].p_vaddr);
        }
        return 1;  // the first object is the program
      },
      &path);
  return path;
}

TEST(HostileInput, TheCommandMayBeStartedByTheDynamicLoader) {
  const Outcome outcome =
      command::start(dynamicLoader(), {XQUERY_BINARY_DIR "/xquery", "-e", recursion("1000")});
  EXPECT_EQ(outcome.err, "");
  EXPECT_EQ(outcome.out, "1000\n");
}

TEST(HostileInput, ADocumentAMillionElementsDeepCanBeSearched) {
  const TemporaryDirectory directory;
  const std::string file = directory.write("deep.xml", deepDocument(1000000));
  const Outcome nothing = xquery({"-e", "//b", file});
  EXPECT_EQ(nothing.status, 0);
  EXPECT_EQ(nothing.out, "");
  const Outcome text = xquery({"-e", "//text()", file});
  EXPECT_EQ(text.status, 0);
  EXPECT_EQ(text.out, "x\n");
}

TEST(HostileInput, ADocumentAMillionElementsDeepCanBePrinted) {
  const TemporaryDirectory directory;
  const std::string xml = deepDocument(1000000);
  const Outcome outcome = xquery({"-e", "/a", directory.write("deep.xml", xml)});
  EXPECT_EQ(outcome.status, 0);
  EXPECT_TRUE(outcome.out == xml + "\n");
}

TEST(HostileInput, ADocumentAMillionElementsDeepCanBeCompared) {
  const TemporaryDirectory directory;
  const std::string file = directory.write("deep.xml", deepDocument(1000000));
  EXPECT_EQ(xquery({"-e", "/a = \"x\"", file}).out, "true\n");
}

}  // namespace

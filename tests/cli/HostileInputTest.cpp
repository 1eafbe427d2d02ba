// Input of absurd shape must end in a result or a clear error, never in a crash.
#include "cli/Command.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

using command::Outcome;
using command::TemporaryDirectory;
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

TEST(HostileInput, AHundredThousandParenthesesAreAnError) {
  const TemporaryDirectory directory;
  const size_t depth = 100000;
  const Outcome outcome =
      xquery({directory.write("deep.xq", repeated("(", depth) + "1" + repeated(")", depth))});
  EXPECT_EQ(outcome.status, 1);
  EXPECT_EQ(outcome.out, "");
  EXPECT_THAT(outcome.err, StartsWith("XQueryError:3 - \"parser stack overflow"));
}

TEST(HostileInput, AZeroInTheQueryIsAnErrorThatIsReportedWhole) {
  const TemporaryDirectory directory;
  const Outcome outcome = xquery({directory.write("zero.xq", std::string("1 \0+ 1", 6))});
  EXPECT_EQ(outcome.status, 1);
  EXPECT_EQ(outcome.out, "");
  EXPECT_THAT(outcome.err, HasSubstr("line:1"));
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

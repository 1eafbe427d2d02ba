// Documents that are packed, as the command is given them.
#include "cli/Command.h"
#include "Platform/Reading/PackedText.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <string>

using command::Outcome;
using command::TemporaryDirectory;
using command::xquery;
using packing::Format;
using packing::formats;

namespace {

const std::string text = "<a>" + std::string(100000, ' ') + "<b>1</b></a>";

TEST(PackedInput, IsReadAsItIsFromFilesAndStandardInput) {
  const TemporaryDirectory directory;
  for (const Format& format : formats) {
    const std::string packed = format.pack(text);
    const std::string file = directory.write("packed", packed);
    EXPECT_EQ(xquery({"-e", "a/b", file}).out, "<b>1</b>\n") << format.name;
    EXPECT_EQ(xquery({"-e", "a/b", "-"}, packed).out, "<b>1</b>\n") << format.name;
    const std::string piped = "cat \"$1\" | \"$0\" -e a/b -";
    EXPECT_EQ(command::shell(piped, {file}).out, "<b>1</b>\n") << format.name;
    const std::string bound = "declare variable $d external; string($d)";
    EXPECT_THAT(xquery({"--strip-space", "--doc", "d=" + file, "-e", bound}).out, "1\n");
    EXPECT_EQ(xquery({"-e", "doc('" + file + "')/a/b", "-"}, "<a/>").out, "<b>1</b>\n");
  }
}

TEST(PackedInput, MayBeHTML) {
  const TemporaryDirectory directory;
  for (const Format& format : formats) {
    const std::string packed = format.pack("<p>one<p>two");
    const std::string file = directory.write("page.html.gz", packed);
    EXPECT_EQ(xquery({"--html", "-e", "count(//*:p)", file}).out, "2\n") << format.name;
    EXPECT_EQ(xquery({"-e", "count(doc('" + file + "')//*:p)"}).out, "2\n") << format.name;
  }
}

// What has been found without going on to the end stands.
TEST(PackedInput, ThatIsDamagedBehindTheDocumentIsThreeOfAStreamThatGetsThere) {
  const Format& format = formats[0];
  const std::string packed = format.pack(text);
  const std::string data = std::string("xquery: standard input: the ") + format.name + " data ";
  const Outcome cut =
      xquery({"--stream", "-e", "count(//b)", "-"}, packed.substr(0, packed.size() - 3));
  EXPECT_EQ(cut.status, 3);
  EXPECT_EQ(cut.out, "");
  EXPECT_EQ(cut.err, data + "ends too soon\n");
  const Outcome more = xquery({"--stream", "-e", "count(//b)", "-"}, packed + "more");
  EXPECT_EQ(more.status, 3);
  EXPECT_EQ(more.err, data + "is followed by something else\n");
  EXPECT_EQ(xquery({"--stream", "-e", "exists(//b)", "-"}, packed + "more").out, "true\n");
}

TEST(PackedInput, ThatIsDamagedIsThree) {
  const TemporaryDirectory directory;
  for (const Format& format : formats) {
    const std::string packed = format.pack(text);
    const std::string file = directory.write("packed", packed.substr(0, packed.size() - 3));
    const std::string message = std::string("the ") + format.name + " data ends too soon\n";
    const Outcome outcome = xquery({"-e", "1", file});
    EXPECT_EQ(outcome.status, 3);
    EXPECT_EQ(outcome.out, "");
    EXPECT_EQ(outcome.err, "xquery: " + file + ": " + message);
    EXPECT_EQ(xquery({"-e", "1", "-"}, packed.substr(0, packed.size() - 3)).err,
              "xquery: standard input: " + message);
    EXPECT_EQ(xquery({"-e", "1", "-"}, packed + "more").status, 3);
    const std::string bad = directory.write("bad", format.pack("<a>"));
    EXPECT_THAT(xquery({"-e", "1", bad}).err, testing::StartsWith(bad + ":1:4: Premature end"));
  }
}

}  // namespace

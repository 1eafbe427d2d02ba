// Reading ends when it is told to, and leaves nothing behind.
#include "Platform/Base/LookCounter.h"
#include "Platform/Reading/EndlessDocuments.h"
#include "Platform/Reading/ReaderTestSupport.h"

#include <gtest/gtest.h>

#include <span>
#include <string>

namespace xquery {
namespace {

using readingtest::Ceiling;
using readingtest::Endless;
using readingtest::MiB;

constexpr size_t mostRead = size_t{16} << 20;

// What is kept of a pipe counts as well: the two inputs end in the end of an evaluation.
bool isEnded(const Endless& document, bool isFile) {
  TextInput input = inputOf(document, mostRead);
  const TextRewinding rewind = [&] {
    input = inputOf(document, mostRead);
    return true;
  };
  TextSource source([&](char* buffer, size_t size) { return input(buffer, size); },
                    isFile ? rewind : TextRewinding());
  NSXMLParseError error;
  const Ceiling watching(2 * MiB);
  try {
    EXPECT_FALSE(readDocument(source, NSXMLNodePreserveWhitespace, error)) << document.what;
  } catch (const Ended&) {
    return true;
  }
  // What refuses a large block is heard by the other reader, and by the next look.
  return error.message == "out of memory" && workMeter.wasRefused;
}

TEST(XMLReaderLimits, CountWhatADocumentTakesWhileItIsRead) {
  for (const Endless& document : readingtest::endless) {
    for (const bool isFile : {true, false}) {
      const int64_t before = workMeter.valueBytes;
      EXPECT_TRUE(isEnded(document, isFile)) << document.what;
      EXPECT_EQ(workMeter.valueBytes, before) << document.what;
    }
  }
}

// Whether it was ended at that look.
bool isEndedAt(int look, std::string_view text, size_t piece) {
  TextSource memory(text);
  TextSource pieces(readingtest::inPieces(text, piece ? piece : 1));
  NSXMLParseError error;
  const LookCounter looks(look);
  try {
    EXPECT_TRUE(readDocument(piece ? pieces : memory, 0, error, XMLWay::Own));
  } catch (const Ended&) {
    return true;
  }
  return false;
}

std::string repeated(std::string_view part, size_t count) {
  std::string all;
  for (size_t index = 0; index < count; ++index) all += part;
  return all;
}

TEST(XMLReaderLimits, AreLookedAtAllTheTime) {
  const std::string content(1 << 20, 'x');
  std::string names;
  for (int index = 0; index < 50000; ++index) names += "<n" + std::to_string(index) + "/>";
  const std::string documents[] = {
      "<a>" + repeated("<e a='1'>text</e>", 60000) + "</a>",
      "<a>" + names + "</a>",
      "<a>" + content + "</a>",
      "<a b='" + content + "'/>",
      "<a>" + repeated("&#233;", 200000) + "</a>",
      "<a>" + repeated("\xC3\xA9", 500000) + "</a>",
      "<a><!--" + content + "--></a>",
      "<a><?b " + content + "?></a>",
      "<a><![CDATA[" + content + "]]></a>",
      "<a>" + repeated(" ", 1 << 20) + "</a>",
      "<a/>" + repeated(" ", 1 << 20),
      "<a" + repeated(" ", 1 << 20) + "/>",
  };
  for (const std::string& document : documents) {
    for (const size_t piece : {size_t{0}, size_t{100000}}) {
      const int64_t before = workMeter.valueBytes;
      for (const int look : {0, 1, 2, 7, 20, 40}) {
        EXPECT_TRUE(isEndedAt(look, document, piece)) << document.substr(0, 20) << " at " << look;
        EXPECT_EQ(workMeter.valueBytes, before) << document.substr(0, 20);
      }
    }
  }
}

}  // namespace
}  // namespace xquery

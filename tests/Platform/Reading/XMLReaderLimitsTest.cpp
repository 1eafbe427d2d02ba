// Reading ends when it is told to, and leaves nothing behind.
#include "Platform/Base/LookCounter.h"
#include "Platform/Reading/EndlessDocuments.h"
#include "Platform/Reading/ReaderTestSupport.h"
#include "Platform/Reading/XMLProjection.h"

#include <gtest/gtest.h>

#include <span>
#include <string>
#include <vector>

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
bool isEndedAt(int look, std::string_view text, size_t piece,
               const XMLProjection* projection = nullptr) {
  TextSource memory(text);
  TextSource pieces(readingtest::inPieces(text, piece ? piece : 1));
  NSXMLParseError error;
  const LookCounter looks(look);
  try {
    EXPECT_TRUE(readDocument(piece ? pieces : memory, 0, error, XMLWay::Own, projection));
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

std::vector<std::string> largeDocuments() {
  const std::string content(1 << 20, 'x');
  std::string names;
  for (int index = 0; index < 50000; ++index) names += "<n" + std::to_string(index) + "/>";
  return {
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
}

TEST(XMLReaderLimits, AreLookedAtAllTheTime) {
  for (const std::string& document : largeDocuments()) {
    for (const size_t piece : {size_t{0}, size_t{100000}}) {
      const int64_t before = workMeter.valueBytes;
      for (const int look : {0, 1, 2, 7, 20, 40}) {
        EXPECT_TRUE(isEndedAt(look, document, piece)) << document.substr(0, 20) << " at " << look;
        EXPECT_EQ(workMeter.valueBytes, before) << document.substr(0, 20);
      }
    }
  }
}

// --- where nothing is needed -------------------------------------------------------------------

TEST(XMLReaderLimits, AreLookedAtWhereNothingIsNeeded) {
  const XMLProjection nothing;
  for (const std::string& document : largeDocuments()) {
    for (const size_t piece : {size_t{0}, size_t{100000}}) {
      const int64_t before = workMeter.valueBytes;
      for (const int look : {0, 1, 2, 7, 20}) {
        EXPECT_TRUE(isEndedAt(look, document, piece, &nothing)) << document.substr(0, 20) << look;
        EXPECT_EQ(workMeter.valueBytes, before) << document.substr(0, 20);
      }
    }
  }
}

// From a file, of which nothing is kept.
bool isReadBelow(int64_t bytes, std::string_view text, const XMLProjection* projection) {
  TextInput input = readingtest::inPieces(text, 4096);
  const TextRewinding rewind = [&] {
    input = readingtest::inPieces(text, 4096);
    return true;
  };
  TextSource source([&](char* buffer, size_t size) { return input(buffer, size); }, rewind);
  NSXMLParseError error;
  const Ceiling watching(bytes);
  try {
    return readDocument(source, 0, error, XMLWay::Own, projection) != nullptr;
  } catch (const Ended&) {
    return false;
  }
}

TEST(XMLReaderLimits, WhatIsNotNeededTakesNoMemory) {
  const XMLProjection nothing;
  XMLProjection anywhere;
  anywhere.need(anywhere.step(XMLProjection::document, true, "none"), XMLProjection::Itself);
  const std::string text =
      "<a>" + repeated("<e a='1'>text<!--x--><?p q?><f>&lt;</f></e>", 200'000) + "</a>";
  const int64_t before = workMeter.valueBytes;
  EXPECT_FALSE(isReadBelow(2 * MiB, text, nullptr));
  EXPECT_TRUE(isReadBelow(2 * MiB, text, &nothing));
  EXPECT_TRUE(isReadBelow(2 * MiB, text, &anywhere));
  EXPECT_EQ(workMeter.valueBytes, before);
}

// Open elements do, needed or not.
TEST(XMLReaderLimits, LevelsOfWhatIsNotNeededCount) {
  constexpr size_t levels = 1'000'000;
  const XMLProjection nothing;
  const std::string text = repeated("<e>", levels) + repeated("</e>", levels);
  EXPECT_FALSE(isReadBelow(2 * MiB, text, &nothing));
  EXPECT_TRUE(isReadBelow(64 * MiB, text, &nothing));
}

}  // namespace
}  // namespace xquery

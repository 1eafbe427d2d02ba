// Names, texts and comments of a gigabyte. They take many seconds and several gigabytes of memory,
// so that they are left out unless the environment has XQUERY_HUGE_TESTS:
//
//   XQUERY_HUGE_TESTS=1 build/release/Platform_tests --gtest_filter='HugePieces.*'
#include "Platform/Reading/NotTaken.h"
#include "Platform/Reading/ReaderTestSupport.h"

#include <gtest/gtest.h>

#include <cstdio>
#include <cstdlib>
#include <string>
#include <unistd.h>

namespace xquery {
namespace {

using namespace readingtest;

constexpr size_t GiB = size_t{1} << 30;

class HugePieces : public testing::Test {
 protected:
  void SetUp() override {
    if (!std::getenv("XQUERY_HUGE_TESTS")) GTEST_SKIP() << "XQUERY_HUGE_TESTS is not set";
    const auto page = static_cast<size_t>(::sysconf(_SC_PAGESIZE));
    const size_t free = static_cast<size_t>(::sysconf(_SC_AVPHYS_PAGES)) * page;
    if (free < 8 * GiB) GTEST_SKIP() << "less than 8 GiB of memory are free";
  }
};

std::string around(std::string_view begin, size_t count, std::string_view end) {
  std::string text(begin);
  text.reserve(begin.size() + count + end.size());
  text.append(count, 'x').append(end);
  return text;
}

// Read as a whole, or refused with a reason.
void expectReadOrRefused(const std::string& text, size_t count) {
  TextSource source(text);
  NSXMLParseError error;
  const auto document = readDocument(source, NSXMLNodePreserveWhitespace, error);
  if (!document) {
    EXPECT_FALSE(error.message.empty());
    std::printf("refused: %s\n", error.message.c_str());
    return;
  }
  const NSXMLNode* const root = document->firstChild();
  const NSXMLNode* const child = root->firstChild();
  EXPECT_EQ(child ? child->textView().length() : root->nameView().length(), count);
}

TEST_F(HugePieces, AText) {
  expectReadOrRefused(around("<a>", GiB, "</a>"), GiB);
}

TEST_F(HugePieces, AComment) {
  expectReadOrRefused(around("<a><!--", GiB, "--></a>"), GiB);
}

TEST_F(HugePieces, AName) {
  expectReadOrRefused(around("<", GiB, "/>"), GiB);
}

TEST_F(HugePieces, WhatOurReaderTakesIsRead) {
  for (const std::string_view begin : {"<a>", "<a><!--"}) {
    const size_t count = longestPieceTaken;
    const std::string text = around(begin, count, begin == "<a>" ? "</a>" : "--></a>");
    const auto document = read(text, XMLWay::Own);
    ASSERT_TRUE(document);
    const NSStringView found = document->firstChild()->firstChild()->textView();
    EXPECT_EQ(found.length(), count);
    EXPECT_EQ(found.asciiUnits()[count - 1], 'x');
  }
}

TEST_F(HugePieces, AWideTextIsReadToItsEnd) {
  std::string text = "<a>";
  text.reserve(longestPieceTaken + 16);
  while (text.size() < longestPieceTaken - 8) text += "д";
  text += "</a>";
  const auto document = read(text, XMLWay::Own);
  ASSERT_TRUE(document);
  const NSStringView found = document->firstChild()->firstChild()->textView();
  EXPECT_EQ(found.length(), (text.size() - 7) / 2);
  EXPECT_EQ(found.wideUnits()[found.length() - 1], u'д');
}

}  // namespace
}  // namespace xquery

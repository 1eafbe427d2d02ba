#include "Platform/Base/WorkMeter.h"
#include "Platform/Reading/ReaderTestSupport.h"
#include "Platform/Reading/TextSource.h"

#include <gtest/gtest.h>

#include <string>

namespace xquery {
namespace {

std::string text(size_t size) {
  std::string all;
  for (size_t at = 0; all.size() < size; ++at) all += std::to_string(at) + " ";
  all.resize(size);
  return all;
}

// All of it, letting go of as much as `kept` says after each look.
std::string readThrough(TextSource& source, size_t kept) {
  std::string all;
  const char* at = source.begin();
  size_t known = 0;  // of what is in hand, read already
  do {
    all.append(source.begin() + known, source.end());
    const auto held = static_cast<size_t>(source.end() - source.begin());
    known = std::min(kept, held);
    at = source.end() - known;
  } while (source.more(at));
  return all;
}

std::string readAgain(TextSource& source) {
  const TextInput input = source.fromTheBeginning();
  std::string all;
  char piece[17];
  for (ptrdiff_t count = 0; (count = input(piece, sizeof piece)) > 0;) {
    all.append(piece, static_cast<size_t>(count));
  }
  return all;
}

TEST(TextSource, MemoryIsInHandAtOnce) {
  const std::string all = text(1000);
  TextSource source(all);
  EXPECT_EQ(source.begin(), all.data());
  EXPECT_EQ(source.end(), all.data() + all.size());
  EXPECT_FALSE(source.isUnfinished());
  EXPECT_FALSE(source.more(source.begin()));
  EXPECT_EQ(readAgain(source), all);
  EXPECT_EQ(readAgain(source), all);
}

TEST(TextSource, WhatIsKeptStaysInFrontOfWhatComes) {
  const std::string all = text(5000);
  for (const size_t window : {1, 2, 7, 64, 1000, 10000}) {
    for (const size_t piece : {1, 3, 64, 100000}) {
      for (const size_t kept : {0, 1, 5, 300}) {
        TextSource source(readingtest::inPieces(all, piece), {}, window, 2 * window);
        EXPECT_EQ(readThrough(source, kept), all) << window << " " << piece << " " << kept;
        EXPECT_FALSE(source.isUnfinished());
      }
    }
  }
}

TEST(TextSource, HandsOutWhatComesAtOnceWhereThatIsWanted) {
  const std::string all(100'000, 'x');
  TextSource waiting(readingtest::inPieces(all, 10), {}, 1000, 1000);
  EXPECT_TRUE(waiting.more(waiting.begin()));
  EXPECT_EQ(waiting.end() - waiting.begin(), 1000);
  TextSource source(readingtest::inPieces(all, 10), {}, 1000, 1000);
  source.takeAsItComes();
  EXPECT_TRUE(source.more(source.begin()));
  EXPECT_EQ(source.end() - source.begin(), 10);
  EXPECT_TRUE(source.more(source.begin()));
  EXPECT_EQ(source.end() - source.begin(), 20);
  // But a long piece is not begun again for a few bytes.
  int times = 0;
  while (source.more(source.begin())) ++times;
  EXPECT_EQ(source.end() - source.begin(), 100'000);
  EXPECT_LT(times, 500);
}

TEST(TextSource, IsReadOnFromWhereItsReaderStopped) {
  const std::string all = "0123456789abcdefghij";
  for (const size_t piece : {1, 3, 100}) {
    TextSource source(readingtest::inPieces(all, piece), {}, 4, 8);
    while (source.end() - source.begin() < 4) EXPECT_TRUE(source.more(source.begin()));
    const TextInput rest = source.from(source.begin() + 2);
    std::string text;
    char buffer[3];
    for (ptrdiff_t count; (count = rest(buffer, sizeof buffer)) > 0;) {
      text.append(buffer, static_cast<size_t>(count));
    }
    EXPECT_EQ(text, all.substr(2));
  }
  TextSource memory(all);
  char buffer[100];
  const TextInput rest = memory.from(memory.begin() + 5);
  EXPECT_EQ(rest(buffer, sizeof buffer), 15);
  EXPECT_EQ(rest(buffer, sizeof buffer), 0);
}

TEST(TextSource, APipeIsReadAgainFromWhatWasKept) {
  const std::string all = text(600000);
  TextSource source(readingtest::inPieces(all, 1000));
  while (source.begin() == source.end() || source.end()[-1] != all[400000]) {
    if (!source.more(source.end())) break;
  }
  EXPECT_EQ(readAgain(source), all) << "some of it was not read before";
}

TEST(TextSource, AFileIsReadAgainFromItsBeginning) {
  const std::string all = text(100000);
  size_t at = 0;
  const TextInput input = [&](char* buffer, size_t size) {
    const size_t count = std::min(size, all.size() - at);
    std::memcpy(buffer, all.data() + at, count);
    at += count;
    return static_cast<ptrdiff_t>(count);
  };
  size_t rewound = 0;
  TextSource source(input, [&] {
    at = 0;
    ++rewound;
    return true;
  });
  EXPECT_EQ(readThrough(source, 0), all);
  EXPECT_EQ(readAgain(source), all);
  EXPECT_EQ(rewound, 1U);
  TextSource lost(input, [] { return false; });
  char byte = 0;
  EXPECT_LT(lost.fromTheBeginning()(&byte, 1), 0);
}

TEST(TextSource, AFailureIsOneAgain) {
  size_t calls = 0;
  const TextInput input = [&](char* buffer, size_t) -> ptrdiff_t {
    *buffer = 'x';
    return ++calls < 3 ? 1 : -1;
  };
  TextSource source(input);
  EXPECT_TRUE(source.more(source.end()));
  EXPECT_EQ(std::string(source.begin(), source.end()), "xx");
  EXPECT_FALSE(source.more(source.end()));
  const TextInput again = source.fromTheBeginning();
  char piece[8];
  EXPECT_EQ(again(piece, sizeof piece), 2);
  EXPECT_LT(again(piece, sizeof piece), 0);
  EXPECT_EQ(calls, 3U);
}

TEST(TextSource, AWindowThatOnePieceMadeLargeDoesNotStay) {
  const int64_t before = workMeter.valueBytes;
  const std::string all = text(4 << 20);
  TextSource source(
      readingtest::inPieces(all, all.size()), [] { return true; }, 16384, 65536);
  while (source.end() - source.begin() < (2 << 20)) ASSERT_TRUE(source.more(source.begin()));
  EXPECT_GE(workMeter.valueBytes - before, 2 << 20) << "it counts as memory";
  ASSERT_TRUE(source.more(source.end()));
  EXPECT_LE(workMeter.valueBytes - before, 1 << 17);
}

}  // namespace
}  // namespace xquery

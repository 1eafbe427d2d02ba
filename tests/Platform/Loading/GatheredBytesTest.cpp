#include "Platform/Base/WorkMeter.h"
#include "Platform/Loading/GatheredBytes.h"

#include <gtest/gtest.h>

#include <new>
#include <string>

namespace xquery {
namespace {

TEST(GatheredBytes, ComeOutAsTheyWentIn) {
  for (const size_t expected : {size_t{0}, size_t{1000}, size_t{5'000'000}}) {
    GatheredBytes bytes(expected);
    std::string all;
    for (int piece = 0; piece < 40; ++piece) {
      const std::string next(static_cast<size_t>(piece) * 5000,
                             static_cast<char>('a' + piece % 26));
      bytes.append(next);
      all += next;
    }
    EXPECT_EQ(bytes.size(), all.size());
    EXPECT_EQ(bytes.take(), all);
  }
  EXPECT_EQ(GatheredBytes().take(), "");
}

TEST(GatheredBytes, CountUntilTheyGo) {
  const int64_t before = workMeter.valueBytes;
  {
    GatheredBytes bytes;
    bytes.append(std::string(3'000'000, 'x'));
    EXPECT_GE(workMeter.valueBytes - before, 3'000'000);
    EXPECT_LE(workMeter.valueBytes - before, 5'000'000);
  }
  EXPECT_EQ(workMeter.valueBytes, before);
}

TEST(GatheredBytes, GrowUpToTheCeilingAndNotBeyond) {
  constexpr int64_t ceiling = 16 << 20;
  workMeter.mostValueBytes = workMeter.valueBytes + ceiling;
  GatheredBytes bytes;
  const std::string piece(16384, 'x');
  EXPECT_THROW(for (;;) bytes.append(piece), std::bad_alloc);
  EXPECT_GT(bytes.size(), ceiling - (2 << 20)) << "what there is room for is used";
  EXPECT_LE(workMeter.valueBytes, workMeter.mostValueBytes);
  workMeter.mostValueBytes = INT64_MAX;
  workMeter.wasRefused = false;
  workMeter.stepsLeft = WorkMeter::manySteps;
}

}  // namespace
}  // namespace xquery

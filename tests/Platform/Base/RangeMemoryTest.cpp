#include "Platform/Base/RangeMemory.h"
#include "Platform/Base/Sanitizers.h"

#include <gtest/gtest.h>

#include <atomic>
#include <cstring>
#include <sys/wait.h>
#include <thread>
#include <unistd.h>
#include <vector>

namespace xquery {
namespace {

TEST(RangeMemory, ABlockHasTheRoomThatItSays) {
  for (size_t bytes = 0; bytes < 3000; bytes = bytes * 9 / 8 + 1) {
    const RangeBlock block = takeRangeBlock(bytes);
    EXPECT_GE(block.bytes, bytes);
    EXPECT_GE(block.bytes, rangeBlockBytes(bytes));
    std::memset(block.address, 1, block.bytes);
    giveRangeBlock(block.address);
  }
}

TEST(RangeMemory, AThreadMayGiveBackWhatAnotherTook) {
  std::vector<RangeBlock> blocks;
  for (int turn = 0; turn < 20; ++turn) {
    std::thread taking([&] {
      for (size_t count = 0; count < 6000; ++count) {
        blocks.push_back(takeRangeBlock(16 + count % 200));
        std::memset(blocks.back().address, static_cast<int>(count), blocks.back().bytes);
      }
    });
    taking.join();
    for (size_t count = 0; count < blocks.size(); ++count) {
      const auto* const bytes = static_cast<const unsigned char*>(blocks[count].address);
      ASSERT_EQ(bytes[0], static_cast<unsigned char>(count));
      ASSERT_EQ(bytes[blocks[count].bytes - 1], static_cast<unsigned char>(count));
      giveRangeBlock(blocks[count].address);
    }
    blocks.clear();
  }
  giveFreeRangeBlocks();
  giveIdleRangePages();
}

#if !XQUERY_THREAD_SANITIZER
TEST(RangeMemory, AChildProcessMayTakeBlocksWhateverOtherThreadsDo) {
  std::atomic<bool> isOver = false;
  std::thread other([&] {
    while (!isOver) giveRangeBlock(takeRangeBlock(100000).address);
  });
  for (int turn = 0; turn < 20; ++turn) {
    const pid_t child = ::fork();
    if (child == 0) {
      giveRangeBlock(takeRangeBlock(100000).address);
      ::_exit(7);
    }
    int status = 0;
    ASSERT_EQ(::waitpid(child, &status, 0), child);
    EXPECT_EQ(WEXITSTATUS(status), 7);
  }
  isOver = true;
  other.join();
}
#endif

}  // namespace
}  // namespace xquery

// Blocks of memory in the one range of addresses of the process, where what is in them can be
// referred to by 32 bits.
//
// A thread keeps small blocks that it gave back for the next ones it takes; when those of a size
// are many, they go to the process.
#pragma once

#include "Platform/Base/RangeRuns.h"

#include <cstddef>

namespace xquery {

struct RangeBlock {
  void* address;
  size_t bytes;
};

// What a block for that many bytes has room for.
constexpr size_t rangeBlockBytes(size_t bytes) {
  return RangeRuns::bytesOf(RangeRuns::unitsFor(bytes));
}
// At least that many bytes, and all of the block's, at an address that divides by 8. Counts nothing
// as memory of values. Throws std::bad_alloc when the range is full.
[[nodiscard]] RangeBlock takeRangeBlock(size_t bytes);
void giveRangeBlock(void* address) noexcept;

// Gives the blocks that the calling thread keeps to the process.
void giveFreeRangeBlocks() noexcept;
// Gives the pages of free blocks of the process to the system.
void giveIdleRangePages() noexcept;

}  // namespace xquery

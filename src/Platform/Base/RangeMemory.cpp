#include "Platform/Base/RangeMemory.h"

#include "Platform/Base/Abandoned.h"
#include "Platform/Base/Sanitizers.h"

#include <algorithm>
#include <new>
#include <pthread.h>
#include <utility>

namespace xquery {

namespace {

// Under a sanitizer it sees each block that is given back.
#if XQUERY_ADDRESS_SANITIZER || XQUERY_THREAD_SANITIZER
constexpr bool keepsBlocks = false;
#else
constexpr bool keepsBlocks = true;
#endif

constexpr size_t mostUnitsKept = 32;
constexpr size_t bytesAtOnce = size_t{8} << 10;
constexpr size_t mostBytesKept = size_t{256} << 10;  // of each size

RangeRuns& runs() {
  // Never destroyed: trees may be freed by destructors that run at exit.
  alignas(RangeRuns) static unsigned char storage[sizeof(RangeRuns)];
  static RangeRuns* const shared = ::new (storage) RangeRuns(RangeRuns::windowBytes);
  return *shared;
}

// A child process must not find it locked, or half made, by a thread that it does not have. Whoever
// loads the library uses it from no other thread yet. Who waits for others to free values waits
// before it is locked for them.
[[maybe_unused]] const int handlersOfFork = [] {
  const auto prepare = [] {
    waitForAbandonedValues();
    runs().lock();
  };
  const auto goOn = [] { runs().unlock(); };
  return ::pthread_atfork(prepare, goOn, goOn);
}();

struct BlockList {
  RangeRuns::Block* first = nullptr;
  size_t count = 0;
};

struct ThreadBlocks {
  BlockList lists[mostUnitsKept + 1];  // by their units
  bool closesAtExit = false;
};

// Needs no construction, so that reaching it is one instruction.
constinit thread_local ThreadBlocks threadBlocks __attribute__((tls_model("initial-exec")));

struct ThreadExit {
  ~ThreadExit() { giveFreeRangeBlocks(); }
};

void closeAtThreadExit() {
  if (threadBlocks.closesAtExit) return;
  static thread_local ThreadExit threadExit;
  static_cast<void>(&threadExit);
  threadBlocks.closesAtExit = true;
}

void giveList(BlockList& list) noexcept {
  runs().giveChain(std::exchange(list.first, nullptr));
  list.count = 0;
}

// A block of another size may be among them.
[[gnu::noinline]] void fill(BlockList& list, size_t units) {
  closeAtThreadExit();
  const size_t bytes = RangeRuns::bytesOf(units);
  list.first = runs().takeChain(bytes, std::max<size_t>(bytesAtOnce / bytes, 1));
  list.count = 0;  // only paces what is given to the process
}

}  // namespace

RangeBlock takeRangeBlock(size_t bytes) {
  const size_t units = RangeRuns::unitsFor(bytes);
  if (!keepsBlocks || units > mostUnitsKept) {
    void* const block = runs().take(bytes);
    return {block, RangeRuns::bytesOf(RangeRuns::unitsOf(block))};
  }
  BlockList& list = threadBlocks.lists[units];
  if (!list.first) [[unlikely]] {
    fill(list, units);
  }
  RangeRuns::Block* const block = list.first;
  list.first = block->next;
  list.count -= list.count > 0;
  return {block, RangeRuns::bytesOf(units)};
}

void giveRangeBlock(void* address) noexcept {
  const size_t units = RangeRuns::unitsOf(address);
  if (!keepsBlocks || units > mostUnitsKept) {
    runs().give(address);
    return;
  }
  BlockList& list = threadBlocks.lists[units];
  if (list.count >= mostBytesKept / (units * RangeRuns::unit)) [[unlikely]] {
    giveList(list);
  }
  if (!list.first) closeAtThreadExit();
  list.first = ::new (address) RangeRuns::Block{list.first};
  ++list.count;
}

void giveFreeRangeBlocks() noexcept {
  if (!threadBlocks.closesAtExit) return;
  for (BlockList& list : threadBlocks.lists) {
    if (list.first) giveList(list);
  }
}

void giveIdleRangePages() noexcept {
  runs().giveBackIdle();
}

}  // namespace xquery

// Memory in one reserved range of addresses, for what refers to each other by places in it.
//
//   range   | run | run | free run | run | ...          top | not used yet        | not usable yet
//   | run     | units of the one before it | own units, whether free | the block that is handed out
//   | free    | units of the one before it | own units, free         | next, previous of its bin
//   ... |
//
// The range is reserved at once and made usable as it fills. It lies within a multiple of
// `windowBytes`, so that its window follows from any address in it; where the system refuses the
// size that is asked for, it is a smaller one.
//
// Free runs are in bins by size, and free neighbours are one run. Large blocks that were given back
// are kept as they are for who asks for as much, up to a bound; beyond it, their pages are offered
// to the system, which takes them when memory gets short and not before: the next large tree finds
// them still there, where new ones would cost it a tenth of its time and more, and much more on a
// virtual machine whose host takes memory that lies idle. Pages go back for good, and those under
// small runs at all, on request only.
//
// Blocks are multiples of 16 bytes less the 8 of the head, at addresses that divide by 8. Any
// thread may call anything. Under AddressSanitizer a free block is out of bounds, for a while even
// for the next one who asks for memory.
#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <mutex>

namespace xquery {

class RangeRuns {
 public:
  static constexpr size_t windowBytes = size_t{1} << 35;
  static constexpr size_t unit = 16;
  static constexpr size_t headBytes = 8;

  // What is handed out as a chain.
  struct Block {
    Block* next;
  };

  // What the system is told about pages goes through `advise`, which is madvise or a test's.
  using Advise = int (*)(void* begin, size_t bytes, int advice) noexcept;
  explicit RangeRuns(size_t mostBytes, Advise advise = adviseSystem);
  ~RangeRuns();
  RangeRuns(const RangeRuns&) = delete;
  RangeRuns& operator=(const RangeRuns&) = delete;

  static constexpr size_t unitsFor(size_t bytes) {
    return (bytes + headBytes + unit - 1) / unit < fewestUnits
               ? fewestUnits
               : (bytes + headBytes + unit - 1) / unit;
  }
  static constexpr size_t bytesOf(size_t units) { return units * unit - headBytes; }
  // Of a block that was taken: at least what was asked for.
  static size_t unitsOf(const void* block) { return runOf(block)->units(); }

  // Throws std::bad_alloc when the range is full.
  [[nodiscard]] void* take(size_t bytes);
  // At least one and at most `count` small blocks.
  [[nodiscard]] Block* takeChain(size_t bytes, size_t count);
  void give(void* block) noexcept;
  void giveChain(Block* first) noexcept;

  // The pages of all that is free.
  void giveBackIdle() noexcept;

  // For who forks while other threads take memory.
  void lock() { _mutex.lock(); }
  void unlock() { _mutex.unlock(); }

  size_t size() const { return _size; }

 private:
  static constexpr size_t fewestUnits = 2;  // a free run has links
  static constexpr size_t exactBins = 64;
  static constexpr size_t binsPerDoubling = 8;
  static constexpr size_t binCount = exactBins + 25 * binsPerDoubling;
  static constexpr size_t largeBytes = size_t{64} << 10;
  static constexpr size_t mostKeptBytes = size_t{32} << 20;

  struct Run {
    uint32_t unitsBefore;  // of the run before it; 0 for the first
    uint32_t unitsAndFree;

    size_t units() const { return unitsAndFree >> 1; }
    bool isFree() const { return (unitsAndFree & 1) != 0; }
    void set(size_t units, bool isFree) {
      unitsAndFree = static_cast<uint32_t>(units << 1) | (isFree ? 1 : 0);
    }
    char* address() { return reinterpret_cast<char*>(this); }
    void* block() { return this + 1; }
    Run* after() { return reinterpret_cast<Run*>(address() + units() * unit); }
    Run* before() { return reinterpret_cast<Run*>(address() - size_t{unitsBefore} * unit); }
  };
  struct FreeRun : Run {
    FreeRun* next;
    FreeRun* previous;
  };
  static_assert(sizeof(Run) == headBytes && sizeof(FreeRun) <= fewestUnits * unit);

  static Run* runOf(void* block) { return static_cast<Run*>(block) - 1; }
  static const Run* runOf(const void* block) { return static_cast<const Run*>(block) - 1; }

  static int adviseSystem(void* begin, size_t bytes, int advice) noexcept;

  void reserve(size_t bytes);
  bool makeUsable(char* end);
  static size_t binOf(size_t units);
  size_t binFrom(size_t bin) const;
  void link(Run* run);
  void unlink(FreeRun* run);
  FreeRun* fitting(size_t units);
  // All of these answer null for want of room.
  Run* takeRun(size_t units);
  Run* takeFree(size_t units);
  Run* takeKept(size_t units);
  Run* takeTop(size_t units);
  void cut(Run* run, size_t units);
  Block* chained(Run* run, Block* next);
  Block* split(Run* run, size_t units);
  void give(Run* run);
  void keep(Run* run);
  // All that is free around a run that was released.
  struct FreeRoom {
    char* begin;
    char* end;
  };
  FreeRoom release(Run* run);
  void releaseToSystem(Run* run);
  void releaseIdle();
  void giveBack(char* begin, char* end);
  void offer(char* begin, char* end);

  const Advise _advise;
  std::mutex _mutex;
  char* _begin = nullptr;
  size_t _size = 0;
  char* _top = nullptr;
  char* _usableEnd = nullptr;
  uint32_t _unitsBeforeTop = 0;
  std::array<FreeRun*, binCount> _bins = {};
  std::array<uint64_t, (binCount + 63) / 64> _filledBins = {};
  // The oldest first.
  std::array<Run*, 64> _kept = {};
  size_t _keptCount = 0;
  size_t _keptBytes = 0;
  // Under AddressSanitizer: the smaller blocks that were given back last.
  std::array<Run*, 256> _waiting = {};
  size_t _nextWaiting = 0;
};

}  // namespace xquery

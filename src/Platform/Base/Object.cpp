// The object allocator and the destruction of object graphs.
//
// Blocks of up to 128 bytes are kept in lists by size, 16 bytes apart. A thread works on some lists
// of each size without any lock: the one in use and full ones in reserve, enough for a result of
// some thousand items, which would go from processor to processor otherwise. A thread that has no
// place for a full one hands it to the process, and a thread that runs dry takes one from there
// before it carves new blocks from a chunk; so one thread may for ever make what another frees
// without the process growing.
//
//   free block   | next block of the list | next list (first block of a list of the process) | ...
//
// There are two sets of lists, for objects that come and go and for those that last
// (LastingObjects.h). A thread works on one of the sets; the other one waits.
//
// Chunks are given back on request only: memory that a large result needed once stays ready for the
// next one.
// Under a sanitizer every block comes from malloc, so that it sees each of them.
#include "xquery/Object.h"

#include "Platform/Base/Abandoned.h"
#include "Platform/Base/LastingObjects.h"
#include "Platform/Base/ObjectBlocks.h"
#include "Platform/Base/RangeMemory.h"
#include "Platform/Base/Sanitizers.h"
#include "Platform/Base/WorkMeter.h"
#include "xquery/Collection.h"
#include "xquery/Memory.h"

#include <algorithm>
#include <cstdlib>
#include <iterator>
#include <malloc.h>
#include <mutex>
#include <new>
#include <utility>
#include <vector>

namespace xquery {

namespace {

#if XQUERY_ADDRESS_SANITIZER || XQUERY_THREAD_SANITIZER
constexpr bool usesFreeLists = false;
#else
constexpr bool usesFreeLists = true;
#endif

constexpr size_t granule = 16;
constexpr size_t largestBlock = 128;
constexpr size_t sizeCount = largestBlock / granule;
constexpr size_t setCount = 2;
constexpr size_t chunkBytes = size_t{64} * 1024;
constexpr uint32_t listLength = 256;
constexpr size_t reserveBytes = size_t{256} * 1024;  // of each size

struct FreeBlock {
  FreeBlock* next;
  FreeBlock* nextList;
};

struct BlockList {
  FreeBlock* first = nullptr;
  uint32_t length = 0;
  FreeBlock* reserve = nullptr;  // lists of `listLength` blocks, each with the next one
  uint32_t reserveCount = 0;
};

// Objects whose destruction waits until the ones above them on the stack are done.
struct PendingObjects {
  const NSCounted** objects = nullptr;
  size_t count = 0;
  size_t capacity = 0;
};

// For objects of one use.
struct BlockSet {
  BlockList lists[sizeCount];
  unsigned char* chunk = nullptr;  // what is left of the chunk being carved
  size_t chunkLeft = 0;
};

// All that a thread keeps; needs no construction, so that reaching it is one instruction.
struct ThreadState : BlockSet {
  BlockSet waiting;
  bool isLasting = false;  // which of the sets the thread works on
  bool closesAtExit = false;
  uint32_t destructionDepth = 0;
  PendingObjects pending;
};

constinit thread_local ThreadState threadState __attribute__((tls_model("initial-exec")));

// What threads hand to each other: per size a stack of lists.
struct SharedLists {
  std::mutex mutex;
  FreeBlock* lists[setCount][sizeCount] = {};
  // Every chunk, chained through its first word, so that leak checkers find the memory in use.
  void* chunks = nullptr;
};

SharedLists& sharedLists() {
  // Never destroyed: objects may be released by destructors that run at exit.
  alignas(SharedLists) static unsigned char storage[sizeof(SharedLists)];
  static SharedLists* const shared = ::new (storage) SharedLists;
  return *shared;
}

void giveList(bool isLasting, size_t sizeIndex, FreeBlock* list) {
  SharedLists& shared = sharedLists();
  const std::lock_guard<std::mutex> guard(shared.mutex);
  list->nextList = shared.lists[isLasting][sizeIndex];
  shared.lists[isLasting][sizeIndex] = list;
}

void giveList(size_t sizeIndex, FreeBlock* list) {
  giveList(threadState.isLasting, sizeIndex, list);
}

// Of the other use if need be: what was made for one may have been freed for the other.
FreeBlock* takeList(size_t sizeIndex) {
  SharedLists& shared = sharedLists();
  const std::lock_guard<std::mutex> guard(shared.mutex);
  for (const bool isLasting : {threadState.isLasting, !threadState.isLasting}) {
    FreeBlock*& lists = shared.lists[isLasting][sizeIndex];
    if (lists) return std::exchange(lists, lists->nextList);
  }
  return nullptr;
}

void changeSets() {
  std::swap(static_cast<BlockSet&>(threadState), threadState.waiting);
  threadState.isLasting = !threadState.isLasting;
}

// Gives the next bytes of the chunk, a multiple of the granule, to the process as one block.
void giveRemainder(size_t size) {
  auto* block = reinterpret_cast<FreeBlock*>(threadState.chunk);
  block->next = nullptr;
  giveList(size / granule - 1, block);
  threadState.chunk += size;
  threadState.chunkLeft -= size;
}

// Gives everything the thread holds of the set it works on to the process.
void giveSet() {
  for (size_t index = 0; index < sizeCount; ++index) {
    BlockList& blocks = threadState.lists[index];
    if (blocks.first) giveList(index, blocks.first);
    while (blocks.reserve) giveList(index, std::exchange(blocks.reserve, blocks.reserve->nextList));
    blocks = BlockList();
  }
  // The rest of the chunk becomes blocks of the largest size that fits.
  while (threadState.chunkLeft >= granule) {
    giveRemainder(std::min(threadState.chunkLeft, largestBlock));
  }
}

struct ThreadExit {
  ~ThreadExit() { giveFreeBlocks(); }
};

void closeAtThreadExit() {
  static thread_local ThreadExit threadExit;
  static_cast<void>(&threadExit);
  threadState.closesAtExit = true;
}

void startChunk() {
  auto* chunk = static_cast<unsigned char*>(std::malloc(chunkBytes));
  if (!chunk) throw std::bad_alloc();
  SharedLists& shared = sharedLists();
  const std::lock_guard<std::mutex> guard(shared.mutex);
  *reinterpret_cast<void**>(chunk) = shared.chunks;
  shared.chunks = chunk;
  threadState.chunk = chunk + granule;
  threadState.chunkLeft = chunkBytes - granule;
}

// Fills the empty list in use with some blocks from the chunk.
void carveBlocks(size_t sizeIndex) {
  constexpr uint32_t blocksAtOnce = 32;
  const size_t size = (sizeIndex + 1) * granule;
  ThreadState& state = threadState;
  if (state.chunkLeft < size) {
    // A remainder smaller than this block serves a smaller size.
    if (state.chunkLeft >= granule) giveRemainder(state.chunkLeft);
    startChunk();
  }
  BlockList& blocks = state.lists[sizeIndex];
  blocks.length = 0;
  while (blocks.length < blocksAtOnce && state.chunkLeft >= size) {
    auto* block = reinterpret_cast<FreeBlock*>(state.chunk);
    block->next = blocks.first;
    blocks.first = block;
    ++blocks.length;
    state.chunk += size;
    state.chunkLeft -= size;
  }
}

FreeBlock* takeReserve(BlockList& blocks) {
  FreeBlock* list = blocks.reserve;
  if (!list) return nullptr;
  blocks.reserve = list->nextList;
  --blocks.reserveCount;
  return list;
}

void keepInReserve(size_t sizeIndex, FreeBlock* list) {
  BlockList& blocks = threadState.lists[sizeIndex];
  if (blocks.reserveCount >= reserveBytes / (listLength * (sizeIndex + 1) * granule)) {
    giveList(sizeIndex, list);
    return;
  }
  list->nextList = blocks.reserve;
  blocks.reserve = list;
  ++blocks.reserveCount;
}

// The list in use is empty.
[[gnu::noinline]] void* allocateSlowly(size_t sizeIndex) {
  ThreadState& state = threadState;
  if (!state.closesAtExit) closeAtThreadExit();
  BlockList& blocks = state.lists[sizeIndex];
  FreeBlock* list = takeReserve(blocks);
  if (!list) list = takeList(sizeIndex);
  if (list) {
    blocks.first = list->next;
    // A list left by a thread that ended may be shorter; the length only paces the exchange.
    blocks.length = listLength - 1;
    return list;
  }
  carveBlocks(sizeIndex);
  FreeBlock* block = blocks.first;
  blocks.first = block->next;
  --blocks.length;
  return block;
}

// The list in use is full or empty.
[[gnu::noinline]] void prepareToFree(size_t sizeIndex) {
  ThreadState& state = threadState;
  if (!state.closesAtExit) closeAtThreadExit();
  BlockList& blocks = state.lists[sizeIndex];
  if (!blocks.first) {
    blocks.length = 0;
    return;
  }
  keepInReserve(sizeIndex, std::exchange(blocks.first, nullptr));
  blocks.length = 0;
}

// What was handed to the process, taken out of its hands to give back the chunks of which every
// block is idle. A block that some thread uses, keeps in its own lists or has not carved yet keeps
// its chunk; nobody else touches the others meanwhile.
class IdleBlocks {
 public:
  IdleBlocks() {
    SharedLists& shared = sharedLists();
    const std::lock_guard<std::mutex> guard(shared.mutex);
    for (void* chunk = shared.chunks; chunk; chunk = *static_cast<void**>(chunk)) {
      _chunks.push_back({static_cast<unsigned char*>(chunk), granule});
    }
    std::sort(_chunks.begin(), _chunks.end(),
              [](const Chunk& a, const Chunk& b) { return a.first < b.first; });
    std::swap(_lists, shared.lists);
  }

  void giveBack() {
    forEachBlock([this](bool, size_t index, FreeBlock* block) {
      chunkOf(block)->idleBytes += (index + 1) * granule;
    });
    forEachBlock([this](bool isLasting, size_t index, FreeBlock* block) {
      if (!isIdle(*chunkOf(block))) keep(isLasting, index, block);
    });
    for (const bool isLasting : {false, true}) {
      for (size_t index = 0; index < sizeCount; ++index) {
        FreeBlock* kept = _kept[isLasting][index].first;
        if (kept) giveList(isLasting, index, kept);
      }
    }
    unchain();
    for (const Chunk& chunk : _chunks) {
      if (isIdle(chunk)) std::free(chunk.first);
    }
  }

 private:
  struct Chunk {
    unsigned char* first;
    size_t idleBytes;  // with the word that chains it
  };

  static bool isIdle(const Chunk& chunk) { return chunk.idleBytes == chunkBytes; }

  template <class Work>
  void forEachBlock(Work work) {
    for (const bool isLasting : {false, true}) {
      for (size_t index = 0; index < sizeCount; ++index) {
        forEachBlock(_lists[isLasting][index],
                     [&](FreeBlock* block) { work(isLasting, index, block); });
      }
    }
  }
  template <class Work>
  static void forEachBlock(FreeBlock* list, Work work) {
    while (list) {
      FreeBlock* const nextList = list->nextList;
      for (FreeBlock* block = list; block;) {
        FreeBlock* const next = block->next;
        work(block);
        block = next;
      }
      list = nextList;
    }
  }
  // Null for what is in none of those that were there at the start.
  Chunk* chunkOf(const void* block) {
    const auto after = std::upper_bound(
        _chunks.begin(), _chunks.end(), static_cast<const unsigned char*>(block),
        [](const unsigned char* wanted, const Chunk& chunk) { return wanted < chunk.first; });
    if (after == _chunks.begin()) return nullptr;
    Chunk& chunk = *std::prev(after);
    return block < chunk.first + chunkBytes ? &chunk : nullptr;
  }
  void keep(bool isLasting, size_t index, FreeBlock* block) {
    BlockList& kept = _kept[isLasting][index];
    if (kept.length == listLength) {
      giveList(isLasting, index, kept.first);
      kept = BlockList();
    }
    block->next = kept.first;
    kept.first = block;
    ++kept.length;
  }
  // Takes what is given back out of the chain, to which chunks may have been added meanwhile.
  void unchain() {
    SharedLists& shared = sharedLists();
    const std::lock_guard<std::mutex> guard(shared.mutex);
    void* kept = nullptr;
    for (void* chunk = shared.chunks; chunk;) {
      void* const next = *static_cast<void**>(chunk);
      const Chunk* known = chunkOf(chunk);
      if (!known || !isIdle(*known)) {
        *static_cast<void**>(chunk) = kept;
        kept = chunk;
      }
      chunk = next;
    }
    shared.chunks = kept;
  }

  std::vector<Chunk> _chunks;
  FreeBlock* _lists[setCount][sizeCount] = {};
  BlockList _kept[setCount][sizeCount];
};

bool pushPending(const NSCounted* object) {
  PendingObjects& pending = threadState.pending;
  if (pending.count == pending.capacity) {
    const size_t capacity = pending.capacity ? pending.capacity * 2 : 64;
    void* objects = std::realloc(pending.objects, capacity * sizeof(*pending.objects));
    if (!objects) return false;
    pending.objects = static_cast<const NSCounted**>(objects);
    pending.capacity = capacity;
  }
  pending.objects[pending.count++] = object;
  return true;
}

// Whether the list, or what is left of it, is freed later.
bool isSetAside(const NSCounted* object, AbandonedValues::Free free) {
  if (!NSArray::classof(*object)) return false;
  // Nobody else knows it any more.
  auto& objects = const_cast<NSArray*>(static_cast<const NSArray*>(object))->objects();
  AbandonedValues& abandoned = *abandonedValues;
  while (!abandoned.take(object, free, objects.size())) {
    if (objects.size() <= AbandonedValues::partsPerLook) return false;
    objects.resize(objects.size() - AbandonedValues::partsPerLook);
    abandoned.isOver();
  }
  return true;
}

}  // namespace

void giveFreeBlocks() {
  for (size_t set = 0; set < setCount; ++set) {
    giveSet();
    changeSets();
  }
  giveFreeRangeBlocks();
}

LastingObjects::LastingObjects() : _isOutermost(!threadState.isLasting) {
  if (_isOutermost) changeSets();
}

LastingObjects::~LastingObjects() {
  if (_isOutermost) changeSets();
}

void* NSCounted::operator new(size_t size) {
  countValueBytes(size);
  if (!usesFreeLists || size > largestBlock) return ::operator new(size);
  const size_t sizeIndex = (size - 1) / granule;
  BlockList& blocks = threadState.lists[sizeIndex];
  FreeBlock* block = blocks.first;
  if (!block) [[unlikely]] {
    return allocateSlowly(sizeIndex);
  }
  blocks.first = block->next;
  --blocks.length;
  return block;
}

void NSCounted::operator delete(void* block, size_t size) noexcept {
  uncountValueBytes(size);
  if (!usesFreeLists || size > largestBlock) {
    ::operator delete(block, size);
    return;
  }
  const size_t sizeIndex = (size - 1) / granule;
  BlockList& blocks = threadState.lists[sizeIndex];
  if (!blocks.first || blocks.length >= listLength) [[unlikely]] {
    prepareToFree(sizeIndex);
  }
  auto* freed = static_cast<FreeBlock*>(block);
  freed->next = blocks.first;
  blocks.first = freed;
  ++blocks.length;
}

void NSCounted::destroy(const NSCounted* object) {
  // A number refers to no other object, so that nothing nests and nothing is worth setting aside.
  if (object->kind() >= Kind::Number && object->kind() <= Kind::TypedNumber) {
    delete object;
    return;
  }
  // A nested destruction takes a few hundred bytes of stack, so this depth is safe everywhere.
  constexpr uint32_t maximumDepth = 64;
  ThreadState& state = threadState;
  if (abandonedValues) {
    const auto free = [](const void* list) { destroy(static_cast<const NSCounted*>(list)); };
    if (isSetAside(object, free)) return;
  }
  if (state.destructionDepth >= maximumDepth && pushPending(object)) return;
  ++state.destructionDepth;
  delete object;
  if (state.destructionDepth == 1 && state.pending.count) [[unlikely]] {
    PendingObjects& pending = state.pending;
    while (pending.count) delete pending.objects[--pending.count];
    std::free(pending.objects);
    pending = PendingObjects();
  }
  --state.destructionDepth;
}

void XQueryReleaseIdleMemory() {
  waitForAbandonedValues();
  giveFreeBlocks();
  try {
    IdleBlocks().giveBack();
  } catch (const std::bad_alloc&) {
    // Not even the list of what there is; the rest can still go.
  }
  giveIdleRangePages();
#ifdef __GLIBC__
  ::malloc_trim(0);
#endif
}

}  // namespace xquery

// The object allocator and the destruction of object graphs.
//
// Blocks of up to 128 bytes are kept in lists by size, 16 bytes apart. A thread works on two lists
// of each size without any lock: the one in use and a full one in reserve. A thread that fills both
// hands the full one to the process, and a thread that runs dry takes one from there before it
// carves new blocks from a chunk; so one thread may for ever make what another frees without the
// process growing.
//
//   free block   | next block of the list | next list (first block of a list of the process) | ...
//
// Chunks are given back on request only: memory that a large result needed once stays ready for the
// next one.
// Under a sanitizer every block comes from malloc, so that it sees each of them.
#include "xquery/Object.h"

#include "Platform/Base/Abandoned.h"
#include "Platform/Base/ObjectBlocks.h"
#include "Platform/Base/WorkMeter.h"
#include "xquery/Collection.h"
#include "xquery/Memory.h"

#include <algorithm>
#include <cstdlib>
#include <iterator>
#include <malloc.h>
#include <mutex>
#include <new>
#include <vector>

namespace xquery {

namespace {

#if defined(__SANITIZE_ADDRESS__) || defined(__SANITIZE_THREAD__)
constexpr bool usesFreeLists = false;
#else
constexpr bool usesFreeLists = true;
#endif

constexpr size_t granule = 16;
constexpr size_t largestBlock = 128;
constexpr size_t sizeCount = largestBlock / granule;
constexpr size_t chunkBytes = size_t{64} * 1024;
constexpr uint32_t listLength = 256;

struct FreeBlock {
  FreeBlock* next;
  FreeBlock* nextList;
};

struct BlockList {
  FreeBlock* first = nullptr;
  uint32_t length = 0;
  FreeBlock* reserve = nullptr;  // a list of `listLength` blocks, or null
};

// Objects whose destruction waits until the ones above them on the stack are done.
struct PendingObjects {
  const NSCounted** objects = nullptr;
  size_t count = 0;
  size_t capacity = 0;
};

// All that a thread keeps; needs no construction, so that reaching it is one instruction.
struct ThreadState {
  BlockList lists[sizeCount];
  unsigned char* chunk = nullptr;  // what is left of the chunk being carved
  size_t chunkLeft = 0;
  bool closesAtExit = false;
  uint32_t destructionDepth = 0;
  PendingObjects pending;
};

constinit thread_local ThreadState threadState __attribute__((tls_model("initial-exec")));

// What threads hand to each other: per size a stack of lists.
struct SharedLists {
  std::mutex mutex;
  FreeBlock* lists[sizeCount] = {};
  // Every chunk, chained through its first word, so that leak checkers find the memory in use.
  void* chunks = nullptr;
};

SharedLists& sharedLists() {
  // Never destroyed: objects may be released by destructors that run at exit.
  alignas(SharedLists) static unsigned char storage[sizeof(SharedLists)];
  static SharedLists* const shared = ::new (storage) SharedLists;
  return *shared;
}

void giveList(size_t sizeIndex, FreeBlock* list) {
  SharedLists& shared = sharedLists();
  const std::lock_guard<std::mutex> guard(shared.mutex);
  list->nextList = shared.lists[sizeIndex];
  shared.lists[sizeIndex] = list;
}

FreeBlock* takeList(size_t sizeIndex) {
  SharedLists& shared = sharedLists();
  const std::lock_guard<std::mutex> guard(shared.mutex);
  FreeBlock* list = shared.lists[sizeIndex];
  if (list) shared.lists[sizeIndex] = list->nextList;
  return list;
}

// Gives the next bytes of the chunk, a multiple of the granule, to the process as one block.
void giveRemainder(size_t size) {
  auto* block = reinterpret_cast<FreeBlock*>(threadState.chunk);
  block->next = nullptr;
  giveList(size / granule - 1, block);
  threadState.chunk += size;
  threadState.chunkLeft -= size;
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

// The list in use is empty.
[[gnu::noinline]] void* allocateSlowly(size_t sizeIndex) {
  ThreadState& state = threadState;
  if (!state.closesAtExit) closeAtThreadExit();
  BlockList& blocks = state.lists[sizeIndex];
  FreeBlock* list = blocks.reserve ? std::exchange(blocks.reserve, nullptr) : takeList(sizeIndex);
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
  if (blocks.reserve) giveList(sizeIndex, blocks.reserve);
  blocks.reserve = std::exchange(blocks.first, nullptr);
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
    std::swap_ranges(std::begin(_lists), std::end(_lists), std::begin(shared.lists));
  }

  void giveBack() {
    forEachBlock([this](size_t index, FreeBlock* block) {
      chunkOf(block)->idleBytes += (index + 1) * granule;
    });
    forEachBlock([this](size_t index, FreeBlock* block) {
      if (!isIdle(*chunkOf(block))) keep(index, block);
    });
    for (size_t index = 0; index < sizeCount; ++index) {
      if (_kept[index].first) giveList(index, _kept[index].first);
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
    for (size_t index = 0; index < sizeCount; ++index) {
      for (FreeBlock* list = _lists[index]; list;) {
        FreeBlock* const nextList = list->nextList;
        for (FreeBlock* block = list; block;) {
          FreeBlock* const next = block->next;
          work(index, block);
          block = next;
        }
        list = nextList;
      }
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
  void keep(size_t index, FreeBlock* block) {
    BlockList& kept = _kept[index];
    if (kept.length == listLength) {
      giveList(index, kept.first);
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
  FreeBlock* _lists[sizeCount] = {};
  BlockList _kept[sizeCount];
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
  for (size_t index = 0; index < sizeCount; ++index) {
    BlockList& blocks = threadState.lists[index];
    if (blocks.first) giveList(index, blocks.first);
    if (blocks.reserve) giveList(index, blocks.reserve);
    blocks = BlockList();
  }
  // The rest of the chunk becomes blocks of the largest size that fits.
  while (threadState.chunkLeft >= granule) {
    giveRemainder(std::min(threadState.chunkLeft, largestBlock));
  }
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
#ifdef __GLIBC__
  ::malloc_trim(0);
#endif
}

}  // namespace xquery

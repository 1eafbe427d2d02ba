// Tables of what one document has: entries that stay where they are, found by a keyed hash, and the
// memory that they are made in. There may be millions of them; growing and freeing never takes long
// in one go.
#pragma once

#include "Platform/Base/WorkMeter.h"
#include "xquery/Object.h"

#include <cstddef>
#include <cstdint>
#include <cstring>
#include <new>
#include <string_view>
#include <type_traits>
#include <utility>
#include <vector>

namespace xquery {

// Memory that is freed as a whole.
class EntryMemory {
 public:
  EntryMemory() = default;
  ~EntryMemory() {
    for (const Block& block : _blocks) freeValueMemory(block.bytes, block.size);
  }
  EntryMemory(const EntryMemory&) = delete;
  EntryMemory& operator=(const EntryMemory&) = delete;

  template <class Entry>
  Entry* make() {
    static_assert(std::is_trivially_destructible_v<Entry> && alignof(Entry) <= alignment);
    return ::new (allocate(sizeof(Entry))) Entry();
  }
  std::string_view copy(std::string_view bytes) {
    if (bytes.empty()) return {};
    auto* const copy = static_cast<char*>(allocate(bytes.size()));
    std::memcpy(copy, bytes.data(), bytes.size());
    return {copy, bytes.size()};
  }

 private:
  struct Block {
    char* bytes;
    size_t size;
  };
  static constexpr size_t alignment = alignof(std::max_align_t);
  static constexpr size_t smallestBlock = 4096;
  static constexpr size_t largestBlock = size_t{1} << 20;

  void* allocate(size_t bytes) {
    bytes = (bytes + alignment - 1) / alignment * alignment;
    if (static_cast<size_t>(_end - _at) < bytes) addBlock(bytes);
    return std::exchange(_at, _at + bytes);
  }
  void addBlock(size_t bytes) {
    const size_t usual =
        _blocks.empty() ? smallestBlock : std::min(2 * _blocks.back().size, largestBlock);
    const size_t size = std::max(usual, bytes);
    _blocks.reserve(_blocks.size() + 1);
    _at = static_cast<char*>(allocateValueMemory(size));
    _end = _at + size;
    _blocks.push_back({_at, size});
  }

  std::vector<Block> _blocks;
  char* _at = nullptr;
  char* _end = nullptr;
};

// An entry knows its own `hash`.
template <class Entry>
class EntryTable {
 public:
  EntryTable() : _places(32) {}

  // The entry for which `matches` is true among those with that hash; null if there is none.
  template <class Matches>
  Entry* find(uint64_t hash, Matches matches) const {
    for (size_t place = hash & mask();; place = (place + 1) & mask()) {
      Entry* const entry = _places[place];
      if (!entry || (entry->hash == hash && matches(*entry))) return entry;
    }
  }
  // One that is not there yet.
  void insert(Entry* entry) {
    if (2 * (_count + 1) > _places.size()) grow();
    put(_places, entry);
    ++_count;
  }

 private:
  using Places = std::vector<Entry*, ValueAllocator<Entry*>>;

  size_t mask() const { return _places.size() - 1; }
  static void put(Places& places, Entry* entry) {
    const size_t mask = places.size() - 1;
    size_t place = entry->hash & mask;
    while (places[place]) place = (place + 1) & mask;
    places[place] = entry;
  }
  void grow() {
    Places larger(_places.size() * 2);
    WorkPacer pacer;
    for (Entry* const entry : _places) {
      pacer.turn();
      if (entry) put(larger, entry);
    }
    _places.swap(larger);
  }

  Places _places;  // 2^n, at most half of them taken
  size_t _count = 0;
};

}  // namespace xquery

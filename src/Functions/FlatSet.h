// A set that only grows, laid out for going through a million values once: the keys lie one behind
// the other in the order of their insertion, and a table of indices into them, open addressed and
// at most half full, finds them. The hash of a key is kept beside it, so that neither growing nor
// passing a key of another hash touches what the key refers to.
#pragma once

#include "xquery/Object.h"

#include <cstddef>
#include <cstdint>
#include <utility>
#include <vector>

namespace xquery {

template <class Key, class Hash, class Equal>
class FlatSet {
 public:
  bool empty() const { return _entries.empty(); }
  auto begin() const { return _entries.begin(); }
  auto end() const { return _entries.end(); }

  bool contains(const Key& key) const {
    return !_slots.empty() && _slots[slotOf(key, Hash()(key))] != vacant;
  }

  // False when the key is there already.
  bool insert(Key key) {
    if (_slots.size() < 2 * (_entries.size() + 1)) grow();
    const uint64_t hash = Hash()(key);
    uint32_t& slot = _slots[slotOf(key, hash)];
    if (slot != vacant) return false;
    _entries.push_back({std::move(key), hash});
    slot = static_cast<uint32_t>(_entries.size());
    return true;
  }

  struct Entry {
    Key key;
    uint64_t hash;
  };

 private:
  template <class T>
  using Vector = std::vector<T, ValueAllocator<T>>;

  static constexpr uint32_t vacant = 0;  // else the index of an entry and 1

  // Hashes may differ in any of their bits only, so they are mixed; but not the lowest four, which
  // keeps the slots of neighbours, such as the numbers of a range, in one cache line.
  size_t firstSlot(uint64_t hash) const {
    uint64_t line = hash >> 4;
    line = (line ^ (line >> 32)) * 0x9E3779B97F4A7C15ULL;
    return ((line >> 20 << 4) | (hash & 15)) & (_slots.size() - 1);
  }

  // The slot that holds the key, or the vacant one where it belongs.
  size_t slotOf(const Key& key, uint64_t hash) const {
    size_t at = firstSlot(hash);
    for (; _slots[at] != vacant; at = (at + 1) & (_slots.size() - 1)) {
      const Entry& entry = _entries[_slots[at] - 1];
      if (entry.hash == hash && Equal()(entry.key, key)) break;
    }
    return at;
  }

  void grow() {
    const size_t size = _slots.empty() ? 16 : _slots.size() * 2;
    _slots.assign(size, vacant);
    for (size_t index = 0; index < _entries.size(); ++index) {
      size_t at = firstSlot(_entries[index].hash);
      while (_slots[at] != vacant) at = (at + 1) & (size - 1);
      _slots[at] = static_cast<uint32_t>(index + 1);
    }
  }

  Vector<Entry> _entries;
  Vector<uint32_t> _slots;  // a power of two of them
};

}  // namespace xquery

// A set that only grows: keys in a list in order of arrival, and a table of slots that say which
// key is where.
//
//   _keys    key 0 | key 1 | key 2 | ...
//   _slots   [ mark of a hash, number of its key ] or [ free ], a power of two of them
//
// A key is looked for from the slot that its mark names onward. The slots are at most half full, so
// with hashes that spread only a few are looked at, mostly in one line of memory; and since they
// keep their marks, neither doubling the table nor passing a key of another hash touches a key.
//
// Keys whose hashes were made to meet would turn every look into a walk past all of them. A key
// that finds no free slot within `longestWalk` goes into an ordered set instead, so that the worst
// keys cost a logarithm.
//
// A table of millions takes long to double and to visit, so that the evaluation may end in between.
// A set that it ended in is good for nothing but being destroyed.
#pragma once

#include "Platform/Base/WorkMeter.h"
#include "xquery/Object.h"

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <set>
#include <utility>
#include <vector>

namespace xquery {

// `Less` is an order in which only equal keys are neither less nor greater.
template <class Key, class Hash, class Equal, class Less>
class FlatSet {
 public:
  bool empty() const { return _keys.empty(); }

  bool contains(const Key& key) const {
    return !_keys.empty() && (isKey(walk(key, markOf(key))) || isCrowded(key));
  }

  // False when an equal key is there already.
  bool insert(Key key) {
    if (_keys.size() >= _slots.size() / 2) grow();
    const uint32_t mark = markOf(key);
    const size_t at = walk(key, mark);
    if (isKey(at) || isCrowded(key)) return false;
    if (at == nowhere) {
      _crowded.insert(std::move(key));
    } else {
      _keys.push_back(std::move(key));
      _slots[at] = {mark, static_cast<uint32_t>(_keys.size())};
    }
    return true;
  }

  // In the order of insertion, but for those in the ordered set.
  template <class Work>
  void forEach(Work work) const {
    WorkPacer pacer;
    const auto paced = [&](const Key& key) {
      pacer.turn();
      work(key);
    };
    for (const Key& key : _keys) paced(key);
    for (const Key& key : _crowded) paced(key);
  }

 private:
  template <class T>
  using Vector = std::vector<T, ValueAllocator<T>>;

  static constexpr size_t smallestTable = 16;
  static constexpr size_t longestWalk = 128;
  static constexpr size_t nowhere = SIZE_MAX;

  struct Slot {
    uint32_t mark = 0;
    uint32_t number = 0;  // of a key, from 1; 0 for a free slot
  };

  // Hashes may differ in any of their bits only, so they are mixed; but not the lowest four, which
  // keeps the slots of neighbours, such as the numbers of a range, in one line of memory.
  static uint32_t markOf(const Key& key) {
    const uint64_t hash = Hash()(key);
    uint64_t line = hash >> 4;
    line = (line ^ (line >> 32)) * 0x9E3779B97F4A7C15ULL;
    return static_cast<uint32_t>((line >> 36 << 4) | (hash & 15));
  }
  size_t slotOf(uint32_t mark) const { return mark & (_slots.size() - 1); }
  size_t after(size_t at) const { return (at + 1) & (_slots.size() - 1); }

  bool isKey(size_t at) const { return at != nowhere && _slots[at].number != 0; }
  bool isCrowded(const Key& key) const { return !_crowded.empty() && _crowded.contains(key); }

  // The slot of the key, or the free one where it belongs, or nowhere.
  size_t walk(const Key& key, uint32_t mark) const {
    size_t at = slotOf(mark);
    for (size_t steps = 0; steps < longestWalk; ++steps, at = after(at)) {
      const Slot& slot = _slots[at];
      if (slot.number == 0) return at;
      if (slot.mark == mark && Equal()(_keys[slot.number - 1], key)) return at;
    }
    return nowhere;
  }

  // A key that would be too far from its slot moves into the ordered set. Its place in the list
  // stays, behind no slot.
  void grow() {
    Vector<Slot> slots(std::max(smallestTable, _slots.size() * 2));
    _slots.swap(slots);
    WorkPacer pacer;
    for (const Slot& slot : slots) {
      pacer.turn();
      if (slot.number != 0) place(slot);
    }
  }
  void place(const Slot& slot) {
    size_t at = slotOf(slot.mark);
    for (size_t steps = 0; steps < longestWalk; ++steps, at = after(at)) {
      if (_slots[at].number == 0) {
        _slots[at] = slot;
        return;
      }
    }
    _crowded.insert(_keys[slot.number - 1]);
  }

  Vector<Key> _keys;
  Vector<Slot> _slots;
  std::set<Key, Less, ValueAllocator<Key>> _crowded;
};

}  // namespace xquery

// A set of objects by identity: open addressing over pointers, nothing retained.
#pragma once

#include "Platform/Base/WorkMeter.h"
#include "xquery/Object.h"

#include <cstdint>
#include <vector>

namespace xquery {

class XQueryIdentitySet {
 public:
  // Whether the object was not in the set before.
  bool insert(const NSObject* object) {
    if (2 * (_count + 1) > _slots.size()) grow();
    const size_t index = indexFor(object);
    if (_slots[index]) return false;
    _slots[index] = object;
    ++_count;
    return true;
  }
  bool contains(const NSObject* object) const {
    return !_slots.empty() && _slots[indexFor(object)];
  }
  bool isEmpty() const { return _count == 0; }

 private:
  static constexpr size_t smallestSize = 16;

  // The slot that holds the object, or the free one where it belongs. At most half of the slots are
  // in use, so the search ends.
  size_t indexFor(const NSObject* object) const {
    const size_t mask = _slots.size() - 1;
    // The multiplier spreads the upper bits of addresses that differ by small multiples of 8.
    const uint64_t spread = reinterpret_cast<uintptr_t>(object) * 0x9E3779B97F4A7C15U;
    size_t index = static_cast<size_t>(spread >> 32) & mask;
    while (_slots[index] && _slots[index] != object) index = (index + 1) & mask;
    return index;
  }
  void grow() {
    std::vector<const NSObject*> old(_slots.empty() ? smallestSize : 2 * _slots.size());
    old.swap(_slots);
    WorkPacer pacer;
    for (const NSObject* object : old) {
      pacer.turn();
      if (object) _slots[indexFor(object)] = object;
    }
  }

  std::vector<const NSObject*> _slots;
  size_t _count = 0;
};

}  // namespace xquery

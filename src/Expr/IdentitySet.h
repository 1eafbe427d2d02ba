// A set of objects by identity: open addressing over pointers, nothing retained.
#pragma once

#include "xquery/Object.h"

#include <cstdint>
#include <vector>

namespace xquery {

class XQueryIdentitySet {
 public:
  // Whether the object was not in the set before.
  bool insert(const NSObject* object) {
    if (2 * (_count + 1) > _slots.size()) grow();
    const NSObject** slot = slotFor(object);
    if (*slot) return false;
    *slot = object;
    ++_count;
    return true;
  }

 private:
  static constexpr size_t smallestSize = 16;

  // At most half of the slots are in use, so the search ends.
  const NSObject** slotFor(const NSObject* object) {
    const size_t mask = _slots.size() - 1;
    // The multiplier spreads the upper bits of addresses that differ by small multiples of 8.
    const uint64_t spread = reinterpret_cast<uintptr_t>(object) * 0x9E3779B97F4A7C15U;
    size_t index = static_cast<size_t>(spread >> 32) & mask;
    while (_slots[index] && _slots[index] != object) index = (index + 1) & mask;
    return &_slots[index];
  }
  void grow() {
    std::vector<const NSObject*> old(_slots.empty() ? smallestSize : 2 * _slots.size());
    old.swap(_slots);
    for (const NSObject* object : old) {
      if (object) *slotFor(object) = object;
    }
  }

  std::vector<const NSObject*> _slots;
  size_t _count = 0;
};

}  // namespace xquery

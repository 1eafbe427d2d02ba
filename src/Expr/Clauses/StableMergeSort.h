// A stable sort that is safe with any relation: where the relation contradicts itself (nodes of
// several trees, keys of unlike types) the result is some permutation, and nothing outside the
// array is ever touched. The standard library promises that only for consistent relations.
#pragma once

#include "Platform/Base/WorkMeter.h"

#include <algorithm>
#include <utility>
#include <vector>

namespace xquery {

// Sorts so that no element stands after one that it is `before`, as far as the relation allows.
// Elements of which neither is before the other keep their order.
template <class T, class Before>
void stableMergeSort(std::vector<T>& items, Before before) {
  // What is compared lies anywhere in memory, so that a step is fewer turns than usual.
  constexpr size_t turnsPerStep = 32;
  std::vector<T> merged(items.size());
  for (size_t width = 1; width < items.size(); width *= 2) {
    for (size_t start = 0; start < items.size(); start += 2 * width) {
      const size_t middle = std::min(start + width, items.size());
      const size_t end = std::min(start + 2 * width, items.size());
      size_t left = start, right = middle;
      for (size_t out = start; out < end; ++out) {
        if (out % turnsPerStep == 0) checkWork();
        const bool takeRight = left == middle || (right < end && before(items[right], items[left]));
        merged[out] = std::move(items[takeRight ? right++ : left++]);
      }
    }
    items.swap(merged);
  }
}

}  // namespace xquery

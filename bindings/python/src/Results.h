// Results as sequences of Python.
#pragma once

#include "Module.h"

namespace xquery::python {

// xquery.Result: the items of a sequence, or some of them at equal distances. An item becomes an
// object of Python when it is asked for, each time anew.
struct Result {
  Ref<NSArray> items;
  size_t first = 0;
  size_t count = 0;
  ptrdiff_t step = 1;

  explicit Result(Ref<NSArray> array)
      : items(std::move(array)), count(items ? items->count() : 0) {}
  Result(Ref<NSArray> array, size_t from, size_t howMany, ptrdiff_t by)
      : items(std::move(array)), first(from), count(howMany), step(by) {}

  NSObject* item(size_t index) const {
    return items->objectAtIndex(
        static_cast<size_t>(static_cast<ptrdiff_t>(first) + static_cast<ptrdiff_t>(index) * step));
  }
  // All the items as a value of the library.
  Value value() const;
};

}  // namespace xquery::python

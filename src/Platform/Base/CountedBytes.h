// Memory that no value owns but that is taken for an evaluation, such as a library's: it counts
// while this lives.
#pragma once

#include "Platform/Base/WorkMeter.h"

namespace xquery {

class CountedBytes {
 public:
  explicit CountedBytes(size_t bytes = 0) { set(bytes); }
  ~CountedBytes() { set(0); }
  CountedBytes(const CountedBytes&) = delete;
  CountedBytes& operator=(const CountedBytes&) = delete;

  // More of them. Throws std::bad_alloc, counting nothing, for a large block that would exceed what
  // the evaluation may take.
  void add(size_t bytes) {
    countValueBlock(bytes);
    _bytes += bytes;
  }
  // So many they are now. Whether that is too many shows at the next look.
  void set(size_t bytes) {
    uncountValueBytes(_bytes);
    countValueBytes(bytes);
    _bytes = bytes;
  }

 private:
  size_t _bytes = 0;
};

}  // namespace xquery

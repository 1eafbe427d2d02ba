// Bytes that come piece by piece, until they are all there.
//
// They count as memory of the evaluation while they are gathered. A text that doubles its room
// whenever it is full takes three times what is in it for a moment; here room is added in chunks,
// and what is taken out at the end is moved there chunk by chunk.
#pragma once

#include "Platform/Base/CountedBytes.h"

#include <cstddef>
#include <string>
#include <string_view>
#include <vector>

namespace xquery {

class GatheredBytes {
 public:
  // That many are expected; any number may come.
  explicit GatheredBytes(size_t expected = 0) : _expected(expected) {}
  size_t size() const { return _size; }
  // Throws std::bad_alloc where a limit of the evaluation does not allow it.
  void append(std::string_view bytes);
  // All of them, which count no longer.
  std::string take();

 private:
  void addChunk();

  const size_t _expected;
  size_t _size = 0;
  std::vector<std::string> _chunks;  // none ever grows
  CountedBytes _counted;
};

}  // namespace xquery

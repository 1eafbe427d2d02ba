// Text that is kept as it arrives, to be read again from its beginning. It counts as memory of
// values.
#pragma once

#include "Platform/Text/Blocks.h"

#include <string_view>
#include <vector>

namespace xquery {

class KeptText {
 public:
  void append(std::string_view bytes);
  // The next to be read is the first byte.
  void rewind() { _piece = _at = 0; }
  // Answers how many bytes there were; 0 where all has been read.
  size_t read(char* buffer, size_t size);

 private:
  std::vector<ValueText<char>> _pieces;  // none ever moves
  size_t _piece = 0;
  size_t _at = 0;
};

}  // namespace xquery

#include "Platform/Reading/MarkedText.h"

#include "Platform/Base/WorkMeter.h"

#include <algorithm>
#include <cstring>

namespace xquery {

void MarkedText::markFrom(const char* at) {
  // What is read takes several times as long as marking it.
  constexpr size_t bytesPerStep = 2048;
  const size_t count = std::min(static_cast<size_t>(_end - at), marksPerBlock * bytesPerMarks);
  checkWork(1 + count / bytesPerStep);
  _block = at;
  _blockEnd = at + count;
  const size_t whole = count / bytesPerMarks;
  const size_t rest = count % bytesPerMarks;
  markBytes(at, whole, _marks.data());
  ByteMarks* last = &_marks[whole];
  *last = {};
  if (rest) {
    // Nothing behind the text may be read.
    char bytes[bytesPerMarks] = {};
    std::memcpy(bytes, at + whole * bytesPerMarks, rest);
    markBytes(bytes, 1, last);
    last->wide &= ~(~uint64_t{0} << rest);
  }
  const uint64_t behind = ~uint64_t{0} << rest;
  last->text |= behind;
  last->value |= behind;
  last->name |= behind;
}

}  // namespace xquery

// What is compiled several times, for processors with different vectors.
#pragma once

#include "Platform/Reading/ByteMarks.h"
#include "Platform/Reading/Widening.h"

#include <vector>

namespace xquery {

struct VectorCode {
  const char* target;
  void (*mark)(const char* bytes, size_t count, ByteMarks* marks);
  Widened (*widen)(std::string_view bytes, char16_t* units);
};

// All that this processor can run, the best first, which is what `markBytes` and `widenSome` do:
// for tests, that what other processors run is right as well.
std::vector<VectorCode> vectorCodes();

}  // namespace xquery

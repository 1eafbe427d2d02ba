// The reader of this room takes what it fully understands, and leaves the rest to libxml2, which
// reads or refuses it: whatever breaks a rule, and what is rare. So nothing of it has to say what
// is wrong, and where.
#pragma once

#include <cstddef>

namespace xquery {

// Thrown wherever that shows; all work is dropped.
struct NotTaken {};

inline void take(bool isUnderstood) {
  if (!isUnderstood) [[unlikely]] {
    throw NotTaken();
  }
}

// Of a name, of a namespace and of any other piece of a document: libxml2 has bounds of its own
// beyond these.
constexpr size_t longestNameTaken = 10'000;
constexpr size_t longestURITaken = size_t{1} << 20;
constexpr size_t longestPieceTaken = size_t{512} << 20;

}  // namespace xquery

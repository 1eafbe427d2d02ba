#include "Platform/Reading/AttributeSet.h"

#include "Platform/Base/KeyedHash.h"

#include <bit>

namespace xquery {

void AttributeSet::start(size_t most) {
  _count = 0;
  _isTable = most > longestList;
  if (_isTable) _places.assign(std::bit_ceil(2 * most), nullptr);
}

bool AttributeSet::insertIntoTable(const void* name) {
  const size_t mask = _places.size() - 1;
  size_t place = keyedHash(reinterpret_cast<uintptr_t>(name)) & mask;
  for (; _places[place]; place = (place + 1) & mask) {
    if (_places[place] == name) return false;
  }
  _places[place] = name;
  return true;
}

}  // namespace xquery

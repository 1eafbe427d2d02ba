// The names of the attributes of one tag, which must be distinct, by where they are interned. Few
// are compared with each other, many are looked up in a table.
#pragma once

#include "xquery/Object.h"

#include <cstddef>
#include <vector>

namespace xquery {

class AttributeSet {
 public:
  // For a tag of so many names at most.
  void start(size_t most);
  // Whether it was not there yet.
  bool insert(const void* name) { return _isTable ? insertIntoTable(name) : insertIntoList(name); }

 private:
  bool insertIntoList(const void* name) {
    for (size_t index = 0; index < _count; ++index) {
      if (_list[index] == name) return false;
    }
    _list[_count++] = name;
    return true;
  }
  bool insertIntoTable(const void* name);

  static constexpr size_t longestList = 16;
  const void* _list[longestList];
  size_t _count = 0;
  bool _isTable = false;
  std::vector<const void*, ValueAllocator<const void*>> _places;
};

}  // namespace xquery

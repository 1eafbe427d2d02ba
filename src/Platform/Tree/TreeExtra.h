// The names that a tree holds, one count each, and what only a large tree needs.
//
// A query may construct very many elements, each a tree of its own, with a name or a few: one name
// is kept in the tree itself, a few in a block of the object allocator, and more in the extra part.
#pragma once

#include "Platform/Base/WorkMeter.h"
#include "Platform/Tree/Arena.h"
#include "Platform/Tree/Names.h"

#include <cstddef>
#include <cstdint>
#include <vector>

namespace xquery {

struct NSXMLNameList {
  // Lists have room for 3, 7 or 15 names: blocks of 32, 64 and 128 bytes.
  static constexpr uint32_t shortest = 3;
  static constexpr uint32_t longest = 15;

  uint32_t count;
  uint32_t capacity;

  const NSXMLName** begin() { return reinterpret_cast<const NSXMLName**>(this + 1); }
  const NSXMLName** end() { return begin() + count; }
  bool contains(const NSXMLName* name);

  [[nodiscard]] static NSXMLNameList* create(uint32_t capacity);
  static void destroy(NSXMLNameList* list);
};

struct NSXMLTreeExtra {
  NSXMLTreeExtra() = default;
  ~NSXMLTreeExtra() { uncountValueBytes(_nameBytes); }
  NSXMLTreeExtra(const NSXMLTreeExtra&) = delete;
  NSXMLTreeExtra& operator=(const NSXMLTreeExtra&) = delete;

  // One that is not there yet. A tree of very many names mostly is the only one that has them, so
  // that they count like its nodes.
  void insert(const NSXMLName* name);

  NSXMLNameSet names;
  std::vector<NSXMLDocument*> documents;  // those with a URI

 private:
  size_t _nameBytes = 0;
};

inline NSXMLTreeExtra* NSXMLTree::extra() const {
  return (_extra & tagBits) ? nullptr : reinterpret_cast<NSXMLTreeExtra*>(_extra);
}

inline const NSXMLName* NSXMLTree::singleName() const {
  return (_extra & tagBits) == nameTag ? reinterpret_cast<const NSXMLName*>(_extra & ~tagBits)
                                       : nullptr;
}

inline NSXMLNameList* NSXMLTree::nameList() const {
  return (_extra & tagBits) == listTag ? reinterpret_cast<NSXMLNameList*>(_extra & ~tagBits)
                                       : nullptr;
}

template <class Function>
void NSXMLTree::forEachName(Function function) const {
  if (const NSXMLName* name = singleName()) {
    function(name);
  } else if (NSXMLNameList* list = nameList()) {
    for (const NSXMLName* each : *list) function(each);
  } else if (const NSXMLTreeExtra* present = extra()) {
    present->names.forEach(function);
  }
}

}  // namespace xquery

// The names that no node of a tree has two children of, as "name" and "address" below a person: who
// looks for the children of such a name has all of them with the first one, and need not go on to
// the siblings behind it, each of which lies somewhere else in memory.
//
// Known of documents that are read, since it takes one comparison an element there. The children of
// a name are met in document order, and so are, mostly, their parents:
//
//   <a>1 <b>2/> <b>3/> </a>                  the second b has the parent of the first: not single
//   <a>1 <b>2/> </a> <a>3 <b>4/> </a>        parents 1 and 3: single
//   <a>1 <a>2 <b>3/> </a> <b>4/> </a>        parents 2 and 1: taken for one that is not single
//
// As long as the parents of a name come in ascending order, each is another one. So nothing has to
// be remembered for an element, and what is said to be single always is.
#pragma once

#include "Platform/Tree/NodeSpan.h"
#include "Platform/Tree/TreeHead.h"
#include "xquery/XMLNode.h"

#include <cstddef>
#include <cstdint>
#include <memory>

namespace xquery {

// Never changes. Of the tree as it was: whoever asks sees to it that it has not changed.
class NSXMLSingleNames {
 public:
  bool contains(const NSXMLExpandedName* name) const {
    size_t place = placeOf(name) & (_table.size() - 1);
    while (_table[place] && _table[place] != name) place = (place + 1) & (_table.size() - 1);
    return _table[place] != nullptr;
  }

 private:
  friend class NSXMLSingleNamesMaker;
  explicit NSXMLSingleNames(size_t size) : _table(size) {}
  static size_t placeOf(const NSXMLExpandedName* name) {
    constexpr uint64_t mix = 0x9E3779B97F4A7C15;
    return (reinterpret_cast<uintptr_t>(name) >> 3) * mix >> 32;
  }

  // 2^n places, at most half of them taken. The tree holds the names.
  NSXMLIndexList<const NSXMLExpandedName*> _table;
};

// Told of the elements of a tree while it is built.
class NSXMLSingleNamesMaker {
 public:
  // Documents have few names, and in those that have more the first ones are told apart.
  static constexpr size_t mostNames = 256;

  // An element of the name begins below the parent, whose number is good.
  void add(const NSXMLExpandedName* name, const NSXMLNode& parent) {
    const uint32_t number = NSXMLNodeOrder::number(parent);
    size_t place = NSXMLSingleNames::placeOf(name) & (_table.size() - 1);
    while (_table[place].name != name) {
      if (!_table[place].name) return addName(place, name, number);
      place = (place + 1) & (_table.size() - 1);
    }
    Name& known = _table[place];
    if (number <= known.lastParent) known.isSingle = false;
    known.lastParent = number;
  }
  // Null for none.
  [[nodiscard]] std::unique_ptr<const NSXMLSingleNames> names() const;

 private:
  struct Name {
    const NSXMLExpandedName* name = nullptr;
    uint32_t lastParent = 0;
    bool isSingle = true;
  };
  static constexpr size_t smallestTable = 32;

  void addName(size_t place, const NSXMLExpandedName* name, uint32_t parent);

  NSXMLIndexList<Name> _table{smallestTable};
  size_t _count = 0;
};

}  // namespace xquery

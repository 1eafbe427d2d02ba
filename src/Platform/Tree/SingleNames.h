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
// be remembered for an element, and what is said to be single always is (ElementLog.h looks).
#pragma once

#include "Platform/Tree/NodeSpan.h"
#include "xquery/XMLNode.h"

#include <cstddef>
#include <cstdint>
#include <memory>

namespace xquery {

// So are two ways to write one name taken for one that is not single.
//
// Never changes. Of the tree as it was: whoever asks sees to it that it has not changed.
class NSXMLSingleNames {
 public:
  // A name as it is written in one way, and whether it is single as far as that goes.
  struct Candidate {
    const NSXMLExpandedName* name = nullptr;
    bool isSingle = false;
  };
  using Candidates = NSXMLIndexList<Candidate>;
  // Null for none.
  [[nodiscard]] static std::unique_ptr<const NSXMLSingleNames> ofThose(
      const Candidates& candidates);

  bool contains(const NSXMLExpandedName* name) const {
    size_t place = placeOf(name) & (_table.size() - 1);
    while (_table[place] && _table[place] != name) place = (place + 1) & (_table.size() - 1);
    return _table[place] != nullptr;
  }

 private:
  explicit NSXMLSingleNames(size_t size) : _table(size) {}
  static size_t placeOf(const NSXMLExpandedName* name) {
    constexpr uint64_t mix = 0x9E3779B97F4A7C15;
    return (reinterpret_cast<uintptr_t>(name) >> 3) * mix >> 32;
  }

  // 2^n places, at most half of them taken. The tree holds the names.
  NSXMLIndexList<const NSXMLExpandedName*> _table;
};

}  // namespace xquery

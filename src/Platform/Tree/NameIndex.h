// The elements of a tree, or its attributes, by expanded name, each name's in document order.
//
//   table   name -> end of its nodes, which begin where those of the name before it end
//   nodes   a a a a b b c c c ...       one array, name by name
//
// An index is made in one pass and never changes. It is of the tree as it was: whoever uses it sees
// to it that the tree has not changed (TreeIndexes.h). The pass looks at limits; one that is ended
// leaves nothing behind.
//
// All names are indexed at once: the pass costs little more than a walk for one of them, and a name
// that the tree does not have is known to be missing without an entry of its own.
#pragma once

#include "Platform/Tree/NodeSpan.h"
#include "xquery/XMLNode.h"

#include <cstddef>
#include <cstdint>
#include <memory>

namespace xquery {

// Which names somebody looks for.
class NSXMLNameSelection {
 public:
  // Whether nodes of the expanded name may be among what is looked for.
  virtual bool mayTake(const NSXMLExpandedName& name) const = 0;
  // Whether such a node is. Nodes that are written alike, with the same prefix, are all or none.
  virtual bool takes(const NSXMLNode& node) const = 0;

 protected:
  ~NSXMLNameSelection() = default;
};

class NSXMLNameIndex {
 public:
  // Of everything under the root of a tree whose order numbers are good. Room is made for at most
  // so many nodes at once, and for more as they come.
  [[nodiscard]] static std::unique_ptr<const NSXMLNameIndex> ofElements(const NSXMLNode* root,
                                                                        uint32_t mostNodes = 0);
  [[nodiscard]] static std::unique_ptr<const NSXMLNameIndex> ofAttributes(const NSXMLNode* root,
                                                                          uint32_t mostNodes = 0);
  // What making one takes at most while it is made, for a tree of so many nodes.
  static size_t mostBytes(uint64_t nodes) { return nodes * bytesPerNode; }

  // All nodes of this name.
  NSXMLNodeSpan nodes(const NSXMLExpandedName* name) const;
  // The nodes of several names, from `first` on before `stop` as below, in document order.
  NSXMLNodeList nodes(const NSXMLNameSelection& selection, const NSXMLNode* first,
                      const NSXMLNode* stop) const;
  // How many these are, without looking at them but where nodes of one name are written
  // differently.
  uint64_t count(const NSXMLNameSelection& selection, const NSXMLNode* first,
                 const NSXMLNode* stop) const;
  // Whether the tree of an index of elements has processing instructions, which have names too.
  bool hasInstructions() const { return _hasInstructions; }
  // Of nodes in document order those from `first` on that come before `stop`, which is null for the
  // end of the tree. The attributes of a node come after it and before its children.
  static NSXMLNodeSpan between(NSXMLNodeSpan nodes, const NSXMLNode* first, const NSXMLNode* stop);
  // Those inside a node: descendants, or attributes of its own and of its descendants.
  static NSXMLNodeSpan inside(NSXMLNodeSpan nodes, const NSXMLNode* node);

 private:
  class Maker;
  struct Name {
    const NSXMLExpandedName* name = nullptr;  // the tree holds it
    const NSXMLName* writtenAs = nullptr;     // by all of its nodes; null where they differ
    uint32_t begin = 0;
    uint32_t end = 0;
  };
  // The list of nodes and that of their names, and the result.
  static constexpr size_t bytesPerNode = 2 * sizeof(NSXMLNodePlace) + sizeof(uint32_t);

  NSXMLNameIndex() = default;
  // The nodes of a name from `first` on before `stop`, of which `isSure` tells whether all are
  // among those of the selection; where not, each has to be asked. Empty for none.
  struct Part {
    NSXMLNodeSpan nodes;
    bool isSure = false;
  };
  Part partOf(const Name& name, const NSXMLNameSelection& selection, const NSXMLNode* first,
              const NSXMLNode* stop) const;
  // The name's own place, or the empty one where it belongs.
  static size_t placeOf(const NSXMLIndexList<Name>& table, const NSXMLExpandedName* name);

  NSXMLIndexList<Name> _table;  // 2^n places, at most half of them taken
  NSXMLNodeList _nodes;
  bool _hasInstructions = false;
};

}  // namespace xquery

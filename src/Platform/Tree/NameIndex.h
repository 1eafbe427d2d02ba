// The elements of a tree, or its attributes, by expanded name, each name's in document order.
//
//   table   name -> end of its nodes, which begin where those of the name before it end
//   nodes   a a a a b b c c c ...       one array, name by name
//   ways    of elements: the names from the top down to some of them, as a tree of names, with
//           their number; documents have few, as many as there are sorts of things in them
//
//             site -+- regions -+- africa --- item (55) -+- name (55)
//                   |           +- asia ----- item (200) ...
//                   +- people --- person (2550) ...
//
// So how many elements the steps of a path from the document find is known without looking at any
// of them, and where all elements of a name lie on the ways of a path these are what it finds. None
// are kept where there are very many, or so many that they would take more memory than the nodes.
// The descendant axis of the last child of a last child goes on behind its subtree
// (Tree/Arena.h, descendantStop): what it finds is not told by the ways.
//
// An index is made in one pass and never changes, but that the ways may be added later. It is of
// the tree as it was: whoever uses it sees to it that the tree has not changed (TreeIndexes.h). The
// pass looks at limits; one that is ended leaves nothing behind.
//
// Of a tree that was read the elements are on record (ElementLog.h): the names are put in order
// from that in a fifth of the time that a walk takes, and the ways, which not everybody asks for,
// in half of it.
//
// All names are indexed at once: the pass costs little more than a walk for one of them, and a name
// that the tree does not have is known to be missing without an entry of its own.
#pragma once

#include "Platform/Tree/NodeSpan.h"
#include "xquery/XMLNode.h"

#include <atomic>
#include <cstddef>
#include <cstdint>
#include <memory>
#include <optional>
#include <span>

namespace xquery {

class NSXMLElementLog;

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

// A step from elements, or from the document, down to elements.
struct NSXMLWayStep {
  bool isDeep = false;                            // to descendants, not to children alone
  const NSXMLExpandedName* name = nullptr;        // that they have, or
  const NSXMLNameSelection* selection = nullptr;  // one of several; with neither, any
};

class NSXMLNameIndex {
 public:
  static constexpr size_t mostWays = 4096;

  // Of everything under the root of a tree whose order numbers are good. Room is made for at most
  // so many nodes at once, and for more as they come.
  [[nodiscard]] static std::unique_ptr<const NSXMLNameIndex> ofElements(const NSXMLNode* root,
                                                                        uint32_t mostNodes = 0);
  [[nodiscard]] static std::unique_ptr<const NSXMLNameIndex> ofAttributes(const NSXMLNode* root,
                                                                          uint32_t mostNodes = 0);
  // The same from the record of a tree of whose nodes one is given, but without the ways.
  [[nodiscard]] static std::unique_ptr<const NSXMLNameIndex> ofElements(const NSXMLElementLog& log,
                                                                        const NSXMLNode* node);
  // Adds them, once; nobody else does so meanwhile, though others may ask.
  void addWays(const NSXMLElementLog& log) const;
  bool asksForWays() const { return !_ways.load(std::memory_order_acquire); }
  ~NSXMLNameIndex() { delete _ways.load(std::memory_order_relaxed); }
  NSXMLNameIndex(const NSXMLNameIndex&) = delete;
  NSXMLNameIndex& operator=(const NSXMLNameIndex&) = delete;
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
  // How many elements the steps find from the document at the root, each counted once; none where
  // the ways are not known, or do not tell.
  std::optional<uint64_t> countAlong(std::span<const NSXMLWayStep> steps) const;
  // On which ways these lie, by numbers in ascending order; and how many elements lie on some ways.
  using Ways = NSXMLIndexList<uint32_t>;
  std::optional<Ways> along(std::span<const NSXMLWayStep> steps) const;
  uint64_t countOn(const Ways& ways) const;
  // These, where the last step asks for a name, all of whose elements they are.
  std::optional<NSXMLNodeSpan> nodesAlong(std::span<const NSXMLWayStep> steps) const;
  // Whether the tree of an index of elements has processing instructions, which have names too.
  bool hasInstructions() const { return _hasInstructions; }
  // Of nodes in document order those from `first` on that come before `stop`, which is null for the
  // end of the tree. The attributes of a node come after it and before its children.
  static NSXMLNodeSpan between(NSXMLNodeSpan nodes, const NSXMLNode* first, const NSXMLNode* stop);
  // Those inside a node: descendants, or attributes of its own and of its descendants.
  static NSXMLNodeSpan inside(NSXMLNodeSpan nodes, const NSXMLNode* node);

 private:
  class WayMaker;
  class Maker;
  class LoggedWays;
  struct Name {
    const NSXMLExpandedName* name = nullptr;  // the tree holds it
    const NSXMLName* writtenAs = nullptr;     // by all of its nodes; null where they differ
    uint32_t begin = 0;
    uint32_t end = 0;
  };
  // A way that some elements lie on, or, the first one, the place above the topmost.
  struct Way {
    const NSXMLName* name = nullptr;  // as it is written
    const NSXMLNode* first = nullptr;
    uint32_t above = 0;
    uint32_t count = 0;
    uint32_t below = 0;  // the last one of those that are longer by a name; 0 for none
    uint32_t next = 0;   // another one of the same length
    // Whether the descendant axis of some of them does, behind their subtrees. What is not known is
    // found out by who asks first; several may.
    enum : uint8_t { RunsNot, Runs, MayRun };
    mutable uint8_t runsOn = RunsNot;
  };
  using WayList = NSXMLIndexList<Way>;
  static void addBelow(const WayList& known, uint32_t way, const NSXMLWayStep& step, Ways& found);
  static uint32_t behind(const WayList& known, uint32_t way, uint32_t top, bool isDeep);
  bool runsOn(const Way& way) const;
  static bool anyRunsOn(NSXMLNodeSpan elements);
  std::optional<Ways> waysAlong(std::span<const NSXMLWayStep> steps) const;

  // The list of nodes and that of their ways, and the result.
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
  // The table of the names that have nodes, each with its number for `begin` and how many it has
  // for `end`; `numberOf` takes the numbers of all that are asked for. `written(i)` and `count(i)`
  // tell of each of them from the second on.
  template <class Written, class Count>
  static NSXMLIndexList<Name> tableOf(size_t size, Written written, Count count,
                                      NSXMLIndexList<uint32_t>& numberOf);
  // Puts these names' nodes one behind the other. Answers where each begins, by number.
  static NSXMLIndexList<uint32_t> placeNames(NSXMLIndexList<Name>& table);
  static void growTable(NSXMLIndexList<Name>& table);
  // The name's own place, or the empty one where it belongs.
  static size_t placeOf(const NSXMLIndexList<Name>& table, const NSXMLExpandedName* name);

  NSXMLIndexList<Name> _table;  // 2^n places, at most half of them taken
  NSXMLNodeList _nodes;
  mutable std::atomic<const WayList*> _ways = nullptr;  // an empty list where they are of no use
  bool _hasInstructions = false;
};

}  // namespace xquery

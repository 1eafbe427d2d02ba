// Which parts of a document are records, while its tree is built: whoever builds it asks after each
// piece. Outside of records every piece but the open elements is dropped at once, so that a record
// stands alone below the elements that it is in.
#pragma once

#include "Platform/Reading/ReadTree.h"
#include "Platform/Reading/XMLRecords.h"

#include <cstddef>
#include <cstdint>
#include <span>
#include <vector>

namespace xquery {

class XMLRecordFilter {
 public:
  // Of a tree that is a document without children yet.
  XMLRecordFilter(ReadTree& tree, std::span<const XMLRecordPath> paths);

  // After a piece: how many elements were open before it, and are now. The record, if it is
  // complete by that; it must be dropped before the next piece.
  const NSXMLElement* look(size_t depthBefore, size_t depth) {
    if (_recordDepth == 0) return lookOutside(depthBefore, depth);
    return depth < _recordDepth ? completeRecord() : nullptr;
  }
  void dropRecord() {
    _tree.backTo(_levels.back().mark);
    _elementsKept = elementsAbove();
  }
  // Of the elements above a record that is complete: how many were above the record before it too.
  size_t elementsKept() const { return _elementsKept; }

 private:
  // Of the document and each open element outside of records: where to go back to, and how many
  // steps of each path lead there, as bits.
  struct Level {
    NSXMLTreeBuilder::Mark mark;
    uint64_t matched;
  };

  const NSXMLElement* lookOutside(size_t depthBefore, size_t depth);
  const NSXMLElement* completeRecord();
  uint64_t enter(const NSXMLElement* element) const;
  void leave();
  size_t elementsAbove() const { return _levels.size() - 1; }

  ReadTree& _tree;
  // The steps of all paths, one behind the other. Each path has a place behind its last one, whose
  // bit stands for a record.
  std::vector<XMLRecordStep> _steps;
  uint64_t _ends = 0;
  std::vector<Level, ValueAllocator<Level>> _levels;
  size_t _recordDepth = 0;  // of the record that is being read; 0 outside
  size_t _elementsKept = 0;
};

}  // namespace xquery

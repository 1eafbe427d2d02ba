// The head of a tree, by which its nodes find it, and the order of nodes, which is asked for more
// often than anything else of a tree.
#pragma once

#include "xquery/XMLNode.h"

#include <cstdint>

namespace xquery {

// The head of a tree; the rest of it is the library's own.
struct NSXMLTreeHead {
  enum Order : uint8_t {
    Fresh,         // one root, and all numbers are good
    Stale,         // one root, numbers to be assigned anew
    SeveralRoots,  // each root's own number tells whether the numbers under it are good
  };
  uint32_t references = 0;
  uint8_t order = Fresh;
};

// The head of a piece of an arena.
struct NSXMLBlock {
  NSXMLTreeHead* tree;
  NSXMLLink<NSXMLBlock> next;
  uint32_t roomUnits;  // behind the head, in units of 8 bytes
};

static_assert(sizeof(NSXMLBlock) == 16);

// The document order of nodes as numbers.
struct NSXMLNodeOrder {
  // Whether both nodes hang under one root and that root's order numbers can be compared directly.
  static bool areComparable(const NSXMLNode* a, const NSXMLNode* b) {
    const NSXMLTreeHead* tree = a->block()->tree;
    if (tree != b->block()->tree) return false;
    if (__atomic_load_n(&tree->order, __ATOMIC_ACQUIRE) == NSXMLTreeHead::Fresh) return true;
    return makeComparable(a, b);
  }
  // Meaningful between nodes for which areComparable answered true.
  static uint32_t number(const NSXMLNode& node) { return node._word; }

 private:
  static bool makeComparable(const NSXMLNode* a, const NSXMLNode* b);
};

}  // namespace xquery

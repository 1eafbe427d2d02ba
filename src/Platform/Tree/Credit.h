// References to trees and names that a thread takes in advance.
//
// A tree has one counter for the references to all its nodes, and a name one for the trees that use
// it. A query over a document counts at every step, and two threads with one document, or with one
// query that constructs elements, would move the counter between their processors each time. While
// a thread evaluates it therefore takes many references at once, its credit, and single references
// out of it and back into it; the counter itself is touched once in many thousand times.
//
//   counter = references that somebody holds + the credit of all threads
//
// So the counter is never too low, whichever thread gives back what another one took, and what it
// counts is not freed before every credit is given back, which the end of the evaluation does. Only
// what lives as long anyway is worth a credit: the trees that the evaluation begins with, and names
// that a tree of them or the query holds. In a process of one thread the trees are counted plainly.
#pragma once

#include "xquery/XMLNode.h"

#include <array>
#include <cstdint>
#include <optional>

namespace xquery {

class NSXMLTree;

// The time in which the calling thread takes credit. Times may nest; a tree's credit is given back
// at the end of the time in which it was taken, a name's at the end of the outermost.
class NSXMLCredit {
 public:
  NSXMLCredit();
  ~NSXMLCredit();
  NSXMLCredit(const NSXMLCredit&) = delete;
  NSXMLCredit& operator=(const NSXMLCredit&) = delete;

  static bool isUnderWay() { return credits != nullptr; }
  // For the tree of the node, unless there is no such time or no room for another tree.
  static void take(const NSXMLNode* node);

  // --- for trees and names ----------------------------------------------------------------------
  // Whether a reference was taken from the thread's credit, or given back to it.
  static bool retain(NSXMLTree* tree) {
    Tree* known = creditOf(tree);
    if (!known) return false;
    if (known->left == 0) refill(*known);
    --known->left;
    return true;
  }
  static bool release(NSXMLTree* tree, uint32_t times) {
    Tree* known = creditOf(tree);
    if (!known) return false;
    known->left += times;
    if (known->left >= 2 * portion) giveBackPortion(*known);
    return true;
  }
  // Before the tree becomes part of another one.
  static void giveBack(NSXMLTree* tree) {
    if (Tree* known = creditOf(tree)) giveBack(*known);
  }
  static bool retain(const NSXMLName* name) {
    Name* known = placeOf(name);
    if (!known) return false;
    if (known->left == 0) refill(*known);
    --known->left;
    return true;
  }
  static bool release(const NSXMLName* name) {
    Name* known = placeOf(name);
    if (!known || known->left == 2 * portion) return false;
    ++known->left;
    return true;
  }

 private:
  // Fits many times into the 31 bits of a counter.
  static constexpr uint32_t portion = 1U << 14;

  struct Tree {
    NSXMLTree* tree = nullptr;
    uint32_t left = 0;
  };
  struct Name {
    const NSXMLName* name = nullptr;
    uint32_t left = 0;
  };
  // Each tree and name has two places where it may be, so that those of a query seldom meet. Others
  // at both mean no credit for the tree, and the one that came first gives way to the name.
  struct Credits {
    std::array<std::array<Tree, 2>, 8> trees;
    std::array<std::array<Name, 2>, 16> names;

    Credits() : trees(), names() {}  // clang must not look for one before the class ends
    std::array<Tree, 2>& placesOf(const NSXMLTree* tree) { return trees[hash(tree) % 8]; }
    std::array<Name, 2>& placesOf(const NSXMLName* name) { return names[hash(name) % 16]; }

   private:
    static uintptr_t hash(const void* address) {
      const auto bits = reinterpret_cast<uintptr_t>(address);
      return bits >> 5 ^ bits >> 9;
    }
  };
  // Those of the outermost time; null outside of any.
  static constinit thread_local Credits* credits __attribute__((tls_model("initial-exec")));

  static Tree* creditOf(const NSXMLTree* tree) {
    if (!credits) return nullptr;
    std::array<Tree, 2>& places = credits->placesOf(tree);
    if (places[0].tree == tree) return &places[0];
    return places[1].tree == tree ? &places[1] : nullptr;
  }
  static void refill(Tree& known);
  static void giveBackPortion(Tree& known);
  static void giveBack(Tree& known);

  static Name* placeOf(const NSXMLName* name) {
    if (!credits) return nullptr;
    std::array<Name, 2>& places = credits->placesOf(name);
    if (places[0].name == name) return &places[0];
    return places[1].name == name ? &places[1] : &placeFor(name);
  }
  static Name& placeFor(const NSXMLName* name);
  static void refill(Name& known);
  static void giveBack(Name& known);

  std::optional<Credits> _own;  // of the outermost time
  uint16_t _treesBefore = 0;    // the places that had credit when this time began, as bits
};

}  // namespace xquery

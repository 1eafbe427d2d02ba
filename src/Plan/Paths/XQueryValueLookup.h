// The nodes of a step by a value that a condition asks of them, as "person[@id = 'p1']",
// "item[description//emph = 'x']" and "*[author/last = $name]" do, from the index of the tree.
//
// What is found are candidates: all nodes, among those that the step would walk to, for which the
// condition can hold. Whoever asks goes on to filter them as if they had been walked to. Where a
// predicate is nothing but "K = P", it holds for all of them, and need not be asked.
//
// Elements of one name have an index of their own (Platform/Tree/ValueIndex.h). Where the step
// takes others as well, what has the value is found first, and the way from there goes up:
//
//   *[author/last = "x"]     last = "x"  ->  author  ->  *
//   //@id[. = "x"]           elements with such an @id  ->  their @id
//
// A condition may hold for one of several values, as "person[@id = $x or name = $y]": then the
// nodes that each finds are put together.
#pragma once

#include "Plan/Paths/XQueryValueWay.h"
#include "Platform/Tree/Names.h"
#include "Platform/Tree/TreeIndexes.h"

#include <vector>

namespace xquery {

class XQueryItemList;
class XQueryStepTest;

class XQueryValueLookup {
 public:
  enum class Of : uint8_t {
    Name,       // elements of one name
    AnyName,    // elements, by a way of children that is not empty
    Attribute,  // attributes of one name, by their own value
  };
  struct Probe {
    // Repeatable, and of the focus it reads the root at most: that above the step's nodes.
    Ref<XQueryExpr> expr;
    // An element without a value meets the empty text.
    bool meetsNoneWhenEmpty = false;
    // Of several values it is enough to equal one; otherwise they are an error.
    bool takesSeveral = false;
    // Whatever it comes to are texts, if it does not fail.
    bool areTexts = false;
  };
  // What the way leads to equals the probe.
  struct Match {
    XQueryValueWay way;
    Probe probe;
  };
  // A condition of more of them is left to walking.
  static constexpr size_t mostMatches = 8;
  // The first predicate that is not part of the test holds for all candidates; or not surely.
  enum class First : uint8_t { Asked, Holds };

  // `name` is that of the elements or attributes, null for any. What has none of the matches does
  // not meet the condition.
  XQueryValueLookup(Of of, const NSXMLExpandedName* name, std::vector<Match> matches, First first);

  // How many predicates need not be asked of candidates.
  size_t answers() const { return _first == First::Holds ? 1 : 0; }
  // Whether what lies below the root of a tree will be found in an index, which is there or is made
  // now, and not walked to.
  bool isReady(const NSXMLNode* root) const;

  // Lists the candidates that the axis, which is child, descendant or, for attributes, "//@a",
  // leads to from the node, in document order; the list is empty before. False, and nothing listed,
  // for: walk.
  bool find(NSXMLNode* node, int axis, XQueryStepTest& test, XQueryContext& context,
            std::vector<NSXMLNode*>& candidates) const;
  // After such a walk: of how many nodes from the node on the predicate was asked.
  void noteAsked(const NSXMLNode* node, size_t nodes) const;

 private:
  // Where the values of a match lie, and those that are looked for there.
  struct KeyedMatch {
    Match match;
    NSXMLValueKey key;
  };
  struct Search {
    const NSXMLNode* first;
    const NSXMLNode* stop;  // null for the end of the tree
    XQueryStepTest& test;
    std::vector<NSXMLNode*>& candidates;
  };

  void addNodesWith(const NSXMLValueIndex& values, const XQueryItemList& probes,
                    const XQueryValueWay& way, const Search& search) const;
  static void climb(NSXMLNodeSpan ends, const XQueryValueWay& way, const Search& search);
  void listAttributes(NSXMLNodeSpan owners, std::vector<NSXMLNode*>& candidates) const;

  const Of _of;
  const NSXMLExpandedNameRef _name;
  std::vector<KeyedMatch> _matches;
  const First _first;
};

}  // namespace xquery

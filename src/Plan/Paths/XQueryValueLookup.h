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
  // The first predicate that is not part of the test holds for all candidates; or not surely.
  enum class First : uint8_t { Asked, Holds };

  // `name` is that of the elements or attributes, null for any.
  XQueryValueLookup(Of of, const NSXMLExpandedName* name, const XQueryValueWay& way, Probe probe,
                    First first);

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
  bool areTexts(const XQueryItemList& probes) const;
  void addNodesWith(const NSXMLValueIndex& values, const XQueryItemList& probes,
                    const NSXMLNode* first, const NSXMLNode* stop, XQueryStepTest& test,
                    std::vector<NSXMLNode*>& candidates) const;
  void climb(NSXMLNodeSpan ends, const NSXMLNode* first, XQueryStepTest& test,
             std::vector<NSXMLNode*>& candidates) const;
  void listAttributes(NSXMLNodeSpan owners, std::vector<NSXMLNode*>& candidates) const;

  const Of _of;
  const NSXMLExpandedNameRef _name;
  const XQueryValueWay _way;
  const NSXMLValueKey _key;
  const Probe _probe;
  const First _first;
};

}  // namespace xquery

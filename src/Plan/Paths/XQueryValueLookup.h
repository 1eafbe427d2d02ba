// The elements of a step by a value that a predicate asks of them, as "person[@id = 'p1']" and
// "book[author/last = $name]" do, from the index of the tree.
//
// What is found are candidates: all elements, among those that the step would walk to, for which
// the comparison can hold. Whoever asks goes on to filter them as if they had been walked to.
#pragma once

#include "Plan/Operators/XQueryShortWalk.h"
#include "Platform/Tree/TreeIndexes.h"

#include <optional>
#include <vector>

namespace xquery {

class XQueryValueLookup {
 public:
  // `walk` leads from an element to the values of `key`, `probe` is what they are compared with. It
  // is repeatable and does not read the focus.
  XQueryValueLookup(NSXMLValueKey key, const XQueryShortWalk& walk, Ref<XQueryExpr> probe)
      : _key(std::move(key)), _walk(walk), _probe(std::move(probe)) {}

  const NSXMLExpandedName* element() const { return _key.element.get(); }
  // Lists the candidates that the axis, which is child or descendant, leads to from the node, in
  // document order; the list is empty before. False, and nothing listed, for: walk.
  bool find(NSXMLNode* node, int axis, XQueryContext& context,
            std::vector<NSXMLNode*>& candidates) const;
  // After such a walk: of how many elements from the node on the predicate was asked.
  void noteAsked(const NSXMLNode* node, size_t elements) const;

 private:
  const NSXMLValueKey _key;
  const XQueryShortWalk _walk;
  const Ref<XQueryExpr> _probe;
};

}  // namespace xquery

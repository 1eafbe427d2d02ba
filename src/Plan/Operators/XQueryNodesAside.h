// Whether a value is equal to something of what stands before or behind a node:
// "$p/name = $p/preceding-sibling::person/name", ". = following::b".
#pragma once

#include "Plan/Operators/XQueryPlannedExpr.h"
#include "Plan/Operators/XQueryShortWalk.h"

#include <cstdint>
#include <memory>
#include <optional>
#include <utility>

namespace xquery {

class XQueryNodesAside : public XQueryPlannedExpr {
 public:
  // The value can be repeated, and may fail only if it is the first operand.
  struct Operands {
    Ref<XQueryExpr> value;  // the other side of the comparison
    Ref<XQueryExpr> nodes;  // holds the path
    // From one node, with a first step to siblings, or to all that precedes or follows, without
    // predicates and with a test that raises nothing.
    const XQueryWalkedPath* path;
    int64_t varID;         // of the variable that the path begins with; 0 for the context item
    XQueryShortWalk walk;  // from such a node to what is compared, of no step for the node itself
  };
  // Whether a path may be one of those as far as its beginning goes.
  static bool isOpenFor(const XQueryWalkedPath& path);

  [[nodiscard]] static Ref<XQueryNodesAside> exprWithPlain(Ref<XQueryExpr> plain,
                                                           Operands operands) {
    return make<XQueryNodesAside>(std::move(plain), std::move(operands));
  }

  // What the comparison answers: from a table of what is compared of all the children of the same
  // parent, or all nodes of the tree, once it is asked for again.
  Value computeValue(XQueryContext& context) const override;

 protected:
  XQueryNodesAside(Ref<XQueryExpr> plain, Operands operands)
      : XQueryPlannedExpr(std::move(plain)), _operands(std::move(operands)) {}
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  class Table;

  NSXMLNode* start(XQueryContext& context) const;
  std::shared_ptr<Table> tableFor(NSXMLNode* node, XQueryContext& context) const;
  Value answer(NSXMLNode* node, const Value& value, XQueryContext& context) const;

  const Operands _operands;
};

}  // namespace xquery

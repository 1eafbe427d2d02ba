// Whether one node is among those that a few steps find from another one:
// "ancestor::unit intersect $unit", "$item intersect order/line".
#pragma once

#include "Plan/Operators/XQueryNodeQuestion.h"
#include "Plan/Operators/XQueryPlannedExpr.h"
#include "Plan/Operators/XQueryShortWalk.h"

#include <cstdint>
#include <optional>

namespace xquery {

class XQueryNearbyNode : public XQueryPlannedExpr, private XQueryNodeQuestion {
 public:
  // The plain expression is the intersection of what the walk finds with a local variable.
  [[nodiscard]] static Ref<XQueryNearbyNode> exprWithPlain(Ref<XQueryExpr> plain,
                                                           const XQueryShortWalk& walk,
                                                           int64_t varID) {
    return make<XQueryNearbyNode>(std::move(plain), walk, varID);
  }

  // The node, or nothing.
  Value computeValue(XQueryContext& context) const override;
  const XQueryNodeQuestion* nodeQuestion() const override {
    return _walk.startsFromFocus() ? this : nullptr;
  }

 protected:
  XQueryNearbyNode(Ref<XQueryExpr> plain, const XQueryShortWalk& walk, int64_t varID)
      : XQueryPlannedExpr(std::move(plain)), _walk(walk), _varID(varID) {}
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  std::optional<bool> holdsFor(NSXMLNode* node, const XQueryContext& context) const override;
  bool asksForNodeAbove() const override { return _walk.goesUpOnly(); }
  const NSXMLNode* nodeAbove(const XQueryContext& context) const override {
    return asksForNodeAbove() ? wantedIn(context) : nullptr;
  }
  // Null unless the variable holds one node.
  const NSXMLNode* wantedIn(const XQueryContext& context) const;
  bool finds(const NSXMLNode* wanted, NSXMLNode* start) const;

  const XQueryShortWalk _walk;
  const int64_t _varID;
};

}  // namespace xquery

#include "Plan/Operators/XQueryNearbyNode.h"

#include "Context/XQueryContextInternal.h"
#include "xquery/Collection.h"

namespace xquery {

const NSXMLNode* XQueryNearbyNode::wantedIn(const XQueryContext& context) const {
  return dyn_cast<NSXMLNode>(_internal(context).variableForID(_varID));
}

bool XQueryNearbyNode::finds(const NSXMLNode* wanted, NSXMLNode* start) const {
  bool isFound = false;
  _walk.visit(start, [&](const NSXMLNode* node) {
    isFound = node == wanted;
    return !isFound;
  });
  return isFound;
}

std::optional<bool> XQueryNearbyNode::holdsFor(NSXMLNode* node,
                                               const XQueryContext& context) const {
  const NSXMLNode* wanted = wantedIn(context);
  if (!wanted || !_walk.isOpen(context)) return std::nullopt;
  return finds(wanted, node);
}

Value XQueryNearbyNode::computeValue(XQueryContext& context) const {
  NSXMLNode* start = _walk.start(context);
  const NSXMLNode* wanted = wantedIn(context);
  if (!start || !wanted) return plain().evaluateWithContext(context);
  return finds(wanted, start) ? Value(_internal(context).variableForID(_varID))
                              : Value(NSNull::null());
}

}  // namespace xquery

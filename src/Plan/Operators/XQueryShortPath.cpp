#include "Plan/Operators/XQueryShortPath.h"

#include "xquery/Collection.h"

namespace xquery {

Value XQueryShortPath::computeValue(XQueryContext& context) const {
  NSXMLNode* start = _walk.start(context);
  if (!start) return plain().evaluateWithContext(context);
  NSXMLNode* only = nullptr;
  Ref<NSArray> nodes;  // two or more
  _walk.visit(start, [&](NSXMLNode* found) {
    if (!only) {
      only = found;
      return true;
    }
    if (!nodes) nodes = NSArray::arrayWithObjects({Value(only)});
    nodes->objects().push_back(Value(found));
    return true;
  });
  if (nodes) return nodes;
  return only ? Value(only) : Value(NSNull::null());
}

}  // namespace xquery

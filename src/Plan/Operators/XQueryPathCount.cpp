#include "Plan/Operators/XQueryPathCount.h"

#include "Context/XQueryContextInternal.h"
#include "Types/XQueryNumber.h"
#include "xquery/Number.h"

namespace xquery {

std::optional<uint64_t> XQueryPathCount::countUpTo(uint64_t most, XQueryContext& context) const {
  NSXMLNode* start = _isShort ? _shortWalk.start(context) : nullptr;
  return start ? countFrom(start, most) : _path->countNodes(most, context);
}

uint64_t XQueryPathCount::countFrom(NSXMLNode* node, uint64_t most) const {
  uint64_t count = 0;
  _shortWalk.visit(node, [&](const NSXMLNode*) { return ++count < most; });
  return count;
}

std::optional<bool> XQueryPathCount::holdsFor(NSXMLNode* node, const XQueryContext& context) const {
  if (!_shortWalk.isOpen(context)) return std::nullopt;
  return (countFrom(node, _question.least) >= _question.least) != _question.isNegated;
}

Value XQueryPathCount::computeValue(XQueryContext& context) const {
  // Diagnostics show every error that a predicate meets.
  if (context._internal().showsErrors()) return plain().evaluateWithContext(context);
  const uint64_t least = _question.least;
  const auto count = countUpTo(least == 0 ? UINT64_MAX : least, context);
  if (!count) return {};
  if (least == 0) return XQueryNumber::integerWithInt64(static_cast<int64_t>(*count));
  return NSNumber::numberWithBool((*count >= least) != _question.isNegated);
}

}  // namespace xquery

#include "Plan/Operators/XQueryPathCount.h"

#include "Context/XQueryContextInternal.h"
#include "Expr/XQueryAsking.h"
#include "Types/XQueryNumber.h"
#include "xquery/Number.h"

namespace xquery {

Value XQueryPathCount::Question::answer(uint64_t count) const {
  if (least == 0) return XQueryNumber::integerWithInt64(static_cast<int64_t>(count));
  return NSNumber::numberWithBool((count >= least) != isNegated);
}

void XQueryPathCount::readShortWalk() {
  XQueryShortWalk whole;
  XQueryShortWalk behindPosition;
  if (whole.readFrom(_path->path())) {
    _shortWalk = whole;
    _shortLeast = _question.least;
    _isShort = true;
  } else if (_question.least == 1) {
    _shortLeast = behindPosition.readFromWithPosition(_path->path());
    _shortWalk = behindPosition;
    _isShort = _shortLeast > 0;
  }
}

uint64_t XQueryPathCount::countFrom(NSXMLNode* node, uint64_t most) const {
  uint64_t count = 0;
  _shortWalk.visit(node, [&](const NSXMLNode*) { return ++count < most; });
  return count;
}

std::optional<bool> XQueryPathCount::holdsFor(NSXMLNode* node, const XQueryContext& context) const {
  if (!_shortWalk.isOpen(context)) return std::nullopt;
  return holdsFrom(node);
}

Value XQueryPathCount::computeValue(XQueryContext& context) const {
  // Diagnostics show every error that a predicate meets.
  if (_internal(context).showsErrors()) return plain().evaluateWithContext(context);
  const uint64_t least = _question.least;
  NSXMLNode* start = _isShort ? _shortWalk.start(context) : nullptr;
  if (start && least > 0) return NSNumber::numberWithBool(holdsFrom(start));
  if (start && _path->looksUpSiblings(start, context)) start = nullptr;
  const uint64_t most = least == 0 ? UINT64_MAX : least;
  const auto count =
      start ? std::optional(countFrom(start, most))
            : XQueryAsk(*_path, context, [&] { return _path->countNodes(most, context); });
  return count ? _question.answer(*count) : Value();
}

}  // namespace xquery

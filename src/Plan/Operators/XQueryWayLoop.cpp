#include "Plan/Operators/XQueryWayLoop.h"

#include "Context/StackGuard.h"
#include "Context/XQueryContextInternal.h"
#include "Plan/Operators/XQueryTentative.h"
#include "Plan/Paths/XQueryPathPattern.h"
#include "Platform/Tree/TreeIndexes.h"
#include "Types/XQueryAtomization.h"

#include <algorithm>
#include <array>

namespace xquery {

// The elements of the path for which the condition holds.
class XQueryWayLoop::Asked final : public NSXMLNameSelection {
 public:
  Asked(const XQueryWayLoop& loop, XQueryPathPattern& pattern, XQueryContext& context)
      : _loop(loop), _pattern(pattern), _context(context) {}

  bool hasFailed() const { return _hasFailed; }
  bool mayTake(const NSXMLExpandedName&) const override { return !_hasFailed; }
  bool takes(const NSXMLNode& node) const override {
    auto* first = const_cast<NSXMLNode*>(&node);
    if (!_pattern.finds(first)) return false;
    const auto holds = _loop.holdsFor(first, _context);
    _hasFailed = !holds;
    return holds.value_or(false);
  }

 private:
  const XQueryWayLoop& _loop;
  XQueryPathPattern& _pattern;
  XQueryContext& _context;
  mutable bool _hasFailed = false;
};

// None where something fails, which leaves nothing behind.
std::optional<bool> XQueryWayLoop::holdsFor(NSXMLNode* node, XQueryContext& context) const {
  const auto truthOf = [&context](const XQueryExpr& expr) -> std::optional<bool> {
    const Value value = XQueryValueOrNull(expr, context);
    return value ? std::optional(XQueryIsTrue(XQueryEffectiveBooleanValue(value, context)))
                 : std::nullopt;
  };
  bool isFirst = true;
  for (const auto& clause : _loop.flwor->forLet()) {
    const Value value = isFirst ? Value(node) : XQueryValueOrNull(*clause, context);
    if (!value) return std::nullopt;
    isFirst = false;
    _internal(context).setVariable(value, clause->varID());
    for (const auto& condition : clause->conditions()) {
      const auto holds = truthOf(*condition);
      if (!holds.value_or(false)) return holds;
    }
  }
  return truthOf(*_loop.flwor->whereExpr());
}

std::optional<uint64_t> XQueryWayLoop::countTuples(const NSXMLDocument& document,
                                                   XQueryContext& context) const {
  const NSXMLIndexedWays known = NSXMLIndexedWays::of(&document);
  if (!known.elements) return std::nullopt;
  XQueryPathPattern pattern(*_loop.path, document, context);
  if (!pattern.findsElementsAlone(known.elements->hasInstructions())) return std::nullopt;
  const Asked asked(*this, pattern, context);
  const std::array steps = {NSXMLWayStep{true, nullptr, &asked}};
  const auto count = known.elements->countAlong(steps);
  return asked.hasFailed() ? std::nullopt : count;
}

Value XQueryWayLoop::computeValue(XQueryContext& context) const {
  XQueryCheckStack(context);
  auto& dynamic = _internal(context);
  // Diagnostics show every error that a condition meets.
  auto* item = dynamic.showsErrors() ? nullptr : dyn_cast<NSXMLNode>(dynamic.contextItem());
  const auto* document = item ? dyn_cast<NSXMLDocument>(item->rootNode()) : nullptr;
  const auto count = document ? countTuples(*document, context) : std::nullopt;
  return count ? _question.answer(*count) : plain().evaluateWithContext(context);
}

}  // namespace xquery

// The steps at the head of a path that the index of the tree knows the answer to.
//
// Children of children of the document, and descendants of these, by their names: each element that
// they find lies on one way (Platform/Tree/NameIndex.h), and each is found once in the results. All
// of them arrive in document order, which is that of children of children; where steps go deeper,
// the order has to be free.
#include "Expr/Paths/XQueryPathResults.h"
#include "Plan/Paths/XQueryPathWalk.h"
#include "Platform/Base/WorkMeter.h"
#include "Platform/Tree/TreeIndexes.h"

#include <array>

namespace xquery {

// What the first steps ask for.
class XQueryPathWalk::Ways {
 public:
  explicit Ways(XQueryPathWalk& walk) {
    bool isDeep = false;
    for (size_t index = 0; index < walk._steps.size() && _count < most; ++index) {
      const XQueryWalkedStep& step = walk._steps[index];
      if (step.isExpression() || step.testMayRaise || step.gathersFirst || step.lookup) return;
      if (step.isDescendantShorthand()) {
        isDeep = true;
        continue;
      }
      isDeep = isDeep || step.axis == XQueryAxisDescendant;
      if (step.axis != XQueryAxisChild && step.axis != XQueryAxisDescendant) return;
      if (step.hasPredicates() && !step.filtersEach) return;
      if ((isDeep && !walk.orderIsFree) || !add(step, isDeep, walk)) return;
      _steps[_count - 1] = index + 1;
      if (step.hasPredicates()) return;
      isDeep = false;
    }
  }

  // Of one of them alone others know as much.
  bool areOfUse() const { return _count > 1; }
  size_t count() const { return _count; }
  // Those behind which so many steps of the path, predicates of the last one apart, are done.
  std::span<const NSXMLWayStep> first(size_t count) const { return {_ways.data(), count}; }
  size_t stepsDone(size_t count) const { return _steps[count - 1]; }
  // Whether the last one looks for processing instructions as well.
  bool mayFindInstructions() const { return _mayFindInstructions; }

 private:
  static constexpr size_t most = 12;

  bool add(const XQueryWalkedStep& step, bool isDeep, XQueryPathWalk& walk) {
    XQueryStepTest test(step, walk);
    NSXMLWayStep way{isDeep, test.onlyName(), nullptr};
    if (!way.name) way.selection = test.onlyNames();
    if (!test.takesElements()) return false;
    if (!way.name && !way.selection && !test.takesAllNamed()) return false;
    _mayFindInstructions = !way.name && test.acceptsInstructions();
    _ways[_count++] = way;
    return true;
  }

  std::array<NSXMLWayStep, most> _ways;
  std::array<size_t, most> _steps{};
  size_t _count = 0;
  bool _mayFindInstructions = false;
};

bool XQueryPathWalk::takeAlongWays(const Value& start) {
  const auto* document = dyn_cast<NSXMLDocument>(start.get());
  if (!document || _steps.size() < 2 || setsEveryFocus || listingStep) return false;
  const Ways ways(*this);
  if (!ways.areOfUse()) return false;
  const NSXMLIndexedWays known = NSXMLIndexedWays::of(document);
  if (!known.elements) {
    _notesMetOf = document;
    return false;
  }
  const size_t all = ways.count();
  const bool isWhole = ways.stepsDone(all) == _steps.size() && !_steps.back().hasPredicates();
  const bool isSure = !ways.mayFindInstructions() || !known.elements->hasInstructions();
  if (isWhole && isSure && results.countsOnly()) {
    const auto number = known.elements->countAlong(ways.first(all));
    if (number) results.addNumber(*number);
    if (number) return true;
  }
  for (size_t count = all; count > 1; --count) {
    const auto nodes = known.elements->nodesAlong(ways.first(count));
    if (!nodes) continue;
    takeIndexed(*nodes, ways.stepsDone(count));
    return true;
  }
  return false;
}

void XQueryPathWalk::noteMet() const {
  if (_notesMetOf) NSXMLNoteWalked(_met, _notesMetOf);
}

// What so many steps find, of which the last one may have predicates to be asked.
void XQueryPathWalk::takeIndexed(NSXMLNodeSpan nodes, size_t steps) {
  const XQueryWalkedStep& step = _steps[steps - 1];
  WorkPacer pacer;
  for (NSXMLNode* node : nodes) {
    pacer.turn();
    if (step.hasPredicates() && !keepsAlone(step, step.predicatesInTest, node)) {
      if (hasFailed) return;
      continue;
    }
    takeNode(steps, node);
    if (isOver()) return;
  }
}

}  // namespace xquery

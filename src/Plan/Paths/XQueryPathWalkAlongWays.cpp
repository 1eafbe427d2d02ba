// The steps at the head of a path that the index of the tree knows the answer to.
//
// Children of children of the document, and descendants of these, by their names: each element that
// they find lies on one way (Platform/Tree/NameIndex.h), and each is found once in the results. All
// of them arrive in document order, which is that of children of children; where steps go deeper,
// the order has to be free, and how often a node arrives must not show, as it does in what an
// expression behind them answers for it.
#include "Expr/Paths/XQueryPathResults.h"
#include "Plan/Paths/XQueryIndexedWalk.h"
#include "Plan/Paths/XQueryPathWalk.h"
#include "Platform/Base/WorkMeter.h"
#include "Platform/Tree/TreeIndexes.h"

#include <algorithm>
#include <array>

namespace xquery {

// What the first steps ask for.
class XQueryPathWalk::Ways {
 public:
  explicit Ways(XQueryPathWalk& walk) : _walk(walk) {
    const bool arrivalShows =
        std::any_of(walk._steps.begin(), walk._steps.end(),
                    [](const XQueryWalkedStep& step) { return step.isExpression(); });
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
      if (step.hasPredicates() && (!step.filtersEach || isBeforeExpression(index))) return;
      if (isDeep && (arrivalShows || !walk.orderIsFree)) return;
      if (!add(step, isDeep)) return;
      _steps[_count - 1] = index + 1;
      if (step.hasPredicates() && !areAnswered(step)) return;
      isDeep = false;
    }
  }

  // Of one of them alone others know as much.
  bool areOfUse() const { return _count > 1 || (_count == 1 && _asked[0].step); }
  size_t count() const { return _count; }
  // Those behind which so many steps of the path, predicates of the last one apart, are done.
  std::span<const NSXMLWayStep> first(size_t count) const { return {_ways.data(), count}; }
  size_t stepsDone(size_t count) const { return _steps[count - 1]; }
  // Whether the last one looks for processing instructions as well.
  bool mayFindInstructions() const { return _mayFindInstructions; }
  // Whether nothing is left to be asked of what all of them find.
  bool areAllAnswered() const {
    const XQueryWalkedStep& last = _walk._steps[_steps[_count - 1] - 1];
    return !last.hasPredicates() || areAnswered(last);
  }

 private:
  static constexpr size_t most = 12;

  // Predicates that answer alike for all elements on a way are asked of the first of them.
  struct Asked final : NSXMLNameSelection {
    bool mayTake(const NSXMLExpandedName& name) const override {
      if (way.name) return &name == way.name;
      return !way.selection || way.selection->mayTake(name);
    }
    bool takes(const NSXMLNode& node) const override {
      if (!way.name && way.selection && !way.selection->takes(node)) return false;
      return walk->keepsAlone(*step, step->predicatesInTest, const_cast<NSXMLNode*>(&node));
    }

    NSXMLWayStep way;  // without them
    const XQueryWalkedStep* step = nullptr;
    XQueryPathWalk* walk = nullptr;
  };

  // What it hands on is a list, of which the expression may ask for positions.
  bool isBeforeExpression(size_t index) const {
    return index + 1 < _walk._steps.size() && _walk._steps[index + 1].isExpression();
  }
  // Of nodes that are wanted by themselves, those of a name are asked in their turn.
  bool areAnswered(const XQueryWalkedStep& step) const {
    return step.asksForWays && _walk.results.countsOnly();
  }
  bool add(const XQueryWalkedStep& step, bool isDeep) {
    XQueryStepTest test(step, _walk);
    NSXMLWayStep way{isDeep, test.onlyName(), nullptr};
    if (!way.name) way.selection = test.onlyNames();
    if (!test.takesElements()) return false;
    if (!way.name && !way.selection && !test.takesAllNamed()) return false;
    _mayFindInstructions = !way.name && test.acceptsInstructions();
    if (step.hasPredicates() && areAnswered(step)) {
      Asked& asked = _asked[_count];
      asked.way = way;
      asked.step = &step;
      asked.walk = &_walk;
      way = {isDeep, nullptr, &asked};
    }
    _ways[_count++] = way;
    return true;
  }

  XQueryPathWalk& _walk;
  std::array<NSXMLWayStep, most> _ways;
  std::array<Asked, most> _asked;
  std::array<size_t, most> _steps{};
  size_t _count = 0;
  bool _mayFindInstructions = false;
};

bool XQueryPathWalk::takeAlongWays(const Value& start) {
  const auto* document = dyn_cast<NSXMLDocument>(start.get());
  if (!document || _steps.empty() || setsEveryFocus || listingStep) return false;
  const Ways ways(*this);
  if (!ways.areOfUse()) return false;
  const NSXMLIndexedWays known = NSXMLIndexedWays::of(document);
  if (!known.elements) {
    _notesMetOf = document;
    return false;
  }
  const size_t all = ways.count();
  const bool isWhole = ways.stepsDone(all) == _steps.size() && ways.areAllAnswered();
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

std::optional<NSXMLNameIndex::Ways> XQueryPathWalk::waysFrom(const NSXMLNameIndex& elements) {
  const Ways ways(*this);
  const size_t all = ways.count();
  if (all == 0 || ways.stepsDone(all) != _steps.size() || !ways.areAllAnswered()) {
    return std::nullopt;
  }
  if (ways.mayFindInstructions() && elements.hasInstructions()) return std::nullopt;
  return elements.along(ways.first(all));
}

void XQueryPathWalk::noteMet() const {
  if (_notesMetOf) NSXMLNoteWalked(_met, _notesMetOf);
}

// What so many steps find, of which the last one may have predicates to be asked.
void XQueryPathWalk::takeIndexed(NSXMLNodeSpan nodes, size_t steps) {
  const XQueryWalkedStep& step = _steps[steps - 1];
  XQueryVisitSpan(nodes, [&](NSXMLNode* node) {
    if (step.hasPredicates() && !keepsAlone(step, step.predicatesInTest, node)) return !hasFailed;
    takeNode(steps, node);
    return !isOver();
  });
}

}  // namespace xquery

// What binding finds out about the steps of a path (XQueryPath.cpp says what for), and what
// planning changes of them.
#include "Expr/Paths/XQueryPath.h"

#include <utility>
#include <vector>

namespace xquery {

void XQueryPathExpr::noteChange() {
  for (XQueryStep* step = _step.get(); step; step = step->next()) step->notePredicates();
  findShortcuts();
  _findsInOrder = _countsNodes && arrivesInOrder();
  findGatheringSteps();
}

// The list of predicates moves, and with it stay the places of the predicates.
Ref<XQueryStep> XQueryPathExpr::replaceStepBehind(XQueryStep& previous, const Ref<XQueryStep>& by) {
  Ref<XQueryStep> replaced(previous.next());
  by->setNext(Ref<XQueryStep>(replaced->next()));
  by->setPredicates(std::move(replaced->_predicates));
  by->_mayAdopt = replaced->_mayAdopt;
  previous.setNext(by);
  noteChange();
  return replaced;
}

void XQueryPathExpr::findShortcuts() {
  std::vector<XQueryStep*> steps;
  bool loadsDocuments = false;
  bool nodesMayGo = false;  // some nodes are held by an intermediate result only
  // A quantified expression, say, in a predicate leaves its variable to the steps after it.
  bool variablesMayChange = false;
  for (XQueryStep* step = _step.get(); step; step = step->next()) {
    steps.push_back(step);
    if (auto* axisStep = dyn_cast<XQueryAxisStep>(step)) axisStep->forgetShortcuts();
    const bool isFilter = !isa<XQueryAxisStep>(step);
    if (isFilter && step == _step.get()) continue;  // done before the walk begins
    nodesMayGo = nodesMayGo || isFilter;
    variablesMayChange = variablesMayChange || isFilter || !step->hasRepeatablePredicates(false);
  }
  _trailCount = 0;
  _countsNodes = false;
  // From the end, as long as everything from a step on is repeatable.
  for (size_t i = steps.size(); i-- > 0;) {
    auto* step = dyn_cast<XQueryAxisStep>(steps[i]);
    const bool isRepeatable =
        step && !step->testMayRaise() && step->hasRepeatablePredicates(variablesMayChange);
    if (!isRepeatable) break;
    const auto* next = dyn_cast<XQueryAxisStep>(step->next());
    step->_filtersEach = step->hasPredicates() && step->hasPredicatesOfTruth();
    step->_absorbsNext = step->isDescendantShorthand() && next && next->mayTakeDescendants();
    const auto* previous = i == 0 ? nullptr : dyn_cast<XQueryAxisStep>(steps[i - 1]);
    const bool keepsTrail = !nodesMayGo && step->mayWalkTwice(previous);
    step->_trail = keepsTrail ? _trailCount++ : XQueryAxisStep::noTrail;
    if (step->loadsDocuments()) loadsDocuments = true;
    _countsNodes = (i == 0 || (i == 1 && !isa<XQueryAxisStep>(steps[0]))) && !loadsDocuments;
  }
}

// Whether nodes reach the results in document order when the path starts from one node. Nodes that
// do not lie in each other, in document order, have children and attributes in document order.
bool XQueryPathExpr::arrivesInOrder() const {
  enum class Found : uint8_t { One, Apart, Nested } found = Found::One;
  const XQueryStep* const first = isa<XQueryAxisStep>(_step.get()) ? _step.get() : _step->next();
  for (const XQueryStep* each = first; each; each = each->next()) {
    const auto* step = cast<XQueryAxisStep>(each);
    const bool wasOne = found == Found::One;
    switch (step->axis()) {
      case XQueryAxisSelf:
        continue;
      case XQueryAxisParent:
        if (!wasOne) return false;
        continue;
      case XQueryAxisAttribute:
        found = Found::Apart;
        break;
      case XQueryAxisChild:
        if (found == Found::Nested) return false;
        found = Found::Apart;
        break;
      case XQueryAxisFollowingSibling:
        if (!wasOne) return false;
        found = Found::Apart;
        break;
      case XQueryAxisDescendant:
      case XQueryAxisDescendantOrSelf:
        // "//" goes on in document order where it is joined with the next step, which is known of
        // the first one (mayEndEarly).
        if (!wasOne || (step->_absorbsNext && step != first)) return false;
        found = Found::Nested;
        if (step->_absorbsNext) each = step = cast<XQueryAxisStep>(each->next());
        break;
      default:
        return false;
    }
    for (size_t index = 0; wasOne && index < step->predicates().size(); ++index) {
      if (step->asksForPosition(index)) found = Found::One;
    }
  }
  return true;
}

void XQueryPathExpr::findGatheringSteps() {
  XQueryStep* last = nullptr;  // the last one that may give nodes a parent
  for (XQueryStep* step = _step.get(); step; step = step->next()) {
    if (step->_mayAdopt) last = step;
  }
  for (XQueryStep* step = _step.get(); last && step != last; step = step->next()) {
    if (auto* axisStep = dyn_cast<XQueryAxisStep>(step)) axisStep->_gathersFirst = true;
  }
}

}  // namespace xquery

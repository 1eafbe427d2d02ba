// What the steps of a path may leave out.
//
// Pattern     steps at the end of a path, as far to the front as what follows can be repeated: no
//             expressions among them, no names that may raise an error
// Facts       of predicates: whether they are repeatable, read what other steps set, ask for a
//             position or a size, may answer a number, load documents; what they leave in
//             variables. Of steps before an expression, at which nodes are to arrive in the same
//             order and as often: all predicates and expressions of the path are repeatable, and
//             none reads what another one sets
// Operator    none: XQueryWalkedPath is told which of its shortcuts are open
// Why         see XQueryPathWalk.h. Predicates that are asked less often, or in another order,
//             leave other values in the variables of their quantifiers, which nobody may read
#include "Plan/Paths/XQueryWalkedPath.h"
#include "Plan/Planning.h"
#include "Plan/Rules.h"
#include "Plan/Rules/PathAt.h"
#include "Plan/Rules/WayConditions.h"

#include <algorithm>
#include <string_view>
#include <unordered_map>
#include <vector>

namespace xquery {
namespace {

using Steps = std::vector<XQueryWalkedStep>;

// Whether nodes reach the results in document order when the path starts from one node. Nodes that
// do not lie in each other, in document order, have children and attributes in document order.
bool arriveInOrder(const Steps& steps) {
  enum class Found : uint8_t { One, Apart, Nested } found = Found::One;
  for (size_t i = 0; i < steps.size(); ++i) {
    const XQueryWalkedStep* step = &steps[i];
    const bool wasOne = found == Found::One;
    switch (step->axis) {
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
      case XQueryAxisFollowing:
        if (!wasOne) return false;
        found = Found::Nested;
        break;
      case XQueryAxisDescendant:
      case XQueryAxisDescendantOrSelf:
        // "//" goes on in document order where it is joined with the next step, which is known of
        // the first one when the walk begins.
        if (!wasOne || (step->absorbsNext && i != 0)) return false;
        found = Found::Nested;
        if (step->absorbsNext) step = &steps[++i];
        break;
      default:
        return false;
    }
    for (size_t index = 0; wasOne && !step->countsBelow && index < step->step->predicates().size();
         ++index) {
      if (step->step->asksForPosition(index)) found = Found::One;
    }
  }
  return true;
}

class Search {
 public:
  Search(XQueryPlanning& planning, XQueryPlaceID place, XQueryWalkedPath& path)
      : _planning(planning),
        _place(place),
        _steps(path.changeableSteps()),
        _predicates(_steps.size()),
        _of(_steps.size()) {
    std::unordered_map<const XQueryStep*, size_t> indexes;
    for (size_t i = 0; i < _steps.size(); ++i) indexes.emplace(_steps[i].step, i);
    for (XQueryPlaceID part = planning.program.firstPart(place); part != XQueryNoPlace;
         part = planning.program.nextPart(part)) {
      const XQueryPlace& at = planning.program[part];
      const auto found = at.step ? indexes.find(at.step) : indexes.end();
      if (found == indexes.end()) continue;
      const size_t index = found->second;
      if (at.role == XQueryRole::Step && _steps[index].isExpression()) _expressions.push_back(part);
      if (at.role == XQueryRole::Predicate) _predicates[index].push_back(part);
    }
  }

  XQueryWalkedPath::Findings run() {
    bool nodesMayGo = false;  // some nodes are held by an intermediate result only
    for (size_t i = 0; i < _steps.size(); ++i) {
      look(i);
      nodesMayGo = nodesMayGo || _steps[i].isExpression();
    }
    // From the end, as long as everything from a step on is repeatable.
    XQueryWalkedPath::Findings findings;
    bool loadsDocuments = false;
    for (size_t i = _steps.size(); i-- > 0;) {
      XQueryWalkedStep& step = _steps[i];
      if (step.isExpression() || step.testMayRaise || !canRepeat(i)) break;
      loadsDocuments = loadsDocuments || _of[i].loads;
      step.filtersEach = step.hasPredicates() && _of[i].areOfTruth;
      step.asksForWays = step.filtersEach && _of[i].areOfWays;
      if (step.isDescendantShorthand() && i + 1 < _steps.size()) {
        _steps[i + 1].countsBelow = i == 0 && startsFromOne() && mayCountBelow(i + 1);
        step.absorbsNext = _steps[i + 1].countsBelow || mayTakeDescendants(i + 1);
      }
      if (!nodesMayGo && mayWalkTwice(i)) step.trail = findings.trailCount++;
      findings.countsNodes = i == 0 && !loadsDocuments;
    }
    findings.findsInOrder = findings.countsNodes && arriveInOrder(_steps);
    keepArrivals();
    note();
    return findings;
  }

 private:
  // Of the predicates of a step.
  struct OfPredicates {
    bool areRepeatable = true;
    bool readGlobals = false;
    // Each keeps a node for what it finds true of it, wherever the node stands, and without loading
    // documents.
    bool areOfTruth = true;
    bool areOfTruthBehind = true;  // the same but for the first one
    bool areOfWays = true;
    bool loads = false;
    XQueryVariableSet reads;
  };

  size_t indexOf(const XQueryWalkedStep& step) const {
    return static_cast<size_t>(&step - _steps.data());
  }

  void look(size_t index) {
    const XQueryWalkedStep& step = _steps[index];
    if (step.isExpression()) {
      _anythingMayChange = true;
      return;
    }
    OfPredicates& of = _of[index];
    const auto& places = _predicates[index];
    if (places.size() != step.step->predicates().size()) of.areRepeatable = false;
    for (size_t i = step.predicatesInTest; i < places.size(); ++i) {
      using namespace XQueryDeeds;
      const XQueryFacts& facts = _planning.facts[places[i]];
      of.areRepeatable = of.areRepeatable && facts.isRepeatable() &&
                         !_planning.showsLeftovers(facts.assigns, _place);
      of.readGlobals = of.readGlobals || facts.does(ReadsGlobals);
      of.loads = of.loads || facts.does(LoadsDocuments);
      const bool isOfTruth = !step.step->asksForPosition(i) &&
                             !facts.does(ReadsPosition | ReadsSize | LoadsDocuments) &&
                             !facts.mayBe(XQueryItems::Numeric | XQueryItems::Other);
      of.areOfTruth = of.areOfTruth && isOfTruth;
      if (i > step.predicatesInTest) of.areOfTruthBehind = of.areOfTruthBehind && isOfTruth;
      of.areOfWays = of.areOfWays && XQueryIsOfWays(_planning.program, places[i]);
      of.reads.add(facts.reads);
      _assigned.add(facts.assigns);
    }
    _anythingMayChange = _anythingMayChange || !of.areRepeatable;
  }

  // An expression, and what a predicate does, may set variables.
  bool canRepeat(size_t index) const {
    const OfPredicates& of = _of[index];
    if (!of.areRepeatable || of.reads.meets(_assigned)) return false;
    return !_anythingMayChange || (of.reads.isEmpty() && !of.readGlobals);
  }

  // --- before an expression

  // What an expression answers for the nodes that arrive at it are the items of the path, so these
  // have to be the same nodes, as often, in the same order; then nothing can tell that predicates
  // have been asked of all of them beforehand.
  void keepArrivals() {
    const auto expression =
        std::find_if(_steps.begin(), _steps.end(),
                     [](const XQueryWalkedStep& step) { return step.isExpression(); });
    if (expression == _steps.end() || !areIdleExpressions()) return;
    for (auto step = _steps.begin(); step != expression; ++step) {
      const size_t index = indexOf(*step);
      step->filtersEach = step->hasPredicates() && _of[index].areOfTruth;
      if (!step->isDescendantShorthand() || step + 1 == expression) continue;
      XQueryWalkedStep& next = step[1];
      next.countsBelow = index == 0 && startsFromOne() && mayCountBelow(index + 1);
      step->absorbsNext = next.countsBelow || mayTakeDescendants(index + 1);
      next.arrivesByParents = step->absorbsNext;
    }
  }

  bool areIdleExpressions() const {
    XQueryVariableSet reads;
    XQueryVariableSet assigned;
    const auto isIdle = [&](XQueryPlaceID place) {
      const XQueryFacts& facts = _planning.facts[place];
      reads.add(facts.reads);
      assigned.add(facts.assigns);
      return facts.isRepeatable();
    };
    size_t expressions = 0;
    for (const XQueryWalkedStep& step : _steps) {
      const size_t index = indexOf(step);
      const auto& predicates = _predicates[index];
      if (step.isExpression()) ++expressions;
      if (step.testMayRaise || !_of[index].areRepeatable) return false;
      if (predicates.size() != step.step->predicates().size()) return false;
      if (!std::all_of(predicates.begin(), predicates.end(), isIdle)) return false;
    }
    return expressions == _expressions.size() &&
           std::all_of(_expressions.begin(), _expressions.end(), isIdle) && !reads.meets(assigned);
  }

  // ---

  // Whether the step may walk the descendants of a node in place of the children of each of them,
  // or the attributes below it.
  bool mayTakeDescendants(size_t index) const {
    const int axis = _steps[index].axis;
    return (axis == XQueryAxisChild || axis == XQueryAxisAttribute) && _of[index].areOfTruth;
  }

  // Whether the step asks for a position among siblings, and all its other predicates, which come
  // behind, for truth.
  bool mayCountBelow(size_t index) const {
    const XQueryWalkedStep& step = _steps[index];
    return step.axis == XQueryAxisChild && step.hasPredicates() &&
           step.step->asksForPosition(step.predicatesInTest) && _of[index].areOfTruthBehind;
  }

  bool startsFromOne() const {
    const XQueryPlaceID start = _planning.program.part(_place, XQueryRole::FirstStep);
    return start == XQueryNoPlace || _planning.facts[start].most <= 1;
  }

  // Whether walks of a step from different nodes may meet the same node and nothing can tell
  // whether it is met again: predicates, apart from those that only ask for truth, see a list for
  // each node walked from. Not counted are steps whose nodes go straight to the results, which hold
  // each node once anyway.
  bool mayWalkTwice(size_t index) const {
    const XQueryWalkedStep& step = _steps[index];
    // One of these walks what is below in place of a "//" before it.
    if (step.axis == XQueryAxisChild || step.axis == XQueryAxisAttribute) {
      return index > 0 && _steps[index - 1].isDescendantShorthand() && mayTakeDescendants(index);
    }
    if (step.hasPredicates()) return false;
    switch (step.axis) {
      case XQueryAxisSelf:
        return false;
      case XQueryAxisParent:
        return index + 1 < _steps.size();
      default:
        return true;
    }
  }

  void note() {
    std::string_view obstacle;
    bool joinsSteps = false;
    for (size_t i = 0; i + 1 < _steps.size(); ++i) {
      joinsSteps = joinsSteps || _steps[i].absorbsNext;
      if (!_steps[i].isDescendantShorthand() || _steps[i].absorbsNext) continue;
      if (_steps[i + 1].isExpression()) continue;
      if (!_of[i + 1].areRepeatable) {
        obstacle = "a predicate behind \"//\" may do something else when it is asked again";
      } else if (!_of[i + 1].areOfTruth) {
        obstacle = "a predicate behind \"//\" may ask for a position among siblings";
      }
    }
    if (joinsSteps) _planning.choose(_place, "\"//\" goes straight down to what it looks for");
    if (!obstacle.empty()) _planning.refuse(_place, obstacle);
  }

  XQueryPlanning& _planning;
  const XQueryPlaceID _place;
  Steps& _steps;
  std::vector<std::vector<XQueryPlaceID>> _predicates;  // by step
  std::vector<OfPredicates> _of;                        // by step
  std::vector<XQueryPlaceID> _expressions;              // in place of steps
  XQueryVariableSet _assigned;
  bool _anythingMayChange = false;
};

}  // namespace

void XQueryKeepTrails(XQueryPlanning& planning) {
  for (XQueryPlaceID place = 0; place < planning.program.placeCount(); ++place) {
    const auto* slot = planning.program[place].slot;
    const auto* planned = dyn_cast<XQueryPlannedExpr>(slot ? slot->get() : nullptr);
    if (!planned || !planned->walkedPath()) continue;
    auto& path = const_cast<XQueryWalkedPath&>(*planned->walkedPath());
    path.setFindings(Search(planning, place, path).run());
  }
}

}  // namespace xquery

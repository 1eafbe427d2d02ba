#include "Plan/Joins/XQueryJoinedSteps.h"

#include "Plan/Paths/XQueryWalkedPath.h"
#include "Platform/Base/WorkMeter.h"

#include <algorithm>

namespace xquery {
namespace {

bool staysInside(int axis) {
  return axis == XQueryAxisChild || axis == XQueryAxisAttribute || axis == XQueryAxisSelf;
}

}  // namespace

std::vector<XQueryPlaceID> XQueryPredicatesOf(const XQueryPlanning& planning, XQueryPlaceID path,
                                              const XQueryStep& step, size_t first) {
  std::vector<XQueryPlaceID> places;
  if (step.predicates().empty()) return places;
  WorkPacer pacer;
  for (XQueryPlaceID part = planning.program.firstPart(path);
       part != XQueryNoPlace && places.size() < step.predicates().size();
       part = planning.program.nextPart(part)) {
    pacer.turn();
    const XQueryPlace& at = planning.program[part];
    if (at.step == &step && at.role == XQueryRole::Predicate) places.push_back(part);
  }
  if (places.size() != step.predicates().size()) return {};
  places.erase(places.begin(), places.begin() + static_cast<std::ptrdiff_t>(first));
  return places;
}

std::vector<XQueryPlaceID> XQueryPredicatesOf(const XQueryPlanning& planning, XQueryPlaceID path,
                                              const XQueryWalkedStep& step) {
  return XQueryPredicatesOf(planning, path, *step.step, step.predicatesInTest);
}

void XQueryPredicatesOfSteps::findAll() {
  _areFound = true;
  WorkPacer pacer;
  for (XQueryPlaceID part = _planning.program.firstPart(_path); part != XQueryNoPlace;
       part = _planning.program.nextPart(part)) {
    pacer.turn();
    const XQueryPlace& at = _planning.program[part];
    if (at.step && at.role == XQueryRole::Predicate) _places[at.step].push_back(part);
  }
}

std::vector<XQueryPlaceID> XQueryPredicatesOfSteps::of(const XQueryWalkedStep& step) {
  const size_t count = step.step->predicates().size();
  if (count == 0) return {};
  if (!_areFound) findAll();
  const auto found = _places.find(step.step);
  if (found == _places.end() || found->second.size() < count) return {};
  const auto first = found->second.begin();
  return {first + static_cast<std::ptrdiff_t>(step.predicatesInTest),
          first + static_cast<std::ptrdiff_t>(count)};
}

bool XQueryPredicatesAreOfTruth(const XQueryPlanning& planning,
                                const std::vector<XQueryPlaceID>& places) {
  if (places.empty()) return false;
  return std::all_of(places.begin(), places.end(), [&](XQueryPlaceID place) {
    using namespace XQueryDeeds;
    const XQueryFacts& facts = planning.facts[place];
    return facts.isRepeatable() && !facts.does(ReadsPosition | ReadsSize) &&
           !facts.mayBe(XQueryItems::Numeric | XQueryItems::Other) &&
           (places.size() == 1 || !facts.does(LoadsDocuments));
  });
}

XQueryFacts XQueryFactsUpTo(const XQueryPlanning& planning, XQueryPlaceID place,
                            const XQueryWalkedPath& path, const XQueryWalkedStep& end) {
  XQueryFacts facts;
  XQueryPredicatesOfSteps predicates(planning, place);
  for (const XQueryWalkedStep& step : path.steps()) {
    if (!staysInside(step.axis)) facts.deeds |= XQueryDeeds::ReadsOutside;
    if (&step == &end) break;
    const auto places = predicates.of(step);
    if (places.empty() && step.hasPredicates()) facts.deeds |= XQueryDeeds::IsUnrepeatable;
    for (const XQueryPlaceID each : places) facts.addDeedsWithin(planning.facts[each]);
  }
  return facts;
}

}  // namespace xquery

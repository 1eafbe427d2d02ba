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
  for (const XQueryWalkedStep& step : path.steps()) {
    if (!staysInside(step.axis)) facts.deeds |= XQueryDeeds::ReadsOutside;
    if (&step == &end) break;
    const auto places = XQueryPredicatesOf(planning, place, step);
    if (places.empty() && step.hasPredicates()) facts.deeds |= XQueryDeeds::IsUnrepeatable;
    for (const XQueryPlaceID each : places) facts.addDeedsWithin(planning.facts[each]);
  }
  return facts;
}

}  // namespace xquery

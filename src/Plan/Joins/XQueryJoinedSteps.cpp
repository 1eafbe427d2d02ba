#include "Plan/Joins/XQueryJoinedSteps.h"

#include "Expr/Paths/XQueryPath.h"

#include <algorithm>

namespace xquery {
namespace {

bool staysInside(int axis) {
  return axis == XQueryAxisChild || axis == XQueryAxisAttribute || axis == XQueryAxisSelf;
}

}  // namespace

std::vector<XQueryPlaceID> XQueryPredicatesOf(const XQueryPlanning& planning, XQueryPlaceID path,
                                              const XQueryStep& step) {
  std::vector<XQueryPlaceID> places;
  for (XQueryPlaceID part = planning.program.firstPart(path); part != XQueryNoPlace;
       part = planning.program.nextPart(part)) {
    const XQueryPlace& at = planning.program[part];
    if (at.step == &step && at.role == XQueryRole::Predicate) places.push_back(part);
  }
  // Those that have become part of the test come first.
  places.erase(places.begin(), places.begin() + static_cast<std::ptrdiff_t>(std::min(
                                                    places.size(), step.predicatesInTest())));
  return places;
}

bool XQueryPredicatesAreKnown(const XQueryStep& step, const std::vector<XQueryPlaceID>& places) {
  return places.size() + step.predicatesInTest() == step.predicates().size();
}

bool XQueryPredicatesAreOfTruth(const XQueryPlanning& planning, const XQueryStep& step,
                                const std::vector<XQueryPlaceID>& places) {
  if (places.empty() || !XQueryPredicatesAreKnown(step, places)) return false;
  return std::all_of(places.begin(), places.end(), [&](XQueryPlaceID place) {
    using namespace XQueryDeeds;
    const XQueryFacts& facts = planning.facts[place];
    return facts.isRepeatable() && !facts.does(ReadsPosition | ReadsSize) &&
           !facts.mayBe(XQueryItems::Numeric | XQueryItems::Other) &&
           (places.size() == 1 || !facts.does(LoadsDocuments));
  });
}

XQueryFacts XQueryFactsUpTo(const XQueryPlanning& planning, XQueryPlaceID path,
                            const XQueryStep& first, const XQueryStep& end) {
  XQueryFacts facts;
  for (const XQueryStep* step = &first;; step = step->next()) {
    if (!staysInside(cast<XQueryAxisStep>(step)->axis())) facts.deeds |= XQueryDeeds::ReadsOutside;
    if (step == &end) return facts;
    const auto places = XQueryPredicatesOf(planning, path, *step);
    if (!XQueryPredicatesAreKnown(*step, places)) facts.deeds |= XQueryDeeds::IsUnrepeatable;
    for (const XQueryPlaceID place : places) facts.addDeedsWithin(planning.facts[place]);
  }
}

}  // namespace xquery

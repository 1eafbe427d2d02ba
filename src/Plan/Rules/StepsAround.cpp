#include "Plan/Rules/StepsAround.h"

#include "Plan/Paths/XQueryWalkedPath.h"
#include "Plan/Planning.h"
#include "Plan/Rules/PathAt.h"
#include "Platform/Base/WorkMeter.h"

namespace xquery {

bool XQueryHidesFocusOf(const XQueryStep& step, const XQueryWalkedPath& path, XQueryPlaceID place,
                        const XQueryPlanning& planning) {
  if (path.start() && !isa<XQueryRootStep>(path.start())) {
    const XQueryPlaceID start = planning.program.part(place, XQueryRole::FirstStep);
    if (start == XQueryNoPlace) return false;
    const XQueryFacts& items = planning.facts[start];
    // Where a variable was read that may have held anything, a path of nodes may stand.
    const XQueryWalkedPath* inner = XQueryWalkedPathAt(planning, start);
    const bool areNodes = inner && inner->countsNodes();
    if (!areNodes && !items.are(XQueryItems::Node) && items.most > 1) return false;
  }
  bool isPassed = path.start() == &step;
  WorkPacer pacer;
  for (const XQueryWalkedStep& each : path.steps()) {
    pacer.turn();
    if (each.testMayRaise) return false;
    if (each.isExpression() && each.step != &step && !isPassed) return false;
    isPassed = isPassed || each.step == &step;
  }
  return true;
}

}  // namespace xquery

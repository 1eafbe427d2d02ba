#include "Plan/Rules/StepsAround.h"

#include "Expr/Paths/XQueryPath.h"
#include "Plan/Planning.h"

namespace xquery {

bool XQueryHidesFocusOf(const XQueryStep& step, const XQueryPathExpr& path, XQueryPlaceID place,
                        const XQueryPlanning& planning) {
  const XQueryStep* first = path.step();
  if (!isa<XQueryAxisStep>(first) && !isa<XQueryRootStep>(first)) {
    const XQueryPlaceID start = planning.program.part(place, XQueryRole::FirstStep);
    if (start == XQueryNoPlace) return false;
    const XQueryFacts& items = planning.facts[start];
    if (!items.are(XQueryItems::Node) && items.most > 1) return false;
  }
  bool isPassed = false;
  for (const XQueryStep* each = first; each; each = each->next()) {
    const auto* axisStep = dyn_cast<XQueryAxisStep>(each);
    if (axisStep && axisStep->testMayRaise()) return false;
    if (!axisStep && each != first && each != &step && !isPassed) return false;
    isPassed = isPassed || each == &step;
  }
  return true;
}

}  // namespace xquery

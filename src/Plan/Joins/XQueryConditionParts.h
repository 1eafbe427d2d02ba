// What a condition consists of, however it is written: only its truth is looked at.
#pragma once

#include "Plan/Planning.h"

#include <vector>

namespace xquery {

struct XQueryConditionPart {
  XQueryPlaceID place = XQueryNoPlace;
  bool isNegated = false;  // it holds where the place does not
  // Where an expression stands whose truth is that of the part; XQueryNoPlace for none.
  XQueryPlaceID whole = XQueryNoPlace;
};

using XQueryConditionParts = std::vector<XQueryConditionPart>;

// The condition holds where it is said to, or where it does not hold (`isNegated`).
inline XQueryConditionPart XQueryWholeCondition(XQueryPlaceID place, bool isNegated) {
  return {place, isNegated, isNegated ? XQueryNoPlace : place};
}

// The parts all of which have to hold, in the order in which they are asked: none behind one that
// does not hold. None at all for too many.
XQueryConditionParts XQueryJoinedByAnd(const XQueryPlanning& planning, XQueryConditionPart part);
// The parts one of which has to hold, in their order: none behind one that holds.
XQueryConditionParts XQueryJoinedByOr(const XQueryPlanning& planning, XQueryConditionPart part);

}  // namespace xquery

// What asks for nothing but how many items there are, or whether there are any.
#pragma once

#include "Plan/Operators/XQueryPathCount.h"
#include "Plan/Planning.h"

#include <optional>

namespace xquery {

struct XQueryNumberQuestion {
  XQueryPathCount::Question question;
  // It asks for the truth of the items, which is that there are any where they are nodes.
  bool isOfTruth = false;
  XQueryPlaceID place = XQueryNoPlace;  // of what asks
};

// What a call of count(), exists(), empty(), boolean() or not() asks of its argument.
std::optional<XQueryNumberQuestion> XQueryNumberQuestionOf(const XQueryExpr& call);
// Whether all that is made of a value is its truth.
bool XQueryIsAskedForTruth(const XQueryProgram& program, XQueryPlaceID place);
// What is asked of the value of a place, perhaps in parentheses, where another expression may be
// put that answers it.
std::optional<XQueryNumberQuestion> XQueryNumberQuestionAround(const XQueryPlanning& planning,
                                                               XQueryPlaceID place);

}  // namespace xquery

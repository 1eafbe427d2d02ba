// How far above an item everything lies that an expression reads of it.
#pragma once

#include "Plan/Planning.h"

#include <cstdint>

namespace xquery {

// The number of parents to go up from the item before anything of it is looked at: 2 in
// "max(../../sale/price)", and 0 where the item itself may matter. `varID` is that of a local
// variable that holds the item, or 0 for the context item of the focus in which the expression
// stands. For an expression that reads it.
[[nodiscard]] uint8_t XQueryStepsToWhatIsRead(const XQueryPlanning& planning, XQueryPlaceID place,
                                              int64_t varID);

}  // namespace xquery

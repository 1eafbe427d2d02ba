// Comparing the name of the context item with a constant.
//
// Pattern     name() = "a" and local-name() = "a", with "." for an argument or without one, on
//             either side, with "=" or "eq"
// Facts       none are asked for
// Operator    XQueryNameComparison: compares the text of the name where it lies
// Why         for an element or an attribute both functions answer exactly the name, as a string,
//             and two strings compare equal when their text is; everything else, errors included,
//             is left to the expression as it was written
#include "Plan/Operators/XQueryNameComparison.h"
#include "Plan/Planning.h"
#include "Plan/Rules.h"
#include "Plan/Rules/NameConditions.h"

namespace xquery {

void XQueryCompareNames(XQueryPlanning& planning) {
  for (XQueryPlaceID place = 0; place < planning.program.placeCount(); ++place) {
    if (!planning.isOpen(place)) continue;
    const auto condition = XQueryNameConditionIn(*planning.program[place].expr);
    if (!condition || condition->texts.size() != 1) continue;
    using By = XQueryNameChoice::By;
    if (condition->by != By::Name && condition->by != By::LocalName) continue;
    const auto which = condition->by == By::Name ? XQueryNameComparison::Name::Qualified
                                                 : XQueryNameComparison::Name::Local;
    planning.wrap(place, XQueryNameComparison::exprWithPlain(*planning.program[place].slot, which,
                                                             condition->texts.front()));
  }
}

}  // namespace xquery

#include "Plan/Joins/XQueryProbesAhead.h"

#include "Context/XQueryContextInternal.h"
#include "Expr/XQuerySequence.h"

#include <algorithm>
#include <cstddef>
#include <vector>

namespace xquery {

Value XQueryProbesAhead::computeValue(XQueryContext& context) const {
  // For more of them nearly every item of the earlier clause may be met.
  constexpr size_t fewItems = 32;
  const Value source = _bound->evaluateWithContext(context);
  if (!source || XQueryHasFailed(source, context)) return {};
  XQueryPicks picks;
  const auto listItems = [&](std::vector<Value>& items) {
    return XQueryListItems(XQueryItemList(source.get()), items);
  };
  if (!_picker->pick(source, listItems, context, picks)) return {};
  const bool areSure = std::all_of(picks.chosen.begin(), picks.chosen.end(),
                                   [](const XQueryPick& pick) { return pick.isSure; });
  if (!areSure || picks.chosen.size() > fewItems) return {};
  XQueryGatherer probes;
  for (const XQueryPick& pick : picks.chosen) {
    _internal(context).setVariable((*picks.items)[pick.position], _varID);
    Value probe = plain().evaluateWithContext(context);
    if (!probe || XQueryHasFailed(probe, context)) return {};
    probes.add(std::move(probe));
  }
  return probes.value();
}

}  // namespace xquery

#include "Platform/Tree/SingleNames.h"

#include <bit>

namespace xquery {

std::unique_ptr<const NSXMLSingleNames> NSXMLSingleNames::ofThose(const Candidates& candidates) {
  const size_t size = std::bit_ceil(2 * candidates.size() + 1);
  Candidates seen(size);
  for (const Candidate& each : candidates) {
    size_t place = placeOf(each.name) & (size - 1);
    while (seen[place].name && seen[place].name != each.name) place = (place + 1) & (size - 1);
    const bool isFirst = !seen[place].name;
    seen[place] = {each.name, isFirst && each.isSingle};
  }
  std::unique_ptr<NSXMLSingleNames> made(new NSXMLSingleNames(size));
  bool areAny = false;
  for (const Candidate& each : seen) {
    if (!each.isSingle) continue;
    areAny = true;
    size_t free = placeOf(each.name) & (size - 1);
    while (made->_table[free]) free = (free + 1) & (size - 1);
    made->_table[free] = each.name;
  }
  return areAny ? std::move(made) : nullptr;
}

}  // namespace xquery

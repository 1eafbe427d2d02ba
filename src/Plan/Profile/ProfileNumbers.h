// The numbers of a profile, the same in each of its forms.
#pragma once

#include "Plan/Profile/ProfileWriters.h"

#include <cstdint>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

namespace xquery {

// "12.345": with so many decimals, 0 to 6. No locale changes it.
std::string XQueryMilliseconds(int64_t nanoseconds, unsigned decimals);
// "12.3"; of nothing "0.0".
std::string XQueryPercent(int64_t part, int64_t whole);

// What is known of them, in the order in which they come; nanoseconds. "planning" is part of
// "compiling".
std::vector<std::pair<std::string_view, int64_t>> XQueryProfilePhases(
    const XQueryProfileData& profile, const XQueryProfileSurroundings& surroundings);

// For each node of the tree of calls its time with that of all below it.
std::vector<int64_t> XQueryProfileTotals(const XQueryProfileCounts& counts);

}  // namespace xquery

#include "Plan/Profile/ProfileNumbers.h"

#include <algorithm>
#include <cmath>

namespace xquery {
namespace {

// A decimal number of so many units in the last place.
std::string pointed(int64_t units, unsigned decimals) {
  std::string digits = std::to_string(std::max<int64_t>(units, 0));
  if (decimals == 0) return digits;
  if (digits.size() <= decimals) digits.insert(0, decimals + 1 - digits.size(), '0');
  return digits.insert(digits.size() - decimals, ".");
}

}  // namespace

std::string XQueryMilliseconds(int64_t nanoseconds, unsigned decimals) {
  int64_t unit = 1;
  for (unsigned n = decimals; n < 6; ++n) unit *= 10;
  return pointed((nanoseconds + unit / 2) / unit, decimals);
}

std::string XQueryPercent(int64_t part, int64_t whole) {
  if (whole <= 0) return "0.0";
  return pointed(std::llround(1000.0 * static_cast<double>(part) / static_cast<double>(whole)), 1);
}

std::vector<std::pair<std::string_view, int64_t>> XQueryProfilePhases(
    const XQueryProfileData& profile, const XQueryProfileSurroundings& surroundings) {
  std::vector<std::pair<std::string_view, int64_t>> phases;
  if (surroundings.reading) phases.emplace_back("reading", surroundings.reading->count());
  phases.emplace_back("compiling", profile.program->compiling.count());
  phases.emplace_back("planning", profile.program->planning.count());
  phases.emplace_back("evaluating", profile.counts.nanoseconds());
  if (surroundings.printing) phases.emplace_back("printing", surroundings.printing->count());
  return phases;
}

std::vector<int64_t> XQueryProfileTotals(const XQueryProfileCounts& counts) {
  std::vector<int64_t> totals;
  for (const XQueryProfileNode& node : counts.nodes()) totals.push_back(node.own);
  for (size_t i = totals.size(); i-- > 1;) totals[counts.nodes()[i].parent] += totals[i];
  return totals;
}

}  // namespace xquery

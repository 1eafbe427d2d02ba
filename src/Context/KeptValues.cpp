#include "Context/KeptValues.h"

#include <algorithm>

namespace xquery {

// After a few first uses in a row all but two, one after the other, of every so many uses.
bool XQueryKeptValues::looksAway(const XQueryExpr& expr) {
  constexpr uint32_t patience = 16;
  constexpr uint32_t period = 32;
  const auto found = _entries.find(&expr);
  if (found == _entries.end() || found->second.firsts < patience) return false;
  Entry& entry = found->second;
  ++entry.firsts;
  if (entry.firsts < patience + period) return true;
  entry.firsts = patience - 2;
  return false;
}

XQueryKeptValues::Use XQueryKeptValues::use(const XQueryExpr& expr,
                                            std::span<const Value> dependencies,
                                            std::shared_ptr<XQueryKeptValue>& kept) {
  const auto [found, isNew] = _entries.try_emplace(&expr);
  Entry& entry = found->second;
  auto& known = entry.dependencies;
  if (isNew || !std::equal(known.begin(), known.end(), dependencies.begin(), dependencies.end())) {
    known.assign(dependencies.begin(), dependencies.end());
    entry.isDecided = false;
    entry.value = nullptr;
    ++entry.firsts;
    return Use::First;
  }
  entry.firsts = 0;
  kept = entry.value;
  return entry.isDecided ? Use::Further : Use::Second;
}

void XQueryKeptValues::keep(const XQueryExpr& expr, std::shared_ptr<XQueryKeptValue> value) {
  Entry& entry = _entries[&expr];
  entry.isDecided = true;
  entry.value = std::move(value);
}

}  // namespace xquery

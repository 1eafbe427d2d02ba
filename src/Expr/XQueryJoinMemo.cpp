#include "Expr/XQueryJoinMemo.h"

#include <algorithm>

namespace xquery {

XQueryJoinMemo::Use XQueryJoinMemo::use(const XQueryExpr& expr, std::span<const Value> dependencies,
                                        std::shared_ptr<XQueryJoinTable>& table) {
  const auto [found, isNew] = _entries.try_emplace(&expr);
  Entry& entry = found->second;
  auto& known = entry.dependencies;
  if (isNew || !std::equal(known.begin(), known.end(), dependencies.begin(), dependencies.end())) {
    known.assign(dependencies.begin(), dependencies.end());
    entry.isDecided = false;
    entry.table = nullptr;
    return Use::First;
  }
  table = entry.table;
  return entry.isDecided ? Use::Further : Use::Second;
}

void XQueryJoinMemo::keep(const XQueryExpr& expr, std::shared_ptr<XQueryJoinTable> table) {
  Entry& entry = _entries[&expr];
  entry.isDecided = true;
  entry.table = std::move(table);
}

}  // namespace xquery

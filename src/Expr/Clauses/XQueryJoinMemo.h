// The join tables of one evaluation, by the expression that uses them.
//
// An expression has one table at most, for what it depended on when the table was made. A table is
// worth its making only when it is used again, so it is made when the expression is evaluated the
// second time with the same things to depend on. Most expressions never are (the path in "for $p in
// $people return $p/profile[@income > 5000]"), and looking costs more than a short path, so after
// a few disappointments in a row the memo looks only now and then.
#pragma once

#include "Expr/Clauses/XQueryJoinTable.h"
#include "xquery/Object.h"

#include <cstdint>
#include <memory>
#include <span>
#include <unordered_map>
#include <vector>

namespace xquery {

class XQueryExpr;

class XQueryJoinMemo {
 public:
  enum class Use : uint8_t {
    First,    // of these dependencies: take the plain way
    Second,   // make a table, or find that none can be made, and tell with `keep`
    Further,  // `table` is what was kept
  };
  // To be asked before every use: whether to take the plain way without looking.
  bool looksAway(const XQueryExpr& expr);
  // What is compared of the dependencies is their identity; the memo keeps them alive.
  Use use(const XQueryExpr& expr, std::span<const Value> dependencies,
          std::shared_ptr<XQueryJoinTable>& table);
  // A null table stands for: take the plain way as long as the dependencies are these.
  void keep(const XQueryExpr& expr, std::shared_ptr<XQueryJoinTable> table);
  void clear() { _entries.clear(); }

 private:
  struct Entry {
    std::vector<Value> dependencies;
    bool isDecided = false;
    uint32_t firsts = 0;  // in a row
    std::shared_ptr<XQueryJoinTable> table;
  };

  std::unordered_map<const XQueryExpr*, Entry> _entries;
};

}  // namespace xquery

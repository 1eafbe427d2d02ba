// The keys of an item that has several: one for each value that the clauses between the item and
// its key may give to their variables.
#pragma once

#include "Plan/Facts.h"
#include "Plan/Operators/XQueryPlannedExpr.h"

#include <cstddef>
#include <cstdint>
#include <utility>
#include <vector>

namespace xquery {

class XQueryGatherer;

// A let clause, or one whose variable takes the items of its value one after another.
struct XQueryJoinClause {
  int64_t varID = 0;
  Ref<XQueryExpr> expr;
  bool isLoop = false;
  XQueryFacts facts;  // of the clause
};

class XQueryJoinKeys : public XQueryPlannedExpr {
 public:
  // `areSingle`: each key is of one item at most, or none can be had.
  [[nodiscard]] static Ref<XQueryJoinKeys> exprWithClauses(std::vector<XQueryJoinClause> clauses,
                                                           Ref<XQueryExpr> key, bool areSingle) {
    return make<XQueryJoinKeys>(std::move(clauses), std::move(key), areSingle);
  }

  // All the keys, one after another; null when a clause or a key fails.
  Value computeValue(XQueryContext& context) const override;

 protected:
  XQueryJoinKeys(std::vector<XQueryJoinClause> clauses, Ref<XQueryExpr> key, bool areSingle)
      : XQueryPlannedExpr(std::move(key)), _clauses(std::move(clauses)), _areSingle(areSingle) {}
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  bool add(size_t clause, XQueryGatherer& keys, XQueryContext& context) const;

  const std::vector<XQueryJoinClause> _clauses;
  const bool _areSingle;
};

}  // namespace xquery

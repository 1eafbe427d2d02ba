// Joins: a clause or a step whose items are asked a comparison of a key with a probe finds those
// that meet it in a table of the keys when it is evaluated again over the same items. Of several
// comparisons joined by "and" the one that is met by the fewest items finds them, and the others
// are asked of these. The plain way
// evaluates the comparison for every item each time, which makes a join of two lists take as many
// comparisons as there are pairs.
//
// Nobody can tell the difference. Key, probe and what else is asked beforehand are repeatable, so
// how often they are evaluated does not matter; keys are found where nothing changes while a query
// is evaluated, which is inside a node and, for nodes of documents, around it; an item whose
// comparison may be an error is asked the plain way when its turn comes; and where the probe itself
// fails, or anything else is unusual, the whole round is done the plain way. With diagnostics on,
// when evaluating writes to the log, there are no joins.
#pragma once

#include "Expr/XQueryPicker.h"
#include "Plan/Joins/XQueryJoinCondition.h"

#include <cstdint>
#include <memory>
#include <optional>
#include <utility>
#include <vector>

namespace xquery {

class XQueryJoin final : public XQueryPicker {
 public:
  // For the items of a clause that sets a variable. `owner` is the clause.
  static std::unique_ptr<const XQueryJoin> ofClause(const XQueryExpr& owner, int64_t varID,
                                                    XQueryJoinCondition condition);
  // For what a path's step is asked for. `looksAround`: to find the items from what the path starts
  // with. `owner` is the path.
  static std::unique_ptr<const XQueryJoin> ofStep(const XQueryExpr& owner,
                                                  XQueryJoinCondition condition, bool looksAround);

  bool pick(const Value& source, const Lister& listItems, XQueryContext& context,
            XQueryPicks& picks) const override;

 private:
  XQueryJoin(const XQueryExpr& owner, int64_t varID, XQueryJoinCondition condition,
             bool looksAround)
      : _owner(owner),
        _varID(varID),
        _condition(std::move(condition)),
        _looksAroundSource(looksAround) {}

  class Tables;
  struct Asked;

  std::shared_ptr<Tables> tables(const Value& source, const Lister& listItems,
                                 XQueryContext& context) const;
  std::shared_ptr<Tables> tablesOf(const Lister& listItems) const;
  std::shared_ptr<Tables> makeTables(const Lister& listItems, XQueryContext& context) const;
  const XQueryValueWay* indexedWay() const;
  std::shared_ptr<Tables> indexed(const Value& source, const Lister& listItems,
                                  XQueryContext& context) const;
  bool prepareTable(Tables& tables, XQueryContext& context) const;
  bool pickIndexed(Tables& tables, bool withProbes, XQueryContext& context,
                   XQueryPicks& picks) const;
  bool addTable(Tables& tables, XQueryContext& context) const;
  Value keyOf(const Value& item, size_t position, size_t term, XQueryContext& context) const;
  bool askEach(const Tables& tables, bool withProbes, XQueryContext& context,
               std::vector<Asked>& asked) const;
  static std::optional<uint64_t> numberOf(Tables& tables, std::vector<Asked>& asked,
                                          XQueryPicks::Number wanted);
  static void select(Tables& tables, std::vector<Asked>& asked, bool areSure, XQueryPicks& picks);

  const XQueryExpr& _owner;
  const int64_t _varID;  // 0: the item is the context item
  const XQueryJoinCondition _condition;
  const bool _looksAroundSource;
};

}  // namespace xquery

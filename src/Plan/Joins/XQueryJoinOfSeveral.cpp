#include "Plan/Joins/XQueryJoinOfSeveral.h"

#include "Platform/Base/WorkMeter.h"

#include <utility>
#include <vector>

namespace xquery {
namespace {

using Chosen = std::vector<XQueryPick>;

// What is chosen by the condition `first` or, of what that excludes, by the one behind it. Where it
// is open whether the first holds it has to be asked, since that may be an error.
Chosen eitherOf(const Chosen& first, const Chosen& second) {
  Chosen all;
  all.reserve(first.size() + second.size());
  WorkPacer pacer;
  auto one = first.begin();
  auto other = second.begin();
  while (one != first.end() || other != second.end()) {
    pacer.turn();
    const bool isOfFirst =
        one != first.end() && (other == second.end() || one->position <= other->position);
    if (!isOfFirst) {
      all.push_back(*other++);
      continue;
    }
    if (other != second.end() && other->position == one->position) ++other;
    all.push_back(*one++);
  }
  return all;
}

class JoinOfSeveral final : public XQueryPicker {
 public:
  // What each keeps is kept by its key, an expression of its own.
  struct Join {
    Ref<XQueryExpr> owner;
    std::unique_ptr<const XQueryJoin> join;
  };
  explicit JoinOfSeveral(std::vector<Join> joins) : _joins(std::move(joins)) {}

  bool pick(const Value& source, const Lister& listItems, XQueryContext& context,
            XQueryPicks& picks) const override {
    bool haveAll = true;
    bool isFirst = true;
    for (const Join& each : _joins) {
      XQueryPicks own;
      // Each is to be asked, so that all know that the items have come again.
      haveAll = each.join->pick(source, listItems, context, own) && haveAll;
      if (!haveAll) continue;
      picks.chosen = isFirst ? std::move(own.chosen) : eitherOf(picks.chosen, own.chosen);
      picks.items = std::move(own.items);
      isFirst = false;
    }
    if (!haveAll) picks.chosen.clear();
    return haveAll;
  }

 private:
  const std::vector<Join> _joins;
};

// `make` makes the join of one condition, kept by an expression.
template <class Make>
std::unique_ptr<const XQueryPicker> joinsOf(const XQueryExpr& owner, XQueryJoinCondition condition,
                                            Make make) {
  if (condition.orElse.empty()) return make(owner, std::move(condition));
  std::vector<JoinOfSeveral::Join> joins;
  auto others = std::exchange(condition.orElse, {});
  others.insert(others.begin(), std::move(condition));
  for (XQueryJoinCondition& each : others) {
    XQueryJoinTerm& term = each.terms.front();
    term.key = XQueryJoinKeys::exprWithClauses({}, std::move(term.key), false);
    const Ref<XQueryExpr> own = term.key;
    joins.push_back({own, make(*own, std::move(each))});
  }
  return std::make_unique<JoinOfSeveral>(std::move(joins));
}

}  // namespace

std::unique_ptr<const XQueryPicker> XQueryJoinsOfClause(const XQueryExpr& owner, int64_t varID,
                                                        XQueryJoinCondition condition) {
  return joinsOf(owner, std::move(condition), [&](const XQueryExpr& by, XQueryJoinCondition own) {
    return XQueryJoin::ofClause(by, varID, std::move(own));
  });
}

std::unique_ptr<const XQueryPicker> XQueryJoinsOfStep(const XQueryExpr& owner,
                                                      XQueryJoinCondition condition,
                                                      bool looksAround) {
  return joinsOf(owner, std::move(condition), [&](const XQueryExpr& by, XQueryJoinCondition own) {
    return XQueryJoin::ofStep(by, std::move(own), looksAround);
  });
}

}  // namespace xquery

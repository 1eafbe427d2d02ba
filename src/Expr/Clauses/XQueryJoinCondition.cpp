#include "Expr/Clauses/XQueryJoinCondition.h"

#include "Expr/Operators/XQueryOperatorExpr.h"
#include "Expr/XQueryLists.h"

#include <algorithm>
#include <cstddef>
#include <optional>
#include <utility>

namespace xquery {
namespace {

// Longer chains of conditions are left alone.
constexpr size_t mostConditions = 16;

// The value comparison code whose relation the operator asks for.
std::optional<int> relationCode(int type) {
  switch (type) {
    case XQueryOperatorEqual:
    case XQueryOperatorLess:
    case XQueryOperatorLessEqual:
    case XQueryOperatorGreater:
    case XQueryOperatorGreaterEqual:
      return type + XQueryOperatorEq - XQueryOperatorEqual;
    case XQueryOperatorEq:
    case XQueryOperatorLt:
    case XQueryOperatorLe:
    case XQueryOperatorGt:
    case XQueryOperatorGe:
      return type;
    default:
      return std::nullopt;
  }
}

// a < b is b > a, and not (a < b) is not (b > a).
XQueryRelation mirrored(XQueryRelation relation) {
  if (relation.test == XQueryRelation::Less) {
    relation.test = XQueryRelation::Greater;
  } else if (relation.test == XQueryRelation::Greater) {
    relation.test = XQueryRelation::Less;
  }
  return relation;
}

XQueryJoinCondition comparisonIn(const XQueryExpr& condition,
                                 const XQueryJoinCondition::Reads& reads) {
  XQueryJoinCondition found;
  const auto* comparison = dyn_cast<XQueryOperatorExpr>(&condition);
  const auto code = comparison ? relationCode(comparison->operatorType()) : std::nullopt;
  if (!code || !comparison->left() || !comparison->right()) return found;
  // A comparison with a range looks at its bounds; listing its integers may take all memory.
  if (XQueryOperatorExpr::rangeIn(comparison->right())) return found;
  found.relation = XQueryRelationForCode(*code);
  found.isValueComparison = comparison->operatorType() >= XQueryOperatorEq;
  const XQueryExpr* left = comparison->left();
  const XQueryExpr* right = comparison->right();
  if (reads(*right) == XQueryJoinReads::Item) {
    std::swap(left, right);
    found.relation = mirrored(found.relation);
  }
  if (reads(*left) == XQueryJoinReads::Item && reads(*right) == XQueryJoinReads::Round) {
    found.key = left;
    found.probe = right;
  }
  return found;
}

// The conditions that "and" joins, in their order; none for too long a chain.
std::vector<const XQueryExpr*> conjuncts(const XQueryExpr* condition) {
  std::vector<const XQueryExpr*> found;
  std::vector<const XQueryExpr*> waiting = {condition};
  while (!waiting.empty()) {
    const XQueryExpr* next = XQueryWithoutParentheses(waiting.back());
    waiting.pop_back();
    const auto* both = dyn_cast<XQueryOperatorExpr>(next);
    if (both && both->operatorType() == XQueryOperatorAnd) {
      waiting.push_back(both->right());
      waiting.push_back(both->left());
    } else {
      found.push_back(next);
    }
    if (!next || found.size() + waiting.size() > mostConditions) return {};
  }
  return found;
}

// How much a comparison promises to exclude. One that is the same in every round excludes the same
// items each time, which says nothing about how many.
int promiseOf(const XQueryJoinCondition& comparison) {
  if (!comparison.key) return 0;
  if (comparison.relation.test != XQueryRelation::Equal) return 1;
  const XQueryReads probe = XQueryReadsOf(*comparison.probe);
  return probe.focus || probe.globals || !probe.variables.empty() ? 3 : 2;
}

}  // namespace

XQueryJoinCondition XQueryJoinCondition::in(const XQueryExpr* condition, bool errorExcludes,
                                            const Reads& reads) {
  const auto all = conjuncts(condition);
  XQueryJoinCondition best;
  std::vector<const XQueryExpr*> filters;
  std::vector<const XQueryExpr*> guards;
  for (const XQueryExpr* conjunct : all) {
    if (!conjunct) break;
    const XQueryReads parts = XQueryReadsOf(*conjunct);
    if (!parts.isRepeatable) break;
    // The plain way, which came first, has fetched what the first condition asks for of each item,
    // and may not have come to the others.
    if (parts.loads && conjunct != all.front()) break;
    XQueryJoinCondition found = comparisonIn(*conjunct, reads);
    if (promiseOf(found) > promiseOf(best)) {
      best = std::move(found);
      best.isWhole = conjunct == all.back() && filters.size() + guards.size() + 1 == all.size();
      best.filters = filters;
      best.guards = guards;
    }
    if (errorExcludes) {
      if (parts.loads) break;
      continue;
    }
    const XQueryJoinReads read = reads(*conjunct);
    if (read == XQueryJoinReads::Unknown) break;
    (read == XQueryJoinReads::Item ? filters : guards).push_back(conjunct);
  }
  if (best.key) best.noteOutward();
  return best;
}

void XQueryJoinCondition::noteOutward() {
  const auto looksOut = [](const XQueryExpr* expr) { return XQueryReadsOf(*expr).outside; };
  looksOutOfItems = looksOut(key) || std::any_of(filters.begin(), filters.end(), looksOut);
  const auto note = [this](const XQueryExpr* expr) {
    XQueryReads reads = XQueryReadsOf(*expr);
    if (reads.outside) outward.push_back(std::move(reads));
  };
  note(probe);
  std::for_each(guards.begin(), guards.end(), note);
}

}  // namespace xquery

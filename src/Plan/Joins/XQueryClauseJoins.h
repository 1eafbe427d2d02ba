// Gives the clauses of a FLWOR or a quantifier that can be joined their joins.
#pragma once

#include "Expr/XQueryBinding.h"
#include "Plan/Joins/XQueryJoinCondition.h"
#include "Plan/Planning.h"

#include <cstddef>
#include <string_view>
#include <utility>
#include <vector>

namespace xquery {

class XQueryClauseJoins {
 public:
  // What is asked once all clauses have set their variables: the items of a clause are picked for
  // which it may hold, or for which it may not hold.
  enum class Picks : uint8_t { WhereItHolds, WhereItFails };

  // The condition stands in a part of the expression, or is one, behind the clauses.
  XQueryClauseJoins(XQueryPlanning& planning, XQueryPlaceID expr, XQueryPlaceID part,
                    XQueryPlaceID condition, Picks picks)
      : _planning(planning),
        _clauses(clausesBefore(part, expr, planning.program)),
        _condition(condition),
        _picks(picks) {}

  // Whether any clause has been given a join.
  bool join() {
    bool areAny = false;
    for (size_t index = 0; index < _clauses.size(); ++index) areAny = joinClause(index) || areAny;
    return areAny;
  }
  // Whether there are comparisons that could pick items of one of them.
  bool seesComparison() const;

 private:
  // What is ordered by stands behind them.
  static std::vector<XQueryPlaceID> clausesBefore(XQueryPlaceID end, XQueryPlaceID whole,
                                                  const XQueryProgram& program) {
    std::vector<XQueryPlaceID> clauses;
    for (XQueryPlaceID part = program.firstPart(whole);
         part != end && isa<XQueryBindingExpr>(program[part].expr); part = program.nextPart(part)) {
      clauses.push_back(part);
    }
    return clauses;
  }

  const XQueryPlace& at(XQueryPlaceID place) const { return _planning.program[place]; }
  const XQueryFacts& facts(XQueryPlaceID place) const { return _planning.facts[place]; }
  const XQueryBindingExpr& clauseAt(size_t index) const {
    return *cast<XQueryBindingExpr>(at(_clauses[index]).expr);
  }
  XQueryPlaceID boundAt(size_t index) const {
    return _planning.program.part(_clauses[index], XQueryRole::Bound);
  }
  struct Later {
    std::vector<XQueryJoinClause> following;
    // What must not fail, though it is evaluated for no item that is left out.
    std::vector<Ref<XQueryExpr>> needed;
    XQueryVariableSet leftovers;  // variables that are left with something else
    std::string_view obstacle;    // why no item can be left out
  };

  XQueryJoinScope scopeOf(size_t index) const;
  Later clausesBehind(size_t index, XQueryJoinScope& scope) const;
  // The operands of an equality.
  struct Sides {
    XQueryPlaceID first = XQueryNoPlace;
    XQueryPlaceID second = XQueryNoPlace;
  };
  Sides sidesOf(XQueryPlaceID comparison) const;
  bool readsOnly(XQueryPlaceID place, int64_t varID) const;
  void addTermsAhead(size_t index, const XQueryJoinScope& scope, const XQueryJoinSearch& search,
                     XQueryJoinCondition& condition) const;
  void addTermsAhead(size_t later, const std::vector<XQueryPlaceID>& conditions, int64_t varID,
                     const XQueryJoinScope& scope, XQueryJoinCondition& condition) const;
  bool mayLookAhead(size_t later, const std::vector<XQueryPlaceID>& conditions, int64_t varID,
                    const XQueryJoinScope& scope) const;
  std::string_view obstacleAhead(size_t later) const;
  bool walksItems(size_t index) const;
  bool mayFollow(size_t index, size_t later) const;
  bool joinClause(size_t index);

  XQueryPlanning& _planning;
  const std::vector<XQueryPlaceID> _clauses;
  const XQueryPlaceID _condition;
  const Picks _picks;
};

}  // namespace xquery

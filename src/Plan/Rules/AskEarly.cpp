// A condition of a where clause is asked as soon as what it reads is there.
//
// Pattern     for or let $x ..., clauses behind it, where ... C ..., where C is one of the
//             conditions that "and" joins, or the only one, and reads nothing that the clauses
//             behind $x set
// Facts       C, the conditions before it and the clauses behind $x are repeatable, cannot fail and
//             load nothing; a condition answers a truth value or nodes; what the clauses leave in
//             variables cannot be told; where C looks outside the nodes that it starts from, the
//             whole expression makes no nodes
// Operator    none for the clause, which is told the condition; XQueryAskedEarly in its old place
// Why         C is the same for every tuple with this $x. Where it does not hold, the where clause
//             drops them all, and nothing that is evaluated for them can be told
#include "Expr/Clauses/XQueryFLWOR.h"
#include "Plan/Joins/XQueryJoinCondition.h"
#include "Plan/Operators/XQueryAskedEarly.h"
#include "Plan/Planning.h"
#include "Plan/Rules.h"

#include <cstddef>
#include <utility>
#include <vector>

namespace xquery {
namespace {

class EarlyConditions {
 public:
  EarlyConditions(XQueryPlanning& planning, XQueryPlaceID place)
      : _planning(planning), _program(planning.program), _place(place) {
    _where = _program.part(place, XQueryRole::Where);
    for (XQueryPlaceID part = _program.firstPart(place); part != XQueryNoPlace && part != _where;
         part = _program.nextPart(part)) {
      _clauses.push_back(part);
    }
  }

  void take() const {
    if (_where == XQueryNoPlace || _clauses.size() < 2) return;
    const XQueryJoinSearch search(_planning, {}, {});
    bool areAllTaken = true;
    for (const XQueryPlaceID condition : search.conjuncts(_where)) {
      if (!search.cannotFail(condition) || !isIdleButForErrors(condition)) return;
      const bool isThere = _planning.isOpen(condition) || _planning.isWrapped(condition);
      areAllTaken = isThere && (areAllTaken || isBrief(condition)) && takeCondition(condition);
    }
  }

 private:
  const XQueryFacts& facts(XQueryPlaceID place) const { return _planning.facts[place]; }
  XQueryBindingExpr& clauseAt(size_t index) const {
    return *cast<XQueryBindingExpr>(_program[_clauses[index]].expr);
  }
  bool isIdleButForErrors(XQueryPlaceID place) const {
    return facts(place).isRepeatable() && !facts(place).does(XQueryDeeds::LoadsDocuments);
  }

  // Behind a condition that drops most tuples a long one would be asked more often than before.
  bool isBrief(XQueryPlaceID condition) const {
    constexpr XQueryPlaceID mostPlaces = 12;
    using namespace XQueryDeeds;
    return _program[condition].end - condition <= mostPlaces &&
           !facts(condition).does(ReadsRoot | ReadsOutside | ReadsGlobals);
  }

  bool takeCondition(XQueryPlaceID condition) const {
    const size_t index = clauseFor(condition);
    if (index == _clauses.size() || !mayDropBehind(index, condition)) return false;
    Ref<XQueryExpr> asked = _planning.exprAt(condition);
    clauseAt(index).addCondition(asked);
    _planning.wrap(condition, XQueryAskedEarly::exprWithPlain(std::move(asked)));
    return true;
  }

  // The first clause behind which the condition can be asked, to some purpose; their number for
  // none.
  size_t clauseFor(XQueryPlaceID condition) const {
    size_t index = _clauses.size();
    XQueryVariableSet later;
    while (index > 0) {
      if (facts(condition).reads.meets(later)) break;
      later.add(variablesOf(--index));
    }
    return index + 1 < _clauses.size() ? index : _clauses.size();
  }

  // Those that it sets.
  XQueryVariableSet variablesOf(size_t index) const {
    XQueryVariableSet variables = facts(_clauses[index]).assigns;
    variables.add(clauseAt(index).varID());
    const auto* forExpr = dyn_cast<XQueryForExpr>(&clauseAt(index));
    if (forExpr) variables.add(forExpr->posVarID());
    return variables;
  }

  // Whether nobody can tell that the clauses behind one are not evaluated.
  bool mayDropBehind(size_t index, XQueryPlaceID condition) const {
    using namespace XQueryDeeds;
    if (facts(condition).does(ReadsOutside | ReadsRoot) && !facts(_place).isRepeatable()) {
      return false;
    }
    XQueryVariableSet leftovers = facts(_where).assigns;
    for (size_t later = index + 1; later < _clauses.size(); ++later) {
      const bool mayFail =
          clauseAt(later).type() != nullptr || facts(_clauses[later]).does(MayFail);
      if (mayFail || !isIdleButForErrors(_clauses[later])) {
        _planning.refuse(condition, "a clause that would not be evaluated may fail, or be told");
        return false;
      }
      leftovers.add(variablesOf(later));
    }
    return !_planning.showsLeftovers(leftovers, _place);
  }

  XQueryPlanning& _planning;
  const XQueryProgram& _program;
  const XQueryPlaceID _place;
  XQueryPlaceID _where;
  std::vector<XQueryPlaceID> _clauses;
};

}  // namespace

void XQueryAskEarly(XQueryPlanning& planning) {
  for (XQueryPlaceID place = 0; place < planning.program.placeCount(); ++place) {
    if (isa<XQueryFLWORExpr>(planning.program[place].expr)) {
      EarlyConditions(planning, place).take();
    }
  }
}

}  // namespace xquery

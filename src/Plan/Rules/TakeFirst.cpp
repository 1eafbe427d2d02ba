// The first items of a path, and of what is sorted.
//
// Pattern     subsequence(E, 1, 3), (E)[1], (E)[position() <= 3], with any small numbers; the
//             same of a variable that "let" sets to E, where every use of it is such; for $x at $i
//             in E ... where $i <= 3 ...
// Facts       E is a path that finds its nodes in document order from one node, and that can be
//             walked in part (XQueryWalkedPath::findsInOrder), a FLWOR with order specs, or one of
//             which what is behind an item cannot fail and does nothing (EarlyEnds.h); clauses
//             declare no types; those between "at $i" and the condition are repeatable and cannot
//             fail; what is left in their variables cannot be told
// Operator    XQueryFirstNodes for a path: the walk ends at the last node that can be asked for.
//             XQueryFirstTuples for a FLWOR: only so many are put into their order, once everything
//             has been evaluated, or no more tuples are made than that takes
// Why         what is behind these items cannot be told from what is not there, since the whole
//             asks neither for it nor for the number of items. Whether keys can be compared is
//             found out for all of them
#include "Expr/Clauses/XQueryFLWOR.h"
#include "Expr/Operators/XQueryOperatorExpr.h"
#include "Expr/Paths/XQueryPath.h"
#include "Expr/XQueryLeaves.h"
#include "Expr/XQueryLists.h"
#include "Functions/Sequence.h"
#include "Functions/XQueryFunctionCall.h"
#include "Plan/Operators/XQueryFirstNodes.h"
#include "Plan/Planning.h"
#include "Plan/Rules.h"
#include "Plan/Rules/EarlyEnds.h"
#include "Plan/Rules/PathAt.h"
#include "Plan/Rules/PlaceInside.h"
#include "Plan/Rules/PositionConditions.h"

#include <algorithm>
#include <map>
#include <optional>

namespace xquery {
namespace {

// How many items at the front of its first argument a call looks at; none for: all.
std::optional<uint64_t> itemsAskedForBy(const XQueryFunctionCall& call) {
  const bool fits = call.builtIn() && call.function() == fn_subsequence && call.args() &&
                    call.args()->count() == 3;
  if (!fits) return std::nullopt;
  const auto start = XQuerySmallIntegerIn(call.args()->objectAtIndex(1));
  const auto length = XQuerySmallIntegerIn(call.args()->objectAtIndex(2));
  if (!start || !length) return std::nullopt;
  // A start below 1 counts as 1.
  const int64_t last = std::max<int64_t>(*start, 1) - 1 + *length;
  return *length < 1 ? std::nullopt : std::optional(static_cast<uint64_t>(last));
}

// The same for a comparison of their positions with a number.
std::optional<uint64_t> itemsAskedForBy(int comparison, int64_t number) {
  int64_t last = 0;
  switch (comparison) {
    case XQueryOperatorLess:
    case XQueryOperatorLt:
      last = number - 1;
      break;
    case XQueryOperatorLessEqual:
    case XQueryOperatorLe:
    case XQueryOperatorEqual:
    case XQueryOperatorEq:
      last = number;
      break;
    default:
      break;
  }
  return last < 1 ? std::nullopt : std::optional(static_cast<uint64_t>(last));
}

// The same for a predicate of the items.
std::optional<uint64_t> itemsAskedForBy(const XQueryExpr& predicate) {
  if (const auto number = XQuerySmallIntegerIn(&predicate)) {
    return itemsAskedForBy(XQueryOperatorEq, *number);
  }
  const auto asked = XQueryPositionConditionIn(predicate);
  return asked ? itemsAskedForBy(asked->comparison, asked->number) : std::nullopt;
}

class Search {
 public:
  explicit Search(XQueryPlanning& planning) : _planning(planning), _program(planning.program) {}

  void run() {
    for (XQueryPlaceID place = 0; place < _program.placeCount(); ++place) {
      const XQueryPlace& here = _program[place];
      if (isa<XQueryVariable>(here.expr)) noteUse(place);
      if (const auto* call = dyn_cast<XQueryFunctionCall>(here.expr)) {
        const auto most = itemsAskedForBy(*call);
        if (most) limit(_program.firstPart(_program.firstPart(place)), *most);
      } else if (here.role == XQueryRole::FirstStep && here.step &&
                 !here.step->predicates().empty() && here.step->predicates().front()) {
        const auto most = itemsAskedForBy(*here.step->predicates().front());
        if (most) limit(place, *most);
      } else if (here.expr->kind() == Kind::ForExpr) {
        const auto most = itemsAskedForByPosition(place);
        if (most) limit(_program.part(place, XQueryRole::Bound), *most);
      }
    }
    for (const auto& [clause, uses] : _lets) {
      const auto* let = cast<XQueryLetExpr>(_program[clause].expr);
      if (uses.asking < uses.all || let->type()) continue;
      limit(_program.part(clause, XQueryRole::Bound), uses.most);
    }
  }

 private:
  // Of a variable that is set by "let".
  struct Uses {
    size_t all = 0;
    size_t asking = 0;  // that ask for the first items only
    uint64_t most = 0;
  };

  Uses* usesOf(XQueryPlaceID variable) {
    const XQueryPlaceID binder = _program[variable].binder;
    const bool isLet = binder != XQueryNoPlace && _program[binder].expr->kind() == Kind::LetExpr;
    return isLet ? &_lets[binder] : nullptr;
  }

  void noteUse(XQueryPlaceID variable) {
    if (Uses* uses = usesOf(variable)) ++uses->all;
  }

  // The place, or what stands in parentheses there.
  void limit(XQueryPlaceID place, uint64_t most) {
    place = place == XQueryNoPlace ? place : XQueryPlaceInside(_program, place);
    if (place == XQueryNoPlace || !_planning.isOpen(place)) return;
    if (isa<XQueryVariable>(_program[place].expr)) {
      if (Uses* uses = usesOf(place)) {
        ++uses->asking;
        uses->most = std::max(uses->most, most);
      }
      return;
    }
    if (auto* flwor = dyn_cast<XQueryFLWORExpr>(_program[place].expr)) {
      const bool mayEndEarly =
          XQueryMayEndEarly(_planning, place) && !_planning.facts[place].mayBe(XQueryItems::Other);
      if (flwor->orderSpecs().empty() && !mayEndEarly) {
        return _planning.refuse(place, "what is behind the first items may fail, or could be told");
      }
      return _planning.wrap(place,
                            XQueryFirstTuples::exprWithPlain(Ref<XQueryFLWORExpr>(flwor), most));
    }
    XQueryWalkedPath* path = XQueryWalkedPathAt(_planning, place);
    if (!path) return;
    if (!path->findsInOrder()) {
      return _planning.refuse(place, "its nodes may not come in document order as they are found");
    }
    _planning.wrap(place, XQueryFirstNodes::exprWithPlain(Ref<XQueryWalkedPath>(path), most));
  }

  // Of a for clause with a position that the condition asks for first: how many items can meet it.
  std::optional<uint64_t> itemsAskedForByPosition(XQueryPlaceID clause) {
    const auto& forExpr = *cast<XQueryForExpr>(_program[clause].expr);
    if (forExpr.posVarID() == 0 || forExpr.type()) return std::nullopt;
    XQueryVariableSet leftovers;
    leftovers.add(forExpr.varID());
    leftovers.add(forExpr.posVarID());
    XQueryPlaceID part = _program.nextPart(clause);
    for (; part != XQueryNoPlace && _program[part].role == XQueryRole::Clause;
         part = _program.nextPart(part)) {
      const XQueryFacts& facts = _planning.facts[part];
      const auto* later = dyn_cast<XQueryForExpr>(_program[part].expr);
      if (!facts.isRepeatable() || facts.does(XQueryDeeds::MayFail | XQueryDeeds::LoadsDocuments)) {
        return std::nullopt;
      }
      leftovers.add(facts.assigns);
      const auto* binding = dyn_cast<XQueryBindingExpr>(_program[part].expr);
      if (binding) leftovers.add(binding->varID());
      if (later) leftovers.add(later->posVarID());
    }
    if (part == XQueryNoPlace || _program[part].role != XQueryRole::Where) return std::nullopt;
    const auto most = itemsAskedForByFirst(part, forExpr.posVarID());
    if (most && _planning.showsLeftovers(leftovers, clause)) {
      _planning.refuse(clause, "a variable that would be left with another item may be read unset");
      return std::nullopt;
    }
    return most;
  }

  // The same for the first of the conditions that "and" joins.
  std::optional<uint64_t> itemsAskedForByFirst(XQueryPlaceID where, int64_t positionID) const {
    XQueryPlaceID place = _program.withoutParentheses(where);
    const auto* operation = dyn_cast<XQueryOperatorExpr>(_program[place].expr);
    while (operation && operation->operatorType() == XQueryOperatorAnd) {
      place = _program.withoutParentheses(_program.firstPart(place));
      operation = dyn_cast<XQueryOperatorExpr>(_program[place].expr);
    }
    if (!operation || !operation->left() || !operation->right()) return std::nullopt;
    const XQueryPlaceID left = _program.withoutParentheses(_program.firstPart(place));
    const XQueryPlaceID right =
        _program.withoutParentheses(_program.nextPart(_program.firstPart(place)));
    const auto isPosition = [&](XQueryPlaceID each) {
      const auto* variable = dyn_cast<XQueryVariable>(_program[each].expr);
      return variable && variable->varID() == positionID;
    };
    const bool isOnLeft = isPosition(left);
    if (!isOnLeft && !isPosition(right)) return std::nullopt;
    const auto number = XQuerySmallIntegerIn(_program[isOnLeft ? right : left].expr);
    const int type = operation->operatorType();
    if (!number) return std::nullopt;
    return itemsAskedForBy(isOnLeft ? type : XQueryMirroredComparison(type), *number);
  }

  XQueryPlanning& _planning;
  const XQueryProgram& _program;
  std::map<XQueryPlaceID, Uses> _lets;  // by clause
};

}  // namespace

void XQueryTakeFirst(XQueryPlanning& planning) {
  Search(planning).run();
}

}  // namespace xquery

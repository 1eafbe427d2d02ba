// How many nodes there are, and whether there are any.
//
// Pattern     count(P), exists(P), empty(P), not(P), boolean(P); count(P) compared with an integer;
//             P where its truth is asked for: as a predicate, a condition, an operand of "and" and
//             "or"
// Facts       P is a path whose last step is an axis step, all of whose tests and predicates can be
//             repeated and cannot fail once the first step is evaluated
//             (XQueryWalkedPath::countsNodes)
// Operator    XQueryPathCount: no list is made, and the walk ends as soon as the answer is certain
// Why         what is not walked could only have found more nodes; the truth of nodes is that there
//             are any
#include "Expr/Operators/XQueryOperatorExpr.h"
#include "Expr/XQueryLists.h"
#include "Functions/Boolean.h"
#include "Functions/Sequence.h"
#include "Functions/XQueryFunctionCall.h"
#include "Plan/Operators/XQueryPathCount.h"
#include "Plan/Paths/XQueryWalkedPath.h"
#include "Plan/Planning.h"
#include "Plan/Rules.h"
#include "Plan/Rules/PositionConditions.h"

#include <array>
#include <optional>

namespace xquery {
namespace {

using Question = XQueryPathCount::Question;

// The path that counts its nodes, in parentheses or not; null for anything else.
XQueryWalkedPath* pathIn(const XQueryExpr* expr) {
  const auto* planned = dyn_cast<XQueryPlannedExpr>(XQueryWithoutParentheses(expr));
  const XQueryWalkedPath* path = planned ? planned->walkedPath() : nullptr;
  return path && path->countsNodes() ? const_cast<XQueryWalkedPath*>(path) : nullptr;
}

// Of a call with one argument.
const XQueryExpr* onlyArgument(const XQueryExpr* expr, XQueryProcedure function) {
  const auto* call = dyn_cast<XQueryFunctionCall>(XQueryWithoutParentheses(expr));
  const bool fits = call && call->builtIn() && call->function() == function && call->args() &&
                    call->args()->count() == 1;
  return fits ? call->args()->objectAtIndex(0) : nullptr;
}

// "count compared with number" as a question for some number of nodes at least; none for one that
// is none, as for a certain number, or whose answer is known.
std::optional<Question> questionOf(int type, int64_t number) {
  const auto atLeast = [](int64_t least, bool isNegated) -> std::optional<Question> {
    if (least < 1) return std::nullopt;
    return Question{static_cast<uint64_t>(least), isNegated};
  };
  switch (type) {
    case XQueryOperatorGreater:
    case XQueryOperatorGt:
      return atLeast(number + 1, false);
    case XQueryOperatorGreaterEqual:
    case XQueryOperatorGe:
      return atLeast(number, false);
    case XQueryOperatorLess:
    case XQueryOperatorLt:
      return atLeast(number, true);
    case XQueryOperatorLessEqual:
    case XQueryOperatorLe:
      return atLeast(number + 1, true);
    case XQueryOperatorEqual:
    case XQueryOperatorEq:
      return number == 0 ? atLeast(1, true) : std::nullopt;
    case XQueryOperatorNotEqual:
    case XQueryOperatorNe:
      return number == 0 ? atLeast(1, false) : std::nullopt;
    default:
      return std::nullopt;
  }
}

class Search {
 public:
  explicit Search(XQueryPlanning& planning) : _planning(planning) {}

  void run() {
    // Whole ones first: "not(P)" before P.
    for (XQueryPlaceID place = 0; place < _planning.program.placeCount(); ++place) {
      if (!_planning.isOpen(place) || XQueryTraitsOf(_planning.program[place].role).isNoValue) {
        continue;
      }
      if (!lookAtCall(place) && !lookAtComparison(place)) lookAtTruth(place);
    }
  }

 private:
  const XQueryExpr* at(XQueryPlaceID place) const { return _planning.program[place].expr; }

  bool wrap(XQueryPlaceID place, XQueryWalkedPath* path, Question question) {
    if (!path) return false;
    _planning.wrap(place, XQueryPathCount::exprWithPlain(*_planning.program[place].slot,
                                                         Ref<XQueryWalkedPath>(path), question));
    return true;
  }

  bool lookAtCall(XQueryPlaceID place) {
    struct Row {
      XQueryProcedure function;
      Question question;
    };
    static constexpr std::array<Row, 5> rows = {{
        {fn_count, {0, false}},
        {fn_exists, {1, false}},
        {fn_boolean, {1, false}},
        {fn_empty, {1, true}},
        {fn_not, {1, true}},
    }};
    if (!isa<XQueryFunctionCall>(at(place))) return false;
    for (const Row& row : rows) {
      const XQueryExpr* argument = onlyArgument(at(place), row.function);
      if (argument) return wrap(place, pathIn(argument), row.question);
    }
    return false;
  }

  bool lookAtComparison(XQueryPlaceID place) {
    const auto* comparison = dyn_cast<XQueryOperatorExpr>(at(place));
    if (!comparison) return false;
    int type = comparison->operatorType();
    const XQueryExpr* counted = onlyArgument(comparison->left(), fn_count);
    auto number = XQuerySmallIntegerIn(comparison->right());
    if (!counted) {
      counted = onlyArgument(comparison->right(), fn_count);
      number = XQuerySmallIntegerIn(comparison->left());
      type = XQueryMirroredComparison(type);
    }
    if (!counted || !number) return false;
    const auto question = questionOf(type, *number);
    return question && wrap(place, pathIn(counted), *question);
  }

  void lookAtTruth(XQueryPlaceID place) {
    if (isAskedForTruth(place)) wrap(place, pathIn(_planning.exprAt(place).get()), {1, false});
  }

  bool isAskedForTruth(XQueryPlaceID place) const {
    switch (_planning.program[place].role) {
      case XQueryRole::Test:
      case XQueryRole::Where:
      case XQueryRole::Satisfies:
      case XQueryRole::Predicate:
        return true;
      case XQueryRole::Operand:
      case XQueryRole::LaterOperand: {
        const auto* whole = dyn_cast<XQueryOperatorExpr>(at(_planning.program[place].parent));
        return whole && XQueryOperatorExpr::operatorClassification(whole->operatorType()) == 1;
      }
      default:
        return false;
    }
  }

  XQueryPlanning& _planning;
};

}  // namespace

void XQueryCountPaths(XQueryPlanning& planning) {
  Search(planning).run();
}

}  // namespace xquery

// How many items there are, and whether there are any.
//
// Pattern     count(E), exists(E), empty(E), not(E), boolean(E); count(E) compared with an integer;
//             E where its truth is asked for: as a predicate, a condition, an operand of "and" and
//             "or"
// Facts       E is a path whose last step is an axis step, all of whose tests and predicates can be
//             repeated and cannot fail once the first step is evaluated
//             (XQueryWalkedPath::countsNodes); or it is a FLWOR without order specs, a filter, a
//             call of a declared function, whose body may be a filter or a path; or what has such
//             a path between commas and can be repeated.
//             Of these only nodes are asked for their truth. They are evaluated to the end unless
//             they can be repeated, cannot fail but in what the first clause walks, and leave
//             nothing in variables that can be told. "b[6]", where its truth is asked for, is
//             whether there are six, and "b[last() > 5]" as well
// Operator    XQueryPathCount, XQueryItemCount: no list is made, and a walk ends as soon as the
//             answer is certain. What a join picks for certain is not even listed where it is one
//             item each (XQueryFLWORExpr::Yield)
// Why         what is not walked could only have found more items; the truth of nodes is that there
//             are any
#include "Expr/Operators/XQueryOperatorExpr.h"
#include "Plan/Operators/XQueryItemCount.h"
#include "Plan/Operators/XQueryPathCount.h"
#include "Plan/Paths/XQueryWalkedPath.h"
#include "Plan/Planning.h"
#include "Plan/Rules.h"
#include "Plan/Rules/EarlyEnds.h"
#include "Plan/Rules/NumberQuestions.h"
#include "Plan/Rules/PlaceInside.h"
#include "Plan/Rules/PositionConditions.h"

#include <optional>
#include <string_view>

namespace xquery {
namespace {

using Question = XQueryPathCount::Question;

// The path that counts its nodes; null for anything else.
XQueryWalkedPath* countingPathIn(const XQueryExpr& expr) {
  const auto* planned = dyn_cast<XQueryPlannedExpr>(&expr);
  const XQueryWalkedPath* path = planned ? planned->walkedPath() : nullptr;
  return path && path->countsNodes() ? const_cast<XQueryWalkedPath*>(path) : nullptr;
}

// Of a call of count(), in parentheses or not.
XQueryPlaceID countedIn(const XQueryPlanning& planning, XQueryPlaceID place) {
  const XQueryProgram& program = planning.program;
  place = XQueryPlaceInside(program, place);
  const auto asks = XQueryNumberQuestionOf(*program[place].expr);
  const bool isCount = asks && asks->question.least == 0 && planning.isOpen(place);
  return isCount ? program.firstPart(program.firstPart(place)) : XQueryNoPlace;
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

  // Answers the question about the items of another place there.
  bool wrap(XQueryPlaceID place, XQueryPlaceID counted, Question question, bool asksForTruth) {
    if (counted == XQueryNoPlace) return false;
    counted = XQueryPlaceInside(_planning.program, counted);
    const Ref<XQueryExpr> items = _planning.exprAt(counted);
    const Ref<XQueryExpr> plain = _planning.exprAt(place);
    if (XQueryWalkedPath* path = countingPathIn(*items)) {
      _planning.wrap(place,
                     XQueryPathCount::exprWithPlain(plain, Ref<XQueryWalkedPath>(path), question));
      return true;
    }
    const XQueryFacts& facts = _planning.facts[counted];
    if (!XQueryCountsItems(*items) || (asksForTruth && !facts.are(XQueryItems::Node))) return false;
    if (items->kind() == Kind::ExprList && !facts.isRepeatable()) return false;
    const bool mayEndEarly = XQueryMayEndEarly(_planning, counted);
    const std::string_view reason =
        question.least == 0 || mayEndEarly
            ? ""
            : "items are counted to the end, since what is behind may fail, or could be told";
    _planning.wrap(place, XQueryItemCount::exprWithPlain(plain, items, question, mayEndEarly),
                   reason);
    return true;
  }

  bool lookAtCall(XQueryPlaceID place) {
    const auto asks = XQueryNumberQuestionOf(*at(place));
    if (!asks) return false;
    const XQueryPlaceID argument = _planning.program.firstPart(_planning.program.firstPart(place));
    return wrap(place, argument, asks->question, asks->isOfTruth);
  }

  bool lookAtComparison(XQueryPlaceID place) {
    const auto* comparison = dyn_cast<XQueryOperatorExpr>(at(place));
    const XQueryPlaceID left = comparison ? _planning.program.firstPart(place) : XQueryNoPlace;
    const XQueryPlaceID right =
        left == XQueryNoPlace ? XQueryNoPlace : _planning.program.nextPart(left);
    if (right == XQueryNoPlace) return false;
    int type = comparison->operatorType();
    XQueryPlaceID counted = countedIn(_planning, left);
    auto number = XQuerySmallIntegerIn(comparison->right());
    if (counted == XQueryNoPlace) {
      counted = countedIn(_planning, right);
      number = XQuerySmallIntegerIn(comparison->left());
      type = XQueryMirroredComparison(type);
    }
    if (counted == XQueryNoPlace || !number) return false;
    const auto question = questionOf(type, *number);
    return question && wrap(place, counted, *question, false);
  }

  void lookAtTruth(XQueryPlaceID place) {
    if (XQueryIsAskedForTruth(_planning.program, place)) wrap(place, place, {1, false}, true);
  }

  XQueryPlanning& _planning;
};

}  // namespace

void XQueryCountPaths(XQueryPlanning& planning) {
  Search(planning).run();
}

}  // namespace xquery

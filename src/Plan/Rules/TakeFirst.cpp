// The first nodes of a path.
//
// Pattern     subsequence(P, 1, 3), (P)[1], (P)[position() <= 3], with any small numbers
// Facts       P is a path that finds its nodes in document order from one node, and that can be
//             walked in part (XQueryWalkedPath::findsInOrder)
// Operator    XQueryFirstNodes for P: the walk ends at the last node that can be asked for
// Why         what is behind that node cannot be told from what is not there, since the whole asks
//             neither for it nor for the number of nodes
#include "Expr/Operators/XQueryOperatorExpr.h"
#include "Expr/Paths/XQueryPath.h"
#include "Expr/XQueryLists.h"
#include "Functions/Sequence.h"
#include "Functions/XQueryFunctionCall.h"
#include "Plan/Operators/XQueryFirstNodes.h"
#include "Plan/Planning.h"
#include "Plan/Rules.h"
#include "Plan/Rules/PathAt.h"
#include "Plan/Rules/PlaceInside.h"
#include "Plan/Rules/PositionConditions.h"

#include <algorithm>
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

// The same for a predicate of the items.
std::optional<uint64_t> itemsAskedForBy(const XQueryExpr& predicate) {
  int64_t last = 0;
  if (const auto number = XQuerySmallIntegerIn(&predicate)) {
    last = *number;
  } else if (const auto asked = XQueryPositionConditionIn(predicate)) {
    const int type = asked->comparison;
    const bool isBelow = type == XQueryOperatorLess || type == XQueryOperatorLt;
    const bool isUpTo = type == XQueryOperatorLessEqual || type == XQueryOperatorLe;
    if (!isBelow && !isUpTo) return std::nullopt;
    last = isBelow ? asked->number - 1 : asked->number;
  }
  return last < 1 ? std::nullopt : std::optional(static_cast<uint64_t>(last));
}

class Search {
 public:
  explicit Search(XQueryPlanning& planning) : _planning(planning), _program(planning.program) {}

  void run() {
    for (XQueryPlaceID place = 0; place < _program.placeCount(); ++place) {
      const XQueryPlace& here = _program[place];
      if (const auto* call = dyn_cast<XQueryFunctionCall>(here.expr)) {
        const auto most = itemsAskedForBy(*call);
        if (most) limit(_program.firstPart(_program.firstPart(place)), *most);
      } else if (here.role == XQueryRole::FirstStep && here.step &&
                 !here.step->predicates().empty() && here.step->predicates().front()) {
        const auto most = itemsAskedForBy(*here.step->predicates().front());
        if (most) limit(place, *most);
      }
    }
  }

 private:
  // The place, or what stands in parentheses there.
  void limit(XQueryPlaceID place, uint64_t most) {
    place = XQueryPlaceInside(_program, place);
    if (place == XQueryNoPlace || !_planning.isOpen(place)) return;
    XQueryWalkedPath* path = XQueryWalkedPathAt(_planning, place);
    if (!path) return;
    if (!path->findsInOrder()) {
      return _planning.refuse(place, "its nodes may not come in document order as they are found");
    }
    _planning.wrap(place, XQueryFirstNodes::exprWithPlain(Ref<XQueryWalkedPath>(path), most));
  }

  XQueryPlanning& _planning;
  const XQueryProgram& _program;
};

}  // namespace

void XQueryTakeFirst(XQueryPlanning& planning) {
  Search(planning).run();
}

}  // namespace xquery

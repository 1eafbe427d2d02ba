// The items from one position to another.
//
// Pattern     a[position() <= $n], $l[position() > 2 and $n >= position()], $l[position() = $n],
//             $l[position() = 2 to last()], $l[position() != 1]: one or more comparisons of the
//             position, joined by "and"
// Facts       what the position is compared with is repeatable and reads no more of the focus than
//             its size; nothing shows the focus that the predicate leaves (StepsAround.h)
// Operator    none: the step is told (XQueryPositionRange). It works the positions out once for all
//             of its items, takes these, and walks no further
// Why         a comparison with one number answers the same for a position whichever item stands
//             there, and the positions for which it holds stand in a row; so do those that equal
//             one of the integers of "$n to $m". Without items nothing is compared; where what the
//             position is compared with fails, or is neither, the predicate is asked of each item
#include "Expr/Operators/XQueryOperatorExpr.h"
#include "Expr/XQueryLists.h"
#include "Plan/Planning.h"
#include "Plan/Rules.h"
#include "Plan/Rules/PathAt.h"
#include "Plan/Rules/PositionConditions.h"
#include "Plan/Rules/StepsAround.h"

#include <optional>
#include <utility>
#include <vector>

namespace xquery {
namespace {

bool keepsRow(int type) {
  switch (type) {
    case XQueryOperatorEqual:
    case XQueryOperatorEq:
    case XQueryOperatorNotEqual:
    case XQueryOperatorNe:
    case XQueryOperatorLess:
    case XQueryOperatorLessEqual:
    case XQueryOperatorGreater:
    case XQueryOperatorGreaterEqual:
    case XQueryOperatorLt:
    case XQueryOperatorLe:
    case XQueryOperatorGt:
    case XQueryOperatorGe:
      return true;
    default:
      return false;
  }
}

class Search {
 public:
  explicit Search(XQueryPlanning& planning) : _planning(planning), _program(planning.program) {}

  void lookAt(XQueryPlaceID place) {
    const XQueryPlace& here = _program[place];
    const bool isPredicate = here.role == XQueryRole::Predicate && here.step &&
                             here.parent != XQueryNoPlace && _planning.isOpen(place);
    auto* path = isPredicate ? XQueryWalkedPathAt(_planning, here.parent) : nullptr;
    if (!path) return;
    auto range = rangeIn(place);
    if (!range) return;
    // A path restores the focus that its start has left.
    const bool isAll = path->start() == here.step && path->steps().empty();
    if (!isAll && !XQueryHidesFocusOf(*here.step, *path, here.parent, _planning)) {
      return _planning.refuse(place, "an error that comes up later may show the focus it leaves");
    }
    XQueryStepPositions* of = path->positionsOf(*here.step);
    const auto index = XQueryPredicateAt(here);
    if (!of || !index || of->range.predicate != XQueryPositionRange::noPredicate) return;
    range->predicate = *index;
    of->range = *std::move(range);
    _planning.choose(place);
  }

 private:
  std::optional<XQueryPositionRange> rangeIn(XQueryPlaceID predicate) const {
    XQueryPositionRange range;
    constexpr size_t mostComparisons = 8;
    std::vector<XQueryPlaceID> waiting = {predicate};
    for (size_t count = 0; !waiting.empty(); ++count) {
      const XQueryPlaceID place = _program.withoutParentheses(waiting.back());
      waiting.pop_back();
      auto* operation = dyn_cast<XQueryOperatorExpr>(_program[place].expr);
      if (!operation || !operation->left() || !operation->right()) return std::nullopt;
      if (operation->operatorType() == XQueryOperatorAnd) {
        const XQueryPlaceID left = _program.firstPart(place);
        waiting.push_back(_program.nextPart(left));
        waiting.push_back(left);
      } else if (!add(place, *operation, range)) {
        return std::nullopt;
      }
      if (count + waiting.size() > 2 * mostComparisons) return std::nullopt;
    }
    return range;
  }

  bool add(XQueryPlaceID place, XQueryOperatorExpr& comparison, XQueryPositionRange& range) const {
    if (!keepsRow(comparison.operatorType())) return false;
    const bool isOnLeft = XQueryIsPosition(comparison.left());
    if (!isOnLeft && !XQueryIsPosition(comparison.right())) return false;
    const XQueryPlaceID left = _program.firstPart(place);
    const XQueryPlaceID other = isOnLeft ? _program.nextPart(left) : left;
    if (other == XQueryNoPlace || !isForAll(_planning.facts[other])) return false;
    const int type = comparison.operatorType();
    range.add(Ref<XQueryOperatorExpr>(&comparison), isOnLeft,
              isOnLeft ? type : XQueryMirroredComparison(type),
              _planning.facts[other].does(XQueryDeeds::ReadsSize));
    return true;
  }

  static bool isForAll(const XQueryFacts& facts) {
    return facts.mayBe(XQueryItems::Numeric) && facts.isRepeatable() && facts.assigns.isEmpty() &&
           !facts.does((XQueryDeeds::ReadsFocus & ~XQueryDeeds::ReadsSize) |
                       XQueryDeeds::LoadsDocuments);
  }

  XQueryPlanning& _planning;
  const XQueryProgram& _program;
};

}  // namespace

void XQueryTakePositionRanges(XQueryPlanning& planning) {
  Search search(planning);
  for (XQueryPlaceID place = 0; place < planning.program.placeCount(); ++place) {
    search.lookAt(place);
  }
}

}  // namespace xquery

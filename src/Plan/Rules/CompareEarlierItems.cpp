// What has come up before.
//
// Pattern     L = V[position() < E] and L = V[position() <= E], on either side, also with a few
//             steps to children and attributes behind the predicate, where V is a variable
// Facts       L and E are repeatable; E cannot fail and does not read the focus; L cannot fail
//             unless it is on the left, where it is evaluated first
// Operator    XQueryEarlierItems: finds the first item that is equal in a table of all of them
// Why         see there
#include "Expr/Operators/XQueryOperatorExpr.h"
#include "Expr/Paths/XQueryPath.h"
#include "Expr/XQueryLeaves.h"
#include "Plan/Operators/XQueryEarlierItems.h"
#include "Plan/Planning.h"
#include "Plan/Rules.h"
#include "Plan/Rules/PlaceInside.h"
#include "Plan/Rules/PositionConditions.h"

#include <utility>

namespace xquery {
namespace {

bool canRepeat(const XQueryFacts& facts) {
  return facts.isRepeatable() && facts.assigns.isEmpty() &&
         !facts.does(XQueryDeeds::LoadsDocuments);
}

bool isIdle(const XQueryFacts& facts) {
  return canRepeat(facts) && !facts.does(XQueryDeeds::MayFail);
}

class Search {
 public:
  explicit Search(XQueryPlanning& planning) : _planning(planning), _program(planning.program) {}

  void run() {
    for (XQueryPlaceID place = 0; place < _program.placeCount(); ++place) {
      const auto* comparison = dyn_cast<XQueryOperatorExpr>(_program[place].expr);
      if (!comparison || !_planning.isOpen(place)) continue;
      if (comparison->operatorType() != XQueryOperatorEqual) continue;
      const XQueryPlaceID left = _program.firstPart(place);
      const XQueryPlaceID right = left == XQueryNoPlace ? left : _program.nextPart(left);
      if (right == XQueryNoPlace || XQueryOperatorExpr::rangeIn(comparison->right())) continue;
      if (canRepeat(_planning.facts[left]) && takeOver(place, left, right)) continue;
      if (isIdle(_planning.facts[right])) takeOver(place, right, left);
    }
  }

 private:
  bool takeOver(XQueryPlaceID place, XQueryPlaceID value, XQueryPlaceID items) {
    const XQueryPlaceID pathPlace = XQueryPlaceInside(_program, items);
    const auto* path = dyn_cast<XQueryPathExpr>(_program[pathPlace].expr);
    const XQueryStep* step = path ? path->step() : nullptr;
    const bool fits = step && step->kind() == Kind::FilterStep && step->predicates().size() == 1 &&
                      _program[value].slot;
    if (!fits) return false;
    const XQueryPlaceID source =
        XQueryPlaceInside(_program, _program.part(pathPlace, XQueryRole::FirstStep));
    const XQueryPlaceID predicate = _program.part(pathPlace, XQueryRole::Predicate);
    if (source == XQueryNoPlace || predicate == XQueryNoPlace) return false;
    if (!isa<XQueryVariable>(_program[source].expr) || _program[predicate].step != step) {
      return false;
    }
    XQueryEarlierItems::Operands operands{};
    operands.value = *_program[value].slot;
    operands.items = Ref<XQueryExpr>(_program[source].expr);
    if (!readBound(predicate, operands) || !operands.walk.readSteps(step->next())) return false;
    _planning.wrap(place,
                   XQueryEarlierItems::exprWithPlain(*_program[place].slot, std::move(operands)));
    return true;
  }

  // "position() < E", "E >= position()".
  bool readBound(XQueryPlaceID predicate, XQueryEarlierItems::Operands& operands) const {
    const XQueryPlaceID place = XQueryPlaceInside(_program, predicate);
    const auto* comparison = dyn_cast<XQueryOperatorExpr>(_program[place].expr);
    if (!comparison) return false;
    const bool isOnLeft = XQueryIsPosition(comparison->left());
    if (!isOnLeft && !XQueryIsPosition(comparison->right())) return false;
    const int written = comparison->operatorType();
    const int type = isOnLeft ? written : XQueryMirroredComparison(written);
    const bool isBelow = type == XQueryOperatorLess || type == XQueryOperatorLt;
    operands.isInclusive = type == XQueryOperatorLessEqual || type == XQueryOperatorLe;
    const XQueryPlaceID first = _program.firstPart(place);
    const XQueryPlaceID bound = isOnLeft ? _program.nextPart(first) : first;
    if ((!isBelow && !operands.isInclusive) || bound == XQueryNoPlace) return false;
    const XQueryFacts& facts = _planning.facts[bound];
    if (!isIdle(facts) || facts.does(XQueryDeeds::ReadsFocus)) return false;
    operands.bound = Ref<XQueryExpr>(_program[bound].expr);
    return true;
  }

  XQueryPlanning& _planning;
  const XQueryProgram& _program;
};

}  // namespace

void XQueryCompareEarlierItems(XQueryPlanning& planning) {
  Search(planning).run();
}

}  // namespace xquery

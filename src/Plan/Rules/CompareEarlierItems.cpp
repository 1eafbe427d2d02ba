// What has come up before.
//
// Pattern     L = V[position() < E] and L = V[position() <= E], on either side, also with a few
//             steps to children and attributes behind the predicate, where V is a variable; the
//             same with N/preceding-sibling::a, N/following-sibling::a, N/preceding::a and
//             N/following::a, where N is the context item or a variable
// Facts       L and E are repeatable; E cannot fail and does not read the focus; L cannot fail
//             unless it is on the left, where it is evaluated first
// Refused     where one of these is missing; for items that are not those of a variable; for steps
//             of another kind
// Operator    XQueryEarlierItems: finds the first item that is equal in a table of all of them;
//             XQueryNodesAside: the same with the first or the last of the nodes beside each other
// Why         see there
#include "Expr/Operators/XQueryOperatorExpr.h"
#include "Expr/Paths/XQueryPath.h"
#include "Expr/XQueryLeaves.h"
#include "Plan/Operators/XQueryEarlierItems.h"
#include "Plan/Operators/XQueryNodesAside.h"
#include "Plan/Planning.h"
#include "Plan/Rules.h"
#include "Plan/Rules/PathAt.h"
#include "Plan/Rules/PlaceInside.h"
#include "Plan/Rules/PositionConditions.h"

#include <optional>
#include <string_view>
#include <utility>

namespace xquery {
namespace {

bool canRepeat(const XQueryFacts& facts) {
  return facts.isRepeatable() && facts.assigns.isEmpty() &&
         !facts.does(XQueryDeeds::LoadsDocuments);
}

// The items before a position.
struct Earlier {
  const XQueryStep* step;  // with the predicate
  XQueryPlaceID source;
  XQueryPlaceID bound;
  bool isInclusive;
};

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
      lookAt(place, left, right);
    }
  }

 private:
  void lookAt(XQueryPlaceID place, XQueryPlaceID left, XQueryPlaceID right) {
    if (takeNodes(place, left, right, true) || takeNodes(place, right, left, false)) return;
    std::string_view obstacle;
    if (takeOver(place, left, right, true, obstacle)) return;
    if (takeOver(place, right, left, false, obstacle)) return;
    if (!obstacle.empty()) _planning.refuse(place, obstacle);
  }

  // The nodes beside one that a comparison asks for; false where it does not.
  bool takeNodes(XQueryPlaceID place, XQueryPlaceID value, XQueryPlaceID nodes, bool isValueFirst) {
    const XQueryPlaceID pathPlace = XQueryPlaceInside(_program, nodes);
    if (_program[pathPlace].expr->kind() != Kind::PathExpr || !_program[value].slot) return false;
    const XQueryWalkedPath* path = XQueryWalkedPathAt(_planning, pathPlace);
    if (!path || !XQueryNodesAside::isOpenFor(*path)) return false;
    XQueryNodesAside::Operands operands{};
    if (path->start()) {
      const XQueryPlaceID source =
          XQueryPlaceInside(_program, _program.part(pathPlace, XQueryRole::FirstStep));
      const auto* variable =
          source == XQueryNoPlace ? nullptr : dyn_cast<XQueryVariable>(_program[source].expr);
      const bool isItem =
          source != XQueryNoPlace && _program[source].expr->kind() == Kind::ContextItemExpr;
      if (!isItem && (!variable || variable->varID() <= 0)) return false;
      operands.varID = variable ? variable->varID() : 0;
    }
    const XQueryFacts& ofValue = _planning.facts[value];
    const bool isOpen = canRepeat(ofValue) && (isValueFirst || !ofValue.does(XQueryDeeds::MayFail));
    if (!isOpen || !operands.walk.readSteps(path->steps().front().step->next())) return false;
    operands.value = *_program[value].slot;
    operands.nodes = _planning.exprAt(pathPlace);
    operands.path = path;
    _planning.wrap(place,
                   XQueryNodesAside::exprWithPlain(*_program[place].slot, std::move(operands)),
                   "the first or the last node with that value is found in a table");
    return true;
  }

  bool takeOver(XQueryPlaceID place, XQueryPlaceID value, XQueryPlaceID items, bool isValueFirst,
                std::string_view& obstacle) {
    const std::optional<Earlier> earlier = earlierIn(items);
    if (!earlier || !_program[value].slot) return false;
    XQueryEarlierItems::Operands operands{};
    obstacle = obstacleTo(*earlier, _planning.facts[value], isValueFirst);
    if (obstacle.empty() && !operands.walk.readSteps(earlier->step->next())) {
      obstacle = "the steps behind the position are not a few to children and attributes";
    }
    if (!obstacle.empty()) return false;
    operands.value = *_program[value].slot;
    operands.items = Ref<XQueryExpr>(_program[earlier->source].expr);
    operands.bound = Ref<XQueryExpr>(_program[earlier->bound].expr);
    operands.isInclusive = earlier->isInclusive;
    _planning.wrap(place,
                   XQueryEarlierItems::exprWithPlain(*_program[place].slot, std::move(operands)));
    return true;
  }

  // What stands in the way; empty for nothing.
  std::string_view obstacleTo(const Earlier& earlier, const XQueryFacts& ofValue,
                              bool isValueFirst) const {
    const XQueryFacts& ofBound = _planning.facts[earlier.bound];
    if (!isa<XQueryVariable>(_program[earlier.source].expr)) {
      return "the items before the position are not those of a variable";
    }
    if (earlier.step->predicates().size() != 1) return "the items have another predicate";
    if (!canRepeat(ofBound)) return "the position is compared with what cannot be repeated";
    if (ofBound.does(XQueryDeeds::MayFail)) {
      return "the position is compared with what may fail, once for each item";
    }
    if (ofBound.does(XQueryDeeds::ReadsFocus)) {
      return "the position is compared with what reads the context item or its position";
    }
    if (!canRepeat(ofValue)) return "they are compared with what cannot be repeated";
    if (!isValueFirst && ofValue.does(XQueryDeeds::MayFail)) {
      return "they are compared with what may fail, after them";
    }
    return {};
  }

  // A filter of some items whose first predicate asks for a position below another one.
  std::optional<Earlier> earlierIn(XQueryPlaceID items) const {
    const XQueryPlaceID pathPlace = XQueryPlaceInside(_program, items);
    const auto* path = dyn_cast<XQueryPathExpr>(_program[pathPlace].expr);
    const XQueryStep* step = path ? path->step() : nullptr;
    if (!step || step->kind() != Kind::FilterStep) return std::nullopt;
    const XQueryPlaceID source =
        XQueryPlaceInside(_program, _program.part(pathPlace, XQueryRole::FirstStep));
    const XQueryPlaceID predicate = _program.part(pathPlace, XQueryRole::Predicate);
    if (source == XQueryNoPlace || predicate == XQueryNoPlace) return std::nullopt;
    if (_program[predicate].step != step) return std::nullopt;
    const XQueryPlaceID place = XQueryPlaceInside(_program, predicate);
    const auto* comparison = dyn_cast<XQueryOperatorExpr>(_program[place].expr);
    if (!comparison) return std::nullopt;
    const bool isOnLeft = XQueryIsPosition(comparison->left());
    if (!isOnLeft && !XQueryIsPosition(comparison->right())) return std::nullopt;
    const int written = comparison->operatorType();
    const int type = isOnLeft ? written : XQueryMirroredComparison(written);
    const bool isBelow = type == XQueryOperatorLess || type == XQueryOperatorLt;
    const bool isInclusive = type == XQueryOperatorLessEqual || type == XQueryOperatorLe;
    const XQueryPlaceID first = _program.firstPart(place);
    const XQueryPlaceID bound = isOnLeft ? _program.nextPart(first) : first;
    if ((!isBelow && !isInclusive) || bound == XQueryNoPlace) return std::nullopt;
    return Earlier{step, source, bound, isInclusive};
  }

  XQueryPlanning& _planning;
  const XQueryProgram& _program;
};

}  // namespace

void XQueryCompareEarlierItems(XQueryPlanning& planning) {
  Search(planning).run();
}

}  // namespace xquery

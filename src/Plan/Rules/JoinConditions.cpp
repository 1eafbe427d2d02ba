// Several conditions on a node.
//
// Pattern     A and B, A or B, not(A), where A and B are conditions on the context item that other
//             rules have found can be asked of a node as it is
// Facts       none are asked for
// Operator    XQueryNodeLogic, one for a whole chain of "and" or "or": a step asks its nodes
// without
//             making each the context item
// Why         these conditions read the node alone, leave nothing behind, and say where they cannot
//             tell, for which the expression is evaluated as a whole: what is evaluated twice has
//             done nothing the first time. What stands in a chain is then evaluated as it is
//             written, and conditions lie within each other no deeper than a few levels, so that no
//             more than these few are asked again, and any stack has room for asking
#include "Expr/Operators/XQueryOperatorExpr.h"
#include "Functions/Boolean.h"
#include "Functions/XQueryFunctionCall.h"
#include "Plan/Operators/XQueryNodeLogic.h"
#include "Plan/Planning.h"
#include "Plan/Rules.h"
#include "Plan/Rules/PlaceInside.h"

#include <algorithm>
#include <cstdint>
#include <optional>
#include <utility>
#include <vector>

namespace xquery {
namespace {

using Joint = XQueryNodeLogic::Joint;

// How the operands of an expression are joined, if they are.
std::optional<Joint> jointOf(const XQueryExpr& expr) {
  if (const auto* operation = dyn_cast<XQueryOperatorExpr>(&expr)) {
    if (operation->operatorType() == XQueryOperatorAnd) return Joint::And;
    if (operation->operatorType() == XQueryOperatorOr) return Joint::Or;
    return std::nullopt;
  }
  const auto* call = dyn_cast<XQueryFunctionCall>(&expr);
  const bool isNot = call && call->builtIn() && call->function() == fn_not && call->args() &&
                     call->args()->count() == 1;
  return isNot ? std::optional(Joint::Not) : std::nullopt;
}

class Search {
 public:
  explicit Search(XQueryPlanning& planning)
      : _planning(planning),
        _program(planning.program),
        _levels(_program.placeCount(), notAsked),
        _isInChain(_program.placeCount()) {}

  void run() {
    const auto& places = _program.partsFirst();
    for (const XQueryPlaceID place : places) look(place);
    for (const XQueryPlaceID place : places) {
      if (_levels[place] > 0 && !_isInChain[place]) join(place);
    }
  }

 private:
  static constexpr uint8_t notAsked = UINT8_MAX;
  static constexpr uint8_t mostLevels = 16;

  // The operands, in parentheses or not.
  template <class Act>
  void forOperands(XQueryPlaceID place, Joint joint, Act act) const {
    XQueryPlaceID part = _program.firstPart(place);
    if (joint == Joint::Not && part != XQueryNoPlace) part = _program.firstPart(part);
    for (; part != XQueryNoPlace; part = _program.nextPart(part)) {
      act(XQueryPlaceInside(_program, part));
    }
  }

  // What stands there, if it is asked of a node by itself.
  Ref<XQueryPlannedExpr> questionAt(XQueryPlaceID place) const {
    const Ref<XQueryExpr> there = _planning.exprAt(place);
    auto* planned = dyn_cast<XQueryPlannedExpr>(there.get());
    return Ref<XQueryPlannedExpr>(planned && planned->nodeQuestion() ? planned : nullptr);
  }

  // Finds out how many levels of conditions there are in one, none for what other rules have found.
  void look(XQueryPlaceID place) {
    const auto joint = jointOf(*_program[place].expr);
    if (!joint || !_planning.isOpen(place)) {
      if (questionAt(place)) _levels[place] = 0;
      return;
    }
    uint8_t levels = 1;
    size_t count = 0;
    forOperands(place, *joint, [&](XQueryPlaceID operand) {
      const uint8_t below = _levels[operand];
      ++count;
      if (below == notAsked || levels == notAsked) {
        levels = notAsked;
      } else {
        const bool isOfChain = goesOn(operand, *joint);
        levels = std::max<uint8_t>(levels, below + (isOfChain ? 0 : 1));
      }
    });
    const bool areAll = count == (joint == Joint::Not ? 1 : 2);
    if (!areAll || levels > mostLevels) return;
    _levels[place] = levels;
    forOperands(place, *joint, [&](XQueryPlaceID operand) {
      if (goesOn(operand, *joint)) _isInChain[operand] = true;
    });
  }

  // Whether an operand joins its own in the same way.
  bool goesOn(XQueryPlaceID operand, Joint joint) const {
    return joint != Joint::Not && _levels[operand] > 0 && _levels[operand] != notAsked &&
           jointOf(*_program[operand].expr) == joint;
  }

  void join(XQueryPlaceID place) {
    if (_levels[place] == notAsked) return;
    const Joint joint = *jointOf(*_program[place].expr);
    std::vector<Ref<XQueryPlannedExpr>> operands;
    std::vector<XQueryPlaceID> waiting = {place};
    while (!waiting.empty()) {
      const XQueryPlaceID at = waiting.back();
      waiting.pop_back();
      if (at != place && !goesOn(at, joint)) {
        operands.push_back(questionAt(at));
        continue;
      }
      const size_t before = waiting.size();
      forOperands(at, joint, [&](XQueryPlaceID operand) { waiting.push_back(operand); });
      std::reverse(waiting.begin() + static_cast<std::ptrdiff_t>(before), waiting.end());
    }
    _planning.wrap(
        place, XQueryNodeLogic::exprWithPlain(_planning.exprAt(place), joint, std::move(operands)));
  }

  XQueryPlanning& _planning;
  const XQueryProgram& _program;
  std::vector<uint8_t> _levels;  // by place
  std::vector<bool> _isInChain;  // taken by the whole that it is an operand of
};

}  // namespace

void XQueryJoinConditions(XQueryPlanning& planning) {
  Search(planning).run();
}

}  // namespace xquery

// What does not change in a loop.
//
// Pattern     an expression that is evaluated again and again, by a clause, a predicate, a step, a
//             quantifier or the calls of a function around it, reads nothing that differs from one
//             time to the next, and takes more work than looking that up: it holds a path of some
//             length, a FLWOR, a quantifier, a call of a declared function or of a built-in one
//             that goes through all items of a list
//             The same for what reads nothing of the item that differs but what lies above it, and
//             so is the same for its siblings: "@sku = ../line/sku"
// Facts       it is repeatable; all that it reads is known one by one; its items are nodes, or
//             which objects they are cannot be told
// Operator    XQueryKeptExpr: evaluates it when it is first needed, and keeps the outcome
// Why         see there; the facts choose where it is worth the trouble, what is compared at each
//             use decides whether the outcome is still good
#include "Expr/Clauses/XQueryFLWOR.h"
#include "Expr/Clauses/XQueryQuantified.h"
#include "Expr/Operators/XQueryOperatorExpr.h"
#include "Expr/Paths/XQueryPath.h"
#include "Expr/XQueryBinding.h"
#include "Expr/XQueryLeaves.h"
#include "Expr/XQueryLists.h"
#include "Functions/Aggregate.h"
#include "Functions/DeepEqual.h"
#include "Functions/Sequence.h"
#include "Functions/String.h"
#include "Functions/XQueryFunctionCall.h"
#include "Plan/Operators/XQueryKeptExpr.h"
#include "Plan/Operators/XQueryShortWalk.h"
#include "Plan/Planning.h"
#include "Plan/Rules.h"
#include "Plan/Rules/PlaceInside.h"
#include "Plan/Rules/ReadsAbove.h"
#include "Prolog/XQueryDeclarations.h"

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <iterator>
#include <set>
#include <string_view>
#include <unordered_map>
#include <utility>
#include <vector>

namespace xquery {
namespace {

XQueryVariableSet variablesOf(const XQueryBindingExpr& clause) {
  XQueryVariableSet variables;
  variables.add(clause.varID());
  if (const auto* forExpr = dyn_cast<XQueryForExpr>(&clause)) variables.add(forExpr->posVarID());
  return variables;
}

bool isAtHand(const XQueryExpr* expr) {
  return expr && (expr->kind() == Kind::Variable || expr->kind() == Kind::ContextItemExpr);
}

// A path from a variable or the context item over a few children or attributes is done as quickly
// as looked up, where it begins with one node.
bool isNarrow(const XQueryPathExpr& path, size_t mostSteps) {
  size_t steps = 0;
  for (const XQueryStep* step = path.step(); step; step = step->next()) {
    if (!step->predicates().empty() || ++steps > mostSteps) return false;
    const auto* axisStep = dyn_cast<XQueryAxisStep>(step);
    if (!axisStep) {
      if (step != path.step() || !isAtHand(step->expr())) return false;
      continue;
    }
    const int axis = axisStep->axis();
    if (axis != XQueryAxisChild && axis != XQueryAxisAttribute && axis != XQueryAxisSelf &&
        axis != XQueryAxisParent) {
      return false;
    }
  }
  return true;
}

bool isShort(const XQueryPathExpr& path) {
  constexpr size_t fewSteps = 3;
  return isNarrow(path, fewSteps);
}

// Whether a call takes the longer the more items its arguments have.
bool goesThroughItems(const XQueryFunctionCall& call) {
  constexpr XQueryProcedure functions[] = {fn_sum,         fn_avg,      fn_max,
                                           fn_min,         fn_index_of, fn_distinct_values,
                                           fn_string_join, fn_reverse,  fn_deep_equal};
  return std::find(std::begin(functions), std::end(functions), call.function()) !=
         std::end(functions);
}

class Search {
 public:
  explicit Search(XQueryPlanning& planning)
      : _planning(planning), _program(planning.program), _work(planning.program.placeCount()) {}

  void run() {
    noteLists();
    for (const XQueryPlaceID place : _program.partsFirst()) {
      if (isLaborious(place) || isWalked(place)) {
        _work[place] = std::max(_work[place], isFewSteps(place) ? Work::Some : Work::Much);
      }
      const XQueryPlaceID whole = at(place).parent;
      if (whole != XQueryNoPlace) _work[whole] = std::max(_work[whole], _work[place]);
    }
    for (XQueryPlaceID place = 0; place < _program.placeCount(); ++place) {
      if (_work[place] == Work::None || !isOpen(place)) continue;
      if (isInvariantSomewhere(place, facts(place))) {
        keep(place, {});
      } else if (_work[place] == Work::Some) {
        continue;
      } else if (auto above = readAbove(place); !above.empty()) {
        keep(place, std::move(above));
      }
    }
  }

 private:
  // How much looking up would save: something where all that it takes is the same each time, or
  // also where it is the same for some items only.
  enum class Work : uint8_t { None, Some, Much };

  const XQueryPlace& at(XQueryPlaceID place) const { return _program[place]; }
  const XQueryFacts& facts(XQueryPlaceID place) const { return _planning.facts[place]; }

  bool isLaborious(XQueryPlaceID place) const {
    const XQueryExpr& expr = *at(place).expr;
    switch (expr.kind()) {
      case Kind::PathExpr:
        return !isShort(*cast<XQueryPathExpr>(&expr)) || beginsWithList(place) ||
               isComparedFromAbove(place);
      case Kind::FLWORExpr:
      case Kind::QuantifiedExpr:
        return true;
      case Kind::FunctionCall: {
        const auto& call = *cast<XQueryFunctionCall>(&expr);
        return call.functionDecl() || (goesThroughItems(call) && hasListArgument(place));
      }
      default:
        return false;
    }
  }

  // Whether a path does no more than go up and down by a few steps, and is not one whose items are
  // compared.
  bool isFewSteps(XQueryPlaceID place) const {
    const auto* path = dyn_cast<XQueryPathExpr>(at(place).expr);
    return path && isNarrow(*path, XQueryShortWalk::mostSteps) && !isComparedFromAbove(place);
  }

  // Whether a path goes up to go down again, by steps enough to find many, for a comparison.
  bool isComparedFromAbove(XQueryPlaceID place) const {
    const auto& path = *cast<XQueryPathExpr>(at(place).expr);
    int down = 0;
    int up = 0;
    for (const XQueryStep* step = path.step(); step; step = step->next()) {
      const auto* axisStep = dyn_cast<XQueryAxisStep>(step);
      if (axisStep && axisStep->axis() == XQueryAxisParent) ++up;
      if (axisStep && axisStep->axis() == XQueryAxisChild) ++down;
    }
    return up > 0 && down > 1 && isComparedInGeneral(place);
  }

  bool isComparedInGeneral(XQueryPlaceID place) const {
    const XQueryPlaceID whole = at(XQueryPlaceAround(_program, place)).parent;
    const auto* comparison =
        whole == XQueryNoPlace ? nullptr : dyn_cast<XQueryOperatorExpr>(at(whole).expr);
    constexpr int generalClass = 6;
    return comparison &&
           XQueryOperatorExpr::operatorClassification(comparison->operatorType()) == generalClass;
  }

  // Whether a path goes on from a variable that has been given a list.
  bool beginsWithList(XQueryPlaceID path) const {
    const XQueryPlaceID first = _program.part(path, XQueryRole::FirstStep);
    if (first == XQueryNoPlace || facts(first).most != XQueryFacts::many) return false;
    const auto* variable = dyn_cast<XQueryVariable>(at(first).expr);
    if (!variable) return false;
    if (variable->varID() == 0) return true;
    const XQueryPlaceID binder = at(first).binder;
    if (binder != XQueryNoPlace) return at(binder).expr->kind() == Kind::LetExpr;
    return isComparedList(path, *variable);
  }

  // Whether a function compares what a path finds from a parameter that some call passes a list
  // for: the calls of a loop mostly pass the same one.
  bool isComparedList(XQueryPlaceID path, const XQueryVariable& parameter) const {
    const XQueryFunctionDecl* function = _program.bodyOf(path).function;
    return function && _lists.count({function, parameter.varID()}) > 0 && isComparedInGeneral(path);
  }

  // Notes the parameters for which some call passes many items.
  void noteLists() {
    for (XQueryPlaceID place = 0; place < _program.placeCount(); ++place) {
      const auto* call = dyn_cast<XQueryFunctionCall>(at(place).expr);
      if (!call || !call->hasBody()) continue;
      const XQueryPlaceID arguments = _program.part(place, XQueryRole::Arguments);
      XQueryPlaceID each =
          arguments == XQueryNoPlace ? XQueryNoPlace : _program.firstPart(arguments);
      for (const auto& parameter : call->functionDecl()->params()) {
        if (each == XQueryNoPlace) break;
        const bool isList =
            facts(each).most == XQueryFacts::many && facts(each).are(XQueryItems::Node);
        if (isList) _lists.insert({call->functionDecl(), parameter->varID()});
        each = _program.nextPart(each);
      }
    }
  }

  bool hasListArgument(XQueryPlaceID call) const {
    const XQueryPlaceID arguments = _program.part(call, XQueryRole::Arguments);
    if (arguments == XQueryNoPlace) return false;
    for (XQueryPlaceID each = _program.firstPart(arguments); each != XQueryNoPlace;
         each = _program.nextPart(each)) {
      if (facts(each).most == XQueryFacts::many) return true;
    }
    return false;
  }

  // Joins know the items of a clause again by the list that they stand in.
  bool isWalked(XQueryPlaceID place) const {
    if (at(place).role != XQueryRole::Bound) return false;
    return at(place).expr->kind() == Kind::PathExpr &&
           at(at(place).parent).expr->kind() != Kind::LetExpr;
  }

  bool isOpen(XQueryPlaceID place) const {
    const XQueryPlace& here = at(place);
    if (!_planning.isOpen(place) || XQueryTraitsOf(here.role).isNoValue) return false;
    if (here.expr->kind() == Kind::RootStepExpr || here.expr->kind() == Kind::Args) return false;
    // What is in parentheses is looked at by itself.
    const auto* list = dyn_cast<XQueryExprList>(here.expr);
    if (list && list->count() == 1) return false;
    // Loops walk ranges without making them.
    const auto* range = dyn_cast<XQueryOperatorExpr>(here.expr);
    return !range || range->operatorType() != XQueryOperatorTo;
  }

  using Above = XQueryKeptExpr::Above;

  // Whether a path goes up from an item first.
  bool isPathAbove(XQueryPlaceID place) const {
    const auto* path = dyn_cast<XQueryPathExpr>(at(place).expr);
    const XQueryStep* step = path ? path->step() : nullptr;
    if (step && !isa<XQueryAxisStep>(step)) {
      step = isAtHand(XQueryWithoutParentheses(step->expr())) ? step->next() : nullptr;
    }
    const auto* axisStep = dyn_cast<XQueryAxisStep>(step);
    return axisStep && axisStep->axis() == XQueryAxisParent;
  }

  // The same for a call that goes through the items of such a path. What consists of more keeps
  // those of its parts that are the same for all items, which is worth more.
  bool beginsAbove(XQueryPlaceID place) const {
    const auto* call = dyn_cast<XQueryFunctionCall>(at(place).expr);
    if (!call) return isPathAbove(place);
    if (!goesThroughItems(*call)) return false;
    const XQueryPlaceID arguments = _program.part(place, XQueryRole::Arguments);
    XQueryPlaceID each = arguments == XQueryNoPlace ? arguments : _program.firstPart(arguments);
    for (; each != XQueryNoPlace; each = _program.nextPart(each)) {
      if (!isPathAbove(XQueryPlaceInside(_program, each))) return false;
    }
    return true;
  }

  // What it reads by way of parents, where it is invariant but for that; none for others.
  std::vector<Above> readAbove(XQueryPlaceID place) const {
    XQueryFacts own = facts(place);
    std::vector<Above> above;
    const auto add = [&](int64_t varID) {
      const uint8_t steps = XQueryStepsToWhatIsRead(_planning, place, varID);
      if (steps > 0) above.push_back({varID, steps});
      return steps > 0;
    };
    if (!beginsAbove(place)) return {};
    // A tree without a document may be changed by what is constructed: nothing is kept of it.
    if (!own.does(XQueryDeeds::ReadsOutside) || !own.reads.isExact()) return {};
    if (own.does(XQueryDeeds::ReadsItem) && add(0)) own.deeds &= ~unsigned{XQueryDeeds::ReadsItem};
    const XQueryVariableSet reads = own.reads;
    reads.forEach([&](int64_t varID) {
      if (add(varID)) own.reads.remove(varID);
    });
    const bool isInvariant = !above.empty() && isInvariantSomewhere(place, own);
    return isInvariant ? above : std::vector<Above>();
  }

  void keep(XQueryPlaceID place, std::vector<Above> above) {
    const XQueryFacts& own = facts(place);
    std::string_view obstacle = XQueryKeptExpr::obstacleTo(own);
    if (obstacle.empty() && !own.are(XQueryItems::Node) && _planning.showsIdentity(place)) {
      obstacle = "it may answer values that are no nodes, and which objects they are can be told";
    }
    if (!obstacle.empty()) return _planning.refuse(place, obstacle);
    const bool isOfAll = above.empty();
    _planning.wrap(place, XQueryKeptExpr::exprWithPlain(*at(place).slot, own, std::move(above)),
                   isOfAll ? "evaluated when it is first needed, and kept as long as nothing that "
                             "it reads has changed"
                           : "evaluated for one item, and kept for others below the same node");
  }

  // Whether some loop around it leaves all that it reads as it is.
  bool isInvariantSomewhere(XQueryPlaceID place, const XQueryFacts& own) const {
    XQueryPlaceID inner = place;
    for (int level = 0; level < XQueryPlanning::mostLevels; ++level, inner = at(inner).parent) {
      if (inner != place && _planning.isWrapped(inner)) return false;
      const XQueryRole role = at(inner).role;
      if (role == XQueryRole::Body) {
        // A function may be called any number of times, in any focus.
        return _program.bodyOf(inner).function && !own.does(XQueryDeeds::ReadsItem) &&
               (own.reads.isEmpty() || beginsWithList(place));
      }
      if (XQueryTraitsOf(role).hasOwnFocus) return !own.does(XQueryDeeds::ReadsItem);
      switch (loopAround(inner, own.reads)) {
        case Loop::Found:
          return true;
        case Loop::Changes:
          return false;
        case Loop::None:
          break;
      }
    }
    return false;
  }

  enum class Loop : uint8_t { None, Found, Changes };

  // Whether the expression around a part evaluates it in a loop that sets none of the variables.
  Loop loopAround(XQueryPlaceID part, const XQueryVariableSet& reads) const {
    const XQueryPlaceID whole = at(part).parent;
    const Kind kind = at(whole).expr->kind();
    if (kind == Kind::CaseClause) {
      const bool isRead = variablesOf(*cast<XQueryBindingExpr>(at(whole).expr)).meets(reads);
      return isRead ? Loop::Changes : Loop::None;
    }
    if (kind != Kind::FLWORExpr && kind != Kind::QuantifiedExpr) return Loop::None;
    const Clauses& before = clausesBefore(part, whole);
    if (before.sets.meets(reads)) return Loop::Changes;
    return before.areInLoop ? Loop::Found : Loop::None;
  }

  // What stands in a FLWOR or quantified expression before one of its parts: whether a loop begins
  // there, and what is set from the innermost one on.
  struct Clauses {
    bool areInLoop = false;
    XQueryVariableSet sets;
  };

  // All parts of the whole are looked at once.
  const Clauses& clausesBefore(XQueryPlaceID part, XQueryPlaceID whole) const {
    const auto known = _clausesBefore.find(part);
    if (known != _clausesBefore.end()) return known->second;
    Clauses before;
    for (XQueryPlaceID each = _program.firstPart(whole); each != XQueryNoPlace;
         each = _program.nextPart(each)) {
      _clausesBefore.emplace(each, before);
      const auto* clause = dyn_cast<XQueryBindingExpr>(at(each).expr);
      if (!clause) continue;
      if (clause->kind() != Kind::LetExpr) before = {true, {}};
      before.sets.add(variablesOf(*clause));
    }
    return _clausesBefore.at(part);
  }

  XQueryPlanning& _planning;
  const XQueryProgram& _program;
  std::vector<Work> _work;
  mutable std::unordered_map<XQueryPlaceID, Clauses> _clausesBefore;
  std::set<std::pair<const XQueryFunctionDecl*, int64_t>> _lists;  // parameters, by their IDs
};

}  // namespace

void XQueryKeepInvariants(XQueryPlanning& planning) {
  Search(planning).run();
}

}  // namespace xquery

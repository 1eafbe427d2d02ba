#include "Plan/Rules/ValueConditions.h"

#include "Expr/Clauses/XQueryFLWOR.h"
#include "Expr/Clauses/XQueryQuantified.h"
#include "Expr/Operators/XQueryOperatorExpr.h"
#include "Expr/Paths/XQueryPath.h"
#include "Expr/XQueryLeaves.h"
#include "Expr/XQueryLists.h"
#include "Functions/Boolean.h"
#include "Functions/Node.h"
#include "Functions/Sequence.h"
#include "Functions/XQueryFunctionCall.h"
#include "Plan/Joins/XQueryPartOfCall.h"
#include "Plan/Rules/PlaceInside.h"
#include "Plan/Rules/PositionConditions.h"
#include "Prolog/XQueryDeclarations.h"

#include <algorithm>
#include <iterator>
#include <utility>
#include <vector>

namespace xquery {
namespace {

using Found = std::optional<XQueryValueCondition>;
using Matches = std::vector<XQueryValueLookup::Match>;

// Conditions nest in each other; further down nothing is looked for.
constexpr int mostLevels = 16;

bool isCallOf(const XQueryExpr& expr, XQueryProcedure function) {
  const auto* call = dyn_cast<XQueryFunctionCall>(&expr);
  return call && call->builtIn() && call->function() == function && call->args() &&
         call->args()->count() == 1;
}

class Search {
 public:
  // `start` is where the values are looked for, to which `way` leads from the origin.
  struct Start {
    XQueryValueOrigin origin;
    XQueryValueWay way;
    XQueryVariableSet own;  // variables that the condition sets for itself
    // In the body of a declared function: its call, and where that is.
    XQueryPlaceID call = XQueryNoPlace;
    const Start* caller = nullptr;
  };

  explicit Search(const XQueryPlanning& planning)
      : _planning(planning), _program(planning.program) {}

  Found conditionIn(XQueryPlaceID place, const Start& from, int level) const {
    place = inside(place);
    if (place == XQueryNoPlace || level > mostLevels) return std::nullopt;
    const XQueryExpr& expr = *_program[place].expr;
    if (const auto* operation = dyn_cast<XQueryOperatorExpr>(&expr)) {
      if (operation->operatorType() == XQueryOperatorAnd) return ofAnd(place, from, level);
      if (operation->operatorType() == XQueryOperatorOr) return ofOr(place, from, level);
      return ofComparison(place, *operation, from, level);
    }
    if (isa<XQueryQuantifiedExpr>(&expr)) return ofSome(place, from, level);
    if (isa<XQueryPathExpr>(&expr)) return ofPath(place, from, level);
    const auto* call = dyn_cast<XQueryFunctionCall>(&expr);
    if (call && call->functionDecl()) return ofDeclared(place, *call, from, level);
    if (isCallOf(expr, fn_boolean)) return conditionIn(argumentOf(place), from, level + 1);
    if (isCallOf(expr, fn_exists)) return ofItems(argumentOf(place), from, level + 1);
    return isCallOf(expr, fn_not) ? ofNot(argumentOf(place), from, level + 1) : std::nullopt;
  }

  std::optional<XQueryValueWay> wayFrom(XQueryPlaceID place,
                                        const XQueryValueOrigin& origin) const {
    place = inside(place);
    if (isCallOf(*_program[place].expr, fn_data)) place = argumentOf(place);
    XQueryValueWay way;
    Start from;
    from.origin = origin;
    if (!readPath(*_program[place].expr, from, way)) return std::nullopt;
    return way;
  }

  bool isTextOfOne(XQueryPlaceID place) const {
    const XQueryExpr& expr = *_program[place].expr;
    if (!isCallOf(expr, fn_string) && !isCallOf(expr, fn_data)) return false;
    const XQueryFacts& facts = _planning.facts[argumentOf(place)];
    return facts.most <= 1 && facts.are(XQueryItems::Node) && !facts.does(XQueryDeeds::MayFail);
  }

 private:
  const XQueryFacts& facts(XQueryPlaceID place) const { return _planning.facts[place]; }
  XQueryPlaceID inside(XQueryPlaceID place) const { return XQueryPlaceInside(_program, place); }
  XQueryPlaceID argumentOf(XQueryPlaceID call) const {
    return inside(_program.firstPart(_program.firstPart(call)));
  }

  // The first of the conditions is asked of all nodes, so that an error in it is seen.
  Found ofAnd(XQueryPlaceID place, const Start& from, int level) const {
    const XQueryPlaceID left = _program.firstPart(place);
    if (left == XQueryNoPlace) return std::nullopt;
    Found found = conditionIn(left, from, level + 1);
    const XQueryPlaceID right = _program.nextPart(left);
    if (found || !from.origin.errorExcludes || right == XQueryNoPlace) return found;
    return conditionIn(right, from, level + 1);
  }

  Found ofOr(XQueryPlaceID place, const Start& from, int level) const {
    const XQueryPlaceID left = _program.firstPart(place);
    const XQueryPlaceID right = left == XQueryNoPlace ? left : _program.nextPart(left);
    if (right == XQueryNoPlace) return std::nullopt;
    Found found = conditionIn(left, from, level + 1);
    Found other = found ? conditionIn(right, from, level + 1) : std::nullopt;
    if (!other || found->anyOf.size() + other->anyOf.size() > XQueryValueLookup::mostMatches) {
      return std::nullopt;
    }
    std::move(other->anyOf.begin(), other->anyOf.end(), std::back_inserter(found->anyOf));
    found->isAll = false;
    return found;
  }

  Found ofNot(XQueryPlaceID place, const Start& from, int level) const {
    const XQueryExpr& expr = *_program[place].expr;
    if (isCallOf(expr, fn_not)) return conditionIn(argumentOf(place), from, level + 1);
    return isCallOf(expr, fn_empty) ? ofItems(argumentOf(place), from, level + 1) : std::nullopt;
  }

  // That there are items.
  Found ofItems(XQueryPlaceID place, const Start& from, int level) const {
    const XQueryExpr& expr = *_program[place].expr;
    if (isa<XQueryPathExpr>(&expr)) return ofPath(place, from, level);
    return isa<XQueryFLWORExpr>(&expr) ? ofFor(place, from, level) : std::nullopt;
  }

  // --- comparisons

  Found ofComparison(XQueryPlaceID place, const XQueryOperatorExpr& comparison, const Start& from,
                     int level) const {
    const int type = comparison.operatorType();
    if (Found found = ofCount(place, comparison, from, level)) return found;
    if (type != XQueryOperatorEqual && type != XQueryOperatorEq) return std::nullopt;
    const XQueryPlaceID left = _program.firstPart(place);
    const XQueryPlaceID right = left == XQueryNoPlace ? left : _program.nextPart(left);
    if (right == XQueryNoPlace || XQueryOperatorExpr::rangeIn(comparison.right())) {
      return std::nullopt;
    }
    const bool isOfOne = type == XQueryOperatorEq;
    Found found = ofOperands(left, right, isOfOne, from);
    if (!found) found = ofOperands(right, left, isOfOne, from);
    if (!found) return found;
    for (XQueryValueLookup::Match& match : found->anyOf) match.probe.takesSeveral = !isOfOne;
    found->isAll = found->isAll && level == 0;
    return found;
  }

  // "count(K) > 0" and the like, which no items do not meet.
  Found ofCount(XQueryPlaceID place, const XQueryOperatorExpr& comparison, const Start& from,
                int level) const {
    if (!comparison.left() || !comparison.right()) return std::nullopt;
    XQueryPlaceID count = inside(_program.firstPart(place));
    auto number = XQuerySmallIntegerIn(comparison.right());
    int type = comparison.operatorType();
    if (!number) {
      count = inside(_program.nextPart(_program.firstPart(place)));
      number = XQuerySmallIntegerIn(comparison.left());
      type = XQueryMirroredComparison(type);
    }
    if (!number || !isCallOf(*_program[count].expr, fn_count)) return std::nullopt;
    return needsItems(type, *number) ? ofItems(argumentOf(count), from, level + 1) : std::nullopt;
  }
  static bool needsItems(int comparison, int64_t number) {
    switch (comparison) {
      case XQueryOperatorGreater:
      case XQueryOperatorGt:
        return number >= 0;
      case XQueryOperatorGreaterEqual:
      case XQueryOperatorGe:
      case XQueryOperatorEqual:
      case XQueryOperatorEq:
        return number >= 1;
      default:
        return false;
    }
  }

  // `isOfOne`: a key of several values is an error, which may be one to be seen.
  Found ofOperands(XQueryPlaceID key, XQueryPlaceID probe, bool isOfOne, const Start& from) const {
    XQueryValueCondition found;
    key = inside(key);
    if (!isProbe(probe, from) || !readKeys(key, from, found.anyOf)) return std::nullopt;
    const XQueryPlaceID value = boundByLet(key, from);
    const bool isOne = facts(value).most <= 1 || isTextOfOne(value);
    if (isOfOne && !isOne && !from.origin.errorExcludes) return std::nullopt;
    found.isAll = isBare(key, from) && (isOne || !isOfOne);
    const Ref<XQueryExpr> expr = from.caller ? probeOfCall(probe, from) : _planning.exprAt(probe);
    if (!expr) return std::nullopt;
    for (XQueryValueLookup::Match& match : found.anyOf) {
      match.probe.areTexts =
          facts(probe).are(XQueryItems::Node | XQueryItems::Untyped | XQueryItems::String);
      match.probe.expr = expr;
    }
    return found;
  }

  bool isProbe(XQueryPlaceID place, const Start& from) const {
    const XQueryFacts& probe = facts(place);
    using namespace XQueryDeeds;
    // All that a predicate looks at is in the tree of its context item, as are its ways.
    const bool sharesRoot = from.origin.isInTreeOfFocus && !from.caller;
    const unsigned unknown = ReadsFocus & ~(sharesRoot ? unsigned{ReadsRoot} : 0U);
    return isIdleButForErrors(place) && !probe.does(unknown) && probe.assigns.isEmpty() &&
           !probe.reads.meets(from.own) &&
           probe.mayBe(XQueryItems::Node | XQueryItems::Untyped | XQueryItems::String);
  }
  // Whether the key is nothing but a way from the context item of a predicate.
  bool isBare(XQueryPlaceID key, const Start& from) const {
    XQueryValueWay way;
    return !from.caller && from.origin.varID == 0 && readPath(*_program[key].expr, from, way) &&
           way.isOfChildren();
  }

  bool isIdleButForErrors(XQueryPlaceID place) const {
    return facts(place).isRepeatable() && !facts(place).does(XQueryDeeds::LoadsDocuments);
  }

  // A key, or a list of them.
  bool readKeys(XQueryPlaceID key, const Start& from, Matches& found) const {
    const auto* list = dyn_cast<XQueryExprList>(_program[key].expr);
    if (!list || list->kind() != Kind::ExprList) return readKey(key, from, found);
    if (list->count() == 0 || list->count() > XQueryValueLookup::mostMatches) return false;
    for (XQueryPlaceID part = _program.firstPart(key); part != XQueryNoPlace;
         part = _program.nextPart(part)) {
      if (!readKey(inside(part), from, found)) return false;
    }
    return true;
  }

  bool readKey(XQueryPlaceID key, const Start& from, Matches& found) const {
    XQueryValueLookup::Match match{from.way, {}};
    key = boundByLet(key, from);
    const XQueryExpr& expr = *_program[key].expr;
    const bool isString = isCallOf(expr, fn_string);
    if (isString || isCallOf(expr, fn_data)) {
      match.probe.meetsNoneWhenEmpty = isString;
      if ((isString || !from.origin.errorExcludes) && !isTextOfOne(key)) return false;
      key = argumentOf(key);
    }
    if (!readPath(*_program[key].expr, from, match.way)) return false;
    found.push_back(std::move(match));
    return true;
  }

  // Of a variable that follows from the origin what it was set to.
  XQueryPlaceID boundByLet(XQueryPlaceID place, const Start& from) const {
    const auto* variable = dyn_cast<XQueryVariable>(_program[place].expr);
    const XQueryPlaceID binder = _program[place].binder;
    if (!variable || binder == XQueryNoPlace) return place;
    XQueryVariableSet read;
    read.add(variable->varID());
    if (!from.own.holds(read) || _program[binder].expr->kind() != Kind::LetExpr) return place;
    return inside(_program.part(binder, XQueryRole::Bound));
  }

  // The way from the origin, which is "." or a variable, by a path without predicates.
  static bool readPath(const XQueryExpr& expr, const Start& from, XQueryValueWay& way) {
    if (isOrigin(&expr, from)) return true;
    const auto* path = dyn_cast<XQueryPathExpr>(&expr);
    const XQueryStep* step = path ? firstAxisStep(*path, from) : nullptr;
    for (const XQueryStep* each = step; each; each = each->next()) {
      if (!each->predicates().empty()) return false;
    }
    return step && way.addSteps(step, nullptr);
  }

  static bool isOrigin(const XQueryExpr* expr, const Start& from) {
    if (from.origin.varID == 0) return expr && isa<XQueryContextItem>(expr);
    const auto* variable = dyn_cast<XQueryVariable>(expr);
    return variable && variable->varID() == from.origin.varID;
  }

  // Of a path that begins at the origin; null for another one.
  static const XQueryStep* firstAxisStep(const XQueryPathExpr& path, const Start& from) {
    const XQueryStep* step = path.step();
    if (step && step->kind() == Kind::FilterStep) {
      const bool isBare = step->predicates().empty();
      if (!isBare || !isOrigin(XQueryWithoutParentheses(step->expr()), from)) return nullptr;
      return step->next();
    }
    return from.origin.varID == 0 ? dyn_cast<XQueryAxisStep>(step) : nullptr;
  }

  // --- what has a condition of its own

  // For one of the items of the place, to which a variable is set, the condition holds.
  Found ofVariable(XQueryPlaceID bound, int64_t varID, XQueryPlaceID condition, const Start& from,
                   int level) const {
    Start inner = from;
    bound = inside(bound);
    if (bound == XQueryNoPlace || varID <= 0) return std::nullopt;
    if (!readPath(*_program[bound].expr, from, inner.way)) return std::nullopt;
    inner.origin.varID = varID;
    inner.own.add(varID);
    return inner.own.isExact() ? conditionIn(condition, inner, level + 1) : std::nullopt;
  }

  Found ofSome(XQueryPlaceID place, const Start& from, int level) const {
    const auto* some = cast<XQueryQuantifiedExpr>(_program[place].expr);
    if (some->every() || some->items().size() != 1) return std::nullopt;
    const XQueryQuantifiedExprItem& clause = *some->items().front();
    const XQueryPlaceID satisfies = _program.part(place, XQueryRole::Satisfies);
    if (clause.type() || satisfies == XQueryNoPlace) return std::nullopt;
    const XQueryPlaceID bound = _program.part(_program.firstPart(place), XQueryRole::Bound);
    return ofVariable(bound, clause.varID(), satisfies, from, level);
  }

  Found ofFor(XQueryPlaceID place, const Start& from, int level) const {
    const auto* flwor = cast<XQueryFLWORExpr>(_program[place].expr);
    const auto* clause = flwor->forLet().size() == 1
                             ? dyn_cast<XQueryForExpr>(flwor->forLet().front().get())
                             : nullptr;
    const XQueryPlaceID where = _program.part(place, XQueryRole::Where);
    const bool isBare = clause && !clause->type() && clause->posVarID() == 0;
    if (!isBare || where == XQueryNoPlace) return std::nullopt;
    const XQueryPlaceID bound = _program.part(_program.firstPart(place), XQueryRole::Bound);
    return ofVariable(bound, clause->varID(), where, from, level);
  }

  // A declared function whose body is a condition on one of its arguments.
  Found ofDeclared(XQueryPlaceID place, const XQueryFunctionCall& call, const Start& from,
                   int level) const {
    const XQueryProgramBody* body = _program.bodyOfFunction(call.functionDecl());
    const auto& params = call.functionDecl()->params();
    const auto arguments = argumentsOf(place);
    if (!body || from.caller || arguments.size() != params.size()) return std::nullopt;
    for (const XQueryPlaceID argument : arguments) {
      const bool isIdle = isIdleButForErrors(argument) && facts(argument).assigns.isEmpty();
      const bool mayFail = facts(argument).does(XQueryDeeds::MayFail);
      if (!isIdle || (mayFail && !from.origin.errorExcludes)) return std::nullopt;
    }
    for (size_t index = 0; index < params.size(); ++index) {
      Start inner{{}, from.way, {}, place, &from};
      inner.origin.varID = params[index]->varID();
      inner.origin.errorExcludes = from.origin.errorExcludes;
      inner.origin.isInTreeOfFocus = from.origin.isInTreeOfFocus;
      inner.own.add(inner.origin.varID);
      const XQueryExpr& argument = *_program[inside(arguments[index])].expr;
      if (!inner.own.isExact() || !readPath(argument, from, inner.way)) continue;
      if (Found found = conditionIn(body->place, inner, level + 1)) return found;
    }
    return std::nullopt;
  }

  std::vector<XQueryPlaceID> argumentsOf(XQueryPlaceID call) const {
    std::vector<XQueryPlaceID> found;
    const XQueryPlaceID list = _program.part(call, XQueryRole::Arguments);
    XQueryPlaceID part = list == XQueryNoPlace ? list : _program.firstPart(list);
    for (; part != XQueryNoPlace; part = _program.nextPart(part)) found.push_back(part);
    return found;
  }

  // What the call evaluates in the place of its body; null where that reads more than arguments
  // that could be probes themselves.
  Ref<XQueryExpr> probeOfCall(XQueryPlaceID place, const Start& from) const {
    Ref<XQueryExpr> call(_program[from.call].expr);
    const auto& params = cast<XQueryFunctionCall>(call)->functionDecl()->params();
    const auto arguments = argumentsOf(from.call);
    XQueryVariableSet others = facts(place).reads;
    std::vector<size_t> read;
    for (size_t index = 0; index < params.size(); ++index) {
      XQueryVariableSet param;
      param.add(params[index]->varID());
      if (!param.isExact() || !others.meets(param)) continue;
      if (!isProbe(arguments[index], *from.caller)) return nullptr;
      others.remove(params[index]->varID());
      read.push_back(index);
    }
    if (!others.isEmpty()) return nullptr;
    return XQueryPartOfCall::exprWithCall(std::move(call), _planning.exprAt(place),
                                          std::move(read));
  }

  // That a path of nodes leads to some, each step of which must find one that its predicates keep.
  // Errors in these drop a node.
  Found ofPath(XQueryPlaceID place, const Start& from, int level) const {
    const auto& path = *cast<XQueryPathExpr>(_program[place].expr);
    if (!facts(place).are(XQueryItems::Node)) return std::nullopt;
    const XQueryStep* const start = path.step();
    const bool filtersOrigin = start && start->kind() == Kind::FilterStep &&
                               isOrigin(XQueryWithoutParentheses(start->expr()), from);
    const XQueryStep* const first = firstAxisStep(path, from);
    if (!first && !filtersOrigin) return std::nullopt;
    for (XQueryPlaceID part = _program.firstPart(place); part != XQueryNoPlace;
         part = _program.nextPart(part)) {
      const XQueryPlace& at = _program[part];
      if (at.role != XQueryRole::Predicate || !at.step) continue;
      const bool isOfOrigin = filtersOrigin && at.step == start;
      if (!first && !isOfOrigin) break;
      Start inner = from;
      inner.origin = {};
      if (!isOfOrigin && !inner.way.addSteps(first, at.step->next())) return std::nullopt;
      if (Found found = conditionIn(part, inner, level + 1)) return found;
    }
    return std::nullopt;
  }

  const XQueryPlanning& _planning;
  const XQueryProgram& _program;
};

}  // namespace

std::optional<XQueryValueCondition> XQueryValueConditionIn(const XQueryPlanning& planning,
                                                           XQueryPlaceID condition,
                                                           const XQueryValueOrigin& origin) {
  Search::Start start;
  start.origin = origin;
  start.own = origin.own;
  if (origin.varID != 0) start.own.add(origin.varID);
  if (!start.own.isExact()) return std::nullopt;
  return Search(planning).conditionIn(condition, start, 0);
}

std::optional<XQueryValueWay> XQueryWayFrom(const XQueryPlanning& planning, XQueryPlaceID place,
                                            int64_t varID) {
  XQueryValueOrigin origin;
  origin.varID = varID;
  return Search(planning).wayFrom(place, origin);
}

bool XQueryIsTextOfOne(const XQueryPlanning& planning, XQueryPlaceID place) {
  place = XQueryPlaceInside(planning.program, place);
  return place != XQueryNoPlace && Search(planning).isTextOfOne(place);
}

}  // namespace xquery

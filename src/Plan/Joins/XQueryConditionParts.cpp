// "A and B" is written as "if (A) then B else ()" as well, "A" as "boolean(A)", "A = true()", "not(
// not(A))", or as a variable that a let clause sets to it, and what holds where "A or B" does not
// is "not(A) and not(B)". Each is taken apart in the same way. The order in which the parts are
// asked, and that none is asked behind one that decides, is the same for all of them.
#include "Plan/Joins/XQueryConditionParts.h"

#include "Expr/Clauses/XQueryConditional.h"
#include "Expr/Clauses/XQueryFLWOR.h"
#include "Expr/Operators/XQueryOperatorExpr.h"
#include "Expr/XQueryLeaves.h"
#include "Functions/Boolean.h"
#include "Functions/XQueryFunctionCall.h"
#include "Plan/Rules/PlaceInside.h"

#include <optional>

namespace xquery {
namespace {

// Longer chains of conditions are left alone.
constexpr size_t mostParts = 16;

using Part = XQueryConditionPart;

class Reader {
 public:
  Reader(const XQueryPlanning& planning, bool takesAnd)
      : _planning(planning), _program(planning.program), _takesAnd(takesAnd) {}

  XQueryConditionParts parts(Part whole) const {
    XQueryConditionParts found;
    XQueryConditionParts waiting = {whole};
    while (!waiting.empty()) {
      Part next = plainly(waiting.back());
      waiting.pop_back();
      if (const auto both = takenApart(next)) {
        waiting.push_back(both->second);
        waiting.push_back(both->first);
      } else if (!decidesNothing(next)) {
        found.push_back(next);
      }
      if (found.size() + waiting.size() > mostParts) return {};
    }
    return found;
  }

 private:
  struct Both {
    Part first;
    Part second;
  };

  XQueryPlaceID inside(XQueryPlaceID place) const { return XQueryPlaceInside(_program, place); }
  const XQueryExpr& exprAt(XQueryPlaceID place) const { return *_program[place].expr; }
  bool isCallOf(XQueryPlaceID place, XQueryProcedure function, size_t arguments) const {
    const auto* call = dyn_cast<XQueryFunctionCall>(&exprAt(place));
    return call && call->builtIn() && call->function() == function &&
           (call->args() ? call->args()->count() : 0) == arguments;
  }
  XQueryPlaceID argumentOf(XQueryPlaceID call) const {
    return _program.firstPart(_program.part(call, XQueryRole::Arguments));
  }

  // Without what says nothing of its own.
  Part plainly(Part part) const {
    for (int level = 0; level < XQueryPlanning::mostLevels; ++level) {
      part = atPlaceInside(part);
      const std::optional<Part> next = inPlaceOf(part);
      if (!next) return part;
      part = *next;
    }
    return part;
  }
  Part atPlaceInside(Part part) const {
    part.place = inside(part.place);
    if (!part.isNegated) part.whole = part.place;
    return part;
  }

  // A part that says the same.
  std::optional<Part> inPlaceOf(const Part& part) const {
    if (isCallOf(part.place, fn_boolean, 1))
      return Part{argumentOf(part.place), part.isNegated, part.whole};
    if (isCallOf(part.place, fn_not, 1)) {
      const XQueryPlaceID whole = part.isNegated ? XQueryNoPlace : part.place;
      return Part{argumentOf(part.place), !part.isNegated, whole};
    }
    if (const auto truth = comparedWithTruth(part)) return truth;
    return ofVariable(part);
  }

  // "A = true()", where A is one truth value, or nothing.
  std::optional<Part> comparedWithTruth(const Part& part) const {
    const auto* comparison = dyn_cast<XQueryOperatorExpr>(&exprAt(part.place));
    const bool isEquality = comparison && (comparison->operatorType() == XQueryOperatorEqual ||
                                           comparison->operatorType() == XQueryOperatorEq);
    if (!isEquality) return std::nullopt;
    XQueryPlaceID left = _program.firstPart(part.place);
    XQueryPlaceID right = left == XQueryNoPlace ? left : _program.nextPart(left);
    if (right == XQueryNoPlace) return std::nullopt;
    if (isTrue(left) || isFalse(left)) std::swap(left, right);
    const XQueryFacts& facts = _planning.facts[left];
    if (facts.most != 1 || !facts.are(XQueryItems::Boolean)) return std::nullopt;
    if (isTrue(right)) return Part{left, part.isNegated, part.whole};
    // Nothing equals neither.
    if (facts.least == 1 && isCallOf(inside(right), fn_false, 0)) {
      return Part{left, !part.isNegated, part.isNegated ? XQueryNoPlace : part.place};
    }
    return std::nullopt;
  }

  // What a let clause of the FLWOR sets it to, in whose condition it stands: nothing is evaluated
  // between them that could change what it reads. Not what may fail, which would be sooner.
  std::optional<Part> ofVariable(const Part& part) const {
    const XQueryPlaceID clause = _program[part.place].binder;
    if (!isa<XQueryVariable>(&exprAt(part.place)) || clause == XQueryNoPlace) return std::nullopt;
    const auto* let = dyn_cast<XQueryLetExpr>(&exprAt(clause));
    const XQueryPlaceID bound = _program.part(clause, XQueryRole::Bound);
    if (!let || let->type() || bound == XQueryNoPlace) return std::nullopt;
    const XQueryFacts& facts = _planning.facts[bound];
    const bool isIdle = facts.isRepeatable() && facts.assigns.isEmpty() &&
                        !facts.does(XQueryDeeds::MayFail | XQueryDeeds::LoadsDocuments);
    if (!isIdle || !facts.are(XQueryItems::Boolean)) return std::nullopt;
    if (!standsInConditionOf(_program[clause].parent, part.place)) return std::nullopt;
    if (isSetAgainBehind(clause, facts)) return std::nullopt;
    return Part{bound, part.isNegated, part.whole};
  }
  bool standsInConditionOf(XQueryPlaceID flwor, XQueryPlaceID place) const {
    const XQueryPlaceID where = _program.part(flwor, XQueryRole::Where);
    return where != XQueryNoPlace && place >= where && place < _program[where].end &&
           _program[place].focus == _program[where].focus;
  }
  // Whether a clause behind sets what the variable was made from.
  bool isSetAgainBehind(XQueryPlaceID clause, const XQueryFacts& facts) const {
    for (XQueryPlaceID part = _program.nextPart(clause); part != XQueryNoPlace;
         part = _program.nextPart(part)) {
      XQueryVariableSet own = _planning.facts[part].assigns;
      if (const auto* binding = dyn_cast<XQueryBindingExpr>(&exprAt(part))) {
        own.add(binding->varID());
      }
      if (const auto* loop = dyn_cast<XQueryForExpr>(&exprAt(part))) own.add(loop->posVarID());
      if (facts.reads.meets(own)) return true;
    }
    return false;
  }

  // Whether it decides nothing: what always holds behind "and", and what never does behind "or".
  bool decidesNothing(const Part& part) const {
    return _takesAnd != part.isNegated ? isTrue(part.place) : isFalse(part.place);
  }
  bool isTrue(XQueryPlaceID place) const { return isCallOf(inside(place), fn_true, 0); }
  // Nothing, which "()" is, holds no more than false().
  bool isFalse(XQueryPlaceID place) const {
    const XQueryFacts& facts = _planning.facts[place];
    const bool isNothing = facts.most == 0 && facts.deeds == 0 && facts.assigns.isEmpty();
    return isNothing || isCallOf(inside(place), fn_false, 0);
  }

  // Into two parts that "and" joins, or "or" where that is asked for.
  std::optional<Both> takenApart(const Part& part) const {
    if (exprAt(part.place).kind() == Kind::ConditionalExpr) return ofConditional(part);
    const auto* operation = dyn_cast<XQueryOperatorExpr>(&exprAt(part.place));
    if (!operation) return std::nullopt;
    const bool isAnd = operation->operatorType() == XQueryOperatorAnd;
    if (!isAnd && operation->operatorType() != XQueryOperatorOr) return std::nullopt;
    if ((isAnd != part.isNegated) != _takesAnd) return std::nullopt;
    const XQueryPlaceID left = _program.firstPart(part.place);
    const XQueryPlaceID right = left == XQueryNoPlace ? left : _program.nextPart(left);
    if (right == XQueryNoPlace) return std::nullopt;
    return Both{XQueryWholeCondition(left, part.isNegated),
                XQueryWholeCondition(right, part.isNegated)};
  }

  std::optional<Both> ofConditional(const Part& part) const {
    const XQueryPlaceID test = _program.part(part.place, XQueryRole::Test);
    const XQueryPlaceID then = test == XQueryNoPlace ? test : _program.nextPart(test);
    const XQueryPlaceID other = then == XQueryNoPlace ? then : _program.nextPart(then);
    if (other == XQueryNoPlace) return std::nullopt;
    // "if (A) then B else false()" is "A and B", "if (A) then true() else B" is "A or B", and with
    // the branches the other way round A is negated.
    for (const bool isThen : {true, false}) {
      const XQueryPlaceID open = isThen ? then : other;
      const XQueryPlaceID constant = isThen ? other : then;
      const bool isAnd = isFalse(constant);
      if (!isAnd && !isTrue(constant)) continue;
      if ((isAnd != part.isNegated) != _takesAnd) continue;
      const bool isTestNegated = (isAnd == isThen) == part.isNegated;
      return Both{XQueryWholeCondition(test, isTestNegated),
                  XQueryWholeCondition(open, part.isNegated)};
    }
    return std::nullopt;
  }

  const XQueryPlanning& _planning;
  const XQueryProgram& _program;
  const bool _takesAnd;
};

}  // namespace

XQueryConditionParts XQueryJoinedByAnd(const XQueryPlanning& planning, XQueryConditionPart part) {
  return Reader(planning, true).parts(part);
}

XQueryConditionParts XQueryJoinedByOr(const XQueryPlanning& planning, XQueryConditionPart part) {
  return Reader(planning, false).parts(part);
}

}  // namespace xquery

// Variables that are read for the last time.
//
// Pattern     $v between commas, as an argument of a call of a declared function, as the first
//             argument of remove, insert-before, subsequence or reverse, or in front of a range of
//             positions: f(($list, $new), $n - 1), $list[1] + f($list[position() > 1])
// Facts       it is local to a function, of which no part from the body down to the variable is
//             evaluated more than once, and what is evaluated behind it does not read the variable.
//             What is left in the variable cannot be told
// Operator    XQueryTakenVariable: the value moves out of the frame. XQueryLateElement around what
//             stands between commas, and late arguments of calls, where others next to the variable
//             read it as well: f(remove($list, 1), ($new, $list[1])), ($list, $list[last()] + 1)
// Why         nobody reads the variable again. A list that is held elsewhere as well is copied as
//             ever, by whoever would change it. What is evaluated late is the variable alone, or
//             changes of it by literal positions, which cannot fail. Where a body is asked for
//             something else than its value, and may be asked again, its frame keeps what it has
#include "Expr/Clauses/XQueryFLWOR.h"
#include "Expr/Operators/XQueryOperatorExpr.h"
#include "Expr/XQueryLeaves.h"
#include "Functions/XQueryFunctionCall.h"
#include "Plan/Operators/XQueryLateElement.h"
#include "Plan/Operators/XQueryScalarBody.h"
#include "Plan/Operators/XQueryTakenVariable.h"
#include "Plan/Planning.h"
#include "Plan/Rules.h"
#include "Plan/Rules/PathAt.h"
#include "Plan/Rules/PlaceInside.h"

#include <algorithm>

namespace xquery {
namespace {

class Search {
 public:
  explicit Search(XQueryPlanning& planning) : _planning(planning), _program(planning.program) {}

  void lookAt(XQueryPlaceID place) {
    auto* variable = dyn_cast<XQueryVariable>(_program[place].expr);
    if (!variable || variable->varID() < 1 || !_planning.isOpen(place)) return;
    if (!isTakenApart(XQueryPlaceAround(_program, place))) return;
    XQueryVariableSet own;
    own.add(variable->varID());
    Late late;
    if (!own.isExact() || !isLastUse(place, own, late)) return;
    if (_planning.showsLeftovers(own, place)) {
      return _planning.refuse(place, "the variable may be read where nothing has set it");
    }
    _planning.wrap(place, XQueryTakenVariable::exprWithPlain(Ref<XQueryVariable>(variable)));
    if (late.whole != XQueryNoPlace) evaluateLate(late);
  }

 private:
  // A part that is to be evaluated behind the others of its whole.
  struct Late {
    XQueryPlaceID whole = XQueryNoPlace;
    XQueryPlaceID part = XQueryNoPlace;
  };

  // Whether who evaluates the place may make something else of the list, or hands it on.
  bool isTakenApart(XQueryPlaceID place) const {
    const XQueryPlace& here = _program[place];
    if (here.parent == XQueryNoPlace) return false;
    if (here.role == XQueryRole::Element) return isList(here.parent);
    if (here.role == XQueryRole::FirstStep) return keepsRange(here.parent);
    if (here.role != XQueryRole::Argument) return false;
    const auto* call = dyn_cast<XQueryFunctionCall>(_program[_program[here.parent].parent].expr);
    if (!call) return false;
    if (!call->builtIn()) return call->hasBody();
    return call->builtIn()->row().takingProc && _program.firstPart(here.parent) == place;
  }

  // Whether what was written is what is evaluated there. The body of a function that is computed
  // without objects is, where that does not tell.
  bool isAsWritten(XQueryPlaceID place) const {
    if (_planning.isOpen(place)) return true;
    const Ref<XQueryExpr> expr = _planning.exprAt(place);
    const auto* planned = dyn_cast<XQueryPlannedExpr>(expr.get());
    return planned && planned->scalarBody() && &planned->plain() == _program[place].expr;
  }

  bool isList(XQueryPlaceID place) const { return _program[place].expr->kind() == Kind::ExprList; }

  // Whether a path is walked there that does no more with the items of its start.
  bool keepsRange(XQueryPlaceID place) const {
    const auto* path = XQueryWalkedPathAt(_planning, place);
    return path && path == _planning.exprAt(place).get() && path->keepsRangeAlone();
  }

  bool isLastUse(XQueryPlaceID place, const XQueryVariableSet& own, Late& late) const {
    bool isHarmless = true;
    for (int level = 0; level < XQueryPlanning::mostLevels; ++level) {
      const XQueryPlaceID whole = _program[place].parent;
      if (whole == XQueryNoPlace) return _program.bodyOf(place).function != nullptr;
      if (!evaluatesOnce(whole, _program[place].role)) return false;
      if (isReadBehind(place, own) && !isAlternative(place)) {
        if (!isHarmless || late.whole != XQueryNoPlace || !mayBeLate(place, own)) return false;
        late = {whole, place};
      }
      isHarmless = isHarmless && isHarmlessAround(place);
      place = whole;
    }
    return false;
  }

  // Whether the whole can fail in no other way than the part, of which the same holds: parentheses,
  // and changes of a list by literal positions.
  bool isHarmlessAround(XQueryPlaceID part) const {
    const XQueryPlace& here = _program[part];
    switch (here.role) {
      case XQueryRole::Element:
        return _program.nextPart(part) == XQueryNoPlace && _program.firstPart(here.parent) == part;
      case XQueryRole::Arguments: {
        const auto& call = *cast<XQueryFunctionCall>(_program[here.parent].expr);
        return call.builtIn() && call.builtIn()->row().takingProc &&
               call.builtIn()->row().takes(call.args()->count());
      }
      case XQueryRole::Argument:
        for (XQueryPlaceID other = _program.nextPart(part); other != XQueryNoPlace;
             other = _program.nextPart(other)) {
          const auto* literal = dyn_cast<XQueryLiteral>(_program[other].expr);
          if (!literal || !_planning.facts[other].are(XQueryItems::Integer)) return false;
        }
        return _program.firstPart(here.parent) == part;
      default:
        return false;
    }
  }

  // Whether the part, which reads nothing but this variable, may be evaluated behind the others.
  bool mayBeLate(XQueryPlaceID part, const XQueryVariableSet& own) const {
    const XQueryPlace& here = _program[part];
    if (here.role == XQueryRole::Element) return true;
    if (here.role != XQueryRole::Argument) return false;
    const auto* call = dyn_cast<XQueryFunctionCall>(_program[_program[here.parent].parent].expr);
    return call && !call->builtIn() && call->hasBody() &&
           indexOf(part) < XQueryFunctionCall::mostLateArguments && !isReadLate(here.parent, own);
  }

  size_t indexOf(XQueryPlaceID part) const {
    size_t index = 0;
    for (XQueryPlaceID each = _program.firstPart(_program[part].parent); each != part;
         each = _program.nextPart(each)) {
      ++index;
    }
    return index;
  }

  // Whether a late argument of the list reads it.
  bool isReadLate(XQueryPlaceID arguments, const XQueryVariableSet& own) const {
    const auto* call = dyn_cast<XQueryFunctionCall>(_program[_program[arguments].parent].expr);
    size_t index = 0;
    for (XQueryPlaceID each = _program.firstPart(arguments); each != XQueryNoPlace;
         each = _program.nextPart(each), ++index) {
      if (call && call->isLateArgument(index) && _planning.facts[each].reads.meets(own)) {
        return true;
      }
    }
    return false;
  }

  void evaluateLate(const Late& late) {
    if (_program[late.part].role == XQueryRole::Element) {
      const Ref<XQueryExprList> list(cast<XQueryExprList>(_program[late.whole].expr));
      return _planning.wrap(late.whole, XQueryLateElement::exprWithPlain(list, indexOf(late.part)),
                            "a variable is taken behind what else reads it");
    }
    auto* call = cast<XQueryFunctionCall>(_program[_program[late.whole].parent].expr);
    call->setLateArgument(indexOf(late.part));
  }

  // Whether, of the parts behind this one, none is evaluated where this one is.
  bool isAlternative(XQueryPlaceID place) const {
    return _program[place].role == XQueryRole::Branch ||
           _program[_program[place].parent].expr->kind() == Kind::TypeswitchExpr;
  }

  // Whether the whole evaluates the part in that role once at most, and is what evaluates it.
  bool evaluatesOnce(XQueryPlaceID whole, XQueryRole role) const {
    const XQueryExpr& expr = *_program[whole].expr;
    switch (role) {
      case XQueryRole::Element:
        return isList(whole) && isAsWritten(whole);
      case XQueryRole::FirstStep:
        return keepsRange(whole);
      case XQueryRole::Argument:
        return expr.kind() == Kind::Args;
      case XQueryRole::Arguments:
      case XQueryRole::Branch:
        return isAsWritten(whole);
      case XQueryRole::Operand: {
        const auto* operation = dyn_cast<XQueryOperatorExpr>(&expr);
        return operation && isArithmetic(operation->operatorType()) && isAsWritten(whole);
      }
      case XQueryRole::Bound:
        return expr.kind() == Kind::LetExpr;
      case XQueryRole::Case:
        return expr.kind() == Kind::CaseClause;
      case XQueryRole::Clause:
        if (expr.kind() == Kind::TypeswitchExpr) return isAsWritten(whole);
        return isSingleTuple(expr) && isAsWritten(whole);
      case XQueryRole::Return:
        return isSingleTuple(expr) && isAsWritten(whole);
      default:
        return false;
    }
  }

  static bool isArithmetic(int type) {
    switch (type) {
      case XQueryOperatorPlus:
      case XQueryOperatorMinus:
      case XQueryOperatorMultiply:
      case XQueryOperatorDiv:
      case XQueryOperatorIDiv:
      case XQueryOperatorMod:
        return true;
      default:
        return false;
    }
  }

  // A FLWOR of let clauses alone.
  static bool isSingleTuple(const XQueryExpr& expr) {
    const auto* flwor = dyn_cast<XQueryFLWORExpr>(&expr);
    return flwor && flwor->orderSpecs().empty() &&
           std::all_of(flwor->forLet().begin(), flwor->forLet().end(),
                       [](const auto& clause) { return clause->kind() == Kind::LetExpr; });
  }

  bool isReadBehind(XQueryPlaceID place, const XQueryVariableSet& own) const {
    constexpr int mostParts = 64;
    int count = 0;
    const XQueryPlace& here = _program[place];
    if (here.role == XQueryRole::Argument && isReadLate(here.parent, own)) return true;
    for (place = _program.nextPart(place); place != XQueryNoPlace;
         place = _program.nextPart(place)) {
      if (_planning.facts[place].reads.meets(own) || ++count > mostParts) return true;
    }
    return false;
  }

  XQueryPlanning& _planning;
  const XQueryProgram& _program;
};

}  // namespace

void XQueryTakeLastUses(XQueryPlanning& planning) {
  Search search(planning);
  for (XQueryPlaceID place = 0; place < planning.program.placeCount(); ++place) {
    search.lookAt(place);
  }
}

}  // namespace xquery

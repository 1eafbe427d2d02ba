// Variables of which only the number of items is asked for.
//
// Pattern     let $l := E ..., where every use of $l is count($l), exists($l) or empty($l), or of
//             nodes not($l), boolean($l) or a condition; E is a path, or a FLWOR without order
//             specs
// Facts       the clause declares no type; what is left in the variable cannot be told
// Operator    XQueryKeptCount for E: the variable takes the number. XQueryAskedCount for each use
// Why         E is evaluated when and as far as it always is, and fails as it always does. Nobody
//             sees the items, nor the number in their place
#include "Expr/Clauses/XQueryFLWOR.h"
#include "Expr/XQueryLeaves.h"
#include "Plan/Operators/XQueryItemCount.h"
#include "Plan/Planning.h"
#include "Plan/Rules.h"
#include "Plan/Rules/NumberQuestions.h"
#include "Plan/Rules/PlaceInside.h"

#include <map>
#include <vector>

namespace xquery {
namespace {

class Search {
 public:
  explicit Search(XQueryPlanning& planning) : _planning(planning), _program(planning.program) {}

  void run() {
    for (XQueryPlaceID place = 0; place < _program.placeCount(); ++place) {
      const auto* variable = dyn_cast<XQueryVariable>(_program[place].expr);
      const XQueryPlaceID binder = _program[place].binder;
      if (!variable || binder == XQueryNoPlace) continue;
      if (_program[binder].expr->kind() == Kind::LetExpr) _uses[binder].push_back(place);
    }
    for (const auto& [clause, uses] : _uses) lookAt(clause, uses);
  }

 private:
  void lookAt(XQueryPlaceID clause, const std::vector<XQueryPlaceID>& variables) {
    const auto& let = *cast<XQueryLetExpr>(_program[clause].expr);
    const XQueryPlaceID bound = _program.part(clause, XQueryRole::Bound);
    if (let.type() || bound == XQueryNoPlace || !_planning.isOpen(bound)) return;
    const XQueryPlaceID list = XQueryPlaceInside(_program, bound);
    if (!_planning.isOpen(list) || !isCountable(list)) return;
    std::vector<XQueryNumberQuestion> uses;
    for (const XQueryPlaceID variable : variables) {
      const auto asks = XQueryNumberQuestionAround(_planning, variable);
      const bool isNode = _planning.facts[bound].are(XQueryItems::Node);
      if (!asks || (asks->isOfTruth && !isNode)) return;
      uses.push_back(*asks);
    }
    XQueryVariableSet own;
    own.add(let.varID());
    if (!own.isExact() || _planning.showsLeftovers(own, clause)) {
      return _planning.refuse(clause, "the variable may be read where nothing has set it");
    }
    for (const XQueryNumberQuestion& use : uses) {
      _planning.wrap(use.place, XQueryAskedCount::exprWithPlain(_planning.exprAt(use.place),
                                                                let.varID(), use.question));
    }
    _planning.wrap(bound, XQueryKeptCount::exprWithPlain(_planning.exprAt(list)));
  }

  bool isCountable(XQueryPlaceID place) const {
    const XQueryExpr& expr = *_program[place].expr;
    if (const auto* flwor = dyn_cast<XQueryFLWORExpr>(&expr)) return flwor->orderSpecs().empty();
    return expr.kind() == Kind::PathExpr;
  }

  XQueryPlanning& _planning;
  const XQueryProgram& _program;
  std::map<XQueryPlaceID, std::vector<XQueryPlaceID>> _uses;  // of variables, by clause
};

}  // namespace

void XQueryCountLists(XQueryPlanning& planning) {
  Search(planning).run();
}

}  // namespace xquery

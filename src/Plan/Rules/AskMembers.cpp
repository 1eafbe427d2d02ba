// One node and a large set.
//
// Pattern     N intersect S, N except S, count(N | S) and count(S | N), some $x in S satisfies
//             $x is N, where S is a variable or an expression that is kept
// Facts       N answers one node at most, S nodes; both can be repeated; in a quantifier, N cannot
//             tell which member the variable stands for
// Operator    XQueryMembership: a table of S is made when S is asked again
// Why         see there
#include "Expr/Clauses/XQueryQuantified.h"
#include "Expr/Operators/XQueryOperatorExpr.h"
#include "Expr/XQueryLeaves.h"
#include "Functions/Sequence.h"
#include "Functions/XQueryFunctionCall.h"
#include "Plan/Operators/XQueryMembership.h"
#include "Plan/Planning.h"
#include "Plan/Rules.h"
#include "Plan/Rules/PlaceInside.h"

namespace xquery {
namespace {

using Question = XQueryMembership::Question;

class Search {
 public:
  explicit Search(XQueryPlanning& planning) : _planning(planning), _program(planning.program) {}

  void run() {
    for (XQueryPlaceID place = 0; place < _program.placeCount(); ++place) {
      if (_planning.isOpen(place)) lookAt(place);
    }
  }

 private:
  void lookAt(XQueryPlaceID place) {
    const XQueryExpr* expr = _program[place].expr;
    if (const auto* operation = dyn_cast<XQueryOperatorExpr>(expr)) {
      const int type = operation->operatorType();
      if (type != XQueryOperatorIntersect && type != XQueryOperatorExcept) return;
      const bool isCommon = type == XQueryOperatorIntersect;
      takeOver(place, operandsOf(place), false,
               isCommon ? Question::Intersection : Question::Difference);
    } else if (isa<XQueryFunctionCall>(expr)) {
      lookAtCount(place);
    } else if (isa<XQueryQuantifiedExpr>(expr)) {
      lookAtQuantifier(place);
    }
  }

  struct Operands {
    XQueryPlaceID first = XQueryNoPlace;
    XQueryPlaceID second = XQueryNoPlace;
  };
  Operands operandsOf(XQueryPlaceID operation) const {
    const XQueryPlaceID first = _program.firstPart(operation);
    return {first, first == XQueryNoPlace ? XQueryNoPlace : _program.nextPart(first)};
  }

  XQueryPlaceID inside(XQueryPlaceID place) const { return XQueryPlaceInside(_program, place); }

  void lookAtCount(XQueryPlaceID place) {
    const auto* call = cast<XQueryFunctionCall>(_program[place].expr);
    const bool isCount = call->builtIn() && call->function() == fn_count && call->args() &&
                         call->args()->count() == 1;
    if (!isCount) return;
    const XQueryPlaceID set = inside(_program.firstPart(_program.firstPart(place)));
    const auto* operation =
        set == XQueryNoPlace ? nullptr : dyn_cast<XQueryOperatorExpr>(_program[set].expr);
    if (!operation || operation->operatorType() != XQueryOperatorUnion) return;
    const Operands operands = operandsOf(set);
    if (!takeOver(place, operands, false, Question::CountOfUnion)) {
      takeOver(place, {operands.second, operands.first}, true, Question::CountOfUnion);
    }
  }

  void lookAtQuantifier(XQueryPlaceID place) {
    const auto* quantifier = cast<XQueryQuantifiedExpr>(_program[place].expr);
    if (quantifier->every() || quantifier->items().size() != 1) return;
    const XQueryQuantifiedExprItem& clause = *quantifier->items().front();
    const XQueryPlaceID test = inside(_program.part(place, XQueryRole::Satisfies));
    const auto* comparison =
        test == XQueryNoPlace ? nullptr : dyn_cast<XQueryOperatorExpr>(_program[test].expr);
    if (clause.type() || !comparison || comparison->operatorType() != XQueryOperatorIs) return;
    const Operands sides = operandsOf(test);
    const auto isMember = [&](XQueryPlaceID side) {
      const auto* variable =
          dyn_cast<XQueryVariable>(side == XQueryNoPlace ? nullptr : _program[inside(side)].expr);
      return variable && variable->varID() == clause.varID() && clause.varID() > 0;
    };
    const XQueryPlaceID node = isMember(sides.first) ? sides.second : sides.first;
    if (node == XQueryNoPlace || (!isMember(sides.first) && !isMember(sides.second))) return;
    XQueryVariableSet own;
    own.add(clause.varID());
    const XQueryPlaceID set = _program.part(_program.firstPart(place), XQueryRole::Bound);
    if (!own.isExact() || _planning.facts[node].reads.meets(own)) return;
    takeOver(place, {node, set}, true, Question::Some, clause.varID());
  }

  bool takeOver(XQueryPlaceID place, Operands operands, bool isSetFirst, Question question,
                int64_t varID = 0) {
    const auto [node, set] = operands;
    if (node == XQueryNoPlace || set == XQueryNoPlace || !isSteady(set)) return false;
    const XQueryFacts& ofNode = _planning.facts[node];
    const XQueryFacts& ofSet = _planning.facts[set];
    const bool fits = ofNode.most <= 1 && ofNode.are(XQueryItems::Node) && ofSet.most > 1 &&
                      ofSet.mayBe(XQueryItems::Node) && canRepeat(ofNode) && canRepeat(ofSet);
    if (!fits || !_program[node].slot || !_program[set].slot) return false;
    _planning.wrap(place, XQueryMembership::exprWithPlain(
                              *_program[place].slot, question,
                              {*_program[node].slot, *_program[set].slot, isSetFirst, varID}));
    return true;
  }

  static bool canRepeat(const XQueryFacts& facts) {
    return facts.isRepeatable() && facts.assigns.isEmpty() &&
           !facts.does(XQueryDeeds::LoadsDocuments);
  }

  // Whether the value is likely to be the same one when it is asked for again.
  bool isSteady(XQueryPlaceID set) const {
    const XQueryPlaceID place = inside(set);
    if (place == XQueryNoPlace) return false;
    return isa<XQueryVariable>(_program[place].expr) || _planning.isWrapped(place) ||
           _planning.isWrapped(set);
  }

  XQueryPlanning& _planning;
  const XQueryProgram& _program;
};

}  // namespace

void XQueryAskMembers(XQueryPlanning& planning) {
  Search(planning).run();
}

}  // namespace xquery

#include "Plan/Rules/WayConditions.h"

#include "Expr/Clauses/XQueryQuantified.h"
#include "Expr/Operators/XQueryOperatorExpr.h"
#include "Expr/Paths/XQueryNameTest.h"
#include "Expr/Paths/XQueryPath.h"
#include "Expr/TypeTests/XQueryTypeDeclaration.h"
#include "Expr/XQueryLeaves.h"
#include "Functions/Boolean.h"
#include "Functions/Node.h"
#include "Functions/Sequence.h"
#include "Functions/XQueryFunctionCall.h"
#include "Plan/Rules/PlaceInside.h"
#include "Plan/Rules/PositionConditions.h"

#include <algorithm>
#include <array>

namespace xquery {
namespace {

constexpr int mostLevels = 16;

// Goes through a condition. The variables of its own stand for nodes above the one that is asked.
class Search {
 public:
  Search(const XQueryProgram& program, const XQueryWayVariables& variables)
      : _program(program), _variables(variables.nodes), _numbers(variables.numbers) {}

  bool isOfWays(XQueryPlaceID place, int level) {
    place = XQueryPlaceInside(_program, place);
    if (place == XQueryNoPlace || level > mostLevels) return false;
    const XQueryExpr& expr = *_program[place].expr;
    if (XQuerySmallIntegerIn(&expr) || isNode(expr) || isOneOf(_numbers, expr)) return true;
    if (isa<XQueryPathExpr>(&expr)) return isPathOfWays(place, level);
    if (isa<XQueryFunctionCall>(&expr)) return isCallOfWays(place, level);
    if (isa<XQueryQuantifiedExpr>(&expr)) return isQuantifierOfWays(place, level);
    return isa<XQueryOperatorExpr>(&expr) && isOperationOfWays(place, level);
  }

 private:
  bool allAre(XQueryPlaceID whole, int level) {
    XQueryPlaceID part = _program.firstPart(whole);
    if (part == XQueryNoPlace) return false;
    for (; part != XQueryNoPlace; part = _program.nextPart(part)) {
      if (!isOfWays(part, level + 1)) return false;
    }
    return true;
  }

  // The node that is asked, or one of those above it.
  bool isNode(const XQueryExpr& expr) const {
    return isa<XQueryContextItem>(&expr) || isOneOf(_variables, expr);
  }
  static bool isOneOf(const XQueryVariableSet& variables, const XQueryExpr& expr) {
    const auto* variable = dyn_cast<XQueryVariable>(&expr);
    if (!variable || variable->varID() <= 0) return false;
    XQueryVariableSet read;
    read.add(variable->varID());
    return variables.holds(read);
  }

  // Whether the test accepts a node by its kind or its name.
  static bool isOfNames(const XQueryExpr* test) {
    if (isa<XQueryNameTest>(test) || isa<XQueryWildCardNameTest>(test)) return true;
    const auto* type = dyn_cast<XQueryTypeDeclaration>(test);
    return type && !type->data() && type->acceptsCount(1) &&
           (type->type() == XQueryTypeDeclaration::AnyKindTest ||
            type->type() == XQueryTypeDeclaration::ElementTest);
  }

  static bool goesUp(const XQueryStep& step) {
    constexpr std::array axes = {XQueryAxisParent, XQueryAxisAncestor, XQueryAxisAncestorOrSelf,
                                 XQueryAxisSelf};
    const auto* axisStep = dyn_cast<XQueryAxisStep>(&step);
    return axisStep && axisStep->expr() && isOfNames(axisStep->expr()) &&
           !axisStep->testMayRaise() &&
           std::find(axes.begin(), axes.end(), axisStep->axis()) != axes.end();
  }

  bool startsAtNode(const XQueryStep& step) const {
    return step.kind() == Kind::FilterStep && step.predicates().empty() && step.expr() &&
           isNode(*XQueryWithoutParentheses(step.expr()));
  }

  // The nodes that it finds differ, but not how many there are.
  bool isPathOfWays(XQueryPlaceID place, int level) {
    const auto* path = cast<XQueryPathExpr>(_program[place].expr);
    const XQueryStep* step = path->step();
    if (step && startsAtNode(*step)) step = step->next();
    if (!step) return false;
    for (; step; step = step->next()) {
      if (!goesUp(*step)) return false;
    }
    for (XQueryPlaceID part = _program.firstPart(place); part != XQueryNoPlace;
         part = _program.nextPart(part)) {
      const XQueryPlace& at = _program[part];
      if (at.role == XQueryRole::Predicate && !XQuerySmallIntegerIn(at.expr) &&
          !isOfWays(part, level + 1)) {
        return false;
      }
    }
    return true;
  }

  bool isCallOfWays(XQueryPlaceID place, int level) {
    constexpr std::array functions = {fn_not, fn_boolean, fn_exists, fn_empty, fn_count};
    const auto* call = cast<XQueryFunctionCall>(_program[place].expr);
    if (!call->builtIn() || !call->args() || call->args()->count() != 1) return false;
    const bool fits =
        std::find(functions.begin(), functions.end(), call->function()) != functions.end();
    return fits && allAre(_program.firstPart(place), level);
  }

  bool isQuantifierOfWays(XQueryPlaceID place, int level) {
    const auto* quantifier = cast<XQueryQuantifiedExpr>(_program[place].expr);
    const XQueryVariableSet outside = _variables;
    bool fits = true;
    for (XQueryPlaceID part = _program.firstPart(place); fits && part != XQueryNoPlace;
         part = _program.nextPart(part)) {
      const auto* clause = dyn_cast<XQueryQuantifiedExprItem>(_program[part].expr);
      if (!clause) {
        fits = isOfWays(part, level + 1);
        continue;
      }
      const XQueryPlaceID bound = _program.part(part, XQueryRole::Bound);
      fits = !clause->type() && clause->varID() > 0 && bound != XQueryNoPlace &&
             isa<XQueryPathExpr>(_program[XQueryPlaceInside(_program, bound)].expr) &&
             isOfWays(bound, level + 1);
      _variables.add(clause->varID());
    }
    fits = fits && _variables.isExact() && !quantifier->items().empty();
    _variables = outside;
    return fits;
  }

  // --- comparisons

  bool isNumber(XQueryPlaceID place) const {
    const XQueryExpr* expr = _program[XQueryPlaceInside(_program, place)].expr;
    return XQueryIsNumberOfNodes(_program, place) || XQuerySmallIntegerIn(expr) ||
           isOneOf(_numbers, *expr);
  }

  bool isText(XQueryPlaceID place) const {
    const auto* literal =
        dyn_cast<XQueryLiteral>(_program[XQueryPlaceInside(_program, place)].expr);
    return literal && isa<NSString>(literal->literalValue());
  }

  // name(), local-name(..).
  bool isName(XQueryPlaceID place, int level) {
    place = XQueryPlaceInside(_program, place);
    const auto* call = dyn_cast<XQueryFunctionCall>(_program[place].expr);
    if (!call || !call->builtIn()) return false;
    if (call->function() != fn_name && call->function() != fn_local_name) return false;
    const size_t arguments = call->args() ? call->args()->count() : 0;
    return arguments == 0 || (arguments == 1 && isPathOrNode(_program.firstPart(place), level));
  }
  bool isPathOrNode(XQueryPlaceID arguments, int level) {
    const XQueryPlaceID place = XQueryPlaceInside(_program, _program.firstPart(arguments));
    const XQueryExpr& expr = *_program[place].expr;
    return isNode(expr) || (isa<XQueryPathExpr>(&expr) && isOfWays(place, level + 1));
  }

  bool isOperationOfWays(XQueryPlaceID place, int level) {
    const auto* operation = cast<XQueryOperatorExpr>(_program[place].expr);
    if (!operation->left() || !operation->right()) return false;
    const int type = operation->operatorType();
    if (type == XQueryOperatorAnd || type == XQueryOperatorOr) return allAre(place, level);
    const int operatorClass = XQueryOperatorExpr::operatorClassification(type);
    if (operatorClass != 5 && operatorClass != 6) return false;
    const XQueryPlaceID left = _program.firstPart(place);
    const XQueryPlaceID right = _program.nextPart(left);
    if (isName(left, level) && isText(right)) return true;
    if (isText(left) && isName(right, level)) return true;
    return isNumber(left) && isNumber(right) && allAre(place, level);
  }

  const XQueryProgram& _program;
  XQueryVariableSet _variables;
  const XQueryVariableSet _numbers;
};

}  // namespace

bool XQueryIsOfWays(const XQueryProgram& program, XQueryPlaceID place,
                    const XQueryWayVariables& variables) {
  return Search(program, variables).isOfWays(place, 0);
}

bool XQueryIsNumberOfNodes(const XQueryProgram& program, XQueryPlaceID place) {
  const XQueryExpr* expr = program[XQueryPlaceInside(program, place)].expr;
  const auto* call = dyn_cast<XQueryFunctionCall>(expr);
  return call && call->builtIn() && call->function() == fn_count;
}

}  // namespace xquery

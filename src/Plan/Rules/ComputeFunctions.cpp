// Declared functions over numbers, texts and lists.
//
// Pattern     a function whose body consists of literals of numbers and strings, true() and
// false(),
//             its parameters, let variables without a type, arithmetic, comparisons,
//             "and", "or", not(), conditionals, quantifiers over one range, items by position, as
//             in $l[1] and $l[position() > $n], (), built-in functions of XQueryScalarFunctions.h
//             and calls of functions for which the same holds
// Facts       each variable is read where it is surely set, by a parameter or a clause around it
// Refused     functions of many parameters and variables, and very long ones; what stands between
//             commas, as lists that grow are better off where they are changed in place
// Operator    XQueryScalarBody
// Why         nothing that is computed can be told from outside but the answer; where it is not
//             known, the body is evaluated as it was written, with the same arguments
#include "Expr/Clauses/XQueryConditional.h"
#include "Expr/Clauses/XQueryFLWOR.h"
#include "Expr/Clauses/XQueryQuantified.h"
#include "Expr/Operators/XQueryOperatorExpr.h"
#include "Expr/Paths/XQueryPath.h"
#include "Expr/XQueryLeaves.h"
#include "Functions/Boolean.h"
#include "Functions/XQueryFunctionCall.h"
#include "Plan/Operators/XQueryScalarBody.h"
#include "Plan/Planning.h"
#include "Plan/Rules.h"
#include "Plan/Rules/PlaceInside.h"
#include "Plan/Rules/PositionConditions.h"
#include "Prolog/XQueryDeclarations.h"
#include "Types/XQueryNumericOperand.h"

#include <algorithm>
#include <map>
#include <memory>
#include <optional>
#include <utility>
#include <vector>

namespace xquery {
namespace {

using Terms = XQueryScalarProgram;
using TermKind = XQueryScalarProgram::Kind;
using Added = std::optional<Terms::Index>;

// The classes of operators, as XQueryOperatorExpr::operatorClassification numbers them.
constexpr int logicalClass = 1, arithmeticClass = 2, valueClass = 5, generalClass = 6;

using BuiltIn = XQueryScalarFunction;

// Which items a comparison with position() keeps; nothing for "!=".
std::optional<BuiltIn> itemsKeptBy(int comparison) {
  switch (comparison) {
    case XQueryOperatorEqual:
    case XQueryOperatorEq:
      return BuiltIn::Item;
    case XQueryOperatorGreater:
    case XQueryOperatorGt:
      return BuiltIn::ItemsAbove;
    case XQueryOperatorGreaterEqual:
    case XQueryOperatorGe:
      return BuiltIn::ItemsFrom;
    case XQueryOperatorLess:
    case XQueryOperatorLt:
      return BuiltIn::ItemsBelow;
    case XQueryOperatorLessEqual:
    case XQueryOperatorLe:
      return BuiltIn::ItemsUpTo;
    default:
      return std::nullopt;
  }
}

using FunctionIndexes = std::map<const XQueryFunctionDecl*, Terms::Index>;

// Adds the terms of one function.
class Compiler {
 public:
  Compiler(const XQueryProgram& program, const FunctionIndexes& functions,
           XQueryScalarBody::Program& into)
      : _program(program), _functions(functions), _into(into) {}

  std::optional<Terms::Function> functionOf(const XQueryProgramBody& body) {
    Terms::Function function;
    for (const auto& parameter : body.function->params()) {
      if (parameter->varID() < 1 || _slotsOfParameters.size() == Terms::mostSlots) return {};
      _slotsOfParameters.emplace(parameter->varID(), _slots++);
    }
    if (_slotsOfParameters.size() != body.function->params().size()) return {};
    function.parameters = _slots;
    const Added added = add(body.place, Use::Answer, 0);
    if (!added) return {};
    function.body = *added;
    return function;
  }

 private:
  // What becomes of a value: it is looked at, or may be the answer.
  enum class Use : uint8_t { Operand, Answer };

  Added add(XQueryPlaceID place, Use use, int level) {
    constexpr int mostLevels = 64;
    place = XQueryPlaceInside(_program, place);
    if (place == XQueryNoPlace || level > mostLevels) return {};
    if (_into.scalars.count() >= Terms::mostTerms) return {};
    const XQueryExpr& expr = *_program[place].expr;
    switch (expr.kind()) {
      case Kind::Literal:
        return addLiteral(*cast<XQueryLiteral>(_program[place].expr), use);
      case Kind::Variable:
        return addVariable(place);
      case Kind::OperatorExpr:
        return addOperation(place, *cast<XQueryOperatorExpr>(&expr), level + 1);
      case Kind::FunctionCall:
        return addCall(place, *cast<XQueryFunctionCall>(&expr), level + 1);
      case Kind::ConditionalExpr:
        return addConditional(place, use, level + 1);
      case Kind::QuantifiedExpr:
        return addQuantifier(place, *cast<XQueryQuantifiedExpr>(&expr), level + 1);
      case Kind::PathExpr:
        return addPositions(place, *cast<XQueryPathExpr>(&expr), level + 1);
      case Kind::ExprList:
        if (_program.firstPart(place) != XQueryNoPlace) return {};
        return addConstant(XQueryScalar::ofNothing());
      case Kind::FLWORExpr:
        return addLets(place, *cast<XQueryFLWORExpr>(&expr), use, level + 1);
      default:
        return {};
    }
  }

  // Of one that may be the answer the object matters.
  Added addLiteral(XQueryLiteral& literal, Use use) {
    NSObject* value = literal.literalValue().get();
    if (isa<NSNull>(value)) return addConstant(XQueryScalar::ofNothing());
    if (isa<NSString>(value)) {
      if (use == Use::Answer) _into.literals.emplace_back(&literal);
      return addObject(value);
    }
    const auto number = XQueryNumericOperand::of(value, false);
    const bool isInteger = number.form == XQueryNumericOperand::Exact && number.isInteger &&
                           number.exact->isSmallInteger();
    if (number.form == XQueryNumericOperand::Other) return {};
    const bool isLong = !isInteger && number.form == XQueryNumericOperand::Exact;
    if (isLong && use == Use::Operand) return addObject(value);
    if (use == Use::Answer) {
      _into.literals.emplace_back(&literal);
      return addObject(value);
    }
    return addConstant(isInteger ? XQueryScalar::ofInteger(number.exact->smallInteger())
                                 : XQueryScalar::ofDouble(number.number));
  }

  Added addObject(NSObject* value) {
    _into.constants.emplace_back(value);
    return addConstant(XQueryScalar::ofObject(value));
  }

  Added addConstant(const XQueryScalar& constant) {
    Terms::Term term;
    term.constant = constant;
    return _into.scalars.add(term);
  }

  Added addVariable(XQueryPlaceID place) {
    const auto& variable = *cast<XQueryVariable>(_program[place].expr);
    const XQueryPlaceID binder = _program[place].binder;
    Terms::Term term;
    term.kind = TermKind::Slot;
    if (binder != XQueryNoPlace) {
      const auto slot = _slotsOfVariables.find(binder);
      if (slot == _slotsOfVariables.end()) return {};
      term.code = slot->second;
    } else {
      const auto slot = _slotsOfParameters.find(variable.varID());
      if (slot == _slotsOfParameters.end()) return {};
      term.code = slot->second;
    }
    return _into.scalars.add(term);
  }

  Added addOperation(XQueryPlaceID place, const XQueryOperatorExpr& operation, int level) {
    const XQueryPlaceID first = _program.firstPart(place);
    if (first == XQueryNoPlace) return {};
    Terms::Term term;
    const int type = operation.operatorType();
    term.code = static_cast<uint8_t>(type);
    switch (XQueryOperatorExpr::operatorClassification(type)) {
      case logicalClass:
        term.kind = type == XQueryOperatorAnd ? TermKind::And : TermKind::Or;
        break;
      case arithmeticClass:
        term.kind = TermKind::Arithmetic;
        if (operation.isSign()) return addSign(term, first, level);
        break;
      case valueClass:
        term.kind = TermKind::Comparison;
        break;
      case generalClass:
        term.kind = TermKind::General;
        term.code = static_cast<uint8_t>(type + XQueryOperatorEq - XQueryOperatorEqual);
        break;
      default:
        return {};
    }
    return addOf(term, add(first, Use::Operand, level), _program.nextPart(first), level);
  }

  // A sign adds to nothing, or takes from it.
  Added addSign(const Terms::Term& term, XQueryPlaceID operand, int level) {
    return addOf(term, addConstant(XQueryScalar::ofInteger(0)), operand, level);
  }

  Added addOf(Terms::Term term, const Added& left, XQueryPlaceID right, int level) {
    if (!left || right == XQueryNoPlace) return {};
    const Added added = add(right, Use::Operand, level);
    if (!added) return {};
    term.left = *left;
    term.right = *added;
    return _into.scalars.add(term);
  }

  Added addCall(XQueryPlaceID place, const XQueryFunctionCall& call, int level) {
    const XQueryPlaceID list = _program.part(place, XQueryRole::Arguments);
    const XQueryPlaceID first = list == XQueryNoPlace ? list : _program.firstPart(list);
    if (call.builtIn()) return addBuiltIn(call, first, level);
    const auto function = _functions.find(call.functionDecl());
    if (!call.hasBody() || function == _functions.end()) return {};
    const auto operands = addOperands(first, Use::Answer, level);
    if (!operands) return {};
    Terms::Term term;
    term.kind = TermKind::Call;
    term.code = static_cast<uint8_t>(operands->size());
    term.left = function->second;
    if (_into.scalars.operandCount() + operands->size() >= Terms::mostTerms) return {};
    term.right = _into.scalars.addOperands(*operands);
    return _into.scalars.add(term);
  }

  using Operands = std::vector<Terms::Index>;

  // Of the place and those behind it in the same whole.
  std::optional<Operands> addOperands(XQueryPlaceID first, Use use, int level) {
    Operands operands;
    for (XQueryPlaceID each = first; each != XQueryNoPlace; each = _program.nextPart(each)) {
      const Added added = add(each, use, level);
      if (!added) return std::nullopt;
      operands.push_back(*added);
    }
    return operands;
  }

  Added addFunction(BuiltIn function, const Operands& operands) {
    const size_t count = operands.size();
    if (count > XQueryMostScalarArguments) return {};
    if (_into.scalars.operandCount() + count >= Terms::mostTerms) return {};
    Terms::Term term;
    term.kind = TermKind::BuiltIn;
    term.code = static_cast<uint8_t>(function);
    term.left = _into.scalars.addOperands(operands);
    term.right = static_cast<Terms::Index>(count);
    return _into.scalars.add(term);
  }

  // What is in parentheses or a variable, with predicates that ask for positions.
  Added addPositions(XQueryPlaceID place, const XQueryPathExpr& path, int level) {
    const XQueryStep* step = path.step();
    if (!step || step->next() || step->kind() != Kind::FilterStep || !step->expr()) return {};
    const XQueryPlaceID start = _program.part(place, XQueryRole::FirstStep);
    if (start == XQueryNoPlace) return {};
    Added items = add(start, Use::Answer, level);
    size_t index = 0;
    for (XQueryPlaceID each = _program.nextPart(start); items && each != XQueryNoPlace;
         each = _program.nextPart(each), ++index) {
      if (index >= step->predicates().size()) return {};
      items = addPredicate(each, step->literalPosition(index), *items, level);
    }
    return items;
  }

  Added addPredicate(XQueryPlaceID place, const std::optional<uint64_t>& position,
                     Terms::Index items, int level) {
    if (position) {
      if (*position > UINT32_MAX) return {};
      const auto number = static_cast<int64_t>(*position);
      return addFilter(BuiltIn::Item, items, addConstant(XQueryScalar::ofInteger(number)));
    }
    const XQueryPlaceID inside = XQueryPlaceInside(_program, place);
    if (inside == XQueryNoPlace) return {};
    const XQueryExpr& predicate = *_program[inside].expr;
    if (const auto behind = XQueryItemsBehindAskedFor(predicate)) {
      const auto number = static_cast<int64_t>(*behind);
      return addFilter(BuiltIn::ItemFromBack, items, addConstant(XQueryScalar::ofInteger(number)));
    }
    const auto* comparison = dyn_cast<XQueryOperatorExpr>(&predicate);
    const bool isOnLeft = comparison && XQueryIsPosition(comparison->left());
    if (isOnLeft || (comparison && XQueryIsPosition(comparison->right()))) {
      const int type = comparison->operatorType();
      const auto kept = itemsKeptBy(isOnLeft ? type : XQueryMirroredComparison(type));
      const XQueryPlaceID left = _program.firstPart(inside);
      const XQueryPlaceID compared = isOnLeft ? _program.nextPart(left) : left;
      return kept ? addFilter(*kept, items, add(compared, Use::Operand, level)) : Added();
    }
    return addFilter(BuiltIn::Item, items, add(inside, Use::Operand, level));
  }

  Added addFilter(BuiltIn function, Terms::Index items, const Added& asked) {
    return asked ? addFunction(function, {items, *asked}) : Added();
  }

  Added addBuiltIn(const XQueryFunctionCall& call, XQueryPlaceID first, int level) {
    const bool hasArgument = first != XQueryNoPlace;
    if (!hasArgument && call.function() == fn_true) return addConstant(XQueryScalar::ofTruth(true));
    if (!hasArgument && call.function() == fn_false) {
      return addConstant(XQueryScalar::ofTruth(false));
    }
    const bool isNot =
        call.function() == fn_not && hasArgument && _program.nextPart(first) == XQueryNoPlace;
    if (!isNot) {
      const auto function = XQueryScalarFunctionOf(call);
      const auto operands = function ? addOperands(first, Use::Answer, level) : std::nullopt;
      return operands ? addFunction(*function, *operands) : Added();
    }
    const Added negated = add(first, Use::Operand, level);
    if (!negated) return {};
    Terms::Term term;
    term.kind = TermKind::Not;
    term.left = *negated;
    return _into.scalars.add(term);
  }

  Added addConditional(XQueryPlaceID place, Use use, int level) {
    const XQueryPlaceID test = _program.part(place, XQueryRole::Test);
    const XQueryPlaceID onTrue = _program.part(place, XQueryRole::Branch);
    const XQueryPlaceID onFalse =
        onTrue == XQueryNoPlace ? XQueryNoPlace : _program.nextPart(onTrue);
    if (test == XQueryNoPlace || onFalse == XQueryNoPlace) return {};
    Terms::Term term;
    term.kind = TermKind::Conditional;
    const Added parts[] = {add(test, Use::Operand, level), add(onTrue, use, level),
                           add(onFalse, use, level)};
    if (!parts[0] || !parts[1] || !parts[2]) return {};
    term.left = *parts[0];
    term.right = *parts[1];
    term.third = *parts[2];
    return _into.scalars.add(term);
  }

  Added addLets(XQueryPlaceID place, const XQueryFLWORExpr& flwor, Use use, int level) {
    if (!flwor.orderSpecs().empty() || flwor.whereExpr()) return {};
    std::vector<Terms::Term> lets;
    XQueryPlaceID part = _program.firstPart(place);
    for (const auto& clause : flwor.forLet()) {
      if (clause->kind() != Kind::LetExpr || clause->type()) return {};
      const XQueryPlaceID bound = _program.part(part, XQueryRole::Bound);
      if (bound == XQueryNoPlace) return {};
      const Added added = add(bound, Use::Answer, level);
      if (!added || _slots == Terms::mostSlots) return {};
      Terms::Term term;
      term.kind = TermKind::Let;
      term.left = *added;
      term.code = _slots++;
      _slotsOfVariables.emplace(part, term.code);
      lets.push_back(term);
      part = _program.nextPart(part);
    }
    const XQueryPlaceID returned = _program.part(place, XQueryRole::Return);
    Added inner = returned == XQueryNoPlace ? Added() : add(returned, use, level);
    // Read elsewhere it is what was left in it.
    for (part = _program.firstPart(place); part != XQueryNoPlace; part = _program.nextPart(part)) {
      _slotsOfVariables.erase(part);
    }
    for (auto let = lets.rbegin(); inner && let != lets.rend(); ++let) {
      let->right = *inner;
      inner = _into.scalars.add(*let);
    }
    return inner;
  }

  // Over the integers of a range.
  Added addQuantifier(XQueryPlaceID place, const XQueryQuantifiedExpr& quantifier, int level) {
    if (quantifier.items().size() != 1 || quantifier.items().front()->type()) return {};
    const XQueryPlaceID clause = _program.firstPart(place);
    const XQueryPlaceID satisfies = _program.part(place, XQueryRole::Satisfies);
    const XQueryPlaceID bound =
        XQueryPlaceInside(_program, _program.part(clause, XQueryRole::Bound));
    if (bound == XQueryNoPlace || satisfies == XQueryNoPlace) return {};
    const auto* range = dyn_cast<XQueryOperatorExpr>(_program[bound].expr);
    if (!range || range->operatorType() != XQueryOperatorTo) return {};
    const XQueryPlaceID first = _program.firstPart(bound);
    const XQueryPlaceID last = first == XQueryNoPlace ? first : _program.nextPart(first);
    if (last == XQueryNoPlace) return {};
    Terms::Term term;
    term.kind = TermKind::Quantifier;
    term.constant = XQueryScalar::ofTruth(quantifier.every());
    const Added from = add(first, Use::Operand, level);
    const Added to = from ? add(last, Use::Operand, level) : from;
    if (!to || _slots == Terms::mostSlots) return {};
    term.code = _slots++;
    _slotsOfVariables.emplace(clause, term.code);
    const Added asked = add(satisfies, Use::Operand, level);
    _slotsOfVariables.erase(clause);
    if (!asked) return {};
    term.left = *from;
    term.right = *to;
    term.third = *asked;
    return _into.scalars.add(term);
  }

  const XQueryProgram& _program;
  const FunctionIndexes& _functions;
  XQueryScalarBody::Program& _into;
  std::map<int64_t, uint8_t> _slotsOfParameters;
  std::map<XQueryPlaceID, uint8_t> _slotsOfVariables;
  uint8_t _slots = 0;
};

// Those that remain when no function calls one that is none: each round leaves out what calls what
// the round before left out.
class Search {
 public:
  explicit Search(XQueryPlanning& planning) : _planning(planning) {}

  void run() {
    for (const XQueryProgramBody& body : _planning.program.bodies()) {
      if (body.function && body.place != XQueryNoPlace) _bodies.push_back(&body);
    }
    constexpr int mostRounds = 16;
    for (int round = 0; round < mostRounds && !_bodies.empty(); ++round) {
      if (compileAll()) return install();
    }
  }

 private:
  // Whether all of the present ones could be compiled; forgets the others.
  bool compileAll() {
    FunctionIndexes indexes;
    for (const XQueryProgramBody* body : _bodies) {
      indexes.emplace(body->function, static_cast<Terms::Index>(indexes.size()));
    }
    _compiled = std::make_shared<XQueryScalarBody::Program>();
    std::vector<Terms::Function> functions;
    const size_t count = _bodies.size();
    std::erase_if(_bodies, [&](const XQueryProgramBody* body) {
      const auto function = Compiler(_planning.program, indexes, *_compiled).functionOf(*body);
      if (function) functions.push_back(*function);
      return !function;
    });
    _compiled->scalars.setFunctions(std::move(functions));
    return _bodies.size() == count;
  }

  void install() {
    for (size_t index = 0; index < _bodies.size(); ++index) {
      const XQueryProgramBody& body = *_bodies[index];
      const XQueryPlaceID place = XQueryPlaceInside(_planning.program, body.place);
      // A body that is no more than a parameter or a literal gains nothing.
      const Kind kind = _planning.program[place].expr->kind();
      if (kind == Kind::Literal || kind == Kind::Variable) continue;
      std::vector<int64_t> parameters;
      for (const auto& parameter : body.function->params()) {
        parameters.push_back(parameter->varID());
      }
      _planning.wrap(place, XQueryScalarBody::exprWithPlain(_planning.exprAt(place), _compiled,
                                                            static_cast<Terms::Index>(index),
                                                            std::move(parameters)));
    }
  }

  XQueryPlanning& _planning;
  std::vector<const XQueryProgramBody*> _bodies;
  std::shared_ptr<XQueryScalarBody::Program> _compiled;
};

}  // namespace

void XQueryComputeFunctions(XQueryPlanning& planning) {
  Search(planning).run();
}

}  // namespace xquery

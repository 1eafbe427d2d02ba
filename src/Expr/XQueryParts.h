// The parts of expressions: which expressions another one consists of, and what it does with each.
//
// Every class of expressions names its parts in one place, XQueryExpr::visitParts, in the order in
// which they are bound. Whoever looks through a program or puts other expressions into it learns of
// its shape from there and from the roles below.
#pragma once

#include "xquery/Object.h"

#include <array>
#include <cstddef>
#include <cstdint>

namespace xquery {

class XQueryExpr;
class XQueryStep;

// What a part is to its whole.
enum class XQueryRole : uint8_t {
  Body,          // of nothing: the body of a query or a function, the value of a global variable
  Element,       // of a list; what is handed on as it is: "treat as", "ordered"
  Operand,       // of an operator, a cast or a type test
  LaterOperand,  // the right one of "and" and "or"
  Arguments,     // the list of a call
  Argument,
  Test,    // of a conditional
  Branch,  // of a conditional
  Clause,  // a clause or an order spec of a FLWOR, a clause of a quantifier, a case
  Bound,   // what the variable of a for, let or quantifier's clause takes
  Where,
  OrderKey,
  Return,
  Satisfies,
  Switched,   // the operand of a typeswitch
  Case,       // what a case answers
  FirstStep,  // the expression of the step that a path begins with
  Step,       // the expression of a later filter step
  Predicate,
  NodeTest,
  Type,
  Name,     // of a constructed node
  Content,  // of a constructed node, and its text
  Last = Content,
};

struct XQueryRoleTraits {
  // Evaluated with a context item, position and size of its own.
  bool hasOwnFocus = false;
  // Perhaps evaluated more than once in one evaluation of the whole.
  bool isRepeated = false;
  // Perhaps not evaluated at all in one evaluation of the whole that does not fail.
  bool isOptional = false;
  // The items of its value may be items of the value of the whole, or become values of variables:
  // which objects they are can be told.
  bool handsOn = false;
  // Looked at, but never evaluated for a value.
  bool isNoValue = false;
};

inline constexpr XQueryRoleTraits XQueryTraitsOf(XQueryRole role) {
  constexpr size_t count = static_cast<size_t>(XQueryRole::Last) + 1;
  //  own focus, repeated, optional, hands on, no value
  constexpr std::array<XQueryRoleTraits, count> traits = {{
      {false, false, false, true, false},   // Body
      {false, false, false, true, false},   // Element
      {false, false, false, false, false},  // Operand
      {false, false, true, false, false},   // LaterOperand
      {false, false, false, true, false},   // Arguments
      {false, false, false, true, false},   // Argument
      {false, false, false, false, false},  // Test
      {false, false, true, true, false},    // Branch
      {false, true, true, true, false},     // Clause
      {false, true, true, true, false},     // Bound
      {false, true, true, false, false},    // Where
      {false, true, true, false, false},    // OrderKey
      {false, true, true, true, false},     // Return
      {false, true, true, false, false},    // Satisfies
      {false, false, false, true, false},   // Switched
      {false, false, true, true, false},    // Case
      {false, false, false, true, false},   // FirstStep
      {true, true, true, true, false},      // Step
      {true, true, true, false, false},     // Predicate
      {false, false, true, false, true},    // NodeTest
      {false, false, true, false, true},    // Type
      {false, false, false, false, false},  // Name
      {false, false, false, false, false},  // Content
  }};
  return traits[static_cast<size_t>(role)];
}

class XQueryPartVisitor {
 public:
  // A part in whose place another expression may be put that answers the same; null when the query
  // leaves it out.
  virtual void part(Ref<XQueryExpr>& part, XQueryRole role) = 0;
  // A part that the whole knows by its class: clauses, node tests, attributes of a constructor. Its
  // own parts may be replaced. Null when the query leaves it out.
  virtual void ownPart(XQueryExpr* part, XQueryRole role) = 0;
  // The parts up to the next step, or the end, are those of this step of a path.
  virtual void step(const XQueryStep&) {}

 protected:
  ~XQueryPartVisitor() = default;
};

}  // namespace xquery

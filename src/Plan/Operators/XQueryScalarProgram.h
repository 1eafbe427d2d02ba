// Declared functions over numbers, texts and lists, computed with machine numbers and with parts of
// texts and lists that are not made objects.
//
//   declare function local:gcd($a, $b) { if ($b = 0) then $a else local:gcd($b, $a mod $b) };
//   declare function local:sum($l) { if (empty($l)) then 0 else $l[1] + local:sum(subsequence($l,
//   2)) };
//
// A body of literals, parameters, let variables, arithmetic, comparisons, logic, conditionals,
// quantifiers over ranges, items of lists by their positions, calls of some built-in functions
// (XQueryScalarFunctions.h) and of functions like it becomes a tree of terms. A call computes with
// slots on the stack in place of a frame of variables, and neither arguments nor answers are made
// objects, but for decimals and integers beyond a word. Wherever an operand is something else than
// these values, there would be an error or the stack ends, nothing is known, and the body is
// evaluated as it was written: terms do nothing that could be told.
//
// What values refer to is held by the caller of the whole, or kept while the values may be used:
// what a call has made goes with it, but for its answer.
#pragma once

#include "Plan/Operators/XQueryScalar.h"
#include "Plan/Operators/XQueryScalarFunctions.h"

#include <cstddef>
#include <cstdint>
#include <vector>

namespace xquery {

class XQueryScalarProgram {
 public:
  using Index = uint16_t;
  // Parameters and let variables of a function.
  static constexpr size_t mostSlots = 10;
  static constexpr size_t mostTerms = 2000;

  enum class Kind : uint8_t {
    Constant,
    Slot,         // code: which one
    Arithmetic,   // code: the operator; a sign's left operand is the constant 0
    Comparison,   // code: the value comparison
    General,      // code: the value comparison of each pair of items
    And,          // left, right
    Or,           // left, right
    Not,          // left
    Conditional,  // left: the test; right and third: the branches
    Let,          // code: the slot; left: what it takes; right: what is computed with it
    Call,         // left: the function; right: the first of its operands; code: their number
    // Over the integers of a range: code: the slot; left, right: the bounds; third: what is asked
    // of each; constant: whether of every one.
    Quantifier,
    BuiltIn,  // code: the function; left: the first of its operands; right: their number
  };
  struct Term {
    Kind kind = Kind::Constant;
    uint8_t code = 0;
    Index left = 0;
    Index right = 0;
    Index third = 0;
    XQueryScalar constant{};
  };
  struct Function {
    Index body = 0;
    uint8_t parameters = 0;
  };

  Index add(const Term& term) {
    _terms.push_back(term);
    return static_cast<Index>(_terms.size() - 1);
  }
  // Of a call, which stand in a row. The index of the first.
  Index addOperands(const std::vector<Index>& operands) {
    _operands.insert(_operands.end(), operands.begin(), operands.end());
    return static_cast<Index>(_operands.size() - operands.size());
  }
  void setFunctions(std::vector<Function> functions) { _functions = std::move(functions); }
  Term& operator[](Index index) { return _terms[index]; }
  size_t count() const { return _terms.size(); }
  size_t operandCount() const { return _operands.size(); }
  const Function& function(Index index) const { return _functions[index]; }

  // What a function answers for arguments in `slots`, which are overwritten; `made` takes what the
  // answer refers to, where that was made on the way. `outOfStack` is set where that is why nothing
  // is known. Throws where a limit of the evaluation is reached.
  XQueryScalar answer(Index function, XQueryScalar* slots, Value& made, bool& outOfStack) const;

 private:
  struct Run;

  std::vector<Term> _terms;
  std::vector<Index> _operands;
  std::vector<Function> _functions;
};

}  // namespace xquery

// What a rule is given: the program, what is known of it, and the means to change it.
#pragma once

#include "Plan/FactsAnalysis.h"
#include "Plan/Program.h"

#include <vector>

namespace xquery {

class XQueryPlannedExpr;

class XQueryPlanning {
 public:
  // How far rules look up from a place for what is around it. Planning stays in proportion to the
  // length of a query, however deep that nests.
  static constexpr int mostLevels = 256;

  explicit XQueryPlanning(XQueryProgram& ofProgram)
      : program(ofProgram), facts(ofProgram), _states(ofProgram.placeCount()) {}

  // Whether another expression may be put in this place. Not where one of an earlier rule stands,
  // nor inside of what an earlier rule has taken out of the program.
  bool isOpen(XQueryPlaceID place) const {
    return program[place].slot && _states[place] == State::AsWritten;
  }
  // Whether an operator stands there that evaluates what was written.
  bool isWrapped(XQueryPlaceID place) const { return _states[place] == State::Wrapped; }
  // Whether it can be told which objects the items of the value are. Objects that are equal and not
  // the same are two items of a path's results, and two items of a host.
  bool showsIdentity(XQueryPlaceID place) const;

  // Puts an operator in the place, which evaluates what was written there or parts of it.
  void wrap(XQueryPlaceID place, Ref<XQueryExpr> by);
  // Puts an expression in the place; what was written there is evaluated no more.
  void replace(XQueryPlaceID place, Ref<XQueryExpr> by);

  XQueryProgram& program;
  const XQueryFactTable facts;

 private:
  enum class State : uint8_t { AsWritten, Wrapped, Gone };

  std::vector<State> _states;
};

}  // namespace xquery

// What a profile tells of a program: its expressions as they were written, each that is counted
// with the number of its counter.
//
// After all rules have run, one more pass puts an expression that counts around whatever is worth a
// line of its own (Report.h) and stands in an open place: what the query evaluates there, the
// operators of the rules included. Left out are values that are there already (literals, variables,
// "."), and what the expression around it knows by its class and would not find any more: ranges,
// of which clauses and comparisons take the bounds, and operators on the left of operators, which
// are evaluated in a loop. These belong to what is around them, and so does what an operator of the
// plan evaluates by itself.
#pragma once

#include "Context/ProfileRecorder.h"
#include "Plan/Report.h"

#include <chrono>
#include <cstddef>
#include <cstdint>
#include <string>
#include <vector>

namespace xquery {

class XQueryPlanning;
class XQueryProlog;

// Where an expression is written.
struct XQueryProfilePlace {
  std::string module;  // the URL of an imported one; empty for the query itself
  int64_t line = 0;    // from 1; 0 where it is not known
  int64_t column = 0;  // of its first character, from 1; 0 where it is not known
  int64_t length = 0;  // in characters, a line end being one; 0 where it is not known
};

struct XQueryProfiledExpression {
  size_t depth;  // 0 for the body of the query or a function, or the value of a variable
  // In its whole; of a body whose it is: "query", "function local:f#1", "variable $x".
  std::string role;
  std::string label;
  XQueryProfilePlace place;
  std::vector<XQueryPlanReport::Note> notes;
  XQueryCounterID counter = XQueryNoCounter;
  // Whether an operator around it may evaluate it uncounted, or does its work.
  bool mayBeInside = false;
};

// UTF-8 throughout.
struct XQueryProfiledProgram {
  std::vector<XQueryProfiledExpression> expressions;  // wholes before their parts
  std::vector<uint32_t> counted;                      // for each counter its expression
  std::string source;                                 // the text of the query
  std::chrono::nanoseconds compiling{};               // planning included
  std::chrono::nanoseconds planning{};
};

// The rules have been applied. Makes the program count, and lists what there is to tell of it.
void XQueryProfileProgram(XQueryPlanning& planning, const XQueryPlanReport& report,
                          const XQueryProlog& main, XQueryProfiledProgram& profiled);

}  // namespace xquery

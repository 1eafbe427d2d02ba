// Whether an expression may be evaluated any number of times for the same focus.
#pragma once

namespace xquery {

class XQueryExpr;

// True when every evaluation with the same context item, position and size gives an equal value, or
// fails alike, and does nothing else that anybody could tell: literals, variables, the context
// item, operators, lists and paths of such. False for what is not known, calls and constructors
// among it, and for very large expressions, which are not looked through. Where something may
// assign variables between two evaluations, an expression that reads one is not repeatable.
bool XQueryIsRepeatable(const XQueryExpr& expr, bool variablesMayChange = false);

}  // namespace xquery

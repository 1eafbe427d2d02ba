// Planning: a bound program is gone over once, and expressions are replaced by operators that
// answer the same with less work.
//
//   bound program --> places (Program.h) --> facts (FactsAnalysis.h) --> rules (Rules.h), in turn
//                                                                          |
//                          operators (Operators/), which keep the expressions they stand for
//
// A planned program is as immutable as a bound one. Nobody can tell it from the plain one but by
// the time it takes.
#pragma once

#include "Expr/XQueryExpr.h"
#include "Plan/Projection/XQueryProjectionPlan.h"
#include "Plan/Report.h"
#include "Plan/Rules.h"

#include <optional>
#include <span>

namespace xquery {

class XQueryProlog;
struct XQueryProfiledProgram;

// Whether queries are planned: unless the environment variable XQUERY_PLAN is "0". Read anew at
// each call.
bool XQueryPlanIsEnabled();

// Plans the body of a query, which may be null, with the functions and global variables of its
// module and of the modules that it imports. Everything has been bound without errors. Answers the
// planned body.
Ref<XQueryExpr> XQueryPlanned(const XQueryProlog& prolog, const Ref<XQueryExpr>& body,
                              std::span<const XQueryRule> rules = XQueryRules());
// The same, with what the program needs of its document.
Ref<XQueryExpr> XQueryPlanned(const XQueryProlog& prolog, const Ref<XQueryExpr>& body,
                              XQueryProjectionPlan& projection);
// The same, and what there is to say of it.
Ref<XQueryExpr> XQueryPlanned(const XQueryProlog& prolog, const Ref<XQueryExpr>& body,
                              XQueryProjectionPlan& projection, XQueryPlanReport& report);
// The same, with expressions that count in it, and what there is to say of these; where queries are
// not planned the program as it is written, which is read a whole document.
Ref<XQueryExpr> XQueryProfiled(const XQueryProlog& prolog, const Ref<XQueryExpr>& body,
                               std::optional<XQueryProjectionPlan>& projection,
                               XQueryProfiledProgram& profiled);

}  // namespace xquery

// Checking: a bound program is gone over once, before it is planned, for what its author hardly
// wants.
//
//   bound program --> places (Plan/Program.h) --> facts (Plan/FactsAnalysis.h) --> families, in
//   turn
//
// Each family of warnings is a file: Names, Unused, Conditions, Comparisons, Paths, Types,
// Declarations, Casts, Calls, Clauses, Constructors, Remarks. WarningTable.h lists all warnings,
// Checking.h says what a family is given. To add a warning: a row in that table, the look at the
// place in the file of its family, and an entry in docs/warnings.md.
//
// A warning is an accusation: where the facts leave open whether the query means it, there is none.
// Facts know least and most, so a family asks for what surely is, never for what only may be.
#pragma once

#include "Expr/XQueryExpr.h"
#include "xquery/Warnings.h"

#include <vector>

namespace xquery {

class XQueryProlog;

// The warnings of a main module, or of a library module by itself, and of all that it imports.
// Everything has been bound without errors, and nothing has been planned; nothing is changed.
// `body` may be null.
std::vector<XQueryWarning> XQueryCheckedProgram(const XQueryProlog& prolog,
                                                const Ref<XQueryExpr>& body);

}  // namespace xquery

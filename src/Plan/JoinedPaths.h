// Paths that a program is written in parts of are put together, before anything else is planned.
//
//   let $v := P ... $v[C]/a ... count($v)        P[C]/a ... count(P)
//   declare variable $v := P; ... $v/a           P/a
//   declare function f() { P }; ... f()[C]       f()/P'[C], where f answers the document of P
//   for $a in P for $b in $a/Q ...               for $b in P/Q ...
//
// What holds      P begins at the document and goes down by names alone: it can fail nowhere but in
//                 looking for the document, which is done where it was, so that the variable, or
//                 the function, takes the document. All uses are such as a path goes on from, or
//                 ask for no more than the number of its nodes; predicates ask for truth. The tree
//                 is that in which the query begins, or that of the focus of a call
// Why             the index of the tree knows the way from the document to what a path finds, its
//                 values and their number. That tree is changed by no evaluation, so that P finds
//                 the same nodes whenever it is walked. Loops over children find each node once, in
//                 document order where all their parents are of one level, as the path does
// Rejected        one operator for each of these: rules would have to know all of them
#pragma once

#include "Plan/FactsAnalysis.h"
#include "Plan/Program.h"

#include <vector>

namespace xquery {

// Puts together what can be, and answers the paths that there are instead; none where all is as it
// was. Otherwise the program has to be installed and read again, and may then hold more of them.
std::vector<const XQueryExpr*> XQueryJoinPaths(XQueryProgram& program,
                                               const XQueryFactTable& facts);

}  // namespace xquery

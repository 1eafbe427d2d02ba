// Which parts of the document that is its context item a program can look at.
//
// The analysis follows the nodes of the document through the program. What an expression answers is
// known as a set of sources, places of the projection (XMLProjection.h): what a path of names finds
// from the document on. Who uses the answer says what it looks at: that there are nodes, their
// string values, all that is below them.
//
// The rule is one of permission: each class of expressions, each axis and each built-in function
// that may meet nodes of the document is listed here or has a column in the registry. Anything else
// that meets one needs the whole document: steps sideways and upwards, comparisons of order, nodes
// that are given to functions, typeswitch and the like.
//
// Positions are no matter: they are counted among the nodes that a step finds, and of these all are
// there. Nor is what else there is: more than what is asked for is never found by a step. The
// descendant axis is, since it ends where the next sibling of its node or of that one's parent
// begins, and with the document where there is neither; so it may begin at the document and at
// elements of a known level down to the third, which it does not leave for any element.
#pragma once

#include "Plan/FactsAnalysis.h"
#include "Plan/Program.h"
#include "Platform/Reading/XMLProjection.h"

#include <string_view>

namespace xquery {

struct XQueryProjectionPlan {
  XMLProjection projection;
  // Whether nodes of the document may be items of the result, so that a host can look at what is
  // around them.
  bool answersNodes = false;
  // Whether the program looks at the document at all.
  bool isUsed = false;

  // Where and why all of the document is needed; no place where it is not.
  XQueryPlaceID refusedAt = XQueryNoPlace;
  std::string_view reason;

  bool isPossible() const { return refusedAt == XQueryNoPlace; }
};

// Of a program as it was written: before rules have changed it.
[[nodiscard]] XQueryProjectionPlan XQueryPlanProjection(const XQueryProgram& program,
                                                        const XQueryFactTable& facts);

}  // namespace xquery

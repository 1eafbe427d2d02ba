// Conditions that hold only for what has a certain value.
#pragma once

#include "Plan/Paths/XQueryValueLookup.h"
#include "Plan/Planning.h"

#include <optional>
#include <vector>

namespace xquery {

// The condition holds only where one of the matches does: where its way leads to a value that
// equals its probe. This is repeatable, and does not read the focus, but for the root above the
// context item where that is the one above the node, too.
struct XQueryValueCondition {
  std::vector<XQueryValueLookup::Match> anyOf;
  bool isAll = false;  // the condition says no more than that, and cannot fail there
};

// Whose values a condition asks for.
struct XQueryValueOrigin {
  int64_t varID = 0;      // the variable that holds it; 0: the context item
  XQueryVariableSet own;  // variables that let clauses set for it
  // An error in the condition excludes the node, too. Otherwise there is none for those that are
  // excluded.
  bool errorExcludes = true;
  // What it holds lies in the tree of the context item of the condition.
  bool isInTreeOfFocus = true;
};

// Finds such a condition among what has to hold for this one: in "K = P" and "K eq P", on either
// side and joined with others by "and"; in both sides of "or"; "some $k in K satisfies $k = P";
// "K[. = P]" where its truth is asked for, or whether it is there, also by exists, boolean,
// not(empty(...)) and count(...) > 0, and as "for $k in K where $k = P return ..."; and in the body
// of a declared function. K may be passed through string() or data(), or through a variable that a
// let clause sets, and "(K, L) = P" asks for either.
std::optional<XQueryValueCondition> XQueryValueConditionIn(const XQueryPlanning& planning,
                                                           XQueryPlaceID condition,
                                                           const XQueryValueOrigin& origin);

// The way from the context item, or for another ID from the variable, to the values of a path
// without predicates, or of what is passed through data(); nothing for another expression.
std::optional<XQueryValueWay> XQueryWayFrom(const XQueryPlanning& planning, XQueryPlaceID place,
                                            int64_t varID);

// Whether the place is string() or data() of one node at most, which cannot fail.
bool XQueryIsTextOfOne(const XQueryPlanning& planning, XQueryPlaceID place);

}  // namespace xquery

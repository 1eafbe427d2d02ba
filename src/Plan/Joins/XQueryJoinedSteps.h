// What is known of the steps of a path whose items are joined.
#pragma once

#include "Plan/Planning.h"

#include <vector>

namespace xquery {

class XQueryStep;

// The places of the step's predicates that its test does not ask for already.
std::vector<XQueryPlaceID> XQueryPredicatesOf(const XQueryPlanning& planning, XQueryPlaceID path,
                                              const XQueryStep& step);
// Whether these are all there are: places refer to the steps of a path as it was written.
bool XQueryPredicatesAreKnown(const XQueryStep& step, const std::vector<XQueryPlaceID>& places);
// Whether they, of which there are some, can be asked in any order, of each item by itself.
bool XQueryPredicatesAreOfTruth(const XQueryPlanning& planning, const XQueryStep& step,
                                const std::vector<XQueryPlaceID>& places);
// What finding the nodes of a step reads and does, from the first axis step on: all but its own
// predicates.
XQueryFacts XQueryFactsUpTo(const XQueryPlanning& planning, XQueryPlaceID path,
                            const XQueryStep& first, const XQueryStep& end);

}  // namespace xquery

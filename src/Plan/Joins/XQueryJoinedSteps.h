// What is known of the steps of a path whose items are joined.
#pragma once

#include "Plan/Planning.h"

#include <cstddef>
#include <unordered_map>
#include <vector>

namespace xquery {

class XQueryStep;
class XQueryWalkedPath;
struct XQueryWalkedStep;

// The places of the step's predicates, without the first so many, or empty where they are not all
// known.
std::vector<XQueryPlaceID> XQueryPredicatesOf(const XQueryPlanning& planning, XQueryPlaceID path,
                                              const XQueryStep& step, size_t first);
// The same without those that its test asks for already.
std::vector<XQueryPlaceID> XQueryPredicatesOf(const XQueryPlanning& planning, XQueryPlaceID path,
                                              const XQueryWalkedStep& step);
// The same for many steps of one path, whose parts are looked at once.
class XQueryPredicatesOfSteps {
 public:
  XQueryPredicatesOfSteps(const XQueryPlanning& planning, XQueryPlaceID path)
      : _planning(planning), _path(path) {}

  std::vector<XQueryPlaceID> of(const XQueryWalkedStep& step);

 private:
  void findAll();

  const XQueryPlanning& _planning;
  const XQueryPlaceID _path;
  bool _areFound = false;
  std::unordered_map<const XQueryStep*, std::vector<XQueryPlaceID>> _places;
};

// Whether they, of which there are some, can be asked in any order, of each item by itself.
bool XQueryPredicatesAreOfTruth(const XQueryPlanning& planning,
                                const std::vector<XQueryPlaceID>& places);
// What finding the nodes of a step reads and does, from the first axis step on: all but its own
// predicates. There are none but axis steps up to it.
XQueryFacts XQueryFactsUpTo(const XQueryPlanning& planning, XQueryPlaceID place,
                            const XQueryWalkedPath& path, const XQueryWalkedStep& end);

}  // namespace xquery

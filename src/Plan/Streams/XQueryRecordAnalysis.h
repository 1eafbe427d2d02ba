// The part of the analysis of streams that deals with one path: where it finds the records, and
// whether all that is evaluated for a record stays inside of it (XQueryStreamPlan.h has the rules).
#pragma once

#include "Plan/DocumentAnalysis.h"
#include "Plan/Rules/PlaceInside.h"
#include "Plan/Streams/XQueryStreamPlan.h"

#include <cstddef>

namespace xquery {

class XQueryRecordAnalysis : protected XQueryDocumentAnalysis<XQueryStreamPlan> {
 protected:
  using XQueryDocumentAnalysis::XQueryDocumentAnalysis;

  // What the reader can look for.
  static constexpr size_t mostSteps = 63;

  XQueryPlaceID inside(XQueryPlaceID place) const { return XQueryPlaceInside(_program, place); }
  bool readsDocument(XQueryPlaceID place) const {
    return _facts[place].does(XQueryDeeds::ReadsFocus);
  }
  // Whether it is a path from the document on; whether the first clause goes through one; either.
  bool isPathOfDocument(XQueryPlaceID place) const;
  bool beginsWithRecords(XQueryPlaceID place) const;
  bool goesThroughRecords(XQueryPlaceID place) const;

  // Of what goes through records: finds them and checks the rest, or refuses.
  void takeItems(XQueryPlaceID place);
  void takeClauses(XQueryPlaceID place);
  void takePath(XQueryPlaceID place);
  // It has been taken: another one may be.
  void endPart(XQueryPlaceID place);

  XQueryStreamPart _now;  // that is looked at

 private:
  XQueryPlaceID recordClauseOf(XQueryPlaceID place) const;
  void checkInside(XQueryPlaceID place) const;
  void checkStaysInside(XQueryPlaceID place) const;
  bool leavesItToItsParts(XQueryPlaceID place) const;
  bool takesInnerAxes(XQueryPlaceID path) const;

  bool isWholeDocument() const;
  size_t levelOfRecord() const;
  bool takeRecordStep(const XQueryStep& step, XQueryPlaceID path);
  void beginAnywhere(XQueryPlaceID path);
  bool countsPositions(const XQueryStep& step) const;
  void checkPredicates(const XQueryStep& step);
  bool makesValues(XQueryPlaceID place) const;
  void takeInnerStep(const XQueryStep& step, XQueryPlaceID path);

  XQueryPlaceID _part = XQueryNoPlace;  // of the path, the next of those of the step at hand
  bool _isAnywhere = false;             // "//" has been met and waits for the name behind it
  bool _isByParents = false;  // so what the steps find is not in document order before it is sorted
  bool _isComplete = false;
  bool _bindsRecords = false;                   // the path finds the records themselves
  XQueryPlaceID _recordClause = XQueryNoPlace;  // whose variable is a record that holds descendants
};

}  // namespace xquery

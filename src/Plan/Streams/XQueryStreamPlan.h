// Whether a program can be evaluated record by record, and how.
//
// A record is a subtree of the document that is evaluated, over all of the program's expressions as
// they are, in a document that holds the record, the elements above it with their attributes and
// namespaces, and nothing else. What this answers for one record after the other is what the whole
// document would have answered where
//
//   - the body is a path, a FLWOR or a quantifier over a path, or one function or position of such,
//     whose value is put together from those of the records (the fold);
//   - everything in it starts from that path, and nothing leaves the nodes that it finds or counts
//     them among others.
//
// An expression around several such functions and quantifiers, as `sum(/a/b/c) div count(/a/b)`, is
// evaluated once they are known, with their values in their places. It looks at nothing else of the
// document. The records are then what any of the paths finds, outermost ones only: each path finds
// below a record of another one what it finds there in the whole document.
//
// The record is what the longest beginning of the path finds that asks for names alone: predicates
// look at what is below their step, and positions at what is beside it.
//
// The descendant axis ends where the next sibling of its node or of that one's parent begins, and
// with the document where there is neither: from deep inside of a record it may lead out of it. So
// it may only stand at the beginning of the path, and behind the variable of a record, not more
// than three levels down: from there nothing follows but what is behind the document element, which
// no name of an element finds.
#pragma once

#include "Plan/FactsAnalysis.h"
#include "Plan/Program.h"

#include <cstdint>
#include <limits>
#include <string>
#include <string_view>
#include <vector>

namespace xquery {

class XQueryNameTest;

struct XQueryStreamStep {
  bool isAnywhere;             // below, not a child
  const XQueryNameTest* name;  // null for any element

  // Whether it finds the same.
  bool operator==(const XQueryStreamStep& other) const;
};

// What is made of the values of the records.
enum class XQueryStreamFold : uint8_t {
  Items,  // they are the value, one behind the other
  Count,
  Sum,
  Average,
  Least,
  Greatest,
  Exists,
  Empty,
  Distinct,
  Some,
  Every,
  Part,  // the items of some positions
};

// A path through the records, and what is made of what it finds.
struct XQueryStreamPart {
  std::vector<XQueryStreamStep> record;
  XQueryStreamFold fold = XQueryStreamFold::Items;
  // Of a part of a sequence: the positions of its items.
  uint64_t first = 1;
  uint64_t last = std::numeric_limits<uint64_t>::max();
  // Whether it is asked for in any case: its failure is one of the whole.
  bool isSure = true;
  // Where its value stands.
  XQueryPlaceID place = XQueryNoPlace;
  // What is evaluated for each record.
  XQueryPlaceID each = XQueryNoPlace;
};

struct XQueryStreamPlan {
  std::vector<XQueryStreamPart> parts;
  // What is evaluated at the end, around the values of the parts; no place where the only part is
  // the whole.
  XQueryPlaceID around = XQueryNoPlace;

  // Where and why the program cannot be evaluated so; no place where it can.
  XQueryPlaceID refusedAt = XQueryNoPlace;
  std::string_view reason;

  bool isPossible() const { return refusedAt == XQueryNoPlace; }
  // As paths, with commas between: "/site/people/person", "/a/b, //item".
  std::string recordPath() const;
  // For people: a line for the records, and one for the folds.
  std::string description() const;
};

// Of a program with a body, as it was written: before rules have changed it.
[[nodiscard]] XQueryStreamPlan XQueryPlanStream(const XQueryProgram& program,
                                                const XQueryFactTable& facts);

}  // namespace xquery

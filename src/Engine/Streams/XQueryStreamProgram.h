// A query as it is evaluated record by record: how to find the records, what to evaluate for each,
// and what to make of that.
#pragma once

#include "Expr/Paths/XQueryNameTest.h"
#include "Functions/XQueryFunctionCall.h"
#include "Plan/Streams/XQueryStreamPlan.h"
#include "xquery/Error.h"

#include <cstdint>
#include <memory>
#include <string>
#include <vector>

namespace xquery {

class XQueryContext;
class XQueryProlog;

struct XQueryStreamProgram {
  struct Step {
    bool isAnywhere;           // below, not a child
    Ref<XQueryNameTest> name;  // null for any element
  };
  struct Part {
    XQueryStreamFold fold = XQueryStreamFold::Items;
    // Of a part of a sequence: the positions of its items.
    uint64_t first = 1;
    uint64_t last = 0;
    bool isSure = true;  // XQueryStreamPart::isSure
    // Evaluated with the document that holds the record as the context item. Planned.
    Ref<XQueryExpr> each;
    // Whose argument that is; null for a fold without a function.
    Ref<XQueryFunctionCall> call;
  };

  std::vector<std::vector<Step>> records;  // paths, none of them twice
  std::vector<Part> parts;                 // one at least
  // What is evaluated at the end, with two local variables for each of the parts, from this one on:
  // for its value, and for its failure where it has one. Null where the only part is the whole.
  Ref<XQueryExpr> around;
  int64_t firstVariable = 0;
  std::string description;  // XQueryStreamPlan::description

  // Where the context does not know the prefix of a name on the way to the records, the refusal:
  // the whole document is without fault there as long as no earlier step finds anything, of which
  // the records tell nothing. Null where it knows them all.
  [[nodiscard]] Ref<XQueryError> refusalIn(const XQueryContext& context,
                                           const XQueryProlog& prolog) const;

  // Of a query that has been bound. Null, with the refusal, for one that cannot be evaluated so.
  [[nodiscard]] static std::unique_ptr<const XQueryStreamProgram> of(const XQueryProlog& prolog,
                                                                     const Ref<XQueryExpr>& body,
                                                                     Ref<XQueryError>& refusal);
};

}  // namespace xquery

// How many tuples a loop over nodes of a document makes whose condition asks for nothing but the
// names from each node up: "count(for $k in //k let $l := $k/ancestor::l where count($l) > 1 return
// $k)".
#pragma once

#include "Expr/Clauses/XQueryFLWOR.h"
#include "Plan/Operators/XQueryPathCount.h"
#include "Plan/Operators/XQueryPlannedExpr.h"
#include "Plan/Paths/XQueryWalkedPath.h"

#include <optional>
#include <utility>

namespace xquery {

class XQueryWayLoop : public XQueryPlannedExpr {
 public:
  using Question = XQueryPathCount::Question;

  // The loop is part of the plain expression: a "for" over the path, which has no predicates and
  // fits a pattern (XQueryPathPattern.h), then "let" clauses and a condition, all of which answer
  // alike for all elements on one way; one item for each tuple. What it leaves in variables cannot
  // be told.
  struct Loop {
    Ref<XQueryFLWORExpr> flwor;
    Ref<XQueryWalkedPath> path;
  };
  [[nodiscard]] static Ref<XQueryWayLoop> exprWithPlain(Ref<XQueryExpr> plain, Loop loop,
                                                        Question question) {
    return make<XQueryWayLoop>(std::move(plain), std::move(loop), question);
  }

  // An integer, or one of the shared truth values: from the first element on each way that the
  // index of the tree knows. Where there is none, and where something fails, the plain way.
  Value computeValue(XQueryContext& context) const override;

 protected:
  XQueryWayLoop(Ref<XQueryExpr> plain, Loop loop, Question question)
      : XQueryPlannedExpr(std::move(plain)), _loop(std::move(loop)), _question(question) {}
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  class Asked;
  std::optional<uint64_t> countTuples(const NSXMLDocument& document, XQueryContext& context) const;
  std::optional<bool> holdsFor(NSXMLNode* node, XQueryContext& context) const;

  const Loop _loop;
  const Question _question;
};

}  // namespace xquery

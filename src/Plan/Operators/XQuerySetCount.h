// How many nodes a union, an intersection or a difference of paths from the document has:
// "count(//a except //b/a)", "exists((//a | //b) intersect /r//c)".
#pragma once

#include "Expr/Operators/XQueryOperatorExpr.h"
#include "Plan/Operators/XQueryPathCount.h"
#include "Plan/Operators/XQueryPlannedExpr.h"
#include "Plan/Paths/XQueryWalkedPath.h"

#include <optional>
#include <utility>
#include <vector>

namespace xquery {

class XQuerySetCount : public XQueryPlannedExpr {
 public:
  // Paths, and operators that take the two sets before them, in the order of their evaluation:
  // "a | b except c" is a, b, |, c, except. The paths begin at the document.
  struct Term {
    Ref<XQueryWalkedPath> path;  // null for an operator
    int operatorType = 0;
  };
  using Terms = std::vector<Term>;

  [[nodiscard]] static Ref<XQuerySetCount> exprWithPlain(Ref<XQueryExpr> plain, Terms terms,
                                                         XQueryPathCount::Question question) {
    return make<XQuerySetCount>(std::move(plain), std::move(terms), question);
  }

  // From the ways that the index of the tree knows, each of which all elements on it share: those
  // of a set are all the elements on some ways. Where the index does not know a path, the plain
  // way.
  Value computeValue(XQueryContext& context) const override;

 protected:
  XQuerySetCount(Ref<XQueryExpr> plain, Terms terms, XQueryPathCount::Question question)
      : XQueryPlannedExpr(std::move(plain)), _terms(std::move(terms)), _question(question) {}
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  std::optional<uint64_t> countFrom(const NSXMLDocument& document, XQueryContext& context) const;

  const Terms _terms;
  const XQueryPathCount::Question _question;
};

}  // namespace xquery

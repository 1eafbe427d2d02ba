// The nodes of a set that a path finds, or does not: "$set intersect //a[@x]", "//b except /r/b".
#pragma once

#include "Expr/Operators/XQueryOperatorExpr.h"
#include "Plan/Operators/XQueryPlannedExpr.h"
#include "Plan/Paths/XQueryWalkedPath.h"

#include <utility>

namespace xquery {

class XQueryPathPattern;

class XQueryPathFilter : public XQueryPlannedExpr {
 public:
  // Operands of an "intersect" or "except" that fit a pattern (XQueryPathPattern.h); null for one
  // that does not, or that may not be asked in the place of being evaluated. The right one of an
  // "except" is there.
  struct Paths {
    Ref<XQueryWalkedPath> left;
    Ref<XQueryWalkedPath> right;
  };

  [[nodiscard]] static Ref<XQueryPathFilter> exprWithPlain(Ref<XQueryOperatorExpr> plain,
                                                           Paths paths) {
    return make<XQueryPathFilter>(std::move(plain), std::move(paths));
  }

  // What the operator answers: one operand is evaluated, and the path that is the other one is
  // asked for each of its nodes, where they are few beside those that the path would be walked to.
  // Otherwise, and where an index or a table answers the path at once, it is evaluated.
  Value computeValue(XQueryContext& context) const override;

 protected:
  XQueryPathFilter(Ref<XQueryOperatorExpr> plain, Paths paths)
      : XQueryPlannedExpr(plain), _operation(std::move(plain)), _paths(std::move(paths)) {}
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  Value filtered(const XQueryExpr& operand, const XQueryWalkedPath& path,
                 XQueryContext& context) const;
  Value keptOf(const Value& items, XQueryPathPattern& pattern, XQueryContext& context) const;

  const Ref<XQueryOperatorExpr> _operation;
  const Paths _paths;
};

}  // namespace xquery

// An expression whose outcome is kept from one evaluation to the next, as long as nothing that it
// reads has changed.
#pragma once

#include "Plan/Facts.h"
#include "Plan/Operators/XQueryPlannedExpr.h"

#include <cstddef>
#include <string_view>

namespace xquery {

class XQueryKeptExpr : public XQueryPlannedExpr {
 public:
  // An outcome that depends on more variables than this is not kept.
  static constexpr int mostVariables = 6;
  // Empty where all that the expression reads is known well enough to see when it changes, and
  // evaluating it again is the same as not doing so; else what stands in the way.
  static std::string_view obstacleTo(const XQueryFacts& facts);

  [[nodiscard]] static Ref<XQueryKeptExpr> exprWithPlain(Ref<XQueryExpr> plain,
                                                         const XQueryFacts& facts);

  // The value of the expression, or its failure, which is raised anew.
  Value computeValue(XQueryContext& context) const override;

 protected:
  XQueryKeptExpr(Ref<XQueryExpr> plain, const XQueryFacts& facts)
      : XQueryPlannedExpr(std::move(plain)), _facts(facts) {}
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  class Dependencies;
  class Assignments;
  struct Focus;
  class Outcome;

  const XQueryFacts _facts;
};

}  // namespace xquery

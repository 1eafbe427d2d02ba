// An expression whose outcome is kept from one evaluation to the next, as long as nothing that it
// reads has changed.
#pragma once

#include "Plan/Facts.h"
#include "Plan/Operators/XQueryPlannedExpr.h"

#include <cstddef>
#include <cstdint>
#include <string_view>
#include <utility>
#include <vector>

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

  // Of an item that the expression reads nothing of but what lies so many parents above it, the
  // parent there is what is compared: "../sale/price" is the same for all children of a node. Such
  // an outcome is kept when it comes a second time, and a failure is not.
  struct Above {
    int64_t varID;  // 0 for the context item
    uint8_t steps;
  };
  [[nodiscard]] static Ref<XQueryKeptExpr> exprWithPlain(Ref<XQueryExpr> plain,
                                                         const XQueryFacts& facts,
                                                         std::vector<Above> above);

  // The value of the expression, or its failure, which is raised anew.
  Value computeValue(XQueryContext& context) const override;

 protected:
  XQueryKeptExpr(Ref<XQueryExpr> plain, const XQueryFacts& facts, std::vector<Above> above)
      : XQueryPlannedExpr(std::move(plain)), _facts(facts), _above(std::move(above)) {}
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  class Dependencies;
  class Assignments;
  struct Focus;
  class Outcome;

  const XQueryFacts _facts;
  const std::vector<Above> _above;
};

}  // namespace xquery

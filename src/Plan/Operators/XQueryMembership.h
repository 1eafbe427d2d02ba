// Whether one node is in a large set of nodes that is asked again and again: ". intersect $set",
// ". except $set", "count(. | $set)", "some $each in $set satisfies $each is .".
#pragma once

#include "Plan/Operators/XQueryPlannedExpr.h"

#include <cstdint>
#include <memory>
#include <utility>

namespace xquery {

class XQueryMembership : public XQueryPlannedExpr {
 public:
  enum class Question : uint8_t { Intersection, Difference, CountOfUnion, Some };
  // Both operands can be repeated, as they stand in the plain expression; `node` answers one node
  // at most. Of Some, `varID` is the variable that takes the members.
  struct Operands {
    Ref<XQueryExpr> node;
    Ref<XQueryExpr> set;
    bool isSetFirst;
    int64_t varID = 0;
  };

  [[nodiscard]] static Ref<XQueryMembership> exprWithPlain(Ref<XQueryExpr> plain, Question question,
                                                           Operands operands) {
    return make<XQueryMembership>(std::move(plain), question, std::move(operands));
  }

  // What the expression answers: from a table of the set, as long as the set is the same.
  Value computeValue(XQueryContext& context) const override;

 protected:
  XQueryMembership(Ref<XQueryExpr> plain, Question question, Operands operands)
      : XQueryPlannedExpr(std::move(plain)), _question(question), _operands(std::move(operands)) {}
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  class Members;

  std::shared_ptr<const Members> membersOf(const Value& set, XQueryContext& context) const;
  Value answer(const Value& node, const Members& members) const;

  const Question _question;
  const Operands _operands;
};

}  // namespace xquery

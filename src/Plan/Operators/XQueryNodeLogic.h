// Conditions on the context item, joined by "and" or "or", or negated, all of which can be asked of
// a node as it is: "@id and not(b)", "a or @x = '1'".
#pragma once

#include "Plan/Operators/XQueryNodeQuestion.h"
#include "Plan/Operators/XQueryPlannedExpr.h"

#include <optional>
#include <utility>
#include <vector>

namespace xquery {

class XQueryNodeLogic : public XQueryPlannedExpr, private XQueryNodeQuestion {
 public:
  enum class Joint : uint8_t { And, Or, Not };

  // Any number of operands, of a whole chain of the same joint, or one for Not; all of them are
  // node questions.
  [[nodiscard]] static Ref<XQueryNodeLogic> exprWithPlain(
      Ref<XQueryExpr> plain, Joint joint, std::vector<Ref<XQueryPlannedExpr>> operands) {
    return make<XQueryNodeLogic>(std::move(plain), joint, std::move(operands));
  }

  // What the expression answers.
  Value computeValue(XQueryContext& context) const override;
  const XQueryNodeQuestion* nodeQuestion() const override { return this; }

 protected:
  XQueryNodeLogic(Ref<XQueryExpr> plain, Joint joint, std::vector<Ref<XQueryPlannedExpr>> operands);
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  std::optional<bool> holdsFor(NSXMLNode* node, const XQueryContext& context) const override;
  bool asksForNodeAbove() const override { return _ofNodeAbove != nullptr; }
  const NSXMLNode* nodeAbove(const XQueryContext& context) const override {
    return _ofNodeAbove ? _ofNodeAbove->nodeAbove(context) : nullptr;
  }

  const Joint _joint;
  const std::vector<Ref<XQueryPlannedExpr>> _operands;
  const XQueryNodeQuestion* _ofNodeAbove = nullptr;  // one of those that have to hold
};

}  // namespace xquery

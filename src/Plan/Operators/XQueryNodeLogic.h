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

  // Two operands, or one for Not; all of them are node questions.
  [[nodiscard]] static Ref<XQueryNodeLogic> exprWithPlain(
      Ref<XQueryExpr> plain, Joint joint, std::vector<Ref<XQueryPlannedExpr>> operands) {
    return make<XQueryNodeLogic>(std::move(plain), joint, std::move(operands));
  }

  // What the expression answers.
  Value computeValue(XQueryContext& context) const override;
  const XQueryNodeQuestion* nodeQuestion() const override { return this; }

 protected:
  XQueryNodeLogic(Ref<XQueryExpr> plain, Joint joint, std::vector<Ref<XQueryPlannedExpr>> operands)
      : XQueryPlannedExpr(std::move(plain)), _joint(joint), _operands(std::move(operands)) {}
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  std::optional<bool> holdsFor(NSXMLNode* node, const XQueryContext& context) const override;
  bool asksForNodeAbove() const override { return questionOfNodeAbove() != nullptr; }
  const NSXMLNode* nodeAbove(const XQueryContext& context) const override {
    const XQueryNodeQuestion* question = questionOfNodeAbove();
    return question ? question->nodeAbove(context) : nullptr;
  }
  // Of those that have to hold.
  const XQueryNodeQuestion* questionOfNodeAbove() const;

  const Joint _joint;
  const std::vector<Ref<XQueryPlannedExpr>> _operands;
};

}  // namespace xquery

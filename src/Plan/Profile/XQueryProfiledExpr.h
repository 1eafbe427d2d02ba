// An expression that is counted and timed: it stands around one, or around an operator in its
// place, and answers what that one answers. Whoever asks an operator for more than its value gets
// the answer of the operator inside.
#pragma once

#include "Context/ProfileRecorder.h"
#include "Plan/Operators/XQueryNodeQuestion.h"
#include "Plan/Operators/XQueryPlannedExpr.h"

#include <utility>

namespace xquery {

class XQueryProfiledExpr final : public XQueryPlannedExpr, private XQueryNodeQuestion {
 public:
  [[nodiscard]] static Ref<XQueryProfiledExpr> exprWithPlain(Ref<XQueryExpr> plain,
                                                             XQueryCounterID counter) {
    return make<XQueryProfiledExpr>(std::move(plain), counter);
  }

  Value computeValue(XQueryContext& context) const override;
  // What is counted by walking the path belongs to whoever asks for it.
  const XQueryWalkedPath* walkedPath() const override {
    return _operator ? _operator->walkedPath() : nullptr;
  }
  const XQueryNodeQuestion* nodeQuestion() const override { return _question ? this : nullptr; }

 protected:
  XQueryProfiledExpr(Ref<XQueryExpr> plain, XQueryCounterID counter);
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  std::optional<bool> holdsFor(NSXMLNode* node, const XQueryContext& context) const override;

  const XQueryPlannedExpr* const _operator;  // what it stands around, where that is one
  const XQueryNodeQuestion* const _question;
  const XQueryCounterID _counter;
};

}  // namespace xquery

// Comparing what a short path finds with a constant: "@id = 'a1'", "$p/price > 40", ". eq 'b'".
#pragma once

#include "Expr/Operators/XQueryComparison.h"
#include "Plan/Operators/XQueryNodeQuestion.h"
#include "Plan/Operators/XQueryPlannedExpr.h"
#include "Plan/Operators/XQueryShortWalk.h"
#include "xquery/String.h"

#include <optional>

namespace xquery {

class XQueryConstantComparison : public XQueryPlannedExpr, private XQueryNodeQuestion {
 public:
  struct Constant {
    Ref<NSString> text;  // exactly xs:string; null for a number
    double number = 0;   // never NaN
  };

  // `relation` is that of a node to the constant. A value comparison takes one node and a text.
  [[nodiscard]] static Ref<XQueryConstantComparison> exprWithPlain(Ref<XQueryExpr> plain,
                                                                   const XQueryShortWalk& walk,
                                                                   XQueryRelation relation,
                                                                   bool isValueComparison,
                                                                   Constant constant) {
    return make<XQueryConstantComparison>(std::move(plain), walk, relation, isValueComparison,
                                          std::move(constant));
  }

  // One of the shared truth values, or the NSNull for no nodes; what the comparison itself answers
  // from anything but one node, for a text that is no number where the constant is one, and for a
  // value comparison of other than one node.
  Value computeValue(XQueryContext& context) const override;
  const XQueryNodeQuestion* nodeQuestion() const override {
    return _walk.startsFromFocus() ? this : nullptr;
  }

 protected:
  XQueryConstantComparison(Ref<XQueryExpr> plain, const XQueryShortWalk& walk,
                           XQueryRelation relation, bool isValueComparison, Constant constant)
      : XQueryPlannedExpr(std::move(plain)),
        _walk(walk),
        _relation(relation),
        _isValueComparison(isValueComparison),
        _constant(std::move(constant)) {}
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  struct Answer {
    bool isKnown;
    std::optional<bool> holds;  // none where there are no nodes
  };
  std::optional<bool> holdsOf(const NSXMLNode& node) const;
  Answer answerFrom(NSXMLNode* start) const;
  std::optional<bool> holdsFor(NSXMLNode* node, const XQueryContext& context) const override;

  const XQueryShortWalk _walk;
  const XQueryRelation _relation;
  const bool _isValueComparison;
  const Constant _constant;
};

}  // namespace xquery

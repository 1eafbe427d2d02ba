// some $x in ... satisfies ..., every $x in ... satisfies ...
#pragma once

#include "Expr/XQueryBinding.h"
#include "Expr/XQueryExpr.h"
#include "Expr/XQueryPicker.h"
#include "xquery/Number.h"

#include <vector>

namespace xquery {

// One variable clause.
class XQueryQuantifiedExprItem : public XQueryBindingExpr {
 public:
  static bool classof(const NSObject& object) { return object.kind() == Kind::QuantifiedItem; }

  // `type` may be null.
  [[nodiscard]] static Ref<XQueryQuantifiedExprItem> quantifiedExpr(
      Ref<XQueryExpr> expr, Ref<NSString> forVar, Ref<XQueryTypeDeclaration> type);
  void bindInfoForProlog(XQueryProlog& prolog) override;

 protected:
  using XQueryBindingExpr::XQueryBindingExpr;
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);
};

class XQueryQuantifiedExpr : public XQueryExpr {
 public:
  static bool classof(const NSObject& object) { return object.kind() == Kind::QuantifiedExpr; }

  using Items = std::vector<Ref<XQueryQuantifiedExprItem>>;

  [[nodiscard]] static Ref<XQueryQuantifiedExpr> someExpr(Items items, Ref<XQueryExpr> satisfies);
  [[nodiscard]] static Ref<XQueryQuantifiedExpr> everyExpr(Items items, Ref<XQueryExpr> satisfies);

  void bindInfoForProlog(XQueryProlog& prolog) override;
  // One of the shared truth values, or the error record of a binding of the wrong type.
  Value computeValue(XQueryContext& context) const override;
  void visitParts(XQueryPartVisitor& visitor) override;

  const Items& items() const { return _items; }
  // "every", not "some".
  bool every() const { return _every; }

 protected:
  XQueryQuantifiedExpr(Items items, Ref<XQueryExpr> satisfies, bool every);
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  // The misspelling belongs to the name.
  Value evaluatePostion(size_t index, XQueryContext& withContext) const;
  Value evaluateItems(size_t clause, size_t index, XQueryContext& context) const;
  Value evaluateGiven(size_t clause, size_t index, XQueryContext& context) const;
  Value evaluateItem(size_t clause, size_t index, Value item, XQueryContext& context) const;
  Value evaluatePicks(size_t clause, const XQueryPicks& picks, XQueryContext& context) const;
  // What an item answers that leaves the question open.
  Value undecided() const { return NSNumber::numberWithBool(_every); }

  Items _items;
  Ref<XQueryExpr> _satisfies;
  bool _every;
};

}  // namespace xquery

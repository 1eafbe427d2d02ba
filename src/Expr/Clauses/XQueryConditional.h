// if (...) then ... else ...
#pragma once

#include "Expr/XQueryExpr.h"
#include "Expr/XQueryTruthTeller.h"

#include <optional>
#include <utility>

namespace xquery {

class XQueryConditionalExpr : public XQueryExpr {
 public:
  static bool classof(const NSObject& object) { return object.kind() == Kind::ConditionalExpr; }

  // A missing branch is null and stands for the empty sequence. The misspelling belongs to the
  // name.
  [[nodiscard]] static Ref<XQueryConditionalExpr> condionalExpr(Ref<XQueryExpr> test,
                                                                Ref<XQueryExpr> thenExpr,
                                                                Ref<XQueryExpr> elseExpr);

  // Tells of the test, which holds the teller.
  void setTeller(const XQueryTruthTeller* ofTest) { _teller = ofTest; }

  void bindInfoForProlog(XQueryProlog& prolog) override;
  Value computeValue(XQueryContext& context) const override;
  void visitParts(XQueryPartVisitor& visitor) override;

 protected:
  XQueryConditionalExpr(Ref<XQueryExpr> intWithTestExpr, Ref<XQueryExpr> thenExpr,
                        Ref<XQueryExpr> elseExpr)
      : XQueryExpr(Kind::ConditionalExpr),
        _test(std::move(intWithTestExpr)),
        _then(std::move(thenExpr)),
        _else(std::move(elseExpr)) {}
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  std::optional<bool> testIn(XQueryContext& context) const;
  [[gnu::noinline, gnu::cold]] Value failConversion(XQueryContext& context) const;

  Ref<XQueryExpr> _test;
  Ref<XQueryExpr> _then;
  Ref<XQueryExpr> _else;
  const XQueryTruthTeller* _teller = nullptr;
};

}  // namespace xquery

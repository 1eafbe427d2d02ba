// instance of, treat as, cast as, castable as.
#pragma once

#include "Expr/TypeTests/XQueryTypeDeclaration.h"
#include "Expr/XQueryExpr.h"
#include "Types/XQueryCasting.h"

#include <utility>

namespace xquery {

// An operand and a declared type.
class XQueryTypedExpr : public XQueryExpr {
 public:
  static bool classof(const NSObject& object) {
    return object.kind() >= Kind::InstanceOfExpr && object.kind() <= Kind::CastableExpr;
  }

  void bindInfoForProlog(XQueryProlog& prolog) override;
  void visitParts(XQueryPartVisitor& visitor) override;
  const XQueryTypeDeclaration& type() const { return *_type; }
  // May be null.
  const XQueryExpr* subject() const { return _expr.get(); }

 protected:
  // A null operand is the empty sequence.
  XQueryTypedExpr(Kind kind, Ref<XQueryExpr> expr, Ref<XQueryTypeDeclaration> type)
      : XQueryExpr(kind), _expr(std::move(expr)), _type(std::move(type)) {}
  Value operand(XQueryContext& context) const;

  Ref<XQueryExpr> _expr;
  Ref<XQueryTypeDeclaration> _type;
};

class XQueryInstanceOfExpr : public XQueryTypedExpr {
 public:
  static bool classof(const NSObject& object) { return object.kind() == Kind::InstanceOfExpr; }

  [[nodiscard]] static Ref<XQueryInstanceOfExpr> instanceOfExpr(Ref<XQueryExpr> expr,
                                                                Ref<XQueryTypeDeclaration> forType);
  // One of the shared truth values. `forContext` may be null.
  static Value object(const Value& object, const XQueryTypeDeclaration& instanceOf,
                      XQueryContext* forContext);
  Value computeValue(XQueryContext& context) const override;

 protected:
  using XQueryTypedExpr::XQueryTypedExpr;
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);
};

class XQueryTreatExpr : public XQueryTypedExpr {
 public:
  static bool classof(const NSObject& object) { return object.kind() == Kind::TreatExpr; }

  [[nodiscard]] static Ref<XQueryTreatExpr> treatExpr(Ref<XQueryExpr> expr,
                                                      Ref<XQueryTypeDeclaration> asType);
  // The object itself when it matches; otherwise raises error 6 "invalid type".
  static Value object(const Value& object, const XQueryTypeDeclaration& treatAs,
                      XQueryContext& forContext) {
    return XQueryTreatAs(object, treatAs, forContext);
  }
  Value computeValue(XQueryContext& context) const override;
  void visitParts(XQueryPartVisitor& visitor) override;

 protected:
  using XQueryTypedExpr::XQueryTypedExpr;
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);
};

class XQueryCastExpr : public XQueryTypedExpr {
 public:
  static bool classof(const NSObject& object) { return object.kind() == Kind::CastExpr; }

  [[nodiscard]] static Ref<XQueryCastExpr> castExpr(Ref<XQueryExpr> expr,
                                                    Ref<XQueryTypeDeclaration> asType);
  // Atomizes, then casts: see XQueryCastObject.
  static Value castObject(const Value& object, XQueryTypeID asType, XQueryContext& forContext,
                          bool allowEmpty) {
    return XQueryCastObject(object, asType, forContext, allowEmpty);
  }
  Value computeValue(XQueryContext& context) const override;

 protected:
  using XQueryTypedExpr::XQueryTypedExpr;
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);
};

class XQueryCastableExpr : public XQueryTypedExpr {
 public:
  static bool classof(const NSObject& object) { return object.kind() == Kind::CastableExpr; }

  [[nodiscard]] static Ref<XQueryCastableExpr> castableExpr(Ref<XQueryExpr> expr,
                                                            Ref<XQueryTypeDeclaration> asType);
  Value computeValue(XQueryContext& context) const override;

 protected:
  using XQueryTypedExpr::XQueryTypedExpr;
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);
};

}  // namespace xquery

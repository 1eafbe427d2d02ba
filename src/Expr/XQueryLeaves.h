// The leaves of the expression tree: literals, variable references, the context item and QName
// references that wait for run time.
#pragma once

#include "Expr/LiteralCopies.h"
#include "Expr/XQueryExpr.h"
#include "Types/XQueryQName.h"
#include "xquery/String.h"

namespace xquery {

class XQueryLiteral : public XQueryExpr {
 public:
  static bool classof(const NSObject& object) { return object.kind() == Kind::Literal; }

  [[nodiscard]] static Ref<XQueryLiteral> literalWithValue(Value value);
  [[nodiscard]] static Ref<XQueryLiteral> stringLiteralWithString(const Ref<NSString>& text);
  // Both null for more digits than a decimal holds.
  [[nodiscard]] static Ref<XQueryLiteral> integerLiteralWithString(const Ref<NSString>& digits);
  [[nodiscard]] static Ref<XQueryLiteral> decimalLiteralWithString(const Ref<NSString>& digits);
  // What overflows becomes an infinity.
  [[nodiscard]] static Ref<XQueryLiteral> doubleLiteralWithString(const Ref<NSString>& text);

  const Value& literalValue() const { return _value.stored(); }
  void bindInfoForProlog(XQueryProlog&) override {}
  // The stored object itself, every time, or the calling thread's own copy.
  Value computeValue(XQueryContext&) const override { return _value.own(); }
  void visitParts(XQueryPartVisitor&) override {}
  Ref<NSString> description() const override;

 protected:
  explicit XQueryLiteral(Value value) : XQueryExpr(Kind::Literal), _value(std::move(value)) {}
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  const XQueryLiteralCopies _value;
};

class XQueryVariable : public XQueryExpr {
 public:
  static bool classof(const NSObject& object) { return object.kind() == Kind::Variable; }

  // The name as written, prefix included, without the dollar sign.
  [[nodiscard]] static Ref<XQueryVariable> variableWithName(Ref<NSString> name);

  const Ref<NSString>& name() const { return _name; }
  // 0 for a variable that is not local.
  int64_t varID() const { return _varID; }
  void bindInfoForProlog(XQueryProlog& prolog) override;
  Value computeValue(XQueryContext& context) const override;
  void visitParts(XQueryPartVisitor&) override {}

 protected:
  explicit XQueryVariable(Ref<NSString> name)
      : XQueryExpr(Kind::Variable), _name(std::move(name)) {}
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  Ref<NSString> _name;
  Ref<XQueryQName> _qName;
  int64_t _varID = 0;
};

// "." - one shared instance, which carries no line.
class XQueryContextItem : public XQueryExpr {
 public:
  static bool classof(const NSObject& object) { return object.kind() == Kind::ContextItemExpr; }

  static XQueryContextItem* contextItem();

  void bindInfoForProlog(XQueryProlog&) override {}
  // Null when there is no focus.
  Value computeValue(XQueryContext& context) const override;
  void visitParts(XQueryPartVisitor&) override {}

 private:
  XQueryContextItem() : XQueryExpr(Kind::ContextItemExpr) {}
};

// A QName that could not be resolved when the query was bound, or one that was and stands as an
// expression.
class XQueryQNameReference : public XQueryExpr {
 public:
  static bool classof(const NSObject& object) { return object.kind() == Kind::QNameReference; }

  [[nodiscard]] static Ref<XQueryQNameReference> qNameReferenceWithString(Ref<NSString> name,
                                                                          int64_t line);
  [[nodiscard]] static Ref<XQueryQNameReference> qNameReferenceWithQName(Ref<XQueryQName> qName,
                                                                         int64_t line);

  void bindInfoForProlog(XQueryProlog&) override {}
  Value computeValue(XQueryContext& context) const override;
  void visitParts(XQueryPartVisitor&) override {}
  // The same for those who raise errors. Raises error 1 for a name that has no namespace even now.
  Ref<XQueryQName> qNameForContext(XQueryContext& context) const;

 protected:
  XQueryQNameReference(Ref<NSString> name, Ref<XQueryQName> qName, int64_t line);
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  Ref<NSString> _name;
  Ref<NSString> _prefix;
  Ref<NSString> _localPart;
  Ref<XQueryQName> _qName;
};

}  // namespace xquery

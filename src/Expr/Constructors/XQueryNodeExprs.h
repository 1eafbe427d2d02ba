// Constructors of texts, comments, processing instructions, documents and namespaces.
#pragma once

#include "Expr/Constructors/XQueryConstructorName.h"
#include "Expr/XQueryExpr.h"
#include "xquery/XMLNode.h"

namespace xquery {

// A constructor that has a value and no name.
class XQueryValueConstructor : public XQueryExpr {
 public:
  void bindInfoForProlog(XQueryProlog& prolog) override;
  void visitParts(XQueryPartVisitor& visitor) override;

 protected:
  XQueryValueConstructor(Kind kind, Ref<XQueryExpr> value)
      : XQueryExpr(kind), _value(std::move(value)) {}

  Ref<XQueryExpr> _value;
};

// text {...}: the empty sequence makes no node.
class XQueryTextExpr : public XQueryValueConstructor {
 public:
  static bool classof(const NSObject& object) { return object.kind() == Kind::TextExpr; }

  [[nodiscard]] static Ref<XQueryTextExpr> textExprWithValue(Ref<XQueryExpr> value);

  Value computeValue(XQueryContext& context) const override;

 protected:
  using XQueryValueConstructor::XQueryValueConstructor;
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);
};

// comment {...}
class XQueryCommentExpr : public XQueryValueConstructor {
 public:
  static bool classof(const NSObject& object) { return object.kind() == Kind::CommentExpr; }

  [[nodiscard]] static Ref<XQueryCommentExpr> commentExprWithValue(Ref<XQueryExpr> value);

  Value computeValue(XQueryContext& context) const override;

 protected:
  using XQueryValueConstructor::XQueryValueConstructor;
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);
};

// processing-instruction {...} {...}, and the direct form.
class XQueryProcessingInstructionExpr : public XQueryExpr {
 public:
  static bool classof(const NSObject& object) {
    return object.kind() == Kind::ProcessingInstructionExpr;
  }

  // `value` may be null.
  [[nodiscard]] static Ref<XQueryProcessingInstructionExpr> processingInstructionExprWithName(
      Ref<XQueryExpr> name, Ref<XQueryExpr> value);

  void bindInfoForProlog(XQueryProlog& prolog) override;
  Value computeValue(XQueryContext& context) const override;
  void visitParts(XQueryPartVisitor& visitor) override;

 protected:
  XQueryProcessingInstructionExpr(Ref<XQueryExpr> name, Ref<XQueryExpr> value)
      : XQueryExpr(Kind::ProcessingInstructionExpr),
        _name(std::move(name)),
        _value(std::move(value)) {}
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  static NSXMLNameRef targetNamed(const NSXMLNameRef& name);

  XQueryConstructorName _name;
  Ref<XQueryExpr> _value;
};

// document {...}
class XQueryDocumentExpr : public XQueryValueConstructor {
 public:
  static bool classof(const NSObject& object) { return object.kind() == Kind::DocumentExpr; }

  [[nodiscard]] static Ref<XQueryDocumentExpr> documentWithExpr(Ref<XQueryExpr> expr);
  void bindInfoForProlog(XQueryProlog& prolog) override;

  Value computeValue(XQueryContext& context) const override;

 protected:
  using XQueryValueConstructor::XQueryValueConstructor;
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);
};

// A namespace declaration attribute of a direct constructor.
class XQueryNamespaceExpr : public XQueryExpr {
 public:
  static bool classof(const NSObject& object) { return object.kind() == Kind::NamespaceExpr; }

  // The name is the prefix, "" for the default namespace.
  [[nodiscard]] static Ref<XQueryNamespaceExpr> namespaceExprWithName(Ref<NSString> name,
                                                                      Ref<XQueryExpr> value);

  // The declaration, known without evaluation; null when the value is not a literal string.
  Ref<NSXMLNode> constantNode() const;
  void bindInfoForProlog(XQueryProlog& prolog) override;
  Value computeValue(XQueryContext& context) const override;
  void visitParts(XQueryPartVisitor& visitor) override;

 protected:
  XQueryNamespaceExpr(Ref<NSString> name, Ref<XQueryExpr> value)
      : XQueryExpr(Kind::NamespaceExpr), _name(std::move(name)), _value(std::move(value)) {}
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  Ref<NSString> _name;
  Ref<XQueryExpr> _value;
};

}  // namespace xquery

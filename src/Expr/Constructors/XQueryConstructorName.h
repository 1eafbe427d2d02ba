// The name of a constructed element or attribute: a constant, whose prefix is resolved when the
// query is bound, or an expression.
#pragma once

#include "Expr/XQueryExpr.h"
#include "Platform/Tree/Names.h"
#include "Types/XQueryQName.h"
#include "xquery/Object.h"
#include "xquery/String.h"

#include <cstdint>

namespace xquery {

class XQueryConstructorName {
 public:
  explicit XQueryConstructorName(Ref<NSString> name) : _name(std::move(name)) {}
  explicit XQueryConstructorName(Ref<XQueryExpr> nameExpr) : _nameExpr(std::move(nameExpr)) {}
  // A string is a constant name, anything else an expression.
  explicit XQueryConstructorName(const Value& nameOrExpr);

  // As written; null for an expression.
  const Ref<NSString>& constantName() const { return _name; }
  // Resolves a constant name, or binds the expression. An element's name without a prefix takes the
  // nearest enclosing constructor's default namespace before the prolog's; an attribute's is in no
  // namespace. A name that does not resolve is an error in a library module and waits for the
  // context's namespaces elsewhere.
  // Line and place are those of the constructor.
  void bind(XQueryProlog& prolog, Kind nodeKind, const XQueryExpr& constructor);

  // The expression, unless the name is a constant.
  void visitParts(XQueryPartVisitor& visitor);

  // Null when the expression has failed. Raises error 1 for a name that has no namespace even now,
  // error 6 for a value that is no name of a node.
  NSXMLNameRef evaluate(XQueryContext& context, int64_t line) const;

 private:
  Ref<XQueryQName> resolved(const XQueryProlog& prolog, Kind nodeKind) const;
  void bindTarget();
  void bindUnresolved(XQueryProlog& prolog, const XQueryExpr& constructor);
  bool isConstantIn(XQueryContext& context) const;

  Ref<NSString> _name;
  Ref<XQueryExpr> _nameExpr;
  Kind _nodeKind = Kind::None;
  // The name that the expression gives without being evaluated: always, or while the context has no
  // default namespace.
  NSXMLNameRef _constant;
  bool _waitsForContext = false;
};

}  // namespace xquery

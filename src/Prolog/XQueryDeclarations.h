// What a prolog declares: global variables and functions, and the parameters of the latter.
//
// A prolog owns its declarations, and so does every prolog that imported them; a declaration knows
// the prolog that declared it but does not own it. That prolog lives as long as the compilation's
// registry of modules, so the pointer stays good wherever the declaration is used.
#pragma once

#include "Expr/TypeTests/XQueryTypeDeclaration.h"
#include "Expr/XQueryExpr.h"
#include "Types/XQueryQName.h"
#include "xquery/String.h"

#include <cstdint>
#include <utility>
#include <vector>

namespace xquery {

class XQueryProlog;

class XQueryVarDecl : public NSCounted {
 public:
  static bool classof(const NSObject& object) { return object.kind() == Kind::VarDecl; }

  // `forType` may be null; a null expression makes the variable external.
  [[nodiscard]] static Ref<XQueryVarDecl> varDecl(Ref<XQueryQName> qName,
                                                  Ref<XQueryTypeDeclaration> forType,
                                                  Ref<XQueryExpr> withExpr, XQueryProlog& prolog);

  const Ref<XQueryQName>& name() const { return _name; }
  XQueryTypeDeclaration* type() const { return _type.get(); }
  XQueryExpr* expr() const { return _expr.get(); }
  // One that answers the same.
  void setExpr(Ref<XQueryExpr> expr) { _expr = std::move(expr); }
  XQueryProlog& prolog() const { return _prolog; }
  bool isExternal() const { return !_expr; }
  // Where it is declared: the name as written, without a dollar sign, null until set, and the line,
  // counted from 0.
  const Ref<NSString>& writtenName() const { return _writtenName; }
  int64_t line() const { return _line; }
  void setWritten(Ref<NSString> name, int64_t line) {
    _writtenName = std::move(name);
    _line = line;
  }
  // That of the declaration.
  XQueryPlaceNumber place() const { return _place; }
  void setPlace(XQueryPlaceNumber place) { _place = place; }

 protected:
  XQueryVarDecl(Ref<XQueryQName> name, Ref<XQueryTypeDeclaration> type, Ref<XQueryExpr> expr,
                XQueryProlog& prolog);
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  Ref<XQueryQName> _name;
  Ref<XQueryTypeDeclaration> _type;
  Ref<XQueryExpr> _expr;
  XQueryProlog& _prolog;
  Ref<NSString> _writtenName;
  int64_t _line = 0;
  XQueryPlaceNumber _place = 0;
};

// A parameter of a declared function.
class XQueryParam : public XQueryExpr {
 public:
  static bool classof(const NSObject& object) { return object.kind() == Kind::Param; }

  // The name as written, prefix included, without the dollar sign; `type` may be null.
  [[nodiscard]] static Ref<XQueryParam> paramWithName(Ref<NSString> name,
                                                      Ref<XQueryTypeDeclaration> type);

  const Ref<NSString>& name() const { return _name; }
  XQueryTypeDeclaration* type() const { return _type.get(); }
  // The local variable that takes the argument; 0 until bound.
  int64_t varID() const { return _varID; }

  // A name that the function's parameter list already used is error 39.
  void bindInfoForProlog(XQueryProlog& prolog) override;
  // NSNull: a parameter is not evaluated for a value.
  Value computeValue(XQueryContext& context) const override;
  // None: what is declared of a parameter is part of no expression.
  void visitParts(XQueryPartVisitor&) override {}

 protected:
  XQueryParam(Ref<NSString> name, Ref<XQueryTypeDeclaration> type);
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  Ref<NSString> _name;
  Ref<XQueryTypeDeclaration> _type;
  int64_t _varID = 0;
};

class XQueryFunctionDecl : public NSCounted {
 public:
  static bool classof(const NSObject& object) { return object.kind() == Kind::FunctionDecl; }

  // `forType` may be null; a null expression makes the function external.
  [[nodiscard]] static Ref<XQueryFunctionDecl> functionDecl(
      Ref<XQueryQName> name, Ref<XQueryTypeDeclaration> forType,
      std::vector<Ref<XQueryParam>> withParams, Ref<XQueryExpr> expr, XQueryProlog& prolog);

  const Ref<XQueryQName>& name() const { return _name; }
  XQueryTypeDeclaration* type() const { return _type.get(); }
  const std::vector<Ref<XQueryParam>>& params() const { return _params; }
  XQueryExpr* expr() const { return _expr.get(); }
  // One that answers the same.
  void setExpr(Ref<XQueryExpr> expr) { _expr = std::move(expr); }
  XQueryProlog& prolog() const { return _prolog; }
  bool isExternal() const { return !_expr; }
  // Where it is declared: the name as written, without a dollar sign, null until set, and the line,
  // counted from 0.
  const Ref<NSString>& writtenName() const { return _writtenName; }
  int64_t line() const { return _line; }
  void setWritten(Ref<NSString> name, int64_t line) {
    _writtenName = std::move(name);
    _line = line;
  }
  // That of the declaration.
  XQueryPlaceNumber place() const { return _place; }
  void setPlace(XQueryPlaceNumber place) { _place = place; }

 protected:
  XQueryFunctionDecl(Ref<XQueryQName> name, Ref<XQueryTypeDeclaration> type,
                     std::vector<Ref<XQueryParam>> params, Ref<XQueryExpr> expr,
                     XQueryProlog& prolog);
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  Ref<XQueryQName> _name;
  Ref<XQueryTypeDeclaration> _type;
  std::vector<Ref<XQueryParam>> _params;
  Ref<XQueryExpr> _expr;
  XQueryProlog& _prolog;
  Ref<NSString> _writtenName;
  int64_t _line = 0;
  XQueryPlaceNumber _place = 0;
};

}  // namespace xquery

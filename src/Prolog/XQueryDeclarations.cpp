#include "Prolog/XQueryDeclarations.h"

#include "Prolog/XQueryProlog.h"
#include "Types/XQueryErrors.h"
#include "xquery/Collection.h"

namespace xquery {

XQueryVarDecl::XQueryVarDecl(Ref<XQueryQName> name, Ref<XQueryTypeDeclaration> type,
                             Ref<XQueryExpr> expr, XQueryProlog& prolog)
    : NSCounted(Kind::VarDecl),
      _name(std::move(name)),
      _type(std::move(type)),
      _expr(std::move(expr)),
      _prolog(prolog) {}

Ref<XQueryVarDecl> XQueryVarDecl::varDecl(Ref<XQueryQName> qName,
                                          Ref<XQueryTypeDeclaration> forType,
                                          Ref<XQueryExpr> withExpr, XQueryProlog& prolog) {
  return make<XQueryVarDecl>(std::move(qName), std::move(forType), std::move(withExpr), prolog);
}

XQueryParam::XQueryParam(Ref<NSString> name, Ref<XQueryTypeDeclaration> type)
    : XQueryExpr(Kind::Param), _name(std::move(name)), _type(std::move(type)) {}

Ref<XQueryParam> XQueryParam::paramWithName(Ref<NSString> name, Ref<XQueryTypeDeclaration> type) {
  return make<XQueryParam>(std::move(name), std::move(type));
}

void XQueryParam::bindInfoForProlog(XQueryProlog& prolog) {
  if (const auto qName = prolog.variableQNameFromString(_name)) {
    if (prolog.localVariableIDForQName(qName) != 0) {
      prolog.addError(XQueryErrors::duplicateParameter.error(), exprPlace());
    } else {
      _varID = prolog.newLocalVariableIDForQName(qName);
    }
  }
  if (_type) _type->bindInfoForProlog(prolog);
}

Value XQueryParam::computeValue(XQueryContext&) const {
  return NSNull::null();
}

XQueryFunctionDecl::XQueryFunctionDecl(Ref<XQueryQName> name, Ref<XQueryTypeDeclaration> type,
                                       std::vector<Ref<XQueryParam>> params, Ref<XQueryExpr> expr,
                                       XQueryProlog& prolog)
    : NSCounted(Kind::FunctionDecl),
      _name(std::move(name)),
      _type(std::move(type)),
      _params(std::move(params)),
      _expr(std::move(expr)),
      _prolog(prolog) {}

Ref<XQueryFunctionDecl> XQueryFunctionDecl::functionDecl(Ref<XQueryQName> name,
                                                         Ref<XQueryTypeDeclaration> forType,
                                                         std::vector<Ref<XQueryParam>> withParams,
                                                         Ref<XQueryExpr> expr,
                                                         XQueryProlog& prolog) {
  return make<XQueryFunctionDecl>(std::move(name), std::move(forType), std::move(withParams),
                                  std::move(expr), prolog);
}

}  // namespace xquery

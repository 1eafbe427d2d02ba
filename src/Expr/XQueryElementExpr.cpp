#include "Expr/XQueryElementExpr.h"

#include "Eval/StackGuard.h"
#include "Eval/XQueryContextInternal.h"
#include "Expr/XQueryContent.h"
#include "Expr/XQueryInScopeNamespaces.h"
#include "Expr/XQueryNodeExprs.h"
#include "Platform/XMLTree.h"
#include "Prolog/XQueryProlog.h"

namespace xquery {

Ref<XQueryElementExpr> XQueryElementExpr::elementeExprWithName(const Ref<NSString>& name,
                                                               Exprs attributes, Exprs items) {
  return make<XQueryElementExpr>(XQueryConstructorName(name), std::move(attributes),
                                 std::move(items));
}

Ref<XQueryElementExpr> XQueryElementExpr::elementExprWithNameExpr(const Value& nameExpr,
                                                                  Ref<XQueryExpr> value) {
  Exprs items;
  if (value) items.push_back(std::move(value));
  return make<XQueryElementExpr>(XQueryConstructorName(nameExpr), Exprs(), std::move(items));
}

namespace {

void collectNamespaces(const XQueryElementExpr::Exprs& exprs,
                       std::vector<Ref<NSXMLNode>>& namespaces) {
  for (const auto& expr : exprs) {
    const auto* declaration = dyn_cast<XQueryNamespaceExpr>(expr.get());
    const Ref<NSXMLNode> node = declaration ? declaration->constantNode() : nullptr;
    if (node) namespaces.push_back(node);
  }
}

}  // namespace

void XQueryElementExpr::bindInfoForProlog(XQueryProlog& prolog) {
  if (!XQueryCheckStack(prolog)) return;
  collectNamespaces(_attributes, _namespaces);
  collectNamespaces(_items, _namespaces);
  if (!_namespaces.empty()) prolog.pushInScopeNamespaces(_namespaces);
  _name.bind(prolog, Kind::Element, exprLine());
  for (const auto& attribute : _attributes) attribute->bindInfoForProlog(prolog);
  for (const auto& item : _items) item->bindInfoForProlog(prolog);
  if (!_namespaces.empty()) prolog.popInScopeNamespaces();
}

Value XQueryElementExpr::evaluateWithContext(XQueryContext& context) const {
  XQueryCheckStack(context);
  auto& dynamic = context._internal();
  XQueryInScopeNamespaces namespaces(dynamic);
  if (!_namespaces.empty()) namespaces.push(_namespaces);
  const Ref<NSXMLElement> element =
      NSXMLTree::makeLoneElement(_name.evaluate(context, exprLine()).detach());
  dynamic.setBaseURI(dynamic.baseURI(), element.get());
  for (const auto& declaration : _namespaces) element->addNamespace(declaration->copy());
  namespaces.updateNamespacesForElement(*element, *element);

  XQueryElementContent content(*element, namespaces, context, exprLine());
  for (const auto& attribute : _attributes) content.add(attribute->evaluateWithContext(context));
  for (const auto& item : _items) content.add(item->evaluateWithContext(context));
  content.finish();
  return element;
}

}  // namespace xquery

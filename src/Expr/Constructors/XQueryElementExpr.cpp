#include "Expr/Constructors/XQueryElementExpr.h"

#include "Context/StackGuard.h"
#include "Context/XQueryContextInternal.h"
#include "Expr/BorrowedValue.h"
#include "Expr/Constructors/XQueryAttributeExpr.h"
#include "Expr/Constructors/XQueryContent.h"
#include "Expr/Constructors/XQueryContentText.h"
#include "Expr/Constructors/XQueryElementContentString.h"
#include "Expr/Constructors/XQueryInScopeNamespaces.h"
#include "Expr/Constructors/XQueryNodeExprs.h"
#include "Expr/XQueryLeaves.h"
#include "Expr/XQueryParts.h"
#include "Platform/Tree/Arena.h"
#include "Platform/Tree/Credit.h"
#include "Prolog/XQueryProlog.h"

#include <algorithm>

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

// False for an error.
bool addValue(const XQueryExpr& expr, XQueryElementContent& content, XQueryContext& context) {
  const XQueryBorrowedValue value(expr, context);
  if (XQueryHasFailed(*value, context)) return false;
  content.add(*value);
  return true;
}

size_t roomForText(size_t length) {
  return NSXMLTree::roomForNode + (length + 7) / 8 * 8;
}

}  // namespace

// What the attributes take, and the text of an element that has no element constructors among its
// content. Only a guess: what finds no room is put elsewhere.
size_t XQueryElementExpr::roomBytes() const {
  constexpr size_t most = 4096;
  size_t bytes = 0;
  for (const auto& expr : _attributes) {
    const auto* attribute = dyn_cast<XQueryAttributeExpr>(expr.get());
    if (attribute) bytes += roomForText(attribute->expectedTextLength());
  }
  size_t textLength = 0;
  bool mayBeText = false;
  for (const auto& item : _items) {
    const auto* literal = dyn_cast<XQueryLiteral>(item.get());
    const auto* run =
        literal ? dyn_cast<XQueryElementContentString>(literal->literalValue()) : nullptr;
    if (isa<XQueryElementExpr>(item.get())) return std::min(bytes, most);
    if (run && run->isXMLSpace()) continue;
    mayBeText = true;
    textLength += run ? run->view().length() : XQueryExpectedTextLength;
  }
  if (mayBeText) bytes += roomForText(textLength);
  return std::min(bytes, most);
}

void XQueryElementExpr::bindInfoForProlog(XQueryProlog& prolog) {
  if (!XQueryCheckStack(prolog)) return;
  prolog.countAdopter();
  collectNamespaces(_attributes, _namespaces);
  collectNamespaces(_items, _namespaces);
  if (!_namespaces.empty()) prolog.pushInScopeNamespaces(_namespaces);
  _name.bind(prolog, Kind::Element, *this);
  for (const auto& attribute : _attributes) attribute->bindInfoForProlog(prolog);
  for (const auto& item : _items) item->bindInfoForProlog(prolog);
  _roomBytes = roomBytes();
  if (!_namespaces.empty()) prolog.popInScopeNamespaces();
}

void XQueryElementExpr::visitParts(XQueryPartVisitor& visitor) {
  _name.visitParts(visitor);
  for (const auto& attribute : _attributes) visitor.ownPart(attribute.get(), XQueryRole::Content);
  for (auto& item : _items) visitor.part(item, XQueryRole::Content);
}

Value XQueryElementExpr::computeValue(XQueryContext& context) const {
  XQueryCheckStack(context);
  auto& dynamic = _internal(context);
  XQueryInScopeNamespaces namespaces(dynamic);
  if (!_namespaces.empty()) {
    for (const auto& declaration : _namespaces) NSXMLCredit::take(declaration.get());
    namespaces.push(_namespaces);
  }
  NSXMLNameRef name = _name.evaluate(context, exprLine());
  if (!name) return {};
  NSXMLRoom room;
  const Ref<NSXMLElement> element =
      _isInPlace ? NSXMLTree::makeElementInPlace(name.detach(), _roomBytes, room)
                 : NSXMLTree::makeLoneElement(name.detach(), _roomBytes, room);
  XQueryElementContent content(*element, room, namespaces, context, exprLine());
  dynamic.setBaseURI(dynamic.baseURI(), element.get());
  for (const auto& declaration : _namespaces) {
    namespaces.declare(*element, *declaration->copy());
  }
  namespaces.updateNamespacesForElement(*element, *element->nodeName());

  for (const auto& expr : _attributes) {
    const auto* attribute = dyn_cast<XQueryAttributeExpr>(expr.get());
    const bool goesOn =
        attribute ? attribute->addTo(content, context) : addValue(*expr, content, context);
    if (!goesOn) return {};
  }
  for (const auto& item : _items) {
    if (!addValue(*item, content, context)) return {};
  }
  content.finish();
  return element;
}

}  // namespace xquery

#include "Expr/Constructors/XQueryAttributeExpr.h"

#include "Context/StackGuard.h"
#include "Context/XQueryContextInternal.h"
#include "Expr/BorrowedValue.h"
#include "Expr/Constructors/XQueryContent.h"
#include "Expr/Constructors/XQueryContentText.h"
#include "Expr/XQueryLeaves.h"
#include "Expr/XQueryParts.h"
#include "Platform/Tree/Arena.h"
#include "Prolog/XQueryModules.h"
#include "Types/XQueryErrors.h"
#include "Types/XQueryStringFunctions.h"

namespace xquery {
namespace {

bool isDeclarationName(const NSXMLName& name) {
  static const Ref<NSString> reserved = XQueryModules::builtinNamespaceForID(XQueryNamespaceXmlns);
  return name.text == "xmlns" || NSXMLURIOf(*name.expanded) == reserved->view();
}

// Null when the name's expression has failed.
NSXMLNameRef attributeName(const XQueryConstructorName& expr, XQueryContext& context,
                           int64_t line) {
  NSXMLNameRef name = expr.evaluate(context, line);
  if (name && isDeclarationName(*name.get())) {
    _internal(context).raise(XQueryErrors::attributeIsXMLNS.errorAtLine(line));
  }
  return name;
}

}  // namespace

Ref<XQueryAttributeExpr> XQueryAttributeExpr::attributeExprWithName(
    const Ref<NSString>& name, std::vector<Ref<XQueryExpr>> forItems, char16_t enclosedWith) {
  return make<XQueryAttributeExpr>(name, std::move(forItems), enclosedWith);
}

void XQueryAttributeExpr::bindInfoForProlog(XQueryProlog& prolog) {
  if (!XQueryCheckStack(prolog)) return;
  _name.bind(prolog, Kind::Attribute, *this);
  for (const auto& item : _items) item->bindInfoForProlog(prolog);
}

void XQueryAttributeExpr::visitParts(XQueryPartVisitor& visitor) {
  _name.visitParts(visitor);
  for (auto& item : _items) visitor.part(item, XQueryRole::Content);
}

Value XQueryAttributeExpr::computeValue(XQueryContext& context) const {
  NSXMLNameRef name = attributeName(_name, context, exprLine());
  NSMutableString text;
  if (!name || !appendValueText(text, context)) return {};
  return Ref<NSXMLNode>(NSXMLTree::makeLoneNode(Kind::Attribute, text.view(), name.detach()));
}

bool XQueryAttributeExpr::addTo(XQueryElementContent& content, XQueryContext& context) const {
  NSXMLNameRef name = attributeName(_name, context, exprLine());
  NSMutableString text;
  if (!name || !appendValueText(text, context)) return false;
  content.addNewAttribute(std::move(name), text.view());
  return true;
}

bool XQueryAttributeExpr::appendValueText(NSMutableString& text, XQueryContext& context) const {
  for (const auto& item : _items) {
    const XQueryBorrowedValue value(*item, context);
    if (XQueryHasFailed(*value, context)) return false;
    XQueryAppendText(*value, text, context);
  }
  XQueryNormalizeAttributeString(text);
  return true;
}

size_t XQueryAttributeExpr::expectedTextLength() const {
  size_t length = 0;
  for (const auto& item : _items) {
    const auto* literal = dyn_cast<XQueryLiteral>(item.get());
    const auto* text = literal ? dyn_cast<NSString>(literal->literalValue()) : nullptr;
    length += text ? text->length() : XQueryExpectedTextLength;
  }
  return length;
}

Ref<XQueryComputedAttributeExpr> XQueryComputedAttributeExpr::computedAttributeExprWithName(
    Ref<XQueryExpr> name, Ref<XQueryExpr> value) {
  return make<XQueryComputedAttributeExpr>(std::move(name), std::move(value));
}

void XQueryComputedAttributeExpr::bindInfoForProlog(XQueryProlog& prolog) {
  if (!XQueryCheckStack(prolog)) return;
  _name.bind(prolog, Kind::Attribute, *this);
  if (_value) _value->bindInfoForProlog(prolog);
}

void XQueryComputedAttributeExpr::visitParts(XQueryPartVisitor& visitor) {
  _name.visitParts(visitor);
  visitor.part(_value, XQueryRole::Content);
}

Value XQueryComputedAttributeExpr::computeValue(XQueryContext& context) const {
  XQueryCheckStack(context);
  NSXMLNameRef name = attributeName(_name, context, exprLine());
  if (!name) return {};
  NSMutableString text;
  if (_value) {
    const Value value = _value->evaluateWithContext(context);
    if (XQueryHasFailed(value, context)) return {};
    XQueryAppendText(value, text, context);
  }
  XQueryNormalizeAttributeString(text);
  return Ref<NSXMLNode>(_isInPlace
                            ? NSXMLTree::makeAttributeInPlace(name.detach(), text.view())
                            : NSXMLTree::makeLoneNode(Kind::Attribute, text.view(), name.detach()));
}

}  // namespace xquery

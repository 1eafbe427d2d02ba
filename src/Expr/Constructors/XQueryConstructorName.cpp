#include "Expr/Constructors/XQueryConstructorName.h"

#include "Context/XQueryContextInternal.h"
#include "Expr/XQueryLeaves.h"
#include "Expr/XQueryParts.h"
#include "Prolog/XQueryProlog.h"
#include "Types/NameCharacters.h"
#include "Types/XQueryAtomization.h"
#include "Types/XQueryCasting.h"
#include "Types/XQueryErrors.h"

namespace xquery {
namespace {

NSXMLNameRef nodeName(const XQueryQName& name) {
  const Ref<NSString>& URI = name.namespaceURI();
  return {name.XQueryStringValue()->view(), URI ? URI->view() : NSStringView()};
}

// A cast asks for no more than a prefix that is known, so that any text may be a QName; a node
// whose name no parser would read back is not made of it. A prefix needs a namespace to be declared
// with. The prefix of declarations is no element's; an attribute that has it gets another when it
// is written, or has an error of its own.
bool mayBeNodeName(const XQueryQName& name, Kind nodeKind) {
  const Ref<NSString>& prefix = name.prefixHint();
  if (prefix && prefix->length() > 0) {
    if (!name.namespaceURI() || name.namespaceURI()->length() == 0) return false;
    if (nodeKind == Kind::Element && prefix->view() == "xmlns") return false;
  }
  return XQueryIsNodeName(name.XQueryStringValue()->view());
}

bool hasPrefix(NSStringView name) {
  const uint32_t colon = name.find(u':');
  return colon != NSStringView::notFound && colon != 0;
}

}  // namespace

XQueryConstructorName::XQueryConstructorName(const Value& nameOrExpr) {
  if (isa<NSString>(nameOrExpr)) {
    _name = cast<NSString>(nameOrExpr);
  } else {
    _nameExpr = cast<XQueryExpr>(nameOrExpr);
  }
}

// Null when the prefix stands for no namespace; one that is declared as "" does not stand for any.
Ref<XQueryQName> XQueryConstructorName::resolved(const XQueryProlog& prolog, Kind nodeKind) const {
  if (!hasPrefix(_name->view())) {
    if (nodeKind == Kind::Attribute) return XQueryQName::qname(_name, nullptr);
    bool fromProlog = false;
    const Ref<NSString> URI = prolog.namespaceForPrefix(NSStringView(), fromProlog);
    if (!fromProlog) return XQueryQName::qname(_name, URI->length() ? URI : nullptr);
    return prolog.xmlQNameFromString(_name);
  }
  Ref<XQueryQName> qName = prolog.xmlQNameFromString(_name);
  return qName && qName->namespaceURI()->length() ? qName : nullptr;
}

void XQueryConstructorName::bindUnresolved(XQueryProlog& prolog, const XQueryExpr& constructor) {
  const int64_t line = constructor.exprLine();
  if (prolog.isModule()) {
    auto error = XQueryErrors::unresolvedQName.errorAtLine(line, _name);
    prolog.addError(error, constructor.exprPlace());
    _nameExpr = XQueryLiteral::literalWithValue(error);
    return;
  }
  auto reference = XQueryQNameReference::qNameReferenceWithString(_name, line);
  reference->setExprPlace(constructor.exprPlace());
  prolog.addQNameReference(reference);
  _nameExpr = reference;
  if (hasPrefix(_name->view())) return;
  _constant = NSXMLNameRef(_name->view(), NSStringView());
  _waitsForContext = true;
}

// A target is written as a literal string, which is cast to a QName. Without a prefix that needs
// nothing of the context, and of the QName only the local name, which is the text, is used.
void XQueryConstructorName::bindTarget() {
  const auto* literal = dyn_cast<XQueryLiteral>(_nameExpr.get());
  const auto* text = literal ? dyn_cast<NSString>(literal->literalValue()) : nullptr;
  if (!text || text->view().find(u':') != NSStringView::notFound) return;
  if (XQueryIsNodeName(text->view())) _constant = NSXMLNameRef(text->view(), NSStringView());
}

void XQueryConstructorName::bind(XQueryProlog& prolog, Kind nodeKind,
                                 const XQueryExpr& constructor) {
  _nodeKind = nodeKind;
  if (_nameExpr || !_name) {
    if (_nameExpr) _nameExpr->bindInfoForProlog(prolog);
    if (nodeKind == Kind::ProcessingInstruction) bindTarget();
  } else if (const Ref<XQueryQName> qName = resolved(prolog, nodeKind)) {
    _nameExpr = XQueryQNameReference::qNameReferenceWithQName(qName, constructor.exprLine());
    _nameExpr->setExprPlace(constructor.exprPlace());
    _constant = nodeName(*qName);
  } else {
    bindUnresolved(prolog, constructor);
  }
}

void XQueryConstructorName::visitParts(XQueryPartVisitor& visitor) {
  if (_name) {
    visitor.ownPart(_nameExpr.get(), XQueryRole::Name);
  } else {
    visitor.part(_nameExpr, XQueryRole::Name);
  }
}

bool XQueryConstructorName::isConstantIn(XQueryContext& context) const {
  return _constant &&
         (!_waitsForContext || !_internal(context).contextNamespaceForPrefix(NSStringView()));
}

NSXMLNameRef XQueryConstructorName::evaluate(XQueryContext& context, int64_t line) const {
  if (isConstantIn(context)) return _constant;
  const Value value = _nameExpr ? _nameExpr->evaluateWithContext(context) : Value();
  if (XQueryHasFailed(value, context)) return {};
  if (!value) {
    _internal(context).raise(XQueryErrors::unresolvedQName.errorAtLine(line, _name));
  }
  const Value item =
      XQueryAtomizationCheckingOccurrence(value, XQueryOccurrenceExactlyOne, context);
  const Value name = XQueryCastAs(item, XQueryTypeQName, context);
  const auto* qName = dyn_cast<XQueryQName>(name);
  if (!qName || !mayBeNodeName(*qName, _nodeKind)) {
    _internal(context).raise(XQueryErrors::invalidType.errorAtLine(line));
  }
  return nodeName(*qName);
}

}  // namespace xquery

// Name tests.
//
// A name is compared as an interned (namespace, local name) pair: one pointer comparison. An
// element name without a prefix in a main module without a default element namespace is not known
// before run time, since the context may have a default namespace; it usually has none, so the name
// it then stands for is interned at binding as well.
#include "Expr/Paths/XQueryNameTest.h"

#include "Context/XQueryContextInternal.h"
#include "Expr/XQueryLeaves.h"
#include "Platform/Tree/Names.h"
#include "Prolog/XQueryProlog.h"
#include "Types/XQueryErrors.h"
#include "xquery/Collection.h"

namespace xquery {
namespace {

bool haveSameURI(const NSXMLNode& node, const Ref<NSString>& URI) {
  const NSStringView ofNode = node.URIView();
  if (!URI) return ofNode.isEmpty();
  return URI->length() != 0 && ofNode == URI->view();
}

}  // namespace

Ref<XQueryNameTest> XQueryNameTest::nameTest(Ref<NSString> name) {
  return make<XQueryNameTest>(std::move(name));
}

// Nodes know no empty namespace, so a name that has one is nobody's name.
NSXMLExpandedNameRef XQueryNameTest::interned(const XQueryQName& name) {
  const Ref<NSString>& URI = name.namespaceURI();
  if (!URI) return {NSStringView(), name.localPart()->view()};
  if (URI->length() == 0) return {};
  return {URI->view(), name.localPart()->view()};
}

// An attribute name without a prefix is in no namespace, whatever the default element namespace.
Ref<XQueryQName> XQueryNameTest::resolved(XQueryProlog& prolog) const {
  if (_attribute && _name->view().find(u':') == NSStringView::notFound) {
    return XQueryQName::qnameWithLocalPart(_name, nullptr);
  }
  return prolog.xmlQNameFromString(_name);
}

void XQueryNameTest::bindInfoForProlog(XQueryProlog& prolog) {
  if (Ref<XQueryQName> qName = resolved(prolog)) {
    _expandedName = interned(*qName);
    _qName = qName;
    return;
  }
  if (prolog.isModule()) {
    prolog.addError(XQueryErrors::unresolvedQName.errorAtLine(_line, _name), exprPlace());
    return;
  }
  auto reference = XQueryQNameReference::qNameReferenceWithString(_name, _line);
  reference->setExprPlace(exprPlace());
  prolog.addQNameReference(reference);
  _qName = reference;
  Ref<NSString> prefix;
  Ref<NSString> localPart;
  XQueryQName::parseQNameString(_name, prefix, localPart);
  const bool hasPrefix = prefix && prefix->length() != 0;
  if (!hasPrefix && localPart && localPart->length() != 0) {
    _expandedName = NSXMLExpandedNameRef(NSStringView(), localPart->view());
  }
}

Ref<XQueryQName> XQueryNameTest::qNameForContext(XQueryContext* context) const {
  if (!isDeferred()) return dyn_cast<XQueryQName>(_qName);
  if (context) {
    return cast<XQueryQNameReference>(_qName)->qNameForContext(*context);
  }
  return nameWithoutNamespace() ? XQueryQName::qnameWithLocalPart(_name, nullptr) : nullptr;
}

bool XQueryNameTest::isValidNode(const NSXMLNode& node, XQueryContext* context) const {
  const bool nameIsKnown = _expandedName && (!isDeferred() || !context);
  if (nameIsKnown) return node.expandedName() == _expandedName.get();
  const Ref<XQueryQName> qName = qNameForContext(context);
  return qName && haveSameURI(node, qName->namespaceURI()) &&
         node.localNameView() == qName->localPart()->view();
}

Value XQueryNameTest::computeValue(XQueryContext&) const {
  return NSNull::null();
}

Ref<XQueryWildCardNameTest> XQueryWildCardNameTest::nameTest(Ref<NSString> prefix,
                                                             Ref<NSString> localName) {
  return make<XQueryWildCardNameTest>(std::move(prefix), std::move(localName));
}

void XQueryWildCardNameTest::bindInfoForProlog(XQueryProlog& prolog) {
  if (!_prefix) return;
  _uri = prolog.namespaceForPrefix(_prefix->view());
  if (_uri) return;
  NSMutableString name;
  name.append(_prefix->view());
  name.appendASCII(":*");
  auto reference = XQueryQNameReference::qNameReferenceWithString(name.string(), _line);
  reference->setExprPlace(exprPlace());
  prolog.addQNameReference(reference);
  _qNameReference = reference;
}

Ref<NSString> XQueryWildCardNameTest::uriForContext(XQueryContext* context) const {
  if (_uri || !_qNameReference || !context) return _uri;
  const Ref<XQueryQName> qName = _qNameReference->qNameForContext(*context);
  return qName ? qName->namespaceURI() : nullptr;
}

bool XQueryWildCardNameTest::isValidNode(const NSXMLNode& node, XQueryContext* context) const {
  if (!node.hasName()) return false;
  if (_uri) {  // by itself, since taking a reference for every node would count it
    if (!haveSameURI(node, _uri)) return false;
  } else if (_prefix) {
    const Ref<NSString> URI = uriForContext(context);
    if (!URI || !haveSameURI(node, URI)) return false;
  }
  return !_localName || node.localNameView() == _localName->view();
}

Value XQueryWildCardNameTest::computeValue(XQueryContext&) const {
  return NSNull::null();
}

}  // namespace xquery

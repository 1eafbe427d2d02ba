#include "Expr/XQueryLeaves.h"

#include "Context/XQueryContextInternal.h"
#include "Platform/Base/Counting.h"
#include "Platform/Base/LastingObjects.h"
#include "Platform/Numbers/NumberText.h"
#include "Prolog/XQueryProlog.h"
#include "Types/XQueryErrors.h"
#include "Types/XQueryNumber.h"
#include "Types/XQueryString.h"
#include "Types/XQueryValues.h"
#include "xquery/Collection.h"
#include "xquery/Number.h"

namespace xquery {

Ref<XQueryLiteral> XQueryLiteral::literalWithValue(Value value) {
  return make<XQueryLiteral>(std::move(value));
}

Ref<XQueryLiteral> XQueryLiteral::stringLiteralWithString(const Ref<NSString>& text) {
  return literalWithValue(XQueryString::stringWithString(*text));
}

Ref<XQueryLiteral> XQueryLiteral::integerLiteralWithString(const Ref<NSString>& digits) {
  NSDecimal value;
  if (!NSDecimal::scan(digits->view(), value)) return nullptr;
  return literalWithValue(XQueryNumber::integerWithDecimal(value.truncated()));
}

Ref<XQueryLiteral> XQueryLiteral::decimalLiteralWithString(const Ref<NSString>& digits) {
  NSDecimal value;
  if (!NSDecimal::scan(digits->view(), value)) return nullptr;
  return literalWithValue(XQueryNumber::numberWithDecimal(std::move(value)));
}

Ref<XQueryLiteral> XQueryLiteral::doubleLiteralWithString(const Ref<NSString>& text) {
  // The scanner only hands over text of double-literal form, so there always is a number.
  double value = 0;
  scanDouble(text->view(), value);
  Ref<XQueryNumber> number = XQueryNumber::numberWithDouble(value);
  return literalWithValue(
      XQueryNumber::isSpecial(number.get()) ? number : XQueryNumber::doubleWithNumber(*number));
}

Ref<NSString> XQueryLiteral::description() const {
  NSMutableString text;
  text.appendASCII("<XQueryLiteral - ");
  text.append(XQueryDescription(literalValue().get())->view());
  text.appendASCII(">");
  return text.string();
}

Ref<XQueryVariable> XQueryVariable::variableWithName(Ref<NSString> name) {
  return make<XQueryVariable>(std::move(name));
}

void XQueryVariable::bindInfoForProlog(XQueryProlog& prolog) {
  _qName = prolog.variableQNameFromString(_name);
  if (_qName) _varID = prolog.localVariableIDForQName(_qName);
}

Value XQueryVariable::computeValue(XQueryContext& context) const {
  auto& dynamic = _internal(context);
  NSObject* value = nullptr;
  if (_varID != 0) {
    // An empty local slot is never looked up among the globals.
    value = dynamic.variableForID(_varID);
  } else if (_qName) {
    value = dynamic.globalForQName(*_qName);
  }
  if (!value)
    return dynamic.fail(XQueryErrors::undefinedVariable.errorAtLine(exprLine(), _name),
                        exprPlace());
  return value;
}

XQueryContextItem* XQueryContextItem::contextItem() {
  static XQueryContextItem* const shared = [] {
    const LastingObjects lasting;
    auto* item = new XQueryContextItem();
    NSCounting::makeImmortal(*item);
    return item;
  }();
  return shared;
}

Value XQueryContextItem::computeValue(XQueryContext& context) const {
  return _internal(context).contextItem();
}

XQueryQNameReference::XQueryQNameReference(Ref<NSString> name, Ref<XQueryQName> qName, int64_t line)
    : XQueryExpr(Kind::QNameReference, line), _name(std::move(name)), _qName(std::move(qName)) {
  if (_name) XQueryQName::parseQNameString(_name, _prefix, _localPart);
}

Ref<XQueryQNameReference> XQueryQNameReference::qNameReferenceWithString(Ref<NSString> name,
                                                                         int64_t line) {
  return make<XQueryQNameReference>(std::move(name), Ref<XQueryQName>(), line);
}

Ref<XQueryQNameReference> XQueryQNameReference::qNameReferenceWithQName(Ref<XQueryQName> qName,
                                                                        int64_t line) {
  return make<XQueryQNameReference>(Ref<NSString>(), std::move(qName), line);
}

Value XQueryQNameReference::computeValue(XQueryContext& context) const {
  return qNameForContext(context);
}

Ref<XQueryQName> XQueryQNameReference::qNameForContext(XQueryContext& context) const {
  if (_qName) return _qName;
  auto& dynamic = _internal(context);
  if (_localPart && _localPart->length() > 0) {
    const Ref<NSString> URI = dynamic.contextNamespaceForPrefix(_prefix->view());
    if (URI || _prefix->length() == 0) {
      // A name resolved here keeps no prefix.
      return XQueryQName::qname(_localPart, URI);
    }
  }
  dynamic.raise(XQueryErrors::unresolvedQName.errorAtLine(exprLine(), _name), exprPlace());
}

}  // namespace xquery

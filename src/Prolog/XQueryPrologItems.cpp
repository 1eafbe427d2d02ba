#include "Prolog/XQueryPrologItems.h"

#include "Prolog/XQueryModules.h"
#include "Prolog/XQueryProlog.h"
#include "Types/MessageText.h"
#include "Types/XQueryErrors.h"

namespace xquery {

namespace {

std::string_view yesOrNo(bool value) {
  return value ? "YES" : "NO";
}

Ref<NSString> joined(const XQueryPrologItemLocations& locations) {
  NSMutableString out;
  if (locations) {
    for (const auto& location : *locations) {
      if (&location != &locations->front()) out.appendASCII(", ");
      appendMessagePart(out, location);
    }
  }
  return out.string();
}

void addItemError(XQueryProlog& prolog, const XQueryErrorText<1>& text,
                  const XQueryPrologItem& item) {
  prolog.addError(text.error(item.description()), item.place());
}

// Registers the namespace of an import and its prefix; false for a prefix bound to another one.
bool addImportedNamespace(XQueryProlog& prolog, const Ref<NSString>& URI,
                          const Ref<NSString>& prefix, const XQueryPrologItem& item) {
  if (!URI) return true;
  const int64_t id = prolog.addNamespace(URI);
  if (!prefix) return true;
  const int64_t boundID = prolog.namespaceIDForPrefix(prefix->view());
  if (boundID != XQueryNamespaceNone && boundID != id) {
    addItemError(prolog, XQueryErrors::prefixReused, item);
    return false;
  }
  prolog.addNamespace(URI, prefix);
  return true;
}

bool isInModuleNamespace(const XQueryProlog& prolog, const Ref<NSString>& prefix) {
  return prolog.namespaceIDForPrefix(prefix->view()) ==
         prolog.namespaceIDForPrefix(prolog.modulePrefix()->view());
}

// A main module may declare functions in the local namespace, in that of XHTML, and in those it
// declared itself.
bool mayDeclareFunctionsIn(const XQueryProlog& prolog, int64_t namespaceID) {
  if (namespaceID == XQueryNamespaceLocal || namespaceID == XQueryNamespaceXHTML) return true;
  return namespaceID >= XQueryNamespaceFirstUser && prolog.namespaceForID(namespaceID);
}

}  // namespace

// --- effects -------------------------------------------------------------------------------------

void XQueryPrologItemModuleNamespace::XQueryUpdateProlog(XQueryProlog& prolog) {
  prolog.setModulePrefix(_prefix);
  prolog.addPrefix(_prefix, _namespaceString);
}

void XQueryPrologItemXMLSpacePerserve::XQueryUpdateProlog(XQueryProlog& prolog) {
  prolog.setXMLSpacePreserve(_value);
}

void XQueryPrologItemDefaultOrder::XQueryUpdateProlog(XQueryProlog& prolog) {
  prolog.setEmptyLeast(_value);
}

void XQueryPrologItemInheritNamespaces::XQueryUpdateProlog(XQueryProlog& prolog) {
  prolog.setInheritNamespaces(_value);
}

void XQueryPrologItemOrdered::XQueryUpdateProlog(XQueryProlog& prolog) {
  prolog.setOrdered(_value);
}

void XQueryPrologItemConstructionPerserve::XQueryUpdateProlog(XQueryProlog& prolog) {
  prolog.setConstructionPreserve(_value);
}

void XQueryPrologItemDefaultCollation::XQueryUpdateProlog(XQueryProlog& prolog) {
  prolog.setDefaultCollation(_collation);
}

void XQueryPrologItemDefaultBaseURI::XQueryUpdateProlog(XQueryProlog& prolog) {
  if (prolog.baseURI()) {
    addItemError(prolog, XQueryErrors::baseURIDefined, *this);
  } else {
    prolog.setBaseURI(_baseURI);
  }
}

void XQueryPrologItemDeclareNamespace::XQueryUpdateProlog(XQueryProlog& prolog) {
  int64_t boundID = prolog.namespaceIDForPrefix(_prefix->view());
  if (boundID == XQueryNamespaceNone && _prefix->view() == "xmlns") boundID = XQueryNamespaceXmlns;
  if (boundID >= XQueryNamespaceFirstUser) {
    addItemError(prolog, XQueryErrors::prefixReused, *this);
  } else if (boundID == XQueryNamespaceXML || boundID == XQueryNamespaceXmlns) {
    prolog.addError(XQueryErrors::reservedPrefix.error(_prefix), place());
  } else {
    prolog.addNamespace(_namespaceString, _prefix);
  }
}

void XQueryPrologItemDefaultElementNamespace::XQueryUpdateProlog(XQueryProlog& prolog) {
  if (_namespaceString->length() == 0) {
    addItemError(prolog, XQueryErrors::invalidNamespaceURI, *this);
  } else {
    prolog.setDefaultElementNamespace(_namespaceString);
  }
}

void XQueryPrologItemDefaultFunctionNamespace::XQueryUpdateProlog(XQueryProlog& prolog) {
  if (_namespaceString->length() == 0) {
    addItemError(prolog, XQueryErrors::invalidNamespaceURI, *this);
  } else {
    prolog.setDefaultFunctionNamespace(_namespaceString);
  }
}

void XQueryPrologItemVariableDeclaration::XQueryUpdateProlog(XQueryProlog& prolog) {
  Ref<NSString> prefix;
  Ref<NSString> localPart;
  XQueryQName::parseQNameString(_varName, prefix, localPart);
  if (prolog.isModule() && !isInModuleNamespace(prolog, prefix)) {
    addItemError(prolog, XQueryErrors::variableOutsideModule, *this);
    return;
  }
  const auto qName = XQueryQName::qname(localPart, prolog.namespaceForPrefix(prefix->view()));
  if (!qName) return;
  if (prolog.variableInfoForQName(qName)) {
    addItemError(prolog, XQueryErrors::variableDeclaredTwice, *this);
    return;
  }
  auto declaration = XQueryVarDecl::varDecl(qName, _type, _expr, prolog);
  declaration->setWritten(_varName, line());
  declaration->setPlace(place());
  prolog.setVariableInfo(std::move(declaration), qName);
}

void XQueryPrologItemFunctionDeclaration::XQueryUpdateProlog(XQueryProlog& prolog) {
  Ref<NSString> prefix;
  Ref<NSString> localPart;
  XQueryQName::parseQNameString(_name, prefix, localPart);
  Ref<NSString> URI;
  if (prolog.isModule()) {
    if (!isInModuleNamespace(prolog, prefix)) {
      addItemError(prolog, XQueryErrors::functionOutsideModule, *this);
      return;
    }
    URI = prolog.namespaceForPrefix(prefix->view());
  } else {
    const int64_t id = prolog.namespaceIDForPrefix(prefix->view());
    if (!mayDeclareFunctionsIn(prolog, id)) {
      addItemError(prolog, XQueryErrors::functionInReservedNamespace, *this);
      return;
    }
    URI = prolog.namespaceForID(id);
  }
  const auto qName = XQueryQName::qname(localPart, URI);
  if (!qName) return;
  const XQueryFunctionSignature signature(qName, _paramList.size());
  if (prolog.functionInfoForSignature(signature)) {
    addItemError(prolog, XQueryErrors::functionDeclaredTwice, *this);
    return;
  }
  auto declaration = XQueryFunctionDecl::functionDecl(qName, _type, _paramList, _expr, prolog);
  declaration->setWritten(_name, line());
  declaration->setPlace(place());
  prolog.setFunctionInfo(std::move(declaration), signature);
}

void XQueryPrologItemDeclareValidationSchemaMode::XQueryUpdateProlog(XQueryProlog& prolog) {
  prolog.setSchemaMode(_mode);
}

void XQueryPrologItemModuleImport::XQueryUpdateProlog(XQueryProlog& prolog) {
  if (!addImportedNamespace(prolog, _namespaceString, _prefix, *this)) return;
  prolog.addModule(this);
}

void XQueryPrologItemSchemaImport::XQueryUpdateProlog(XQueryProlog& prolog) {
  if (!addImportedNamespace(prolog, _namespaceString, _prefix, *this)) return;
  prolog.addSchema(this);
}

void XQueryPrologItemSchemaImportDefaultElement::XQueryUpdateProlog(XQueryProlog& prolog) {
  if (!_locations || _locations->empty()) return;
  prolog.setDefaultSchema(_namespaceString, _locations->front());
}

// --- descriptions --------------------------------------------------------------------------------

Ref<NSString> XQueryPrologItemModuleNamespace::description() const {
  return messageText("prolog item module namespace:\"", _namespaceString, "\" prefix:\"", _prefix,
                     "\" line:", line());
}

Ref<NSString> XQueryPrologItemXMLSpacePerserve::description() const {
  return messageText("prolog item xmlspace:", _value ? "preserve" : "strip", " line:", line());
}

Ref<NSString> XQueryPrologItemDefaultOrder::description() const {
  return messageText("prolog item empty least:", yesOrNo(_value), " line:", line());
}

Ref<NSString> XQueryPrologItemInheritNamespaces::description() const {
  return messageText("prolog item inherit namespaces:", yesOrNo(_value), " line:", line());
}

Ref<NSString> XQueryPrologItemOrdered::description() const {
  return messageText("prolog ordering:", _value ? "ordered" : "unordered", " line:", line());
}

Ref<NSString> XQueryPrologItemConstructionPerserve::description() const {
  return messageText("prolog item declare construction:", yesOrNo(_value), " line:", line());
}

Ref<NSString> XQueryPrologItemDefaultCollation::description() const {
  return messageText("prolog item default collation:\"", _collation, "\" line:", line());
}

Ref<NSString> XQueryPrologItemDefaultBaseURI::description() const {
  return messageText("prolog item base uri:\"", _baseURI, "\" line:", line());
}

Ref<NSString> XQueryPrologItemDeclareNamespace::description() const {
  return messageText("prolog item namespace:\"", _namespaceString, "\" for prefix:\"", _prefix,
                     "\" line:", line());
}

Ref<NSString> XQueryPrologItemDefaultElementNamespace::description() const {
  return messageText("prolog item default element namespace:\"", _namespaceString,
                     "\" line:", line());
}

Ref<NSString> XQueryPrologItemDefaultFunctionNamespace::description() const {
  return messageText("prolog item default function namespace:\"", _namespaceString,
                     "\" line:", line());
}

Ref<NSString> XQueryPrologItemVariableDeclaration::description() const {
  return messageText("prolog item variable declaration:\"", _varName,
                     "\" external:", yesOrNo(_external), " line:", line());
}

Ref<NSString> XQueryPrologItemFunctionDeclaration::description() const {
  return messageText("prolog item function declaration:\"", _name,
                     "\" external:", yesOrNo(_external), " line:", line());
}

Ref<NSString> XQueryPrologItemDeclareValidationSchemaMode::description() const {
  return messageText("prolog item validation:", static_cast<int64_t>(_mode), " line:", line());
}

Ref<NSString> XQueryPrologItemModuleImport::description() const {
  return messageText("prolog item module import:\"", _namespaceString, "\" for prefix:\"", _prefix,
                     "\" at locations:\"", joined(_locations), "\" line:", line());
}

Ref<NSString> XQueryPrologItemSchemaImport::description() const {
  return messageText("prolog item schema import:\"", _namespaceString, "\" for prefix:\"", _prefix,
                     "\" at locations:\"", joined(_locations), "\" line:", line());
}

Ref<NSString> XQueryPrologItemSchemaImportDefaultElement::description() const {
  return messageText("prolog item schema import default element:\"", _namespaceString,
                     "\" at locations:\"", joined(_locations), "\" line:", line());
}

// --- construction --------------------------------------------------------------------------------

XQueryPrologItemModuleNamespace::XQueryPrologItemModuleNamespace(Ref<NSString> namespaceString,
                                                                 Ref<NSString> prefix, int64_t line)
    : XQueryPrologItem(line),
      _namespaceString(std::move(namespaceString)),
      _prefix(std::move(prefix)) {}

Ref<XQueryPrologItemModuleNamespace> XQueryPrologItemModuleNamespace::moduleNamespace(
    Ref<NSString> namespaceString, Ref<NSString> forPrefix, int64_t atLine) {
  return make<XQueryPrologItemModuleNamespace>(std::move(namespaceString), std::move(forPrefix),
                                               atLine);
}

XQueryPrologItemXMLSpacePerserve::XQueryPrologItemXMLSpacePerserve(bool value, int64_t line)
    : XQueryPrologItem(line), _value(value) {}

Ref<XQueryPrologItemXMLSpacePerserve> XQueryPrologItemXMLSpacePerserve::preserve(bool preserve,
                                                                                 int64_t atLine) {
  return make<XQueryPrologItemXMLSpacePerserve>(preserve, atLine);
}

XQueryPrologItemDefaultOrder::XQueryPrologItemDefaultOrder(bool value, int64_t line)
    : XQueryPrologItem(line), _value(value) {}

Ref<XQueryPrologItemDefaultOrder> XQueryPrologItemDefaultOrder::emptyLeast(bool emptyLeast,
                                                                           int64_t atLine) {
  return make<XQueryPrologItemDefaultOrder>(emptyLeast, atLine);
}

XQueryPrologItemInheritNamespaces::XQueryPrologItemInheritNamespaces(bool value, int64_t line)
    : XQueryPrologItem(line), _value(value) {}

Ref<XQueryPrologItemInheritNamespaces> XQueryPrologItemInheritNamespaces::inherit(bool inherit,
                                                                                  int64_t atLine) {
  return make<XQueryPrologItemInheritNamespaces>(inherit, atLine);
}

XQueryPrologItemOrdered::XQueryPrologItemOrdered(bool value, int64_t line)
    : XQueryPrologItem(line), _value(value) {}

Ref<XQueryPrologItemOrdered> XQueryPrologItemOrdered::ordered(bool ordered, int64_t atLine) {
  return make<XQueryPrologItemOrdered>(ordered, atLine);
}

XQueryPrologItemConstructionPerserve::XQueryPrologItemConstructionPerserve(bool value, int64_t line)
    : XQueryPrologItem(line), _value(value) {}

Ref<XQueryPrologItemConstructionPerserve> XQueryPrologItemConstructionPerserve::preserve(
    bool preserve, int64_t atLine) {
  return make<XQueryPrologItemConstructionPerserve>(preserve, atLine);
}

XQueryPrologItemDefaultCollation::XQueryPrologItemDefaultCollation(Ref<NSString> collation,
                                                                   int64_t line)
    : XQueryPrologItem(line), _collation(std::move(collation)) {}

Ref<XQueryPrologItemDefaultCollation> XQueryPrologItemDefaultCollation::collation(
    Ref<NSString> collation, int64_t atLine) {
  return make<XQueryPrologItemDefaultCollation>(std::move(collation), atLine);
}

XQueryPrologItemDefaultBaseURI::XQueryPrologItemDefaultBaseURI(Ref<NSString> baseURI, int64_t line)
    : XQueryPrologItem(line), _baseURI(std::move(baseURI)) {}

Ref<XQueryPrologItemDefaultBaseURI> XQueryPrologItemDefaultBaseURI::baseURI(Ref<NSString> baseURI,
                                                                            int64_t atLine) {
  return make<XQueryPrologItemDefaultBaseURI>(std::move(baseURI), atLine);
}

XQueryPrologItemDeclareNamespace::XQueryPrologItemDeclareNamespace(Ref<NSString> namespaceString,
                                                                   Ref<NSString> prefix,
                                                                   int64_t line)
    : XQueryPrologItem(line),
      _namespaceString(std::move(namespaceString)),
      _prefix(std::move(prefix)) {}

Ref<XQueryPrologItemDeclareNamespace> XQueryPrologItemDeclareNamespace::declareNamespace(
    Ref<NSString> URI, Ref<NSString> forPrefix, int64_t atLine) {
  return make<XQueryPrologItemDeclareNamespace>(std::move(URI), std::move(forPrefix), atLine);
}

XQueryPrologItemDefaultElementNamespace::XQueryPrologItemDefaultElementNamespace(
    Ref<NSString> namespaceString, int64_t line)
    : XQueryPrologItem(line), _namespaceString(std::move(namespaceString)) {}

Ref<XQueryPrologItemDefaultElementNamespace>
XQueryPrologItemDefaultElementNamespace::elementNamespace(Ref<NSString> URI, int64_t atLine) {
  return make<XQueryPrologItemDefaultElementNamespace>(std::move(URI), atLine);
}

XQueryPrologItemDefaultFunctionNamespace::XQueryPrologItemDefaultFunctionNamespace(
    Ref<NSString> namespaceString, int64_t line)
    : XQueryPrologItem(line), _namespaceString(std::move(namespaceString)) {}

Ref<XQueryPrologItemDefaultFunctionNamespace>
XQueryPrologItemDefaultFunctionNamespace::functionNamespace(Ref<NSString> URI, int64_t atLine) {
  return make<XQueryPrologItemDefaultFunctionNamespace>(std::move(URI), atLine);
}

XQueryPrologItemVariableDeclaration::XQueryPrologItemVariableDeclaration(
    Ref<NSString> varName, Ref<XQueryTypeDeclaration> type, Ref<XQueryExpr> expr, bool external,
    int64_t line)
    : XQueryPrologItem(line),
      _varName(std::move(varName)),
      _type(std::move(type)),
      _expr(std::move(expr)),
      _external(external) {}

Ref<XQueryPrologItemVariableDeclaration> XQueryPrologItemVariableDeclaration::variable(
    Ref<NSString> name, Ref<XQueryTypeDeclaration> ofType, Ref<XQueryExpr> forExpr, bool isExternal,
    int64_t atLine) {
  return make<XQueryPrologItemVariableDeclaration>(std::move(name), std::move(ofType),
                                                   std::move(forExpr), isExternal, atLine);
}

XQueryPrologItemFunctionDeclaration::XQueryPrologItemFunctionDeclaration(
    Ref<NSString> name, std::vector<Ref<XQueryParam>> paramList, Ref<XQueryTypeDeclaration> type,
    Ref<XQueryExpr> expr, bool external, int64_t line)
    : XQueryPrologItem(line),
      _name(std::move(name)),
      _paramList(std::move(paramList)),
      _type(std::move(type)),
      _expr(std::move(expr)),
      _external(external) {}

Ref<XQueryPrologItemFunctionDeclaration> XQueryPrologItemFunctionDeclaration::function(
    Ref<NSString> name, std::vector<Ref<XQueryParam>> withParams, Ref<XQueryTypeDeclaration> ofType,
    Ref<XQueryExpr> forExpr, bool isExternal, int64_t atLine) {
  return make<XQueryPrologItemFunctionDeclaration>(std::move(name), std::move(withParams),
                                                   std::move(ofType), std::move(forExpr),
                                                   isExternal, atLine);
}

XQueryPrologItemDeclareValidationSchemaMode::XQueryPrologItemDeclareValidationSchemaMode(
    int32_t mode, int64_t line)
    : XQueryPrologItem(line), _mode(mode) {}

Ref<XQueryPrologItemDeclareValidationSchemaMode>
XQueryPrologItemDeclareValidationSchemaMode::schemaMode(int32_t mode, int64_t atLine) {
  return make<XQueryPrologItemDeclareValidationSchemaMode>(mode, atLine);
}

XQueryPrologItemModuleImport::XQueryPrologItemModuleImport(Ref<NSString> namespaceString,
                                                           XQueryPrologItemLocations locations,
                                                           Ref<NSString> prefix, int64_t line)
    : XQueryPrologItem(line),
      _namespaceString(std::move(namespaceString)),
      _locations(std::move(locations)),
      _prefix(std::move(prefix)) {}

Ref<XQueryPrologItemModuleImport> XQueryPrologItemModuleImport::moduleImport(
    Ref<NSString> namespaceString, XQueryPrologItemLocations atLocations, Ref<NSString> forPrefix,
    int64_t atLine) {
  return make<XQueryPrologItemModuleImport>(std::move(namespaceString), std::move(atLocations),
                                            std::move(forPrefix), atLine);
}

XQueryPrologItemSchemaImport::XQueryPrologItemSchemaImport(Ref<NSString> namespaceString,
                                                           XQueryPrologItemLocations locations,
                                                           Ref<NSString> prefix, int64_t line)
    : XQueryPrologItem(line),
      _namespaceString(std::move(namespaceString)),
      _locations(std::move(locations)),
      _prefix(std::move(prefix)) {}

Ref<XQueryPrologItemSchemaImport> XQueryPrologItemSchemaImport::schemaImport(
    Ref<NSString> namespaceString, XQueryPrologItemLocations atLocations, Ref<NSString> forPrefix,
    int64_t atLine) {
  return make<XQueryPrologItemSchemaImport>(std::move(namespaceString), std::move(atLocations),
                                            std::move(forPrefix), atLine);
}

XQueryPrologItemSchemaImportDefaultElement::XQueryPrologItemSchemaImportDefaultElement(
    Ref<NSString> namespaceString, XQueryPrologItemLocations locations, int64_t line)
    : XQueryPrologItem(line),
      _namespaceString(std::move(namespaceString)),
      _locations(std::move(locations)) {}

Ref<XQueryPrologItemSchemaImportDefaultElement>
XQueryPrologItemSchemaImportDefaultElement::defaultElement(Ref<NSString> namespaceString,
                                                           XQueryPrologItemLocations atLocations,
                                                           int64_t atLine) {
  return make<XQueryPrologItemSchemaImportDefaultElement>(std::move(namespaceString),
                                                          std::move(atLocations), atLine);
}

}  // namespace xquery

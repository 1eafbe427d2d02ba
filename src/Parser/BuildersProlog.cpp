#include "Parser/BuilderSupport.h"
#include "Prolog/XQueryPrologItems.h"

namespace xquery {
namespace {

XQueryPrologItemLocations locationsOf(NSObject* list) {
  if (!list) return std::nullopt;
  return XQVector<NSString>(list);
}

// Hands a declaration to the pool, with its place.
template <class Item>
NSObject* XQItem(Ref<Item> item) {
  XQueryParser::currentParser()->setPlace(*item);
  return XQueryParserAutoRelease(std::move(item));
}

}  // namespace

NSObject* XQMainModule(NSObject* version, NSObject* prologItems, NSObject* body) {
  return XQueryParserAutoRelease(XQueryParsedModule::moduleWithPrologItems(
      XQVector<XQueryPrologItem>(prologItems), XQRef<XQueryExpr>(body), XQRef<NSString>(version)));
}

NSObject* XQLibraryModule(NSObject* version, NSObject* moduleNamespace, NSObject* prologItems) {
  auto items = XQVector<XQueryPrologItem>(prologItems);
  items.insert(items.begin(), XQRef<XQueryPrologItem>(moduleNamespace));
  return XQueryParserAutoRelease(XQueryParsedModule::moduleWithPrologItems(
      std::move(items), nullptr, XQRef<NSString>(version)));
}

NSObject* XQVersion(NSObject* version) {
  return version;
}

NSObject* XQModuleNamespace(NSObject* prefix, NSObject* URI, int64_t line) {
  return XQItem(XQueryPrologItemModuleNamespace::moduleNamespace(XQRef<NSString>(URI),
                                                                 XQRef<NSString>(prefix), line));
}

NSObject* XQProlog(NSObject* setters, NSObject* nonSetters) {
  NSObject* items = XQList(nullptr);
  return XQListAddAll(XQListAddAll(items, setters), nonSetters);
}

NSObject* XQPrologItems(NSObject* item) {
  return XQList(item);
}

NSObject* XQPrologItemsAppend(NSObject* items, NSObject* itemOrItems) {
  return XQListAddAll(items, itemOrItems);
}

NSObject* XQVariableDeclaration(NSObject* name, NSObject* type, NSObject* expr, bool isExternal,
                                int64_t line) {
  return XQItem(XQueryPrologItemVariableDeclaration::variable(
      XQRef<NSString>(name), XQRef<XQueryTypeDeclaration>(type), XQRef<XQueryExpr>(expr),
      isExternal, line));
}

NSObject* XQXMLSpacePreserve(bool preserve, int64_t line) {
  return XQItem(XQueryPrologItemXMLSpacePerserve::preserve(preserve, line));
}

NSObject* XQOrdered(bool ordered, int64_t line) {
  return XQItem(XQueryPrologItemOrdered::ordered(ordered, line));
}

NSObject* XQDeclareConstructionPreserve(bool preserve, int64_t line) {
  return XQItem(XQueryPrologItemConstructionPerserve::preserve(preserve, line));
}

NSObject* XQDeclareDefaultOrderEmptyLeast(bool emptyLeast, int64_t line) {
  return XQItem(XQueryPrologItemDefaultOrder::emptyLeast(emptyLeast, line));
}

NSObject* XQDeclareInheritNamespaces(bool inherit, int64_t line) {
  return XQItem(XQueryPrologItemInheritNamespaces::inherit(inherit, line));
}

NSObject* XQDeclareDefaultCollation(NSObject* URI, int64_t line) {
  XQRemark(XQueryRemark::Matter::DefaultCollation, line, URI);
  return XQItem(XQueryPrologItemDefaultCollation::collation(XQRef<NSString>(URI), line));
}

NSObject* XQDeclareDefaultBaseURI(NSObject* URI, int64_t line) {
  XQRemark(XQueryRemark::Matter::BaseURI, line, URI);
  return XQItem(XQueryPrologItemDefaultBaseURI::baseURI(XQRef<NSString>(URI), line));
}

NSObject* XQDeclareNamespace(NSObject* prefix, NSObject* URI, int64_t line) {
  return XQItem(XQueryPrologItemDeclareNamespace::declareNamespace(XQRef<NSString>(URI),
                                                                   XQRef<NSString>(prefix), line));
}

NSObject* XQDeclareDefaultElementNamespace(NSObject* URI, int64_t line) {
  return XQItem(
      XQueryPrologItemDefaultElementNamespace::elementNamespace(XQRef<NSString>(URI), line));
}

NSObject* XQDeclareDefaultFunctionNamespace(NSObject* URI, int64_t line) {
  return XQItem(
      XQueryPrologItemDefaultFunctionNamespace::functionNamespace(XQRef<NSString>(URI), line));
}

NSObject* XQFunctionDecl(NSObject* name, NSObject* params, NSObject* type, NSObject* expr,
                         bool isExternal, int64_t line) {
  return XQItem(XQueryPrologItemFunctionDeclaration::function(
      XQRef<NSString>(name), XQVector<XQueryParam>(params), XQRef<XQueryTypeDeclaration>(type),
      XQRef<XQueryExpr>(expr), isExternal, line));
}

NSObject* XQDeclareValidationSchemaMode(int32_t mode, int64_t line) {
  return XQItem(XQueryPrologItemDeclareValidationSchemaMode::schemaMode(mode, line));
}

NSObject* XQModuleImport(NSObject* URI, NSObject* locations, NSObject* prefix, int64_t line) {
  return XQItem(XQueryPrologItemModuleImport::moduleImport(
      XQRef<NSString>(URI), locationsOf(locations), XQRef<NSString>(prefix), line));
}

NSObject* XQSchemaImport(NSObject* URI, NSObject* locations, NSObject* prefix, int64_t line) {
  XQRemark(XQueryRemark::Matter::SchemaImport, line, URI);
  return XQItem(XQueryPrologItemSchemaImport::schemaImport(
      XQRef<NSString>(URI), locationsOf(locations), XQRef<NSString>(prefix), line));
}

NSObject* XQSchemaImportDefaultElement(NSObject* URI, NSObject* locations, int64_t line) {
  XQRemark(XQueryRemark::Matter::SchemaImport, line, URI);
  return XQItem(XQueryPrologItemSchemaImportDefaultElement::defaultElement(
      XQRef<NSString>(URI), locationsOf(locations), line));
}

NSObject* XQImportList(NSObject* location) {
  return XQList(location);
}

NSObject* XQImportListAdd(NSObject* locations, NSObject* locationOrLocations) {
  return XQListAddAll(locations, locationOrLocations);
}

NSObject* XQParam(NSObject* name, NSObject* type, int64_t line) {
  return XQAtLine(
      XQueryParam::paramWithName(XQRef<NSString>(name), XQRef<XQueryTypeDeclaration>(type)), line);
}

NSObject* XQParamList(NSObject* param) {
  return XQList(param);
}

NSObject* XQParamListAdd(NSObject* params, NSObject* param) {
  return XQListAdd(params, param);
}

}  // namespace xquery

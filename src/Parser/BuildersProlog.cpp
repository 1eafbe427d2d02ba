#include "Parser/BuilderSupport.h"
#include "Prolog/XQueryPrologItems.h"

namespace xquery {
namespace {

XQueryPrologItemLocations locationsOf(NSObject* list) {
  if (!list) return std::nullopt;
  return XQVector<NSString>(list);
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
  return XQueryParserAutoRelease(XQueryPrologItemModuleNamespace::moduleNamespace(
      XQRef<NSString>(URI), XQRef<NSString>(prefix), line));
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
  return XQueryParserAutoRelease(XQueryPrologItemVariableDeclaration::variable(
      XQRef<NSString>(name), XQRef<XQueryTypeDeclaration>(type), XQRef<XQueryExpr>(expr),
      isExternal, line));
}

NSObject* XQXMLSpacePreserve(bool preserve, int64_t line) {
  return XQueryParserAutoRelease(XQueryPrologItemXMLSpacePerserve::preserve(preserve, line));
}

NSObject* XQOrdered(bool ordered, int64_t line) {
  return XQueryParserAutoRelease(XQueryPrologItemOrdered::ordered(ordered, line));
}

NSObject* XQDeclareConstructionPreserve(bool preserve, int64_t line) {
  return XQueryParserAutoRelease(XQueryPrologItemConstructionPerserve::preserve(preserve, line));
}

NSObject* XQDeclareDefaultOrderEmptyLeast(bool emptyLeast, int64_t line) {
  return XQueryParserAutoRelease(XQueryPrologItemDefaultOrder::emptyLeast(emptyLeast, line));
}

NSObject* XQDeclareInheritNamespaces(bool inherit, int64_t line) {
  return XQueryParserAutoRelease(XQueryPrologItemInheritNamespaces::inherit(inherit, line));
}

NSObject* XQDeclareDefaultCollation(NSObject* URI, int64_t line) {
  XQRemark(XQueryRemark::Matter::DefaultCollation, line, URI);
  return XQueryParserAutoRelease(
      XQueryPrologItemDefaultCollation::collation(XQRef<NSString>(URI), line));
}

NSObject* XQDeclareDefaultBaseURI(NSObject* URI, int64_t line) {
  XQRemark(XQueryRemark::Matter::BaseURI, line, URI);
  return XQueryParserAutoRelease(
      XQueryPrologItemDefaultBaseURI::baseURI(XQRef<NSString>(URI), line));
}

NSObject* XQDeclareNamespace(NSObject* prefix, NSObject* URI, int64_t line) {
  return XQueryParserAutoRelease(XQueryPrologItemDeclareNamespace::declareNamespace(
      XQRef<NSString>(URI), XQRef<NSString>(prefix), line));
}

NSObject* XQDeclareDefaultElementNamespace(NSObject* URI, int64_t line) {
  return XQueryParserAutoRelease(
      XQueryPrologItemDefaultElementNamespace::elementNamespace(XQRef<NSString>(URI), line));
}

NSObject* XQDeclareDefaultFunctionNamespace(NSObject* URI, int64_t line) {
  return XQueryParserAutoRelease(
      XQueryPrologItemDefaultFunctionNamespace::functionNamespace(XQRef<NSString>(URI), line));
}

NSObject* XQFunctionDecl(NSObject* name, NSObject* params, NSObject* type, NSObject* expr,
                         bool isExternal, int64_t line) {
  return XQueryParserAutoRelease(XQueryPrologItemFunctionDeclaration::function(
      XQRef<NSString>(name), XQVector<XQueryParam>(params), XQRef<XQueryTypeDeclaration>(type),
      XQRef<XQueryExpr>(expr), isExternal, line));
}

NSObject* XQDeclareValidationSchemaMode(int32_t mode, int64_t line) {
  return XQueryParserAutoRelease(
      XQueryPrologItemDeclareValidationSchemaMode::schemaMode(mode, line));
}

NSObject* XQModuleImport(NSObject* URI, NSObject* locations, NSObject* prefix, int64_t line) {
  return XQueryParserAutoRelease(XQueryPrologItemModuleImport::moduleImport(
      XQRef<NSString>(URI), locationsOf(locations), XQRef<NSString>(prefix), line));
}

NSObject* XQSchemaImport(NSObject* URI, NSObject* locations, NSObject* prefix, int64_t line) {
  XQRemark(XQueryRemark::Matter::SchemaImport, line, URI);
  return XQueryParserAutoRelease(XQueryPrologItemSchemaImport::schemaImport(
      XQRef<NSString>(URI), locationsOf(locations), XQRef<NSString>(prefix), line));
}

NSObject* XQSchemaImportDefaultElement(NSObject* URI, NSObject* locations, int64_t line) {
  XQRemark(XQueryRemark::Matter::SchemaImport, line, URI);
  return XQueryParserAutoRelease(XQueryPrologItemSchemaImportDefaultElement::defaultElement(
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

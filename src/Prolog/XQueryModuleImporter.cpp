#include "Prolog/XQueryModuleImporter.h"

#include "Prolog/XQueryModules.h"
#include "Prolog/XQueryParsedModule.h"
#include "Prolog/XQueryProlog.h"
#include "Prolog/XQueryPrologItems.h"
#include "Types/XQueryErrors.h"

#include <utility>

namespace xquery {

void XQueryModuleImporter::build(const Ref<XQueryProlog>& prolog) {
  _importers.push_back({prolog});
  while (!_importers.empty()) step();
}

void XQueryModuleImporter::step() {
  Importer& importer = _importers.back();
  if (importer.import == importer.prolog->moduleImports().size()) {
    finish();
  } else {
    resolve(importer);
  }
}

void XQueryModuleImporter::goOn(Importer& importer) {
  ++importer.import;
  importer.nextLocation = 0;
}

// One attempt at the import at hand.
void XQueryModuleImporter::resolve(Importer& importer) {
  XQueryProlog& prolog = *importer.prolog;
  const XQueryPrologItemModuleImport& item = *prolog.moduleImports()[importer.import];
  const auto fail = [&] {
    prolog.addError(XQueryErrors::moduleNotFound.error(item.description()));
  };
  if (importer.nextLocation == 0) {
    const int64_t id = prolog.namespaceID(item.namespaceString());
    if (const XQueryProlog* module = prolog.modules().prologForID(id)) {
      prolog._importDeclarations(*module);
      return goOn(importer);
    }
  }
  const XQueryPrologItemLocations& locations = item.locations();
  if (locations && importer.nextLocation < locations->size()) {
    return tryLocation(prolog, (*locations)[importer.nextLocation++]);
  }
  fail();
  // Without any location clause the failure is recorded twice.
  if (!locations) fail();
  goOn(importer);
}

// Starts building the module, if there is one; whether it will do is seen when it is finished.
void XQueryModuleImporter::tryLocation(XQueryProlog& importer, const Ref<NSString>& location) {
  const auto source = importer.modules().sourceAtLocation(location);
  if (!source) return;
  const auto [module, errors] = XQueryParseModule(source);
  if (!module || !errors.empty()) return;
  auto prolog = make<XQueryProlog>(Ref<XQueryModules>(&importer.modules()));
  prolog->_start(module->prologItems(), location, module->version());
  _importers.push_back({std::move(prolog)});
}

void XQueryModuleImporter::finish() {
  const Ref<XQueryProlog> prolog = std::move(_importers.back().prolog);
  _importers.pop_back();
  prolog->_bindInfo();
  if (_importers.empty() || !prolog->isModule() || !prolog->errors().empty()) return;
  Importer& importer = _importers.back();
  importer.prolog->_importDeclarations(*prolog);
  goOn(importer);
}

}  // namespace xquery

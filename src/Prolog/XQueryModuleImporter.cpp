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
  importer.reasons.clear();
}

// One attempt at the import at hand.
void XQueryModuleImporter::resolve(Importer& importer) {
  XQueryProlog& prolog = *importer.prolog;
  const XQueryPrologItemModuleImport& item = *prolog.moduleImports()[importer.import];
  if (importer.nextLocation == 0) {
    const int64_t id = prolog.namespaceID(item.namespaceString());
    if (const XQueryProlog* module = prolog.modules().prologForID(id)) {
      prolog._importDeclarations(*module, item.place());
      return goOn(importer);
    }
  }
  const XQueryPrologItemLocations& locations = item.locations();
  if (locations && importer.nextLocation < locations->size()) {
    return tryLocation(importer, (*locations)[importer.nextLocation++]);
  }
  const auto fail = [&] {
    prolog.addError(XQueryErrors::moduleNotFound.error(item.description()), item.place());
  };
  fail();
  // Without any location clause the failure is recorded twice.
  if (!locations) fail();
  for (const auto& reason : importer.reasons) prolog.addError(reason);
  goOn(importer);
}

// Starts building the module, if there is one; whether it will do is seen when it is finished.
void XQueryModuleImporter::tryLocation(Importer& importer, const Ref<NSString>& location) {
  XQueryModules& modules = importer.prolog->modules();
  const auto URL = importer.prolog->URLForLocation(location);
  const auto source = URL ? modules.sourceAtURL(URL) : Ref<NSString>();
  if (!source) return;
  const auto [module, errors] = XQueryParseModule(source, URL->absoluteString(), modules.places());
  if (!errors.empty()) return noteReasons(importer, errors, *URL);
  if (!module) return;
  auto prolog = make<XQueryProlog>(Ref<XQueryModules>(&modules));
  prolog->_start(module->prologItems(), location, module->version(), URL);
  prolog->setRemarks(module->remarks());
  _importers.push_back({std::move(prolog)});
}

void XQueryModuleImporter::finish() {
  const Ref<XQueryProlog> prolog = std::move(_importers.back().prolog);
  _importers.pop_back();
  prolog->_bindInfo();
  if (_importers.empty()) return;
  Importer& importer = _importers.back();
  if (!prolog->errors().empty()) {
    return noteReasons(importer, prolog->errors(), *prolog->moduleURL());
  }
  if (!prolog->isModule()) return;
  const XQueryPrologItem& item = *importer.prolog->moduleImports()[importer.import];
  importer.prolog->_importDeclarations(*prolog, item.place());
  goOn(importer);
}

// The first error of a module, and behind an import that failed the reasons for that: they are
// errors of other modules.
void XQueryModuleImporter::noteReasons(Importer& importer,
                                       const std::vector<Ref<XQueryError>>& errors,
                                       const NSURL& URL) {
  constexpr size_t mostReasons = 100;
  bool isFirst = true;
  for (const auto& error : errors) {
    if (importer.reasons.size() == mostReasons || (!isFirst && !error->moduleURL())) return;
    importer.reasons.push_back(isFirst ? XQueryError::errorInModule(*error, URL.absoluteString())
                                       : error);
    isFirst = false;
  }
}

}  // namespace xquery

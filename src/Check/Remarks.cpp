// What the parser noted of each module, and the imports.
#include "Check/Checking.h"
#include "Prolog/XQueryProlog.h"
#include "Prolog/XQueryPrologItems.h"
#include "Prolog/XQueryRemark.h"

#include <string>
#include <unordered_set>
#include <vector>

namespace xquery {
namespace {

using ID = XQueryWarningID;
using Matter = XQueryRemark::Matter;

std::string textOf(const Ref<NSString>& text) {
  return text ? text->utf8() : std::string();
}

// Whether the result may begin with an element that the query makes.
bool mayMakeElements(const XQueryChecking& checking) {
  if (checking.program.bodies().empty()) return false;
  const XQueryProgramBody& body = checking.program.bodies().back();
  if (body.function || body.variable || body.place >= checking.program.placeCount()) return false;
  const XQueryFacts& facts = checking.factsOf(body.place);
  return facts.does(XQueryDeeds::MakesNodes) &&
         facts.mayBe(XQueryItems::Element | XQueryItems::Document);
}

void tell(XQueryChecking& checking, const XQueryProlog& module, const XQueryRemark& remark) {
  const std::string first = textOf(remark.first);
  const auto warn = [&](ID id, XQueryChecking::Parts parts = {}) {
    checking.warnAt(module, {remark.line, remark.place}, id, parts);
  };
  switch (remark.matter) {
    case Matter::EndTag:
      return warn(ID::EndTag, {first, textOf(remark.second)});
    case Matter::EnclosedNamespace:
      return warn(ID::EnclosedNamespace, {first});
    case Matter::LineEndReference:
      return warn(ID::LineEndReference);
    case Matter::TypeInTest:
      return warn(ID::TypeInTest, {first});
    case Matter::SchemaTest:
      return warn(ID::SchemaTest, {first});
    case Matter::Validate:
      return warn(ID::Validate);
    case Matter::SchemaImport:
      return warn(ID::SchemaImport, {first});
    case Matter::DefaultCollation:
      if (!XQueryIsCodepointCollation(first)) warn(ID::Collation, {"\"" + first + "\""});
      return;
    case Matter::BaseURI:
      if (&module == &checking.main && mayMakeElements(checking)) warn(ID::BaseURI);
      return;
  }
}

// A module that has another namespace than its import names is imported all the same.
void checkImports(XQueryChecking& checking, const XQueryProlog& module) {
  std::unordered_set<std::string> namespaces;
  for (const XQueryProlog* imported : module.importedModules()) {
    namespaces.insert(textOf(imported->namespaceForPrefix(imported->modulePrefix()->view())));
  }
  for (const auto& import : module.moduleImports()) {
    if (namespaces.contains(textOf(import->namespaceString()))) continue;
    checking.warnAt(module, {import->line(), import->place()}, ID::ModuleNamespace,
                    {textOf(import->namespaceString())});
  }
}

}  // namespace

void XQueryCheckRemarks(XQueryChecking& checking, const XQueryUses&) {
  std::unordered_set<const XQueryProlog*> seen{&checking.main};
  std::vector<const XQueryProlog*> waiting{&checking.main};
  while (!waiting.empty()) {
    const XQueryProlog& module = *waiting.back();
    waiting.pop_back();
    for (const XQueryRemark& remark : module.remarks()) tell(checking, module, remark);
    checkImports(checking, module);
    for (const XQueryProlog* imported : module.importedModules()) {
      if (seen.insert(imported).second) waiting.push_back(imported);
    }
  }
}

}  // namespace xquery

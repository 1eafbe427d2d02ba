// Global variables before the body runs.
//
// A module's variables get their values before those of whoever imports it, each module's once and
// in the order of the imports, and in the static context of that module. So an initializer finds
// the variables that it reads, and the functions that it calls find theirs, also those of a module
// that only another module imports. Where modules import each other, the one that is met first
// waits for the other.
#include "Context/XQueryGlobals.h"

#include "Context/StackGuard.h"
#include "Context/XQueryContextInternal.h"
#include "Prolog/XQueryDeclarations.h"
#include "Prolog/XQueryProlog.h"
#include "Types/XQueryErrors.h"

#include <unordered_set>

namespace xquery {
namespace {

// At the declaration.
template <class Declaration>
[[noreturn]] void raiseUnresolved(const XQueryErrorText<1>& text, const Declaration& declaration,
                                  XQueryContextInternal& context) {
  context.raise(text.error(declaration.name()->XQueryStringValue()), declaration.place());
}

void evaluateVariable(const XQueryVarDecl& declaration, XQueryContext& publicContext) {
  constexpr auto& unresolved = XQueryErrors::unresolvedExternalVariable;
  auto& context = _internal(publicContext);
  const XQueryQName& name = *declaration.name();
  if (declaration.isExternal()) {
    if (!context.globalForQName(name)) raiseUnresolved(unresolved, declaration, context);
    return;
  }
  XQueryProlog* const prolog = context.activeProlog();
  const bool ordered = context.ordered();
  context.setActiveProlog(&declaration.prolog());
  context.setOrdered(declaration.prolog().ordered());
  const Value value = declaration.expr()->evaluateWithContext(publicContext);
  context.setActiveProlog(prolog);
  context.setOrdered(ordered);
  if (XQueryHasFailed(value, publicContext)) context.throwFailure();
  if (!value) raiseUnresolved(unresolved, declaration, context);
  context.setGlobal(value, declaration.name());
}

void checkFunction(const XQueryFunctionDecl& declaration, XQueryContextInternal& context) {
  const XQueryQName& name = *declaration.name();
  if (declaration.isExternal() && !context.XQueryExternalFunctionForQName(name)) {
    raiseUnresolved(XQueryErrors::unresolvedExternalFunction, declaration, context);
  }
}

void evaluateVariablesOf(const XQueryProlog& module, XQueryContext& context) {
  for (const Value& declaration : module.declarations()) {
    const auto* variable = dyn_cast<XQueryVarDecl>(declaration);
    if (variable && &variable->prolog() == &module) evaluateVariable(*variable, context);
  }
}

// What the main module imports, directly or not.
class ImportedVariables {
 public:
  ImportedVariables(const XQueryProlog& main, XQueryContext& context)
      : _context(context), _seen{&main} {}

  void evaluateImportsOf(const XQueryProlog& importer) {
    XQueryCheckStack(_context);
    for (const XQueryProlog* module : importer.importedModules()) {
      if (!_seen.insert(module).second) continue;
      evaluateImportsOf(*module);
      evaluateVariablesOf(*module, _context);
    }
  }

 private:
  XQueryContext& _context;
  std::unordered_set<const XQueryProlog*> _seen;
};

}  // namespace

void XQuerySetConstants(const XQueryVariables& constants, const XQueryProlog& prolog,
                        XQueryContext& context) {
  for (const auto& [name, value] : constants) {
    const auto text = NSString::stringWithUTF8(name);
    if (!text || !value) continue;
    if (const auto qName = prolog.variableQNameFromString(text)) {
      _internal(context).setGlobal(value, qName);
    }
  }
}

void XQueryEvaluateDeclarations(const XQueryProlog& prolog, XQueryContext& context) {
  if (!prolog.importedModules().empty()) {
    ImportedVariables(prolog, context).evaluateImportsOf(prolog);
  }
  for (const Value& declaration : prolog.declarations()) {
    if (const auto* variable = dyn_cast<XQueryVarDecl>(declaration)) {
      if (&variable->prolog() == &prolog) evaluateVariable(*variable, context);
    } else if (const auto* function = dyn_cast<XQueryFunctionDecl>(declaration)) {
      checkFunction(*function, _internal(context));
    }
  }
}

}  // namespace xquery

// Global variables before the body runs.
//
// A prolog's list of declarations holds its own and those of the modules it imports, each evaluated
// in the static context of the module that declared it. A module that only another module imports
// has no place in the main module's list, yet the functions of its importer use its variables: they
// get their values first of all, a module's own imports before the module.
#include "Context/XQueryGlobals.h"

#include "Context/StackGuard.h"
#include "Context/XQueryContextInternal.h"
#include "Prolog/XQueryDeclarations.h"
#include "Prolog/XQueryProlog.h"
#include "Types/XQueryErrors.h"

#include <unordered_set>

namespace xquery {
namespace {

[[noreturn]] void raiseUnresolved(const XQueryErrorText<1>& text, const XQueryQName& name,
                                  XQueryContextInternal& context) {
  context.raise(text.error(name.XQueryStringValue()));
}

void evaluateVariable(const XQueryVarDecl& declaration, XQueryContext& publicContext) {
  constexpr auto& unresolved = XQueryErrors::unresolvedExternalVariable;
  auto& context = publicContext._internal();
  const XQueryQName& name = *declaration.name();
  if (declaration.isExternal()) {
    if (!context.globalForQName(name)) raiseUnresolved(unresolved, name, context);
    return;
  }
  XQueryProlog* const prolog = context.activeProlog();
  const bool ordered = context.ordered();
  context.setActiveProlog(&declaration.prolog());
  context.setOrdered(declaration.prolog().ordered());
  const Value value = declaration.expr()->evaluateWithContext(publicContext);
  context.setActiveProlog(prolog);
  context.setOrdered(ordered);
  if (!value) raiseUnresolved(unresolved, name, context);
  context.setGlobal(value, declaration.name());
}

void checkFunction(const XQueryFunctionDecl& declaration, XQueryContextInternal& context) {
  const XQueryQName& name = *declaration.name();
  if (declaration.isExternal() && !context.XQueryExternalFunctionForQName(name)) {
    raiseUnresolved(XQueryErrors::unresolvedExternalFunction, name, context);
  }
}

const XQueryProlog& ownerOf(const Value& declaration) {
  if (const auto* variable = dyn_cast<XQueryVarDecl>(declaration)) return variable->prolog();
  return cast<XQueryFunctionDecl>(declaration)->prolog();
}

// The variables of the modules that the main module does not import itself. Modules are found by
// the declarations taken over from them: one that nothing was taken over from cannot be used.
class IndirectVariables {
 public:
  IndirectVariables(const XQueryProlog& main, XQueryContext& context)
      : _main(main), _context(context), _seen{&main} {}

  void evaluateImportsOf(const XQueryProlog& importer) {
    XQueryCheckStack(_context);
    for (const Value& declaration : importer.declarations()) {
      const XQueryProlog& module = ownerOf(declaration);
      if (!_seen.insert(&module).second) continue;
      evaluateImportsOf(module);
      evaluateVariablesOf(module);
    }
  }

 private:
  void evaluateVariablesOf(const XQueryProlog& module) {
    for (const Value& declaration : module.declarations()) {
      const auto* variable = dyn_cast<XQueryVarDecl>(declaration);
      if (!variable || &variable->prolog() != &module) continue;
      const bool hasItsPlace = _main.variableInfoForQName(variable->name()) == variable;
      if (!hasItsPlace) evaluateVariable(*variable, _context);
    }
  }

  const XQueryProlog& _main;
  XQueryContext& _context;
  std::unordered_set<const XQueryProlog*> _seen;
};

}  // namespace

void XQuerySetConstants(const XQueryConstants& constants, const XQueryProlog& prolog,
                        XQueryContext& context) {
  for (const auto& [name, value] : constants) {
    const auto text = NSString::stringWithUTF8(name);
    if (!text || !value) continue;
    if (const auto qName = prolog.variableQNameFromString(text)) {
      context._internal().setGlobal(value, qName);
    }
  }
}

void XQueryEvaluateDeclarations(const XQueryProlog& prolog, XQueryContext& context) {
  IndirectVariables(prolog, context).evaluateImportsOf(prolog);
  for (const Value& declaration : prolog.declarations()) {
    if (const auto* variable = dyn_cast<XQueryVarDecl>(declaration)) {
      evaluateVariable(*variable, context);
    } else if (const auto* function = dyn_cast<XQueryFunctionDecl>(declaration)) {
      checkFunction(*function, context._internal());
    }
  }
}

}  // namespace xquery

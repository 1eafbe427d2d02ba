// The declarations of a prolog: their tables, the import of those of library modules, the numbering
// of local variables, and the binding pass over the declarations.
#include "Platform/Base/WorkMeter.h"
#include "Prolog/XQueryDeclarations.h"
#include "Prolog/XQueryProlog.h"
#include "Types/XQueryErrors.h"

namespace xquery {

// --- tables --------------------------------------------------------------------------------------

XQueryVarDecl* XQueryProlog::variableInfoForQName(const Ref<XQueryQName>& qName) const {
  const auto found = _variables.find(qName);
  return found == _variables.end() ? nullptr : found->second.get();
}

void XQueryProlog::setVariableInfo(Ref<XQueryVarDecl> declaration,
                                   const Ref<XQueryQName>& forQName) {
  _declarations.push_back(declaration);
  _variables.insert_or_assign(forQName, std::move(declaration));
}

XQueryFunctionDecl* XQueryProlog::functionInfoForSignature(
    const XQueryFunctionSignature& signature) const {
  const auto found = _functions.find(signature);
  return found == _functions.end() ? nullptr : found->second.get();
}

void XQueryProlog::setFunctionInfo(Ref<XQueryFunctionDecl> declaration,
                                   const XQueryFunctionSignature& forSignature) {
  _declarations.push_back(declaration);
  _functions.insert_or_assign(forSignature, std::move(declaration));
}

// --- local variables -----------------------------------------------------------------------------

int64_t XQueryProlog::localVariableIDForQName(const Ref<XQueryQName>& qName) const {
  const auto found = _localVariableIDs.find(qName);
  if (found == _localVariableIDs.end() || found->second >= _nextLocalVariableID) return 0;
  return found->second;
}

int64_t XQueryProlog::newLocalVariableIDForQName(const Ref<XQueryQName>& qName) {
  int64_t& recordedID = _localVariableIDs[qName];
  _localVariableLog.push_back({qName, recordedID});
  recordedID = _nextLocalVariableID++;
  return recordedID;
}

void XQueryProlog::restoreLocalScope(const LocalScope& scope) {
  while (_localVariableLog.size() > scope.namedCount) {
    const NamedLocal& last = _localVariableLog.back();
    if (last.replacedID == 0) {
      _localVariableIDs.erase(last.name);
    } else {
      _localVariableIDs[last.name] = last.replacedID;
    }
    _localVariableLog.pop_back();
  }
  _nextLocalVariableID = scope.nextID;
}

// --- imports -------------------------------------------------------------------------------------

// Copies what the module declared in its own namespace, and nothing that it imported itself. A
// module that imports itself finds each of its names taken, so the walk never sees its own growth.
void XQueryProlog::_importDeclarations(const XQueryProlog& module, XQueryPlaceNumber at) {
  // Each name of each import may be an error: of two short texts more than any memory holds.
  constexpr size_t mostErrors = 100'000;
  if (!module.isModule()) return;
  _importedModules.push_back(&module);
  const int64_t moduleID = module.namespaceIDForPrefix(module._modulePrefix->view());
  const auto isOwn = [&](const XQueryQName& name) {
    return module.namespaceID(name.namespaceURI()) == moduleID;
  };
  WorkPacer pacer;
  for (size_t index = 0; index < module._declarations.size(); ++index) {
    if (_errors.size() >= mostErrors) return;
    pacer.turn();
    const Value declaration = module._declarations[index];
    if (auto* variable = dyn_cast<XQueryVarDecl>(declaration)) {
      const auto& name = variable->name();
      if (!isOwn(*name)) continue;
      if (variableInfoForQName(name)) {
        addError(XQueryErrors::duplicateVariable.error(name->XQueryStringValue()), at);
      } else {
        setVariableInfo(variable, name);
      }
    } else if (auto* function = dyn_cast<XQueryFunctionDecl>(declaration)) {
      const auto& name = function->name();
      if (!isOwn(*name)) continue;
      const XQueryFunctionSignature signature(name, function->params().size());
      if (functionInfoForSignature(signature)) {
        addError(XQueryErrors::duplicateFunction.error(name->XQueryStringValue()), at);
      } else {
        setFunctionInfo(function, signature);
      }
    }
  }
}

// --- binding -------------------------------------------------------------------------------------

// Local variable IDs start at 1 in every declaration, and no name of one is visible in the next:
// otherwise a name left over from the last body would pass for a parameter given twice.
void XQueryProlog::_bindInfo() {
  for (size_t index = 0; index < _declarations.size(); ++index) {
    checkWork();
    _nextLocalVariableID = 1;
    const LocalScope scope = localScope();
    const Value declaration = _declarations[index];
    bindDeclaration(*declaration);
    restoreLocalScope(scope);
  }
}

// What was imported has been bound in its own module.
void XQueryProlog::bindDeclaration(NSObject& declaration) {
  XQueryExpr* expr = nullptr;
  if (auto* variable = dyn_cast<XQueryVarDecl>(&declaration)) {
    if (variable->isExternal() || &variable->prolog() != this) return;
    expr = variable->expr();
  } else if (auto* function = dyn_cast<XQueryFunctionDecl>(&declaration)) {
    if (function->isExternal() || &function->prolog() != this) return;
    for (const auto& param : function->params()) param->bindInfoForProlog(*this);
    expr = function->expr();
  }
  if (expr) expr->bindInfoForProlog(*this);
}

}  // namespace xquery

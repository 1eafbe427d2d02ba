// Variables that nobody reads and functions that nobody calls.
//
// The variable of a for clause and a parameter are left alone: going round is a use, and a
// parameter belongs to those who call. So is a name that begins with "_", and what is traced on the
// way.
#include "Check/Checking.h"
#include "Check/Uses.h"
#include "Expr/Clauses/XQueryFLWOR.h"
#include "Expr/Clauses/XQueryQuantified.h"
#include "Functions/XQueryFunctionCall.h"
#include "Platform/Base/WorkMeter.h"
#include "Prolog/XQueryDeclarations.h"
#include "Prolog/XQueryProlog.h"

#include <string>
#include <unordered_set>
#include <vector>

namespace xquery {
namespace {

using ID = XQueryWarningID;

class Unused {
 public:
  Unused(XQueryChecking& checking, const XQueryUses& uses) : _checking(checking), _uses(uses) {}

  void run() {
    WorkPacer pacer;
    for (XQueryPlaceID place = 0; place < _checking.program.placeCount(); ++place) {
      pacer.turn();
      if (const auto* clause = _checking.as<XQueryBindingExpr>(place)) lookAtClause(place, *clause);
      const auto* call = _checking.as<XQueryFunctionCall>(place);
      if (call && !call->builtIn() && !call->functionDecl()) _missed.insert(call->name()->utf8());
    }
    lookAtGlobals();
    // A library module is there for others to call.
    if (!_checking.main.isModule()) lookAtFunctions();
  }

 private:
  static bool isMeant(const Ref<NSString>& name) {
    const NSStringView text = name->view();
    const auto colon = text.find(u':');
    const uint32_t start = colon == NSStringView::notFound ? 0 : colon + 1;
    return start < text.length() && text[start] == u'_';
  }

  void lookAtClause(XQueryPlaceID place, const XQueryBindingExpr& clause) {
    if (const auto* forExpr = dyn_cast<XQueryForExpr>(&clause)) {
      lookAtVariable(place, forExpr->posVarName(), forExpr->posVarID());
    } else if (!_checking.factsOf(place).does(XQueryDeeds::Traces) && !asksForItemsOnly(place)) {
      lookAtVariable(place, clause.varName(), clause.varID());
    }
  }

  // "some $x in ... satisfies true()" asks whether there is anything.
  bool asksForItemsOnly(XQueryPlaceID clause) const {
    if (_checking.at(clause).expr->kind() != Kind::QuantifiedItem) return false;
    const XQueryPlaceID whole = _checking.at(clause).parent;
    const XQueryPlaceID condition = _checking.program.part(whole, XQueryRole::Satisfies);
    return condition != XQueryNoPlace && _checking.functionCalledIn(condition) == "true";
  }

  void lookAtVariable(XQueryPlaceID place, const Ref<NSString>& name, int64_t varID) {
    if (varID == 0 || !name || name->length() == 0 || isMeant(name)) return;
    if (!_uses.readsOf(place, varID).empty()) return;
    _checking.warn(place, ID::UnusedVariable, {name->utf8()}, name);
  }

  // Of the main module: those of others may be for their importers.
  void lookAtGlobals() {
    if (_checking.main.isModule()) return;
    for (const Value& declaration : _checking.main.declarations()) {
      const auto* variable = dyn_cast<XQueryVarDecl>(declaration);
      if (!variable || &variable->prolog() != &_checking.main) continue;
      const Ref<NSString>& name = variable->writtenName();
      if (!name || isMeant(name) || !_uses.readsOf(variable).empty()) continue;
      const auto* body = _checking.bodyOf(variable);
      if (body && _checking.factsOf(body->place).does(XQueryDeeds::Traces)) continue;
      _checking.warnAt(_checking.main, {variable->line(), variable->place()}, ID::UnusedVariable,
                       {name->utf8()}, name);
    }
  }

  // What is called from the body of the query or the value of a variable, directly or not.
  std::unordered_set<const XQueryFunctionDecl*> reachedFunctions() const {
    const XQueryProgram& program = _checking.program;
    std::unordered_set<const XQueryFunctionDecl*> reached;
    std::vector<const XQueryProgramBody*> waiting;
    for (const XQueryProgramBody& body : program.bodies()) {
      if (!body.function) waiting.push_back(&body);
    }
    WorkPacer pacer;
    while (!waiting.empty()) {
      const XQueryProgramBody& body = *waiting.back();
      waiting.pop_back();
      const bool isThere = body.place < program.placeCount();
      const XQueryPlaceID end = isThere ? program[body.place].end : body.place;
      for (XQueryPlaceID place = body.place; place < end; ++place) {
        pacer.turn();
        const auto* call = _checking.as<XQueryFunctionCall>(place);
        const auto* function = call ? call->functionDecl() : nullptr;
        if (!function || !reached.insert(function).second) continue;
        if (const auto* called = _checking.bodyOf(function)) waiting.push_back(called);
      }
    }
    return reached;
  }

  void lookAtFunctions() {
    const auto reached = reachedFunctions();
    for (const Value& declaration : _checking.main.declarations()) {
      const auto* function = dyn_cast<XQueryFunctionDecl>(declaration);
      if (!function || &function->prolog() != &_checking.main || function->isExternal()) continue;
      const Ref<NSString>& name = function->writtenName();
      if (!name || isMeant(name) || reached.contains(function)) continue;
      if (_missed.contains(name->utf8())) continue;
      _checking.warnAt(_checking.main, {function->line(), function->place()}, ID::UnusedFunction,
                       {name->utf8()}, name);
    }
  }

  XQueryChecking& _checking;
  const XQueryUses& _uses;
  // Calls that lead nowhere, mostly for a wrong number of arguments: their functions count as
  // called.
  std::unordered_set<std::string> _missed;
};

}  // namespace

void XQueryCheckUnused(XQueryChecking& checking, const XQueryUses& uses) {
  Unused(checking, uses).run();
}

}  // namespace xquery

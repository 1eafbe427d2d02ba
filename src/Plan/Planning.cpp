#include "Plan/Planning.h"

#include "Expr/XQueryLeaves.h"
#include "Functions/XQueryFunctionCall.h"
#include "Plan/Rules.h"
#include "Prolog/XQueryDeclarations.h"

#include <algorithm>

namespace xquery {
namespace {

// Whether a call may hand on items of its arguments.
bool handsOnArguments(const XQueryFunctionCall& call) {
  const auto* builtIn = call.builtIn();
  if (!builtIn) return true;
  constexpr XQueryItemKinds handedOn = XQueryBuiltInFunction::OfFirst |
                                       XQueryBuiltInFunction::OfAll |
                                       XQueryBuiltInFunction::AtomizedFirst | XQueryItems::Other;
  return (builtIn->row().answer.kinds & handedOn) != 0 ||
         builtIn->row().has(XQueryBuiltInFunction::Traces);
}

}  // namespace

XQueryPlanning::XQueryPlanning(XQueryProgram& ofProgram)
    : program(ofProgram), facts(ofProgram), _states(ofProgram.placeCount()) {
  for (const XQueryProgramBody& body : program.bodies()) {
    XQueryVariableSet parameters;
    if (body.function) {
      for (const auto& param : body.function->params()) parameters.add(param->varID());
    }
    XQueryVariableSet unset;
    const XQueryPlaceID end = body.place < program.placeCount() ? program[body.place].end : 0;
    for (XQueryPlaceID place = body.place; place < end; ++place) {
      const auto* variable = dyn_cast<XQueryVariable>(program[place].expr);
      if (!variable || facts.isSurelySet(place)) continue;
      XQueryVariableSet read;
      read.add(variable->varID());
      const bool isParameter = program[place].binder == XQueryNoPlace && parameters.holds(read);
      if (!isParameter) unset.add(read);
    }
    _unset.push_back(unset);
  }
  shareFrame();
}

// The body of the query and the global variables have one frame: what one of them leaves, another
// one may read.
void XQueryPlanning::shareFrame() {
  XQueryVariableSet shared;
  for (size_t body = 0; body < _unset.size(); ++body) {
    if (!program.bodies()[body].function) shared.add(_unset[body]);
  }
  for (size_t body = 0; body < _unset.size(); ++body) {
    if (!program.bodies()[body].function) _unset[body] = shared;
  }
}

bool XQueryPlanning::showsLeftovers(const XQueryVariableSet& variables, XQueryPlaceID place) const {
  const auto body = static_cast<size_t>(&program.bodyOf(place) - program.bodies().data());
  return _unset[body].meets(variables);
}

bool XQueryPlanning::showsIdentity(XQueryPlaceID place) const {
  for (int level = 0; place != XQueryNoPlace && level < mostLevels; ++level) {
    const XQueryPlace& at = program[place];
    // The results of a path hold each object once, atomic ones as well.
    if (at.role == XQueryRole::Step) return true;
    if (!XQueryTraitsOf(at.role).handsOn) return false;
    place = at.parent;
    if (at.role != XQueryRole::Arguments) continue;
    const auto* call = dyn_cast<XQueryFunctionCall>(program[place].expr);
    if (call && !handsOnArguments(*call)) return false;
  }
  return true;
}

void XQueryPlanning::note(XQueryPlaceID place, bool isRefusal, std::string_view text) {
  if (_notes) _notes->push_back({place, _rule, isRefusal, text.empty() ? _rule->summary : text});
}

void XQueryPlanning::wrap(XQueryPlaceID place, Ref<XQueryExpr> by, std::string_view reason) {
  program.replace(place, std::move(by));
  _states[place] = State::Wrapped;
  choose(place, reason);
}

void XQueryPlanning::replace(XQueryPlaceID place, Ref<XQueryExpr> by, std::string_view reason) {
  choose(place, reason);
  program.replace(place, std::move(by));
  leaveOut(place);
}

void XQueryPlanning::leaveOut(XQueryPlaceID place) {
  std::fill(_states.begin() + place, _states.begin() + program[place].end, State::Gone);
}

}  // namespace xquery

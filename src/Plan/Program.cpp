#include "Plan/Program.h"

#include "Expr/Clauses/XQueryFLWOR.h"
#include "Expr/Clauses/XQueryQuantified.h"
#include "Expr/Paths/XQueryPath.h"
#include "Expr/XQueryBinding.h"
#include "Expr/XQueryLeaves.h"
#include "Platform/Base/WorkMeter.h"
#include "Prolog/XQueryDeclarations.h"
#include "Prolog/XQueryProlog.h"

#include <algorithm>
#include <unordered_set>
#include <utility>

namespace xquery {

// Lists the places of one body after another.
class XQueryProgramReader final : public XQueryPartVisitor {
 public:
  explicit XQueryProgramReader(XQueryProgram& program) : _program(program) {}

  void read(XQueryProgramBody& body) {
    _binders.clear();
    _bodyIsOrdered = body.prolog->ordered();
    body.place = nextPlace();
    _whole = XQueryNoPlace;
    _step = nullptr;
    part(body.expr, XQueryRole::Body);
    putOff();
    WorkPacer pacer;
    while (!_waiting.empty()) {
      pacer.turn();
      const Waiting next = _waiting.back();
      _waiting.pop_back();
      if (next.isDone) {
        close(next.whole);
      } else {
        open(next);
      }
    }
  }

  void part(Ref<XQueryExpr>& part, XQueryRole role) override {
    if (part) _parts.push_back({part.get(), &part, _step, _whole, role, false});
  }
  void ownPart(XQueryExpr* part, XQueryRole role) override {
    if (part) _parts.push_back({part, nullptr, _step, _whole, role, false});
  }
  void step(const XQueryStep& step) override { _step = &step; }

 private:
  struct Waiting {
    XQueryExpr* expr;
    Ref<XQueryExpr>* slot;
    const XQueryStep* step;
    XQueryPlaceID whole;
    XQueryRole role;
    bool isDone;  // the parts of `whole` have all been read
  };

  XQueryPlaceID nextPlace() const { return static_cast<XQueryPlaceID>(_program._places.size()); }

  void putOff() {
    _waiting.insert(_waiting.end(), _parts.rbegin(), _parts.rend());
    _parts.clear();
  }

  void open(const Waiting& next) {
    const XQueryPlaceID place = nextPlace();
    const bool isBody = next.whole == XQueryNoPlace;
    XQueryPlaceID focus = isBody ? XQueryNoPlace : _program[next.whole].focus;
    if (XQueryTraitsOf(next.role).hasOwnFocus) focus = place;
    _program._places.push_back({next.expr, next.slot, next.step, next.whole, 0, focus,
                                binderOf(*next.expr), next.role, isOrderedIn(next.whole)});
    if (next.expr->kind() == Kind::CaseClause) setBinder(*next.expr, place);
    _waiting.push_back({nullptr, nullptr, nullptr, place, XQueryRole::Body, true});
    _whole = place;
    _step = nullptr;
    next.expr->visitParts(*this);
    putOff();
  }

  void close(XQueryPlaceID place) {
    _program._places[place].end = nextPlace();
    _program._partsFirst.push_back(place);
    setBinder(*_program[place].expr, place);
  }

  bool isOrderedIn(XQueryPlaceID whole) const {
    if (whole == XQueryNoPlace) return _bodyIsOrdered;
    const auto* mode = dyn_cast<XQueryOrderExpr>(_program[whole].expr);
    return mode ? mode->ordered() : _program[whole].isOrdered;
  }

  // A variable is set once its clause is done; an ID in use is given to no other one.
  void setBinder(const XQueryExpr& expr, XQueryPlaceID place) {
    const auto* clause = dyn_cast<XQueryBindingExpr>(&expr);
    if (!clause) return;
    setBinder(clause->varID(), place);
    if (const auto* forExpr = dyn_cast<XQueryForExpr>(&expr)) setBinder(forExpr->posVarID(), place);
  }
  void setBinder(int64_t varID, XQueryPlaceID place) {
    if (varID <= 0) return;
    const auto index = static_cast<size_t>(varID);
    if (_binders.size() <= index) _binders.resize(index + 1, XQueryNoPlace);
    _binders[index] = place;
  }
  XQueryPlaceID binderOf(const XQueryExpr& expr) const {
    const auto* variable = dyn_cast<XQueryVariable>(&expr);
    const auto index = static_cast<size_t>(variable ? variable->varID() : 0);
    return index < _binders.size() ? _binders[index] : XQueryNoPlace;
  }

  XQueryProgram& _program;
  XQueryPlanList<Waiting> _waiting;          // the next one last
  XQueryPlanList<Waiting> _parts;            // of the place just opened, in order
  XQueryPlanList<XQueryPlaceID> _binders{};  // by ID of the variable
  XQueryPlaceID _whole = XQueryNoPlace;
  const XQueryStep* _step = nullptr;
  bool _bodyIsOrdered = true;
};

XQueryProgram::XQueryProgram(const XQueryProlog& prolog, Ref<XQueryExpr> body) {
  addModules(prolog);
  addBodiesOf(prolog);
  if (body) _bodies.push_back({std::move(body), nullptr, nullptr, &prolog, XQueryNoPlace});
  // From here on the bodies stay where they are: places refer to them.
  XQueryProgramReader reader(*this);
  for (XQueryProgramBody& each : _bodies) reader.read(each);
}

// What the main module imports, directly or not.
void XQueryProgram::addModules(const XQueryProlog& main) {
  if (main.importedModules().empty()) return;
  std::unordered_set<const XQueryProlog*> seen = {&main};
  std::vector<const XQueryProlog*> waiting = {&main};
  while (!waiting.empty()) {
    const XQueryProlog* importer = waiting.back();
    waiting.pop_back();
    for (const XQueryProlog* module : importer->importedModules()) {
      if (!seen.insert(module).second) continue;
      addBodiesOf(*module);
      waiting.push_back(module);
    }
  }
}

void XQueryProgram::addBodiesOf(const XQueryProlog& prolog) {
  for (const Value& declaration : prolog.declarations()) {
    if (auto* function = dyn_cast<XQueryFunctionDecl>(declaration.get())) {
      if (function->isExternal() || &function->prolog() != &prolog) continue;
      _bodies.push_back({function->expr(), function, nullptr, &prolog, XQueryNoPlace});
    } else if (auto* variable = dyn_cast<XQueryVarDecl>(declaration.get())) {
      if (variable->isExternal() || &variable->prolog() != &prolog) continue;
      _bodies.push_back({variable->expr(), nullptr, variable, &prolog, XQueryNoPlace});
    }
  }
}

const XQueryProgramBody& XQueryProgram::bodyOf(XQueryPlaceID place) const {
  const auto isBehind = [](XQueryPlaceID id, const XQueryProgramBody& body) {
    return id < body.place;
  };
  return *std::prev(std::upper_bound(_bodies.begin(), _bodies.end(), place, isBehind));
}

const XQueryProgramBody* XQueryProgram::bodyOfFunction(const XQueryFunctionDecl* function) const {
  const auto found = std::find_if(_bodies.begin(), _bodies.end(), [&](const auto& body) {
    return function && body.function == function;
  });
  return found == _bodies.end() ? nullptr : &*found;
}

// Rules look through the parts of a whole for each of these, which of thousands takes seconds: here
// is where the limits of a compilation end that.
XQueryPlaceID XQueryProgram::nextPart(XQueryPlaceID place) const {
  static constinit thread_local WorkPacer pacer;
  pacer.turn();
  const XQueryPlaceID whole = _places[place].parent;
  const XQueryPlaceID next = _places[place].end;
  return whole != XQueryNoPlace && next < _places[whole].end ? next : XQueryNoPlace;
}

XQueryPlaceID XQueryProgram::part(XQueryPlaceID whole, XQueryRole role) const {
  XQueryPlaceID found = firstPart(whole);
  while (found != XQueryNoPlace && _places[found].role != role) found = nextPart(found);
  return found;
}

XQueryPlaceID XQueryProgram::withoutParentheses(XQueryPlaceID place) const {
  while (_places[place].expr->kind() == Kind::ExprList) {
    const XQueryPlaceID first = firstPart(place);
    if (first == XQueryNoPlace || nextPart(first) != XQueryNoPlace) break;
    place = first;
  }
  return place;
}

Ref<XQueryExpr> XQueryProgram::install() {
  Ref<XQueryExpr> main;
  for (XQueryProgramBody& body : _bodies) {
    if (body.function) {
      body.function->setExpr(body.expr);
    } else if (body.variable) {
      body.variable->setExpr(body.expr);
    } else {
      main = body.expr;
    }
  }
  return main;
}

}  // namespace xquery

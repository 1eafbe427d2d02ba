// A variable that stands for a path and is used once.
//
// Pattern     let $v := P ... $v/a, $v[C], for $x in $v; declare function f($v) { ... $v/a }; f(P);
//             where P is "/" alone, any number of these
// Facts       P begins at the document and consists of steps down without predicates, whose names
//             raise nothing. Clause and call stand in the body of the query, what they are and the
//             use of the variable are evaluated once at most, in the focus of the query, and with
//             the same ordering mode. The function is of the same module and called nowhere else.
//             What is left in the variable cannot be told, and a position is not asked for there
// Operator    none: the path is walked where the variable was read, so that it is known how it goes
//             on, and takes the index of the tree. XQueryMovedPath is left in its place
// Why         the focus of the query is that of a tree which no evaluation changes: what P finds is
//             the same whenever it is walked. It can fail nowhere but in looking for the document,
//             which is left where it was
#include "Expr/Clauses/XQueryFLWOR.h"
#include "Expr/XQueryLeaves.h"
#include "Functions/XQueryFunctionCall.h"
#include "Plan/Operators/XQueryMovedPath.h"
#include "Plan/Planning.h"
#include "Plan/Rules.h"
#include "Plan/Rules/EvaluatedOnce.h"
#include "Plan/Rules/PathAt.h"
#include "Plan/Rules/PlaceInside.h"
#include "Plan/Rules/SplicePath.h"
#include "Prolog/XQueryDeclarations.h"

#include <algorithm>
#include <map>
#include <utility>
#include <vector>

namespace xquery {
namespace {

using Places = std::vector<XQueryPlaceID>;

class Search {
 public:
  explicit Search(XQueryPlanning& planning) : _planning(planning), _program(planning.program) {}

  void run() {
    if (_program.bodies().empty()) return;
    const XQueryProgramBody& last = _program.bodies().back();
    if (last.function || last.variable) return;
    _main = last.place;
    noteUses();
    // In their order, so that one path may begin with another one.
    for (XQueryPlaceID place = _main; place < _program[_main].end; ++place) {
      const auto* let = dyn_cast<XQueryLetExpr>(_program[place].expr);
      if (let) lookAt(place, *let);
    }
    for (const auto& [function, calls] : _calls) {
      if (calls.size() == 1 && isInMain(calls.front())) lookAtCall(calls.front(), *function);
    }
  }

 private:
  bool isInMain(XQueryPlaceID place) const { return place >= _main && place < _program[_main].end; }

  void noteUses() {
    for (XQueryPlaceID place = 0; place < _program.placeCount(); ++place) {
      const XQueryPlace& here = _program[place];
      if (const auto* variable = dyn_cast<XQueryVariable>(here.expr)) {
        if (here.binder != XQueryNoPlace) {
          _uses[here.binder].push_back(place);
        } else if (variable->varID() > 0) {
          const XQueryFunctionDecl* function = _program.bodyOf(place).function;
          if (function) _ofParams[{function, variable->varID()}].push_back(place);
        }
      } else if (const auto* call = dyn_cast<XQueryFunctionCall>(here.expr)) {
        if (call->functionDecl()) _calls[call->functionDecl()].push_back(place);
      }
    }
  }

  void lookAt(XQueryPlaceID clause, const XQueryLetExpr& let) {
    const XQueryPlaceID bound = _program.part(clause, XQueryRole::Bound);
    const auto uses = _uses.find(clause);
    if (let.type() || bound == XQueryNoPlace || uses == _uses.end()) return;
    XQueryVariableSet own;
    own.add(let.varID());
    if (!own.isExact() || _planning.showsLeftovers(own, clause)) return;
    move(bound, uses->second);
  }

  void lookAtCall(XQueryPlaceID call, const XQueryFunctionDecl& function) {
    const XQueryProgramBody* body = _program.bodyOfFunction(&function);
    const XQueryPlaceID list = _program.part(call, XQueryRole::Arguments);
    if (!body || list == XQueryNoPlace) return;
    if (body->prolog != _program.bodies().back().prolog) return;
    Places arguments;
    for (XQueryPlaceID each = _program.firstPart(list); each != XQueryNoPlace;
         each = _program.nextPart(each)) {
      arguments.push_back(each);
    }
    if (arguments.size() != function.params().size() || !isEvaluatedOnce(call)) return;
    for (size_t index = 0; index < arguments.size(); ++index) {
      const auto uses = _ofParams.find({&function, function.params()[index]->varID()});
      if (uses != _ofParams.end()) move(arguments[index], uses->second);
    }
  }

  void move(XQueryPlaceID from, const Places& uses) {
    const XQueryPlaceID inside = XQueryPlaceInside(_program, from);
    const bool isOpen = inside != XQueryNoPlace && _planning.isOpen(from) &&
                        _planning.isOpen(inside) && _program[from].focus == XQueryNoPlace;
    XQueryWalkedPath* path = isOpen ? XQueryWalkedPathAt(_planning, inside) : nullptr;
    if (!path || path != _planning.exprAt(inside).get() || !isMovable(*path)) return;
    const Ref<XQueryWalkedPath> moved(path);
    if (moved->steps().empty()) {
      for (const XQueryPlaceID use : uses) {
        if (fits(use, from))
          put(use, XQueryWalkedPath::exprWithPlain(plainOf(*moved), plainOf(*moved)));
      }
      return;
    }
    if (uses.size() != 1 || !fits(uses.front(), from)) return;
    if (!isEvaluatedOnce(from) || !isEvaluatedOnce(uses.front())) return;
    put(uses.front(), moved);
    _planning.wrap(from, XQueryMovedPath::exprWithPlain(plainOf(*moved), moved),
                   "it is walked where the variable is used");
  }

  static Ref<XQueryPathExpr> plainOf(const XQueryWalkedPath& path) {
    return Ref<XQueryPathExpr>(const_cast<XQueryPathExpr*>(&path.path()));
  }

  void put(XQueryPlaceID use, Ref<XQueryWalkedPath> path) {
    _planning.replace(use, std::move(path));
    const XQueryPlaceID around = XQueryPlaceAround(_program, use);
    if (_program[around].role == XQueryRole::FirstStep) {
      XQuerySplicePath(_planning, _program[around].parent);
    }
  }

  static bool isMovable(const XQueryWalkedPath& path) {
    if (!path.start() || !isa<XQueryRootStep>(path.start())) return false;
    if (!path.start()->predicates().empty()) return false;
    return std::all_of(path.steps().begin(), path.steps().end(), [](const XQueryWalkedStep& step) {
      const bool goesDown = step.axis == XQueryAxisChild || step.axis == XQueryAxisDescendant ||
                            step.axis == XQueryAxisAttribute || step.isDescendantShorthand();
      return goesDown && !step.testMayRaise && !step.step->mayAdopt() &&
             step.step->predicates().empty();
    });
  }

  // Whether a path, or a loop, goes on from there.
  bool fits(XQueryPlaceID use, XQueryPlaceID from) const {
    const XQueryPlace& here = _program[use];
    if (!_planning.isOpen(use) || here.focus != XQueryNoPlace) return false;
    if (here.isOrdered != _program[from].isOrdered) return false;
    const XQueryPlaceID around = XQueryPlaceAround(_program, use);
    const XQueryPlace& at = _program[around];
    if (at.role == XQueryRole::Bound) {
      const auto* clause = dyn_cast<XQueryForExpr>(_program[at.parent].expr);
      return clause && clause->posVarID() == 0 && around == use;
    }
    if (at.role != XQueryRole::FirstStep || !at.step) return false;
    const auto& predicates = at.step->predicates();
    if (predicates.empty()) return at.step->next() != nullptr;
    const XQueryPlaceID first = _program.nextPart(around);
    if (first == XQueryNoPlace || _program[first].role != XQueryRole::Predicate) return false;
    using namespace XQueryDeeds;
    const XQueryFacts& facts = _planning.facts[first];
    return !at.step->asksForPosition(0) && !facts.does(ReadsPosition | ReadsSize) &&
           !facts.mayBe(XQueryItems::Numeric | XQueryItems::Other);
  }

  bool isEvaluatedOnce(XQueryPlaceID place) const { return XQueryIsEvaluatedOnce(_program, place); }

  XQueryPlanning& _planning;
  const XQueryProgram& _program;
  XQueryPlaceID _main = XQueryNoPlace;
  std::map<XQueryPlaceID, Places> _uses;  // of variables, by clause
  std::map<std::pair<const XQueryFunctionDecl*, int64_t>, Places> _ofParams;
  std::map<const XQueryFunctionDecl*, Places> _calls;
};

}  // namespace

void XQueryMovePaths(XQueryPlanning& planning) {
  Search(planning).run();
}

}  // namespace xquery

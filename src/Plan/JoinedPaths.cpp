#include "Plan/JoinedPaths.h"

#include "Expr/Clauses/XQueryFLWOR.h"
#include "Expr/Operators/XQueryOperatorExpr.h"
#include "Expr/Paths/XQueryPath.h"
#include "Expr/XQueryLeaves.h"
#include "Functions/XQueryFunctionCall.h"
#include "Plan/Paths/XQueryWalkedStep.h"
#include "Plan/Rules/EvaluatedOnce.h"
#include "Plan/Rules/NumberQuestions.h"
#include "Plan/Rules/PlaceInside.h"
#include "Prolog/XQueryDeclarations.h"
#include "Prolog/XQueryProlog.h"

#include <algorithm>
#include <functional>
#include <iterator>
#include <map>
#include <unordered_map>
#include <unordered_set>
#include <utility>

namespace xquery {
namespace {

using Places = std::vector<XQueryPlaceID>;

bool isPlain(const XQueryStep* step) {
  const auto* axisStep = dyn_cast<XQueryAxisStep>(step);
  return axisStep && !axisStep->testMayRaise() && !step->mayAdopt();
}

bool goesDown(const XQueryStep& step) {
  const int axis = cast<XQueryAxisStep>(&step)->axis();
  return axis == XQueryAxisChild || axis == XQueryAxisDescendant || axis == XQueryAxisAttribute ||
         XQueryWalkedStep(step).isDescendantShorthand();
}

// The steps behind the document of a path that goes down by names alone; null for another one.
const XQueryStep* stepsDown(const XQueryExpr* expr) {
  const auto* path = dyn_cast<XQueryPathExpr>(expr);
  const XQueryStep* start = path ? path->step() : nullptr;
  if (!start || !isa<XQueryRootStep>(start) || !start->predicates().empty()) return nullptr;
  for (const XQueryStep* step = start->next(); step; step = step->next()) {
    if (!isPlain(step) || !step->predicates().empty() || !goesDown(*step)) return nullptr;
  }
  return start->next();
}

// Whether none of what the steps find from the document is below another one.
bool staysOnLevel(const XQueryStep* step) {
  for (; step; step = step->next()) {
    if (cast<XQueryAxisStep>(step)->axis() != XQueryAxisChild) return false;
  }
  return true;
}

template <class T>
Ref<T> standingAt(const XQueryExpr& place, Ref<T> expr) {
  expr->setExprLine(place.exprLine());
  expr->setExprPlace(place.exprPlace());
  return expr;
}

// The document, as the path looks for it.
Ref<XQueryRootStep> rootOf(const XQueryPathExpr& path) {
  auto root = XQueryRootStep::rootStep();
  (void)standingAt(*path.step()->expr(), Ref<XQueryExpr>(root->expr()));
  return root;
}
Ref<XQueryExpr> documentOf(const XQueryPathExpr& path) {
  return standingAt(path, XQueryPathExpr::pathExprWithStep(rootOf(path)));
}

// What a path goes on with where another one ends.
struct Rest {
  std::vector<Ref<XQueryExpr>> predicates;  // of its last step
  XQueryStep* steps = nullptr;
};

// The start, copies of the steps down, and the rest.
Ref<XQueryPathExpr> pathOf(Ref<XQueryStep> start, const XQueryStep* down, Rest rest) {
  std::vector<Ref<XQueryAxisStep>> copies;
  for (; down; down = down->next()) {
    copies.push_back(XQueryAxisStep::axisStepWithAxis(cast<XQueryAxisStep>(down)->axis(),
                                                      Ref<XQueryExpr>(down->expr())));
  }
  if (!rest.predicates.empty()) copies.back()->setPredicates(std::move(rest.predicates));
  if (rest.steps) copies.back()->setNext(Ref<XQueryStep>(rest.steps));
  for (size_t i = copies.size(); i-- > 1;) copies[i - 1]->setNext(copies[i]);
  start->setNext(copies.front());
  return XQueryPathExpr::pathExprWithStep(std::move(start));
}

class Joining {
 public:
  Joining(XQueryProgram& program, const XQueryFactTable& facts)
      : _program(program), _facts(facts) {}

  std::vector<const XQueryExpr*> run() {
    if (_program.bodies().empty()) return {};
    const XQueryProgramBody& last = _program.bodies().back();
    if (last.function || last.variable || !last.prolog->importedModules().empty()) return {};
    if (!findCandidates()) return {};
    noteUses();
    for (const XQueryPlaceID let : _lets) joinLet(let);
    for (const XQueryPlaceID flwor : _flwors) joinLoops(flwor);
    for (const XQueryProgramBody& body : _program.bodies()) {
      if (body.variable) joinGlobal(body);
      if (body.function) joinFunction(body);
    }
    return std::move(_joined);
  }

 private:
  const XQueryPlace& at(XQueryPlaceID place) const { return _program[place]; }
  XQueryPlaceID mainPlace() const { return _program.bodies().back().place; }
  XQueryPlaceID inside(XQueryPlaceID place) const { return XQueryPlaceInside(_program, place); }
  const XQueryStep* stepsDownAt(XQueryPlaceID place) const {
    return place == XQueryNoPlace ? nullptr : stepsDown(at(inside(place)).expr);
  }

  // Most programs have none.
  bool findCandidates() {
    for (XQueryPlaceID place = mainPlace(); place < _program.placeCount(); ++place) {
      if (at(place).focus != XQueryNoPlace) continue;
      const Kind kind = at(place).expr->kind();
      if (kind == Kind::LetExpr && stepsDownAt(_program.part(place, XQueryRole::Bound))) {
        _lets.push_back(place);
      } else if (kind == Kind::FLWORExpr && stepsDownAt(boundOfFirst(place))) {
        _flwors.push_back(place);
      }
    }
    const auto isPath = [&](const XQueryProgramBody& body) {
      return (body.variable || body.function) && stepsDownAt(body.place);
    };
    const auto& bodies = _program.bodies();
    return !_lets.empty() || !_flwors.empty() || std::any_of(bodies.begin(), bodies.end(), isPath);
  }
  XQueryPlaceID boundOfFirst(XQueryPlaceID flwor) const {
    const XQueryPlaceID first = _program.firstPart(flwor);
    const bool isFor = first != XQueryNoPlace && isa<XQueryForExpr>(at(first).expr);
    return isFor ? _program.part(first, XQueryRole::Bound) : XQueryNoPlace;
  }

  void noteUses() {
    for (XQueryPlaceID place = 0; place < _program.placeCount(); ++place) {
      if (const auto* variable = dyn_cast<XQueryVariable>(at(place).expr)) {
        if (at(place).binder != XQueryNoPlace) _uses[at(place).binder].push_back(place);
        if (variable->varID() == 0) noteGlobal(place, *variable);
        if (_facts.isSurelySet(place)) continue;
        _unsetAnywhere.add(variable->varID());
        if (place >= mainPlace()) _unset.insert(variable->varID());
      } else if (const auto* call = dyn_cast<XQueryFunctionCall>(at(place).expr)) {
        if (call->functionDecl()) _calls[call->functionDecl()].push_back(place);
        const auto* builtIn = call->builtIn();
        const bool isKnown = builtIn ? !builtIn->row().has(XQueryBuiltInFunction::Unrepeatable)
                                     : call->functionDecl() && !call->functionDecl()->isExternal();
        _mayDeclare = _mayDeclare || !isKnown;
      }
    }
  }

  void noteGlobal(XQueryPlaceID place, const XQueryVariable& variable) {
    const auto name = _program.bodies().back().prolog->variableQNameFromString(variable.name());
    if (name) _ofGlobals[name].push_back(place);
  }

  // --- what a path may be put in the place of

  // A place where the path goes on, and all that is written anew there.
  struct Use {
    XQueryPlaceID place;  // of the variable, or the call
    XQueryPlaceID whole;  // of the path that begins there, or the place itself
  };

  bool mayTake(XQueryPlaceID whole) const {
    const auto behind = _taken.lower_bound(at(whole).end);
    const bool isFree = behind == _taken.begin() || std::prev(behind)->second <= whole;
    return isFree && at(whole).slot && at(whole).isOrdered;
  }
  void take(XQueryPlaceID whole) { _taken[whole] = at(whole).end; }

  // Asked once, and for what an index may answer: of a list that is kept there are tables, and it
  // is gone over sooner than the path is walked again.
  bool isFound(XQueryPlaceID predicate) const {
    using namespace XQueryDeeds;
    const XQueryFacts& facts = _facts[predicate];
    const bool asksForTruth = facts.isRepeatable() && !facts.does(ReadsPosition | ReadsSize) &&
                              !facts.mayBe(XQueryItems::Numeric | XQueryItems::Other);
    bool isEquality = false;
    for (XQueryPlaceID part = predicate; part < at(predicate).end; ++part) {
      const auto* operation = dyn_cast<XQueryOperatorExpr>(at(part).expr);
      const int type = operation ? operation->operatorType() : XQueryOperatorOr;
      isEquality = isEquality || type == XQueryOperatorEqual || type == XQueryOperatorEq;
    }
    return asksForTruth && isEquality && !_program.bodyOf(predicate).function &&
           XQueryIsEvaluatedOnce(_program, at(predicate).parent);
  }

  // Whether nobody can tell of which nodes, and in which order, the predicate is asked.
  bool isIdle(XQueryPlaceID predicate) const {
    const XQueryFacts& facts = _facts[predicate];
    return facts.isRepeatable() && !facts.assigns.meets(_unsetAnywhere) &&
           !facts.assigns.meets(facts.reads);
  }

  // Whether nobody can tell which step of the path the predicates of its start are asked by, and
  // that its steps go on from another one. What is repeatable gives no node a parent.
  bool goesOn(XQueryPlaceID path, const XQueryStep& start) const {
    size_t count = 0;
    for (XQueryPlaceID part = _program.firstPart(path); part != XQueryNoPlace;
         part = _program.nextPart(part)) {
      if (at(part).role != XQueryRole::Predicate) continue;
      if (!isIdle(part)) return false;
      if (at(part).step != &start) continue;
      if (!isFound(part)) return false;
      ++count;
    }
    if (count != start.predicates().size() || (count == 0 && !start.next())) return false;
    for (const XQueryStep* step = start.next(); step; step = step->next()) {
      if (!isPlain(step)) return false;
    }
    return true;
  }

  bool find(XQueryPlaceID place, std::vector<Use>& uses) const {
    const XQueryPlaceID around = XQueryPlaceAround(_program, place);
    const XQueryPlace& here = at(around);
    if (here.parent == XQueryNoPlace) return false;
    if (here.role == XQueryRole::FirstStep) {
      if (!here.step || !goesOn(here.parent, *here.step) || !mayTake(here.parent)) return false;
      uses.push_back({place, here.parent});
      return true;
    }
    const bool isBound = here.role == XQueryRole::Bound && isWalked(here.parent);
    const bool isCounted = here.role == XQueryRole::Argument && isNumber(here.parent);
    if ((!isBound && !isCounted) || !mayTake(place)) return false;
    uses.push_back({place, place});
    return true;
  }
  bool isWalked(XQueryPlaceID clause) const {
    const XQueryExpr* expr = at(clause).expr;
    if (expr->kind() == Kind::QuantifiedItem) return true;
    const auto* loop = dyn_cast<XQueryForExpr>(expr);
    return loop && loop->posVarID() == 0;
  }
  bool isNumber(XQueryPlaceID arguments) const {
    const XQueryPlaceID call = at(arguments).parent;
    return call != XQueryNoPlace && XQueryNumberQuestionOf(*at(call).expr).has_value();
  }

  // Not where one is written inside of another.
  bool findAll(const Places& places, std::vector<Use>& uses) const {
    const bool areAll = std::all_of(places.begin(), places.end(),
                                    [&](XQueryPlaceID place) { return find(place, uses); });
    const auto meets = [&](const Use& one, const Use& next) {
      return next.whole < at(one.whole).end;
    };
    return areAll && !uses.empty() &&
           std::adjacent_find(uses.begin(), uses.end(), meets) == uses.end();
  }

  // The path that begins at the start and goes on as the use does.
  void put(const Use& use, Ref<XQueryStep> start, const XQueryStep* down) {
    Rest rest;
    if (use.whole != use.place) {
      const XQueryStep* first = cast<XQueryPathExpr>(at(use.whole).expr)->step();
      rest = {first->predicates(), first->next()};
    }
    auto path = standingAt(*at(use.whole).expr, pathOf(std::move(start), down, std::move(rest)));
    _joined.push_back(path.get());
    _program.replace(use.whole, std::move(path));
    take(use.whole);
  }

  // --- what stands for a path

  // In the focus of the query the path begins at the document, elsewhere at what the variable
  // holds.
  void putAll(XQueryPlaceID from, const std::vector<Use>& uses) {
    const Ref<XQueryPathExpr> path(cast<XQueryPathExpr>(at(inside(from)).expr));
    const XQueryStep* down = path->step()->next();
    for (const Use& use : uses) {
      const bool isInFocus =
          at(use.place).focus == XQueryNoPlace && !_program.bodyOf(use.place).function;
      Ref<XQueryStep> start;
      if (isInFocus) {
        start = rootOf(*path);
      } else {
        start = XQueryFilterStep::filterStepWithExpr(Ref<XQueryExpr>(at(use.place).expr));
      }
      put(use, std::move(start), down);
    }
    _program.replace(from, documentOf(*path));
    take(from);
  }

  void joinLet(XQueryPlaceID clause) {
    const auto& let = *cast<XQueryLetExpr>(at(clause).expr);
    const XQueryPlaceID bound = _program.part(clause, XQueryRole::Bound);
    const auto uses = _uses.find(clause);
    if (let.type() || uses == _uses.end() || !mayTake(bound) || mayBeLeft(let.varID())) return;
    std::vector<Use> found;
    if (findAll(uses->second, found)) putAll(bound, found);
  }

  // Whether the local variable may be read in the body of the query where nothing has set it.
  bool mayBeLeft(int64_t varID) const { return varID <= 0 || _unset.contains(varID); }

  // An evaluation inside of this one may give the variable another value.
  void joinGlobal(const XQueryProgramBody& body) {
    if (_mayDeclare || !stepsDownAt(body.place) || !mayTake(body.place)) return;
    const auto uses = _ofGlobals.find(body.variable->name());
    if (uses == _ofGlobals.end()) return;
    for (const XQueryPlaceID place : uses->second) {
      // It is not there yet.
      if (place < body.place && _program.bodyOf(place).variable) return;
    }
    std::vector<Use> found;
    if (findAll(uses->second, found)) putAll(body.place, found);
  }

  // A call answers the document above its own focus, which is that of its place.
  void joinFunction(const XQueryProgramBody& body) {
    const auto calls = _calls.find(body.function);
    if (!body.function->params().empty() || calls == _calls.end()) return;
    if (!stepsDownAt(body.place) || !mayTake(body.place)) return;
    std::vector<Use> found;
    if (!findAll(calls->second, found)) return;
    const bool haveNone = std::all_of(calls->second.begin(), calls->second.end(), [&](auto call) {
      const auto* args = cast<XQueryFunctionCall>(at(call).expr)->args();
      return !args || args->count() == 0;
    });
    if (!haveNone) return;
    const Ref<XQueryPathExpr> path(cast<XQueryPathExpr>(at(inside(body.place)).expr));
    for (const Use& use : found) {
      put(use, XQueryFilterStep::filterStepWithExpr(Ref<XQueryExpr>(at(use.place).expr)),
          path->step()->next());
    }
    _program.replace(body.place, documentOf(*path));
    take(body.place);
  }

  // --- loops

  // "for $a in P for $b in $a/Q": nothing else reads $a.
  void joinLoops(XQueryPlaceID flwor) {
    const auto& expr = *cast<XQueryFLWORExpr>(at(flwor).expr);
    const XQueryPlaceID first = _program.firstPart(flwor);
    const XQueryPlaceID second = _program.nextPart(first);
    const auto* outer = bareLoop(first);
    const auto* inner = second == XQueryNoPlace ? nullptr : bareLoop(second);
    const auto uses = _uses.find(first);
    if (!outer || !inner || uses == _uses.end() || uses->second.size() != 1) return;
    const XQueryPlaceID bound = _program.part(second, XQueryRole::Bound);
    const XQueryPlaceID start = XQueryPlaceAround(_program, uses->second.front());
    const auto* further = dyn_cast<XQueryPathExpr>(at(inside(bound)).expr);
    const bool beginsThere =
        further && at(start).role == XQueryRole::FirstStep && at(start).parent == inside(bound);
    if (!beginsThere || !leadsToOwn(*further)) return;
    const Ref<XQueryPathExpr> path(cast<XQueryPathExpr>(at(inside(boundOfFirst(flwor))).expr));
    const XQueryStep* down = path->step()->next();
    if (!staysOnLevel(down) || !mayTake(flwor) || mayBeLeft(outer->varID())) return;
    auto joined = standingAt(*further, pathOf(rootOf(*path), down, {{}, further->step()->next()}));
    _joined.push_back(joined.get());
    _program.replace(bound, std::move(joined));
    _program.replace(flwor, withoutFirst(flwor, expr));
    take(flwor);
  }
  const XQueryForExpr* bareLoop(XQueryPlaceID clause) const {
    const auto* loop = dyn_cast<XQueryForExpr>(at(clause).expr);
    return loop && !loop->type() && loop->posVarID() == 0 ? loop : nullptr;
  }
  // Behind its start, to what belongs to one node alone.
  static bool leadsToOwn(const XQueryPathExpr& path) {
    const XQueryStep* start = path.step();
    if (!start->predicates().empty() || !start->next()) return false;
    for (const XQueryStep* step = start->next(); step; step = step->next()) {
      if (!isPlain(step)) return false;
      const int axis = cast<XQueryAxisStep>(step)->axis();
      if (axis != XQueryAxisChild && axis != XQueryAxisAttribute) return false;
    }
    return true;
  }
  Ref<XQueryExpr> withoutFirst(XQueryPlaceID flwor, const XQueryFLWORExpr& expr) const {
    const auto partAt = [&](XQueryRole role) {
      const XQueryPlaceID part = _program.part(flwor, role);
      return part == XQueryNoPlace ? Ref<XQueryExpr>() : *at(part).slot;
    };
    XQueryFLWORExpr::Clauses clauses(expr.forLet().begin() + 1, expr.forLet().end());
    return standingAt(
        expr, XQueryFLWORExpr::exprWithForLet(std::move(clauses), partAt(XQueryRole::Where),
                                              expr.orderSpecs(), partAt(XQueryRole::Return)));
  }

  XQueryProgram& _program;
  const XQueryFactTable& _facts;
  std::map<XQueryPlaceID, XQueryPlaceID> _taken;  // what has been written anew: where it ends
  std::vector<const XQueryExpr*> _joined;
  Places _lets;    // of the query's body, in its focus, that are set to such a path
  Places _flwors;  // the same of those that begin with a loop over one
  std::unordered_map<XQueryPlaceID, Places> _uses;  // of variables, by clause
  std::unordered_map<Ref<XQueryQName>, Places, XQueryQNameHash, XQueryQNameEqual> _ofGlobals;
  std::unordered_set<int64_t> _unset;  // variables that the body of the query may read unset
  XQueryVariableSet _unsetAnywhere;    // the same for all bodies, with their parameters
  std::unordered_map<const XQueryFunctionDecl*, Places> _calls;
  bool _mayDeclare = false;
};

}  // namespace

std::vector<const XQueryExpr*> XQueryJoinPaths(XQueryProgram& program,
                                               const XQueryFactTable& facts) {
  return Joining(program, facts).run();
}

}  // namespace xquery

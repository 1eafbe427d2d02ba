// How many nodes nested loops find.
//
// Pattern     count(for $a in P, $b in $a/Q return $b/R), count(for $a in P return $a/Q), of any
//             number of clauses; exists(), empty(), not() and boolean() of the same
// Facts       P begins at the document; all of the paths consist of steps down, without predicates,
//             whose names raise nothing, and at most one "//" among those of P; behind it they lead
//             to children and attributes; the clauses have neither types nor positions; what is
//             left in their variables cannot be told
// Operator    XQueryPathCount for the path P/Q/R: the index of the tree knows the way
// Why         each child and attribute is found from one node alone, so that the loops find each
//             node once, as the path does; nothing can fail but looking for the document
#include "Expr/Clauses/XQueryFLWOR.h"
#include "Expr/XQueryLeaves.h"
#include "Plan/Operators/XQueryPathCount.h"
#include "Plan/Planning.h"
#include "Plan/Rules.h"
#include "Plan/Rules/NumberQuestions.h"
#include "Plan/Rules/PathAt.h"
#include "Plan/Rules/PlaceInside.h"

#include <utility>
#include <vector>

namespace xquery {
namespace {

using Steps = std::vector<const XQueryStep*>;

class Loops {
 public:
  Loops(const XQueryPlanning& planning, XQueryPlaceID flwor)
      : _planning(planning), _program(planning.program), _flwor(flwor) {}

  // The path that finds what the loops find; null for none.
  Ref<XQueryWalkedPath> path() {
    const auto& expr = *cast<XQueryFLWORExpr>(_program[_flwor].expr);
    if (!expr.orderSpecs().empty() || expr.whereExpr()) return nullptr;
    XQueryPlaceID part = _program.firstPart(_flwor);
    const auto* clause = clauseAt(part);
    if (!clause || !takeFirst(boundAt(part))) return nullptr;
    for (;;) {
      part = _program.nextPart(part);
      if (part == XQueryNoPlace) return nullptr;
      if (_program[part].role == XQueryRole::Return) break;
      const auto* next = clauseAt(part);
      if (!next || !takeFurther(boundAt(part), clause->varID())) return nullptr;
      clause = next;
    }
    const auto* variable = dyn_cast<XQueryVariable>(_program[inside(part)].expr);
    const bool isItem = variable && variable->varID() == clause->varID();
    if (!isItem && !takeFurther(part, clause->varID())) return nullptr;
    return made();
  }

 private:
  XQueryPlaceID inside(XQueryPlaceID place) const { return XQueryPlaceInside(_program, place); }
  XQueryPlaceID boundAt(XQueryPlaceID clause) const {
    return _program.part(clause, XQueryRole::Bound);
  }
  const XQueryForExpr* clauseAt(XQueryPlaceID place) const {
    const auto* clause =
        place == XQueryNoPlace ? nullptr : dyn_cast<XQueryForExpr>(_program[place].expr);
    const bool fits = clause && !clause->type() && clause->posVarID() == 0 && clause->varID() > 0;
    return fits ? clause : nullptr;
  }
  const XQueryPathExpr* pathAt(XQueryPlaceID place) const {
    return place == XQueryNoPlace ? nullptr
                                  : dyn_cast<XQueryPathExpr>(_program[inside(place)].expr);
  }

  bool takeFirst(XQueryPlaceID place) {
    _first = pathAt(place);
    if (!_first || !_first->step() || !isa<XQueryRootStep>(_first->step())) return false;
    if (!_first->step()->predicates().empty() || !_first->step()->next()) return false;
    size_t shorthands = 0;
    for (const XQueryStep* step = _first->step()->next(); step; step = step->next()) {
      if (XQueryWalkedStep(*step).isDescendantShorthand() && step->next()) {
        ++shorthands;
      } else if (!leadsToOwn(*step)) {
        return false;
      }
    }
    return shorthands <= 1;
  }

  bool takeFurther(XQueryPlaceID place, int64_t varID) {
    const XQueryPathExpr* path = pathAt(place);
    if (!path || !path->step() || isa<XQueryAxisStep>(path->step())) return false;
    if (!path->step()->expr() || !path->step()->predicates().empty()) return false;
    const auto* variable = dyn_cast<XQueryVariable>(XQueryWithoutParentheses(path->step()->expr()));
    if (!variable || variable->varID() != varID || !path->step()->next()) return false;
    for (const XQueryStep* step = path->step()->next(); step; step = step->next()) {
      if (!leadsToOwn(*step)) return false;
      _further.push_back(step);
    }
    return true;
  }

  // To what belongs to one node alone.
  static bool leadsToOwn(const XQueryStep& step) {
    const auto* axisStep = dyn_cast<XQueryAxisStep>(&step);
    if (!axisStep || axisStep->testMayRaise() || !step.predicates().empty()) return false;
    return axisStep->axis() == XQueryAxisChild || axisStep->axis() == XQueryAxisAttribute;
  }

  Ref<XQueryWalkedPath> made() const {
    auto path = XQueryWalkedPath::exprWithPlain(
        _planning.exprAt(_flwor), Ref<XQueryPathExpr>(const_cast<XQueryPathExpr*>(_first)));
    auto& steps = path->changeableSteps();
    for (const XQueryStep* step : _further) steps.emplace_back(*step);
    for (XQueryWalkedStep& step : steps) step.absorbsNext = step.isDescendantShorthand();
    path->setFindings({.trailCount = 0, .countsNodes = true, .findsInOrder = false});
    return path;
  }

  const XQueryPlanning& _planning;
  const XQueryProgram& _program;
  const XQueryPlaceID _flwor;
  const XQueryPathExpr* _first = nullptr;
  Steps _further;
};

}  // namespace

void XQueryCountLoops(XQueryPlanning& planning) {
  const XQueryProgram& program = planning.program;
  for (XQueryPlaceID place = 0; place < program.placeCount(); ++place) {
    const auto asks =
        planning.isOpen(place) ? XQueryNumberQuestionOf(*program[place].expr) : std::nullopt;
    if (!asks) continue;
    const XQueryPlaceID flwor =
        XQueryPlaceInside(program, program.firstPart(program.firstPart(place)));
    if (program[flwor].expr->kind() != Kind::FLWORExpr || !planning.isOpen(flwor)) continue;
    auto path = Loops(planning, flwor).path();
    if (!path) continue;
    if (planning.showsLeftovers(planning.facts[flwor].assigns, place)) {
      planning.refuse(place, "a variable that would be left unset may be read");
      continue;
    }
    planning.wrap(place, XQueryPathCount::exprWithPlain(planning.exprAt(place), std::move(path),
                                                        asks->question));
  }
}

}  // namespace xquery

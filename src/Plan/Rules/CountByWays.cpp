// How many nodes meet a condition on the names above them.
//
// Pattern     count(for $x in P let $l := L where C return R), exists(), empty(), not() and
//             boolean() of the same, of any number of let clauses
// Facts       P is a path down from the document without predicates (XQueryPathPattern); L and C
//             look at nothing but the names from $x up (WayConditions.h); R answers one item, can
//             be repeated and cannot fail; no clause has a type or a position; what is left in the
//             variables cannot be told
// Operator    XQueryWayLoop: the index of the tree knows the ways of names, and how many elements
//             lie on each; the condition is asked of the first one on each
// Why         the condition holds for all elements on a way or for none. Where it fails for one,
//             all is done the plain way
#include "Expr/Clauses/XQueryFLWOR.h"
#include "Expr/XQueryLists.h"
#include "Plan/Operators/XQueryWayLoop.h"
#include "Plan/Paths/XQueryPathPattern.h"
#include "Plan/Planning.h"
#include "Plan/Rules.h"
#include "Plan/Rules/NumberQuestions.h"
#include "Plan/Rules/PathAt.h"
#include "Plan/Rules/PlaceInside.h"
#include "Plan/Rules/WayConditions.h"

#include <algorithm>
#include <utility>

namespace xquery {
namespace {

class Search {
 public:
  explicit Search(XQueryPlanning& planning) : _planning(planning), _program(planning.program) {}

  void run() {
    for (XQueryPlaceID place = 0; place < _program.placeCount(); ++place) {
      const auto asks =
          _planning.isOpen(place) ? XQueryNumberQuestionOf(*_program[place].expr) : std::nullopt;
      if (asks) lookAt(place, *asks);
    }
  }

 private:
  XQueryPlaceID inside(XQueryPlaceID place) const { return XQueryPlaceInside(_program, place); }

  void lookAt(XQueryPlaceID place, const XQueryNumberQuestion& asks) {
    const XQueryPlaceID loop = inside(_program.firstPart(_program.firstPart(place)));
    auto* flwor = dyn_cast<XQueryFLWORExpr>(_program[loop].expr);
    if (!flwor || !_planning.isOpen(loop) || !flwor->orderSpecs().empty()) return;
    if (!flwor->whereExpr() || (asks.isOfTruth && !_planning.facts[loop].are(XQueryItems::Node))) {
      return;
    }
    XQueryWalkedPath* path = walked(loop);
    if (!path || !isAskedOfWays(loop)) return;
    if (_planning.showsLeftovers(_planning.facts[loop].assigns, place)) {
      return _planning.refuse(place, "a variable that would be left with another item may be read");
    }
    _planning.wrap(place,
                   XQueryWayLoop::exprWithPlain(
                       _planning.exprAt(place),
                       {Ref<XQueryFLWORExpr>(flwor), Ref<XQueryWalkedPath>(path)}, asks.question));
  }

  // What the first clause walks.
  XQueryWalkedPath* walked(XQueryPlaceID loop) const {
    const XQueryPlaceID first = _program.firstPart(loop);
    const auto* clause = dyn_cast<XQueryForExpr>(_program[first].expr);
    if (!clause || clause->type() || clause->posVarID() != 0 || clause->varID() <= 0) {
      return nullptr;
    }
    const XQueryPlaceID bound = inside(_program.part(first, XQueryRole::Bound));
    XQueryWalkedPath* path =
        bound == XQueryNoPlace ? nullptr : XQueryWalkedPathAt(_planning, bound);
    if (!path || !XQueryPathPattern::fits(*path)) return nullptr;
    const bool isFiltered =
        std::any_of(path->steps().begin(), path->steps().end(),
                    [](const XQueryWalkedStep& step) { return step.hasPredicates(); });
    return isFiltered ? nullptr : path;
  }

  bool isAskedOfWays(XQueryPlaceID loop) const {
    XQueryPlaceID part = _program.firstPart(loop);
    XQueryWayVariables variables;
    variables.nodes.add(cast<XQueryForExpr>(_program[part].expr)->varID());
    for (part = _program.nextPart(part); part != XQueryNoPlace; part = _program.nextPart(part)) {
      switch (_program[part].role) {
        case XQueryRole::Clause: {
          const auto* let = dyn_cast<XQueryLetExpr>(_program[part].expr);
          const XQueryPlaceID bound = _program.part(part, XQueryRole::Bound);
          if (!let || let->type() || let->varID() <= 0 || bound == XQueryNoPlace) return false;
          if (!XQueryIsOfWays(_program, bound, variables)) return false;
          const bool isNumber = XQueryIsNumberOfNodes(_program, bound);
          (isNumber ? variables.numbers : variables.nodes).add(let->varID());
          break;
        }
        case XQueryRole::Where:
          if (!XQueryIsOfWays(_program, part, variables)) return false;
          break;
        default:
          if (!isOneItem(part)) return false;
      }
    }
    return variables.nodes.isExact() && variables.numbers.isExact();
  }

  bool isOneItem(XQueryPlaceID answer) const {
    const XQueryFacts& facts = _planning.facts[answer];
    return facts.least == 1 && facts.most == 1 && !facts.mayBe(XQueryItems::Other) &&
           facts.isRepeatable() && !facts.does(XQueryDeeds::MayFail | XQueryDeeds::LoadsDocuments);
  }

  XQueryPlanning& _planning;
  const XQueryProgram& _program;
};

}  // namespace

void XQueryCountByWays(XQueryPlanning& planning) {
  Search(planning).run();
}

}  // namespace xquery

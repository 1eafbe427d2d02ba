// Whether "/" can fail: not where there is a document above the context item for certain.
//
// Of the expressions around a place, those parts that are evaluated before the one that holds it
// have found a document there, or have failed, which ends the evaluation:
//
//   for $p in /site/people, $s in /site/sales where exists(//item) ...
//            finds it             cannot fail              cannot fail
//
// A predicate or a step has a focus of its own. Its context item lies in the tree of the one around
// the path, or in that of a document with which the path begins, as long as all steps up to there
// walk along axes. A node that is below a document stays there: what is constructed takes nodes
// that have a parent in as copies.
#include "Expr/Paths/XQueryPath.h"
#include "Plan/FactsAnalysis.h"

namespace xquery {
namespace {

constexpr int mostLevels = 256;
constexpr int mostParts = 64;

class Search {
 public:
  explicit Search(const XQueryFactsAt& at) : _program(at.program), _facts(at.table) {}

  bool findsBefore(XQueryPlaceID place) const {
    for (int level = 0; level < mostLevels; ++level) {
      const XQueryPlaceID whole = _program[place].parent;
      if (whole == XQueryNoPlace) return false;
      if (XQueryTraitsOf(_program[place].role).hasOwnFocus) {
        if (!isInTreeAround(place)) return false;
        const XQueryPlaceID start = _program.part(whole, XQueryRole::FirstStep);
        if (start != XQueryNoPlace && _facts[start].findsRoot) return true;
      } else if (evaluatesInOrder(*_program[whole].expr) && isFoundByPartBefore(place)) {
        return true;
      }
      place = whole;
    }
    return false;
  }

 private:
  // Whether the parts of the expression are evaluated one after another, if they are.
  static bool evaluatesInOrder(const XQueryExpr& expr) {
    switch (expr.kind()) {
      case Kind::FLWORExpr:
      case Kind::QuantifiedExpr:
      case Kind::ConditionalExpr:
      case Kind::TypeswitchExpr:
      case Kind::ExprList:
      case Kind::Args:
      case Kind::OperatorExpr:
        return true;
      default:
        return false;
    }
  }

  // The first parts that are evaluated whenever the one at the place is.
  bool isFoundByPartBefore(XQueryPlaceID place) const {
    XQueryPlaceID part = _program.firstPart(_program[place].parent);
    for (int count = 0; part != place && count < mostParts; ++count) {
      if (isEvaluatedBefore(part) && _facts[part].findsRoot) return true;
      part = _program.nextPart(part);
    }
    return false;
  }

  // What items are sorted by is found when they are there, and one branch or case in place of
  // another one.
  bool isEvaluatedBefore(XQueryPlaceID part) const {
    const XQueryPlace& at = _program[part];
    if (at.role == XQueryRole::Branch || XQueryTraitsOf(at.role).isNoValue) return false;
    return at.expr->kind() != Kind::OrderSpec && at.expr->kind() != Kind::CaseClause;
  }

  // Whether the context item that is set at the place lies in the tree of the one around the path.
  bool isInTreeAround(XQueryPlaceID place) const {
    const XQueryPlace& setter = _program[place];
    const auto* path = dyn_cast<XQueryPathExpr>(_program[setter.parent].expr);
    const XQueryStep* step = path ? path->step() : nullptr;
    if (step && !isa<XQueryAxisStep>(step)) {
      const XQueryPlaceID start = _program.part(setter.parent, XQueryRole::FirstStep);
      const bool isInTree = start != XQueryNoPlace && _facts[start].are(XQueryItems::Node) &&
                            _facts[start].tree == XQueryTreeFact::OfContext;
      if (!isInTree) return false;
      if (setter.step == step) return true;
      step = step->next();
    }
    const bool isOfStep = setter.role == XQueryRole::Step;
    for (; step && (step != setter.step || !isOfStep); step = step->next()) {
      if (!isa<XQueryAxisStep>(step)) return false;
      if (step == setter.step) return true;
    }
    return step != nullptr;
  }

  const XQueryProgram& _program;
  const XQueryFactTable& _facts;
};

}  // namespace

bool XQueryFindsRootBefore(const XQueryFactsAt& at) {
  return Search(at).findsBefore(at.place);
}

}  // namespace xquery

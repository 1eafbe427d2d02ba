#include "Expr/XQueryReads.h"

#include "Expr/Operators/XQueryOperatorExpr.h"
#include "Expr/Paths/XQueryPath.h"
#include "Expr/XQueryCallExpr.h"
#include "Expr/XQueryLeaves.h"
#include "Expr/XQueryLists.h"

#include <algorithm>
#include <cstddef>

namespace xquery {
namespace {

// Bounds the work, since every path looks through its predicates, and paths nest.
constexpr size_t mostExpressions = 64;

// Looks through an expression without recursion.
class Reader {
 public:
  // `hasOuterFocus`: the expression's focus is that of the whole.
  void add(const XQueryExpr* expr, bool hasOuterFocus) {
    if (expr) _waiting.push_back({expr, hasOuterFocus});
  }
  void addSteps(const XQueryStep* first, bool hasOuterFocus) {
    for (const XQueryStep* step = first; step; step = step->next()) {
      addStep(*step, hasOuterFocus && step == first);
      if (_waiting.size() > mostExpressions) return;
    }
  }

  XQueryReads run() {
    for (size_t looked = 0; !_waiting.empty() && _reads.isRepeatable; ++looked) {
      const Part part = _waiting.back();
      _waiting.pop_back();
      _reads.isRepeatable = looked + _waiting.size() < mostExpressions && look(part);
    }
    return std::move(_reads);
  }

 private:
  struct Part {
    const XQueryExpr* expr;
    bool hasOuterFocus;
  };

  void addStep(const XQueryStep& step, bool hasOuterFocus) {
    if (const auto* axisStep = dyn_cast<XQueryAxisStep>(&step)) {
      if (hasOuterFocus) _reads.focus = true;
      if (!staysInside(axisStep->axis())) _reads.outside = true;
    }
    add(step.expr(), hasOuterFocus);
    for (const auto& predicate : step.predicates()) add(predicate.get(), false);
  }

  static bool staysInside(int axis) {
    switch (axis) {
      case XQueryAxisChild:
      case XQueryAxisAttribute:
      case XQueryAxisSelf:
        return true;
      default:
        return false;
    }
  }

  void addElements(const XQueryExprList& list, bool hasOuterFocus) {
    for (size_t i = 0; i < list.count() && i <= mostExpressions; ++i) {
      add(list.objectAtIndex(i), hasOuterFocus);
    }
  }

  void readVariable(int64_t varID) {
    if (varID == 0) {
      _reads.globals = true;
    } else if (!_reads.readsVariable(varID)) {
      _reads.variables.push_back(varID);
    }
  }

  // Adds what the expression consists of; false when its kind is not known to be repeatable.
  bool look(const Part& part) {
    const bool outer = part.hasOuterFocus;
    switch (part.expr->kind()) {
      case Kind::Variable:
        readVariable(cast<XQueryVariable>(part.expr)->varID());
        return true;
      case Kind::RootStepExpr:
        // The document above stays. Without one it is an error, from which a predicate goes on.
        _reads.outside = _reads.outside || !outer;
        _reads.focus = _reads.focus || outer;
        return true;
      case Kind::ContextItemExpr:
        _reads.focus = _reads.focus || outer;
        return true;
      case Kind::Literal:
      case Kind::NameTest:
      case Kind::WildCardNameTest:
      case Kind::TypeDeclaration:
        return true;
      case Kind::OperatorExpr:
        add(cast<XQueryOperatorExpr>(part.expr)->left(), outer);
        add(cast<XQueryOperatorExpr>(part.expr)->right(), outer);
        return true;
      case Kind::ExprList:
      case Kind::Args:
        addElements(*cast<XQueryExprList>(part.expr), outer);
        return true;
      case Kind::FunctionCall:
        add(cast<XQueryCallExpr>(part.expr)->args(), outer);
        _reads.loads = _reads.loads || cast<XQueryCallExpr>(part.expr)->loadsDocuments();
        return cast<XQueryCallExpr>(part.expr)->readsArgumentsOnly();
      case Kind::PathExpr:
        addSteps(cast<XQueryPathExpr>(part.expr)->step(), outer);
        return true;
      default:
        return false;
    }
  }

  std::vector<Part> _waiting;
  XQueryReads _reads;
};

}  // namespace

bool XQueryReads::readsVariable(int64_t varID) const {
  return std::find(variables.begin(), variables.end(), varID) != variables.end();
}

XQueryReads XQueryReadsOf(const XQueryExpr& expr) {
  Reader reader;
  reader.add(&expr, true);
  return reader.run();
}

bool XQueryIsRepeatable(const XQueryExpr& expr, bool variablesMayChange) {
  const XQueryReads reads = XQueryReadsOf(expr);
  return reads.isRepeatable && !(variablesMayChange && (reads.globals || !reads.variables.empty()));
}

}  // namespace xquery

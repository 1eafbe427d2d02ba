#include "Expr/XQueryRepeatable.h"

#include "Expr/XQueryLists.h"
#include "Expr/XQueryOperatorExpr.h"
#include "Expr/XQueryPath.h"

#include <cstddef>
#include <vector>

namespace xquery {
namespace {

// Bounds the work, since every path looks through its predicates, and paths nest.
constexpr size_t mostExpressions = 64;

using Waiting = std::vector<const XQueryExpr*>;

void addSteps(const XQueryPathExpr& path, Waiting& waiting) {
  for (const XQueryStep* step = path.step(); step; step = step->next()) {
    waiting.push_back(step->expr());
    for (const auto& predicate : step->predicates()) waiting.push_back(predicate.get());
    if (waiting.size() > mostExpressions) return;
  }
}

void addElements(const XQueryExprList& list, Waiting& waiting) {
  for (size_t i = 0; i < list.count() && i <= mostExpressions; ++i) {
    waiting.push_back(list.objectAtIndex(i));
  }
}

// Adds what the expression consists of; false when its kind is not known to be repeatable.
bool addParts(const XQueryExpr& expr, bool variablesMayChange, Waiting& waiting) {
  switch (expr.kind()) {
    case Kind::Variable:
      return !variablesMayChange;
    case Kind::Literal:
    case Kind::ContextItemExpr:
    case Kind::RootStepExpr:
    case Kind::NameTest:
    case Kind::WildCardNameTest:
    case Kind::TypeDeclaration:
      return true;
    case Kind::OperatorExpr:
      waiting.push_back(cast<XQueryOperatorExpr>(&expr)->left());
      waiting.push_back(cast<XQueryOperatorExpr>(&expr)->right());
      return true;
    case Kind::ExprList:
      addElements(*cast<XQueryExprList>(&expr), waiting);
      return true;
    case Kind::PathExpr:
      addSteps(*cast<XQueryPathExpr>(&expr), waiting);
      return true;
    default:
      return false;
  }
}

}  // namespace

bool XQueryIsRepeatable(const XQueryExpr& expr, bool variablesMayChange) {
  Waiting waiting = {&expr};
  for (size_t looked = 0; !waiting.empty(); ++looked) {
    if (looked + waiting.size() > mostExpressions) return false;
    const XQueryExpr* next = waiting.back();
    waiting.pop_back();
    if (next && !addParts(*next, variablesMayChange, waiting)) return false;
  }
  return true;
}

}  // namespace xquery

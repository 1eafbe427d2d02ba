#include "Plan/Operators/XQueryShortWalk.h"

#include "Expr/Paths/XQueryNameTest.h"
#include "Expr/TypeTests/XQueryTypeDeclaration.h"
#include "Expr/XQueryLeaves.h"
#include "Expr/XQueryLists.h"
#include "Plan/Paths/XQueryWalkedPath.h"
#include "Plan/Rules/PositionConditions.h"

namespace xquery {

bool XQueryShortWalk::readFrom(const XQueryExpr& expr) {
  const XQueryExpr* origin = XQueryWithoutParentheses(&expr);
  if (const auto* path = XQueryPathIn(origin)) {
    const XQueryStep* step = path->step();
    origin = nullptr;
    if (step && step->kind() == Kind::FilterStep && step->predicates().empty()) {
      origin = XQueryWithoutParentheses(step->expr());
      step = step->next();
      if (!origin) return false;
    }
    if (!step || !readSteps(step)) return false;
  }
  return readOrigin(origin);
}

// Null for the context item.
bool XQueryShortWalk::readOrigin(const XQueryExpr* origin) {
  if (!origin || isa<XQueryContextItem>(origin)) return true;
  const auto* variable = dyn_cast<XQueryVariable>(origin);
  _varID = variable ? variable->varID() : 0;
  return _varID != 0;
}

bool XQueryShortWalk::readSteps(const XQueryStep* step) {
  for (; step; step = step->next()) {
    const auto* axisStep = dyn_cast<XQueryAxisStep>(step);
    const bool isShort = axisStep && step->predicates().empty() && readStep(*axisStep);
    if (!isShort) return false;
  }
  return true;
}

uint64_t XQueryShortWalk::readFromWithPosition(const XQueryPathExpr& path) {
  const XQueryStep* step = path.step();
  const XQueryExpr* origin = nullptr;
  if (step && step->kind() == Kind::FilterStep && step->predicates().empty()) {
    origin = XQueryWithoutParentheses(step->expr());
    if (!origin) return 0;
    step = step->next();
  }
  const auto* only = dyn_cast<XQueryAxisStep>(step);
  if (!only || only->next() || only->predicates().size() != 1) return 0;
  auto least = only->literalPosition(0);
  if (!least) least = XQueryItemsAskedFor(*only->predicates().front());
  return least && readOrigin(origin) && readStep(*only) ? *least : 0;
}

bool XQueryShortWalk::readStep(const XQueryAxisStep& step) {
  if (_count == mostSteps) return false;
  // A parent comes first, so that there is one of them.
  const bool isLeading = _count == 0 || _steps[_count - 1].axis == XQueryAxisParent;
  const bool isOpen = step.axis() == XQueryAxisChild || step.axis() == XQueryAxisAttribute ||
                      (step.axis() == XQueryAxisParent && isLeading) ||
                      ((goesUp(step.axis()) || goesAside(step.axis())) && _count == 0);
  if (!isOpen) return false;
  const NSXMLExpandedName* name = nullptr;
  uint32_t kinds = 0;
  if (const auto* nameTest = dyn_cast<XQueryNameTest>(step.expr())) {
    name = nameTest->boundName();
    if (!name) {
      name = nameTest->nameWithoutNamespace();
      _needsNoDefaultNamespace = true;
    }
    if (!name) return false;
    kinds = XQueryKindBit(Kind::Element) | XQueryKindBit(Kind::Attribute);
  } else if (const auto* type = dyn_cast<XQueryTypeDeclaration>(step.expr())) {
    if (type->data() || !type->acceptsCount(1)) return false;
    if (type->type() == XQueryTypeDeclaration::TextTest) {
      kinds = XQueryKindBit(Kind::Text);
    } else if (type->type() == XQueryTypeDeclaration::AnyKindTest) {
      kinds = UINT32_MAX;
    } else {
      return false;
    }
  } else {
    return false;
  }
  _steps[_count++] = {step.axis(), kinds, name};
  return true;
}

}  // namespace xquery

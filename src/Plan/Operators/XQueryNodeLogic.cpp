#include "Plan/Operators/XQueryNodeLogic.h"

#include "Context/XQueryContextInternal.h"
#include "xquery/Number.h"

namespace xquery {

// The operand behind one that decides is not asked, as it would not be evaluated.
std::optional<bool> XQueryNodeLogic::holdsFor(NSXMLNode* node, const XQueryContext& context) const {
  const auto first = _operands.front()->nodeQuestion()->holdsFor(node, context);
  if (!first || _joint == Joint::Not) return first ? std::optional(!*first) : first;
  if (*first == (_joint == Joint::Or)) return first;
  return _operands.back()->nodeQuestion()->holdsFor(node, context);
}

const XQueryNodeQuestion* XQueryNodeLogic::questionOfNodeAbove() const {
  if (_joint != Joint::And) return nullptr;
  for (const auto& operand : _operands) {
    if (operand->nodeQuestion()->asksForNodeAbove()) return operand->nodeQuestion();
  }
  return nullptr;
}

Value XQueryNodeLogic::computeValue(XQueryContext& context) const {
  auto* node = dyn_cast<NSXMLNode>(_internal(context).contextItem());
  const auto answer = node ? holdsFor(node, context) : std::nullopt;
  return answer ? Value(NSNumber::numberWithBool(*answer)) : plain().evaluateWithContext(context);
}

}  // namespace xquery

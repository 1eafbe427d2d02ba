#include "Plan/Operators/XQueryNodeLogic.h"

#include "Context/XQueryContextInternal.h"
#include "Platform/Base/WorkMeter.h"
#include "xquery/Number.h"

#include <algorithm>

namespace xquery {

XQueryNodeLogic::XQueryNodeLogic(Ref<XQueryExpr> plain, Joint joint,
                                 std::vector<Ref<XQueryPlannedExpr>> operands)
    : XQueryPlannedExpr(std::move(plain)), _joint(joint), _operands(std::move(operands)) {
  if (_joint != Joint::And) return;
  const auto found = std::find_if(_operands.begin(), _operands.end(), [](const auto& operand) {
    return operand->nodeQuestion()->asksForNodeAbove();
  });
  if (found != _operands.end()) _ofNodeAbove = (*found)->nodeQuestion();
}

// The operands behind one that decides are not asked, as they would not be evaluated.
std::optional<bool> XQueryNodeLogic::holdsFor(NSXMLNode* node, const XQueryContext& context) const {
  const bool decides = _joint == Joint::Or;
  WorkPacer pacer;
  for (const auto& operand : _operands) {
    pacer.turn();
    const auto answer = operand->nodeQuestion()->holdsFor(node, context);
    if (!answer) return answer;
    if (_joint == Joint::Not) return !*answer;
    if (*answer == decides) return decides;
  }
  return !decides;
}

Value XQueryNodeLogic::computeValue(XQueryContext& context) const {
  auto* node = dyn_cast<NSXMLNode>(_internal(context).contextItem());
  const auto answer = node ? holdsFor(node, context) : std::nullopt;
  return answer ? Value(NSNumber::numberWithBool(*answer)) : plain().evaluateWithContext(context);
}

}  // namespace xquery

#include "Plan/Operators/XQueryNameComparison.h"

#include "Context/XQueryContextInternal.h"
#include "xquery/Number.h"
#include "xquery/XMLNode.h"

namespace xquery {

std::optional<bool> XQueryNameComparison::holdsFor(NSXMLNode* node, const XQueryContext&) const {
  if (node->kind() != Kind::Element && node->kind() != Kind::Attribute) return std::nullopt;
  const NSStringView name = _which == Name::Local ? node->localNameView() : node->nameView();
  return name == _text->view();
}

Value XQueryNameComparison::computeValue(XQueryContext& context) const {
  auto* node = dyn_cast<NSXMLNode>(_internal(context).contextItem());
  const auto answer = node ? holdsFor(node, context) : std::nullopt;
  return answer ? Value(NSNumber::numberWithBool(*answer)) : plain().evaluateWithContext(context);
}

}  // namespace xquery

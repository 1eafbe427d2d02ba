#include "Plan/Operators/XQueryNameComparison.h"

#include "Context/XQueryContextInternal.h"
#include "xquery/Number.h"
#include "xquery/XMLNode.h"

namespace xquery {

Value XQueryNameComparison::computeValue(XQueryContext& context) const {
  const auto* node = dyn_cast<NSXMLNode>(context._internal().contextItem());
  const bool isNamed = node && (node->kind() == Kind::Element || node->kind() == Kind::Attribute);
  if (!isNamed) return plain().evaluateWithContext(context);
  const NSStringView name = _which == Name::Local ? node->localNameView() : node->nameView();
  return NSNumber::numberWithBool(name == _text->view());
}

}  // namespace xquery

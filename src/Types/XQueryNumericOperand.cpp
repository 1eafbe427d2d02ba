#include "Types/XQueryNumericOperand.h"

#include "Platform/Numbers/NumberText.h"

namespace xquery {

XQueryNumericOperand XQueryNumericOperand::ofUntyped(const NSObject& object) {
  XQueryNumericOperand operand;
  const XQueryUntypedText text(object);
  if (scanDouble(text.view(), operand.number)) operand.form = Double;
  return operand;
}

double XQueryNumericOperand::asDouble(const NSDecimal& exact) {
  if (exact.isSmallInteger() && exact.smallInteger() >= -XQueryExactIntegerBound &&
      exact.smallInteger() <= XQueryExactIntegerBound) {
    return static_cast<double>(exact.smallInteger());
  }
  return exact.doubleValue();
}

}  // namespace xquery

// A number as the shortcuts of arithmetic and of the aggregate functions see it.
//
//   Exact    exactly xs:integer or xs:decimal, holding a decimal that is a number
//   Double   exactly xs:double, or untyped with a number for a text
//   Other    everything else; the plain algorithms take it
//
// Two operands that are not Other have xs:integer, xs:decimal or xs:double for their common type,
// and casting them to it is what `asDouble` does, or nothing at all.
#pragma once

#include "Types/XQueryNumber.h"
#include "Types/XQueryUntypedText.h"
#include "xquery/Object.h"

#include <cstdint>
#include <limits>

namespace xquery {

struct XQueryNumericOperand {
  enum Form : uint8_t { Other, Exact, Double };
  Form form = Other;
  bool isInteger = false;            // of an exact operand
  const NSDecimal* exact = nullptr;  // of an exact operand; the number's own
  double number = 0;                 // of a double operand

  // Without untyped ones, strings and nodes are Other.
  static XQueryNumericOperand of(const NSObject* object, bool untypedOnes = true);

  double asDouble() const { return form == Double ? number : asDouble(*exact); }
  // The double to which a decimal is cast: the one that its text reads as.
  static double asDouble(const NSDecimal& exact);

 private:
  static XQueryNumericOperand ofNumber(const XQueryNumber& number);
  static XQueryNumericOperand ofUntyped(const NSObject& object);
};

// Every integer up to this magnitude is a double.
inline constexpr int64_t XQueryExactIntegerBound = int64_t{1}
                                                   << std::numeric_limits<double>::digits;

inline XQueryNumericOperand XQueryNumericOperand::ofNumber(const XQueryNumber& number) {
  XQueryNumericOperand operand;
  const XQueryTypeID type = number.typeID();
  if (type == XQueryTypeDouble) {
    operand.form = Double;
    operand.number = number.doubleValue();
  } else if (type == XQueryTypeInteger || type == XQueryTypeDecimal) {
    operand.exact = number.storedDecimal();
    operand.isInteger = type == XQueryTypeInteger;
    if (operand.exact && !operand.exact->isNaN()) operand.form = Exact;
  }
  return operand;
}

inline XQueryNumericOperand XQueryNumericOperand::of(const NSObject* object, bool untypedOnes) {
  if (const auto* number = dyn_cast<XQueryNumber>(object)) return ofNumber(*number);
  return untypedOnes && XQueryIsUntyped(object) ? ofUntyped(*object) : XQueryNumericOperand();
}

}  // namespace xquery

// Arithmetic over the commonest operands, with one allocation at most for the result.
#pragma once

#include "xquery/Object.h"

namespace xquery {

class XQueryContext;
struct XQueryNumericOperand;

// What XQueryOperatorExpr answers for these operands; null for those that are left to it, and
// wherever it would fail. They are meant for XQueryOperatorExpr::answerQuickly.
Value XQueryQuickArithmetic(int type, const Value& left, const Value& right,
                            XQueryContext& context);
Value XQueryQuickSign(int type, const Value& left, const Value& operand, XQueryContext& context);

// The same of operands that have been read.
Value XQueryQuickArithmeticOf(int type, const XQueryNumericOperand& left,
                              const XQueryNumericOperand& right);

}  // namespace xquery

// Value and general comparisons of the commonest operands.
#pragma once

#include "xquery/Object.h"

namespace xquery {

class XQueryContext;

// What XQueryOperatorExpr answers for these operands; null for those that are left to it. They are
// meant for XQueryOperatorExpr::answerQuickly.
Value XQueryQuickValueComparison(int type, const Value& left, const Value& right,
                                 XQueryContext& context);
Value XQueryQuickGeneralComparison(int type, const Value& left, const Value& right,
                                   XQueryContext& context);

}  // namespace xquery

// Joins whose condition may be that one of several holds: "K = P or L = Q". Each picks items by
// itself; an item that none of them picks is left out, and the others are put together in their
// order.
#pragma once

#include "Expr/XQueryPicker.h"
#include "Plan/Joins/XQueryJoin.h"

#include <memory>

namespace xquery {

// XQueryJoin::ofClause and XQueryJoin::ofStep for any condition.
[[nodiscard]] std::unique_ptr<const XQueryPicker> XQueryJoinsOfClause(
    const XQueryExpr& owner, int64_t varID, XQueryJoinCondition condition);
[[nodiscard]] std::unique_ptr<const XQueryPicker> XQueryJoinsOfStep(const XQueryExpr& owner,
                                                                    XQueryJoinCondition condition,
                                                                    bool looksAround);

}  // namespace xquery

// Conditions on the position of the context item, and small numbers.
#pragma once

#include <cstdint>
#include <optional>

namespace xquery {

class XQueryExpr;

// The integer that a literal is, in parentheses or not, unless it is a large one.
std::optional<int64_t> XQuerySmallIntegerIn(const XQueryExpr* expr);

// The comparison that the operands of another one stand in when they change sides.
int XQueryMirroredComparison(int type);

// Whether it is a call of position().
bool XQueryIsPosition(const XQueryExpr* expr);

// "position() = 3", "3 >= position()" with the position on the left.
struct XQueryPositionCondition {
  int comparison;
  int64_t number;
};
std::optional<XQueryPositionCondition> XQueryPositionConditionIn(const XQueryExpr& expr);

// "last()", "last() - 1", "position() = last() - 1" as a predicate: how many items stand behind the
// one that is asked for.
std::optional<uint64_t> XQueryItemsBehindAskedFor(const XQueryExpr& predicate);

// "last() > 1", "2 <= last()" as a predicate, which keeps all items or none: how many there have to
// be.
std::optional<uint64_t> XQueryItemsAskedFor(const XQueryExpr& predicate);

}  // namespace xquery

// Operators that make sequences: ranges, and the set operators over nodes.
#include "Eval/XQueryContextInternal.h"
#include "Expr/NodeOrder.h"
#include "Expr/XQueryOperatorExpr.h"
#include "Expr/XQuerySequence.h"
#include "Types/XQueryErrors.h"
#include "Types/XQueryNumber.h"
#include "Types/XQueryTypeTable.h"
#include "xquery/Collection.h"

#include <algorithm>
#include <cstdint>
#include <new>
#include <unistd.h>
#include <unordered_set>
#include <vector>

namespace xquery {
namespace {

// --- ranges --------------------------------------------------------------------------------------

// A range is built at once, so its size is bounded: by 2^31 items, past which a position would no
// longer fit the 32-bit lengths used elsewhere, and by the memory that the machine has, since a
// request beyond it would not fail but have the process killed.
uint64_t mostRangeItems() {
  static const uint64_t most = [] {
    constexpr uint64_t positionBound = uint64_t{1} << 31;
    constexpr uint64_t bytesPerItem = sizeof(Value) + sizeof(XQueryNumber);
    const int64_t pages = sysconf(_SC_PHYS_PAGES);
    const int64_t pageSize = sysconf(_SC_PAGE_SIZE);
    if (pages <= 0 || pageSize <= 0) return positionBound;
    const uint64_t memory = static_cast<uint64_t>(pages) * static_cast<uint64_t>(pageSize);
    return std::min(positionBound, memory / bytesPerItem);
  }();
  return most;
}

[[noreturn]] void raiseRangeTooLong(XQueryContext& context) {
  context._internal().raise(XQueryErrors::rangeTooLong.error());
}

Value integersFrom(int64_t first, int64_t last, XQueryContext& context) {
  const uint64_t distance = static_cast<uint64_t>(last) - static_cast<uint64_t>(first);
  if (distance >= mostRangeItems()) raiseRangeTooLong(context);
  const Ref<XQuerySequence> sequence = XQuerySequence::sequence();
  try {
    std::vector<Value>& items = sequence->objects();
    items.reserve(distance + 1);
    // Counted by distance: the last integer may be the greatest there is.
    for (uint64_t offset = 0; offset <= distance; ++offset) {
      const uint64_t value = static_cast<uint64_t>(first) + offset;
      items.push_back(XQueryNumber::integerWithInt64(static_cast<int64_t>(value)));
    }
  } catch (const std::bad_alloc&) {
    raiseRangeTooLong(context);
  }
  return sequence;
}

// --- set operators -------------------------------------------------------------------------------

using Nodes = std::vector<NSObject*>;
using IdentitySet = std::unordered_set<const NSObject*>;

// The nodes of an operand; false when some item is none. A missing operand is invalid.
bool gatherNodes(const Value& operand, Nodes& nodes) {
  if (!operand) return false;
  const XQueryItemList items(operand.get());
  nodes.reserve(items.count());
  for (size_t index = 0; index < items.count(); ++index) {
    NSObject* item = items[index];
    if (!item || !item->isNode()) return false;
    nodes.push_back(item);
  }
  return true;
}

// Appends each node once, as long as `wanted` agrees.
template <class Wanted>
void appendDistinct(const Nodes& nodes, IdentitySet& seen, std::vector<Value>& result,
                    Wanted wanted) {
  for (NSObject* node : nodes) {
    if (wanted(node) && seen.insert(node).second) result.emplace_back(node);
  }
}

std::vector<Value> combine(int type, const Nodes& left, const Nodes& right) {
  std::vector<Value> result;
  IdentitySet seen(left.size() + right.size());
  const auto any = [](const NSObject*) { return true; };
  if (type == XQueryOperatorUnion) {
    appendDistinct(left, seen, result, any);
    appendDistinct(right, seen, result, any);
    return result;
  }
  const IdentitySet rightSet(right.begin(), right.end());
  const bool wantsCommon = type == XQueryOperatorIntersect;
  appendDistinct(left, seen, result,
                 [&](const NSObject* node) { return rightSet.contains(node) == wantsCommon; });
  return result;
}

}  // namespace

Value XQueryOperatorExpr::rangeOperatorEvaluate(int, const Value& withLeft, const Value& right,
                                                XQueryContext& forContext) {
  const Value left = normalised(withLeft);
  const Value end = normalised(right);
  if (!left || !end) return Value();
  if (isNull(left) || isNull(end)) return NSNull::null();
  const Value first = XQueryPromoteToInteger(left, forContext);
  const Value last = XQueryPromoteToInteger(end, forContext);
  const auto* firstNumber = dyn_cast<NSNumber>(first);
  const auto* lastNumber = dyn_cast<NSNumber>(last);
  if (!firstNumber || !lastNumber) return Value();
  if (firstNumber->compare(*lastNumber) > 0) return XQuerySequence::sequence();
  return integersFrom(firstNumber->longLongValue(), lastNumber->longLongValue(), forContext);
}

Value XQueryOperatorExpr::sequenceOperatorEvaluate(int type, const Value& withLeft,
                                                   const Value& right, XQueryContext&) {
  Nodes leftNodes;
  Nodes rightNodes;
  if (!gatherNodes(withLeft, leftNodes) || !gatherNodes(right, rightNodes)) return Value();
  std::vector<Value> nodes = combine(type, leftNodes, rightNodes);
  if (nodes.empty()) return NSNull::null();
  if (nodes.size() == 1) return nodes.front();
  XQuerySortNodesForwardStable(nodes);
  const Ref<XQuerySequence> sequence = XQuerySequence::sequence();
  sequence->objects() = std::move(nodes);
  return sequence;
}

}  // namespace xquery

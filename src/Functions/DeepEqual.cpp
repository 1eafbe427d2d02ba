// Two sequences are deep-equal when they have as many items, not none, and their items are so pair
// by pair; two empty ones are so too. Nodes are compared by the trees below them, atomic values as
// "eq" compares them, and a node equals no atomic value. What cannot be compared differs. A host
// may leave places of an array empty: they are like the empty sequence there.
#include "Functions/DeepEqual.h"

#include "Context/XQueryContextInternal.h"
#include "Expr/Operators/XQueryOperatorExpr.h"
#include "Expr/XQuerySequence.h"
#include "Platform/Base/WorkMeter.h"
#include "Types/XQueryAtomization.h"
#include "Types/XQueryNodeFunctions.h"
#include "xquery/Exception.h"

#include <vector>

namespace xquery {
namespace {

bool sameItems(NSObject* a, NSObject* b, XQueryContext& context) {
  if (a->isNode() || b->isNode()) {
    return a->isNode() && b->isNode() &&
           XQueryNodeEqual(cast<NSXMLNode>(a), cast<NSXMLNode>(b), &context);
  }
  return XQueryIsTrue(
      XQueryOperatorExpr::evaluateOperator(XQueryOperatorEq, Value(a), Value(b), context));
}

bool isEmpty(const NSObject* item) {
  return !item || item->kind() == Kind::Null;
}

// Two arrays and the next pair of elements to compare.
struct Pair {
  const NSArray* a;
  const NSArray* b;
  size_t next;
};

// Arrays that a host hands in may nest to any depth, so the pairs that are open are kept here.
bool same(NSObject* a, NSObject* b, XQueryContext& context) {
  std::vector<Pair> open;
  const auto compare = [&](NSObject* x, NSObject* y) {
    const auto* first = dyn_cast<NSArray>(x);
    const auto* second = dyn_cast<NSArray>(y);
    if (first && second) {
      open.push_back({first, second, 0});
      return first->count() == second->count() && first->count() > 0;
    }
    if (first || second) return false;
    if (isEmpty(x) || isEmpty(y)) return isEmpty(x) && isEmpty(y);
    return sameItems(x, y, context);
  };
  if (!compare(a, b)) return false;
  WorkPacer pacer;
  while (!open.empty()) {
    pacer.turn();
    Pair& pair = open.back();
    if (pair.next == pair.a->count()) {
      open.pop_back();
      continue;
    }
    const size_t index = pair.next++;
    if (!compare(pair.a->objectAtIndex(index), pair.b->objectAtIndex(index))) return false;
  }
  return true;
}

}  // namespace

// A third argument, the collation, is not looked at.
Value fn_deep_equal(const Value* arguments, size_t count, XQueryContext& context) {
  if (count < 2 || count > 3) return Value();
  auto& dynamic = _internal(context);
  try {
    return NSNumber::numberWithBool(same(arguments[0].get(), arguments[1].get(), context));
  } catch (const NSException&) {
    if (XQueryIsLimit(dynamic.error().get())) throw;
    dynamic.setError(nullptr, false);
    return NSNumber::falseValue();
  }
}

}  // namespace xquery

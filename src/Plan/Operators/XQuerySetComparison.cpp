// Nobody can tell: pairs are compared in an order of which nothing is left to see, unless one of
// them is an error. A set takes text, or else numbers, and a probe that it can answer: then no pair
// is. Nothing is compared with a list without items, but each of the other items has to be one that
// can be compared, which those of a set are. Everything else is compared as it was written, and so
// is everything with diagnostics on.
#include "Plan/Operators/XQuerySetComparison.h"

#include "Context/KeptValues.h"
#include "Context/XQueryContextInternal.h"
#include "Expr/Operators/XQueryOperatorExpr.h"
#include "Expr/XQuerySequence.h"
#include "xquery/Collection.h"
#include "xquery/Number.h"

#include <array>
#include <optional>
#include <utility>
#include <vector>

namespace xquery {
namespace {

// So few are compared as quickly as looked up.
constexpr size_t fewPairs = 8;
constexpr size_t fewItems = 64;
// A set that is used but once is worth its making.
constexpr size_t manyPairs = size_t{1} << 14;

// Of an item of the set to one of the other side.
XQueryJoinRelation relationOf(int type, bool setIsLeft) {
  XQueryJoinRelation by;
  by.relation = XQueryRelationForCode(type + XQueryOperatorEq - XQueryOperatorEqual);
  if (!setIsLeft) by.relation = XQueryMirrored(by.relation);
  return by;
}

}  // namespace

Ref<XQuerySetComparison> XQuerySetComparison::exprWithPlain(Ref<XQueryOperatorExpr> plain,
                                                            Again again) {
  return make<XQuerySetComparison>(std::move(plain), again);
}

XQuerySetComparison::XQuerySetComparison(Ref<XQueryOperatorExpr> plain, Again again)
    : XQueryPlannedExpr(plain), _comparison(*plain), _again(again) {}

Value XQuerySetComparison::computeValue(XQueryContext& context) const {
  const Value left = _comparison.left()->evaluateWithContext(context);
  if (XQueryHasFailed(left, context)) return {};
  const Value right = _comparison.right()->evaluateWithContext(context);
  if (XQueryHasFailed(right, context)) return {};
  const size_t leftCount = XQueryItemList(left.get()).count();
  const size_t rightCount = XQueryItemList(right.get()).count();
  const size_t pairs = leftCount * rightCount;
  const size_t work = pairs ? pairs : leftCount + rightCount;
  if (work <= fewPairs || _internal(context).showsErrors())
    return _comparison.answerFor(left, right, context);
  bool setIsLeft = leftCount > rightCount;
  // However long a list is that is never seen again, looking its items up takes less than a set of
  // them, which could answer no other comparison.
  if (_again == Again::Left && leftCount >= fewItems) setIsLeft = true;
  if (_again == Again::Right && rightCount >= fewItems) setIsLeft = false;
  const auto set = setOf(setIsLeft ? left : right, setIsLeft, work >= manyPairs, context);
  if (pairs == 0 && left && right && set && set->isRegular()) return NSNull::null();
  const auto areMet = set ? set->meets(setIsLeft ? right : left) : std::nullopt;
  if (!areMet) return _comparison.answerFor(left, right, context);
  return NSNumber::numberWithBool(*areMet);
}

// Null where there is none, and for a list that may never be seen again.
std::shared_ptr<XQueryJoinTable> XQuerySetComparison::setOf(const Value& items, bool isLeft,
                                                            bool isWorthIt,
                                                            XQueryContext& context) const {
  auto& keptValues = _internal(context).keptValues();
  if (!isWorthIt && keptValues.looksAway(*this)) return nullptr;
  std::shared_ptr<XQueryKeptValue> kept;
  // Which side it is decides how it is asked.
  const std::array<Value, 2> dependencies = {items, NSNumber::numberWithBool(isLeft)};
  const auto use = isWorthIt ? keptValues.useAtOnce(*this, dependencies, false, kept)
                             : keptValues.use(*this, dependencies, false, kept);
  if (use == XQueryKeptValues::Use::First) return nullptr;
  if (use == XQueryKeptValues::Use::Further) return std::static_pointer_cast<XQueryJoinTable>(kept);
  const auto listed = std::make_shared<std::vector<Value>>();
  std::shared_ptr<XQueryJoinTable> made;
  if (XQueryListItems(XQueryItemList(items.get()), *listed) &&
      listed->size() <= XQueryJoinTable::mostItems) {
    made = std::make_shared<XQueryJoinTable>(relationOf(_comparison.operatorType(), isLeft), listed,
                                             [&listed](size_t index) { return (*listed)[index]; });
    if (!made->isComplete()) made = nullptr;
  }
  keptValues.keep(*this, dependencies, made);
  return made;
}

}  // namespace xquery

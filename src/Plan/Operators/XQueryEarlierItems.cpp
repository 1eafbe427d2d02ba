// Nobody can tell: what is compared lies inside the items, which are the same list each time; a
// table answers what comparing each pair would, and where an item or a value is unusual, there is
// nothing to compare, or diagnostics are on, everything is done as it was written.
#include "Plan/Operators/XQueryEarlierItems.h"

#include "Context/KeptValues.h"
#include "Context/XQueryContextInternal.h"
#include "Expr/XQuerySequence.h"
#include "Plan/Joins/XQueryJoinTable.h"
#include "Platform/Numbers/NSDecimal.h"
#include "Types/XQueryItemKinds.h"

#include <algorithm>
#include <cmath>
#include <limits>
#include <vector>

namespace xquery {
namespace {

// So few are compared as quickly as looked up.
constexpr size_t fewItems = 16;

// How many positions come before a bound; 0 for none, and for what is no number that is exact as a
// double.
size_t countBefore(const Value& bound, bool isInclusive) {
  const auto* number = dyn_cast<NSNumber>(bound);
  if (!number || (XQueryKindsOfItem(*number) & ~XQueryItems::Numeric) != 0) return 0;
  const NSDecimal* decimal = number->storedDecimal();
  if ((decimal && !decimal->isSmallInteger()) || number->storage() == NSNumber::Storage::Float) {
    return 0;
  }
  const double value = number->doubleValue();
  const double last = isInclusive ? std::floor(value) : std::ceil(value) - 1;
  if (!(last >= 1)) return 0;
  constexpr double most = XQueryJoinTable::mostItems;
  return static_cast<size_t>(std::min(last, most));
}

}  // namespace

class XQueryEarlierItems::Table final : public XQueryKeptValue {
 public:
  Table(const XQueryJoinTable::Items& items, const XQueryShortWalk& walk)
      : _keys({}, items, [&](size_t position) {
          Value keys = keysOf((*items)[position], walk);
          const bool isFirst = keys && keys->kind() != Kind::Null && position < _firstWithKeys;
          if (isFirst) _firstWithKeys = position;
          return keys;
        }) {}

  bool isComplete() const { return _keys.isComplete(); }

  // Whether one of the first so many items meets the value; nothing where there is no telling.
  std::optional<bool> isMetBefore(size_t end, const Value& value) {
    const auto question = _keys.questionOf(value);
    if (!question || _firstWithKeys >= end) return std::nullopt;
    XQueryJoinTable::Selection met;
    _keys.select(*question, met, true);
    const auto isBefore = [end](const XQueryPick& pick) { return pick.position < end; };
    // One that has to be asked may be an error, whatever else is met.
    const bool isOpen = std::any_of(met.begin(), met.end(), [&](const XQueryPick& pick) {
      return isBefore(pick) && !pick.isSure;
    });
    if (isOpen) return std::nullopt;
    return !met.empty() && isBefore(met.front());
  }

 private:
  static Value keysOf(const Value& item, const XQueryShortWalk& walk) {
    if (walk.isEmpty()) return item;
    auto* node = dyn_cast<NSXMLNode>(item);
    if (!node) return {};
    XQueryGatherer keys;
    walk.visit(node, [&](NSXMLNode* found) {
      keys.add(Value(found));
      return true;
    });
    return keys.value();
  }

  size_t _firstWithKeys = std::numeric_limits<size_t>::max();
  XQueryJoinTable _keys;
};

std::shared_ptr<XQueryEarlierItems::Table> XQueryEarlierItems::tableOf(
    const Value& items, XQueryContext& context) const {
  if (XQueryItemList(items.get()).count() < fewItems) return nullptr;
  if (!_operands.walk.isOpen(context)) return nullptr;
  auto& keptValues = _internal(context).keptValues();
  if (keptValues.looksAway(*this)) return nullptr;
  std::shared_ptr<XQueryKeptValue> kept;
  const auto use = keptValues.use(*this, {&items, 1}, false, kept);
  if (use == XQueryKeptValues::Use::First) return nullptr;
  if (use == XQueryKeptValues::Use::Further) return std::static_pointer_cast<Table>(kept);
  const auto listed = std::make_shared<std::vector<Value>>();
  std::shared_ptr<Table> made;
  if (XQueryListItems(XQueryItemList(items.get()), *listed) &&
      listed->size() <= XQueryJoinTable::mostItems) {
    made = std::make_shared<Table>(listed, _operands.walk);
    if (!made->isComplete()) made = nullptr;
  }
  keptValues.keep(*this, {&items, 1}, made);
  return made;
}

std::optional<bool> XQueryEarlierItems::answer(const Value& value, XQueryContext& context) const {
  if (!value || value->kind() == Kind::Null) return std::nullopt;
  const Value items = _operands.items->evaluateWithContext(context);
  const auto table = items ? tableOf(items, context) : nullptr;
  if (!table) return std::nullopt;
  const Value bound = _operands.bound->evaluateWithContext(context);
  const size_t count = countBefore(bound, _operands.isInclusive);
  return count == 0 ? std::nullopt : table->isMetBefore(count, value);
}

Value XQueryEarlierItems::computeValue(XQueryContext& context) const {
  if (_internal(context).showsErrors()) return plain().evaluateWithContext(context);
  const Value value = _operands.value->evaluateWithContext(context);
  if (XQueryHasFailed(value, context)) return {};
  const auto isMet = answer(value, context);
  if (!isMet) return plain().evaluateWithContext(context);
  return NSNumber::numberWithBool(*isMet);
}

}  // namespace xquery

#include "Plan/Joins/XQueryJoin.h"

#include "Context/KeptValues.h"
#include "Context/XQueryContextInternal.h"
#include "Expr/XQuerySequence.h"
#include "Platform/Base/NSLog.h"
#include "Types/XQueryAtomization.h"
#include "xquery/Number.h"

#include <algorithm>
#include <utility>

namespace xquery {
namespace {

// Evaluates what the plain way may not have come to evaluate yet, and may never: null for an error,
// which leaves nothing behind. That goes for limits as well, such as a range of too many items; one
// that ends the whole evaluation is reached again at the next look at the work.
Value valueOrNull(const XQueryExpr& expr, XQueryContext& context) {
  auto& dynamic = context._internal();
  const Value item = dynamic.contextItem();
  const int64_t position = dynamic.position();
  const int64_t last = dynamic.last();
  const Ref<XQueryError> error = dynamic.error();
  Value value = expr.evaluateWithContext(context);
  if (!XQueryHasFailed(value, context)) return value;
  dynamic.passOverFailure(error);
  dynamic.setContextItem(item, position);
  dynamic.setLast(last);
  return {};
}

// Where it has to be known for every round.
bool isBrieflySettledAround(const Value& value) {
  constexpr size_t mostItems = 4096;
  return XQueryItemList(value.get()).count() <= mostItems && XQueryAreSettled({&value, 1}, true);
}

enum class Answer : uint8_t { No, Yes, Failure };

// What the conditions, joined by "and", come to.
Answer answerOf(const std::vector<Ref<XQueryExpr>>& conditions, XQueryContext& context) {
  for (const auto& condition : conditions) {
    const Value value = valueOrNull(*condition, context);
    if (!value) return Answer::Failure;
    if (!XQueryIsTrue(XQueryEffectiveBooleanValue(value, context))) return Answer::No;
  }
  return Answer::Yes;
}

}  // namespace

std::unique_ptr<const XQueryJoin> XQueryJoin::ofClause(const XQueryExpr& owner, int64_t varID,
                                                       XQueryJoinCondition condition) {
  return std::unique_ptr<const XQueryJoin>(
      new XQueryJoin(owner, varID, std::move(condition), false));
}

std::unique_ptr<const XQueryJoin> XQueryJoin::ofStep(const XQueryExpr& owner,
                                                     XQueryJoinCondition condition,
                                                     bool looksAround) {
  return std::unique_ptr<const XQueryJoin>(
      new XQueryJoin(owner, 0, std::move(condition), looksAround));
}

// Whether what probe and guards find outside their nodes is the same for the whole round, whatever
// is constructed meanwhile.
bool XQueryJoin::isInvariantInRound(XQueryContext& context) const {
  const auto& dynamic = context._internal();
  return std::all_of(
      _condition.outward.begin(), _condition.outward.end(), [&](const XQueryFacts& facts) {
        if (facts.does(XQueryDeeds::ReadsGlobals) || !facts.reads.isExact()) return false;
        const bool readsFocus = facts.does(XQueryDeeds::ReadsItem | XQueryDeeds::ReadsRoot);
        if (readsFocus && !isBrieflySettledAround(dynamic.contextItem())) return false;
        bool areSettled = true;
        facts.reads.forEach([&](int64_t varID) {
          areSettled = areSettled && isBrieflySettledAround(dynamic.variableForID(varID));
        });
        return areSettled;
      });
}

bool XQueryJoin::pick(const Value& source, const Lister& listItems, XQueryContext& context,
                      XQueryPicks& picks) const {
  if (!source || XQueryLogEnabled()) return false;
  if (_varID != 0 && XQueryItemList(source.get()).count() < XQueryJoinTable::fewestItems) {
    return false;
  }
  const auto found = table(source, listItems, context);
  if (!found || !isInvariantInRound(context)) return false;
  const bool needsFail =
      std::any_of(_condition.needed.begin(), _condition.needed.end(),
                  [&](const auto& expr) { return !valueOrNull(*expr, context); });
  if (needsFail) return false;
  const Answer guards = answerOf(_condition.guards, context);
  if (guards == Answer::Failure) return false;
  // Without a probe nothing is met, but what may be an error has still to be asked.
  Value probe = guards == Answer::Yes ? valueOrNull(*_condition.probe, context) : NSNull::null();
  if (guards == Answer::No && _condition.relation.isComplement) return false;
  if (!found->select(probe, picks.chosen, picks.wantsFirst && _condition.isWhole)) return false;
  if (!_condition.isWhole) {
    for (XQueryPick& pick : picks.chosen) pick.isSure = false;
  }
  picks.items = std::shared_ptr<const std::vector<Value>>(found, &found->items());
  return true;
}

// The table that is kept, or one made when it is worth it; null for the plain way.
std::shared_ptr<XQueryJoinTable> XQueryJoin::table(const Value& source, const Lister& listItems,
                                                   XQueryContext& context) const {
  auto& keptValues = context._internal().keptValues();
  if (keptValues.looksAway(_owner)) return nullptr;
  std::shared_ptr<XQueryKeptValue> kept;
  switch (keptValues.use(_owner, {&source, 1}, _looksAroundSource, kept)) {
    case XQueryKeptValues::Use::First:
      return nullptr;
    case XQueryKeptValues::Use::Second: {
      auto made = makeTable(listItems, context);
      if (made && !made->isComplete()) made = nullptr;
      keptValues.keep(_owner, {&source, 1}, made);
      return made;
    }
    case XQueryKeptValues::Use::Further:
      break;
  }
  return std::static_pointer_cast<XQueryJoinTable>(kept);
}

std::shared_ptr<XQueryJoinTable> XQueryJoin::makeTable(const Lister& listItems,
                                                       XQueryContext& context) const {
  std::vector<Value> items;
  if (!listItems(items)) return nullptr;
  if (items.size() < XQueryJoinTable::fewestItems || items.size() > XQueryJoinTable::mostItems) {
    return nullptr;
  }
  if (_condition.looksOutOfItems && !XQueryAreSettled(items, true)) return nullptr;
  auto& dynamic = context._internal();
  const Value item = dynamic.contextItem();
  const int64_t position = dynamic.position();
  auto made = std::make_shared<XQueryJoinTable>(_condition.relation, items, [&](size_t index) {
    return keyOf(items[index], index, context);
  });
  if (_varID == 0) dynamic.setContextItem(item, position);
  return made;
}

Value XQueryJoin::keyOf(const Value& item, size_t position, XQueryContext& context) const {
  auto& dynamic = context._internal();
  if (_varID != 0) {
    dynamic.setVariable(item, _varID);
  } else {
    dynamic.setContextItem(item, static_cast<int64_t>(position) + 1);
  }
  const bool checksFail =
      std::any_of(_condition.checks.begin(), _condition.checks.end(),
                  [&](const auto& expr) { return !valueOrNull(*expr, context); });
  if (checksFail) return {};
  switch (answerOf(_condition.filters, context)) {
    case Answer::Yes:
      return valueOrNull(*_condition.key, context);
    case Answer::No:  // as an item without a key, it meets nothing
      return Value(NSNull::null());
    default:
      return {};
  }
}

}  // namespace xquery

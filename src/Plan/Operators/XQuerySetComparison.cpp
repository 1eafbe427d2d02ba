// Nobody can tell: pairs are compared in an order of which nothing is left to see, unless one of
// them is an error. A set takes texts alone, or numbers alone, and answers for such probes only,
// so that no pair is one: a set of texts may even read its list no further than to the first text
// that is equal. Nothing is compared with a list without items, but each of the other items has to
// be one that can be compared, which those of a set are. Everything else is compared as it was
// written, and so is everything with diagnostics on.
#include "Plan/Operators/XQuerySetComparison.h"

#include "Context/KeptValues.h"
#include "Context/XQueryContextInternal.h"
#include "Expr/Operators/XQueryOperatorExpr.h"
#include "Expr/XQuerySequence.h"
#include "Plan/Joins/XQueryGrowingTexts.h"
#include "Plan/Joins/XQueryIndexedItems.h"
#include "Plan/Joins/XQueryJoinOperand.h"
#include "Plan/Joins/XQueryJoinTable.h"
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

bool isEquality(const XQueryRelation& relation) {
  return relation.test == XQueryRelation::Equal && !relation.negated;
}

}  // namespace

// Of one side: what the index of the items' tree knows of them, or else, of texts that are asked
// for equal ones, those read so far; of anything else a table, once it is made, or none where that
// cannot be.
class XQuerySetComparison::Set final : public XQueryKeptValue {
 public:
  Set(const XQueryJoinRelation& by, const Value& items) : _by(by), _items(items) {}

  // False where the index has no answer.
  bool takeIndex(XQueryContext& context) {
    if (!isEquality(_by.relation)) return false;
    if (const Items& items = listed()) {
      _indexed = XQueryIndexedItems::of(items, XQueryValueWay(), context);
    }
    return _indexed != nullptr;
  }
  // For: no index, and the items are read from now on.
  void takeTexts() {
    if (!isEquality(_by.relation)) return;
    if (const Items& items = listed()) XQueryIndexedItems::noteAsked(*items, XQueryValueWay());
    _texts = XQueryGrowingTexts::of(_items);
  }
  // Whether the table may be made: the same list has come a second time, or is long enough.
  void allowTable() { _mayMakeTable = true; }
  // Whether nothing can be an error that the items are compared with.
  bool isRegular() { return _indexed || _texts || (table() && _table->isRegular()); }
  // Nothing for a probe that has to be compared the plain way.
  std::optional<bool> meets(const Value& probe) {
    if (_indexed) {
      const auto areMet = _indexed->holds(XQueryItemList(probe.get()), _looked);
      if (!areMet || _indexed->isWorthATable(_looked)) leaveIndex();
      if (areMet) return areMet;
    }
    if (const auto areMet = _texts ? meetsTexts(probe) : std::nullopt) return areMet;
    return table() ? _table->meets(probe) : std::nullopt;
  }

 private:
  using Items = XQueryJoinTable::Items;

  void leaveIndex() {
    _indexed = nullptr;
    _texts = XQueryGrowingTexts::of(_items);
    allowTable();
  }
  // Null for too many.
  const Items& listed() {
    if (_listed || _isRefused) return _listed;
    const auto items = std::make_shared<std::vector<Value>>();
    if (XQueryListItems(XQueryItemList(_items.get()), *items) && !items->empty() &&
        items->size() <= XQueryJoinTable::mostItems) {
      _listed = items;
    }
    _isRefused = !_listed;
    return _listed;
  }
  std::optional<bool> meetsTexts(const Value& probe) {
    const XQueryItemList list(probe.get());
    WorkPacer pacer;
    for (size_t i = 0; i < list.count(); ++i) {
      pacer.turn();
      if (!XQueryJoinOperand::hasText(list[i])) return std::nullopt;
    }
    for (size_t i = 0; i < list.count(); ++i) {
      pacer.turn();
      const auto isMet = _texts->contains(XQueryUntypedText(*list[i]).view());
      if (isMet.value_or(true)) return isMet;
    }
    return false;
  }
  XQueryJoinTable* table() {
    if (_table || !_mayMakeTable || !listed()) return _table.get();
    _table = std::make_unique<XQueryJoinTable>(_by, _listed,
                                               [this](size_t index) { return (*_listed)[index]; });
    if (!_table->isComplete()) {
      _table = nullptr;
      _listed = nullptr;
      _isRefused = true;
    }
    return _table.get();
  }

  const XQueryJoinRelation _by;
  const Value _items;
  Items _listed;
  bool _isRefused = false;
  std::unique_ptr<const XQueryIndexedItems> _indexed;
  size_t _looked = 0;  // that the index has found
  std::unique_ptr<XQueryGrowingTexts> _texts;
  std::unique_ptr<XQueryJoinTable> _table;
  bool _mayMakeTable = false;
};

Ref<XQuerySetComparison> XQuerySetComparison::exprWithPlain(Ref<XQueryOperatorExpr> plain,
                                                            Again again) {
  return make<XQuerySetComparison>(std::move(plain), again);
}

XQuerySetComparison::XQuerySetComparison(Ref<XQueryOperatorExpr> plain, Again again)
    : XQueryPlannedExpr(plain), _comparison(*plain), _again(again) {}

bool XQuerySetComparison::isOfEquality() const {
  return _comparison.operatorType() == XQueryOperatorEqual;
}

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
  Gain gain = Gain::None;
  // However long a list is that is never seen again, looking its items up takes less than a set of
  // them, which could answer no other comparison.
  if (_again == Again::Left && leftCount >= fewItems) setIsLeft = true;
  if (_again == Again::Right && rightCount >= fewItems) setIsLeft = false;
  const bool isAgain = _again == Again::Both || _again == (setIsLeft ? Again::Left : Again::Right);
  if (isOfEquality() && isAgain && (setIsLeft ? leftCount : rightCount) >= fewItems)
    gain = Gain::IfAgain;
  if (work >= manyPairs) gain = Gain::AtOnce;
  const auto set = setOf(setIsLeft ? left : right, setIsLeft, gain, context);
  if (pairs == 0 && left && right && set && set->isRegular()) return NSNull::null();
  const auto areMet = set ? set->meets(setIsLeft ? right : left) : std::nullopt;
  if (!areMet) return _comparison.answerFor(left, right, context);
  return NSNumber::numberWithBool(*areMet);
}

// Null where there is none, and for a list that may never be seen again.
std::shared_ptr<XQuerySetComparison::Set> XQuerySetComparison::setOf(const Value& items,
                                                                     bool isLeft, Gain gain,
                                                                     XQueryContext& context) const {
  auto& keptValues = _internal(context).keptValues();
  if (gain != Gain::AtOnce && keptValues.looksAway(*this)) return nullptr;
  std::shared_ptr<XQueryKeptValue> kept;
  // Which side it is decides how it is asked.
  const std::array<Value, 2> dependencies = {items, NSNumber::numberWithBool(isLeft)};
  const auto use = gain == Gain::None ? keptValues.use(*this, dependencies, false, kept)
                                      : keptValues.useAtOnce(*this, dependencies, false, kept);
  if (use == XQueryKeptValues::Use::First) {
    auto made = indexedSet(items, isLeft, context);
    if (made) keptValues.keep(*this, dependencies, made);
    return made;
  }
  auto set = std::static_pointer_cast<Set>(kept);
  if (use == XQueryKeptValues::Use::Second) {
    set = std::make_shared<Set>(relationOf(_comparison.operatorType(), isLeft), items);
    if (!set->takeIndex(context)) set->takeTexts();
    keptValues.keep(*this, dependencies, set);
    if (gain == Gain::IfAgain) return set;
  }
  if (set) set->allowTable();
  return set;
}

// What the index of a tree answers costs no table, so that it need not be known whether the list
// comes again.
std::shared_ptr<XQuerySetComparison::Set> XQuerySetComparison::indexedSet(
    const Value& items, bool isLeft, XQueryContext& context) const {
  const XQueryItemList list(items.get());
  if (!isOfEquality() || list.count() < XQueryIndexedItems::fewestItems) return nullptr;
  if (!XQueryIndexedItems::mayAnswer(list[0], XQueryValueWay(), context)) return nullptr;
  if (!XQueryAreSettled({&items, 1}, false)) return nullptr;
  auto made = std::make_shared<Set>(relationOf(_comparison.operatorType(), isLeft), items);
  return made->takeIndex(context) ? made : nullptr;
}

}  // namespace xquery

#include "Expr/Clauses/XQueryJoinTable.h"

#include "Expr/XQuerySequence.h"
#include "Platform/Base/WorkMeter.h"
#include "Types/XQueryAtomization.h"
#include "Types/XQueryTypeTable.h"
#include "xquery/Number.h"
#include "xquery/XMLNode.h"

#include <algorithm>
#include <bit>
#include <cmath>
#include <functional>
#include <limits>

namespace xquery {
namespace {

// Every integer below this magnitude is a double and no other integer is the same double.
constexpr double exactIntegerBound = 1LL << std::numeric_limits<double>::digits;
constexpr double notANumber = std::numeric_limits<double>::quiet_NaN();

// NaN, whichever way it is stored, meets nothing.
bool isFloating(const NSNumber& number) {
  return std::isnan(number.doubleValue()) || number.storage() == NSNumber::Storage::Double ||
         number.storage() == NSNumber::Storage::Float;
}

bool isExactAsDouble(const NSNumber& number) {
  const NSDecimal* decimal = number.storedDecimal();
  if (decimal && !decimal->isSmallInteger()) return false;
  return std::abs(number.doubleValue()) < exactIntegerBound;
}

uint32_t hashOfDouble(double value) {
  // The two zeros are equal.
  const auto bits = std::bit_cast<uint64_t>(value == 0 ? 0.0 : value);
  return static_cast<uint32_t>((bits * 0x9E3779B97F4A7C15U) >> 32U);
}

uint32_t hashOfText(NSStringView text) {
  return text.hash();
}

int orderOf(double a, double b) {
  return a < b ? -1 : a > b ? 1 : 0;
}
int orderOf(NSStringView a, NSStringView b) {
  return a.compare(b);
}
bool isEqual(double a, double b) {
  return a == b;
}
bool isEqual(NSStringView a, NSStringView b) {
  return a.equals(b);
}
bool meetsNothing(double key) {
  return std::isnan(key);
}
bool meetsNothing(NSStringView) {
  return false;
}

// Of several probes of an order relation one decides: what is below any is below the greatest.
template <class Key>
Key decidingProbe(XQueryRelation relation, const std::vector<Key>& probes) {
  const auto below = [](const Key& a, const Key& b) { return orderOf(a, b) < 0; };
  const bool wantsGreatest = (relation.test == XQueryRelation::Less) != relation.negated;
  return wantsGreatest ? *std::max_element(probes.begin(), probes.end(), below)
                       : *std::min_element(probes.begin(), probes.end(), below);
}

// So that every key is found once.
template <class Key>
void keepDistinct(std::vector<Key>& probes) {
  if (probes.size() < 2) return;
  WorkPacer pacer;
  std::sort(probes.begin(), probes.end(), [&pacer](const Key& a, const Key& b) {
    pacer.turn();
    return orderOf(a, b) < 0;
  });
  const auto areEqual = [](const Key& a, const Key& b) { return isEqual(a, b); };
  probes.erase(std::unique(probes.begin(), probes.end(), areEqual), probes.end());
}

// In the order of the items, each once; an item that has to be asked stays one.
void arrange(XQueryJoinTable::Selection& selection) {
  const auto before = [](const auto& a, const auto& b) {
    return a.position != b.position ? a.position < b.position : a.isSure < b.isSure;
  };
  if (!std::is_sorted(selection.begin(), selection.end(), before)) {
    std::sort(selection.begin(), selection.end(), before);
  }
  const auto isSameItem = [](const auto& a, const auto& b) { return a.position == b.position; };
  selection.erase(std::unique(selection.begin(), selection.end(), isSameItem), selection.end());
}

}  // namespace

// --- operands ------------------------------------------------------------------------------------

XQueryJoinTable::Operand::Operand(NSObject* item) {
  if (!item) return;
  const XQueryTypeID type =
      item->isNode() ? XQueryTypeID{XQueryTypeUntypedAtomic} : XQueryObjectTypeID(item);
  const XQueryTypeID primitive = XQueryPrimitiveTypeForTypeID(type);
  if (type == XQueryTypeUntypedAtomic || type == XQueryTypeString) {
    kind = type == XQueryTypeString ? Text : Untyped;
    text = XQueryUntypedText(*item);
  } else if (primitive >= XQueryTypeDouble && primitive <= XQueryTypeDecimal) {
    const auto& value = *cast<NSNumber>(item);
    number = value.doubleValue();
    kind = isFloating(value) ? Floating : isExactAsDouble(value) ? ExactDecimal : InexactDecimal;
  }
}

bool XQueryJoinTable::Operand::scan() {
  return kind == Untyped ? scanDouble(text.view(), number) : isNumber();
}

template <class HashOf>
void XQueryJoinTable::Chains::build(size_t count, HashOf hashOf) {
  _heads.assign(std::bit_ceil(2 * count + 1), end);
  _next.assign(count, end);
  WorkPacer pacer;
  // From the last key on, so that a chain begins with the first one.
  for (size_t key = count; key-- > 0;) {
    pacer.turn();
    uint32_t& head = _heads[hashOf(key) & (_heads.size() - 1)];
    _next[key] = head;
    head = static_cast<uint32_t>(key);
  }
}

// --- filling -------------------------------------------------------------------------------------

XQueryJoinTable::XQueryJoinTable(const XQueryJoinCondition& condition, std::vector<Value> items,
                                 const KeyReader& keyOf)
    : _relation(condition.relation),
      _isValueComparison(condition.isValueComparison),
      _items(std::move(items)) {
  readKeys(keyOf);
  countMemory();
}

XQueryJoinTable::~XQueryJoinTable() {
  uncountValueBytes(static_cast<size_t>(_countedBytes));
}

void XQueryJoinTable::readKeys(const KeyReader& keyOf) {
  const int64_t bytesBefore = workMeter.valueBytes;
  for (size_t index = 0; index < _items.size() && _isComplete; ++index) {
    checkWork();
    read(static_cast<uint32_t>(index), keyOf(index));
    _isComplete = !isTooLarge(bytesBefore);
  }
}

// `bytesBefore`: what all values took before the first key was read.
bool XQueryJoinTable::isTooLarge(int64_t bytesBefore) const {
  if (_keys.size() > std::max(keysOfAnyItems, _items.size() * mostKeysPerItem)) return true;
  // With both ways of finding it.
  constexpr size_t bytesPerKey = sizeof(Operand) + sizeof(Value) + sizeof(NSStringView) +
                                 sizeof(double) + 12 * sizeof(uint32_t);
  constexpr int64_t part = 4;
  const auto own = static_cast<int64_t>(_items.size() * sizeof(Value) + _keys.size() * bytesPerKey);
  const int64_t keyBytes = workMeter.valueBytes - bytesBefore;
  return own + keyBytes > workMeter.mostValueBytes / part - bytesBefore / part;
}

void XQueryJoinTable::read(uint32_t position, const Value& value) {
  if (!value) return _irregular.push_back(position);
  const XQueryItemList list(value.get());
  Operands keys;
  for (size_t i = 0; i < list.count(); ++i) keys.emplace_back(list[i]);
  if (!takes(keys)) return _irregular.push_back(position);
  for (size_t i = 0; i < keys.size(); ++i) {
    if (_keys.size() == mostItems) throw std::bad_alloc();
    if (!list[i]->isNode()) _keptKeys.emplace_back(list[i]);
    _hasDecimals = _hasDecimals || keys[i].isDecimal();
    _hasInexactDecimals = _hasInexactDecimals || keys[i].kind == Operand::InexactDecimal;
    _keys.push_back(std::move(keys[i]));
    _positions.push_back(position);
  }
}

// Whether the keys of an item are of the one kind that the table holds: that of its first key. An
// item without keys meets nothing.
bool XQueryJoinTable::takes(const Operands& keys) {
  if (keys.empty()) return true;
  if (_isValueComparison && keys.size() > 1) return false;
  const auto isText = [](const Operand& key) { return key.isText(); };
  const auto isNumber = [](const Operand& key) { return key.isNumber(); };
  const bool allTexts = std::all_of(keys.begin(), keys.end(), isText);
  const bool allNumbers = std::all_of(keys.begin(), keys.end(), isNumber);
  if (!_holdsTexts && !_holdsNumbers) {
    _holdsTexts = allTexts;
    _holdsNumbers = allNumbers;
  }
  return (_holdsTexts && allTexts) || (_holdsNumbers && allNumbers);
}

// Reads the keys as numbers. An item one of whose keys is none cannot be compared with a number.
void XQueryJoinTable::scanTexts() {
  if (_isScanned) return;
  _isScanned = true;
  _numbers.reserve(_keys.size());
  for (size_t key = 0; key < _keys.size(); ++key) {
    const bool isNumber = _keys[key].scan();
    _numbers.push_back(isNumber ? _keys[key].number : notANumber);
    if (!isNumber) _irregularAsNumbers.push_back(_positions[key]);
  }
}

void XQueryJoinTable::countMemory() {
  const size_t bytes = _items.size() * sizeof(Value) + _keptKeys.size() * sizeof(Value) +
                       _keys.size() * sizeof(Operand) +
                       (_positions.size() + _irregular.size()) * sizeof(uint32_t) +
                       _texts.size() * sizeof(NSStringView) + _numbers.size() * sizeof(double) +
                       _textChains.bytes() + _numberChains.bytes();
  const int64_t more = static_cast<int64_t>(bytes) - _countedBytes;
  if (more > 0) countValueBytes(static_cast<size_t>(more));
  _countedBytes = std::max(_countedBytes, static_cast<int64_t>(bytes));
}

// --- asking --------------------------------------------------------------------------------------

bool XQueryJoinTable::select(const Value& probe, Selection& selection) {
  if (!probe) return false;
  const XQueryItemList list(probe.get());
  if (_isValueComparison && list.count() > 1) return false;
  Operands probes;
  for (size_t i = 0; i < list.count(); ++i) {
    probes.emplace_back(list[i]);
    if (probes.back().kind == Operand::Other) return false;
  }
  const auto isText = [](const Operand& operand) { return operand.isText(); };
  if (!probes.empty() && !_keys.empty()) {
    if (_holdsTexts && std::all_of(probes.begin(), probes.end(), isText)) {
      selectByText(probes, selection);
    } else if (comparesAsNumbers(probes)) {
      selectByNumber(probes, selection);
    } else {
      return false;
    }
  }
  for (const uint32_t position : _irregular) selection.push_back({position, false});
  arrange(selection);
  countMemory();
  return true;
}

// Whether every pair is compared by double, or as if it were.
bool XQueryJoinTable::comparesAsNumbers(const Operands& probes) const {
  return std::all_of(probes.begin(), probes.end(), [this](const Operand& probe) {
    switch (probe.kind) {
      case Operand::Untyped:  // a value comparison would make it a string
        return _holdsNumbers && !_isValueComparison && Operand(probe).scan();
      case Operand::Floating:
        return _holdsNumbers || !_isValueComparison;
      case Operand::ExactDecimal:
        return _holdsNumbers ? !_hasInexactDecimals : !_isValueComparison;
      case Operand::InexactDecimal:
        return _holdsNumbers ? !_hasDecimals : !_isValueComparison;
      default:
        return false;
    }
  });
}

void XQueryJoinTable::selectByText(const Operands& probes, Selection& selection) {
  if (_texts.empty()) {
    _texts.reserve(_keys.size());
    for (const Operand& key : _keys) _texts.push_back(key.text.view());
  }
  std::vector<NSStringView> texts;
  for (const Operand& probe : probes) texts.push_back(probe.text.view());
  selectBy(_texts, std::move(texts), _textChains, hashOfText, selection);
}

void XQueryJoinTable::selectByNumber(const Operands& probes, Selection& selection) {
  scanTexts();
  for (const uint32_t position : _irregularAsNumbers) selection.push_back({position, false});
  std::vector<double> numbers;
  for (Operand probe : probes) {
    probe.scan();
    if (!std::isnan(probe.number)) numbers.push_back(probe.number);
  }
  if (numbers.empty()) return;
  selectBy(_numbers, std::move(numbers), _numberChains, hashOfDouble, selection);
}

template <class Key, class HashOf>
void XQueryJoinTable::selectBy(const std::vector<Key>& keys, std::vector<Key> probes,
                               Chains& chains, HashOf hashOf, Selection& selection) {
  WorkPacer pacer;
  if (_relation.test != XQueryRelation::Equal) {
    const Key probe = decidingProbe(_relation, probes);
    for (size_t key = 0; key < keys.size(); ++key) {
      pacer.turn();
      if (meetsNothing(keys[key]) || !_relation.holds(orderOf(keys[key], probe))) continue;
      selection.push_back({_positions[key], true});
    }
    return;
  }
  if (!chains.isBuilt()) {
    chains.build(keys.size(), [&](size_t key) { return hashOf(keys[key]); });
  }
  keepDistinct(probes);
  for (const Key& probe : probes) {
    for (uint32_t key = chains.first(hashOf(probe)); key != Chains::end; key = chains.next(key)) {
      pacer.turn();
      if (isEqual(keys[key], probe)) selection.push_back({_positions[key], true});
    }
  }
}

}  // namespace xquery

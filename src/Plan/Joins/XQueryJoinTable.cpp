#include "Plan/Joins/XQueryJoinTable.h"

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
#include <numeric>
#include <type_traits>

namespace xquery {
namespace {

constexpr double notANumber = std::numeric_limits<double>::quiet_NaN();

// What holds for an order relation, and for equal values.
XQueryRelation withTies(XQueryRelation relation) {
  if (relation.negated) return relation;
  return {relation.test == XQueryRelation::Less ? XQueryRelation::Greater : XQueryRelation::Less,
          true};
}

// Of several probes of an order relation one decides: what is below any is below the greatest.
template <class Key>
Key decidingProbe(XQueryRelation relation, const std::vector<Key>& probes) {
  const auto below = [](const Key& a, const Key& b) { return XQueryOrderOfKeys(a, b) < 0; };
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
    return XQueryOrderOfKeys(a, b) < 0;
  });
  const auto areEqual = [](const Key& a, const Key& b) { return XQueryAreEqualKeys(a, b); };
  probes.erase(std::unique(probes.begin(), probes.end(), areEqual), probes.end());
}

// Of the probes those that decide.
template <class Key>
void keepDeciding(XQueryRelation relation, bool isDistinct, std::vector<Key>& probes) {
  if (relation.test == XQueryRelation::Equal) {
    if (isDistinct) keepDistinct(probes);
  } else if (!probes.empty())
    probes.assign(1, decidingProbe(relation, probes));
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

// --- filling -------------------------------------------------------------------------------------

XQueryJoinTable::XQueryJoinTable(const XQueryJoinRelation& by, Items items, const KeyReader& keyOf)
    : _relation(by.relation),
      _isValueComparison(by.isValueComparison),
      _isComplement(by.isComplement),
      _isIdentity(by.isIdentity),
      _isPrefix(by.isPrefix),
      _wantsOneKey(by.isValueComparison && !by.keysAreOfEach),
      _wantsOneProbe(by.isValueComparison && !by.probesAreOfEach),
      _items(std::move(items)) {
  readKeys(keyOf);
  countMemory();
}

XQueryJoinTable::~XQueryJoinTable() {
  uncountValueBytes(static_cast<size_t>(_countedBytes));
}

void XQueryJoinTable::readKeys(const KeyReader& keyOf) {
  const int64_t bytesBefore = workMeter.valueBytes;
  if (!_isIdentity) _keys.reserve(_items->size());
  _positions.reserve(_items->size());
  for (size_t index = 0; index < _items->size() && _isComplete; ++index) {
    checkWork();
    read(static_cast<uint32_t>(index), keyOf(index));
    _isComplete = !isTooLarge(bytesBefore);
  }
}

// `bytesBefore`: what all values took before the first key was read.
bool XQueryJoinTable::isTooLarge(int64_t bytesBefore) const {
  if (_keys.size() > std::max(keysOfAnyItems, _items->size() * mostKeysPerItem)) return true;
  // With both ways of finding it.
  constexpr size_t bytesPerKey = sizeof(Operand) + sizeof(Value) + sizeof(NSStringView) +
                                 sizeof(double) + 12 * sizeof(uint32_t);
  constexpr int64_t part = 4;
  const auto own =
      static_cast<int64_t>(_items->size() * sizeof(Value) + _keys.size() * bytesPerKey);
  const int64_t keyBytes = workMeter.valueBytes - bytesBefore;
  return own + keyBytes > workMeter.mostValueBytes / part - bytesBefore / part;
}

void XQueryJoinTable::read(uint32_t position, const Value& value) {
  if (!value) return _irregular.push_back(position);
  const XQueryItemList list(value.get());
  if (_isIdentity) {
    if (!readNode(position, list)) _irregular.push_back(position);
    return;
  }
  const size_t first = _keys.size();
  if (list.count() > mostItems - first) throw std::bad_alloc();
  for (size_t i = 0; i < list.count(); ++i) _keys.emplace_back(list[i]);
  const std::span<const Operand> keys = std::span(_keys).subspan(first);
  if (!takes(keys)) {
    _keys.erase(_keys.begin() + static_cast<std::ptrdiff_t>(first), _keys.end());
    return _irregular.push_back(position);
  }
  _hasSeveralKeys = _hasSeveralKeys || keys.size() > 1;
  for (size_t i = 0; i < keys.size(); ++i) {
    if (!list[i]->isNode()) _keptKeys.emplace_back(list[i]);
    _hasDecimals = _hasDecimals || keys[i].isDecimal();
    _hasInexactDecimals = _hasInexactDecimals || keys[i].kind == Operand::InexactDecimal;
    _hasFloating = _hasFloating || keys[i].kind == Operand::Floating;
    _positions.push_back(position);
  }
}

// Whether the item can be looked for by the node that is its key; without one it meets nothing.
bool XQueryJoinTable::readNode(uint32_t position, const XQueryItemList& keys) {
  if (keys.count() == 0) return true;
  if (keys.count() > 1 || !keys[0]->isNode()) return false;
  _keptKeys.emplace_back(keys[0]);
  _nodes.keys.push_back(keys[0]);
  _positions.push_back(position);
  return true;
}

// Whether the keys of an item are of the one kind that the table holds: that of its first key. An
// item without keys meets nothing.
bool XQueryJoinTable::takes(std::span<const Operand> keys) {
  if (_isComplement && (keys.size() != 1 || keys.front().isNaN())) return false;
  // What is nothing begins as the empty text does.
  if (_isPrefix && (keys.empty() || !keys.front().isText())) return false;
  if (keys.empty()) return true;
  if (_wantsOneKey && keys.size() > 1) return false;
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
  _numbers.keys.reserve(_keys.size());
  for (size_t key = 0; key < _keys.size(); ++key) {
    bool isNumber = _keys[key].scan();
    if (_isComplement && std::isnan(_keys[key].number)) isNumber = false;
    _numbers.keys.push_back(isNumber ? _keys[key].number : notANumber);
    if (!isNumber) _irregularAsNumbers.push_back(_positions[key]);
  }
}

void XQueryJoinTable::countMemory() {
  const size_t bytes =
      _items->size() * sizeof(Value) + _keptKeys.size() * sizeof(Value) +
      _keys.size() * sizeof(Operand) + _texts.bytes() + _numbers.bytes() + _exacts.bytes() +
      _nodes.bytes() +
      (_positions.size() + _irregular.size() + _firstKeys.size()) * sizeof(uint32_t);
  const int64_t more = static_cast<int64_t>(bytes) - _countedBytes;
  if (more > 0) countValueBytes(static_cast<size_t>(more));
  _countedBytes = std::max(_countedBytes, static_cast<int64_t>(bytes));
}

// --- asking --------------------------------------------------------------------------------------

XQueryJoinTable::Way XQueryJoinTable::wayFor(const Value& probe, Operands& probes) const {
  if (!probe) return Way::Plain;
  const XQueryItemList list(probe.get());
  if (_isIdentity) {
    if (list.count() > 1 || (list.count() == 1 && !list[0]->isNode())) return Way::Plain;
    return list.count() == 1 && !_nodes.keys.empty() ? Way::Nodes : Way::Nothing;
  }
  if (_wantsOneProbe && list.count() > 1) return Way::Plain;
  if (_isComplement && list.count() != 1) return Way::Plain;
  WorkPacer pacer;
  for (size_t i = 0; i < list.count(); ++i) {
    pacer.turn();
    probes.emplace_back(list[i]);
    if (probes.back().kind == Operand::Other) return Way::Plain;
    if (_isComplement && probes.back().isNaN()) return Way::Plain;
  }
  if (_isPrefix && (probes.empty() || !probes.front().isWholeText())) return Way::Plain;
  if (probes.empty() || _keys.empty()) return Way::Nothing;
  const auto isText = [](const Operand& operand) { return operand.isText(); };
  if (_holdsTexts && std::all_of(probes.begin(), probes.end(), isText)) return Way::Texts;
  return wayOfNumbers(probes);
}

std::optional<XQueryJoinTable::Question> XQueryJoinTable::questionOf(const Value& probe,
                                                                     bool isDistinct) {
  Question question;
  question.way = wayFor(probe, question.operands);
  if (question.way == Way::Plain) return std::nullopt;
  question.probe = probe;
  switch (question.way) {
    case Way::Nodes:
      question.nodes.push_back(XQueryItemList(probe.get())[0]);
      break;
    case Way::Texts:
      readTexts();
      for (const Operand& each : question.operands) question.texts.push_back(each.text.view());
      keepDeciding(_relation, isDistinct, question.texts);
      break;
    case Way::Numbers:
    case Way::NumbersButTies:
      scanTexts();
      for (Operand& each : question.operands) {
        each.scan();
        // NaN meets nothing.
        if (!std::isnan(each.number)) question.numbers.push_back(each.number);
      }
      keepDeciding(_relation, isDistinct, question.numbers);
      break;
    case Way::Exacts:
      readExacts();
      for (size_t index = 0; index < question.operands.size(); ++index) {
        const auto* number = cast<NSNumber>(XQueryItemList(probe.get())[index]);
        question.exacts.push_back({question.operands[index].number, number});
      }
      keepDeciding(_relation, isDistinct, question.exacts);
      break;
    default:
      break;
  }
  return question;
}

template <class Visit>
void XQueryJoinTable::forEachMet(const Question& question, bool wantsFirst, Visit visit) {
  const Asked asked{question.way == Way::NumbersButTies, wantsFirst};
  withForm(question, [&](auto& form, const auto& probes) {
    if (_relation.test == XQueryRelation::Equal) {
      forEachEqual(probes, form, asked, visit);
    } else {
      forEachOrdered(probes, form, asked, visit);
    }
  });
}

void XQueryJoinTable::select(const Question& question, Selection& selection, bool wantsFirst) {
  forEachMet(question, wantsFirst, [&](size_t key, bool isTie) {
    selection.push_back({_positions[key], !isTie});
    return true;
  });
  if (isOfNumbers(question)) {
    for (const uint32_t position : _irregularAsNumbers) selection.push_back({position, false});
  }
  for (const uint32_t position : _irregular) selection.push_back({position, false});
  arrange(selection);
  countMemory();
}

std::optional<bool> XQueryJoinTable::meets(const Value& probe) {
  if (!_irregular.empty()) return std::nullopt;
  // The first one that is found decides, so that sorting them would take longer.
  const auto question = questionOf(probe, false);
  if (!question || (isOfNumbers(*question) && !_irregularAsNumbers.empty())) return std::nullopt;
  bool areMet = false;
  bool isOpen = false;
  forEachMet(*question, true, [&](size_t, bool isTie) {
    (isTie ? isOpen : areMet) = true;
    return !areMet;
  });
  countMemory();
  if (isOpen && !areMet) return std::nullopt;
  return areMet;
}

size_t XQueryJoinTable::estimateFor(const Question& question) {
  if (question.way == Way::Nodes) return 1;
  size_t number = 0;
  withForm(question, [&](auto& form, const auto& probes) { number = estimate(probes, form); });
  return number;
}

template <class Key>
size_t XQueryJoinTable::estimate(const std::vector<Key>& probes, Form<Key>& form) {
  if (probes.empty()) return 0;
  if (_relation.test != XQueryRelation::Equal) {
    if (form.order.keys.empty()) return form.keys.size() / 2;
    return metInOrder(_relation, probes.front(), form).size();
  }
  if (!form.buckets.isBuilt()) form.buckets.build(form.keys);
  size_t count = 0;
  for (const Key& probe : probes) count += form.buckets.at(XQueryHashOfKey(probe)).size();
  return count;
}

// Of keys that are sorted, asked in their order, it is a difference.
std::optional<uint64_t> XQueryJoinTable::numberFor(const Question& question) {
  if (!hasOneAnswerFor(question) || _isComplement) return std::nullopt;
  uint64_t number = 0;
  withForm(question, [&](auto& form, const auto& probes) {
    const bool isOrdered = _relation.test != XQueryRelation::Equal;
    if (isOrdered && !probes.empty() && form.order.asked >= askedToSort) {
      number = metInOrder(_relation, probes.front(), form).size();
    } else {
      forEachMet(question, false, [&number](size_t, bool) {
        ++number;
        return true;
      });
    }
  });
  countMemory();
  return number;
}

std::optional<bool> XQueryJoinTable::isMetBy(const Question& question, uint32_t position) {
  if (isIrregular(position)) return std::nullopt;
  const bool isIrregularAsNumber =
      isOfNumbers(question) &&
      std::binary_search(_irregularAsNumbers.begin(), _irregularAsNumbers.end(), position);
  if (isIrregularAsNumber) return std::nullopt;
  if (_firstKeys.empty()) findKeysOfItems();
  const bool areTiesOpen = question.way == Way::NumbersButTies;
  std::optional<bool> answer = false;
  withForm(question, [&](const auto& form, const auto& probes) {
    answer = isMet(form.keys, probes, areTiesOpen, position);
  });
  return answer;
}

template <class Key>
std::optional<bool> XQueryJoinTable::isMet(const std::vector<Key>& keys,
                                           const std::vector<Key>& probes, bool areTiesOpen,
                                           uint32_t position) const {
  if (probes.empty()) return false;
  bool isOpen = false;
  for (uint32_t key = _firstKeys[position]; key < _firstKeys[position + 1]; ++key) {
    if (XQueryMeetsNothing(keys[key])) continue;
    if (_relation.test == XQueryRelation::Equal) {
      const auto before = [](const Key& a, const Key& b) { return XQueryOrderOfKeys(a, b) < 0; };
      if (!std::binary_search(probes.begin(), probes.end(), keys[key], before)) continue;
      if (!areTiesOpen) return true;
      isOpen = true;
    } else {
      const int order = XQueryOrderOfKeys(keys[key], probes.front());
      if (areTiesOpen && order == 0) {
        isOpen = true;
      } else if (holds(_relation, keys[key], probes.front())) {
        return true;
      }
    }
  }
  if (isOpen) return std::nullopt;
  return false;
}

// The keys of an item stand in a row.
void XQueryJoinTable::findKeysOfItems() {
  _firstKeys.assign(_items->size() + 1, 0);
  WorkPacer pacer;
  for (const uint32_t position : _positions) {
    pacer.turn();
    ++_firstKeys[position + 1];
  }
  std::partial_sum(_firstKeys.begin(), _firstKeys.end(), _firstKeys.begin());
  countMemory();
}

// Whether every pair is compared by double, or as if it were. Two decimals are compared exactly,
// which makes a difference where one of them is no double.
XQueryJoinTable::Way XQueryJoinTable::wayOfNumbers(const Operands& probes) const {
  Way way = Way::Numbers;
  for (const Operand& probe : probes) {
    switch (probe.kind) {
      case Operand::Untyped: {  // a value comparison would make it a string
        Operand scanned = probe;
        const bool isNumber = _holdsNumbers && !_isValueComparison && scanned.scan() &&
                              !(_isComplement && std::isnan(scanned.number));
        if (!isNumber) return Way::Plain;
        break;
      }
      case Operand::ExactDecimal:
      case Operand::InexactDecimal: {
        const bool isInexact = probe.kind == Operand::InexactDecimal;
        if (isInexact ? _hasDecimals : _hasInexactDecimals) way = Way::NumbersButTies;
        if (!_holdsNumbers && _isValueComparison) return Way::Plain;
        break;
      }
      case Operand::Floating:
        if (!_holdsNumbers && _isValueComparison) return Way::Plain;
        break;
      default:
        return Way::Plain;
    }
  }
  if (way != Way::NumbersButTies || _hasFloating) return way;
  const bool areDecimals = std::all_of(probes.begin(), probes.end(),
                                       [](const Operand& probe) { return probe.isDecimal(); });
  return areDecimals ? Way::Exacts : way;
}

void XQueryJoinTable::readTexts() {
  if (!_texts.keys.empty()) return;
  _texts.keys.reserve(_keys.size());
  for (const Operand& key : _keys) _texts.keys.push_back(key.text.view());
}

// All keys are numbers, which are kept.
void XQueryJoinTable::readExacts() {
  if (!_exacts.keys.empty()) return;
  _exacts.keys.reserve(_keys.size());
  for (size_t key = 0; key < _keys.size(); ++key) {
    _exacts.keys.push_back({_keys[key].number, cast<NSNumber>(_keptKeys[key].get())});
  }
}

// A few probes are compared with every key; for more of them the keys are sorted.
template <class Key, class Visit>
void XQueryJoinTable::forEachOrdered(const std::vector<Key>& probes, Form<Key>& form, Asked asked,
                                     Visit visit) {
  if (probes.empty()) return;
  const std::vector<Key>& keys = form.keys;
  const Key& probe = probes.front();
  // So many are found in the order of the items as quickly as put into it.
  constexpr size_t part = 16;
  const XQueryRelation relation = asked.areTiesOpen ? withTies(_relation) : _relation;
  const auto isTie = [&](size_t key) {
    return asked.areTiesOpen && XQueryOrderOfKeys(keys[key], probe) == 0;
  };
  WorkPacer pacer;
  if (form.order.asked < askedToSort) {
    ++form.order.asked;
  } else {
    const auto met = metInOrder(relation, probe, form);
    if (met.size() < keys.size() / part) {
      for (const uint32_t key : met) {
        pacer.turn();
        if (!visit(key, isTie(key))) return;
      }
      return;
    }
  }
  for (size_t key = 0; key < keys.size(); ++key) {
    pacer.turn();
    if (XQueryMeetsNothing(keys[key]) || !holds(relation, keys[key], probe)) continue;
    if (!visit(key, isTie(key)) || (asked.wantsFirst && !isTie(key))) return;
  }
}

// The keys that meet a probe are the first ones in their order, or the last ones; those that begin
// with it stand in a row.
template <class Key>
std::span<const uint32_t> XQueryJoinTable::metInOrder(XQueryRelation relation, const Key& probe,
                                                      Form<Key>& form) const {
  std::vector<uint32_t>& sorted = form.order.keys;
  const std::vector<Key>& keys = form.keys;
  if (sorted.empty()) {
    for (size_t key = 0; key < keys.size(); ++key) {
      if (!XQueryMeetsNothing(keys[key])) sorted.push_back(static_cast<uint32_t>(key));
    }
    WorkPacer pacer;
    std::sort(sorted.begin(), sorted.end(), [&](uint32_t a, uint32_t b) {
      pacer.turn();
      return XQueryOrderOfKeys(keys[a], keys[b]) < 0;
    });
  }
  return metAmong(relation, probe, keys, sorted);
}

template <class Key, class Visit>
void XQueryJoinTable::forEachEqual(const std::vector<Key>& probes, Form<Key>& form, Asked asked,
                                   Visit visit) {
  if (probes.empty()) return;
  if (!form.buckets.isBuilt()) form.buckets.build(form.keys);
  WorkPacer pacer;
  for (const Key& probe : probes) {
    for (const uint32_t key : form.buckets.at(XQueryHashOfKey(probe))) {
      pacer.turn();
      if (!XQueryAreEqualKeys(form.keys[key], probe)) continue;
      if (!visit(key, asked.areTiesOpen)) return;
      if (asked.wantsFirst && !asked.areTiesOpen) break;
    }
  }
}

}  // namespace xquery

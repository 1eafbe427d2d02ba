#include "Plan/Joins/XQueryJoinPair.h"

#include "Platform/Base/WorkMeter.h"

#include <algorithm>
#include <numeric>
#include <span>
#include <type_traits>

namespace xquery {
namespace {

constexpr uint32_t noKey = UINT32_MAX;

// The first of the keys that are equal to one; its row goes by that.
template <class Form, class Key>
uint32_t firstEqual(const Form& form, const Key& key) {
  for (const uint32_t each : form.buckets.at(XQueryHashOfKey(key))) {
    if (XQueryAreEqualKeys(form.keys[each], key)) return each;
  }
  return noKey;
}

}  // namespace

std::unique_ptr<XQueryJoinPair> XQueryJoinPair::of(Table& first, const Question& askedOfFirst,
                                                   Table& second, const Question& askedOfSecond) {
  const bool areOrders = isOfOrder(first) && isOfOrder(second);
  if (!areOrders && (!isOfRows(first) || second._isComplement)) return nullptr;
  std::unique_ptr<XQueryJoinPair> made(
      new XQueryJoinPair(first, askedOfFirst.way, second, askedOfSecond.way));
  if (!made->answersFor(askedOfFirst, askedOfSecond)) return nullptr;
  if (areOrders && !made->takesStretches(askedOfFirst)) return nullptr;
  if (!areOrders) {
    if (second._firstKeys.empty()) second.findKeysOfItems();
    first.withForm(askedOfFirst, [&](auto& rows, const auto&) {
      second.withForm(askedOfSecond,
                      [&](const auto& others, const auto&) { made->fill(rows, others); });
    });
  }
  made->_countedBytes = (made->_starts.size() + made->_keys.size()) * sizeof(uint32_t);
  countValueBytes(made->_countedBytes);
  return made;
}

XQueryJoinPair::~XQueryJoinPair() {
  uncountValueBytes(_countedBytes);
}

bool XQueryJoinPair::answersFor(const Question& first, const Question& second) const {
  using Way = Table::Way;
  const bool areOfWays = first.way == _firstWay && second.way == _secondWay;
  return areOfWays && first.way != Way::Nothing && second.way != Way::Nothing &&
         _first.hasOneAnswerFor(first) && _second.hasOneAnswerFor(second);
}

// All keys as one row, where both tables have the same ones; false where they have not.
bool XQueryJoinPair::takesStretches(const Question& first) {
  if (_firstWay != _secondWay || _first._positions != _second._positions) return false;
  bool areSame = false;
  _first.withForm(first, [&](const auto& form, const auto&) {
    _second.withForm(first, [&](const auto& other, const auto&) {
      if constexpr (std::is_same_v<decltype(form), decltype(other)>) {
        WorkPacer pacer;
        areSame = std::equal(form.keys.begin(), form.keys.end(), other.keys.begin(),
                             other.keys.end(), [&pacer](const auto& a, const auto& b) {
                               pacer.turn();
                               const bool isNothing = XQueryMeetsNothing(a);
                               return isNothing ? XQueryMeetsNothing(b) : XQueryAreEqualKeys(a, b);
                             });
        if (!areSame) return;
        for (size_t key = 0; key < form.keys.size(); ++key) {
          pacer.turn();
          if (!XQueryMeetsNothing(form.keys[key])) _keys.push_back(static_cast<uint32_t>(key));
        }
        _starts = {0, static_cast<uint32_t>(_keys.size())};
        sortRows(form.keys);
      }
    });
  });
  _areStretches = areSame;
  return areSame;
}

template <class FirstKey, class SecondKey>
void XQueryJoinPair::fill(Table::Form<FirstKey>& first, const Table::Form<SecondKey>& second) {
  if (!first.buckets.isBuilt()) first.buckets.build(first.keys);
  struct Place {
    uint32_t row;
    uint32_t key;
  };
  std::vector<Place> places;
  places.reserve(first.keys.size());
  _starts.assign(first.keys.size() + 1, 0);
  WorkPacer pacer;
  for (size_t each = 0; each < first.keys.size(); ++each) {
    pacer.turn();
    const uint32_t position = _first._positions[each];
    const uint32_t key = _second._firstKeys[position];
    const bool hasKey = key < _second._firstKeys[position + 1];
    if (!hasKey || XQueryMeetsNothing(first.keys[each]) || XQueryMeetsNothing(second.keys[key])) {
      continue;
    }
    const uint32_t row = firstEqual(first, first.keys[each]);
    places.push_back({row, key});
    ++_starts[row + 1];
  }
  std::partial_sum(_starts.begin(), _starts.end(), _starts.begin());
  std::vector<uint32_t> ends(_starts.begin(), _starts.end() - 1);
  _keys.resize(places.size());
  for (const Place& place : places) {
    pacer.turn();
    _keys[ends[place.row]++] = place.key;
  }
  sortRows(second.keys);
}

template <class Key>
void XQueryJoinPair::sortRows(const std::vector<Key>& keys) {
  WorkPacer pacer;
  const std::span<uint32_t> all(_keys);
  for (size_t row = 0; row + 1 < _starts.size(); ++row) {
    const auto own = all.subspan(_starts[row], _starts[row + 1] - _starts[row]);
    std::sort(own.begin(), own.end(), [&](uint32_t a, uint32_t b) {
      pacer.turn();
      return XQueryOrderOfKeys(keys[a], keys[b]) < 0;
    });
  }
}

template <class Visit>
void XQueryJoinPair::forEachMet(const Question& first, const Question& second, Visit visit) {
  const std::span<const uint32_t> all(_keys);
  const auto rowOf = [&](const auto& rows, const auto& value) -> std::span<const uint32_t> {
    if (_areStretches) return _first.metAmong(_first._relation, value, rows.keys, all);
    const uint32_t row = firstEqual(rows, value);
    if (row == noKey) return {};
    return all.subspan(_starts[row], _starts[row + 1] - _starts[row]);
  };
  WorkPacer pacer;
  _first.withForm(first, [&](auto& rows, const auto& values) {
    _second.withForm(second, [&](const auto& others, const auto& probes) {
      for (const auto& value : values) {
        const auto own = rowOf(rows, value);
        // Of an order one probe decides.
        for (const auto& probe : probes) {
          pacer.turn();
          visit(_second.metAmong(_second._relation, probe, others.keys, own));
        }
      }
    });
  });
}

uint64_t XQueryJoinPair::numberFor(const Question& first, const Question& second) {
  uint64_t number = 0;
  forEachMet(first, second, [&](std::span<const uint32_t> keys) { number += keys.size(); });
  return number;
}

void XQueryJoinPair::select(const Question& first, const Question& second, bool areSure,
                            bool wantsFirst, Table::Selection& selection) {
  const auto isBefore = [](const XQueryPick& a, const XQueryPick& b) {
    return a.position < b.position;
  };
  WorkPacer pacer;
  forEachMet(first, second, [&](std::span<const uint32_t> keys) {
    for (const uint32_t key : keys) {
      pacer.turn();
      const XQueryPick pick{_second._positions[key], areSure};
      if (!wantsFirst || selection.empty()) {
        selection.push_back(pick);
      } else if (isBefore(pick, selection.front())) {
        selection.front() = pick;
      }
    }
  });
  std::sort(selection.begin(), selection.end(), isBefore);
}

}  // namespace xquery

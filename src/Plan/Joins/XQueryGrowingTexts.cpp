#include "Plan/Joins/XQueryGrowingTexts.h"

#include "Plan/Joins/XQueryJoinOperand.h"

#include <utility>

namespace xquery {

std::unique_ptr<XQueryGrowingTexts> XQueryGrowingTexts::of(Value items) {
  const XQueryItemList list(items.get());
  WorkPacer pacer;
  for (size_t i = 0; i < list.count(); ++i) {
    pacer.turn();
    if (!XQueryJoinOperand::hasText(list[i])) return nullptr;
  }
  if (list.count() >= UINT32_MAX) return nullptr;
  return std::unique_ptr<XQueryGrowingTexts>(new XQueryGrowingTexts(std::move(items)));
}

size_t XQueryGrowingTexts::placeOf(NSStringView text, uint32_t hash) const {
  const size_t mask = _table.size() - 1;
  const auto isText = [&](const Place& place) {
    return place.hash == hash && _texts[place.text - 1].view().equals(text);
  };
  WorkPacer pacer;
  size_t place = hash & mask;
  while (_table[place].text && !isText(_table[place])) {
    pacer.turn();
    place = (place + 1) & mask;
  }
  return place;
}

void XQueryGrowingTexts::grow() {
  List<Place> old(2 * _table.size());
  old.swap(_table);
  const size_t mask = _table.size() - 1;
  WorkPacer pacer;
  for (const Place& each : old) {
    pacer.turn();
    if (!each.text) continue;
    size_t place = each.hash & mask;
    while (_table[place].text) place = (place + 1) & mask;
    _table[place] = each;
  }
}

bool XQueryGrowingTexts::isTooLarge() const {
  constexpr int64_t part = 4;
  constexpr size_t growth = 2;
  const auto own = static_cast<int64_t>(
      growth * (_texts.size() * sizeof(XQueryUntypedText) + _table.size() * sizeof(Place)));
  const int64_t before = workMeter.valueBytes - own - _gatheredBytes;
  return own + _gatheredBytes > workMeter.mostValueBytes / part - before / part;
}

std::optional<bool> XQueryGrowingTexts::contains(NSStringView text) {
  const uint32_t hash = text.hash();
  if (_table[placeOf(text, hash)].text) return true;
  WorkPacer pacer;
  while (_readCount < _list.count()) {
    pacer.turn();
    if (isTooLarge()) return std::nullopt;
    const int64_t bytesBefore = workMeter.valueBytes;
    XQueryUntypedText read(*_list[_readCount]);
    const int64_t bytes = workMeter.valueBytes - bytesBefore;
    const uint32_t readHash = read.view().hash();
    const size_t place = placeOf(read.view(), readHash);
    const bool isFound = readHash == hash && read.view().equals(text);
    if (!_table[place].text) {
      _texts.push_back(std::move(read));
      _gatheredBytes += bytes;
      _table[place] = {readHash, static_cast<uint32_t>(_texts.size())};
      if (2 * _texts.size() > _table.size()) grow();
    }
    ++_readCount;
    if (isFound) return true;
  }
  return false;
}

}  // namespace xquery

#include "Platform/Tree/ElementLog.h"

#include "Platform/Tree/Names.h"

namespace xquery {

// --- names ---------------------------------------------------------------------------------------

namespace {

size_t startOf(const NSXMLName* name) {
  constexpr uint64_t mix = 0x9E3779B97F4A7C15;
  return (reinterpret_cast<uintptr_t>(name) >> 3) * mix >> 32;
}

}  // namespace

NSXMLElementLog::Number NSXMLElementLog::numberOf(const NSXMLName* name) {
  constexpr size_t smallestTable = 32;
  if (_places.empty()) _places.resize(smallestTable);
  size_t place = startOf(name) & (_places.size() - 1);
  while (const Number number = _places[place]) {
    if (_names[number].name == name) return number;
    place = (place + 1) & (_places.size() - 1);
  }
  return addName(place, name);
}

NSXMLElementLog::Number NSXMLElementLog::addName(size_t place, const NSXMLName* name) {
  if (_names.size() > mostNames) {
    giveUp();
    return 0;
  }
  const auto number = static_cast<Number>(_names.size());
  _names.push_back({name});
  _places[place] = number;
  if (2 * _names.size() > _places.size()) enterNames(2 * _places.size());
  return number;
}

void NSXMLElementLog::enterNames(size_t places) {
  NSXMLIndexList<Number>(places).swap(_places);
  for (size_t number = 1; number < _names.size(); ++number) {
    size_t place = startOf(_names[number].name) & (places - 1);
    while (_places[place]) place = (place + 1) & (places - 1);
    _places[place] = static_cast<Number>(number);
  }
}

uint64_t NSXMLElementLog::count() const {
  uint64_t count = 0;
  for (const Name& each : _names) count += each.count;
  return count;
}

// A name that is written in several ways may have two children of one parent.
std::unique_ptr<const NSXMLSingleNames> NSXMLElementLog::singleNames() const {
  NSXMLSingleNames::Candidates candidates;
  candidates.reserve(_names.size());
  for (const Name& each : _names) {
    if (each.name) candidates.push_back({each.name->expanded, each.isSingle});
  }
  return NSXMLSingleNames::ofThose(candidates);
}

// --- entries -------------------------------------------------------------------------------------

void NSXMLElementLog::giveUp() {
  _isGivenUp = true;
  NSXMLIndexList<Part>().swap(_parts);
  _at = _end = nullptr;
}

void NSXMLElementLog::startPart() {
  const size_t before = _parts.empty() ? smallestPart / 2 : _parts.back().size();
  const Part& part = _parts.emplace_back(std::min(2 * before, largestPart));
  _at = part.begin();
  _end = part.end();
}

void NSXMLElementLog::push(uint32_t entry) {
  if (_at == _end) startPart();
  *_at++ = entry;
}

bool NSXMLElementLog::makeRoom(const NSXMLNode* element) {
  if (_isGivenUp) return false;
  const auto address = reinterpret_cast<uintptr_t>(element);
  if ((address - _base) / unit > mostDistance) {
    push(0);
    push(static_cast<uint32_t>(address % NSXMLRangeBytes / unit));
    _base = address;
  }
  if (_at == _end) startPart();
  return true;
}

}  // namespace xquery

#include "Platform/Tree/SingleNames.h"

namespace xquery {

void NSXMLSingleNamesMaker::addName(size_t place, const NSXMLExpandedName* name, uint32_t parent) {
  if (_count == mostNames) return;
  _table[place] = {name, parent, true};
  ++_count;
  if (2 * _count <= _table.size()) return;
  NSXMLIndexList<Name> old(2 * _table.size());
  old.swap(_table);
  for (const Name& each : old) {
    if (!each.name) continue;
    size_t free = NSXMLSingleNames::placeOf(each.name) & (_table.size() - 1);
    while (_table[free].name) free = (free + 1) & (_table.size() - 1);
    _table[free] = each;
  }
}

std::unique_ptr<const NSXMLSingleNames> NSXMLSingleNamesMaker::names() const {
  std::unique_ptr<NSXMLSingleNames> made(new NSXMLSingleNames(_table.size()));
  bool areAny = false;
  for (const Name& each : _table) {
    if (!each.name || !each.isSingle) continue;
    areAny = true;
    size_t free = NSXMLSingleNames::placeOf(each.name) & (_table.size() - 1);
    while (made->_table[free]) free = (free + 1) & (_table.size() - 1);
    made->_table[free] = each.name;
  }
  return areAny ? std::move(made) : nullptr;
}

}  // namespace xquery

// Lines and columns of many places of a program at once.
#pragma once

#include "Platform/Base/WorkMeter.h"
#include "Platform/Base/XQueryPlaces.h"

#include <algorithm>
#include <cstdint>
#include <tuple>
#include <vector>

namespace xquery {

// In characters, lines and columns from 1.
struct XQueryPlaceColumn {
  int64_t line;
  int64_t column;
  int64_t length;
};

// Calls tell(item, XQueryPlaceColumn) for each item that has a place. An item names it by its
// `number`, and the module it lies in by its `module`, anything that can be compared. The items are
// put in the order of the text, so that each text is read but once; equal ones stay as they were.
template <class Item, class Tell>
void XQueryFindColumns(const XQueryPlaces& places, std::vector<Item>& items, const Tell& tell) {
  std::stable_sort(items.begin(), items.end(), [&](const Item& a, const Item& b) {
    return std::tuple(a.module, places.span(a.number).start) <
           std::tuple(b.module, places.span(b.number).start);
  });
  XQueryPlaceCursor cursor(places);
  WorkPacer pacer;
  for (Item& item : items) {
    pacer.turn();
    if (!cursor.goTo(item.number)) continue;
    const XQuerySpan span = places.span(item.number);
    tell(item, XQueryPlaceColumn{cursor.line(), cursor.column(),
                                 static_cast<int64_t>(span.end) - span.start});
  }
}

}  // namespace xquery

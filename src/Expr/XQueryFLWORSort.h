// Sorting the results of a FLWOR expression by its order keys.
#pragma once

#include "xquery/Object.h"

#include <memory>
#include <vector>

namespace xquery {

// The keys of one tuple, one per order spec: NSNull, an atomic value, or an array of several.
using XQueryOrderKeys = std::shared_ptr<const std::vector<Value>>;

// One result item with the keys that all items of its tuple share, and its place in the tuple.
struct XQuerySortItem {
  Value value;
  XQueryOrderKeys sortInfo;
  size_t position;
};

// Sorts by the keys. Direction and empty order are one for all keys: the order specs after the
// first have no say in them. Items with equal keys keep their order. Answers whether every pair of
// keys that was compared could be compared.
bool XQueryFLWORSort(std::vector<XQuerySortItem>& items, bool ascending, bool emptyLeast);

}  // namespace xquery

// Sorting the results of a FLWOR expression by its order keys.
#pragma once

#include "xquery/Object.h"

#include <cstddef>
#include <vector>

namespace xquery {

// One result item with the keys that all items of its tuple share, and its place in the tuple.
struct XQuerySortItem {
  Value value;
  size_t sortInfo = 0;  // where the keys begin in the list of keys
  size_t position = 0;
};

// The items to sort. The keys of all tuples stand in one list, so that a tuple costs no block of
// its own.
struct XQuerySortList {
  size_t keyCount = 1;      // of every tuple: one per order spec
  std::vector<Value> keys;  // NSNull, an atomic value, or an array of several
  std::vector<XQuerySortItem> items;

  const NSObject& key(const XQuerySortItem& item, size_t k) const {
    return *keys[item.sortInfo + k];
  }
};

// Sorts by the keys. Direction and empty order are one for all keys: the order specs after the
// first have no say in them. Items with equal keys keep their order. Answers whether every pair of
// keys that was compared could be compared.
bool XQueryFLWORSort(XQuerySortList& list, bool ascending, bool emptyLeast);

// The same where only the first `most` items are wanted: the others may be left out.
bool XQueryFLWORSortFirst(XQuerySortList& list, bool ascending, bool emptyLeast, size_t most);

// The same by looking at both keys anew for every comparison: what the shortcut must agree with.
bool XQueryFLWORSortPlainly(XQuerySortList& list, bool ascending, bool emptyLeast);

}  // namespace xquery

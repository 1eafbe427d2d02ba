// Changing lists in place.
//
// Copying a list counts a reference of each item twice, once for the copy and once when one of both
// goes. A list that nobody else holds needs no copy: whoever is about to drop it may make of it
// what he answers, in the time of moving pointers.
#pragma once

#include "xquery/Collection.h"

#include <cstddef>
#include <vector>

namespace xquery {

// The array that the value is, if nobody else holds it; otherwise null.
NSArray* XQueryOwnArray(const Value& value);

// Copies items to the end of another list.
void XQueryAppendItems(const std::vector<Value>& items, size_t first, size_t count,
                       std::vector<Value>& to);
// Puts the items before the one at an index, which is not past the end.
void XQueryInsertItems(std::vector<Value>& items, size_t before, std::vector<Value> inserted);
// Takes items out; there are so many. Room that is mostly left empty is given back.
void XQueryEraseItems(std::vector<Value>& items, size_t first, size_t count);

}  // namespace xquery

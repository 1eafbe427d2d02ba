// Tables indexed by identifiers that start above 0.
#pragma once

#include "xquery/Object.h"

#include <vector>

namespace xquery {

// Stores the object at the index, padding with NSNull up to it. Index 0 stands for "no identifier":
// nothing is stored.
void SafeNSArrayAdd(std::vector<Value>& array, Value object, size_t index);

}  // namespace xquery

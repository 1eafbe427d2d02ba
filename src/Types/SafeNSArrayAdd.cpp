#include "Types/SafeNSArrayAdd.h"

#include "xquery/Collection.h"

namespace xquery {

void SafeNSArrayAdd(std::vector<Value>& array, Value object, size_t index) {
  if (index == 0) return;
  if (array.size() <= index) array.resize(index + 1, Value(NSNull::null()));
  array[index] = std::move(object);
}

}  // namespace xquery

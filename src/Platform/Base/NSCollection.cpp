#include "xquery/Collection.h"

#include <new>

namespace xquery {

NSNull* NSNull::null() {
  // In static storage and never destroyed: objects released at exit may still refer to it.
  alignas(NSNull) static unsigned char storage[sizeof(NSNull)];
  static NSNull* const shared = [] {
    auto* object = ::new (storage) NSNull();
    object->makeImmortal();
    return object;
  }();
  return shared;
}

}  // namespace xquery

// What the library alone does with the counts of objects; a host has `Ref`.
#pragma once

#include "xquery/Object.h"

namespace xquery {

struct NSCounting {
  // For pointers that are kept in other ways than by a `Ref`.
  static void retain(const NSCounted& object) { object.retain(); }
  static void release(const NSCounted& object) { object.release(); }

  // For shared singletons and literals: from now on the object is never freed.
  static void makeImmortal(const NSCounted& object) { object._word |= NSCounted::immortalBit; }
  static bool isImmortal(const NSCounted& object) {
    return (object._word & NSCounted::immortalBit) != 0;
  }
  // Whether nobody but the caller holds the object; what others did with it is done then.
  static bool hasOneReference(const NSCounted& object) {
    return __atomic_load_n(&object._word, __ATOMIC_ACQUIRE) == 1;
  }
};

}  // namespace xquery

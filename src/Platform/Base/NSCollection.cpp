#include "Platform/Base/Counting.h"
#include "xquery/Collection.h"

#include <array>
#include <new>
#include <utility>

namespace xquery {

NSNull* NSNull::null() {
  // In static storage and never destroyed: objects released at exit may still refer to it.
  // A line of memory by itself, since every thread looks at it all the time.
  alignas(64) static unsigned char storage[64];
  static NSNull* const shared = [] {
    auto* object = ::new (storage) NSNull();
    NSCounting::makeImmortal(*object);
    return object;
  }();
  return shared;
}

// Nodes in a row are mostly those of one tree, whose counter other threads may be using: it is
// touched once for many of them.
NSArray::~NSArray() {
  std::array<const NSXMLNode*, 32> nodes;  // few, since destructions nest
  size_t count = 0;
  for (Value& object : _objects) {
    if (!object || !object->isNode()) continue;
    nodes[count++] = reinterpret_cast<const NSXMLNode*>(object.detach());
    if (count == nodes.size()) releaseTreesOf(nodes.data(), std::exchange(count, 0));
  }
  releaseTreesOf(nodes.data(), count);
}

}  // namespace xquery

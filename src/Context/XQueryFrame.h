// One frame of local variables, indexed by local variable ID.
//
//   | count, lets take | IDs 1 to 10: in the frame itself | IDs from 11 on: in a vector |
//
// Every call of a declared function has a frame of its own. A frame is one block of the object
// allocator's largest recycled size, so that a call of a function with few variables allocates
// nothing that has not been used before.
#pragma once

#include "xquery/Collection.h"
#include "xquery/Object.h"

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <memory>
#include <new>
#include <utility>
#include <vector>

namespace xquery {

class XQueryFrame : public NSCounted {
 public:
  static bool classof(const NSObject& object) { return object.kind() == Kind::Frame; }

  // Null for an ID below 1 or past the end.
  NSObject* valueForID(int64_t varID) const {
    const Value* slot = slotForID(varID);
    return slot ? slot->get() : nullptr;
  }
  // The same, as it is held until a variable is set.
  const Value* slotForID(int64_t varID) const {
    const size_t index = indexOf(varID);
    if (index >= _count) return nullptr;
    return index < nearSlots ? &_near[index] : &_far[index - nearSlots];
  }

  // The ID is at least 1; slots below it that were never set get NSNull.
  void setValue(Value value, int64_t forID) {
    const size_t index = indexOf(forID);
    while (_count < index) append(NSNull::null());
    if (index == _count) {
      append(std::move(value));
    } else {
      (index < nearSlots ? _near[index] : _far[index - nearSlots]) = std::move(value);
    }
  }

  // The value where the variable is read for the last time: the frame keeps NSNull in its place if
  // it lets go of values. Null for an ID below 1 or past the end.
  Value lastValueForID(int64_t varID) {
    Value* slot = const_cast<Value*>(slotForID(varID));
    if (!slot) return {};
    return _letsTake ? std::exchange(*slot, Value(NSNull::null())) : *slot;
  }
  // To be set for a call of which every part is evaluated once at most. A frame in which a body is
  // asked for something else than its value may be asked again.
  void setLetsTake() { _letsTake = true; }

 protected:
  XQueryFrame() : NSCounted(Kind::Frame) {}
  ~XQueryFrame() override { std::destroy_n(_near, std::min<size_t>(_count, nearSlots)); }
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  static constexpr size_t nearSlots = 10;

  // An ID below 1 becomes an index past every end.
  static size_t indexOf(int64_t varID) {
    return varID < 1 ? SIZE_MAX : static_cast<size_t>(varID) - 1;
  }

  void append(Value value) {
    if (_count < nearSlots) {
      ::new (&_near[_count]) Value(std::move(value));
    } else {
      _far.push_back(std::move(value));
    }
    ++_count;
  }

  uint32_t _count = 0;
  bool _letsTake = false;
  // Those in use are made as they are set: most calls set two or three.
  union {
    Value _near[nearSlots];
  };
  std::vector<Value> _far;
};

using XQueryFrameRef = Ref<XQueryFrame>;

static_assert(sizeof(XQueryFrame) <= 128, "a frame fits a recycled block");

}  // namespace xquery

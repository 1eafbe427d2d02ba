// The result container and the rules about value shapes that every consumer shares.
#pragma once

#include "xquery/Collection.h"
#include "xquery/Object.h"

#include <cstdint>
#include <vector>

namespace xquery {

// A flat sequence: adding an array adds its items, adding the empty sequence adds nothing. So its
// elements are never arrays and never NSNull.
class XQuerySequence : public NSArray {
 public:
  static bool classof(const NSObject& object) { return object.kind() == Kind::Sequence; }

  [[nodiscard]] static Ref<XQuerySequence> sequence() { return make<XQuerySequence>(); }
  [[nodiscard]] static Ref<XQuerySequence> sequenceWithItem(Value item);

  void addObject(const Value& item);
  // Takes over an item that is no array, and the items of an array that nobody else holds.
  void addObject(Value&& item);
  // Ignores null and NSNull and does not flatten; into an empty sequence the index is not looked
  // at, past the end it appends.
  void insertObject(const Value& item, size_t atIndex);
  void removeLastObject();
  void removeObjectAtIndex(size_t index);
  void replaceObjectAtIndex(size_t index, const Value& withObject);

 protected:
  XQuerySequence() : NSArray(Kind::Sequence) {}
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  void takeObjects(std::vector<Value>& of);
};

inline bool isNull(const Value& value) {
  return value && value->kind() == Kind::Null;
}

// A one-element array becomes its element and an empty array NSNull; anything else is unchanged.
// Here it is answered for whoever only looks at it: the value itself, or what it has or the
// process.
const Value& normalisedIn(const Value& value);
inline Value normalised(Value value) {
  if (!isa<NSArray>(value) || cast<NSArray>(value)->count() > 1) return value;
  return normalisedIn(value);
}

// The value with nothing but items in it: of an array the sequence that adding it to an empty one
// gives, which is the array itself when it is flat already. Anything else is unchanged.
Value flattened(Value value);

// Gathers values as the comma operator does: nothing gives NSNull, the first non-empty value is
// kept as it is, a second one turns both into a sequence. `value` normalises.
class XQueryGatherer {
 public:
  void add(Value value);
  Value value();

 private:
  Value _first;
  Ref<XQuerySequence> _sequence;
};

// How many items the value of a gatherer would have, to which the same is added.
class XQueryItemTally {
 public:
  // `most`: beyond it nobody asks.
  explicit XQueryItemTally(uint64_t most) : _most(most) {}
  void add(const Value& value);
  // So many values of one item each.
  void addItems(uint64_t number);
  bool mayEndEarly() const { return _most != UINT64_MAX; }
  bool isComplete() const { return _flat >= _most && (_values > 1 || _alone >= _most); }
  uint64_t count() const { return _values == 1 ? _alone : _flat; }

 private:
  uint64_t _most;
  uint64_t _values = 0;
  uint64_t _alone = 0;  // items of the first value, as it is without a second
  uint64_t _flat = 0;   // items of all of them
};

// The item-list rule: null, NSNull and an empty array are no items, an array its elements, anything
// else one item. The value must outlive the list.
class XQueryItemList {
 public:
  explicit XQueryItemList(const NSObject* value);
  size_t count() const { return _count; }
  NSObject* operator[](size_t index) const {
    return _array ? _array->objectAtIndex(index) : _single;
  }

 private:
  const NSArray* _array = nullptr;
  NSObject* _single = nullptr;
  size_t _count = 0;
};

// Lists them; false when one is no item by itself: an array of a host within an array, or NSNull.
bool XQueryListItems(const XQueryItemList& list, std::vector<Value>& items);

}  // namespace xquery

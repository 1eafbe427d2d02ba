#include "Expr/XQuerySequence.h"

#include "Expr/XQueryListChanges.h"
#include "Platform/Base/WorkMeter.h"

#include <algorithm>
#include <utility>
#include <vector>

namespace xquery {
namespace {

// Whether adding the array to an empty sequence adds its elements as they are.
bool isFlat(const NSArray& array) {
  if (array.kind() == Kind::Sequence) return true;
  WorkPacer pacer;
  return std::all_of(array.objects().begin(), array.objects().end(), [&](const Value& element) {
    pacer.turn();
    return element && !isNull(element) && !isa<NSArray>(element);
  });
}

}  // namespace

Ref<XQuerySequence> XQuerySequence::sequenceWithItem(Value item) {
  auto sequence = XQuerySequence::sequence();
  sequence->addObject(std::move(item));
  return sequence;
}

// Arrays a host hands in may nest to any depth, so the flattening keeps its own stack.
void XQuerySequence::addObject(const Value& item) {
  struct Position {
    const NSArray* array;
    size_t next;
  };
  std::vector<Position> open;
  auto addOne = [&](const Value& value) {
    if (!value || isNull(value)) return;
    if (const auto* array = dyn_cast<NSArray>(value)) {
      open.push_back({array, 0});
    } else {
      _objects.push_back(value);
    }
  };
  addOne(item);
  WorkPacer pacer;
  while (!open.empty()) {
    pacer.turn();
    Position& top = open.back();
    if (top.next < top.array->count()) {
      addOne(top.array->objects()[top.next++]);
    } else {
      open.pop_back();
    }
  }
}

void XQuerySequence::addObject(Value&& item) {
  if (item && !isNull(item) && !isa<NSArray>(item)) {
    _objects.push_back(std::move(item));
  } else if (NSArray* array = XQueryOwnArray(item); array && isFlat(*array)) {
    takeObjects(array->objects());
  } else if (item && item->kind() == Kind::Sequence) {
    const auto& objects = cast<XQuerySequence>(item)->_objects;
    XQueryAppendItems(objects, 0, objects.size(), _objects);
  } else {
    addObject(std::as_const(item));
  }
}

// Of both lists the shorter one moves, so that a list that grows at either end by a few items at a
// time is never moved item by item.
void XQuerySequence::takeObjects(std::vector<Value>& of) {
  if (of.size() > _objects.size()) {
    XQueryInsertItems(of, 0, std::move(_objects));
    _objects = std::move(of);
  } else {
    XQueryInsertItems(_objects, _objects.size(), std::move(of));
  }
}

void XQuerySequence::insertObject(const Value& item, size_t atIndex) {
  if (!item || isNull(item)) return;
  if (atIndex > _objects.size()) atIndex = _objects.size();
  _objects.insert(_objects.begin() + static_cast<std::ptrdiff_t>(atIndex), item);
}

void XQuerySequence::removeLastObject() {
  if (!_objects.empty()) _objects.pop_back();
}

void XQuerySequence::removeObjectAtIndex(size_t index) {
  if (index < _objects.size()) {
    _objects.erase(_objects.begin() + static_cast<std::ptrdiff_t>(index));
  }
}

void XQuerySequence::replaceObjectAtIndex(size_t index, const Value& withObject) {
  if (index < _objects.size()) _objects[index] = withObject;
}

const Value& normalisedIn(const Value& value) {
  static const Value empty(NSNull::null());
  const auto* array = dyn_cast<NSArray>(value);
  if (!array || array->count() > 1) return value;
  return array->count() == 1 ? array->objects().front() : empty;
}

Value flattened(Value value) {
  if (!value || value->kind() != Kind::Array) return value;  // an XQuerySequence is flat
  if (isFlat(*cast<NSArray>(value))) return value;
  return XQuerySequence::sequenceWithItem(value);
}

void XQueryGatherer::add(Value value) {
  if (!value || isNull(value)) return;
  if (_sequence && !isa<NSArray>(value)) {
    _sequence->objects().push_back(std::move(value));
  } else if (_sequence) {
    _sequence->addObject(std::move(value));
  } else if (_first) {
    _sequence = XQuerySequence::sequenceWithItem(std::exchange(_first, Value()));
    _sequence->addObject(std::move(value));
  } else {
    _first = std::move(value);
  }
}

Value XQueryGatherer::value() {
  if (_sequence) return normalised(std::move(_sequence));
  if (_first) return normalised(std::move(_first));
  return NSNull::null();
}

void XQueryItemTally::add(const Value& value) {
  if (!value || isNull(value)) return;
  if (!isa<NSArray>(value)) return addItems(1);
  if (++_values == 1) _alone = XQueryItemList(normalised(value).get()).count();
  _flat += XQueryItemList(flattened(value).get()).count();
}

void XQueryItemTally::addItems(uint64_t number) {
  if (_values == 0 && number > 0) _alone = 1;
  _values += number;
  _flat += number;
}

XQueryItemList::XQueryItemList(const NSObject* value) {
  if (!value || value->kind() == Kind::Null) return;
  if (const auto* array = dyn_cast<NSArray>(value)) {
    _array = array;
    _count = array->count();
  } else {
    _single = const_cast<NSObject*>(value);
    _count = 1;
  }
}

bool XQueryListItems(const XQueryItemList& list, std::vector<Value>& items) {
  items.reserve(list.count());
  for (size_t i = 0; i < list.count(); ++i) {
    if (!list[i] || list[i]->kind() == Kind::Null || isa<NSArray>(list[i])) return false;
    items.emplace_back(list[i]);
  }
  return true;
}

}  // namespace xquery

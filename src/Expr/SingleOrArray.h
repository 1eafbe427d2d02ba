// Storage with a fast path for one element.
//
// `value` holds the only element while the container has exactly one and was never grown; `array`
// holds the elements otherwise. At most one of the two is in use.
#pragma once

#include "xquery/Object.h"

#include <utility>
#include <vector>

namespace xquery {

template <class T>
class SingleOrArray {
 public:
  size_t count() const { return _value ? 1 : _array.size(); }
  // Null at or past the end.
  T* objectAtIndex(size_t index) const {
    if (_value) return index == 0 ? _value.get() : nullptr;
    return index < _array.size() ? _array[index].get() : nullptr;
  }
  bool hasValue() const { return static_cast<bool>(_value); }
  bool hasArray() const { return _hasArray; }

  void append(Ref<T> element) {
    if (_value) moveValueToArray();
    if (_hasArray) {
      _array.push_back(std::move(element));
    } else {
      _value = std::move(element);
    }
  }
  void moveValueToArray() {
    _hasArray = true;
    _array.push_back(std::exchange(_value, Ref<T>()));
  }
  void removeLast() {
    if (_value) {
      _value = Ref<T>();
    } else if (!_array.empty()) {
      _array.pop_back();
    }
  }
  // Index 0 names the single value; an index past the end does nothing.
  void removeAtIndex(size_t index) {
    if (_value) {
      if (index == 0) _value = Ref<T>();
    } else if (index < _array.size()) {
      _array.erase(_array.begin() + static_cast<std::ptrdiff_t>(index));
    }
  }
  void replaceAtIndex(size_t index, Ref<T> element) {
    if (_value) {
      if (index == 0) _value = std::move(element);
    } else if (index < _array.size()) {
      _array[index] = std::move(element);
    }
  }
  template <class Visit>
  void forEach(Visit visit) {
    if (_value) visit(_value);
    for (Ref<T>& element : _array) visit(element);
  }
  void insertInArray(size_t index, Ref<T> element) {
    if (index > _array.size()) index = _array.size();
    _array.insert(_array.begin() + static_cast<std::ptrdiff_t>(index), std::move(element));
  }

 private:
  Ref<T> _value;
  std::vector<Ref<T>> _array;
  bool _hasArray = false;
};

}  // namespace xquery

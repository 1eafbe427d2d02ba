// Nodes in a row, each by its place in the range that all nodes are in (XMLNode.h): 32 bits, half
// of a pointer, wherever the row itself lies.
//
//   NSXMLNodeList   owns the places; nodes are added at its end
//   NSXMLNodeSpan   a part of one, read as if it were of pointers
#pragma once

#include "xquery/XMLNode.h"

#include <cstddef>
#include <cstdint>
#include <iterator>
#include <vector>

namespace xquery {

// A list that counts towards the memory ceiling.
template <class T>
using NSXMLIndexList = std::vector<T, ValueAllocator<T>>;

// The place of a node: in units of 8 bytes from the start of the range.
class NSXMLNodePlace {
 public:
  NSXMLNodePlace() = default;
  explicit NSXMLNodePlace(const NSXMLNode* node)
      : _place(static_cast<uint32_t>(reinterpret_cast<uintptr_t>(node) % NSXMLRangeBytes / unit)) {}

  // The node, given the start of the range.
  NSXMLNode* node(uintptr_t start) const {
    return reinterpret_cast<NSXMLNode*>(start + uintptr_t{_place} * unit);
  }
  // The process has one range, so that any of its nodes tells where it starts.
  static uintptr_t start(const NSXMLNode* node) {
    return reinterpret_cast<uintptr_t>(node) & ~(NSXMLRangeBytes - 1);
  }

  friend bool operator==(NSXMLNodePlace, NSXMLNodePlace) = default;

 private:
  static constexpr uintptr_t unit = 8;
  uint32_t _place = 0;
};

static_assert(sizeof(NSXMLNodePlace) == 4);

class NSXMLNodeSpan {
 public:
  class Iterator {
   public:
    // What it refers to is made when it is asked for; in all else it has random access.
    using iterator_category = std::random_access_iterator_tag;
    using value_type = NSXMLNode*;
    using difference_type = ptrdiff_t;
    using pointer = void;
    using reference = NSXMLNode*;

    Iterator() = default;
    Iterator(const NSXMLNodePlace* place, uintptr_t start) : _place(place), _start(start) {}

    NSXMLNode* operator*() const { return _place->node(_start); }
    NSXMLNode* operator[](ptrdiff_t at) const { return _place[at].node(_start); }
    Iterator& operator++() { return *this += 1; }
    Iterator operator++(int) {
      const Iterator before = *this;
      ++*this;
      return before;
    }
    Iterator& operator--() { return *this -= 1; }
    Iterator operator--(int) {
      const Iterator before = *this;
      --*this;
      return before;
    }
    Iterator& operator+=(ptrdiff_t by) {
      _place += by;
      return *this;
    }
    Iterator& operator-=(ptrdiff_t by) { return *this += -by; }
    friend Iterator operator+(Iterator from, ptrdiff_t by) { return from += by; }
    friend Iterator operator+(ptrdiff_t by, Iterator from) { return from += by; }
    friend Iterator operator-(Iterator from, ptrdiff_t by) { return from -= by; }
    friend ptrdiff_t operator-(Iterator a, Iterator b) { return a._place - b._place; }
    friend bool operator==(Iterator a, Iterator b) { return a._place == b._place; }
    friend auto operator<=>(Iterator a, Iterator b) { return a._place <=> b._place; }

   private:
    const NSXMLNodePlace* _place = nullptr;
    uintptr_t _start = 0;
  };

  NSXMLNodeSpan() = default;
  NSXMLNodeSpan(const NSXMLNodePlace* places, size_t size, uintptr_t start)
      : _places(places), _size(size), _start(start) {}

  size_t size() const { return _size; }
  bool empty() const { return _size == 0; }
  NSXMLNode* operator[](size_t at) const { return _places[at].node(_start); }
  NSXMLNode* front() const { return (*this)[0]; }
  Iterator begin() const { return {_places, _start}; }
  Iterator end() const { return {_places + _size, _start}; }
  NSXMLNodeSpan first(size_t count) const { return {_places, count, _start}; }
  NSXMLNodeSpan subspan(size_t from) const { return {_places + from, _size - from, _start}; }
  NSXMLNodeSpan subspan(size_t from, size_t count) const { return {_places + from, count, _start}; }

 private:
  const NSXMLNodePlace* _places = nullptr;
  size_t _size = 0;
  uintptr_t _start = 0;
};

class NSXMLNodeList {
 public:
  using value_type = const NSXMLNode*;

  void reserve(size_t count) { _places.reserve(count); }
  void clear() { _places.clear(); }
  size_t size() const { return _places.size(); }
  void push_back(const NSXMLNode* node) {
    _start = NSXMLNodePlace::start(node);
    _places.push_back(NSXMLNodePlace(node));
  }
  NSXMLNodeSpan span() const { return {_places.data(), _places.size(), _start}; }
  // The nodes of another list, the i-th of them at `placeOf(i)`, which answers each number once.
  template <class PlaceOf>
  void arrange(const NSXMLNodeList& arrived, PlaceOf placeOf) {
    _places.resize(arrived.size());
    _start = arrived._start;
    for (size_t i = 0; i < arrived.size(); ++i) _places[placeOf(i)] = arrived._places[i];
  }
  // So many nodes of the range that the node is in: fill(put) calls put(i, node) once for each
  // place.
  template <class Fill>
  void arrange(const NSXMLNode* node, size_t count, Fill fill) {
    _places.resize(count);
    _start = NSXMLNodePlace::start(node);
    NSXMLNodePlace* const places = _places.data();
    fill([places](size_t i, const NSXMLNode* each) { places[i] = NSXMLNodePlace(each); });
  }
  template <class Takes>
  void keepThose(Takes takes) {
    std::erase_if(_places, [&](NSXMLNodePlace place) { return !takes(*place.node(_start)); });
  }

 private:
  NSXMLIndexList<NSXMLNodePlace> _places;
  uintptr_t _start = 0;
};

}  // namespace xquery

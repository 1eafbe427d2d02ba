// The keys of a join's table by themselves: their order, whether they are equal, their hash.
//
//   double           what is compared as a double
//   XQueryExactKey   decimals among decimals
//   NSStringView     texts
//   const NSObject*  nodes
#pragma once

#include "Platform/Base/KeyedHash.h"
#include "xquery/Number.h"
#include "xquery/Object.h"
#include "xquery/String.h"

#include <bit>
#include <cmath>
#include <cstdint>
#include <functional>

namespace xquery {

// A decimal. Those that are the same double are told apart by their digits.
struct XQueryExactKey {
  double nearest;
  const NSNumber* number;
};

inline uint32_t XQueryHashOfKey(double value) {
  // The two zeros are equal.
  return static_cast<uint32_t>(keyedHash(std::bit_cast<uint64_t>(value == 0 ? 0.0 : value)));
}
inline uint32_t XQueryHashOfKey(const XQueryExactKey& key) {
  return XQueryHashOfKey(key.nearest);
}
inline uint32_t XQueryHashOfKey(NSStringView text) {
  return text.hash();
}
inline uint32_t XQueryHashOfKey(const NSObject* node) {
  return static_cast<uint32_t>((reinterpret_cast<uintptr_t>(node) * 0x9E3779B97F4A7C15U) >> 32U);
}

inline int XQueryOrderOfKeys(double a, double b) {
  return a < b ? -1 : a > b ? 1 : 0;
}
inline int XQueryOrderOfKeys(const XQueryExactKey& a, const XQueryExactKey& b) {
  const int order = XQueryOrderOfKeys(a.nearest, b.nearest);
  return order != 0 ? order : a.number->compare(*b.number);
}
inline int XQueryOrderOfKeys(NSStringView a, NSStringView b) {
  return a.compare(b);
}
inline int XQueryOrderOfKeys(const NSObject* a, const NSObject* b) {
  return std::less<>()(a, b) ? -1 : std::less<>()(b, a) ? 1 : 0;
}

inline bool XQueryAreEqualKeys(NSStringView a, NSStringView b) {
  return a.equals(b);
}
inline bool XQueryAreEqualKeys(double a, double b) {
  return a == b;
}
template <class Key>
bool XQueryAreEqualKeys(const Key& a, const Key& b) {
  return XQueryOrderOfKeys(a, b) == 0;
}

// Of numbers, those that are none.
inline bool XQueryMeetsNothing(double key) {
  return std::isnan(key);
}
template <class Key>
bool XQueryMeetsNothing(const Key&) {
  return false;
}

}  // namespace xquery

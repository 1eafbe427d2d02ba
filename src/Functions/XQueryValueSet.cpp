#include "Functions/XQueryValueSet.h"

#include "Types/XQueryValues.h"

#include <bit>
#include <cmath>
#include <functional>
#include <limits>

namespace xquery {
namespace {

// Equal doubles have equal keys: one for all NaNs, one for both zeros.
uint64_t keyOf(double value) {
  if (std::isnan(value)) value = std::numeric_limits<double>::quiet_NaN();
  return std::bit_cast<uint64_t>(value == 0 ? 0.0 : value);
}

}  // namespace

uint64_t XQueryValueSet::ExactHash::operator()(const NSDecimal& value) const {
  if (value.isSmallInteger()) return static_cast<uint64_t>(value.smallInteger());
  return std::hash<std::string>()(value.toString());
}

size_t XQueryValueSet::ValueHash::operator()(const NSObject* value) const {
  return XQueryObjectHash(*value);
}

bool XQueryValueSet::ValueEqual::operator()(const NSObject* a, const NSObject* b) const {
  return XQueryObjectsEqual(*a, *b);
}

bool XQueryValueSet::insert(const NSObject& value) {
  if (const auto* string = dyn_cast<NSString>(&value)) return _strings.insert(string->view());
  if (const auto* number = dyn_cast<NSNumber>(&value)) return insertNumber(*number);
  return _others.insert(&value).second;
}

bool XQueryValueSet::insertNumber(const NSNumber& number) {
  const auto storage = number.storage();
  if (storage == NSNumber::Storage::Double || storage == NSNumber::Storage::Float) {
    return insertFloating(number.doubleValue());
  }
  return insertExact(number.decimalValue());
}

bool XQueryValueSet::insertFloating(double value) {
  if (_floating.empty()) {
    _exact.forEach(
        [&](const NSDecimal& exact) { _exactDoubles.insert(keyOf(exact.doubleValue())); });
  }
  const uint64_t key = keyOf(value);
  return !_exactDoubles.contains(key) && _floating.insert(key);
}

bool XQueryValueSet::insertExact(NSDecimal value) {
  if (_floating.empty()) return _exact.insert(std::move(value));
  const uint64_t key = keyOf(value.doubleValue());
  if (_floating.contains(key) || !_exact.insert(std::move(value))) return false;
  _exactDoubles.insert(key);
  return true;
}

}  // namespace xquery

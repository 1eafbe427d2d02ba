#include "Functions/XQueryValueSet.h"

#include "Platform/Numbers/NumberText.h"
#include "Types/XQueryQName.h"
#include "Types/XQueryValues.h"
#include "xquery/Date.h"

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

Kind familyOf(const NSObject& value) {
  return isa<NSDate>(&value) ? Kind::Date : value.kind();
}

// No namespace comes before all others.
int orderOf(const Ref<NSString>& a, const Ref<NSString>& b) {
  if (!a || !b) return (a ? 1 : 0) - (b ? 1 : 0);
  return a->view().compare(b->view());
}

bool isOrderedBefore(const XQueryQName& a, const XQueryQName& b) {
  const int order = orderOf(a.localPart(), b.localPart());
  return order != 0 ? order < 0 : orderOf(a.namespaceURI(), b.namespaceURI()) < 0;
}

}  // namespace

bool XQueryIsOrderedBefore(const NSObject& a, const NSObject& b) {
  const Kind family = familyOf(a);
  if (family != familyOf(b)) return family < familyOf(b);
  switch (family) {
    case Kind::Date:
      return cast<NSDate>(&a)->instant() < cast<NSDate>(&b)->instant();
    case Kind::QName:
      return isOrderedBefore(*cast<XQueryQName>(&a), *cast<XQueryQName>(&b));
    case Kind::URL:
    case Kind::Notation:
    case Kind::HexBinary:
    case Kind::Base64Binary:
      return orderOf(XQueryStringValue(a), XQueryStringValue(b)) < 0;
    default:
      return std::less<>()(&a, &b);
  }
}

uint64_t XQueryOtherValueHash::operator()(const NSObject* value) const {
  const uint64_t hash = XQueryObjectHash(*value);
  const auto* name = dyn_cast<XQueryQName>(value);
  return name && name->namespaceURI() ? hash << 32 | name->namespaceURI()->hash() : hash;
}

uint64_t XQueryValueSet::ExactHash::operator()(const NSDecimal& value) const {
  if (value.isSmallInteger()) return static_cast<uint64_t>(value.smallInteger());
  return hashDigits(value);
}

bool XQueryValueSet::ObjectEqual::operator()(const NSObject* a, const NSObject* b) const {
  return XQueryObjectsEqual(*a, *b);
}

bool XQueryValueSet::insert(const NSObject& value) {
  if (const auto* string = dyn_cast<NSString>(&value)) return _strings.insert(string->view());
  if (const auto* number = dyn_cast<NSNumber>(&value)) return insertNumber(*number);
  return _others.insert(&value);
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

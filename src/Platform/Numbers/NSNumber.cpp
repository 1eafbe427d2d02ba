#include "Platform/Base/Counting.h"
#include "Platform/Base/LastingObjects.h"
#include "Platform/Numbers/NSDecimal.h"
#include "Platform/Numbers/NumberText.h"

#include <charconv>
#include <cmath>
#include <limits>

namespace xquery {

namespace {

constexpr double twoTo63 = 9223372036854775808.0;
constexpr double twoTo64 = 18446744073709551616.0;

int64_t saturatedInt64(double value) {
  if (std::isnan(value)) return 0;
  if (value >= twoTo63) return INT64_MAX;
  if (value < -twoTo63) return INT64_MIN;
  return static_cast<int64_t>(value);
}

uint64_t saturatedUInt64(double value) {
  if (std::isnan(value) || value <= 0) return 0;
  if (value >= twoTo64) return UINT64_MAX;
  return static_cast<uint64_t>(value);
}

// NaN equals NaN and is below every other number.
int compareDoubles(double a, double b) {
  if (std::isnan(a) || std::isnan(b)) return (std::isnan(b) ? 1 : 0) - (std::isnan(a) ? 1 : 0);
  return a < b ? -1 : a > b ? 1 : 0;
}

template <class Integer>
std::string formatInteger(Integer value) {
  char buffer[24];
  return std::string(buffer, std::to_chars(buffer, buffer + sizeof buffer, value).ptr);
}

std::string formatFloating(double value, bool single) {
  if (std::isnan(value)) return "NaN";
  if (std::isinf(value)) return value > 0 ? "INF" : "-INF";
  return single ? formatFloat(static_cast<float>(value)) : formatDouble(value);
}

NSNumber* sharedBoolean(bool value) {
  const LastingObjects lasting;
  auto number = make<NSNumber>(Kind::Number, uint16_t{0}, value);
  NSCounting::makeImmortal(*number);
  return number.detach();
}

}  // namespace

NSNumber::NSNumber(Kind kind, uint16_t aux, bool value) : NSCounted(kind), _bool(value) {
  _aux = aux;
  _flags = static_cast<uint8_t>(Storage::Boolean);
}

NSNumber::NSNumber(Kind kind, uint16_t aux, int64_t value) : NSCounted(kind), _int64(value) {
  _aux = aux;
  _flags = static_cast<uint8_t>(Storage::Int64);
}

NSNumber::NSNumber(Kind kind, uint16_t aux, uint64_t value) : NSCounted(kind), _uint64(value) {
  _aux = aux;
  _flags = static_cast<uint8_t>(Storage::UInt64);
}

NSNumber::NSNumber(Kind kind, uint16_t aux, double value) : NSCounted(kind), _double(value) {
  _aux = aux;
  _flags = static_cast<uint8_t>(Storage::Double);
}

NSNumber::NSNumber(Kind kind, uint16_t aux, float value) : NSCounted(kind), _float(value) {
  _aux = aux;
  _flags = static_cast<uint8_t>(Storage::Float);
}

NSNumber::NSNumber(Kind kind, uint16_t aux, NSDecimal value) : NSCounted(kind) {
  static_assert(sizeof(NSDecimal) == sizeof(_decimal) && alignof(NSDecimal) == 8);
  ::new (_decimal) NSDecimal(std::move(value));
  _aux = aux;
  _flags = static_cast<uint8_t>(Storage::Decimal);
}

NSNumber::NSNumber(Kind kind, uint16_t aux, const NSNumber& value) : NSCounted(kind), _int64(0) {
  _aux = aux;
  switch (value.storage()) {
    case Storage::Boolean:
      _bool = value._bool;
      break;
    case Storage::Int64:
      _int64 = value._int64;
      break;
    case Storage::UInt64:
      _uint64 = value._uint64;
      break;
    case Storage::Double:
      _double = value._double;
      break;
    case Storage::Float:
      _float = value._float;
      break;
    case Storage::Decimal:
      ::new (_decimal) NSDecimal(*value.storedDecimal());
      break;
  }
  _flags = value._flags;
}

NSNumber::~NSNumber() {
  if (const NSDecimal* decimal = storedDecimal()) decimal->~NSDecimal();
}

NSNumber* NSNumber::trueValue() {
  static NSNumber* const shared = sharedBoolean(true);
  return shared;
}

NSNumber* NSNumber::falseValue() {
  static NSNumber* const shared = sharedBoolean(false);
  return shared;
}

Ref<NSNumber> NSNumber::numberWithLongLong(int64_t value) {
  return make<NSNumber>(Kind::Number, uint16_t{0}, value);
}

Ref<NSNumber> NSNumber::numberWithUnsignedLongLong(uint64_t value) {
  return make<NSNumber>(Kind::Number, uint16_t{0}, value);
}

Ref<NSNumber> NSNumber::numberWithDouble(double value) {
  return make<NSNumber>(Kind::Number, uint16_t{0}, value);
}

Ref<NSNumber> NSNumber::numberWithFloat(float value) {
  return make<NSNumber>(Kind::Number, uint16_t{0}, value);
}

bool NSNumber::boolValue() const {
  // A decimal may be too small for a double and still not be zero.
  if (const NSDecimal* decimal = storedDecimal()) return !decimal->isZero() && !decimal->isNaN();
  const double value = doubleValue();
  return value != 0 && !std::isnan(value);
}

double NSNumber::doubleValue() const {
  switch (storage()) {
    case Storage::Boolean:
      return _bool ? 1 : 0;
    case Storage::Int64:
      return static_cast<double>(_int64);
    case Storage::UInt64:
      return static_cast<double>(_uint64);
    case Storage::Double:
      return _double;
    case Storage::Float:
      return static_cast<double>(_float);
    case Storage::Decimal:
      return storedDecimal()->doubleValue();
  }
  return 0;
}

float NSNumber::floatValue() const {
  return storage() == Storage::Float ? _float : static_cast<float>(doubleValue());
}

int64_t NSNumber::longLongValue() const {
  switch (storage()) {
    case Storage::Boolean:
      return _bool ? 1 : 0;
    case Storage::Int64:
      return _int64;
    case Storage::UInt64:
      return _uint64 > INT64_MAX ? INT64_MAX : static_cast<int64_t>(_uint64);
    case Storage::Double:
      return saturatedInt64(_double);
    case Storage::Float:
      return saturatedInt64(static_cast<double>(_float));
    case Storage::Decimal:
      return storedDecimal()->int64Value();
  }
  return 0;
}

uint64_t NSNumber::unsignedLongLongValue() const {
  switch (storage()) {
    case Storage::Boolean:
      return _bool ? 1 : 0;
    case Storage::Int64:
      return _int64 < 0 ? 0 : static_cast<uint64_t>(_int64);
    case Storage::UInt64:
      return _uint64;
    case Storage::Double:
      return saturatedUInt64(_double);
    case Storage::Float:
      return saturatedUInt64(static_cast<double>(_float));
    case Storage::Decimal:
      return storedDecimal()->uint64Value();
  }
  return 0;
}

uint64_t NSNumber::unsignedIntegerValue() const {
  const double value = doubleValue();
  return value < 0 || std::isnan(value) ? UINT64_MAX : unsignedLongLongValue();
}

NSDecimal NSNumber::decimalValue() const {
  switch (storage()) {
    case Storage::Boolean:
      return NSDecimal(_bool ? 1 : 0);
    case Storage::Int64:
      return NSDecimal(_int64);
    case Storage::UInt64:
      return NSDecimal::fromUnsigned(_uint64);
    case Storage::Decimal:
      return *storedDecimal();
    case Storage::Float: {
      // The digits that the number prints, not those of the double beside it.
      NSDecimal value;
      if (!std::isfinite(_float)) break;
      NSDecimal::scan(NSStringView::ascii(formatFloat(_float)), value);
      return value;
    }
    case Storage::Double:
      break;
  }
  const double value = doubleValue();
  return std::isnan(value) ? NSDecimal::notANumber() : NSDecimal::fromDouble(value);
}

int NSNumber::compare(const NSNumber& other) const {
  const Storage a = storage();
  const Storage b = other.storage();
  if (a == Storage::Int64 && b == Storage::Int64) {
    return _int64 < other._int64 ? -1 : _int64 > other._int64 ? 1 : 0;
  }
  if (a == Storage::Decimal && b == Storage::Decimal) {
    return storedDecimal()->compare(*other.storedDecimal());
  }
  const bool floating =
      a == Storage::Double || a == Storage::Float || b == Storage::Double || b == Storage::Float;
  if (floating) return compareDoubles(doubleValue(), other.doubleValue());
  return decimalValue().compare(other.decimalValue());
}

uint32_t NSNumber::hash() const {
  return hashDouble(doubleValue());
}

std::string NSNumber::stringValue() const {
  switch (storage()) {
    case Storage::Boolean:
      return _bool ? "true" : "false";
    case Storage::Int64:
      return formatInteger(_int64);
    case Storage::UInt64:
      return formatInteger(_uint64);
    case Storage::Double:
      return formatFloating(_double, false);
    case Storage::Float:
      return formatFloating(static_cast<double>(_float), true);
    case Storage::Decimal:
      return storedDecimal()->toString();
  }
  return {};
}

NSDecimalNumber::NSDecimalNumber(NSDecimal value)
    : NSNumber(Kind::DecimalNumber, 0, std::move(value)) {}

Ref<NSDecimalNumber> NSDecimalNumber::decimalNumberWithString(NSStringView text) {
  NSDecimal value = NSDecimal::notANumber();
  NSDecimal::scan(text, value);
  return make<NSDecimalNumber>(std::move(value));
}

Ref<NSDecimalNumber> NSDecimalNumber::decimalNumberWithDecimal(NSDecimal value) {
  return make<NSDecimalNumber>(std::move(value));
}

}  // namespace xquery

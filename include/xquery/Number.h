// Platform numbers.
//
// A decimal is exact: an integer coefficient times a power of ten, of at most 250,000 digits,
// before and after the point taken together. A host makes and reads one as its digits (Values.h).
#pragma once

#include "xquery/Object.h"
#include "xquery/String.h"

#include <cstdint>
#include <string>
#include <utility>

namespace xquery {

class NSDecimal;  // a decimal as the library computes with it

// A platform number. The two booleans are shared singletons and are the engine's xs:boolean values;
// any other plain NSNumber is an xs:double as an item.
class XQUERY_EXPORT NSNumber : public NSCounted {
 public:
  enum class Storage : uint8_t { Boolean, Int64, UInt64, Double, Float, Decimal };

  static bool classof(const NSObject& object) {
    return object.kind() >= Kind::Number && object.kind() <= Kind::TypedNumber;
  }

  // The shared truth values; compared by identity.
  static NSNumber* trueValue();
  static NSNumber* falseValue();
  [[nodiscard]] static Ref<NSNumber> numberWithBool(bool value) {
    return value ? trueValue() : falseValue();
  }
  [[nodiscard]] static Ref<NSNumber> numberWithLongLong(int64_t value);
  [[nodiscard]] static Ref<NSNumber> numberWithUnsignedLongLong(uint64_t value);
  [[nodiscard]] static Ref<NSNumber> numberWithDouble(double value);
  [[nodiscard]] static Ref<NSNumber> numberWithFloat(float value);

  Storage storage() const { return static_cast<Storage>(_flags); }
  bool isBoolean() const { return storage() == Storage::Boolean; }
  // The payload in place, for code that must not copy it; null when it is stored in another form.
  const NSDecimal* storedDecimal() const {
    return storage() == Storage::Decimal ? reinterpret_cast<const NSDecimal*>(_decimal) : nullptr;
  }

  bool boolValue() const;
  double doubleValue() const;
  float floatValue() const;
  // Truncate and saturate; NaN gives 0.
  int64_t longLongValue() const;
  uint64_t unsignedLongLongValue() const;
  // As an index: a negative value or NaN is huge and selects nothing.
  uint64_t unsignedIntegerValue() const;
  int64_t integerValue() const { return longLongValue(); }
  // Exact for integers and decimals; a double's shortest digits; NaN gives not-a-number.
  NSDecimal decimalValue() const;

  // -1, 0 or 1. Exact between integers and decimals, by double otherwise; NaN equals NaN and is
  // below every other number.
  int compare(const NSNumber& other) const;
  // Numeric equality; booleans count as 0 and 1. `hash` agrees with it.
  bool isEqualToNumber(const NSNumber& other) const { return compare(other) == 0; }
  uint32_t hash() const;

  // "true"/"false"; decimals plain; a double's shortest digits, plain for decimal exponents from
  // -4 to 16, otherwise with an exponent ("1e+17"); "NaN", "INF", "-INF".
  std::string stringValue() const;

 protected:
  NSNumber(Kind kind, uint16_t aux, bool value);
  NSNumber(Kind kind, uint16_t aux, int64_t value);
  NSNumber(Kind kind, uint16_t aux, uint64_t value);
  NSNumber(Kind kind, uint16_t aux, double value);
  NSNumber(Kind kind, uint16_t aux, float value);
  NSNumber(Kind kind, uint16_t aux, NSDecimal value);
  // Takes the payload of another number.
  NSNumber(Kind kind, uint16_t aux, const NSNumber& value);
  ~NSNumber() override;
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

  union {
    bool _bool;
    int64_t _int64;
    uint64_t _uint64;
    double _double;
    float _float;
    alignas(8) unsigned char _decimal[16];  // an NSDecimal
  };
};

class XQUERY_EXPORT NSDecimalNumber : public NSNumber {
 public:
  static bool classof(const NSObject& object) { return object.kind() == Kind::DecimalNumber; }
  // Longest numeric prefix; not-a-number when there is none.
  [[nodiscard]] static Ref<NSDecimalNumber> decimalNumberWithString(NSStringView text);
  [[nodiscard]] static Ref<NSDecimalNumber> decimalNumberWithDecimal(NSDecimal value);

 protected:
  explicit NSDecimalNumber(NSDecimal value);
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);
};

}  // namespace xquery

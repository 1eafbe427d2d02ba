// Typed numbers: every numeric type, and the two ordered durations as counts of months and seconds.
#pragma once

#include "Platform/Base/Counting.h"
#include "Platform/Numbers/NSDecimal.h"
#include "Types/XQueryTypeTable.h"

namespace xquery {

class XQueryNumber : public NSNumber {
 public:
  static bool classof(const NSObject& object) { return object.kind() == Kind::TypedNumber; }

  XQueryTypeID typeID() const { return static_cast<XQueryTypeID>(_aux); }
  // Unchecked; only for a value that its maker has not handed out yet.
  void setType(XQueryTypeID type) { _aux = static_cast<uint16_t>(type); }

  // The shared special values, all of type xs:double. Every NaN and infinity the engine makes is
  // one of these.
  static XQueryNumber* posInf();
  static XQueryNumber* negInf();
  static XQueryNumber* nan();
  static XQueryNumber* zero();
  static XQueryNumber* one();
  // Whether the object is one of the shared NaN and infinities.
  static bool isSpecial(const NSObject* object);

  // Null when the value is not representable in the type. A NaN or an infinity as a decimal or
  // integer is the shared value.
  [[nodiscard]] static Ref<XQueryNumber> number(const NSNumber& withNumber, XQueryTypeID type);
  [[nodiscard]] static Ref<XQueryNumber> doubleWithNumber(const NSNumber& number);
  [[nodiscard]] static Ref<XQueryNumber> floatWithNumber(const NSNumber& number);
  [[nodiscard]] static Ref<XQueryNumber> decimalWithNumber(const NSNumber& number);
  [[nodiscard]] static Ref<XQueryNumber> integerWithNumber(const NSNumber& number);
  [[nodiscard]] static Ref<XQueryNumber> nonNegativeIntegerWithNumber(const NSNumber& number);
  [[nodiscard]] static Ref<XQueryNumber> positiveIntegerWithNumber(const NSNumber& number);
  [[nodiscard]] static Ref<XQueryNumber> nonPositiveIntegerWithNumber(const NSNumber& number);
  [[nodiscard]] static Ref<XQueryNumber> negativeIntegerWithNumber(const NSNumber& number);
  [[nodiscard]] static Ref<XQueryNumber> longWithNumber(const NSNumber& number);
  [[nodiscard]] static Ref<XQueryNumber> intWithNumber(const NSNumber& number);
  [[nodiscard]] static Ref<XQueryNumber> shortWithNumber(const NSNumber& number);
  [[nodiscard]] static Ref<XQueryNumber> byteWithNumber(const NSNumber& number);
  [[nodiscard]] static Ref<XQueryNumber> unsignedLongWithNumber(const NSNumber& number);
  [[nodiscard]] static Ref<XQueryNumber> unsignedIntWithNumber(const NSNumber& number);
  [[nodiscard]] static Ref<XQueryNumber> unsignedShortWithNumber(const NSNumber& number);
  [[nodiscard]] static Ref<XQueryNumber> unsignedByteWithNumber(const NSNumber& number);
  // Another object of the same type and value.
  [[nodiscard]] static Ref<XQueryNumber> copyOf(const XQueryNumber& number) {
    return make<XQueryNumber>(number.typeID(), static_cast<const NSNumber&>(number));
  }
  // A decimal.
  [[nodiscard]] static Ref<XQueryNumber> numberWithDecimal(NSDecimal value);
  // Of a given decimal-based type, unchecked: the caller knows that the value fits.
  [[nodiscard]] static Ref<XQueryNumber> integerWithInt64(int64_t value);
  [[nodiscard]] static Ref<XQueryNumber> integerWithDecimal(NSDecimal value);
  // Makes an integer another one, so that a loop over a range needs no object for each turn; only
  // where nobody but the caller holds it. False for what is no such integer.
  bool becomeInteger(int64_t value) {
    if (typeID() != XQueryTypeInteger || !storedDecimal() || !NSCounting::hasOneReference(*this)) {
      return false;
    }
    *reinterpret_cast<NSDecimal*>(_decimal) = NSDecimal(value);
    return true;
  }

  [[nodiscard]] static Ref<XQueryNumber> yearMonthDurationWithMonths(int64_t months);
  [[nodiscard]] static Ref<XQueryNumber> dayTimeDurationWithSeconds(double seconds);
  // Null for any deviation from the lexical forms.
  [[nodiscard]] static Ref<XQueryNumber> yearMonthDurationWithString(NSStringView text);
  [[nodiscard]] static Ref<XQueryNumber> dayTimeDurationWithString(NSStringView text);
  // Offset of the local zone from GMT.
  [[nodiscard]] static Ref<XQueryNumber> implicitTimeZone();

  // Platform-compatible constructors: type xs:double whatever the argument; NaN and infinities are
  // the shared values.
  [[nodiscard]] static Ref<XQueryNumber> numberWithLongLong(int64_t value);
  [[nodiscard]] static Ref<XQueryNumber> numberWithUnsignedLongLong(uint64_t value);
  [[nodiscard]] static Ref<XQueryNumber> numberWithBool(bool value);
  [[nodiscard]] static Ref<XQueryNumber> numberWithFloat(float value);
  [[nodiscard]] static Ref<XQueryNumber> numberWithDouble(double value);

  // The canonical lexical form.
  Ref<NSString> XQueryStringValue() const;

 protected:
  template <class Payload>
  XQueryNumber(XQueryTypeID type, Payload&& value)
      : NSNumber(Kind::TypedNumber, static_cast<uint16_t>(type), std::forward<Payload>(value)) {}
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  static Ref<XQueryNumber> singlePrecision(const NSNumber& number);
};

}  // namespace xquery

// General durations: years to seconds, each field as it was written.
#pragma once

#include "Types/XQueryTypeTable.h"
#include "xquery/Object.h"
#include "xquery/String.h"

#include <string>

namespace xquery {

struct XQueryDurationParts;

class XQueryDuration : public NSCounted {
 public:
  static bool classof(const NSObject& object) { return object.kind() == Kind::Duration; }

  // Null for any deviation from the lexical form, and for a field beyond 32 bits.
  [[nodiscard]] static Ref<XQueryDuration> durationWithString(NSStringView text);

  // Unchecked: the caller knows that none of them is below 0.
  [[nodiscard]] static Ref<XQueryDuration> durationWithParts(const XQueryDurationParts& parts);

  XQueryTypeID typeID() const { return XQueryTypeDuration; }
  bool isNeg() const { return _isNeg; }
  int32_t year() const { return _year; }
  int32_t month() const { return _month; }
  int32_t day() const { return _day; }
  int32_t hour() const { return _hour; }
  int32_t minute() const { return _minute; }
  double second() const { return _second; }

  // Without the sign: a negative duration prints as its magnitude.
  Ref<NSString> XQueryStringValue() const;
  // The texts of which the two ordered durations are read when this one is cast to them; each
  // leaves out the other's fields and has the sign.
  std::string dayTimeText() const;
  std::string yearMonthText() const;

 protected:
  XQueryDuration() : NSCounted(Kind::Duration) {}
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  bool hasTime() const { return _hour != 0 || _minute != 0 || _second != 0; }
  std::string timeText() const;

  bool _isNeg = false;
  int32_t _year = 0;
  int32_t _month = 0;
  int32_t _day = 0;
  int32_t _hour = 0;
  int32_t _minute = 0;
  double _second = 0;
};

}  // namespace xquery

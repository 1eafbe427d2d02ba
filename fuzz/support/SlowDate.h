// Dates and times counted day by day: what the engine's are compared with. The process's zone is
// GMT here.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>

namespace xquery::fuzz {

struct SlowDate {
  enum Type { GYearMonth, GYear, GMonthDay, GDay, GMonth, DateTime, Date, Time };

  int64_t year = 0;
  int month = 0;
  int day = 0;
  int hour = 0;
  int minute = 0;
  int64_t nanoseconds = 0;      // of the minute
  std::optional<int64_t> zone;  // seconds east of GMT

  // Nothing where the text is none of the type. Fields that the type does not have get their
  // resting values. `isBeyond` where it is one that this model does not follow: a year of more than
  // six digits, or parts of a microsecond.
  static std::optional<SlowDate> parse(std::string_view text, Type type, bool& isBeyond);

  // Nanoseconds from the beginning of year 0 in GMT.
  __extension__ using Instant = __int128;
  Instant instant() const;
  // The fields that a clock in that zone shows.
  static SlowDate at(Instant instant, std::optional<int64_t> zone);

  SlowDate plusMonths(int64_t months) const;
  SlowDate plusSeconds(int64_t seconds, Type type) const;
  // As the type has it, with the fields that a carried second changes.
  std::string text(Type type) const;
  void rest(Type type);
};

}  // namespace xquery::fuzz

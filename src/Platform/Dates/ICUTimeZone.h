// The rules of named time zones; the one file behind it is all that knows the library.
#pragma once

#include <cstdint>
#include <memory>
#include <string_view>

namespace xquery {

class ICUTimeZone {
 public:
  // Seconds east of GMT: the standard time and what daylight saving adds to it.
  struct Offset {
    int32_t standard = 0;
    int32_t daylight = 0;
    int32_t total() const { return standard + daylight; }
  };

  // Null for a name that is not known.
  static std::unique_ptr<const ICUTimeZone> named(std::string_view name);
  // The zone of the process. Never null.
  static std::unique_ptr<const ICUTimeZone> ofProcess();

  virtual ~ICUTimeZone() = default;

  // Both take seconds since 2001-01-01T00:00:00: of an instant, and as a clock in the zone shows.
  // Skipped clock times have the offset before the change, repeated ones are the first of the two.
  virtual Offset offsetAt(int64_t seconds) const = 0;
  virtual Offset offsetForClock(int64_t seconds) const = 0;
  // Whether the offset is the same at all times.
  virtual bool isFixed() const = 0;
};

}  // namespace xquery

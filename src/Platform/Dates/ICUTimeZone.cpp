#include "Platform/Dates/ICUTimeZone.h"

#include "Platform/Dates/GregorianCalendar.h"

#include <unicode/basictz.h>
#include <unicode/simpletz.h>
#include <unicode/tztrans.h>
#include <unicode/unistr.h>

#include <charconv>
#include <cstdlib>
#include <string>

namespace xquery {

namespace {

constexpr int64_t startOfYear(int64_t year) {
  return dayNumber(year, 1, 1) * secondsPerDay;
}

// Before there were zones, the data hold each city's mean solar time, with odd minutes and seconds.
// Nobody means these by a zone: a time of day, which is kept in year 0, would come to be some
// minutes off. So up to here a zone has its present standard offset.
constexpr int64_t startOfZones = startOfYear(1900);

// From here on every zone repeats with the calendar, and the library is asked about one cycle only:
// its own years do not reach as far as ours.
constexpr int64_t startOfCycle = startOfYear(2100);
constexpr int64_t secondsPerCycle = daysPerCycle * secondsPerDay;

constexpr int64_t withinLibraryReach(int64_t seconds) {
  if (seconds < startOfCycle) return seconds;
  return startOfCycle + (seconds - startOfCycle) % secondsPerCycle;
}

// The library counts milliseconds from 1970.
UDate libraryTime(int64_t seconds) {
  return static_cast<double>(withinLibraryReach(seconds) - startOfYear(1970)) * 1000;
}

// Every zone that the library makes from a name or a rule is of this class.
using LibraryZone = std::unique_ptr<const icu::BasicTimeZone>;

class ICUZone : public ICUTimeZone {
 public:
  explicit ICUZone(LibraryZone zone) : _zone(std::move(zone)) {}

  Offset offsetAt(int64_t seconds) const override {
    if (seconds < startOfZones) return present();
    int32_t standard = 0;
    int32_t daylight = 0;
    UErrorCode status = U_ZERO_ERROR;
    _zone->getOffset(libraryTime(seconds), false, standard, daylight, status);
    return {standard / 1000, daylight / 1000};
  }

  Offset offsetForClock(int64_t seconds) const override {
    if (seconds < startOfZones) return present();
    int32_t standard = 0;
    int32_t daylight = 0;
    UErrorCode status = U_ZERO_ERROR;
    _zone->getOffsetFromLocal(libraryTime(seconds), UCAL_TZ_LOCAL_FORMER, UCAL_TZ_LOCAL_FORMER,
                              standard, daylight, status);
    return {standard / 1000, daylight / 1000};
  }

  bool isFixed() const override {
    icu::TimeZoneTransition transition;
    return !_zone->getNextTransition(libraryTime(startOfZones), false, transition);
  }

 private:
  Offset present() const { return {_zone->getRawOffset() / 1000, 0}; }

  LibraryZone _zone;
};

LibraryZone libraryZone(icu::TimeZone* zone) {
  return LibraryZone(static_cast<icu::BasicTimeZone*>(zone));
}

// --- rules in the POSIX form: CET-1CEST,M3.5.0,M10.5.0/3 -----------------------------------------

class RuleReader {
 public:
  explicit RuleReader(std::string_view text) : _text(text) {}

  bool atEnd() const { return _text.empty(); }
  char peek() const { return _text.front(); }
  bool take(char character) {
    if (_text.empty() || _text.front() != character) return false;
    _text.remove_prefix(1);
    return true;
  }
  // Letters, or anything in angle brackets.
  bool name() {
    size_t length = 0;
    if (take('<')) {
      length = _text.find('>');
      if (length == std::string_view::npos) return false;
      ++length;
    } else {
      while (length < _text.size() && isLetter(_text[length])) ++length;
    }
    _text.remove_prefix(length);
    return length >= 3;
  }
  bool number(int& out) {
    const auto [end, error] = std::from_chars(_text.data(), _text.data() + _text.size(), out);
    if (error != std::errc() || out < 0 || out > 1000) return false;
    _text.remove_prefix(static_cast<size_t>(end - _text.data()));
    return true;
  }
  // [+-]hh[:mm[:ss]], no more than a day.
  bool seconds(int& out) {
    const bool negative = take('-');
    if (!negative) take('+');
    int minutes = 0;
    int rest = 0;
    if (!number(out) || (take(':') && !number(minutes)) || (take(':') && !number(rest))) {
      return false;
    }
    out = out * 3600 + minutes * 60 + rest;
    if (out > secondsPerDay) return false;
    if (negative) out = -out;
    return true;
  }

 private:
  static bool isLetter(char c) { return (c >= 'a' && c <= 'z') || (c >= 'A' && c <= 'Z'); }
  std::string_view _text;
};

struct YearlyRule {
  int month = 0, week = 0, weekday = 0;  // week 5 is the last of the month
  int time = 7200;                       // on the clock before the change
};

bool readYearlyRule(RuleReader& reader, YearlyRule& rule) {
  return reader.take(',') && reader.take('M') && reader.number(rule.month) && reader.take('.') &&
         reader.number(rule.week) && reader.take('.') && reader.number(rule.weekday) &&
         (!reader.take('/') || reader.seconds(rule.time)) && rule.month >= 1 && rule.month <= 12 &&
         rule.week >= 1 && rule.week <= 5 && rule.weekday <= 6 && rule.time >= 0;
}

// Null for a text that is no such rule. Without dates the daylight saving of the United States
// holds, as it does elsewhere on the system.
LibraryZone zoneForRule(std::string_view text) {
  constexpr int milliseconds = 1000;
  RuleReader reader(text);
  int west = 0;
  if (!reader.name() || !reader.seconds(west)) return nullptr;
  const auto name = icu::UnicodeString::fromUTF8(std::string(text));
  auto standardOnly = std::make_unique<icu::SimpleTimeZone>(-west * milliseconds, name);
  if (reader.atEnd()) return standardOnly;
  if (!reader.name()) return nullptr;
  int daylightWest = west - 3600;
  if (!reader.atEnd() && reader.peek() != ',' && !reader.seconds(daylightWest)) return nullptr;
  YearlyRule start{3, 2, 0, 7200};
  YearlyRule end{11, 1, 0, 7200};
  if (!reader.atEnd() && (!readYearlyRule(reader, start) || !readYearlyRule(reader, end))) {
    return standardOnly;
  }
  const auto week = [](const YearlyRule& rule) {
    return static_cast<int8_t>(rule.week == 5 ? -1 : rule.week);
  };
  const auto weekday = [](const YearlyRule& rule) { return static_cast<int8_t>(rule.weekday + 1); };
  UErrorCode status = U_ZERO_ERROR;
  auto zone = std::make_unique<icu::SimpleTimeZone>(
      -west * milliseconds, name, static_cast<int8_t>(start.month - 1), week(start), weekday(start),
      start.time * milliseconds, icu::SimpleTimeZone::WALL_TIME, static_cast<int8_t>(end.month - 1),
      week(end), weekday(end), end.time * milliseconds, icu::SimpleTimeZone::WALL_TIME,
      (west - daylightWest) * milliseconds, status);
  return U_SUCCESS(status) ? std::move(zone) : std::move(standardOnly);
}

LibraryZone zoneNamed(std::string_view name) {
  const auto id = icu::UnicodeString::fromUTF8(std::string(name));
  std::unique_ptr<icu::TimeZone> zone(icu::TimeZone::createTimeZone(id));
  if (!zone || *zone == icu::TimeZone::getUnknown()) return nullptr;
  return libraryZone(zone.release());
}

// The value of TZ: a name, perhaps after a colon or as a path of the system's zone files, or a
// rule.
LibraryZone zoneForSetting(std::string_view setting) {
  if (setting.starts_with(':')) setting.remove_prefix(1);
  if (setting.empty()) return zoneNamed("UTC");
  constexpr std::string_view folder = "/zoneinfo/";
  if (const size_t at = setting.find(folder); at != std::string_view::npos) {
    setting.remove_prefix(at + folder.size());
  }
  if (LibraryZone zone = zoneNamed(setting)) return zone;
  if (LibraryZone zone = zoneForRule(setting)) return zone;
  return zoneNamed("UTC");
}

}  // namespace

std::unique_ptr<const ICUTimeZone> ICUTimeZone::named(std::string_view name) {
  LibraryZone zone = zoneNamed(name);
  return zone ? std::make_unique<ICUZone>(std::move(zone)) : nullptr;
}

std::unique_ptr<const ICUTimeZone> ICUTimeZone::ofProcess() {
  const char* setting = std::getenv("TZ");
  LibraryZone zone =
      setting ? zoneForSetting(setting) : libraryZone(icu::TimeZone::detectHostTimeZone());
  return std::make_unique<ICUZone>(std::move(zone));
}

}  // namespace xquery

#include "support/SlowDate.h"

#include <algorithm>
#include <cstdio>

namespace xquery::fuzz {

namespace {

constexpr int64_t daysOfCycle = 146097;  // of 400 years
constexpr int64_t yearsOfCycle = 400;
constexpr int64_t secondsOfDay = 86400;
constexpr SlowDate::Instant second = 1'000'000'000;

bool isLeap(int64_t year) {
  return year % 4 == 0 && (year % 100 != 0 || year % 400 == 0);
}

int daysIn(int64_t year, int month) {
  switch (month) {
    case 2:
      return isLeap(year) ? 29 : 28;
    case 4:
    case 6:
    case 9:
    case 11:
      return 30;
    default:
      return 31;
  }
}

SlowDate::Instant floorDivide(SlowDate::Instant a, SlowDate::Instant b) {
  return a / b - (a % b < 0 ? 1 : 0);
}

// Of the first of January, counted from the beginning of year 0.
int64_t daysBefore(int64_t year) {
  const auto cycle = static_cast<int64_t>(floorDivide(year, yearsOfCycle));
  int64_t days = cycle * daysOfCycle;
  for (int64_t each = cycle * yearsOfCycle; each < year; ++each) days += isLeap(each) ? 366 : 365;
  return days;
}

// Reads characters one by one; what does not fit is remembered.
class Reader {
 public:
  explicit Reader(std::string_view text) : _left(text) {}
  bool isWrong = false;

  bool take(char c) {
    if (_left.empty() || _left.front() != c) return false;
    _left.remove_prefix(1);
    return true;
  }
  void need(std::string_view text) {
    for (const char c : text) isWrong = !take(c) || isWrong;
  }
  std::string digits() {
    std::string taken;
    while (!_left.empty() && _left.front() >= '0' && _left.front() <= '9') {
      taken += _left.front();
      _left.remove_prefix(1);
    }
    return taken;
  }
  int two(int least, int most) {
    const std::string taken = digits();
    if (taken.size() != 2) {
      isWrong = true;
      return 0;
    }
    const int value = std::stoi(taken);
    isWrong = isWrong || value < least || value > most;
    return value;
  }
  bool atEnd() const { return _left.empty(); }

 private:
  std::string_view _left;
};

constexpr bool hasYear(SlowDate::Type type) {
  return type == SlowDate::GYearMonth || type == SlowDate::GYear || type == SlowDate::DateTime ||
         type == SlowDate::Date;
}
constexpr bool hasMonth(SlowDate::Type type) {
  return type != SlowDate::GYear && type != SlowDate::GDay && type != SlowDate::Time;
}
constexpr bool hasDay(SlowDate::Type type) {
  return type == SlowDate::GMonthDay || type == SlowDate::GDay || type == SlowDate::DateTime ||
         type == SlowDate::Date;
}
constexpr bool hasTime(SlowDate::Type type) {
  return type == SlowDate::DateTime || type == SlowDate::Time;
}

void readDate(Reader& in, SlowDate& date, SlowDate::Type type, bool& isBeyond) {
  bool isNegative = false;
  if (hasYear(type)) {
    isNegative = in.take('-');
    std::string digits = in.digits();
    in.isWrong = in.isWrong || digits.size() < 4;
    digits.erase(0, std::min(digits.find_first_not_of('0'), digits.size()));
    isBeyond = isBeyond || digits.size() > 6;
    date.year = digits.empty() || isBeyond ? 0 : std::stoll(digits);
  }
  if (hasMonth(type)) {
    in.need(hasYear(type) ? "-" : "--");
    date.month = in.two(1, 12);
    if (!hasDay(type) && !hasYear(type)) in.need("--");
  }
  if (hasDay(type)) {
    in.need(hasMonth(type) ? "-" : "---");
    date.day = in.two(1, 31);
    if (hasMonth(type)) in.isWrong = in.isWrong || date.day > daysIn(date.year, date.month);
  }
  if (isNegative) date.year = -date.year;
}

// Digits with a point before, among, behind them or nowhere, up to 60.
void readSeconds(Reader& in, SlowDate& date, bool& isBeyond) {
  std::string whole = in.digits();
  std::string fraction;
  const bool hasPoint = in.take('.');
  if (hasPoint) fraction = in.digits();
  in.isWrong = in.isWrong || (whole.empty() && fraction.empty());
  whole.erase(0, std::min(whole.find_first_not_of('0'), whole.size()));
  while (!fraction.empty() && fraction.back() == '0') fraction.pop_back();
  if (fraction.size() > 6) isBeyond = true;
  if (whole.size() > 2) in.isWrong = true;
  if (in.isWrong || isBeyond) return;
  const int64_t seconds = whole.empty() ? 0 : std::stoll(whole);
  fraction.resize(9, '0');
  const int64_t parts = std::stoll(fraction);
  in.isWrong = seconds > 60 || (seconds == 60 && parts > 0);
  date.nanoseconds = seconds * 1'000'000'000 + parts;
}

void readZone(Reader& in, SlowDate& date) {
  if (in.take('Z')) {
    date.zone = 0;
    return;
  }
  const bool isWest = in.take('-');
  if (!isWest && !in.take('+')) return;
  int64_t seconds = int64_t{in.two(0, 99)} * 3600;
  in.need(":");
  seconds += int64_t{in.two(0, 99)} * 60;
  date.zone = isWest ? -seconds : seconds;
}

template <class... Numbers>
std::string formatted(const char* format, Numbers... numbers) {
  char text[64];
  std::snprintf(text, sizeof text, format, numbers...);
  return text;
}

std::string zoneText(int64_t zone) {
  if (zone == 0) return "Z";
  const int64_t size = zone < 0 ? -zone : zone;
  return (zone < 0 ? "-" : "+") + formatted("%.2ld:%.2ld", static_cast<long>(size / 3600),
                                            static_cast<long>(size / 60 % 60));
}

}  // namespace

std::optional<SlowDate> SlowDate::parse(std::string_view text, Type type, bool& isBeyond) {
  Reader in(text);
  SlowDate date;
  isBeyond = false;
  if (type != Time) readDate(in, date, type, isBeyond);
  if (type == DateTime) in.need("T");
  if (hasTime(type)) {
    date.hour = in.two(0, 23);
    in.need(":");
    date.minute = in.two(0, 59);
    in.need(":");
    readSeconds(in, date, isBeyond);
  }
  readZone(in, date);
  if (in.isWrong || !in.atEnd()) return std::nullopt;
  date.rest(type);
  return date;
}

void SlowDate::rest(Type type) {
  if (type == DateTime) return;
  if (!hasYear(type)) year = 0;
  if (type == Time) {
    month = day = 0;
    return;
  }
  if (!hasMonth(type)) month = 1;
  if (!hasDay(type)) day = 1;
  hour = minute = 0;
  nanoseconds = 0;
}

SlowDate::Instant SlowDate::instant() const {
  // Day 0 of month 0 is the last of November, a month before December of the year before.
  const int64_t startYear = month > 0 ? year : year - 1;
  const int startMonth = month > 0 ? month : 12;
  int64_t days = daysBefore(startYear);
  for (int each = 1; each < startMonth; ++each) days += daysIn(startYear, each);
  days += day - 1;
  const Instant seconds =
      Instant{days} * secondsOfDay + hour * 3600 + minute * 60 - zone.value_or(0);
  return seconds * second + nanoseconds;
}

SlowDate SlowDate::at(Instant instant, std::optional<int64_t> zone) {
  const Instant shown = instant + zone.value_or(0) * second;
  auto days = static_cast<int64_t>(floorDivide(shown, secondsOfDay * second));
  Instant left = shown - Instant{days} * secondsOfDay * second;
  SlowDate date;
  date.zone = zone;
  const auto cycle = static_cast<int64_t>(floorDivide(days, daysOfCycle));
  date.year = cycle * yearsOfCycle;
  days -= cycle * daysOfCycle;
  for (; days >= (isLeap(date.year) ? 366 : 365); ++date.year)
    days -= isLeap(date.year) ? 366 : 365;
  for (date.month = 1; days >= daysIn(date.year, date.month); ++date.month) {
    days -= daysIn(date.year, date.month);
  }
  date.day = static_cast<int>(days) + 1;
  date.hour = static_cast<int>(left / (3600 * second));
  left %= 3600 * second;
  date.minute = static_cast<int>(left / (60 * second));
  date.nanoseconds = static_cast<int64_t>(left % (60 * second));
  return date;
}

SlowDate SlowDate::plusMonths(int64_t months) const {
  SlowDate date = *this;
  for (; months > 0; --months) {
    if (++date.month > 12) date.month = 1, ++date.year;
  }
  for (; months < 0; ++months) {
    if (--date.month < 1) date.month = 12, --date.year;
  }
  date.day = std::min(date.day, daysIn(date.year, date.month));
  return date;
}

SlowDate SlowDate::plusSeconds(int64_t seconds, Type type) const {
  SlowDate date = at(instant() + seconds * second, zone);
  date.rest(type);
  return date;
}

std::string SlowDate::text(Type type) const {
  // What was written as the sixtieth second is the first of the next minute.
  const SlowDate shown = at(instant(), zone);
  const int y = static_cast<int>(shown.year);
  std::string text;
  if (hasYear(type)) text += formatted("%.4d", y);
  if (hasMonth(type)) text += formatted(hasYear(type) ? "-%.2d" : "--%.2d", shown.month);
  if (hasDay(type)) text += formatted(hasMonth(type) ? "-%.2d" : "---%.2d", shown.day);
  if (type == GMonth) text += "--";
  if (type == DateTime) text += "T";
  if (hasTime(type)) {
    const auto whole = static_cast<int>(shown.nanoseconds / 1'000'000'000);
    text += formatted("%.2d:%.2d:%.2d", shown.hour, shown.minute, whole);
    const auto parts = static_cast<int>(shown.nanoseconds % 1'000'000'000 / 1000);
    if (parts > 0) text += formatted(".%.6d", parts);
  }
  return zone ? text + zoneText(*zone) : text;
}

}  // namespace xquery::fuzz

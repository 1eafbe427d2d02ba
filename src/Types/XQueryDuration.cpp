#include "Types/XQueryDuration.h"

#include "Platform/Numbers/NumberText.h"
#include "Types/DurationReader.h"
#include "xquery/Values.h"

#include <cmath>
#include <limits>

namespace xquery {

namespace {

// The greatest number that is read is the greatest machine integer, whose double is one more.
std::string wholeText(double seconds) {
  constexpr double twoTo63 = 9223372036854775808.0;
  return std::to_string(seconds < twoTo63 ? static_cast<int64_t>(seconds) : INT64_MAX);
}

// A number that was read and waits for its designator. Each field may be left out, but a number
// must have one.
class FieldReader {
 public:
  explicit FieldReader(DurationReader& reader) : _reader(reader) {}

  // Reads a number unless one is waiting; false when there is none.
  bool next() {
    if (!_isWaiting) _isWaiting = _reader.integer(_number);
    return _isWaiting;
  }
  // Takes the number that is waiting when its designator follows. False when the field does not
  // hold the number.
  bool field(char16_t designator, int32_t& out) {
    if (!next() || !_reader.take(designator)) return true;
    if (_number > std::numeric_limits<int32_t>::max()) return false;
    out = static_cast<int32_t>(_number);
    _isWaiting = false;
    ++_fieldCount;
    return true;
  }
  bool seconds(double& out) {
    if (!next()) return true;
    out = static_cast<double>(_number);
    if (_reader.take('.') && !_reader.fraction(_number, out)) return false;
    if (!_reader.take('S')) return false;
    _isWaiting = false;
    ++_fieldCount;
    return true;
  }
  bool isWaiting() const { return _isWaiting; }
  int fieldCount() const { return _fieldCount; }

 private:
  DurationReader& _reader;
  int64_t _number = 0;
  bool _isWaiting = false;
  int _fieldCount = 0;
};

void appendField(std::string& text, int32_t value, char designator) {
  if (value != 0) text += std::to_string(value) + designator;
}

}  // namespace

Ref<XQueryDuration> XQueryDuration::durationWithString(NSStringView text) {
  Ref<XQueryDuration> duration = make<XQueryDuration>();
  DurationReader reader(text);
  duration->_isNeg = reader.take('-');
  if (!reader.take('P')) return nullptr;
  FieldReader fields(reader);
  if (!fields.field('Y', duration->_year) || !fields.field('M', duration->_month) ||
      !fields.field('D', duration->_day) || fields.isWaiting()) {
    return nullptr;
  }
  if (reader.take('T')) {
    const int dateFields = fields.fieldCount();
    if (!fields.field('H', duration->_hour) || !fields.field('M', duration->_minute) ||
        !fields.seconds(duration->_second) || fields.fieldCount() == dateFields) {
      return nullptr;
    }
  }
  if (fields.fieldCount() == 0 || !reader.atEnd()) return nullptr;
  return duration;
}

Ref<XQueryDuration> XQueryDuration::durationWithParts(const XQueryDurationParts& parts) {
  Ref<XQueryDuration> duration = make<XQueryDuration>();
  duration->_isNeg = parts.isNegative;
  duration->_year = parts.years;
  duration->_month = parts.months;
  duration->_day = parts.days;
  duration->_hour = parts.hours;
  duration->_minute = parts.minutes;
  duration->_second = parts.seconds;
  return duration;
}

std::string XQueryDuration::timeText() const {
  std::string text;
  appendField(text, _hour, 'H');
  appendField(text, _minute, 'M');
  if (_second != 0) {
    const bool whole = _second == std::trunc(_second);
    text += (whole ? wholeText(_second) : formatDouble(_second)) + "S";
  }
  return text;
}

Ref<NSString> XQueryDuration::XQueryStringValue() const {
  std::string text = "P";
  appendField(text, _year, 'Y');
  appendField(text, _month, 'M');
  appendField(text, _day, 'D');
  if (hasTime()) {
    text += "T" + timeText();
  } else if (text == "P") {
    text += "0M";
  }
  return NSString::stringWithASCII(text);
}

std::string XQueryDuration::dayTimeText() const {
  std::string text = _isNeg ? "-P" : "P";
  if (!hasTime()) return text + std::to_string(_day) + "D";
  appendField(text, _day, 'D');
  return text + "T" + timeText();
}

std::string XQueryDuration::yearMonthText() const {
  return (_isNeg ? "-P" : "P") + std::to_string(_year) + "Y" + std::to_string(_month) + "M";
}

}  // namespace xquery

#include "Types/LexicalForms.h"

#include "Platform/Numbers/NumberText.h"
#include "Platform/Reading/XMLCharacters.h"
#include "xquery/Number.h"

#include <algorithm>
#include <limits>

namespace xquery {

namespace {

using Outcome = XQueryFormOutcome;

constexpr bool isDigit(char byte) {
  return byte >= '0' && byte <= '9';
}
constexpr bool isLetter(char byte) {
  return (byte >= 'a' && byte <= 'z') || (byte >= 'A' && byte <= 'Z');
}

// Reads a form from its beginning to its end.
class FormReader {
 public:
  explicit FormReader(std::string_view text) : _rest(text) {}

  bool atEnd() const { return _rest.empty(); }
  char next() const { return atEnd() ? '\0' : _rest.front(); }
  bool take(std::string_view text) {
    if (!_rest.starts_with(text)) return false;
    _rest.remove_prefix(text.size());
    return true;
  }
  bool takeSign() { return take("+") || take("-"); }
  // As many as there are, which may be none.
  std::string_view digits() {
    const auto end = std::find_if_not(_rest.begin(), _rest.end(), isDigit);
    const auto found = _rest.substr(0, static_cast<size_t>(end - _rest.begin()));
    _rest.remove_prefix(found.size());
    return found;
  }
  // Digits with perhaps a point; one digit at least.
  bool mantissa() {
    const size_t whole = digits().size();
    const size_t fraction = take(".") ? digits().size() : 0;
    return whole + fraction > 0;
  }
  bool twoDigits(int& out) {
    if (_rest.size() < 2 || !isDigit(_rest[0]) || !isDigit(_rest[1])) return false;
    out = (_rest[0] - '0') * 10 + (_rest[1] - '0');
    _rest.remove_prefix(2);
    return true;
  }

 private:
  std::string_view _rest;
};

// False where the digits are more than the type holds.
template <class Number>
bool numberOf(std::string_view digits, Number& out) {
  out = 0;
  for (const char digit : digits) {
    if (__builtin_mul_overflow(out, Number{10}, &out) ||
        __builtin_add_overflow(out, static_cast<Number>(digit - '0'), &out)) {
      return false;
    }
  }
  return true;
}

// --- dates ---------------------------------------------------------------------------------------

class DateForm {
 public:
  DateForm(std::string_view text, XQueryDateTimeParts& parts) : _reader(text), _parts(parts) {}

  Outcome read(XQueryItemType type) {
    const bool isGood = readFields(type) && readZone() && _reader.atEnd();
    if (!isGood) return Outcome::Malformed;
    return _yearFits ? Outcome::Good : Outcome::OutOfRange;
  }

 private:
  bool readFields(XQueryItemType type) {
    switch (type) {
      case XQueryItemType::GYearMonth:
        return readYear() && readMonth("-");
      case XQueryItemType::GYear:
        return readYear();
      case XQueryItemType::GMonthDay:
        return readMonth("--") && readDay("-");
      case XQueryItemType::GDay:
        return readDay("---");
      case XQueryItemType::GMonth:
        return readMonthAlone();
      case XQueryItemType::DateTime:
        return readYear() && readMonth("-") && readDay("-") && _reader.take("T") && readTime();
      case XQueryItemType::Date:
        return readYear() && readMonth("-") && readDay("-");
      case XQueryItemType::Time:
        return readTime();
      default:
        return false;
    }
  }

  // Four digits or more, of which more than four begin with none that says nothing. There is no
  // year -0000.
  bool readYear() {
    const bool isNegative = _reader.take("-");
    const std::string_view digits = _reader.digits();
    if (digits.size() < 4 || (digits.size() > 4 && digits.front() == '0')) return false;
    if (isNegative && digits == "0000") return false;
    int64_t year = 0;
    _yearFits = numberOf(digits, year);
    if (isNegative) year = -year;
    _yearFits = _yearFits && year >= std::numeric_limits<int32_t>::min() &&
                year <= std::numeric_limits<int32_t>::max();
    if (_yearFits) _parts.year = static_cast<int32_t>(year);
    return true;
  }
  bool readMonth(std::string_view before) {
    return _reader.take(before) && _reader.twoDigits(_parts.month);
  }
  bool readDay(std::string_view before) {
    return _reader.take(before) && _reader.twoDigits(_parts.day);
  }
  // The first edition wrote "--" behind it, and so does the language. A zone may begin with "-".
  bool readMonthAlone() {
    if (!readMonth("--")) return false;
    _reader.take("--");
    return true;
  }
  bool readTime() {
    return _reader.twoDigits(_parts.hour) && _reader.take(":") &&
           _reader.twoDigits(_parts.minute) && _reader.take(":") &&
           _reader.twoDigits(_parts.second) && readFraction();
  }
  bool readFraction() {
    if (!_reader.take(".")) return true;
    const std::string_view digits = _reader.digits();
    for (size_t index = 0; index < 9; ++index) {
      const int digit = index < digits.size() ? digits[index] - '0' : 0;
      _parts.nanosecond = _parts.nanosecond * 10 + digit;
    }
    return !digits.empty();
  }
  bool readZone() {
    if (_reader.atEnd()) return true;
    _parts.zone = std::chrono::minutes(0);
    if (_reader.take("Z")) return true;
    const bool isWest = _reader.next() == '-';
    int hours = 0;
    int minutes = 0;
    if (!_reader.takeSign() || !_reader.twoDigits(hours) || !_reader.take(":") ||
        !_reader.twoDigits(minutes) || minutes > 59) {
      return false;
    }
    const std::chrono::minutes offset(hours * 60 + minutes);
    _parts.zone = isWest ? -offset : offset;
    return true;
  }

  FormReader _reader;
  XQueryDateTimeParts& _parts;
  bool _yearFits = true;
};

// --- durations -----------------------------------------------------------------------------------

class DurationForm {
 public:
  DurationForm(std::string_view text, XQueryDurationForm& form) : _reader(text), _form(form) {}

  Outcome read(XQueryItemType type) {
    const bool hasMonths = type != XQueryItemType::DayTimeDuration;
    const bool hasDays = type != XQueryItemType::YearMonthDuration;
    _form.isNegative = _reader.take("-");
    if (!_reader.take("P")) return Outcome::Malformed;
    next();
    if (hasMonths) {
      field('Y', _form.years);
      field('M', _form.months);
    }
    if (hasDays) {
      field('D', _form.days);
      if (_number.empty() && _reader.take("T")) readTime();
    }
    const bool isGood = _fields > 0 && !_isMalformed && _number.empty() && _reader.atEnd();
    if (!isGood) return Outcome::Malformed;
    return _fits ? Outcome::Good : Outcome::OutOfRange;
  }

 private:
  // What follows a "T" has a field at least.
  void readTime() {
    const int before = _fields;
    next();
    field('H', _form.hours);
    field('M', _form.minutes);
    seconds();
    if (_fields == before) _isMalformed = true;
  }
  void next() { _number = _reader.digits(); }
  // Takes the number that waits when its letter follows.
  void field(char letter, int64_t& out) {
    if (_number.empty() || !_reader.take({&letter, 1})) return;
    _fits = numberOf(_number, out) && _fits;
    ++_fields;
    next();
  }
  void seconds() {
    if (_number.empty()) return;
    std::string text(_number);
    if (_reader.take(".")) {
      const std::string_view fraction = _reader.digits();
      if (fraction.empty()) _isMalformed = true;
      text.append(".").append(fraction);
    }
    if (!_reader.take("S")) _isMalformed = true;
    _fits = scanDouble(NSStringView::ascii(text), _form.seconds) &&
            _form.seconds <= std::numeric_limits<double>::max() && _fits;
    ++_fields;
    _number = {};
  }

  FormReader _reader;
  XQueryDurationForm& _form;
  std::string_view _number;  // read, and without its letter yet
  int _fields = 0;
  bool _fits = true;
  bool _isMalformed = false;
};

}  // namespace

std::string_view XQueryTrimmedForm(std::string_view text) {
  const size_t first = text.find_first_not_of(whiteSpaceOfXML);
  if (first == text.npos) return {};
  return text.substr(first, text.find_last_not_of(whiteSpaceOfXML) - first + 1);
}

bool XQueryIsIntegerForm(std::string_view text) {
  FormReader reader(text);
  reader.takeSign();
  return !reader.digits().empty() && reader.atEnd();
}

bool XQueryIsDecimalForm(std::string_view text) {
  FormReader reader(text);
  reader.takeSign();
  return reader.mantissa() && reader.atEnd();
}

bool XQueryIsDoubleForm(std::string_view text) {
  FormReader reader(text);
  reader.takeSign();
  if (!reader.mantissa()) return false;
  if (reader.take("e") || reader.take("E")) {
    reader.takeSign();
    if (reader.digits().empty()) return false;
  }
  return reader.atEnd();
}

bool XQueryIsLanguageForm(std::string_view text) {
  constexpr size_t most = 8;
  for (bool isFirst = true;; isFirst = false) {
    const std::string_view part = text.substr(0, text.find('-'));
    const bool isGood = std::all_of(part.begin(), part.end(), [&](char byte) {
      return isLetter(byte) || (!isFirst && isDigit(byte));
    });
    if (part.empty() || part.size() > most || !isGood) return false;
    if (part.size() == text.size()) return true;
    text.remove_prefix(part.size() + 1);
  }
}

bool XQueryIsHexForm(std::string_view text) {
  return text.size() % 2 == 0 && std::all_of(text.begin(), text.end(), [](char byte) {
           return isDigit(byte) || (byte >= 'a' && byte <= 'f') || (byte >= 'A' && byte <= 'F');
         });
}

// The last character before padding has no bits that say nothing.
bool XQueryIsBase64Form(std::string_view text) {
  constexpr std::string_view beforeTwo = "AQgw";
  constexpr std::string_view beforeOne = "AEIMQUYcgkosw048";
  size_t count = 0;
  size_t padding = 0;
  char last = '\0';
  for (const char byte : text) {
    if (isXMLSpace(byte)) continue;
    ++count;
    if (byte == '=') {
      ++padding;
    } else if (padding > 0 || !(isLetter(byte) || isDigit(byte) || byte == '+' || byte == '/')) {
      return false;
    } else {
      last = byte;
    }
  }
  if (count % 4 != 0 || padding > 2) return false;
  if (padding == 2) return beforeTwo.find(last) != beforeTwo.npos;
  return padding == 0 || beforeOne.find(last) != beforeOne.npos;
}

XQueryFormOutcome XQueryReadDateForm(XQueryItemType type, std::string_view text,
                                     XQueryDateTimeParts& parts) {
  return DateForm(text, parts).read(type);
}

XQueryFormOutcome XQueryReadDurationForm(XQueryItemType type, std::string_view text,
                                         XQueryDurationForm& form) {
  return DurationForm(text, form).read(type);
}

}  // namespace xquery

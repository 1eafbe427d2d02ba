#include "arguments/Model.h"

#include <gtest/gtest.h>

#include <charconv>
#include <cmath>
#include <cstdlib>

namespace xquery::arguments {

using castingtable::Outcome;
using castingtable::Row;
using castingtable::Targets;

void fail(int number, const std::string& text) {
  throw Failure{{"error " + std::to_string(number) + " " + text}};
}

// --- making items --------------------------------------------------------------------------------

Item string(std::string text) {
  return {9, std::move(text)};
}
Item untyped(std::string text) {
  const Row* row = rowOf(8, text);
  return {8, std::move(text), nullptr, row};
}
Item integer(int64_t value) {
  return {42, std::to_string(value)};
}
Item boolean(bool value) {
  return {10, value ? "true" : "false"};
}
Item number(double value) {
  return numberOf(11, value);
}
Item numberOf(int type, double value) {
  // The special values are shared and double.
  return {std::isfinite(value) ? type : 11, numberText(value)};
}
Item dayTime(double seconds) {
  return {29, dayTimeText(seconds)};
}
Item anyOf(int type, const std::string& start) {
  return {type, start + "*"};
}
Sequence one(Item item) {
  return {std::move(item)};
}

std::string numberText(double value) {
  if (std::isnan(value)) return "NaN";
  if (std::isinf(value)) return value < 0 ? "-INF" : "INF";
  if (value == 0) return std::signbit(value) ? "-0" : "0";
  char digits[64];
  const double size = std::fabs(value);
  const auto format =
      size >= 1e17 || size < 1e-4 ? std::chars_format::scientific : std::chars_format::fixed;
  const auto end = std::to_chars(digits, digits + sizeof digits, value, format);
  return {digits, end.ptr};
}

std::string dayTimeText(double seconds) {
  double rest = std::fabs(seconds);
  const auto take = [&](double unit) {
    const double whole = std::trunc(rest / unit);
    rest -= whole * unit;
    return static_cast<int64_t>(whole);
  };
  const int64_t days = take(86400);
  const int64_t hours = take(3600);
  const int64_t minutes = take(60);
  std::string text = seconds < 0 ? "-P" : "P";
  if (days) text += std::to_string(days) + "D";
  if (hours) text += "T" + std::to_string(hours) + "H";
  if (minutes) text += (hours ? "" : "T") + std::to_string(minutes) + "M";
  if (rest != 0) text += (hours || minutes ? "" : "T") + numberText(rest) + "S";
  if (!days && !hours && !minutes && rest == 0) text += "T0S";
  return text;
}

// --- types ---------------------------------------------------------------------------------------

int primitiveType(int type) {
  if (type < 28 || type == 37 || type == 39 || type == 41) return type;
  return type < 30 ? 24 : type < 42 ? 9 : 13;
}

bool isStringType(int type) {
  return type == 8 || primitiveType(type) == 9;
}
bool isNumericType(int type) {
  return type == 11 || type == 12 || primitiveType(type) == 13;
}
bool isNumberObject(int type) {
  return type == 10 || isNumericType(type) || type == 28 || type == 29;
}

double durationValue(const Item& item) {
  double total = 0;
  double digits = 0;
  bool isTime = false;
  const char* at = item.text.c_str();
  const bool isNegative = *at == '-';
  if (isNegative) ++at;
  for (++at; *at; ++at) {
    if (*at == 'T') {
      isTime = true;
      continue;
    }
    char* end = nullptr;
    digits = std::strtod(at, &end);
    at = end;
    if (item.type == 28) {
      total += *at == 'Y' ? 12 * digits : digits;
    } else {
      total += digits * (*at == 'D' ? 86400 : *at == 'H' ? 3600 : *at == 'M' && isTime ? 60 : 1);
    }
  }
  return isNegative ? -total : total;
}

double numericValue(const Item& item) {
  if (item.type == 10) return item.text == "true";
  if (item.type == 28 || item.type == 29) return durationValue(item);
  if (item.text == "INF") return INFINITY;
  if (item.text == "-INF") return -INFINITY;
  if (item.text == "NaN") return NAN;
  return std::strtod(item.text.c_str(), nullptr);
}

// --- the shared steps ----------------------------------------------------------------------------

Item typedValue(const Item& item) {
  if (item.isNode()) return untyped(item.text);
  if (!item.isAtomic()) fail(6, invalidType);
  return item;
}

Sequence atomized(const Sequence& value) {
  Sequence items;
  for (const Item& item : value) items.push_back(typedValue(item));
  return items;
}

Item castItem(const Item& item, int target) {
  if (target == item.type) return item;
  if (target == 8) return untyped(item.text);
  if (target == 9) return string(item.text);
  // A name with a prefix is a name of its own; of no use but as text.
  if (item.type == 15) fail(6, noMatch);
  if (!item.row) {
    ADD_FAILURE() << "no row for " << item.type << " '" << item.text << "'";
    fail(6, noMatch);
  }
  for (const Outcome& outcome : item.row->outcomes) {
    if (!(outcome.targets & (Targets{1} << target))) continue;
    const bool isShared =
        (target == 11 || target == 12) && castingtable::isSharedDouble(outcome.text);
    const int type = isShared ? 11 : target;
    return {type, outcome.text, nullptr, rowOf(type, outcome.text)};
  }
  fail(6, noMatch);
}

Item castTo(const Sequence& value, int target) {
  if (value.size() != 1) fail(6, invalidAtomization);
  return castItem(typedValue(value.front()), target);
}

namespace {

std::string described(const Sequence& value) {
  if (value.size() == 1) return value.front().text;
  std::string text = "(";
  for (const Item& item : value) text += (text.size() > 1 ? ", " : "") + item.text;
  return text + ")";
}

[[noreturn]] void failNot(const char* what, const Sequence& value) {
  fail(6, "not a " + std::string(what) + " type - " + described(value));
}

}  // namespace

Item promotedToString(const Sequence& value) {
  const Sequence items = atomized(value);
  if (items.empty()) return string("");
  if (items.size() > 1) failNot("string", items);
  const Item& item = items.front();
  if (primitiveType(item.type) == 9) return item;
  if (item.type == 8 || item.type == 14) return string(item.text);
  failNot("string", items);
}

std::string stringOf(const Sequence& value) {
  return promotedToString(value).text;
}

std::optional<Item> promotedToNumeric(const Sequence& value) {
  const Sequence items = atomized(value);
  if (items.empty()) return std::nullopt;
  if (items.size() > 1) failNot("numeric", items);
  const Item& item = items.front();
  if (item.type == 8) return castItem(item, 11);
  if (!isNumericType(item.type)) failNot("numeric", items);
  return item;
}

std::optional<Item> promotedToInteger(const Sequence& value) {
  const Sequence items = atomized(value);
  if (items.empty()) return std::nullopt;
  if (items.size() > 1) failNot("integer", items);
  const Item& item = items.front();
  if (item.type == 8 || (item.type >= 11 && item.type <= 13)) return castItem(item, 42);
  if (!isNumericType(item.type)) failNot("integer", items);
  return item;
}

bool effectiveBooleanValue(const Sequence& value) {
  if (value.size() != 1) return !value.empty();
  const Item& item = value.front();
  if (isStringType(item.type)) return !item.text.empty();
  if (!isNumberObject(item.type)) return true;
  const double number = numericValue(item);
  return number != 0 && !std::isnan(number);
}

bool equalValues(const Item& a, const Item& b) {
  if (isStringType(a.type) && isStringType(b.type)) return a.text == b.text;
  if (isNumberObject(a.type) && isNumberObject(b.type)) {
    const double x = numericValue(a);
    const double y = numericValue(b);
    return x == y || (std::isnan(x) && std::isnan(y));
  }
  return a.type == b.type && a.text == b.text;
}

// --- text ----------------------------------------------------------------------------------------

std::u16string units(const std::string& utf8) {
  std::u16string units;
  for (size_t at = 0; at < utf8.size();) {
    const unsigned char first = utf8[at];
    const size_t length = first < 0x80 ? 1 : first < 0xE0 ? 2 : first < 0xF0 ? 3 : 4;
    char32_t point = length == 1 ? first : first & (0xFF >> (length + 1));
    for (size_t i = 1; i < length; ++i) point = point << 6 | (utf8[at + i] & 0x3F);
    at += length;
    if (point < 0x10000) {
      units += static_cast<char16_t>(point);
    } else {
      units += static_cast<char16_t>(0xD7C0 + (point >> 10));
      units += static_cast<char16_t>(0xDC00 + (point & 0x3FF));
    }
  }
  return units;
}

std::string utf8(const std::u16string& units) {
  std::string text;
  for (size_t i = 0; i < units.size(); ++i) {
    char32_t point = units[i];
    if (point >= 0xD800 && point < 0xE000) {
      const bool isPair =
          point < 0xDC00 && i + 1 < units.size() && units[i + 1] >= 0xDC00 && units[i + 1] < 0xE000;
      // What is half of a pair is written as the replacement character.
      point = isPair ? 0x10000 + ((point - 0xD800) << 10) + (units[++i] - 0xDC00) : 0xFFFD;
    }
    if (point < 0x80) {
      text += static_cast<char>(point);
      continue;
    }
    const int more = point < 0x800 ? 1 : point < 0x10000 ? 2 : 3;
    text += static_cast<char>(0xFF00 >> (more + 1) | point >> (6 * more));
    for (int left = more - 1; left >= 0; --left) {
      text += static_cast<char>(0x80 | ((point >> (6 * left)) & 63));
    }
  }
  return text;
}

std::string trimmed(const std::string& text) {
  const size_t first = text.find_first_not_of(" \t\r\n");
  return first == text.npos ? "" : text.substr(first, text.find_last_not_of(" \t\r\n") + 1 - first);
}

std::string normalizedSpace(const std::string& text) {
  std::string result;
  for (const char c : trimmed(text)) {
    const bool isSpace = c == ' ' || c == '\t' || c == '\r' || c == '\n';
    if (!isSpace) {
      result += c;
    } else if (result.back() != ' ') {
      result += ' ';
    }
  }
  return result;
}

bool isURI(const std::string& text) {
  const Row* row = rowOf(9, text) ? rowOf(9, text) : rowOf(8, text);
  if (!row) return text.find_first_of(" <>\"{}|\\^`") == text.npos;
  for (const Outcome& outcome : row->outcomes) {
    if (outcome.targets & castingtable::anyURI) return true;
  }
  return false;
}

}  // namespace xquery::arguments

#include "DataWriter.h"

#include <algorithm>
#include <cmath>
#include <cstdio>

namespace bench {
namespace {

constexpr std::array<std::string_view, 32> syllables = {
    "ba", "cor", "den", "el",  "fa",  "gri", "ho",  "im", "jun", "ka", "lor",
    "mi", "nes", "o",   "pra", "qui", "ra",  "sto", "ta", "un",  "ve", "wol",
    "xa", "yor", "zi",  "bre", "ca",  "dul", "en",  "fo", "ger", "hil"};

}  // namespace

unsigned scaled(double whole, double factor) {
  return static_cast<unsigned>(std::max(1.0, std::round(whole * factor)));
}

DataWriter::DataWriter(uint64_t seed, double factor) : _random(seed), _vocabulary(4000) {
  for (std::string& word : _vocabulary) {
    for (unsigned count = _random.between(1, 4); count > 0; count--) {
      word += _random.pick(syllables);
    }
  }
  _out.reserve(static_cast<size_t>(factor * 125e6) + 65536);
  _out += "<?xml version=\"1.0\" encoding=\"UTF-8\"?>\n";
}

void DataWriter::put(std::string_view pattern, std::initializer_list<unsigned> numbers) {
  const unsigned* number = numbers.begin();
  for (const char c : pattern) {
    if (c == '#') {
      _out += std::to_string(*number++);
    } else {
      _out += c;
    }
  }
}

void DataWriter::element(std::string_view name, std::string_view text) {
  open(name);
  _out += text;
  close(name);
}

void DataWriter::attribute(std::string_view name, std::string_view text) {
  (((_out += ' ') += name) += "=\"") += text;
  _out += '"';
}

void DataWriter::words(unsigned count) {
  for (; count > 0; count--) {
    _out += word();
    if (_random.below(200) == 0) _out += " &amp;";
    if (count > 1) _out += ' ';
  }
}

std::string DataWriter::moneyText(unsigned cents) {
  char text[32];
  std::snprintf(text, sizeof text, "%u.%02u", cents / 100, cents % 100);
  return text;
}

std::string DataWriter::isoDate(unsigned firstYear, unsigned lastYear) {
  const unsigned year = _random.between(firstYear, lastYear);
  const unsigned month = _random.between(1, 12), day = _random.between(1, 28);
  char text[48];
  std::snprintf(text, sizeof text, "%u-%02u-%02u", year, month, day);
  return text;
}

std::string DataWriter::capitalised() {
  std::string text(word());
  text[0] = static_cast<char>(text[0] - 'a' + 'A');
  return text;
}

std::string DataWriter::fullName() {
  const std::string first = capitalised();
  return first + " " + capitalised();
}

}  // namespace bench

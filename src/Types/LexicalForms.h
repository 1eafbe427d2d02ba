// The lexical forms of XML Schema Part 2 (second edition) for dates, times and durations, and the
// grammar of its numbers. Whether the fields are in their ranges is asked when a value is made.
#pragma once

#include "xquery/Values.h"

#include <string>
#include <string_view>

namespace xquery {

// Without the white space of XML around it.
std::string_view XQueryTrimmedForm(std::string_view text);

// [+-]digits; [+-] digits with perhaps a point among or around them; that with an exponent.
bool XQueryIsIntegerForm(std::string_view text);
bool XQueryIsDecimalForm(std::string_view text);
bool XQueryIsDoubleForm(std::string_view text);
// What the form of xs:language asks for: up to eight letters, and after each "-" up to eight
// letters and digits.
bool XQueryIsLanguageForm(std::string_view text);
// Digits in pairs; groups of four characters with their padding, perhaps with blanks between.
bool XQueryIsHexForm(std::string_view text);
bool XQueryIsBase64Form(std::string_view text);

enum class XQueryFormOutcome : uint8_t {
  Good,
  Malformed,
  OutOfRange,  // more than the fields hold
};

// `type` is one of the eight. Fields are as written, so that a month may be 13; an hour of 24 is
// kept where nothing follows it. Digits of a second past the ninth are left out.
XQueryFormOutcome XQueryReadDateForm(XQueryItemType type, std::string_view text,
                                     XQueryDateTimeParts& parts);

// `type` is one of the three: months and years alone, days and less alone, or all of them. Each
// number is kept apart.
struct XQueryDurationForm {
  bool isNegative = false;
  int64_t years = 0;
  int64_t months = 0;
  int64_t days = 0;
  int64_t hours = 0;
  int64_t minutes = 0;
  double seconds = 0;
};
XQueryFormOutcome XQueryReadDurationForm(XQueryItemType type, std::string_view text,
                                         XQueryDurationForm& form);

}  // namespace xquery

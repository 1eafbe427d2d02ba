// What casting makes of every source type, in one table for the tests that need it. A line is a
// text, the types whose values are read from it, the targets in which they print as that very text,
// and what they print as in the others; in all other targets they fail. A failure is an error that
// is raised, except that a URI answers its error. For the tests there is a row for each type.
#pragma once

#include <cstdint>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

namespace xquery::castingtable {

using Targets = uint64_t;

template <class... Types>
constexpr Targets types(Types... ids) {
  return ((Targets{1} << ids) | ...);
}

inline constexpr Targets untyped = types(8);
inline constexpr Targets string = types(9);
inline constexpr Targets boolean = types(10);
inline constexpr Targets floating = types(11, 12);
inline constexpr Targets decimal = types(13);
inline constexpr Targets anyURI = types(14);
inline constexpr Targets QName = types(15);
inline constexpr Targets gYearMonth = types(16);
inline constexpr Targets gYear = types(17);
inline constexpr Targets gMonthDay = types(18);
inline constexpr Targets gDay = types(19);
inline constexpr Targets gMonth = types(20);
inline constexpr Targets dateTime = types(21);
inline constexpr Targets date = types(22);
inline constexpr Targets timeOfDay = types(23);
inline constexpr Targets duration = types(24);
inline constexpr Targets base64 = types(25);
inline constexpr Targets hex = types(26);
inline constexpr Targets notation = types(27);
inline constexpr Targets months = types(28);
inline constexpr Targets seconds = types(29);
inline constexpr Targets normalized = types(30);
inline constexpr Targets tokens = types(30, 31, 32);         // normalizedString, token, language
inline constexpr Targets names = types(33, 34, 35, 36, 38);  // Name, NCName, ID, IDREF, ENTITY
inline constexpr Targets onlyName = types(33);
inline constexpr Targets nmtoken = types(40);
inline constexpr Targets integers = types(42, 47, 48, 49, 50);
inline constexpr Targets naturals = types(43, 44, 51, 52, 53, 54);  // that hold a positive value
inline constexpr Targets negatives = types(45, 46);

inline constexpr Targets plain = untyped | string;
inline constexpr Targets freeText = plain | tokens;
inline constexpr Targets tokenText = freeText | nmtoken;
inline constexpr Targets anyText = tokenText | names;
inline constexpr Targets real = floating | decimal;
inline constexpr Targets zeroes = integers | types(43, 45, 51, 52, 53, 54);  // that hold a zero
inline constexpr Targets shorts = types(50, 54);                             // of eight bits

struct Outcome {
  Targets targets;
  std::string text;
};

struct Row {
  int type;
  const char* from;
  std::vector<Outcome> outcomes;
};

struct Line {
  Targets types;
  const char* from;
  Targets same;
  std::vector<Outcome> others = {};
};

inline std::vector<Line> lines() {
  return {
      // Strings and untyped values read as everything that their text is a form of.
      {anyText, "abcd", anyText | anyURI | QName | base64 | notation, {{hex, "ABCD"}}},
      {plain | types(31),
       "1",
       tokenText | real | integers | naturals | anyURI | QName | notation,
       {{boolean, "true"}}},
      {nmtoken,
       "-0.5",
       tokenText | real | anyURI | QName,
       {{integers | types(51, 52, 53, 54) | negatives, "0"}}},
      {string,
       "2.7 ",
       plain | normalized | QName | notation,
       {{real, "2.7"}, {integers | naturals, "2"}}},
      {plain, "", freeText | anyURI | QName | base64 | hex},
      {string, "p:abcd", freeText | onlyName | anyURI | notation},
      {string, "\u00e9\U0001F600", freeText | QName | notation},
      {untyped, "urn:p", freeText | onlyName | anyURI, {{base64, "urnp"}}},
      {string, "$1", freeText | anyURI | QName | notation},
      {string, "i", anyText | anyURI | QName | notation},
      {string, "p", anyText | anyURI | QName | notation},
      {string, "en-GB", anyText | anyURI | QName | notation, {{base64, "enGB"}}},
      {string, "NFD", anyText | anyURI | QName | notation},
      {string, "US-ASCII", anyText | anyURI | QName | notation},
      {string, "<a/>", freeText | QName | notation},
      {untyped, "INF", anyText | floating | anyURI | QName},
      {string, "false", anyText | boolean | anyURI | QName | notation},
      {string, "http://a/b?c#d", freeText | anyURI | notation},
      {untyped,
       "2004-05",
       tokenText | anyURI | QName | gYearMonth,
       {{real | ((integers | naturals) & ~shorts), "2004"}}},
      {untyped, "2004",
       tokenText | real | ((integers | naturals) & ~shorts) | anyURI | QName | gYear | base64 |
           hex},
      {untyped, "--02-29", tokenText | anyURI | QName | gMonthDay, {{base64, "0229"}}},
      {untyped, "---31Z", tokenText | anyURI | QName | gDay},
      {untyped, "--05--", tokenText | anyURI | QName | gMonth},
      {types(34), "P1Y2M", anyText | anyURI | QName | duration | months},
      {untyped, "P1DT2H", anyText | anyURI | QName | duration | seconds},
      {untyped, "12:30:45-01:00", freeText | timeOfDay, {{real | integers | naturals, "12"}}},
      {string,
       "2004-05-06",
       tokenText | anyURI | QName | date | notation,
       {{real | ((integers | naturals) & ~shorts), "2004"}, {base64, "20040506"}}},
      {untyped,
       "2004-05-06T12:30:45Z",
       freeText | dateTime,
       {{real | ((integers | naturals) & ~shorts), "2004"}, {base64, "20040506T123045Z"}}},

      // Booleans count as 1 and 0.
      {boolean, "true", anyText | boolean, {{real | integers | naturals, "1"}}},
      {boolean, "false", anyText | boolean, {{real | zeroes, "0"}}},

      // Numbers are truncated; the signs are asked of the value as given.
      {types(11), "1.5", tokenText | real, {{boolean, "true"}, {integers | naturals, "1"}}},
      {types(11), "NaN", anyText | floating, {{boolean, "false"}}},
      {types(11), "-INF", tokenText | floating, {{boolean, "true"}}},
      {types(11),
       "1e300",
       0,
       {{freeText | types(11), "1e+300"},
        {boolean, "true"},
        {types(12), "INF"},
        {decimal | types(42, 43, 44), "1" + std::string(300, '0')}}},
      {types(12), "0.1", tokenText | real, {{boolean, "true"}, {integers | naturals, "0"}}},
      {decimal, "-128.9", tokenText | real, {{boolean, "true"}, {integers | negatives, "-128"}}},
      {decimal, "0.0", 0, {{tokenText | real | zeroes, "0"}, {boolean, "false"}}},
      {types(42),
       "70000",
       tokenText | real | types(42, 43, 44, 47, 48, 51, 52),
       {{boolean, "true"}}},
      {types(54), "200", tokenText | real | integers | naturals | negatives, {{boolean, "true"}}},

      // Among the integer types one of a larger number counts as derived from one of a smaller, and
      // is taken over without a check: so 12 as a long is "in" the negative types, and -12 as a
      // negativeInteger in some of the natural ones.
      {types(42, 43, 44), "12", tokenText | real | integers | naturals, {{boolean, "true"}}},
      {types(45, 46),
       "-12",
       tokenText | real | integers | negatives | types(43, 44),
       {{boolean, "true"}}},
      {types(47, 48, 49, 50, 51, 52, 53, 54),
       "12",
       tokenText | real | integers | naturals | negatives,
       {{boolean, "true"}}},

      // Dates and times go to text, and to the types whose fields they have.
      {gYearMonth, "2004-05+02:00", freeText | gYearMonth},
      {gYear, "2004", tokenText | gYear},
      {gMonthDay, "--02-29Z", tokenText | gMonthDay},
      {gDay, "---31", tokenText | gDay},
      {gMonth, "--05--", tokenText | gMonth},
      {dateTime,
       "2004-02-29T12:30:45.5+02:00",
       0,
       {{freeText | dateTime, "2004-02-29T12:30:45.500000+02:00"},
        {gYearMonth, "2004-02+02:00"},
        {gYear, "2004+02:00"},
        {gMonthDay, "--02-29+02:00"},
        {gDay, "---29+02:00"},
        {gMonth, "--02--+02:00"},
        {date, "2004-02-29+02:00"},
        {timeOfDay, "12:30:45.500000+02:00"}}},
      {dateTime,
       "-0044-03-15T00:00:00",
       freeText | dateTime,
       {{gYearMonth, "-0044-03"},
        {gYear, "-0044"},
        {gMonthDay, "--03-15"},
        {gDay, "---15"},
        {gMonth, "--03--"},
        {date, "-0044-03-15"},
        {timeOfDay, "00:00:00"}}},
      {date,
       "2004-02-29",
       tokenText | date,
       {{gYearMonth, "2004-02"},
        {gYear, "2004"},
        {gMonthDay, "--02-29"},
        {gDay, "---29"},
        {gMonth, "--02--"},
        {dateTime, "2004-02-29T00:00:00"}}},
      {date,
       "2004-02-29-11:00",
       freeText | date,
       {{gYearMonth, "2004-02-11:00"},
        {gYear, "2004-11:00"},
        {gMonthDay, "--02-29-11:00"},
        {gDay, "---29-11:00"},
        {gMonth, "--02---11:00"},
        {dateTime, "2004-02-29T00:00:00-11:00"}}},
      {timeOfDay, "12:30:45Z", freeText | timeOfDay},

      // Durations. The general one prints without its sign but gives it to the ordered ones.
      {duration,
       "P1Y2M3DT4H5M6.5S",
       anyText | duration,
       {{months, "P1Y2M"}, {seconds, "P3DT4H5M6.5S"}}},
      {duration,
       "-P1Y2M3DT4H5M6S",
       0,
       {{anyText | duration, "P1Y2M3DT4H5M6S"}, {months, "-P1Y2M"}, {seconds, "-P3DT4H5M6S"}}},
      {duration, "P14M", anyText | duration, {{months, "P1Y2M"}, {seconds, "PT0S"}}},
      {duration, "PT36H", anyText | duration, {{months, "P0M"}, {seconds, "P1DT12H"}}},
      {months, "P14M", 0, {{anyText | duration | months, "P1Y2M"}}},
      {months, "-P1Y", tokenText | months, {{duration, "P1Y"}}},
      {seconds, "P1DT2H", anyText | duration | seconds},
      {seconds, "-PT90S", 0, {{tokenText | seconds, "-PT1M30S"}, {duration, "PT1M30S"}}},

      // The other classes.
      {anyURI, "http://a/b", freeText | anyURI},
      {anyURI, "abcd", anyText | anyURI},
      {QName, "abcd", plain | QName},
      {notation, "p:abcd", plain | notation},
      {base64, "abcd", anyText | base64, {{hex, "69B71D"}}},
      {base64, "QQ==", freeText | base64, {{hex, "41"}}},
      {hex, "abcd", 0, {{anyText | hex, "ABCD"}, {base64, "q80="}}},
      {hex, "0f", 0, {{tokenText | hex, "0F"}, {base64, "Dw=="}}},
  };
}

// Of the strings only those of type string itself become a notation, whatever their text.
inline std::vector<Row> table() {
  std::vector<Row> rows;
  for (const Line& line : lines()) {
    for (int type = 8; type <= 54; ++type) {
      if (!(line.types & types(type))) continue;
      const bool mayBeNotation = types(type) & (string | notation);
      Row row = {
          type, line.from, {{line.same & (mayBeNotation ? ~Targets{0} : ~notation), line.from}}};
      row.outcomes.insert(row.outcomes.end(), line.others.begin(), line.others.end());
      rows.push_back(std::move(row));
    }
  }
  return rows;
}

// The special numbers are shared objects of type double, whatever type was asked for.
inline bool isSharedDouble(std::string_view text) {
  return text == "NaN" || text == "INF" || text == "-INF";
}

}  // namespace xquery::castingtable

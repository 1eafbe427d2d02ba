// What casting makes of every source type, in one table for the tests that need it. A row is a
// value, written as its type and the text it is read from, and what it becomes in each group of
// targets; in all other targets it fails. A failure is an error that is raised, except that a URI
// answers its error.
#pragma once

#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

namespace xquery::castingtable {

using Targets = uint64_t;

template <class... Types>
constexpr Targets types(Types... ids) {
  return ((Targets{1} << ids) | ...);
}

inline constexpr Targets untyped = types(8);
inline constexpr Targets plain = types(8, 9);
inline constexpr Targets tokens = types(30, 31, 32);         // normalizedString, token, language
inline constexpr Targets names = types(33, 34, 35, 36, 38);  // Name, NCName, ID, IDREF, ENTITY
inline constexpr Targets nmtoken = types(40);
inline constexpr Targets freeText = plain | tokens;
inline constexpr Targets anyText = plain | tokens | names | nmtoken;
inline constexpr Targets boolean = types(10);
inline constexpr Targets floating = types(11, 12);
inline constexpr Targets decimal = types(13);
inline constexpr Targets integers = types(42, 47, 48, 49, 50);
inline constexpr Targets naturals = types(43, 44, 51, 52, 53, 54);  // that hold a positive value
inline constexpr Targets negatives = types(45, 46);
inline constexpr Targets anyURI = types(14);
inline constexpr Targets QName = types(15);

struct Outcome {
  Targets targets;
  const char* text;
};

struct Row {
  int type;
  const char* from;
  std::vector<Outcome> outcomes;
};

// A number 12 of an integer type up to unsignedByte. Among the integer types one of a larger number
// counts as derived from one of a smaller, and is taken over without a check: so 12 as a long is
// "in" the negative types.
inline Row twelve(int type) {
  Row row = {type,
             "12",
             {{freeText | nmtoken, "12"},
              {boolean, "true"},
              {floating, "12"},
              {decimal | integers | naturals, "12"}}};
  if (type > 45) row.outcomes.push_back({types(45), "12"});
  if (type > 46) row.outcomes.push_back({types(46), "12"});
  return row;
}

// The same of -12, which the naturals hold only where it is taken over.
inline Row minusTwelve(int type, Targets takenOver) {
  return {type,
          "-12",
          {{freeText | nmtoken, "-12"},
           {boolean, "true"},
           {floating, "-12"},
           {decimal | integers | negatives | takenOver, "-12"}}};
}

// A name of any string type. Only from xs:string itself there is a NOTATION.
inline Row name(int type) {
  Row row = {
      type,
      "abcd",
      {{anyText, "abcd"}, {anyURI | QName, "abcd"}, {types(25), "abcd"}, {types(26), "ABCD"}}};
  if (type == 9) row.outcomes.push_back({types(27), "abcd"});
  return row;
}

inline std::vector<Row> table() {
  return {
      // Strings and untyped values read as everything that their text is a form of.
      name(8),
      name(9),
      name(30),
      name(31),
      name(32),
      name(33),
      name(34),
      name(35),
      name(36),
      name(38),
      name(40),
      {8,
       "1",
       {{freeText | nmtoken, "1"},
        {boolean, "true"},
        {floating | decimal, "1"},
        {integers | naturals, "1"},
        {anyURI, "1"},
        {QName, "1"}}},
      {9,
       "1",
       {{freeText | nmtoken, "1"},
        {boolean, "true"},
        {floating | decimal, "1"},
        {integers | naturals, "1"},
        {anyURI, "1"},
        {QName, "1"},
        {types(27), "1"}}},
      {31,
       "1",
       {{freeText | nmtoken, "1"},
        {boolean, "true"},
        {floating | decimal, "1"},
        {integers | naturals, "1"},
        {anyURI, "1"},
        {QName, "1"}}},
      {40,
       "-0.5",
       {{freeText | nmtoken, "-0.5"},
        {floating | decimal, "-0.5"},
        {integers | types(51, 52, 53, 54), "0"},
        {negatives, "0"},
        {anyURI, "-0.5"},
        {QName, "-0.5"}}},
      {9,
       "2.7 ",
       {{plain | types(30), "2.7 "},
        {floating | decimal, "2.7"},
        {integers | naturals, "2"},
        {QName, "2.7 "},
        {types(27), "2.7 "}}},
      {8, "", {{freeText, ""}, {anyURI | QName, ""}, {types(25, 26), ""}}},
      {9, "", {{freeText, ""}, {anyURI | QName, ""}, {types(25, 26), ""}}},
      {9,
       "p:abcd",
       {{freeText, "p:abcd"}, {types(33), "p:abcd"}, {anyURI, "p:abcd"}, {types(27), "p:abcd"}}},
      {9,
       "\u00e9\U0001F600",
       {{freeText, "\u00e9\U0001F600"}, {QName | types(27), "\u00e9\U0001F600"}}},
      {8,
       "urn:p",
       {{freeText, "urn:p"}, {types(33), "urn:p"}, {anyURI, "urn:p"}, {types(25), "urnp"}}},
      {9, "$1", {{freeText, "$1"}, {anyURI | QName, "$1"}, {types(27), "$1"}}},
      {9, "i", {{anyText, "i"}, {anyURI | QName, "i"}, {types(27), "i"}}},
      {9, "p", {{anyText, "p"}, {anyURI | QName, "p"}, {types(27), "p"}}},
      {9,
       "en-GB",
       {{anyText, "en-GB"}, {anyURI | QName, "en-GB"}, {types(27), "en-GB"}, {types(25), "enGB"}}},
      {9, "NFD", {{anyText, "NFD"}, {anyURI | QName, "NFD"}, {types(27), "NFD"}}},
      {9,
       "US-ASCII",
       {{anyText, "US-ASCII"}, {anyURI | QName, "US-ASCII"}, {types(27), "US-ASCII"}}},
      {9, "<a/>", {{freeText, "<a/>"}, {QName, "<a/>"}, {types(27), "<a/>"}}},
      {8, "INF", {{anyText, "INF"}, {floating, "INF"}, {anyURI | QName, "INF"}}},
      {9,
       "false",
       {{anyText, "false"}, {boolean, "false"}, {anyURI | QName, "false"}, {types(27), "false"}}},
      {9,
       "http://a/b?c#d",
       {{freeText, "http://a/b?c#d"}, {anyURI, "http://a/b?c#d"}, {types(27), "http://a/b?c#d"}}},
      {8,
       "2004-05",
       {{freeText | nmtoken, "2004-05"},
        {floating | decimal, "2004"},
        {integers & ~types(50), "2004"},
        {naturals & ~types(54), "2004"},
        {anyURI | QName, "2004-05"},
        {types(16), "2004-05"}}},
      {8,
       "2004",
       {{freeText | nmtoken, "2004"},
        {floating | decimal, "2004"},
        {integers & ~types(50), "2004"},
        {naturals & ~types(54), "2004"},
        {anyURI | QName, "2004"},
        {types(17), "2004"},
        {types(25, 26), "2004"}}},
      {8,
       "--02-29",
       {{freeText | nmtoken, "--02-29"},
        {anyURI | QName, "--02-29"},
        {types(18), "--02-29"},
        {types(25), "0229"}}},
      {8,
       "---31Z",
       {{freeText | nmtoken, "---31Z"}, {anyURI | QName, "---31Z"}, {types(19), "---31Z"}}},
      {8,
       "--05--",
       {{freeText | nmtoken, "--05--"}, {anyURI | QName, "--05--"}, {types(20), "--05--"}}},
      {34, "P1Y2M", {{anyText, "P1Y2M"}, {anyURI | QName, "P1Y2M"}, {types(24, 28), "P1Y2M"}}},
      {8, "P1DT2H", {{anyText, "P1DT2H"}, {anyURI | QName, "P1DT2H"}, {types(24, 29), "P1DT2H"}}},
      {8,
       "12:30:45-01:00",
       {{freeText, "12:30:45-01:00"},
        {floating | decimal, "12"},
        {integers | naturals, "12"},
        {types(23), "12:30:45-01:00"}}},
      {9,
       "2004-05-06",
       {{freeText | nmtoken, "2004-05-06"},
        {floating | decimal, "2004"},
        {integers & ~types(50), "2004"},
        {naturals & ~types(54), "2004"},
        {anyURI | QName, "2004-05-06"},
        {types(22), "2004-05-06"},
        {types(25), "20040506"},
        {types(27), "2004-05-06"}}},
      {8,
       "2004-05-06T12:30:45Z",
       {{freeText, "2004-05-06T12:30:45Z"},
        {floating | decimal, "2004"},
        {integers & ~types(50), "2004"},
        {naturals & ~types(54), "2004"},
        {types(21), "2004-05-06T12:30:45Z"},
        {types(25), "20040506T123045Z"}}},

      // Booleans count as 1 and 0.
      {10,
       "true",
       {{anyText, "true"},
        {boolean, "true"},
        {floating | decimal, "1"},
        {integers | naturals, "1"}}},
      {10,
       "false",
       {{anyText, "false"},
        {boolean, "false"},
        {floating | decimal, "0"},
        {integers | types(43, 45, 51, 52, 53, 54), "0"}}},

      // Numbers are truncated; the signs are asked of the value as given.
      {11,
       "1.5",
       {{freeText | nmtoken, "1.5"},
        {boolean, "true"},
        {floating | decimal, "1.5"},
        {integers | naturals, "1"}}},
      {11, "NaN", {{anyText, "NaN"}, {boolean, "false"}, {floating, "NaN"}}},
      {11, "-INF", {{freeText | nmtoken, "-INF"}, {boolean, "true"}, {floating, "-INF"}}},
      {11,
       "1e300",
       {{freeText, "1e+300"},
        {boolean, "true"},
        {types(11), "1e+300"},
        {types(12), "INF"},
        {decimal | types(42, 43, 44),
         "1000000000000000000000000000000000000000000000000000000000000000000000000"
         "0000000000000000000000000000000000000000000000000000000000000000000000000"
         "0000000000000000000000000000000000000000000000000000000000000000000000000"
         "0000000000000000000000000000000000000000000000000000000000000000000000000"
         "000000000"}}},
      {12,
       "0.1",
       {{freeText | nmtoken, "0.1"},
        {boolean, "true"},
        {floating | decimal, "0.1"},
        {integers | naturals, "0"}}},
      {13,
       "-128.9",
       {{freeText | nmtoken, "-128.9"},
        {boolean, "true"},
        {floating | decimal, "-128.9"},
        {integers | negatives, "-128"}}},
      {13,
       "0.0",
       {{freeText | nmtoken, "0"},
        {boolean, "false"},
        {floating | decimal, "0"},
        {integers | types(43, 45, 51, 52, 53, 54), "0"}}},
      {42,
       "70000",
       {{freeText | nmtoken, "70000"},
        {boolean, "true"},
        {floating | decimal, "70000"},
        {types(42, 43, 44, 47, 48, 51, 52), "70000"}}},
      {54,
       "200",
       {{freeText | nmtoken, "200"},
        {boolean, "true"},
        {floating | decimal, "200"},
        {integers | naturals | negatives, "200"}}},
      twelve(42),
      twelve(43),
      twelve(44),
      minusTwelve(45, types(43, 44)),
      minusTwelve(46, types(43, 44)),
      twelve(47),
      twelve(48),
      twelve(49),
      twelve(50),
      twelve(51),
      twelve(52),
      twelve(53),
      twelve(54),

      // Dates and times go to text, and to the types whose fields they have.
      {16, "2004-05+02:00", {{freeText, "2004-05+02:00"}, {types(16), "2004-05+02:00"}}},
      {17, "2004", {{freeText | nmtoken, "2004"}, {types(17), "2004"}}},
      {18, "--02-29Z", {{freeText | nmtoken, "--02-29Z"}, {types(18), "--02-29Z"}}},
      {19, "---31", {{freeText | nmtoken, "---31"}, {types(19), "---31"}}},
      {20, "--05--", {{freeText | nmtoken, "--05--"}, {types(20), "--05--"}}},
      {21,
       "2004-02-29T12:30:45.5+02:00",
       {{freeText, "2004-02-29T12:30:45.500000+02:00"},
        {types(16), "2004-02+02:00"},
        {types(17), "2004+02:00"},
        {types(18), "--02-29+02:00"},
        {types(19), "---29+02:00"},
        {types(20), "--02--+02:00"},
        {types(21), "2004-02-29T12:30:45.500000+02:00"},
        {types(22), "2004-02-29+02:00"},
        {types(23), "12:30:45.500000+02:00"}}},
      {21,
       "-0044-03-15T00:00:00",
       {{freeText, "-0044-03-15T00:00:00"},
        {types(16), "-0044-03"},
        {types(17), "-0044"},
        {types(18), "--03-15"},
        {types(19), "---15"},
        {types(20), "--03--"},
        {types(21), "-0044-03-15T00:00:00"},
        {types(22), "-0044-03-15"},
        {types(23), "00:00:00"}}},
      {22,
       "2004-02-29",
       {{freeText | nmtoken, "2004-02-29"},
        {types(16), "2004-02"},
        {types(17), "2004"},
        {types(18), "--02-29"},
        {types(19), "---29"},
        {types(20), "--02--"},
        {types(21), "2004-02-29T00:00:00"},
        {types(22), "2004-02-29"}}},
      {22,
       "2004-02-29-11:00",
       {{freeText, "2004-02-29-11:00"},
        {types(16), "2004-02-11:00"},
        {types(17), "2004-11:00"},
        {types(18), "--02-29-11:00"},
        {types(19), "---29-11:00"},
        {types(20), "--02---11:00"},
        {types(21), "2004-02-29T00:00:00-11:00"},
        {types(22), "2004-02-29-11:00"}}},
      {23, "12:30:45Z", {{freeText, "12:30:45Z"}, {types(23), "12:30:45Z"}}},

      // Durations. The general one prints without its sign but gives it to the ordered ones.
      {24,
       "P1Y2M3DT4H5M6.5S",
       {{anyText, "P1Y2M3DT4H5M6.5S"},
        {types(24), "P1Y2M3DT4H5M6.5S"},
        {types(28), "P1Y2M"},
        {types(29), "P3DT4H5M6.5S"}}},
      {24,
       "-P1Y2M3DT4H5M6S",
       {{anyText, "P1Y2M3DT4H5M6S"},
        {types(24), "P1Y2M3DT4H5M6S"},
        {types(28), "-P1Y2M"},
        {types(29), "-P3DT4H5M6S"}}},
      {24,
       "P14M",
       {{anyText, "P14M"}, {types(24), "P14M"}, {types(28), "P1Y2M"}, {types(29), "PT0S"}}},
      {24,
       "PT36H",
       {{anyText, "PT36H"}, {types(24), "PT36H"}, {types(28), "P0M"}, {types(29), "P1DT12H"}}},
      {28, "P14M", {{anyText, "P1Y2M"}, {types(24, 28), "P1Y2M"}}},
      {28, "-P1Y", {{freeText | nmtoken, "-P1Y"}, {types(24), "P1Y"}, {types(28), "-P1Y"}}},
      {29, "P1DT2H", {{anyText, "P1DT2H"}, {types(24, 29), "P1DT2H"}}},
      {29,
       "-PT90S",
       {{freeText | nmtoken, "-PT1M30S"}, {types(24), "PT1M30S"}, {types(29), "-PT1M30S"}}},

      // The other classes.
      {14, "http://a/b", {{freeText, "http://a/b"}, {anyURI, "http://a/b"}}},
      {14, "abcd", {{anyText, "abcd"}, {anyURI, "abcd"}}},
      {15, "abcd", {{plain, "abcd"}, {QName, "abcd"}}},
      {27, "p:abcd", {{plain, "p:abcd"}, {types(27), "p:abcd"}}},
      {25, "abcd", {{anyText, "abcd"}, {types(25), "abcd"}, {types(26), "69B71D"}}},
      {25, "QQ==", {{freeText, "QQ=="}, {types(25), "QQ=="}, {types(26), "41"}}},
      {26, "abcd", {{anyText, "ABCD"}, {types(26), "ABCD"}, {types(25), "q80="}}},
      {26, "0f", {{freeText | nmtoken, "0F"}, {types(26), "0F"}, {types(25), "Dw=="}}},
  };
}

// The special numbers are shared objects of type double, whatever type was asked for.
inline bool isSharedDouble(std::string_view text) {
  return text == "NaN" || text == "INF" || text == "-INF";
}

}  // namespace xquery::castingtable

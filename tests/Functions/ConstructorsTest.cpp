#include "Functions/Constructors.h"
#include "Functions/FunctionsTesting.h"

namespace xquery {
namespace {

using namespace functiontest;

struct Row {
  const char* name;
  XQueryProcedure procedure;
  XQueryTypeID type;
};

constexpr Row rows[] = {
    {"xs:string", xs_string, 9},
    {"xs:boolean", xs_boolean, 10},
    {"xs:decimal", xs_decimal, 13},
    {"xs:float", xs_float, 12},
    {"xs:double", xs_double, 11},
    {"xs:duration", xs_duration, 24},
    {"xs:dateTime", xs_dateTime, 21},
    {"xs:time", xs_time, 23},
    {"xs:date", xs_date, 22},
    {"xs:gYearMonth", xs_gYearMonth, 16},
    {"xs:gYear", xs_gYear, 17},
    {"xs:gMonthDay", xs_gMonthDay, 18},
    {"xs:gDay", xs_gDay, 19},
    {"xs:gMonth", xs_gMonth, 20},
    {"xs:hexBinary", xs_hexBinary, 26},
    {"xs:base64Binary", xs_base64Binary, 25},
    {"xs:anyURI", xs_anyURI, 14},
    {"xs:QName", xs_QName, 15},
    {"xs:normalizedString", xs_normalizedString, 30},
    {"xs:token", xs_token, 31},
    {"xs:language", xs_language, 32},
    {"xs:NMTOKEN", xs_NMTOKEN, 40},
    {"xs:Name", xs_Name, 33},
    {"xs:NCName", xs_NCName, 34},
    {"xs:ID", xs_ID, 35},
    {"xs:IDREF", xs_IDREF, 36},
    {"xs:ENTITY", xs_ENTITY, 38},
    {"xs:integer", xs_integer, 42},
    {"xs:nonPositiveInteger", xs_nonPositiveInteger, 45},
    {"xs:negativeInteger", xs_negativeInteger, 46},
    {"xs:long", xs_long, 47},
    {"xs:int", xs_int, 48},
    {"xs:short", xs_short, 49},
    {"xs:byte", xs_byte, 50},
    {"xs:nonNegativeInteger", xs_nonNegativeInteger, 43},
    {"xs:unsignedLong", xs_unsignedLong, 51},
    {"xs:unsignedInt", xs_unsignedInt, 52},
    {"xs:unsignedShort", xs_unsignedShort, 53},
    {"xs:unsignedByte", xs_unsignedByte, 54},
    {"xs:positiveInteger", xs_positiveInteger, 44},
    {"xs:NOTATION", xs_NOTATION, 27},
    {"xdt:yearMonthDuration", xdt_yearMonthDuration, 28},
    {"xdt:dayTimeDuration", xdt_dayTimeDuration, 29},
    {"xdt:untypedAtomic", xdt_untypedAtomic, 8},
};

// One text of every lexical form; each type takes some of them.
constexpr const char* texts[] = {
    "1",         "-7",         "12.9", "abc",   "P1Y2M",   "P1DT2H",
    "true",      "2004-10-29", "--10", "---29", "--10-29", "2004-10",
    "12:30:00Z", "AB12",       "YWJj", "a b",   "en-US",   "2004-10-29T12:30:00Z",
    "",          "INF",        "%zz",  "p:q",   "300",     "2004"};

TEST(Constructors, AnswerWhatACastToTheirTypeAnswers) {
  for (const Row& row : rows) {
    for (const char* text : texts) {
      for (const Value& value : {string(text), untyped(text)}) {
        const std::string expected = outcome([&](XQueryContext& context) {
          return XQueryCastAsTypeForContext(value, row.type, context);
        });
        EXPECT_EQ(call(row.procedure, {value}), expected) << row.name << " of " << text;
      }
    }
  }
}

TEST(Constructors, TakeExactlyOneArgument) {
  for (const Row& row : rows) {
    EXPECT_EQ(call(row.procedure, {}), "null") << row.name;
    EXPECT_EQ(call(row.procedure, {string("1"), string("1")}), "null") << row.name;
    EXPECT_EQ(answer(std::string(row.name) + "()"),
              std::string("error 17 line 1 invalid arguments to function - ") + row.name);
  }
}

TEST(Constructors, RefuseTheEmptySequenceAndSeveralItems) {
  for (const Row& row : rows) {
    EXPECT_EQ(call(row.procedure, {empty()}), "error 6 invalid type for automization") << row.name;
    EXPECT_EQ(call(row.procedure, {sequence({integer(1), integer(2)})}),
              "error 6 invalid type for automization")
        << row.name;
  }
}

TEST(Constructors, OfTheSimplerTypesInQueries) {
  EXPECT_EQ(answer("xs:integer('12'), xs:integer(2.7), xs:decimal('1.50'), xs:double('1e3')"),
            "integer 12, integer 2, decimal 1.5, double 1000");
  EXPECT_EQ(answer("xs:boolean('1'), xs:boolean('false'), xs:string(5), xdt:untypedAtomic(5)"),
            "true, false, string 5, untypedAtomic 5");
  EXPECT_EQ(answer("xs:byte('127'), xs:unsignedByte(255), xs:positiveInteger(3)"),
            "byte 127, unsignedByte 255, positiveInteger 3");
  EXPECT_EQ(answer("xs:hexBinary('ab'), xs:base64Binary('YWJj'), xs:anyURI('urn:x')"),
            "hexBinary AB, base64Binary YWJj, anyURI urn:x");
  EXPECT_EQ(answer("xdt:yearMonthDuration('P14M'), xdt:dayTimeDuration('PT90M')"),
            "yearMonthDuration P1Y2M, dayTimeDuration PT1H30M");
  EXPECT_EQ(answer("xs:NCName('a'), xs:token('a b'), xs:language('en'), xs:NOTATION('n')"),
            "NCName a, token a b, language en, NOTATION n");
}

TEST(Constructors, AtomizeANode) {
  EXPECT_EQ(answer("xs:integer(a)", document("<a>42</a>")), "integer 42");
  EXPECT_EQ(answer("xs:string(a/@b)", document("<a b='x'/>")), "string x");
}

TEST(Constructors, FailAsTheCastFails) {
  EXPECT_EQ(answer("xs:byte(128)"), "error 6 line 0 value does not match a required type");
  EXPECT_EQ(answer("xs:integer('x')"), "error 6 line 0 value does not match a required type");
}

TEST(Constructors, TheErrorOfAURIsCastIsRaisedByTheCall) {
  EXPECT_EQ(answer("xs:integer(xs:anyURI('urn:x'))"),
            "error 6 line 0 value does not match a required type");
}

TEST(Constructors, OfQNamesResolveThePrefixInTheProlog) {
  EXPECT_EQ(answer("declare namespace p = 'urn:p'; xs:QName('p:a') eq xs:QName('p:a')"), "true");
  EXPECT_EQ(answer("xs:QName('zz:a')"), "error 6 line 0 value does not match a required type");
}

}  // namespace
}  // namespace xquery

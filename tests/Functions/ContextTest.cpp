#include "Functions/Context.h"
#include "Functions/FunctionsTesting.h"

namespace xquery {
namespace {

using namespace functiontest;

std::string inFocus(XQueryProcedure procedure, int64_t position, int64_t last) {
  return outcome([&](XQueryContext& context) {
    _internal(context).setContextItem(integer(7), position);
    _internal(context).setLast(last);
    return procedure(nullptr, 0, context);
  });
}

TEST(Position, IsThePlaceInTheFocus) {
  EXPECT_EQ(inFocus(fn_position, 3, 5), "integer 3");
}

TEST(Position, OfZeroIsRefused) {
  EXPECT_EQ(inFocus(fn_position, 0, 5), "null");
  EXPECT_EQ(call(fn_position, {}), "null");
}

TEST(Last, IsTheSizeOfTheFocus) {
  EXPECT_EQ(inFocus(fn_last, 3, 5), "integer 5");
}

TEST(Last, OfZeroIsRefused) {
  EXPECT_EQ(inFocus(fn_last, 3, 0), "null");
  EXPECT_EQ(call(fn_last, {}), "null");
}

TEST(PositionAndLast, TakeNoArguments) {
  EXPECT_EQ(outcome([](XQueryContext& context) {
              _internal(context).setContextItem(integer(7), 1);
              _internal(context).setLast(1);
              const Value argument = integer(1);
              EXPECT_FALSE(fn_position(&argument, 1, context));
              return fn_last(&argument, 1, context);
            }),
            "null");
}

TEST(Last, WithoutASizeFailsTheCall) {
  EXPECT_EQ(answer("last()"), "error 17 line 1 invalid arguments to function - last");
  EXPECT_EQ(answer("position()"), "error 17 line 1 invalid arguments to function - position");
}

TEST(Position, OfTheContextItemOfTheWholeQueryIsOne) {
  EXPECT_EQ(answer("position()", document("<a/>")), "integer 1");
  EXPECT_EQ(answer("last()", document("<a/>")),
            "error 17 line 1 invalid arguments to function - last");
}

// --- the static context --------------------------------------------------------------------------

TEST(StaticBaseURI, IsTheDeclaredOne) {
  EXPECT_EQ(answer("declare base-uri 'http://h/a'; static-base-uri()"), "anyURI http://h/a");
  EXPECT_EQ(answer("declare base-uri 'a/b'; static-base-uri()"), "anyURI a/b");
}

TEST(StaticBaseURI, UndeclaredOrEmptyIsNone) {
  EXPECT_EQ(answer("static-base-uri()"), "");
  EXPECT_EQ(answer("declare base-uri ''; static-base-uri()"), "");
}

TEST(StaticBaseURI, ThatIsNoURIIsAFailedCast) {
  EXPECT_EQ(answer("declare base-uri 'a b'; static-base-uri()"),
            "error 6 line 0 value does not match a required type");
}

TEST(DefaultCollation, IsTheDeclaredOneAsAString) {
  EXPECT_EQ(answer("declare default collation 'urn:c'; default-collation()"), "string urn:c");
  EXPECT_EQ(answer("declare default collation 'no uri'; default-collation()"), "string no uri");
}

TEST(DefaultCollation, UndeclaredIsTheEmptyString) {
  EXPECT_EQ(answer("default-collation()"), "string ");
}

TEST(ImplicitTimezone, IsTheLocalOffsetAsADuration) {
  const std::string zone = call(fn_implicit_timezone, {});
  EXPECT_EQ(zone, show(XQueryNumber::implicitTimeZone()));
  EXPECT_EQ(zone.substr(0, 16), "dayTimeDuration ");
}

TEST(StaticContext, FunctionsTakeNoArguments) {
  for (const char* name : {"static-base-uri", "default-collation", "implicit-timezone"}) {
    EXPECT_EQ(answer(std::string(name) + "(())"),
              "error 17 line 1 invalid arguments to function - " + std::string(name));
    EXPECT_EQ(answer(std::string(name) + "(1, 2)"),
              "error 17 line 1 invalid arguments to function - " + std::string(name));
  }
}

}  // namespace
}  // namespace xquery

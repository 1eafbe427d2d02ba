#include "Functions/Boolean.h"
#include "Functions/FunctionsTesting.h"

namespace xquery {
namespace {

using namespace functiontest;

TEST(TrueAndFalse, TakeNoArguments) {
  EXPECT_EQ(call(fn_true, {}), "true");
  EXPECT_EQ(call(fn_false, {}), "false");
  EXPECT_EQ(refusedCounts(fn_true, integer(1)), "1 2 3 4 5");
  EXPECT_EQ(refusedCounts(fn_false, integer(1)), "1 2 3 4 5");
}

TEST(Boolean, IsTheEffectiveBooleanValue) {
  EXPECT_EQ(call(fn_boolean, {sequence({integer(1), integer(2)})}), "true");
  EXPECT_EQ(call(fn_boolean, {empty()}), "false");
  EXPECT_EQ(call(fn_boolean, {string("")}), "false");
  EXPECT_EQ(call(fn_boolean, {string("0")}), "true");
  EXPECT_EQ(call(fn_boolean, {untyped("")}), "false");
  EXPECT_EQ(call(fn_boolean, {integer(0)}), "false");
  EXPECT_EQ(call(fn_boolean, {nan()}), "false");
  EXPECT_EQ(call(fn_boolean, {number(-0.5)}), "true");
  EXPECT_EQ(call(fn_boolean, {boolean(false)}), "false");
  EXPECT_EQ(call(fn_boolean, {document("<a/>")}), "true");
}

TEST(Boolean, PassesAnErrorRecordThrough) {
  EXPECT_EQ(call(fn_boolean, {XQueryError::error(6, "x")}), "record 6 x");
}

TEST(Boolean, TakesOneArgument) {
  EXPECT_EQ(refusedCounts(fn_boolean, integer(1)), "0 2 3 4 5");
}

TEST(Not, InvertsTheEffectiveBooleanValue) {
  EXPECT_EQ(call(fn_not, {empty()}), "true");
  EXPECT_EQ(call(fn_not, {string("a")}), "false");
  EXPECT_EQ(call(fn_not, {integer(0)}), "true");
  EXPECT_EQ(call(fn_not, {sequence({boolean(false), boolean(false)})}), "false");
}

TEST(Not, PassesAnErrorRecordThrough) {
  EXPECT_EQ(call(fn_not, {XQueryError::error(6, "x")}), "record 6 x");
}

TEST(Not, TakesOneArgument) {
  EXPECT_EQ(refusedCounts(fn_not, integer(1)), "0 2 3 4 5");
}

}  // namespace
}  // namespace xquery

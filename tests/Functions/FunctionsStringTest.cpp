#include "Functions/FunctionsString.h"
#include "Functions/FunctionsTesting.h"

namespace xquery {
namespace {

using namespace functiontest;

TEST(Concat, JoinsTheStringsOfItsArguments) {
  EXPECT_EQ(call(fn_concat, {string("a"), integer(1)}), "untypedAtomic a1");
  EXPECT_EQ(call(fn_concat, {number(1.5), boolean(true), untyped("u"), months(14)}),
            "untypedAtomic 1.5trueuP1Y2M");
}

TEST(Concat, GivesAnUntypedValue) {
  EXPECT_EQ(call(fn_concat, {string("a"), string("b")}), "untypedAtomic ab");
}

TEST(Concat, TakesTheTextOfNodes) {
  EXPECT_EQ(call(fn_concat, {elementFrom("<a>x<b>y</b></a>"), string("z")}), "untypedAtomic xyz");
}

TEST(Concat, TheEmptySequenceContributesNothing) {
  EXPECT_EQ(call(fn_concat, {string("a"), empty(), string("b")}), "untypedAtomic ab");
  EXPECT_EQ(call(fn_concat, {empty(), empty()}), "untypedAtomic ");
}

TEST(Concat, KeepsTextOutsideASCII) {
  EXPECT_EQ(call(fn_concat, {string("a"), string("\xC3\xA9"), string("\xF0\x9F\x98\x80")}),
            "untypedAtomic a\xC3\xA9\xF0\x9F\x98\x80");
}

TEST(Concat, AnArgumentOfSeveralItemsIsAnError) {
  EXPECT_EQ(call(fn_concat, {sequence({integer(1), integer(2)}), string("a")}),
            "error 6 invalid type for automization");
}

TEST(Concat, TakesTwoArgumentsOrMore) {
  EXPECT_EQ(refusedCounts(fn_concat, string("a"), 12), "0 1");
  EXPECT_EQ(call(fn_concat, std::vector<Value>(12, string("a"))), "untypedAtomic aaaaaaaaaaaa");
}

}  // namespace
}  // namespace xquery

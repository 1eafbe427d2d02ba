#include "Functions/FunctionsSequence.h"
#include "Functions/FunctionsTesting.h"

namespace xquery {
namespace {

using namespace functiontest;

Value pair() {
  return sequence({integer(1), integer(2)});
}

// --- empty, exists, count ------------------------------------------------------------------------

TEST(EmptyAndExists, TellWhetherThereIsAnItem) {
  EXPECT_EQ(call(fn_empty, {empty()}), "true");
  EXPECT_EQ(call(fn_exists, {empty()}), "false");
  for (const Value& value : {integer(0), string(""), pair(), elementFrom("<a/>")}) {
    EXPECT_EQ(call(fn_empty, {value}), "false") << show(value);
    EXPECT_EQ(call(fn_exists, {value}), "true") << show(value);
  }
}

TEST(EmptyAndExists, AnArrayOfNothingIsEmpty) {
  EXPECT_EQ(answer("empty($x), exists($x), count($x)", Value(), {{"x", sequence({})}}),
            "true, false, integer 0");
}

TEST(Count, IsTheNumberOfItems) {
  EXPECT_EQ(call(fn_count, {empty()}), "integer 0");
  EXPECT_EQ(call(fn_count, {string("abc")}), "integer 1");
  EXPECT_EQ(call(fn_count, {pair()}), "integer 2");
  EXPECT_EQ(answer("count(1 to 1000), count((1, (2, 3), ()))"), "integer 1000, integer 3");
}

TEST(EmptyExistsAndCount, TakeOneArgument) {
  for (const XQueryProcedure procedure : {fn_empty, fn_exists, fn_count}) {
    EXPECT_EQ(refusedCounts(procedure, integer(1)), "0 2 3 4 5");
  }
}

// --- cardinality ---------------------------------------------------------------------------------

TEST(Cardinality, PassesWhatItAccepts) {
  EXPECT_EQ(call(fn_zero_or_one, {empty()}), "()");
  EXPECT_EQ(call(fn_zero_or_one, {integer(1)}), "integer 1");
  EXPECT_EQ(call(fn_one_or_more, {integer(1)}), "integer 1");
  EXPECT_EQ(call(fn_one_or_more, {pair()}), "(integer 1, integer 2)");
  EXPECT_EQ(call(fn_exactly_one, {integer(1)}), "integer 1");
}

TEST(Cardinality, AnswersAnErrorRecordWithoutRaisingIt) {
  EXPECT_EQ(call(fn_zero_or_one, {pair()}),
            "record 6 fn:zero-or-one called with a sequence containing more than one item");
  EXPECT_EQ(call(fn_one_or_more, {empty()}),
            "record 6 fn:one-or-more called with a sequence containing zero items");
  EXPECT_EQ(call(fn_exactly_one, {empty()}),
            "record 6 fn:exactly-one called with a sequence containing zero or more than one item");
  EXPECT_EQ(call(fn_exactly_one, {pair()}),
            "record 6 fn:exactly-one called with a sequence containing zero or more than one item");
}

TEST(Cardinality, TheCallRaisesTheRecord) {
  EXPECT_EQ(answer("zero-or-one((1, 2)), 3"),
            "error 6 line 0 fn:zero-or-one called with a sequence containing more than one item");
  EXPECT_EQ(answer("one-or-more(())"),
            "error 6 line 0 fn:one-or-more called with a sequence containing zero items");
}

TEST(Cardinality, UnwrapsAnArrayOfOneItem) {
  const Value one = sequence({integer(1)});
  EXPECT_EQ(call(fn_zero_or_one, {one}), "integer 1");
  EXPECT_EQ(call(fn_one_or_more, {one}), "integer 1");
  EXPECT_EQ(call(fn_exactly_one, {one}), "integer 1");
  EXPECT_EQ(call(fn_zero_or_one, {sequence({})}), "()");
}

TEST(Cardinality, TakesOneArgument) {
  for (const XQueryProcedure procedure : {fn_zero_or_one, fn_one_or_more, fn_exactly_one}) {
    EXPECT_EQ(refusedCounts(procedure, integer(1)), "0 2 3 4 5");
  }
}

// --- distinct-values -----------------------------------------------------------------------------

TEST(DistinctValues, KeepsTheFirstOfEachValueInOrder) {
  EXPECT_EQ(call(fn_distinct_values,
                 {sequence({integer(3), integer(1), integer(3), integer(2), integer(1)})}),
            "(integer 3, integer 1, integer 2)");
}

TEST(DistinctValues, NumbersAreEqualAcrossTypes) {
  EXPECT_EQ(call(fn_distinct_values,
                 {sequence({integer(1), number(1), decimal("1.0"), boolean(true), number(2)})}),
            "(integer 1, double 2)");
}

TEST(DistinctValues, NaNIsOneValue) {
  EXPECT_EQ(call(fn_distinct_values, {sequence({nan(), integer(1), nan()})}),
            "(double NaN, integer 1)");
}

TEST(DistinctValues, AnUntypedItemBecomesAString) {
  EXPECT_EQ(call(fn_distinct_values, {untyped("a")}), "string a");
  EXPECT_EQ(call(fn_distinct_values, {sequence({untyped("a"), string("a"), untyped("b")})}),
            "(string a, string b)");
  EXPECT_EQ(call(fn_distinct_values, {sequence({untyped("1"), integer(1)})}),
            "(string 1, integer 1)");
}

TEST(DistinctValues, ATypedStringKeepsItsType) {
  EXPECT_EQ(call(fn_distinct_values,
                 {sequence({typed(XQueryTypeNCName, "a"), string("a"), untyped("a")})}),
            "NCName a");
}

TEST(DistinctValues, OfNodesAreTheirDistinctTexts) {
  EXPECT_EQ(answer("distinct-values(//b)", document("<a><b>x</b><b>y</b><b>x</b></a>")),
            "string x, string y");
}

TEST(DistinctValues, OfOneItemIsTheItemAndOfNothingEmpty) {
  EXPECT_EQ(call(fn_distinct_values, {integer(1)}), "integer 1");
  EXPECT_EQ(call(fn_distinct_values, {sequence({integer(1), integer(1)})}), "integer 1");
  EXPECT_EQ(call(fn_distinct_values, {empty()}), "()");
}

TEST(DistinctValues, ValuesOfDifferentClassesDiffer) {
  EXPECT_EQ(call(fn_distinct_values, {sequence({typed(XQueryTypeHexBinary, "AB"), string("AB"),
                                                typed(XQueryTypeHexBinary, "ab")})}),
            "(hexBinary AB, string AB)");
}

TEST(DistinctValues, TheCollationMustBeAStringAndChangesNothing) {
  EXPECT_EQ(call(fn_distinct_values, {sequence({string("a"), string("A")}), string("urn:any")}),
            "(string a, string A)");
  EXPECT_EQ(call(fn_distinct_values, {string("a"), integer(1)}), "error 6 not a string type - 1");
}

TEST(DistinctValues, TakesOneOrTwoArguments) {
  EXPECT_EQ(refusedCounts(fn_distinct_values, string("a")), "0 3 4 5");
}

}  // namespace
}  // namespace xquery

#include "Functions/FunctionsTesting.h"
#include "Functions/Sequence.h"

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

// --- reverse, unordered --------------------------------------------------------------------------

TEST(Reverse, TurnsTheOrderOfTheItems) {
  EXPECT_EQ(call(fn_reverse, {sequence({integer(1), string("b"), integer(3)})}),
            "(integer 3, string b, integer 1)");
  EXPECT_EQ(call(fn_reverse, {integer(1)}), "integer 1");
  EXPECT_EQ(call(fn_reverse, {empty()}), "()");
  EXPECT_EQ(refusedCounts(fn_reverse, integer(1)), "0 2 3 4 5");
}

TEST(Reverse, LeavesItsArgumentAsItIs) {
  const Value items = pair();
  EXPECT_EQ(call(fn_reverse, {items}), "(integer 2, integer 1)");
  EXPECT_EQ(show(items), "(integer 1, integer 2)");
}

TEST(Unordered, IsItsArgument) {
  EXPECT_EQ(call(fn_unordered, {pair()}), "(integer 1, integer 2)");
  EXPECT_EQ(call(fn_unordered, {empty()}), "()");
  EXPECT_EQ(refusedCounts(fn_unordered, integer(1)), "0 2 3 4 5");
}

// --- index-of ------------------------------------------------------------------------------------

TEST(IndexOf, IsEveryPositionOfTheValue) {
  EXPECT_EQ(call(fn_index_of, {sequence({integer(10), integer(20), integer(10)}), integer(10)}),
            "(integer 1, integer 3)");
  EXPECT_EQ(call(fn_index_of, {pair(), integer(2)}), "integer 2");
  EXPECT_EQ(call(fn_index_of, {pair(), integer(3)}), "()");
  EXPECT_EQ(call(fn_index_of, {empty(), integer(3)}), "()");
  EXPECT_EQ(call(fn_index_of, {integer(3), integer(3)}), "integer 1");
}

TEST(IndexOf, EqualityIsTheValuesOwn) {
  const Value items = sequence(
      {integer(1), number(1), decimal("1.0"), boolean(true), string("1"), untyped("1"), nan()});
  EXPECT_EQ(call(fn_index_of, {items, integer(1)}), "(integer 1, integer 2, integer 3, integer 4)");
  EXPECT_EQ(call(fn_index_of, {items, string("1")}), "(integer 5, integer 6)");
  EXPECT_EQ(call(fn_index_of, {items, untyped("1")}), "(integer 5, integer 6)");
  EXPECT_EQ(call(fn_index_of, {items, nan()}), "integer 7");
}

TEST(IndexOf, ItemsAreAtomizedAndTheValueIsNot) {
  const Value items = sequence({elementFrom("<a>x</a>"), string("x")});
  EXPECT_EQ(call(fn_index_of, {items, string("x")}), "(integer 1, integer 2)");
  EXPECT_EQ(call(fn_index_of, {items, elementFrom("<a>x</a>")}), "()");
  EXPECT_EQ(call(fn_index_of, {items, empty()}), "()");
  EXPECT_EQ(call(fn_index_of, {pair(), pair()}), "()");
}

TEST(IndexOf, TheCollationMustBeAStringAndChangesNothing) {
  EXPECT_EQ(call(fn_index_of, {sequence({string("a"), string("A")}), string("A"), string("c")}),
            "integer 2");
  EXPECT_EQ(call(fn_index_of, {pair(), integer(1), integer(1)}), "error 6 not a string type - 1");
}

TEST(IndexOf, TakesTwoOrThreeArguments) {
  EXPECT_EQ(refusedCounts(fn_index_of, string("a")), "0 1 4 5");
}

// --- insert-before -------------------------------------------------------------------------------

Value letters() {
  return sequence({string("a"), string("b"), string("c")});
}

std::string insertedAt(int64_t position) {
  return call(fn_insert_before, {letters(), integer(position), string("x")});
}

TEST(InsertBefore, GoesBeforeThePosition) {
  EXPECT_EQ(insertedAt(1), "(string x, string a, string b, string c)");
  EXPECT_EQ(insertedAt(2), "(string a, string x, string b, string c)");
  EXPECT_EQ(insertedAt(3), "(string a, string b, string x, string c)");
}

TEST(InsertBefore, AFarPositionIsTheNearestOne) {
  EXPECT_EQ(insertedAt(4), "(string a, string b, string c, string x)");
  EXPECT_EQ(insertedAt(10), "(string a, string b, string c, string x)");
  EXPECT_EQ(insertedAt(INT64_MAX), "(string a, string b, string c, string x)");
  EXPECT_EQ(insertedAt(0), "(string x, string a, string b, string c)");
  EXPECT_EQ(insertedAt(-5), "(string x, string a, string b, string c)");
  EXPECT_EQ(insertedAt(INT64_MIN), "(string x, string a, string b, string c)");
}

TEST(InsertBefore, ASequenceIsSplicedInWhole) {
  EXPECT_EQ(call(fn_insert_before, {letters(), integer(2), pair()}),
            "(string a, integer 1, integer 2, string b, string c)");
  EXPECT_EQ(call(fn_insert_before, {letters(), integer(2), empty()}),
            "(string a, string b, string c)");
}

TEST(InsertBefore, IntoNothingOrOneItem) {
  EXPECT_EQ(call(fn_insert_before, {empty(), integer(7), string("x")}), "string x");
  EXPECT_EQ(call(fn_insert_before, {empty(), integer(1), pair()}), "(integer 1, integer 2)");
  EXPECT_EQ(call(fn_insert_before, {empty(), integer(1), empty()}), "()");
  EXPECT_EQ(call(fn_insert_before, {string("a"), integer(2), string("x")}), "(string a, string x)");
  EXPECT_EQ(call(fn_insert_before, {string("a"), integer(1), empty()}), "string a");
}

TEST(InsertBefore, ThePositionIsPromotedToAnInteger) {
  EXPECT_EQ(call(fn_insert_before, {pair(), number(2.9), string("x")}),
            "(integer 1, string x, integer 2)");
  EXPECT_EQ(call(fn_insert_before, {pair(), untyped("2"), string("x")}),
            "(integer 1, string x, integer 2)");
  EXPECT_EQ(call(fn_insert_before,
                 {pair(), typed(XQueryTypeInteger, "99999999999999999999"), string("x")}),
            "(integer 1, integer 2, string x)");
  EXPECT_EQ(call(fn_insert_before, {pair(), string("2"), string("x")}),
            "error 6 not a integer type - 2");
  EXPECT_EQ(call(fn_insert_before, {pair(), empty(), string("x")}), "null");
}

TEST(InsertBefore, LeavesItsArgumentsAsTheyAre) {
  const Value target = letters();
  const Value inserted = pair();
  call(fn_insert_before, {target, integer(2), inserted});
  EXPECT_EQ(show(target), "(string a, string b, string c)");
  EXPECT_EQ(show(inserted), "(integer 1, integer 2)");
  EXPECT_EQ(refusedCounts(fn_insert_before, integer(1)), "0 1 2 4 5");
}

// --- remove --------------------------------------------------------------------------------------

TEST(Remove, TakesTheItemAtThePosition) {
  EXPECT_EQ(call(fn_remove, {letters(), integer(1)}), "(string b, string c)");
  EXPECT_EQ(call(fn_remove, {letters(), integer(2)}), "(string a, string c)");
  EXPECT_EQ(call(fn_remove, {letters(), integer(3)}), "(string a, string b)");
}

TEST(Remove, APositionOutsideLeavesTheSequenceAsItIs) {
  for (const int64_t position : {int64_t{0}, int64_t{-1}, int64_t{4}, INT64_MAX, INT64_MIN}) {
    EXPECT_EQ(call(fn_remove, {letters(), integer(position)}), "(string a, string b, string c)")
        << position;
  }
}

TEST(Remove, AnswersASequenceWhateverIsLeft) {
  EXPECT_EQ(call(fn_remove, {pair(), integer(1)}), "(integer 2)");
  EXPECT_EQ(call(fn_remove, {integer(1), integer(2)}), "(integer 1)");
  const Ref<XQueryContext> context = XQueryContext::xqueryContext();
  const Value arguments[] = {integer(1), integer(1)};
  const Value none = fn_remove(arguments, 2, *context);
  ASSERT_TRUE(isa<NSArray>(none));
  EXPECT_EQ(cast<NSArray>(none)->count(), 0U);
}

TEST(Remove, TheCallUnwrapsTheSequence) {
  EXPECT_EQ(answer("remove((1, 2), 1) instance of xs:integer, empty(remove(1, 1)), "
                   "remove((1, 2), 1) + 1"),
            "true, true, integer 3");
}

TEST(Remove, ThePositionIsPromotedToAnInteger) {
  EXPECT_EQ(call(fn_remove, {letters(), decimal("2.9")}), "(string a, string c)");
  EXPECT_EQ(call(fn_remove, {letters(), string("2")}), "error 6 not a integer type - 2");
  EXPECT_EQ(call(fn_remove, {letters(), empty()}), "null");
  EXPECT_EQ(refusedCounts(fn_remove, integer(1)), "0 1 3 4 5");
}

// --- subsequence ---------------------------------------------------------------------------------

std::string subsequenceOfFour(const Value& start, const Value& length = Value()) {
  std::vector<Value> arguments = {sequence({integer(1), integer(2), integer(3), integer(4)}),
                                  start};
  if (length) arguments.push_back(length);
  std::string text = call(fn_subsequence, arguments);
  for (size_t at; (at = text.find("integer ")) != text.npos;) text.erase(at, 8);
  return text;
}

TEST(Subsequence, IsWhatStartsAtThePosition) {
  EXPECT_EQ(subsequenceOfFour(integer(1)), "(1, 2, 3, 4)");
  EXPECT_EQ(subsequenceOfFour(integer(3)), "(3, 4)");
  EXPECT_EQ(subsequenceOfFour(integer(4)), "4");
  EXPECT_EQ(subsequenceOfFour(integer(5)), "()");
  EXPECT_EQ(subsequenceOfFour(integer(INT64_MAX)), "()");
}

TEST(Subsequence, TakesAtMostTheLength) {
  EXPECT_EQ(subsequenceOfFour(integer(2), integer(2)), "(2, 3)");
  EXPECT_EQ(subsequenceOfFour(integer(2), integer(1)), "2");
  EXPECT_EQ(subsequenceOfFour(integer(2), integer(9)), "(2, 3, 4)");
  EXPECT_EQ(subsequenceOfFour(integer(2), integer(INT64_MAX)), "(2, 3, 4)");
  EXPECT_EQ(subsequenceOfFour(integer(2), integer(0)), "()");
  EXPECT_EQ(subsequenceOfFour(integer(2), integer(-1)), "()");
  EXPECT_EQ(subsequenceOfFour(integer(0), integer(0)), "()");
}

TEST(Subsequence, AStartBelowOneDoesNotShortenTheLength) {
  EXPECT_EQ(subsequenceOfFour(integer(0), integer(2)), "(1, 2)");
  EXPECT_EQ(subsequenceOfFour(integer(-10), integer(2)), "(1, 2)");
  EXPECT_EQ(subsequenceOfFour(integer(INT64_MIN), integer(1)), "1");
  EXPECT_EQ(subsequenceOfFour(integer(-3)), "(1, 2, 3, 4)");
}

TEST(Subsequence, StartAndLengthAreRoundedHalvesUp) {
  EXPECT_EQ(subsequenceOfFour(number(2.5)), "(3, 4)");
  EXPECT_EQ(subsequenceOfFour(decimal("2.4999")), "(2, 3, 4)");
  EXPECT_EQ(subsequenceOfFour(integer(1), decimal("1.5")), "(1, 2)");
  EXPECT_EQ(subsequenceOfFour(integer(1), number(2.5)), "(1, 2, 3)");
  EXPECT_EQ(subsequenceOfFour(integer(1), number(0.4)), "()");
}

TEST(Subsequence, SpecialNumbersSaturate) {
  EXPECT_EQ(subsequenceOfFour(infinity()), "()");
  EXPECT_EQ(subsequenceOfFour(minusInfinity()), "(1, 2, 3, 4)");
  EXPECT_EQ(subsequenceOfFour(nan()), "(1, 2, 3, 4)");
  EXPECT_EQ(subsequenceOfFour(integer(2), infinity()), "(2, 3, 4)");
  EXPECT_EQ(subsequenceOfFour(integer(2), nan()), "()");
}

TEST(Subsequence, StartAndLengthArePromotedToNumbers) {
  EXPECT_EQ(subsequenceOfFour(untyped("2"), elementFrom("<a>2</a>")), "(2, 3)");
  EXPECT_EQ(subsequenceOfFour(string("2")), "error 6 not a numeric type - 2");
  EXPECT_EQ(subsequenceOfFour(empty()), "null");
  EXPECT_EQ(subsequenceOfFour(integer(1), empty()), "null");
}

TEST(Subsequence, OfOneItemOrNothing) {
  EXPECT_EQ(call(fn_subsequence, {string("a"), integer(1)}), "string a");
  EXPECT_EQ(call(fn_subsequence, {string("a"), integer(2)}), "()");
  EXPECT_EQ(call(fn_subsequence, {empty(), integer(1)}), "()");
  EXPECT_EQ(refusedCounts(fn_subsequence, integer(1)), "0 1 4 5");
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

// --- lists that nobody else holds ----------------------------------------------------------------

struct OwnCase {
  XQueryProcedure plain;
  XQueryTakingProcedure taking;
  std::vector<Value> others;  // the arguments behind the list
};

std::vector<OwnCase> ownCases() {
  std::vector<OwnCase> cases = {{fn_reverse, XQueryReverseOwn, {}}};
  const std::vector<Value> positions = {integer(-5), integer(0), integer(1),  integer(2),
                                        integer(3),  integer(9), string("x"), empty()};
  for (const Value& position : positions) {
    cases.push_back({fn_remove, XQueryRemoveFromOwn, {position}});
    cases.push_back({fn_subsequence, XQuerySubsequenceOfOwn, {position}});
    for (const Value& other : positions) {
      cases.push_back({fn_subsequence, XQuerySubsequenceOfOwn, {position, other}});
      cases.push_back({fn_insert_before, XQueryInsertIntoOwn, {position, other}});
    }
    cases.push_back({fn_insert_before, XQueryInsertIntoOwn, {position, pair()}});
  }
  return cases;
}

// A new one of so many items each time.
Value listOf(int count) {
  if (count == 0) return empty();
  if (count == 1) return integer(7);
  std::vector<Value> items;
  for (int each = 0; each < count; ++each) items.push_back(integer(each));
  return sequence(std::move(items));
}

std::string taken(const OwnCase& example, Value list) {
  return outcome([&](XQueryContext& context) {
    std::vector<Value> arguments = {std::move(list)};
    arguments.insert(arguments.end(), example.others.begin(), example.others.end());
    return example.taking(arguments.data(), arguments.size(), context);
  });
}

TEST(OwnLists, BecomeWhatThePlainFunctionsAnswer) {
  for (const OwnCase& example : ownCases()) {
    for (const int count : {0, 1, 2, 3, 50}) {
      std::vector<Value> arguments = {listOf(count)};
      arguments.insert(arguments.end(), example.others.begin(), example.others.end());
      EXPECT_EQ(taken(example, listOf(count)), call(example.plain, arguments));
    }
  }
}

TEST(OwnLists, AreCopiedWhereOthersHoldThem) {
  for (const OwnCase& example : ownCases()) {
    const Value list = listOf(5);
    const std::string before = show(list);
    std::vector<Value> arguments = {list};
    arguments.insert(arguments.end(), example.others.begin(), example.others.end());
    EXPECT_EQ(taken(example, list), call(example.plain, arguments));
    EXPECT_EQ(show(list), before);
  }
}

TEST(OwnLists, AreRefusedLikeAnyArguments) {
  for (const auto& example : ownCases()) {
    for (size_t count = 0; count < 5; ++count) {
      std::vector<Value> arguments(count, integer(1));
      const std::string plain = call(example.plain, arguments);
      EXPECT_EQ(outcome([&](XQueryContext& context) {
                  return example.taking(arguments.data(), count, context);
                }),
                plain);
    }
  }
}

}  // namespace
}  // namespace xquery

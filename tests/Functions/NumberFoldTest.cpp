// What a fold makes of items that come one after the other, and what the functions make of the
// list of them.
#include "Expr/RandomChoices.h"
#include "Functions/Aggregate.h"
#include "Functions/FunctionsTesting.h"
#include "Functions/NumberFold.h"

#include <cstdint>
#include <limits>
#include <string>
#include <utility>
#include <vector>

namespace xquery {
namespace {

using namespace functiontest;

using Aim = XQueryNumberFold::Aim;

XQueryProcedure functionFor(Aim aim) {
  return aim == Aim::Sum ? fn_sum : aim == Aim::Greatest ? fn_max : fn_min;
}

std::string averageOf(XQueryNumberFold& fold) {
  return outcome([&](XQueryContext& context) {
    return XQueryAverageOf(XQuerySumOf(fold.argument(), context), fold.count(), context);
  });
}

// The values one after the other, and in one list.
void expectAlike(const std::vector<Value>& values) {
  XQueryGatherer gatherer;
  for (const Value& value : values) gatherer.add(value);
  const Value list = gatherer.value();
  for (const Aim aim : {Aim::Sum, Aim::Greatest, Aim::Least}) {
    XQueryNumberFold fold(aim);
    for (const Value& value : values) fold.add(value);
    EXPECT_EQ(call(functionFor(aim), {fold.argument()}), call(functionFor(aim), {list}))
        << show(list);
    EXPECT_EQ(fold.count(), XQueryItemList(list.get()).count()) << show(list);
    if (aim == Aim::Sum && fold.count() > 0) {
      EXPECT_EQ(averageOf(fold), call(fn_avg, {list})) << show(list);
    }
  }
}

TEST(NumberFold, OfNothingIsNothing) {
  XQueryNumberFold fold(Aim::Sum);
  EXPECT_EQ(show(fold.argument()), "()");
  fold.add(empty());
  fold.add(Value());
  fold.add(XQuerySequence::sequence());
  EXPECT_EQ(show(fold.argument()), "()");
  EXPECT_EQ(fold.count(), 0U);
  EXPECT_FALSE(fold.isList());
}

TEST(NumberFold, OfOneItemIsThatItem) {
  for (const Aim aim : {Aim::Sum, Aim::Greatest, Aim::Least}) {
    for (const Value& item : {integer(3), number(-0.0), untyped("2"), string("x"), nan()}) {
      XQueryNumberFold fold(aim);
      fold.add(item);
      EXPECT_EQ(fold.argument(), item);
    }
  }
}

TEST(NumberFold, MakesNoListOfNumbers) {
  for (const Aim aim : {Aim::Sum, Aim::Greatest, Aim::Least}) {
    XQueryNumberFold fold(aim);
    for (const Value& item : {integer(3), decimal("2.5"), number(1e300), untyped("7")}) {
      fold.add(item);
    }
    EXPECT_FALSE(fold.isList());
    EXPECT_EQ(fold.count(), 4U);
  }
}

TEST(NumberFold, GoesOnAsAListAtWhatItDoesNotKnow) {
  for (const Value& item : {string("x"), nan(), typed(XQueryTypeByte, "1"), boolean(true),
                            Value(NSArray::arrayWithObjects({integer(1), empty()}))}) {
    XQueryNumberFold fold(Aim::Sum);
    for (const Value& each : {integer(1), integer(2), item, integer(4)}) fold.add(each);
    EXPECT_TRUE(fold.isList()) << show(item);
    expectAlike({integer(1), integer(2), item, integer(4)});
    expectAlike({item, integer(4)});
    expectAlike({item});
  }
}

// Adding up ever longer ones could come to too many digits, which is an error of the function.
TEST(NumberFold, LeavesLongNumbersToTheFunction) {
  const Value wide = typed(XQueryTypeInteger, "1" + std::string(30, '0'));
  const Value fine = decimal("0." + std::string(30, '0') + "1");
  const Value greatest = integer(std::numeric_limits<int64_t>::max());
  for (const auto& values : {std::vector<Value>{integer(1), wide, integer(2)},
                             {integer(1), fine, integer(2)},
                             {greatest, greatest, greatest, integer(1)}}) {
    XQueryNumberFold fold(Aim::Sum);
    for (const Value& value : values) fold.add(value);
    EXPECT_TRUE(fold.isList());
    expectAlike(values);
  }
}

TEST(NumberFold, TakesNumbersThatAreNoObjects) {
  constexpr int64_t greatest = std::numeric_limits<int64_t>::max();
  RandomChoices random(23);
  const std::vector<int64_t> integers = {0, 1, -5, greatest, -greatest - 1, greatest};
  const std::vector<double> doubles = {0.0,
                                       -0.0,
                                       1.5,
                                       1e300,
                                       -1e300,
                                       std::numeric_limits<double>::infinity(),
                                       std::numeric_limits<double>::quiet_NaN()};
  for (int round = 0; round < 2000; ++round) {
    const Aim aim = std::vector{Aim::Sum, Aim::Greatest, Aim::Least}[random.below(3)];
    XQueryNumberFold bare(aim);
    XQueryNumberFold boxed(aim);
    for (size_t left = random.below(6); left > 0; --left) {
      switch (random.below(4)) {
        case 0: {
          const double value = doubles[random.below(doubles.size())];
          bare.addDouble(value);
          boxed.add(number(value));
          break;
        }
        case 1: {
          const Value other = random.below(3) ? decimal("0.25") : string("x");
          bare.add(other);
          boxed.add(other);
          break;
        }
        default: {
          const int64_t value = integers[random.below(integers.size())];
          bare.addInteger(value);
          boxed.add(integer(value));
        }
      }
    }
    EXPECT_EQ(show(bare.argument()), show(boxed.argument()));
    EXPECT_EQ(bare.count(), boxed.count());
  }
}

Value anyItem(RandomChoices& random) {
  const auto small = [&] { return static_cast<int64_t>(random.below(21)) - 10; };
  switch (random.below(14)) {
    case 0:
      return integer(small() * 1000000000000000000);
    case 1:
      return typed(XQueryTypeInteger, "123456789012345678901" + std::to_string(random.below(100)));
    case 2:
      return decimal(std::to_string(small()) + "." + std::to_string(random.below(1000)));
    case 3:
      return number(static_cast<double>(small()) / 8);
    case 4:
      return random.below(2) ? number(-0.0) : infinity();
    case 5:
      return untyped(std::to_string(small()) + ".5");
    case 6:
      return elementFrom("<a>" + std::to_string(small()) + "</a>");
    case 7:
      return random.below(4) ? untyped("x") : nan();
    case 8:
      return single("0.5");
    case 9:
      return random.below(2) ? string("a") : boolean(true);
    case 10:
      return random.below(2) ? months(3) : seconds(5);
    default:
      return integer(small());
  }
}

TEST(NumberFold, AgreesWithTheFunctionsOverGeneratedValues) {
  RandomChoices random(20041123);
  for (int round = 0; round < 3000; ++round) {
    // Most hold few kinds, as those in queries do.
    const Value often = anyItem(random);
    std::vector<Value> values;
    for (size_t left = random.below(6); left > 0; --left) {
      const auto item = [&] { return random.below(3) ? often : anyItem(random); };
      switch (random.below(8)) {
        case 0:
          values.push_back(empty());
          break;
        case 1:
          values.push_back(sequence({item(), item(), item()}));
          break;
        case 2:
          values.push_back(flattened(sequence({item(), item()})));
          break;
        default:
          values.push_back(item());
      }
    }
    expectAlike(values);
  }
}

}  // namespace
}  // namespace xquery

#include "Functions/FunctionsTesting.h"
#include "Functions/XQueryValueSet.h"
#include "Platform/Base/ProcessorTime.h"
#include "Types/XQueryDate.h"

#include <cstdlib>
#include <random>
#include <set>

namespace xquery {
namespace {

using namespace functiontest;

// The rule itself: a value is new when it equals none of those kept.
class PlainValueSet {
 public:
  bool insert(const NSObject& value) {
    for (const NSObject* kept : _kept) {
      if (XQueryObjectsEqual(*kept, value)) return false;
    }
    _kept.push_back(&value);
    return true;
  }

 private:
  std::vector<const NSObject*> _kept;
};

// Values that are equal, nearly equal, or equal only as doubles.
std::vector<Value> somewhatAlike() {
  std::vector<Value> values = {nan(),
                               infinity(),
                               minusInfinity(),
                               boolean(true),
                               boolean(false),
                               number(-0.0),
                               number(0.1),
                               single("0.1"),
                               decimal("0.1"),
                               decimal("0.10000000149011612"),
                               decimal("0.1000000000000000055511151231257827"),
                               typed(XQueryTypeUnsignedLong, "18446744073709551615"),
                               number(18446744073709551616.0),
                               typed(XQueryTypeQName, "a"),
                               typed(XQueryTypeAnyURI, "urn:a"),
                               typed(XQueryTypeAnyURI, "1"),
                               typed(XQueryTypeHexBinary, "61"),
                               typed(XQueryTypeBase64Binary, "YQ=="),
                               typed(XQueryTypeNotation, "a"),
                               months(1),
                               seconds(1),
                               typed(XQueryTypeFloat, "INF"),
                               typed(XQueryTypeDate, "2004-10-29Z"),
                               typed(XQueryTypeDate, "2004-10-29"),
                               typed(XQueryTypeDateTime, "2004-10-29T00:00:00Z"),
                               typed(XQueryTypeDateTime, "2004-10-29T02:00:00+02:00"),
                               typed(XQueryTypeDateTime, "2004-10-28T23:00:00-01:00"),
                               typed(XQueryTypeTime, "12:00:00Z"),
                               typed(XQueryTypeTime, "13:00:00+01:00"),
                               typed(XQueryTypeGYear, "2004"),
                               typed(XQueryTypeDuration, "P1M"),
                               typed(XQueryTypeDuration, "P0Y1M"),
                               typed(XQueryTypeDuration, "PT1S"),
                               NSNumber::numberWithLongLong(2),
                               NSNumber::numberWithDouble(2)};
  constexpr int64_t beyondDouble = int64_t{1} << 53;
  for (int64_t offset = -3; offset <= 3; ++offset) {
    values.push_back(integer(offset));
    values.push_back(integer(beyondDouble + offset));
    values.push_back(decimal(std::to_string(beyondDouble + offset) + ".25"));
    values.push_back(number(static_cast<double>(beyondDouble + offset)));
    values.push_back(number(static_cast<double>(offset)));
    values.push_back(single(std::to_string(offset)));
    values.push_back(typed(XQueryTypeLong, std::to_string(offset)));
    values.push_back(decimal("1" + std::string(40, '0') + std::to_string(offset + 3)));
    values.push_back(string(std::to_string(offset)));
    values.push_back(untyped(std::to_string(offset)));
    values.push_back(typed(XQueryTypeToken, std::to_string(offset)));
  }
  return values;
}

TEST(ValueSet, AnswersWhatComparingWithEveryKeptValueAnswers) {
  const std::vector<Value> pool = somewhatAlike();
  std::mt19937 random(20041029);
  for (int round = 0; round < 3000; ++round) {
    XQueryValueSet set;
    PlainValueSet plain;
    std::string history;
    const size_t count = 1 + random() % 60;
    for (size_t index = 0; index < count; ++index) {
      const Value& value = pool[random() % pool.size()];
      history += show(value) + ", ";
      ASSERT_EQ(set.insert(*value), plain.insert(*value)) << history;
    }
  }
}

TEST(ValueSet, TheAnswerDependsOnTheOrderWhereEqualityDoes) {
  const Value low = integer((int64_t{1} << 53) + 1);
  const Value exact = integer(int64_t{1} << 53);
  const Value floating = number(9007199254740992.0);
  XQueryValueSet exactFirst;
  EXPECT_TRUE(exactFirst.insert(*low));
  EXPECT_TRUE(exactFirst.insert(*exact));
  EXPECT_FALSE(exactFirst.insert(*floating));
  XQueryValueSet floatingFirst;
  EXPECT_TRUE(floatingFirst.insert(*floating));
  EXPECT_FALSE(floatingFirst.insert(*low));
  EXPECT_FALSE(floatingFirst.insert(*exact));
}

// The values that are neither texts nor numbers.
std::vector<Value> otherValues() {
  std::vector<Value> values;
  for (const Value& value : somewhatAlike()) {
    if (!isa<NSString>(value) && !isa<NSNumber>(value)) values.push_back(value);
  }
  for (const char* name : {"a", "b", "p:a"}) {
    for (const char* URI : {"urn:1", "urn:2"}) {
      values.push_back(
          XQueryQName::qname(NSString::stringWithASCII(name), NSString::stringWithASCII(URI)));
    }
    values.push_back(typed(XQueryTypeNotation, name));
    values.push_back(typed(XQueryTypeAnyURI, name));
  }
  values.push_back(NSDate::dateWithTimeIntervalSinceReferenceDate(0));
  values.push_back(typed(XQueryTypeDateTime, "2001-01-01T00:00:00Z"));
  return values;
}

TEST(ValueOrder, OfTwoValuesOneIsLessUnlessTheyAreEqual) {
  const std::vector<Value> values = otherValues();
  size_t equalPairs = 0;
  for (const Value& a : values) {
    for (const Value& b : values) {
      const bool equal = XQueryObjectsEqual(*a, *b);
      EXPECT_EQ(XQueryIsOrderedBefore(*a, *b) + XQueryIsOrderedBefore(*b, *a), equal ? 0 : 1)
          << show(a) << " and " << show(b);
      equalPairs += equal && a != b;
    }
  }
  EXPECT_GT(equalPairs, 10U);
}

TEST(ValueOrder, IsAnOrder) {
  const std::vector<Value> values = otherValues();
  for (const Value& a : values) {
    for (const Value& b : values) {
      if (!XQueryIsOrderedBefore(*a, *b)) continue;
      for (const Value& c : values) {
        if (!XQueryIsOrderedBefore(*b, *c)) continue;
        EXPECT_TRUE(XQueryIsOrderedBefore(*a, *c)) << show(a) << show(b) << show(c);
      }
    }
  }
}

// A QName's own hash is that of its local part.
TEST(ValueSet, NamesOfOneLocalPartAreSpreadByTheirNamespaces) {
  const Ref<NSString> local = NSString::stringWithASCII("a");
  std::set<uint64_t> hashes;
  for (int index = 0; index < 1000; ++index) {
    const Ref<NSString> URI = NSString::stringWithASCII("urn:" + std::to_string(index));
    const Ref<XQueryQName> name = XQueryQName::qnameWithLocalPart(local, URI);
    hashes.insert(XQueryOtherValueHash()(name.get()));
    const Ref<NSString> same = NSString::stringWithASCII("urn:" + std::to_string(index));
    EXPECT_EQ(
        XQueryOtherValueHash()(name.get()),
        XQueryOtherValueHash()(XQueryQName::qname(NSString::stringWithASCII("p:a"), same).get()));
  }
  EXPECT_GT(hashes.size(), 990U);
}

// Dates made so that all have one hash, which sends most of them into the ordered part of the set.
TEST(ValueSet, DatesOfOneHashAreToldApart) {
  constexpr uint64_t factor = 0x9E3779B97F4A7C15U;
  uint64_t inverse = factor;
  for (int step = 0; step < 6; ++step) inverse *= 2 - factor * inverse;
  std::vector<Value> dates;
  for (uint64_t half = 1; dates.size() < 3000; ++half) {
    const auto seconds = static_cast<int64_t>((half << 32 | half) * inverse);
    if (std::abs(seconds) > int64_t{1} << 55) continue;
    dates.push_back(
        XQueryDate::xqueryDateWithInstant({seconds, 0}, Ref<NSTimeZone>(), XQueryTypeDateTime));
    ASSERT_EQ(XQueryObjectHash(*dates.back()), 0U);
  }
  XQueryValueSet set;
  for (const Value& date : dates) EXPECT_TRUE(set.insert(*date));
  for (const Value& date : dates) {
    const XQueryDate& one = *cast<XQueryDate>(date);
    const Value copy =
        XQueryDate::xqueryDateWithInstant(one.instant(), NSTimeZone::GMT(), XQueryTypeDate);
    EXPECT_FALSE(set.insert(*copy));
  }
}

// Numbers that share one double must not make each insertion look at all the others.
TEST(ValueSet, ManyIntegersOfOneDoubleStayFast) {
  constexpr size_t count = 20000;
  std::vector<Value> values;
  for (size_t index = 0; index < count; ++index) {
    const std::string digits = std::to_string(count + index);
    values.push_back(decimal("1" + std::string(40, '0') + digits));
  }
  const double start = processorSeconds();
  XQueryValueSet set;
  for (const Value& value : values) EXPECT_TRUE(set.insert(*value));
  EXPECT_FALSE(set.insert(*values.back()));
  // Every pair compared would take many times as long.
  EXPECT_LT(processorSeconds() - start, 5);
}

}  // namespace
}  // namespace xquery

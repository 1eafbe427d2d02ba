#include "Expr/BindingTesting.h"
#include "Expr/Clauses/XQueryFLWORSort.h"

#include <gtest/gtest.h>

#include <functional>
#include <limits>
#include <random>
#include <string>
#include <vector>

namespace xquery::bindingtest {
namespace {

using Keys = std::vector<Value>;
using Sort = bool (*)(XQuerySortList&, bool, bool);

// One item per tuple, numbered from 0; every row holds the keys of one tuple.
XQuerySortList listOf(const std::vector<Keys>& rows) {
  XQuerySortList list;
  list.keyCount = rows.empty() ? 1 : rows.front().size();
  for (const Keys& keys : rows) {
    const size_t sortInfo = list.keys.size();
    list.items.push_back({integer(static_cast<int64_t>(list.items.size())), sortInfo, 0});
    list.keys.insert(list.keys.end(), keys.begin(), keys.end());
  }
  return list;
}

// The numbers of the items in their new order; "invalid" after them when a pair had no order.
std::string sorted(Sort sort, const std::vector<Keys>& rows, bool ascending, bool emptyLeast) {
  XQuerySortList list = listOf(rows);
  const bool comparable = sort(list, ascending, emptyLeast);
  std::string text;
  for (const auto& item : list.items) {
    text += (text.empty() ? "" : " ") + XQueryStringValue(*item.value)->utf8();
  }
  return comparable ? text : "invalid";
}

// Both sorts, which must agree, over one column of keys.
std::string order(const Keys& keys, bool ascending = true, bool emptyLeast = true) {
  std::vector<Keys> rows;
  for (const Value& key : keys) rows.push_back({key});
  const std::string answer = sorted(XQueryFLWORSort, rows, ascending, emptyLeast);
  EXPECT_EQ(answer, sorted(XQueryFLWORSortPlainly, rows, ascending, emptyLeast));
  return answer;
}
std::string orderOfRows(const std::vector<Keys>& rows, bool ascending = true,
                        bool emptyLeast = true) {
  const std::string answer = sorted(XQueryFLWORSort, rows, ascending, emptyLeast);
  EXPECT_EQ(answer, sorted(XQueryFLWORSortPlainly, rows, ascending, emptyLeast));
  return answer;
}

// --- one key -------------------------------------------------------------------------------------

TEST(FLWORSort, NothingAndOneItemAreSorted) {
  EXPECT_EQ(order({}), "");
  EXPECT_EQ(order({integer(1)}), "0");
  EXPECT_EQ(order({months(1)}), "0");
}

TEST(FLWORSort, NumbersAscendAndDescend) {
  EXPECT_EQ(order({integer(3), integer(1), integer(2)}), "1 2 0");
  EXPECT_EQ(order({integer(3), integer(1), integer(2)}, false), "0 2 1");
  EXPECT_EQ(order({integer(-1), integer(0), integer(-2), integer(1)}), "2 0 1 3");
}

TEST(FLWORSort, NumbersOfAllTypesCompareByValue) {
  EXPECT_EQ(order({integer(3), decimal("1.5"), number(2), single("2.5"), typed(XQueryTypeByte, "1"),
                   typed(XQueryTypeUnsignedLong, "4")}),
            "4 1 2 3 0 5");
}

TEST(FLWORSort, EqualNumbersOfSeveralTypesKeepTheirOrder) {
  EXPECT_EQ(order({number(1), integer(1), decimal("1.0"), single("1"), integer(0)}), "4 0 1 2 3");
  EXPECT_EQ(order({number(0.0), number(-0.0), integer(0)}), "0 1 2");
}

TEST(FLWORSort, NaNIsBelowEveryNumberAndEqualToItself) {
  EXPECT_EQ(order({infinity(), nan(), minusInfinity(), number(0), nan()}), "1 4 2 3 0");
  EXPECT_EQ(order({infinity(), nan(), minusInfinity(), number(0), nan()}, false), "0 3 2 1 4");
}

TEST(FLWORSort, NaNIsAboveAnEmptyKeyThatIsLeast) {
  EXPECT_EQ(order({nan(), empty()}), "1 0");
  EXPECT_EQ(order({empty(), infinity()}, true, false), "1 0");
}

TEST(FLWORSort, IntegersThatNoDoubleHoldsCompareExactly) {
  constexpr int64_t big = int64_t{1} << 53;
  EXPECT_EQ(order({integer(big + 1), integer(big), integer(big + 2)}), "1 0 2");
  EXPECT_EQ(order({decimal("100000000000000000000000000000000000002"),
                   decimal("100000000000000000000000000000000000001")}),
            "1 0");
  EXPECT_EQ(order({decimal("0.1000000000000000000001"), decimal("0.1")}), "1 0");
  EXPECT_EQ(order({typed(XQueryTypeLong, "9223372036854775807"),
                   typed(XQueryTypeLong, "9223372036854775806")}),
            "1 0");
}

TEST(FLWORSort, StringsCompareByCodePoint) {
  EXPECT_EQ(order({string("b"), string("B"), string("a"), string("")}), "3 1 2 0");
  EXPECT_EQ(order({string("ab"), string("a"), string("abc")}), "1 0 2");
  // U+10000 is above U+FFFD, whose code unit is above that of a high surrogate.
  EXPECT_EQ(order({string("\xF0\x90\x80\x80"), string("\xEF\xBF\xBD"), string("\xC3\xA9")}),
            "2 1 0");
  EXPECT_EQ(order({string("z\xC3\xA9"), string("z\x7F"), string("z"), string("z\xC3\xA8")}),
            "2 1 3 0");
}

TEST(FLWORSort, StringsCompareInWhole) {
  EXPECT_EQ(
      order({string("12345678b"), string("12345678a"), string("12345678"), string("1234567")}),
      "3 2 1 0");
  EXPECT_EQ(order({string("http://example/12345678901"), string("http://example/12345678900"),
                   string("http://example/")}),
            "2 1 0");
  const auto withNull = [](std::u16string_view text) -> Value {
    return XQueryString::stringWithString(*NSString::stringWithUTF16(text));
  };
  EXPECT_EQ(order({withNull(std::u16string_view(u"a\0", 2)), string("a"),
                   withNull(std::u16string_view(u"a\0\0", 3))}),
            "1 0 2");
}

TEST(FLWORSort, StringTypesCompareWithEachOther) {
  EXPECT_EQ(order({typed(XQueryTypeToken, "b"), string("a"), typed(XQueryTypeNCName, "aa")}),
            "1 2 0");
}

TEST(FLWORSort, AnEmptyKeyIsNoEmptyString) {
  EXPECT_EQ(order({string(""), empty()}), "1 0");
  EXPECT_EQ(order({empty(), string("")}), "0 1");
  EXPECT_EQ(order({empty(), string("")}, true, false), "1 0");
  EXPECT_EQ(order({string(""), empty()}, false), "0 1");
}

TEST(FLWORSort, BooleansCompareFalseFirst) {
  EXPECT_EQ(order({boolean(true), boolean(false), boolean(true)}), "1 0 2");
}

TEST(FLWORSort, EmptyKeysAreLeastOrGreatest) {
  const Keys keys = {integer(1), empty(), integer(-1), empty()};
  EXPECT_EQ(order(keys, true, true), "1 3 2 0");
  EXPECT_EQ(order(keys, true, false), "2 0 1 3");
  EXPECT_EQ(order(keys, false, true), "0 2 1 3");
  EXPECT_EQ(order(keys, false, false), "1 3 0 2");
  EXPECT_EQ(order({empty(), empty()}), "0 1");
}

TEST(FLWORSort, EqualKeysKeepTheirOrderInBothDirections) {
  const Keys keys(50, string("same"));
  std::string unchanged = "0";
  for (int i = 1; i < 50; ++i) unchanged += " " + std::to_string(i);
  EXPECT_EQ(order(keys, true), unchanged);
  EXPECT_EQ(order(keys, false), unchanged);
}

// --- keys that cannot be compared ----------------------------------------------------------------

TEST(FLWORSort, UnlikeKeysCannotBeCompared) {
  EXPECT_EQ(order({integer(1), string("1")}), "invalid");
  EXPECT_EQ(order({integer(1), boolean(true)}), "invalid");
  EXPECT_EQ(order({string("true"), boolean(true)}), "invalid");
  EXPECT_EQ(order({integer(1), empty(), string("1")}), "invalid");
}

TEST(FLWORSort, OnlyStringsBooleansAndNumbersAreKeys) {
  const auto pair = [](const Value& key) { return order({key, key}); };
  EXPECT_EQ(pair(string("a")), "0 1");
  EXPECT_EQ(pair(boolean(true)), "0 1");
  EXPECT_EQ(pair(number(1)), "0 1");
  EXPECT_EQ(pair(single("1")), "0 1");
  EXPECT_EQ(pair(decimal("1")), "0 1");
  EXPECT_EQ(pair(integer(1)), "0 1");
  EXPECT_EQ(pair(months(1)), "invalid");
  EXPECT_EQ(pair(seconds(1)), "invalid");
  EXPECT_EQ(pair(untyped("a")), "invalid");
  EXPECT_EQ(pair(integers({1, 2})), "invalid");
  EXPECT_EQ(pair(error(6, "a")), "invalid");
  EXPECT_EQ(pair(XQueryQName::qname(text("a"), nullptr)), "invalid");
  EXPECT_EQ(pair(typed(XQueryTypeAnyURI, "urn:a")), "invalid");
  EXPECT_EQ(pair(typed(XQueryTypeHexBinary, "00")), "invalid");
}

TEST(FLWORSort, AnEmptyKeyCanBeComparedWithAnything) {
  EXPECT_EQ(order({months(1), empty()}), "1 0");
  EXPECT_EQ(order({empty(), integers({1, 2})}, true, false), "1 0");
}

// --- several keys --------------------------------------------------------------------------------

TEST(FLWORSort, LaterKeysDecideWhereEarlierOnesAreEqual) {
  EXPECT_EQ(orderOfRows(
                {{integer(1), string("b")}, {integer(0), string("z")}, {integer(1), string("a")}}),
            "1 2 0");
  EXPECT_EQ(orderOfRows({{integer(1), empty(), integer(2)}, {integer(1), empty(), integer(1)}}),
            "1 0");
}

TEST(FLWORSort, OneDirectionRulesEveryKey) {
  EXPECT_EQ(orderOfRows({{integer(1), integer(1)},
                         {integer(1), integer(2)},
                         {integer(2), integer(1)},
                         {integer(2), integer(2)}},
                        false),
            "3 2 1 0");
}

TEST(FLWORSort, OneEmptyOrderRulesEveryKey) {
  const std::vector<Keys> rows = {{integer(1), empty()}, {integer(1), integer(2)}};
  EXPECT_EQ(orderOfRows(rows, true, false), "1 0");
  EXPECT_EQ(orderOfRows(rows, true, true), "0 1");
}

TEST(FLWORSort, KeysAreComparedOnlyWhereEarlierOnesAreEqual) {
  EXPECT_EQ(orderOfRows({{integer(2), months(1)}, {integer(1), months(1)}}), "1 0");
  EXPECT_EQ(orderOfRows({{integer(1), months(1)}, {integer(1), months(1)}}), "invalid");
  EXPECT_EQ(orderOfRows({{string("a"), string("a")}, {string("b"), integer(1)}}), "0 1");
}

TEST(FLWORSort, ItemsMayShareTheKeysOfTheirTuple) {
  XQuerySortList list;
  list.keys = {integer(2), integer(1)};
  for (int i = 0; i < 4; ++i) {
    list.items.push_back({integer(i), static_cast<size_t>(i / 2), static_cast<size_t>(i % 2)});
  }
  EXPECT_TRUE(XQueryFLWORSort(list, true, true));
  std::string text;
  for (const auto& item : list.items) text += XQueryStringValue(*item.value)->utf8();
  EXPECT_EQ(text, "2301");
}

// --- against the plain comparison ----------------------------------------------------------------

class GeneratedKeys : public testing::Test {
 protected:
  using Make = std::function<Value()>;

  int64_t below(int64_t bound) {
    return std::uniform_int_distribution<int64_t>(0, bound - 1)(_random);
  }
  Value smallNumber() {
    switch (below(5)) {
      case 0:
        return number(static_cast<double>(below(20) - 10) / 2);
      case 1:
        return decimal(std::to_string(below(20) - 10) + "." + std::to_string(below(3)));
      case 2:
        return single(std::to_string(below(20) - 10));
      default:
        return integer(below(20) - 10);
    }
  }
  // Numbers around the greatest ones that a double holds exactly, where the comparison by double
  // and the exact one differ.
  Value largeNumber() {
    constexpr int64_t edge = int64_t{1} << 53;
    const int64_t value = (edge + below(5) - 2) * (below(2) ? 1 : -1);
    switch (below(4)) {
      case 0:
        return number(static_cast<double>(value));
      case 1:
        return decimal(std::to_string(value) + ".25");
      case 2:
        return typed(XQueryTypeLong, std::to_string(value));
      default:
        return integer(value);
    }
  }
  Value anyNumber() {
    switch (below(8)) {
      case 0:
        return nan();
      case 1:
        return below(2) ? infinity() : minusInfinity();
      case 2:
        return largeNumber();
      case 3:
        return integer(std::numeric_limits<int64_t>::min() + below(3));
      default:
        return smallNumber();
    }
  }
  Value anyString() {
    static const std::vector<std::string> pieces = {
        "", "a", "b", "ab", "\x7F", "\xC3\xA9", "\xEF\xBF\xBD", "\xF0\x90\x80\x80", "12345678"};
    std::string text;
    for (int64_t i = below(4); i > 0; --i) {
      text += pieces[static_cast<size_t>(below(static_cast<int64_t>(pieces.size())))];
    }
    return string(text);
  }
  Value sharedPrefixString() { return string("urn:example:" + std::to_string(below(100000))); }
  Value orEmpty(const Make& make) { return below(5) == 0 ? empty() : make(); }

  void compareBothSorts(const std::vector<Make>& columns, int runs) {
    for (int run = 0; run < runs; ++run) {
      std::vector<Keys> rows(static_cast<size_t>(below(60)));
      for (Keys& keys : rows) {
        for (const Make& make : columns) keys.push_back(make());
      }
      const bool ascending = below(2) == 0;
      const bool emptyLeast = below(2) == 0;
      ASSERT_EQ(sorted(XQueryFLWORSort, rows, ascending, emptyLeast),
                sorted(XQueryFLWORSortPlainly, rows, ascending, emptyLeast))
          << "run " << run;
      comparePart(rows, ascending, emptyLeast);
    }
  }
  // The first few, which are not sorted with the others where that can be known.
  void comparePart(const std::vector<Keys>& rows, bool ascending, bool emptyLeast) {
    const size_t most = 1 + static_cast<size_t>(below(static_cast<int64_t>(rows.size() / 6 + 1)));
    XQuerySortList all = listOf(rows);
    XQuerySortList part = listOf(rows);
    ASSERT_EQ(XQueryFLWORSortPlainly(all, ascending, emptyLeast),
              XQueryFLWORSortFirst(part, ascending, emptyLeast, most));
    ASSERT_GE(part.items.size(), std::min(most, rows.size()));
    for (size_t i = 0; i < std::min(most, rows.size()); ++i) {
      ASSERT_EQ(XQueryStringValue(*all.items[i].value)->utf8(),
                XQueryStringValue(*part.items[i].value)->utf8());
    }
  }

  const Make small = [this] { return smallNumber(); };
  const Make large = [this] { return largeNumber(); };
  const Make anyOf = [this] { return anyNumber(); };
  const Make strings = [this] { return anyString(); };
  const Make prefixed = [this] { return sharedPrefixString(); };
  const Make truth = [this] { return boolean(below(2) == 0); };
  const Make constant = [] { return string("http://example/of/some/length"); };
  const Make mixed = [this] { return below(12) == 0 ? anyString() : smallNumber(); };
  const Make duration = [this] { return months(below(3)); };
  Make optional(Make make) {
    return [this, make] { return orEmpty(make); };
  }

 private:
  std::mt19937 _random{20041029};
};

TEST(FLWORSort, LeavesOutWhatIsNotWanted) {
  const auto left = [](const Keys& keys, size_t most) {
    std::vector<Keys> rows;
    for (const Value& key : keys) rows.push_back({key});
    XQuerySortList list = listOf(rows);
    EXPECT_TRUE(XQueryFLWORSortFirst(list, true, true, most));
    return list.items.size();
  };
  EXPECT_EQ(left(Keys(100, number(1)), 3), 3U);
  EXPECT_EQ(left(Keys(100, string("a")), 3), 3U);
  EXPECT_EQ(left(Keys(100, decimal("1.5")), 3), 3U);
  // The order of these may contradict itself, which sorting all of them decides one way.
  Keys both(50, decimal("1.5"));
  both.resize(100, number(1.5));
  EXPECT_EQ(left(both, 3), 100U);
}

TEST_F(GeneratedKeys, OneColumnSortsAsThePlainComparisonDoes) {
  for (const Make& make :
       {small, large, anyOf, strings, prefixed, truth, constant, mixed, duration}) {
    compareBothSorts({make}, 100);
    compareBothSorts({optional(make)}, 100);
  }
}

TEST_F(GeneratedKeys, SeveralColumnsSortAsThePlainComparisonDoes) {
  const std::vector<Make> all = {small, large, strings, prefixed, truth, constant, mixed, duration};
  for (const Make& first : all) {
    for (const Make& second : all) {
      compareBothSorts({first, optional(second)}, 10);
      compareBothSorts({optional(truth), optional(first), second}, 10);
    }
  }
}

}  // namespace
}  // namespace xquery::bindingtest

#include "Functions/XQueryRegExCache.h"

#include <gtest/gtest.h>

#include <string>
#include <string_view>

namespace xquery {
namespace {

Ref<XQueryRegEx> get(XQueryRegExCache& cache, std::string_view pattern,
                     std::string_view flags = "") {
  const auto text = NSString::stringWithUTF8(pattern);
  return cache.regExp(text->view(), NSStringView::ascii(flags));
}

TEST(RegExCache, APatternIsCompiledOnce) {
  XQueryRegExCache cache;
  const auto first = get(cache, "a");
  EXPECT_EQ(get(cache, "b")->flags(), 0U);
  EXPECT_EQ(get(cache, "a"), first);
  EXPECT_EQ(cache.count(), 2U);
}

TEST(RegExCache, PatternsWithOtherFlagsAreOthers) {
  XQueryRegExCache cache;
  const auto plain = get(cache, "a");
  const auto caseless = get(cache, "a", "i");
  EXPECT_FALSE(plain == caseless);
  EXPECT_EQ(get(cache, "a", "ii"), caseless);
  EXPECT_EQ(get(cache, "a", ""), plain);
}

TEST(RegExCache, WhatIsInvalidIsNotKept) {
  XQueryRegExCache cache;
  EXPECT_FALSE(get(cache, "("));
  EXPECT_FALSE(get(cache, "a", "q"));
  EXPECT_EQ(cache.count(), 0U);
  EXPECT_TRUE(get(cache, "a"));
  EXPECT_FALSE(get(cache, "a", "q"));
}

TEST(RegExCache, TheLongestUnusedLeaves) {
  XQueryRegExCache cache;
  const auto first = get(cache, "0");
  const auto second = get(cache, "1");
  for (size_t index = 2; index < XQueryRegExCache::mostEntries; ++index) {
    EXPECT_TRUE(get(cache, std::to_string(index)));
  }
  EXPECT_EQ(get(cache, "0"), first);
  EXPECT_EQ(cache.count(), XQueryRegExCache::mostEntries);
  EXPECT_TRUE(get(cache, "one more"));
  EXPECT_EQ(cache.count(), XQueryRegExCache::mostEntries);
  EXPECT_EQ(get(cache, "0"), first);
  EXPECT_FALSE(get(cache, "1") == second);
}

TEST(RegExCache, LargePatternsAreBoundedTogether) {
  XQueryRegExCache cache;
  for (int index = 0; index < 60; ++index) {
    EXPECT_TRUE(get(cache, std::to_string(index) + std::string(30'000, 'a')));
    EXPECT_LE(cache.byteCount(), XQueryRegExCache::mostBytes);
  }
  EXPECT_GT(cache.count(), 10U);
  EXPECT_LT(cache.count(), 60U);
}

}  // namespace
}  // namespace xquery

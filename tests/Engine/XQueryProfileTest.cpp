// Profiles as hosts see them.
#include "xquery/xquery.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <string>

namespace xquery {
namespace {

using testing::HasSubstr;
using testing::StartsWith;

Ref<XQuery> compiled(const char* text, XQueryWay way = XQueryWay::Profiled) {
  return XQuery::xqueryWithSource(text, XQueryLoading(), XQueryLimits(), way);
}

Ref<XQueryContext> evaluated(const XQuery& query, int times = 1) {
  auto context = XQueryContext::xqueryContext();
  for (int n = 0; n < times; ++n) (void)context->evaluateXQuery(query, {}, nullptr);
  return context;
}

TEST(Profile, IsTheSumOfContexts) {
  const auto query = compiled("count((1, 2, 3))");
  XQueryProfile profile(*query);
  EXPECT_EQ(profile.evaluations(), 0u);
  EXPECT_TRUE(profile.add(*evaluated(*query, 2)));
  EXPECT_TRUE(profile.add(*evaluated(*query)));
  EXPECT_EQ(profile.evaluations(), 3u);
  EXPECT_THAT(profile.describe(XQueryProfileFormat::JSON), HasSubstr("\"calls\":3,\"items\":3,"));
  EXPECT_THAT(profile.describe(XQueryProfileFormat::Text), StartsWith("3 evaluations\n"));
  XQueryProfileSurroundings surroundings;
  surroundings.name = "mine";
  EXPECT_THAT(profile.describe(XQueryProfileFormat::HTML, surroundings),
              HasSubstr("<title>Profile of mine</title>"));
}

TEST(Profile, OfAnotherQueryIsNotTaken) {
  const auto query = compiled("1 + 1"), other = compiled("1 + 1");
  XQueryProfile profile(*query);
  EXPECT_FALSE(profile.add(*evaluated(*other)));
  EXPECT_FALSE(profile.add(*evaluated(*compiled("1 + 1", XQueryWay::Planned))));
  EXPECT_FALSE(profile.add(*XQueryContext::xqueryContext()));
  EXPECT_EQ(profile.evaluations(), 0u);
}

TEST(Profile, OfAQueryThatIsNotProfiledIsNothing) {
  for (const auto& query : {compiled("1", XQueryWay::Planned), compiled("1 +")}) {
    XQueryProfile profile(*query);
    EXPECT_FALSE(profile.add(*evaluated(*query)));
    EXPECT_EQ(profile.describe(XQueryProfileFormat::Text), "");
    EXPECT_EQ(profile.describe(XQueryProfileFormat::JSON), "");
    EXPECT_EQ(profile.describe(XQueryProfileFormat::HTML), "");
  }
}

TEST(Profile, OutlivesItsQueryAndItsContexts) {
  auto query = compiled("count((1, 2))");
  XQueryProfile profile(*query);
  EXPECT_TRUE(profile.add(*evaluated(*query)));
  query = nullptr;
  XQueryProfile moved = std::move(profile);
  EXPECT_THAT(moved.describe(XQueryProfileFormat::Text), HasSubstr("query: count(...)  (line 1)"));
}

TEST(Profile, TakesInWhatFailed) {
  const auto query = compiled("error('a', 'b')");
  XQueryProfile profile(*query);
  EXPECT_TRUE(profile.add(*evaluated(*query)));
  EXPECT_THAT(profile.describe(XQueryProfileFormat::Text), HasSubstr("1 failed"));
}

TEST(Profile, OfAQueryWithoutABodyHasNoExpressions) {
  for (const char* text : {"", "module namespace m = 'm'; declare variable $m:x := 1;"}) {
    const auto query = compiled(text);
    ASSERT_FALSE(query->parseErrors()) << text;
    XQueryProfile profile(*query);
    EXPECT_TRUE(profile.add(*evaluated(*query)));
    EXPECT_THAT(profile.describe(XQueryProfileFormat::Text), StartsWith("1 evaluation\n"));
  }
}

// What a query evaluates from a text is counted as one with what does so.
TEST(Profile, KnowsNothingInsideOfInnerQueries) {
  const auto query = compiled("count(ext:node-xquery(<a/>, 'for $i in 1 to 3 return $i'))");
  XQueryProfile profile(*query);
  EXPECT_TRUE(profile.add(*evaluated(*query)));
  EXPECT_EQ(profile.describe(XQueryProfileFormat::Text).find("FLWOR"), std::string::npos);
}

}  // namespace
}  // namespace xquery

// The twenty numbered ideas of bench/queries over a small document, each phrasing of them against
// results that were worked out by a program of its own, which reads the same document and knows
// nothing of the engine.
#include "AuctionData.h"
#include "Engine.h"
#include "Queries.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <fstream>
#include <iterator>
#include <string>
#include <vector>

using namespace xquery;

namespace {

constexpr double factor = 0.004;

const std::vector<bench::PhrasedQuery>& theTwenty() {
  static const auto queries = [] {
    auto all = bench::phrasedQueries(XQUERY_SOURCE_DIR "/bench/queries");
    std::erase_if(all, [](const bench::PhrasedQuery& query) { return !query.isOfTheTwenty(); });
    return all;
  }();
  return queries;
}

std::vector<std::string> ideas() {
  std::vector<std::string> names;
  for (const auto& query : theTwenty()) names.push_back(query.idea);
  names.erase(std::unique(names.begin(), names.end()), names.end());
  return names;
}

std::string expected(const std::string& idea) {
  std::ifstream file(XQUERY_SOURCE_DIR "/tests/bench/auction/" + idea + ".expected",
                     std::ios::binary);
  return {std::istreambuf_iterator<char>(file), {}};
}

class AuctionQuery : public testing::TestWithParam<std::string> {};

TEST_P(AuctionQuery, GivesTheExpectedResultHoweverItIsPhrased) {
  const Value document = bench::parse(bench::auctionData(factor));
  for (const bench::PhrasedQuery& query : theTwenty()) {
    if (query.idea != GetParam()) continue;
    const auto compiled = bench::compile(query.text);
    Ref<XQueryError> error;
    const auto items =
        XQueryContext::xqueryContext()->evaluateXQuery(*compiled, {}, document, &error);
    ASSERT_TRUE(items) << query.phrasing << ": "
                       << (error ? error->description()->utf8() : "no value");
    EXPECT_EQ(bench::printed(*items), expected(query.idea)) << query.phrasing;
  }
}

std::string testName(const testing::TestParamInfo<std::string>& parameter) {
  std::string name = parameter.param;
  std::replace(name.begin(), name.end(), '-', '_');
  return name;
}

INSTANTIATE_TEST_SUITE_P(All, AuctionQuery, testing::ValuesIn(ideas()), testName);

TEST(AuctionQueries, AreTwenty) {
  EXPECT_EQ(ideas().size(), 20U);
}

TEST(AuctionQueries, AllHaveAPlainPhrasing) {
  const auto& queries = theTwenty();
  EXPECT_EQ(std::count_if(queries.begin(), queries.end(),
                          [](const auto& query) { return query.phrasing == "plain"; }),
            20);
}

}  // namespace

// All phrasings of each idea of bench/queries, compared with each other over small documents.
#include "DataSets.h"
#include "Engine.h"
#include "Queries.h"

#include <gmock/gmock.h>

#include <set>
#include <string>

using namespace xquery;

namespace {

constexpr double factor = 0.0015;

std::string answer(const bench::PhrasedQuery& query, const Value& document) {
  Ref<XQueryError> error;
  const auto items = XQueryContext::xqueryContext()->evaluateXQuery(*bench::compile(query.text), {},
                                                                    document, &error);
  return items ? bench::printed(*items) : error ? error->description()->utf8() : "no value";
}

class Phrasings : public testing::TestWithParam<bench::DataSet> {};

TEST_P(Phrasings, OfAnIdeaGiveTheSameResult) {
  const Value document = bench::parse(GetParam().generate(factor));
  const bench::PhrasedQuery* first = nullptr;
  std::string expected;
  const auto queries = bench::phrasedQueries(XQUERY_SOURCE_DIR "/bench/queries");
  for (const bench::PhrasedQuery& query : queries) {
    if (query.data != GetParam().name || query.isOfTheTwenty()) continue;
    const std::string own = answer(query, document);
    if (first && query.asksTheSameAs(*first)) {
      EXPECT_EQ(own, expected) << query.idea << ": " << query.phrasing << ", " << first->phrasing;
      continue;
    }
    first = &query;
    expected = own;
    // What phrasings that are wrong could agree on.
    EXPECT_THAT(expected, testing::Not(testing::AnyOf("", "0\n", "false\n"))) << query.idea;
  }
  EXPECT_TRUE(first);
}

std::string testName(const testing::TestParamInfo<bench::DataSet>& parameter) {
  return std::string(parameter.param.name);
}

INSTANTIATE_TEST_SUITE_P(All, Phrasings, testing::ValuesIn(bench::dataSets), testName);

TEST(PhrasedQueries, LieInFoldersOfTheDataTheyAreAbout) {
  std::set<std::string> found, known;
  const auto queries = bench::phrasedQueries(XQUERY_SOURCE_DIR "/bench/queries");
  for (const bench::PhrasedQuery& query : queries) found.insert(query.data);
  for (const bench::DataSet& data : bench::dataSets) known.emplace(data.name);
  EXPECT_EQ(found, known);
  EXPECT_GE(queries.size(), 100U);
}

}  // namespace

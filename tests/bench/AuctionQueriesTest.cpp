// The twenty queries of bench/queries over a small document, against results that were worked out
// by a program of its own, which reads the same document and knows nothing of the engine.
#include "AuctionData.h"
#include "xquery/xquery.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <string>
#include <vector>

using namespace xquery;

namespace {

constexpr double factor = 0.004;

std::string readFile(const std::filesystem::path& path) {
  std::ifstream file(path, std::ios::binary);
  return {std::istreambuf_iterator<char>(file), {}};
}

std::vector<std::string> queryNames() {
  std::vector<std::string> names;
  for (const auto& entry :
       std::filesystem::directory_iterator(XQUERY_SOURCE_DIR "/bench/queries")) {
    if (entry.path().extension() == ".xq") names.push_back(entry.path().stem().string());
  }
  std::sort(names.begin(), names.end());
  return names;
}

// One line per item, as the command prints it.
std::string printed(const NSArray& items) {
  std::string text;
  for (const Value& item : items.objects()) {
    if (const auto* node = dyn_cast<NSXMLNode>(item)) {
      node->appendXMLTo(text);
    } else {
      text += XQueryItemStringValue(*item);
    }
    text += '\n';
  }
  return text;
}

class AuctionQuery : public testing::TestWithParam<std::string> {};

TEST_P(AuctionQuery, GivesTheExpectedResult) {
  static const Ref<NSXMLDocument> document =
      NSXMLDocument::documentWithData(bench::auctionData(factor), NSXMLNodePreserveWhitespace);
  const auto query =
      XQuery::xqueryWithSource(readFile(XQUERY_SOURCE_DIR "/bench/queries/" + GetParam() + ".xq"));
  Ref<XQueryError> error;
  const auto items =
      XQueryContext::xqueryContext()->evaluateXQuery(*query, {}, Value(document.get()), &error);
  ASSERT_TRUE(items) << (error ? error->description()->utf8() : "no value");
  EXPECT_EQ(printed(*items),
            readFile(XQUERY_SOURCE_DIR "/tests/bench/auction/" + GetParam() + ".expected"));
}

std::string testName(const testing::TestParamInfo<std::string>& parameter) {
  std::string name = parameter.param;
  std::replace(name.begin(), name.end(), '-', '_');
  return name;
}

INSTANTIATE_TEST_SUITE_P(All, AuctionQuery, testing::ValuesIn(queryNames()), testName);

TEST(AuctionQueries, AreTwenty) {
  EXPECT_EQ(queryNames().size(), 20U);
}

}  // namespace

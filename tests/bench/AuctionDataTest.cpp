#include "AuctionData.h"
#include "DataSupport.h"
#include "xquery/xquery.h"

#include <gmock/gmock.h>

#include <set>
#include <string>

using namespace xquery;
using namespace datatest;

namespace {

TEST(AuctionData, IsTheSameOnEveryMachine) {
  EXPECT_EQ(fingerprint(bench::auctionData(0.001)), 0x84C670B310B266A9U);
}

TEST(AuctionData, IsAboutAHundredAndTenMegabytesAtFactorOne) {
  const size_t size = bench::auctionData(0.05).size();
  EXPECT_NEAR(static_cast<double>(size) / 0.05, 110e6, 4e6);
}

TEST(AuctionData, IsInProportionToTheFactor) {
  const auto small = elementCounts(*parsed(bench::auctionData(0.01))),
             large = elementCounts(*parsed(bench::auctionData(0.03)));
  for (const char* name : {"item", "person", "open_auction", "closed_auction", "category",
                           "keyword", "listitem", "bidder"}) {
    const double ratio = static_cast<double>(large.at(name)) / static_cast<double>(small.at(name));
    EXPECT_NEAR(ratio, 3, 0.5) << name;
  }
}

TEST(AuctionData, EveryReferenceResolves) {
  const Ref<NSXMLDocument> document = parsed(bench::auctionData(0.005));
  ASSERT_TRUE(document);
  const std::set<std::string> ids = attributeValues(*document, {"id"});
  const std::set<std::string> referred =
      attributeValues(*document, {"person", "item", "category", "open_auction", "from", "to"});
  EXPECT_GT(referred.size(), 100U);
  EXPECT_THAT(unresolved(referred, ids), testing::IsEmpty());
}

}  // namespace

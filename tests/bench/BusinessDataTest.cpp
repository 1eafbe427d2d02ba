#include "BusinessData.h"
#include "DataSupport.h"

#include <gmock/gmock.h>

#include <set>
#include <string>

using namespace xquery;
using namespace datatest;

namespace {

TEST(BusinessData, IsTheSameOnEveryMachine) {
  EXPECT_EQ(fingerprint(bench::businessData(0.001)), 0xFFEF88F50FF7CD84U);
}

TEST(BusinessData, IsAboutAHundredAndTenMegabytesAtFactorOne) {
  const size_t size = bench::businessData(0.02).size();
  EXPECT_NEAR(static_cast<double>(size) / 0.02, 110e6, 6e6);
}

TEST(BusinessData, IsInProportionToTheFactor) {
  const auto small = elementCounts(*parsed(bench::businessData(0.004)));
  const auto large = elementCounts(*parsed(bench::businessData(0.012)));
  for (const char* name : {"u:unit", "u:employee", "c:customer", "p:product", "o:order", "o:line",
                           "o:shipped", "o:payment"}) {
    const double ratio = static_cast<double>(large.at(name)) / static_cast<double>(small.at(name));
    EXPECT_NEAR(ratio, 3, 0.5) << name;
  }
}

TEST(BusinessData, EveryReferenceResolves) {
  const Ref<NSXMLDocument> document = parsed(bench::businessData(0.005));
  ASSERT_TRUE(document);
  const std::set<std::string> ids = attributeValues(*document, {"id", "number"});
  const std::set<std::string> referred =
      attributeValues(*document, {"customer", "employee", "order"});
  EXPECT_GT(referred.size(), 100U);
  EXPECT_THAT(unresolved(referred, ids), testing::IsEmpty());
}

TEST(BusinessData, LinesSellKnownProducts) {
  const Ref<NSXMLDocument> document = parsed(bench::businessData(0.005));
  ASSERT_TRUE(document);
  // Of lines and products together: their attributes have the same name.
  const size_t products = elementCounts(*document).at("p:product");
  EXPECT_EQ(attributeValues(*document, {"sku"}).size(), products);
}

}  // namespace

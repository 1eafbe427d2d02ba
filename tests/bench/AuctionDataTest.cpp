#include "AuctionData.h"
#include "xquery/xquery.h"

#include <gtest/gtest.h>

#include <cstdint>
#include <map>
#include <set>
#include <string>

using namespace xquery;

namespace {

uint64_t fingerprint(const std::string& text) {
  uint64_t hash = 0xCBF29CE484222325U;
  for (const char c : text) hash = (hash ^ static_cast<unsigned char>(c)) * 0x100000001B3U;
  return hash;
}

Ref<NSXMLDocument> parsed(double factor) {
  return NSXMLDocument::documentWithData(bench::auctionData(factor), NSXMLNodeOptionsNone);
}

std::map<std::string, size_t> elementCounts(const NSXMLDocument& document) {
  std::map<std::string, size_t> counts;
  for (const NSXMLNode* node = &document; node; node = node->nextNode()) {
    if (isa<NSXMLElement>(node)) counts[node->nameView().utf8()]++;
  }
  return counts;
}

TEST(AuctionData, IsTheSameOnEveryMachine) {
  EXPECT_EQ(fingerprint(bench::auctionData(0.001)), 0x84C670B310B266A9U);
}

TEST(AuctionData, IsAboutAHundredAndTenMegabytesAtFactorOne) {
  const size_t size = bench::auctionData(0.05).size();
  EXPECT_NEAR(static_cast<double>(size) / 0.05, 110e6, 4e6);
}

TEST(AuctionData, IsInProportionToTheFactor) {
  const auto small = elementCounts(*parsed(0.01)), large = elementCounts(*parsed(0.03));
  for (const char* name : {"item", "person", "open_auction", "closed_auction", "category",
                           "keyword", "listitem", "bidder"}) {
    const double ratio = static_cast<double>(large.at(name)) / static_cast<double>(small.at(name));
    EXPECT_NEAR(ratio, 3, 0.5) << name;
  }
}

TEST(AuctionData, EveryReferenceResolves) {
  const Ref<NSXMLDocument> document = parsed(0.005);
  ASSERT_TRUE(document);
  const std::set<std::string> references = {"person",       "item", "category",
                                            "open_auction", "from", "to"};
  std::set<std::string> ids, referred;
  for (const NSXMLNode* node = document.get(); node; node = node->nextNode()) {
    const auto* element = dyn_cast<NSXMLElement>(static_cast<const NSObject*>(node));
    if (!element) continue;
    for (const NSXMLNode* attribute = element->firstAttribute(); attribute;
         attribute = NSXMLElement::nextAttribute(attribute)) {
      const std::string name = attribute->nameView().utf8();
      if (name == "id") ids.insert(attribute->textView().utf8());
      if (references.count(name) > 0) referred.insert(attribute->textView().utf8());
    }
  }
  EXPECT_GT(referred.size(), 100U);
  for (const std::string& reference : referred) EXPECT_EQ(ids.count(reference), 1U) << reference;
}

}  // namespace

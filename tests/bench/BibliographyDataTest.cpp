#include "BibliographyData.h"
#include "DataSupport.h"

#include <gmock/gmock.h>

#include <set>
#include <string>

using namespace xquery;
using namespace datatest;

namespace {

TEST(BibliographyData, IsTheSameOnEveryMachine) {
  EXPECT_EQ(fingerprint(bench::bibliographyData(0.001)), 0x31ED3B2AE26E6A5CU);
}

TEST(BibliographyData, IsAboutAHundredAndTenMegabytesAtFactorOne) {
  const size_t size = bench::bibliographyData(0.02).size();
  EXPECT_NEAR(static_cast<double>(size) / 0.02, 110e6, 6e6);
}

TEST(BibliographyData, IsInProportionToTheFactor) {
  const auto small = elementCounts(*parsed(bench::bibliographyData(0.004)));
  const auto large = elementCounts(*parsed(bench::bibliographyData(0.012)));
  for (const char* name : {"person", "journal", "proceedings", "article", "paper", "book", "thesis",
                           "author", "cite", "crossref"}) {
    const double ratio = static_cast<double>(large.at(name)) / static_cast<double>(small.at(name));
    EXPECT_NEAR(ratio, 3, 0.5) << name;
  }
}

TEST(BibliographyData, EveryReferenceResolves) {
  const Ref<NSXMLDocument> document = parsed(bench::bibliographyData(0.002));
  ASSERT_TRUE(document);
  const std::set<std::string> keys = attributeValues(*document, {"key"});
  const std::set<std::string> crossReferences = elementValues(*document, {"crossref"});
  EXPECT_GT(crossReferences.size(), 5U);
  EXPECT_THAT(unresolved(crossReferences, keys), testing::IsEmpty());
  EXPECT_THAT(unresolved(elementValues(*document, {"author", "editor"}),
                         elementValues(*document, {"name"})),
              testing::IsEmpty());
}

TEST(BibliographyData, RecordsCiteKnownRecords) {
  const Ref<NSXMLDocument> document = parsed(bench::bibliographyData(0.002));
  ASSERT_TRUE(document);
  const auto counts = elementCounts(*document);
  // Of all records and of the references to them: their attributes have the same name.
  std::set<std::string> keys = attributeValues(*document, {"key"});
  std::erase_if(keys, [](const std::string& key) {
    return key.starts_with("journals/") || key.starts_with("conf/");
  });
  EXPECT_EQ(keys.size(),
            counts.at("article") + counts.at("paper") + counts.at("book") + counts.at("thesis"));
}

TEST(BibliographyData, NamesEveryPersonOnce) {
  const Ref<NSXMLDocument> document = parsed(bench::bibliographyData(0.005));
  ASSERT_TRUE(document);
  EXPECT_EQ(elementValues(*document, {"name"}).size(), elementCounts(*document).at("person"));
}

}  // namespace

#include "Platform/Base/WorkMeter.h"
#include "Platform/Tree/Names.h"
#include "Platform/Tree/TreeBuilder.h"
#include "Platform/Tree/TreeHead.h"
#include "Platform/Tree/TreeIndexes.h"
#include "Platform/Tree/XMLTestSupport.h"

#include <gtest/gtest.h>

#include <string>

namespace xquery {
namespace {

// A document of records below two elements, of which there is one at a time.
class Records : public testing::Test {
 protected:
  Records() {
    document = builder.openDocument();
    open("a");
    builder.addProperty(Kind::Attribute, name("n"), A("1"));
    open("b");
    start = builder.mark();
  }

  const NSXMLName* name(std::string_view text) {
    const NSXMLName* const interned = NSXMLInternName(A(text), {});
    builder.tree().adopt(interned);
    return interned;
  }
  NSXMLElement* open(std::string_view text) { return builder.openElement(name(text)); }
  // With so many children, each of which has a text.
  NSXMLElement* addRecord(size_t children, const std::string& text) {
    NSXMLElement* const record = open("r");
    builder.addProperty(Kind::Attribute, name("i"), A(text));
    for (size_t child = 0; child < children; ++child) {
      open("c");
      builder.addLeaf(Kind::Text, A(text));
      builder.close();
    }
    builder.close();
    builder.endOpenNodes();
    return record;
  }
  static std::string recordText(size_t children, const std::string& text) {
    std::string XML = "<a n=\"1\"><b><r i=\"" + text + "\"" + (children ? ">" : "/>");
    for (size_t child = 0; child < children; ++child) XML += "<c>" + text + "</c>";
    return XML + (children ? "</r>" : "") + "</b></a>";
  }
  std::string written() const { return document->rootElement()->XMLString()->utf8(); }

  NSXMLTreeBuilder builder{256, 128};
  NSXMLDocument* document = nullptr;
  NSXMLTreeBuilder::Mark start = {};
};

TEST_F(Records, AreBuiltOneInThePlaceOfTheOther) {
  const size_t sizes[] = {0, 1, 3, 100, 2, 2000, 0, 5};
  for (const size_t children : sizes) {
    for (const size_t length : {1, 100, 200, 5000}) {
      if (children * length > 300'000) continue;
      const std::string text(length, static_cast<char>('a' + children % 26));
      const NSXMLElement* const record = addRecord(children, text);
      EXPECT_TRUE(written() == recordText(children, text)) << children << " " << length;
      EXPECT_EQ(record->parent()->firstChild(), record);
      EXPECT_EQ(record->parent()->lastChild(), record);
      EXPECT_EQ(NSXMLNodeOrder::number(*record), start.nextNumber);
      EXPECT_EQ(document->lastChild()->lastChild(), record->parent());
      builder.backTo(start);
      builder.endOpenNodes();
      EXPECT_EQ(written(), "<a n=\"1\"><b/></a>");
    }
  }
}

TEST_F(Records, TakeNoMoreMemoryHoweverManyThereAre) {
  const std::string texts[] = {std::string(10, 'x'), std::string(300, 'y'),
                               std::string(100'000, 'z')};
  int64_t most = 0;
  for (int turn = 0; turn < 300; ++turn) {
    const std::string& text = texts[static_cast<size_t>(turn) % 3];
    addRecord(text.size() > 1000 ? 2 : 200, text);
    if (turn == 20) most = workMeter.valueBytes;
    if (turn > 20) {
      EXPECT_LE(workMeter.valueBytes, most + 300'000) << turn;
    }
    builder.backTo(start);
  }
  const int64_t atTheEnd = workMeter.valueBytes;
  for (int turn = 0; turn < 100; ++turn) {
    addRecord(200, texts[0]);
    builder.backTo(start);
  }
  EXPECT_EQ(workMeter.valueBytes, atTheEnd) << "what is there serves again";
}

TEST_F(Records, MayLieBelowOtherElementsLater) {
  addRecord(500, "text");
  builder.backTo(start);
  builder.close();
  const auto between = builder.mark();
  for (int turn = 0; turn < 10; ++turn) {
    open("d");
    const auto inner = builder.mark();
    addRecord(300, "more");
    builder.backTo(inner);
    addRecord(1, "last");
    EXPECT_EQ(written(), "<a n=\"1\"><b/><d><r i=\"last\"><c>last</c></r></d></a>");
    builder.backTo(inner);
    builder.close();
    builder.backTo(between);
  }
  builder.endOpenNodes();
  EXPECT_EQ(written(), "<a n=\"1\"><b/></a>");
}

TEST_F(Records, LeaveLastingTextsWhereTheyAre) {
  std::vector<const NSStringView*> stored;
  for (int turn = 0; turn < 100; ++turn) {
    addRecord(50, "text");
    stored.push_back(builder.storeLasting(A("urn:" + std::to_string(turn))));
    addRecord(50, "text");
    builder.backTo(start);
  }
  stored.push_back(builder.storeLasting(NSStringView(u"\u00E9", 1)));
  for (int turn = 0; turn < 100; ++turn) {
    EXPECT_EQ(stored[static_cast<size_t>(turn)]->utf8(), "urn:" + std::to_string(turn));
  }
  EXPECT_EQ(stored.back()->utf8(), "\xC3\xA9");
}

TEST_F(Records, HaveNoIndexOfAnEarlierOne) {
  addRecord(1000, "text");
  const NSXMLIndexesRef indexes = NSXMLTreeIndexes::of(document);
  ASSERT_TRUE(indexes);
  EXPECT_TRUE(indexes->isOf(document));
  builder.backTo(start);
  addRecord(1000, "text");
  EXPECT_FALSE(indexes->isOf(document));
}

}  // namespace
}  // namespace xquery

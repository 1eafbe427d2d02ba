#include "Platform/Base/WorkMeter.h"
#include "Platform/Numbers/NSDecimal.h"
#include "Platform/Numbers/NumberText.h"
#include "Platform/Text/ICUText.h"
#include "xquery/Collection.h"
#include "xquery/Data.h"
#include "xquery/String.h"
#include "xquery/URL.h"
#include "xquery/XMLNode.h"

#include <gtest/gtest.h>

#include <new>
#include <string>
#include <vector>

namespace xquery {
namespace {

struct Ended {};

// Watches this thread; ends its work at the given look, if any.
class Watcher final : public WorkWatcher {
 public:
  explicit Watcher(int64_t stepsPerLook, int lastLook = 0)
      : _stepsPerLook(stepsPerLook), _lastLook(lastLook) {
    workMeter.stepsLeft = stepsPerLook;
    workMeter.watcher = this;
  }
  ~Watcher() {
    workMeter.watcher = nullptr;
    workMeter.stepsLeft = WorkMeter::manySteps;
  }
  void lookAtWork() override {
    workMeter.stepsLeft = _stepsPerLook;
    if (++looks == _lastLook) throw Ended();
  }
  int looks = 0;

 private:
  int64_t _stepsPerLook;
  int _lastLook;
};

int64_t bytesTakenBy(auto make) {
  const int64_t before = workMeter.valueBytes;
  const auto kept = make();
  return workMeter.valueBytes - before;
}

// --- work ----------------------------------------------------------------------------------------

TEST(WorkMeter, AsksTheWatcherOnceInSoManySteps) {
  Watcher watcher(10);
  for (int step = 0; step < 9; ++step) checkWork();
  EXPECT_EQ(watcher.looks, 0);
  checkWork();
  EXPECT_EQ(watcher.looks, 1);
  for (int step = 0; step < 20; ++step) checkWork();
  EXPECT_EQ(watcher.looks, 3);
}

TEST(WorkMeter, ChargingOnlyCounts) {
  Watcher watcher(10, 1);
  chargeWork(1000);
  EXPECT_EQ(watcher.looks, 0);
  EXPECT_THROW(checkWork(), Ended);
}

TEST(WorkMeter, WithoutAWatcherNothingHappens) {
  workMeter.stepsLeft = 1;
  checkWork(5);
  EXPECT_EQ(workMeter.stepsLeft, WorkMeter::manySteps);
}

TEST(WorkMeter, APacerMakesAStepOfManyTurns) {
  Watcher watcher(2);
  WorkPacer pacer;
  for (uint32_t turn = 0; turn < 2 * WorkPacer::turnsPerStep - 1; ++turn) pacer.turn();
  EXPECT_EQ(watcher.looks, 0);
  pacer.turn();
  EXPECT_EQ(watcher.looks, 1);
}

// --- walks over a tree can be ended --------------------------------------------------------------

std::string manyElements(int count) {
  std::string xml = "<r>";
  for (int element = 0; element < count; ++element) xml += "<e>t</e>";
  return xml + "</r>";
}

TEST(WorkMeter, AParseCanBeEnded) {
  const std::string xml = manyElements(50000);
  NSXMLParseError error;
  Watcher watcher(1, 3);
  EXPECT_THROW(static_cast<void>(NSXMLDocument::documentWithData(xml, 0, &error)), Ended);
}

TEST(WorkMeter, ACopyCanBeEndedAndLeavesNothingBehind) {
  const auto document = NSXMLDocument::documentWithData(manyElements(50000), 0);
  const int64_t before = workMeter.valueBytes;
  {
    Watcher watcher(1, 3);
    EXPECT_THROW(static_cast<void>(document->copy()), Ended);
  }
  EXPECT_EQ(workMeter.valueBytes, before);
}

TEST(WorkMeter, AStringValueAndXMLTextCanBeEnded) {
  const auto document = NSXMLDocument::documentWithData(manyElements(50000), 0);
  {
    Watcher watcher(1, 3);
    EXPECT_THROW(static_cast<void>(document->stringValue()), Ended);
  }
  Watcher watcher(1, 3);
  EXPECT_THROW(static_cast<void>(document->XMLString()), Ended);
}

TEST(WorkMeter, RenumberingCanBeEndedAndIsDoneByTheNextToAsk) {
  const auto document = NSXMLDocument::documentWithData(manyElements(50000), 0);
  NSXMLElement* root = document->rootElement();
  root->insertChild(NSXMLElement::elementWithName(NSStringView::ascii("first")), 0);
  const NSXMLNode* first = root->firstChild();
  const NSXMLNode* second = first->nextSibling();
  {
    Watcher watcher(1, 3);
    EXPECT_THROW(NSXMLNode::compareOrder(second, first), Ended);
  }
  EXPECT_EQ(NSXMLNode::compareOrder(first, second), -1);
  EXPECT_EQ(NSXMLNode::compareOrder(second, first), 1);
}

TEST(WorkMeter, ALongWayUpATreeIsCharged) {
  std::string xml;
  for (int depth = 0; depth < 10000; ++depth) xml += "<e>";
  for (int depth = 0; depth < 10000; ++depth) xml += "</e>";
  const auto document = NSXMLDocument::documentWithData(xml, 0);
  const NSXMLNode* deepest = document.get();
  while (deepest->firstChild()) deepest = deepest->firstChild();
  Watcher watcher(1000);
  EXPECT_EQ(deepest->level(), 10000);
  EXPECT_EQ(workMeter.stepsLeft, 1000 - 10000 / int{WorkPacer::turnsPerStep});
}

// --- every pass over a long text can be ended ----------------------------------------------------

constexpr size_t longLength = 1000000;

template <class Work>
void expectCanBeEnded(const char* name, Work work) {
  SCOPED_TRACE(name);
  const int64_t before = workMeter.valueBytes;
  {
    Watcher watcher(10, 3);
    EXPECT_THROW(work(), Ended);
  }
  EXPECT_EQ(workMeter.valueBytes, before) << "what was made so far goes";
}

TEST(WorkMeter, PassesOverALongTextCanBeEnded) {
  const std::string narrow(longLength, 'x');
  const std::u16string wide(longLength, u'\u00E9');
  const std::string encoded = NSString::stringWithUTF16(wide)->utf8();
  const auto text = NSString::stringWithASCII(narrow);
  const auto other = NSString::stringWithASCII(narrow);
  const auto wideText = NSString::stringWithUTF16(wide);
  const auto otherWide = NSString::stringWithUTF16(wide);
  expectCanBeEnded("ASCII", [&] { static_cast<void>(NSString::stringWithASCII(narrow)); });
  expectCanBeEnded("UTF-16", [&] { static_cast<void>(NSString::stringWithUTF16(wide)); });
  expectCanBeEnded("from UTF-8", [&] { static_cast<void>(NSString::stringWithUTF8(encoded)); });
  expectCanBeEnded("to UTF-8", [&] { static_cast<void>(text->utf8()); });
  expectCanBeEnded("wide to UTF-8", [&] { static_cast<void>(wideText->utf8()); });
  expectCanBeEnded("to UTF-16", [&] { static_cast<void>(text->view().utf16()); });
  expectCanBeEnded("hash", [&] { static_cast<void>(text->hash()); });
  expectCanBeEnded("equality", [&] { static_cast<void>(text->isEqualToString(*other)); });
  expectCanBeEnded("order", [&] { static_cast<void>(wideText->compare(*otherWide)); });
  expectCanBeEnded("appending", [&] { NSMutableString().append(text->view()); });
  expectCanBeEnded("appending wide", [&] { NSMutableString().append(wideText->view()); });
  expectCanBeEnded("widening", [&] {
    NSMutableString mutableText;
    mutableText.append(text->view().substring(0, longLength / 5));
    mutableText.append(u'\u00E9');
    mutableText.append(text->view().substring(0, longLength / 5));
  });
}

TEST(WorkMeter, MappingsOfALongTextCanBeEnded) {
  const std::u16string sigmas(longLength, u'\u03A3');
  const std::u16string ignorable(longLength, u'\u0301');
  expectCanBeEnded("sigmas", [&] { static_cast<void>(lowerCasedText(sigmas)); });
  expectCanBeEnded("ignorable", [&] { static_cast<void>(lowerCasedText(ignorable)); });
  expectCanBeEnded("upper case", [&] { static_cast<void>(upperCasedText(sigmas)); });
  expectCanBeEnded("code points", [&] { static_cast<void>(codePointsOfText(sigmas)); });
  const std::vector<int32_t> points(longLength, 0x3A3);
  expectCanBeEnded("from code points", [&] { static_cast<void>(textWithCodePoints(points)); });
}

TEST(WorkMeter, ReadingALongTextCanBeEnded) {
  const auto expectEnds = [](const char* name, const std::string& text) {
    double number = 0;
    NSDecimal decimal;
    const auto view = NSStringView::ascii(text);
    expectCanBeEnded(name, [&] { static_cast<void>(scanDouble(view, number)); });
    expectCanBeEnded(name, [&] { static_cast<void>(NSDecimal::scan(view, decimal)); });
  };
  expectEnds("digits", std::string(longLength, '1'));
  expectEnds("white space", std::string(longLength, ' '));
  expectEnds("zeros", std::string(longLength, '0'));
  expectEnds("fraction", "0." + std::string(longLength, '0') + "1");
  expectEnds("exponent", "1e" + std::string(longLength, '0') + "1");
  for (const char* unit : {"a", "/", "../", "%41", ":", "?", "#", "a/./"}) {
    std::string reference = "http:";
    while (reference.size() < longLength) reference += unit;
    if (*unit == '#') reference = "#" + std::string(longLength, 'f');
    const auto text = NSString::stringWithASCII(reference);
    const auto base = NSURL::URLWithString(NSString::stringWithASCII("http://h/a"));
    expectCanBeEnded(unit, [&] { static_cast<void>(NSURL::URLWithString(text)); });
    expectCanBeEnded(unit, [&] { static_cast<void>(NSURL::URLWithString(text, *base)); });
  }
}

// --- bytes ---------------------------------------------------------------------------------------

TEST(ValueBytes, AnObjectCountsWhileItLives) {
  const int64_t before = workMeter.valueBytes;
  {
    const auto number = NSNumber::numberWithDouble(1.5);
    EXPECT_EQ(workMeter.valueBytes - before, int64_t{sizeof(NSNumber)});
  }
  EXPECT_EQ(workMeter.valueBytes, before);
}

TEST(ValueBytes, ALongTextCountsItsUnits) {
  const std::string text(100000, 'x');
  const std::u16string wide(100000, u'é');
  EXPECT_EQ(bytesTakenBy([&] { return NSString::stringWithASCII(text); }),
            int64_t{sizeof(NSString)} + 100000);
  EXPECT_EQ(bytesTakenBy([&] { return NSString::stringWithUTF16(wide); }),
            int64_t{sizeof(NSString)} + 200000);
}

TEST(ValueBytes, ATextBeingPutTogetherCounts) {
  const int64_t before = workMeter.valueBytes;
  {
    NSMutableString text;
    for (int time = 0; time < 10000; ++time) text.appendASCII("0123456789");
    EXPECT_GE(workMeter.valueBytes - before, 100000);
  }
  EXPECT_EQ(workMeter.valueBytes, before);
}

TEST(ValueBytes, RawBytesCount) {
  const int64_t before = workMeter.valueBytes;
  EXPECT_GE(bytesTakenBy([] { return NSData::dataWithBytes(std::string(50000, 'x')); }), 50000);
  EXPECT_EQ(workMeter.valueBytes, before);
}

TEST(ValueBytes, AListOfValuesCountsItsRoom) {
  const int64_t before = workMeter.valueBytes;
  {
    auto array = NSArray::array();
    for (int index = 0; index < 1000; ++index) array->objects().push_back(NSNull::null());
    EXPECT_GE(workMeter.valueBytes - before, 8000);
    EXPECT_EQ(workMeter.valueBytes - before,
              int64_t{sizeof(NSArray)} + int64_t{8} * int64_t(array->objects().capacity()));
  }
  EXPECT_EQ(workMeter.valueBytes, before);
}

TEST(ValueBytes, ATreeCountsItsBlocks) {
  const int64_t before = workMeter.valueBytes;
  {
    const auto document = NSXMLDocument::documentWithData(manyElements(10000), 0);
    // An element and a text each.
    EXPECT_GE(workMeter.valueBytes - before, 10000 * 100);
  }
  EXPECT_EQ(workMeter.valueBytes, before);
  EXPECT_GE(bytesTakenBy([] { return NSXMLElement::elementWithName(NSStringView::ascii("e")); }),
            64);
  EXPECT_EQ(workMeter.valueBytes, before);
}

TEST(ValueBytes, ALargeDecimalCountsItsDigits) {
  const std::string digits(10000, '7');
  const int64_t before = workMeter.valueBytes;
  {
    NSDecimal decimal;
    ASSERT_TRUE(NSDecimal::scan(NSStringView::ascii(digits), decimal));
    EXPECT_GE(workMeter.valueBytes - before, 4000);
    EXPECT_GE(bytesTakenBy([&] { return decimal; }), 4000);
    const NSDecimal moved = std::move(decimal);
    EXPECT_GE(workMeter.valueBytes - before, 4000);
  }
  EXPECT_EQ(workMeter.valueBytes, before);
}

// --- the most that values may take ---------------------------------------------------------------

class MostValueBytes : public testing::Test {
 protected:
  void allow(int64_t bytes) { workMeter.mostValueBytes = workMeter.valueBytes + bytes; }
  ~MostValueBytes() override {
    workMeter.mostValueBytes = INT64_MAX;
    workMeter.wasRefused = false;
    workMeter.stepsLeft = WorkMeter::manySteps;
  }
};

TEST_F(MostValueBytes, ALargeBlockThatWouldExceedThemIsRefused) {
  const std::string text(200000, 'x');
  allow(150000);
  const int64_t before = workMeter.valueBytes;
  EXPECT_THROW(static_cast<void>(NSString::stringWithASCII(text)), std::bad_alloc);
  EXPECT_TRUE(workMeter.wasRefused);
  EXPECT_LE(workMeter.stepsLeft, 0);
  EXPECT_EQ(workMeter.valueBytes, before);
}

TEST_F(MostValueBytes, ALargeBlockWithinThemIsMade) {
  const std::string text(100000, 'x');
  allow(150000);
  EXPECT_EQ(NSString::stringWithASCII(text)->length(), 100000U);
  EXPECT_FALSE(workMeter.wasRefused);
}

TEST_F(MostValueBytes, HoldForLists) {
  allow(1000000);
  std::vector<Value> values;
  EXPECT_THROW(values.resize(1000000), std::bad_alloc);
  EXPECT_TRUE(values.empty());
}

TEST_F(MostValueBytes, HoldForTheBlocksOfATree) {
  const std::string xml = manyElements(100000);
  allow(1000000);
  const int64_t before = workMeter.valueBytes;
  NSXMLParseError error;
  EXPECT_FALSE(NSXMLDocument::documentWithData(xml, 0, &error));
  EXPECT_EQ(error.message, "out of memory");
  EXPECT_EQ(workMeter.valueBytes, before);
}

}  // namespace
}  // namespace xquery

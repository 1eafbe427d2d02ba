// Both representations of a text must give the same answers, so most tests ask every question of
// all four pairings over generated texts and compare with a plain implementation.
#include "Platform/Base/ProcessorTime.h"
#include "Platform/Base/WorkMeter.h"
#include "Platform/Text/TextTestSupport.h"
#include "xquery/String.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <random>
#include <set>
#include <string>
#include <vector>

namespace xquery {
namespace {

// A text in both representations.
struct Both {
  std::string ascii;
  std::u16string wide;
  explicit Both(std::string text) : ascii(std::move(text)), wide(ascii.begin(), ascii.end()) {}
  std::vector<NSStringView> views() const { return {NSStringView::ascii(ascii), wideView(wide)}; }
  static NSStringView wideView(const std::u16string& text) {
    return {text.data(), static_cast<uint32_t>(text.size())};
  }
};

std::string randomText(std::mt19937& random, size_t longest, int letters) {
  std::string text(random() % (longest + 1), 'a');
  for (char& letter : text) letter = static_cast<char>('a' + random() % letters);
  return text;
}

uint32_t expectedPosition(size_t position) {
  return position == std::string::npos ? NSStringView::notFound : static_cast<uint32_t>(position);
}

TEST(StringView, FindGivesTheSameAnswerInEveryRepresentation) {
  std::mt19937 random(1);
  for (int round = 0; round < 4000; ++round) {
    const Both text(randomText(random, 60, 2));
    const Both pattern(randomText(random, round % 3 ? 4 : 30, 2));
    const auto from = static_cast<uint32_t>(random() % 64);
    const uint32_t expected = expectedPosition(text.ascii.find(pattern.ascii, from));
    for (const NSStringView textView : text.views()) {
      for (const NSStringView patternView : pattern.views()) {
        ASSERT_EQ(textView.find(patternView, from), expected)
            << text.ascii << " / " << pattern.ascii << " from " << from;
      }
    }
  }
}

TEST(StringView, FindOfLongPatternsInRepetitiveTexts) {
  std::mt19937 random(2);
  for (int round = 0; round < 500; ++round) {
    std::string period = randomText(random, 5, 2) + "a";
    std::string repeated;
    while (repeated.size() < 200) repeated += period;
    Both text(repeated + randomText(random, 10, 2) + repeated);
    const size_t start = random() % text.ascii.size();
    const Both pattern(text.ascii.substr(start, 17 + random() % 60));
    const uint32_t expected = expectedPosition(text.ascii.find(pattern.ascii));
    for (const NSStringView textView : text.views()) {
      for (const NSStringView patternView : pattern.views()) {
        ASSERT_EQ(textView.find(patternView), expected);
      }
    }
  }
}

TEST(StringView, EmptyTextIsFoundWhereTheSearchStarts) {
  const Both both("abc");
  for (const NSStringView text : both.views()) {
    EXPECT_EQ(text.find(NSStringView(), 0), 0U);
    EXPECT_EQ(text.find(NSStringView(), 3), 3U);
    EXPECT_EQ(text.find(NSStringView(), 4), NSStringView::notFound);
  }
  EXPECT_EQ(NSStringView().find(NSStringView()), 0U);
}

TEST(StringView, FindOfAUnit) {
  const Both text("hello");
  for (const NSStringView view : text.views()) {
    EXPECT_EQ(view.find(u'l'), 2U);
    EXPECT_EQ(view.find(u'l', 3), 3U);
    EXPECT_EQ(view.find(u'l', 4), NSStringView::notFound);
    EXPECT_EQ(view.find(u'o', 100), NSStringView::notFound);
    EXPECT_EQ(view.find(u'\u016C'), NSStringView::notFound);  // low byte is that of "l"
  }
  const std::u16string wide = u"a\u016C";
  EXPECT_EQ(Both::wideView(wide).find(u'\u016C'), 1U);
  EXPECT_EQ(NSStringView().find(u'a'), NSStringView::notFound);
}

TEST(StringView, WidePatternIsNotFoundInNarrowTextUnlessItsUnitsAre) {
  const std::u16string pattern = u"l\u00E9";
  EXPECT_EQ(NSStringView::ascii("hello l").find(Both::wideView(pattern)), NSStringView::notFound);
  const std::u16string longPattern = std::u16string(40, u'l') + u"\u00E9";
  const std::string text(200, 'l');
  EXPECT_EQ(NSStringView::ascii(text).find(Both::wideView(longPattern)), NSStringView::notFound);
}

TEST(StringView, HostileSearchTakesLinearTime) {
  const std::u16string text = std::u16string(400000, u'\u0101');
  const std::u16string pattern = std::u16string(200000, u'\u0101') + u"\u0102";
  const double start = processorSeconds();
  EXPECT_EQ(Both::wideView(text).find(Both::wideView(pattern)), NSStringView::notFound);
  EXPECT_LT(processorSeconds() - start, 2);
}

// Long texts are searched in pieces, which must not show where they meet.
TEST(StringView, FindInLongTextsMissesNoPlace) {
  constexpr uint32_t pieceLength = 0x10000;
  for (const uint32_t patternLength : {1U, 2U, 16U, 17U, 5000U, pieceLength, pieceLength + 1}) {
    const Both pattern(std::string(patternLength, 'b'));
    for (const uint32_t start : {pieceLength - patternLength, pieceLength - 1, pieceLength,
                                 pieceLength + 1, 2 * pieceLength - 1, 2 * pieceLength}) {
      std::string letters(3 * pieceLength, 'a');
      if (start > letters.size() - patternLength) continue;
      letters.replace(start, patternLength, pattern.ascii);
      const Both text(std::move(letters));
      for (const NSStringView textView : text.views()) {
        for (const NSStringView patternView : pattern.views()) {
          EXPECT_EQ(textView.find(patternView), start) << patternLength;
          EXPECT_EQ(textView.find(patternView, start), start) << patternLength;
          EXPECT_EQ(textView.find(patternView, start + 1), NSStringView::notFound) << patternLength;
        }
      }
    }
  }
}

struct Ended {};

// Ends the work of this thread when it is looked at for the second time.
class SecondLook final : public WorkWatcher {
 public:
  SecondLook() {
    workMeter.stepsLeft = 1;
    workMeter.watcher = this;
  }
  ~SecondLook() {
    workMeter.watcher = nullptr;
    workMeter.stepsLeft = WorkMeter::manySteps;
  }
  void lookAtWork() override {
    workMeter.stepsLeft = 1;
    if (++_looks == 2) throw Ended();
  }

 private:
  int _looks = 0;
};

TEST(StringView, ASearchThroughALongTextCanBeEnded) {
  const Both text(std::string(1000000, 'a'));
  for (const uint32_t patternLength : {1U, 3U, 30U, 300000U}) {
    const Both pattern(std::string(patternLength - 1, 'a') + "b");
    for (const NSStringView textView : text.views()) {
      for (const NSStringView patternView : pattern.views()) {
        const SecondLook watcher;
        EXPECT_THROW(textView.find(patternView), Ended) << patternLength;
      }
    }
  }
}

TEST(StringView, StartsAndEndsAgreeWithSubstrings) {
  std::mt19937 random(3);
  for (int round = 0; round < 2000; ++round) {
    const Both text(randomText(random, 10, 2));
    const Both part(randomText(random, 4, 2));
    const bool starts = text.ascii.rfind(part.ascii, 0) == 0;
    const bool ends = text.ascii.size() >= part.ascii.size() &&
                      text.ascii.substr(text.ascii.size() - part.ascii.size()) == part.ascii;
    for (const NSStringView textView : text.views()) {
      for (const NSStringView partView : part.views()) {
        ASSERT_EQ(textView.startsWith(partView), starts);
        ASSERT_EQ(textView.endsWith(partView), ends);
      }
    }
  }
}

TEST(StringView, SubstringIsClamped) {
  const Both both("abcdef");
  for (const NSStringView text : both.views()) {
    EXPECT_TRUE(text.substring(2, 3) == std::string_view("cde"));
    EXPECT_TRUE(text.substring(4) == std::string_view("ef"));
    EXPECT_TRUE(text.substring(4, 100) == std::string_view("ef"));
    EXPECT_EQ(text.substring(6).length(), 0U);
    EXPECT_EQ(text.substring(UINT32_MAX, UINT32_MAX).length(), 0U);
  }
}

TEST(StringView, CompareEqualsAndHashAgreeInEveryRepresentation) {
  std::mt19937 random(4);
  for (int round = 0; round < 4000; ++round) {
    const Both a(randomText(random, 12, 2));
    const Both b(round % 4 ? randomText(random, 12, 2) : a.ascii);
    const int order = a.ascii.compare(b.ascii);
    const int expected = order < 0 ? -1 : order > 0 ? 1 : 0;
    for (const NSStringView aView : a.views()) {
      for (const NSStringView bView : b.views()) {
        ASSERT_EQ(aView.compare(bView), expected) << a.ascii << " / " << b.ascii;
        ASSERT_EQ(aView.equals(bView), expected == 0);
        if (expected == 0) {
          ASSERT_EQ(aView.hash(), bView.hash());
        }
      }
    }
  }
}

// The code points of a text, a lone surrogate being itself: what the order is defined by.
std::u32string codePoints(const std::u16string& text) {
  std::u32string points;
  for (size_t index = 0; index < text.size(); ++index) {
    const char16_t unit = text[index];
    const bool pair = unit >= 0xD800 && unit < 0xDC00 && index + 1 < text.size() &&
                      text[index + 1] >= 0xDC00 && text[index + 1] < 0xE000;
    if (pair) {
      points += 0x10000 + ((char32_t{unit} - 0xD800) << 10) + (text[++index] - 0xDC00);
    } else {
      points += unit;
    }
  }
  return points;
}

TEST(StringView, OrderIsByCodePoint) {
  const char16_t alphabet[] = {u'a',   u'b',   0x00E9, 0xD7FF, 0xD800, 0xDBFF,
                               0xDC00, 0xDFFF, 0xE000, 0xFFFD, 0xFFFF};
  std::mt19937 random(5);
  const auto randomWide = [&] {
    std::u16string text(random() % 5, u'a');
    for (char16_t& unit : text) unit = alphabet[random() % std::size(alphabet)];
    return text;
  };
  for (int round = 0; round < 200000; ++round) {
    const std::u16string a = randomWide();
    const std::u16string b = randomWide();
    const int order = codePoints(a).compare(codePoints(b));
    ASSERT_EQ(Both::wideView(a).compare(Both::wideView(b)), order < 0   ? -1
                                                            : order > 0 ? 1
                                                                        : 0)
        << testing::PrintToString(a) << testing::PrintToString(b);
  }
}

TEST(StringView, APairIsAboveEveryCharacterOfTheBasicPlane) {
  const std::u16string last = u"\uFFFF";
  const std::u16string pair = u"\U00010000";
  EXPECT_EQ(Both::wideView(pair).compare(Both::wideView(last)), 1);
  EXPECT_EQ(Both::wideView(last).compare(Both::wideView(pair)), -1);
}

TEST(StringView, LongTextsDifferWhereTheyDiffer) {
  for (size_t place = 0; place < 40; ++place) {
    std::string low(40, 'm');
    low[place] = 'l';
    const Both a(low);
    const Both b(std::string(40, 'm'));
    for (const NSStringView aView : a.views()) {
      for (const NSStringView bView : b.views()) {
        EXPECT_EQ(aView.compare(bView), -1);
        EXPECT_EQ(bView.compare(aView), 1);
        EXPECT_FALSE(aView.equals(bView));
      }
    }
    EXPECT_NE(a.views()[0].hash(), b.views()[0].hash());
  }
}

TEST(StringView, ConversionsGiveTheText) {
  const Both both("text");
  for (const NSStringView text : both.views()) {
    EXPECT_EQ(text.utf8(), "text");
    EXPECT_EQ(text.utf16(), u"text");
    std::string out = "more ";
    text.appendUTF8To(out);
    EXPECT_EQ(out, "more text");
    EXPECT_EQ(text[3], u't');
  }
  EXPECT_EQ(NSStringView().utf8(), "");
  EXPECT_EQ(NSStringView().utf16(), u"");
}

// Whoever knows how four units are multiplied in can choose four more that undo them.
TEST(StringView, TextsMadeToMeetInAnUnkeyedHashDoNotMeet) {
  std::set<uint32_t> hashes;
  constexpr size_t count = 5000;
  for (const std::u16string& text : meetingTexts(count)) {
    hashes.insert(Both::wideView(text).hash());
  }
  EXPECT_GE(hashes.size(), count - 2);
}

TEST(StringView, TheHashOfEveryLengthDependsOnEveryUnit) {
  for (size_t length = 1; length < 40; ++length) {
    const std::string text(length, 'm');
    std::set<uint32_t> hashes = {NSStringView::ascii(text).hash(),
                                 NSStringView::ascii(text + std::string(1, '\0')).hash()};
    for (size_t place = 0; place < length; ++place) {
      std::string other = text;
      other[place] = 'n';
      hashes.insert(NSStringView::ascii(other).hash());
    }
    EXPECT_EQ(hashes.size(), length + 2);
  }
}

}  // namespace
}  // namespace xquery

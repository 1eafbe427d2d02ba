#include "Platform/Base/ProcessorTime.h"
#include "Platform/Text/ICUText.h"

#include <gtest/gtest.h>

#include <map>
#include <random>
#include <utility>
#include <vector>

namespace xquery {
namespace {

constexpr NSNormalizationForm forms[] = {NSNormalizationForm::C, NSNormalizationForm::D,
                                         NSNormalizationForm::KC, NSNormalizationForm::KD};

TEST(ICUText, CaseMappingMayLengthenAText) {
  EXPECT_EQ(upperCasedText(u"\u00DF\u0390"), u"SS\u0399\u0308\u0301");
  EXPECT_EQ(lowerCasedText(u"\u0130"), u"i\u0307");
  EXPECT_EQ(upperCasedText(std::u16string(1000, u'\u0390')).size(), 3000U);
}

TEST(ICUText, ASigmaAtTheEndOfAWordIsFinal) {
  EXPECT_EQ(lowerCasedText(u"\u03A3\u03A3 \u03A3\u03A3"), u"\u03C3\u03C2 \u03C3\u03C2");
}

TEST(ICUText, NormalisesToTheFormAskedFor) {
  const std::u16string text = u"\u212B\uFB01";  // the angstrom sign, the ligature fi
  EXPECT_EQ(normalizedText(text, NSNormalizationForm::C), u"\u00C5\uFB01");
  EXPECT_EQ(normalizedText(text, NSNormalizationForm::D), u"A\u030A\uFB01");
  EXPECT_EQ(normalizedText(text, NSNormalizationForm::KC), u"\u00C5fi");
  EXPECT_EQ(normalizedText(text, NSNormalizationForm::KD), u"A\u030Afi");
}

TEST(ICUText, MarksComeIntoCanonicalOrder) {
  EXPECT_EQ(normalizedText(u"a\u0301\u0323", NSNormalizationForm::D), u"a\u0323\u0301");
}

TEST(ICUText, LoneSurrogatesStay) {
  for (const NSNormalizationForm form : forms) {
    EXPECT_EQ(normalizedText(u"\xD800\u00E9\xDC00", form).front(), u'\xD800');
    EXPECT_EQ(normalizedText(u"\xD800\u00E9\xDC00", form).back(), u'\xDC00');
  }
}

// The canonical order of a run of marks, found by exchanging neighbours that a text of two marks
// exchanges.
std::u16string orderedByNeighbours(std::u16string run) {
  const auto exchanged = [](char16_t a, char16_t b) {
    return normalizedText(std::u16string{a, b}, NSNormalizationForm::D)[0] == b && a != b;
  };
  std::map<std::pair<char16_t, char16_t>, bool> known;
  for (size_t sorted = 1; sorted < run.size(); ++sorted) {
    for (size_t index = sorted; index > 0; --index) {
      const auto [entry, added] = known.try_emplace({run[index - 1], run[index]});
      if (added) entry->second = exchanged(run[index - 1], run[index]);
      if (!entry->second) break;
      std::swap(run[index - 1], run[index]);
    }
  }
  return run;
}

// A long run is put in order before the library sees it, which must not show.
TEST(ICUText, LongRunsOfMarksNormaliseAsShortOnesDo) {
  constexpr std::u16string_view marks =
      u"\u0301\u0323\u0344\u0F73\u0F71\u0F72\u05B0\u0308\u3099\u0345";
  std::mt19937 random(9);
  for (int round = 0; round < 50; ++round) {
    std::u16string run;
    std::u16string decomposedRun;
    for (size_t length = 120 + random() % 60; length > 0; --length) {
      run += marks[random() % marks.size()];
      decomposedRun += normalizedText(run.substr(run.size() - 1), NSNormalizationForm::D);
    }
    const std::u16string text = u"\u00E9" + run + u"e\u0301\uAC01";
    const std::u16string decomposed =
        u"e" + orderedByNeighbours(u"\u0301" + decomposedRun) + u"e\u0301\u1100\u1161\u11A8";
    ASSERT_EQ(normalizedText(text, NSNormalizationForm::D), decomposed);
    ASSERT_EQ(normalizedText(text, NSNormalizationForm::KD), decomposed);
    const std::u16string composed = normalizedText(decomposed, NSNormalizationForm::C);
    ASSERT_EQ(normalizedText(text, NSNormalizationForm::C), composed);
    ASSERT_EQ(normalizedText(text, NSNormalizationForm::KC), composed);
    ASSERT_EQ(composed.substr(composed.size() - 2), u"\u00E9\uAC01");
  }
}

// Words that begin with a space neither change nor are changed by what is before them, so the
// words' results, put together, are the text's.
TEST(ICUText, ALongTextIsConvertedAsItsWordsAre) {
  constexpr std::u16string_view units =
      u"aZ\u03A3\u03A3\u00AD\u0301\u0323\u00E9\u1100\u1161\u11A8\uFB01\u0390\u00DF\xD801\xDC00"
      u"\xD801\xDC28";
  std::mt19937 random(3);
  const auto wordByWord = [](const std::vector<std::u16string>& words, auto convert) {
    std::u16string result;
    for (const std::u16string& word : words) result += convert(word);
    return result;
  };
  for (int round = 0; round < 20; ++round) {
    std::u16string text;
    std::vector<std::u16string> words;
    while (text.size() < 30000) {
      std::u16string word = u" ";
      for (size_t length = random() % (round % 2 ? 90 : 9); length > 0; --length) {
        word += units[random() % units.size()];
      }
      text += word;
      words.push_back(word);
    }
    ASSERT_EQ(upperCasedText(text), wordByWord(words, upperCasedText));
    ASSERT_EQ(lowerCasedText(text), wordByWord(words, lowerCasedText));
    for (const NSNormalizationForm form : forms) {
      ASSERT_EQ(normalizedText(text, form), wordByWord(words, [&](const std::u16string& word) {
                  return normalizedText(word, form);
                }));
    }
  }
}

TEST(ICUText, ALongTextWithoutAPlaceToCutIsConvertedWhole) {
  const std::u16string sigmas(20000, u'\u03A3');
  EXPECT_EQ(lowerCasedText(sigmas), std::u16string(19999, u'\u03C3') + u'\u03C2');
  std::u16string pairs = u"a";
  for (int index = 0; index < 10000; ++index) pairs += u"\xD801\xDC28";
  EXPECT_EQ(lowerCasedText(upperCasedText(pairs)), pairs);
  EXPECT_EQ(normalizedText(pairs, NSNormalizationForm::C), pairs);
}

// Each mark of the lower class belongs before all of the higher one.
TEST(ICUText, AHostileRunOfMarksTakesTimeInProportion) {
  for (const std::u16string_view pair : {u"\u0301\u0323", u"\u0F73\u0F73"}) {
    std::u16string text = u"a";
    for (int index = 0; index < 100000; ++index) text += pair;
    for (const NSNormalizationForm form : forms) {
      const double start = processorSeconds();
      EXPECT_GE(normalizedText(text, form).size(), text.size() - 2);
      EXPECT_LT(processorSeconds() - start, 5);
    }
  }
}

TEST(ICUText, CodePointsOutsideTheirRangeMakeNoText) {
  EXPECT_EQ(textWithCodePoints({0x61, 0x10FFFF, 0}), std::u16string(u"a\xDBFF\xDFFF\0", 4));
  for (const int32_t point : {0x110000, 0xD800, 0xDFFF, -1, INT32_MAX, INT32_MIN}) {
    EXPECT_EQ(textWithCodePoints({0x61, point}), std::nullopt) << point;
  }
}

TEST(ICUText, ALoneSurrogateHasNoCodePoint) {
  EXPECT_EQ(codePointsOfText(u"a\xD83D\xDE00"), (std::vector<int32_t>{0x61, 0x1F600}));
  EXPECT_EQ(codePointsOfText(u"a\xD83D"), std::nullopt);
  EXPECT_EQ(codePointsOfText(u"\xDE00z"), std::nullopt);
}

// Wherever a long text is cut, around whatever decides about a sigma.
TEST(ICUText, AFinalSigmaIsFoundAcrossEveryCut) {
  const std::u16string rows[] = {
      u"\u03A3",
      u"\u03A3a",
      u"\u03A3'a",
      u"\u03A3' a",
      u"'\u03A3",
      u" \u03A3",
      u"1\u03A3",
      u"\u03A3\u03A3\u03A3",
      u"\U00010400\u03A3",
      u"\u03A3\U00010400",
      u"'\u03A3'b",
      u"Σ''",
      u"İΣ",
      u"Σİ",
  };
  for (const std::u16string& row : rows) {
    const std::u16string mapped = lowerCasedText(u"B" + row + u"!");
    for (size_t before = 8192 - 9; before <= 8192; ++before) {
      const std::u16string start(before, u'B');
      EXPECT_TRUE(lowerCasedText(start + row + u"!" + start) ==
                  std::u16string(before, u'b') + mapped.substr(1) + std::u16string(before, u'b'))
          << before;
    }
  }
}

TEST(ICUText, ALongTextOfSigmasAndIgnorableCharactersTakesTimeInProportion) {
  const auto measure = [](size_t length) {
    std::u16string text;
    while (text.size() < length) text += u"Σ''́";
    text += std::u16string(length, u'́');
    return processorSecondsOf([&] { EXPECT_GE(lowerCasedText(text).size(), length); });
  };
  EXPECT_TRUE(growsInProportion(measure, 200000));
}

}  // namespace
}  // namespace xquery

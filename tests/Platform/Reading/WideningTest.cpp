#include "Platform/Reading/VectorCode.h"

#include <gtest/gtest.h>

#include <memory>
#include <random>
#include <string>
#include <string_view>
#include <vector>

namespace xquery {
namespace {

using Way = Widened (*)(std::string_view, char16_t*);

// The text and the units in memory of just their sizes, for who watches the bounds.
std::u16string widenedAll(Way way, std::string_view text) {
  const std::unique_ptr<char[]> copy(new char[text.size()]);
  text.copy(copy.get(), text.size());
  const std::unique_ptr<char16_t[]> units(new char16_t[text.size()]);
  std::u16string all;
  for (size_t at = 0; at < text.size();) {
    const Widened some = way({copy.get() + at, text.size() - at}, units.get());
    if (!some.bytes) return u"none";
    EXPECT_LE(some.units, some.bytes);
    all.append(units.get(), some.units);
    at += some.bytes;
  }
  return all;
}

// Whatever vectors the processor has.
void expectAllAlike(const std::string& text) {
  static const std::vector<VectorCode> codes = vectorCodes();
  const std::u16string plain = widenedAll(widenSomePlainly, text);
  for (const VectorCode& code : codes) {
    EXPECT_EQ(widenedAll(code.widen, text), plain) << code.target << ": " << text;
  }
}

std::string encoded(char32_t point) {
  const auto byte = [](char32_t bits) { return static_cast<char>(bits); };
  const auto more = [=](unsigned shift) { return byte(0x80 | (point >> shift & 0x3F)); };
  if (point < 0x80) return {byte(point)};
  if (point < 0x800) return {byte(0xC0 | point >> 6), more(0)};
  if (point < 0x10000) return {byte(0xE0 | point >> 12), more(6), more(0)};
  return {byte(0xF0 | point >> 18), more(12), more(6), more(0)};
}

bool isCharacter(char32_t point) {
  return (point < 0xD800 || point > 0xDFFF) && point != 0xFFFE && point != 0xFFFF;
}

TEST(Widening, EveryCharacterInARow) {
  std::string text;
  for (char32_t point = 1; point < 0x110000; point += point < 0x11000 ? 1 : 257) {
    if (isCharacter(point)) text += encoded(point);
  }
  const std::u16string all = widenedAll(widenSome, text);
  EXPECT_EQ(all.front(), u'\1');
  EXPECT_GT(all.size(), 0x10000U);
  expectAllAlike(text);
}

// Of each length, so that every way in which a step may begin occurs.
TEST(Widening, CharactersInEveryOrderAndTextsOfEveryLength) {
  const std::string_view characters[] = {"a", "é", "€", "\U0001D11E"};
  std::mt19937 random(11);
  for (unsigned favourite = 0; favourite <= std::size(characters); ++favourite) {
    std::string text;
    for (unsigned count = 0; count < 150; ++count) {
      const size_t any = random() % std::size(characters);
      text += characters[favourite < std::size(characters) && random() % 8 ? favourite : any];
      expectAllAlike(text);
    }
  }
}

TEST(Widening, LongTextsAreWidenedInParts) {
  std::string text;
  while (text.size() < 5 * widenedAtOnce) text += "а€bé\U0001D11E ";
  std::u16string units(text.size(), u'\0');
  for (const VectorCode& code : vectorCodes()) {
    const Widened some = code.widen(text, units.data());
    EXPECT_GE(some.bytes, widenedAtOnce) << code.target;
    EXPECT_LE(some.bytes, widenedAtOnce + 64) << code.target;
  }
  expectAllAlike(text);
}

// Each character of a text lies across the end of a part once, and so does each fault.
TEST(Widening, APartEndsAnywhereInACharacter) {
  const std::string_view seams[] = {"a",        "é",    "€",    "\U0001D11E",   "\xC3",
                                    "\xE2\x82", "\xE2", "\xF0", "\xF0\x9F\x98", "\xF0\x9F"};
  for (const std::string_view seam : seams) {
    for (size_t before = 0; before < 8; ++before) {
      std::string text(widenedAtOnce + 64 - before, 'b');
      text += seam;
      for (const std::string_view behind : {"b", "é", "\x80"}) {
        expectAllAlike(text + std::string(behind) + std::string(70, 'b'));
        expectAllAlike(text + std::string(behind));
      }
    }
  }
}

// Texts of every mixture with a few bytes changed, most of which is no text any more.
TEST(Widening, ChangedTextsAreRefusedAlike) {
  const std::string_view characters[] = {"a", "é", "€", "\U0001D11E", "\uFFFD", "\uD7FF"};
  std::mt19937 random(12);
  unsigned refused = 0;
  for (unsigned count = 0; count < 4000; ++count) {
    std::string text;
    const size_t kinds = 1 + random() % std::size(characters);
    const size_t wanted = random() % 300;
    while (text.size() < wanted) text += characters[random() % kinds];
    for (size_t changes = text.empty() ? 0 : random() % 3; changes; --changes) {
      text[random() % text.size()] = static_cast<char>(random() % 4 ? 0x80 | random() : random());
    }
    refused += widenedAll(widenSomePlainly, text) == u"none";
    expectAllAlike(text);
  }
  EXPECT_GT(refused, 1000U);
  EXPECT_LT(refused, 3000U);
}

// Each pair of halves that the tables know, in the middle of a text and at its end.
TEST(Widening, WhatIsNoTextIsRefusedWhereverItStands) {
  constexpr unsigned char bytes[] = {0x00, 0x41, 0x7F, 0x80, 0x8F, 0x90, 0x9F, 0xA0, 0xBD, 0xBE,
                                     0xBF, 0xC0, 0xC1, 0xC2, 0xDF, 0xE0, 0xE1, 0xEC, 0xED, 0xEE,
                                     0xEF, 0xF0, 0xF1, 0xF3, 0xF4, 0xF5, 0xF7, 0xF8, 0xFD, 0xFF};
  const std::string around = "abcЖdefgжhijk€lmno";
  unsigned refused = 0;
  for (const unsigned char first : bytes) {
    for (const unsigned char second : bytes) {
      for (const unsigned char third : bytes) {
        std::string text = {static_cast<char>(first), static_cast<char>(second),
                            static_cast<char>(third)};
        text += static_cast<char>(0x80 + third % 0x40);
        const Widened plain = widenSomePlainly(text, std::u16string(4, u'\0').data());
        refused += plain.bytes < text.size();
        expectAllAlike(text);
        expectAllAlike(around + text + around + around + around + around);
      }
    }
  }
  EXPECT_GT(refused, 20000U);
}

TEST(Widening, AFaultIsFoundAtEveryPlace) {
  const std::string_view faults[] = {"\x80",         "\xC3",         "\xE2\x82",
                                     "\xF0\x9F\x98", "\xEF\xBF\xBE", "\xED\xA0\x80"};
  for (const std::string_view fault : faults) {
    for (const std::string_view around : {"a", "é", "€", "\U0001D11E"}) {
      std::string text;
      while (text.size() < 150) text += around;
      for (size_t at = 0; at <= text.size(); at += around.size()) {
        std::string changed = text;
        changed.insert(at, fault);
        EXPECT_EQ(widenedAll(widenSome, changed), u"none") << at;
        expectAllAlike(changed);
      }
    }
  }
}

}  // namespace
}  // namespace xquery

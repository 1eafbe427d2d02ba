// The forms of a profile, of counts that are known beforehand.
#include "Plan/Profile/ProfileNumbers.h"
#include "Plan/Profile/ProfileWriters.h"
#include "xquery/String.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <clocale>
#include <sstream>

namespace xquery {
namespace {

using testing::AllOf;
using testing::ElementsAre;
using testing::HasSubstr;
using testing::Not;
using testing::Pair;
using testing::StartsWith;

// --- texts ---------------------------------------------------------------------------------------

TEST(ProfileTexts, HaveNoCharactersThatSteer) {
  EXPECT_EQ(XQueryVisibleText("a\tb\x1b[0m\x7f"), "a\\u0009b\\u001B[0m\\u007F");
  EXPECT_EQ(XQueryVisibleText("\u0085\u061C\u200E\u200F\u2028\u202A\u202E\u2066\u2069\uFEFF"),
            "\\u0085\\u061C\\u200E\\u200F\\u2028\\u202A\\u202E\\u2066\\u2069\\uFEFF");
  EXPECT_EQ(XQueryVisibleText("\u00A0\u0600\u200D\u2030\u2065\u206A \U0001F600"),
            "\u00A0\u0600\u200D\u2030\u2065\u206A \U0001F600");
  EXPECT_EQ(XQueryVisibleText(std::string_view("a\0b", 3)), "a\\u0000b");
  EXPECT_EQ(XQueryVisibleText(""), "");
}

TEST(ProfileTexts, AreUTF8WhateverTheyWere) {
  EXPECT_EQ(XQueryVisibleText("a\xFF\xC3z"), "a\uFFFD\uFFFDz");
  EXPECT_EQ(XQueryProfileJSONString("\xC3"), "\"\uFFFD\"");
}

TEST(ProfileTexts, OfJSONMayStandInAScriptElement) {
  EXPECT_EQ(XQueryProfileJSONString("</script>&<!--"),
            "\"\\u003C/script\\u003E\\u0026\\u003C!--\"");
  EXPECT_EQ(XQueryProfileJSONString("\"\\\n\u2028"), "\"\\\"\\\\\\u000A\\u2028\"");
}

TEST(ProfileTexts, OfHTMLAreNoMarkup) {
  EXPECT_EQ(XQueryEscapedHTML("<a b=\"c\">&amp;\n"), "&lt;a b=&quot;c&quot;&gt;&amp;amp;\n");
}

// --- numbers -------------------------------------------------------------------------------------

TEST(ProfileNumbers, AreRoundedAndKeepTheirDecimals) {
  EXPECT_EQ(XQueryMilliseconds(0, 3), "0.000");
  EXPECT_EQ(XQueryMilliseconds(1, 6), "0.000001");
  EXPECT_EQ(XQueryMilliseconds(499, 3), "0.000");
  EXPECT_EQ(XQueryMilliseconds(500, 3), "0.001");
  EXPECT_EQ(XQueryMilliseconds(1'234'567'890, 3), "1234.568");
  EXPECT_EQ(XQueryMilliseconds(1'500'000, 0), "2");
  EXPECT_EQ(XQueryMilliseconds(-5, 3), "0.000");
  EXPECT_EQ(XQueryPercent(1, 3), "33.3");
  EXPECT_EQ(XQueryPercent(1, 0), "0.0");
  EXPECT_EQ(XQueryPercent(7, 7), "100.0");
}

TEST(ProfileNumbers, HaveAPointInEveryLocale) {
  const std::string before = std::setlocale(LC_ALL, nullptr);
  for (const char* name : {"de_DE.UTF-8", "fr_FR.UTF-8", "C.UTF-8"}) {
    std::setlocale(LC_ALL, name);
    EXPECT_EQ(XQueryMilliseconds(1'500'000, 3), "1.500") << name;
  }
  std::setlocale(LC_ALL, before.c_str());
}

// --- whole profiles ------------------------------------------------------------------------------

XQueryProfiledExpression expression(size_t depth, const char* role, const char* label, int64_t line,
                                    XQueryCounterID counter = XQueryNoCounter) {
  return {depth, role, label, {"", line}, {}, counter};
}

class ProfileForms : public testing::Test {
 protected:
  ProfileForms() {
    auto program = std::make_shared<XQueryProfiledProgram>();
    program->source = "for $a in //a\nreturn f(<b/>)";
    program->compiling = std::chrono::microseconds(1500);
    program->planning = std::chrono::microseconds(250);
    program->expressions = {
        expression(0, "function f#1", "if", 1, 0), expression(0, "query", "FLWOR", 1, 1),
        expression(1, "", "for $a in", 1),         expression(2, "", "//a", 1, 2),
        expression(1, "return", "f(...)", 2, 3),   expression(2, "", "$a/b", 0, 4)};
    program->expressions[3].notes = {{"walks", "goes <down>", false}, {"values", "no key", true}};
    program->expressions[4].place.module = "http://e/m\u202E.xq";
    program->expressions[5].mayBeInside = true;
    program->counted = {0, 1, 3, 4, 5};
    profile.program = program;
    XQueryProfileRecorder recorder(nullptr, 5);
    recorder.begin();
    const auto query = recorder.enter(1);
    recorder.leave(recorder.enter(2), 1200, false);
    for (int i = 0; i < 3; ++i) {
      const auto call = recorder.enter(3);
      const auto outer = recorder.enter(0);
      recorder.leave(recorder.enter(0), 1, i == 0);
      recorder.leave(outer, 1, false);
      recorder.leave(call, 1, false);
    }
    recorder.leave(query, 3, false);
    recorder.end();
    profile.counts.add(recorder.counts());
  }

  // The lines of the text without the columns of times.
  std::vector<std::string> lines() const {
    std::istringstream in(XQueryProfileText(profile, {}));
    std::vector<std::string> found;
    for (std::string line; std::getline(in, line);) found.push_back(line);
    return found;
  }

  XQueryProfileData profile{nullptr, XQueryProfileCounts(5)};
};

TEST_F(ProfileForms, OfTextAlignTheirColumns) {
  const std::vector<std::string> all = lines();
  const size_t at = all[3].find("expression");
  ASSERT_NE(at, std::string::npos) << all[3];
  EXPECT_EQ(all[3].substr(at - 14), "calls  items  expression");
  EXPECT_EQ(all[4].substr(at - 14),
            "    6      6  function f#1: if  (line 1)  1 failed"
            "  3 calls within itself, 2 deep");
  EXPECT_EQ(all[5].substr(at - 14), "    1      3  query: FLWOR  (line 1)");
  EXPECT_EQ(all[6].substr(at - 14), "                for $a in  (line 1)");
  EXPECT_EQ(all[7].substr(at - 14), "    1   1200      //a  (line 1)");
  EXPECT_EQ(all[8], std::string(at, ' ') + "      + walks: goes <down>");
  EXPECT_EQ(all[9], std::string(at, ' ') + "      - not values: no key");
  EXPECT_EQ(all[10].substr(at - 14),
            "    3      3    return: f(...)  (line 2 of http://e/m\\u202E.xq)");
  EXPECT_EQ(all[11].substr(at - 14), "    ~             $a/b");
  EXPECT_THAT(all.back(), StartsWith("~  never evaluated by itself"));
}

TEST_F(ProfileForms, OfTextBeginWithWhatIsKnown) {
  EXPECT_THAT(XQueryProfileText(profile, {}),
              StartsWith("1 evaluation\ncompiling 1.500 ms, planning 0.250 ms of it, evaluating "));
  XQueryProfileSurroundings all;
  all.name = "a\nb";
  all.reading = std::chrono::milliseconds(7);
  all.printing = std::chrono::milliseconds(8);
  all.inputs = 2;
  all.failures = 1;
  all.memoryPeak = 5 << 20;
  EXPECT_THAT(XQueryProfileText(profile, all),
              AllOf(StartsWith("a\\u000Ab: 1 evaluation for 2 inputs, 1 failed\n"
                               "reading 7.000 ms, compiling "),
                    HasSubstr(", printing 8.000 ms; at most 6 MiB\n")));
}

TEST_F(ProfileForms, OfJSONTellEverything) {
  XQueryProfileSurroundings surroundings;
  surroundings.name = "q.xq";
  surroundings.inputs = 4;
  const std::string json = XQueryProfileJSON(profile, surroundings);
  EXPECT_THAT(json, StartsWith("{\"evaluations\":1,\"name\":\"q.xq\",\"inputs\":4,"
                               "\"milliseconds\":{\"compiling\":1.500000,\"planning\":0.250000,"));
  EXPECT_THAT(json, HasSubstr("\"text\":\"for $a in //a\\u000Areturn f(\\u003Cb/\\u003E)\""));
  EXPECT_THAT(json,
              HasSubstr("\n{\"depth\":1,\"label\":\"for $a in\",\"line\":1,\"notes\":[]},\n"));
  EXPECT_THAT(json, HasSubstr("\"notes\":[{\"rule\":\"walks\",\"refused\":false,\"reason\":\"goes "
                              "\\u003Cdown\\u003E\"},{\"rule\":\"values\",\"refused\":true,"));
  EXPECT_THAT(json, HasSubstr(",\"calls\":1,\"items\":1200,\"failures\":0,\"total\":"));
  EXPECT_THAT(json, HasSubstr(",\"recursions\":3,\"deepest\":2}"));
  EXPECT_THAT(json, HasSubstr("\"calls\":0,\"inside\":true,\"items\":0"));
  EXPECT_THAT(json, HasSubstr("{\"expression\":0,\"parent\":3,\"calls\":6,\"items\":6,\"total\":"));
}

TEST_F(ProfileForms, OfAPageHoldTheProfileAndItsText) {
  XQueryProfileSurroundings surroundings;
  surroundings.name = "<b>\"q\"&";
  const std::string page = XQueryProfilePage(profile, surroundings);
  EXPECT_THAT(page, AllOf(StartsWith("<!doctype html>"),
                          HasSubstr("<title>Profile of &lt;b&gt;&quot;q&quot;&amp;</title>"),
                          HasSubstr(XQueryProfileJSON(profile, surroundings)),
                          HasSubstr("+ walks: goes &lt;down&gt;"), Not(HasSubstr("/*style*/")),
                          Not(HasSubstr("/*script*/")), Not(HasSubstr("<!--title-->"))));
}

TEST_F(ProfileForms, AreAlikeForAProgramOfNothing) {
  XQueryProfileData nothing{std::make_shared<XQueryProfiledProgram>(), XQueryProfileCounts(0)};
  EXPECT_THAT(XQueryProfileText(nothing, {}), StartsWith("0 evaluations\n"));
  EXPECT_THAT(XQueryProfileJSON(nothing, {}), HasSubstr("\"expressions\":[],\n\"calls\":[\n{"));
}

TEST(ProfileTotals, AreOwnTimesAndThoseBelow) {
  XQueryProfileRecorder recorder(nullptr, 3);
  recorder.begin();
  const auto a = recorder.enter(0);
  recorder.leave(recorder.enter(1), 1, false);
  recorder.leave(recorder.enter(2), 1, false);
  recorder.leave(a, 1, false);
  recorder.end();
  const auto& nodes = recorder.counts().nodes();
  const std::vector<int64_t> totals = XQueryProfileTotals(recorder.counts());
  EXPECT_THAT(totals,
              ElementsAre(recorder.counts().nanoseconds(),
                          nodes[1].own + nodes[2].own + nodes[3].own, nodes[2].own, nodes[3].own));
}

}  // namespace
}  // namespace xquery

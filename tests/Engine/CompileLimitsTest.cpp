// Compilations under limits of their own, and compilations that are part of an evaluation.
#include "Engine/LimitsTestSupport.h"
#include "Platform/Loading/HTTPServer.h"
#include "Platform/Text/TextTestSupport.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <string>

namespace xquery {
namespace {

using limitstest::Clock;
using limitstest::expectSoon;
using limitstest::milliseconds;
using limitstest::mostLate;
using limitstest::mostWait;
using limitstest::Outcome;
using limitstest::processorTime;

constexpr uint64_t MiB = 1024 * 1024;

// Queries whose compilation is a long pass of some kind.
struct LongText {
  const char* name;
  std::string (*text)(size_t length);
};

const LongText longTexts[] = {
    {"Operands", [](size_t length) { return "1" + repeated(",1", length / 2); }},
    {"Literal", [](size_t length) { return "'" + std::string(length, 'x') + "'"; }},
    {"WideLiteral", [](size_t length) { return "'" + repeated("\xC3\xA9", length / 2) + "'"; }},
    {"DoubledQuotes", [](size_t length) { return "'" + repeated("''", length / 2) + "'"; }},
    {"Name", [](size_t length) { return std::string(length, 'x'); }},
    {"NameOfOtherLetters", [](size_t length) { return repeated("\xC3\xA9", length / 2); }},
    {"Comment", [](size_t length) { return "1 (:" + std::string(length, '-') + ":)"; }},
    {"CommentAfterAName", [](size_t length) { return "element (:" + std::string(length, '-'); }},
    {"Pragma",
     [](size_t length) { return "1 (:: pragma p:p " + std::string(length, '-') + "::)"; }},
    {"Blanks", [](size_t length) { return std::string(length, ' ') + "1"; }},
    {"BlanksInAnInstruction",
     [](size_t length) { return "<?p " + std::string(length, ' ') + "?>"; }},
    {"LineFeedsBeforeAnError", [](size_t length) { return std::string(length, '\n') + "#"; }},
    {"CarriageReturnsBeforeAnError", [](size_t length) { return std::string(length, '\r') + "#"; }},
    {"Attributes",
     [](size_t length) {
       std::string text = "<a";
       for (int number = 0; text.size() < length; ++number)
         text += " a" + std::to_string(number) + "=''";
       return text + "/>";
     }},
    {"AttributeText", [](size_t length) { return "<a b='" + std::string(length, 'x') + "'/>"; }},
    {"ElementContent", [](size_t length) { return "<a>" + std::string(length, 'x') + "</a>"; }},
    {"Elements", [](size_t length) { return "<a>" + repeated("<b/>", length / 4) + "</a>"; }},
    {"NestedElements",
     [](size_t length) { return repeated("<a>", length / 7) + repeated("</a>", length / 7); }},
    {"Parentheses",
     [](size_t length) { return repeated("(", length / 2) + "1" + repeated(")", length / 2); }},
    {"OpenParentheses", [](size_t length) { return repeated("(", length); }},
    {"Steps", [](size_t length) { return "a" + repeated("/a", length / 2); }},
    {"Predicates", [](size_t length) { return "a" + repeated("[1]", length / 3); }},
    {"Conditionals",
     [](size_t length) { return repeated("if (1) then 2 else ", length / 19) + "3"; }},
    {"Variables",
     [](size_t length) {
       std::string text;
       for (int number = 0; text.size() < length; ++number) {
         text += "declare variable $v" + std::to_string(number) + " := 1;";
       }
       return text + "1";
     }},
    {"Calls",
     [](size_t length) {
       return "declare function local:f() { 1 }; local:f()" + repeated(",local:f()", length / 10);
     }},
    {"UnknownCalls", [](size_t length) { return "none()" + repeated(",none()", length / 7); }},
    {"Bindings", [](size_t length) { return repeated("for $x in 1 ", length / 12) + "return $x"; }},
};

class LongCompilation : public testing::TestWithParam<LongText> {};

// The text is so long that compiling it takes longer than the time that it gets.
TEST_P(LongCompilation, EndsAtItsDeadline) {
  const auto text = NSString::stringWithUTF8(GetParam().text(16 * MiB));
  XQueryLimits limits;
  limits.duration = milliseconds(5);
  const auto attempt = [&] {
    Outcome outcome;
    const auto start = processorTime(CLOCK_THREAD_CPUTIME_ID);
    {
      const auto query = XQuery::xqueryWithSource(text, {}, limits);
      if (const auto errors = query->parseErrors()) {
        outcome.error = cast<XQueryError>(errors->objectAtIndex(0))->msg()->utf8();
      }
    }
    outcome.lateProcessor = processorTime(CLOCK_THREAD_CPUTIME_ID) - start - milliseconds(5);
    return outcome;
  };
  expectSoon(attempt, "limit: deadline passed", &Outcome::lateProcessor, mostLate);
}

// One that fails does so as often as the evaluation is not ended.
TEST_P(LongCompilation, EndsWithTheEvaluationThatItIsPartOf) {
  const std::string text = GetParam().text(4 * MiB);
  const Value item = NSString::stringWithUTF8(text);
  const auto query =
      XQuery::xqueryWithSource("declare variable $text external; (1 to 1000)[ext:eval($text)]");
  const auto context = XQueryContext::xqueryContext();
  XQueryLimits limits;
  limits.duration = milliseconds(20);
  context->contextSetLimits(limits);
  const auto attempt = [&] {
    Outcome outcome;
    const auto start = processorTime(CLOCK_THREAD_CPUTIME_ID);
    Ref<XQueryError> error;
    EXPECT_FALSE(context->evaluateXQuery(*query, {{"text", item}}, nullptr, &error));
    if (error) outcome.error = error->msg()->utf8();
    outcome.lateProcessor = processorTime(CLOCK_THREAD_CPUTIME_ID) - start - milliseconds(20);
    return outcome;
  };
  expectSoon(attempt, "limit: deadline passed", &Outcome::lateProcessor, mostLate);
}

INSTANTIATE_TEST_SUITE_P(CompileLimits, LongCompilation, testing::ValuesIn(longTexts),
                         [](const auto& test) { return std::string(test.param.name); });

// Queries that are parsed soon and have so many parts beside each other that planning them takes
// many times as long.
const LongText longPlans[] = {
    {"Steps", [](size_t count) { return repeated("a//", count) + "a"; }},
    {"StepsWithPredicates", [](size_t count) { return repeated("a[b]//", count) + "a"; }},
    {"StepsThatAreExpressions", [](size_t count) { return repeated("a/(b)/", count) + "a"; }},
    {"PredicatesOfOneStep", [](size_t count) { return "a" + repeated("[b = 1]", count); }},
    {"Clauses", [](size_t count) { return repeated("let $x := a[b] ", count) + "return $x"; }},
    {"Conditions",
     [](size_t count) {
       return repeated("for $x in a[b] ", count) + "where 1" + repeated(" and $x/c = 1", count) +
              " return $x";
     }},
};

class LongPlanning : public testing::TestWithParam<LongText> {};

TEST_P(LongPlanning, EndsAtItsDeadline) {
  const auto text = NSString::stringWithUTF8(GetParam().text(20'000));
  const auto timeOf = [&](XQueryWay way, const XQueryLimits& limits) {
    const auto start = processorTime(CLOCK_THREAD_CPUTIME_ID);
    { const auto query = XQuery::xqueryWithSource(text, {}, limits, way); }
    return processorTime(CLOCK_THREAD_CPUTIME_ID) - start;
  };
  XQueryLimits limits;
  limits.duration = 2 * timeOf(XQueryWay::Plain, {}) + milliseconds(1);
  milliseconds taken = milliseconds::max();
  for (int times = 0; times < 3 && taken > *limits.duration + mostLate; ++times) {
    taken = std::min(taken, timeOf(XQueryWay::Planned, limits));
  }
  EXPECT_LE(taken, *limits.duration + mostLate);
}

INSTANTIATE_TEST_SUITE_P(CompileLimits, LongPlanning, testing::ValuesIn(longPlans),
                         [](const auto& test) { return std::string(test.param.name); });

std::string failureOf(const XQuery& query) {
  const auto errors = query.parseErrors();
  if (!errors) return "";
  const auto* error = cast<XQueryError>(errors->objectAtIndex(0));
  return std::to_string(error->err()) + " " + error->msg()->utf8();
}

std::string failureWithin(const XQueryLimits& limits, std::string_view text) {
  return failureOf(*XQuery::xqueryWithSource(text, XQueryLoading(), limits));
}

TEST(CompileLimits, AreNoneUnlessSet) {
  EXPECT_EQ(failureWithin({}, "1"), "");
  XQueryLimits limits;
  limits.duration = std::chrono::hours(1);
  limits.cancelled = std::make_shared<std::atomic<bool>>(false);
  limits.memoryCeiling = 64 * MiB;
  EXPECT_EQ(failureWithin(limits, "1"), "");
  EXPECT_EQ(failureWithin(limits, "1 +"), "3 parse error invalid token ()- 1 +");
  EXPECT_EQ(failureOf(*XQuery::xqueryWithSource(NSString::stringWithASCII("1"), {}, limits)), "");
}

TEST(CompileLimits, ThatAreReachedEndTheShortestCompilation) {
  XQueryLimits limits;
  limits.duration = milliseconds(0);
  EXPECT_EQ(failureWithin(limits, "1"), "0 limit: deadline passed");
  limits = {};
  limits.cancelled = std::make_shared<std::atomic<bool>>(true);
  EXPECT_EQ(failureWithin(limits, "1"), "0 limit: evaluation cancelled");
}

TEST(CompileLimits, AQueryThatReachedOneIsEvaluatedToItsError) {
  XQueryLimits limits;
  limits.duration = milliseconds(0);
  const auto query = XQuery::xqueryWithSource(std::string_view("1"), {}, limits);
  Ref<XQueryError> error;
  EXPECT_FALSE(XQueryContext::xqueryContext()->evaluateXQuery(*query, {}, nullptr, &error));
  ASSERT_TRUE(error);
  EXPECT_EQ(error->msg()->utf8(), "limit: deadline passed");
}

TEST(CompileLimits, DoNotHoldForTheEvaluation) {
  XQueryLimits limits;
  limits.cancelled = std::make_shared<std::atomic<bool>>(false);
  const auto query = XQuery::xqueryWithSource(std::string_view("1 + 1"), {}, limits);
  limits.cancelled->store(true);
  EXPECT_TRUE(XQueryContext::xqueryContext()->evaluateXQuery(*query, {}, nullptr));
}

TEST(CompileLimits, CountTheMemoryOfCompiling) {
  XQueryLimits limits;
  limits.memoryCeiling = 4 * MiB;
  for (const LongText& row : longTexts) {
    EXPECT_EQ(failureWithin(limits, row.text(3 * MiB)), "0 limit: memory ceiling reached")
        << row.name;
  }
}

// What is fetched has no deadline of its own here.
class CompileLimitsOfImports : public testing::Test {
 protected:
  Outcome importing(const XQueryLimits& limits, milliseconds duration) {
    std::string text;
    for (int number = 0; number < 10; ++number) {
      text += "import module namespace m" + std::to_string(number) + " = 'm" +
              std::to_string(number) + "' at '" + server.URL("/silent") + "?" +
              std::to_string(number) + "'; ";
    }
    Outcome outcome;
    const auto start = Clock::now();
    const auto query = XQuery::xqueryWithSource(text + "1", XQueryLoading(), limits);
    outcome.lateWall = std::chrono::duration_cast<milliseconds>(Clock::now() - start) - duration;
    outcome.error = failureOf(*query);
    return outcome;
  }
  HTTPServer server;
};

TEST_F(CompileLimitsOfImports, EndTheWaitForASlowServer) {
  server.handle("/silent?0", [](HTTPServer::Connection& connection) { connection.waitForEnd(); });
  XQueryLimits limits;
  limits.duration = milliseconds(60);
  const auto attempt = [&] { return importing(limits, milliseconds(60)); };
  expectSoon(attempt, "0 limit: deadline passed", &Outcome::lateWall, mostWait);
}

TEST_F(CompileLimitsOfImports, AFlagEndsTheWaitForASlowServer) {
  XQueryLimits limits;
  limits.cancelled = std::make_shared<std::atomic<bool>>(false);
  server.handle("/silent?0", [&](HTTPServer::Connection& connection) {
    limits.cancelled->store(true);
    connection.waitForEnd();
  });
  EXPECT_EQ(importing(limits, milliseconds(0)).error, "0 limit: evaluation cancelled");
}

// --- inner queries -------------------------------------------------------------------------------

std::string ceilingOn(std::string_view text, uint64_t ceiling) {
  const auto context = XQueryContext::xqueryContext();
  const Value item = NSString::stringWithUTF8(text);
  XQueryLimits limits;
  limits.memoryCeiling = ceiling;
  context->contextSetLimits(limits);
  const auto query =
      XQuery::xqueryWithSource("declare variable $text external; ext:eval($text)[2]");
  Ref<XQueryError> error;
  const auto items = context->evaluateXQuery(*query, {{"text", item}}, nullptr, &error);
  return error ? error->msg()->utf8() : items ? "a result" : "no value";
}

TEST(CompileLimits, OfAnInnerQueryAreThoseOfTheEvaluationAroundIt) {
  EXPECT_EQ(ceilingOn(std::string(8 * MiB, '\n') + "#", 64 * MiB),
            "invalid arguments to function - ext:eval");
  EXPECT_EQ(ceilingOn(std::string(8 * MiB, '\n') + "#", 12 * MiB), "limit: memory ceiling reached");
  EXPECT_EQ(ceilingOn(std::string(8 * MiB, '\n') + "1", 12 * MiB), "limit: memory ceiling reached");
  EXPECT_EQ(ceilingOn("1" + repeated(",1", MiB / 4), 4 * MiB), "limit: memory ceiling reached");
}

// --- no source -----------------------------------------------------------------------------------

TEST(CompileLimits, AQueryWithoutASourceIsAnError) {
  EXPECT_EQ(failureOf(*XQuery::xqueryWithSource(Ref<NSString>())), "3 there is no query text");
  EXPECT_EQ(failureOf(*XQuery::xqueryWithSource(Ref<NSString>(), XQueryLoading())),
            "3 there is no query text");
  EXPECT_EQ(failureOf(*XQuery::xqueryWithSource(std::string_view())), "");
  const auto root = NSXMLElement::elementWithName(NSStringView::ascii("a"));
  Ref<NSError> error;
  EXPECT_FALSE(root->objectsForXQuery(Ref<NSString>(), &error));
  ASSERT_TRUE(error);
  EXPECT_EQ(error->description()->utf8(), "XQueryError:3 - \"there is no query text\"");
}

}  // namespace
}  // namespace xquery

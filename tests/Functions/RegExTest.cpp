#include "Context/XQueryContextInternal.h"
#include "Functions/FunctionsTesting.h"
#include "Functions/RegEx.h"
#include "Functions/XQueryRegExCache.h"
#include "Platform/Base/ProcessorTime.h"

#include <gtest/gtest.h>

#include <chrono>
#include <string>

namespace xquery {
namespace {

using namespace functiontest;

TEST(RegExFunctions, RefuseOtherNumbersOfArguments) {
  EXPECT_EQ(refusedCounts(fn_matches, string("x")), "0 1 4 5");
  EXPECT_EQ(refusedCounts(fn_replace, untyped("x")), "0 1 2 5");
  EXPECT_EQ(refusedCounts(fn_tokenize, untyped("x")), "0 1 4 5");
}

TEST(RegExFunctions, FlagsAreTheLastArgument) {
  EXPECT_EQ(call(fn_matches, {string("abc"), string("B"), string("i")}), "true");
  EXPECT_EQ(call(fn_matches, {string("abc"), string("B")}), "false");
  EXPECT_EQ(call(fn_replace, {string("abc"), string("B"), string("x"), string("i")}),
            "untypedAtomic axc");
  EXPECT_EQ(call(fn_tokenize, {string("aXb"), string("x"), string("i")}),
            "(untypedAtomic a, untypedAtomic b)");
  EXPECT_EQ(call(fn_matches, {string("abc"), string("B"), empty()}), "false");
}

TEST(RegExFunctions, InvalidFlagsAndPatternsGiveNoValue) {
  EXPECT_EQ(call(fn_matches, {string("a"), string("a"), string("q")}), "null");
  EXPECT_EQ(call(fn_matches, {string("a"), string("(")}), "null");
  EXPECT_EQ(call(fn_replace, {string("a"), string("("), string("")}), "null");
  EXPECT_EQ(call(fn_replace, {string("a"), string("a"), string(""), string("q")}), "null");
  EXPECT_EQ(call(fn_tokenize, {string("a"), string("(")}), "null");
  EXPECT_EQ(call(fn_tokenize, {string("a"), string("a"), string("q")}), "null");
}

TEST(RegExFunctions, ArgumentsArePromotedToStrings) {
  EXPECT_EQ(call(fn_matches, {elementFrom("<a>x</a>"), untyped("x")}), "true");
  EXPECT_EQ(call(fn_matches, {empty(), string("^$")}), "true");
  EXPECT_EQ(call(fn_matches, {empty(), string("a")}), "false");
  EXPECT_EQ(call(fn_matches, {string("a"), empty()}), "true");
  EXPECT_EQ(call(fn_replace, {empty(), string("a"), string("b")}), "untypedAtomic ");
  EXPECT_EQ(call(fn_matches, {integer(1), string("1")}), "error 6 not a string type - 1");
  EXPECT_EQ(call(fn_matches, {string("1"), integer(1)}), "error 6 not a string type - 1");
  EXPECT_EQ(call(fn_matches, {string("1"), string("1"), integer(1)}),
            "error 6 not a string type - 1");
  EXPECT_EQ(call(fn_tokenize, {string(""), integer(1)}), "error 6 not a string type - 1");
}

TEST(RegExFunctions, TokenizingTheEmptyStringDoesNotLookAtThePattern) {
  EXPECT_EQ(call(fn_tokenize, {string(""), string(",")}), "string ");
  EXPECT_EQ(call(fn_tokenize, {empty(), string("(")}), "string ");
  EXPECT_EQ(call(fn_tokenize, {string(""), string("("), string("q")}), "string ");
}

TEST(RegExFunctions, AMissingValueIsErrorSeventeen) {
  EXPECT_EQ(answer("matches('a', 'a', 'q')"),
            "error 17 line 1 invalid arguments to function - matches");
  EXPECT_EQ(answer("replace('a', 'a', '\\')"),
            "error 17 line 1 invalid arguments to function - replace");
  EXPECT_EQ(answer("fn:tokenize('abc', 'x*')"),
            "error 17 line 1 invalid arguments to function - fn:tokenize");
}

TEST(RegExFunctions, ALoopCompilesItsPatternOnce) {
  const auto query = XQuery::xqueryWithSource(
      "for $i in 1 to 100 return matches(string($i), '^[0-9]+$'), replace('a', 'b', 'c')");
  const auto context = XQueryContext::xqueryContext();
  Ref<XQueryError> error;
  ASSERT_TRUE(context->evaluateXQuery(*query, {}, Value(), &error));
  EXPECT_EQ(_internal(*context).regExCache()->count(), 2U);
}

TEST(RegExFunctions, ARunawayPatternIsGivenUpSoon) {
  const std::string text = "'aaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaab'";
  const double start = processorSeconds();
  EXPECT_EQ(answer("matches(" + text + ", '(a+)+$')"), "false");
  EXPECT_LT(processorSeconds() - start, 10);
  EXPECT_EQ(answer("replace(" + text + ", '(a+)+$', '')"),
            "error 17 line 1 invalid arguments to function - replace");
  EXPECT_EQ(answer("tokenize(" + text + ", '(a+)+$')"),
            "error 17 line 1 invalid arguments to function - tokenize");
}

std::string limited(const std::string& source, XQueryLimits limits) {
  const auto query = XQuery::xqueryWithSource(source);
  const auto context = XQueryContext::xqueryContext();
  context->contextSetLimits(std::move(limits));
  Ref<XQueryError> error;
  const auto items = context->evaluateXQuery(*query, {}, Value(), &error);
  return error ? error->msg()->utf8() : "no error";
}

TEST(RegExFunctions, ADeadlineEndsAMatch) {
  XQueryLimits limits;
  limits.duration = std::chrono::milliseconds(20);
  EXPECT_EQ(
      limited("matches('aaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaab', '(a+)+$')", limits),
      "limit: deadline passed");
}

TEST(RegExFunctions, AMemoryCeilingEndsAReplacement) {
  XQueryLimits limits;
  limits.memoryCeiling = 50'000'000;
  // A hundred thousand times a hundred thousand.
  EXPECT_EQ(
      limited("declare function local:times($s, $n) {"
              " if ($n = 0) then $s else local:times(replace($s, '.', '$0$0$0$0$0$0$0$0$0$0'),"
              " $n - 1) };"
              " replace(local:times('a', 5), 'a', local:times('b', 5))",
              limits),
      "limit: memory ceiling reached");
}

}  // namespace
}  // namespace xquery

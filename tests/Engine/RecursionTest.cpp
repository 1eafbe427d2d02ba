// Recursion through every kind of expression: how an error, a limit and the end of the stack leave
// it, and what that costs.
#include "Engine/LimitsTestSupport.h"
#include "Platform/Base/ProcessorTime.h"
#include "Platform/Base/StackTestSupport.h"

namespace xquery {
namespace {

using namespace limitstest;

constexpr const char* tooDeep = "limit: expression nested too deeply";
constexpr size_t kibibyte = 1024;
constexpr size_t mebibyte = 1024 * kibibyte;

// AddressSanitizer takes an exception on a stack of more than 64 MiB for a mistake of the program,
// and needs more of the stack for each level.
#ifdef XQUERY_SANITIZED
constexpr size_t roomyStack = 60 * mebibyte;
constexpr int64_t depthOfErrors = 1000;
constexpr int64_t depthOfLimits = 1000;
#else
constexpr size_t roomyStack = 256 * mebibyte;
constexpr int64_t depthOfErrors = 4000;
constexpr int64_t depthOfLimits = 20000;
#endif

// Of processor time, for the deepest recursion there is; of what is built for use.
#if defined(XQUERY_SANITIZED) || !defined(NDEBUG)
constexpr double mostSeconds = 10;
constexpr size_t largeStack = roomyStack;
#else
constexpr double mostSeconds = 1;
constexpr size_t largeStack = 1024 * mebibyte;
#endif

struct Way {
  const char* name;
  const char* body;  // of the function, where "%" is the call of itself
};

constexpr Way ways[] = {
    {"Plain", "1 + %"},
    {"Tail", "%"},
    {"Sequence", "(1, %)[1]"},
    {"List", "subsequence((1, %), 1, 2)"},
    {"Argument", "count((1, %))"},
    {"ManyArguments", "concat('', '', '', '', %)"},
    {"OwnArgument", "local:same(%)"},
    {"Comparison", "if (% = 1) then 1 else 1"},
    {"Range", "count(1 to %)"},
    {"And", "1 = 1 and %"},
    {"Condition", "if (%) then 1 else 1"},
    {"For", "for $x in % return 1"},
    {"Return", "for $x in (1, 2)[1] return %"},
    {"Where", "for $x in 1 where % return 1"},
    {"Order", "for $x in 1 order by % return 1"},
    {"Let", "let $x := % return $x"},
    {"Quantifier", "some $x in 1 satisfies %"},
    {"Typeswitch", "typeswitch (%) case xs:string return 1 default return 1"},
    {"Instance", "% instance of xs:integer"},
    {"Cast", "% cast as xs:string"},
    {"Element", "<a>{ % }</a>"},
    {"Nested", "<a><b>{ % }</b></a>"},
    {"Attribute", "<a b='{ % }'/>"},
    {"Text", "text { % }"},
    {"Ordering", "unordered { % }"},
    {"Filter", "(<a/>/string(%))"},
    {"Steps", "(<a><b/></a>/b/string(%))"},
    {"Name", "name(element { concat('a', string(empty((%)))) } {})"},
};

// Of a function that calls itself so many times and then comes to what the bottom says.
std::string query(const Way& way, int64_t depth, const std::string& bottom) {
  std::string body = way.body;
  body.replace(body.find('%'), 1, "local:f($n - 1)");
  return "declare function local:same($x) { $x }; declare function local:f($n) { if ($n = 0) "
         "then " +
         bottom + " else " + body + " }; string(count((local:f(" + std::to_string(depth) + "))))";
}

class Recursion : public testing::TestWithParam<Way> {};

TEST_P(Recursion, AnErrorLeavesItAsFastAsAValue) {
  constexpr double most = 4;
  const Way way = GetParam();
  onStack(roomyStack, [&] {
    const auto context = XQueryContext::xqueryContext();
    double factor = 1e9;
    for (int turn = 0; turn < 5 && factor > most; ++turn) {
      Outcome answered;
      const double normal = processorSecondsOf(
          [&] { answered = evaluate(*context, query(way, depthOfErrors, "1")); });
      ASSERT_EQ(answered.error, "");
      Outcome failed;
      const double failing = processorSecondsOf(
          [&] { failed = evaluate(*context, query(way, depthOfErrors, "$undefined")); });
      ASSERT_EQ(failed.error, "reference to undefined variable \"undefined\"");
      factor = std::min(factor, failing / normal);
    }
    EXPECT_LE(factor, most);
  });
}

TEST_P(Recursion, WithoutEndIsAnErrorOnAStackOfAnySize) {
  for (const size_t size : {64 * kibibyte, 160 * kibibyte, mebibyte, 8 * mebibyte}) {
    onStack(size, [&] {
      const auto context = XQueryContext::xqueryContext();
      EXPECT_EQ(evaluate(*context, query(GetParam(), -1, "1")).error, tooDeep) << size;
      EXPECT_EQ(evaluate(*context, "1 + 1").result, "2");
    });
  }
}

INSTANTIATE_TEST_SUITE_P(Ways, Recursion, testing::ValuesIn(ways),
                         [](const auto& instance) { return instance.param.name; });

// What a stack can hold is left within a fraction of the tenth of a second that a limit has.
TEST(DeepRecursion, WithoutEndEndsSoonOnALargeStack) {
  for (const char* body : {"1 + local:f($n + 1)", "local:f($n)", "(1)[local:f($n)]",
                           "for $x in 1 return <a>{ local:f($n) }</a>"}) {
    for (const size_t size : {roomyStack / 4, largeStack}) {
      onStack(size, [&] {
        const auto context = XQueryContext::xqueryContext();
        const std::string text =
            std::string("declare function local:f($n) { ") + body + " }; local:f(0)";
        double least = 1e9;
        for (int turn = 0; turn < 3 && least > mostSeconds; ++turn) {
          least = std::min(least, processorSecondsOf(
                                      [&] { EXPECT_EQ(evaluate(*context, text).error, tooDeep); }));
        }
        EXPECT_LE(least, mostSeconds) << body << " " << size;
      });
    }
  }
}

// The depth is reached well before the limit, and work at the bottom lasts until then.
std::string busyAtTheBottom(const std::string& body, int64_t depth) {
  return "declare function local:f($n) { if ($n = 0) then count(for $i in 1 to 1000000, $j in 1 to "
         "1000000 "
         "return ()) else " +
         body + " }; local:f(" + std::to_string(depth) + ")";
}

TEST(DeepRecursion, IsEndedByADeadlineAtOnce) {
  for (const char* body : {"1 + local:f($n - 1)", "(1)[local:f($n - 1)]",
                           "let $x := ($n, 'a') return <a>{ local:f($n - 1) }</a>"}) {
    onStack(roomyStack, [&] {
      const auto context = XQueryContext::xqueryContext();
      expectSoon(
          [&] {
            return endedAfter(milliseconds(400), *context, busyAtTheBottom(body, depthOfLimits));
          },
          "limit: deadline passed", &Outcome::lateProcessor, mostLate);
    });
  }
}

TEST(DeepRecursion, IsEndedByAFlagAtOnce) {
  onStack(roomyStack, [&] {
    const auto context = XQueryContext::xqueryContext();
    expectSoon(
        [&] {
          return cancelledAfter(milliseconds(400), *context,
                                busyAtTheBottom("1 + local:f($n - 1)", depthOfLimits));
        },
        "limit: evaluation cancelled", &Outcome::lateProcessor, mostLate);
  });
}

TEST(DeepRecursion, IsEndedByAMemoryCeiling) {
  onStack(roomyStack, [&] {
    const auto context = XQueryContext::xqueryContext();
    XQueryLimits limits;
    limits.memoryCeiling = roomyStack / 128;
    context->contextSetLimits(limits);
    for (const char* body : {"1 + local:f($n + 1)", "(1)[local:f($n)]", "<a>{ local:f($n) }</a>"}) {
      const std::string text =
          std::string("declare function local:f($n) { ") + body + " }; local:f(0)";
      EXPECT_EQ(evaluate(*context, text).error, "limit: memory ceiling reached") << body;
    }
  });
}

}  // namespace
}  // namespace xquery

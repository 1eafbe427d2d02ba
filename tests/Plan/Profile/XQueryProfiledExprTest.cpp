// How often each expression ran and what it gave, and that counting changes nothing else.
#include "Plan/Profile/ProfileTesting.h"

#include <gmock/gmock.h>

#include <chrono>
#include <memory>
#include <thread>

namespace xquery {
namespace {

using namespace plantest;
using testing::ElementsAre;
using testing::IsEmpty;
using testing::IsSupersetOf;

const char* const document = "<r><a n='1'><b/><b/></a><a n='2'><b/></a><a n='3'/></r>";

struct Row {
  const char* query;
  std::vector<std::string> lines;
};

TEST(ProfiledExpressions, AreCountedAsTheyRun) {
  const AsWritten asWritten;
  const Row rows[] = {
      {"1 + 2", {"query: + 1/1"}},
      {"count(//a)", {"query: count(...) 1/1", "//a 1/3"}},
      {"for $a in //a return count($a/b)",
       {"query: FLWOR 1/3", "//a 1/3", "return: count(...) 3/3", "$a/b 3/3"}},
      {"for $a in //a where $a/@n > 1 return name($a)",
       {"query: FLWOR 1/2", "//a 1/3", "where: > 3/3", "$a/@n 3/3", "return: name(...) 2/2"}},
      {"(//b, //a)", {"query: list 1/6", "//b 1/3", "//a 1/3"}},
      {"if (//b) then name(/*) else count(//a)",
       {"query: if 1/1", "test: //b 1/3", "name(...) 1/1", "/* 1/1", "count(...) 0/0", "//a 0/0"}},
      {"some $b in //b satisfies count($b/..) = 1",
       {"query: some 1/1", "//b 1/3", "satisfies: = 1/1", "count(...) 1/1", "$b/.. 1/1"}},
      {"//a[count(b) > 1]", {"query: //a[...] 1/1", "predicate: > 3/3", "count(...) 3/3", "b 3/3"}},
      {"let $x := //a return ($x, $x)", {"query: FLWOR 1/6", "//a 1/3", "return: list 1/6"}},
      {"<x>{ //b }</x>", {"query: element x 1/1", "//b 1/3"}},
      {"for $i in 1 to 1000 return $i + 1", {"query: FLWOR 1/1000", "return: + 1000/1000"}},
      {"count(//a) + count(//b) + 1",
       {"query: + 1/1", "count(...) 1/1", "//a 1/3", "count(...) 1/1", "//b 1/3"}},
  };
  for (const Row& row : rows) {
    const Profiled profiled(row.query, documentOf(document));
    EXPECT_FALSE(profiled.error) << row.query;
    EXPECT_EQ(profiled.lines(), row.lines) << row.query;
  }
}

TEST(ProfiledExpressions, OfAPlanCountWhatItsOperatorsLeaveToThem) {
  const Profiled profiled("for $a in //a return count($a/b)", documentOf(document));
  EXPECT_THAT(profiled.lines(),
              IsSupersetOf({"query: FLWOR 1/3", "//a 1/3", "return: count(...) 3/3", "$a/b 0/0"}));
  for (const XQueryProfiledExpression& each : profiled.program().expressions) {
    EXPECT_EQ(each.mayBeInside, each.label == "$a/b") << each.label;
  }
}

TEST(ProfiledExpressions, OfFunctionsAreCalledByTheirNames) {
  const Profiled profiled(
      "declare function local:f($n) { if ($n = 0) then 0 else $n + local:f($n - 1) };\n"
      "local:f(10)");
  const auto* function = profiled.counter("function local:f#1: if");
  ASSERT_TRUE(function);
  EXPECT_EQ(function->calls, 11u);
  EXPECT_EQ(function->recursions, 10u);
  EXPECT_EQ(function->deepest, 11u);
  EXPECT_EQ(profiled.counter("query: local:f(...)")->calls, 1u);
  EXPECT_EQ(profiled.counter("+")->calls, 10u);
}

// Where a function of the plan stands for the call, the body is not there any more.
TEST(ProfiledExpressions, OfFunctionsAndVariablesOfOtherModulesHaveTheirModule) {
  XQueryLoading loading;
  class Loader : public XQueryLoader {
   public:
    std::optional<XQueryResource> load(const NSURL&, XQueryLoadPurpose) override {
      return XQueryResource{
          "module namespace m = 'm';\n"
          "declare variable $m:v := count((1 to 5));\n"
          "declare function m:f($x) {\n reverse($x) };",
          {},
          {},
          {}};
    }
  };
  loading.loader = std::make_shared<Loader>();
  const auto query = XQuery::xqueryWithSource(
      "import module namespace m = 'm' at 'http://e/m.xq';\nm:f(($m:v, 2))", loading,
      XQueryLimits(), XQueryWay::Profiled);
  ASSERT_FALSE(query->parseErrors());
  const auto context = XQueryContext::xqueryContext();
  ASSERT_EQ(context->evaluateXQuery(*query, {}, nullptr)->count(), 2u);
  std::vector<std::string> places;
  for (const auto& each : _internal(*query).profiledProgram()->expressions) {
    if (each.depth > 0) continue;
    places.push_back(each.role + " " + each.place.module + ":" + std::to_string(each.place.line));
  }
  EXPECT_THAT(places, ElementsAre("variable $m:v http://e/m.xq:2", "function m:f#1 http://e/m.xq:4",
                                  "query :2"));
  for (const auto& counter : _internal(*context).profile()->counts().counters()) {
    EXPECT_EQ(counter.calls, 1u);
  }
}

// In characters, whatever those before them are made of.
TEST(ProfiledExpressions, KnowWhichTextTheyStandFor) {
  const auto query = XQuery::xqueryWithSource(
      "\xEF\xBB\xBF"
      "for $x in ('😀é', 'b')\r\nwhere $x ne\n  'c'\nreturn upper-case($x)",
      XQueryLoading(), XQueryLimits(), XQueryWay::Profiled);
  ASSERT_FALSE(query->parseErrors());
  std::vector<std::string> places;
  for (const auto& each : _internal(*query).profiledProgram()->expressions) {
    places.push_back(each.label + " " + std::to_string(each.place.line) + ":" +
                     std::to_string(each.place.column) + "+" + std::to_string(each.place.length));
  }
  EXPECT_THAT(places, ElementsAre("FLWOR 1:1+61", "for $x in 1:6+16", "list 1:12+9", "ne 2:7+11",
                                  "upper-case(...) 4:8+14"));
}

TEST(ProfiledExpressions, ThatFailAreCounted) {
  const AsWritten asWritten;
  const Profiled profiled("for $i in (1, 0, 2) return 6 idiv $i");
  ASSERT_TRUE(profiled.error);
  EXPECT_EQ(profiled.counter("return: idiv")->calls, 2u);
  EXPECT_EQ(profiled.counter("return: idiv")->failures, 1u);
  EXPECT_EQ(profiled.counter("return: idiv")->items, 1u);
  EXPECT_EQ(profiled.counter("query: FLWOR")->failures, 1u);
  // A predicate that fails drops its item, and the path goes on.
  const Profiled passed("//a[1 idiv (@n - 2)]", documentOf("<r><a n='1'/><a n='2'/></r>"));
  EXPECT_FALSE(passed.error);
  EXPECT_EQ(passed.counter("predicate: idiv")->failures, 1u);
  EXPECT_EQ(passed.counter("query: //a[...]")->failures, 0u);
}

TEST(ProfiledExpressions, AddUpOverEvaluationsOfOneContext) {
  Profiled profiled("count((1, 2, 3))");
  profiled.evaluate();
  profiled.evaluate();
  EXPECT_EQ(profiled.counts().evaluations(), 3u);
  EXPECT_EQ(profiled.counter("query: count(...)")->calls, 3u);
}

TEST(ProfiledExpressions, OfAnotherQueryBeginAnew) {
  Profiled first("count((1, 2))");
  const auto second = compiled("count((1, 2, 3)), 1", XQueryWay::Profiled);
  ASSERT_TRUE(first.context->evaluateXQuery(*second, {}, nullptr));
  EXPECT_EQ(first.counts().evaluations(), 1u);
  EXPECT_EQ(_internal(*first.context).profile()->program(), _internal(*second).profiledProgram());
}

TEST(ProfiledExpressions, CostNothingWhereNobodyAsks) {
  const auto query = compiled("for $a in //a return count($a/b)", XQueryWay::Planned);
  EXPECT_FALSE(_internal(*query).profiledProgram());
  const auto context = XQueryContext::xqueryContext();
  ASSERT_TRUE(context->evaluateXQuery(*query, {}, documentOf(document)));
  EXPECT_FALSE(_internal(*context).profile());
}

// --- nothing else changes ------------------------------------------------------------------------

TEST(ProfiledExpressions, LeaveRangesAsLongAsTheyAre) {
  for (const char* text : {"5 = 1 to 4000000000000", "5 = (1 to 4000000000000)",
                           "some $i in 1 to 40000000 satisfies $i = 7"}) {
    XQueryLimits limits;
    limits.memoryCeiling = 64 << 20;
    const Profiled profiled(text, nullptr, limits);
    EXPECT_FALSE(profiled.error) << text;
  }
}

TEST(ProfiledExpressions, LeaveChainsOfOperatorsAsLongAsTheyAre) {
  std::string chain = "1";
  for (int i = 0; i < 200'000; ++i) chain += " + 1";
  const Profiled profiled(chain);
  ASSERT_FALSE(profiled.error);
  EXPECT_EQ(XQueryItemStringValue(*profiled.items->objectAtIndex(0)), "200001");
}

TEST(ProfiledExpressions, NestAsDeepAsTheStackIsAndEndInItsError) {
  const Profiled profiled("declare function local:f($n) { 1 + local:f($n) }; local:f(1)");
  ASSERT_TRUE(profiled.error);
  EXPECT_EQ(profiled.error->msg()->utf8(), "limit: expression nested too deeply");
  const auto* function = profiled.counter("function local:f#1: +");
  EXPECT_GT(function->deepest, 1000u);
  EXPECT_EQ(function->failures, function->calls);
}

TEST(ProfiledExpressions, EndAtADeadlineHoweverDeepTheyAre) {
  XQueryLimits limits;
  limits.duration = std::chrono::milliseconds(200);
  limits.memoryCeiling = 256 << 20;
  const auto start = std::chrono::steady_clock::now();
  const Profiled profiled(
      "declare function local:f($n) { if ($n > 500) then local:g(90) else 1 + local:f($n + 1) };\n"
      "declare function local:g($n) { if ($n < 2) then 1 else local:g($n - 1) + local:g($n - 2) "
      "};\n"
      "local:f(1)",
      nullptr, limits);
  ASSERT_TRUE(profiled.error);
  EXPECT_EQ(profiled.error->msg()->utf8(), "limit: deadline passed");
  EXPECT_LT(std::chrono::steady_clock::now() - start, std::chrono::seconds(3));
  EXPECT_EQ(profiled.counter("function local:f#1: if")->failures, 501u);
  EXPECT_GT(profiled.counter("function local:g#1: if")->deepest, 50u);
  EXPECT_GE(profiled.counts().nanoseconds(), 190'000'000);
}

// Time is given to somebody, and to nobody twice.
TEST(ProfiledExpressions, HaveTimesThatAddUp) {
  const Profiled profiled("for $a in //a return sum(for $i in 1 to 2000 return $i * 2)",
                          documentOf(document));
  int64_t own = 0;
  for (const XQueryProfileCounter& counter : profiled.counts().counters()) {
    EXPECT_GE(counter.total, counter.own);
    EXPECT_LE(counter.total, profiled.counts().nanoseconds());
    own += counter.own;
  }
  EXPECT_LE(own, profiled.counts().nanoseconds());
  EXPECT_GT(own, profiled.counts().nanoseconds() / 4);
  EXPECT_EQ(profiled.counter("return: *")->calls, 6000u);
}

TEST(ProfiledExpressions, OfOneQueryAreCountedByThreadsApart) {
  const auto query = compiled("count(for $i in 1 to 1000 return $i * $i)", XQueryWay::Profiled);
  XQueryProfile sum(*query);
  std::vector<Ref<XQueryContext>> contexts;
  for (int i = 0; i < 4; ++i) contexts.push_back(XQueryContext::xqueryContext());
  std::vector<std::thread> threads;
  for (const auto& context : contexts) {
    threads.emplace_back([&] {
      for (int turn = 0; turn < 20; ++turn) {
        (void)context->evaluateXQuery(*query, {}, nullptr);
      }
    });
  }
  for (std::thread& thread : threads) thread.join();
  for (const auto& context : contexts) EXPECT_TRUE(sum.add(*context));
  EXPECT_EQ(sum.evaluations(), 80u);
  EXPECT_NE(sum.describe(XQueryProfileFormat::JSON).find("\"calls\":80000,"), std::string::npos);
}

}  // namespace
}  // namespace xquery

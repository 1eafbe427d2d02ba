// Evaluations inside an evaluation: a client of the host begins them on the same thread.
#include "Context/LimitWatch.h"
#include "Engine/LimitsTestSupport.h"
#include "Platform/Loading/HTTPServer.h"

#include <gtest/gtest.h>

#include <functional>
#include <memory>
#include <string>

namespace xquery {
namespace {

using limitstest::evaluate;
using limitstest::Outcome;
using std::chrono::milliseconds;

constexpr const char* endless = "for $i in 1 to 1000000, $j in 1 to 1000000 where $i < 0 return 1";
constexpr const char* explosion = "(1 to 20000000, 1)";
constexpr uint64_t MiB = uint64_t{1} << 20;

// Does something when a query calls trace.
class Client : public XQueryClient {
 public:
  explicit Client(std::function<void(XQueryContext&)> act) : _act(std::move(act)) {}
  void XQueryClientTraceValue(const Value&, const Ref<NSString>&, XQueryContext& context) override {
    _act(context);
  }

 private:
  std::function<void(XQueryContext&)> _act;
};

class LimitWatch : public testing::Test {
 protected:
  // Evaluates a query that calls back under the outer limits.
  Outcome evaluateOuter(std::function<void(XQueryContext&)> act,
                        const std::string& query = "trace(1, 'label') + 1") {
    context->contextSetClient(std::make_shared<Client>(std::move(act)));
    context->contextSetLimits(outerLimits);
    return evaluate(*context, query);
  }
  // The callback: evaluates the query in a context of its own under the inner limits.
  std::function<void(XQueryContext&)> evaluating(const std::string& query) {
    return [this, query](XQueryContext& outer) {
      const auto nested = XQueryNestedContext(outer);
      nested->contextSetLimits(innerLimits);
      inner = evaluate(*nested, query);
    };
  }

  const Ref<XQuery> tracing = XQuery::xqueryWithSource("trace(1, 'label')");
  XQueryLimits outerLimits;
  XQueryLimits innerLimits;
  Outcome inner;
  Ref<XQueryContext> context = XQueryContext::xqueryContext();
};

TEST_F(LimitWatch, AnInnerEvaluationEndsAtTheDeadlineOfTheOuterOne) {
  outerLimits.duration = milliseconds(30);
  const Outcome outer = evaluateOuter(evaluating(endless));
  EXPECT_EQ(inner.error, "limit: deadline passed");
  EXPECT_EQ(outer.error, "limit: deadline passed");
}

TEST_F(LimitWatch, AnInnerEvaluationEndsAtTheFlagOfTheOuterOne) {
  outerLimits.cancelled = std::make_shared<std::atomic<bool>>(false);
  const Outcome outer = evaluateOuter([&](XQueryContext& its) {
    outerLimits.cancelled->store(true);
    evaluating(endless)(its);
    // It was raised, so the outer evaluation ends whatever becomes of the flag.
    outerLimits.cancelled->store(false);
  });
  EXPECT_EQ(inner.error, "limit: evaluation cancelled");
  EXPECT_EQ(outer.error, "limit: evaluation cancelled");
}

TEST_F(LimitWatch, AnInnerEvaluationHasTheMemoryThatIsLeftOfTheOuterOne) {
  outerLimits.memoryCeiling = 8 * MiB;
  for (const char* query : {explosion, "for $i in 1 to 20000000 return $i + 1"}) {
    const Outcome outer = evaluateOuter(evaluating(query));
    EXPECT_EQ(inner.error, "limit: memory ceiling reached");
    EXPECT_EQ(outer.error, "limit: memory ceiling reached");
  }
  innerLimits.memoryCeiling = 800 * MiB;
  EXPECT_EQ(evaluateOuter(evaluating(explosion)).error, "limit: memory ceiling reached");
  EXPECT_EQ(inner.error, "limit: memory ceiling reached");
}

TEST_F(LimitWatch, AnInnerLimitEndsTheInnerEvaluationOnly) {
  outerLimits.duration = std::chrono::seconds(60);
  outerLimits.memoryCeiling = 800 * MiB;
  innerLimits.duration = milliseconds(20);
  EXPECT_EQ(evaluateOuter(evaluating(endless)).result, "2");
  EXPECT_EQ(inner.error, "limit: deadline passed");
  innerLimits = {};
  innerLimits.memoryCeiling = 4 * MiB;
  EXPECT_EQ(evaluateOuter(evaluating(explosion)).result, "2");
  EXPECT_EQ(inner.error, "limit: memory ceiling reached");
  innerLimits = {};
  innerLimits.cancelled = std::make_shared<std::atomic<bool>>(true);
  EXPECT_EQ(evaluateOuter(evaluating("1")).result, "2");
  EXPECT_EQ(inner.error, "limit: evaluation cancelled");
}

TEST_F(LimitWatch, WithoutLimitsInnerAndOuterEvaluationsGoOn) {
  EXPECT_EQ(evaluateOuter(evaluating("count((1 to 300000, 1))")).result, "2");
  EXPECT_EQ(inner.result, "300001");
}

TEST_F(LimitWatch, OuterLimitsHoldTwoLevelsDown) {
  outerLimits.duration = milliseconds(30);
  Outcome middle;
  const Outcome outer = evaluateOuter([&](XQueryContext& its) {
    const auto nested = XQueryNestedContext(its);
    nested->contextSetClient(std::make_shared<Client>(evaluating(endless)));
    middle = evaluate(*nested, "trace(1, 'label')");
  });
  EXPECT_EQ(inner.error, "limit: deadline passed");
  EXPECT_EQ(middle.error, "limit: deadline passed");
  EXPECT_EQ(outer.error, "limit: deadline passed");
}

TEST_F(LimitWatch, AfterTheOuterEvaluationItsLimitsHoldNoMore) {
  outerLimits.duration = milliseconds(10);
  EXPECT_EQ(evaluateOuter(evaluating(endless)).error, "limit: deadline passed");
  EXPECT_EQ(evaluate(*XQueryContext::xqueryContext(), "count((1 to 300000, 1))").result, "300001");
}

TEST_F(LimitWatch, CompilingInsideAnEvaluationEndsItAtTheLimit) {
  std::string longQuery = "1";
  for (int times = 0; times < 2000000; ++times) longQuery += ",1";
  outerLimits.duration = milliseconds(30);
  for (const std::string& text : {longQuery, "'" + std::string(4000000, 'x') + "'"}) {
    const auto compiling = [&] {
      const auto start = limitstest::processorTime(CLOCK_THREAD_CPUTIME_ID);
      Outcome outer = evaluateOuter([&](XQueryContext&) {
        while (true) static_cast<void>(XQuery::xqueryWithSource(text));
      });
      outer.lateProcessor =
          limitstest::processorTime(CLOCK_THREAD_CPUTIME_ID) - start - milliseconds(30);
      return outer;
    };
    limitstest::expectSoon(compiling, "limit: deadline passed", &Outcome::lateProcessor,
                           limitstest::mostLate);
  }
  EXPECT_EQ(evaluate(*XQueryContext::xqueryContext(), "1 + 1").result, "2");
}

TEST_F(LimitWatch, ImportingAModuleFromASlowServerEndsAtTheLimit) {
  HTTPServer server;
  server.handle("/silent", [](HTTPServer::Connection& connection) { connection.waitForEnd(); });
  const std::string query = "import module namespace m = 'm' at '" + server.URL("/silent") + "'; 1";
  outerLimits.duration = milliseconds(120);
  const auto importing = [&] {
    const auto start = limitstest::Clock::now();
    Outcome outer =
        evaluateOuter([&](XQueryContext&) { static_cast<void>(XQuery::xqueryWithSource(query)); });
    outer.lateWall = std::chrono::duration_cast<milliseconds>(limitstest::Clock::now() - start) -
                     milliseconds(120);
    return outer;
  };
  limitstest::expectSoon(importing, "limit: deadline passed", &Outcome::lateWall,
                         limitstest::mostWait);
}

TEST_F(LimitWatch, ImportingAModuleManyTimesEndsAtTheLimit) {
  class Modules : public XQueryLoader {
   public:
    std::optional<XQueryResource> load(const NSURL& URL, XQueryLoadPurpose) override {
      if (URL.absoluteString()->utf8() == "app:outer") {
        return XQueryResource{
            "module namespace o = 'urn:o'; import module 'urn:i' at 'app:inner';", {}, {}, {}};
      }
      std::string text = "module namespace i = 'urn:i';";
      for (int i = 0; i < 10000; ++i) text += "declare variable $i:v" + std::to_string(i) + ":=1;";
      return XQueryResource{text, {}, {}, {}};
    }
  };
  XQueryLoading loading;
  loading.policy = XQueryLoadingPolicy::denyAll().allowScheme("app");
  loading.loader = std::make_shared<Modules>();
  // None of the many declarations that the module has imported is taken over.
  std::string query;
  for (int i = 0; i < 10000; ++i) query += "import module 'urn:o' at 'app:outer';";
  constexpr milliseconds duration(1000);
  outerLimits.duration = duration;
  const auto importing = [&] {
    const auto start = limitstest::processorTime(CLOCK_THREAD_CPUTIME_ID);
    Outcome outer = evaluateOuter(
        [&](XQueryContext&) { static_cast<void>(XQuery::xqueryWithSource(query + "1", loading)); });
    outer.lateProcessor = limitstest::processorTime(CLOCK_THREAD_CPUTIME_ID) - start - duration;
    return outer;
  };
  limitstest::expectSoon(importing, "limit: deadline passed", &Outcome::lateProcessor,
                         limitstest::mostLate);
}

TEST_F(LimitWatch, ANestedContextLoadsByTheRulesOfTheOuterOneAndSharesNothingElse) {
  class Loader : public XQueryLoader {
   public:
    std::optional<XQueryResource> load(const NSURL&, XQueryLoadPurpose) override { return {}; }
  };
  XQueryLoading loading;
  loading.loader = std::make_shared<Loader>();
  loading.limits.mostRedirects = 3;
  context->contextSetLoading(loading);
  context->contextSetClient(std::make_shared<Client>([](XQueryContext&) {}));
  context->contextSetLimits(outerLimits);
  const auto nested = XQueryNestedContext(*context);
  EXPECT_EQ(nested->contextLoading().loader, loading.loader);
  EXPECT_EQ(nested->contextLoading().limits.mostRedirects, 3);
  EXPECT_FALSE(nested->contextClient());
}

}  // namespace
}  // namespace xquery

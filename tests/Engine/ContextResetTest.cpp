// What a context forgets when it is reset, and what it keeps.
#include "xquery/xquery.h"

#include <gtest/gtest.h>

#include <atomic>
#include <thread>

namespace xquery {
namespace {

Ref<XQuery> compiled(std::string_view text) {
  return XQuery::xqueryWithSource(text);
}

std::string answer(XQueryContext& context, std::string_view text, const Value& item = nullptr) {
  Ref<XQueryError> error;
  const auto items = context.evaluateXQuery(*compiled(text), {}, item, &error);
  if (!items) return error ? "error " + error->msg()->utf8() : "nothing";
  std::string texts;
  for (const Value& found : items->objects()) texts += XQueryItemStringValue(*found) + ";";
  return texts;
}

// Counts what is asked for; every other document is missing.
class CountingLoader : public XQueryLoader {
 public:
  std::optional<XQueryResource> load(const NSURL&, XQueryLoadPurpose) override {
    if (++calls % 2 == 0) return std::nullopt;
    return XQueryResource{"<n>" + std::to_string(calls) + "</n>", {}, "application/xml", {}};
  }
  std::atomic<int> calls = 0;
};

TEST(ContextReset, ForgetsTheContextItem) {
  const auto context = XQueryContext::xqueryContext();
  const std::string withoutItem = answer(*context, "string(/a)");
  const std::string withoutPlace = answer(*context, "position(), last()");
  const auto document = NSXMLDocument::documentWithData("<a>7</a>", NSXMLNodeOptionsNone);
  EXPECT_EQ(answer(*context, "string(/a)", document), "7;");
  EXPECT_EQ(answer(*context, "string(/a)"), "7;");
  EXPECT_TRUE(context->contextReset());
  EXPECT_EQ(answer(*context, "string(/a)"), withoutItem);
  EXPECT_NE(withoutItem, "7;");
  EXPECT_EQ(answer(*context, "position(), last()"), withoutPlace);
}

TEST(ContextReset, ForgetsTheBaseURIsOfConstructedNodes) {
  const auto context = XQueryContext::xqueryContext();
  const auto query = compiled("declare base-uri 'http://b/'; <first/>, <a/>");
  const auto items = context->evaluateXQuery(*query, {}, {});
  ASSERT_TRUE(items);
  const Value node = items->objects().back();
  EXPECT_EQ(answer(*context, "string(base-uri(.))", node), "http://b/;");
  EXPECT_TRUE(context->contextReset());
  EXPECT_EQ(answer(*context, "string(base-uri(.))", node), ";");
}

TEST(ContextReset, ForgetsTheProfile) {
  const auto context = XQueryContext::xqueryContext();
  const auto query =
      XQuery::xqueryWithSource("1 + 1", XQueryLoading(), XQueryLimits(), XQueryWay::Profiled);
  XQueryProfile profile(*query);
  ASSERT_TRUE(context->evaluateXQuery(*query, {}, {}));
  EXPECT_TRUE(profile.add(*context));
  EXPECT_TRUE(context->contextReset());
  EXPECT_FALSE(profile.add(*context));
  EXPECT_EQ(profile.evaluations(), 1u);
}

TEST(ContextReset, LetsTheClockGoOn) {
  const auto context = XQueryContext::xqueryContext();
  const std::string first = answer(*context, "current-dateTime()");
  std::this_thread::sleep_for(std::chrono::milliseconds(2));
  EXPECT_EQ(answer(*context, "current-dateTime()"), first);
  EXPECT_TRUE(context->contextReset());
  EXPECT_NE(answer(*context, "current-dateTime()"), first);
}

TEST(ContextReset, ForgetsDocumentsAndKeepsTheLoader) {
  const auto loader = std::make_shared<CountingLoader>();
  const auto context = XQueryContext::xqueryContext();
  XQueryLoading loading;
  loading.policy = XQueryLoadingPolicy::denyAll().allowScheme("test");
  loading.loader = loader;
  context->contextSetLoading(loading);
  const char* both = "string(doc('test:a')), count(doc('test:b'))";
  EXPECT_EQ(answer(*context, both), "1;0;");
  EXPECT_EQ(answer(*context, both), "1;0;");
  EXPECT_EQ(loader->calls, 2);
  EXPECT_TRUE(context->contextReset());
  EXPECT_EQ(answer(*context, both), "3;0;");
  EXPECT_EQ(loader->calls, 4);
}

TEST(ContextReset, KeepsNamespacesClientAndLimits) {
  class Listener : public XQueryClient {
   public:
    void XQueryClientTraceValue(const Value&, const Ref<NSString>&, XQueryContext&) override {
      ++calls;
    }
    int calls = 0;
  };
  const auto listener = std::make_shared<Listener>();
  const auto context = XQueryContext::xqueryContextWithNamespaces({{"p", "urn:p"}});
  context->contextSetClient(listener);
  XQueryLimits limits;
  limits.duration = std::chrono::milliseconds(20);
  context->contextSetLimits(limits);
  EXPECT_TRUE(context->contextReset());
  EXPECT_EQ(context->contextClient(), listener);
  EXPECT_EQ(context->contextLimits().duration, limits.duration);
  EXPECT_EQ(answer(*context, "trace(1, 'l')"), "1;");
  EXPECT_EQ(listener->calls, 1);
  EXPECT_EQ(answer(*context, "namespace-uri(<a>{element p:b {}}</a>/*)"), "urn:p;");
  EXPECT_EQ(answer(*context, "count(for $i in 1 to 100000, $j in 1 to 100000 return 1)"),
            "error limit: deadline passed");
}

TEST(ContextReset, IsAsAfterAnErrorAndForAnyNumberOfTimes) {
  const auto context = XQueryContext::xqueryContext();
  EXPECT_EQ(answer(*context, "1 idiv 0"), "error divide by zero");
  for (int round = 0; round < 100; ++round) EXPECT_TRUE(context->contextReset());
  EXPECT_EQ(answer(*context, "1 + 1"), "2;");
}

TEST(ContextReset, GivesItsDocumentsBackButNotThoseOfResults) {
  const auto context = XQueryContext::xqueryContext();
  XQueryLoading loading;
  loading.policy = XQueryLoadingPolicy::denyAll().allowScheme("test");
  loading.loader = std::make_shared<CountingLoader>();
  context->contextSetLoading(loading);
  const auto items = context->evaluateXQuery(*compiled("doc('test:a')/n"), {}, {});
  ASSERT_TRUE(items);
  EXPECT_TRUE(context->contextReset());
  EXPECT_EQ(XQueryItemStringValue(*items->objectAtIndex(0)), "1");
}

TEST(ContextReset, IsRefusedWhileAnEvaluationIsUnderWay) {
  class Meddler : public XQueryClient {
   public:
    void XQueryClientTraceValue(const Value&, const Ref<NSString>&,
                                XQueryContext& context) override {
      wasReset = context.contextReset();
    }
    bool wasReset = true;
  };
  const auto meddler = std::make_shared<Meddler>();
  const auto context = XQueryContext::xqueryContext();
  context->contextSetClient(meddler);
  EXPECT_EQ(answer(*context, "trace((1, 2), 'l')"), "1;2;");
  EXPECT_FALSE(meddler->wasReset);
  EXPECT_TRUE(context->contextReset());
}

}  // namespace
}  // namespace xquery

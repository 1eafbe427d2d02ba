#include "Functions/Error.h"
#include "Functions/FunctionsTesting.h"
#include "Types/XQueryQName.h"

#include <cstdlib>

namespace xquery {
namespace {

using namespace functiontest;

Value name(std::string_view local, std::string_view URI) {
  return XQueryQName::qname(NSString::stringWithASCII(local),
                            URI.empty() ? nullptr : NSString::stringWithASCII(URI));
}

TEST(Error, WithoutArgumentsIsTheUnidentifiedError) {
  EXPECT_EQ(call(fn_error, {}), "record 0 http://www.w3.org/2004/07/xqt-errors#FOER0000");
}

TEST(Error, IsNamedByAQName) {
  EXPECT_EQ(call(fn_error, {name("p:bad", "urn:e")}), "record 0 urn:e#bad");
  EXPECT_EQ(call(fn_error, {name("bad", "")}), "record 0 (null)#bad");
}

TEST(Error, OfWhatIsNoQNameHasNoName) {
  EXPECT_EQ(call(fn_error, {string("bad")}), "record 0 (null)#");
  EXPECT_EQ(call(fn_error, {empty()}), "record 0 (null)#");
}

TEST(Error, CarriesADescription) {
  EXPECT_EQ(call(fn_error, {name("bad", "urn:e"), string("x")}), "record 0 urn:e#bad - x");
  EXPECT_EQ(call(fn_error, {empty(), untyped("why")}), "record 0 (null)# - why");
}

TEST(Error, AnEmptyDescriptionIsLeftOut) {
  EXPECT_EQ(call(fn_error, {name("bad", "urn:e"), string("")}), "record 0 urn:e#bad");
  EXPECT_EQ(call(fn_error, {name("bad", "urn:e"), empty()}), "record 0 urn:e#bad");
}

TEST(Error, ADescriptionThatIsNoStringIsAnErrorItself) {
  EXPECT_EQ(call(fn_error, {name("bad", "urn:e"), integer(1)}), "error 6 not a string type - 1");
}

TEST(Error, IgnoresAThirdArgument) {
  EXPECT_EQ(call(fn_error, {name("bad", "urn:e"), string("x"), integer(1)}),
            "record 0 urn:e#bad - x");
}

TEST(Error, TakesUpToThreeArguments) {
  EXPECT_EQ(refusedCounts(fn_error, string("a"), 6), "4 5 6");
}

TEST(Error, HasNoLine) {
  const Ref<XQueryContext> context = XQueryContext::xqueryContext();
  const Value error = fn_error(nullptr, 0, *context);
  ASSERT_TRUE(isa<XQueryError>(error));
  EXPECT_EQ(cast<XQueryError>(error)->line(), 0);
}

TEST(Error, EndsTheEvaluationThatCallsIt) {
  EXPECT_EQ(answer("1,\n\nerror((), 'stop'), 2"), "error 0 line 0 (null)# - stop");
  EXPECT_EQ(answer("declare namespace e = 'urn:e'; error(xs:QName('e:oops'), 'why')"),
            "error 0 line 0 urn:e#oops - why");
}

// --- trace ---------------------------------------------------------------------------------------

class Listener : public XQueryClient {
 public:
  void XQueryClientTraceValue(const Value& value, const Ref<NSString>& label,
                              XQueryContext&) override {
    heard.push_back(label->utf8() + ": " + show(value));
  }
  std::vector<std::string> heard;
};

TEST(Trace, HandsValueAndLabelToTheClientAndAnswersTheValue) {
  const auto listener = std::make_shared<Listener>();
  const auto context = XQueryContext::xqueryContext();
  context->contextSetClient(listener);
  const auto query = XQuery::xqueryWithSource("trace((1, 2), 'pair'), trace((), 'none')");
  const auto items = context->evaluateXQuery(*query, {}, nullptr);
  ASSERT_TRUE(items);
  EXPECT_EQ(show(items), "(integer 1, integer 2)");
  EXPECT_EQ(listener->heard,
            (std::vector<std::string>{"pair: (integer 1, integer 2)", "none: ()"}));
}

TEST(Trace, AnswersItsFirstArgumentUnchanged) {
  const Value items = sequence({integer(1), string("a")});
  const Value arguments[] = {items, string("label")};
  const auto context = XQueryContext::xqueryContext();
  EXPECT_EQ(fn_trace(arguments, 2, *context), items);
}

TEST(Trace, ALabelThatIsNoStringIsAnError) {
  EXPECT_EQ(call(fn_trace, {integer(1), integer(2)}), "error 6 not a string type - 2");
}

TEST(Trace, LogsLabelAndValueWithoutAClient) {
  setenv("XQUERY_LOG", "1", 1);
  testing::internal::CaptureStderr();
  EXPECT_EQ(call(fn_trace, {sequence({integer(1), integer(2)}), string("pair")}),
            "(integer 1, integer 2)");
  const std::string log = testing::internal::GetCapturedStderr();
  unsetenv("XQUERY_LOG");
  EXPECT_NE(log.find("pair (1, 2)"), std::string::npos) << log;
}

TEST(Trace, TakesTwoArguments) {
  EXPECT_EQ(refusedCounts(fn_trace, string("a")), "0 1 3 4 5");
}

}  // namespace
}  // namespace xquery

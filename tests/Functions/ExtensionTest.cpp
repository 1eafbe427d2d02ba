#include "Functions/Extension.h"
#include "Functions/FunctionsTesting.h"
#include "Platform/Base/ProcessorTime.h"
#include "Platform/Loading/LoadingTestSupport.h"
#include "Types/XQueryDate.h"

#include <atomic>
#include <chrono>
#include <thread>

namespace xquery {
namespace {

using namespace functiontest;

constexpr std::string_view refusedEval = "error 17 line 1 invalid arguments to function - ext:eval";

// The answer of a query against a context with settings.
struct Outcome {
  std::string text;
  double seconds;  // of the processor
};
Outcome outcome(std::string_view source, const Value& item, const XQueryVariables& constants,
                XQueryContext& context) {
  const Ref<XQuery> query = XQuery::xqueryWithSource(source);
  Ref<XQueryError> error;
  const double start = processorSeconds();
  const Ref<NSArray> items = context.evaluateXQuery(*query, constants, item, &error);
  const double seconds = processorSeconds() - start;
  if (error) return {"error " + std::to_string(error->err()) + " " + error->msg()->utf8(), seconds};
  return {items ? show(items) : "no result", seconds};
}

// --- eval ----------------------------------------------------------------------------------------

TEST(Eval, AnswersTheItemsOfTheQuery) {
  EXPECT_EQ(answer("ext:eval('1 + 2')"), "integer 3");
  EXPECT_EQ(answer("ext:eval('1, \"a\", <b/>')"), "integer 1, string a, node b");
  EXPECT_EQ(answer("count(ext:eval('()'))"), "integer 0");
  EXPECT_EQ(answer("ext:eval('for $x in 1 to 3 return $x * 2')[2]"), "integer 4");
}

TEST(Eval, GivesTheQueryAContextItem) {
  EXPECT_EQ(answer("ext:eval('. + 1', 2)"), "integer 3");
  EXPECT_EQ(answer("ext:eval('//b', .)", document("<a><b/></a>")), "node b");
  EXPECT_EQ(answer("ext:eval('//b', .) is //b", document("<a><b/></a>")), "true");
  EXPECT_EQ(answer("ext:eval('position()', 2)"), "integer 1");
}

TEST(Eval, TheQueryHasNoContextItemUnlessGivenOne) {
  EXPECT_EQ(answer("count(ext:eval('.'))", document("<a/>")), "integer 0");
  EXPECT_EQ(answer("count(ext:eval('.', ()))", document("<a/>")), "integer 0");
  EXPECT_EQ(answer("ext:eval('/')", document("<a/>")), refusedEval);
}

TEST(Eval, SharesNothingWithTheQueryAroundIt) {
  EXPECT_EQ(answer("let $x := 1 return ext:eval('$x')"), refusedEval);
  EXPECT_EQ(answer("declare variable $x := 1; ext:eval('$x')"), refusedEval);
  EXPECT_EQ(answer("declare variable $x := 1; ext:eval('declare variable $x external; $x')"),
            refusedEval);
  EXPECT_EQ(answer("declare namespace p = 'u'; ext:eval('<p:a/>')"), refusedEval);
  EXPECT_EQ(answer("declare function local:f() {1}; ext:eval('local:f()')"), refusedEval);
  EXPECT_EQ(answer("declare default element namespace 'u'; namespace-uri(ext:eval('<a/>'))"),
            "anyURI ");
  EXPECT_EQ(answer("declare base-uri 'http://h/'; count(ext:eval('static-base-uri()'))"),
            "integer 0");
}

TEST(Eval, SharesNoCaches) {
  const TestFolder folder;
  const std::string URL = folder.write("a.xml", "<a/>");
  EXPECT_EQ(answer("doc('" + URL + "') is ext:eval(\"doc('" + URL + "')\")"), "false");
}

// Answers true where the query has a client and no inner one.
TEST(Eval, SharesNoClient) {
  class Client : public XQueryClient {
   public:
    int calls = 0;
    void XQueryClientTraceValue(const Value&, const Ref<NSString>&, XQueryContext&) override {
      ++calls;
    }
  };
  const auto client = std::make_shared<Client>();
  const Ref<XQueryContext> context = XQueryContext::xqueryContext();
  context->contextSetClient(client);
  EXPECT_EQ(outcome("trace(1, 'a'), ext:eval('trace(2, \"b\")')", {}, {}, *context).text,
            "(integer 1, integer 2)");
  EXPECT_EQ(client->calls, 1);
}

TEST(Eval, LeavesTheOuterEvaluationAsItWas) {
  EXPECT_EQ(answer("declare ordering unordered; declare variable $g := 5; "
                   "let $x := 7 return (ext:eval('declare variable $g := 1; let $x := 2 "
                   "return $g + $x'), $x, $g, .)",
                   string("item")),
            "integer 3, integer 7, integer 5, string item");
}

TEST(Eval, IsRefusedWhereTheQueryFails) {
  for (const std::string_view query :
       {"1 +", "<a>", "no:such()", "$missing", "1 + 'a'", "error()", "xs:integer('x')",
        "declare function local:f() external; 1", "(1, 2", "import module 'urn:none'; 1", ""}) {
    EXPECT_EQ(answer("declare variable $q external; ext:eval($q)", {}, {{"q", string(query)}}),
              refusedEval)
        << query;
  }
}

TEST(Eval, PromotesTheQueryToAString) {
  EXPECT_EQ(answer("ext:eval(.)", document("<a>1 + 1</a>")), "integer 2");
  EXPECT_EQ(answer("ext:eval(1)"), "error 6 line 0 not a string type - 1");
  EXPECT_EQ(refusedCounts(ext_eval, string("1")), "0 3 4 5");
}

TEST(Eval, AnswersNodesThatOutliveItsContext) {
  EXPECT_EQ(answer("declare variable $n := ext:eval('<a><!--c--><b x=\"1\"/></a>'); "
                   "string($n/b/@x), string($n/comment()), ext:string-from-node($n)"),
            "string 1, string c, untypedAtomic <a><!--c--><b x=\"1\"/></a>");
}

TEST(Eval, EndsWhereAQueryEvaluatesItself) {
  const Ref<XQueryContext> context = XQueryContext::xqueryContext();
  for (const std::string_view query : {"ext:eval(., .)", "ext:eval(., .), ext:eval(., .)",
                                       "ext:node-xquery(<q>{string(.)}</q>, string(.))",
                                       "ext:eval('ext:node-xquery(<q/>, string(.))', .)"}) {
    const std::string start = "ext:eval(., .)";
    const Outcome found = outcome(start, string(query), {}, *context);
    EXPECT_TRUE(found.text.starts_with("error ")) << query << ": " << found.text;
    EXPECT_LT(found.seconds, 3) << query;
  }
}

TEST(Eval, EndlessSelfEvaluationIsNotPassedOverByAPredicate) {
  const Ref<XQueryContext> context = XQueryContext::xqueryContext();
  const std::string_view query =
      "(1 to 10)[ext:eval(string($q), $q)], "
      "(1 to 10)[ext:eval(string($q), $q)]";
  const std::string inner = "for $q in string(.) return (" + std::string(query) + ")";
  const Outcome found = outcome("ext:eval(., .)", string(inner), {}, *context);
  EXPECT_EQ(found.text, "error 0 limit: expression nested too deeply");
  EXPECT_LT(found.seconds, 3);
}

TEST(Eval, NestsToAFixedDepth) {
  // Counts down by evaluating itself.
  const std::string query =
      "if (xs:integer(string(./@n)) eq 0) then 'end' else "
      "ext:eval(string(.), <q n='{xs:integer(string(./@n)) - 1}'>"
      "{string(.)}</q>)";
  const auto levels = [&](int count) {
    const std::string start =
        "declare variable $t external; ext:eval($t, <q n='" + std::to_string(count) + "'>{$t}</q>)";
    return answer(start, {}, {{"t", string(query)}});
  };
  EXPECT_EQ(levels(99), "string end");
  EXPECT_EQ(levels(100), "error 0 line 0 limit: expression nested too deeply");
}

TEST(Eval, KeepsToTheLoadingPolicy) {
  const TestFolder folder;
  const std::string URL = folder.write("a.xml", "<a>secret</a>");
  const std::string module =
      folder.write("m.xq", "module namespace m = 'urn:m'; declare function m:f() {1};");
  const Ref<XQueryContext> context = XQueryContext::xqueryContext();
  const std::vector<std::string> queries = {
      "ext:eval(\"doc('" + URL + "')\")",
      "ext:eval(\"ext:eval(\"\"doc('" + URL + "')\"\")\")",
      "ext:node-xquery(<a/>, \"doc('" + URL + "')\")",
      "ext:node-xpath(<a/>, \"doc('" + URL + "')\")",
      "ext:_test(<a/>, \"doc('" + URL + "')\")",
      "ext:eval(\"count(ext:eval('1', doc('" + URL + "')))\") instance of element()",
  };
  for (const std::string& query : queries) {
    const std::string allowed = outcome(query, {}, {}, *context).text;
    EXPECT_TRUE(allowed == "(node )" || allowed == "(false)") << query << allowed;
  }
  const std::string import =
      "ext:eval(\"import module namespace m = 'urn:m' at '" + module + "'; m:f()\")";
  EXPECT_EQ(outcome(import, {}, {}, *context).text, "(integer 1)");

  const Ref<XQueryContext> strict = XQueryContext::xqueryContext();
  XQueryLoading loading;
  loading.policy = XQueryLoadingPolicy::denyAll();
  strict->contextSetLoading(loading);
  for (const std::string& query : queries) {
    const std::string text = outcome(query, {}, {}, *strict).text;
    EXPECT_TRUE(text == "()" || text == "(false)") << query << text;
  }
  EXPECT_EQ(outcome(import, {}, {}, *strict).text,
            "error 17 invalid arguments to function - "
            "ext:eval");
}

TEST(Eval, UsesTheHostsLoader) {
  class Loader : public XQueryLoader {
   public:
    std::optional<XQueryResource> load(const NSURL&, XQueryLoadPurpose) override {
      return XQueryResource{"<h/>", {}, {}, {}};
    }
  };
  const Ref<XQueryContext> context = XQueryContext::xqueryContext();
  XQueryLoading loading;
  loading.loader = std::make_shared<Loader>();
  context->contextSetLoading(loading);
  EXPECT_EQ(outcome("ext:eval(\"doc('http://h/')/*\")", {}, {}, *context).text, "(node h)");
}

constexpr std::string_view endless = "count(for $a in 1 to 100000, $b in 1 to 100000 return ())";

TEST(Eval, EndsAtTheDeadlineOfTheOuterEvaluation) {
  for (const std::string& query : {"ext:eval('" + std::string(endless) + "')",
                                   "ext:eval('ext:eval(\"" + std::string(endless) + "\")')",
                                   "ext:node-xquery(<a/>, '" + std::string(endless) + "')",
                                   "ext:_test(<a/>, '" + std::string(endless) + "')",
                                   "(1, 2)[ext:eval('" + std::string(endless) + "')]"}) {
    const Ref<XQueryContext> context = XQueryContext::xqueryContext();
    XQueryLimits limits;
    limits.duration = std::chrono::milliseconds(50);
    context->contextSetLimits(limits);
    const Outcome found = outcome(query, {}, {}, *context);
    EXPECT_EQ(found.text, "error 0 limit: deadline passed") << query;
    EXPECT_LT(found.seconds, 5);
  }
}

TEST(Eval, EndsWhereTheOuterEvaluationIsCancelled) {
  const Ref<XQueryContext> context = XQueryContext::xqueryContext();
  XQueryLimits limits;
  limits.cancelled = std::make_shared<std::atomic<bool>>(false);
  context->contextSetLimits(limits);
  std::thread other([&] {
    std::this_thread::sleep_for(std::chrono::milliseconds(30));
    limits.cancelled->store(true);
  });
  const Outcome found = outcome("ext:eval('" + std::string(endless) + "')", {}, {}, *context);
  other.join();
  EXPECT_EQ(found.text, "error 0 limit: evaluation cancelled");
}

TEST(Eval, HasWhatMemoryTheOuterEvaluationHasLeft) {
  const Ref<XQueryContext> context = XQueryContext::xqueryContext();
  XQueryLimits limits;
  limits.memoryCeiling = uint64_t{48} << 20;
  context->contextSetLimits(limits);
  EXPECT_EQ(outcome("count(ext:eval('1 to 100000'))", {}, {}, *context).text, "(integer 100000)");
  EXPECT_EQ(outcome("ext:eval('count((1 to 5000000, 1))')", {}, {}, *context).text,
            "error 0 limit: memory ceiling reached");
  // Each of the two alone would fit.
  const std::string half = "1 to 500000";
  EXPECT_EQ(outcome("count(ext:eval('" + half + "'))", {}, {}, *context).text, "(integer 500000)");
  EXPECT_EQ(outcome("let $a := (" + half + ", 1), $b := (" + half +
                        ", 1) "
                        "return count(ext:eval('" +
                        half + ", 1')) + count($a) + count($b)",
                    {}, {}, *context)
                .text,
            "error 0 limit: memory ceiling reached");
}

TEST(Eval, CompilesHugeQueriesUnderTheDeadline) {
  const Ref<XQueryContext> context = XQueryContext::xqueryContext();
  XQueryLimits limits;
  limits.duration = std::chrono::milliseconds(100);
  context->contextSetLimits(limits);
  std::string query = "1";
  for (int index = 0; index < 5000000; ++index) query += "+1";
  const Outcome found = outcome("ext:eval(.)", string(query), {}, *context);
  EXPECT_EQ(found.text, "error 0 limit: deadline passed");
  EXPECT_LT(found.seconds, 1.5);
}

TEST(Eval, TakesHostileTexts) {
  const auto eval = [](const std::string& query) {
    return answer("declare variable $q external; count(ext:eval($q))", {}, {{"q", string(query)}});
  };
  EXPECT_EQ(eval(std::string(1000, '(') + "1" + std::string(1000, ')')), "integer 1");
  EXPECT_TRUE(eval(std::string(1000000, '(')).starts_with("error 17"));
  EXPECT_TRUE(eval(std::string(1000000, '<')).starts_with("error 17"));
  EXPECT_TRUE(eval(std::string(1000000, '"')).starts_with("error 17") ||
              eval(std::string(1000000, '"')) == "integer 1");
  EXPECT_TRUE(eval("\xEF\xBF\xBF").starts_with("error 17"));
}

TEST(Eval, CompilesFromSeveralThreadsAtOnce) {
  std::vector<std::thread> threads;
  std::atomic<int> right = 0;
  for (int index = 0; index < 4; ++index) {
    threads.emplace_back([&] {
      for (int turn = 0; turn < 50; ++turn) {
        if (answer("ext:eval('ext:eval(\"1 + 1\")')") == "integer 2") ++right;
      }
    });
  }
  for (std::thread& thread : threads) thread.join();
  EXPECT_EQ(right, 200);
}

// --- node-xquery, node-xpath, _test --------------------------------------------------------------

TEST(NodeXQuery, EvaluatesAgainstTheNode) {
  const Value doc = document("<a><b>1</b><b>2</b></a>");
  EXPECT_EQ(answer("ext:node-xquery(/a, 'sum(b)')", doc), "double 3");
  EXPECT_EQ(answer("ext:node-xquery(/, '//b') is ()", doc), answer("//b is ()", doc));
  EXPECT_EQ(answer("count(ext:node-xquery(/, '//b'))", doc), "integer 2");
  EXPECT_EQ(answer("count(ext:node-xquery(/, '()'))", doc), "integer 0");
}

TEST(NodeXQuery, HandsOnTheErrorOfTheQuery) {
  EXPECT_EQ(answer("ext:node-xquery(<a/>, '1 + \"x\"')"),
            "error 6 line 1 invalid type for operator");
  EXPECT_TRUE(answer("ext:node-xquery(<a/>, '1 +')").starts_with("error 3 "));
  EXPECT_EQ(answer("ext:node-xquery(<a/>, '$x')"),
            "error 8 line 1 reference to undefined variable \"x\"");
}

TEST(NodeXQuery, IsRefusedWithoutANodeAndWithoutAValue) {
  EXPECT_EQ(call(ext_node_xquery, {string("a"), string("1")}), "null");
  EXPECT_EQ(call(ext_node_xquery, {NSNull::null(), string("1")}), "null");
  EXPECT_EQ(call(ext_node_xquery, {document("<a/>"), string("")}), "null");
  EXPECT_EQ(refusedCounts(ext_node_xquery, document("<a>1</a>")), "0 1 3 4 5");
  EXPECT_EQ(call(ext_node_xquery, {document("<a/>"), integer(1)}), "error 6 not a string type - 1");
}

TEST(NodeXPath, AnswersNodes) {
  const Value doc = document("<a><b>1</b><b x='2'>2</b></a>");
  EXPECT_EQ(answer("ext:node-xpath(/a, 'b[2]') is /a/b[2]", doc), "true");
  EXPECT_EQ(answer("ext:node-xpath(/, '//b/@x')", doc), "node x");
  EXPECT_EQ(answer("count(ext:node-xpath(/, '//c'))", doc), "integer 0");
}

TEST(NodeXPath, HandsOnItsErrors) {
  const Value doc = document("<a/>");
  EXPECT_EQ(answer("ext:node-xpath(/, 'count(*)')", doc), "error 19 line 0 item not a node");
  EXPECT_EQ(answer("ext:node-xpath(/, '*, 1')", doc), "error 19 line 0 item not a node");
  EXPECT_TRUE(answer("ext:node-xpath(/, 'a[')", doc).starts_with("error 3 "));
  EXPECT_EQ(call(ext_node_xpath, {string("a"), string(".")}), "null");
  EXPECT_EQ(refusedCounts(ext_node_xpath, document("<a>.</a>")), "0 1 3 4 5");
}

TEST(NodeTest, IsNodeXQueryWithoutItsErrors) {
  const Value doc = document("<a><b>1</b></a>");
  EXPECT_EQ(answer("ext:_test(/a, 'b + 1')", doc), "double 2");
  EXPECT_EQ(answer("ext:_test(/a, '1 +')", doc),
            "error 17 line 1 invalid arguments to function - ext:_test");
  EXPECT_EQ(call(ext_test, {string("a"), string("1")}), "null");
  EXPECT_EQ(refusedCounts(ext_test, document("<a>1</a>")), "0 1 3 4 5");
}

// --- the clock -----------------------------------------------------------------------------------

TEST(RealDateTime, IsOfTheMomentOfTheCall) {
  const Ref<XQueryContext> context = XQueryContext::xqueryContext();
  const Value first = ext_real_date_time(nullptr, 0, *context);
  std::this_thread::sleep_for(std::chrono::milliseconds(1100));
  const Value second = ext_real_date_time(nullptr, 0, *context);
  EXPECT_NE(show(first), show(second));
  EXPECT_TRUE(show(first).starts_with("dateTime ")) << show(first);
  EXPECT_EQ(refusedCounts(ext_real_date_time, integer(1)), "1 2 3 4 5");
}

// --- uri-body ------------------------------------------------------------------------------------

TEST(URIBody, GivesTheBytes) {
  const TestFolder folder;
  const std::string URL = folder.write("a", std::string_view("a\0\xFF", 3));
  EXPECT_EQ(answer("ext:uri-body('" + URL + "')"), "hexBinary 6100FF");
  EXPECT_EQ(answer("declare base-uri '" + folder.URL("x.xq") + "'; ext:uri-body('a')"),
            "hexBinary 6100FF");
  folder.write("empty", "");
  EXPECT_EQ(answer("ext:uri-body('" + folder.URL("empty") + "')"), "hexBinary ");
}

TEST(URIBody, IsRefusedWhereThereAreNone) {
  const TestFolder folder;
  constexpr std::string_view refused =
      "error 17 line 1 invalid arguments to function - ext:uri-body";
  EXPECT_EQ(answer("ext:uri-body('')"), refused);
  EXPECT_EQ(answer("ext:uri-body(())"), refused);
  EXPECT_EQ(answer("ext:uri-body('a b')"), refused);
  EXPECT_EQ(answer("ext:uri-body('relative')"), refused);
  EXPECT_EQ(answer("ext:uri-body('" + folder.URL("missing") + "')"), refused);
  EXPECT_EQ(answer("ext:uri-body(1)"), "error 6 line 0 not a string type - 1");
  EXPECT_EQ(refusedCounts(ext_uri_body, string("")), "0 1 2 3 4 5");
}

TEST(URIBody, LooksForDocumentsFirst) {
  const TestFolder folder;
  const std::string URL = folder.write("a.xml", "<a/>");
  EXPECT_EQ(answer("count(doc('" + URL + "')), ext:uri-body('" + URL + "')"),
            "error 17 line 1 invalid arguments to function - ext:uri-body");
}

}  // namespace
}  // namespace xquery

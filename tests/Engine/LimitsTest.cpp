// What ends an evaluation: its deadline, its flag and its memory ceiling, for each kind of long
// work, through the public interface.
//
// How late an evaluation ends is measured in the processor time of its thread, which a busy machine
// does not lengthen, except where it waits for others. An evaluation that ends by itself before it
// is told to fails its test, since it gives no error.
#include "Context/XQueryContextInternal.h"
#include "Engine/LimitsTestSupport.h"
#include "Platform/Base/StackTestSupport.h"
#include "Platform/Loading/HTTPServer.h"
#include "Platform/Loading/LoadingTestSupport.h"
#include "Platform/Text/TextTestSupport.h"
#include "Platform/Tree/TreeIndexes.h"

#include <gtest/gtest.h>

#include <limits>
#include <string>
#include <thread>
#include <vector>

namespace xquery {
namespace {

using limitstest::cancelledAfter;
using limitstest::endedAfter;
using limitstest::evaluate;
using limitstest::expectSoon;
using limitstest::Outcome;
using std::chrono::milliseconds;

constexpr const char* deadlinePassed = "limit: deadline passed";
constexpr const char* cancelled = "limit: evaluation cancelled";
constexpr const char* ceilingReached = "limit: memory ceiling reached";
constexpr const char* tooDeep = "limit: expression nested too deeply";
constexpr uint64_t MiB = uint64_t{1} << 20;

// --- long work of every kind ---------------------------------------------------------------------

enum class Input { None, Wide, Deep, Nested };

struct Work {
  const char* name;
  std::string query;
  Input input = Input::None;
};

void PrintTo(const Work& work, std::ostream* out) {
  *out << work.name;
}

// Takes seconds at least.
const std::vector<Work>& longWork() {
  static const std::string strings =
      "let $s := for $i in 1 to 200000 return concat('s', $i), "
      "$t := for $i in 1 to 200000 return concat('t', $i) ";
  static const std::string doubled = "let $s := concat($s, $s) ";
  static const std::string megabytes = "let $s := '0123456789abcdef' " + [] {
    std::string text;
    for (int times = 0; times < 18; ++times) text += doubled;
    return text;
  }();
  static const std::string digits = "let $n := xs:decimal('7" + std::string(100000, '3') + "') ";
  static const std::vector<Work> rows = {
      {"Range", "for $i in 1 to 20000000 where $i < 0 return $i"},
      {"NestedLoops", "for $i in 1 to 1000000, $j in 1 to 1000000 where $i + $j < 0 return 1"},
      {"Every", "every $i in 1 to 20000000 satisfies $i"},
      {"Some", "some $i in 1 to 1000000, $j in 1 to 1000000 satisfies $i + $j < 0"},
      {"RangesMade", "for $i in 1 to 1000000 return count((1 to 1000000, 1))"},
      {"Predicates", "for $i in 1 to 1000000 return (1 to 1000000)[. < 0]"},
      {"FailingPredicates", "for $i in 1 to 1000000 return (1 to 100000)[. < 'a']"},
      {"Recursion",
       "declare function local:fib($n) { if ($n < 2) then 1 else local:fib($n - 1) + "
       "local:fib($n - 2) }; local:fib(60)"},
      {"Sorting",
       "for $j in 1 to 1000, $k in 1 to 1000000 return count(for $i in 1 to 200000 order by "
       "($i * 7919) mod 100003 return $i)"},
      {"SortingStrings",
       strings + "for $j in 1 to 1000, $k in 1 to 1000000 return count(for $i in $s order by $i "
                 "descending return $i)"},
      {"ComparingStrings",
       strings + "for $j in 1 to 1000, $k in 1 to 1000000 where $s = $t return $k"},
      {"ComparingDates",
       "let $d := for $i in 1 to 3000 return xs:date('2004-01-01') + "
       "xdt:dayTimeDuration(concat('P', $i, 'D')) for $j in 1 to 1000, $k in 1 to 1000000 where $d "
       "= xs:date("
       "'1999-01-01') or $d > $d return $k"},
      {"DistinctValues",
       strings + "for $j in 1 to 1000, $k in 1 to 1000000 return count(distinct-values(($s, $t)))"},
      {"Adding", "for $j in 1 to 1000, $k in 1 to 1000000 return sum(1 to 1000000)"},
      {"Types",
       "let $s := (1 to 1000000, 'a') for $j in 1 to 1000, $k in 1 to 1000000 return $s instance "
       "of "
       "xs:integer*"},
      {"Typeswitch",
       "let $s := (1 to 1000000, 'a') for $j in 1 to 1000, $k in 1 to 1000000 return typeswitch "
       "($s) "
       "case xs:integer* return 1 case xs:string* return 2 default return 3"},
      {"Text", megabytes + "for $j in 1 to 1000, $k in 1 to 1000000 return count(concat($s, $k))"},
      {"MappingText", megabytes +
                          "for $j in 1 to 1000, $k in 1 to 1000000 return count((upper-case($s), "
                          "translate($s, 'a9', 'b'), "
                          "normalize-space($s), escape-uri($s, true()), contains($s, 'fe'), "
                          "string-join(($s, $s), $s)))"},
      {"MappingWideText",
       megabytes +
           "let $w := translate($s, '9', '&#233;') for $j in 1 to 1000, $k in 1 to 1000000 return "
           "count((upper-case($w), lower-case($w), normalize-unicode($w, 'NFD'), "
           "translate($w, 'a', $w), translate('a', $w, $w), escape-uri($w, false())))"},
      {"Codepoints", megabytes + "for $j in 1 to 1000, $k in 1 to 1000000 return "
                                 "count(codepoints-to-string(string-to-codepoints($s)))"},
      {"ComparingText",
       megabytes + "let $t := concat($s, 'x') for $j in 1 to 1000, $k in 1 to 1000000 where "
                   "concat($s, 'y') = $t return $k"},
      {"CastingText",
       megabytes + "for $j in 1 to 1000, $k in 1 to 1000000 return ($s castable as xs:integer, "
                   "$s castable as xs:NCName, $s castable as xs:hexBinary, "
                   "$s castable as xs:base64Binary, $s castable as xs:token)"},
      {"CastingTextToURI",
       megabytes + "let $p := translate($s, '0123456789abcdef', '////////////////') "
                   "for $j in 1 to 1000, $k in 1 to 1000000 return ($s castable as xs:anyURI, "
                   "$p castable as xs:anyURI, string-length(string(resolve-uri($p, "
                   "'http://h/a'))), string-length(string(resolve-uri($s, 'http://h/a'))))"},
      {"CastingDigits",
       megabytes + "let $n := translate($s, 'abcdef', '012345') for $j in 1 to 1000, $k in 1 to "
                   "1000000 return "
                   "(number($n), $n castable as xs:decimal, $n castable as xs:date, "
                   "concat('12:00:00.', $n) castable as xs:time, number(translate($s, "
                   "'0123456789abcdef', ' ')), concat('PT', $n, 'S') castable as xs:duration)"},
      {"LowerCaseOfSigmas",
       megabytes + "let $w := translate($s, '0123456789abcdef', "
                   "'&#931;&#931;&#931;&#931;&#931;&#931;&#931;&#931;::::::::') "
                   "for $j in 1 to 1000, $k in 1 to 1000000 return count(lower-case($w))"},
      {"JoiningWideText",
       megabytes +
           "let $w := translate($s, '9', '&#233;') for $j in 1 to 1000, $k in 1 to 1000000 return "
           "count((concat($s, $w), string-join(($s, $w, $s), $w), "
           "ext:string-from-node(text {$w})))"},
      {"JoiningText",
       strings +
           "for $j in 1 to 1000, $k in 1 to 1000000 return string-length(string-join($s, $t[1]))"},
      {"SearchingText", megabytes +
                            "for $j in 1 to 1000, $k in 1 to 1000000 return (contains($s, 'fe'), "
                            "substring-before($s, 'fe'), ends-with($s, 'fe'))"},
      {"Patterns", megabytes + "for $j in 1 to 1000, $k in 1 to 1000000 return (matches($s, 'g'), "
                               "string-length(replace($s, 'a', 'b')))"},
      {"SlowPatterns", "let $s := '" + std::string(3000, 'a') +
                           "' for $j in 1 to 1000, $k in 1 to 1000000 return "
                           "matches($s, '(a+)+b')"},
      {"Tokens",
       megabytes + "for $j in 1 to 1000, $k in 1 to 1000000 return count(tokenize($s, 'a'))"},
      {"DeepEqual",
       "for $j in 1 to 1000, $k in 1 to 1000000 return deep-equal(/, <x>{/}</x>/node())",
       Input::Wide},
      {"Sequences",
       "let $s := (1 to 1000000, 1) for $j in 1 to 1000, $k in 1 to 1000000 return "
       "(count(reverse($s)), "
       "count(subsequence($s, 5)), count(remove($s, 7)), count(index-of($s, 1)), "
       "count(insert-before($s, 9, $s)))"},
      {"Extremes",
       "let $s := (1 to 1000000, 1) for $j in 1 to 1000, $k in 1 to 1000000 return (max($s), "
       "min($s), "
       "avg($s))"},
      {"Joins", strings + "for $j in 1 to 1000, $k in 1 to 1000000 return count(for $a in $s, $b "
                          "in $t where $a = $b "
                          "return 1)"},
      {"Rounding",
       digits + "for $j in 1 to 1000, $k in 1 to 1000000 return count(round($n div 7))"},
      {"Multiplying", digits + "for $j in 1 to 1000, $k in 1 to 1000000 return count($n * $n)"},
      {"Dividing",
       digits + "for $j in 1 to 1000, $k in 1 to 1000000 return count(($n * $n) idiv $n)"},
      {"Digits",
       digits + "for $j in 1 to 1000, $k in 1 to 1000000 return count(xs:decimal(string($n)))"},
      {"ComparingDigits",
       digits + "let $m := ($n + 1, $n + 0.1, $n - 0.01), $d := (1e5, $n) "
                "for $j in 1 to 1000, $k in 1 to 1000000 where $m = $d or $m < 1e5 return $k"},
      {"SortingDigits",
       digits + "for $j in 1 to 1000, $k in 1 to 1000000 return count(for $i in (1 to 20) order "
                "by $n + $i * 0.001 return $i)"},
      {"SearchingDigits", digits +
                              "let $m := for $i in 1 to 50 return $n + $i * 0.01 for $j in 1 to "
                              "1000, $k in 1 to 1000000 return "
                              "(count(index-of($m, 1.5e0)), count(distinct-values(($m, 1e0))))"},
      {"Elements",
       "for $j in 1 to 1000, $k in 1 to 1000000 return count(<a>{for $i in 1 to 100000 return "
       "<b c='{$i}'>{$i}</b>}</a>)"},
      {"WideTree", "for $j in 1 to 1000, $k in 1 to 1000000 return count(//missing)", Input::Wide},
      {"EveryNode", "for $j in 1 to 1000, $k in 1 to 1000000 return count(//node())", Input::Wide},
      {"Siblings", "count(//e[count((following-sibling::e, 1)) < 0])", Input::Wide},
      {"Preceding", "count(//e[preceding::missing])", Input::Wide},
      {"PrecedingByPosition", "count(//e[preceding::e[100000]])", Input::Wide},
      {"Quadratic", "count(//a//b[.//b = //missing or count(ancestor::a) < 0])", Input::Nested},
      {"DescendantsOfAll", "count(//a[count(.//b) < 0])", Input::Nested},
      {"Ancestors", "count(//e[count(ancestor::e) < 0])", Input::Deep},
      {"Sets",
       "for $j in 1 to 1000, $k in 1 to 1000000 return count((//e union //a) intersect (//e except "
       "//b))",
       Input::Wide},
      {"SetsOfParts",
       "let $s := (//e, //e) for $j in 1 to 1000, $k in 1 to 1000000 return count($s | $s)",
       Input::Wide},
      {"Copying", "for $j in 1 to 1000, $k in 1 to 1000000 return count(<x>{/}</x>)", Input::Wide},
      {"CopyingDeep", "for $j in 1 to 1000, $k in 1 to 1000000 return count(<x>{/}</x>)",
       Input::Deep},
      {"Atomizing", "for $j in 1 to 1000, $k in 1 to 1000000 return count(data(/))", Input::Wide},
      {"AtomizingEach", "for $j in 1 to 1000, $k in 1 to 1000000 return count(data(//e))",
       Input::Wide},
      {"ComparingNodes", "for $j in 1 to 1000, $k in 1 to 1000000 where //e = 'missing' return $k",
       Input::Wide},
      {"Names",
       "for $j in 1 to 1000, $k in 1 to 1000000 for $e in //e return in-scope-prefixes($e)",
       Input::Deep},
      {"BaseURIs", "for $j in 1 to 1000, $k in 1 to 1000000 for $e in //e return base-uri($e)",
       Input::Deep},
      {"RecordedBaseURIs",
       "declare base-uri 'http://b/'; let $t := <t>{for $i in 1 to 100000 return <e/>}</t> "
       "for $j in 1 to 1000, $k in 1 to 1000000 for $e in reverse($t/e) return base-uri($e)"},
  };
  return rows;
}

Ref<NSXMLDocument> parsed(const std::string& xml) {
  return NSXMLDocument::documentWithData(xml, NSXMLNodePreserveWhitespace);
}

Value inputFor(Input input) {
  static const auto wide = parsed("<r>" + repeated("<e>text</e>", 200000) + "</r>");
  static const auto deep = parsed(repeated("<e>", 100000) + repeated("</e>", 100000));
  static const auto nested =
      parsed(repeated("<a><b/>", 10000) + repeated("<c/>", 10000) + repeated("</a>", 10000));
  switch (input) {
    case Input::Wide:
      return wide;
    case Input::Deep:
      return deep;
    case Input::Nested:
      return nested;
    default:
      return {};
  }
}

// An index stays with its document.
void makeIndex(const Value& input) {
  const auto* document = dyn_cast<NSXMLDocument>(input);
  if (!document) return;
  const NSXMLIndexesRef indexes = NSXMLTreeIndexes::of(document);
  static_cast<void>(indexes->elements(UINT32_MAX));
  ASSERT_TRUE(indexes->elements(0));
}

class LongWork : public testing::TestWithParam<Work> {
 protected:
  const Value input = inputFor(GetParam().input);
  const Ref<XQueryContext> context = XQueryContext::xqueryContext();
};

TEST_P(LongWork, EndsAtItsDeadline) {
  // Compiling may leave longer buffers behind.
  static_cast<void>(XQuery::xqueryWithSource(GetParam().query));
  makeIndex(input);
  const int64_t before = limitstest::valueBytes();
  expectSoon([&] { return endedAfter(milliseconds(60), *context, GetParam().query, input); },
             deadlinePassed, &Outcome::lateProcessor, limitstest::mostLate);
  context->contextSetLimits({});
  EXPECT_EQ(evaluate(*context, "1 + 1").result, "2");
  EXPECT_LE(limitstest::valueBytes(), before + limitstest::keptByAContext);
}

TEST_P(LongWork, EndsWhenCancelled) {
  // So that other phases of the work are met as well.
  for (const int after : {30, 170}) {
    expectSoon(
        [&] { return cancelledAfter(milliseconds(after), *context, GetParam().query, input); },
        cancelled, &Outcome::lateProcessor, limitstest::mostLate);
  }
}

INSTANTIATE_TEST_SUITE_P(Limits, LongWork, testing::ValuesIn(longWork()),
                         [](const auto& row) { return std::string(row.param.name); });

// --- documents -----------------------------------------------------------------------------------

class Supply : public XQueryLoader {
 public:
  explicit Supply(std::string data, const char* type = "application/xml")
      : _data(std::move(data)), _type(type) {}
  std::optional<XQueryResource> load(const NSURL& URL, XQueryLoadPurpose) override {
    return XQueryResource{_data, 200, _type, URL.absoluteString()->utf8()};
  }

 private:
  std::string _data;
  std::string _type;
};

Ref<XQueryContext> contextWithLoader(std::shared_ptr<XQueryLoader> loader) {
  XQueryLoading loading;
  loading.loader = std::move(loader);
  auto context = XQueryContext::xqueryContext();
  context->contextSetLoading(loading);
  return context;
}

constexpr const char* manyDocuments =
    "for $i in 1 to 1000000 return count(doc(concat('http://h/', $i))//missing)";

void expectParsingEnds(const std::shared_ptr<XQueryLoader>& loader) {
  for (const int after : {20, 90}) {
    expectSoon(
        [&] {
          return cancelledAfter(milliseconds(after), *contextWithLoader(loader), manyDocuments);
        },
        cancelled, &Outcome::lateProcessor, limitstest::mostLate);
  }
}

TEST(Limits, EndTheParsingOfALongDocument) {
  expectParsingEnds(
      std::make_shared<Supply>("<r>" + repeated("<e a='1'>text</e>", 1000000) + "</r>"));
}

TEST(Limits, EndTheParsingOfOneLongText) {
  expectParsingEnds(std::make_shared<Supply>("<r>" + std::string(50000000, 'x') + "</r>"));
}

TEST(Limits, EndTheExpansionOfEntities) {
  const std::string subset = "<!DOCTYPE r [<!ENTITY e '" + repeated("<e/>", 1000) + "'>]>";
  expectParsingEnds(std::make_shared<Supply>(subset + "<r>" + repeated("&e;", 2500) +
                                             std::string(5000000, ' ') + "</r>"));
}

TEST(Limits, EndTheParsingOfTagsOfManyAttributes) {
  std::string tag = "<e";
  for (int index = 0; index < 6000; ++index) tag += " a" + std::to_string(index) + "=''";
  expectParsingEnds(std::make_shared<Supply>("<r>" + repeated(tag + "/>", 200) + "</r>"));
}

TEST(Limits, EndTheReadingOfHtml) {
  const std::string paragraph = "<p>one <b>two<p title=x>three</b> <a href='http://h/'>four</a>";
  const auto loader = std::make_shared<Supply>(repeated(paragraph, 50000), "text/html");
  for (const int after : {30, 120, 250}) {
    expectSoon(
        [&] {
          return cancelledAfter(milliseconds(after), *contextWithLoader(loader), manyDocuments);
        },
        cancelled, &Outcome::lateWall, limitstest::mostWait);
  }
}

TEST(Limits, CountTheMemoryOfDocuments) {
  const auto context = contextWithLoader(
      std::make_shared<Supply>("<r>" + repeated("<e a='1'>text</e>", 200000) + "</r>"));
  XQueryLimits limits;
  limits.memoryCeiling = 8 * MiB;
  context->contextSetLimits(limits);
  EXPECT_EQ(evaluate(*context, "count(doc('http://h/a'))").error, ceilingReached);
}

// The document itself is small, and the parser keeps none of the comments.
TEST(Limits, CountTheBytesOfADocumentWhileTheyAreFetched) {
  const std::string comment = "<!--" + std::string(1000, ' ') + "-->";
  const std::string text = "<!DOCTYPE r [" + repeated(comment, 32 * MiB / 1000) + "]><r/>";
  const TestFolder folder;
  HTTPServer server;
  server.answer("/a.xml", "application/xml", text);
  for (const std::string& URL : {folder.write("a.xml", text), server.URL("/a.xml")}) {
    const auto context = XQueryContext::xqueryContext();
    XQueryLimits limits;
    limits.memoryCeiling = 8 * MiB;
    context->contextSetLimits(limits);
    const int64_t before = limitstest::valueBytes();
    const std::string query = "count(doc('" + URL + "'))";
    EXPECT_EQ(evaluate(*context, query).error, ceilingReached) << URL;
    EXPECT_LE(limitstest::valueBytes(), before + limitstest::keptByAContext) << URL;
    limits.memoryCeiling = 48 * MiB;
    context->contextSetLimits(limits);
    EXPECT_EQ(evaluate(*context, query).result, "1") << URL;
  }
}

TEST(Limits, DoNotLeaveADocumentInTheCacheAsMissing) {
  const auto context = contextWithLoader(
      std::make_shared<Supply>("<r>" + repeated("<e a='1'>text</e>", 200000) + "</r>"));
  XQueryLimits limits;
  limits.memoryCeiling = 8 * MiB;
  context->contextSetLimits(limits);
  EXPECT_EQ(evaluate(*context, "count(doc('http://h/a')//e)").error, ceilingReached);
  context->contextSetLimits({});
  EXPECT_EQ(evaluate(*context, "count(doc('http://h/a')//e)").result, "200000");
}

struct Slowness {
  const char* path;
  HTTPServer::Handler handler;
};

TEST(Limits, EndTheWaitForASlowServer) {
  HTTPServer server;
  const Slowness rows[] = {
      {"/silent", [](HTTPServer::Connection& connection) { connection.waitForEnd(); }},
      {"/trickle",
       [](HTTPServer::Connection& connection) {
         connection.send("HTTP/1.1 200 OK\r\nContent-Type: application/xml\r\n\r\n<r>");
         connection.trickle();
       }},
      {"/header",
       [](HTTPServer::Connection& connection) {
         connection.send("HTTP/1.1 200 OK\r\nX-Slow: ");
         connection.trickle();
       }},
  };
  for (const Slowness& row : rows) {
    server.handle(row.path, row.handler);
    const std::string query = "doc('" + server.URL(row.path) + "')";
    SCOPED_TRACE(row.path);
    expectSoon(
        [&] { return cancelledAfter(milliseconds(130), *XQueryContext::xqueryContext(), query); },
        cancelled, &Outcome::lateWall, limitstest::mostWait);
    expectSoon(
        [&] { return endedAfter(milliseconds(130), *XQueryContext::xqueryContext(), query); },
        deadlinePassed, &Outcome::lateWall, limitstest::mostWait);
  }
}

// --- when ----------------------------------------------------------------------------------------

Outcome underLimits(const XQueryLimits& limits, const std::string& query) {
  const auto context = XQueryContext::xqueryContext();
  context->contextSetLimits(limits);
  return evaluate(*context, query);
}

TEST(Limits, AreNoneUnlessSet) {
  const auto context = XQueryContext::xqueryContext();
  EXPECT_FALSE(context->contextLimits().deadline);
  EXPECT_FALSE(context->contextLimits().duration);
  EXPECT_FALSE(context->contextLimits().cancelled);
  EXPECT_FALSE(context->contextLimits().memoryCeiling);
  EXPECT_EQ(evaluate(*context, "count((1 to 3000000, 1))").result, "3000001");
}

TEST(Limits, ADeadlineThatHasPassedEndsTheShortestEvaluation) {
  XQueryLimits limits;
  limits.deadline = std::chrono::steady_clock::now();
  EXPECT_EQ(underLimits(limits, "1").error, deadlinePassed);
  EXPECT_EQ(underLimits(limits, "()").error, deadlinePassed);
  limits = {};
  limits.duration = milliseconds(0);
  EXPECT_EQ(underLimits(limits, "1").error, deadlinePassed);
  limits.duration = milliseconds(-5);
  EXPECT_EQ(underLimits(limits, "1").error, deadlinePassed);
}

TEST(Limits, TheEarlierOfDurationAndDeadlineCounts) {
  XQueryLimits limits;
  limits.deadline = std::chrono::steady_clock::now() + std::chrono::hours(1);
  limits.duration = milliseconds(20);
  EXPECT_EQ(underLimits(limits, longWork()[0].query).error, deadlinePassed);
  limits.deadline = std::chrono::steady_clock::now() + milliseconds(20);
  limits.duration = std::chrono::hours(1);
  EXPECT_EQ(underLimits(limits, longWork()[0].query).error, deadlinePassed);
}

TEST(Limits, ADurationBeyondTheClockIsNone) {
  XQueryLimits limits;
  limits.duration = std::chrono::nanoseconds::max();
  EXPECT_EQ(underLimits(limits, "1 + 1").result, "2");
  limits.deadline = std::chrono::steady_clock::time_point::max();
  EXPECT_EQ(underLimits(limits, "1 + 1").result, "2");
}

TEST(Limits, ADurationCountsAnewForEachEvaluation) {
  const auto context = XQueryContext::xqueryContext();
  XQueryLimits limits;
  limits.duration = milliseconds(200);
  context->contextSetLimits(limits);
  std::this_thread::sleep_for(milliseconds(250));
  EXPECT_EQ(evaluate(*context, "1 + 1").result, "2");
  EXPECT_EQ(evaluate(*context, longWork()[0].query).error, deadlinePassed);
  EXPECT_EQ(evaluate(*context, "1 + 1").result, "2");
}

TEST(Limits, AFlagHoldsForEveryContextThatSharesItUntilItIsCleared) {
  XQueryLimits limits;
  limits.cancelled = std::make_shared<std::atomic<bool>>(true);
  EXPECT_EQ(underLimits(limits, "1").error, cancelled);
  EXPECT_EQ(underLimits(limits, "1").error, cancelled);
  EXPECT_TRUE(*limits.cancelled);
  *limits.cancelled = false;
  EXPECT_EQ(underLimits(limits, "1").result, "1");
}

TEST(Limits, DeclaredVariablesAreEvaluatedUnderThem) {
  XQueryLimits limits;
  limits.duration = milliseconds(20);
  EXPECT_EQ(underLimits(limits,
                        "declare variable $v := every $i in 1 to 20000000 satisfies $i;"
                        "1")
                .error,
            deadlinePassed);
}

TEST(Limits, NobodyPassesOverTheirErrors) {
  const std::string endless = "(every $i in 1 to 20000000 satisfies $i)";
  XQueryLimits limits;
  limits.duration = milliseconds(20);
  EXPECT_EQ(underLimits(limits, "(1, 2)[" + endless + "]").error, deadlinePassed);
  EXPECT_EQ(underLimits(limits, endless + " castable as xs:date").error, deadlinePassed);
}

TEST(Limits, AnErrorOfTheQueryIsNoneHoweverItBegins) {
  const std::string error =
      "declare namespace p = 'limit: '; count((1, 2)[error(xs:QName('p:x'), 'limit: y')])";
  EXPECT_EQ(underLimits({}, error).result, "0");
}

TEST(Limits, LeaveTheFocusAsItWasBefore) {
  const auto context = XQueryContext::xqueryContext();
  _internal(*context).setContextItem(NSString::stringWithUTF8("kept"), 3);
  XQueryLimits limits;
  limits.duration = milliseconds(20);
  context->contextSetLimits(limits);
  EXPECT_EQ(evaluate(*context, "(1 to 20000000)[position() < 0]").error, deadlinePassed);
  context->contextSetLimits({});
  EXPECT_EQ(evaluate(*context, "., position()").result, "kept 3");
}

TEST(Limits, TheirErrorsHaveNumberZeroAndNoLine) {
  XQueryLimits limits;
  limits.duration = milliseconds(0);
  const auto context = XQueryContext::xqueryContext();
  context->contextSetLimits(limits);
  Ref<XQueryError> error;
  EXPECT_FALSE(context->evaluateXQuery(*XQuery::xqueryWithSource("\n\n1"), {}, nullptr, &error));
  ASSERT_TRUE(error);
  EXPECT_EQ(error->err(), 0);
  EXPECT_EQ(error->line(), 0);
}

// --- memory --------------------------------------------------------------------------------------

constexpr const char* explosions[] = {
    "(1 to 20000000, 1)",
    "for $i in 1 to 20000000 return $i",
    "for $i in 1 to 20000000 return concat('a', $i)",
    "count(((1 to 20000000, 1), (1 to 20000000, 1)))",
    "let $s := for $i in 1 to 20000000 return 1.5 return reverse($s)",
    "declare function local:f($s) { local:f(($s, $s)) }; local:f((1, 2))",
    "declare function local:f($s) { local:f(concat($s, $s)) }; local:f('ab')",
    "declare function local:f($s) { local:f(<a>{$s, $s}</a>) }; local:f(<b/>)",
    "<a>{for $i in 1 to 20000000 return <b/>}</a>",
    "<a>{for $i in 1 to 20000000 return 'text'}</a>",
    "for $i in 1 to 20000000 return <b c='{$i}'/>",
    "for $i in 1 to 20000000 order by -$i return $i",
    "distinct-values(for $i in 1 to 20000000 return concat('a', $i))",
    "for $i in 1 to 20000000 return xs:date('2004-01-01') + xdt:dayTimeDuration('P1D')",
    "(1 to 20000000)[. > 0]",
    "string-join(for $i in 1 to 20000000 return 'abc', ',')",
    "string-to-codepoints(string-join(for $i in 1 to 100000 return 'abcdefghij', ''))",
    "declare function local:f($s) { local:f(replace($s, 'a', 'aaaaaaaa')) }; local:f('a')",
    "declare function local:f($s) { local:f(reverse(($s, $s))) }; local:f((1, 2))",
};

class Explosions : public testing::TestWithParam<const char*> {};

TEST_P(Explosions, EndAtTheMemoryCeiling) {
  const auto context = XQueryContext::xqueryContext();
  XQueryLimits limits;
  limits.memoryCeiling = 24 * MiB;
  // Were it not for the ceiling.
  limits.duration = std::chrono::seconds(60);
  context->contextSetLimits(limits);
  const int64_t before = limitstest::valueBytes();
  for (int round = 0; round < 2; ++round) {
    EXPECT_EQ(evaluate(*context, GetParam()).error, ceilingReached);
    EXPECT_EQ(evaluate(*context, "count(for $i in 1 to 10000 return $i + 1)").result, "10000");
  }
  EXPECT_LE(limitstest::valueBytes(), before + limitstest::keptByAContext);
}

INSTANTIATE_TEST_SUITE_P(Limits, Explosions, testing::ValuesIn(explosions));

TEST(Limits, WithoutRoomOnlyWhatMakesNoValuesIsEvaluated) {
  XQueryLimits limits;
  limits.memoryCeiling = 0;
  EXPECT_EQ(underLimits(limits, "1").result, "1");
  EXPECT_EQ(underLimits(limits, "()").result, "");
  EXPECT_EQ(underLimits(limits, "1 + 1").error, ceilingReached);
  EXPECT_EQ(underLimits(limits, "<a/>").error, ceilingReached);
}

TEST(Limits, ACeilingBeyondTheAddressSpaceIsNone) {
  XQueryLimits limits;
  limits.memoryCeiling = std::numeric_limits<uint64_t>::max();
  EXPECT_EQ(underLimits(limits, "count((1 to 1000000, 1))").result, "1000001");
}

TEST(Limits, WhatIsFreedAgainDoesNotCountTowardTheCeiling) {
  XQueryLimits limits;
  limits.memoryCeiling = 4 * MiB;
  EXPECT_EQ(underLimits(limits,
                        "count(for $i in 1 to 300000 where concat('a', $i) = '' "
                        "return 1)")
                .result,
            "0");
  EXPECT_EQ(underLimits(limits, "sum(for $i in 1 to 40 return count((1 to 20000, 1)))").result,
            "800040");
  EXPECT_EQ(underLimits(limits,
                        "count(for $i in 1 to 300 where count(<a>{for $j in 1 to 1000 "
                        "return <b/>}</a>/b) = 0 return 1)")
                .result,
            "0");
}

TEST(Limits, ResultsThatAreKeptDoNotCountTowardTheNextEvaluation) {
  XQueryLimits limits;
  limits.memoryCeiling = 12 * MiB;
  auto context = XQueryContext::xqueryContext();
  context->contextSetLimits(limits);
  const auto query = XQuery::xqueryWithSource("for $i in 1 to 100000 return concat('text', $i)");
  const int64_t before = limitstest::valueBytes();
  {
    std::vector<Ref<NSArray>> kept;
    for (int round = 0; round < 8; ++round) {
      kept.push_back(context->evaluateXQuery(*query, {}, nullptr));
      ASSERT_TRUE(kept.back());
    }
    context = nullptr;
    for (const auto& result : kept) {
      EXPECT_EQ(XQueryItemStringValue(*result->objectAtIndex(99999)), "text100000");
    }
    EXPECT_GT(limitstest::valueBytes(), before + int64_t{8} * 3'000'000);
  }
  EXPECT_LE(limitstest::valueBytes(), before);
}

TEST(Limits, MemoryThatIsTakenIsCountedToTheByteAndGivenBack) {
  const auto context = XQueryContext::xqueryContext();
  XQueryLimits limits;
  limits.memoryCeiling = 64 * MiB;
  context->contextSetLimits(limits);
  const char* const queries[] = {
      "count(for $i in 1 to 20000 return ($i, concat('a long enough text to be outside', $i)))",
      "<a>{for $i in 1 to 20000 return <b c='{$i}'>{$i, <!--x-->}</b>}</a>",
      "count(distinct-values(for $i in 1 to 20000 return $i mod 1000))",
      "for $i in 1 to 20000 order by -$i return $i * 1.5",
      "1 div (1 to 20)",
      "error('x')",
  };
  for (const char* query : queries) {
    const auto compiled = XQuery::xqueryWithSource(query);
    // The first evaluation may leave an error or a date in the context.
    static_cast<void>(context->evaluateXQuery(*compiled, {}, nullptr));
    const int64_t before = limitstest::valueBytes();
    for (int round = 0; round < 3; ++round) {
      static_cast<void>(context->evaluateXQuery(*compiled, {}, nullptr));
    }
    EXPECT_EQ(limitstest::valueBytes(), before) << query;
  }
}

// --- nesting -------------------------------------------------------------------------------------

constexpr const char* endless[] = {
    "declare function local:f($n) { local:f($n + 1) }; local:f(0)",
    "declare function local:f($n) { for $i in (2, 1) order by local:f($n + $i) return $i };"
    "local:f(0)",
    "declare function local:f($n) { (1)[local:f($n + 1)] }; local:f(0)",
    "declare function local:f($n) { (1, 2) = local:f($n + 1) }; local:f(0)",
    "declare function local:f($n) { <a>{local:f($n + 1)}</a> }; local:f(0)",
    "declare function local:f($n) { some $i in (1, 2) satisfies local:f($n + $i) }; local:f(0)",
    "declare function local:f($n) { typeswitch (local:f($n)) case xs:integer return 1 default "
    "return 2 }; local:f(0)",
    "declare function local:f($n) { sum((1, local:f($n))) }; local:f(0)",
};

TEST(Limits, RecursionWithoutAnEndIsAnErrorOnEveryStack) {
  for (const size_t stack : {size_t{256} << 10, size_t{8} << 20}) {
    for (const char* query : endless) {
      onStack(stack, [&] {
        const auto context = XQueryContext::xqueryContext();
        EXPECT_EQ(evaluate(*context, query).error, tooDeep) << query;
        EXPECT_EQ(evaluate(*context, "1 + 1").result, "2");
      });
    }
  }
}

TEST(Limits, HoldOnSmallStacks) {
  onStack(size_t{256} << 10, [] {
    XQueryLimits limits;
    limits.duration = milliseconds(20);
    EXPECT_EQ(underLimits(limits, longWork()[0].query).error, deadlinePassed);
  });
}

}  // namespace
}  // namespace xquery

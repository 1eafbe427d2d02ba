// Built-in functions, joins and limits in several threads at once.
#include "Engine/ConcurrencyTesting.h"
#include "Platform/Loading/LoadingTestSupport.h"

#include <gtest/gtest.h>

#include <atomic>
#include <memory>

namespace xquery {
namespace {

constexpr Work works[] = {
    {"Strings",
     "for $t in //title return (upper-case($t), lower-case($t), normalize-space($t), "
     "substring($t, 2, 3), substring-before($t, ' '), substring-after($t, ' '), contains($t, '1'), "
     "starts-with($t, 'T'), ends-with($t, '5'), string-length($t), translate($t, 'Tit', 'tIT'), "
     "string-join(($t, 'x'), '-'), compare($t, 'Title 3'), escape-uri($t, true()), "
     "codepoints-to-string(string-to-codepoints($t)))"},
    {"Normalisation",
     "for $t in //title return (normalize-unicode($t, 'NFD'), normalize-unicode($t, 'NFKC'), "
     "upper-case(concat($t, '\xC3\xA9')))"},
    {"RegularExpressions",
     "for $t in //title return (matches($t, '^T.*[0-9]$'), replace($t, '([a-z]+)', '<$1>'), "
     "tokenize($t, '[ \xC3\xA9]'), matches($t, 'TITLE', 'i'))"},
    {"Numbers",
     "for $p in //price return (abs(-$p), floor($p), ceiling($p), round($p), "
     "round-half-to-even(xs:decimal($p) div 3, 2), number($p))"},
    {"Aggregates",
     "avg(//price), max(//price), min(//price), sum(//price), max(//title/string-length(.)), "
     "count(distinct-values(//price)), avg((xdt:dayTimeDuration('P1D'), "
     "xdt:dayTimeDuration('P3D')))"},
    {"Sequences",
     "reverse(//book/@id), subsequence(//price, 3, 2), remove((1, 2, 3), 2), "
     "insert-before((1, 2), 2, //b[1]), index-of(//price, '37.5'), unordered(//b[. < 3]), "
     "deep-equal(//book[1], //book[1]), deep-equal(//book[1], //book[2]), "
     "distinct-values((1, 1.0, 1e0, //b))"},
    {"Dates",
     "for $d in //day return (year-from-date($d cast as xs:date), month-from-date(xs:date($d)), "
     "adjust-date-to-timezone(xs:date($d), xdt:dayTimeDuration('PT5H')), "
     "subtract-dates-yielding-dayTimeDuration(xs:date($d), xs:date('2004-01-01')), "
     "hours-from-dateTime(xs:dateTime('2004-07-01T00:30:00')), "
     "minutes-from-duration(xdt:dayTimeDuration('PT5M')), implicit-timezone())"},
    {"QNames",
     "declare namespace m = 'urn:m'; for $b in //book return (node-name($b/@m:kind), "
     "local-name-from-QName(node-name($b)), namespace-uri-from-QName(xs:QName('m:x')), "
     "in-scope-prefixes($b), namespace-uri-for-prefix('m', $b), resolve-QName('m:y', $b), "
     "name($b/m:note), namespace-uri($b/m:note))"},
    {"Nodes",
     "for $b in //book return (base-uri($b), root($b)/library/comment(), lang('en', $b), "
     "data($b/price), string($b/title), nilled($b))"},
    {"IDs", "id('b3 b5')/title, //book[id('b7') is .]/@id, idref('b1')"},
    {"URIs",
     "for $b in //book return (resolve-uri($b/@id, 'http://example.org/a/'), "
     "xs:anyURI(concat('urn:', $b/@id)))"},
    {"JoinedClauses",
     "for $a in //book, $b in //book[@id = $a/@id] return concat($a/title, $b/price), "
     "for $a in //book, $b in //book where $a/price = $b/price return string($b/@id), "
     "for $a in 1 to 30, $b in 1 to 30 where $a eq $b return $a"},
    {"JoinedPaths",
     "for $a in //book return count(//book[price = $a/price]), "
     "for $i in 1 to 20 return //book[@id = concat('b', $i)]/title"},
    {"InnerQueries",
     "for $i in 1 to 5 return (ext:eval('sum(//price)', /), ext:node-xquery(/library, "
     "'count(book)'), "
     "ext:node-xpath(/library, 'book[2]/title'), ext:xpath-for-node((//b)[3]), "
     "ext:node-from-string(ext:string-from-node(//book[$i])))"},
    {"Stylesheets",
     "for $i in 1 to 3 return ext:xslt(/, '<x:stylesheet version=\"1.0\" "
     "xmlns:x=\"http://www.w3.org/1999/XSL/Transform\"><x:template match=\"/\"><all>"
     "<x:for-each select=\"//book\"><x:sort select=\"price\"/><b><x:value-of "
     "select=\"title\"/></b></x:for-each></all></x:template></x:stylesheet>')/*"},
    {"FailingStylesheets",
     "(1 to 3)[ext:xslt(/, '<x:stylesheet version=\"1.0\" "
     "xmlns:x=\"http://www.w3.org/1999/XSL/Transform\"><x:template match=\"/\"><x:message "
     "terminate=\"yes\">no</x:message></x:template></x:stylesheet>')], 'after'"},
    {"Binaries",
     "for $i in 1 to 20 return (xs:hexBinary('0aFF'), xs:base64Binary('AQID') cast as "
     "xs:hexBinary, xs:hexBinary('00') eq xs:hexBinary('00'))"},
};

class SharedFunctions : public testing::TestWithParam<Work> {};

TEST_P(SharedFunctions, GiveEveryThreadTheSame) {
  std::vector<std::string> complaints;
  const std::string expected = evaluatedTogether(GetParam().query, library(20), complaints);
  EXPECT_EQ(complaints, none);
  EXPECT_FALSE(expected.starts_with("error") || expected == "nothing") << expected;
}

INSTANTIATE_TEST_SUITE_P(Concurrency, SharedFunctions, testing::ValuesIn(works),
                         [](const auto& each) { return std::string(each.param.name); });

// --- limits --------------------------------------------------------------------------------------

constexpr const char* endless = "every $i in 1 to 100000, $j in 1 to 100000 satisfies $i + $j > 0";

// One flag ends them all.
TEST(ConcurrencyOfLimits, AFlagEndsEveryThreadsEvaluation) {
  const auto query = XQuery::xqueryWithSource(endless);
  const auto flag = std::make_shared<std::atomic<bool>>(false);
  std::atomic<int> begun{0};
  std::thread canceller([&] {
    while (begun < threadCount) std::this_thread::yield();
    std::this_thread::sleep_for(std::chrono::milliseconds(20));
    flag->store(true);
  });
  EXPECT_EQ(together([&](int, Complaints& complaints) {
              const auto context = newContext();
              XQueryLimits limits;
              limits.cancelled = flag;
              context->contextSetLimits(limits);
              ++begun;
              const std::string found = evaluated(*context, *query, nullptr);
              if (found.find("limit: evaluation cancelled") == found.npos) complaints.add(found);
            }),
            none);
  canceller.join();
}

// A thread's limits are no other thread's.
TEST(ConcurrencyOfLimits, EachThreadHasItsOwn) {
  const auto query = XQuery::xqueryWithSource(endless);
  const auto finite = XQuery::xqueryWithSource("count(for $i in 1 to 20000 return <e>{$i}</e>)");
  EXPECT_EQ(together([&](int thread, Complaints& complaints) {
              const auto context = newContext();
              if (thread % 2) {
                XQueryLimits limits;
                limits.duration = std::chrono::milliseconds(30);
                context->contextSetLimits(limits);
                const std::string found = evaluated(*context, *query, nullptr);
                if (found.find("limit: deadline passed") == found.npos) complaints.add(found);
                return;
              }
              for (int i = 0; i < 5; ++i) {
                const std::string found = evaluated(*context, *finite, nullptr);
                if (found != "xs:integer 20000\n") complaints.add(found);
              }
            }),
            none);
}

// What is thrown while a shared document is being numbered anew leaves it to the next to finish.
TEST(ConcurrencyOfLimits, ADeadlineInTheMidstOfASharedDocument) {
  const auto document = parsed(library(3000));
  document->rootElement()->insertChild(NSXMLElement::elementWithName(NSStringView::ascii("new")),
                                       0);
  const auto query = XQuery::xqueryWithSource("count((//b, //title, //new)/..)");
  EXPECT_EQ(together([&](int thread, Complaints& complaints) {
              const auto context = newContext();
              if (thread % 2) {
                XQueryLimits limits;
                limits.duration = std::chrono::milliseconds(1);
                context->contextSetLimits(limits);
              }
              const std::string found = evaluated(*context, *query, document);
              if (found.find("limit: ") == found.npos && found != "xs:integer 6001\n") {
                complaints.add(found);
              }
            }),
            none);
  EXPECT_EQ(evaluated(*query, document), "xs:integer 6001\n");
}

// --- clients and documents -----------------------------------------------------------------------

class Counting : public XQueryClient {
 public:
  void XQueryClientTraceValue(const Value&, const Ref<NSString>&, XQueryContext&) override {
    ++traced;
  }
  std::atomic<int> traced{0};
};

TEST(ConcurrencyOfClients, OneClientMayHearSeveralContexts) {
  const auto client = std::make_shared<Counting>();
  const auto query = XQuery::xqueryWithSource("for $i in 1 to 50 return trace($i, 'i')");
  EXPECT_EQ(together([&](int, Complaints& complaints) {
              const auto context = newContext();
              context->contextSetClient(client);
              if (evaluated(*context, *query, nullptr).empty()) complaints.add("nothing");
            }),
            none);
  EXPECT_EQ(client->traced, 50 * threadCount);
}

// Each context has documents of its own, whatever the others load from the same place.
TEST(ConcurrencyOfDocuments, ContextsLoadTheSameFiles) {
  const TestFolder folder;
  const std::string XML = folder.write("a.xml", library(20));
  const std::string HTML = folder.write("b.html", "<title>t</title><p>one<p>two");
  const std::string missing = folder.URL("none.xml");
  const auto query = XQuery::xqueryWithSource(
      std::string_view("count(doc('" + XML + "')//book), count(doc('" + HTML +
                       "')//*:p), empty(doc('" + missing + "')), doc('" + XML + "') is doc('" +
                       XML + "'), ends-with(document-uri(doc('" + XML + "')), 'a.xml')"));
  EXPECT_EQ(together([&](int, Complaints& complaints) {
              for (int i = 0; i < 3; ++i) {
                const std::string found = evaluated(*query, nullptr);
                if (found !=
                    "xs:integer 20\nxs:integer 2\nxs:boolean true\nxs:boolean true\n"
                    "xs:boolean true\n") {
                  complaints.add(found);
                }
              }
            }),
            none);
}

}  // namespace
}  // namespace xquery

// Several threads at once: one query over one document, each thread with a context of its own;
// compilations; first uses; values handed from thread to thread.
#include "Engine/ConcurrencyTesting.h"
#include "Engine/ModuleTable.h"
#include "Platform/Loading/LoadingTestSupport.h"

#include <gtest/gtest.h>

#include <barrier>
#include <deque>
#include <mutex>
#include <string>
#include <thread>
#include <vector>

namespace xquery {
namespace {

// --- one query, one document ---------------------------------------------------------------------

constexpr Work works[] = {
    {"Paths", "count(//book/title), //book[price > 90]/title, /library/book[3]/@id"},
    {"NamesAndKinds",
     "declare namespace m = 'urn:m'; //m:note/b, //book/@m:kind, /library/comment(), "
     "/library/processing-instruction(style), //m:*[b = '7'], count(//*:note)"},
    {"DocumentOrder",
     "declare namespace m = 'urn:m'; (//price, //title)[. << (//book)[5]], (//book[4], //book[2]) "
     "union //book[3], "
     "(//book[9] intersect //book[9], //b except //book/m:note/b)[1]"},
    {"ReverseAxes",
     "//b[. = '8']/ancestor::*/local-name(.), (//book)[4]/preceding-sibling::book/@id, "
     "(//price)[3]/following::title[2], (//price)[3]/preceding::b"},
    {"Positions", "//book[last()]/@id, //book[position() < 3]/title[1]/text()"},
    {"Constructors",
     "for $b in //book[price < 20] return <found at='{$b/@id}' n=\"{1, 2}\">{$b/title, "
     "attribute late {1}, text {'x', 1}, comment {'c'}, processing-instruction p {'q'}}</found>"},
    {"Literals",
     "count(//book/(7)), count(//book/('text')), for $i in 1 to 100 return ($i + 1, 'seven', 1.5, "
     "2e0, -1, 'a literal of more than twenty-four units', xs:token('token'), <e a='1'>text</e>)"},
    {"ComputedNames",
     "for $i in 1 to 20 return element {concat('e', $i)} {attribute {concat('a', $i)} {$i}}"},
    {"ConstantNodes", "(<!-- same -->, <?same pi?>, <e><!-- in --></e>, <f a='1'/>)"},
    {"AdoptedNodes", "let $a := <a><b/></a> return <c>{$a, $a, $a/b}</c>"},
    {"BaseURIs",
     "declare base-uri 'http://example.org/base/'; <a><b>{for $i in 1 to 30 return <c>{$i}</c>}"
     "</b></a>"},
    {"BaseURIsAndTheDocument",
     "declare base-uri 'http://example.org/base/'; (//book[2], <a/>, base-uri(//book[3]))"},
    {"Sorting",
     "for $b in //book let $p := $b/price order by xs:decimal($p) descending, $b/title "
     "return string($b/@id)"},
    {"Joins",
     "for $a in //book, $b in //book[@id = $a/@id] where $a/price = $b/price "
     "return <pair>{$a/title/text(), $b/price/text()}</pair>"},
    {"FunctionsAndGlobals",
     "declare variable $all := //book; declare variable $n := count($all); "
     "declare function local:sum($x as item()*, $i as xs:integer) as xs:double { "
     "if ($i > count($x)) then 0 else number($x[$i]) + local:sum($x, $i + 1) }; "
     "$n, local:sum($all/price, 1)"},
    {"DecimalsAndDoubles",
     "for $i in 1 to 30 return ($i div 7, 1.5 * $i, 1e3 div $i, $i * "
     "123456789012345678901234567.5, "
     "xs:float('1.25') + $i, $i idiv 3, -$i, $i mod 4)"},
    {"Texts",
     "declare namespace m = 'urn:m'; for $b in //book return (concat($b/title, '-', $b/@id), "
     "string($b/m:note), "
     "$b/title eq 'Title 3', $b/title < 'Title 5')"},
    {"Casting",
     "for $b in //book return (xs:double($b/price), xs:decimal($b/price) cast as xs:integer, "
     "$b/price cast as xs:string, xs:date($b/day), $b/day castable as xs:date, "
     "xs:hexBinary('0aff'), xs:base64Binary('AAAA'), xs:anyURI('http://example.org/'))"},
    {"DatesAndZones",
     "for $b in //book return (xs:date($b/day) + xdt:dayTimeDuration('P40D'), "
     "xs:dateTime('2004-07-01T00:30:00') lt xs:dateTime('2004-07-01T00:30:00Z'), "
     "xs:dateTime('2004-03-28T01:30:00+02:00') - xs:dateTime('2003-03-28T01:30:00Z'), "
     "xdt:yearMonthDuration('P1Y2M') + xdt:yearMonthDuration('P1M'), xs:time('10:00:00'))"},
    {"ControlFlow",
     "for $b in //book return if (some $p in $b/price satisfies $p > 50) then typeswitch "
     "($b/title) "
     "case element(title) return 'title' default return 'other' else "
     "(every $x in (1, 2, 3) satisfies $x instance of xs:integer)"},
    {"Sequences",
     "declare namespace m = 'urn:m'; distinct-values(//book/@m:kind), exists(//none), "
     "empty(//none), boolean(//b), "
     "zero-or-one(//none), (1 to 100)[. mod 7 = 0], sum(//price), root((//b)[5])/library/book[1]"},
    {"LateNames", "<late:e late:a='1'><late:f/></late:e>, local-name(<late:g/>)"},
    {"Errors", "for $b in //book return xs:integer($b/title)"},
    {"MissingGlobals", "declare variable $absent external; $absent"},
};

class SharedQuery : public testing::TestWithParam<Work> {};

TEST_P(SharedQuery, GivesEveryThreadTheSame) {
  std::vector<std::string> complaints;
  const std::string expected = evaluatedTogether(GetParam().query, library(20), complaints);
  EXPECT_EQ(complaints, none);
  const std::string name = GetParam().name;
  EXPECT_EQ(expected.starts_with("error"), name == "Errors" || name == "MissingGlobals")
      << expected;
}

INSTANTIATE_TEST_SUITE_P(Concurrency, SharedQuery, testing::ValuesIn(works),
                         [](const auto& each) { return std::string(each.param.name); });

// One context serves many evaluations of its thread; queries and documents change under it.
TEST(Concurrency, ContextsLastOverManyQueries) {
  const std::string xml = library(10);
  const Value document = parsed(xml);
  std::vector<Ref<XQuery>> queries;
  std::vector<std::string> expected;
  for (const Work& work : works) {
    queries.push_back(XQuery::xqueryWithSource(std::string_view(work.query)));
    expected.push_back(evaluated(*queries.back(), parsed(xml)));
  }
  EXPECT_EQ(
      together([&](int thread, Complaints& complaints) {
        const auto context = XQueryContext::xqueryContextWithNamespaces({{"late", "urn:late"}});
        for (size_t i = 0; i < queries.size(); ++i) {
          const size_t which = (i + static_cast<size_t>(thread) * 3) % queries.size();
          // A context that has recorded a base URI marks the first new element of every result.
          if (std::string_view(works[which].name).starts_with("BaseURIs")) continue;
          Ref<XQueryError> error;
          const auto items = context->evaluateXQuery(*queries[which], {}, document, &error);
          if (printed(items, error) != expected[which]) complaints.add(works[which].name);
        }
      }),
      none);
}

TEST(Concurrency, ConstantsAreShared) {
  const auto query = XQuery::xqueryWithSource(
      "declare variable $all external; declare variable $n external; "
      "sum($all) + $n, count($all[. > $n]), <e>{$all}</e>, $all[3]");
  std::vector<Value> numbers;
  for (int i = 0; i < 50; ++i) numbers.push_back(NSString::stringWithUTF8(std::to_string(i)));
  const XQueryVariables constants = {{"all", NSArray::arrayWithObjects(numbers)},
                                     {"n", NSNumber::numberWithLongLong(10)}};
  const std::string expected = evaluated(*query, nullptr, constants);
  EXPECT_EQ(together([&](int, Complaints& complaints) {
              for (int i = 0; i < evaluations; ++i) {
                const std::string found = evaluated(*query, nullptr, constants);
                if (found != expected) complaints.add(found);
              }
            }),
            none);
}

// Without a parent they could become part of what is constructed.
TEST(Concurrency, ConstantNodesAreShared) {
  const auto query = XQuery::xqueryWithSource(
      "declare base-uri 'http://example.org/'; declare variable $n external; "
      "let $e := <e>{$n}</e> return ($n, $e, <f>{$n, $n[1]}</f>, document {$n[1]}, "
      "$e//m, count($n/ancestor-or-self::node()), <g>{.}</g>)");
  const auto element = NSXMLElement::elementWithName(NSStringView::ascii("n"));
  element->addChild(NSXMLElement::elementWithName(NSStringView::ascii("m")));
  const Ref<NSXMLNode> comment = NSXMLNode::commentWithStringValue(NSStringView::ascii("c"));
  const XQueryVariables constants = {{"n", NSArray::arrayWithObjects({element, comment})}};
  const std::string expected = evaluated(*query, element->copy(), constants);
  EXPECT_EQ(expected.find("error"), std::string::npos) << expected;
  EXPECT_EQ(together([&](int, Complaints& complaints) {
              for (int i = 0; i < rounds; ++i) {
                const std::string found = evaluated(*query, element, constants);
                if (found != expected) complaints.add(found);
              }
            }),
            none);
  EXPECT_FALSE(element->parent());
  EXPECT_EQ(element->XMLString()->utf8(), "<n><m/></n>");
}

// One comment for all threads.
TEST(Concurrency, ConstantCommentsAreShared) {
  const auto query = XQuery::xqueryWithSource(
      "declare function local:c() { <!--c--> }; "
      "let $e := <e>{local:c(), local:c()}</e> return ($e, $e/comment(), local:c(), "
      "document {local:c()}, local:c() is local:c(), empty(local:c()/..), local:c() << "
      "$e/comment()[1])");
  const std::string expected = evaluated(*query, nullptr);
  EXPECT_EQ(expected.find("error"), std::string::npos) << expected;
  EXPECT_EQ(together([&](int, Complaints& complaints) {
              for (int i = 0; i < rounds; ++i) {
                const std::string found = evaluated(*query, nullptr);
                if (found != expected) complaints.add(found);
              }
            }),
            none);
}

// --- trees ---------------------------------------------------------------------------------------

// Order numbers that a change has made stale are assigned anew by whoever asks first. The threads
// meet at each tree with nothing else to do, so that they ask at the same time.
TEST(Concurrency, OrderNumbersOfAChangedTree) {
  constexpr int trees = 300;
  const auto query = XQuery::xqueryWithSource("(//c, //a, //b)/local-name(.), //c << //a");
  const std::string expected = evaluated(*query, parsed("<r x='1'><a/><b/><c/></r>"));
  std::vector<Ref<NSXMLDocument>> documents;
  for (int i = 0; i < trees; ++i) {
    documents.push_back(parsed("<r><a/><c/></r>"));
    NSXMLElement* root = documents.back()->rootElement();
    root->insertChild(NSXMLElement::elementWithName(NSStringView::ascii("b")), 1);
    root->addAttribute(
        NSXMLNode::attributeWithName(NSStringView::ascii("x"), NSStringView::ascii("1")));
  }
  std::barrier tree(threadCount);
  EXPECT_EQ(together([&](int, Complaints& complaints) {
              const auto context = XQueryContext::xqueryContext();
              for (const auto& document : documents) {
                tree.arrive_and_wait();
                const std::string found = evaluated(*context, *query, document);
                if (found != expected) complaints.add(found);
              }
            }),
            none);
}

// A detached part shares its tree's memory, not its order.
TEST(Concurrency, OrderNumbersOfSeveralRoots) {
  const auto document = parsed(library(20));
  std::vector<Ref<NSXMLNode>> parts;
  for (int i = 0; i < 4; ++i) {
    parts.emplace_back(document->rootElement()->lastChild());
    parts.back()->detach();
  }
  const auto order = XQuery::xqueryWithSource(
      "(descendant::b, child::title, @id)[. << .], count((price, title)[1] "
      "union price), (price, title)/.. is .");
  const std::string expected = evaluated(*order, parts[0]);
  EXPECT_EQ(together([&](int thread, Complaints& complaints) {
              for (size_t i = 0; i < parts.size(); ++i) {
                const auto& part = parts[(i + static_cast<size_t>(thread)) % parts.size()];
                const std::string found = evaluated(*order, part);
                if (found != expected) complaints.add(found);
              }
            }),
            none);
}

// Each thread makes trees with names that others make, use and drop at the same time.
TEST(Concurrency, NamesComeAndGo) {
  EXPECT_EQ(together([](int thread, Complaints& complaints) {
              for (int i = 0; i < 100; ++i) {
                const std::string name = "n" + std::to_string((i + thread) % 7);
                const std::string xml = "<p:" + name + " xmlns:p=\"urn:" + name + "\" a=\"" +
                                        std::to_string(i) + "\"></p:" + name + ">";
                const auto document = parsed(xml);
                const auto* root = document->rootElement();
                if (root->localName()->utf8() != name || root->URI()->utf8() != "urn:" + name) {
                  complaints.add(document->XMLString()->utf8());
                }
              }
            }),
            none);
}

TEST(Concurrency, WritersShareATree) {
  const auto document = parsed(library(30));
  const std::string expected = parsed(library(30))->XMLString()->utf8();
  EXPECT_EQ(together([&](int, Complaints& complaints) {
              const Ref<NSXMLNode> copy = document->copy();
              if (copy->XMLString()->utf8() != expected) complaints.add("copy");
              if (document->XMLString()->utf8() != expected) complaints.add("original");
              if (document->rootElement()->stringValue()->length() == 0) complaints.add("text");
            }),
            none);
}

// --- values handed on ----------------------------------------------------------------------------

// Nodes made in one thread are read, copied and adopted by another after it has ended.
TEST(Concurrency, ConstructedNodesOutliveTheirThread) {
  Ref<NSArray> made;
  std::thread([&made] {
    const auto context = XQueryContext::xqueryContext();
    made = context->evaluateXQuery(
        *XQuery::xqueryWithSource(
            "declare base-uri 'http://example.org/'; for $i in 1 to 50 return "
            "<e n='{$i}'><f>{$i * 2}</f></e>"),
        {}, nullptr);
  }).join();
  ASSERT_TRUE(made);
  ASSERT_EQ(made->count(), 50U);
  const std::string expected =
      evaluated(*XQuery::xqueryWithSource("sum(./f), string(./@n)"), made->objectAtIndex(7));
  EXPECT_EQ(expected, "xs:double 16\nxs:string 8\n");
  EXPECT_EQ(together([&](int, Complaints& complaints) {
              const auto query = XQuery::xqueryWithSource("sum(./f), string(./@n)");
              if (evaluated(*query, made->objectAtIndex(7)) != expected) complaints.add("read");
            }),
            none);
  const auto wrapped = XQueryContext::xqueryContext()->evaluateXQuery(
      *XQuery::xqueryWithSource("declare variable $made external; <all>{$made}</all>"),
      {{"made", made}}, nullptr);
  made = nullptr;
  EXPECT_EQ(cast<NSXMLElement>(wrapped->objectAtIndex(0))->childCount(), 50U);
}

// Every object is freed by another thread than the one that made it.
TEST(Concurrency, ObjectsAreFreedElsewhere) {
  std::mutex mutex;
  std::deque<std::pair<int, Ref<NSArray>>> handed;
  EXPECT_EQ(
      together([&](int thread, Complaints& complaints) {
        const auto query = XQuery::xqueryWithSource(
            "for $i in 1 to 200 return ($i + 0.5, concat('t', $i), <e>{$i}</e>, "
            "xs:date('2004-01-01') + xdt:dayTimeDuration('P1D'), $i div 3, xs:QName('xml:x'))");
        for (int i = 0; i < 10; ++i) {
          const auto items = XQueryContext::xqueryContext()->evaluateXQuery(*query, {}, nullptr);
          if (!items || items->count() != 1200) complaints.add("items");
          std::pair<int, Ref<NSArray>> other;
          {
            const std::lock_guard guard(mutex);
            handed.emplace_back(thread, items);
            if (handed.size() < 4) continue;
            other = std::move(handed.front());
            handed.pop_front();
          }
          if (XQueryItemStringValue(*other.second->objectAtIndex(1199)) != "xml:x") {
            complaints.add("handed");
          }
        }
      }),
      none);
}

// Contexts, with the documents they loaded, and queries end in threads that never used them.
TEST(Concurrency, ContextsAndQueriesEndElsewhere) {
  std::vector<Ref<XQueryContext>> contexts(threadCount);
  std::vector<Ref<XQuery>> queries(threadCount);
  std::vector<Ref<NSArray>> results(threadCount);
  EXPECT_EQ(together([&](int thread, Complaints& complaints) {
              const auto slot = static_cast<size_t>(thread);
              contexts[slot] = XQueryContext::xqueryContext();
              queries[slot] = XQuery::xqueryWithSource(
                  "declare function local:f($x) { <e>{$x}</e> }; for $i in 1 to 20 return "
                  "local:f($i)");
              results[slot] = contexts[slot]->evaluateXQuery(*queries[slot], {}, parsed("<r/>"));
              if (!results[slot]) complaints.add("no result");
            }),
            none);
  EXPECT_EQ(together([&](int thread, Complaints& complaints) {
              const auto slot = static_cast<size_t>((thread + 1) % threadCount);
              contexts[slot] = nullptr;
              queries[slot] = nullptr;
              if (results[slot]->count() != 20) complaints.add("result");
              results[slot] = nullptr;
            }),
            none);
}

// Objects made while the process had one thread are counted safely when it has several.
TEST(Concurrency, ObjectsOlderThanTheFirstThread) {
  const auto document = parsed(library(5));
  const Ref<NSString> text = NSString::stringWithASCII("a text that is shared by all the threads");
  const Value value = text;
  const auto items = NSArray::arrayWithObjects({value, document, value});
  EXPECT_EQ(together([&](int, Complaints& complaints) {
              for (int i = 0; i < 2000; ++i) {
                const Ref<NSArray> array = items;
                const Value item = array->objectAtIndex(i % 3);
                const std::vector<Value> copies(3, item);
                if (!copies[2]) complaints.add("lost");
              }
            }),
            none);
  EXPECT_EQ(text->utf8(), "a text that is shared by all the threads");
  EXPECT_EQ(document->rootElement()->localName()->utf8(), "library");
}

// --- first uses ----------------------------------------------------------------------------------

// Run as a process of its own, as the test driver does, this is where everything that the engine
// makes on first use is made, by all threads together.
TEST(ConcurrencyOfFirstUses, EverythingBeginsAtOnce) {
  EXPECT_EQ(together([](int, Complaints& complaints) {
              const auto document = parsed("<r xml:lang='en'><a>1</a><a>2</a></r>");
              const std::string found = evaluated(
                  "declare variable $g := <g/>; declare function local:f($x) { $x }; "
                  "(//a[2], //a[1])/text(), local:f(true()), 1 = 1, xs:double('INF'), 1 div 3, "
                  "xs:date('2004-05-06') + xdt:dayTimeDuration('P1D'), xs:time('01:00:00Z'), "
                  "xs:QName('xs:x'), name($g), xs:hexBinary('AB'), (), '', 2 castable as xs:token",
                  document);
              if (found !=
                  "text() 1\ntext() 2\nxs:boolean true\nxs:boolean true\nxs:double INF\n"
                  "xs:decimal 0.33333333333333333333333333333333333333\n"
                  "xs:date 2004-05-07\nxs:time 01:00:00Z\nxs:QName xs:x\nxs:string g\n"
                  "xs:hexBinary AB\nxs:string \nxs:boolean true\n") {
                complaints.add(found);
              }
            }),
            none);
}

// --- compiling -----------------------------------------------------------------------------------

XQueryLoading modules() {
  return loadingOf({
      {"http://host/a",
       "module namespace a = 'urn:a'; import module namespace b = 'urn:b' at 'http://host/b'; "
       "declare variable $a:v := $b:v + 1; declare function a:f($x) { $x * $a:v };"},
      {"http://host/b", "module namespace b = 'urn:b'; declare variable $b:v := 20;"},
      {"http://host/bad", "module namespace bad = 'urn:bad'; declare function bad:f() { 1 + };"},
  });
}

TEST(Concurrency, CompilationsAreSerialised) {
  const XQueryLoading loading = modules();
  EXPECT_EQ(together([&](int thread, Complaints& complaints) {
              for (int i = 0; i < 12; ++i) {
                const std::string number = std::to_string(thread * 100 + i);
                const auto good = XQuery::xqueryWithSource(
                    std::string_view("import module namespace a = 'urn:a' at 'http://host/a'; "
                                     "declare default element namespace 'urn:" +
                                     number + "'; a:f(" + number + "), <e/>"),
                    loading);
                const std::string expected = "xs:integer " +
                                             std::to_string((thread * 100 + i) * 21) +
                                             "\nelement() <e xmlns=\"urn:" + number + "\"/>\n";
                const std::string found = evaluated(*good, nullptr);
                if (found != expected) complaints.add(found);
                const auto bad = XQuery::xqueryWithSource(
                    "import module namespace bad = 'urn:bad' at 'http://host/bad'; 1", loading);
                const auto errors = bad->parseErrors();
                if (!errors || cast<XQueryError>(errors->objectAtIndex(0))->err() != 47) {
                  complaints.add("bad module");
                }
                const auto wrong = XQuery::xqueryWithSource("1 +\n" + number + " +");
                if (!wrong->parseErrors()) complaints.add("wrong");
              }
            }),
            none);
}

// Half of the threads compile what the others have to do nothing with.
TEST(Concurrency, QueriesAreEvaluatedWhileOthersCompile) {
  const XQueryLoading loading = modules();
  const auto query = XQuery::xqueryWithSource(
      "import module namespace a = 'urn:a' at 'http://host/a'; "
      "for $b in //book order by a:f(xs:double($b/price)) return string($b/title)",
      loading);
  const Value document = parsed(library(20));
  const std::string expected = evaluated(*query, parsed(library(20)));
  EXPECT_EQ(together([&](int thread, Complaints& complaints) {
              for (int i = 0; i < 10; ++i) {
                if (thread % 2) {
                  const std::string found = evaluated(*query, document);
                  if (found != expected) complaints.add(found);
                } else {
                  const std::string found =
                      evaluated("for $book in //book[" + std::to_string(i + 1) +
                                    "] return <title>{string($book/@id)}</title>",
                                document);
                  if (found != "element() <title>b" + std::to_string(i) + "</title>\n") {
                    complaints.add(found);
                  }
                }
              }
            }),
            none);
}

TEST(Concurrency, QueryAndDocumentEndWhileOthersGoOn) {
  for (int round = 0; round < 5; ++round) {
    auto query = XQuery::xqueryWithSource("//book[price > 50]/title/text()");
    Value document = parsed(library(10));
    const std::string expected = evaluated(*query, parsed(library(10)));
    std::vector<std::pair<Ref<XQuery>, Value>> shares(threadCount, {query, document});
    query = nullptr;
    document = nullptr;
    EXPECT_EQ(together([&](int thread, Complaints& complaints) {
                auto share = std::move(shares[static_cast<size_t>(thread)]);
                if (evaluated(*share.first, share.second) != expected) complaints.add("result");
              }),
              none);
  }
}

// What the threads found is read, and let go of, by others, when all that it came from is gone.
TEST(Concurrency, ResultsOutliveWhatTheyCameFrom) {
  constexpr const char* source =
      "//book[price > 50]/title, 7, 'a literal of more than twenty-four units', <!-- c -->, "
      "<made at='{//book[1]/@id}'>{//book[2]}</made>, //title/string(), 1 + 1";
  const std::string expected = evaluated(source, parsed(library(10)));
  for (int round = 0; round < 5; ++round) {
    std::vector<Ref<NSArray>> results(threadCount);
    {
      const auto query = XQuery::xqueryWithSource(source);
      const Value document = parsed(library(10));
      EXPECT_EQ(together([&](int thread, Complaints& complaints) {
                  Ref<XQueryError> error;
                  auto& items = results[static_cast<size_t>(thread)];
                  items = newContext()->evaluateXQuery(*query, {}, document, &error);
                  if (!items) complaints.add("no result");
                }),
                none);
    }
    EXPECT_EQ(together([&](int thread, Complaints& complaints) {
                auto items = std::move(results[static_cast<size_t>((thread + 1) % threadCount)]);
                if (printed(items, nullptr) != expected) complaints.add("result");
              }),
              none);
  }
}

// --- loading -------------------------------------------------------------------------------------

// Each context fetches for itself and keeps what it fetched.
TEST(Concurrency, ContextsLoadForThemselves) {
  const TestFolder folder;
  const std::string XML = folder.write("a.xml", library(5));
  const std::string HTML = folder.write("b.html", "<p>one<p>two");
  EXPECT_EQ(together([&](int, Complaints& complaints) {
              const auto loader = NSURLLoader::loaderWithLoading({});
              if (loaded(*loader, XML) != library(5)) complaints.add("XML");
              if (loaded(*loader, HTML) != "<p>one<p>two") complaints.add("HTML");
              const auto document = NSXMLDocument::documentWithData(loaded(*loader, HTML),
                                                                    NSXMLDocumentTidyHTML, nullptr);
              if (!document || evaluated("count(//*:p)", document) != "xs:integer 2\n") {
                complaints.add("tidied");
              }
              if (!isNothing(loaded(*loader, "http://127.0.0.1:9/none"))) complaints.add("none");
            }),
            none);
}

// --- zones ---------------------------------------------------------------------------------------

TEST(Concurrency, ZonesAreShared) {
  const auto zone = NSTimeZone::timeZoneWithName("Europe/Berlin");
  ASSERT_TRUE(zone);
  EXPECT_EQ(together([&](int thread, Complaints& complaints) {
              for (int i = 0; i < 200; ++i) {
                NSInstant at{};
                at.seconds = int64_t{86400} * 30 * (i + thread);
                const int32_t offset = zone->secondsFromGMT(at);
                if (offset != 3600 && offset != 7200) complaints.add(std::to_string(offset));
                if (zone->isDaylightSavingTime(at) != (offset == 7200)) complaints.add("daylight");
                NSTimeZone::localTimeZone()->secondsFromGMTForClock(at.seconds);
              }
              if (!NSTimeZone::timeZoneWithName("America/New_York")) complaints.add("name");
            }),
            none);
}

}  // namespace
}  // namespace xquery

// The public interface as a host program uses it: the installed headers, and of the engine only how
// it hands a trace on.
#include "Context/XQueryContextInternal.h"
#include "Engine/EmbeddingTesting.h"

#include <atomic>
#include <string>
#include <thread>
#include <vector>

namespace xquery {
namespace {

std::string types(const Ref<NSArray>& items) {
  if (!items) return "(no result)";
  std::string all;
  for (const Value& item : items->objects()) {
    if (!all.empty()) all += ' ';
    all += XQueryItemTypeName(*item);
  }
  return all;
}

// --- compile once, evaluate often ----------------------------------------------------------------

TEST_F(Embedding, OneQueryServesManyDocuments) {
  const auto query = XQuery::xqueryWithSource("/r/a[. > 1] + 0");
  ASSERT_FALSE(query->parseErrors());
  for (int n = 2; n < 200; ++n) {
    const Value document = parse("<r><a>1</a><a>" + std::to_string(n) + "</a></r>");
    ASSERT_EQ(strings(context->evaluateXQuery(*query, {}, document, &error)), std::to_string(n));
  }
}

TEST_F(Embedding, OneDocumentServesManyQueries) {
  const Value document = parse("<r><a>1</a><b>2</b></r>");
  EXPECT_EQ(strings(evaluate("/r/a", {}, document)), "1");
  EXPECT_EQ(strings(evaluate("/r/b", {}, document)), "2");
  EXPECT_EQ(strings(evaluate("/r/*", {}, document)), "1 2");
}

TEST_F(Embedding, EvaluationsDoNotInfluenceOneAnother) {
  const auto good = XQuery::xqueryWithSource("1 + 1");
  const auto bad = XQuery::xqueryWithSource("1 + 'x'");
  for (int i = 0; i < 3; ++i) {
    EXPECT_EQ(strings(context->evaluateXQuery(*good, {}, nullptr, &error)), "2");
    EXPECT_FALSE(error);
    EXPECT_FALSE(context->evaluateXQuery(*bad, {}, nullptr, &error));
    EXPECT_EQ(failure(), "6 invalid type for operator");
  }
}

TEST_F(Embedding, ASuccessClearsTheErrorSlot) {
  EXPECT_FALSE(evaluate("$nowhere"));
  ASSERT_TRUE(error);
  EXPECT_TRUE(evaluate("1"));
  EXPECT_FALSE(error);
}

TEST_F(Embedding, TheErrorSlotMayBeLeftOut) {
  const auto failing = XQuery::xqueryWithSource("1 + 'x'");
  const auto broken = XQuery::xqueryWithSource("1 +");
  EXPECT_FALSE(context->evaluateXQuery(*failing, {}, nullptr));
  EXPECT_FALSE(context->evaluateXQuery(*broken, {}, nullptr));
  EXPECT_EQ(strings(context->evaluateXQuery(*XQuery::xqueryWithSource("7"), {}, nullptr)), "7");
}

TEST_F(Embedding, ContextsHaveTheirOwnItems) {
  const auto query = XQuery::xqueryWithSource("/*/@n");
  const auto first = XQueryContext::xqueryContext();
  const auto second = XQueryContext::xqueryContext();
  EXPECT_EQ(strings(first->evaluateXQuery(*query, {}, parse("<a n='1'/>"), &error)), "1");
  EXPECT_EQ(strings(second->evaluateXQuery(*query, {}, parse("<a n='2'/>"), &error)), "2");
  EXPECT_EQ(strings(first->evaluateXQuery(*query, {}, nullptr, &error)), "1");
  EXPECT_EQ(strings(second->evaluateXQuery(*query, {}, nullptr, &error)), "2");
}

// --- the context item ----------------------------------------------------------------------------

TEST_F(Embedding, AnEarlierContextItemStaysWithoutANewOne) {
  EXPECT_EQ(strings(evaluate("/a", {}, parse("<a>1</a>"))), "1");
  EXPECT_EQ(strings(evaluate("/a")), "1");
  EXPECT_EQ(strings(evaluate("/a", {}, NSNull::null())), "1");
  EXPECT_EQ(strings(evaluate("/a", {}, parse("<a>2</a>"))), "2");
  EXPECT_EQ(strings(evaluate("/a", {}, NSNull::null())), "2");
}

TEST_F(Embedding, AnEarlierContextItemOutlivesTheHostsHandle) {
  Value document = parse("<a><b>kept</b></a>");
  EXPECT_TRUE(evaluate("1", {}, document));
  document = nullptr;
  EXPECT_EQ(strings(evaluate("/a/b")), "kept");
}

TEST_F(Embedding, AnAbsentContextItemAddsNothing) {
  const auto items = evaluate(".");
  ASSERT_TRUE(items);
  EXPECT_EQ(items->count(), 0U);
  EXPECT_EQ(strings(evaluate("1, ., 2")), "1 2");
}

TEST_F(Embedding, AnyNodeMayBeTheContextItem) {
  const Value document = parse("<r k='v'>t<a><b/></a></r>");
  const auto nodes = evaluate("/r/a, /r/@k, /r/text()", {}, document);
  ASSERT_EQ(nodes->count(), 3U);
  EXPECT_EQ(types(evaluate("b, .., ../@k", {}, nodes->objects()[0])),
            "element() element() attribute()");
  EXPECT_EQ(types(evaluate("., ..", {}, nodes->objects()[1])), "attribute() element()");
  EXPECT_EQ(types(evaluate("., following-sibling::a", {}, nodes->objects()[2])),
            "text() element()");
  EXPECT_EQ(types(evaluate("/r", {}, nodes->objects()[2])), "element()");
}

TEST_F(Embedding, AnAtomicValueMayBeTheContextItem) {
  EXPECT_EQ(strings(evaluate(". + 1", {}, NSString::stringWithUTF8("41"))), "42");
  EXPECT_FALSE(evaluate("/a", {}, NSString::stringWithUTF8("x")));
  EXPECT_EQ(failure(), "20 context item not a node");
  EXPECT_FALSE(evaluate("//x"));
  EXPECT_EQ(failure(), "20 context item not a node");
}

TEST_F(Embedding, TheRootOfATreeMustBeADocument) {
  const auto element = NSXMLElement::elementWithName(NSStringView::ascii("a"));
  EXPECT_EQ(types(evaluate(".", {}, element)), "element()");
  EXPECT_FALSE(evaluate("/", {}, element));
  EXPECT_EQ(failure(), "6 invalid type");
  EXPECT_FALSE(evaluate("//a"));
  EXPECT_EQ(failure(), "6 invalid type");
}

// --- results -------------------------------------------------------------------------------------

TEST_F(Embedding, TheEmptySequenceIsAnEmptyArray) {
  for (const char* source : {"()", "((), ())", "5 to 3", "1 = ()", "(1, 2)[3]"}) {
    const auto items = evaluate(source);
    ASSERT_TRUE(items) << source;
    EXPECT_EQ(items->count(), 0U) << source;
  }
}

TEST_F(Embedding, AQueryWithoutABodyGivesNeitherResultNorError) {
  for (const char* source : {"", " \n ", "(: nothing :)", "module namespace m = 'urn:m';"}) {
    EXPECT_FALSE(XQuery::xqueryWithSource(source)->parseErrors()) << source;
    EXPECT_FALSE(evaluate(source)) << source;
    EXPECT_FALSE(error) << source;
  }
}

TEST_F(Embedding, NodesAreThoseOfTheHostsTree) {
  const Value document = parse("<r><a/><b/></r>");
  const auto* root = cast<NSXMLDocument>(document)->rootElement();
  const auto items = evaluate("/r/b, /r, /", {}, document);
  ASSERT_EQ(items->count(), 3U);
  EXPECT_EQ(items->objectAtIndex(0), root->lastChild());
  EXPECT_EQ(items->objectAtIndex(1), root);
  EXPECT_EQ(items->objectAtIndex(2), document.get());
}

TEST_F(Embedding, ResultsOutliveEverythingTheyCameFrom) {
  Ref<NSArray> items;
  {
    Value document = parse("<r><a k='v'>text</a></r>");
    auto query = XQuery::xqueryWithSource("/r/a, /r/a/@k, 'literal', 2.5, 1e0 div 3, 1 = 1");
    auto own = XQueryContext::xqueryContext();
    items = own->evaluateXQuery(*query, {}, document, &error);
    ASSERT_TRUE(items);
  }
  EXPECT_EQ(strings(items), "text v literal 2.5 0.3333333333333333 true");
  const auto* element = cast<NSXMLElement>(items->objects()[0]);
  EXPECT_EQ(element->XMLString()->utf8(), "<a k=\"v\">text</a>");
  EXPECT_EQ(element->parent()->name()->utf8(), "r");
}

TEST_F(Embedding, OneItemKeptFromAResultKeepsItsTree) {
  Value attribute = evaluate("/r/@k", {}, parse("<r k='v'><a/></r>"))->objects()[0];
  context = nullptr;
  EXPECT_EQ(XQueryItemStringValue(*attribute), "v");
  EXPECT_EQ(cast<NSXMLNode>(attribute)->parent()->XMLString()->utf8(), "<r k=\"v\"><a/></r>");
}

TEST_F(Embedding, ResultsOfOneEvaluationServeAsConstantsOfTheNext) {
  const auto nodes = evaluate("/r/a", {}, parse("<r><a>1</a><a>2</a></r>"));
  ASSERT_EQ(nodes->count(), 2U);
  EXPECT_EQ(strings(evaluate("$v[2]/../a[1], $v = 2", {{"v", nodes}})), "1 true");
}

TEST_F(Embedding, ItemTypesAreNamedAsAQueryWritesThem) {
  const Value document = parse("<r k='v'><!--c--><?p q?>t<a/></r>");
  EXPECT_EQ(types(evaluate("/, /r/a, /r/@k, /r/text(), /r/comment(), /r/processing-instruction()",
                           {}, document)),
            "document-node() element() attribute() text() comment() processing-instruction()");
  EXPECT_EQ(types(evaluate("1, 1.5, 1e0, 'x', 1 = 1, 1 div 2, $u",
                           {{"u", NSString::stringWithUTF8("")}})),
            "xs:integer xs:decimal xs:double xs:string xs:boolean xs:decimal xdt:untypedAtomic");
}

// --- constants -----------------------------------------------------------------------------------

TEST_F(Embedding, ConstantsOfEveryAtomicShape) {
  const Ref<NSString> text = NSString::stringWithASCII("7");
  EXPECT_EQ(types(evaluate("$v, $v + 1", {{"v", text}})), "xdt:untypedAtomic xs:double");
  EXPECT_EQ(types(evaluate("$v, $v + 1", {{"v", NSNumber::numberWithDouble(2.5)}})),
            "xs:double xs:double");
  EXPECT_EQ(strings(evaluate("$v + 1", {{"v", NSNumber::numberWithDouble(2.5)}})), "3.5");
  EXPECT_EQ(strings(evaluate("$v, $v eq (1 = 1)", {{"v", NSNumber::numberWithBool(true)}})),
            "true true");
  const Ref<NSString> place = NSString::stringWithASCII("http://example.com/");
  EXPECT_EQ(types(evaluate("$v", {{"v", NSURL::URLWithString(place)}})), "xs:anyURI");
}

TEST_F(Embedding, APlainPlatformNumberIsADouble) {
  EXPECT_EQ(types(evaluate("$v", {{"v", NSNumber::numberWithLongLong(7)}})), "xs:double");
  EXPECT_EQ(strings(evaluate("$v div 2, $v eq 7", {{"v", NSNumber::numberWithLongLong(7)}})),
            "3.5 true");
}

TEST_F(Embedding, ConstantsMayBeNodesAndDocuments) {
  const Value other = parse("<o><x>1</x></o>");
  EXPECT_EQ(strings(evaluate("$d/o/x, $d//x + 1", {{"d", other}})), "1 2");
  EXPECT_EQ(strings(evaluate("/r/a = $d/o/x", {{"d", other}}, parse("<r><a>1</a></r>"))), "true");
}

TEST_F(Embedding, ConstantsMayBeSequences) {
  const auto three =
      NSArray::arrayWithObjects({NSString::stringWithUTF8("1"), NSString::stringWithUTF8("2"),
                                 NSNumber::numberWithDouble(3)});
  EXPECT_EQ(strings(evaluate("$v[2], $v[3] + 1, ($v, 9)", {{"v", three}})), "2 4 1 2 3 9");
  EXPECT_EQ(strings(evaluate("$v = 3, $v = 4", {{"v", three}})), "true false");
}

TEST_F(Embedding, AnArrayOfOneItemIsThatItem) {
  const auto one = NSArray::arrayWithObjects({NSString::stringWithUTF8("4")});
  EXPECT_EQ(strings(evaluate("$v + 1, -$v, $v eq '4', $v to 5, $v[1]", {{"v", one}})),
            "5 -4 true 4 5 4");
}

TEST_F(Embedding, AnEmptyArrayAndTheNullObjectAreTheEmptySequence) {
  for (const Value& nothing : {Value(NSArray::array()), Value(NSNull::null())}) {
    const auto items = evaluate("$v", {{"v", nothing}});
    ASSERT_TRUE(items);
    EXPECT_EQ(items->count(), 0U);
    EXPECT_EQ(strings(evaluate("($v, 1), $v[1], $v = 1, $v/a, $v or 0", {{"v", nothing}})),
              "1 false");
    EXPECT_EQ(strings(evaluate("declare variable $v external; $v, 2", {{"v", nothing}})), "2");
  }
}

TEST_F(Embedding, ConstantsLastForOneEvaluation) {
  const auto query = XQuery::xqueryWithSource("declare variable $v external; $v");
  EXPECT_EQ(strings(context->evaluateXQuery(*query, {{"v", NSString::stringWithUTF8("1")}}, nullptr,
                                            &error)),
            "1");
  EXPECT_FALSE(context->evaluateXQuery(*query, {}, nullptr, &error));
  EXPECT_EQ(failure(), "16 unresloved external variable - v");
  EXPECT_EQ(strings(context->evaluateXQuery(*query, {{"v", NSString::stringWithUTF8("2")}}, nullptr,
                                            &error)),
            "2");
}

TEST_F(Embedding, ConstantsAreClearedAfterAFailureToo) {
  EXPECT_FALSE(evaluate("$v + 'x'", {{"v", NSString::stringWithUTF8("1")}}));
  EXPECT_FALSE(evaluate("$v"));
  EXPECT_EQ(failure(), "8 reference to undefined variable \"v\"");
}

TEST_F(Embedding, ConstantNamesAreResolvedInTheQuery) {
  const XQueryVariables constants = {{"p:v", NSString::stringWithUTF8("1")},
                                     {"q:v", NSString::stringWithUTF8("2")},
                                     {"v", NSString::stringWithUTF8("3")}};
  EXPECT_EQ(strings(evaluate("declare namespace p = 'urn:p'; $p:v, $v", constants)), "1 3");
  EXPECT_EQ(strings(evaluate("declare namespace q = 'urn:p'; $q:v, $v", constants)), "2 3");
  EXPECT_EQ(strings(evaluate("$v", constants)), "3");
}

TEST_F(Embedding, NodesOfDifferentDocuments) {
  const XQueryVariables constants = {{"a", parse("<r n='a'/>")}, {"b", parse("<r n='b'/>")}};
  EXPECT_EQ(strings(evaluate("$a/r << $b/r, $b/r << $a/r, $a/r >> $b/r, $a/r is $b/r", constants)),
            "false false false false");
  EXPECT_EQ(strings(evaluate("$a << $b/r, $b/r << $a", constants)), "true false");
  EXPECT_EQ(strings(evaluate("($a/r union $b/r)/@n = 'a'", constants)), "true");
}

TEST_F(Embedding, SetsOfSeveralDocumentsKeepTheDocumentsInTheirOrder) {
  const XQueryVariables constants = {{"a", parse("<r><x>a1</x><x>a2</x></r>")},
                                     {"b", parse("<r><x>b1</x><x>b2</x></r>")}};
  EXPECT_EQ(strings(evaluate("$a/r/x union $b/r/x", constants)), "a1 a2 b1 b2");
  EXPECT_EQ(strings(evaluate("$b/r/x union $a/r/x", constants)), "b1 b2 a1 a2");
  EXPECT_EQ(strings(evaluate("($b/r/x, $a/r/x) except $b/r/x[1]", constants)), "b2 a1 a2");
}

// --- trees the host builds and changes -----------------------------------------------------------

TEST_F(Embedding, TreesBuiltByHandAreQueriedLikeParsedOnes) {
  const auto document = NSXMLDocument::document();
  const auto root = NSXMLElement::elementWithName(NSStringView::ascii("r"));
  root->addAttribute(
      NSXMLNode::attributeWithName(NSStringView::ascii("k"), NSStringView::ascii("v")));
  root->addChild(NSXMLNode::textWithStringValue(NSStringView::ascii("t")));
  root->addChild(NSXMLElement::elementWithName(NSStringView::ascii("a")));
  document->addChild(root);
  EXPECT_EQ(types(evaluate("/r, /r/@k, /r/text(), //a, //a/..", {}, document)),
            "element() attribute() text() element() element()");
}

TEST_F(Embedding, ChangesOfATreeAreSeenByTheNextEvaluation) {
  const Value document = parse("<r><a n='1'/><c n='3'/></r>");
  auto* root = cast<NSXMLDocument>(document)->rootElement();
  const auto query = XQuery::xqueryWithSource("(//c, //b, //a)/@n, //c >> //a");
  EXPECT_EQ(strings(context->evaluateXQuery(*query, {}, document, &error)), "1 3 true");

  const auto added = NSXMLElement::elementWithName(NSStringView::ascii("b"));
  added->addAttribute(
      NSXMLNode::attributeWithName(NSStringView::ascii("n"), NSStringView::ascii("2")));
  ASSERT_TRUE(root->insertChild(added, 1));
  EXPECT_EQ(strings(context->evaluateXQuery(*query, {}, document, &error)), "1 2 3 true");

  const Ref<NSXMLNode> first(root->firstChild());
  first->detach();
  ASSERT_TRUE(root->addChild(first));
  EXPECT_EQ(strings(context->evaluateXQuery(*query, {}, document, &error)), "2 3 1 false");
}

// --- context namespaces, client, entry points that do nothing ------------------------------------

TEST_F(Embedding, ContextNamespacesServeOneContextOnly) {
  const auto query = XQuery::xqueryWithSource("/p:a");
  const Value document = parse("<x:a xmlns:x='urn:p'>1</x:a>");
  const auto knowing = XQueryContext::xqueryContextWithNamespaces({{"p", "urn:p"}});
  const auto other = XQueryContext::xqueryContextWithNamespaces({{"p", "urn:other"}});
  for (int i = 0; i < 2; ++i) {
    EXPECT_EQ(strings(knowing->evaluateXQuery(*query, {}, document, &error)), "1");
    EXPECT_EQ(strings(other->evaluateXQuery(*query, {}, document, &error)), "");
    EXPECT_FALSE(context->evaluateXQuery(*query, {}, document, &error));
    EXPECT_EQ(failure(), "1 can't resolve QName for \"p:a\"");
  }
}

TEST_F(Embedding, ContextNamespacesDoNotNameVariables) {
  const auto own = XQueryContext::xqueryContextWithNamespaces({{"p", "urn:p"}});
  const auto query = XQuery::xqueryWithSource("$p:v");
  EXPECT_FALSE(
      own->evaluateXQuery(*query, {{"p:v", NSString::stringWithUTF8("1")}}, nullptr, &error));
  EXPECT_EQ(failure(), "8 reference to undefined variable \"p:v\"");
}

class Listener : public XQueryClient {
 public:
  void XQueryClientTraceValue(const Value& value, const Ref<NSString>& label,
                              XQueryContext& context) override {
    heard += label->utf8() + "=" + XQueryItemStringValue(*value) + ";";
    from = &context;
  }
  std::string heard;
  const XQueryContext* from = nullptr;
};

TEST_F(Embedding, TheClientHearsTraces) {
  const auto client = std::make_shared<Listener>();
  context->contextSetClient(client);
  EXPECT_EQ(context->contextClient(), client);
  _traceValue(*context, NSString::stringWithUTF8("1"), NSString::stringWithASCII("a"));
  _traceValue(*context, NSString::stringWithUTF8("2"), NSString::stringWithASCII("b"));
  EXPECT_EQ(client->heard, "a=1;b=2;");
  EXPECT_EQ(client->from, context.get());
}

TEST_F(Embedding, TheClientStaysUntilAnotherTakesItsPlace) {
  const auto first = std::make_shared<Listener>();
  const auto second = std::make_shared<Listener>();
  context->contextSetClient(first);
  EXPECT_EQ(strings(evaluate("1")), "1");
  EXPECT_EQ(context->contextClient(), first);
  context->contextSetClient(second);
  _traceValue(*context, NSString::stringWithUTF8("1"), NSString::stringWithASCII("a"));
  EXPECT_EQ(first->heard, "");
  EXPECT_EQ(second->heard, "a=1;");
  context->contextSetClient(nullptr);
  EXPECT_FALSE(context->contextClient());
  _traceValue(*context, NSString::stringWithUTF8("1"), NSString::stringWithASCII("a"));
  EXPECT_EQ(second->heard, "a=1;");
}

TEST_F(Embedding, TwoEntryPointsDoNothing) {
  context->addXQueryProlog(NSString::stringWithUTF8("declare variable $v := 1;"));
  context->addXQueryProlog(nullptr);
  context->contextAddClientSelector("f:", "f");
  EXPECT_EQ(strings(evaluate("1 + 1")), "2");
  EXPECT_FALSE(evaluate("$v"));
}

// --- errors --------------------------------------------------------------------------------------

TEST_F(Embedding, AnErrorWithALineCarriesMessageAndLine) {
  EXPECT_FALSE(evaluate("1,\n$x"));
  ASSERT_TRUE(error);
  EXPECT_EQ(error->domain()->utf8(), "XQueryErrorDomain");
  EXPECT_EQ(error->code(), 8);
  EXPECT_EQ(error->err(), 8);
  EXPECT_EQ(error->line(), 2);
  ASSERT_TRUE(error->userInfo());
  EXPECT_EQ(error->userInfo()->errorMessage->utf8(), "reference to undefined variable \"x\"");
  EXPECT_EQ(error->userInfo()->errorLine, 2);
  const char* text = "XQueryError:8 - \"reference to undefined variable \"x\"\" at line:2";
  EXPECT_EQ(error->description()->utf8(), text);
  EXPECT_EQ(error->localizedDescription()->utf8(), text);
}

TEST_F(Embedding, AnErrorWithoutALineCarriesItsMessageOnly) {
  EXPECT_FALSE(evaluate("declare namespace xml = 'urn:x'; 1"));
  ASSERT_TRUE(error);
  EXPECT_EQ(error->line(), 0);
  ASSERT_TRUE(error->userInfo());
  EXPECT_EQ(error->userInfo()->errorMessage->utf8(), "prefix xml can't be redeclared");
  EXPECT_FALSE(error->userInfo()->errorLine);
  EXPECT_EQ(error->description()->utf8(), "XQueryError:70 - \"prefix xml can't be redeclared\"");
}

TEST_F(Embedding, AnErrorOutlivesItsQueryAndContext) {
  EXPECT_FALSE(evaluate("1 +"));
  context = nullptr;
  ASSERT_TRUE(error);
  EXPECT_EQ(error->description()->utf8(),
            "XQueryError:3 - \"parse error invalid token ()- 1 +\" at line:1");
}

TEST_F(Embedding, ParseErrorsAreAFreshArrayEachTime) {
  const auto query = XQuery::xqueryWithSource("1 +");
  const auto first = query->parseErrors();
  const auto second = query->parseErrors();
  ASSERT_TRUE(first && second);
  EXPECT_FALSE(first == second);
  first->objects().clear();
  EXPECT_EQ(second->count(), 1U);
  EXPECT_EQ(query->parseErrors()->count(), 1U);
  EXPECT_FALSE(XQuery::xqueryWithSource("1")->parseErrors());
}

TEST_F(Embedding, EveryCompileErrorIsKeptAndTheFirstIsHandedOut) {
  const auto query = XQuery::xqueryWithSource(
      "declare namespace xml = 'urn:x'; declare default element namespace ''; "
      "declare variable $a := 1; declare variable $a := 2; 1");
  const auto errors = query->parseErrors();
  ASSERT_TRUE(errors);
  ASSERT_EQ(errors->count(), 3U);
  EXPECT_EQ(cast<XQueryError>(errors->objects()[0])->err(), 70);
  EXPECT_EQ(cast<XQueryError>(errors->objects()[1])->err(), 46);
  EXPECT_EQ(cast<XQueryError>(errors->objects()[2])->err(), 49);
  EXPECT_FALSE(context->evaluateXQuery(*query, {}, nullptr, &error));
  EXPECT_EQ(error.get(), errors->objectAtIndex(0));
}

TEST_F(Embedding, AnImportWithoutALocationIsReportedTwice) {
  const auto errors =
      XQuery::xqueryWithSource("import module namespace m = 'urn:m'; 1")->parseErrors();
  ASSERT_TRUE(errors);
  ASSERT_EQ(errors->count(), 2U);
  for (const Value& each : errors->objects()) EXPECT_EQ(cast<XQueryError>(each)->err(), 47);
}

TEST_F(Embedding, TextThatIsNotUtf8IsACompileErrorWithoutALine) {
  const auto query = XQuery::xqueryWithSource(std::string_view("'\xff\xfe'"));
  ASSERT_TRUE(query->parseErrors());
  EXPECT_FALSE(context->evaluateXQuery(*query, {}, nullptr, &error));
  ASSERT_TRUE(error);
  EXPECT_EQ(error->err(), 3);
  EXPECT_EQ(error->line(), 0);
}

TEST_F(Embedding, TheSourceMayBeAString) {
  const auto query = XQuery::xqueryWithSource(NSString::stringWithUTF8("'é' eq '&#xE9;'"));
  EXPECT_EQ(strings(context->evaluateXQuery(*query, {}, nullptr, &error)), "true");
}

// --- threads -------------------------------------------------------------------------------------

std::string bigDocument(int count) {
  std::string xml = "<r>";
  for (int i = 0; i < count; ++i) {
    xml += "<a n=\"" + std::to_string(i) + "\"><b>" + std::to_string(i % 7) + "</b></a>";
  }
  return xml + "</r>";
}

TEST_F(Embedding, ThreadsShareOneDocumentAndOneQuery) {
  const Value document = parse(bigDocument(500));
  const auto query = XQuery::xqueryWithSource(
      "declare variable $k external; //a[b = $k]/@n, (//a[3], //a[2]) union //a[1], 10 to 12");
  const XQueryVariables constants = {{"k", NSNumber::numberWithDouble(3)}};
  const auto expected = context->evaluateXQuery(*query, constants, document, &error);
  ASSERT_TRUE(expected);
  std::atomic<int> wrong{0};
  std::vector<std::thread> threads;
  for (int t = 0; t < 8; ++t) {
    threads.emplace_back([&] {
      const auto own = XQueryContext::xqueryContext();
      for (int i = 0; i < 20; ++i) {
        const auto items = own->evaluateXQuery(*query, constants, document);
        if (!items || strings(items) != strings(expected) ||
            items->objectAtIndex(0) != expected->objectAtIndex(0)) {
          ++wrong;
        }
      }
    });
  }
  for (auto& thread : threads) thread.join();
  EXPECT_EQ(wrong, 0);
}

// What a tree builds lazily is built by whoever comes first.
TEST_F(Embedding, ThreadsMeetAFreshDocumentTogether) {
  const auto query = XQuery::xqueryWithSource(
      "/r/a[1] << /r/a[2], (//b, //a)[1] >> /r/a[1], (/r/a[2], /r/a[1])/@n = '0'");
  for (int round = 0; round < 20; ++round) {
    const Value document = parse(bigDocument(50));
    std::atomic<int> wrong{0};
    std::vector<std::thread> threads;
    for (int t = 0; t < 4; ++t) {
      threads.emplace_back([&] {
        const auto own = XQueryContext::xqueryContext();
        if (strings(own->evaluateXQuery(*query, {}, document)) != "true true true") ++wrong;
      });
    }
    for (auto& thread : threads) thread.join();
    EXPECT_EQ(wrong, 0);
  }
}

TEST_F(Embedding, ThreadsCompileAtTheSameTime) {
  std::atomic<int> wrong{0};
  std::vector<std::thread> threads;
  for (int t = 0; t < 8; ++t) {
    threads.emplace_back([&wrong, t] {
      const auto own = XQueryContext::xqueryContext();
      for (int i = 0; i < 50; ++i) {
        const std::string number = std::to_string(t * 1000 + i);
        const auto good = XQuery::xqueryWithSource("(: c :) " + number + " + 0");
        if (strings(own->evaluateXQuery(*good, {}, nullptr)) != number) ++wrong;
        Ref<XQueryError> failure;
        const auto bad = XQuery::xqueryWithSource("\n\n" + number + " + ");
        if (own->evaluateXQuery(*bad, {}, nullptr, &failure)) ++wrong;
        if (!failure || failure->line() != 3 ||
            failure->msg()->utf8() != "parse error invalid token ()- " + number + " + ") {
          ++wrong;
        }
      }
    });
  }
  for (auto& thread : threads) thread.join();
  EXPECT_EQ(wrong, 0);
}

TEST_F(Embedding, ResultsMayBeHandedToAnotherThread) {
  Ref<NSArray> items;
  std::thread([&items] {
    const auto query = XQuery::xqueryWithSource("/r/a, 1 + 1, 'x'");
    items = XQueryContext::xqueryContext()->evaluateXQuery(*query, {}, parse("<r><a>t</a></r>"));
  }).join();
  EXPECT_EQ(strings(items), "t 2 x");
}

// --- hostile input -------------------------------------------------------------------------------

TEST_F(Embedding, DeeplyNestedQueriesEndInAResultOrAnError) {
  for (const int depth : {1000, 100000}) {
    const std::string nested = std::string(depth, '(') + "1" + std::string(depth, ')');
    const auto items = evaluate(nested);
    EXPECT_TRUE(items ? strings(items) == "1" : static_cast<bool>(error)) << depth;
  }
  std::string sum = "1";
  for (int i = 1; i < 100000; ++i) sum += "+1";
  const auto items = evaluate(sum);
  EXPECT_TRUE(items ? strings(items) == "100000" : static_cast<bool>(error));
  std::string predicates = "1";
  for (int i = 0; i < 20000; ++i) predicates += "[1";
  predicates += std::string(20000, ']');
  EXPECT_TRUE(evaluate(predicates) || error);
}

TEST_F(Embedding, DeepDocumentsAreWalked) {
  const int depth = 200000;
  std::string xml;
  for (int i = 0; i < depth; ++i) xml += "<a>";
  xml += "x";
  for (int i = 0; i < depth; ++i) xml += "</a>";
  const Value document = parse(xml);
  const auto all = evaluate("//a", {}, document);
  ASSERT_TRUE(all);
  EXPECT_EQ(all->count(), static_cast<size_t>(depth));
  EXPECT_EQ(strings(evaluate("(/) = 'x', //text() = 'x'")), "true true");
}

}  // namespace
}  // namespace xquery

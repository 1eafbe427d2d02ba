// Evaluating record by record, compared with evaluating over the whole document.
#include "Engine/LimitsTestSupport.h"
#include "xquery/xquery.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <memory>
#include <stdexcept>
#include <string>
#include <string_view>
#include <vector>

namespace xquery {
namespace {

std::string shownItem(const NSObject& item) {
  std::string text = XQueryItemTypeName(item) + ":";
  if (const auto* node = dyn_cast<NSXMLNode>(&item)) return text + node->XMLString()->utf8();
  return text + XQueryItemStringValue(item);
}

XQueryStreamInput inputOf(std::string_view text, size_t pieces = 5) {
  XQueryStreamInput input;
  input.options = NSXMLNodePreserveWhitespace;
  input.read = [text, pieces](char* buffer, size_t size) mutable {
    const size_t count = text.copy(buffer, std::min(size, pieces));
    text.remove_prefix(count);
    return static_cast<ptrdiff_t>(count);
  };
  return input;
}

Ref<XQuery> compiled(std::string_view query, XQueryWay way = XQueryWay::Streamed) {
  auto result = XQuery::xqueryWithSource(query, XQueryLoading(), XQueryLimits(), way);
  const auto errors = result->parseErrors();
  EXPECT_FALSE(errors) << query << "\n  "
                       << cast<XQueryError>(errors->objects().front())->description()->utf8();
  return result;
}

struct Answer {
  std::vector<std::string> items;
  std::string error;
};

Answer streamed(XQueryContext& context, std::string_view query, const XQueryStreamInput& input,
                const XQueryVariables& constants = {}) {
  Answer answer;
  XQueryStreamFailure failure;
  const bool isComplete = context.evaluateStream(
      *compiled(query), constants, input,
      [&](const Value& item) {
        answer.items.push_back(shownItem(*item));
        return true;
      },
      failure);
  EXPECT_EQ(isComplete, !failure.error && failure.reading.message.empty());
  if (failure.error) answer.error = failure.error->description()->utf8();
  if (!failure.reading.message.empty()) {
    answer.error = "document " + std::to_string(failure.reading.line) + ":" +
                   std::to_string(failure.reading.column);
  }
  return answer;
}

Answer streamed(std::string_view query, std::string_view text) {
  return streamed(*XQueryContext::xqueryContext(), query, inputOf(text));
}

Answer ofTheWhole(std::string_view query, std::string_view text,
                  const Ref<XQueryContext>& context = XQueryContext::xqueryContext()) {
  Answer answer;
  const auto document = NSXMLDocument::documentWithData(text, NSXMLNodePreserveWhitespace);
  Ref<XQueryError> error;
  const auto items =
      context->evaluateXQuery(*compiled(query, XQueryWay::Plain), {}, document, &error);
  for (size_t i = 0; items && i < items->count(); ++i) {
    answer.items.push_back(shownItem(*items->objectAtIndex(i)));
  }
  if (error) answer.error = error->description()->utf8();
  return answer;
}

const std::string documents[] = {
    "<a/>",
    "<a><b><c>1</c></b></a>",
    "<a x='1'><b i='1'><c>3</c><c>1</c></b>\n<b i='2'/><!--0--><b i='3'><c>2</c><d>t</d></b></a>",
    "<a><b><c>2.5</c></b><b><c>x</c></b><b><c>1</c></b></a>",
    "<a><b><c>NaN</c></b><b><c>1</c></b><b><c>INF</c></b></a>",
    "<a><b i='a'><c>a text of more than a few characters</c></b><b i='a'><c>a text of more than a "
    "few characters</c></b><b i='b'><c>another text, as long as the one before</c></b></a>",
    "<a><b><d><b><c>1</c></b></d><c>2</c><b><c>3</c><d/></b><c>4</c></b><c>5</c></a>",
    "<a xmlns='u' xmlns:p='v'><b><c p:i='1'>1</c></b></a>",
    "<a xmlns:p='v'><b><p:c p:i='1'>1</p:c><c>7</c></b><b><b><c>8</c></b></b></a>",
};

constexpr std::string_view queries[] = {
    "/a/b",
    "/a/b/c",
    "a/b/@i",
    "//c",
    "//b",
    "/a/b[c = 1]",
    "/a/b[@i > 1]/c/text()",
    "/a/b/c[1]",
    "/a/b/c[last()]",
    "for $b in /a/b return string($b/c[1])",
    "/a/b/(c)[1]",
    "/a/b/(c, d)[2]/text()",
    "/a/b/(c[last()])",
    "/a/b/(d | c)",
    "//b/c",
    "(//b/c/text())[2]",
    "for $c in //b/c return string($c)",
    "for $c in //c return string($c)",
    "/a/descendant::c/string()",
    "/a/descendant::b/string(c[1])",
    "/a/descendant::b[c]/c/string()",
    "(/a/descendant::b[c]/c/string())[2]",
    "for $b in /a/b return ($b/d | $b/c) except $b/c[1]",
    "for $b in /a/b where some $c in $b/c, $d in $b/d satisfies $c != $d return $b/@i",
    "declare namespace p = 'v'; //p:c/@p:i",
    "declare default element namespace 'u'; /a/b/c",
    "for $b in /a/b where $b//c > 1 return <r i='{ $b/@i }'>{ $b/descendant::c }</r>",
    "for $b in /a/b return <r i='{ $b/@i }'>{ $b/c, count($b/c) }</r>",
    "for $b in /a/b, $c in $b/c let $n := number($c) return $n * 2",
    "for $b in /a/b return for $c in $b/c order by string($c) return $c",
    "declare base-uri 'urn:base'; for $b in /a/b return <r>{ $b/c }</r>",
    "declare function local:f($x) { $x/c, $x/d }; for $b in /a/b return local:f($b)",
    "declare variable $g := 1; /a/b[c = $g]/c",
    "count(/a/b)",
    "count(//c)",
    "sum(/a/b/c)",
    "sum(for $c in /a/b/c return xs:decimal($c))",
    "sum(for $c in /a/b/c return xs:byte($c))",
    "sum(for $b in /a/b return string($b/c[1]))",
    "avg(/a/b/c)",
    "avg(for $c in /a/b/c return xs:decimal($c))",
    "avg(for $b in /a/b return string($b/c[1]))",
    "min(/a/b/c)",
    "min(for $b in /a/b return string($b/c[1]))",
    "max(/a/b/c)",
    "max(for $b in /a/b return string($b/c[1]))",
    "max(for $c in /a/b/c return xs:date('2000-01-01'))",
    "exists(/a/b/c)",
    "exists(/a/b/d)",
    "empty(/a/b/c)",
    "distinct-values(/a/b/c)",
    "distinct-values(for $b in /a/b return string($b/c[1]))",
    "distinct-values(for $b in /a/b, $c in $b/* return node-name($c))",
    "distinct-values(for $c in /a/b/c return string-length($c))",
    "some $c in /a/b/c satisfies $c = 1",
    "every $c in /a/b/c satisfies $c = 1",
    "some $c in /a/b/c satisfies xs:integer($c) = 1",
    "(/a/b)[2]",
    "(/a/b/c)[1]",
    "subsequence(/a/b/c, 2)",
    "subsequence(/a/b/c, 2, 2)",
    "subsequence(/a/b/c, 2, 0)",
    "/a/b/c/string()",
    "/a/b/string(c[1])",
    "/a/b/string(d)",
    "/a/b/@i/data(.)",
    "count(/a/b/local-name(*[1]))",
    "distinct-values(/a/b/c/string())",
    "(/a/b/c)[position() <= 2]",
    "(/a/b/c)[position() < 1]",
    "(/a/b/c)[position() eq 2]",
    "(/a/b/c)[position() > 1]",
    "let $n := 1 for $b in /a/b where $b/c > $n return $b/c",
    "count(/a/b) + 1",
    "sum(/a/b/c) div count(/a/b)",
    "count(/a/b), count(//c), count(/a/b/b)",
    "count(//b), count(/a/b), sum(//b/b/c)",
    "<r n='{ count(/a/b) }'>{ max(/a/b/c), distinct-values(/a/b/c) }</r>",
    "<r>{ distinct-values(for $c in /a/b/c return string($c)) }</r>/text()",
    "if (exists(/a/b/d)) then 'yes' else count(/a/b)",
    "let $s := sum(/a/b/c), $n := count(/a/b/c) where $n > 0 return $s div $n",
    "for $i in 1 to count(/a/b) return $i * 2",
    "count(distinct-values(/a/b/c))",
    "(some $c in /a/b/c satisfies $c = 1) or empty(/a/b)",
    "(every $c in /a/b/c satisfies $c = 1) and not(exists(//d))",
    "declare function local:f($x) { $x, $x }; local:f(count(/a/b)), avg(/a/b/c)",
    "(count(/a/b), count(//c))[2]",
    "string-join((string(count(/a/b)), string(min(/a/b/c))), '-')",
    "declare base-uri 'urn:base'; (<r>{ count(/a/b) }</r>, count(//c))",
    "if (empty(/a/b/d)) then 'none' else sum(/a/b/c)",
    "count(/a/b) > 1 and max(/a/b/c) > 1",
    "for $i in 1 to count(/a/b/d) return avg(/a/b/c) + sum(for $c in /a/b/c return xs:integer($c))",
    "let $n := count(/a/d) where $n > 0 return (sum(/a/b/c), some $c in //c satisfies $c * 2 = 2)",
    "/a/b/*",
    "/a/b/*/@i",
    "/a/b/*/name()",
    "for $x in /a/b/* return name($x)",
    // Nobody declares the prefix; that is asked within the record.
    "/a/b/@p:i",
    "/a/b/p:*",
    "/a/b[p:c]",
    "/a/b/c[@p:i]/text()",
    "/a/b[c = 1]/p:d",
    "for $b in /a/b return $b/p:c",
    "for $b in /a/b where $b/c > 1 return $b/descendant::p:d",
    "for $b in /a/b return count($b/d/p:c)",
    "some $b in /a/b satisfies $b/p:c",
    "if (exists(/a/b/d)) then sum(/a/b/d/@p:i) else count(/a/b)",
};

void expectTheAnswersOfTheWhole(const std::string& text) {
  for (const std::string_view query : queries) {
    const Answer whole = ofTheWhole(query, text);
    const Answer answer = streamed(query, text);
    EXPECT_EQ(answer.error, whole.error) << query << "\n" << text;
    if (!whole.error.empty()) continue;
    EXPECT_EQ(answer.items, whole.items) << query << "\n" << text;
  }
}

TEST(Stream, AnswersWhatTheWholeDocumentWould) {
  for (const std::string& text : documents) expectTheAnswersOfTheWhole(text);
}

TEST(Stream, ResolvesNamesInItsContext) {
  const std::string text = "<a xmlns='u'><b>1</b><b>2</b></a>";
  const auto with = [] { return XQueryContext::xqueryContextWithNamespaces({{"", "u"}}); };
  const Answer answer = streamed(*with(), "/a/b/text()", inputOf(text));
  EXPECT_EQ(answer.items, ofTheWhole("/a/b/text()", text, with()).items);
  EXPECT_EQ(answer.items.size(), 2U);
  EXPECT_TRUE(streamed("/a/b", text).items.empty());
}

// The error of an undeclared prefix, which would depend on what earlier steps find.
TEST(Stream, RefusesPrefixesThatNobodyDeclaresBeforeItReads) {
  XQueryStreamInput input;
  input.read = [](char*, size_t) -> ptrdiff_t {
    ADD_FAILURE() << "reads";
    return 0;
  };
  const std::string refusal =
      "XQueryError:0 - \"cannot be evaluated as a stream: a prefix on the way to the records is "
      "not "
      "declared\" at line:";
  const auto other = XQueryContext::xqueryContextWithNamespaces({{"q", "v"}, {"", "u"}});
  for (const std::string_view query :
       {"/a/p:b", "/z/p:b", "/p:a/b", "//p:b/c", "/a//p:b[c]", "count(/z/p:b)",
        "exists(/a/descendant::p:b)", "(/z/p:b)[1]", "some $b in /z/p:b satisfies $b",
        "for $b in /z/p:b return 1", "count(/a/q:b) + count(/z/p:b)",
        "if (1 = 2) then count(/z/p:b) else 3", "declare variable $g := 1 idiv 0; /z/p:b"}) {
    const Answer answer = streamed(*other, query, input);
    EXPECT_EQ(answer.error, refusal + "1") << query;
    EXPECT_TRUE(answer.items.empty()) << query;
  }
  EXPECT_EQ(streamed(*other, "count(\n/a\n/p:b)", input).error, refusal + "3");
  input.read = nullptr;
  input.path = "/no/such/file";
  EXPECT_EQ(streamed(*other, "/z/p:b", input).error, refusal + "1");
  EXPECT_EQ(streamed(*other, "/z/q:b", input).error, "document 0:0");
}

TEST(Stream, TakesThePrefixesOfItsContext) {
  const auto with = [](const char* uri) {
    return XQueryContext::xqueryContextWithNamespaces({{"p", uri}});
  };
  for (const std::string_view query :
       {"/a/b/p:c", "//p:c/@p:i", "/z/p:b", "count(//p:c)", "count(//p:a) + count(/a/b/p:c)",
        "if (1 = 2) then count(/z/p:b) else count(//p:c)"}) {
    for (const char* const uri : {"v", "none", ""}) {
      const Answer answer = streamed(*with(uri), query, inputOf(documents[8]));
      const Answer whole = ofTheWhole(query, documents[8], with(uri));
      EXPECT_EQ(answer.items, whole.items) << query << " in " << uri;
      EXPECT_EQ(answer.error, whole.error) << query << " in " << uri;
    }
  }
  EXPECT_EQ(streamed(*with("v"), "/a/b/p:c/text()", inputOf(documents[8])).items,
            std::vector<std::string>{"text():1"});
  EXPECT_TRUE(streamed("declare namespace p = ''; //p:c", documents[8]).items.empty());
}

TEST(Stream, IsGivenConstants) {
  const Answer answer =
      streamed(*XQueryContext::xqueryContext(), "declare variable $n external; /a/b[c = $n]/@i",
               inputOf(documents[2]), {{"n", NSString::stringWithUTF8("2")}});
  EXPECT_EQ(answer.items, std::vector<std::string>{"attribute():i=\"3\""});
}

TEST(Stream, KeepsTheContextItemThatWasInForce) {
  const auto context = XQueryContext::xqueryContext();
  const auto document = NSXMLDocument::documentWithData("<z/>", 0);
  const auto query = compiled("name(*)", XQueryWay::Plain);
  ASSERT_TRUE(context->evaluateXQuery(*query, {}, document));
  for (const std::string_view each : {"/a/b", "/a/b[xs:date(c)]"}) {
    static_cast<void>(streamed(*context, each, inputOf(documents[2])));
    const auto items = context->evaluateXQuery(*query, {}, nullptr);
    ASSERT_TRUE(items);
    EXPECT_EQ(shownItem(*items->objectAtIndex(0)), "xs:string:z");
  }
}

// So many records; counts the bytes.
XQueryStreamInput records(size_t& bytes, size_t number = SIZE_MAX,
                          const std::string& record = "<b><c>1</c></b>\n") {
  XQueryStreamInput input;
  input.read = [&bytes, number, record, left = std::string("<a>")](char* buffer,
                                                                   size_t size) mutable {
    while (left.size() < size && number > 0) left += --number == 0 ? record + "</a>" : record;
    const size_t count = left.copy(buffer, size);
    left.erase(0, count);
    bytes += count;
    return static_cast<ptrdiff_t>(count);
  };
  return input;
}

TEST(Stream, EndsWhereNothingMoreMatters) {
  for (const std::string_view query :
       {"exists(/a/b)", "empty(/a/b)", "some $b in /a/b satisfies $b/c = 1",
        "every $b in /a/b satisfies $b/c = 2", "(/a/b/c)[3]", "subsequence(/a/b, 2, 2)",
        "(/a/b)[position() < 3]", "exists(/a/b) or empty(/a/b/c)"}) {
    size_t bytes = 0;
    const Answer answer = streamed(*XQueryContext::xqueryContext(), query, records(bytes));
    EXPECT_EQ(answer.error, "") << query;
    EXPECT_FALSE(answer.items.empty()) << query;
    EXPECT_LT(bytes, size_t{1} << 20) << query;
  }
}

TEST(Stream, EndsWhenTheReceiverHasEnough) {
  size_t bytes = 0;
  int count = 0;
  XQueryStreamFailure failure;
  EXPECT_TRUE(XQueryContext::xqueryContext()->evaluateStream(
      *compiled("/a/b/c"), {}, records(bytes), [&](const Value&) { return ++count < 3; }, failure));
  EXPECT_EQ(count, 3);
}

TEST(Stream, TakesNoMoreMemoryHoweverLongItIs) {
  XQueryLimits limits;
  limits.memoryCeiling = 1 << 20;
  for (const std::string_view query :
       {"/a/b[c = 2]", "count(//c)", "sum(/a/b/c)", "max(for $b in /a/b return string($b/c))",
        "distinct-values(/a/b/c)", "every $b in /a/b satisfies $b/c = 1",
        "count(for $b in /a/b return <r>{ $b/c }</r>)",
        "sum(/a/b/c) + count(//c) + count(distinct-values(/a/b/c))"}) {
    const auto context = XQueryContext::xqueryContext();
    context->contextSetLimits(limits);
    size_t bytes = 0;
    EXPECT_EQ(streamed(*context, query, records(bytes, 15'000)).error, "") << query;
    EXPECT_GT(bytes, size_t{3} << 16);
  }
}

// The names are new in each record, and what is remembered of them is bounded.
TEST(Stream, MayMissAnyNumberOfDocuments) {
  constexpr int records = 60'000;
  int number = 0;
  std::string left = "<a>";
  XQueryStreamInput input;
  input.read = [&](char* buffer, size_t size) {
    if (left.empty() && number++ < records) left = "<b>" + std::to_string(number) + "</b>";
    if (left.empty() && number == records + 1) left = "</a>";
    const size_t count = left.copy(buffer, size);
    left.erase(0, count);
    return static_cast<ptrdiff_t>(count);
  };
  XQueryLimits limits;
  limits.memoryCeiling = 8 << 20;
  const auto context = XQueryContext::xqueryContext();
  context->contextSetLimits(limits);
  const Answer answer = streamed(*context, "count(/a/b[doc(concat('gone:', .))])", input);
  EXPECT_EQ(answer.error, "");
  EXPECT_EQ(answer.items, std::vector<std::string>{"xs:integer:0"});
}

TEST(Stream, EndsAtItsLimits) {
  const auto context = XQueryContext::xqueryContext();
  XQueryLimits limits;
  limits.memoryCeiling = 1 << 20;
  context->contextSetLimits(limits);
  size_t bytes = 0;
  const std::string large = "<b>" + std::string(8 << 20, 'x') + "</b>";
  EXPECT_EQ(streamed(*context, "/a/b", records(bytes, SIZE_MAX, large)).error,
            "XQueryError:0 - \"limit: memory ceiling reached\"");
  // The same where libxml2 reads.
  const std::string declares = "<!DOCTYPE a [<!ENTITY e ''>]><a>" + large + "</a>";
  EXPECT_EQ(streamed(*context, "/a/b", inputOf(declares, 4096)).error,
            "XQueryError:0 - \"limit: memory ceiling reached\"");
  limits = {};
  limits.duration = std::chrono::milliseconds(50);
  context->contextSetLimits(limits);
  EXPECT_EQ(streamed(*context, "count(/a/b)", records(bytes)).error,
            "XQueryError:0 - \"limit: deadline passed\"");
}

// Where the whole document is not well formed.
std::string placeOfError(std::string_view text) {
  NSXMLParseError error;
  EXPECT_FALSE(NSXMLDocument::documentWithData(text, NSXMLNodePreserveWhitespace, &error));
  return "document " + std::to_string(error.line) + ":" + std::to_string(error.column);
}

TEST(Stream, HandsOutWhatComesBeforeAFailure) {
  const Answer error =
      streamed("for $b in /a/b return xs:integer($b/c)", "<a><b><c>1</c></b><b><c>x</c></b></a>");
  EXPECT_EQ(error.items, std::vector<std::string>{"xs:integer:1"});
  EXPECT_NE(error.error, "");
  const std::string text = "<a>\n<b><c>1</c></b>\n <b><c></b></a>";
  const Answer malformed = streamed("for $b in /a/b return xs:integer($b/c)", text);
  EXPECT_EQ(malformed.items, std::vector<std::string>{"xs:integer:1"});
  EXPECT_EQ(malformed.error, placeOfError(text));
  for (const std::string_view bad : {"<a><b/>", "", "<a><b/></a><a/>"}) {
    EXPECT_EQ(streamed("count(/a/b)", bad).error, placeOfError(bad)) << bad;
  }
}

TEST(Stream, ReadsWhatOurReaderLeavesToLibXML) {
  for (const std::string text :
       {"<!DOCTYPE a [<!ENTITY e '1'>]><a><b><c>&e;</c></b><b><c>2</c></b></a>",
        "<?xml version='1.0' encoding='ISO-8859-1'?><a><b><c>1\xE9</c></b><b/></a>"}) {
    expectTheAnswersOfTheWhole(text);
  }
}

TEST(Stream, EndsWhereTheHostKeepsANode) {
  const auto context = XQueryContext::xqueryContext();
  std::vector<Value> kept;
  XQueryStreamFailure failure;
  EXPECT_FALSE(context->evaluateStream(
      *compiled("/a/b"), {}, inputOf(documents[2]),
      [&](const Value& item) {
        kept.push_back(item);
        return true;
      },
      failure));
  ASSERT_TRUE(failure.error);
  EXPECT_EQ(failure.error->msg()->utf8(), "a node of a stream is still referred to");
  ASSERT_EQ(kept.size(), 1U);
  EXPECT_EQ(shownItem(*kept.front()), "element():<b i=\"1\"><c>3</c><c>1</c></b>");
}

TEST(Stream, KeepsNothingOfARecordItself) {
  const std::string text =
      "<a><b>urn:a-text-of-more-than-a-few-characters-1</b><b>urn:a-text-of-more-than-a-few-"
      "characters-2</b></a>";
  for (const std::string_view query :
       {"for $b in /a/b return doc-available($b)", "for $b in /a/b return matches('a', $b)",
        "for $b in /a/b return xs:anyURI($b)",
        "distinct-values(for $b in /a/b return xs:anyURI($b))",
        "max(for $b in /a/b return xs:anyURI($b))", "for $b in /a/b return QName(string($b), 'x')",
        "distinct-values(for $b in /a/b return QName(string($b), 'x'))",
        "for $b in /a/b return element { QName(string($b), 'x') } {}",
        "for $b in /a/b return <r xml:base='{ $b }'/>",
        "distinct-values(for $b in /a/b return xs:token($b))",
        "min(for $b in /a/b return xs:token($b))"}) {
    const Answer whole = ofTheWhole(query, text);
    const Answer answer = streamed(query, text);
    EXPECT_EQ(answer.error, whole.error) << query;
    if (!whole.error.empty()) continue;
    EXPECT_EQ(answer.items, whole.items) << query;
  }
}

TEST(Stream, PassesOnWhatTheReceiverThrows) {
  const auto context = XQueryContext::xqueryContext();
  XQueryStreamFailure failure;
  const auto receive = [](const Value&) -> bool { throw std::length_error("the host's own"); };
  EXPECT_THROW(static_cast<void>(context->evaluateStream(*compiled("/a/b"), {},
                                                         inputOf(documents[2]), receive, failure)),
               std::length_error);
}

TEST(Stream, IsRefusedLikeAnErrorOfCompiling) {
  const auto query = XQuery::xqueryWithSource("reverse(\n/a/b[2])", XQueryLoading(), XQueryLimits(),
                                              XQueryWay::Streamed);
  const auto errors = query->parseErrors();
  ASSERT_TRUE(errors);
  EXPECT_EQ(
      cast<XQueryError>(errors->objects().front())->description()->utf8(),
      "XQueryError:0 - \"cannot be evaluated as a stream: the function needs the whole of its "
      "argument\" at line:1");
  XQueryStreamFailure failure;
  const auto receive = [](const Value&) { return true; };
  EXPECT_FALSE(XQueryContext::xqueryContext()->evaluateStream(*query, {}, inputOf("<a/>"), receive,
                                                              failure));
  EXPECT_EQ(static_cast<const NSObject*>(failure.error.get()), errors->objectAtIndex(0));
  EXPECT_FALSE(XQueryContext::xqueryContext()->evaluateStream(
      *compiled("/a/b", XQueryWay::Planned), {}, inputOf("<a/>"), receive, failure));
  EXPECT_EQ(failure.error->msg()->utf8(),
            "cannot be evaluated as a stream: it was not compiled to be");
}

TEST(Stream, MayStillBeEvaluatedOverAWholeDocument) {
  const auto document = NSXMLDocument::documentWithData(documents[2], 0);
  for (const std::string_view query : {"count(/a/b)", "(count(/a/b) + count(//c)) idiv 2"}) {
    const auto items =
        XQueryContext::xqueryContext()->evaluateXQuery(*compiled(query), {}, document);
    ASSERT_TRUE(items) << query;
    EXPECT_EQ(shownItem(*items->objectAtIndex(0)), "xs:integer:3") << query;
  }
}

// Of an element above that looks like the one before it nothing else tells.
TEST(Stream, TellsWhichElementsAboveARecordAreTheSame) {
  std::vector<std::string> heard;
  XQueryStreamInput input =
      inputOf("<a><b><c/><c/></b><b><x/><c><c/></c></b><b/><d><c/></d><c/></a>");
  input.beforeRecord = [&](const NSXMLElement& record, size_t kept) {
    heard.push_back(record.nameView().utf8() + std::to_string(kept));
    EXPECT_TRUE(record.rootDocument());
  };
  XQueryStreamFailure failure;
  const auto context = XQueryContext::xqueryContext();
  EXPECT_TRUE(context->evaluateStream(
      *compiled("//c"), {}, input,
      [&](const Value&) {
        heard.push_back("item");
        return true;
      },
      failure));
  EXPECT_EQ(heard, (std::vector<std::string>{"c0", "item", "c2", "item", "c1", "item", "item", "c1",
                                             "item", "c1", "item"}));
}

}  // namespace
}  // namespace xquery

#include "Functions/FunctionsTesting.h"
#include "Functions/URI.h"
#include "Platform/Loading/HTTPServer.h"
#include "Platform/Loading/LoadingTestSupport.h"
#include "xquery/URL.h"

namespace xquery {
namespace {

using namespace functiontest;

// --- base-uri ------------------------------------------------------------------------------------

// What the procedure answers where the static base URI is the given one.
std::string underBase(std::string_view base, const std::string& query) {
  return answer("declare base-uri '" + std::string(base) + "'; " + query);
}

TEST(BaseURI, WithoutArgumentsIsTheStaticOne) {
  EXPECT_EQ(underBase("http://h/q", "base-uri()"), "anyURI http://h/q");
  EXPECT_EQ(underBase("", "base-uri()"), "");
  EXPECT_EQ(answer("base-uri()"), "");
  EXPECT_EQ(answer("base-uri()", document("<a xml:base='urn:x'/>")), "");
}

TEST(BaseURI, OfANodeIsTheNearestXmlBaseAsWritten) {
  const Value tree = document("<a xml:base='urn:x'><b xml:base='y' c='1'>t</b></a>");
  EXPECT_EQ(answer("base-uri(/), base-uri(/a), base-uri(/a/b), base-uri(/a/b/@c),"
                   "base-uri(/a/b/text())",
                   tree),
            "anyURI urn:x, anyURI urn:x, anyURI y, anyURI y, anyURI y");
}

TEST(BaseURI, TheDocumentsOwnURIPlaysNoPart) {
  const Value tree = document("<a/>");
  cast<NSXMLDocument>(tree)->setURI(NSString::stringWithASCII("http://h/a.xml"));
  EXPECT_EQ(call(fn_base_uri, {tree}), "()");
}

TEST(BaseURI, OfAConstructedNodeIsTheStaticOne) {
  EXPECT_EQ(underBase("http://h/q", "base-uri(<a/>), base-uri(document { <a/> })"),
            "anyURI http://h/q, anyURI http://h/q");
  EXPECT_EQ(underBase("http://h/q", "base-uri(<a xml:base='x'/>)"), "anyURI x");
}

TEST(BaseURI, OfTheEmptySequenceIsEmptyAndOfWhatIsNoNodeRefused) {
  EXPECT_EQ(call(fn_base_uri, {empty()}), "()");
  EXPECT_EQ(call(fn_base_uri, {string("a")}), "null");
  EXPECT_EQ(call(fn_base_uri, {sequence({elementFrom("<a/>"), elementFrom("<b/>")})}), "null");
}

TEST(BaseURI, ThatIsNoURIIsAFailedCast) {
  EXPECT_EQ(call(fn_base_uri, {elementFrom("<a xml:base='a b'/>")}),
            "error 6 value does not match a required type");
}

TEST(BaseURI, TakesUpToOneArgument) {
  EXPECT_EQ(answer("base-uri(/, /)", document("<a/>")),
            "error 17 line 1 invalid arguments to function - base-uri");
  EXPECT_EQ(answer("base-uri(/, /, /)", document("<a/>")),
            "error 17 line 1 invalid arguments to function - base-uri");
}

// --- document-uri --------------------------------------------------------------------------------

std::string documentURI(std::string_view URI) {
  const Value tree = document("<a><b/></a>");
  cast<NSXMLDocument>(tree)->setURI(NSString::stringWithUTF8(URI));
  const Value inner = cast<NSXMLDocument>(tree)->rootElement()->firstChild();
  const std::string own = call(fn_document_uri, {tree});
  EXPECT_EQ(call(fn_document_uri, {inner}), own);
  return own;
}

TEST(DocumentURI, IsThatOfTheNodesDocument) {
  EXPECT_EQ(documentURI("http://h/a.xml"), "anyURI http://h/a.xml");
  EXPECT_EQ(documentURI("urn:x"), "anyURI urn:x");
}

TEST(DocumentURI, WithoutASchemeOrNotAURIIsNone) {
  for (const auto* URI : {"", "a.xml", "/a.xml", "//h/a", "http://h/a b", "http://h/\xC3\xA9"}) {
    EXPECT_EQ(documentURI(URI), "()") << URI;
  }
  EXPECT_EQ(call(fn_document_uri, {document("<a/>")}), "()");
  EXPECT_EQ(call(fn_document_uri, {Value(NSXMLElement::elementWithName(NSStringView::ascii("a")))}),
            "()");
}

TEST(DocumentURI, OfTheEmptySequenceIsEmptyAndOfWhatIsNoNodeRefused) {
  EXPECT_EQ(call(fn_document_uri, {empty()}), "()");
  EXPECT_EQ(call(fn_document_uri, {string("a")}), "null");
  EXPECT_EQ(call(fn_document_uri, {sequence({document("<a/>"), document("<a/>")})}), "null");
}

TEST(DocumentURI, TakesOneArgument) {
  EXPECT_EQ(refusedCounts(fn_document_uri, document("<a/>")), "0 2 3 4 5");
}

// --- resolve-uri ---------------------------------------------------------------------------------

struct ResolutionRow {
  const char* reference;
  const char* base;
  const char* result;
};

TEST(ResolveURI, FollowsTheRulesOfResolution) {
  constexpr ResolutionRow rows[] = {
      {"g", "http://a/b/c/d;p?q", "anyURI http://a/b/c/g"},
      {"../../g", "http://a/b/c/d;p?q", "anyURI http://a/g"},
      {"?y", "http://a/b/c/d;p?q", "anyURI http://a/b/c/d;p?y"},
      {"#s", "http://a/b/c/d;p?q", "anyURI http://a/b/c/d;p?q#s"},
      {"", "http://a/b/c/d;p?q", "anyURI http://a/b/c/d;p?q"},
      {"/g", "http://a/b", "anyURI http://a/g"},
      {"//g", "http://a/b", "anyURI http://g"},
      {"g:h", "http://a/b", "anyURI g:h"},
      {"g", "", "anyURI g"},
      {"g/../h", "", "anyURI g/../h"},
      {"g", "a/b", "anyURI g"},
      {"g", "no uri", "anyURI g"},
      {"a b", "http://a/b", "null"},
      {"a b", "", "null"},
      {"\xC3\xA9", "http://a/b", "null"},
  };
  for (const ResolutionRow& row : rows) {
    EXPECT_EQ(call(fn_resolve_uri, {string(row.reference), string(row.base)}), row.result)
        << row.reference << " against " << row.base;
  }
}

TEST(ResolveURI, TakesTheStaticBaseWithoutASecondArgument) {
  EXPECT_EQ(underBase("http://h/x/y", "resolve-uri('a')"), "anyURI http://h/x/a");
  EXPECT_EQ(underBase("x/y", "resolve-uri('a')"), "anyURI a");
  EXPECT_EQ(answer("resolve-uri('a')"), "anyURI a");
  EXPECT_EQ(underBase("http://h/x/y", "resolve-uri('a', '')"), "anyURI a");
  EXPECT_EQ(underBase("http://h/x/y", "resolve-uri('a', ())"), "anyURI a");
}

TEST(ResolveURI, OfTheEmptySequenceIsEmpty) {
  EXPECT_EQ(call(fn_resolve_uri, {empty(), string("http://h/")}), "()");
  EXPECT_EQ(call(fn_resolve_uri, {empty(), integer(1)}), "()");
  EXPECT_EQ(answer("resolve-uri(())"), "");
}

TEST(ResolveURI, TakesStrings) {
  EXPECT_EQ(call(fn_resolve_uri, {untyped("a"), typed(XQueryTypeAnyURI, "http://h/")}),
            "anyURI http://h/a");
  EXPECT_EQ(call(fn_resolve_uri, {integer(1), string("http://h/")}),
            "error 6 not a string type - 1");
  EXPECT_EQ(call(fn_resolve_uri, {string("a"), integer(1)}), "error 6 not a string type - 1");
}

TEST(ResolveURI, TakesOneOrTwoArguments) {
  EXPECT_EQ(answer("resolve-uri()"), "error 17 line 1 invalid arguments to function - resolve-uri");
  EXPECT_EQ(answer("resolve-uri('a', 'b', 'c')"),
            "error 17 line 1 invalid arguments to function - resolve-uri");
}

// --- doc -----------------------------------------------------------------------------------------

class Doc : public testing::Test {
 protected:
  std::string evaluated(const std::string& query) {
    const auto compiled = XQuery::xqueryWithSource(query);
    Ref<XQueryError> error;
    const auto items = context->evaluateXQuery(*compiled, {}, {}, &error);
    if (error) return "error " + std::to_string(error->err()) + " " + error->msg()->utf8();
    std::string text;
    for (const Value& item : items->objects()) text += (text.empty() ? "" : ", ") + show(item);
    return text;
  }

  HTTPServer server;
  TestFolder folder;
  Ref<XQueryContext> context = XQueryContext::xqueryContext();
};

TEST_F(Doc, ComesFromFilesAndServers) {
  const auto file = folder.write("a.xml", "<a/>");
  server.answer("/b", "application/xml", "<b/>");
  EXPECT_EQ(evaluated("doc('" + file + "')/*, doc('" + server.URL("/b") + "')/*"),
            "node a, node b");
}

TEST_F(Doc, IsRelativeToTheStaticBaseURI) {
  server.answer("/x/a", "application/xml", "<a/>");
  EXPECT_EQ(evaluated("declare base-uri '" + server.URL("/x/q") +
                      "'; doc('a')/*, doc('../x/a')/*, doc('/x/a') is doc('a')"),
            "node a, node a, true");
  EXPECT_EQ(server.requests("/x/a"), 1);
}

TEST_F(Doc, WithoutAnAbsoluteBaseTheNameStandsAlone) {
  const auto file = folder.write("a.xml", "<a/>");
  for (const auto* base : {"", "x/y", "no uri"}) {
    EXPECT_EQ(evaluated("declare base-uri '" + std::string(base) + "'; doc('" + file +
                        "')/*, count(doc('a.xml'))"),
              "node a, integer 0")
        << base;
  }
}

TEST_F(Doc, OneDocumentOfAContextIsOneNode) {
  const auto file = folder.write("a.xml", "<a/>");
  const std::string doc = "doc('" + file + "')";
  EXPECT_EQ(evaluated(doc + " is " + doc + ", " + doc + "/a is " + doc + "/a"), "true, true");
  EXPECT_EQ(evaluated("doc(('" + file + "'))/*"), "node a");
  folder.write("a.xml", "<changed/>");
  EXPECT_EQ(evaluated(doc + "/*"), "node a") << "it is kept from one evaluation to the next";
}

TEST_F(Doc, WhatCannotBeHadIsEmptyAndNotAskedForAgain) {
  const std::string URL = server.URL("/missing");
  EXPECT_EQ(evaluated("count(doc('" + URL + "')), count(doc('" + URL + "'))"),
            "integer 0, integer 0");
  server.answer("/missing", "application/xml", "<a/>");
  EXPECT_EQ(evaluated("count(doc('" + URL + "'))"), "integer 0");
  EXPECT_EQ(server.requests("/missing"), 1);
}

TEST_F(Doc, WhatIsNotWellFormedIsEmpty) {
  EXPECT_EQ(evaluated("count(doc('" + folder.write("a.xml", "<a>") + "'))"), "integer 0");
}

TEST_F(Doc, WhatThePolicyForbidsIsEmpty) {
  const auto file = folder.write("a.xml", "<a/>");
  server.answer("/a", "application/xml", "<a/>");
  XQueryLoading loading;
  loading.policy = XQueryLoadingPolicy::denyAll();
  context->contextSetLoading(loading);
  EXPECT_EQ(evaluated("count((doc('" + file + "'), doc('" + server.URL("/a") + "')))"),
            "integer 0");
  EXPECT_EQ(server.requests(), 0);
}

TEST_F(Doc, AnHTMLPageIsTidied) {
  server.answer("/page", "text/html", "<P>x");
  EXPECT_EQ(evaluated("doc('" + server.URL("/page") + "')//text()/ancestor::*/local-name()"),
            "string p, string body, string html");
}

TEST_F(Doc, KnowsTheURLItWasAskedForBy) {
  server.redirect("/a", "/b");
  server.answer("/b", "application/xml", "<b/>");
  EXPECT_EQ(evaluated("document-uri(doc('" + server.URL("/a") + "')/b)"),
            "anyURI " + server.URL("/a"));
}

TEST_F(Doc, OutlivesItsContext) {
  const auto query = XQuery::xqueryWithSource("doc('" + folder.write("a.xml", "<a>x</a>") + "')/a");
  const auto items = context->evaluateXQuery(*query, {}, {});
  context = nullptr;
  EXPECT_EQ(cast<NSXMLNode>(items->objectAtIndex(0))->XMLString()->utf8(), "<a>x</a>");
}

TEST_F(Doc, OfTheEmptyStringIsEmpty) {
  EXPECT_EQ(call(fn_doc, {string("")}), "()");
  EXPECT_EQ(call(fn_doc, {empty()}), "()");
}

TEST_F(Doc, OfWhatIsNoURIOrNoStringFails) {
  EXPECT_EQ(evaluated("doc('a b')"), "error 17 invalid arguments to function - doc");
  EXPECT_EQ(evaluated("doc(' ')"), "error 17 invalid arguments to function - doc");
  EXPECT_EQ(evaluated("doc(1)"), "error 6 not a string type - 1");
}

TEST_F(Doc, TakesOneArgument) {
  EXPECT_EQ(refusedCounts(fn_doc, string("")), "0 2 3 4 5");
}

TEST_F(Doc, CollectionsAlwaysFail) {
  for (const auto* call : {"collection()", "collection('urn:x')", "collection((), 1)"}) {
    EXPECT_EQ(evaluated(call), "error 17 invalid arguments to function - collection") << call;
  }
}

}  // namespace
}  // namespace xquery

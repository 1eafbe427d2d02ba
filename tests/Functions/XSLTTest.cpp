#include "Functions/FunctionsTesting.h"
#include "Functions/XSLT.h"
#include "Platform/Loading/LoadingTestSupport.h"
#include "Platform/Stylesheets/StylesheetTestSupport.h"

#include <chrono>

namespace xquery {
namespace {

using namespace functiontest;

constexpr std::string_view refused = "error 17 line 1 invalid arguments to function - ext:xslt";

// What the query answers with the stylesheet as $s.
std::string with(std::string_view style, std::string_view query,
                 const Value& item = document("<a><b>1</b></a>")) {
  return answer("declare variable $s external; " + std::string(query), item,
                {{"s", untyped(style)}});
}

TEST(XSLT, AnswersADocument) {
  const std::string style = root("<r><xsl:value-of select='a/b'/></r>");
  EXPECT_EQ(with(style, "ext:xslt(/, $s) instance of document-node()"), "true");
  EXPECT_EQ(with(style, "ext:string-from-node(ext:xslt(/, $s)/*)"), "untypedAtomic <r>1</r>");
  EXPECT_EQ(with(style, "ext:xslt(document { <a><b>{1 + 1}</b></a> }, $s)/r + 1"), "double 3");
}

TEST(XSLT, AnswersAStringForTheTextMethod) {
  EXPECT_EQ(with(stylesheet("<xsl:output method='text'/>"), "ext:xslt(/, $s)"), "untypedAtomic 1");
}

TEST(XSLT, IsRefusedWithoutADocument) {
  const std::string style = root("<r/>");
  EXPECT_EQ(with(style, "ext:xslt(/a, $s)"), refused);
  EXPECT_EQ(with(style, "ext:xslt('a', $s)"), refused);
  EXPECT_EQ(with(style, "ext:xslt((), $s)"), refused);
  EXPECT_EQ(refusedCounts(ext_xslt, document(style)), "0 1 2 3 4 5");
  EXPECT_EQ(refusedCounts(ext_xslt_uri, document("<a/>")), "0 1 2 3 4 5");
}

TEST(XSLT, IsRefusedWhereTheStylesheetFails) {
  for (const std::string& style :
       {std::string("<a"), std::string("<a/>"), root("<xsl:value-of select='$x'/>"),
        root("<xsl:message terminate='yes'/>"),
        stylesheet("<xsl:template name='t' match='/'><xsl:call-template name='t'/>"
                   "</xsl:template>")}) {
    EXPECT_EQ(with(style, "ext:xslt(/, $s)"), refused) << style;
  }
  EXPECT_EQ(call(ext_xslt, {document("<a/>"), integer(1)}), "error 6 not a string type - 1");
}

TEST(XSLT, ResolvesReferencesAgainstTheStaticBaseURI) {
  const TestFolder folder;
  folder.write("d.xml", "<d>5</d>");
  const std::string style = root("<r><xsl:value-of select=\"document('d.xml')\"/></r>");
  EXPECT_EQ(answer("declare base-uri '" + folder.URL("q.xq") +
                       "'; declare variable $s external; string(ext:xslt(/, $s))",
                   document("<a/>"), {{"s", untyped(style)}}),
            "string 5");
  EXPECT_EQ(with(style, "string(ext:xslt(/, $s))"), "string ");
}

TEST(XSLTURI, LoadsTheStylesheet) {
  const TestFolder folder;
  const std::string URL = folder.write("s.xsl", root("<r><xsl:value-of select='a/b'/></r>"));
  const Value doc = document("<a><b>1</b></a>");
  EXPECT_EQ(answer("string(ext:xslt-uri(/, '" + URL + "'))", doc), "string 1");
  EXPECT_EQ(
      answer("declare base-uri '" + folder.URL("q.xq") + "'; string(ext:xslt-uri(/, 's.xsl'))",
             doc),
      "string 1");
}

TEST(XSLTURI, IsRefusedWhereThereIsNone) {
  const TestFolder folder;
  const Value doc = document("<a/>");
  const std::string notRefused = folder.write("s.xsl", root("<r/>"));
  for (const std::string& URI :
       {std::string(), std::string("a b"), std::string("relative.xsl"), folder.URL("missing"),
        folder.write("bad.xsl", "<a"), folder.write("none.xsl", "<a/>")}) {
    EXPECT_EQ(answer("ext:xslt-uri(/, '" + URI + "')", doc),
              "error 17 line 1 invalid arguments to function - ext:xslt-uri")
        << URI;
  }
  EXPECT_EQ(answer("ext:xslt-uri(/a, '" + notRefused + "')", doc),
            "error 17 line 1 invalid arguments to function - ext:xslt-uri");
}

class Settings {
 public:
  Ref<XQueryContext> context = XQueryContext::xqueryContext();
  std::string answer(std::string_view source, std::string_view style) {
    Ref<XQueryError> error;
    const Ref<NSArray> items = context->evaluateXQuery(
        *XQuery::xqueryWithSource("declare variable $s external; " + std::string(source)),
        {{"s", untyped(style)}}, document("<a/>"), &error);
    if (error) return "error " + std::to_string(error->err()) + " " + error->msg()->utf8();
    return show(items);
  }
};

TEST(XSLT, KeepsToTheLoadingPolicy) {
  const TestFolder folder;
  const std::string URL = folder.write("d.xml", "<d>5</d>");
  const std::string styleURL = folder.write("s.xsl", root("<r/>"));
  const std::string style = root("<r><xsl:value-of select=\"document('" + URL + "')\"/></r>");
  Settings settings;
  EXPECT_EQ(settings.answer("string(ext:xslt(/, $s))", style), "(string 5)");
  XQueryLoading loading;
  loading.policy = XQueryLoadingPolicy::denyAll();
  settings.context->contextSetLoading(loading);
  EXPECT_EQ(settings.answer("string(ext:xslt(/, $s))", style), "(string )");
  EXPECT_EQ(settings.answer("string(ext:eval('ext:xslt(/, string(/))', "
                            "document { text { $s } }))",
                            style),
            "(string )");
  EXPECT_EQ(settings.answer("ext:xslt-uri(/, '" + styleURL + "')", style),
            "error 17 invalid arguments to function - ext:xslt-uri");
}

class Hearer : public XQueryClient {
 public:
  void XQueryClientMissesDocument(const XQueryMissingDocument& missing, XQueryContext&) override {
    heard.push_back(missing.URL + " - " + missing.reason);
    if (throws) throw std::length_error("mine");
  }
  std::vector<std::string> heard;
  bool throws = false;
};

TEST(XSLT, TellsTheClientWhatAStylesheetCannotLoad) {
  const TestFolder folder;
  const std::string none = folder.URL("none.xml"), broken = folder.write("broken.xml", "<a>\n<b>"),
                    gone = folder.URL("gone.xsl");
  Settings settings;
  const auto client = std::make_shared<Hearer>();
  settings.context->contextSetClient(client);
  // Both are empty to the stylesheet, and each is told of once.
  EXPECT_EQ(settings.answer("string(ext:xslt(/, $s))",
                            root("<r><xsl:value-of select=\"count(document('" + none +
                                 "')) + count(document('" + broken + "')) + count(document('" +
                                 none + "')/a)\"/></r>")),
            "(string 0)");
  ASSERT_EQ(client->heard.size(), 2u);
  EXPECT_EQ(client->heard[0], none + " - No such file or directory");
  EXPECT_EQ(client->heard[1].find(broken + " - line 2, column "), 0u) << client->heard[1];
  client->heard.clear();
  EXPECT_EQ(settings.answer("ext:xslt-uri(/, '" + gone + "')", ""),
            "error 17 invalid arguments to function - ext:xslt-uri");
  EXPECT_EQ(settings.answer("ext:xslt(/, $s)", stylesheet("<xsl:include href='" + gone + "'/>")),
            "error 17 invalid arguments to function - ext:xslt");
  EXPECT_EQ(client->heard, std::vector<std::string>(2, gone + " - No such file or directory"));
  client->throws = true;
  EXPECT_THROW(settings.answer("ext:xslt-uri(/, '" + gone + "')", ""), std::length_error);
}

TEST(XSLT, EndsAtTheLimitsOfTheEvaluation) {
  const std::string endless = doubling(60, "<x/>");
  for (const std::string_view query :
       {"ext:xslt(/, $s)", "(1, 2)[ext:xslt($d, $s)]", "ext:eval('ext:xslt(/, string(/))', $t)"}) {
    Settings settings;
    XQueryLimits limits;
    limits.duration = std::chrono::milliseconds(50);
    settings.context->contextSetLimits(limits);
    const auto begin = std::chrono::steady_clock::now();
    const std::string text = settings.answer(
        "let $d := /, $t := document { text { $s } } return " + std::string(query), endless);
    EXPECT_EQ(text, "error 0 limit: deadline passed") << query;
    EXPECT_LT(std::chrono::steady_clock::now() - begin, std::chrono::seconds(20));
  }
  Settings settings;
  XQueryLimits limits;
  limits.memoryCeiling = uint64_t{32} << 20;
  settings.context->contextSetLimits(limits);
  EXPECT_EQ(settings.answer("ext:xslt(/, $s)", endless), "error 0 limit: memory ceiling reached");
}

// A text doubles its length on each of some thirty levels, which makes neither nodes nor work.
TEST(XSLT, TextsCountAsMemory) {
  const auto doubled = [](int levels, std::string_view twice) {
    return stylesheet(
        "<xsl:template match='/'><xsl:call-template name='t'/></xsl:template>"
        "<xsl:template name='t'><xsl:param name='n' select='" +
        std::to_string(levels) +
        "'/><xsl:param name='s' select=\"'x'\"/><xsl:choose><xsl:when test='$n'>"
        "<xsl:call-template name='t'><xsl:with-param name='n' select='$n - 1'/>" +
        std::string(twice) +
        "</xsl:call-template></xsl:when><xsl:otherwise><r><xsl:value-of "
        "select='string-length($s)'/></r></xsl:otherwise></xsl:choose></xsl:template>");
  };
  for (const std::string_view twice :
       {"<xsl:with-param name='s' select='concat($s, $s)'/>",
        "<xsl:with-param name='s'><xsl:value-of select='$s'/><xsl:value-of select='$s'/>"
        "</xsl:with-param>"}) {
    Settings settings;
    XQueryLimits limits;
    limits.memoryCeiling = uint64_t{16} << 20;
    settings.context->contextSetLimits(limits);
    EXPECT_TRUE(
        settings.answer("string(ext:xslt(/, $s))", doubled(10, twice)).starts_with("(string "));
    EXPECT_EQ(settings.answer("ext:xslt(/, $s)", doubled(28, twice)),
              "error 0 limit: memory ceiling reached")
        << twice;
  }
}

TEST(XSLT, LoadedDocumentsCountAsMemory) {
  class Loader : public XQueryLoader {
   public:
    std::optional<XQueryResource> load(const NSURL&, XQueryLoadPurpose) override {
      std::string text = "<d>";
      for (int index = 0; index < 50000; ++index) text += "<x/>";
      return XQueryResource{text + "</d>", {}, {}, {}};
    }
  };
  const auto loading = [](int documents) {
    return stylesheet(
        "<xsl:template match='/'><r><xsl:call-template name='t'/></r></xsl:template>"
        "<xsl:template name='t'><xsl:param name='n' select='" +
        std::to_string(documents) +
        "'/><xsl:if test='$n'><xsl:value-of select=\"count(document(concat('http://h/', $n)))\"/>"
        "<xsl:call-template name='t'><xsl:with-param name='n' select='$n - 1'/>"
        "</xsl:call-template></xsl:if></xsl:template>");
  };
  Settings settings;
  XQueryLoading loader;
  loader.loader = std::make_shared<Loader>();
  settings.context->contextSetLoading(loader);
  XQueryLimits limits;
  limits.memoryCeiling = uint64_t{48} << 20;
  settings.context->contextSetLimits(limits);
  EXPECT_EQ(settings.answer("string(ext:xslt(/, $s))", loading(2)), "(string 11)");
  EXPECT_EQ(settings.answer("string(ext:xslt(/, $s))", loading(20)),
            "error 0 limit: memory ceiling reached");
}

}  // namespace
}  // namespace xquery

#include "Platform/LibXSLT.h"
#include "Platform/LoadingTestSupport.h"
#include "Platform/StylesheetTestSupport.h"
#include "Platform/WorkMeter.h"
#include "Platform/XMLStylesheet.h"
#include "xquery/Error.h"

#include <gtest/gtest.h>

#include <chrono>
#include <cstdlib>
#include <filesystem>
#include <iterator>
#include <map>
#include <stdexcept>
#include <string>
#include <thread>
#include <vector>

namespace xquery {
namespace {

Ref<NSXMLDocument> document(std::string_view xml) {
  const auto parsed = NSXMLDocument::documentWithData(xml, NSXMLNodePreserveWhitespace);
  EXPECT_TRUE(parsed) << xml.substr(0, 200);
  return parsed;
}

// The result as XML, "text " and the text, or "(none: why)".
std::string shown(const Value& result, const Ref<NSError>& error) {
  if (!result) return "(none: " + error->userInfo()->errorMessage->utf8() + ")";
  EXPECT_FALSE(error);
  if (const auto* text = dyn_cast<NSString>(result.get())) return "text " + text->utf8();
  EXPECT_EQ(result->kind(), Kind::Document);
  std::string text;
  for (const NSXMLNode* child = cast<NSXMLNode>(result.get())->firstChild(); child;
       child = child->nextSibling()) {
    child->appendXMLTo(text);
  }
  return text;
}

std::string applied(const NSXMLDocument& document, std::string_view style,
                    const XQueryLoading& loading = {},
                    const NSXMLDocument::XSLTArguments& arguments = {}) {
  Ref<NSError> error;
  const Value result = document.objectByApplyingXSLTString(NSString::stringWithUTF8(style),
                                                           arguments, loading, &error);
  return shown(result, error);
}
std::string applied(std::string_view xml, std::string_view style, const XQueryLoading& loading = {},
                    const NSXMLDocument::XSLTArguments& arguments = {}) {
  return applied(*document(xml), style, loading, arguments);
}

bool fails(const std::string& shown) {
  return shown.starts_with("(none: ");
}

XQueryLoading denied() {
  XQueryLoading loading;
  loading.policy = XQueryLoadingPolicy::denyAll();
  return loading;
}

const std::string identity = stylesheet(
    "<xsl:template match='@*|node()'><xsl:copy><xsl:apply-templates select='@*|node()'/>"
    "</xsl:copy></xsl:template>");
const std::string copyOf = root("<xsl:copy-of select='.'/>");

// --- results -------------------------------------------------------------------------------------

TEST(XMLStylesheet, MakesADocument) {
  EXPECT_EQ(applied("<a><b>1</b><b>2</b></a>",
                    root("<r n='{count(//b)}'><xsl:value-of select='sum(//b)'/></r>")),
            "<r n=\"2\">3</r>");
}

TEST(XMLStylesheet, MakesAStringWhereTheMethodIsText) {
  const std::string text = stylesheet(
      "<xsl:output method='text' encoding='UTF-16'/>"
      "<xsl:template match='/'>a<x>é<y>€</y></x>b</xsl:template>");
  EXPECT_EQ(applied("<a/>", text), "text aé€b");
  EXPECT_EQ(applied("<a/>", stylesheet("<xsl:output method='text'/>"
                                       "<xsl:template match='/'/>")),
            "text ");
}

TEST(XMLStylesheet, MakesADocumentForEveryOtherMethod) {
  EXPECT_EQ(applied("<a/>", stylesheet("<xsl:output method='html'/><xsl:template match='/'>"
                                       "<html><br/></html></xsl:template>")),
            "<html><br/></html>");
  EXPECT_EQ(applied("<a>x</a>", stylesheet("")), "x");
  EXPECT_EQ(applied("<a/>", stylesheet("")), "");
}

TEST(XMLStylesheet, TakesALiteralResultElement) {
  EXPECT_EQ(applied("<a>1</a>",
                    "<r xsl:version='1.0' "
                    "xmlns:xsl='http://www.w3.org/1999/XSL/Transform'>"
                    "<xsl:value-of select='/a'/></r>"),
            "<r>1</r>");
}

TEST(XMLStylesheet, KeepsCDATASectionsThatItAskedFor) {
  EXPECT_EQ(applied("<a/>", stylesheet("<xsl:output cdata-section-elements='r'/>"
                                       "<xsl:template match='/'><r>&lt;</r></xsl:template>")),
            "<r><![CDATA[<]]></r>");
}

TEST(XMLStylesheet, TakesArgumentsAsExpressions) {
  const std::string style = stylesheet(
      "<xsl:param name='p' select='0'/><xsl:param name='q'/>"
      "<xsl:template match='/'><r p='{$p}' q='{$q}'/>"
      "</xsl:template>");
  EXPECT_EQ(applied("<a>5</a>", style, {}, {{"p", "/a + 1"}, {"q", "'x'"}}),
            "<r p=\"6\" q=\"x\"/>");
  EXPECT_EQ(applied("<a/>", style), "<r p=\"0\" q=\"\"/>");
  EXPECT_TRUE(fails(applied("<a/>", style, {}, {{"p", "1 +"}})));
}

// --- the tree as a copy --------------------------------------------------------------------------

TEST(XMLStylesheet, SeesAndGivesBackEveryKindOfNode) {
  for (const std::string_view xml :
       {"<a/>", "<a x=\"1\" y=\"&lt;&amp;&quot;\">t&lt;<b/>é€😀</a>", "<!--c--><?p q?><a/><!--d-->",
        "<a> <b> x </b>\n</a>", "<a xml:lang=\"en\" xml:id=\"i\"/>",
        "<a xmlns=\"u\" xmlns:p=\"v\" p:x=\"1\"><p:b/><c xmlns=\"\"/></a>",
        "<p:a xmlns:p=\"u\"><p:a xmlns:p=\"v\"><p:b/></p:a><p:c/></p:a>",
        "<é à=\"ü\"><?日 本?></é>"}) {
    EXPECT_EQ(applied(xml, identity), xml);
    EXPECT_EQ(applied(xml, copyOf), xml);
  }
}

TEST(XMLStylesheet, SeesNamespaces) {
  const std::string style = root(
      "<r><xsl:for-each select='//*'>{<xsl:value-of "
      "select='namespace-uri()'/>}<xsl:value-of select='local-name()'/>"
      ";<xsl:value-of select='count(p:*)'/></xsl:for-each></r>",
      "xmlns:p='u' exclude-result-prefixes='p'");
  EXPECT_EQ(applied("<a xmlns='u'><b/><c xmlns=''/><q:d xmlns:q='w'/></a>", style),
            "<r>{u}a;1{u}b;0{}c;0{w}d;0</r>");
}

TEST(XMLStylesheet, DeclaresWhatAConstructedTreeDoesNot) {
  const auto doc = NSXMLDocument::document();
  const auto element =
      NSXMLElement::elementWithName(NSStringView::ascii("p:a"), NSStringView::ascii("u"));
  element->addAttribute(NSXMLNode::attributeWithName(
      NSStringView::ascii("x"), NSStringView::ascii("1"), NSStringView::ascii("v")));
  element->addChild(NSXMLElement::elementWithName(NSStringView::ascii("p:b")));
  doc->addChild(element);
  const std::string style = root(
      "<r><xsl:for-each select='//*|//@*'>{<xsl:value-of "
      "select='namespace-uri()'/>}<xsl:value-of "
      "select='local-name()'/></xsl:for-each></r>");
  EXPECT_EQ(applied(*doc, style), "<r>{u}a{v}x{}p:b</r>");
}

TEST(XMLStylesheet, KnowsElementsByTheirXMLID) {
  EXPECT_EQ(applied("<a><b xml:id='i'>1</b><b xml:id='j'>2</b></a>",
                    root("<r><xsl:value-of select=\"id('j')\"/></r>")),
            "<r>2</r>");
}

TEST(XMLStylesheet, LeavesTheDocumentAsItIs) {
  const auto doc = document("<a> <b/> </a>");
  const std::string style = stylesheet(
      "<xsl:strip-space elements='*'/><xsl:template match='/'>"
      "<r><xsl:value-of select='count(//text())'/></r></xsl:template>");
  EXPECT_EQ(applied(*doc, style), "<r>0</r>");
  EXPECT_EQ(doc->rootElement()->XMLString()->utf8(), "<a> <b/> </a>");
}

TEST(XMLStylesheet, TakesTagsOfManyAttributesAndNamespaces) {
  std::string xml = "<a";
  for (int index = 0; index < 5000; ++index) {
    xml += " a" + std::to_string(index) + "='" + std::to_string(index) + "'";
  }
  xml += "/>";
  EXPECT_EQ(applied(xml, root("<r><xsl:value-of select='count(/a/@*)'/></r>")), "<r>5000</r>");
}

// --- failures ------------------------------------------------------------------------------------

TEST(XMLStylesheet, FailsWhereTheStylesheetIsNone) {
  for (const std::string_view style :
       {"", "x", "<a>", "<a/>", "<xsl:stylesheet/>",
        "<xsl:stylesheet version='1.0' xmlns:xsl='http://www.w3.org/1999/XSL/Transform'>"}) {
    EXPECT_TRUE(fails(applied("<a/>", style))) << style;
  }
  EXPECT_TRUE(fails(applied("<a/>", root("<xsl:value-of select='1 +'/>"))));
  EXPECT_TRUE(fails(applied("<a/>", root("<xsl:value-of/>"))));
  EXPECT_TRUE(fails(applied("<a/>", root("<xsl:call-template name='missing'/>"))));
  EXPECT_TRUE(fails(applied("<a/>", root("<xsl:value-of select='$missing'/>"))));
  EXPECT_TRUE(fails(applied("<a/>", root("<xsl:value-of select='f:unknown()'/>", "xmlns:f='u'"))));
}

TEST(XMLStylesheet, SaysWhy) {
  EXPECT_EQ(applied("<a/>", "<a>"), "(none: line 1: Premature end of data in tag a line 1)");
  const std::string why = applied("<a/>", root("<xsl:value-of select='$missing'/>"));
  EXPECT_NE(why.find("missing"), std::string::npos) << why;
}

TEST(XMLStylesheet, FailsWhereAMessageTerminates) {
  const std::string why =
      applied("<a/>", root("<xsl:message terminate='yes'>enough</xsl:message>"));
  EXPECT_NE(why.find("enough"), std::string::npos) << why;
  EXPECT_TRUE(fails(why));
  EXPECT_EQ(applied("<a/>", root("<xsl:message>on</xsl:message><r/>")), "<r/>");
}

TEST(XMLStylesheet, PrintsNothing) {
  testing::internal::CaptureStderr();
  testing::internal::CaptureStdout();
  applied("<a/>", "<a>");
  applied("<a/>", root("<xsl:value-of select='1 +'/>"));
  applied("<a/>", root("<xsl:message>on</xsl:message><xsl:value-of select='$missing'/>"));
  applied("<a/>", root("<xsl:copy-of select=\"document('file:///no/such/file')\"/>"));
  applied("<a/>", root("<lx:debug/>",
                       "xmlns:lx='http://xmlsoft.org/XSLT/' "
                       "extension-element-prefixes='lx'"));
  EXPECT_EQ(testing::internal::GetCapturedStderr(), "");
  EXPECT_EQ(testing::internal::GetCapturedStdout(), "");
}

// --- what a stylesheet may read ------------------------------------------------------------------

TEST(XMLStylesheet, ReadsDocumentsThroughTheLoader) {
  const TestFolder folder;
  const std::string URL = folder.write("d.xml", "<d> 1 </d>");
  const std::string style = root("<r><xsl:copy-of select=\"document('" + URL + "')\"/></r>");
  EXPECT_EQ(applied("<a/>", style), "<r><d> 1 </d></r>");
  EXPECT_EQ(applied("<a/>", style, denied()), "<r/>");
  XQueryLoading below = denied();
  below.policy.allowFilesBelow(folder.path());
  EXPECT_EQ(applied("<a/>", style, below), "<r><d> 1 </d></r>");
}

TEST(XMLStylesheet, ReadsNothingThatThePolicyDenies) {
  for (const std::string name :
       {"/etc/passwd", "file:///etc/passwd", "file:/etc/passwd", "file://localhost/etc/passwd",
        "../../../etc/passwd", "http://127.0.0.1:1/x", "ftp://127.0.0.1/x"}) {
    const std::string style = root("<r><xsl:copy-of select=\"document('" + name + "')\"/></r>");
    EXPECT_EQ(applied("<a/>", style, denied()), "<r/>") << name;
    for (const std::string way : {"include", "import"}) {
      const std::string including = stylesheet("<xsl:" + way + " href='" + name +
                                               "'/><xsl:template match='/'><r/>"
                                               "</xsl:template>");
      const std::string result = applied("<a/>", including, denied());
      EXPECT_TRUE(fails(result) || result == "<r/>") << result;
    }
  }
}

TEST(XMLStylesheet, ReadsNoEntities) {
  const TestFolder folder;
  const std::string secret = folder.write("secret", "secret");
  const std::string declaration = "<!DOCTYPE x [<!ENTITY e SYSTEM '" + secret + "'>]>";
  EXPECT_TRUE(fails(applied("<a/>", declaration + root("<r>&e;</r>"))));
  const std::string URL = folder.write("d.xml", declaration + "<x>&e;</x>");
  EXPECT_EQ(applied("<a/>", root("<r><xsl:copy-of select=\"document('" + URL + "')\"/></r>")),
            "<r/>");
}

TEST(XMLStylesheet, IncludesAndImportsThroughTheLoader) {
  const TestFolder folder;
  folder.write("sub/inner.xsl", stylesheet("<xsl:template match='a'><inner/></xsl:template>"));
  const std::string URL =
      folder.write("outer.xsl", stylesheet("<xsl:import href='sub/inner.xsl'/>"));
  for (const std::string way : {"include", "import"}) {
    EXPECT_EQ(applied("<a/>", stylesheet("<xsl:" + way + " href='" + URL + "'/>")), "<inner/>");
    EXPECT_TRUE(
        fails(applied("<a/>", stylesheet("<xsl:" + way + " href='" + URL + "'/>"), denied())));
  }
}

TEST(XMLStylesheet, ReferencesOfADocumentAreRelativeToItsURI) {
  const TestFolder folder;
  folder.write("d.xml", "<d/>");
  const auto doc = document("<a>d.xml</a>");
  doc->setURI(NSString::stringWithUTF8(folder.URL("a.xml")));
  EXPECT_EQ(applied(*doc, root("<r><xsl:copy-of select='document(/a)'/></r>")), "<r><d/></r>");
}

TEST(XMLStylesheet, ReadsItselfByTheEmptyReference) {
  const std::string style = root("<r><xsl:value-of select=\"document('')//x:table\"/></r>",
                                 "xmlns:x='u' exclude-result-prefixes='x'");
  const std::string withTable = style.substr(0, style.find("<xsl:template")) +
                                "<x:table>own</x:table>" +
                                style.substr(style.find("<xsl:template"));
  EXPECT_EQ(applied("<a/>", withTable, denied()), "<r>own</r>");
  const TestFolder folder;
  Ref<NSError> error;
  const Value result = document("<a/>")->objectByApplyingXSLTAtURL(
      URLOf(folder.write("s.xsl", withTable)), {}, &error);
  EXPECT_EQ(shown(result, error), "<r>own</r>");
}

// Answers from a table and counts what it was asked for.
class TableLoader : public XQueryLoader {
 public:
  std::map<std::string, std::string> table;
  std::vector<std::string> asked;
  std::vector<std::thread::id> threads;

  std::optional<XQueryResource> load(const NSURL& URL, XQueryLoadPurpose purpose) override {
    const std::string name = URL.absoluteString()->utf8();
    asked.push_back((purpose == XQueryLoadPurpose::Stylesheet ? "stylesheet " : "document ") +
                    name);
    threads.push_back(std::this_thread::get_id());
    if (name == "http://h/throw") throw std::runtime_error("thrown");
    const auto found = table.find(name);
    if (found == table.end()) return std::nullopt;
    return XQueryResource{found->second, {}, {}, {}};
  }
};

TEST(XMLStylesheet, AsksTheHostsLoaderOnTheCallingThread) {
  const auto loader = std::make_shared<TableLoader>();
  loader->table["http://h/i.xsl"] = root("<r><xsl:copy-of select=\"document('d.xml')\"/></r>");
  loader->table["http://h/d.xml"] = "<d/>";
  XQueryLoading loading;
  loading.loader = loader;
  EXPECT_EQ(applied("<a/>", stylesheet("<xsl:include href='http://h/i.xsl'/>"), loading),
            "<r><d/></r>");
  EXPECT_EQ(loader->asked,
            (std::vector<std::string>{"stylesheet http://h/i.xsl", "document http://h/d.xml"}));
  for (const auto thread : loader->threads) EXPECT_EQ(thread, std::this_thread::get_id());
}

TEST(XMLStylesheet, ThrowsOnWhatALoaderThrows) {
  XQueryLoading loading;
  loading.loader = std::make_shared<TableLoader>();
  EXPECT_THROW(
      applied("<a/>", root("<xsl:copy-of select=\"document('http://h/throw')\"/>"), loading),
      std::runtime_error);
  EXPECT_THROW(applied("<a/>", stylesheet("<xsl:include href='http://h/throw'/>"), loading),
               std::runtime_error);
}

// Each stylesheet imports another one.
class EndlessLoader : public XQueryLoader {
 public:
  int loads = 0;
  std::optional<XQueryResource> load(const NSURL&, XQueryLoadPurpose) override {
    const std::string next = "http://h/" + std::to_string(++loads);
    return XQueryResource{stylesheet("<xsl:import href='" + next + "'/>"), {}, {}, {}};
  }
};

TEST(XMLStylesheet, LoadsABoundedNumberOfResources) {
  const auto loader = std::make_shared<EndlessLoader>();
  XQueryLoading loading;
  loading.loader = loader;
  EXPECT_TRUE(fails(applied("<a/>", stylesheet("<xsl:import href='http://h/0'/>"), loading)));
  EXPECT_EQ(loader->loads, static_cast<int>(LibXSLTMostLoads));
}

TEST(XMLStylesheet, IncludesItselfInVain) {
  const TestFolder folder;
  const std::string URL = folder.URL("s.xsl");
  folder.write("s.xsl", stylesheet("<xsl:include href='s.xsl'/>"));
  EXPECT_TRUE(fails(applied("<a/>", stylesheet("<xsl:include href='" + URL + "'/>"))));
}

TEST(XMLStylesheet, AtAURLIsLoadedLikeTheRest) {
  const TestFolder folder;
  const auto URL = URLOf(folder.write("s.xsl", root("<r/>")));
  Ref<NSError> error;
  const auto doc = document("<a/>");
  EXPECT_EQ(shown(doc->objectByApplyingXSLTAtURL(URL, {}, &error), error), "<r/>");
  EXPECT_FALSE(doc->objectByApplyingXSLTAtURL(URL, {}, denied(), &error));
  EXPECT_EQ(error->localizedDescription()->utf8(),
            "XSLT:1 - cannot load " + URL->absoluteString()->utf8());
  EXPECT_FALSE(doc->objectByApplyingXSLTAtURL(URLOf(folder.URL("missing.xsl")), {}, &error));
  EXPECT_FALSE(doc->objectByApplyingXSLTAtURL(URLOf(folder.write("bad", "<a>")), {}));
}

// --- what a stylesheet may write -----------------------------------------------------------------

TEST(XMLStylesheet, WritesNothing) {
  const TestFolder folder;
  const std::string target = folder.path("written");
  const std::vector<std::string> ways = {
      root("<exsl:document href='" + target + "'><x/></exsl:document><r/>",
           "xmlns:exsl='http://exslt.org/common' extension-element-prefixes='exsl'"),
      stylesheet("<xsl:template match='/'><xsl:document href='" + target +
                     "'><x/></xsl:document></xsl:template>",
                 ""),
      root("<s:output href='" + target + "'><x/></s:output>",
           "xmlns:s='http://icl.com/saxon' extension-element-prefixes='s'"),
      root("<s:output file='" + target + "'><x/></s:output>",
           "xmlns:s='http://icl.com/saxon' extension-element-prefixes='s'"),
      root("<w:write file='" + target + "' select=\"'" + target + "'\"><x/></w:write>",
           "xmlns:w='org.apache.xalan.xslt.extensions.Redirect' extension-element-prefixes='w'"),
      root("<x:document href='" + target + "'><x/></x:document>",
           "xmlns:x='http://www.jclark.com/xt' extension-element-prefixes='x'"),
  };
  for (const std::string& style : ways) {
    applied("<a/>", style);
    std::string version11 = style;
    version11.replace(version11.find("1.0"), 3, "1.1");
    applied("<a/>", version11);
    EXPECT_FALSE(std::filesystem::exists(target)) << style;
  }
}

// --- hostile stylesheets and documents -----------------------------------------------------------

TEST(XMLStylesheet, EndsRecursionWithoutEnd) {
  const std::string why = applied("<a/>", stylesheet("<xsl:template match='/' name='t'>"
                                                     "<xsl:call-template name='t'/>"
                                                     "</xsl:template>"));
  EXPECT_TRUE(fails(why)) << why;
  EXPECT_TRUE(fails(applied("<a/>", stylesheet("<xsl:template match='/'><xsl:apply-templates "
                                               "select='/'/></xsl:template>"))));
  EXPECT_TRUE(fails(applied("<a/>", stylesheet("<xsl:variable name='v' select='$v'/>"
                                               "<xsl:template match='/'>"
                                               "<xsl:value-of select='$v'/></xsl:template>"))));
}

TEST(XMLStylesheet, RecursesAsDeepAsTemplatesMay) {
  const std::string style = stylesheet(
      "<xsl:template match='/'><xsl:call-template name='t'/></xsl:template>"
      "<xsl:template name='t'><xsl:param name='n' select='900'/><xsl:choose><xsl:when test='$n'>"
      "<a><xsl:call-template name='t'><xsl:with-param name='n' select='$n - 1'/>"
      "</xsl:call-template></a></xsl:when><xsl:otherwise><b/></xsl:otherwise></xsl:choose>"
      "</xsl:template>");
  EXPECT_EQ(applied("<a/>", style).size(), 900 * 7 + 4);
}

std::string nested(std::string_view open, std::string_view close, size_t levels,
                   std::string_view inside = "") {
  std::string text;
  for (size_t level = 0; level < levels; ++level) text += open;
  text += inside;
  for (size_t level = 0; level < levels; ++level) text += close;
  return text;
}

TEST(XMLStylesheet, TakesDocumentsUpToTheirBound) {
  const std::string count = root("<r><xsl:value-of select='count(//a)'/></r>");
  const size_t most = LibXSLTMostDocumentLevels;
  EXPECT_EQ(applied(nested("<a>", "</a>", most), count), "<r>10000</r>");
  EXPECT_EQ(applied(nested("<a>", "</a>", most + 1), count),
            "(none: the document nests too deeply)");
  EXPECT_EQ(applied(nested("<a>", "</a>", 1000000), count),
            "(none: the document nests too deeply)");
  EXPECT_EQ(applied(nested("<a>", "</a>", most), copyOf).size(), most * 7 - 3);
}

TEST(XMLStylesheet, TakesStylesheetsUpToTheirBound) {
  const auto style = [](size_t levels) { return root(nested("<a>", "</a>", levels)); };
  // Two levels are the stylesheet and the template.
  EXPECT_EQ(applied("<a/>", style(LibXSLTMostStylesheetLevels - 2)).size(),
            (LibXSLTMostStylesheetLevels - 2) * 7 - 3);
  EXPECT_TRUE(fails(applied("<a/>", style(LibXSLTMostStylesheetLevels - 1))));
  EXPECT_TRUE(fails(applied("<a/>", root(nested("<xsl:if test='1'>", "</xsl:if>", 300000)))));
  EXPECT_EQ(applied("<a/>", root(nested("<xsl:if test='1'>", "</xsl:if>", 2900, "<r/>"))), "<r/>");
}

TEST(XMLStylesheet, TakesExpressionsOfAnyNesting) {
  const auto select = [](const std::string& expression) {
    return applied("<a/>", root("<r><xsl:value-of select='" + expression + "'/></r>"));
  };
  EXPECT_EQ(select(nested("(", ")", 100, "1")), "<r>1</r>");
  EXPECT_TRUE(fails(select(nested("(", ")", 100000, "1"))));
  EXPECT_TRUE(fails(select(nested("a[", "]", 100000, "a"))));
  EXPECT_TRUE(fails(select(nested("1+", "", 100000, "1"))));
  EXPECT_TRUE(fails(select(nested("count(", ")", 100000, "a"))));
}

// Puts a tree into itself again and again, so that it nests by far deeper than any template.
TEST(XMLStylesheet, EndsTreesThatNestWithoutBound) {
  const std::string style = stylesheet(
      "<xsl:template match='/'><xsl:call-template name='t'/></xsl:template>"
      "<xsl:template name='t'><xsl:param name='v'/><xsl:param name='n' select='1000'/>"
      "<xsl:choose><xsl:when test='$n'><xsl:call-template name='t'>"
      "<xsl:with-param name='n' select='$n - 1'/><xsl:with-param name='v'>" +
      nested("<a>", "</a>", 2900, "<xsl:copy-of select='$v'/>") +
      "</xsl:with-param></xsl:call-template></xsl:when>"
      "<xsl:otherwise><xsl:copy-of select='$v'/></xsl:otherwise></xsl:choose></xsl:template>");
  EXPECT_EQ(applied("<a/>", style), "(none: the result nests too deeply)");
}

// Ends the work of its thread once that many milliseconds have passed.
class Deadline final : public WorkWatcher {
 public:
  explicit Deadline(int milliseconds)
      : _end(std::chrono::steady_clock::now() + std::chrono::milliseconds(milliseconds)) {
    workMeter.watcher = this;
  }
  ~Deadline() {
    workMeter.watcher = nullptr;
    workMeter.wasRefused = false;
    workMeter.stepsLeft = WorkMeter::manySteps;
    workMeter.mostValueBytes = INT64_MAX;
  }
  void lookAtWork() override {
    const bool isPast = std::chrono::steady_clock::now() >= _end;
    if (isPast || workMeter.wasRefused) throw NSException("ended", nullptr);
  }

 private:
  std::chrono::steady_clock::time_point _end;
};

TEST(XMLStylesheet, EndsAtADeadline) {
  const std::string xml = "<a>" + nested("<b/>", "", 20000) + "</a>";
  const std::string slowExpression =
      root("<r><xsl:value-of select='count(//*[count(//*[count(//*) > 0]) > 0])'/></r>");
  for (const std::string& style : {doubling(500), slowExpression}) {
    const auto doc = document(xml);
    const auto begin = std::chrono::steady_clock::now();
    const Deadline deadline(50);
    EXPECT_THROW(applied(*doc, style), NSException);
    // Either takes longer than anybody has time; how late a busy machine is does not matter here.
    EXPECT_LT(std::chrono::steady_clock::now() - begin, std::chrono::seconds(20));
  }
}

// Takes libxslt a time in proportion to the square of the number, some tenths of a second for the
// first few thousands; nothing in there can be told to stop.
std::string slowToCompile(int templates) {
  std::string content;
  for (int index = 0; index < templates; ++index) {
    content += "<xsl:template match='a' priority='" + std::to_string(-index) + "'/>";
  }
  return stylesheet(content);
}

ptrdiff_t threadCount() {
  return std::distance(std::filesystem::directory_iterator("/proc/self/task"), {});
}

// Until what other tests left behind is done as well.
void waitForTheLastThread() {
  for (int turn = 0; turn < 6000 && threadCount() > 1; ++turn) {
    std::this_thread::sleep_for(std::chrono::milliseconds(10));
  }
}

TEST(XMLStylesheet, IsLeftBehindWhereItCannotBeStopped) {
  waitForTheLastThread();
  const std::string style = slowToCompile(15000);
  const auto doc = document("<a/>");
  for (int turn = 0; turn < 2; ++turn) {
    const Deadline deadline(10);
    EXPECT_THROW(applied(*doc, style), NSException);
    EXPECT_GT(threadCount(), 1) << "the call waited for the thread";
  }
  EXPECT_EQ(applied(*doc, root("<r/>")), "<r/>");
}

// What is left behind uses libraries that release what they share when the process ends.
TEST(XMLStylesheetDeathTest, TheProcessEndsInOrderWhileOneIsLeftBehind) {
  GTEST_FLAG_SET(death_test_style, "threadsafe");
  const auto leaveAndEnd = [] {
    const auto doc = document("<a/>");
    const std::string style = slowToCompile(10000);
    try {
      const Deadline deadline(10);
      applied(*doc, style);
    } catch (const NSException&) {
      std::exit(0);
    }
    std::exit(1);
  };
  EXPECT_EXIT(leaveAndEnd(), testing::ExitedWithCode(0), "^$");
}

TEST(XMLStylesheet, IsNotBegunWhileTooManyAreLeftBehind) {
  waitForTheLastThread();
  const std::string style = slowToCompile(25000);
  const auto doc = document("<a/>");
  int ended = 0;
  for (int turn = 0; turn < 2 * LibXSLTMostLeftBehind; ++turn) {
    const Deadline deadline(1);
    try {
      EXPECT_EQ(applied(*doc, style), "(none: no thread can be started)");
    } catch (const NSException&) {
      ++ended;
    }
  }
  EXPECT_GE(ended, LibXSLTMostLeftBehind);
  EXPECT_LT(ended, 2 * LibXSLTMostLeftBehind);
  std::string after;
  for (int turn = 0; turn < 600 && after != "<r/>"; ++turn) {
    std::this_thread::sleep_for(std::chrono::milliseconds(100));
    after = applied(*doc, root("<r/>"));
  }
  EXPECT_EQ(after, "<r/>");
}

TEST(XMLStylesheet, EndsWhereTreesTakeTooMuchMemory) {
  const std::string style = doubling(40, "<x/>");
  const auto doc = document("<a/>");
  const Deadline deadline(100000);
  workMeter.mostValueBytes = workMeter.valueBytes + (int64_t{16} << 20);
  const auto begin = std::chrono::steady_clock::now();
  EXPECT_THROW(applied(*doc, style), NSException);
  EXPECT_LT(std::chrono::steady_clock::now() - begin, std::chrono::seconds(20));
}

TEST(XMLStylesheet, RunsOnSeveralThreadsAtOnce) {
  const auto doc = document("<a><b>1</b><b>2</b></a>");
  std::vector<std::thread> threads;
  std::vector<int> wrong(4);
  for (size_t index = 0; index < wrong.size(); ++index) {
    threads.emplace_back([&wrong, &doc, index] {
      for (int turn = 0; turn < 50; ++turn) {
        const std::string name = "r" + std::to_string(index);
        const std::string made = "<" + name + ">3</" + name + ">";
        wrong[index] +=
            applied(*doc, root("<" + name + "><xsl:value-of select='sum(//b)'/></" + name + ">")) !=
            made;
        wrong[index] += !fails(applied(*doc, root("<xsl:value-of select='$" + name + "'/>")));
      }
    });
  }
  for (std::thread& thread : threads) thread.join();
  EXPECT_EQ(wrong, std::vector<int>(4));
}

}  // namespace
}  // namespace xquery

#include "Platform/Loading/LoadingTestSupport.h"
#include "Platform/Stylesheets/LibXSLT.h"
#include "Platform/Stylesheets/Stylesheet.h"
#include "Platform/Stylesheets/StylesheetTestSupport.h"
#include "xquery/Error.h"

#include <gtest/gtest.h>

#include <filesystem>
#include <map>
#include <stdexcept>
#include <string>
#include <thread>
#include <vector>

namespace xquery {
namespace {

using namespace stylesheettest;

XQueryLoading denied() {
  XQueryLoading loading;
  loading.policy = XQueryLoadingPolicy::denyAll();
  return loading;
}

const std::string identity = stylesheet(
    "<xsl:template match='@*|node()'><xsl:copy><xsl:apply-templates select='@*|node()'/>"
    "</xsl:copy></xsl:template>");

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

}  // namespace
}  // namespace xquery

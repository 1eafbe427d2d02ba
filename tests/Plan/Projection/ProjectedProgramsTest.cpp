// Generated programs answer of a projected document what they answer of the whole one.
#include "Plan/PlanTesting.h"
#include "Plan/ProgramGenerator.h"
#include "Plan/Projection/XQueryProjectionPlan.h"
#include "Platform/Reading/XMLDocuments.h"

#include <chrono>

namespace xquery {
namespace {

using namespace plantest;

Value projected(const XQuery& query, std::string_view xml, uint32_t options, XMLWay way) {
  const auto* plan = _internal(query).projectionPlan();
  TextSource source(xml);
  NSXMLParseError failure;
  const Ref<NSXMLDocument> document =
      readDocument(source, options, failure, way, plan->isPossible() ? &plan->projection : nullptr);
  EXPECT_TRUE(document) << failure.message;
  return document;
}

// Whether the program needs less than all.
bool agrees(const std::string& text, const std::string& xml, uint32_t options) {
  const auto query = compiled(text, XQueryWay::Planned);
  const auto* plan = _internal(*query).projectionPlan();
  if (!plan || !plan->isPossible()) return false;
  TextSource source(xml);
  NSXMLParseError failure;
  const Value whole = readDocument(source, options, failure);
  const Outcome expected =
      withoutFocus(outcomeOf(*compiled(text), whole, {}, boundedBy(std::chrono::seconds(1))));
  if (endedAtLimit(expected)) return false;
  for (const XMLWay way : {XMLWay::Either, XMLWay::LibXML}) {
    const Value part = projected(*query, xml, options, way);
    EXPECT_EQ(expected.lines,
              withoutFocus(outcomeOf(*query, part, {}, boundedBy(std::chrono::seconds(60)))).lines)
        << text << "\n"
        << xml << "\n"
        << plan->projection.description();
  }
  return true;
}

TEST(ProjectedPrograms, GeneratedOnesAnswerTheSame) {
  const unsigned first = numberFrom("XQUERY_PLAN_SEED", 1);
  const unsigned count = numberFrom("XQUERY_PLAN_PROGRAMS", 600);
  const std::chrono::seconds time(numberFrom("XQUERY_PLAN_SECONDS", 0));
  const auto end = std::chrono::steady_clock::now() + time;
  size_t needsLess = 0;
  unsigned seed = first;
  for (; time.count() ? std::chrono::steady_clock::now() < end : seed < first + count; ++seed) {
    ProgramGenerator generator(seed);
    const std::string xml = generator.document();
    const std::string program = generator.program();
    SCOPED_TRACE("XQUERY_PLAN_SEED=" + std::to_string(seed));
    const uint32_t options = seed % 2 ? NSXMLNodePreserveWhitespace : NSXMLNodeOptionsNone;
    needsLess += agrees(program, xml, options) ? 1 : 0;
    if (HasFailure()) break;
  }
  EXPECT_GT(needsLess * 20, seed - first) << needsLess << " of " << seed - first;
}

// Questions that need little, put together at random, over the same documents.
class Questions {
 public:
  explicit Questions(unsigned seed) : _random(seed) {}

  std::string question() {
    switch (_random.below(11)) {
      case 0:
        return "for $n in " + path() + " where " + condition("$n") + " return " +
               use("$n" + tail());
      case 1:
        return "let $n := " + path() + " return (" + use("$n" + tail()) + ", " + use("$n") + ")";
      case 2:
        return "some $n in " + path() + " satisfies " + condition("$n");
      case 3:
        return use("(" + path() + " " + _random.oneOf({"|", "intersect", "except", ","}) + " " +
                   path() + ")");
      case 4:
        return "<r n='{" + use(path()) + "}'>{" + path() + "/text()}</r>";
      case 5:
        return "for $n in " + path() + " order by string($n" + tail() + ") return " + use("$n");
      case 6:
        return "<r n='{" + use(path()) + "}'>{" + path() + "}</r>" + aroundCopies();
      case 7:
        return "for $n in " + path() + " return <e>{$n" + tail() + ", $n/@y}</e>" + aroundCopies();
      case 8:
        return "let $d := document {" + path() + ", <s>{" + path() + "}</s>} return $d" +
               aroundCopies();
      default:
        return use(path());
    }
  }

 private:
  std::string name() { return _random.oneOf({"a", "b", "c", "*", "*:a", "b", "c"}); }
  std::string predicate() {
    return _random.oneOf({"[1]", "[last()]", "[@x]", "[b]", "[c = 1]", "[@y = 'u']",
                          "[position() < 3]", "[not(a)]", "[a/b]", "[text()]", "[. = '1']",
                          "[name() = 'b']", "[count(*) > 1]", "[string-length(.) > 1]"});
  }
  std::string step() {
    std::string text = name();
    if (_random.below(3) == 0) text += predicate();
    return text;
  }
  std::string path() {
    std::string text =
        _random.oneOf({"/a/", "//", "//", "/*/", "/a//", "/a/descendant::", "/a/*/"});
    text += step();
    for (size_t i = _random.below(3); i > 0; --i) text += "/" + step();
    return text;
  }
  std::string tail() {
    return _random.oneOf(
        {"", "/@x", "/text()", "/b", "/*", "/self::a", "/@*", "/string()", "/node()", "/c/b"});
  }
  // What is in a new tree can be looked at from all sides.
  std::string aroundCopies() {
    return _random.oneOf({"", "", "/*", "//b", "//c/..", "/*/following-sibling::node()",
                          "/descendant::node()", "/*[last()]/preceding::*/@x", "//a//b", "/@*"});
  }
  std::string condition(const std::string& node) {
    return _random.oneOf({node + "/@x = 1", "exists(" + node + "/b)", node + " = 'u'",
                          "count(" + node + "/*) > 1", node + "/b = " + node + "/c",
                          "not(" + node + tail() + ")"});
  }
  std::string use(const std::string& path) {
    return _random.oneOf({"count(", "exists(", "distinct-values(", "(", "(", "sum(", "data("})
        .append(path)
        .append(")");
  }

  RandomChoices _random;
};

TEST(ProjectedPrograms, QuestionsThatNeedLittleAnswerTheSame) {
  const unsigned first = numberFrom("XQUERY_PLAN_SEED", 1);
  const unsigned count = numberFrom("XQUERY_PLAN_PROGRAMS", 1500);
  size_t needsLess = 0;
  for (unsigned seed = first; seed < first + count; ++seed) {
    ProgramGenerator generator(seed);
    const std::string xml = generator.document();
    Questions questions(seed);
    SCOPED_TRACE("XQUERY_PLAN_SEED=" + std::to_string(seed));
    const uint32_t options = seed % 2 ? NSXMLNodePreserveWhitespace : NSXMLNodeOptionsNone;
    needsLess += agrees(questions.question(), xml, options) ? 1 : 0;
    if (HasFailure()) break;
  }
  EXPECT_GT(needsLess * 2, count);
}

// A copy keeps what is in scope where its node stands, and shows nothing else that is around it.
TEST(ProjectedPrograms, CopiesKeepWhatIsInScope) {
  constexpr std::string_view document =
      "<r xmlns='urn:d' xmlns:p='urn:p' xml:lang='en' xml:base='http://base/'>t"
      "<a xmlns:q='urn:q' x='1'>u<s><p:n q:y='2'>v<q:m xmlns:p='urn:other' p:z='3'/></p:n></s></a>"
      "<b xmlns=''><n xml:space='preserve'> <o/> </n><!--c--><n/></b>"
      "<a xml:base='inner/'><?i j?><n>w</n>k</a></r>";
  const char* const queries[] = {
      "<e>{//*:n}</e>",
      "<e xmlns:p='urn:mine'>{//*:n}</e>",
      "for $n in //*:n return <e>{$n}</e>",
      "for $n in //*:n return <e>{$n}</e>/*/*",
      "<e>{/*/*:a/*:n}</e>/*",
      "<e>{//*:m}</e>//@*",
      "document {//*:n}/*/../node()",
      "<e>{/*/*:b/n, /*/*:a/@x}</e>",
      "<e>{//*:n}</e>/*:n/following-sibling::*",
      "<e>{//*:n/text()}</e>",
      "let $e := <e>{//*:a}</e> return ($e//*:n/.., count($e//text()), $e/*[last()]/node())",
      "element {name(//*:m)} {//*:b}",
      "for $a in /*/*:a return <e l='{$a/*:n}'>{<f>{$a/*:s}</f>}</e>",
  };
  for (const char* const query : queries) {
    for (const uint32_t options : {NSXMLNodePreserveWhitespace, NSXMLNodeOptionsNone}) {
      EXPECT_TRUE(agrees(query, std::string(document), options)) << query;
    }
  }
}

}  // namespace
}  // namespace xquery

// A join is kept only while nothing it was made from has changed. Every query is run both ways,
// while elements grow, nodes are taken in, globals are replaced and the host changes its trees.
#include "Expr/RandomChoices.h"
#include "Functions/FunctionsTesting.h"
#include "Plan/PlainAnswer.h"
#include "xquery/xquery.h"

#include <gtest/gtest.h>

#include <functional>
#include <memory>
#include <string>
#include <vector>

namespace xquery {
namespace {

using functiontest::answer;
using plantest::plainAnswer;

// The members of $c with the key $k, by a path and by clauses.
const std::string joined =
    "declare function local:path($c, $k) { count($c/a[@k = $k]) }; "
    "declare function local:clauses($c, $k) { count(for $x in $c/a where $x/@k = $k return $x) }; "
    "declare function local:deep($c, $k) { count($c//a[@k = $k]) }; "
    "declare function local:above($c, $k) { count($c/a[../a/@k = $k]) }; ";
void expectAsPlain(const std::string& query) {
  EXPECT_EQ(answer(joined + query), plainAnswer(joined + query)) << query;
}

// --- elements that grow --------------------------------------------------------------------------

TEST(JoinChanges, AnElementGrowsBetweenItsContentItems) {
  const std::string start = "let $a := <a/> let $c := ";
  const std::string forty = "{for $i in 1 to 40 return <a k='1'/>}";
  const std::string end = " return string-join($c/n, ' ')";
  for (const std::string function : {"path", "clauses", "deep", "above"}) {
    const std::string count = "<n>{local:" + function + "($a/.., '1')}</n>";
    const std::string content = "{$a}" + forty + count + count + count + "<a k='1'/>" + count;
    EXPECT_EQ(answer(joined + start + "<c>" + content + "</c>" + end),
              answer(function == "above" ? "'41 41 41 42'" : "'40 40 40 41'"));
    expectAsPlain(start + "<c>" + content + "</c>" + end);
    expectAsPlain(start + "<b><c>" + content + "</c></b>/c" + end);
    expectAsPlain(start + "document { <c>" + content + "</c> }/c" + end);
  }
}

// What is kept within an element that is finished stays.
TEST(JoinChanges, AFinishedElementIsJoinedInsideOneThatGrows) {
  const std::string query =
      "let $done := <c>{for $i in 1 to 40 return <a k='{$i mod 4}'/>}</c> let $a := <a/> return "
      "<r>{$a}{for $i in 1 to 5 return <n>{local:path($done, '1')}</n>}{$done}"
      "{for $i in 1 to 5 return local:path($a/../c, '1')}</r>/string()";
  EXPECT_EQ(answer(joined + query), answer("'101010101010 10 10 10 10'"));
  expectAsPlain(query);
}

// --- globals -------------------------------------------------------------------------------------

TEST(JoinChanges, ADeclarationReplacesAGlobalThatFunctionsHaveRead) {
  const std::string functions[] = {
      "declare function local:n($k) { count(for $x in $g/a where $x/@k = $k return $x) }; ",
      "declare function local:n($k) { count(for $x in $g/a let $u := 1 where $x/@k = $k "
      "return $x) }; ",
      "declare function local:n($k) { count($g/a[@k = $k]) }; "};
  Ref<NSXMLElement> given = NSXMLElement::elementWithName(NSStringView::ascii("c"));
  for (int i = 0; i < 40; ++i) {
    const auto child = NSXMLElement::elementWithName(NSStringView::ascii("a"));
    child->addAttribute(
        NSXMLNode::attributeWithName(NSStringView::ascii("k"), NSStringView::ascii("1")));
    given->addChild(child);
  }
  for (const std::string& function : functions) {
    EXPECT_EQ(
        answer(function + "declare variable $before := for $i in 1 to 4 return local:n('1'); "
                          "declare variable $g := <c>{for $i in 1 to 41 return <a k='1'/>}</c>; "
                          "$before, local:n('1'), local:n('1'), local:n('1')",
               Value(), {{"g", given}}),
        answer("40, 40, 40, 40, 41, 41, 41"))
        << function;
  }
}

// --- trees that are moved ------------------------------------------------------------------------

// What a loop joins over is taken into another element in one of its turns, which moves it.
TEST(JoinChanges, ATreeIsMovedWhileALoopJoinsOverItsNodes) {
  const std::string tree =
      "let $t := <r>{for $i in 1 to 400 return <e k='{$i mod 50}'><v>{$i}</v></e>}</r> ";
  const std::string wrapped = "<wrap>{for $j in 1 to 700 return <p/>}{$t}</wrap>";
  const std::string wrapping = "let $w := if ($x = 30) then " + wrapped + " else () return ";
  for (const std::string& query :
       {tree + "let $l := $t/e return string-join(for $x in 1 to 60 " + wrapping +
            "string(count(for $e in $l where $e/@k = string($x) return $e)), ' ')",
        tree + "let $ids := $t/e/@k return string-join(for $x in 1 to 60 " + wrapping +
            "string((string($x), '99') = $ids), ' ')",
        tree +
            "let $l := $t/e for $x in 1 to 60 return (string-join(for $e in $l "
            "where $e/@k = string($x) return string($e/v), ','), "
            "if ($x = 20) then count(" +
            wrapped + "//e) else ())"}) {
    EXPECT_EQ(answer(query), plainAnswer(query)) << query;
  }
}

// --- whatever a query may do ---------------------------------------------------------------------

class Growth : public RandomChoices {
 public:
  using RandomChoices::RandomChoices;

  std::string query() {
    std::string content = "{$a}" + members();
    for (size_t items = 3 + below(8); items > 0; --items) content += item();
    return "let $a := <a k='1'><b/></a> let $e := (<a k='1'/>, <a k='2'/>, <a k='1'/>) "
           "let $d := <c>" +
           members() + "</c> let $r := " +
           oneOf({"<c>" + content + "</c>", "<b><c>" + content + "</c></b>",
                  "document { <c>" + content + "</c> }",
                  "<c>{for $t in 1 to 3 return <s>" + content + "</s>}</c>"}) +
           " return (string-join($r//text(), ' '), count($r//*), local:deep($r, '1'))";
  }

 private:
  std::string members() { return "{for $i in 1 to 12 return <a k='{$i mod 3}'/>}"; }

  std::string item() {
    const std::string key = oneOf({"'1'", "'2'", "('0', '2')", "1"});
    const std::string where = oneOf({"$a/..", "$a/..", "$a/../..", "$d", "$e/..", "$e", "$a"});
    const std::string count =
        "local:" + oneOf({"path", "clauses", "deep", "above"}) + "(" + where + ", " + key + ")";
    return oneOf({"{text { " + count + " }}", "{text { " + count + " }}",
                  "{for $j in 1 to 3 return text { " + count + " }}",
                  "{for $j in 1 to 3 return <n>{" + count + "}{$e[$j]}</n>}",
                  "{<w>{$e}{" + count + "}</w>}", "<a k='1'/>", "{<a k='2'><a k='1'/></a>}",
                  "{$e[1]}", "{$d}", "{attribute k {1}}", "{" + count + ", " + count + "}"});
  }
};

TEST(JoinChanges, GrowingElementsAnswerAsThePlainWay) {
  for (unsigned seed = 1; seed <= 1200; ++seed) {
    SCOPED_TRACE(seed);
    expectAsPlain(Growth(seed).query());
  }
}

// --- hosts that change their trees ---------------------------------------------------------------

Ref<NSXMLElement> member(const std::string& key) {
  const auto made = NSXMLElement::elementWithName(NSStringView::ascii("a"));
  made->addAttribute(
      NSXMLNode::attributeWithName(NSStringView::ascii("k"), NSStringView::ascii(key)));
  return made;
}

Ref<NSXMLDocument> membersDocument() {
  const auto document = NSXMLDocument::document();
  const auto root = NSXMLElement::elementWithName(NSStringView::ascii("c"));
  for (int i = 0; i < 12; ++i) root->addChild(member(std::to_string(i % 3)));
  document->addChild(root);
  return document;
}

// Changes the tree in one of the ways that a host has.
void change(NSXMLDocument& document, RandomChoices& choose) {
  NSXMLElement* root = document.rootElement();
  NSXMLNode* chosen = root->childAtIndex(static_cast<uint32_t>(choose.below(8)));
  auto* element = cast<NSXMLElement>(chosen);
  switch (choose.below(6)) {
    case 0:
      root->addChild(member("1"));
      break;
    case 1:
      root->insertChild(member("1"), 3);
      break;
    case 2:
      chosen->detach();
      break;
    case 3:
      element->attributeForName(NSStringView::ascii("k"))->setStringValue(NSStringView::ascii("1"));
      break;
    case 4:
      element->removeAttributeForName(NSStringView::ascii("k"));
      element->addAttribute(
          NSXMLNode::attributeWithName(NSStringView::ascii("k"), NSStringView::ascii("2")));
      break;
    default:
      element->addChild(member("1"));
  }
}

class Changing : public XQueryClient {
 public:
  Changing(Ref<NSXMLDocument> document, unsigned seed)
      : _document(std::move(document)), _choose(seed) {}
  void XQueryClientTraceValue(const Value&, const Ref<NSString>&, XQueryContext&) override {
    change(*_document, _choose);
  }

 private:
  Ref<NSXMLDocument> _document;
  RandomChoices _choose;
};

std::string printed(XQueryContext& context, const XQuery& query, const Value& item) {
  Ref<XQueryError> error;
  const auto items = context.evaluateXQuery(query, {}, item, &error);
  if (!items) return error ? error->description()->utf8() : "nothing";
  std::string text;
  for (const Value& each : items->objects()) text += XQueryItemStringValue(*each) + " ";
  return text;
}

TEST(JoinChanges, AHostChangesATreeWhileItIsCalled) {
  for (unsigned seed = 1; seed <= 200; ++seed) {
    const std::string rounds =
        "let $c := /c for $i in 1 to 12 return (local:path($c, '1'), local:clauses($c, '1'), "
        "local:deep(/, '1'), local:above($c, '1'), local:path($c, '1'), "
        "if ($i mod 3 = 0) then string(trace($i, 'change')) else ())";
    std::string answers[2];
    for (const bool isPlain : {false, true}) {
      const auto document = membersDocument();
      const auto context = XQueryContext::xqueryContext();
      context->contextSetClient(std::make_shared<Changing>(document, seed));
      const auto query =
          XQuery::xqueryWithSource(std::string_view(joined + rounds), XQueryLoading(),
                                   XQueryLimits(), isPlain ? XQueryWay::Plain : XQueryWay::Planned);
      answers[isPlain] = printed(*context, *query, document);
    }
    EXPECT_EQ(answers[0], answers[1]) << "seed " << seed;
  }
}

TEST(JoinChanges, AHostChangesATreeBetweenEvaluations) {
  const std::string rounds =
      "for $i in 1 to 3 return (local:path(/c, '1'), local:clauses(/c, '1'), local:deep(/, '1'), "
      "local:above(/c, '1'))";
  const auto withJoins = XQuery::xqueryWithSource(std::string_view(joined + rounds));
  const auto without = XQuery::xqueryWithSource(std::string_view(joined + rounds), XQueryLoading(),
                                                XQueryLimits(), XQueryWay::Plain);
  const auto context = XQueryContext::xqueryContext();
  RandomChoices choose(7);
  for (int round = 0; round < 50; ++round) {
    const auto document = membersDocument();
    for (int changes = 0; changes < 4; ++changes) {
      EXPECT_EQ(printed(*context, *withJoins, document), printed(*context, *without, document));
      change(*document, choose);
    }
  }
}

}  // namespace
}  // namespace xquery

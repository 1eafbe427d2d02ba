// The plan to be looked at.
#include "Plan/Labels.h"
#include "Plan/PlanTesting.h"
#include "Plan/Report.h"

#include <gmock/gmock.h>

#include <algorithm>
#include <cctype>

namespace xquery {
namespace {

using namespace plantest;
using testing::ElementsAre;
using testing::HasSubstr;
using testing::Not;

std::vector<XQueryPlanReport::Entry> entriesOf(std::string_view text) {
  return _internal(*compiled(text, XQueryWay::Explained)).planReport()->entries();
}

// "depth label".
std::vector<std::string> labelsOf(std::string_view text) {
  std::vector<std::string> labels;
  for (const auto& entry : entriesOf(text)) {
    const std::string role = entry.role.empty() ? "" : std::string(entry.role) + ": ";
    labels.push_back(std::to_string(entry.depth) + " " + role + entry.label);
  }
  return labels;
}

// Of the only expression of a query.
std::string labelOf(const std::string& text) {
  const auto entries = entriesOf(text);
  return entries.size() < 2 ? "" : entries[1].label;
}

std::string planText(std::string_view text, XQueryPlanFormat format = XQueryPlanFormat::Text) {
  const auto plan = compiled(text, XQueryWay::Explained)->planDescription(format);
  EXPECT_TRUE(plan);
  return plan ? plan->utf8() : "";
}

TEST(PlanReport, ShowsWholesBeforeTheirPartsAsTheyWereWritten) {
  EXPECT_THAT(
      labelsOf("for $a at $i in //b[c > 1] let $d := $a/@e where $i < 3 "
               "order by $d descending return ($a, \"x\")"),
      ElementsAre("0 query", "1 FLWOR", "2 for $a at $i in", "3 //b[...]", "4 predicate: >", "5 c",
                  "5 1", "2 let $d :=", "3 $a/@e", "2 where: <", "3 $i", "3 3",
                  "2 order by descending", "3 $d", "2 return: list", "3 $a", "3 \"x\"", "0 input"));
  EXPECT_THAT(
      labelsOf("declare function local:f($x) { $x + 1 }; "
               "declare variable $v := local:f(2); if ($v) then $v else ()"),
      ElementsAre("0 function local:f#1", "1 +", "2 $x", "2 1", "0 variable $v", "1 local:f(...)",
                  "2 2", "0 query", "1 if", "2 test: $v", "2 $v", "2 ()"));
}

TEST(PlanReport, LabelsPathsMuchAsTheyAreWritten) {
  for (const char* path :
       {"/a/b", "//a", "/a//@b", "$x/a[1]", "a/text()", "a/..", "ancestor::a/self::b",
        "following-sibling::*/@*", "descendant::a", "a/p:*", "*:a", "/", "(...)/a", "element(a)",
        "preceding::node()", "a[...]/b[2][...]"}) {
    std::string query = path;
    for (size_t at; (at = query.find("...")) != std::string::npos;) query.replace(at, 3, "b = 2");
    query = "declare namespace p = 'p'; declare variable $x external; " + query;
    const auto entries = entriesOf(query);
    ASSERT_GE(entries.size(), 2U) << path;
    EXPECT_EQ(entries[1].label, path);
  }
}

TEST(PlanReport, LabelsEveryClassOfExpressions) {
  struct Row {
    const char* query;
    const char* label;
  };
  for (const Row& row : std::initializer_list<Row>{
           {"some $x in 1 satisfies $x", "some"},
           {"every $x as xs:integer in 1 satisfies $x", "every"},
           {"typeswitch (1) case $x as xs:string* return 1 default return 2", "typeswitch"},
           {"1 instance of element(a)?", "instance of element(a)?"},
           {"1 treat as item()+", "treat as item()+"},
           {"1 castable as xs:string", "castable as xs:string"},
           {"<a b='c{1}'/>", "element a"},
           {"element {\"a\"} {1}", "element {...}"},
           {"attribute {\"a\"} {1}", "attribute {...}"},
           {"text {1}", "text {...}"},
           {"comment {\"a\"}", "comment {...}"},
           {"<?a b?>", "processing-instruction {...}"},
           {"document {1}", "document {...}"},
           {"unordered {1}", "unordered"},
           {".", "."},
           {"true()", "true()"},
           {"1 to 2", "to"},
           {"a union b", "union"},
           {"\"a&#10;b\"", "\"a b\""},
           {"\"0123456789012345678901234567890123456789X\"",
            "\"0123456789012345678901234567890123456789...\""}}) {
    EXPECT_EQ(labelOf(row.query), row.label) << row.query;
  }
  EXPECT_THAT(labelsOf("typeswitch (1) case $x as xs:string* return 1 default $y return 2"),
              ElementsAre("0 query", "1 typeswitch", "2 1", "2 case $x as xs:string* return", "3 1",
                          "2 default $y return", "3 2"));
}

TEST(PlanReport, TellsWhatIsKnownOfValues) {
  const auto entries = entriesOf("(//a, 1)");
  EXPECT_EQ(entries[1].items, "one or more elements or integers");
  EXPECT_EQ(entries[2].items, "any number of elements in document order");
  EXPECT_EQ(entries[3].items, "one integer");
  EXPECT_EQ(entriesOf("()")[1].items, "nothing");
  EXPECT_EQ(entriesOf("/@a")[1].items, "at most one attribute");
  EXPECT_THAT(entriesOf("position()")[1].deeds, ElementsAre("reads the position", "may fail"));
}

TEST(PlanReport, CountsLinesFromOne) {
  const auto entries = entriesOf("\n\nfor $a in //b\nreturn $a/c[. = 1]");
  EXPECT_EQ(entries[0].line, 0);
  EXPECT_EQ(entries[1].line, 3);
  // "." is one expression for all queries and has no line of its own.
  const auto item = std::find_if(entries.begin(), entries.end(),
                                 [](const auto& entry) { return entry.label == "."; });
  ASSERT_NE(item, entries.end());
  EXPECT_EQ(item->line, 4);
}

// Loads one module, whatever is asked for.
class OneModule : public XQueryLoader {
 public:
  explicit OneModule(std::string text) : _text(std::move(text)) {}
  std::optional<XQueryResource> load(const NSURL&, XQueryLoadPurpose) override {
    return XQueryResource{_text, {}, {}, {}};
  }

 private:
  const std::string _text;
};

TEST(PlanReport, NamesTheModuleOfALineThatIsImported) {
  XQueryLoading loading;
  loading.moduleURL = "http://h/query.xq";
  loading.loader = std::make_shared<OneModule>(
      "module namespace m = 'urn:m';\n\ndeclare function m:f($d) {\n  $d/a/.. };\n"
      "declare variable $m:x := b/..;");
  const auto query =
      XQuery::xqueryWithSource("import module namespace m = 'urn:m' at 'm.xq';\nm:f(()), $m:x",
                               loading, XQueryLimits(), XQueryWay::Explained);
  ASSERT_FALSE(query->parseErrors());
  const auto text = query->planDescription(XQueryPlanFormat::Text)->utf8();
  EXPECT_THAT(text, HasSubstr("  $d/a/..  (line 4 of http://h/m.xq)  "));
  EXPECT_THAT(text, HasSubstr("  b/..  (line 5 of http://h/m.xq)  "));
  EXPECT_THAT(text, HasSubstr("  m:f(...)  (line 2)  "));
  EXPECT_THAT(text, HasSubstr("\ninput  (line 5 of http://h/m.xq)  "));
  const auto json = query->planDescription(XQueryPlanFormat::JSON)->utf8();
  EXPECT_THAT(json, HasSubstr("{\"label\":\"$d/a/..\",\"line\":4,\"module\":\"http://h/m.xq\","));
  EXPECT_THAT(json, HasSubstr("{\"label\":\"m:f(...)\",\"line\":2,\"items\":"));
}

TEST(PlanReport, SaysWhatRulesDidAndWhatWasMissing) {
  const std::string kept = planText("//a[b = //c/d]");
  EXPECT_THAT(kept, HasSubstr("//c/d  (line 1)"));
  EXPECT_THAT(kept, HasSubstr("        + invariants: "));
  const std::string made = planText("for $i in 1 to 3 return <a>{for $j in 1 to 3 return $j}</a>");
  EXPECT_THAT(made, HasSubstr("- not invariants: it makes nodes"));
  EXPECT_THAT(planText("2 + 3"), HasSubstr("- not constants: its value is handed on"));
  EXPECT_THAT(planText("2 + 3 = 5"), Not(HasSubstr("not constants: its value is handed on;")));
  EXPECT_THAT(planText("if (1 idiv 0 = 1) then 2 else 3"),
              HasSubstr("- not constants: it fails, which it may do only when it is reached"));
}

TEST(PlanReport, IsKeptOfQueriesThatAreToBeExplainedOnly) {
  EXPECT_FALSE(compiled("1", XQueryWay::Planned)->planDescription(XQueryPlanFormat::Text));
  EXPECT_FALSE(compiled("1", XQueryWay::Plain)->planDescription(XQueryPlanFormat::Text));
  const auto wrong =
      XQuery::xqueryWithSource("1 +", XQueryLoading(), XQueryLimits(), XQueryWay::Explained);
  EXPECT_FALSE(wrong->planDescription(XQueryPlanFormat::Text));
  EXPECT_TRUE(compiled("", XQueryWay::Explained)->planDescription(XQueryPlanFormat::Text));
}

TEST(PlanReport, ThePlanThatIsShownIsTheOneThatIsEvaluated) {
  constexpr const char* text = "for $i in 1 to 3 return count(//a[b = //c/d])";
  const auto planned = compiled(text, XQueryWay::Planned);
  const auto explained = compiled(text, XQueryWay::Explained);
  const auto count = [](const XQuery& query) {
    return OperatorList(*_internal(query).body()).operators.size();
  };
  EXPECT_GT(count(*planned), 0U);
  EXPECT_EQ(count(*planned), count(*explained));
}

// Reads JSON by the grammar of RFC 8259, and counts the objects.
class JSONReader {
 public:
  explicit JSONReader(std::string_view text) : _rest(text) {}
  size_t objects = 0;

  bool readAll() { return value() && (space(), _rest.empty()); }

 private:
  void space() {
    while (!_rest.empty() && std::isspace(static_cast<unsigned char>(_rest.front()))) take();
  }
  char take() {
    const char first = _rest.front();
    _rest.remove_prefix(1);
    return first;
  }
  bool takes(char wanted) {
    space();
    if (_rest.empty() || _rest.front() != wanted) return false;
    take();
    return true;
  }
  bool string() {
    if (!takes('"')) return false;
    while (!_rest.empty() && _rest.front() != '"') {
      if (static_cast<unsigned char>(_rest.front()) < ' ') return false;
      if (take() != '\\') continue;
      if (_rest.empty()) return false;
      const char escaped = take();
      if (escaped == 'u') {
        if (_rest.size() < 4) return false;
        _rest.remove_prefix(4);
      } else if (escaped != '"' && escaped != '\\') {
        return false;
      }
    }
    return takes('"');
  }
  template <class Element>
  bool list(char end, Element element) {
    if (takes(end)) return true;
    do {
      if (!element()) return false;
    } while (takes(','));
    return takes(end);
  }
  bool value() {
    space();
    if (_rest.empty()) return false;
    if (_rest.front() == '"') return string();
    if (takes('[')) return list(']', [this] { return value(); });
    if (takes('{')) {
      ++objects;
      return list('}', [this] { return string() && takes(':') && value(); });
    }
    for (const std::string_view word : {"true", "false"}) {
      if (_rest.starts_with(word)) return _rest.remove_prefix(word.size()), true;
    }
    const size_t digits = std::min(_rest.find_first_not_of("0123456789"), _rest.size());
    _rest.remove_prefix(digits);
    return digits > 0;
  }

  std::string_view _rest;
};

TEST(PlanReport, IsWellFormedJSON) {
  for (const char* text : {"1", "", "for $a in //b[c = 'x\\\"'] return <d>{$a, 2 * 3}</d>",
                           "declare function local:f($x) { $x }; local:f(local:f(1)) = 2",
                           "//a[b = //c][d][1]/e | //f"}) {
    const auto entries = entriesOf(text);
    size_t notes = 0;
    for (const auto& entry : entries) notes += entry.notes.size();
    const std::string plan = planText(text, XQueryPlanFormat::JSON);
    JSONReader reader(plan);
    EXPECT_TRUE(reader.readAll()) << plan;
    EXPECT_EQ(reader.objects, entries.size() + notes);
  }
}

TEST(PlanReport, IsAGraphWithABoxForEachExpression) {
  constexpr const char* text = "//a[b = \"x\\y\" ][c = //d/e]";
  const std::string plan = planText(text, XQueryPlanFormat::DOT);
  EXPECT_THAT(plan, HasSubstr("digraph plan {"));
  EXPECT_THAT(plan, HasSubstr("\\\"x\\\\y\\\""));
  EXPECT_THAT(plan, HasSubstr("fillcolor=lightblue"));
  const auto countOf = [&](std::string_view part) {
    size_t count = 0;
    for (size_t at = 0; (at = plan.find(part, at)) != std::string::npos; ++at) ++count;
    return count;
  };
  const size_t entries = entriesOf(text).size();
  EXPECT_EQ(countOf(" [label=\""), entries);
  // The query and its input stand apart.
  EXPECT_EQ(countOf(" -> "), entries - 2);
}

// The text of a plan grows with the query, not with the square of its depth.
TEST(PlanReport, OfADeepQueryStaysShort) {
  std::string text;
  for (int i = 0; i < 3000; ++i) text += "-(";
  text += "1";
  for (int i = 0; i < 3000; ++i) text += ")";
  EXPECT_LT(planText(text).size(), size_t{3000} * 400);
  EXPECT_LT(planText(text, XQueryPlanFormat::JSON).size(), size_t{3000} * 400);
}

}  // namespace
}  // namespace xquery

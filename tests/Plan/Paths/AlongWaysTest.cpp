// Paths down from the document by names, which the index of its tree knows.
#include "Plan/PlanTesting.h"
#include "Platform/Base/WorkMeter.h"

#include <random>
#include <string>
#include <vector>

namespace xquery {
namespace {

using namespace plantest;

// Records of two sorts, in which some names are found on one way only.
Value records(int count, bool withInstructions = false) {
  std::string text = "<site xmlns:p='urn:p'><people>";
  for (int i = 0; i < count; ++i) {
    text += "<person n='" + std::to_string(i) + "'><name>" + std::to_string(i % 9) + "</name>";
    if (i % 3 == 0) text += "<p:note/><note>x</note>";
    text += i % 5 ? "</person>" : "<friend><name>y</name></friend></person>";
  }
  if (withInstructions) text += "<?note here?>";
  text += "</people><items><item><name>1</name></item><p:item/><item><item/></item></items>";
  return document(text + "</site>");
}

// Asked so often that the index is made on the way.
void isSame(const std::string& text, const Value& tree) {
  sameBothWays("for $turn in 1 to 6 return (" + text + ")", tree);
}

TEST(AlongWays, FindsWhatAWalkFinds) {
  const Value trees[] = {records(120), records(90, true), records(3)};
  for (const char* text : {"count(/site/people/person)",
                           "/site/people/person/name",
                           "/site/people/person[name = '3']",
                           "count(/site/people/person[name = '3'])",
                           "exists(/site/people/person/friend)",
                           "count(/site/*/item)",
                           "/site/*/item",
                           "count(/site/*/*)",
                           "/site/people/*",
                           "count(/site/people/*[name])",
                           "/site/items//item",
                           "count(/site/items//item)",
                           "count(/site//person/name)",
                           "/site//friend/name",
                           "(/site/people/person)[4]",
                           "/site/people/person[4]",
                           "/site/people/person[last()]/name",
                           "count(/site/people/none)",
                           "/site/people/person/@n",
                           "/site/people/person[note]/friend/name/text()",
                           "count(/site/people/*[self::person])",
                           "count(/site/*:people/*:person)",
                           "declare namespace p = 'urn:p'; count(/site/people/person/p:*)",
                           "declare namespace p = 'urn:p'; /site/people/person/p:note",
                           "/site/people/person/position()",
                           "/site/people/person/(name, position())",
                           "unordered { /site/people/person/name }",
                           "unordered { /site//name }",
                           "count(/site/people/person/node())",
                           "count(/site/people/person/self::person/name)",
                           "/site/people/person[xs:integer(name) > 4]/@n",
                           "/site/people/person[trace(name, 'x')]/@n",
                           "/site/people/person/name/..",
                           "(/site/people/person, /site/items/item)/name",
                           "some $x in /site/people/person satisfies $x/name = '3'",
                           "(for $x in /site/people/person where $x/note return $x/@n)[2]"}) {
    for (const Value& tree : trees) {
      const std::string whole(text);
      const size_t end = whole.rfind(';') == std::string::npos ? 0 : whole.rfind(';') + 1;
      sameBothWays(whole.substr(0, end) + " for $turn in 1 to 6 return (" + whole.substr(end) + ")",
                   tree);
    }
  }
}

TEST(AlongWays, FindsWhatRandomPathsFind) {
  const std::vector<std::string> steps = {"/site", "/people", "/person", "/name",
                                          "/*",    "//name",  "//item",  "/friend",
                                          "/note", "//*",     "/item",   "/items"};
  const std::vector<std::string> ends = {"",    "",        "[name]", "[1]",      "[@n > 20]",
                                         "/@n", "/text()", "/..",    "[last()]", "/name[. = '3']"};
  std::mt19937 random(11);
  const Value trees[] = {records(100), records(60, true)};
  for (int round = 0; round < 300; ++round) {
    std::string path = random() % 3 ? "/site" : "";
    for (size_t count = 1 + random() % 4; count > 0; --count)
      path += steps[random() % steps.size()];
    path += ends[random() % ends.size()];
    if (random() % 3 == 0) path = "count(" + path + ")";
    isSame(path, trees[random() % 2]);
  }
}

// The descendant axis of the last child of a last child goes on behind its subtree, so that the
// ways of names do not tell what it finds.
TEST(AlongWays, GoOnBehindLastChildrenOfLastChildren) {
  const auto grouped = [](const std::string& group, const std::string& end) {
    std::string text = "<r>";
    for (int i = 0; i < 45; ++i) text += group;
    return document(text + end + "</r>");
  };
  const Value trees[] = {
      grouped("<a><p><l><k/></l></p></a><b><k/></b>", ""),
      grouped("<a><p><l><k/></l></p>x</a><b><k/></b>", ""),
      grouped("<b><k/></b>", "<a><p><l><k/></l></p></a>"),
      grouped("<b><k/></b>", "<a><p><l><k>x</k></l></p></a><b><p/></b>"),
      grouped("<a><p><k>x</k></p></a>", "<a><p><l><p><k>x</k></p></l></p></a>"),
      grouped("<b><k/></b>", "<b/><!--x-->"),
  };
  const std::vector<std::string> steps = {"//l", "//p", "/r/a", "/p"};
  for (const Value& tree : trees) {
    for (const std::string& one : steps) {
      for (const std::string& other : steps) {
        const std::string path = one + other;
        sameBothWays(
            "for $turn in 1 to 3 return (count(" + path + "//k), count(//k except " + path + "))",
            tree);
      }
      sameBothWays("for $turn in 1 to 3 return (count(" + one + "/descendant::k), " + one + "//k)",
                   tree);
    }
  }
}

// Predicates that look at nothing but names above, and others beside them.
TEST(AlongWays, AsksOncePerWayWhatLooksUpByNames) {
  const Value trees[] = {records(120), records(90, true)};
  const std::vector<std::string> tests = {
      "ancestor::people",
      "parent::person",
      "ancestor::item/ancestor::items",
      "self::name",
      "count(ancestor::item) > 1",
      "ancestor::item[1]",
      "ancestor::item[2]",
      "not(parent::friend)",
      "exists(ancestor-or-self::item[parent::items])",
      "empty(ancestor::friend)",
      "0 = count(parent::person)",
      "parent::person or parent::friend",
      "ancestor::none",
      "ancestor::person and not(ancestor::friend)",  // These are asked of each.
      "ancestor::person[note]",
      "ancestor::person/@n > 50",
      "parent::*",
      "..",
      "count(ancestor::*)",
      "parent::person[last()]",
      "ancestor::person = 'x'",
      "following-sibling::name"};
  for (const std::string& test : tests) {
    for (const char* path : {"//name", "//item", "/site//name", "//person/name", "//*", "//note"}) {
      const std::string filtered = std::string(path) + "[" + test + "]";
      for (const Value& tree : trees) {
        isSame("count(" + filtered + ")", tree);
        isSame("exists(" + filtered + "), count(" + filtered + "/..)", tree);
        isSame("count(" + filtered + ") > 100, " + filtered, tree);
      }
    }
  }
}

// Names, kinds and quantifiers in them.
TEST(AlongWays, AsksOncePerWayWhateverLooksUp) {
  const Value tree = records(60, true);
  const std::vector<std::string> tests = {
      "parent::*", "..", "count(ancestor::*) > 3", "count(ancestor::node()) = 4", "name() = 'name'",
      "local-name(..) eq 'person'", "'friend' = name(parent::*)", "ancestor::*[name() = 'friend']",
      "some $a in ancestor::* satisfies $a/parent::people",
      "every $a in ancestor-or-self::* satisfies not($a/self::friend)",
      "some $a in ancestor::item, $b in $a/ancestor::item satisfies $b/parent::items",
      // These are asked of each.
      "name(..) = (., 'friend')", "some $a in ancestor::person satisfies $a/@n = '3'"};
  for (const std::string& test : tests) {
    for (const char* path : {"//name", "//item", "//*"}) {
      const std::string filtered = std::string(path) + "[" + test + "]";
      isSame("count(" + filtered + ")", tree);
      sameBothWays("exists(" + filtered + "), " + filtered, tree);
    }
  }
}

// The context item need not be the document, and the document need not be as it was.
TEST(AlongWays, StartAtTheDocument) {
  const Value tree = records(200);
  isSame("//person[position() < 4]/site/people/person", tree);
  isSame("//people/site/people", tree);
  isSame("//person[3]/(/site/people/person[2])", tree);
  isSame(
      "let $d := document { /site } return (count($d/site/people/person), count($d/site/*/item))",
      tree);
  isSame(
      "let $d := document { <r>{for $i in 1 to 300 return <a><b/></a>}</r> } return "
      "(count($d/r/a/b), count($d/r/a/b), <x>{$d/r/a[1]}</x>, count($d/r/a/b))",
      tree);
}

TEST(AlongWays, LooksAtNoNodeThatIsOnlyCounted) {
  const Value tree = records(20000);
  for (const auto& [text, expected] :
       {std::pair("count(/site/people/person)", "20000"), std::pair("count(/site/*/item)", "2"),
        std::pair("count(/site/people/*/name)", "20000"),
        std::pair("count(/site/people//name)", "24000"),
        std::pair("exists(/site/people/person/friend)", "true"),
        std::pair("count(/site/people/person/note) > 6000", "true"),
        std::pair("count(//name[ancestor::friend])", "4000"),
        std::pair("count(//name[count(ancestor::friend) > 0])", "4000"),
        std::pair("count(//name[parent::person or parent::item])", "20001")}) {
    const auto query = compiled(text, XQueryWay::Planned);
    const auto context = XQueryContext::xqueryContext();
    _internal(*context).setContextItem(tree, 1);
    int64_t steps = 0;
    for (int turn = 0; turn < 12; ++turn) {
      const int64_t before = workMeter.stepsLeft;
      const Value value = _internal(*query).body()->evaluateWithContext(*context);
      steps = before - workMeter.stepsLeft;
      ASSERT_TRUE(value);
      EXPECT_EQ(XQueryItemStringValue(*value), expected) << text;
    }
    EXPECT_LT(steps, 20) << text;
  }
}

}  // namespace
}  // namespace xquery

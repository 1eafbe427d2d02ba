// Items of a list by their values from the index of the tree, in place of tables.
#include "Expr/XQuerySequence.h"
#include "Plan/Joins/XQueryIndexedItems.h"
#include "Plan/Planning.h"
#include "Plan/PlanTesting.h"
#include "Plan/Rules/ValueConditions.h"

#include <algorithm>
#include <memory>
#include <optional>
#include <string>
#include <vector>

namespace xquery {
namespace {

using namespace plantest;

// Sales and offers, some without a buyer and some with two; a name that only some have.
Value market(int count) {
  std::string text = "<r>";
  for (int i = 0; i < count; ++i) {
    const std::string name = i % 3 == 0 ? "offer" : "sale";
    text += "<" + name + (i % 5 ? " b='p" + std::to_string(i % 7) + "'" : "") + ">";
    for (int k = 0; k < i % 3; ++k) text += "<by>p" + std::to_string((i + k) % 11) + "</by>";
    text += "</" + name + ">";
  }
  for (int i = 0; i < 20; ++i)
    text +=
        "<p id='p" + std::to_string(i % 13) + "' n='" + (i == 3 ? "x" : std::to_string(i)) + "'/>";
  return document(text + "</r>");
}

std::shared_ptr<std::vector<Value>> itemsOf(std::string_view query, const Value& contextItem) {
  const auto compiledQuery = compiled(query);
  const auto context = XQueryContext::xqueryContext();
  _internal(*context).setContextItem(contextItem, 1);
  const Value value = _internal(*compiledQuery).body()->evaluateWithContext(*context);
  auto items = std::make_shared<std::vector<Value>>();
  EXPECT_TRUE(XQueryListItems(XQueryItemList(value.get()), *items)) << query;
  return items;
}

// Of a path from the context item, or of "." itself.
XQueryValueWay wayOf(std::string_view path) {
  const auto query = compiled(path);
  XQueryProgram program = programOf(*query);
  const XQueryPlanning planning(program);
  const auto way = XQueryWayFrom(planning, program.bodies().back().place, 0);
  EXPECT_TRUE(way) << path;
  return way.value_or(XQueryValueWay());
}

struct Case {
  const char* list;
  const char* way;
};
constexpr auto cases = std::to_array<Case>({
    {"//sale", "@b"},
    {"//sale[by]", "@b"},
    {"//sale", "by"},
    {"/r/*", "@b"},
    {"/r/*", "by"},
    {"//sale/@b", "."},
    {"//@b", "."},
    {"//by", "."},
    {"//sale[@b]/by", "."},
});

// As many rounds of asking as an index is worth.
std::unique_ptr<const XQueryIndexedItems> indexedOf(const XQueryIndexedItems::Items& items,
                                                    const XQueryValueWay& way) {
  const auto context = XQueryContext::xqueryContext();
  for (int round = 0; round < 100; ++round) {
    if (auto found = XQueryIndexedItems::of(items, way, *context)) return found;
    XQueryIndexedItems::noteAsked(*items, way);
  }
  return nullptr;
}

TEST(IndexedItems, AreThoseThatHaveTheValue) {
  const Value tree = market(150);
  for (const Case& each : cases) {
    const auto items = itemsOf(each.list, tree);
    const auto indexed = indexedOf(items, wayOf(each.way));
    ASSERT_TRUE(indexed) << each.list << " " << each.way;
    for (const char* probe :
         {"'p1'", "'p0'", "'p10'", "'none'", "''", "('p1', 'p2', 'p1')", "()", "//p/@id"}) {
      size_t looked = 0;
      const auto probes = itemsOf(probe, tree);
      std::vector<uint32_t> expected;
      for (size_t i = 0; i < items->size(); ++i) {
        const auto same =
            itemsOf("for $p in " + std::string(probe) + " where $p = " + each.way + " return 1",
                    (*items)[i]);
        // What "//" finds is asked in the tree of the item, which is the same.
        if (!same->empty()) expected.push_back(static_cast<uint32_t>(i));
      }
      const auto list = XQuerySequence::sequence();
      for (const Value& value : *probes) list->addObject(value);
      std::vector<uint32_t> positions;
      ASSERT_TRUE(indexed->find(XQueryItemList(list.get()), false, positions, looked)) << probe;
      EXPECT_EQ(positions, expected) << each.list << " " << each.way << " " << probe;
      EXPECT_EQ(indexed->holds(XQueryItemList(list.get()), looked), !expected.empty()) << probe;
      std::vector<uint32_t> first;
      ASSERT_TRUE(indexed->find(XQueryItemList(list.get()), true, first, looked)) << probe;
      EXPECT_EQ(first.empty(), expected.empty());
      if (!first.empty()) {
        EXPECT_EQ(first.front(), expected.front()) << probe;
      }
    }
  }
}

TEST(IndexedItems, KnowNothingOfNumbers) {
  const Value tree = market(300);
  const auto indexed = indexedOf(itemsOf("//sale", tree), wayOf("@b"));
  ASSERT_TRUE(indexed);
  for (const char* probe : {"1", "('p1', 1)", "xs:token('p1')", "true()"}) {
    const auto list = XQuerySequence::sequence();
    size_t looked = 0;
    const auto probes = itemsOf(probe, tree);
    for (const Value& value : *probes) list->addObject(value);
    std::vector<uint32_t> positions;
    EXPECT_FALSE(indexed->find(XQueryItemList(list.get()), false, positions, looked)) << probe;
    EXPECT_TRUE(positions.empty());
    EXPECT_EQ(indexed->holds(XQueryItemList(list.get()), looked), std::nullopt) << probe;
  }
}

TEST(IndexedItems, AreInOrderAndOfOneTree) {
  const Value tree = market(300);
  for (const Case& each : std::to_array<Case>({
           {"reverse(//sale)", "@b"},
           {"(//sale, //sale[1])", "@b"},
           {"(//sale, 'p1')", "@b"},
           {"('p1', //sale)", "@b"},
           {"(//sale, <sale/>)", "@b"},
           {"(//sale)[position() < 32]", "@b"},
           {"(//sale/@b, //by)", "."},
           {"//by/text()", "."},
           {"for $i in 1 to 40 return <sale b='p1'/>", "@b"},
       })) {
    EXPECT_FALSE(indexedOf(itemsOf(each.list, tree), wayOf(each.way))) << each.list;
  }
}

// A few items among many that have the same values.
TEST(IndexedItems, TellWhenATableIsWorthItsMaking) {
  const Value tree = market(400);
  const auto few = itemsOf("(//sale)[position() <= 40]", tree);
  const auto indexed = indexedOf(few, wayOf("@b"));
  ASSERT_TRUE(indexed);
  const auto probes = itemsOf("'p1'", tree);
  std::vector<uint32_t> positions;
  size_t looked = 0;
  ASSERT_TRUE(indexed->find(XQueryItemList(probes->front().get()), false, positions, looked));
  EXPECT_GT(looked, positions.size());
  EXPECT_FALSE(indexed->isWorthATable(looked));
  for (int round = 0; round < 3; ++round) {
    positions.clear();
    ASSERT_TRUE(indexed->find(XQueryItemList(probes->front().get()), false, positions, looked));
  }
  EXPECT_TRUE(indexed->isWorthATable(looked));
}

TEST(IndexedItems, AnswerAsTablesDo) {
  const Value tree = market(200);
  for (
      const char* text : {
          "for $p in //p, $s in //sale where $s/@b = $p/@id return $s",
          "for $p in //p, $s in //sale where $s/@b eq $p/@id return $s/by",
          "for $p in //p, $s in /r/* where $s/by = $p/@id return ($p/@n, $s)",
          "for $p in //p, $s in /r/* where $s/by eq $p/@id return $s",
          "for $p in //p, $s at $n in //sale where $s/@b = $p/@id return $n",
          "for $p in //p return count(for $s in //sale where $s/@b = $p/@id return $s)",
          "for $p in //p return sum(for $s in //sale where $s/@b = $p/@id return 2)",
          "for $p in //p return sum(for $s in //sale return if ($s/@b = $p/@id) then 1 else 0)",
          "for $p in //p where some $s in //sale satisfies $s/@b = $p/@id return $p/@id",
          "for $p in //p where some $s in //sale satisfies $s/@b eq $p/@id return $p/@id",
          "for $p in //p where every $s in //sale satisfies not($s/@b = $p/@id) return $p/@id",
          "for $p in //p where every $s in //sale satisfies $s/@b != $p/@id return $p/@id",
          "let $l := //sale for $p in //p return count($l[@b = $p/@id])",
          "let $l := /r/* for $p in //p return $l[by = $p/@id][2]",
          "let $l := //sale for $p in //p return $l[@b = $p/@id and by]",
          "let $l := //sale for $p in //p return $l[by and @b = $p/@id]",
          "let $l := //sale/@b for $p in //p where $p/@id = $l return $p/@id",
          "let $l := //by return //p[@id = $l]/@n",
          "//p[not(@id = //sale/@b)]/@n",
          "//p[//@b = @id]/@n",
          "//p[@n = //sale/@b]",
          "//p[some $p in ., $s in //sale satisfies $s/@b = $p/@id]/@n",
          "for $p in (//p, 'p1', 1, 'p1') return count(for $s in //sale where $s/@b = $p return 1)",
          "for $p in ('p1', 'p2', 1, 'p1') return //sale[@b = $p]/by",
          "for $p in //p, $s in //sale where xs:integer($p/@n) > 0 and $s/@b = $p/@id return $s",
          "for $p in //p, $s in //sale where $s/@b = $p/@id and xs:integer($p/@n) > 0 return $s",
          "for $p in //p, $s in //sale where exactly-one($s/@b) = $p/@id return $s",
          "for $p in //p, $s in //sale where exactly-one($s/by) and $s/@b = $p/@id return $s",
          "for $p in //p, $s in //sale where $s/@b = $p/@id and exactly-one($s/by) = 'p1' return 1",
          "for $p in //p, $s in //sale where $s/@b = exactly-one($p/@id[. != 'p9']) return $s",
          "declare function local:of($l, $p) { $l[@b = $p/@id] }; let $l := //sale "
          "return for $p in //p where empty(local:of($l, $p)) return $p/@n",
          // A tree that is still being made.
          "let $l := for $i in 1 to 99 return <s b='p{$i mod 9}'/> "
          "for $p in //p return <e>{$l[@b = $p/@id][1]}</e>",
          "for $p in //p return <e>{for $s in //sale where $s/@b = $p/@id return $s/@b}</e>",
      }) {
    // The first rounds make tables, until an index is worth its making.
    for (int round = 0; round < 3; ++round) sameBothWays(text, tree);
  }
}

}  // namespace
}  // namespace xquery

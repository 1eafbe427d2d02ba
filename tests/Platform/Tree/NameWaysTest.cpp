// What an index of names knows of the ways down to elements is what walks find.
#include "Platform/Text/TextTestSupport.h"
#include "Platform/Tree/NameIndex.h"
#include "Platform/Tree/Names.h"
#include "Platform/Tree/XMLTestSupport.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <array>
#include <memory>
#include <random>
#include <set>
#include <string>
#include <vector>

namespace xquery {
namespace {

const NSXMLExpandedName* name(const std::string& local, const std::string& URI = "") {
  static std::vector<NSXMLExpandedNameRef> held;
  held.emplace_back(A(URI), A(local));
  return held.back().get();
}

// Those that are written with a prefix.
class Prefixed final : public NSXMLNameSelection {
 public:
  bool mayTake(const NSXMLExpandedName&) const override { return true; }
  bool takes(const NSXMLNode& node) const override {
    return node.name()->utf8().find(':') != std::string::npos;
  }
};

bool takes(const NSXMLWayStep& step, const NSXMLNode& node) {
  if (node.kind() != Kind::Element) return false;
  if (step.name) return node.expandedName() == step.name;
  return !step.selection || step.selection->takes(node);
}

using Nodes = std::set<const NSXMLNode*>;

void walk(const NSXMLNode* node, const NSXMLWayStep& step, Nodes& found) {
  for (const NSXMLNode* child = node->firstChild(); child; child = child->nextSibling()) {
    if (takes(step, *child)) found.insert(child);
    if (step.isDeep) walk(child, step, found);
  }
}

Nodes walked(const NSXMLNode* document, const std::vector<NSXMLWayStep>& steps) {
  Nodes nodes = {document};
  for (const NSXMLWayStep& step : steps) {
    Nodes further;
    for (const NSXMLNode* node : nodes) walk(node, step, further);
    nodes.swap(further);
  }
  return nodes;
}

// With each way several times, so that they are of use.
std::string generated(std::mt19937& random, size_t count) {
  static constexpr std::array names = {"a", "b", "n:a", "m:a", "c"};
  std::string out;
  std::vector<std::string> open;
  for (size_t i = 0; i < count; ++i) {
    open.emplace_back(names[random() % names.size()]);
    out += "<" + open.back() + ">";
    if (random() % 5 == 0) out += "text<?a b?><!--c-->";
    while (!open.empty() && (random() % 2 || open.size() > 5)) {
      out += "</" + open.back() + ">";
      open.pop_back();
    }
  }
  for (; !open.empty(); open.pop_back()) out += "</" + open.back() + ">";
  std::string whole = "<r xmlns:n='urn:n' xmlns:m='urn:n'>";
  for (int copy = 0; copy < 20; ++copy) whole += out;
  return whole + "</r>";
}

TEST(XMLNameWays, HaveWhatAWalkFinds) {
  std::mt19937 random(3);
  const Prefixed prefixed;
  const std::vector<NSXMLWayStep> tests = {
      {false, name("a"), nullptr},          {false, name("b"), nullptr},
      {false, name("a", "urn:n"), nullptr}, {false, name("none"), nullptr},
      {false, nullptr, &prefixed},          {false, nullptr, nullptr}};
  int foundAll = 0;
  for (int round = 0; round < 60; ++round) {
    const auto document = parsed(generated(random, 5 + random() % 20));
    const auto index = NSXMLNameIndex::ofElements(document.get());
    for (int turn = 0; turn < 20; ++turn) {
      std::vector<NSXMLWayStep> steps = {{false, name("r"), nullptr}};
      if (random() % 4 == 0) steps.clear();
      for (size_t more = random() % 4; more > 0 || steps.empty(); more -= more ? 1 : 0) {
        steps.push_back(tests[random() % tests.size()]);
        steps.back().isDeep = random() % 3 == 0;
      }
      const Nodes expected = walked(document.get(), steps);
      const auto count = index->countAlong(steps);
      if (!count) {
        // What is below the last child of a last child is not all that "//" finds there.
        EXPECT_TRUE(std::any_of(steps.begin() + 1, steps.end(),
                                [](const NSXMLWayStep& step) { return step.isDeep; }));
        continue;
      }
      ASSERT_EQ(*count, expected.size());
      const auto nodes = index->nodesAlong(steps);
      if (!steps.back().name) {
        EXPECT_FALSE(nodes);
        continue;
      }
      const bool areAll = expected.size() == index->nodes(steps.back().name).size();
      ASSERT_EQ(nodes.has_value(), areAll);
      if (!areAll) continue;
      ++foundAll;
      ASSERT_EQ(Nodes(nodes->begin(), nodes->end()), expected);
    }
  }
  EXPECT_GT(foundAll, 100);
}

// Nearly as many as elements.
TEST(XMLNameWays, AreNotKeptWhereTheyAreOfNoUse) {
  std::string text;
  for (int i = 0; i < 50; ++i) text += "<e" + std::to_string(i) + "/>";
  const std::vector<NSXMLWayStep> steps = {{false, name("r"), nullptr}, {false, nullptr, nullptr}};
  const auto few = parsed("<r>" + text + "</r>");
  EXPECT_FALSE(NSXMLNameIndex::ofElements(few.get())->countAlong(steps));
  std::string copies;
  for (int i = 0; i < 20; ++i) copies += text;
  const auto many = parsed("<r>" + copies + "</r>");
  EXPECT_EQ(NSXMLNameIndex::ofElements(many.get())->countAlong(steps), 1000U);
}

// So many that they would not be worth their memory.
TEST(XMLNameWays, AreNotKeptWhereThereAreTooMany) {
  for (const size_t names : {NSXMLNameIndex::mostWays - 2, NSXMLNameIndex::mostWays + 40}) {
    std::string text = "<r>";
    for (size_t i = 0; i < names; ++i)
      text += "<e" + std::to_string(i) + "><x/></e" + std::to_string(i) + ">";
    text += "<x><e1/></x><e1/></r>";
    const auto document = parsed(text);
    const auto index = NSXMLNameIndex::ofElements(document.get());
    const std::vector<NSXMLWayStep> steps = {{false, name("r"), nullptr},
                                             {false, name("x"), nullptr}};
    EXPECT_FALSE(index->countAlong(steps));
    EXPECT_FALSE(index->nodesAlong(steps));
    EXPECT_EQ(index->nodes(name("x")).size(), names + 1);
    EXPECT_EQ(index->nodes(name("e1")).size(), 3U);
    EXPECT_EQ(index->nodes(name("e" + std::to_string(names - 1))).size(), 1U);
    EXPECT_EQ(index->nodes(name("none")).size(), 0U);
    EXPECT_EQ(index->nodes(name("e1"))[0]->firstChild()->nodeName()->expanded, name("x"));
  }
}

TEST(XMLNameWays, AreKnownUpToTheirNumber) {
  const size_t names = NSXMLNameIndex::mostWays / 2 - 4;
  std::string text = "<r>";
  for (size_t i = 0; i < names; ++i) {
    const std::string own = "e" + std::to_string(i);
    text += "<" + own + ">";
    for (int copy = 0; copy < 30; ++copy) text += "<x/>";
    text += "</" + own + ">";
  }
  const auto document = parsed(text + "<x/></r>");
  const auto index = NSXMLNameIndex::ofElements(document.get());
  const std::vector<NSXMLWayStep> steps = {{false, name("r"), nullptr}, {true, name("x"), nullptr}};
  EXPECT_EQ(index->countAlong(steps), 30 * names + 1);
  EXPECT_TRUE(index->nodesAlong(steps));
}

TEST(XMLNameWays, EndAtAnyDepth) {
  const int levels = 100000;
  std::string text;
  for (int i = 0; i < levels; ++i) text += "<e>";
  text += "<x/>";
  for (int i = 0; i < levels; ++i) text += "</e>";
  const auto document = parsed(text);
  const auto index = NSXMLNameIndex::ofElements(document.get());
  EXPECT_FALSE(index->countAlong(std::vector<NSXMLWayStep>{{true, name("e"), nullptr}}));
  EXPECT_EQ(index->nodes(name("e")).size(), static_cast<size_t>(levels));
  EXPECT_EQ(index->nodes(name("x")).size(), 1U);
}

}  // namespace
}  // namespace xquery

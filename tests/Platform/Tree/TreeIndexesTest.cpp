// Indexes of trees answer what plain walks find, over generated documents that change in between,
// under limits and from several threads.
#include "Platform/Base/LookCounter.h"
#include "Platform/Base/ProcessorTime.h"
#include "Platform/Base/WorkMeter.h"
#include "Platform/Text/TextTestSupport.h"
#include "Platform/Tree/Arena.h"
#include "Platform/Tree/Names.h"
#include "Platform/Tree/TreeIndexes.h"
#include "Platform/Tree/XMLTestSupport.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <atomic>
#include <functional>
#include <map>
#include <random>
#include <set>
#include <string>
#include <thread>
#include <vector>

namespace xquery {
namespace {

using Nodes = std::vector<NSXMLNode*>;

Nodes listed(NSXMLNodeSpan nodes) {
  return {nodes.begin(), nodes.end()};
}

// Elements a, b, c in two namespaces, nested to any depth, with attributes whose values repeat.
class Records {
 public:
  explicit Records(uint32_t seed) : _random(seed) {}
  std::string text(size_t count) {
    std::string out = "<r xmlns:n='urn:n'>";
    std::vector<std::string> open;
    for (size_t i = 0; i < count; ++i) {
      const std::string name = pick({"a", "b", "c", "n:a"});
      out += "<" + name;
      if (_random() % 2) out += " x='" + value() + "'";
      if (_random() % 4 == 0) out += " n:x='" + value() + "'";
      out += ">" + pick({"", "", "1", "2", "caf\xC3\xA9", "<!--c-->3"});
      open.push_back(name);
      while (!open.empty() && (_random() % 2 || open.size() > 6)) {
        out += pick({"", "2", "\xF0\x9F\x98\x80"}) + "</" + open.back() + ">";
        open.pop_back();
      }
    }
    for (; !open.empty(); open.pop_back()) out += "</" + open.back() + ">";
    return out + "</r>";
  }
  std::string value() { return std::to_string(_random() % 9); }
  size_t below(size_t bound) { return _random() % bound; }

 private:
  std::string pick(std::initializer_list<const char*> choices) {
    return choices.begin()[_random() % choices.size()];
  }
  std::mt19937 _random;
};

const NSXMLExpandedNameRef& name(const std::string& local, const std::string& URI = "") {
  static std::map<std::pair<std::string, std::string>, NSXMLExpandedNameRef> names;
  auto& found = names[{local, URI}];
  if (!found) found = NSXMLExpandedNameRef(A(URI), A(local));
  return found;
}

// What a walk from `first` to `stop` finds.
Nodes walked(Kind kind, const NSXMLExpandedName* wanted, NSXMLNode* first, const NSXMLNode* stop) {
  Nodes found;
  for (NSXMLNode* node = first; node && node != stop; node = node->nextNode()) {
    if (kind == Kind::Element && node->expandedName() == wanted) found.push_back(node);
    auto* element = dyn_cast<NSXMLElement>(node);
    if (kind == Kind::Element || !element) continue;
    for (NSXMLNode* each = element->firstAttribute(); each;
         each = NSXMLElement::nextAttribute(each)) {
      if (each->expandedName() == wanted) found.push_back(each);
    }
  }
  return found;
}

Nodes everyNode(NSXMLNode* root) {
  Nodes all;
  for (NSXMLNode* node = root; node; node = node->nextNode()) all.push_back(node);
  return all;
}

const NSXMLExpandedName* const someNames[] = {name("a").get(),
                                              name("b").get(),
                                              name("r").get(),
                                              name("x").get(),
                                              name("a", "urn:n").get(),
                                              name("x", "urn:n").get(),
                                              name("a", "urn:other").get()};

class Ceiling {
 public:
  explicit Ceiling(int64_t bytes) : _outer(workMeter.mostValueBytes) {
    workMeter.mostValueBytes = workMeter.valueBytes + bytes;
  }
  ~Ceiling() { workMeter.mostValueBytes = _outer; }

 private:
  const int64_t _outer;
};

constexpr uint64_t wholeWalk = UINT32_MAX;

// --- names ---------------------------------------------------------------------------------------

TEST(XMLNameIndex, HasWhatAWalkFinds) {
  for (uint32_t seed = 0; seed < 40; ++seed) {
    const auto document = parsed(Records(seed).text(seed * 10));
    const auto elements = NSXMLNameIndex::ofElements(document.get());
    const auto attributes = NSXMLNameIndex::ofAttributes(document.get());
    const Nodes all = everyNode(document.get());
    std::mt19937 random(seed);
    for (const NSXMLExpandedName* each : someNames) {
      for (const Kind kind : {Kind::Element, Kind::Attribute}) {
        const auto& index = kind == Kind::Element ? *elements : *attributes;
        ASSERT_EQ(listed(index.nodes(each)), walked(kind, each, document.get(), nullptr));
        for (int turn = 0; turn < 5; ++turn) {
          const size_t from = random() % all.size();
          const size_t to = from + random() % (all.size() - from);
          ASSERT_EQ(listed(NSXMLNameIndex::between(index.nodes(each), all[from], all[to])),
                    walked(kind, each, all[from], all[to]));
          const NSXMLNode* end = NSXMLTree::endOfSubtree(all[from]);
          Nodes inside = walked(kind, each, all[from], end);
          if (!inside.empty() && inside.front() == all[from]) inside.erase(inside.begin());
          ASSERT_EQ(listed(NSXMLNameIndex::inside(index.nodes(each), all[from])), inside);
        }
      }
    }
  }
}

// The local name, in any namespace, as a prefix writes it or as all do.
class Selection final : public NSXMLNameSelection {
 public:
  Selection(std::string written, bool byPrefix)
      : _written(std::move(written)), _byPrefix(byPrefix) {}
  bool mayTake(const NSXMLExpandedName& name) const override { return name.localName == A("c"); }
  bool takes(const NSXMLNode& node) const override {
    ++asked;
    return !_byPrefix || node.nameView() == A(_written);
  }
  mutable size_t asked = 0;

 private:
  const std::string _written;
  const bool _byPrefix;
};

TEST(XMLNameIndex, CountsWhatItLists) {
  std::string text = "<r xmlns:n='urn:n' xmlns:m='urn:n'>";
  for (int i = 0; i < 60; ++i) text += i % 3 ? "<c><n:c/></c>" : "<n:c><c/><m:c/></n:c>";
  const auto document = parsed(text + "</r>");
  const auto index = NSXMLNameIndex::ofElements(document.get());
  const Nodes all = everyNode(document.get());
  for (const bool byPrefix : {false, true}) {
    for (const char* written : {"c", "n:c", "m:c"}) {
      const Selection names(written, byPrefix);
      for (size_t from = 0; from + 7 < all.size(); from += 7) {
        const size_t end = all.size() - from / 2;
        const NSXMLNode* stop = from % 2 && end > from ? all[end] : nullptr;
        Nodes expected;
        for (size_t i = from; i < all.size() && all[i] != stop; ++i) {
          const bool isNamed = all[i]->expandedName() && names.mayTake(*all[i]->expandedName());
          if (isNamed && names.takes(*all[i])) expected.push_back(all[i]);
        }
        const auto listed = index->nodes(names, all[from], stop);
        ASSERT_EQ(Nodes(listed.span().begin(), listed.span().end()), expected);
        ASSERT_EQ(index->count(names, all[from], stop), expected.size());
      }
    }
  }
}

// Of those that are written in one way one tells for all.
TEST(XMLNameIndex, AsksOneNodeOfThoseWrittenAlike) {
  std::string text = "<r>";
  for (int i = 0; i < 60; ++i) text += "<c/><d/>";
  const auto document = parsed(text + "</r>");
  const auto index = NSXMLNameIndex::ofElements(document.get());
  const Selection names("c", true);
  EXPECT_EQ(index->count(names, document.get(), nullptr), 60U);
  EXPECT_EQ(index->nodes(names, document.get(), nullptr).size(), 60U);
  EXPECT_EQ(names.asked, 2U);
}

TEST(XMLNameIndex, HoldsAsManyNamesAsTheTreeHas) {
  std::string text = "<r>";
  for (int i = 0; i < 3000; ++i) text += "<e" + std::to_string(i % 1000) + "/>";
  const auto document = parsed(text + "</r>");
  const auto index = NSXMLNameIndex::ofElements(document.get());
  for (int i = 0; i < 1000; ++i) {
    const NSXMLExpandedNameRef each({}, A("e" + std::to_string(i)));
    ASSERT_EQ(listed(index->nodes(each.get())),
              walked(Kind::Element, each.get(), document.get(), nullptr));
  }
}

// --- values --------------------------------------------------------------------------------------

Nodes valuesOf(NSXMLNode* element, const NSXMLValueKey& key) {
  Nodes at{element};
  for (const NSXMLValueStep& step : key.steps) {
    Nodes below;
    for (const NSXMLNode* node : at) {
      const NSXMLNode* const stop = NSXMLTree::descendantStop(node);
      NSXMLNode* each = step.isToDescendants ? node->nextNode() : node->firstChild();
      while (each && each != stop) {
        if (each->kind() == Kind::Element && each->expandedName() == step.name.get()) {
          below.push_back(each);
        }
        each = step.isToDescendants ? each->nextNode() : each->nextSibling();
      }
    }
    at.swap(below);
  }
  if (key.ofTexts) {
    Nodes texts;
    for (const NSXMLNode* node : at) {
      for (NSXMLNode* each = node->firstChild(); each; each = each->nextSibling()) {
        if (each->kind() == Kind::Text) texts.push_back(each);
      }
    }
    return texts;
  }
  if (!key.attribute) return at;
  Nodes attributes;
  for (const NSXMLNode* node : at) {
    for (NSXMLNode* each = cast<NSXMLElement>(node)->firstAttribute(); each;
         each = NSXMLElement::nextAttribute(each)) {
      if (each->expandedName() == key.attribute.get()) attributes.push_back(each);
    }
  }
  return attributes;
}

std::map<std::u16string, Nodes> nodesByValue(NSXMLNode* root, const NSXMLValueKey& key) {
  std::map<std::u16string, Nodes> byValue;
  for (NSXMLNode* element : walked(Kind::Element, key.element.get(), root, nullptr)) {
    for (const NSXMLNode* value : valuesOf(element, key)) {
      Nodes& nodes = byValue[value->stringValue()->view().utf16()];
      if (nodes.empty() || nodes.back() != element) nodes.push_back(element);
    }
  }
  return byValue;
}

const NSXMLValueKey someKeys[] = {
    {name("a"), {}, name("x")},
    {name("a"), {}, name("x", "urn:n")},
    {name("a"), {}, {}},
    {name("b"), {name("a")}, {}},
    {name("r"), {name("a"), name("b")}, name("x")},
    {name("a", "urn:n"), {name("a"), name("b"), name("c")}, {}},
    {name("none"), {name("a")}, {}},
    {name("a"), {{name("b"), true}}, name("x")},
    {name("r"), {name("a"), {name("c"), true}}, {}},
    {name("a"), {}, {}, true},
    {name("r"), {name("a"), name("b")}, {}, true},
    {name("r"), {name("a"), {name("c"), true}}, {}, true},
};

void expectValues(const NSXMLValueIndex& index, NSXMLNode* root, const NSXMLValueKey& key) {
  const auto expected = nodesByValue(root, key);
  EXPECT_EQ(index.valueCount(), expected.size());
  for (const auto& [value, nodes] : expected) {
    const NSStringView wide(value.data(), static_cast<uint32_t>(value.size()));
    EXPECT_EQ(listed(index.nodes(wide)), nodes) << wide.utf8();
    EXPECT_EQ(listed(index.nodes(NSString::stringWithView(wide)->view())), nodes) << wide.utf8();
  }
  EXPECT_TRUE(index.nodes(A("no such value")).empty());
}

TEST(XMLValueIndex, HasWhatAWalkFinds) {
  for (uint32_t seed = 0; seed < 20; ++seed) {
    const auto document = parsed(Records(seed).text(seed * 20));
    const auto names = NSXMLNameIndex::ofElements(document.get());
    for (const NSXMLValueKey& key : someKeys) {
      const auto index = NSXMLValueIndex::make(names->nodes(key.element.get()), key, *names);
      expectValues(*index, document.get(), key);
    }
  }
}

TEST(XMLValueIndex, FindsAnElementOnceByEachOfItsValues) {
  const auto document = parsed("<r><i><s p='1'/><s p='2'/><s p='1'/></i><i><s p='2'/><s/></i></r>");
  const NSXMLValueKey key{name("i"), {name("s")}, name("p")};
  const auto names = NSXMLNameIndex::ofElements(document.get());
  const auto index = NSXMLValueIndex::make(names->nodes(key.element.get()), key, *names);
  NSXMLNode* first = document->rootElement()->firstChild();
  EXPECT_EQ(listed(index->nodes(A("1"))), Nodes{first});
  EXPECT_EQ(listed(index->nodes(A("2"))), (Nodes{first, first->nextSibling()}));
  EXPECT_TRUE(index->nodes(A("")).empty());
}

// Each of them would have the values of all the others below it.
TEST(XMLValueIndex, IsGivenUpWhereElementsLieInEachOther) {
  const NSXMLValueKey key{name("e"), {{name("e"), true}}, {}};
  for (const size_t count : {10, 2000}) {
    const auto root = NSXMLElement::elementWithName(A("e"));
    NSXMLElement* inner = root.get();
    for (size_t i = 1; i < count; ++i) {
      const auto element = NSXMLElement::elementWithName(A("e"));
      inner->addChild(element);
      inner = element.get();
    }
    const auto names = NSXMLNameIndex::ofElements(root.get());
    const auto index = NSXMLValueIndex::make(names->nodes(key.element.get()), key, *names);
    EXPECT_EQ(index->isGivenUp(), count > 1000);
    EXPECT_EQ(index->nodes(A("")).size(), count > 1000 ? 0 : count - 1);
  }
}

TEST(XMLTreeIndexes, FindOwnersByTheirAttributes) {
  const auto document = parsed(Records(7).text(500));
  const auto indexes = NSXMLTreeIndexes::of(document.get());
  const NSXMLValueKey key{{}, {}, name("x")};
  const NSXMLValueIndex* index = nullptr;
  for (int turn = 0; turn < 4 && !index; ++turn) index = indexes->values(key, wholeWalk);
  ASSERT_TRUE(index);
  size_t count = 0;
  for (NSXMLNode* each : walked(Kind::Attribute, name("x").get(), document.get(), nullptr)) {
    const auto owners = listed(index->nodes(each->stringValue()->view()));
    EXPECT_TRUE(std::find(owners.begin(), owners.end(), each->parent()) != owners.end());
    ++count;
  }
  EXPECT_GT(count, 0u);
  EXPECT_TRUE(index->nodes(A("no such value")).empty());
}

TEST(XMLValueIndex, ValuesMadeToMeetInAnUnkeyedHashTakeTimeInProportionToThem) {
  const NSXMLValueKey key{name("e"), {}, name("v")};
  const auto seconds = [&](size_t count) {
    const auto root = NSXMLElement::elementWithName(A("r"));
    for (const std::u16string& text : meetingTexts(count)) {
      const NSStringView value(text.data(), static_cast<uint32_t>(text.size()));
      const auto element = NSXMLElement::elementWithName(A("e"));
      element->addAttribute(NSXMLNode::attributeWithName(A("v"), value));
      root->addChild(element);
    }
    const auto names = NSXMLNameIndex::ofElements(root.get());
    const NSXMLNodeSpan elements = names->nodes(key.element.get());
    return processorSecondsOf(
        [&] { EXPECT_EQ(NSXMLValueIndex::make(elements, key, *names)->valueCount(), count); });
  };
  EXPECT_TRUE(growsInProportion(seconds, 8000));
}

// --- when they are made --------------------------------------------------------------------------

std::optional<Nodes> indexed(const NSXMLExpandedName* wanted, const NSXMLNode* first,
                             const NSXMLNode* stop = nullptr) {
  const auto found = NSXMLIndexedElements(wanted, first, stop);
  if (!found) return std::nullopt;
  return listed(found->nodes);
}

TEST(XMLTreeIndexes, AreMadeAtOnceOfWhatIsOnRecord) {
  const auto document = parsed(Records(1).text(500));
  NSXMLNode* root = document->rootElement();
  EXPECT_EQ(indexed(name("a").get(), root), walked(Kind::Element, name("a").get(), root, nullptr));
  EXPECT_EQ(indexed(name("none").get(), root), Nodes());
}

TEST(XMLTreeIndexes, AreMadeWhenATreeIsAskedASecondTime) {
  const Ref<NSXMLNode> document = parsed(Records(1).text(500))->copy();
  NSXMLNode* root = document->firstChild();
  EXPECT_FALSE(indexed(name("a").get(), root));
  EXPECT_EQ(indexed(name("a").get(), root), walked(Kind::Element, name("a").get(), root, nullptr));
  EXPECT_EQ(indexed(name("none").get(), root), Nodes());
}

TEST(XMLTreeIndexes, AreMadeForPartsWhenTheseComeToHalfTheTree) {
  std::string text = "<r>";
  for (int part = 0; part < 10; ++part) {
    text += "<p>";
    for (int i = 0; i < 300; ++i) text += "<e/>";
    text += "</p>";
  }
  const auto document = parsed(text + "</r>");
  const auto copy = document->copy();
  const auto partsWalked = [](const NSXMLNode* root) {
    int turn = 0;
    int count = 0;
    for (NSXMLNode* part = root->firstChild()->firstChild(); part->nextSibling();
         part = part->nextSibling(), ++turn) {
      const auto found = indexed(name("e").get(), part->firstChild(), part->nextSibling());
      if (!found) {
        EXPECT_EQ(count++, turn);
      } else {
        EXPECT_EQ(found->size(), 300u);
      }
    }
    return count;
  };
  EXPECT_EQ(partsWalked(copy.get()), 6);
  // To an eighth, where elements are on record.
  EXPECT_EQ(partsWalked(document.get()), 1);
}

TEST(XMLTreeIndexes, AreNotForSmallTreesAndSmallParts) {
  const auto small = parsed("<r><a/><a/></r>");
  const auto large = parsed(Records(2).text(500));
  for (int turn = 0; turn < 4; ++turn) {
    EXPECT_FALSE(indexed(name("a").get(), small.get()));
    static_cast<void>(indexed(name("a").get(), large.get()));
    NSXMLNode* first = large->rootElement()->firstChild();
    EXPECT_FALSE(indexed(name("a").get(), first, first->nextNode()));
  }
}

TEST(XMLTreeIndexes, AreNotForTreesOfSeveralRoots) {
  const auto document = parsed(Records(3).text(500));
  const Ref<NSXMLNode> part = document->rootElement()->firstChild();
  part->detach();
  for (int turn = 0; turn < 4; ++turn) EXPECT_FALSE(NSXMLTreeIndexes::of(document.get()));
}

TEST(XMLTreeIndexes, KnowTheValuesOfAsManyKeysAsTheyMay) {
  const auto document = parsed(Records(4).text(500));
  const NSXMLIndexesRef indexes = NSXMLTreeIndexes::of(document.get());
  for (uint32_t i = 0; i <= NSXMLTreeIndexes::mostKeys; ++i) {
    const NSXMLExpandedNameRef attribute({}, A("x" + std::to_string(i)));
    const NSXMLValueKey key{name("a"), {}, attribute};
    EXPECT_FALSE(indexes->values(key, wholeWalk)) << i;
    EXPECT_EQ(indexes->values(key, wholeWalk) != nullptr, i < NSXMLTreeIndexes::mostKeys) << i;
  }
}

// --- changes -------------------------------------------------------------------------------------

NSXMLIndexesRef filled(NSXMLNode* node) {
  // Numbers are assigned anew when somebody compares.
  const NSXMLNode* root = node->rootNode();
  static_cast<void>(NSXMLNode::compareOrder(root, root->firstChild()));
  NSXMLIndexesRef indexes = NSXMLTreeIndexes::of(node);
  EXPECT_TRUE(indexes);
  for (int turn = 0; indexes && turn < 2; ++turn) {
    static_cast<void>(indexes->elements(wholeWalk));
    static_cast<void>(indexes->attributes(wholeWalk));
    for (const NSXMLValueKey& key : someKeys) static_cast<void>(indexes->values(key, wholeWalk));
  }
  return indexes;
}

void expectLikeWalks(NSXMLNode* root) {
  const NSXMLIndexesRef indexes = filled(root->firstChild());
  ASSERT_TRUE(indexes && indexes->isOf(root));
  for (const NSXMLExpandedName* each : someNames) {
    ASSERT_EQ(listed(indexes->elements(0)->nodes(each)),
              walked(Kind::Element, each, root, nullptr));
    ASSERT_EQ(listed(indexes->attributes(0)->nodes(each)),
              walked(Kind::Attribute, each, root, nullptr));
  }
  for (const NSXMLValueKey& key : someKeys) expectValues(*indexes->values(key, 0), root, key);
}

TEST(XMLTreeIndexes, GoAtAnyChangeOfTheTree) {
  const auto element = [](std::string_view local) {
    return NSXMLElement::elementWithName(A(local));
  };
  using Change = std::function<void(NSXMLElement*)>;
  const std::pair<const char*, Change> changes[] = {
      {"a child", [&](NSXMLElement* r) { r->addChild(element("a")); }},
      {"a child in front", [&](NSXMLElement* r) { r->insertChild(element("a"), 0); }},
      {"a text", [](NSXMLElement* r) { r->addChild(NSXMLNode::textWithStringValue(A("t"))); }},
      {"an attribute",
       [](NSXMLElement* r) { r->addAttribute(NSXMLNode::attributeWithName(A("x"), A("1"))); }},
      {"no attribute", [](NSXMLElement* r) { r->removeAttributeForName(A("id")); }},
      {"a value", [](NSXMLElement* r) { r->firstAttribute()->setStringValue(A("2")); }},
      {"a new content", [](NSXMLElement* r) { r->lastChild()->setStringValue(A("2")); }},
      {"a larger tree",
       [](NSXMLElement* r) {
         const auto other = parsed(Records(7).text(600));
         const Ref<NSXMLNode> root = other->rootElement();
         root->detach();
         r->addChild(Ref<NSXMLNode>(root));
       }},
  };
  for (const auto& [what, change] : changes) {
    const auto document = parsed("<q id='1'>" + Records(5).text(300) + "</q>");
    const NSXMLIndexesRef indexes = filled(document.get());
    ASSERT_TRUE(indexes->isOf(document.get())) << what;
    change(document->rootElement());
    EXPECT_FALSE(indexes->isOf(document.get())) << what;
  }
}

TEST(XMLTreeIndexes, GoWhenTheTreeMovesIntoAnother) {
  const auto root = NSXMLElement::elementWithName(A("root"));
  const Ref<NSXMLNode> moved = parsed(Records(5).text(300))->rootElement()->copy();
  const NSXMLIndexesRef indexes = filled(moved.get());
  EXPECT_TRUE(indexes->isOf(moved.get()));
  EXPECT_TRUE(root->addChild(moved));
  EXPECT_FALSE(indexes->isOf(moved.get()));
  expectLikeWalks(root.get());
}

TEST(XMLTreeIndexes, AreThoseOfTheTreeAsItIsAfterEachChange) {
  Records random(6);
  const Ref<NSXMLNode> root = parsed(random.text(300))->rootElement()->copy();
  for (int turn = 0; turn < 60; ++turn) {
    const Nodes all = everyNode(root.get());
    NSXMLNode* node = all[random.below(all.size())];
    while (node->kind() != Kind::Element) node = node->parent();
    auto* element = cast<NSXMLElement>(node);
    switch (random.below(4)) {
      case 0:
        element->insertChild(parsed(random.text(3))->rootElement()->copy(),
                             static_cast<uint32_t>(random.below(3)));
        break;
      case 1:
        if (element->firstAttribute()) element->firstAttribute()->setStringValue(A(random.value()));
        break;
      case 2:
        element->addAttribute(NSXMLNode::attributeWithName(A("x"), A(random.value())));
        break;
      default:
        if (element->firstChild() && element->firstChild()->kind() == Kind::Text) {
          element->firstChild()->setStringValue(A(random.value()));
        }
    }
    expectLikeWalks(root.get());
    if (HasFatalFailure()) return;
  }
}

TEST(XMLTreeIndexes, NodesThatSomebodyHoldsStayWhatTheyWereAtAChange) {
  const auto document = parsed(Records(8).text(500));
  NSXMLElement* root = document->rootElement();
  const Nodes before = walked(Kind::Element, name("a").get(), root, nullptr);
  static_cast<void>(indexed(name("a").get(), root));
  const auto held = NSXMLIndexedElements(name("a").get(), root, nullptr);
  root->insertChild(NSXMLElement::elementWithName(A("a")), 0);
  ASSERT_TRUE(held);
  EXPECT_EQ(listed(held->nodes), before);
}

// --- kinds -------------------------------------------------------------------------------------

size_t kindsWalked(const NSXMLNode* document, uint32_t kinds) {
  size_t count = 0;
  for (const NSXMLNode* node = document->firstChild(); node; node = node->nextNode()) {
    count += kinds >> static_cast<unsigned>(node->kind()) & 1;
  }
  return count;
}

size_t attributesWalked(const NSXMLNode* document) {
  size_t count = 0;
  for (const NSXMLNode* node = document->firstChild(); node; node = node->nextNode()) {
    if (const auto* element = dyn_cast<NSXMLElement>(node)) count += element->attributeCount();
  }
  return count;
}

// By whichever reader, with whatever is left out.
TEST(XMLKindCounts, AreWhatAWalkFinds) {
  const std::string prologs[] = {
      "<!--1--><?a b?>", "<!DOCTYPE r [<!ENTITY e '<a x=\"1\"/>t'><!ATTLIST a y CDATA '2'>]>"};
  for (uint32_t seed = 0; seed < 20; ++seed) {
    const std::string inner = "<a xmlns='urn:d' xmlns:q='urn:q'><![CDATA[<]]>&lt;<?p?></a> ";
    const std::string text = prologs[seed % 2] + "<w>" + inner + Records(seed).text(400) + inner +
                             (seed % 2 ? "&e;" : " ") + "</w><!--2-->";
    for (const uint32_t options :
         {uint32_t{NSXMLNodeOptionsNone}, uint32_t{NSXMLNodePreserveWhitespace},
          NSXMLNodePreserveCDATA | NSXMLNodePreserveWhitespace}) {
      const auto document = NSXMLDocument::documentWithData(text, options);
      ASSERT_TRUE(document);
      const NSXMLNode* const first = document->firstChild();
      for (uint32_t kinds = 0; kinds < 256; kinds += 4) {
        ASSERT_EQ(NSXMLCountKinds(kinds, first, nullptr), kindsWalked(document.get(), kinds));
      }
      ASSERT_EQ(NSXMLCountAttributes(first, nullptr), attributesWalked(document.get()));
      ASSERT_EQ(NSXMLCountAttributes(document.get(), nullptr), attributesWalked(document.get()));
    }
  }
}

TEST(XMLKindCounts, AreOfWholeDocumentsThatHaveNotChanged) {
  constexpr uint32_t all = 255;
  const auto document = parsed(Records(3).text(500));
  const NSXMLNode* const root = document->rootElement();
  EXPECT_TRUE(NSXMLCountKinds(all, root, nullptr));
  EXPECT_FALSE(NSXMLCountKinds(all, root->firstChild(), nullptr));
  EXPECT_FALSE(NSXMLCountKinds(all, root, root->lastChild()));
  EXPECT_FALSE(NSXMLCountKinds(all, document.get(), nullptr));
  EXPECT_FALSE(NSXMLCountKinds(all, parsed("<r/>")->rootElement(), nullptr));
  const auto copy = document->copy();
  EXPECT_FALSE(NSXMLCountKinds(all, copy->firstChild(), nullptr));
  document->rootElement()->addChild(NSXMLNode::commentWithStringValue(A("c")));
  EXPECT_FALSE(NSXMLCountKinds(all, root, nullptr));
  EXPECT_FALSE(NSXMLCountAttributes(root, nullptr));
}

// --- limits --------------------------------------------------------------------------------------

TEST(XMLTreeIndexes, OneThatIsEndedLeavesNothingBehind) {
  const Ref<NSXMLNode> document = parsed(Records(9).text(4000))->copy();
  const NSXMLIndexesRef indexes = NSXMLTreeIndexes::of(document.get());
  const NSXMLValueKey key{name("a"), {}, {}};
  // The one empty text of the process, the value of elements without any, counts for its maker.
  static_cast<void>(NSString::empty());
  static_cast<void>(indexes->elements(wholeWalk));
  static_cast<void>(indexes->attributes(wholeWalk));
  static_cast<void>(indexes->values(key, wholeWalk));
  const std::function<bool()> makes[] = {
      [&] { return indexes->attributes(0) != nullptr; },
      [&] { return indexes->elements(0) != nullptr; },
      [&] { return indexes->values(key, 0) != nullptr; },
  };
  for (const auto& make : makes) {
    int looks = 0;
    for (bool isMade = false; !isMade; ++looks) {
      ASSERT_LT(looks, 10'000);
      const int64_t before = workMeter.valueBytes;
      const LookCounter watcher(looks);
      try {
        isMade = make();
        ASSERT_TRUE(isMade);
      } catch (const Ended&) {
        ASSERT_EQ(workMeter.valueBytes, before) << looks;
      }
    }
    EXPECT_GT(looks, 10);
  }
  expectLikeWalks(document.get());
}

TEST(XMLTreeIndexes, AreNotMadeWhereTheyWouldTakeMuchOfWhatIsLeft) {
  const auto document = parsed(Records(10).text(4000));
  const NSXMLNode* root = document->rootElement();
  {
    const Ceiling ceiling(100'000);
    const int64_t before = workMeter.valueBytes;
    EXPECT_FALSE(indexed(name("a").get(), root));
    EXPECT_EQ(workMeter.valueBytes, before);
    EXPECT_FALSE(workMeter.wasRefused);
  }
  EXPECT_TRUE(indexed(name("a").get(), root));
}

TEST(XMLTreeIndexes, CountTowardsTheCeilingUntilTheyGo) {
  // The names of these tests are made when first asked for, and stay.
  static_cast<void>(filled(parsed(Records(11).text(4000)).get()));
  const int64_t atFirst = workMeter.valueBytes;
  {
    const auto document = parsed(Records(11).text(4000));
    const int64_t ofTree = workMeter.valueBytes;
    const size_t elements = walked(Kind::Element, name("a").get(), document.get(), nullptr).size();
    static_cast<void>(filled(document.get()));
    EXPECT_GT(workMeter.valueBytes - ofTree,
              static_cast<int64_t>(elements * 4 * sizeof(NSXMLNodePlace)));
    {
      const Ref<NSXMLNode> text = NSXMLNode::textWithStringValue(A("x"));
      document->rootElement()->addChild(text);
    }
    constexpr int64_t ofText = 128;
    EXPECT_LE(workMeter.valueBytes - ofTree, ofText);
    static_cast<void>(filled(document.get()));
  }
  EXPECT_EQ(workMeter.valueBytes, atFirst);
}

TEST(XMLNameIndex, TakesFourBytesForEachElement) {
  const auto document = parsed(Records(12).text(4000));
  const int64_t before = workMeter.valueBytes;
  const auto index = NSXMLNameIndex::ofElements(document.get());
  constexpr int64_t ofNames = 1024;
  EXPECT_LE(workMeter.valueBytes - before, 4001 * 4 + ofNames);
  EXPECT_EQ(listed(index->nodes(name("r").get())).size(), 1U);
}

// --- threads -------------------------------------------------------------------------------------

TEST(XMLTreeIndexesThreads, AskOneDocumentAtOnce) {
  const NSXMLExpandedName* const a = name("a").get();
  const NSXMLValueKey key{name("a"), {}, name("x")};
  for (uint32_t seed = 0; seed < 4; ++seed) {
    const auto document = parsed(Records(seed).text(1000));
    NSXMLNode* const root = document->rootElement();
    const Nodes expected = walked(Kind::Element, a, root, nullptr);
    const Nodes ofValue = nodesByValue(root, key)[u"3"];
    std::atomic<int> answers = 0;
    const auto ask = [&] {
      for (int turn = 0; turn < 20; ++turn) {
        if (const auto found = indexed(a, root)) {
          EXPECT_EQ(*found, expected);
          ++answers;
        }
        if (turn == 3) NSXMLNoteWalked(wholeWalk, document.get());
        const NSXMLIndexedWays known = NSXMLIndexedWays::of(document.get());
        const NSXMLWayStep anywhere{true, a, nullptr};
        if (known.elements) {
          const auto count = known.elements->countAlong({&anywhere, 1});
          EXPECT_EQ(count.value_or(expected.size()), expected.size());
        }
        const NSXMLIndexesRef indexes = NSXMLTreeIndexes::of(root);
        if (const auto* values = indexes->values(key, wholeWalk)) {
          EXPECT_EQ(listed(values->nodes(A("3"))), ofValue);
          ++answers;
        }
        std::this_thread::yield();
      }
    };
    std::vector<std::thread> threads;
    for (int i = 0; i < 4; ++i) threads.emplace_back(ask);
    for (auto& thread : threads) thread.join();
    EXPECT_GT(answers, 0);
  }
}

}  // namespace
}  // namespace xquery

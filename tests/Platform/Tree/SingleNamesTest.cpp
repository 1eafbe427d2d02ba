// What is known of the names that no node has two children of, against looking at all children.
#include "Platform/Base/WorkMeter.h"
#include "Platform/Tree/Names.h"
#include "Platform/Tree/SingleNames.h"
#include "Platform/Tree/TreeIndexes.h"
#include "Platform/Tree/XMLTestSupport.h"

#include <gtest/gtest.h>

#include <random>
#include <set>
#include <string>
#include <thread>
#include <vector>

namespace xquery {
namespace {

std::vector<NSXMLNode*> elementsOf(NSXMLNode* root) {
  std::vector<NSXMLNode*> found;
  for (NSXMLNode* node = root; node; node = node->nextNode()) {
    if (node->kind() == Kind::Element) found.push_back(node);
  }
  return found;
}

bool hasNamesake(const NSXMLNode* element) {
  const NSXMLNode* const parent = element->parent();
  for (const NSXMLNode* each = parent->firstChild(); each; each = each->nextSibling()) {
    const bool isNamed = each->kind() == Kind::Element && each != element;
    if (isNamed && each->expandedName() == element->expandedName()) return true;
  }
  return false;
}

// As written, of those elements that are said to be the only ones of their names.
std::set<std::string> singleNames(NSXMLNode* root) {
  std::set<std::string> names;
  for (const NSXMLNode* element : elementsOf(root)) {
    if (NSXMLTreeIndexes::isSingle(element)) names.insert(element->nameView().utf8());
  }
  return names;
}

// Enough nodes behind the content for a tree that is indexed.
std::string large(const std::string& content) {
  std::string text = "<r xmlns:p='urn:n' xmlns:q='urn:n'>" + content;
  for (int i = 0; i < 300; ++i) text += "<z/>";
  return text + "</r>";
}

using Names = std::set<std::string>;

TEST(XMLSingleNames, AreThoseOfOneChildEach) {
  const auto names = [](const std::string& content) {
    return singleNames(parsed(large(content)).get());
  };
  EXPECT_EQ(names(""), Names({"r"}));
  EXPECT_EQ(names("<a><b/></a><a><b/>t<c/></a>"), Names({"b", "c", "r"}));
  EXPECT_EQ(names("<a><b/></a><a><b/><c/><b/></a>"), Names({"c", "r"}));
  EXPECT_EQ(names("<a><b/><b/></a><a><b/></a>"), Names({"r"}));
  EXPECT_EQ(names("<a><a><a/></a></a>"), Names({"a", "r"}));
  EXPECT_EQ(names("<a><a/><a/></a>"), Names({"r"}));
}

// A name is what it means.
TEST(XMLSingleNames, AreExpandedNames) {
  const auto names = [](const std::string& content) {
    return singleNames(parsed(large(content)).get());
  };
  EXPECT_EQ(names("<a><p:b/><q:b/></a>"), Names({"a", "r"}));
  EXPECT_EQ(names("<a><p:b/><b/></a>"), Names({"a", "b", "p:b", "r"}));
  EXPECT_EQ(names("<a><b/><b xmlns='urn:n'/></a>"), Names({"a", "b", "r"}));
  EXPECT_EQ(names("<a><p:b/><b xmlns='urn:n'/></a>"), Names({"a", "r"}));
}

// Where a parent comes after a later one, nothing is known.
TEST(XMLSingleNames, AreNotToldWhereParentsComeInAnotherOrder) {
  const auto document = parsed(large("<a><a><b/></a><b/></a>"));
  EXPECT_EQ(singleNames(document.get()), Names({"a", "r"}));
}

TEST(XMLSingleNames, HaveNoNamesakesInAnyDocument) {
  size_t count = 0;
  for (uint32_t seed = 0; seed < 300; ++seed) {
    std::mt19937 random(seed);
    std::string content;
    std::vector<std::string> open;
    const size_t names = 1 + random() % 12;
    for (int i = 0; i < 60; ++i) {
      const std::string name = std::string(random() % 3 ? "" : "p:") +
                               static_cast<char>('a' + static_cast<char>(random() % names));
      content += "<" + name + ">" + (random() % 3 ? "" : "text");
      open.push_back(name);
      while (!open.empty() && random() % 2) {
        content += "</" + open.back() + ">";
        open.pop_back();
      }
    }
    for (; !open.empty(); open.pop_back()) content += "</" + open.back() + ">";
    const auto document = parsed(large(content));
    for (const NSXMLNode* element : elementsOf(document.get())) {
      if (!NSXMLTreeIndexes::isSingle(element)) continue;
      ++count;
      ASSERT_FALSE(hasNamesake(element)) << element->nameView().utf8() << " in " << content;
    }
  }
  EXPECT_GT(count, 1000U);
}

// Who reads what our own reader leaves makes the same of it.
TEST(XMLSingleNames, AreKnownWhoeverReadsTheDocument) {
  const std::string content = large("<a><b/></a><a><b/></a>");
  const auto ours = parsed(content);
  const auto others = parsed("<!DOCTYPE r [<!ENTITY e 'text'>]>" + content);
  EXPECT_EQ(singleNames(ours.get()), Names({"b", "r"}));
  EXPECT_EQ(singleNames(others.get()), Names({"b", "r"}));
}

TEST(XMLSingleNames, AreAsManyAsAreToldApart) {
  std::string content;
  const size_t most = NSXMLElementLog::mostNames;
  for (size_t i = 0; i < most + 50; ++i) {
    content += "<e><n" + std::to_string(i) + "/></e>";
  }
  const auto document = parsed("<z><r>" + content + "</r></z>");
  // Beside those of the first elements, of which "e" is not single.
  EXPECT_EQ(singleNames(document.get()).size(), most - 1);
}

TEST(XMLSingleNames, AreNotKnownOfSmallTreesAndOfCopies) {
  EXPECT_EQ(singleNames(parsed("<r><a/></r>").get()), Names());
  const auto document = parsed(large("<a><b/></a>"));
  EXPECT_EQ(singleNames(document->copy().get()), Names());
}

TEST(XMLSingleNames, AreForgottenAtAnyChange) {
  const auto fresh = [] { return parsed(large("<a><b/></a>")); };
  {
    const auto document = fresh();
    ASSERT_TRUE(singleNames(document.get()).contains("b"));
    auto* const a = cast<NSXMLElement>(document->rootElement()->firstChild());
    a->addChild(NSXMLElement::elementWithName(A("b")));
    EXPECT_EQ(singleNames(document.get()), Names());
  }
  {
    const auto document = fresh();
    const Ref<NSXMLNode> taken = document->rootElement()->firstChild();
    taken->detach();
    EXPECT_EQ(singleNames(document.get()), Names());
    EXPECT_EQ(singleNames(taken.get()), Names());
  }
  {
    const auto document = fresh();
    document->rootElement()->firstChild()->firstChild()->setStringValue(A("t"));
    EXPECT_EQ(singleNames(document.get()), Names());
  }
}

TEST(XMLSingleNames, CountTowardsTheCeilingUntilTheyGo) {
  const std::string text = large("<a><b/></a>");
  static_cast<void>(parsed(text));
  const int64_t before = workMeter.valueBytes;
  { const auto document = parsed(text); }
  EXPECT_EQ(workMeter.valueBytes, before);
}

TEST(XMLSingleNamesThreads, AreAskedWhileIndexesAreMade) {
  const auto document = parsed(large("<a><b/></a><a><b/></a>"));
  NSXMLNode* const root = document->rootElement();
  const NSXMLExpandedNameRef z({}, A("z"));
  const auto ask = [&] {
    for (int turn = 0; turn < 50; ++turn) {
      static_cast<void>(NSXMLIndexedElements(z.get(), root, nullptr));
      EXPECT_EQ(singleNames(root), Names({"b", "r"}));
    }
  };
  std::vector<std::thread> threads;
  for (int i = 0; i < 3; ++i) threads.emplace_back(ask);
  for (auto& thread : threads) thread.join();
}

}  // namespace
}  // namespace xquery

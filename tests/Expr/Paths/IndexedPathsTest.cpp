// Names below a node, found by the index of the tree or by a walk: nobody can tell. A wildcard with
// a question for the name is never found by an index.
#include "xquery/Collection.h"
#include "xquery/XMLNode.h"

#include <gtest/gtest.h>

#include <random>
#include <string>
#include <utility>
#include <vector>

namespace xquery {
namespace {

using Items = std::vector<const NSObject*>;

const std::pair<const char*, const char*> sameQueries[] = {
    {"//a", "//*[local-name() = 'a']"},
    {"//a/b", "//*[local-name() = 'a']/*[local-name() = 'b']"},
    {"//a//b", "//*[local-name() = 'a']//*[local-name() = 'b']"},
    {"/r/descendant::c", "/r/descendant::*[local-name() = 'c']"},
    {"//a[@x = '3']", "//*[local-name() = 'a'][@x = '3']"},
    {"//c[1]", "//*[local-name() = 'c'][1]"},
    {"//b[2]/following::a", "//*[local-name() = 'b'][2]/following::*[local-name() = 'a']"},
    {"//a/descendant-or-self::a", "//*[local-name() = 'a']/descendant-or-self::*[name() = 'a']"},
    {"for $p in /r/* return $p//b", "for $p in /r/* return $p//*[local-name() = 'b']"},
    {"//none", "//*[local-name() = 'none']"},
};

Ref<NSXMLDocument> randomDocument(uint32_t seed) {
  std::mt19937 random(seed);
  std::string text = "<r>";
  std::vector<char> open;
  for (int i = 0; i < 1500; ++i) {
    open.push_back("abcd"[random() % 4]);
    text += std::string("<") + open.back() + " x='" + std::to_string(random() % 5) + "'>t";
    while (!open.empty() && (random() % 2 != 0 || open.size() > 8)) {
      text += std::string("</") + open.back() + ">";
      open.pop_back();
    }
  }
  for (; !open.empty(); open.pop_back()) text += std::string("</") + open.back() + ">";
  return NSXMLDocument::documentWithData(text + "</r>", NSXMLNodePreserveWhitespace);
}

Items evaluated(NSXMLNode& item, const char* query) {
  const Ref<NSArray> result = item.objectsForXQuery(NSString::stringWithASCII(query));
  EXPECT_TRUE(result) << query;
  Items items;
  for (const Value& each : result->objects()) items.push_back(each.get());
  return items;
}

void expectTheSame(NSXMLNode& item) {
  for (const auto& [named, asked] : sameQueries) {
    const Items expected = evaluated(item, asked);
    for (int turn = 0; turn < 3; ++turn) EXPECT_EQ(evaluated(item, named), expected) << named;
  }
}

TEST(IndexedPaths, AnswerWhatWalksDo) {
  for (uint32_t seed = 0; seed < 4; ++seed) expectTheSame(*randomDocument(seed));
}

TEST(IndexedPaths, SeeEveryChangeOfTheTree) {
  const Ref<NSXMLDocument> document = randomDocument(9);
  NSXMLElement* root = document->rootElement();
  expectTheSame(*document);
  const auto element = NSXMLElement::elementWithName(NSStringView::ascii("a"));
  element->addChild(NSXMLElement::elementWithName(NSStringView::ascii("b")));
  root->insertChild(element, 1);
  expectTheSame(*document);
  const size_t before = evaluated(*document, "//b").size();
  element->setStringValue(NSStringView::ascii("no b"));
  EXPECT_EQ(evaluated(*document, "//b").size(), before - 1);
  expectTheSame(*document);
  const Ref<NSXMLNode> part = root->firstChild();
  part->detach();
  expectTheSame(*document);
}

}  // namespace
}  // namespace xquery

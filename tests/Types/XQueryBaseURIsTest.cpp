#include "Platform/Base/WorkMeter.h"
#include "Types/TypesTestSupport.h"
#include "Types/XQueryBaseURIs.h"
#include "Types/XQueryNodeFunctions.h"

#include <algorithm>
#include <random>
#include <vector>

namespace xquery::testing {
namespace {

// A spine of many levels, with short branches before and after it at each, and a base URI here and
// there.
std::string spine(int levels, std::mt19937& random) {
  const auto base = [&](int level) {
    return random() % 7 == 0 ? " xml:base='" + std::to_string(level) + "'" : std::string();
  };
  std::string before;
  std::string after;
  for (int level = 0; level < levels; ++level) {
    before += "<a" + base(level) + "><b" + base(level) + "/>";
    after += "t<c n='v'><?p i?></c></a>";
  }
  return "<?p i?>" + before + after;
}

std::vector<const NSXMLNode*> nodesOf(const NSXMLNode* root) {
  std::vector<const NSXMLNode*> nodes;
  for (const NSXMLNode* node = root; node; node = node->nextNode()) {
    nodes.push_back(node);
    const auto* element = dyn_cast<NSXMLElement>(node);
    if (element && element->firstAttribute()) nodes.push_back(element->firstAttribute());
  }
  return nodes;
}

// The rule, step by step.
std::string plainBaseURI(const NSXMLNode* node) {
  if (const auto* document = dyn_cast<NSXMLDocument>(node)) node = document->rootElement();
  if (node && isa<NSXMLDocument>(node->parent()) && !isa<NSXMLElement>(node)) {
    node = cast<NSXMLDocument>(node->parent())->rootElement();
  }
  for (; node; node = node->parent()) {
    const auto* element = dyn_cast<NSXMLElement>(node);
    const NSXMLNode* base = element ? element->attributeForName(view("xml:base")) : nullptr;
    if (base) return utf8(base->stringValue());
  }
  return "";
}

void expectAlike(XQueryBaseURIs& baseURIs, const std::vector<const NSXMLNode*>& nodes) {
  for (const NSXMLNode* node : nodes) {
    const std::string plain = plainBaseURI(node);
    ASSERT_EQ(utf8(baseURIs.ofNode(node)), plain);
    ASSERT_EQ(utf8(XQueryNodeBaseURI(node)), plain);
  }
}

TEST(BaseURIs, AreThoseOfTheNodesInWhateverOrderTheyAreAskedFor) {
  std::mt19937 random(7);
  for (const int levels : {1, 20, 300, 700}) {
    const auto document = parse(spine(levels, random));
    std::vector<const NSXMLNode*> nodes = nodesOf(document.get());
    XQueryBaseURIs baseURIs;
    expectAlike(baseURIs, nodes);
    std::reverse(nodes.begin(), nodes.end());
    expectAlike(baseURIs, nodes);
    std::shuffle(nodes.begin(), nodes.end(), random);
    expectAlike(baseURIs, nodes);
  }
}

TEST(BaseURIs, AreThoseOfTheTreeAsItHasBecome) {
  std::mt19937 random(11);
  const auto document = parse(spine(400, random));
  XQueryBaseURIs baseURIs;
  const std::vector<const NSXMLNode*> nodes = nodesOf(document.get());
  expectAlike(baseURIs, nodes);
  NSXMLElement* element = document->rootElement();
  for (int level = 0; level < 10; ++level)
    element = cast<NSXMLElement>(element->lastChild()->previousSibling()->previousSibling());
  element->addAttribute(NSXMLNode::attributeWithName(view("xml:base"), view("new"),
                                                     view("http://www.w3.org/XML/1998/namespace")));
  expectAlike(baseURIs, nodes);
  element->attributeForName(view("xml:base"))->setStringValue(view("newer"));
  expectAlike(baseURIs, nodes);
}

TEST(BaseURIs, OfSeveralTreesAreToldApart) {
  std::mt19937 random(13);
  const auto one = parse(spine(300, random));
  const auto other = parse(spine(300, random));
  const std::vector<const NSXMLNode*> ofOne = nodesOf(one.get());
  const std::vector<const NSXMLNode*> ofOther = nodesOf(other.get());
  XQueryBaseURIs baseURIs;
  std::vector<const NSXMLNode*> mixed;
  for (size_t at = 0; at < std::min(ofOne.size(), ofOther.size()); at += 97) {
    mixed.push_back(ofOne[at]);
    mixed.push_back(ofOther[at]);
  }
  expectAlike(baseURIs, mixed);
}

// Steps of work that asking for all nodes in document order takes.
int64_t workForAll(const NSXMLDocument& document) {
  constexpr int64_t steps = int64_t{1} << 40;
  XQueryBaseURIs baseURIs;
  const std::vector<const NSXMLNode*> nodes = nodesOf(&document);
  const auto former = workMeter.stepsLeft;
  workMeter.stepsLeft = steps;
  for (const NSXMLNode* node : nodes) baseURIs.ofNode(node);
  const int64_t work = steps - workMeter.stepsLeft;
  workMeter.stepsLeft = former;
  return work;
}

// Climbing from each node would take some 400,000.
TEST(BaseURIs, OfADeepTreeTakeWorkInProportionToIt) {
  std::mt19937 random(17);
  EXPECT_LT(workForAll(*parse(spine(8000, random))), 8000);
}

TEST(BaseURIs, LeaveNoMemoryThatCounts) {
  std::mt19937 random(19);
  const auto document = parse(spine(2000, random));
  const int64_t before = workMeter.valueBytes;
  {
    XQueryBaseURIs baseURIs;
    for (const NSXMLNode* node : nodesOf(document.get())) baseURIs.ofNode(node);
    EXPECT_GT(workMeter.valueBytes, before);
    baseURIs.clear();
  }
  // The tree has the head of its indexes now.
  EXPECT_LE(workMeter.valueBytes, before + 1024);
}

}  // namespace
}  // namespace xquery::testing

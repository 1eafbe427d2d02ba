// What is made of the record of a document's elements is what a walk through the document finds.
#include "Platform/Base/LookCounter.h"
#include "Platform/Base/WorkMeter.h"
#include "Platform/Text/TextTestSupport.h"
#include "Platform/Tree/ElementLog.h"
#include "Platform/Tree/NameIndex.h"
#include "Platform/Tree/Names.h"
#include "Platform/Tree/TreeBuilder.h"
#include "Platform/Tree/TreeIndexes.h"
#include "Platform/Tree/XMLTestSupport.h"

#include <gtest/gtest.h>

#include <array>
#include <map>
#include <memory>
#include <random>
#include <string>
#include <vector>

namespace xquery {
namespace {

struct Logged {
  Ref<NSXMLNode> document;
  std::unique_ptr<NSXMLElementLog> log = std::make_unique<NSXMLElementLog>();
};

// Builds what the text says in single letters, for an element of that name: "ab)c))" is
// <a><b/><c/></a>. A digit is a text of so many times a hundred bytes, '?' an instruction.
Logged logged(std::string_view text) {
  Logged made;
  NSXMLTreeBuilder builder(256, 128);
  std::map<char, std::pair<const NSXMLName*, NSXMLElementLog::Number>> names;
  const auto nameOf = [&](char letter) -> auto& {
    auto& found = names[letter];
    if (!found.first) {
      found.first = NSXMLInternName(A(std::string(1, letter)), {});
      builder.tree().adopt(found.first);
    }
    return found;
  };
  builder.openDocument();
  for (const char each : text) {
    if (each == ')') {
      made.log->close();
      builder.close();
    } else if (each == '?') {
      made.log->addInstruction();
      builder.addInstruction(nameOf('p').first, A("x"));
    } else if (each >= '0' && each <= '9') {
      builder.addLeaf(Kind::Text, A(std::string(static_cast<size_t>(each - '0') * 100 + 1, 't')));
    } else {
      auto& [name, number] = nameOf(each);
      const NSXMLNode& parent = *builder.current();
      made.log->open(builder.openElement(name), name, number, parent);
    }
  }
  made.document = builder.finish();
  return made;
}

const NSXMLExpandedName* expanded(char letter) {
  static std::map<char, NSXMLExpandedNameRef> held;
  auto& found = held[letter];
  if (!found) found = NSXMLExpandedNameRef({}, A(std::string(1, letter)));
  return found.get();
}

std::vector<const NSXMLNode*> listed(NSXMLNodeSpan nodes) {
  return {nodes.begin(), nodes.end()};
}

// Nested to any depth; many that end at once. With each way several times, so that they are of use.
std::string generated(std::mt19937& random, size_t count, size_t copies) {
  std::string body;
  size_t depth = 0;
  const size_t most = 2 + random() % 40;
  for (size_t i = 0; i < count; ++i) {
    body += static_cast<char>('a' + random() % 4);
    ++depth;
    if (random() % 3 == 0) body += "0123?"[random() % 5];
    while (depth > 0 && (depth > most || random() % 2)) {
      for (size_t ends = random() % 8 ? 1 : depth; ends > 0; --ends, --depth) body += ')';
      if (random() % 3 == 0) body += '0';
    }
  }
  body += std::string(depth, ')');
  std::string text = "r";
  for (size_t i = 0; i < copies; ++i) text += body;
  return text + ")";
}

std::vector<std::vector<NSXMLWayStep>> generatedSteps(std::mt19937& random) {
  std::vector<std::vector<NSXMLWayStep>> all;
  for (int i = 0; i < 20; ++i) {
    std::vector<NSXMLWayStep> steps;
    if (random() % 4) steps.push_back({false, expanded('r'), nullptr});
    for (size_t more = 1 + random() % 3; more > 0; --more) {
      const bool isNamed = random() % 4 != 0;
      const char letter = static_cast<char>('a' + random() % 4);
      steps.push_back({random() % 3 == 0, isNamed ? expanded(letter) : nullptr, nullptr});
    }
    all.push_back(std::move(steps));
  }
  return all;
}

TEST(XMLElementLog, TellsNamesAndWaysAsAWalkDoes) {
  std::mt19937 random(1);
  size_t counted = 0;
  for (int round = 0; round < 200; ++round) {
    const std::string text = generated(random, random() % 60, 30);
    const Logged made = logged(text);
    const auto walked = NSXMLNameIndex::ofElements(made.document.get());
    const auto index = NSXMLNameIndex::ofElements(*made.log, made.document.get());
    EXPECT_EQ(index->hasInstructions(), walked->hasInstructions());
    for (const char letter : std::string("abcdrpz")) {
      ASSERT_EQ(listed(index->nodes(expanded(letter))), listed(walked->nodes(expanded(letter))))
          << text;
    }
    const auto allSteps = generatedSteps(random);
    for (const auto& steps : allSteps) EXPECT_FALSE(index->countAlong(steps));
    EXPECT_TRUE(index->asksForWays());
    index->addWays(*made.log);
    EXPECT_FALSE(index->asksForWays());
    for (const auto& steps : allSteps) {
      const auto count = index->countAlong(steps);
      const auto expected = walked->countAlong(steps);
      // What runs on is told of names here, and of ways there.
      if (count || !expected) {
        ASSERT_EQ(count, expected) << text;
      } else {
        EXPECT_TRUE(steps.front().isDeep || steps.size() > 1);
      }
      if (count) ++counted;
    }
  }
  EXPECT_GT(counted, 1000U);
}

// So that elements lie in many blocks, far from each other.
TEST(XMLElementLog, IsOfTreesOfAnySize) {
  std::mt19937 random(2);
  const Logged made = logged(generated(random, 200'000, 1));
  const auto walked = NSXMLNameIndex::ofElements(made.document.get());
  const auto index = NSXMLNameIndex::ofElements(*made.log, made.document.get());
  index->addWays(*made.log);
  for (const char letter : std::string("abcdr")) {
    ASSERT_EQ(listed(index->nodes(expanded(letter))), listed(walked->nodes(expanded(letter))));
  }
  EXPECT_EQ(made.log->count(), 200'001U);
}

TEST(XMLElementLog, KnowsHowManyHaveEndedAtAnyDepth) {
  const auto most = size_t{NSXMLElementLog::manyEnded};
  for (const size_t levels : {most - 1, most, most + 1, size_t{100'000}}) {
    const std::string down(levels, 'b');
    const std::string up(levels, ')');
    const Logged made = logged("a" + down + up + down + up + "c))");
    const auto index = NSXMLNameIndex::ofElements(*made.log, made.document.get());
    index->addWays(*made.log);
    const std::vector<NSXMLWayStep> steps = {{false, expanded('a'), nullptr},
                                             {false, expanded('c'), nullptr}};
    // More ways than are kept, or than are of use.
    if (levels < 1000) {
      const auto walked = NSXMLNameIndex::ofElements(made.document.get());
      EXPECT_EQ(index->countAlong(steps), walked->countAlong(steps)) << levels;
    } else {
      EXPECT_FALSE(index->countAlong(steps));
    }
    EXPECT_EQ(index->nodes(expanded('b')).size(), 2 * levels);
  }
}

TEST(XMLElementLog, IsGivenUpWhereThereAreMoreNamesThanNumbers) {
  for (const size_t names : {NSXMLElementLog::mostNames - 1, NSXMLElementLog::mostNames}) {
    std::string text = "<r>";
    for (size_t i = 0; i < names; ++i) text += "<e" + std::to_string(i) + "/>";
    const auto document = parsed(text + "</r>");
    const NSXMLExpandedNameRef last({}, A("e" + std::to_string(names - 1)));
    const NSXMLNode* const root = document->rootElement();
    const bool isLogged = names < NSXMLElementLog::mostNames;
    for (int turn = 0; turn < 2; ++turn) {
      const auto found = NSXMLIndexedElements(last.get(), root, nullptr);
      ASSERT_EQ(found.has_value(), isLogged || turn > 0);
      if (found) {
        EXPECT_EQ(found->nodes.size(), 1U);
      }
    }
  }
}

TEST(XMLElementLog, ThatIsGivenUpTakesNothingMore) {
  Logged made = logged("abc)))");
  EXPECT_TRUE(made.log->isComplete());
  made.log->giveUp();
  EXPECT_FALSE(made.log->isComplete());
  NSXMLElementLog::Number number = 0;
  const auto* const element = cast<NSXMLElement>(made.document->firstChild());
  made.log->open(element, element->nodeName(), number, *made.document);
  size_t count = 0;
  made.log->forEach([&](const NSXMLNode*, uint32_t, uint32_t) { ++count; });
  EXPECT_EQ(count, 0U);
}

TEST(XMLElementLog, CountsTowardsTheCeiling) {
  const int64_t before = workMeter.valueBytes;
  {
    const Logged made = logged("r" + std::string(2000, 'a') + std::string(2001, ')'));
    Logged other = logged("r" + std::string(2000, 'a') + std::string(2001, ')'));
    const int64_t withLog = workMeter.valueBytes;
    other.log = nullptr;
    EXPECT_GE(withLog - workMeter.valueBytes, 2001 * 4);
    EXPECT_LE(withLog - workMeter.valueBytes, 2001 * 4 * 2 + 1024);
  }
  EXPECT_EQ(workMeter.valueBytes, before);
}

}  // namespace
}  // namespace xquery

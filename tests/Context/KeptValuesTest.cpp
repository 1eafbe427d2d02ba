#include "Context/KeptValues.h"
#include "Expr/XQueryLeaves.h"
#include "Functions/FunctionsTesting.h"
#include "Platform/Tree/Arena.h"
#include "xquery/xquery.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <functional>
#include <memory>
#include <string>
#include <string_view>
#include <vector>

namespace xquery {
namespace {

using functiontest::integer;
using functiontest::string;

std::string uses(XQueryKeptValues& values, const std::vector<Value>& dependencies) {
  const Ref<XQueryExpr> owner = XQueryLiteral::literalWithValue(integer(0));
  std::string text;
  for (const Value& dependency : dependencies) {
    if (values.looksAway(*owner)) {
      text += "-";
      continue;
    }
    std::shared_ptr<XQueryKeptValue> kept;
    switch (values.use(*owner, {&dependency, 1}, false, kept)) {
      case XQueryKeptValues::Use::First:
        text += "1";
        break;
      case XQueryKeptValues::Use::Second:
        text += "2";
        values.keep(*owner, {&dependency, 1}, nullptr);
        break;
      case XQueryKeptValues::Use::Further:
        text += "+";
        break;
    }
  }
  return text;
}

TEST(KeptValues, KnowsTheUsesInARowWithTheSameDependencies) {
  XQueryKeptValues values;
  const Value a = string("a");
  const Value b = string("b");
  EXPECT_EQ(uses(values, {a, a, a, a, b, b, b, a, b, a}), "12++12++++");
}

TEST(KeptValues, RemembersTheDependenciesThatWereUsedLast) {
  XQueryKeptValues values;
  const Value a = string("a"), b = string("b"), c = string("c"), d = string("d");
  EXPECT_EQ(uses(values, {a, b, a, b, a, c, a, d, a, b}), "1122+1+1+1");
}

TEST(KeptValues, LooksNowAndThenOnlyAfterManyFirstUses) {
  XQueryKeptValues values;
  std::vector<Value> dependencies;
  for (int i = 0; i < 1000; ++i) dependencies.push_back(string(std::to_string(i)));
  const Value again = string("again");
  dependencies.insert(dependencies.end(), 50, again);
  const std::string text = uses(values, dependencies);
  EXPECT_EQ(text.find('-'), 16U);
  EXPECT_LT(std::count(text.begin(), text.begin() + 1000, '1'), 100);
  EXPECT_GT(text.find('2'), 1000U);
  EXPECT_EQ(text.substr(text.find('2') + 1), std::string(text.size() - text.find('2') - 1, '+'));
  EXPECT_EQ(text.back(), '+');
}

TEST(KeptValues, AreMadeAtTheFirstUseWhereThatIsAskedFor) {
  XQueryKeptValues values;
  const Ref<XQueryExpr> owner = XQueryLiteral::literalWithValue(integer(0));
  const Value a = string("a");
  const Value b = string("b");
  std::string text;
  for (const Value& dependency : {a, a, b, b, b, a}) {
    std::shared_ptr<XQueryKeptValue> kept;
    const auto use = values.useAtOnce(*owner, {&dependency, 1}, false, kept);
    text += use == XQueryKeptValues::Use::First ? "1" : kept ? "+" : "-";
    if (!kept) values.keep(*owner, {&dependency, 1}, std::make_shared<XQueryKeptValue>());
  }
  EXPECT_EQ(text, "-+-+++");
}

TEST(KeptValues, AreNotKeptForOtherDependencies) {
  XQueryKeptValues values;
  const Ref<XQueryExpr> owner = XQueryLiteral::literalWithValue(integer(0));
  const Value a = string("a");
  const Value b = string("b");
  std::shared_ptr<XQueryKeptValue> kept;
  values.useAtOnce(*owner, {&a, 1}, false, kept);
  for (const char* other : {"b", "c", "d"}) {
    const Value dependency = string(other);
    values.useAtOnce(*owner, {&dependency, 1}, false, kept);
  }
  values.keep(*owner, {&a, 1}, std::make_shared<XQueryKeptValue>());
  values.useAtOnce(*owner, {&a, 1}, false, kept);
  EXPECT_FALSE(kept);
  values.useAtOnce(*owner, {&b, 1}, false, kept);
  EXPECT_FALSE(kept);
}

// --- what is kept only while nothing has changed -------------------------------------------------

const Ref<XQueryExpr>& anyExpression() {
  static const Ref<XQueryExpr> expression = XQueryLiteral::literalWithValue(integer(0));
  return expression;
}

// "1", "2" or "+", as above.
char useOf(XQueryKeptValues& values, const Value& dependency) {
  std::shared_ptr<XQueryKeptValue> kept;
  const auto use = values.use(*anyExpression(), {&dependency, 1}, false, kept);
  if (use == XQueryKeptValues::Use::Second) {
    values.keep(*anyExpression(), {&dependency, 1}, std::make_shared<XQueryKeptValue>());
  }
  return use == XQueryKeptValues::Use::First ? '1' : kept ? '+' : '2';
}

Ref<NSXMLElement> element(std::string_view name) {
  return NSXMLElement::elementWithName(NSStringView::ascii(name));
}

TEST(KeptValues, AnyChangeOfAFinishedTreeEndsThem) {
  const auto parent = element("p");
  const auto child = element("c");
  const auto attribute =
      NSXMLNode::attributeWithName(NSStringView::ascii("k"), NSStringView::ascii("v"));
  parent->addAttribute(attribute);
  const std::vector<std::function<void()>> changes = {
      [&] { parent->addChild(child); },
      [&] { child->detach(); },
      [&] { parent->insertChild(element("d"), 0); },
      [&] { attribute->setStringValue(NSStringView::ascii("w")); },
      [&] { parent->setStringValue(NSStringView::ascii("text")); },
      [&] { parent->removeAttributeForName(NSStringView::ascii("k")); },
      [&] { NSXMLDocument::document()->addChild(element("e")); },
  };
  XQueryKeptValues values;
  for (const auto& change : changes) {
    EXPECT_EQ(useOf(values, parent), '1');
    EXPECT_EQ(useOf(values, parent), '2');
    EXPECT_EQ(useOf(values, parent), '+');
    EXPECT_EQ(useOf(values, parent), '+');
    change();
  }
}

TEST(KeptValues, AnotherValueOfAGlobalEndsThem) {
  XQueryKeptValues values;
  const Value a = string("a");
  EXPECT_EQ(useOf(values, a), '1');
  EXPECT_EQ(useOf(values, a), '2');
  EXPECT_EQ(useOf(values, a), '+');
  values.noteGlobalChange();
  EXPECT_EQ(useOf(values, a), '1');
}

// What a constructor does to the node that it fills is no change of what is finished, and what is
// inside that node is not kept.
TEST(KeptValues, NothingIsKeptOfANodeThatIsBeingFilled) {
  XQueryKeptValues values;
  const auto done = element("done");
  EXPECT_EQ(useOf(values, done), '1');
  EXPECT_EQ(useOf(values, done), '2');
  const auto growing = element("growing");
  {
    const NSXMLUnfinished unfinished(*growing);
    NSXMLTree::insertChild(growing.get(), element("c").get(), nullptr);
    EXPECT_EQ(useOf(values, done), '+');
    EXPECT_TRUE(XQueryAreSettled(std::vector<Value>{done}, false));
    EXPECT_FALSE(XQueryAreSettled(std::vector<Value>{growing}, false));
    EXPECT_FALSE(XQueryAreSettled(std::vector<Value>{done, growing->firstChild()}, false));
  }
  EXPECT_TRUE(XQueryAreSettled(std::vector<Value>{growing->firstChild()}, false));
}

TEST(KeptValues, WhatIsAroundANodeIsSettledInADocument) {
  const auto lone = element("lone");
  const auto document = NSXMLDocument::document();
  const auto root = element("root");
  document->addChild(root);
  const Value all = NSArray::arrayWithObjects({root, document, integer(1), lone});
  EXPECT_TRUE(XQueryAreSettled(std::vector<Value>{root, document, integer(1)}, true));
  EXPECT_TRUE(XQueryAreSettled({&all, 1}, false));
  EXPECT_FALSE(XQueryAreSettled({&all, 1}, true));
  const Value nested = NSArray::arrayWithObjects({all, root});
  EXPECT_TRUE(XQueryAreSettled({&nested, 1}, false));
  EXPECT_FALSE(XQueryAreSettled({&nested, 1}, true));
  // Nodes of one tree may have different roots.
  const auto cut = element("cut");
  root->addChild(cut);
  cut->detach();
  EXPECT_FALSE(XQueryAreSettled(std::vector<Value>{root, cut}, true));
  // Nothing is kept then, and nobody is asked to make it.
  const Value dependency = lone;
  std::shared_ptr<XQueryKeptValue> kept;
  XQueryKeptValues values;
  values.use(*anyExpression(), {&dependency, 1}, true, kept);
  EXPECT_EQ(values.use(*anyExpression(), {&dependency, 1}, true, kept),
            XQueryKeptValues::Use::Further);
  EXPECT_FALSE(kept);
}

}  // namespace
}  // namespace xquery

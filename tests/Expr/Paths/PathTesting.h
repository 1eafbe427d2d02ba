// Shorthands for building paths by hand and for reading their results.
#pragma once

#include "Context/XQueryContextInternal.h"
#include "Expr/Paths/XQueryNameTest.h"
#include "Expr/Paths/XQueryPath.h"
#include "Expr/ProbeExpr.h"
#include "Expr/TypeTests/XQueryTypeDeclaration.h"
#include "Expr/XQueryLeaves.h"
#include "Expr/XQueryLists.h"
#include "Prolog/XQueryModules.h"
#include "Prolog/XQueryProlog.h"
#include "Prolog/XQueryPrologItems.h"
#include "xquery/Collection.h"
#include "xquery/Exception.h"
#include "xquery/XMLNode.h"
#include "xquery/XQuery.h"

#include <gtest/gtest.h>

#include <functional>
#include <string>
#include <string_view>
#include <vector>

namespace xquery {

inline Ref<NSString> text(std::string_view ascii) {
  return NSString::stringWithASCII(ascii);
}

inline Ref<XQueryLiteral> integer(std::string_view digits) {
  return XQueryLiteral::integerLiteralWithString(text(digits));
}
inline Ref<XQueryLiteral> string(std::string_view ascii) {
  return XQueryLiteral::stringLiteralWithString(text(ascii));
}
inline Value array(std::vector<Value> items) {
  return NSArray::arrayWithObjects(std::move(items));
}

inline Ref<XQueryExpr> name(std::string_view lexical) {
  return XQueryNameTest::nameTest(text(lexical));
}
inline Ref<XQueryExpr> anyName() {
  return XQueryWildCardNameTest::nameTest(nullptr, nullptr);
}
inline Ref<XQueryExpr> anyNode() {
  return XQueryTypeDeclaration::anyKind();
}
using Predicates = std::vector<Ref<XQueryExpr>>;
using Steps = std::vector<Ref<XQueryStep>>;
inline Ref<XQueryStep> step(int axis, Ref<XQueryExpr> test, Predicates predicates = {}) {
  auto result = XQueryAxisStep::axisStepWithAxis(axis, std::move(test));
  result->setPredicates(std::move(predicates));
  return result;
}
inline Ref<XQueryStep> filterStep(Ref<XQueryExpr> expr, Predicates predicates = {}) {
  auto result = XQueryFilterStep::filterStepWithExpr(std::move(expr));
  result->setPredicates(std::move(predicates));
  return result;
}
inline Ref<XQueryStep> rootStep() {
  return XQueryRootStep::rootStep();
}
inline Ref<XQueryStep> child(std::string_view lexical, Predicates predicates = {}) {
  return step(XQueryAxisChild, name(lexical), std::move(predicates));
}
inline Ref<XQueryStep> anyDepth() {
  return step(XQueryAxisDescendantOrSelf, anyNode());
}
inline Ref<XQueryPathExpr> path(const Steps& steps) {
  for (size_t i = 1; i < steps.size(); ++i) steps[0]->setLast(steps[i]);
  return XQueryPathExpr::pathExprWithStep(steps.empty() ? nullptr : steps[0]);
}

inline Ref<NSXMLDocument> parsed(std::string_view xml) {
  NSXMLParseError error;
  auto document = NSXMLDocument::documentWithData(xml, NSXMLNodePreserveWhitespace, &error);
  EXPECT_TRUE(document) << error.message;
  return document;
}

// An element is shown by its "id" attribute, or its name without one; other nodes as a kind test
// with their text, an attribute as @name.
inline std::string shown(const NSObject* item) {
  if (!item) return "(none)";
  switch (item->kind()) {
    case Kind::Null:
      return "()";
    case Kind::Document:
      return "doc";
    case Kind::Element: {
      const auto* element = cast<NSXMLElement>(item);
      const NSXMLNode* id = element->attributeForName(NSStringView::ascii("id"));
      return id ? id->textView().utf8() : element->nameView().utf8();
    }
    case Kind::Attribute:
      return "@" + cast<NSXMLNode>(item)->nameView().utf8();
    case Kind::Namespace:
      return "namespace(" + cast<NSXMLNode>(item)->nameView().utf8() + ")";
    case Kind::ProcessingInstruction:
      return "pi(" + cast<NSXMLNode>(item)->nameView().utf8() + ")";
    case Kind::Comment:
      return "comment(" + cast<NSXMLNode>(item)->textView().utf8() + ")";
    case Kind::Text:
      return "text(" + cast<NSXMLNode>(item)->textView().utf8() + ")";
    default:
      return XQueryItemStringValue(*item);
  }
}
// The items of a value separated by spaces; an array that is no plain sequence in brackets.
inline std::string shown(const Value& value) {
  const auto* items = dyn_cast<NSArray>(value);
  if (!items) return shown(value.get());
  std::string result = items->count() < 2 ? "[" : "";
  for (const Value& item : items->objects()) {
    if (!result.empty() && result != "[") result += " ";
    result += isa<NSArray>(item) ? "[" + shown(item) + "]" : shown(item.get());
  }
  return items->count() < 2 ? result + "]" : result;
}

// The node with that "id", or null.
inline NSXMLNode* byID(const NSXMLNode* root, std::string_view id) {
  for (const NSXMLNode* node = root; node; node = node->nextNode()) {
    const auto* element = dyn_cast<NSXMLElement>(node);
    if (!element) continue;
    const NSXMLNode* attribute = element->attributeForName(NSStringView::ascii("id"));
    if (attribute && attribute->textView() == id) return const_cast<NSXMLNode*>(node);
  }
  return nullptr;
}

class PathTesting : public testing::Test {
 protected:
  void focusOn(const Value& item, int64_t position = 1) {
    _internal(*context).setContextItem(item, position);
  }
  // Binds in a main module and evaluates.
  Value evaluate(const Ref<XQueryExpr>& expr) {
    expr->bindInfoForProlog(*prolog);
    return evaluatedOrThrown(*expr, *context);
  }
  Value evaluate(const Steps& steps) { return evaluate(path(steps)); }
  Value evaluateFrom(const Value& item, const Steps& steps) {
    focusOn(item);
    return evaluate(steps);
  }
  std::string shownFrom(const Value& item, const Steps& steps) {
    return shown(evaluateFrom(item, steps));
  }
  // "number: message" of the error that the evaluation raises, or "" when it raises none.
  std::string errorOf(const std::function<void()>& action) {
    try {
      action();
    } catch (const NSException& exception) {
      EXPECT_EQ(exception.name(), "XQueryError");
      const auto& error = _internal(*context).error();
      return std::to_string(error->err()) + ": " + error->msg()->utf8();
    }
    return "";
  }

  Ref<XQueryContext> context = XQueryContext::xqueryContext();
  Ref<XQueryProlog> prolog = XQueryProlog::prologWithItems({}, nullptr, nullptr, nullptr);
};

}  // namespace xquery

// What the tests of rules have in common: which rules did something, and documents.
#pragma once

#include "Expr/XQueryLeaves.h"
#include "Plan/Plan.h"
#include "Plan/PlanTesting.h"
#include "Plan/Rules.h"
#include "Platform/Base/WorkMeter.h"

#include <cstdint>
#include <set>
#include <string>
#include <string_view>
#include <vector>

namespace xquery::plantest {

// Of the rules that have no tests of their own.
inline size_t operatorsIn(std::string_view text) {
  static const std::set<std::string_view> others = {
      "texts",      "short paths",      "constants",      "counts",     "sets",
      "walks",      "operands",         "constructors",   "lists",      "nearby nodes",
      "one by one", "ranges",           "paths in paths", "set counts", "loop counts",
      "stretches",  "early conditions", "set filters",    "way counts", "moved paths",
      "ends"};
  return choicesIn(text, [](std::string_view rule) {
    return !others.contains(rule) && !rule.ends_with("-joins");
  });
}

// How many operators one rule puts into a query, behind those that are about every path.
inline size_t operatorsOf(std::string_view rule, std::string_view text) {
  std::vector<XQueryRule> rules;
  for (const XQueryRule& each : XQueryRules()) {
    if (each.name == "paths" || each.name == "walks" || each.name == rule) rules.push_back(each);
  }
  EXPECT_EQ(rules.size(), 3U) << rule;
  const auto query = compiled(text);
  const auto& internal = _internal(*query);
  const auto planned = XQueryPlanned(*internal.prolog(), Ref<XQueryExpr>(internal.body()), rules);
  return OperatorList(*planned).operators.size();
}

inline std::vector<std::string> resultOf(std::string_view text, const Value& contextItem = {}) {
  return sameBothWays(text, contextItem).lines;
}

inline const Value& shop() {
  static const Value parsed = document(
      "<shop><product sku='1'><price>5</price></product><product sku='2'><price>7</price>"
      "</product><product sku='3'><price>x</price></product><line><sku>2</sku></line>"
      "<line><sku>3</sku></line></shop>");
  return parsed;
}

// The literals that are left.
inline std::string bodyOf(std::string_view text) {
  const auto query = compiled(text, XQueryWay::Planned);
  const XQueryProgram program = programOf(*query);
  std::string literals;
  for (XQueryPlaceID place = 0; place < program.placeCount(); ++place) {
    const auto* literal = dyn_cast<XQueryLiteral>(program[place].expr);
    if (literal) literals += shownItem(*literal->literalValue()) + ";";
  }
  return literals;
}

// Names with and without prefixes, and instructions, which have names too.
inline const Value& names() {
  static const Value parsed = document(
      "<r xmlns:p='u'><a x='1' y='2'><b/><p:a/><?a b?></a><c><a/>t<b z='3'/></c><?b c?>"
      "<d xmlns='v'><a/></d></r>");
  return parsed;
}

// The same with so many nodes that they are indexed.
inline const Value& manyNames() {
  static const Value parsed = [] {
    std::string xml = "<r xmlns:p='u'>";
    for (int i = 0; i < 200; ++i) xml += "<a x='1'><b/><p:a/><c><b y='2'/></c></a>";
    return document(xml + "</r>");
  }();
  return parsed;
}

// How much is walked shows in how often predicates are asked: each evaluation is a step of work.
inline int64_t stepsOf(const char* text) {
  const auto query = compiled(text, XQueryWay::Planned);
  const auto context = XQueryContext::xqueryContext();
  _internal(*context).setContextItem(manyNames(), 1);
  (void)_internal(*query).body()->evaluateWithContext(*context);  // has the tree indexed
  const int64_t before = workMeter.stepsLeft;
  (void)_internal(*query).body()->evaluateWithContext(*context);
  return before - workMeter.stepsLeft;
}

}  // namespace xquery::plantest

// Programs, places and facts as texts.
#pragma once

#include "Context/XQueryContextInternal.h"
#include "Engine/ErrorPlaceText.h"
#include "Engine/XQueryInternal.h"
#include "Plan/FactsAnalysis.h"
#include "Plan/Operators/XQueryPlannedExpr.h"
#include "Plan/Program.h"
#include "Plan/Report.h"
#include "Prolog/XQueryProlog.h"
#include "xquery/xquery.h"

#include <gtest/gtest.h>

#include <array>
#include <string>
#include <string_view>
#include <unordered_map>
#include <utility>
#include <vector>

namespace xquery::plantest {

inline Ref<XQuery> compiled(std::string_view text, XQueryWay way = XQueryWay::Plain) {
  auto query = XQuery::xqueryWithSource(text, XQueryLoading(), XQueryLimits(), way);
  const auto errors = query->parseErrors();
  EXPECT_FALSE(errors) << text << "\n  "
                       << cast<XQueryError>(errors->objects().front())->description()->utf8();
  return query;
}

inline XQueryProgram programOf(const XQuery& query) {
  return XQueryProgram(*query._internal().prolog(), Ref<XQueryExpr>(query._internal().body()));
}

inline std::string joined(const std::vector<std::string>& words, const char* separator) {
  std::string text;
  for (const std::string& word : words) text += (text.empty() ? "" : separator) + word;
  return text;
}

template <class Names>
std::string bitNames(uint32_t bits, const Names& names) {
  std::vector<std::string> words;
  for (size_t bit = 0; bit < names.size(); ++bit) {
    if (bits & (1U << bit)) words.emplace_back(names[bit]);
  }
  return joined(words, "|");
}

inline std::string kindNames(XQueryItemKinds kinds) {
  static constexpr std::array<const char*, 28> names = {
      "document",  "element", "attribute", "namespace", "instruction", "comment",   "text",
      "untyped",   "string",  "boolean",   "integer",   "decimal",     "float",     "double",
      "URI",       "QName",   "dateTime",  "date",      "time",        "gregorian", "duration",
      "yearMonth", "dayTime", "hex",       "base64",    "notation",    "derived",   "other"};
  if (kinds == XQueryItems::Any) return "item";
  if (kinds == XQueryItems::Node) return "node";
  if (kinds == XQueryItems::Numeric) return "number";
  if (kinds == XQueryItems::Atomic) return "atomic";
  return bitNames(kinds, names);
}

// "1 integer", "0-1 element in order", "* item"; "none" for what is empty.
inline std::string shownItems(const XQueryFacts& facts) {
  if (facts.most == 0) return "none";
  std::string count = facts.most == 1
                          ? (facts.least == 1 ? "1" : "0-1")
                          : (facts.least == 0 ? "*" : std::to_string(facts.least) + "+");
  std::string text = count + " " + kindNames(facts.kinds);
  if (facts.most > 1 && facts.inOrder) text += " in order";
  return text;
}

inline std::string shownDeeds(const XQueryFacts& facts) {
  static constexpr std::array<const char*, 12> names = {
      "item",      "root",    "position", "size",   "globals",      "static",
      "documents", "outside", "makes",    "traces", "unrepeatable", "fails"};
  std::string text = bitNames(facts.deeds, names);
  facts.reads.forEach([&](int64_t id) { text += " $" + std::to_string(id); });
  facts.assigns.forEach([&](int64_t id) { text += " :" + std::to_string(id); });
  return text;
}

// The operators of a planned expression and all that it holds, the outermost first, but for those
// that walk a path as it is written.
class OperatorList final : public XQueryPartVisitor {
 public:
  explicit OperatorList(XQueryExpr& expr) { look(expr); }
  std::vector<const XQueryPlannedExpr*> operators;

  void part(Ref<XQueryExpr>& part, XQueryRole) override {
    if (part) look(*part);
  }
  void ownPart(XQueryExpr* part, XQueryRole) override {
    if (part) look(*part);
  }

 private:
  void look(XQueryExpr& expr) {
    const auto* planned = dyn_cast<XQueryPlannedExpr>(&expr);
    if (planned && !planned->walkedPath()) operators.push_back(planned);
    expr.visitParts(*this);
  }
};

// How often rules did something with a query, of those that `isCounted` names.
template <class IsCounted>
size_t choicesIn(std::string_view text, IsCounted isCounted) {
  const auto query = compiled(text, XQueryWay::Explained);
  size_t count = 0;
  for (const auto& entry : query->_internal().planReport()->entries()) {
    for (const auto& note : entry.notes) count += !note.isRefusal && isCounted(note.rule) ? 1 : 0;
  }
  return count;
}
inline size_t choicesOf(std::string_view rule, std::string_view text) {
  return choicesIn(text, [rule](std::string_view each) { return each == rule; });
}

inline Value document(std::string_view xml) {
  NSXMLParseError failure;
  Value parsed = NSXMLDocument::documentWithData(xml, NSXMLNodePreserveWhitespace, &failure);
  EXPECT_TRUE(parsed) << failure.message;
  return parsed;
}

// The outcome of one evaluation, told in full: the items with their types, which of them are the
// same object, the error with its number, line and text, and the focus that is left.
struct Outcome {
  std::vector<std::string> lines;
  bool operator==(const Outcome&) const = default;
};

inline std::string shownItem(const NSObject& item) {
  std::string text = XQueryItemTypeName(item) + " ";
  if (const auto* node = dyn_cast<NSXMLNode>(&item)) {
    node->appendXMLTo(text);
  } else {
    text += XQueryItemStringValue(item);
  }
  return text;
}

inline Outcome outcomeOf(const XQuery& query, const Value& contextItem,
                         const XQueryConstants& constants = {}, const XQueryLimits& limits = {}) {
  Outcome outcome;
  const auto context = XQueryContext::xqueryContext();
  context->contextSetLimits(limits);
  Ref<XQueryError> error;
  const auto items = context->evaluateXQuery(query, constants, contextItem, &error);
  if (error) {
    outcome.lines.push_back("error " + std::to_string(error->err()) + " line " +
                            std::to_string(error->line()) + " " +
                            (error->msg() ? error->msg()->utf8() : ""));
    outcome.lines.push_back(placeText(*error));
  }
  if (items) {
    std::unordered_map<const NSObject*, size_t> places;
    for (const Value& item : items->objects()) {
      const auto [first, isNew] = places.try_emplace(item.get(), outcome.lines.size());
      std::string line = shownItem(*item);
      if (!isNew) line += " as " + std::to_string(first->second);
      outcome.lines.push_back(std::move(line));
    }
  }
  const auto& left = context->_internal();
  if (left.contextItem()) {
    outcome.lines.push_back("left " + shownItem(*left.contextItem()) + " at " +
                            std::to_string(left.position()) + " of " + std::to_string(left.last()));
  }
  return outcome;
}

// Both ways agree. Answers what they come to.
inline Outcome sameBothWays(std::string_view text, const Value& contextItem = {},
                            const XQueryConstants& constants = {}) {
  const Outcome plain = outcomeOf(*compiled(text), contextItem, constants);
  const Outcome planned = outcomeOf(*compiled(text, XQueryWay::Planned), contextItem, constants);
  EXPECT_EQ(plain.lines, planned.lines) << text;
  return planned;
}

}  // namespace xquery::plantest

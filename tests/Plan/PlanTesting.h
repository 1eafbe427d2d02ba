// Programs, places and facts as texts.
#pragma once

#include "Engine/XQueryInternal.h"
#include "Plan/FactsAnalysis.h"
#include "Plan/Operators/XQueryPlannedExpr.h"
#include "Plan/Outcome.h"
#include "Plan/Program.h"
#include "Plan/Report.h"
#include "Prolog/XQueryProlog.h"
#include "xquery/xquery.h"

#include <gtest/gtest.h>

#include <array>
#include <cstdlib>
#include <string>
#include <string_view>
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

// How many there are to be, or with which to begin: what the environment says.
inline unsigned numberFrom(const char* variable, unsigned otherwise) {
  const char* value = std::getenv(variable);
  return value ? static_cast<unsigned>(std::strtoul(value, nullptr, 10)) : otherwise;
}

inline XQueryProgram programOf(const XQuery& query) {
  return XQueryProgram(*_internal(query).prolog(), Ref<XQueryExpr>(_internal(query).body()));
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
  for (const auto& entry : _internal(*query).planReport()->entries()) {
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

// Both ways agree. Answers what they come to.
inline Outcome sameBothWays(std::string_view text, const Value& contextItem = {},
                            const XQueryVariables& constants = {}) {
  const Outcome plain = outcomeOf(*compiled(text), contextItem, constants);
  const Outcome planned = outcomeOf(*compiled(text, XQueryWay::Planned), contextItem, constants);
  EXPECT_EQ(plain.lines, planned.lines) << text;
  return planned;
}

}  // namespace xquery::plantest

// Holds docs/functions.md to the registry. An entry begins with a heading
//
//   ### fn:name(arguments) as type
//
// or with a row of a table whose first cell is `fn:name(arguments) as type`, and ends where the
// next one begins.
#include "DocsExamples.h"
#include "Functions/XQueryBuiltInFunction.h"

#include <gtest/gtest.h>

#include <cctype>
#include <cstdint>
#include <cstring>
#include <set>

namespace xquery::docs {
namespace {

struct Entry {
  std::string name;  // with its prefix
  std::string type;  // of the result, as written; empty when there is none
  int line = 0;
  std::vector<Example> examples;
};

Entry entryOf(std::string_view line, int number) {
  for (const auto& [start, end] : {std::pair{"### ", ""}, std::pair{"| `", "` |"}}) {
    if (!line.starts_with(start)) continue;
    line.remove_prefix(std::strlen(start));
    if (*end) line = line.substr(0, line.find(end));
    const size_t type = line.rfind(") as ");
    return {std::string(line.substr(0, line.find('('))),
            type == line.npos ? "" : std::string(line.substr(type + 5)),
            number,
            {}};
  }
  return {};
}

std::vector<Entry> readEntries() {
  const Document document = readDocument("docs/functions.md");
  std::vector<Entry> entries;
  for (size_t i = 0; i < document.lines.size(); ++i) {
    Entry entry = entryOf(document.lines[i], static_cast<int>(i) + 1);
    if (!entry.name.empty()) entries.push_back(std::move(entry));
  }
  for (size_t i = 0; i < entries.size(); ++i) {
    for (const Example& example : document.examples) {
      const bool isBefore = i + 1 == entries.size() || example.line < entries[i + 1].line;
      if (example.line >= entries[i].line && isBefore) entries[i].examples.push_back(example);
    }
  }
  return entries;
}

// As the document names functions: "xs:string".
std::string nameOf(const XQueryBuiltInFunction::Registration& row) {
  const char* prefix = row.namespaceID == XQueryNamespaceFN    ? "fn"
                       : row.namespaceID == XQueryNamespaceXS  ? "xs"
                       : row.namespaceID == XQueryNamespaceXDT ? "xdt"
                                                               : "ext";
  return std::string(prefix) + ":" + std::string(row.localName);
}

// Whether the query calls the function of an entry, whose prefix may be left out when it is "fn".
bool calls(std::string_view query, std::string_view name) {
  const bool isStandard = name.starts_with("fn:");
  const std::string call = std::string(isStandard ? name.substr(3) : name) + "(";
  for (size_t at = 0; (at = query.find(call, at)) != query.npos; ++at) {
    const std::string_view before = query.substr(0, at);
    if (isStandard && before.ends_with("fn:")) return true;
    // "name(" is no call of name in "local-name(" and in "p:name(".
    const char last = before.empty() ? ' ' : before.back();
    if (!std::isalnum(static_cast<unsigned char>(last)) && !std::strchr("-_.:", last)) return true;
  }
  return false;
}

// Whether the query is one call of the function and nothing else.
bool isCall(std::string_view query, std::string_view name) {
  if (name.starts_with("fn:") && !query.starts_with("fn:")) name.remove_prefix(3);
  if (!query.starts_with(std::string(name) + "(")) return false;
  int depth = 0;
  for (size_t at = name.size(); at < query.size(); ++at) {
    if (query[at] == '(') ++depth;
    if (query[at] == ')' && --depth == 0) return at + 1 == query.size();
  }
  return false;
}

// Whether an item of the one type is what a signature calls by the other one.
bool isOfType(const std::string& item, const std::string& type) {
  static const std::set<std::string> numbers{"xs:double", "xs:float", "xs:decimal", "xs:integer"};
  if (type == "item()") return true;
  if (type == "node()") return item.ends_with(")") && item != "item()";
  if (type == "xdt:anyAtomicType") return !item.ends_with(")");
  if (type == "number") return numbers.contains(item);
  return item == type;
}

// The types of the result as the query names them; empty for none and for a failure.
std::vector<std::string> typesOf(const Example& example) {
  XQueryLoading loading;
  loading.moduleURL = "file://" XQUERY_SOURCE_DIR "/examples/query.xq";
  const auto query = XQuery::xqueryWithSource(std::string_view(example.query), loading);
  Ref<XQueryError> error;
  const auto items = XQueryContext::xqueryContext()->evaluateXQuery(*query, {}, {}, &error);
  std::vector<std::string> types;
  if (error || !items) return types;
  for (const Value& item : items->objects()) types.push_back(XQueryItemTypeName(*item));
  return types;
}

void expectType(const Entry& entry, const Example& example) {
  if (example.result.starts_with("error ")) return;
  std::string type = entry.type;
  ASSERT_NE(type, "none") << example.place;
  const char last = type.back();
  if (last == '?' || last == '*') type.pop_back();
  const std::vector<std::string> types = typesOf(example);
  const bool isEmpty = type == "empty()";
  EXPECT_GE(types.size(), isEmpty || last == '*' || last == '?' ? 0u : 1u) << example.place;
  EXPECT_LE(types.size(), isEmpty ? 0u : last == '*' ? SIZE_MAX : 1u) << example.place;
  for (const std::string& item : types) {
    EXPECT_TRUE(isOfType(item, type)) << example.place << " " << item << " for " << entry.type;
  }
}

TEST(FunctionsDocument, HasOneEntryForEachFunctionAndNoOther) {
  std::multiset<std::string> documented, registered;
  for (const Entry& entry : readEntries()) documented.insert(entry.name);
  for (const auto& row : XQueryBuiltInFunction::registrations()) registered.insert(nameOf(row));
  EXPECT_EQ(documented, registered);
}

TEST(FunctionsDocument, EachEntryHasAnExampleThatCallsTheFunction) {
  for (const Entry& entry : readEntries()) {
    bool isCalled = false;
    for (const Example& example : entry.examples) {
      isCalled = isCalled || calls(example.query, entry.name);
    }
    EXPECT_TRUE(isCalled) << entry.name << ", line " << entry.line;
  }
}

TEST(FunctionsDocument, ResultsHaveTheTypeOfTheSignature) {
  for (const Entry& entry : readEntries()) {
    EXPECT_NE(entry.type, "") << entry.name;
    if (entry.type.empty()) continue;
    for (const Example& example : entry.examples) {
      if (isCall(example.query, entry.name)) expectType(entry, example);
    }
  }
}

TEST(FunctionsDocument, TheIndexNamesEachFunction) {
  const Document document = readDocument("docs/functions.md");
  std::string index;
  for (const std::string& line : document.lines) {
    if (line.starts_with("- **[")) index += line + "\n";
  }
  for (const Entry& entry : readEntries()) {
    const std::string name = entry.name.starts_with("fn:") ? entry.name.substr(3) : entry.name;
    EXPECT_NE(index.find("[" + name + "](#"), index.npos) << entry.name;
  }
}

}  // namespace
}  // namespace xquery::docs

// Holds docs/functions.md to the registry and runs its examples. An entry begins with a heading
//
//   ### fn:name(arguments)
//
// or with a row of a table whose first cell is `fn:name(arguments)`, and ends where the next one
// begins; its examples are written `query` → `result`.
#include "Functions/XQueryBuiltInFunction.h"
#include "xquery/xquery.h"

#include <gtest/gtest.h>

#include <cctype>
#include <cstring>
#include <fstream>
#include <set>
#include <string>
#include <string_view>
#include <vector>

namespace xquery {
namespace {

struct Example {
  std::string query, result;
  int line = 0;
};

struct Entry {
  std::string name;  // with its prefix
  int line = 0;
  std::vector<Example> examples;
};

std::string entryName(std::string_view line) {
  for (const std::string_view start : {"### ", "| `"}) {
    if (!line.starts_with(start)) continue;
    line.remove_prefix(start.size());
    return std::string(line.substr(0, line.find('(')));
  }
  return "";
}

// The text of the code that begins at `at`, a back quote; `at` goes behind it.
std::string takeCode(std::string_view line, size_t& at) {
  const size_t end = line.find('`', at + 1);
  if (end == line.npos) return "";
  const std::string code(line.substr(at + 1, end - at - 1));
  at = end + 1;
  return code;
}

void addExamples(std::string_view line, int number, std::vector<Example>& examples) {
  constexpr std::string_view arrow = " → ";
  for (size_t at = 0; (at = line.find('`', at)) != line.npos;) {
    Example example;
    example.line = number;
    example.query = takeCode(line, at);
    if (example.query.empty()) return;
    if (line.substr(at, arrow.size()) != arrow) continue;
    at += arrow.size();
    if (at >= line.size() || line[at] != '`') continue;
    example.result = takeCode(line, at);
    examples.push_back(std::move(example));
  }
}

std::vector<Entry> readEntries() {
  std::ifstream in(std::string(XQUERY_SOURCE_DIR) + "/docs/functions.md");
  std::vector<Entry> entries;
  std::string line;
  for (int number = 1; std::getline(in, line); ++number) {
    if (const std::string name = entryName(line); !name.empty()) {
      entries.push_back({name, number, {}});
    }
    if (!entries.empty()) addExamples(line, number, entries.back().examples);
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

std::string printed(const NSObject& item) {
  if (const auto* node = dyn_cast<NSXMLNode>(&item)) return node->XMLString()->utf8();
  return XQueryItemStringValue(item);
}

// Examples that load a file find it in the folder of the examples.
std::string withBase(const std::string& query) {
  if (query.find(".xml'") == query.npos && query.find(".xsl'") == query.npos) return query;
  return "declare base-uri 'file://" XQUERY_SOURCE_DIR "/examples/'; " + query;
}

std::string evaluated(const std::string& query, XQueryWay way) {
  const auto compiled =
      XQuery::xqueryWithSource(std::string_view(query), XQueryLoading(), XQueryLimits(), way);
  const auto context = XQueryContext::xqueryContext();
  Ref<XQueryError> error;
  const auto items = context->evaluateXQuery(*compiled, {}, {}, &error);
  if (error) return "error " + std::to_string(error->err()) + " " + error->msg()->utf8();
  if (!items) return "no result";
  std::string text;
  for (const Value& item : items->objects()) text += (text.empty() ? "" : ", ") + printed(*item);
  return items->count() == 0 ? "()" : text;
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

TEST(FunctionsDocument, ExamplesGiveTheResultsThatAreSaid) {
  for (const Entry& entry : readEntries()) {
    for (const Example& example : entry.examples) {
      for (const XQueryWay way : {XQueryWay::Plain, XQueryWay::Planned}) {
        EXPECT_EQ(evaluated(withBase(example.query), way), example.result)
            << "docs/functions.md:" << example.line << " " << example.query;
      }
    }
  }
}

}  // namespace
}  // namespace xquery

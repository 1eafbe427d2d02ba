// Holds docs/errors.md to the catalogue of errors. An entry begins with a heading
//
//   ### 8: function … not defined for context
//
// the number and the text with … for each part to be filled in. The examples before the line that
// begins with "Remedy:" raise that error, those from there on raise none.
#include "DocsExamples.h"

#include <gtest/gtest.h>

#include <fstream>
#include <set>
#include <sstream>

namespace xquery::docs {
namespace {

constexpr std::string_view gap = "…";

struct Entry {
  std::string heading;  // "8: function … not defined for context"
  int line = 0;
  int remedy = 0;  // its line, 0 without one
  std::string text;
  std::vector<Example> causes, remedies;
};

std::vector<Entry> readEntries() {
  const Document document = readDocument("docs/errors.md");
  std::vector<Entry> entries;
  for (size_t i = 0; i < document.lines.size(); ++i) {
    const std::string& line = document.lines[i];
    const int number = static_cast<int>(i) + 1;
    if (line.starts_with("### ")) entries.push_back({line.substr(4), number, 0, "", {}, {}});
    if (entries.empty()) continue;
    entries.back().text += line + "\n";
    if (line.starts_with("Remedy: ")) entries.back().remedy = number;
  }
  for (size_t i = 0; i < entries.size(); ++i) {
    Entry& entry = entries[i];
    for (const Example& example : document.examples) {
      if (example.line < entry.line) continue;
      if (i + 1 < entries.size() && example.line > entries[i + 1].line) continue;
      (example.line < entry.remedy ? entry.causes : entry.remedies).push_back(example);
    }
  }
  return entries;
}

std::string replaced(std::string text, std::string_view from, std::string_view to) {
  for (size_t at = 0; (at = text.find(from, at)) != text.npos; at += to.size()) {
    text.replace(at, from.size(), to);
  }
  return text;
}

// The rows of the catalogue as the headings write them, read from its source: a row is
// `name{CATEGORY, NUMBER, "TEXT"};`, perhaps with the text on the next line.
std::multiset<std::string> catalogue() {
  std::ifstream in(XQUERY_SOURCE_DIR "/src/Types/XQueryErrors.h");
  std::stringstream source;
  source << in.rdbuf();
  const std::string text = source.str();
  std::multiset<std::string> rows;
  constexpr std::string_view start = "inline constexpr XQueryErrorText<";
  for (size_t at = 0; (at = text.find(start, at)) != text.npos; at += start.size()) {
    const size_t category = text.find('{', at) + 1;
    const size_t number = text.find_first_not_of(" \n", text.find(',', category) + 1);
    const size_t open = text.find('"', number) + 1;
    const size_t close = text.find("\"};", open);
    const std::string row = text.substr(number, text.find(',', number) - number) + ": " +
                            text.substr(open, close - open);
    rows.insert(replaced(replaced(row, "\\\"", "\""), "%@", gap));
  }
  return rows;
}

// Whether the text is that of the heading, with something or nothing in each gap.
bool fits(std::string_view text, std::string_view heading) {
  const size_t first = heading.find(gap);
  if (first == heading.npos) return text == heading;
  if (!text.starts_with(heading.substr(0, first))) return false;
  text.remove_prefix(first);
  heading.remove_prefix(first + gap.size());
  if (heading.empty()) return true;
  for (size_t at = 0; at <= text.size(); ++at) {
    if (fits(text.substr(at), heading)) return true;
  }
  return false;
}

// What an example that raises the error of the entry gives, gaps included.
std::string resultOf(const Entry& entry) {
  const size_t colon = entry.heading.find(": ");
  return "error " + entry.heading.substr(0, colon) + " " + entry.heading.substr(colon + 2);
}

TEST(ErrorsDocument, HasOneEntryForEachTextOfTheCatalogueAndNoOther) {
  const std::multiset<std::string> rows = catalogue();
  ASSERT_GT(rows.size(), 50u);
  std::multiset<std::string> documented;
  for (const Entry& entry : readEntries()) documented.insert(entry.heading);
  EXPECT_EQ(documented, rows);
}

TEST(ErrorsDocument, TheIndexNamesEachText) {
  const Document document = readDocument("docs/errors.md");
  std::string index;
  for (const std::string& line : document.lines) {
    if (line.starts_with("| ")) index += line + "\n";
  }
  for (const Entry& entry : readEntries()) {
    const size_t colon = entry.heading.find(": ");
    const std::string row =
        "| " + entry.heading.substr(0, colon) + " | [" + entry.heading.substr(colon + 2) + "](#";
    EXPECT_NE(index.find(row), index.npos) << row;
  }
}

TEST(ErrorsDocument, ExamplesRaiseTheErrorOfTheirEntry) {
  for (const Entry& entry : readEntries()) {
    for (const Example& example : entry.causes) {
      EXPECT_TRUE(fits(example.result, resultOf(entry))) << example.place << " " << example.result;
    }
  }
}

TEST(ErrorsDocument, EachEntryHasAnExampleAndARemedyThatDoesNotFail) {
  std::set<std::string> without;
  for (const Entry& entry : readEntries()) {
    EXPECT_NE(entry.remedy, 0) << entry.heading;
    if (entry.causes.empty()) {
      without.insert(entry.heading);
      EXPECT_NE(entry.text.find("No query alone raises it"), std::string::npos) << entry.heading;
    }
    for (const Example& example : entry.remedies) {
      EXPECT_FALSE(example.result.starts_with("error ")) << example.place << " " << example.result;
    }
  }
  EXPECT_EQ(
      without,
      (std::set<std::string>{
          "0: limit: out of memory", "0: limit: deadline passed", "0: limit: evaluation cancelled",
          "0: limit: memory ceiling reached", "0: cannot be evaluated as a stream: …",
          "0: a node of a stream is still referred to", "3: there is no query text",
          "3: the query is not well-formed UTF-8", "3: …", "32: base-uri already defined for …"}));
}

TEST(ErrorsDocument, GapsTakeAnything) {
  EXPECT_TRUE(fits("error 8 function f not defined", "error 8 function … not defined"));
  EXPECT_TRUE(fits("error 3 invalid token (b) - b", "error 3 … - …"));
  EXPECT_FALSE(fits("error 6 function f not defined", "error 8 function … not defined"));
  EXPECT_FALSE(fits("error 8 function f not defined!", "error 8 function … not defined"));
  EXPECT_FALSE(fits("error 6 invalid type", "error 6 invalid type conversion"));
}

}  // namespace
}  // namespace xquery::docs

// Holds the examples of docs/plan.md to what the planner does with them.
//
// A table "rule | example | what happens" has queries of which the rule does something, a table
// "rule | example | what is missing" queries that it leaves alone, with what it says then. A row
// without a rule is about that of the row above. What "$ xquery --plan" prints is compared whole,
// or the lines with the word that a grep behind it looks for.
#include "Plan/PlanTesting.h"
#include "Plan/Rules.h"

#include <gmock/gmock.h>

#include <fstream>
#include <set>
#include <sstream>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

namespace xquery {
namespace {

using namespace plantest;
using testing::Contains;

std::vector<std::string> documentedLines() {
  std::ifstream in(std::string(XQUERY_SOURCE_DIR) + "/docs/plan.md");
  std::vector<std::string> lines;
  for (std::string line; std::getline(in, line);) lines.push_back(line);
  EXPECT_FALSE(lines.empty());
  return lines;
}

// The cells of a row; a bar within one is written "\|".
std::vector<std::string> cellsOf(std::string_view line) {
  std::vector<std::string> cells;
  std::string cell;
  for (size_t at = 1; at < line.size(); ++at) {
    if (line[at] == '|') {
      cells.push_back(std::exchange(cell, ""));
    } else {
      if (line[at] == '\\' && at + 1 < line.size() && line[at + 1] == '|') ++at;
      cell += line[at];
    }
  }
  return cells;
}

// What stands between backquotes.
std::vector<std::string> codeIn(std::string_view cell) {
  std::vector<std::string> found;
  for (size_t from = 0; (from = cell.find('`', from)) != std::string_view::npos;) {
    const size_t to = cell.find('`', from + 1);
    if (to == std::string_view::npos) break;
    found.emplace_back(cell.substr(from + 1, to - from - 1));
    from = to + 1;
  }
  return found;
}

std::string trimmed(std::string_view cell) {
  while (!cell.empty() && cell.front() == ' ') cell.remove_prefix(1);
  while (!cell.empty() && cell.back() == ' ') cell.remove_suffix(1);
  return std::string(cell);
}

struct Row {
  std::string rule;
  std::vector<std::string> queries;
  std::string text;
};

std::vector<Row> rowsBelow(std::string_view header) {
  std::vector<Row> rows;
  bool isInside = false;
  for (const std::string& line : documentedLines()) {
    if (line == header) {
      isInside = true;
    } else if (!line.starts_with('|')) {
      isInside = false;
    } else if (isInside && !line.starts_with("|-")) {
      const auto cells = cellsOf(line);
      EXPECT_EQ(cells.size(), 3U) << line;
      if (cells.size() != 3) continue;
      const auto rule = codeIn(cells[0]);
      EXPECT_TRUE(!rule.empty() || !rows.empty()) << line;
      rows.push_back(
          {rule.empty() ? rows.back().rule : rule.front(), codeIn(cells[1]), trimmed(cells[2])});
      EXPECT_FALSE(rows.back().queries.empty()) << line;
    }
  }
  EXPECT_FALSE(rows.empty());
  return rows;
}

// Something for each name of the examples.
const Value& sample() {
  static const Value parsed = document(
      "<site><person id='p1'><name>A</name><seller>p2</seller></person><person id='p2'><name>B"
      "</name></person><product sku='1'><price>5</price></product><product sku='2'><price>70"
      "</price></product><line><sku>2</sku></line><sale open='' date='2004-05-06'><buyer>p1</buyer>"
      "<item>item3</item><month>2004-05</month></sale><sale date='2004-06-01'><buyer>p2</buyer>"
      "<item>item4</item><month>2004-06</month></sale><item id='item3'><price>41</price><place>x"
      "</place></item><item id='item4'><reserve/><price>2</price><place>x</place></item><auction>"
      "<bidder>p1</bidder><bidder>p2</bidder></auction><a><b><c>1</c></b><b/></a></site>");
  return parsed;
}

std::vector<std::string> notesOn(std::string_view rule, const std::string& query,
                                 bool areRefusals) {
  std::vector<std::string> texts;
  const auto explained = compiled(query, XQueryWay::Explained);
  const auto plan = _internal(*explained).planReport();
  if (!plan) return texts;
  for (const auto& entry : plan->entries()) {
    for (const auto& note : entry.notes) {
      if (note.rule == rule && note.isRefusal == areRefusals) texts.emplace_back(note.text);
    }
  }
  return texts;
}

TEST(DocumentedPlans, HaveAnExampleOfEachRule) {
  std::set<std::string_view> rules;
  for (const Row& row : rowsBelow("| rule | example | what happens |")) {
    for (const std::string& query : row.queries) {
      EXPECT_FALSE(notesOn(row.rule, query, false).empty()) << row.rule << "  " << query;
      sameBothWays(query, sample());
    }
    for (const XQueryRule& rule : XQueryRules()) {
      if (rule.name == row.rule) rules.insert(rule.name);
    }
  }
  // What walks a path is not shown as long as it walks it as written.
  rules.insert("paths");
  for (const XQueryRule& rule : XQueryRules()) EXPECT_TRUE(rules.contains(rule.name)) << rule.name;
}

TEST(DocumentedPlans, SayWhatIsMissing) {
  for (const Row& row : rowsBelow("| rule | example | what is missing |")) {
    for (const std::string& query : row.queries) {
      EXPECT_THAT(notesOn(row.rule, query, true), Contains(row.text)) << row.rule << "  " << query;
      sameBothWays(query, sample());
    }
  }
}

// The lines of the text that have the word.
std::string linesWith(std::string_view word, const std::string& text) {
  std::istringstream in(text);
  std::string found;
  for (std::string line; std::getline(in, line);) {
    if (line.find(word) != std::string::npos) found += line + "\n";
  }
  return found;
}

TEST(DocumentedPlans, AreWhatIsPrinted) {
  const auto lines = documentedLines();
  constexpr std::string_view prompt = "$ xquery --plan -e '";
  constexpr std::string_view filter = "| grep -F -- \"";
  size_t count = 0;
  for (size_t at = 0; at < lines.size(); ++at) {
    const std::string_view line = lines[at];
    if (!line.starts_with(prompt)) continue;
    const size_t end = line.rfind('\'');
    const std::string_view query = line.substr(prompt.size(), end - prompt.size());
    std::string printed;
    while (++at < lines.size() && !lines[at].starts_with("```")) printed += lines[at] + "\n";
    std::string plan =
        compiled(query, XQueryWay::Explained)->planDescription(XQueryPlanFormat::Text)->utf8();
    const size_t word = line.find(filter, end);
    if (word != std::string_view::npos) {
      const std::string_view wanted = line.substr(word + filter.size());
      plan = linesWith(wanted.substr(0, wanted.find('"')), plan);
    }
    EXPECT_EQ(plan, printed) << query;
    ++count;
  }
  EXPECT_GE(count, 2U);
}

}  // namespace
}  // namespace xquery

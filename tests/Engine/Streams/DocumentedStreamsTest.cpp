// Holds the table of docs/command.md of what cannot be evaluated as a stream to what is refused: of
// each row every example, with that reason, before anything is read.
#include "xquery/xquery.h"

#include <gtest/gtest.h>

#include <fstream>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

namespace xquery {
namespace {

struct Row {
  std::string reason;
  std::vector<std::string> queries;
};

// A bar within a cell is written "\|".
std::vector<std::string> cellsOf(std::string_view line) {
  std::vector<std::string> cells;
  std::string cell;
  for (size_t at = 1; at < line.size(); ++at) {
    if (line[at] == '|') {
      cells.push_back(std::exchange(cell, ""));
      continue;
    }
    if (line.substr(at).starts_with("\\|")) ++at;
    cell += line[at];
  }
  return cells;
}

std::vector<std::string> codeIn(const std::string& cell) {
  std::vector<std::string> found;
  for (size_t from = 0; (from = cell.find('`', from)) != cell.npos;) {
    const size_t to = cell.find('`', from + 1);
    if (to == cell.npos) break;
    found.push_back(cell.substr(from + 1, to - from - 1));
    from = to + 1;
  }
  return found;
}

std::vector<Row> documentedRows() {
  std::ifstream in(XQUERY_SOURCE_DIR "/docs/command.md");
  std::vector<Row> rows;
  bool isInside = false;
  for (std::string line; std::getline(in, line);) {
    const bool isHeader = line == "| cannot be evaluated as a stream | for example |";
    isInside = isHeader || (isInside && line.starts_with('|'));
    if (!isInside || isHeader || line.starts_with("|-")) continue;
    const std::vector<std::string> cells = cellsOf(line);
    rows.push_back({cells.at(0).substr(1, cells.at(0).size() - 2), codeIn(cells.at(1))});
  }
  return rows;
}

// Empty for a query that is not refused.
std::string refusalOf(const std::string& text) {
  const auto query =
      XQuery::xqueryWithSource(text, XQueryLoading(), XQueryLimits(), XQueryWay::Streamed);
  bool hasRead = false;
  XQueryStreamInput input;
  input.read = [&](char*, size_t) -> ptrdiff_t {
    hasRead = true;
    return 0;
  };
  XQueryStreamFailure failure;
  const auto receive = [](const Value&) { return true; };
  const auto context = XQueryContext::xqueryContext();
  EXPECT_FALSE(context->evaluateStream(*query, {}, input, receive, failure)) << text;
  return failure.error && !hasRead ? failure.error->msg()->utf8() : "";
}

TEST(DocumentedStreams, AreRefusedForTheReasonThatIsTold) {
  constexpr size_t fewestRows = 27;
  const std::vector<Row> rows = documentedRows();
  EXPECT_GE(rows.size(), fewestRows);
  for (const Row& row : rows) {
    EXPECT_FALSE(row.queries.empty()) << row.reason;
    for (const std::string& query : row.queries) {
      EXPECT_EQ(refusalOf(query), "cannot be evaluated as a stream: " + row.reason) << query;
    }
  }
}

}  // namespace
}  // namespace xquery

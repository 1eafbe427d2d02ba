// Holds docs/warnings.md to what is found. Each warning has an entry, in the order of the table:
//
//   ### identifier
//   `its text`
//
//   what causes it
//
//   - Before: `query`, `query`      each has that warning and no other
//   - After: `query`                each has none
#include "Check/WarningTable.h"
#include "CheckTesting.h"

#include <gmock/gmock.h>

#include <fstream>
#include <string>
#include <string_view>
#include <vector>

namespace xquery {
namespace {

struct Entry {
  std::string identifier;
  std::string text;
  std::string cause;
  std::vector<std::string> before;
  std::vector<std::string> after;
};

std::vector<std::string> codeIn(std::string_view line) {
  std::vector<std::string> found;
  for (size_t from = 0; (from = line.find('`', from)) != line.npos;) {
    const size_t to = line.find('`', from + 1);
    if (to == line.npos) break;
    found.emplace_back(line.substr(from + 1, to - from - 1));
    from = to + 1;
  }
  return found;
}

const std::vector<Entry>& entries() {
  static const std::vector<Entry> all = [] {
    std::vector<Entry> found;
    std::ifstream in(std::string(XQUERY_SOURCE_DIR) + "/docs/warnings.md");
    for (std::string line; std::getline(in, line);) {
      if (line.starts_with("### ")) {
        found.push_back({line.substr(4), "", "", {}, {}});
      } else if (line.starts_with("#") || found.empty() || line.empty()) {
        continue;
      } else if (line.starts_with("- Before: ")) {
        found.back().before = codeIn(line);
      } else if (line.starts_with("- After: ")) {
        found.back().after = codeIn(line);
      } else if (found.back().text.empty()) {
        found.back().text = codeIn(line).at(0);
      } else {
        found.back().cause += line;
      }
    }
    return found;
  }();
  return all;
}

// What is warned of, without lines.
std::string identifiersOf(const std::string& text) {
  XQueryLoading loading;
  loading.moduleURL = "file://" + std::string(XQUERY_SOURCE_DIR) + "/examples/query.xq";
  const auto query = XQuery::xqueryWithSource(std::string_view(text), loading, XQueryLimits(),
                                              XQueryWay::Explained);
  if (const auto errors = query->parseErrors()) {
    return cast<XQueryError>(errors->objects().front())->description()->utf8();
  }
  std::string found;
  for (const XQueryWarning& warning : XQueryWarnings(*query)) {
    found += (found.empty() ? "" : ", ") + std::string(warning.identifier);
  }
  return found;
}

TEST(DocumentedWarnings, AreThoseOfTheTable) {
  ASSERT_EQ(entries().size(), XQueryWarningRows().size());
  for (size_t i = 0; i < entries().size(); ++i) {
    EXPECT_EQ(entries()[i].identifier, XQueryWarningRows()[i].identifier);
    EXPECT_EQ(entries()[i].text, XQueryWarningRows()[i].text);
    EXPECT_GT(entries()[i].cause.size(), 40U) << entries()[i].identifier;
  }
}

TEST(DocumentedWarnings, AreGivenBeforeAndNotAfter) {
  for (const Entry& entry : entries()) {
    EXPECT_FALSE(entry.before.empty()) << entry.identifier;
    EXPECT_FALSE(entry.after.empty()) << entry.identifier;
    for (const auto& query : entry.before) {
      EXPECT_EQ(identifiersOf(query), entry.identifier) << query;
    }
    for (const auto& query : entry.after) EXPECT_EQ(identifiersOf(query), "") << query;
  }
}

}  // namespace
}  // namespace xquery

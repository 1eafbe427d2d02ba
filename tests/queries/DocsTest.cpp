// Runs the examples in the documents for people and follows their links.
#include "DocsExamples.h"

#include <gtest/gtest.h>

#include <cctype>
#include <filesystem>
#include <map>
#include <set>

namespace xquery::docs {
namespace {

// --- examples ------------------------------------------------------------------------------------

TEST(Documents, ExamplesGiveTheResultsThatAreSaid) {
  for (const Document& document : readDocuments()) EXPECT_EQ(failuresOf(document), "");
}

TEST(Documents, EachPageForThoseWhoWriteQueriesHasExamples) {
  for (const char* name :
       {"docs/guide.md", "docs/dialect.md", "docs/functions.md", "docs/errors.md"}) {
    EXPECT_GT(readDocument(name).examples.size(), 30u) << name;
  }
}

std::string failuresIn(std::string_view text) {
  return failuresOf(documentOf("page.md", text));
}

TEST(Documents, RightExamplesHaveNoFailures) {
  EXPECT_EQ(failuresIn("`1, 2` → `1, 2`, `()` → `()`, `1 eq 'a'` → `error 6 invalid type for "
                       "operator`\n"),
            "");
  EXPECT_EQ(failuresIn("```xquery\n1,\n2\n```\n\n```text\n1\n2\n```\n"), "");
  EXPECT_EQ(failuresIn("<!-- input: examples/books.xml -->\n```xquery\ncount(//book)\n```\n"
                       "```text\n4\n```\n"),
            "");
  EXPECT_EQ(failuresIn("<!-- var: x=7 -->\n```xquery\ndeclare variable $x external; $x\n```\n"
                       "```text\n7\n```\n"),
            "");
}

TEST(Documents, WrongExamplesAreFound) {
  // Both ways of evaluating are tried.
  EXPECT_EQ(failuresIn("\n`1 + 1` → `3`\n"),
            "page.md:2: 1 + 1\n  gives 2\n  and not 3\n"
            "page.md:2: 1 + 1\n  gives 2\n  and not 3\n");
  EXPECT_NE(failuresIn("| a | `1` → `1` | `2` → `1` |\n"), "");
  EXPECT_NE(failuresIn("`1 + 'a'` → `error 6 invalid type`\n"), "");
  EXPECT_NE(failuresIn("`('', '')` → `()`\n"), "");
  EXPECT_NE(failuresIn("```xquery\n1, 2\n```\n```text\n1, 2\n```\n"), "");
  // The variable was that of the block before.
  EXPECT_NE(failuresIn("<!-- var: x=7 -->\n```xquery\n1\n```\n```text\n1\n```\n"
                       "```xquery\ndeclare variable $x external; $x\n```\n```text\n7\n```\n"),
            "");
}

TEST(Documents, WhatLooksLikeAnExampleAndIsNoneIsFound) {
  EXPECT_EQ(failuresIn("`1` → 1\n"), "page.md:1: an arrow without a result\n");
  EXPECT_EQ(failuresIn("```xquery\n1\n```\ntext\n"), "page.md:1: a query without a result\n");
  EXPECT_EQ(failuresIn("```sh\nls\n"), "page.md:1: a block without an end\n");
}

// --- links ---------------------------------------------------------------------------------------

// The anchor that a heading gets: lower case, blanks as hyphens, no punctuation.
std::string anchorOf(std::string heading) {
  constexpr std::string_view dots = "…";
  for (size_t at; (at = heading.find(dots)) != heading.npos;) heading.erase(at, dots.size());
  std::string anchor;
  for (const char c : heading) {
    const auto byte = static_cast<unsigned char>(c);
    if (byte == ' ') anchor += '-';
    if (byte >= 0x80 || std::isalnum(byte) || byte == '-' || byte == '_') {
      anchor += static_cast<char>(byte < 0x80 ? std::tolower(byte) : byte);
    }
  }
  return anchor;
}

std::set<std::string> anchorsOf(const Document& document) {
  std::set<std::string> anchors;
  std::map<std::string, int> times;
  for (const std::string& line : document.lines) {
    if (!line.starts_with("#")) continue;
    const size_t text = line.find(' ');
    if (text == line.npos) continue;
    const std::string anchor = anchorOf(line.substr(text + 1));
    const int before = times[anchor]++;
    anchors.insert(before == 0 ? anchor : anchor + "-" + std::to_string(before));
  }
  return anchors;
}

using Anchors = std::map<std::string, std::set<std::string>>;  // by the name of the document

// Whether what stands in the brackets of a link is there: another page, a file, a heading.
bool leadsSomewhere(const std::string& target, const std::string& from, const Anchors& anchors) {
  if (target.starts_with("http")) return true;
  const size_t hash = target.find('#');
  std::string name = from;
  if (hash != 0) {
    const auto folder = std::filesystem::path(from).parent_path();
    name = (folder / target.substr(0, hash)).lexically_normal().string();
    if (!std::filesystem::exists(std::string(XQUERY_SOURCE_DIR) + "/" + name)) return false;
  }
  if (hash == target.npos) return true;
  const auto page = anchors.find(name);
  return page != anchors.end() && page->second.contains(target.substr(hash + 1));
}

TEST(Documents, LinksLeadToFilesAndHeadingsThatAreThere) {
  const std::vector<Document> documents = readDocuments();
  Anchors anchors;
  for (const Document& document : documents) anchors[document.name] = anchorsOf(document);
  for (const Document& document : documents) {
    for (size_t number = 0; number < document.lines.size(); ++number) {
      const std::string& line = document.lines[number];
      for (size_t at = 0; (at = line.find("](", at)) != line.npos; ++at) {
        const std::string target = line.substr(at + 2, line.find(')', at) - at - 2);
        if (target.find_first_of(" `'\"") != target.npos) continue;  // code
        EXPECT_TRUE(leadsSomewhere(target, document.name, anchors))
            << document.name << ":" << number + 1 << " " << target;
      }
    }
  }
}

TEST(Documents, LinksThatLeadNowhereAreFound) {
  const Anchors anchors{{"docs/a.md", {"first-step"}}};
  EXPECT_TRUE(leadsSomewhere("#first-step", "docs/a.md", anchors));
  EXPECT_TRUE(leadsSomewhere("../README.md", "docs/a.md", anchors));
  EXPECT_FALSE(leadsSomewhere("#second-step", "docs/a.md", anchors));
  EXPECT_FALSE(leadsSomewhere("missing.md", "docs/a.md", anchors));
}

}  // namespace
}  // namespace xquery::docs

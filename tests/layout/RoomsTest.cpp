// The rooms of src/ and who may include whom: a room knows those above it in this table, and the
// public headers. What two rooms need stands in the upper one; where that one must reach a later
// one, it declares what it asks for and the later one answers.
#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <algorithm>
#include <array>
#include <filesystem>
#include <fstream>
#include <regex>
#include <set>
#include <string>
#include <string_view>
#include <vector>

namespace {

namespace fs = std::filesystem;

constexpr std::array<std::string_view, 18> rooms = {
    "Platform/Base",
    "Platform/Text",
    "Platform/Numbers",
    "Platform/Dates",
    "Platform/Tree",
    "Platform/Reading",
    "Platform/Loading",
    "Platform/Stylesheets",
    "Types",
    "Prolog",
    "Context",
    "Expr",
    "Functions",
    "Plan",
    "Check",
    "Parser",
    "Engine",
    "C",
};

// The prolog holds expressions and declared types, and they are bound in the prolog: the two know
// each other through these headers.
constexpr std::array<std::string_view, 2> narrowHeaders = {
    "Expr/XQueryExpr.h",
    "Expr/TypeTests/XQueryTypeDeclaration.h",
};

// The libraries behind the platform, by how their headers are named.
constexpr std::array<std::string_view, 13> libraryHeaders = {
    "libxml/", "libxslt/", "libexslt/", "unicode/", "curl/",   "pcre2", "gmp",
    "tidy",    "hwy/",     "zlib.h",    "lzma.h",   "bzlib.h", "zstd",
};

struct Include {
  std::string file;  // below src/
  int line;
  std::string header;

  std::string text() const { return file + ":" + std::to_string(line) + " includes " + header; }
};

std::vector<Include> includesBelow(const fs::path& folder) {
  static const std::regex pattern(R"(\s*#\s*include\s*["<]([^">]+)[">].*)");
  static const std::set<std::string> endings = {".cpp", ".h", ".l", ".y"};
  std::vector<Include> found;
  for (const auto& entry : fs::recursive_directory_iterator(folder)) {
    if (!entry.is_regular_file() || !endings.contains(entry.path().extension().string())) continue;
    std::ifstream file(entry.path());
    int number = 0;
    for (std::string line; std::getline(file, line);) {
      ++number;
      std::smatch match;
      if (!std::regex_match(line, match, pattern)) continue;
      found.push_back({fs::relative(entry.path(), folder).string(), number, match[1]});
    }
  }
  return found;
}

const std::vector<Include>& includes() {
  static const std::vector<Include> all = includesBelow(fs::path(XQUERY_SOURCE_DIR) / "src");
  return all;
}

// The number of rooms for what is in none of them.
size_t roomOf(std::string_view path) {
  const auto holds = [path](std::string_view room) {
    return path.starts_with(room) && path.substr(room.size()).starts_with('/');
  };
  return static_cast<size_t>(std::find_if(rooms.begin(), rooms.end(), holds) - rooms.begin());
}

bool isNarrow(const Include& include) {
  return include.file.starts_with("Prolog/") &&
         std::find(narrowHeaders.begin(), narrowHeaders.end(), include.header) !=
             narrowHeaders.end();
}

TEST(Rooms, EverySourceIsInOne) {
  ASSERT_GT(includes().size(), 500U);
  std::set<std::string> outside;
  for (const Include& include : includes()) {
    if (roomOf(include.file) == rooms.size()) outside.insert(include.file);
  }
  EXPECT_THAT(outside, testing::IsEmpty());
}

TEST(Rooms, IncludesPointUpTheTableOnly) {
  std::vector<std::string> wrong;
  for (const Include& include : includes()) {
    const size_t room = roomOf(include.header);
    if (room == rooms.size() || room <= roomOf(include.file) || isNarrow(include)) continue;
    wrong.push_back(include.text());
  }
  EXPECT_THAT(wrong, testing::IsEmpty());
}

TEST(Rooms, AnArrowThatRunsTheOtherWayIsSeen) {
  EXPECT_LT(roomOf("Types/XQueryCasting.cpp"), roomOf("Context/StackGuard.h"));
  EXPECT_LT(roomOf("Platform/Tree/Arena.h"), roomOf("Platform/Reading/LibXML.h"));
  EXPECT_EQ(roomOf("PlatformX/File.h"), rooms.size());
  EXPECT_FALSE(isNarrow({"Types/XQueryCasting.cpp", 1, "Expr/XQueryExpr.h"}));
}

TEST(Rooms, LibrariesAreKnownToThePlatformOnly) {
  std::vector<std::string> wrong;
  for (const Include& include : includes()) {
    if (include.file.starts_with("Platform/")) continue;
    for (const std::string_view library : libraryHeaders) {
      if (include.header.starts_with(library)) wrong.push_back(include.text());
    }
  }
  EXPECT_THAT(wrong, testing::IsEmpty());
}

TEST(Rooms, WhatUsesTheLibraryKnowsItsPublicHeadersOnly) {
  std::vector<std::string> wrong;
  for (const char* folder : {"cli", "bench", "examples", "bindings/python"}) {
    for (const Include& include : includesBelow(fs::path(XQUERY_SOURCE_DIR) / folder)) {
      if (roomOf(include.header) < rooms.size()) {
        wrong.push_back(std::string(folder) + "/" + include.text());
      }
    }
  }
  EXPECT_THAT(wrong, testing::IsEmpty());
}

}  // namespace

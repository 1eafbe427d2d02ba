// Every document that there is in the project, read in both ways.
#include "Platform/Reading/ReaderTestSupport.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cstdio>
#include <filesystem>
#include <fstream>
#include <sstream>
#include <string>
#include <vector>

namespace xquery {
namespace {

using namespace readingtest;
namespace fs = std::filesystem;

using Documents = std::vector<std::string>;

std::string contentOf(const fs::path& path) {
  std::ostringstream all;
  all << std::ifstream(path, std::ios::binary).rdbuf();
  return all.str();
}

std::vector<fs::path> filesUnder(const char* folder) {
  std::vector<fs::path> files;
  for (const auto& entry : fs::recursive_directory_iterator(fs::path(XQUERY_SOURCE_DIR) / folder)) {
    if (entry.is_regular_file()) files.push_back(entry.path());
  }
  std::sort(files.begin(), files.end());
  return files;
}

// The context documents and the files of whole-query cases, and the elements among their results.
void addDocumentsOfCases(const fs::path& path, Documents& documents) {
  constexpr std::string_view result = "element()\t";
  std::ifstream in(path);
  std::string document;
  bool isDocument = false;
  for (std::string line; std::getline(in, line);) {
    const bool begins = line == "-- xml" || line.starts_with("-- file ");
    if (begins || line.starts_with("-- ") || line.starts_with("== ")) {
      if (isDocument) documents.push_back(document);
      isDocument = begins;
      document.clear();
    } else if (isDocument) {
      document += line + "\n";
    } else if (line.starts_with(result)) {
      documents.push_back(line.substr(result.size()));
    }
  }
}

Documents allDocuments() {
  Documents documents;
  for (const char* folder : {"examples", "tests"}) {
    for (const fs::path& path : filesUnder(folder)) {
      const std::string extension = path.extension();
      if (extension == ".xml" || extension == ".xsl") documents.push_back(contentOf(path));
      if (extension == ".cases") addDocumentsOfCases(path, documents);
    }
  }
  // Some seeds begin with a byte of options.
  for (const fs::path& path : filesUnder("fuzz/seeds")) {
    const std::string seed = contentOf(path);
    documents.push_back(seed);
    if (!seed.empty()) documents.push_back(seed.substr(1));
  }
  return documents;
}

void expectAsWithLibXML(const std::string& text) {
  for (const uint32_t options : allOptions) {
    const auto usual = read(text, XMLWay::Either, options);
    const auto other = read(text, XMLWay::LibXML, options);
    ASSERT_EQ(!usual, !other) << text;
    if (usual) {
      EXPECT_EQ(differenceOfTrees(usual.get(), other.get()), "") << text;
    }
  }
}

TEST(EveryDocument, IsReadAlikeInBothWays) {
  size_t wellFormed = 0;
  size_t takenOnes = 0;
  for (const std::string& document : allDocuments()) {
    expectAsWithLibXML(document);
    wellFormed += !isRefused(document);
    takenOnes += isTaken(document);
  }
  std::printf("of %zu well-formed documents of the tests our reader takes %zu\n", wellFormed,
              takenOnes);
  EXPECT_GT(wellFormed, 100U);
  EXPECT_GT(takenOnes, wellFormed * 9 / 10);
}

}  // namespace
}  // namespace xquery

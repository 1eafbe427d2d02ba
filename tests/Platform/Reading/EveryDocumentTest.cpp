// Every document that there is in the project, read in both ways.
#include "Platform/Reading/ReaderTestSupport.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cctype>
#include <charconv>
#include <cstdint>
#include <cstdio>
#include <filesystem>
#include <fstream>
#include <set>
#include <sstream>
#include <string>
#include <string_view>
#include <utility>
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
  // Some seeds begin with a byte of options. What the targets have learnt they go through
  // themselves.
  constexpr size_t lengthOfHash = 40;
  for (const fs::path& path : filesUnder("fuzz/seeds")) {
    if (path.filename().string().size() == lengthOfHash) continue;
    const std::string seed = contentOf(path);
    documents.push_back(seed);
    if (!seed.empty()) documents.push_back(seed.substr(1));
  }
  return documents;
}

// The string literals of a C++ source, those that follow each other as one, as UTF-8.
class Literals {
 public:
  explicit Literals(std::string source) : _source(std::move(source)), _left(_source) {}

  Documents all() {
    Documents found;
    bool follows = false;
    while (skipToLiteral(follows)) {
      if (!follows) found.emplace_back();
      follows = true;
      readLiteral(found.back());
    }
    return found;
  }

 private:
  // Over what is no literal; if that is more than space and comments, the next one begins anew.
  bool skipToLiteral(bool& follows) {
    _isRaw = false;
    while (!_left.empty()) {
      if (_left.starts_with("//")) {
        skipPast("\n");
      } else if (_left.starts_with("/*")) {
        skipPast("*/");
      } else if (_left[0] == '"') {
        return true;
      } else {
        _isRaw = _left.starts_with("R\"");
        follows = follows && (_isRaw || std::isspace(static_cast<unsigned char>(_left[0])));
        const bool isCharacter = _left[0] == '\'' && !_isInWord;
        _isInWord = std::isalnum(static_cast<unsigned char>(_left[0])) || _left[0] == '_';
        _left.remove_prefix(1);
        if (isCharacter) skipCharacter();
      }
    }
    return false;
  }
  void skipPast(std::string_view end) {
    const size_t at = _left.find(end);
    _left.remove_prefix(at == _left.npos ? _left.size() : at + end.size());
  }
  void skipCharacter() {
    if (_left.starts_with("\\")) _left.remove_prefix(2);
    skipPast("'");
  }
  void readLiteral(std::string& to) {
    _left.remove_prefix(1);
    if (_isRaw) {
      const size_t opens = _left.find('(');
      const std::string end = ")" + std::string(_left.substr(0, opens)) + "\"";
      const std::string_view text = _left.substr(opens + 1);
      to += text.substr(0, text.find(end));
      return skipPast(end);
    }
    while (!_left.empty() && _left[0] != '"') {
      const char c = take();
      to += c == '\\' ? escaped() : std::string(1, c);
    }
    if (!_left.empty()) take();
  }
  char take() {
    const char c = _left[0];
    _left.remove_prefix(1);
    return c;
  }
  std::string escaped() {
    constexpr std::string_view letters = "ntrabfv", characters = "\n\t\r\a\b\f\v";
    const char c = take();
    if (c == 'x') return {static_cast<char>(number(16, _left.size()))};
    if (c == 'u') return utf8(number(16, 4));
    if (c == 'U') return utf8(number(16, 8));
    if (c >= '0' && c <= '7') {
      _left = {_left.data() - 1, _left.size() + 1};
      return {static_cast<char>(number(8, 3))};
    }
    const size_t at = letters.find(c);
    return {at == letters.npos ? c : characters[at]};
  }
  uint32_t number(int base, size_t mostDigits) {
    uint32_t value = 0;
    const char* const most = _left.data() + std::min(mostDigits, _left.size());
    const auto end = std::from_chars(_left.data(), most, value, base).ptr;
    _left.remove_prefix(static_cast<size_t>(end - _left.data()));
    return value;
  }
  static std::string utf8(uint32_t codePoint) {
    const auto tail = [&](int shift) {
      return static_cast<char>(0x80 | (codePoint >> shift & 0x3F));
    };
    if (codePoint < 0x80) return {static_cast<char>(codePoint)};
    if (codePoint < 0x800) return {static_cast<char>(0xC0 | codePoint >> 6), tail(0)};
    if (codePoint < 0x10000) return {static_cast<char>(0xE0 | codePoint >> 12), tail(6), tail(0)};
    return {static_cast<char>(0xF0 | codePoint >> 18), tail(12), tail(6), tail(0)};
  }

  const std::string _source;
  std::string_view _left;
  bool _isRaw = false;
  bool _isInWord = false;
};

// What may be documents among the literals of the tests, each once.
Documents documentsInLiterals() {
  std::set<std::string> documents;
  for (const fs::path& path : filesUnder("tests")) {
    if (path.extension() != ".cpp" && path.extension() != ".h") continue;
    for (std::string& literal : Literals(contentOf(path)).all()) {
      const size_t first = literal.find_first_not_of(" \t\r\n\xEF\xBB\xBF");
      if (first != literal.npos && literal[first] == '<') documents.insert(std::move(literal));
    }
  }
  return {documents.begin(), documents.end()};
}

void expectAsWithLibXML(const std::string& text) {
  for (const uint32_t options : allOptions) {
    const auto usual = read(text, XMLWay::Either, options);
    const auto other = read(text, XMLWay::LibXML, options);
    ASSERT_EQ(!usual, !other) << text;
    if (!usual) return;  // whatever the options
    EXPECT_EQ(differenceOfTrees(usual.get(), other.get()), "") << text;
  }
}

struct Counts {
  size_t wellFormed = 0;
  size_t taken = 0;
};

Counts readInBothWays(const Documents& documents) {
  Counts counts;
  for (const std::string& document : documents) {
    expectAsWithLibXML(document);
    counts.wellFormed += !isRefused(document);
    counts.taken += isTaken(document);
  }
  std::printf("of %zu well-formed documents of the tests our reader takes %zu\n", counts.wellFormed,
              counts.taken);
  return counts;
}

TEST(EveryDocument, IsReadAlikeInBothWays) {
  const Counts counts = readInBothWays(allDocuments());
  EXPECT_GT(counts.wellFormed, 100U);
  EXPECT_GT(counts.taken, counts.wellFormed * 9 / 10);
}

// Those of tests of declarations and encodings are among them, which are libxml2's.
TEST(EveryDocument, InALiteralIsReadAlikeInBothWays) {
  const Counts counts = readInBothWays(documentsInLiterals());
  EXPECT_GT(counts.wellFormed, 300U);
  EXPECT_GT(counts.taken, counts.wellFormed / 2);
}

TEST(LiteralsOfASource, AreReadAsTheCompilerReadsThem) {
  const std::string source =
      "f(\"a\\\"b\"  // \"no\"\n  \"c\\x41\" /* \"no\" */, 'x', '\"', 1'000, '\\'', \"\\n\\\\\", "
      "R\"(<r a=\"1\"/>\\)\" R\"x()\")x\", u\"\\u00E4\\101\");";
  EXPECT_EQ(Literals(source).all(), (Documents{"a\"bcA", "\n\\", "<r a=\"1\"/>\\)\"",
                                               "\xC3\xA4"
                                               "A"}));
}

}  // namespace
}  // namespace xquery

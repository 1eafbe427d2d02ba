// Files that become others while they are read: a document or a reason, whatever is there by then.
#include "Platform/Loading/LoadingTestSupport.h"
#include "Platform/Reading/PackedText.h"
#include "xquery/XMLNode.h"

#include <gtest/gtest.h>

#include <filesystem>
#include <fstream>
#include <functional>
#include <string>
#include <string_view>

namespace xquery {
namespace {

constexpr size_t records = 100'000;  // several windows of the reader

std::string repeated(std::string_view text, size_t count) {
  std::string all;
  all.reserve(text.size() * count);
  for (size_t i = 0; i < count; ++i) all += text;
  return all;
}

std::string document(std::string_view prolog = "", std::string_view inside = "") {
  return std::string(prolog) + "<a>" + repeated("<b>text</b>", records) + std::string(inside) +
         "</a>";
}

// What our reader leaves to libxml2, from its beginning or when it comes upon it.
constexpr std::string_view declarations = "<!DOCTYPE a [<!ENTITY e 'x'>]>";

std::string gzipOfDigits() {
  std::string text = "<a>";
  for (size_t i = 0; i < records; ++i)
    text += "<b>" + std::to_string(i * 7919 % 1'000'003) + "</b>";
  return packing::gzip(text + "</a>");
}

class ChangingFile : public testing::Test {
 protected:
  // Reads the file and lets `change` do something to it as soon as some of it has been read.
  Ref<NSXMLDocument> readWith(std::string_view text, const std::function<void()>& change) {
    static_cast<void>(folder.write("file.xml", text));
    bool hasChanged = false;
    const auto progress = [&](uint64_t, uint64_t) {
      if (!hasChanged) change();
      hasChanged = true;
    };
    auto document =
        NSXMLDocument::documentWithFile(path, NSXMLNodePreserveWhitespace, &error, progress);
    EXPECT_TRUE(hasChanged);
    return document;
  }
  void write(std::string_view text) { static_cast<void>(folder.write("file.xml", text)); }

  const TestFolder folder;
  const std::string path = folder.path("file.xml");
  NSXMLParseError error;
};

TEST_F(ChangingFile, ThatShrinksIsNotWellFormed) {
  for (const std::string& text :
       {document(), document(declarations), document("", "&e;"), gzipOfDigits()}) {
    for (const uintmax_t size : {uintmax_t{0}, uintmax_t{1}, uintmax_t{16384}, uintmax_t{70'000}}) {
      const auto read = readWith(text, [&] { std::filesystem::resize_file(path, size); });
      EXPECT_FALSE(read) << text.substr(0, 20) << size;
      EXPECT_NE(error.message, "") << text.substr(0, 20) << size;
    }
  }
}

TEST_F(ChangingFile, ThatVanishesIsReadToItsEnd) {
  for (const std::string& text : {document(), document(declarations), gzipOfDigits()}) {
    const auto read = readWith(text, [&] { std::filesystem::remove(path); });
    ASSERT_TRUE(read) << error.message;
    EXPECT_EQ(read->rootElement()->childCount(), records);
  }
}

TEST_F(ChangingFile, WhosePlaceAnotherTakesIsReadToItsEnd) {
  static_cast<void>(folder.write("other.xml", "<other/>"));
  const auto read =
      readWith(document(), [&] { std::filesystem::rename(folder.path("other.xml"), path); });
  ASSERT_TRUE(read) << error.message;
  EXPECT_EQ(read->rootElement()->childCount(), records);
}

TEST_F(ChangingFile, ThatGrowsIsReadToItsNewEnd) {
  const auto append = [&](const char* text) {
    std::ofstream(path, std::ios::binary | std::ios::app) << text;
  };
  const auto read = readWith(document(), [&] { append("<!-- behind -->"); });
  ASSERT_TRUE(read) << error.message;
  EXPECT_EQ(read->childCount(), 2U);
  EXPECT_FALSE(readWith(document(), [&] { append("<second/>"); }));
  EXPECT_NE(error.message, "");
}

// Where libxml2 begins again there is another text by then.
TEST_F(ChangingFile, ThatIsWrittenAnewIsADocumentOrAReason) {
  const std::string other = "<other/>" + repeated(" ", 20 * records);
  for (const std::string& text : {document(), document(declarations), document("", "&e;")}) {
    const auto read = readWith(text, [&] { write(other); });
    EXPECT_TRUE(read || !error.message.empty());
  }
}

TEST_F(ChangingFile, ThatIsAFolderHasAReason) {
  EXPECT_FALSE(NSXMLDocument::documentWithFile(folder.path(), 0, &error));
  EXPECT_EQ(error.message, folder.path() + ": Is a directory");
  EXPECT_EQ(error.line, 0);
}

}  // namespace
}  // namespace xquery

// Packed documents through every door: files, standard input, memory, HTML, either reader.
#include "Platform/Loading/LoadingTestSupport.h"
#include "Platform/Reading/EndlessDocuments.h"
#include "Platform/Reading/PackedText.h"
#include "Platform/Reading/TreeDifference.h"
#include "Platform/Reading/UnpackedInput.h"
#include "Platform/Reading/XMLDocuments.h"

#include <gtest/gtest.h>

#include <string>
#include <unistd.h>

namespace xquery {
namespace {

using packing::Format;
using packing::formats;
using readingtest::differenceOfTrees;

// The second is left to libxml2 at its beginning, the third at its end; the fourth is in another
// encoding.
std::string documents[] = {
    "<a>" + std::string(300000, 'x') + "<b c='d'/></a>",
    "<!DOCTYPE a [<!ENTITY e 'text'>]><a>&e;</a>",
    "<a>" + std::string(300000, 'x') + "<b xmlns:xml='http://www.w3.org/XML/1998/namespace'/></a>",
    "<?xml version='1.0' encoding='ISO-8859-1'?><a>\xE9</a>",
};

std::string difference(const Ref<NSXMLDocument>& document, const std::string& text) {
  const auto expected = NSXMLDocument::documentWithData(text, NSXMLNodePreserveWhitespace);
  if (!document || !expected) return "not read";
  return differenceOfTrees(document.get(), expected.get());
}

Ref<NSXMLDocument> readFile(const std::string& path, NSXMLParseError& error) {
  return NSXMLDocument::documentWithFile(path, NSXMLNodePreserveWhitespace, &error);
}

// From a pipe, which holds few bytes at a time.
Ref<NSXMLDocument> readPipe(const std::string& path, NSXMLParseError& error) {
  FILE* const pipe = popen(("cat '" + path + "'").c_str(), "r");
  const int saved = dup(STDIN_FILENO);
  dup2(fileno(pipe), STDIN_FILENO);
  const auto document = readFile("-", error);
  dup2(saved, STDIN_FILENO);
  close(saved);
  pclose(pipe);
  return document;
}

TEST(PackedDocuments, AreReadLikePlainOnes) {
  const TestFolder folder;
  for (const Format& format : formats) {
    for (const std::string& text : documents) {
      const std::string packed = format.pack(text);
      folder.write("packed", packed);
      NSXMLParseError error;
      EXPECT_EQ(difference(readFile(folder.path("packed"), error), text), "") << error.message;
      EXPECT_EQ(difference(readPipe(folder.path("packed"), error), text), "") << error.message;
      EXPECT_EQ(
          difference(NSXMLDocument::documentWithData(packed, NSXMLNodePreserveWhitespace, &error),
                     text),
          "")
          << error.message;
    }
  }
}

TEST(PackedDocuments, MayBeHTML) {
  const TestFolder folder;
  for (const Format& format : formats) {
    const std::string packed = format.pack("<title>T</title><p>one<p>two");
    folder.write("packed", packed);
    const auto file = NSXMLDocument::documentWithFile(folder.path("packed"), NSXMLDocumentTidyHTML);
    const auto data = NSXMLDocument::documentWithData(packed, NSXMLDocumentTidyHTML);
    ASSERT_TRUE(file && data);
    EXPECT_EQ(file->stringValue()->utf8(), "Tonetwo");
    EXPECT_EQ(differenceOfTrees(file.get(), data.get()), "");
  }
}

TEST(PackedDocuments, ThatAreNotWellFormedHaveTheirPlaceInTheText) {
  const TestFolder folder;
  for (const Format& format : formats) {
    folder.write("packed", format.pack("<a>\n<b>\n</a>"));
    NSXMLParseError error;
    EXPECT_FALSE(readFile(folder.path("packed"), error));
    EXPECT_EQ(error.line, 3);
    EXPECT_EQ(error.message.substr(0, 40), "Opening and ending tag mismatch: b line ");
    folder.write("packed", format.pack(""));
    EXPECT_FALSE(readFile(folder.path("packed"), error));
    EXPECT_EQ(error.message, "Document is empty");
    folder.write("packed", format.pack(format.pack("<a/>")));
    EXPECT_FALSE(readFile(folder.path("packed"), error)) << "packed twice";
    EXPECT_GT(error.line, 0);
  }
}

TEST(PackedDocuments, ThatAreDamagedAreNotReadHoweverMuchOfThemIs) {
  const TestFolder folder;
  for (const Format& format : formats) {
    const std::string data = std::string("the ") + format.name + " data ";
    const std::string whole = format.pack("<a/>");
    struct Row {
      std::string packed;
      std::string message;
    };
    const Row rows[] = {
        {whole.substr(0, whole.size() - 1), data + "ends too soon"},
        {whole + "<b/>", data + "is followed by something else"},
        {whole + whole.substr(0, whole.size() - 1), data + "ends too soon"},
    };
    for (const Row& row : rows) {
      folder.write("packed", row.packed);
      for (const auto& read : {readFile, readPipe}) {
        NSXMLParseError error;
        EXPECT_FALSE(read(folder.path("packed"), error));
        EXPECT_EQ(error.line, 0);
        const std::string path = read == readFile ? folder.path("packed") : "-";
        EXPECT_EQ(error.message, path + ": " + row.message);
      }
      NSXMLParseError error;
      for (const uint32_t options : {NSXMLNodeOptionsNone, NSXMLDocumentTidyHTML}) {
        EXPECT_FALSE(NSXMLDocument::documentWithData(row.packed, options, &error));
        EXPECT_EQ(error.message, row.message);
        EXPECT_EQ(error.line, 0);
        EXPECT_FALSE(NSXMLDocument::documentWithFile(folder.path("packed"), options, &error));
        EXPECT_EQ(error.message, folder.path("packed") + ": " + row.message);
      }
    }
  }
}

TEST(PackedDocuments, AHostIsToldHowManyPackedBytesHaveBeenRead) {
  const TestFolder folder;
  const std::string packed = packing::gzip(documents[0]);
  folder.write("packed", packed);
  uint64_t last = 0;
  ASSERT_TRUE(NSXMLDocument::documentWithFile(folder.path("packed"), 0, nullptr,
                                              [&](uint64_t bytes, uint64_t whole) {
                                                EXPECT_EQ(whole, packed.size());
                                                last = bytes;
                                              }));
  EXPECT_EQ(last, packed.size());
}

TEST(PackedDocuments, TakeNoMoreThanTheCeilingHoweverSmallTheyAre) {
  std::string text = "<a>";
  while (text.size() < (size_t{32} << 20)) text += std::string(1000, ' ') + "<b/>";
  text += "</a>";
  const std::string packed = packing::zstd(text);
  ASSERT_LT(packed.size(), text.size() / 200);
  const int64_t before = workMeter.valueBytes;
  for (const uint32_t options : {NSXMLNodePreserveWhitespace, NSXMLDocumentTidyHTML}) {
    const readingtest::Ceiling watching(16 * readingtest::MiB);
    try {
      NSXMLParseError error;
      EXPECT_FALSE(NSXMLDocument::documentWithData(packed, options, &error));
      EXPECT_TRUE(workMeter.wasRefused) << error.message;
    } catch (const Ended&) {
    } catch (const std::bad_alloc&) {
      EXPECT_TRUE(workMeter.wasRefused);
    }
    EXPECT_LT(watching.most(), 17 * readingtest::MiB);
  }
  EXPECT_EQ(workMeter.valueBytes, before);
}

TEST(PackedDocuments, MayBeBounded) {
  const std::string text = documents[0];
  for (const Format& format : formats) {
    const std::string packed = format.pack(text);
    NSXMLParseError error;
    EXPECT_TRUE(documentWithBoundedData(packed, 0, text.size(), error));
    EXPECT_FALSE(documentWithBoundedData(packed, 0, text.size() - 1, error));
    EXPECT_EQ(error.message, std::string("the ") + format.name + " data unpacks to too much text");
  }
}

}  // namespace
}  // namespace xquery

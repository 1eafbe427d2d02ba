#include "Platform/Base/WorkMeter.h"
#include "Platform/Reading/EndlessDocuments.h"
#include "Platform/Reading/ReaderTestSupport.h"
#include "Platform/Reading/XMLRecords.h"
#include "Platform/Tree/XMLTestSupport.h"

#include <gtest/gtest.h>

#include <new>
#include <string>
#include <vector>

namespace xquery {
namespace {

// "/a/*//b": names without prefixes.
struct Path {
  explicit Path(std::string_view text) {
    while (!text.empty()) {
      const bool isAnywhere = text.starts_with("//");
      text.remove_prefix(isAnywhere ? 2 : 1);
      const std::string_view name = text.substr(0, text.find('/'));
      text.remove_prefix(name.size());
      if (name != "*") names.emplace_back(NSStringView(), A(name));
      steps.push_back({isAnywhere, name == "*" ? nullptr : names.back().get()});
    }
  }
  std::vector<NSXMLExpandedNameRef> names;
  std::vector<XMLRecordStep> steps;
};

// Whether the steps up to that one lead to the element.
bool isFoundBy(const std::vector<XMLRecordStep>& steps, size_t count, const NSXMLNode* element) {
  if (count == 0) return isa<NSXMLDocument>(element);
  if (!isa<NSXMLElement>(element)) return false;
  const XMLRecordStep& step = steps[count - 1];
  if (step.name && element->expandedName() != step.name) return false;
  const NSXMLNode* above = element->parent();
  if (!step.isAnywhere) return isFoundBy(steps, count - 1, above);
  for (; above; above = above->parent()) {
    if (isFoundBy(steps, count - 1, above)) return true;
  }
  return false;
}

// A record with what is above it.
std::string shown(const NSXMLElement* record) {
  std::string text = record->XMLString()->utf8();
  for (const NSXMLNode* node = record->parent(); isa<NSXMLElement>(node); node = node->parent()) {
    std::string tag = node->nameView().utf8();
    const auto* element = cast<NSXMLElement>(node);
    for (const NSXMLNode* each = element->firstAttribute(); each;
         each = NSXMLElement::nextAttribute(each)) {
      tag += " " + each->XMLString()->utf8();
    }
    text = tag + "/" + text;
  }
  return text + "\n";
}

std::string expected(const std::string& text, const Path& path, uint32_t options) {
  std::string all;
  const auto document = readingtest::read(text, XMLWay::LibXML, options);
  for (const NSXMLNode* node = document.get(); node;) {
    if (isFoundBy(path.steps, path.steps.size(), node)) {
      all += shown(cast<NSXMLElement>(node));
      node = NSXMLTree::endOfSubtree(node);
    } else {
      node = node->nextNode();
    }
  }
  return all;
}

std::string actual(TextSource& source, const Path& path, uint32_t options) {
  XMLRecords records(source, path.steps, options);
  std::string all;
  while (const NSXMLElement* record = records.next()) {
    EXPECT_EQ(record->rootDocument(), records.document());
    EXPECT_FALSE(record->nextSibling() || record->previousSibling());
    all += shown(record);
  }
  return all + (records.isAtEnd() ? "" : "not taken");
}

constexpr std::string_view paths[] = {"/a/b",  "/a/b/c", "//c",    "/a/*",   "/a//c",
                                      "//b/c", "//b//c", "//*//c", "/a/x/y", "//q"};

const std::string documents[] = {
    "<a/>",
    "<a><b/></a>",
    "<a><b>1</b><b>2</b></a>",
    "<!--0--><a i='1'>t<b j='2'>u<c "
    "k='3'>v</c>w<c/></b>x<b><c><c>y</c></c></b>z<x><b/></x></a><?p?>",
    "<a><b><b><c/></b></b><x><y/><c><b><c/></b></c></x></a>",
    "<a>\n  <b>\n    <c> </c>\n  </b>\n  <![CDATA[ x ]]> <b xml:space='preserve'> <c> </c> "
    "</b>\n</a>",
    "<a xmlns:p='u'><b><c p:i='1' xmlns:q='v'><q:d/></c></b><b><c xmlns='w'/><c xmlns:q='v' "
    "q:i='2'/></b></a>",
    "<a>&lt;<b>\xC3\xA9<c>\xC3\xA9</c></b>&#233;<b c='&#233;'/></a>",
};

TEST(XMLRecords, AreThoseOfTheWholeTree) {
  for (const std::string& text : documents) {
    for (const std::string_view path : paths) {
      for (const uint32_t options : readingtest::allOptions) {
        const Path steps(path);
        if (!readingtest::read(text, XMLWay::LibXML, options)) continue;
        const std::string all = expected(text, steps, options);
        TextSource memory(text);
        EXPECT_EQ(actual(memory, steps, options), all) << text << path;
        for (const size_t piece : {1, 3, 100}) {
          TextSource pieces(
              readingtest::inPieces(text, piece), [] { return false; }, piece, piece);
          EXPECT_EQ(actual(pieces, steps, options), all) << text << path;
        }
      }
    }
  }
}

TEST(XMLRecords, EndWhereTheTextIsNotTaken) {
  const Path path("/a/b");
  for (const std::string text : {"<a><b>1</b><b>2</a>", "<a><b>1</b><b>2</b>", "<a><b>1</b>&e;</a>",
                                 "<a><b>1</b></a>x", "<a><b>1</b><b><c></d></b></a>"}) {
    TextSource source(text);
    const std::string all = actual(source, path, 0);
    EXPECT_TRUE(all.starts_with("a/<b>1</b>\n")) << all;
    EXPECT_TRUE(all.ends_with("not taken")) << all;
  }
}

// So many bytes of records that are numbered.
TextInput manyRecords(size_t bytes) {
  return [bytes, number = size_t{0}, text = std::string("<a><head>\n</head>")](
             char* buffer, size_t size) mutable {
    while (text.size() < size && bytes > 0) {
      const std::string digits = std::to_string(number++);
      std::string record =
          "<b xmlns:n='urn:n' id='" + digits + "'>text of " + digits + "<c n:x='y'/></b>\n";
      bytes -= std::min(bytes, record.size());
      text += record;
      if (bytes == 0) text += "</a>";
    }
    const size_t count = text.copy(buffer, size);
    text.erase(0, count);
    return static_cast<ptrdiff_t>(count);
  };
}

TEST(XMLRecords, TakeNoMoreMemoryHoweverLongTheDocumentIs) {
  const readingtest::Ceiling watching(readingtest::MiB);
  TextSource source(manyRecords(size_t{6} << 20), [] { return false; });
  const Path path("/a/b");
  XMLRecords records(source, path.steps, NSXMLNodePreserveWhitespace);
  size_t count = 0;
  while (const NSXMLElement* record = records.next()) {
    EXPECT_EQ(record->firstAttribute()->textView().utf8(), std::to_string(count++));
  }
  EXPECT_TRUE(records.isAtEnd());
  EXPECT_GT(count, 60'000U);
}

TEST(XMLRecords, ThatAreLargerThanTheCeilingEndInALimit) {
  const readingtest::Ceiling watching(4 * readingtest::MiB);
  std::string text = "<a><b/><b>";
  while (text.size() < (size_t{8} << 20)) text += "<c>text</c>";
  TextSource source(text);
  const Path path("/a/b");
  XMLRecords records(source, path.steps, 0);
  EXPECT_TRUE(records.next());
  EXPECT_THROW(static_cast<void>(records.next()), std::bad_alloc);
  EXPECT_TRUE(workMeter.wasRefused);
}

}  // namespace
}  // namespace xquery

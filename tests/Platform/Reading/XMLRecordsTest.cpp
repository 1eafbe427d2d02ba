#include "Platform/Base/WorkMeter.h"
#include "Platform/Reading/EndlessDocuments.h"
#include "Platform/Reading/ReaderTestSupport.h"
#include "Platform/Reading/XMLRecords.h"
#include "Platform/Tree/Names.h"
#include "Platform/Tree/XMLTestSupport.h"

#include <gtest/gtest.h>

#include <new>
#include <set>
#include <stdexcept>
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

std::string shownKept(size_t elementsKept) {
  return std::to_string(elementsKept) + " kept: ";
}

// The elements that both are in.
size_t elementsAroundBoth(const NSXMLNode* a, const NSXMLNode* b) {
  std::set<const NSXMLNode*> around;
  for (const NSXMLNode* node = a ? a->parent() : nullptr; node; node = node->parent()) {
    if (isa<NSXMLElement>(node)) around.insert(node);
  }
  size_t count = 0;
  for (const NSXMLNode* node = b->parent(); node; node = node->parent()) {
    count += around.contains(node);
  }
  return count;
}

std::string expected(const std::string& text, const Path& path, uint32_t options) {
  std::string all;
  const NSXMLNode* last = nullptr;
  const auto document = readingtest::read(text, XMLWay::LibXML, options);
  for (const NSXMLNode* node = document.get(); node;) {
    if (isFoundBy(path.steps, path.steps.size(), node)) {
      all += shownKept(elementsAroundBoth(last, node)) + shown(cast<NSXMLElement>(node));
      last = node;
      node = NSXMLTree::endOfSubtree(node);
    } else {
      node = node->nextNode();
    }
  }
  return all;
}

std::string shownError(const NSXMLParseError& error) {
  return std::to_string(error.line) + ":" + std::to_string(error.column) + ": " + error.message;
}

// With the error that ends the document, as all readers tell it.
std::string actual(TextSource& source, const Path& path, uint32_t options) {
  XMLRecords records(source, {&path.steps, 1}, options);
  std::string all;
  NSXMLParseError error;
  const auto receive = [&](const NSXMLElement& record) {
    EXPECT_EQ(record.rootDocument(), records.document());
    EXPECT_FALSE(record.nextSibling() || record.previousSibling());
    all += shownKept(records.elementsKept()) + shown(&record);
    return true;
  };
  if (records.read(receive, error)) return all;
  return all + shownError(error);
}

std::string inPieces(const std::string& text, size_t piece, const Path& path, uint32_t options) {
  TextSource source(
      readingtest::inPieces(text, piece), [] { return false; }, piece, piece);
  return actual(source, path, options);
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
    "<a><b><c/><c/></b><b><c/><x/></b><x/><b/><b><c/></b><x><b><c/></b></x></a>",
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
          EXPECT_EQ(inPieces(text, piece, steps, options), all) << text << path;
        }
      }
    }
  }
}

// libxml2 counts the names in end tags by their bytes.
TEST(XMLRecords, TellTheColumnOfAnErrorAsReadersOfTheWholeDocumentDo) {
  for (const std::string text :
       {"<r><b>x</b><b></r>", "<r><é>a</é><b></r>", "<r><b><漢>a</漢></b><b>ü</b><c></r>",
        "<r>\n<b>é</b><é/><b x='é'></b><é ></é ><!-- </é> --><![CDATA[</é>]]><?p </é>?><b></r>",
        "<r><b>é</b><!--\n é</é> --><c></r>", "<r><![CDATA[\n</é>\n</é>]]>é<é>é</é\n>é<c></r>",
        "<r>é<b/><漢></漢>é</q></r>", "<r><b>é</b>\n<b>&#x0;</b></r>"}) {
    NSXMLParseError error;
    ASSERT_FALSE(NSXMLDocument::documentWithData(text, NSXMLNodeOptionsNone, &error)) << text;
    TextSource memory(text);
    const std::string all = actual(memory, Path("/r/b"), NSXMLNodeOptionsNone);
    EXPECT_TRUE(all.ends_with(shownError(error))) << text << "\n" << all << shownError(error);
  }
}

// --- what our reader does not take -----------------------------------------------------------

const std::string otherDocuments[] = {
    "<!DOCTYPE a [<!ENTITY e '<c>1</c>'><!ATTLIST b k CDATA 'd'>]>\n<a><b>&e;</b><b/>&e;</a>",
    "<?xml version='1.0' encoding='ISO-8859-1'?><a><b>\xE9</b><b><c>\xE8</c></b></a>",
    "<!DOCTYPE a [<!ENTITY e 'x'>]><a "
    "xmlns:p='u'><p:b><p:c/></p:b><b><c><![CDATA[x]]>&e;</c></b></a>",
    "<a><b><c>1</c></b><b><c p='1'>2</c></b>\n</a><!-- end -->\n<?p x?>\n",
};

// The text as UTF-16 with a mark, of ASCII.
std::string UTF16(std::string_view text) {
  std::string units = "\xFF\xFE";
  for (const char byte : text) units += {byte, '\0'};
  return units;
}

TEST(XMLRecords, AreThoseOfTheWholeTreeWhereOurReaderDoesNotTakeTheText) {
  std::vector<std::string> texts(std::begin(otherDocuments), std::end(otherDocuments));
  texts.push_back(UTF16("<a><b><c>1</c></b>\n<b/></a>"));
  for (const std::string& text : texts) {
    for (const std::string_view path : paths) {
      for (const uint32_t options : readingtest::allOptions) {
        const Path steps(path);
        const std::string all = expected(text, steps, options);
        for (const size_t piece : {1, 100}) {
          EXPECT_EQ(inPieces(text, piece, steps, options), all) << text << path;
        }
      }
    }
  }
}

// What breaks a rule, behind this and before that.
constexpr std::string_view broken[] = {
    "<b>1</a>",
    "<b>1",
    "<b",
    "<b><c>\n<d></c></b>",
    "&e;",
    "<b i='1' i='2'/>",
    "<b xmlns:p='u' xmlns:q='u' p:i='1' q:i='2'>x</b>",
    "<p:b/>",
    "<b p:i='1'/>",
    "<b>]]></b>",
    "t\xFF<!--c-->",
    "<b><c>\xC3</c></b>",
    "<b>x\xFF<![CDATA[y]]></b>",
    "<b><![CDATA[\xFF]]><c/></b>",
    "<b>\x01</b>",
    "<!-- -- -->",
    "<?xml version='1.0'?>",
    "<b i=1/>",
    "<b i='<'/>",
    "<b>&#0;</b>",
    "</a><a/>",
    "</a>x",
    "</a>\n<!--c-->\n&lt;",
    "<!DOCTYPE a>",
};
constexpr std::string_view starts[] = {
    "",
    "<a>",
    "<?xml version='1.0'?>\n<!-- \n -->\n<a\n i='1'>t\n",
    "<!DOCTYPE a SYSTEM 'a.dtd'>\n<a xmlns:n='a&quot;&#10;b' xmlns='v'><b>\n<c>1</c></b>\n <n:x>\n",
    "<a>\n<b>\xC3\xA9</b><b xml:space='preserve'>\xC3\xA9<c k='1'>\n<d>",
};

TEST(XMLRecords, EndWithTheErrorOfTheWholeTree) {
  for (const std::string_view start : starts) {
    for (const std::string_view wrong : broken) {
      const std::string text = std::string(start) + std::string(wrong) + "\n<b>3</b></a>";
      NSXMLParseError error;
      EXPECT_FALSE(NSXMLDocument::documentWithData(text, 0, &error)) << text;
      for (const std::string_view path : {"/a/b", "//c", "/q/r"}) {
        for (const size_t piece : {1, 7, 1000}) {
          const std::string all = inPieces(text, piece, Path(path), 0);
          EXPECT_TRUE(all.ends_with(shownError(error))) << text << "\n"
                                                        << path << piece << "\n"
                                                        << all << "\n"
                                                        << shownError(error);
        }
      }
    }
  }
}

// Places are those of the text, whatever is left out of what libxml2 is given.
TEST(XMLRecords, EndAtThePlaceOfTheWholeTreeFarBehindInTheText) {
  std::string text = "<a>\n<b>";
  for (int i = 0; i < 3000; ++i) text += "<c>\n<d>\xC3\xA9</d></c>";
  for (const std::string_view wrong : {"<e>\n\n</b>", "&e;", "</b>\n<c></a>"}) {
    NSXMLParseError error;
    EXPECT_FALSE(NSXMLDocument::documentWithData(text + std::string(wrong), 0, &error));
    for (const std::string_view path : {"/a/b", "//d"}) {
      const std::string all = text + std::string(wrong);
      TextSource pieces(
          readingtest::inPieces(all, 1000), [] { return false; }, 1000, 1000);
      EXPECT_TRUE(actual(pieces, Path(path), 0).ends_with(shownError(error))) << shownError(error);
    }
  }
}

TEST(XMLRecords, MayBeDeep) {
  constexpr int levels = 50'000;
  std::string text = "<a><b>";
  for (int i = 0; i < levels; ++i) text += "<c>\n";
  NSXMLParseError error;
  EXPECT_FALSE(NSXMLDocument::documentWithData(text + "&e;", 0, &error));
  const std::string all = text + "&e;";
  TextSource source(all);
  EXPECT_EQ(actual(source, Path("/a/b"), 0), shownError(error));
}

TEST(XMLRecords, BeforeAnErrorAreHandedOut) {
  TextSource source("<a><b>1</b>\n<b>2</b><b>3</a>");
  EXPECT_EQ(actual(source, Path("/a/b"), 0),
            "0 kept: a/<b>1</b>\n1 kept: a/<b>2</b>\n2:17: Opening and ending tag mismatch: b line "
            "2 and a");
}

TEST(XMLRecords, EndWhenTheReceiverHasEnough) {
  for (const std::string text :
       {"<a><b/><b/><b/></a", "<!DOCTYPE a [<!ENTITY e ''>]><a><b/><b/>x"}) {
    TextSource source(text);
    const Path path("/a/b");
    XMLRecords records(source, {&path.steps, 1}, 0);
    NSXMLParseError error;
    int count = 0;
    EXPECT_TRUE(records.read([&](const NSXMLElement&) { return ++count < 2; }, error));
    EXPECT_EQ(count, 2);
    EXPECT_EQ(error.message, "");
  }
}

TEST(XMLRecords, PassOnWhatTheReceiverThrows) {
  for (const std::string text : {"<a><b/></a>", "<!DOCTYPE a [<!ENTITY e ''>]><a><b/></a>"}) {
    TextSource source(text);
    const Path path("/a/b");
    XMLRecords records(source, {&path.steps, 1}, 0);
    NSXMLParseError error;
    const auto receive = [](const NSXMLElement&) -> bool { throw std::length_error("its own"); };
    EXPECT_THROW(static_cast<void>(records.read(receive, error)), std::length_error);
  }
}

// --- memory ----------------------------------------------------------------------------------

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
  XMLRecords records(source, {&path.steps, 1}, NSXMLNodePreserveWhitespace);
  size_t count = 0;
  NSXMLParseError error;
  EXPECT_TRUE(records.read(
      [&](const NSXMLElement& record) {
        EXPECT_EQ(record.firstAttribute()->textView().utf8(), std::to_string(count++));
        return true;
      },
      error));
  EXPECT_GT(count, 60'000U);
}

TEST(XMLRecords, ThatAreLargerThanTheCeilingEndInALimit) {
  const readingtest::Ceiling watching(4 * readingtest::MiB);
  std::string text = "<a><b/><b>";
  while (text.size() < (size_t{8} << 20)) text += "<c>text</c>";
  TextSource source(text);
  const Path path("/a/b");
  XMLRecords records(source, {&path.steps, 1}, 0);
  NSXMLParseError error;
  int count = 0;
  const auto receive = [&](const NSXMLElement&) { return ++count > 0; };
  EXPECT_THROW(static_cast<void>(records.read(receive, error)), std::bad_alloc);
  EXPECT_EQ(count, 1);
  EXPECT_TRUE(workMeter.wasRefused);
}

}  // namespace
}  // namespace xquery

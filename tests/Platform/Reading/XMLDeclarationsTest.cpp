// Documents with every kind of declaration, sound and unsound, and every way in which the reading
// of them ends.
#include "Platform/Base/LookCounter.h"
#include "Platform/Reading/IgnorantHandler.h"
#include "Platform/Reading/LibXML.h"
#include "Platform/Reading/LibXMLMemory.h"
#include "Platform/Tree/ReservedNamespaces.h"
#include "xquery/XMLNode.h"

#include <gtest/gtest.h>
#include <libxml/xmlerror.h>
#include <libxml/xmlmemory.h>

#include <functional>
#include <memory>
#include <string>
#include <vector>

namespace xquery {
namespace {

using readingtest::IgnorantHandler;

// Each as it stands in an internal subset; all are well-formed.
const std::vector<std::string> declarations = {
    "<!ELEMENT a EMPTY>",
    "<!ELEMENT a ANY><!ELEMENT a ANY>",
    "<!ELEMENT a (#PCDATA)>",
    "<!ELEMENT a (#PCDATA|b|b|c)*>",
    "<!ELEMENT a (b,(c|d)?,(e+|(f,g)*)+,b)>",
    "<!ATTLIST a x CDATA #IMPLIED>",
    "<!ATTLIST a x CDATA #REQUIRED y ID #IMPLIED z ID #IMPLIED>",
    "<!ATTLIST a x IDREF 'one' y IDREFS 'one two'>",
    "<!ATTLIST a x ENTITY 'u' y ENTITIES 'u u'>",
    "<!ATTLIST a x NMTOKEN ' t ' y NMTOKENS ' t  u '>",
    "<!ATTLIST a x (one|two) 'two'>",
    "<!ATTLIST a x (one|one) #IMPLIED>",
    "<!ATTLIST a x (one | two | one | two) 'three'>",
    "<!ATTLIST a x NOTATION (q) #IMPLIED>",
    "<!ATTLIST a x NOTATION (q|q) 'q'>",
    "<!ATTLIST a x CDATA #FIXED 'f' x CDATA 'again'><!ATTLIST a x ID #IMPLIED>",
    "<!ATTLIST a xmlns CDATA 'u' xmlns:p CDATA 'v' xml:space (default|preserve) 'preserve'>",
    "<!ATTLIST undeclared x CDATA ''>",
    "<!ENTITY e 'text'>",
    "<!ENTITY e 'one'><!ENTITY e 'two'>",
    "<!ENTITY e '<b>&f;</b>'><!ENTITY f '&#60;&#x26;'>",
    "<!ENTITY lt 'no'><!ENTITY amp '&#38;#38;'>",
    "<!ENTITY e SYSTEM 'nowhere'>",
    "<!ENTITY e PUBLIC '-//p' 'nowhere'>",
    "<!ENTITY u SYSTEM 'nowhere' NDATA q><!ENTITY u SYSTEM 'nowhere' NDATA r>",
    "<!ENTITY % p '<!ATTLIST a x (one|one) #IMPLIED>'>%p;",
    "<!ENTITY % t 'one|two|one'><!ENTITY % p '<!ATTLIST a x (&#37;t;) #IMPLIED>'>%p;",
    "<!ENTITY % p ''><!ENTITY % p 'x'>%p;",
    "<!ENTITY % p SYSTEM 'nowhere'>",
    "<!NOTATION q SYSTEM 'x'><!NOTATION q PUBLIC 'y'>",
    "<!NOTATION q PUBLIC '-//p' 'x'>",
    "<!-- a comment -->",
    "<?an instruction?>",
    " \t\r\n",
};

// Each is a breach of well-formedness.
const std::vector<std::string> unsound = {
    "<!ELEMENT a>",
    "<!ELEMENT a (b,c|d)>",
    "<!ELEMENT a (b>",
    "<!ELEMENT a (#PCDATA|b)>",
    "<!ATTLIST a x (one|) #IMPLIED>",
    "<!ATTLIST a x (one|one #IMPLIED>",
    "<!ATTLIST a x NOTATION () #IMPLIED>",
    "<!ATTLIST a x NOTATION (q|q #IMPLIED>",
    "<!ATTLIST a x CDATA>",
    "<!ATTLIST a x CDATA '<'>",
    "<!ATTLIST a x CDATA '&nope;'>",
    "<!ATTLIST a x NOTHING #IMPLIED>",
    "<!ENTITY e>",
    "<!ENTITY e '%p;'>",
    "<!ENTITY e '&'>",
    "<!ENTITY % e SYSTEM 'nowhere' NDATA q>",
    "<!NOTATION q>",
    "<![INCLUDE[<!ELEMENT a ANY>]]>",
    "<![IGNORE[<!ELEMENT a ANY>]]>",
    "<!-- -- -->",
    "<?xml version='1.0'?>",
    "%p;",
    "<!NONSENSE>",
    "text",
};

std::string withSubset(std::string_view declared) {
  return "<!DOCTYPE a [" + std::string(declared) + "]><a>text</a>";
}

std::string withAll() {
  std::string all;
  for (const std::string& each : declarations) all += each;
  return withSubset(all);
}

TEST(XMLDeclarations, EveryKindIsRead) {
  for (const std::string& each : declarations) {
    NSXMLParseError error;
    const auto document = NSXMLDocument::documentWithData(withSubset(each), 0, &error);
    ASSERT_TRUE(document) << each << ": " << error.message;
    EXPECT_EQ(document->stringValue()->utf8(), "text") << each;
  }
  NSXMLParseError error;
  EXPECT_TRUE(NSXMLDocument::documentWithData(withAll(), 0, &error)) << error.message;
}

TEST(XMLDeclarations, EveryBreachIsAnErrorWithItsPlace) {
  for (const std::string& each : unsound) {
    NSXMLParseError error;
    EXPECT_FALSE(NSXMLDocument::documentWithData(withSubset(each), 0, &error)) << each;
    EXPECT_FALSE(error.message.empty()) << each;
    EXPECT_EQ(error.line, 1) << each;
  }
}

TEST(XMLDeclarations, TheyMayBeCutAnywhere) {
  std::vector<std::string> documents = {withAll()};
  for (const std::string& each : declarations) documents.push_back(withSubset(each));
  for (const std::string& each : unsound) documents.push_back(withSubset(each));
  for (const std::string& text : documents) {
    for (size_t length = 0; length < text.size(); ++length) {
      NSXMLParseError error;
      EXPECT_FALSE(
          NSXMLDocument::documentWithData(std::string_view(text).substr(0, length), 0, &error))
          << text.substr(0, length);
      EXPECT_FALSE(error.message.empty());
    }
  }
}

// A failing reader gives the text up to a place and then fails in its way.
template <class Fail>
void readUpTo(const std::string& text, size_t place, Fail fail) {
  size_t at = 0;
  const TextInput read = [&](char* buffer, size_t size) -> ptrdiff_t {
    if (at == place) return fail();
    const size_t count = std::min(size, place - at);
    text.copy(buffer, count, at);
    at += count;
    return static_cast<ptrdiff_t>(count);
  };
  IgnorantHandler handler;
  NSXMLParseError error;
  EXPECT_FALSE(parseWithLibXML(read, handler, error));
}

TEST(XMLDeclarations, TheInputMayFailAnywhere) {
  const std::string text = withAll();
  for (size_t place = 0; place < text.size(); ++place) {
    readUpTo(text, place, []() -> ptrdiff_t { return -1; });
    readUpTo(text, place, []() -> ptrdiff_t { throw std::bad_alloc(); });
    EXPECT_THROW(readUpTo(text, place, []() -> ptrdiff_t { throw Ended(); }), Ended);
  }
}

TEST(XMLDeclarations, ReadingMayBeEndedAtEveryLook) {
  // Longer than a block, so that the end comes inside declarations as well.
  std::string subset;
  while (subset.size() < 20000) {
    for (const std::string& each : declarations) subset += each;
  }
  const std::string text = withSubset(subset);
  bool isRead = false;
  int looks = 0;
  for (; !isRead; ++looks) {
    ASSERT_LT(looks, 100000);
    const LookCounter counter(looks);
    try {
      isRead = bool(NSXMLDocument::documentWithData(text, 0));
      EXPECT_TRUE(isRead);
      break;
    } catch (const Ended&) {
    }
  }
  EXPECT_GT(looks, 4);
}

// How often libxml2 asks for memory while this lives: a comment needs some.
class Requests {
 public:
  Requests() {
    LibXMLMemory::begin();
    xmlMemGet(&free, &malloc, &realloc, &strdup);
    requests = 0;
    xmlMemSetup(free, counting, realloc, strdup);
  }
  ~Requests() { xmlMemSetup(free, malloc, realloc, strdup); }
  size_t count() const { return requests; }

 private:
  static void* counting(size_t size) {
    ++requests;
    return malloc(size);
  }
  static inline size_t requests = 0;
  static inline xmlFreeFunc free = nullptr;
  static inline xmlMallocFunc malloc = nullptr;
  static inline xmlReallocFunc realloc = nullptr;
  static inline xmlStrdupFunc strdup = nullptr;
};

// Ends the reading at the first comment, in one way or the other.
class EndAtComment final : public IgnorantHandler {
 public:
  explicit EndAtComment(bool isEvaluationEnded) : _isEvaluationEnded(isEvaluationEnded) {}
  void comment(std::string_view) override {
    if (_isEvaluationEnded) throw Ended();
    throw LibXMLStop{"a comment"};
  }

 private:
  const bool _isEvaluationEnded;
};

size_t requestsUntilComment(const std::string& text, bool isEvaluationEnded) {
  size_t at = 0;
  const TextInput read = [&](char* buffer, size_t size) {
    const size_t count = text.copy(buffer, size, at);
    at += count;
    return static_cast<ptrdiff_t>(count);
  };
  EndAtComment handler(isEvaluationEnded);
  NSXMLParseError error;
  const Requests requests;
  if (isEvaluationEnded) {
    EXPECT_THROW(static_cast<void>(parseWithLibXML(read, handler, error)), Ended);
  } else {
    EXPECT_FALSE(parseWithLibXML(read, handler, error));
    EXPECT_EQ(error.message, "a comment");
  }
  return requests.count();
}

TEST(XMLDeclarations, WhatEndsInsideAnEntityEndsAtOnce) {
  constexpr size_t count = 10'000;
  std::string comments;
  for (size_t index = 0; index < count; ++index) comments += "<!--x-->";
  const auto document = [&](const std::string& entities, const char* content) {
    return "<!DOCTYPE a [" + entities + "]><a>" + content + comments + "</a>";
  };
  const std::string entity = "<!ENTITY e '" + comments + "'>";
  const std::string around = "<!ENTITY f '<b>&e;</b>" + comments + "'>";
  for (const bool isEvaluationEnded : {false, true}) {
    EXPECT_LT(requestsUntilComment(document("", ""), isEvaluationEnded), count / 10);
    EXPECT_LT(requestsUntilComment(document(entity, "&e;"), isEvaluationEnded), count / 10);
    EXPECT_LT(requestsUntilComment(document(entity + around, "&f;"), isEvaluationEnded),
              count / 10);
  }
}

TEST(XMLDeclarations, WhatIsReportedStaysInside) {
  // Failures of encodings are reported to whatever the thread has set; a host's settings come back.
  int heard = 0;
  const auto hear = [](void* count, xmlError*) { ++*static_cast<int*>(count); };
  xmlSetStructuredErrorFunc(&heard, hear);
  testing::internal::CaptureStderr();
  for (const std::string_view text :
       {"<?xml version='1.0' encoding='UTF-16'?><a/>", "\xFF\xFE<\0a\0>\0\0\xD8\0\xD8<\0",
        "<?xml version='1.0' encoding='EUC-JP'?><a>\xFF\xFF\xFF</a>",
        "<!DOCTYPE a [<!ENTITY lt 'no'>]><a/>"}) {
    static_cast<void>(NSXMLDocument::documentWithData(text, 0));
  }
  EXPECT_EQ(testing::internal::GetCapturedStderr(), "");
  EXPECT_EQ(heard, 0);
  EXPECT_EQ(xmlStructuredErrorContext, &heard);
  xmlSetStructuredErrorFunc(nullptr, nullptr);
}

TEST(XMLDeclarations, TextThatItsEncodingDoesNotKnowIsAnError) {
  NSXMLParseError error;
  EXPECT_FALSE(NSXMLDocument::documentWithData(
      "<?xml version='1.0' encoding='EUC-JP'?><a>\xFF\xFF\xFF</a>", 0, &error));
  EXPECT_NE(error.message.find("input conversion failed"), std::string::npos) << error.message;
}

// --- names ------------------------------------------------------------------------------------

std::string errorOf(const std::string& text) {
  NSXMLParseError error;
  return NSXMLDocument::documentWithData(text, 0, &error) ? "" : error.message;
}

std::string withDefault(const std::string& name, const std::string& value = "v") {
  return "<!DOCTYPE a [<!ATTLIST a " + name + " CDATA '" + value + "'>]><a xmlns:p='u'/>";
}

TEST(XMLDeclarations, ADefaultedAttributeHasAQualifiedName) {
  for (const char* name : {"b", "p:b", "xml:b", "p:_", "\xC3\xA9", "p:\xC3\xA9-1", "b\xC2\xB7"}) {
    EXPECT_EQ(errorOf(withDefault(name)), "") << name;
  }
  for (const char* name :
       {":", ":b", "p:", "p:b:c", "p::b", "xml:2pace", "p:-", "p:.b", "p:\xC2\xB7", "p:\xCC\x80",
        "p:\xE2\x80\xBF", "xmlns:", "xmlns:p:q", "xmlns:2"}) {
    EXPECT_EQ(errorOf(withDefault(name)), "a defaulted attribute whose name is no qualified name")
        << name;
    // Nothing comes of a declaration without a default.
    EXPECT_EQ(errorOf("<!DOCTYPE a [<!ATTLIST a " + std::string(name) + " CDATA #IMPLIED>]><a/>"),
              "")
        << name;
  }
}

TEST(XMLDeclarations, ADefaultedPrefixIsDeclared) {
  EXPECT_NE(errorOf(withDefault("q:b")).find("Namespace prefix q"), std::string::npos);
  EXPECT_EQ(errorOf("<!DOCTYPE a [<!ATTLIST a q:b CDATA 'v' xmlns:q CDATA 'u'>]><a/>"), "");
  EXPECT_NE(errorOf("<!DOCTYPE a [<!ATTLIST a xmlns:q CDATA 'u'>]><a xmlns:p='u' p:b='' q:b=''/>")
                .find("redefined"),
            std::string::npos);
}

TEST(XMLDeclarations, ADefaultedNamespaceDeclarationIsOneThatATagMayHave) {
  struct Declaration {
    const char* name;
    std::string_view URI;
    bool isAllowed;
  };
  for (const Declaration& each : {
           Declaration{"xmlns", "", true},
           Declaration{"xmlns", "u", true},
           Declaration{"xmlns:q", "u", true},
           Declaration{"xmlns:xml", namespaceOfXML, true},
           Declaration{"xmlns", namespaceOfXML, false},
           Declaration{"xmlns", namespaceOfDeclarations, false},
           Declaration{"xmlns:q", "", false},
           Declaration{"xmlns:q", namespaceOfXML, false},
           Declaration{"xmlns:q", namespaceOfDeclarations, false},
           Declaration{"xmlns:xml", "u", false},
           Declaration{"xmlns:xmlns", "u", false},
           Declaration{"xmlns:xmlns", namespaceOfDeclarations, false},
       }) {
    const std::string where = std::string(each.name) + "=" + std::string(each.URI);
    EXPECT_EQ(errorOf(withDefault(each.name, std::string(each.URI))),
              each.isAllowed ? "" : "a defaulted namespace declaration that is not allowed")
        << where;
    const std::string given = "<a " + std::string(each.name) + "='" + std::string(each.URI) + "'/>";
    EXPECT_EQ(errorOf(given).empty(), each.isAllowed) << where;
  }
}

// --- sizes ---------------------------------------------------------------------------------------

std::string repeated(size_t count, const std::function<std::string(size_t)>& part,
                     const char* separator = "") {
  std::string text;
  for (size_t index = 0; index < count; ++index) {
    if (index > 0) text += separator;
    text += part(index);
  }
  return text;
}

std::string name(size_t index) {
  return "n" + std::to_string(index);
}

std::string names(size_t count, const char* separator, size_t first = 0) {
  return repeated(
      count, [=](size_t index) { return name(first + index); }, separator);
}

std::string inEntity(const std::string& declaration) {
  return "<!ENTITY % p \"" + declaration + "\">%p;";
}

struct Sized {
  const char* what;
  std::function<std::string(size_t)> subset;
  size_t most;  // thereabouts
  const char* failure;
};

const std::vector<Sized> sizes = {
    {"tokens", [](size_t n) { return "<!ATTLIST a x (" + names(n, "|") + ") #IMPLIED>"; },
     LibXMLMostListed, "too many names in a declaration"},
    {"notations",
     [](size_t n) { return "<!ATTLIST a x NOTATION (" + names(n, "|") + ") #IMPLIED>"; },
     LibXMLMostListed, "too many names in a declaration"},
    {"names of a sequence", [](size_t n) { return "<!ELEMENT a (" + names(n, " , ") + ")>"; },
     LibXMLMostListed, "too many names in a declaration"},
    {"names of mixed content",
     [](size_t n) { return "<!ELEMENT a (#PCDATA|" + names(n, "|") + ")*>"; }, LibXMLMostListed,
     "too many names in a declaration"},
    {"defaults",
     [](size_t n) {
       return "<!ATTLIST a " + repeated(n, [](size_t i) { return name(i) + " CDATA 'v' "; }) + ">";
     },
     LibXMLMostDefaults, "too many attributes declared"},
    {"attribute lists",
     [](size_t n) {
       return repeated(n, [](size_t i) { return "<!ATTLIST " + name(i) + " x CDATA 'v'>"; });
     },
     LibXMLMostAttributesDeclared, "too many attributes declared"},
};

TEST(XMLDeclarations, WhatIsComparedWithEachOtherIsBounded) {
  for (const Sized& size : sizes) {
    EXPECT_EQ(errorOf(withSubset(size.subset(size.most - 10))), "") << size.what;
    // What has been read at the end is not measured any more.
    const std::string tooMuch = size.subset(size.most + 2000);
    EXPECT_EQ(errorOf(withSubset(tooMuch)), size.failure) << size.what;
    EXPECT_EQ(errorOf(withSubset(inEntity(tooMuch))), size.failure) << size.what;
    EXPECT_EQ(errorOf(withSubset(inEntity(size.subset(size.most - 10)))), "") << size.what;
  }
}

TEST(XMLDeclarations, AListOfSeveralEntitiesIsBoundedToo) {
  std::string subset;
  std::string uses;
  for (size_t part = 0; part < 20; ++part) {
    subset += "<!ENTITY % e" + std::to_string(part) + " '" + names(1000, "|", part * 1000) + "'>";
    uses += (part ? "|&#37;e" : "&#37;e") + std::to_string(part) + ";";
  }
  subset += "<!ENTITY % p '<!ATTLIST a x (" + uses + ") #IMPLIED>'>%p;";
  EXPECT_EQ(errorOf(withSubset(subset)), "too many names in a declaration");
}

TEST(XMLDeclarations, ManyShortOnesAreNot) {
  const std::string subset = repeated(20000, [](size_t index) {
    return "<!ELEMENT " + name(index) + " (a,b)><!ENTITY " + name(index) +
           " 'text, of (a|b|c)'><!NOTATION " + name(index) + " SYSTEM 'x'><!-- | | | -->";
  });
  EXPECT_EQ(errorOf(withSubset(subset)), "");
  EXPECT_EQ(errorOf(withSubset("<!ENTITY e '" + std::string(1 << 20, '|') + "'>")), "");
  EXPECT_EQ(errorOf(withSubset("<!--" + std::string(1 << 20, ',') + "-->")), "");
}

TEST(XMLDeclarations, TheTagsOfAnEntityAreBounded) {
  const auto withTag = [](size_t count) {
    return "<!DOCTYPE a [<!ENTITY e \"<b " +
           repeated(count, [](size_t index) { return name(index) + "='' "; }) + "/>\">]><a>&e;</a>";
  };
  EXPECT_EQ(errorOf(withTag(LibXMLMostAttributes)), "");
  EXPECT_EQ(errorOf(withTag(LibXMLMostAttributes + 1)), "too many attributes");
}

}  // namespace
}  // namespace xquery

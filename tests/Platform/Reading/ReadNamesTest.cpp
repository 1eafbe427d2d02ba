#include "Platform/Reading/NotTaken.h"
#include "Platform/Reading/ReadNames.h"
#include "Platform/Tree/TreeBuilder.h"

#include <gtest/gtest.h>

#include <cstring>
#include <memory>
#include <string>

namespace xquery {
namespace {

class ReadNamesTest : public testing::Test {
 protected:
  ReadNamesTest() : _builder(4096, 4096), names(_builder.tree()) { _builder.openDocument(); }

  ReadName& named(std::string_view text) {
    // With nothing behind it that may be read.
    const std::unique_ptr<char[]> bytes(new char[text.size()]);
    std::memcpy(bytes.get(), text.data(), text.size());
    const char* const end = bytes.get() + text.size();
    return *names.find(bytes.get(), end, end);
  }
  // What `xmlns:prefix="URI"` does, or `xmlns="URI"`.
  void declare(std::string_view attribute, std::string_view URI, size_t depth) {
    ReadName& name = named(attribute);
    ASSERT_TRUE(name.declares);
    names.declare(*name.declares, URI, depth, [this](std::string_view text) {
      return _builder.store(NSStringView::ascii(text));
    });
  }
  std::string URIOf(const NSXMLName* name) { return NSXMLURIOf(*name->expanded).utf8(); }

 private:
  NSXMLTreeBuilder _builder;

 protected:
  ReadNames names;
};

TEST_F(ReadNamesTest, EqualNamesAreOneOfAnyLength) {
  std::string text;
  for (size_t length = 1; length < 70; ++length) {
    text += static_cast<char>('a' + length % 26);
    ReadName& one = named(text);
    EXPECT_EQ(one.bytes, text);
    EXPECT_EQ(&one, &named(text));
    std::string other = text;
    other.back() = 'Z';
    EXPECT_NE(&one, &named(other));
    const std::string more = text + ">";
    EXPECT_EQ(&one, names.find(more.data(), more.data() + length, more.data() + more.size()));
    const std::string much = text + "= and more than the longest head of any name";
    EXPECT_EQ(&one, names.find(much.data(), much.data() + length, much.data() + much.size()));
  }
}

TEST_F(ReadNamesTest, ANameIsFoundAtItsPlace) {
  for (const std::string& text : {std::string("a"), std::string("abcdefgh"), std::string(16, 'x'),
                                  std::string(17, 'x'), std::string(40, 'x')}) {
    const ReadName& name = named(text);
    const auto isAt = [&](const std::string& place) {
      return ReadNames::isAt(name, place.data(), place.data() + place.size());
    };
    EXPECT_TRUE(isAt(text));
    EXPECT_TRUE(isAt(text + ">"));
    EXPECT_TRUE(isAt(text + " and something else"));
    EXPECT_FALSE(isAt(text.substr(1)));
    EXPECT_FALSE(isAt(text.substr(1) + "<"));
    EXPECT_FALSE(isAt("y" + text.substr(1) + ">"));
    EXPECT_FALSE(isAt(text.substr(1) + "y something else that is long"));
  }
}

TEST_F(ReadNamesTest, WhatFollowedANameIsLikelyToFollowItAgain) {
  const auto likely = [this](std::string_view place) {
    const std::unique_ptr<char[]> bytes(new char[place.size()]);
    std::memcpy(bytes.get(), place.data(), place.size());
    return names.likely(bytes.get(), bytes.get() + place.size());
  };
  EXPECT_EQ(likely("a>"), nullptr);
  for (const std::string& text : {std::string("b"), std::string(15, 'x'), std::string(40, 'x')}) {
    named("a");
    ReadName& name = named(text);
    for (const char* end : {">", " ", "=", "/", "\n", "\t", "\r", "> and something else"}) {
      named("a");
      EXPECT_EQ(likely(text + end), &name) << text << end;
    }
    for (const char* end : {"", "x>", "x", "\"", "<", ":y>"}) {
      named("a");
      EXPECT_EQ(likely(text + end), nullptr) << text << end;
      named(text);
    }
    named("a");
    EXPECT_EQ(likely(text.substr(1)), nullptr);
    EXPECT_EQ(likely("y" + text.substr(1) + ">"), nullptr);
    named(text);
  }
}

TEST_F(ReadNamesTest, WhatIsNoNameIsNotTaken) {
  for (const char* text : {"1", "a:", ":a", "a:b:c", "a\"", "\xC3", "a&b"}) {
    EXPECT_THROW(named(text), NotTaken) << text;
  }
  EXPECT_THROW(named(""), NotTaken);
  EXPECT_NO_THROW(named(std::string(longestNameTaken, 'a')));
  EXPECT_THROW(named(std::string(longestNameTaken + 1, 'a')), NotTaken);
}

TEST_F(ReadNamesTest, NamesMeanWhatTheirPrefixesMeanAtTheirPlace) {
  ReadName& plain = named("a");
  ReadName& prefixed = named("p:a");
  EXPECT_EQ(URIOf(names.elementName(plain)), "");
  EXPECT_THROW(names.elementName(prefixed), NotTaken);
  names.startTag();
  declare("xmlns", "u", 0);
  declare("xmlns:p", "v", 0);
  EXPECT_EQ(URIOf(names.elementName(plain)), "u");
  EXPECT_EQ(URIOf(names.attributeName(plain)), "");
  EXPECT_EQ(URIOf(names.elementName(prefixed)), "v");
  EXPECT_EQ(URIOf(names.attributeName(prefixed)), "v");
  EXPECT_EQ(names.elementName(prefixed)->text, "p:a");
  names.startTag();
  declare("xmlns", "", 1);
  declare("xmlns:p", "w", 1);
  EXPECT_EQ(URIOf(names.elementName(plain)), "");
  EXPECT_EQ(URIOf(names.elementName(prefixed)), "w");
  names.endElement(1);
  EXPECT_EQ(URIOf(names.elementName(plain)), "u");
  EXPECT_EQ(URIOf(names.elementName(prefixed)), "v");
  names.endElement(0);
  EXPECT_EQ(URIOf(names.elementName(plain)), "");
  EXPECT_THROW(names.elementName(prefixed), NotTaken);
  EXPECT_EQ(URIOf(names.attributeName(named("xml:id"))), "http://www.w3.org/XML/1998/namespace");
}

TEST_F(ReadNamesTest, DeclarationsThatAreForbiddenAreNotTaken) {
  struct Row {
    const char* attribute;
    const char* URI;
  };
  const Row rows[] = {
      {"xmlns:p", ""},
      {"xmlns:xml", "http://www.w3.org/XML/1998/namespace"},
      {"xmlns:xmlns", "u"},
      {"xmlns:p", "http://www.w3.org/XML/1998/namespace"},
      {"xmlns", "http://www.w3.org/XML/1998/namespace"},
      {"xmlns:p", "http://www.w3.org/2000/xmlns/"},
      {"xmlns", "http://www.w3.org/2000/xmlns/"},
  };
  for (const Row& row : rows) {
    names.startTag();
    EXPECT_THROW(declare(row.attribute, row.URI, 0), NotTaken) << row.attribute << row.URI;
  }
  names.startTag();
  declare("xmlns:p", "u", 0);
  EXPECT_THROW(declare("xmlns:p", "u", 0), NotTaken) << "twice in one tag";
  names.startTag();
  declare("xmlns:p", "u", 1);
}

TEST_F(ReadNamesTest, ThereMayBeMany) {
  for (size_t index = 0; index < 5000; ++index) {
    EXPECT_EQ(named("n" + std::to_string(index)).bytes, "n" + std::to_string(index));
  }
  EXPECT_EQ(named("n77").bytes, "n77");
}

TEST_F(ReadNamesTest, TargetsHaveNoColon) {
  EXPECT_EQ(names.target("a")->text, "a");
  EXPECT_THROW(names.target("p:a"), NotTaken);
  EXPECT_THROW(names.target(""), NotTaken);
}

}  // namespace
}  // namespace xquery

// Importing library modules through the public interface.
#include "xquery/xquery.h"

#include <gtest/gtest.h>

#include <filesystem>
#include <fstream>
#include <string>
#include <unistd.h>
#include <vector>

namespace xquery {
namespace {

Value parse(std::string_view xml) {
  NSXMLParseError failure;
  Value document = NSXMLDocument::documentWithData(xml, NSXMLNodePreserveWhitespace, &failure);
  EXPECT_TRUE(document) << failure.message;
  return document;
}

// The items' strings, one after another with a blank between.
std::string strings(const Ref<NSArray>& items) {
  if (!items) return "(no result)";
  std::string all;
  for (const Value& item : items->objects()) {
    if (!all.empty()) all += ' ';
    all += XQueryItemStringValue(*item);
  }
  return all;
}

class Embedding : public testing::Test {
 protected:
  Ref<NSArray> evaluate(const std::string& source, const XQueryConstants& constants = {},
                        const Value& item = Value()) {
    const auto query = XQuery::xqueryWithSource(std::string_view(source));
    return context->evaluateXQuery(*query, constants, item, &error);
  }
  std::string failure() const {
    if (!error) return "";
    return std::to_string(error->err()) + " " + (error->msg() ? error->msg()->utf8() : "(none)");
  }

  Ref<XQueryContext> context = XQueryContext::xqueryContext();
  Ref<XQueryError> error;
};

// --- library modules -----------------------------------------------------------------------------

class ModuleImport : public Embedding {
 protected:
  void SetUp() override {
    folder = std::filesystem::temp_directory_path() /
             ("xquery-embedding-" + std::to_string(getpid()) + "-" + unique());
    std::filesystem::create_directory(folder);
  }
  void TearDown() override { std::filesystem::remove_all(folder); }
  static std::string unique() {
    return testing::UnitTest::GetInstance()->current_test_info()->name();
  }
  // Writes a module and answers its URL in quotes.
  std::string module(const std::string& name, std::string_view text) {
    std::ofstream(folder / name, std::ios::binary) << text;
    return location(name);
  }
  std::string location(const std::string& name) const {
    return "\"file://" + (folder / name).string() + "\"";
  }
  std::vector<int64_t> numbers(const std::string& source) const {
    std::vector<int64_t> all;
    if (const auto errors = XQuery::xqueryWithSource(std::string_view(source))->parseErrors()) {
      for (const Value& each : errors->objects()) all.push_back(cast<XQueryError>(each)->err());
    }
    return all;
  }
  std::filesystem::path folder;
};

TEST_F(ModuleImport, ImportedVariablesAreSeen) {
  const auto place = module("m.xq",
                            "module namespace m = 'urn:m'; declare variable $m:a := 20; "
                            "declare variable $m:b := $m:a + 1;");
  EXPECT_EQ(strings(evaluate("import module namespace m = 'urn:m' at " + place +
                             "; $m:a, $m:b, $m:b * 2")),
            "20 21 42");
  EXPECT_EQ(failure(), "");
}

// Imports are resolved when the importing module's own items have been applied.
TEST_F(ModuleImport, OwnVariablesGetTheirValuesBeforeImportedOnes) {
  const auto place = module("m.xq", "module namespace m = 'urn:m'; declare variable $m:a := 20;");
  EXPECT_FALSE(evaluate("import module namespace m = 'urn:m' at " + place +
                        "; declare variable $c := $m:a * 2; $c"));
  EXPECT_EQ(failure(), "8 reference to undefined variable \"m:a\"");
}

TEST_F(ModuleImport, AModuleMayBeNamedByAnotherPrefix) {
  const auto place = module("m.xq", "module namespace m = 'urn:m'; declare variable $m:a := 1;");
  EXPECT_EQ(strings(evaluate("import module namespace x = 'urn:m' at " + place + "; $x:a")), "1");
  EXPECT_EQ(failure(), "");
}

TEST_F(ModuleImport, AModulesNamesAreItsOwn) {
  const auto place = module("m.xq",
                            "module namespace m = 'urn:m'; declare default element namespace "
                            "'urn:d'; declare variable $m:a := /a;");
  const Value document = parse("<a xmlns='urn:d'>1</a>");
  EXPECT_EQ(strings(evaluate("import module namespace m = 'urn:m' at " + place + "; $m:a, /a", {},
                             document)),
            "1");
}

TEST_F(ModuleImport, TheFirstLocationThatWillDoIsTaken) {
  const auto missing = location("missing.xq");
  const auto main = module("main.xq", "1 + 1");
  const auto broken = module("broken.xq", "module namespace m = 'urn:m'; declare variable");
  const auto wrong = module("wrong.xq", "module namespace m = 'urn:m'; declare variable $x := 1;");
  const auto good = module("good.xq", "module namespace m = 'urn:m'; declare variable $m:a := 1;");
  const auto later =
      module("later.xq", "module namespace m = 'urn:m'; declare variable $m:a := 2;");
  EXPECT_EQ(strings(evaluate("import module namespace m = 'urn:m' at " + missing + ", " + main +
                             ", " + broken + ", " + wrong + ", " + good + ", " + later + "; $m:a")),
            "1");
  EXPECT_EQ(failure(), "");
}

TEST_F(ModuleImport, WithoutALocationThatWillDoTheImportFailsOnce) {
  const auto main = module("main.xq", "1 + 1");
  EXPECT_EQ(numbers("import module namespace m = 'urn:m' at " + main + "; 1"),
            std::vector<int64_t>{47});
}

TEST_F(ModuleImport, ASecondImportFindsEveryNameTaken) {
  const auto place = module("m.xq",
                            "module namespace m = 'urn:m'; declare variable $m:a := 1; "
                            "declare function m:f() { 1 };");
  const std::string source = "import module namespace m = 'urn:m' at " + place +
                             "; import module 'urn:m' at " + place + "; 1";
  EXPECT_EQ(numbers(source), (std::vector<int64_t>{37, 37}));
  EXPECT_FALSE(evaluate(source));
  EXPECT_EQ(failure().substr(0, 35), "37 duplicate definition of variable");
}

TEST_F(ModuleImport, ModulesMayImportEachOther) {
  module("a.xq", "module namespace a = 'urn:a'; import module namespace b = 'urn:b' at " +
                     location("b.xq") + "; declare variable $a:x := 1;");
  module("b.xq", "module namespace b = 'urn:b'; import module namespace a = 'urn:a' at " +
                     location("a.xq") + "; declare variable $b:y := 2;");
  EXPECT_EQ(
      strings(evaluate("import module namespace a = 'urn:a' at " + location("a.xq") + "; $a:x")),
      "1");
  EXPECT_EQ(failure(), "");
}

TEST_F(ModuleImport, WhatAModuleImportsIsNotHandedOn) {
  module("inner.xq", "module namespace i = 'urn:i'; declare variable $i:x := 5;");
  const auto outer =
      module("outer.xq", "module namespace o = 'urn:o'; import module namespace i = 'urn:i' at " +
                             location("inner.xq") + "; declare variable $o:y := $i:x + 1;");
  EXPECT_EQ(strings(evaluate("import module namespace o = 'urn:o' at " + outer + "; $o:y")), "6");
  EXPECT_EQ(failure(), "");
}

}  // namespace
}  // namespace xquery

// Importing library modules through the public interface.
#include "Engine/EmbeddingTesting.h"
#include "Platform/Loading/LoadingTestSupport.h"

#include <string>
#include <vector>

namespace xquery {
namespace {

// --- library modules -----------------------------------------------------------------------------

class ModuleImport : public Embedding {
 protected:
  // Writes a module and answers its URL in quotes.
  std::string module(const std::string& name, std::string_view text) {
    folder.write(name, text);
    return location(name);
  }
  std::string location(const std::string& name) const { return "\"" + folder.URL(name) + "\""; }
  std::vector<int64_t> numbers(const std::string& source) const {
    std::vector<int64_t> all;
    if (const auto errors = XQuery::xqueryWithSource(std::string_view(source))->parseErrors()) {
      for (const Value& each : errors->objects()) all.push_back(cast<XQueryError>(each)->err());
    }
    return all;
  }
  const TestFolder folder;
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

TEST_F(ModuleImport, ErrorsOfManyImportsOfManyNamesAreReportedUpToABound) {
  std::string declarations = "module namespace m = 'urn:m';";
  for (int i = 0; i < 400; ++i) {
    declarations += " declare variable $m:v" + std::to_string(i) + " := 1;";
  }
  const std::string import = "import module 'urn:m' at " + module("m.xq", declarations) + "; ";
  const auto errorsOf = [&](int imports) {
    std::string source;
    for (int i = 0; i < imports; ++i) source += import;
    return numbers(source + "1").size();
  };
  EXPECT_EQ(errorsOf(1 + 250), 100'000U);
  EXPECT_EQ(errorsOf(1 + 249), 99'600U);
  EXPECT_EQ(errorsOf(1 + 500), 100'000U);
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

// Each module imports the one after it; values and calls go all the way.
TEST_F(ModuleImport, AChainOfAThousandModules) {
  constexpr int count = 1000;
  for (int i = 0; i < count; ++i) {
    const std::string next = std::to_string(i + 1);
    const bool isLast = i + 1 == count;
    module(std::to_string(i) + ".xq",
           "module namespace m = 'urn:" + std::to_string(i) + "';" +
               (isLast ? ""
                       : " import module namespace n = 'urn:" + next + "' at " +
                             location(next + ".xq") + ";") +
               " declare variable $m:v := " + (isLast ? "1" : "$n:v + 1") +
               "; declare function m:f($i) { " + (isLast ? "$i" : "n:f($i + 1)") + " };");
  }
  const std::string import = "import module namespace m = 'urn:0' at " + location("0.xq") + "; ";
  EXPECT_EQ(strings(evaluate(import + "m:f(0), $m:v")), "999 1000");
  EXPECT_EQ(failure(), "");
}

// What was wrong with a rejected module is forgotten, but the module stays registered under its
// namespace: who asks for that next gets its declarations, the wrong ones among them.
TEST_F(ModuleImport, DeclarationsOfARejectedModuleAreEvaluatedLikeOthers) {
  module("b.xq",
         "module namespace b = 'urn:b'; declare variable $b:ok := 1; declare function b:path() { "
         "/zz:e }; declare function b:element() { <zz:e/> }; declare function b:attribute() { <e "
         "zz:a='1'/> }; declare function b:type() { 1 cast as zz:t };");
  const std::string import = "import module namespace b = 'urn:b' at " + location("b.xq") + "; ";
  EXPECT_EQ(numbers(import + "1"), std::vector<int64_t>{47});
  module("x1.xq", "module namespace x = 'urn:x'; " + import + "declare function x:f() { 1 };");
  const std::pair<std::string, std::string> calls[] = {
      {"path", "1"},
      {"element", "6 invalid type"},
      {"attribute", "6 invalid type"},
      {"type", "6 value does not match a required type"}};
  for (const auto& [function, expected] : calls) {
    module("x2.xq", "module namespace x = 'urn:x'; " + import +
                        "declare function x:f() { $b:ok, b:" + function + "() };");
    const std::string source = "import module namespace x = 'urn:x' at " + location("x1.xq") +
                               ", " + location("x2.xq") + "; x:f()";
    EXPECT_EQ(numbers(source), std::vector<int64_t>()) << function;
    const auto items = evaluate(source, {}, parse("<r/>"));
    EXPECT_EQ(items ? strings(items) : failure(), expected) << function;
  }
}

// The query and its context serve on.
TEST_F(ModuleImport, AQueryWithARejectedModuleFailsEachTimeAlike) {
  const auto bad =
      module("m.xq", "module namespace m = 'urn:m'; declare function m:f() { /zz:e };");
  const auto query = XQuery::xqueryWithSource(
      std::string_view("import module namespace m = 'urn:m' at " + bad + "; m:f()"));
  for (int i = 0; i < 2; ++i) {
    EXPECT_FALSE(context->evaluateXQuery(*query, {}, nullptr, &error));
    EXPECT_EQ(failure().substr(0, 24), "47 can't access module f");
  }
  EXPECT_EQ(strings(evaluate("1 + 1")), "2");
}

}  // namespace
}  // namespace xquery

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
  std::vector<std::string> descriptions(const std::string& source) const {
    std::vector<std::string> all;
    if (const auto errors = XQuery::xqueryWithSource(std::string_view(source))->parseErrors()) {
      for (const Value& each : errors->objects()) {
        all.push_back(cast<XQueryError>(each)->description()->utf8());
      }
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

TEST_F(ModuleImport, ImportedVariablesGetTheirValuesBeforeOwnOnes) {
  const auto place = module("m.xq",
                            "module namespace m = 'urn:m'; declare variable $m:a := 20; "
                            "declare function m:twice() { $m:a * 2 };");
  EXPECT_EQ(strings(evaluate("import module namespace m = 'urn:m' at " + place +
                             "; declare variable $c := $m:a; declare variable $d := m:twice(); "
                             "$c, $d")),
            "20 40");
  EXPECT_EQ(failure(), "");
}

// Whoever of them the query imports as well, and in whatever order.
TEST_F(ModuleImport, ModulesThatShareAThirdAreImportedTogether) {
  const auto import = [this](const std::string& prefix) {
    return "import module namespace " + prefix + " = 'urn:" + prefix + "' at " +
           location(prefix + ".xq") + "; ";
  };
  module("c.xq",
         "module namespace c = 'urn:c'; declare variable $c:x := 1; "
         "declare function c:f() { $c:x };");
  module("a.xq", "module namespace a = 'urn:a'; " + import("c") +
                     "declare variable $a:x := $c:x + 10; declare function a:f() { c:f() };");
  module("b.xq", "module namespace b = 'urn:b'; " + import("c") +
                     "declare variable $b:x := c:f() + 20; declare function b:f() { $c:x };");
  const std::string use = "declare variable $own := $a:x + $b:x; $own, a:f(), b:f()";
  for (const auto& imports :
       {import("a") + import("b"), import("b") + import("a"),
        import("c") + import("a") + import("b"), import("a") + import("c") + import("b"),
        import("b") + import("a") + import("c")}) {
    EXPECT_EQ(strings(evaluate(imports + use)), "32 1 1") << imports << failure();
  }
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

// What is missing, and what is no library module, has no error of its own.
TEST_F(ModuleImport, WithoutALocationThatWillDoTheImportFailsOnce) {
  const auto main = module("main.xq", "1 + 1") + ", " + location("missing.xq");
  EXPECT_EQ(numbers("import module namespace m = 'urn:m' at " + main + "; 1"),
            std::vector<int64_t>{47});
}

TEST_F(ModuleImport, AModuleThatCannotBeUsedSaysWhy) {
  const auto broken =
      module("broken.xq", "module namespace m = 'urn:m';\n\ndeclare variable $m:a := 1 +;");
  const auto wrong =
      module("wrong.xq", "module namespace m = 'urn:m';\ndeclare variable $m:a :=\n<p:none/>;");
  const auto errors =
      descriptions("import module namespace m = 'urn:m' at " + broken + ", " + wrong + "; $m:a");
  ASSERT_EQ(errors.size(), 3U);
  EXPECT_EQ(errors[0].find("XQueryError:47 - \"can't access module for prolog item module import:"),
            0U);
  EXPECT_EQ(errors[1],
            "XQueryError:3 - \"parse error invalid token (;)- declare variable $m:a := 1 +;\" at "
            "line:3\n  at " +
                folder.URL("broken.xq") + ":3");
  EXPECT_EQ(errors[2],
            "XQueryError:1 - \"can't resolve QName for \"p:none\"\" at line:3\n"
            "  at " +
                folder.URL("wrong.xq") + ":3");
}

TEST_F(ModuleImport, AnErrorOfAModuleKnowsTheModule) {
  const auto broken = module("broken.xq", "module namespace m = 'urn:m';\n#");
  const auto query =
      XQuery::xqueryWithSource("import module namespace m = 'urn:m' at " + broken + "; 1");
  const auto errors = query->parseErrors();
  ASSERT_TRUE(errors);
  ASSERT_EQ(errors->count(), 2U);
  EXPECT_FALSE(cast<XQueryError>(errors->objectAtIndex(0))->moduleURL());
  const auto* reason = cast<XQueryError>(errors->objectAtIndex(1));
  EXPECT_EQ(reason->moduleURL()->utf8(), folder.URL("broken.xq"));
  EXPECT_EQ(reason->err(), 3);
  EXPECT_EQ(reason->line(), 2);
  EXPECT_EQ(reason->msg()->utf8(), "invalid token (#) - #");
}

TEST_F(ModuleImport, WhatIsWrongFarDownIsSaidToo) {
  const auto importing = [this](const std::string& own, const std::string& other) {
    return "module namespace " + own + " = 'urn:" + own + "';\nimport module namespace " + other +
           " = 'urn:" + other + "' at " + location(other + ".xq") + "; declare variable $" + own +
           ":x := 1;";
  };
  module("c.xq", "module namespace c = 'urn:c';\n\n\n#");
  module("b.xq", importing("b", "c"));
  module("a.xq", importing("a", "b"));
  const auto errors =
      descriptions("import module namespace a = 'urn:a' at " + location("a.xq") + "; 1");
  ASSERT_EQ(errors.size(), 4U);
  EXPECT_NE(errors[0].find("module import:\"urn:a\""), std::string::npos);
  EXPECT_NE(errors[1].find("module import:\"urn:b\""), std::string::npos);
  EXPECT_EQ(errors[1].substr(errors[1].find('\n')), "\n  at " + folder.URL("a.xq"));
  EXPECT_NE(errors[2].find("module import:\"urn:c\""), std::string::npos);
  EXPECT_EQ(errors[2].substr(errors[2].find('\n')), "\n  at " + folder.URL("b.xq"));
  EXPECT_EQ(errors[3], "XQueryError:3 - \"invalid token (#) - #\" at line:4\n  at " +
                           folder.URL("c.xq") + ":4");
}

TEST_F(ModuleImport, ReasonsOfAnImportThatWorksInTheEndAreForgotten) {
  const auto broken = module("broken.xq", "module namespace m = 'urn:m';\n#");
  const auto good = module("good.xq", "module namespace m = 'urn:m'; declare variable $m:a := 1;");
  const std::string import =
      "import module namespace m = 'urn:m' at " + broken + ", " + good + "; ";
  EXPECT_EQ(descriptions(import + "import module namespace n = 'urn:n' at " +
                         location("missing.xq") + "; 1")
                .size(),
            1U);
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

// A rejected module stays registered under its namespace: who asks for that next gets its
// declarations, the wrong ones among them.
TEST_F(ModuleImport, DeclarationsOfARejectedModuleAreEvaluatedLikeOthers) {
  module("b.xq",
         "module namespace b = 'urn:b'; declare variable $b:ok := 1; declare function b:path() { "
         "/zz:e }; declare function b:element() { <zz:e/> }; declare function b:attribute() { <e "
         "zz:a='1'/> }; declare function b:type() { 1 cast as zz:t };");
  const std::string import = "import module namespace b = 'urn:b' at " + location("b.xq") + "; ";
  EXPECT_EQ(numbers(import + "1"), (std::vector<int64_t>{47, 1}));
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

// --- relative locations --------------------------------------------------------------------------

class RelativeLocations : public ModuleImport {
 protected:
  Ref<NSArray> evaluateAt(const std::string& moduleURL, const std::string& source) {
    XQueryLoading loading;
    loading.moduleURL = moduleURL;
    return context->evaluateXQuery(*XQuery::xqueryWithSource(std::string_view(source), loading), {},
                                   nullptr, &error);
  }
};

TEST_F(RelativeLocations, AreResolvedAgainstTheURLOfTheModuleTheyStandIn) {
  folder.write("lib/a.xq",
               "module namespace a = 'urn:a'; import module namespace b = 'urn:b' at 'deep/b.xq'; "
               "declare variable $a:x := $b:x; declare function a:doc() { doc('d.xml') };");
  folder.write("lib/deep/b.xq",
               "module namespace b = 'urn:b'; declare variable $b:x := doc('../d.xml')/d/text();");
  folder.write("lib/d.xml", "<d>below</d>");
  folder.write("d.xml", "<d>beside</d>");
  EXPECT_EQ(
      strings(evaluateAt(folder.URL("main.xq"),
                         "import module namespace a = 'urn:a' at 'lib/a.xq'; $a:x, a:doc()/d, "
                         "doc('d.xml')/d, doc(concat('d', '.xml'))/d")),
      "below below beside beside")
      << failure();
}

TEST_F(RelativeLocations, AreResolvedAgainstADeclaredBaseURIFirst) {
  folder.write("data/d.xml", "<d>data</d>");
  folder.write("data/m.xq", "module namespace m = 'urn:m'; declare variable $m:x := 1;");
  const std::string use =
      "import module namespace m = 'urn:m' at 'm.xq'; $m:x, string(doc('d.xml'))";
  const std::string base = folder.URL("data/");
  EXPECT_EQ(strings(evaluateAt("", "declare base-uri '" + base + "'; " + use)), "1 data");
  EXPECT_EQ(strings(evaluateAt("file:///elsewhere/", "declare base-uri '" + base + "'; " + use)),
            "1 data");
  EXPECT_EQ(strings(evaluateAt(folder.URL("main.xq"), "declare base-uri 'data/'; " + use)),
            "1 data");
}

TEST_F(RelativeLocations, NeedSomethingToBeResolvedAgainst) {
  folder.write("m.xq", "module namespace m = 'urn:m'; declare variable $m:x := 1;");
  const std::string use = "import module namespace m = 'urn:m' at 'm.xq'; $m:x";
  for (const std::string URL : {"", "relative/main.xq", "no URL", "\xFF"}) {
    EXPECT_FALSE(evaluateAt(URL, use)) << URL;
    EXPECT_EQ(failure().substr(0, 24), "47 can't access module f") << URL;
  }
}

TEST_F(RelativeLocations, TheURLShowsNowhereElse) {
  const std::string URL = folder.URL("main.xq");
  EXPECT_EQ(strings(evaluateAt(URL,
                               "count(static-base-uri()), count(base-uri(<a/>)), "
                               "count(base-uri(document { <a/> })), string(resolve-uri('x'))")),
            "0 0 0 x")
      << failure();
  const auto items = evaluateAt(URL, "<a/>");
  ASSERT_TRUE(items);
  EXPECT_EQ(cast<NSXMLNode>(items->objectAtIndex(0))->XMLString()->utf8(), "<a/>");
}

TEST_F(RelativeLocations, StylesheetsAndInnerQueriesFindTheirsToo) {
  folder.write("lib/style.xsl",
               "<xsl:stylesheet version='1.0' xmlns:xsl='http://www.w3.org/1999/XSL/Transform'>"
               "<xsl:output method='text'/><xsl:template match='/'>styled</xsl:template>"
               "</xsl:stylesheet>");
  folder.write("lib/d.xml", "<d>found</d>");
  const std::string URL = folder.URL("lib/main.xq");
  EXPECT_EQ(strings(evaluateAt(URL, "ext:xslt-uri(document { <a/> }, 'style.xsl')")), "styled");
  EXPECT_EQ(strings(evaluateAt(URL,
                               "ext:xslt(document { <a/> }, '<xsl:stylesheet version=\"1.0\" "
                               "xmlns:xsl=\"http://www.w3.org/1999/XSL/Transform\"><xsl:import "
                               "href=\"style.xsl\"/></xsl:stylesheet>')")),
            "styled");
  EXPECT_EQ(strings(evaluateAt(URL, "ext:eval('string(doc(\"d.xml\"))')")), "found");
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

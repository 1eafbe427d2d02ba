#include "Prolog/PrologTesting.h"

#include <gtest/gtest.h>

namespace xquery {
namespace {

using Errors = std::vector<std::string>;

const char* const localURI = "http://www.w3.org/2004/10/xquery-local-functions";

Ref<XQueryPrologItem> import(Ref<NSString> URI, XQueryPrologItemLocations locations,
                             Ref<NSString> prefix = nullptr) {
  return XQueryPrologItemModuleImport::moduleImport(std::move(URI), std::move(locations),
                                                    std::move(prefix), 4);
}

std::vector<std::string> declaredNames(const XQueryProlog& prolog) {
  std::vector<std::string> result;
  for (const auto& declaration : prolog.declarations()) {
    if (auto* variable = dyn_cast<XQueryVarDecl>(declaration)) {
      result.push_back("$" + variable->name()->localPart()->utf8());
    } else if (auto* function = dyn_cast<XQueryFunctionDecl>(declaration)) {
      result.push_back(function->name()->localPart()->utf8() + "/" +
                       std::to_string(function->params().size()));
    }
  }
  return result;
}

// --- local variables -----------------------------------------------------------------------------

TEST(LocalVariables, IDsCountFromOne) {
  const auto prolog = prologOf({});
  EXPECT_EQ(prolog->newLocalVariableIDForQName(qName("a")), 1);
  EXPECT_EQ(prolog->newLocalVariableIDForQName(qName("b")), 2);
  EXPECT_EQ(prolog->nextLocalVariableID(), 3);
  EXPECT_EQ(prolog->localVariableIDForQName(qName("a")), 1);
  EXPECT_EQ(prolog->localVariableIDForQName(qName("b")), 2);
  EXPECT_EQ(prolog->localVariableIDForQName(qName("c")), 0);
}

TEST(LocalVariables, InnerOneOfTheSameNameReplacesTheOuter) {
  const auto prolog = prologOf({});
  prolog->newLocalVariableIDForQName(qName("a"));
  EXPECT_EQ(prolog->newLocalVariableIDForQName(qName("a")), 2);
  EXPECT_EQ(prolog->localVariableIDForQName(qName("a")), 2);
}

TEST(LocalVariables, NameWhoseIDIsNotBelowTheCounterIsOutOfScope) {
  const auto prolog = prologOf({});
  prolog->newLocalVariableIDForQName(qName("a"));
  prolog->newLocalVariableIDForQName(qName("b"));
  prolog->setNextLocalVariableID(2);
  EXPECT_EQ(prolog->localVariableIDForQName(qName("a")), 1);
  EXPECT_EQ(prolog->localVariableIDForQName(qName("b")), 0);
  prolog->setNextLocalVariableID(1);
  EXPECT_EQ(prolog->localVariableIDForQName(qName("a")), 0);
}

TEST(LocalVariables, RestoredScopeShowsTheShadowedOuterVariable) {
  const auto prolog = prologOf({});
  prolog->newLocalVariableIDForQName(qName("a"));
  const auto scope = prolog->localScope();
  prolog->newLocalVariableIDForQName(qName("a"));
  prolog->newLocalVariableIDForQName(qName("a"));
  prolog->newLocalVariableIDForQName(qName("b"));
  prolog->restoreLocalScope(scope);
  EXPECT_EQ(prolog->nextLocalVariableID(), 2);
  EXPECT_EQ(prolog->localVariableIDForQName(qName("a")), 1);
  EXPECT_EQ(prolog->localVariableIDForQName(qName("b")), 0);
}

TEST(LocalVariables, InnerNameStaysHiddenWhenItsIDIsGivenOutAgain) {
  const auto prolog = prologOf({});
  const auto scope = prolog->localScope();
  prolog->newLocalVariableIDForQName(qName("inner"));
  prolog->restoreLocalScope(scope);
  EXPECT_EQ(prolog->newLocalVariableIDForQName(qName("other")), 1);
  EXPECT_EQ(prolog->localVariableIDForQName(qName("inner")), 0);
}

TEST(LocalVariables, ScopesNest) {
  const auto prolog = prologOf({});
  const auto outer = prolog->localScope();
  prolog->newLocalVariableIDForQName(qName("a"));
  const auto inner = prolog->localScope();
  prolog->newLocalVariableIDForQName(qName("a"));
  prolog->restoreLocalScope(inner);
  EXPECT_EQ(prolog->localVariableIDForQName(qName("a")), 1);
  prolog->restoreLocalScope(outer);
  EXPECT_EQ(prolog->localVariableIDForQName(qName("a")), 0);
  EXPECT_EQ(prolog->nextLocalVariableID(), 1);
}

// --- binding of declarations ---------------------------------------------------------------------

TEST(BindingPass, EveryBodyIsBoundOnceInOrderWithItsOwnProlog) {
  std::vector<std::pair<std::string, XQueryProlog*>> seen;
  const auto note = [&](const char* name) {
    return probe([&seen, name](XQueryProlog& prolog) { seen.emplace_back(name, &prolog); });
  };
  const auto prolog = prologOf(
      {function("local:f", {}, note("f")), variable("x", note("x")), variable("y", note("y"))});
  const std::vector<std::pair<std::string, XQueryProlog*>> expected = {
      {"f", prolog.get()}, {"x", prolog.get()}, {"y", prolog.get()}};
  EXPECT_EQ(seen, expected);
}

TEST(BindingPass, AllItemsAreAppliedBeforeAnyBodyIsBound) {
  XQueryVarDecl* later = nullptr;
  const auto prolog = prologOf(
      {variable("x", probe([&](XQueryProlog& p) { later = p.variableInfoForQName(qName("y")); })),
       variable("y")});
  ASSERT_NE(later, nullptr);
  EXPECT_EQ(later->name()->localPart()->utf8(), "y");
}

TEST(BindingPass, IDsRestartInEveryDeclaration) {
  std::vector<int64_t> ids;
  const auto take = [&] {
    return probe([&](XQueryProlog& p) {
      ids.push_back(p.newLocalVariableIDForQName(qName("i")));
      ids.push_back(p.newLocalVariableIDForQName(qName("j")));
    });
  };
  prologOf(
      {variable("x", take()), function("local:f", params({"a"}), take()), variable("y", take())});
  EXPECT_EQ(ids, (std::vector<int64_t>{1, 2, 2, 3, 1, 2}));
}

TEST(BindingPass, ParametersComeBeforeTheBody) {
  std::vector<int64_t> ids;
  const auto body = probe([&](XQueryProlog& p) {
    ids = {p.localVariableIDForQName(qName("a")), p.localVariableIDForQName(qName("b")),
           p.nextLocalVariableID()};
  });
  const auto prolog = prologOf({function("local:f", params({"a", "b"}), body)});
  EXPECT_EQ(ids, (std::vector<int64_t>{1, 2, 3}));
}

TEST(BindingPass, NamesOfOneFunctionAreNotVisibleInTheNext) {
  std::vector<int64_t> ids;
  const auto prolog = prologOf({
      function("local:f", params({"a", "b"})),
      function("local:g", params({"x", "y", "z"}), probe([&](XQueryProlog& p) {
                 ids = {p.localVariableIDForQName(qName("a")),
                        p.localVariableIDForQName(qName("b")),
                        p.localVariableIDForQName(qName("z"))};
               })),
  });
  EXPECT_EQ(ids, (std::vector<int64_t>{0, 0, 3}));
}

TEST(BindingPass, ANameOfTheFunctionBeforeIsNoDuplicateParameter) {
  const auto prolog = prologOf(
      {function("local:f", params({"a", "b"})), function("local:g", params({"x", "y", "a"}))});
  EXPECT_EQ(errorsOf(*prolog), Errors{});
}

TEST(BindingPass, ANameOfAVariableDeclarationIsNoDuplicateParameter) {
  const auto prolog = prologOf(
      {variable("v", probe([](XQueryProlog& p) { p.newLocalVariableIDForQName(qName("b")); })),
       function("local:g", params({"a", "b"}))});
  EXPECT_EQ(errorsOf(*prolog), Errors{});
}

TEST(BindingPass, DuplicateParameterIsError39) {
  const auto prolog = prologOf({function("local:f", params({"a", "b", "a"}))});
  EXPECT_EQ(errorsOf(*prolog), Errors{"39: more than one parameter with the same name"});
}

TEST(BindingPass, CounterIsBackAtOneAfterwards) {
  const auto prolog = prologOf({function("local:f", params({"a", "b"}))});
  EXPECT_EQ(prolog->nextLocalVariableID(), 1);
  EXPECT_EQ(prolog->localVariableIDForQName(qName("a")), 0);
}

TEST(BindingPass, ExternalDeclarationsAreSkipped) {
  const auto list = params({"a", "a"});
  const auto prolog = prologOf({variable("x", nullptr), function("local:f", list, nullptr)});
  EXPECT_EQ(errorsOf(*prolog), Errors{});
  EXPECT_EQ(list[0]->varID(), 0);
  EXPECT_TRUE(prolog->variableInfoForQName(qName("x"))->isExternal());
  EXPECT_TRUE(prolog->functionInfoForSignature({qName("f", localURI), 2})->isExternal());
}

// --- imports -------------------------------------------------------------------------------------

TEST(ModuleImport, WithoutLocationClauseIsError47Twice) {
  const auto prolog = prologOf({import(text("urn:m"), std::nullopt, text("m"))});
  const std::string expected =
      "47: can't access module for prolog item module import:\"urn:m\" for prefix:\"m\" at "
      "locations:\"\" line:4";
  EXPECT_EQ(errorsOf(*prolog), (Errors{expected, expected}));
  EXPECT_NE(prolog->errors()[0], prolog->errors()[1]);
}

TEST(ModuleImport, WithAnEmptyListOfLocationsIsError47Once) {
  const auto prolog = prologOf({import(text("urn:m"), std::vector<Ref<NSString>>{}, text("m"))});
  EXPECT_EQ(errorsOf(*prolog).size(), 1U);
  EXPECT_EQ(prolog->errors()[0]->err(), 47);
}

TEST(ModuleImport, LocationThatGivesNoModuleIsError47Once) {
  const auto prolog =
      prologOf({import(text("urn:m"), std::vector<Ref<NSString>>{text("file:///nowhere/a"),
                                                                 text("file:///nowhere/b")})});
  EXPECT_EQ(errorsOf(*prolog),
            Errors{"47: can't access module for prolog item module import:\"urn:m\" for "
                   "prefix:\"(null)\" at locations:\"file:///nowhere/a, file:///nowhere/b\" "
                   "line:4"});
}

TEST(ModuleImport, WithoutANamespaceFindsNoModule) {
  const auto prolog = prologOf({import(nullptr, std::vector<Ref<NSString>>{})});
  EXPECT_EQ(errorsOf(*prolog).size(), 1U);
}

class RegisteredModule : public testing::Test {
 protected:
  OwnRegistry modules;

  Ref<XQueryProlog> library(Items items) {
    items.insert(items.begin(), moduleNamespace("m", "urn:m"));
    return prologOf(items, modules);
  }
};

TEST_F(RegisteredModule, ItsDeclarationsAreCopiedInOrder) {
  const auto module =
      library({function("m:f", params({"a"})), variable("m:x"), function("m:f", params({}))});
  EXPECT_EQ(errorsOf(*module), Errors{});
  const auto main =
      prologOf({variable("own"), import(text("urn:m"), std::nullopt, text("p"))}, modules);
  EXPECT_EQ(errorsOf(*main), Errors{});
  EXPECT_EQ(declaredNames(*main), (std::vector<std::string>{"$own", "f/1", "$x", "f/0"}));
  EXPECT_EQ(main->variableInfoForQName(qName("x", "urn:m")),
            module->variableInfoForQName(qName("x", "urn:m")));
  EXPECT_EQ(main->functionInfoForSignature({qName("f", "urn:m"), 1}),
            module->functionInfoForSignature({qName("f", "urn:m"), 1}));
  EXPECT_EQ(&main->variableInfoForQName(qName("x", "urn:m"))->prolog(), module.get());
}

TEST_F(RegisteredModule, AddedByHandIsUsedAsWell) {
  const auto module = library({variable("m:x")});
  const int64_t id = modules->namespaceID(text("urn:alias"), true);
  modules->addProlog(module, id);
  const auto main = prologOf({import(text("urn:alias"), std::nullopt)}, modules);
  EXPECT_EQ(errorsOf(*main), Errors{});
  EXPECT_EQ(declaredNames(*main), std::vector<std::string>{"$x"});
}

TEST_F(RegisteredModule, ExternalDeclarationsAreCopiedToo) {
  library({variable("m:x", nullptr), function("m:f", {}, nullptr)});
  const auto main = prologOf({import(text("urn:m"), std::nullopt)}, modules);
  EXPECT_EQ(declaredNames(*main), (std::vector<std::string>{"$x", "f/0"}));
}

TEST_F(RegisteredModule, CopiedDeclarationsAreNotBoundAgain) {
  int bound = 0;
  const auto count = [&] { return probe([&](XQueryProlog&) { ++bound; }); };
  const auto list = params({"a", "a"});
  library({variable("m:x", count()), function("m:f", list, count())});
  EXPECT_EQ(bound, 2);
  const auto main = prologOf({import(text("urn:m"), std::nullopt)}, modules);
  EXPECT_EQ(bound, 2);
  EXPECT_EQ(errorsOf(*main), Errors{});
}

TEST_F(RegisteredModule, ImportedASecondTimeReportsEveryNameAsDuplicate) {
  library({variable("m:x"), function("m:f", params({"a"})), function("m:f")});
  const auto main =
      prologOf({import(text("urn:m"), std::nullopt), import(text("urn:m"), std::nullopt)}, modules);
  EXPECT_EQ(errorsOf(*main), (Errors{"37: duplicate definition of variable x",
                                     "37: duplicate definition of function f",
                                     "37: duplicate definition of function f"}));
  EXPECT_EQ(main->declarations().size(), 3U);
}

TEST_F(RegisteredModule, OwnDeclarationOfTheSameNameIsADuplicate) {
  library({variable("m:x"), function("m:f", params({"a"})), function("m:f")});
  const auto main = prologOf({import(text("urn:m"), std::nullopt, text("m")), variable("m:x"),
                              function("m:f", params({"a"}))},
                             modules);
  EXPECT_EQ(errorsOf(*main), (Errors{"37: duplicate definition of variable x",
                                     "37: duplicate definition of function f"}));
  EXPECT_EQ(declaredNames(*main), (std::vector<std::string>{"$x", "f/1", "f/0"}));
  EXPECT_EQ(&main->variableInfoForQName(qName("x", "urn:m"))->prolog(), main.get());
}

TEST_F(RegisteredModule, WhatItImportedItselfIsNotCopied) {
  prologOf({moduleNamespace("n", "urn:n"), variable("n:y"), function("n:g")}, modules);
  const auto module = library({import(text("urn:n"), std::nullopt), variable("m:x")});
  EXPECT_EQ(declaredNames(*module), (std::vector<std::string>{"$x", "$y", "g/0"}));
  const auto main = prologOf({import(text("urn:m"), std::nullopt)}, modules);
  EXPECT_EQ(declaredNames(*main), std::vector<std::string>{"$x"});
}

TEST_F(RegisteredModule, ThatImportsItselfEndsAndReportsDuplicates) {
  const auto module = library({import(text("urn:m"), std::nullopt), variable("m:x")});
  EXPECT_EQ(errorsOf(*module), Errors{"37: duplicate definition of variable x"});
  EXPECT_EQ(declaredNames(*module), std::vector<std::string>{"$x"});
}

TEST_F(RegisteredModule, ImportsAreResolvedInOrder) {
  prologOf({moduleNamespace("n", "urn:n"), variable("n:y")}, modules);
  library({variable("m:x")});
  const auto main = prologOf(
      {import(text("urn:m"), std::nullopt), import(text("urn:none"), std::vector<Ref<NSString>>{}),
       import(text("urn:n"), std::nullopt)},
      modules);
  EXPECT_EQ(declaredNames(*main), (std::vector<std::string>{"$x", "$y"}));
  EXPECT_EQ(main->errors().size(), 1U);
}

TEST_F(RegisteredModule, MainModuleUnderTheNamespaceHasNothingToCopy) {
  modules->addProlog(prologOf({variable("x")}), modules->namespaceID(text("urn:m"), true));
  const auto main = prologOf({import(text("urn:m"), std::nullopt)}, modules);
  EXPECT_EQ(declaredNames(*main), std::vector<std::string>{});
  EXPECT_EQ(errorsOf(*main), Errors{});
}

TEST_F(RegisteredModule, StaysAliveForWhoeverCopiedFromIt) {
  library({variable("m:x")});
  const auto main = prologOf({import(text("urn:m"), std::nullopt)}, modules);
  library({variable("m:y")});
  const auto& owner = main->variableInfoForQName(qName("x", "urn:m"))->prolog();
  EXPECT_EQ(shown(owner.modulePrefix()), "m");
  EXPECT_EQ(owner.namespaceID(text("urn:m")), 12);
}

}  // namespace
}  // namespace xquery

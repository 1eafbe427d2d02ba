#include "Context/XQueryContextInternal.h"
#include "Context/XQueryGlobals.h"
#include "Prolog/PrologTesting.h"
#include "xquery/Exception.h"

#include <gtest/gtest.h>

#include <functional>
#include <string>
#include <vector>

namespace xquery {
namespace {

// An expression that does what the test says when it is evaluated.
class Initializer : public XQueryExpr {
 public:
  using Work = std::function<Value(XQueryContextInternal&)>;
  explicit Initializer(Work work) : XQueryExpr(Kind::OtherExpr), _work(std::move(work)) {}
  void bindInfoForProlog(XQueryProlog&) override {}
  void visitParts(XQueryPartVisitor&) override {}
  Value computeValue(XQueryContext& context) const override { return _work(_internal(context)); }

 private:
  Work _work;
};

Ref<XQueryPrologItem> import(std::string_view URI) {
  return XQueryPrologItemModuleImport::moduleImport(text(URI), std::nullopt, nullptr, 0);
}

class Globals : public testing::Test {
 protected:
  // Evaluates to `value` and notes `name`.
  Ref<XQueryExpr> noting(const char* name, Value value = text("v")) {
    return make<Initializer>([this, name, value = std::move(value)](XQueryContextInternal&) {
      evaluated.emplace_back(name);
      return value;
    });
  }
  Ref<XQueryProlog> module(std::string_view prefix, Items items) {
    items.insert(items.begin(), moduleNamespace(prefix, "urn:" + std::string(prefix)));
    return prologOf(items, modules);
  }
  void evaluate(const XQueryProlog& prolog, const XQueryVariables& constants = {}) {
    XQuerySetConstants(constants, prolog, *context);
    XQueryEvaluateDeclarations(prolog, *context);
  }
  // "number: message" of the error that is raised.
  std::string failure(const XQueryProlog& prolog, const XQueryVariables& constants = {}) {
    try {
      evaluate(prolog, constants);
    } catch (const NSException&) {
      const auto& error = _internal(*context).error();
      return std::to_string(error->err()) + ": " + error->msg()->utf8();
    }
    return "";
  }
  std::string global(std::string_view local, std::string_view URI = {}) {
    NSObject* value = _internal(*context).globalForQName(*qName(local, URI));
    return shown(Value(value));
  }

  OwnRegistry modules;
  Ref<XQueryContext> context = XQueryContext::xqueryContext();
  std::vector<std::string> evaluated;
};

using Names = std::vector<std::string>;

TEST_F(Globals, ConstantsAreTakenAsGiven) {
  const auto prolog = prologOf({declareNamespace("p", "urn:p")});
  const Value array = NSArray::arrayWithObjects({text("a")});
  evaluate(*prolog, {{"x", array}, {"p:x", text("prefixed")}, {"n", NSNull::null()}});
  EXPECT_EQ(_internal(*context).globalForQName(*qName("x")), array.get());
  EXPECT_EQ(global("x", "urn:p"), "prefixed");
  EXPECT_EQ(_internal(*context).globalForQName(*qName("n")), NSNull::null());
}

TEST_F(Globals, ConstantsThatDoNotResolveAreSkipped) {
  const auto prolog = prologOf({});
  evaluate(*prolog, {{"q:x", text("a")}, {"\xFF", text("b")}, {"y", Value()}, {"z", text("c")}});
  EXPECT_EQ(global("x"), "(none)");
  EXPECT_EQ(global("y"), "(none)");
  EXPECT_EQ(global("z"), "c");
}

TEST_F(Globals, ConstantsDoNotTakeTheDefaultElementNamespace) {
  const auto prolog = prologOf({});
  prolog->setDefaultElementNamespace(text("urn:e"));
  evaluate(*prolog, {{"x", text("a")}});
  EXPECT_EQ(global("x"), "a");
}

TEST_F(Globals, DeclarationsAreEvaluatedInOrder) {
  const auto prolog = prologOf({variable("a", noting("a")), function("local:f", {}, noting("f")),
                                variable("b", noting("b"))});
  evaluate(*prolog);
  EXPECT_EQ(evaluated, (Names{"a", "b"}));
  EXPECT_EQ(global("a"), "v");
}

TEST_F(Globals, AFailureEndsTheLoop) {
  const auto prolog =
      prologOf({variable("a", noting("a")), variable("x", nullptr), variable("b", noting("b"))});
  EXPECT_EQ(failure(*prolog), "16: unresloved external variable - x");
  EXPECT_EQ(evaluated, Names{"a"});
}

TEST_F(Globals, ExternalVariableKeepsTheConstant) {
  const auto prolog = prologOf({variable("x", nullptr)});
  EXPECT_EQ(failure(*prolog, {{"x", text("given")}}), "");
  EXPECT_EQ(global("x"), "given");
}

TEST_F(Globals, DeclaredValueReplacesTheConstant) {
  evaluate(*prologOf({variable("x", noting("x"))}), {{"x", text("given")}});
  EXPECT_EQ(global("x"), "v");
}

TEST_F(Globals, InitializerWithoutAValueIsAnUnresolvedVariable) {
  EXPECT_EQ(failure(*prologOf({variable("x", noting("x", Value()))})),
            "16: unresloved external variable - x");
}

TEST_F(Globals, TheEmptySequenceIsAValue) {
  EXPECT_EQ(failure(*prologOf({variable("x", noting("x", NSNull::null()))})), "");
  EXPECT_EQ(_internal(*context).globalForQName(*qName("x")), NSNull::null());
}

TEST_F(Globals, ExternalFunctionsAreNeverResolved) {
  EXPECT_EQ(failure(*prologOf({function("local:f", {}, nullptr)})),
            "16: unresloved external function - f");
}

TEST_F(Globals, AnInitializerSeesTheStaticContextOfItsModule) {
  XQueryProlog* active = nullptr;
  bool ordered = true;
  const auto look = make<Initializer>([&](XQueryContextInternal& dynamic) {
    active = dynamic.activeProlog();
    ordered = dynamic.ordered();
    return Value(text("v"));
  });
  const auto library =
      module("m", {XQueryPrologItemOrdered::ordered(false, 0), variable("m:x", look)});
  const auto main = prologOf({import("urn:m")}, modules);
  _internal(*context).setActiveProlog(main.get());
  evaluate(*main);
  EXPECT_EQ(active, library.get());
  EXPECT_FALSE(ordered);
  EXPECT_EQ(_internal(*context).activeProlog(), main.get());
  EXPECT_TRUE(_internal(*context).ordered());
}

TEST_F(Globals, ImportedVariablesComeBeforeOwnOnes) {
  module("m", {variable("m:x", noting("m:x"))});
  const auto main = prologOf({import("urn:m"), variable("own", noting("own"))}, modules);
  evaluate(*main);
  EXPECT_EQ(evaluated, (Names{"m:x", "own"}));
}

TEST_F(Globals, WhatOnlyAnotherModuleImportsComesBeforeItsImporter) {
  module("k", {variable("k:z", noting("k:z"))});
  module("n", {variable("n:y", noting("n:y")), import("urn:k")});
  module("m", {function("m:f"), variable("m:x", noting("m:x")), import("urn:n")});
  const auto main = prologOf({import("urn:m"), variable("own", noting("own"))}, modules);
  evaluate(*main);
  EXPECT_EQ(evaluated, (Names{"k:z", "n:y", "m:x", "own"}));
  EXPECT_EQ(global("y", "urn:n"), "v");
  EXPECT_EQ(global("z", "urn:k"), "v");
}

TEST_F(Globals, AModuleImportedAlongTwoWaysIsEvaluatedOnce) {
  module("n", {variable("n:y", noting("n:y"))});
  module("a", {variable("a:x", noting("a:x")), import("urn:n")});
  module("b", {variable("b:x", noting("b:x")), import("urn:n")});
  const auto main = prologOf({import("urn:a"), import("urn:b")}, modules);
  evaluate(*main);
  EXPECT_EQ(evaluated, (Names{"n:y", "a:x", "b:x"}));
}

TEST_F(Globals, AModuleThatTheMainModuleImportsTooComesBeforeItsOtherImporters) {
  module("n", {variable("n:y", noting("n:y"))});
  module("m", {variable("m:x", noting("m:x")), import("urn:n")});
  evaluate(*prologOf({import("urn:m"), import("urn:n")}, modules));
  EXPECT_EQ(evaluated, (Names{"n:y", "m:x"}));
  evaluated.clear();
  evaluate(*prologOf({import("urn:n"), import("urn:m")}, modules));
  EXPECT_EQ(evaluated, (Names{"n:y", "m:x"}));
}

TEST_F(Globals, ModulesComeInTheOrderOfTheImports) {
  module("a", {variable("a:x", noting("a:x"))});
  module("b", {variable("b:x", noting("b:x")), variable("b:y", noting("b:y"))});
  evaluate(*prologOf({import("urn:b"), variable("own", noting("own")), import("urn:a")}, modules));
  EXPECT_EQ(evaluated, (Names{"b:x", "b:y", "a:x", "own"}));
}

TEST_F(Globals, AModuleThatDeclaresNothingHandsItsImportsVariablesOn) {
  module("n", {variable("n:y", noting("n:y"))});
  module("m", {import("urn:n")});
  evaluate(*prologOf({import("urn:m")}, modules));
  EXPECT_EQ(evaluated, Names{"n:y"});
}

TEST_F(Globals, ExternalVariableOfAnIndirectModuleNeedsAValue) {
  module("n", {variable("n:y", nullptr)});
  module("m", {variable("m:x", noting("m:x")), import("urn:n")});
  const auto main = prologOf({import("urn:m"), declareNamespace("n", "urn:n")}, modules);
  EXPECT_EQ(failure(*main), "16: unresloved external variable - y");
  EXPECT_EQ(failure(*main, {{"n:y", text("given")}}), "");
}

TEST_F(Globals, EveryEvaluationEvaluatesAnew) {
  module("n", {variable("n:y", noting("n:y"))});
  module("m", {variable("m:x", noting("m:x")), import("urn:n")});
  const auto main = prologOf({import("urn:m")}, modules);
  evaluate(*main);
  evaluate(*main);
  EXPECT_EQ(evaluated, (Names{"n:y", "m:x", "n:y", "m:x"}));
}

}  // namespace
}  // namespace xquery

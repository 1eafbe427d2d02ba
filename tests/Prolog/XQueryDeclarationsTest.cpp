#include "Platform/Base/Counting.h"
#include "Prolog/PrologTesting.h"
#include "Prolog/XQueryDeclarations.h"
#include "xquery/XQuery.h"

#include <gtest/gtest.h>

namespace xquery {
namespace {

// A sequence type that notes when it is bound.
class ProbeType : public XQueryTypeDeclaration {
 public:
  explicit ProbeType(int& bound) : XQueryTypeDeclaration(Item, nullptr), _bound(bound) {}
  void bindInfoForProlog(XQueryProlog& prolog) override { _bound += prolog.nextLocalVariableID(); }

 private:
  int& _bound;
};

TEST(VarDecl, KeepsItsParts) {
  const auto prolog = prologOf({});
  const auto name = qName("x");
  const auto type = XQueryTypeDeclaration::item();
  const auto expr = nothing();
  const auto declaration = XQueryVarDecl::varDecl(name, type, expr, *prolog);
  EXPECT_EQ(declaration->name(), name);
  EXPECT_EQ(declaration->type(), type.get());
  EXPECT_EQ(declaration->expr(), expr.get());
  EXPECT_EQ(&declaration->prolog(), prolog.get());
  EXPECT_FALSE(declaration->isExternal());
}

TEST(VarDecl, IsExternalWithoutExpression) {
  const auto prolog = prologOf({});
  EXPECT_TRUE(XQueryVarDecl::varDecl(qName("x"), nullptr, nullptr, *prolog)->isExternal());
}

TEST(FunctionDecl, KeepsItsParts) {
  const auto prolog = prologOf({});
  const auto name = qName("f", "urn:a");
  const auto type = XQueryTypeDeclaration::item();
  const auto expr = nothing();
  const auto list = params({"a", "b"});
  const auto declaration = XQueryFunctionDecl::functionDecl(name, type, list, expr, *prolog);
  EXPECT_EQ(declaration->name(), name);
  EXPECT_EQ(declaration->type(), type.get());
  EXPECT_EQ(declaration->params(), list);
  EXPECT_EQ(declaration->expr(), expr.get());
  EXPECT_EQ(&declaration->prolog(), prolog.get());
  EXPECT_FALSE(declaration->isExternal());
}

TEST(FunctionDecl, IsExternalWithoutExpression) {
  const auto prolog = prologOf({});
  EXPECT_TRUE(
      XQueryFunctionDecl::functionDecl(qName("f"), nullptr, {}, nullptr, *prolog)->isExternal());
}

TEST(Declarations, DoNotOwnTheirProlog) {
  const auto prolog = prologOf({variable("x"), function("local:f")});
  EXPECT_TRUE(NSCounting::hasOneReference(*prolog));
}

TEST(Param, IsAnExpressionWithAName) {
  const auto param = XQueryParam::paramWithName(text("p:x"), nullptr);
  EXPECT_TRUE(isa<XQueryExpr>(param.get()));
  EXPECT_EQ(shown(param->name()), "p:x");
  EXPECT_EQ(param->type(), nullptr);
  EXPECT_EQ(param->varID(), 0);
}

TEST(Param, TakesTheNextLocalVariableID) {
  const auto prolog = prologOf({});
  const auto list = params({"a", "b", "c"});
  for (const auto& param : list) param->bindInfoForProlog(*prolog);
  EXPECT_EQ(list[0]->varID(), 1);
  EXPECT_EQ(list[1]->varID(), 2);
  EXPECT_EQ(list[2]->varID(), 3);
  EXPECT_EQ(prolog->localVariableIDForQName(qName("b")), 2);
  EXPECT_TRUE(prolog->errors().empty());
}

TEST(Param, SecondOfOneNameIsError39AndTakesNoID) {
  const auto prolog = prologOf({});
  const auto list = params({"a", "a", "b"});
  for (const auto& param : list) param->bindInfoForProlog(*prolog);
  EXPECT_EQ(errorsOf(*prolog),
            (std::vector<std::string>{"39: more than one parameter with the same name"}));
  EXPECT_EQ(list[0]->varID(), 1);
  EXPECT_EQ(list[1]->varID(), 0);
  EXPECT_EQ(list[2]->varID(), 2);
}

TEST(Param, SameLocalPartInAnotherNamespaceIsAnotherName) {
  const auto prolog = prologOf({declareNamespace("p", "urn:p")});
  const auto list = params({"a", "p:a"});
  for (const auto& param : list) param->bindInfoForProlog(*prolog);
  EXPECT_TRUE(prolog->errors().empty());
  EXPECT_EQ(list[1]->varID(), 2);
}

TEST(Param, TwoPrefixesOfOneNamespaceMakeOneName) {
  const auto prolog = prologOf({declareNamespace("p", "urn:p"), declareNamespace("q", "urn:p")});
  const auto list = params({"p:a", "q:a"});
  for (const auto& param : list) param->bindInfoForProlog(*prolog);
  EXPECT_EQ(prolog->errors().size(), 1U);
}

TEST(Param, UnknownPrefixLeavesItUnboundWithoutError) {
  const auto prolog = prologOf({});
  const auto list = params({"nowhere:a"});
  list[0]->bindInfoForProlog(*prolog);
  EXPECT_EQ(list[0]->varID(), 0);
  EXPECT_EQ(prolog->nextLocalVariableID(), 1);
  EXPECT_TRUE(prolog->errors().empty());
}

TEST(Param, BindsItsTypeAfterTheName) {
  const auto prolog = prologOf({});
  int bound = 0;
  const auto first = XQueryParam::paramWithName(text("a"), make<ProbeType>(bound));
  first->bindInfoForProlog(*prolog);
  EXPECT_EQ(bound, 2);
  const auto again = XQueryParam::paramWithName(text("a"), make<ProbeType>(bound));
  again->bindInfoForProlog(*prolog);
  EXPECT_EQ(bound, 4);
}

TEST(Param, EvaluatesToTheEmptySequence) {
  const auto context = XQueryContext::xqueryContext();
  const auto param = XQueryParam::paramWithName(text("a"), nullptr);
  EXPECT_EQ(param->evaluateWithContext(*context), Value(NSNull::null()));
}

}  // namespace
}  // namespace xquery

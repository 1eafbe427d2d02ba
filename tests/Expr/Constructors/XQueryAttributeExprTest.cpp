#include "Expr/Constructors/ConstructorTesting.h"
#include "Expr/Constructors/XQueryAttributeExpr.h"
#include "Platform/Base/WorkMeter.h"
#include "xquery/Exception.h"

namespace xquery {
namespace {

class AttributeExpr : public Constructors {
 protected:
  static Ref<XQueryAttributeExpr> direct(std::string_view name, Exprs parts = {}) {
    return XQueryAttributeExpr::attributeExprWithName(text(name), std::move(parts), u'\'');
  }
  static Ref<XQueryComputedAttributeExpr> computed(Value name, Ref<XQueryExpr> value = nullptr) {
    return XQueryComputedAttributeExpr::computedAttributeExprWithName(constant(std::move(name)),
                                                                      std::move(value));
  }
};

TEST_F(AttributeExpr, KeepsItsDelimiter) {
  EXPECT_EQ(direct("a")->quoteChar(), u'\'');
  EXPECT_EQ(XQueryAttributeExpr::attributeExprWithName(text("a"), {}, u'"')->quoteChar(), u'"');
}

// A tag may have hundreds of thousands.
TEST_F(AttributeExpr, BindingOneIsAStepOfWork) {
  const auto attribute = direct("a");
  const int64_t before = workMeter.stepsLeft;
  attribute->bindInfoForProlog(*prolog);
  EXPECT_LT(workMeter.stepsLeft, before);
}

TEST_F(AttributeExpr, IsAParentlessNode) {
  const Value value = evaluated(*direct("a", {string("x")}));
  const auto* node = cast<NSXMLNode>(value);
  EXPECT_EQ(node->kind(), Kind::Attribute);
  EXPECT_FALSE(node->parent());
  EXPECT_EQ(node->textView(), "x");
}

TEST_F(AttributeExpr, PartsAreJoinedAndItemsSeparated) {
  const auto parts = constant(sequence({text("1"), Value(element("b")), text("2")}));
  EXPECT_EQ(xmlOf(*direct("a", {string("x"), parts, parts, constant(NSNull::null())})),
            "a=\"x1  21  2\"");
  EXPECT_EQ(xmlOf(*direct("a")), "a=\"\"");
}

TEST_F(AttributeExpr, WhiteSpaceBecomesSpacesInTheWholeValue) {
  EXPECT_EQ(xmlOf(*direct("a", {string("\t\n"), string("\r x")})), "a=\"    x\"");
  EXPECT_EQ(xmlOf(*computed(text("a"), string("\t\r\n"))), "a=\"   \"");
}

TEST_F(AttributeExpr, AnUnprefixedNameIsInNoNamespace) {
  prolog->setDefaultElementNamespace(text("urn:d"));
  _internal(*context).addNamespace(text("urn:c"), text(""));
  EXPECT_TRUE(cast<NSXMLNode>(evaluated(*direct("a")))->URIView().isEmpty());
}

TEST_F(AttributeExpr, APrefixIsResolvedWhenBound) {
  prolog->addPrefix(text("p"), text("urn:p"));
  const Value value = evaluated(*direct("p:a"));
  EXPECT_EQ(cast<NSXMLNode>(value)->nameView(), "p:a");
  EXPECT_EQ(cast<NSXMLNode>(value)->URIView(), "urn:p");
}

TEST_F(AttributeExpr, APrefixThatDoesNotResolveWaitsForTheContext) {
  const auto expr = direct("p:a");
  expr->setExprLine(2);
  EXPECT_EQ(errorOf(*expr), "1 3 can't resolve QName for \"p:a\"");
  _internal(*context).addNamespace(text("urn:p"), text("p"));
  EXPECT_EQ(cast<NSXMLNode>(expr->evaluateWithContext(*context))->URIView(), "urn:p");
}

TEST_F(AttributeExpr, InALibraryModuleAPrefixThatDoesNotResolveIsAnError) {
  prolog->setModulePrefix(text("m"));
  direct("p:a")->bindInfoForProlog(*prolog);
  ASSERT_EQ(prolog->errors().size(), 1u);
  EXPECT_EQ(prolog->errors()[0]->err(), 1);
}

TEST_F(AttributeExpr, WithoutANameThereIsNoAttribute) {
  const auto expr = XQueryAttributeExpr::attributeExprWithName(text("a"), {}, u'"');
  EXPECT_THROW(evaluatedOrThrown(*expr, *context), NSException) << "it was never bound";
  EXPECT_EQ(_internal(*context).error()->msg()->utf8(), "can't resolve QName for \"a\"");
  EXPECT_EQ(_internal(*context).error()->err(), 1);
}

TEST_F(AttributeExpr, NamesOfDeclarationsAreRefused) {
  const char* const refused = "44 1 Attribute namesapce is xmlns";
  EXPECT_EQ(errorOf(*direct("xmlns")), refused);
  EXPECT_EQ(errorOf(*computed(text("xmlns"))), refused);
  prolog->addPrefix(text("p"), text("http://www.w3.org/2000/xmlns"));
  EXPECT_EQ(errorOf(*direct("p:a")), refused);
  EXPECT_EQ(errorOf(*computed(text("p:a"))), refused);
  prolog->setDefaultElementNamespace(text("urn:d"));
  EXPECT_EQ(errorOf(*computed(text("xmlns"))), refused) << "whatever its namespace";
}

TEST_F(AttributeExpr, AComputedNameMayBeAnyNameValue) {
  prolog->addPrefix(text("p"), text("urn:p"));
  EXPECT_EQ(xmlOf(*computed(text("p:a"), string("1"))), "p:a=\"1\"");
  const auto qName = XQueryQName::qname(text("q:b"), text("urn:q"));
  const Value value = evaluated(*computed(qName));
  EXPECT_EQ(cast<NSXMLNode>(value)->nameView(), "q:b");
  EXPECT_EQ(cast<NSXMLNode>(value)->URIView(), "urn:q");
}

TEST_F(AttributeExpr, AComputedNameIsExactlyOneName) {
  EXPECT_EQ(errorOf(*computed(NSNull::null())), "6 0 invalid type for automization");
  EXPECT_EQ(errorOf(*computed(sequence({text("a"), text("b")}))),
            "6 0 invalid type for automization");
  EXPECT_EQ(errorOf(*computed(text("p:a"))), "6 0 value does not match a required type");
  EXPECT_EQ(errorOf(*computed(NSURL::URLWithString(text("urn:a")))), "6 1 invalid type");
}

TEST_F(AttributeExpr, TheNameIsEvaluatedBeforeTheValue) {
  const auto expr = computed(NSNull::null(), constant(XQueryError::error(7, "seven")));
  EXPECT_EQ(errorOf(*expr), "6 0 invalid type for automization");
}

}  // namespace
}  // namespace xquery

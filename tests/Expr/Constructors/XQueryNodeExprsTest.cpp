#include "Expr/Constructors/ConstructorTesting.h"
#include "Expr/Constructors/XQueryNodeExprs.h"
#include "xquery/Exception.h"

namespace xquery {
namespace {

class NodeExprs : public Constructors {
 protected:
  static Value oneTwo() { return sequence({text("1"), Value(element("b")), text("2")}); }
  static Ref<XQueryExpr> pi(Value name, Value content) {
    return XQueryProcessingInstructionExpr::processingInstructionExprWithName(
        constant(std::move(name)), constant(std::move(content)));
  }
  static Ref<XQueryExpr> document(Value content) {
    return XQueryDocumentExpr::documentWithExpr(constant(std::move(content)));
  }
};

// --- text and comments ---------------------------------------------------------------------------

TEST_F(NodeExprs, ATextOfNothingIsNothing) {
  EXPECT_TRUE(isa<NSNull>(evaluated(*XQueryTextExpr::textExprWithValue(constant(NSNull::null())))));
  EXPECT_TRUE(isa<NSNull>(evaluated(*XQueryTextExpr::textExprWithValue(constant(sequence({}))))));
  EXPECT_EQ(xmlOf(*XQueryTextExpr::textExprWithValue(string(""))), "");
}

TEST_F(NodeExprs, ItemsOfATextAreSeparated) {
  EXPECT_EQ(xmlOf(*XQueryTextExpr::textExprWithValue(constant(oneTwo()))), "1  2");
}

TEST_F(NodeExprs, ACommentOfNothingIsEmpty) {
  EXPECT_EQ(xmlOf(*XQueryCommentExpr::commentExprWithValue(constant(NSNull::null()))), "<!---->");
  EXPECT_EQ(xmlOf(*XQueryCommentExpr::commentExprWithValue(constant(oneTwo()))), "<!--1  2-->");
}

TEST_F(NodeExprs, WhatACommentCannotHoldIsAnError) {
  for (const char* refused : {"--", "a--b", "a-", "-"}) {
    const auto expr = XQueryCommentExpr::commentExprWithValue(string(refused));
    expr->setExprLine(4);
    EXPECT_EQ(errorOf(*expr), "72 5 invalid comment") << refused;
  }
  EXPECT_EQ(xmlOf(*XQueryCommentExpr::commentExprWithValue(string("-a-b"))), "<!---a-b-->");
}

// --- processing instructions ---------------------------------------------------------------------

TEST_F(NodeExprs, TheTargetIsTheLocalPartOfTheName) {
  EXPECT_EQ(xmlOf(*pi(text("p"), oneTwo())), "<?p 1  2?>");
  EXPECT_EQ(xmlOf(*pi(XQueryQName::qname(text("q:p"), text("urn:q")), NSNull::null())), "<?p?>");
  EXPECT_EQ(errorOf(*pi(text("q:p"), NSNull::null())), "6 0 value does not match a required type");
}

TEST_F(NodeExprs, LeadingWhiteSpaceOfTheContentIsDropped) {
  EXPECT_EQ(xmlOf(*pi(text("p"), text(" \t\n\rx "))), "<?p x ?>");
  EXPECT_EQ(xmlOf(*pi(text("p"), text("  "))), "<?p?>");
}

TEST_F(NodeExprs, TheContentDoesNotEndTheInstruction) {
  const char* const refused = "26 1 processing instruction content cannot contain ?>";
  EXPECT_EQ(errorOf(*pi(text("p"), text("x?>y"))), refused);
  EXPECT_EQ(errorOf(*pi(text("p"), text("?>"))), refused);
  EXPECT_EQ(errorOf(*pi(text("xml"), text("?>"))), refused) << "content comes before the target";
  EXPECT_EQ(xmlOf(*pi(text("p"), text("?x>"))), "<?p ?x>?>");
}

TEST_F(NodeExprs, AnInstructionThatCannotBeMadeIsAnError) {
  for (const char* refused : {"xml", "XML", "xMl", ""}) {
    EXPECT_EQ(errorOf(*pi(text(refused), NSNull::null())), "6 1 invalid type") << refused;
  }
  EXPECT_EQ(xmlOf(*pi(text("xmlx"), NSNull::null())), "<?xmlx?>");
}

// --- documents -----------------------------------------------------------------------------------

TEST_F(NodeExprs, ADocumentMayBeEmpty) {
  const Value value = evaluated(*document(NSNull::null()));
  EXPECT_EQ(value->kind(), Kind::Document);
  EXPECT_FALSE(cast<NSXMLNode>(value)->firstChild());
}

TEST_F(NodeExprs, ADocumentAdoptsItsChildren) {
  const auto a = element("a");
  const auto word = NSXMLNode::textWithStringValue(view("t"));
  const auto comment = NSXMLNode::commentWithStringValue(view("c"));
  const Value value = evaluated(*document(sequence({Value(comment), Value(a), Value(word)})));
  EXPECT_EQ(a->parent(), value.get());
  EXPECT_EQ(word->parent(), value.get());
  EXPECT_EQ(comment->parent(), value.get());
}

TEST_F(NodeExprs, TextsOfADocumentStayApartAndAtomicValuesDoNot) {
  const auto word = NSXMLNode::textWithStringValue(view("t"));
  const Value value =
      evaluated(*document(sequence({text("1"), text("2"), Value(word), Value(word), text("3")})));
  std::string texts;
  for (const NSXMLNode* child = cast<NSXMLNode>(value)->firstChild(); child;
       child = child->nextSibling()) {
    texts += child->textView().utf8() + "|";
  }
  EXPECT_EQ(texts, "1 2|t|t|3|");
}

TEST_F(NodeExprs, ADocumentTakesNoSecondElement) {
  const char* const refused = "28 1 invalid node for document";
  EXPECT_EQ(errorOf(*document(sequence({Value(element("a")), Value(element("b"))}))), refused);
  const auto inner = NSXMLDocument::document();
  inner->addChild(element("c"));
  EXPECT_EQ(errorOf(*document(sequence({Value(element("a")), Value(inner)}))), refused);
  EXPECT_EQ(errorOf(*document(sequence({Value(inner), Value(inner)}))), refused);
}

TEST_F(NodeExprs, ADocumentTakesNoAttributesAndNamespaces) {
  const char* const refused = "28 1 invalid node for document";
  EXPECT_EQ(errorOf(*document(Value(NSXMLNode::attributeWithName(view("a"), view("1"))))), refused);
  EXPECT_EQ(errorOf(*document(Value(NSXMLNode::namespaceWithName(view("a"), view("u"))))), refused);
}

// --- namespaces ----------------------------------------------------------------------------------

TEST_F(NodeExprs, ANamespaceHasPrefixAndURI) {
  const auto expr = XQueryNamespaceExpr::namespaceExprWithName(text("p"), constant(oneTwo()));
  const Value value = evaluated(*expr);
  ASSERT_EQ(value->kind(), Kind::Namespace);
  EXPECT_EQ(cast<NSXMLNode>(value)->nameView(), "p");
  EXPECT_EQ(cast<NSXMLNode>(value)->textView(), "1  2");
  EXPECT_FALSE(expr->constantNode()) << "its value has to be evaluated";
}

TEST_F(NodeExprs, ALiteralNamespaceIsKnownBeforehand) {
  const auto expr = XQueryNamespaceExpr::namespaceExprWithName(text(""), string("urn:d"));
  ASSERT_TRUE(expr->constantNode());
  EXPECT_EQ(expr->constantNode()->nameView(), "");
  EXPECT_EQ(expr->constantNode()->textView(), "urn:d");
  EXPECT_FALSE(XQueryNamespaceExpr::namespaceExprWithName(text(""), integer("1"))->constantNode());
}

TEST_F(NodeExprs, ReservedPrefixesAreRefused) {
  for (const char* prefix : {"xml", "xmlns"}) {
    const auto expr = XQueryNamespaceExpr::namespaceExprWithName(text(prefix), string("urn:u"));
    expr->setExprLine(6);
    EXPECT_EQ(errorOf(*expr), "70 7 invalid namespace declaration") << prefix;
  }
}

// --- lines, base URIs, depth ---------------------------------------------------------------------

TEST_F(NodeExprs, DocumentsElementsAndInstructionsRecordTheBaseURI) {
  prolog->setBaseURI(text("http://b/"));
  auto& dynamic = _internal(*context);
  const Value node = evaluated(*document(NSNull::null()));
  EXPECT_EQ(dynamic.baseURIForNode(cast<NSXMLNode>(node))->utf8(), "http://b/");
  const Value instruction = evaluated(*pi(text("p"), NSNull::null()));
  EXPECT_EQ(dynamic.baseURIForNode(cast<NSXMLNode>(instruction))->utf8(), "http://b/");
  EXPECT_EQ(dynamic.baseURINodeCount(), 2u);
  const Value comment = evaluated(*XQueryCommentExpr::commentExprWithValue(string("c")));
  const Value word = evaluated(*XQueryTextExpr::textExprWithValue(string("c")));
  EXPECT_FALSE(dynamic.baseURIForNode(cast<NSXMLNode>(comment)));
  EXPECT_FALSE(dynamic.baseURIForNode(cast<NSXMLNode>(word)));
  EXPECT_EQ(dynamic.baseURINodeCount(), 2u);
}

TEST_F(NodeExprs, NestingIsBoundedByTheStack) {
  Ref<XQueryExpr> expr = string("x");
  for (int depth = 0; depth < 200000; ++depth) {
    expr = depth % 2 ? Ref<XQueryExpr>(XQueryDocumentExpr::documentWithExpr(expr))
                     : Ref<XQueryExpr>(XQueryTextExpr::textExprWithValue(expr));
  }
  expr->bindInfoForProlog(*prolog);
  // Binding may need no stack at all, where its last call is a jump; evaluating always does.
  EXPECT_LE(prolog->errors().size(), 1U);
  EXPECT_THROW(evaluatedOrThrown(*expr, *context), NSException);
  EXPECT_EQ(_internal(*context).error()->msg()->utf8(), "limit: expression nested too deeply");
}

}  // namespace
}  // namespace xquery

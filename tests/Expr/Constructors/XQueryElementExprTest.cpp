#include "Expr/Constructors/ConstructorTesting.h"
#include "Expr/Constructors/XQueryAttributeExpr.h"
#include "Expr/Constructors/XQueryElementContentString.h"
#include "Expr/Constructors/XQueryElementExpr.h"
#include "Expr/Constructors/XQueryNodeExprs.h"
#include "Platform/Base/ProcessorTime.h"
#include "xquery/Exception.h"

#include <memory>
#include <thread>

namespace xquery {
namespace {

class ElementExpr : public Constructors {
 protected:
  static Ref<XQueryElementExpr> direct(std::string_view name, Exprs items = {},
                                       Exprs attributes = {}) {
    return XQueryElementExpr::elementeExprWithName(text(name), std::move(attributes),
                                                   std::move(items));
  }
  static Ref<XQueryExpr> declaration(std::string_view prefix, std::string_view URI) {
    return XQueryNamespaceExpr::namespaceExprWithName(text(prefix),
                                                      XQueryLiteral::literalWithValue(text(URI)));
  }
  static Ref<XQueryExpr> attribute(std::string_view name, std::string_view value) {
    return XQueryAttributeExpr::attributeExprWithName(text(name), {string(value)}, u'"');
  }
  static Ref<XQueryExpr> run(std::string_view characters) {
    auto result = XQueryElementContentString::stringWithChar(static_cast<char16_t>(characters[0]));
    for (const char unit : characters.substr(1)) result->addChar(static_cast<char16_t>(unit));
    return XQueryLiteral::literalWithValue(result);
  }
  // The constructed element itself.
  Ref<NSXMLElement> made(XQueryExpr& expr) { return cast<NSXMLElement>(evaluated(expr)); }
  static std::string namespacesOf(const NSXMLElement& element) {
    std::string result;
    for (const NSXMLNode* node = element.firstNamespace(); node;
         node = NSXMLElement::nextNamespace(node)) {
      result += node->nameView().utf8() + "=" + node->textView().utf8() + " ";
    }
    return result;
  }
};

// --- factories -----------------------------------------------------------------------------------

TEST_F(ElementExpr, EachItemOfADirectConstructorIsEvaluatedOnItsOwn) {
  EXPECT_EQ(xmlOf(*direct("a", {integer("1"), integer("2")})), "<a>12</a>");
}

TEST_F(ElementExpr, AComputedConstructorHasOneContentItem) {
  const auto both = XQueryElementExpr::elementExprWithNameExpr(
      string("a"), constant(sequence({text("1"), text("2")})));
  EXPECT_EQ(xmlOf(*both), "<a>1 2</a>");
  const auto none = XQueryElementExpr::elementExprWithNameExpr(string("a"), nullptr);
  EXPECT_EQ(xmlOf(*none), "<a/>");
  const auto constantName = XQueryElementExpr::elementExprWithNameExpr(text("b"), nullptr);
  EXPECT_EQ(xmlOf(*constantName), "<b/>");
}

// --- binding -------------------------------------------------------------------------------------

TEST_F(ElementExpr, DeclarationsAreFoundAmongAttributesAndContent) {
  const auto expr =
      direct("p:a", {declaration("q", "urn:q"), direct("q:b")}, {declaration("p", "urn:p")});
  const auto a = made(*expr);
  EXPECT_EQ(namespacesOf(*a), "p=urn:p q=urn:q ");
  EXPECT_EQ(a->firstChild()->URIView().utf8(), "urn:q");
}

TEST_F(ElementExpr, DeclarationsEndWithTheBinding) {
  const auto expr = direct("p:a", {}, {declaration("p", "urn:p")});
  expr->bindInfoForProlog(*prolog);
  EXPECT_FALSE(prolog->namespaceForPrefix(view("p")));
  EXPECT_TRUE(prolog->errors().empty());
}

TEST_F(ElementExpr, InAMainModuleANameThatDoesNotResolveWaits) {
  const auto expr = direct("p:a");
  expr->setExprLine(3);
  EXPECT_EQ(errorOf(*expr), "1 4 can't resolve QName for \"p:a\"");
  EXPECT_EQ(prolog->qNameReferences().size(), 1u);
  EXPECT_TRUE(prolog->errors().empty());
  _internal(*context).addNamespace(text("urn:p"), text("p"));
  const Value value = expr->evaluateWithContext(*context);
  EXPECT_EQ(cast<NSXMLElement>(value)->nameView().utf8(), "a") << "keeps no prefix";
  EXPECT_EQ(cast<NSXMLElement>(value)->URIView().utf8(), "urn:p");
}

TEST_F(ElementExpr, InALibraryModuleANameThatDoesNotResolveIsAnError) {
  prolog->setModulePrefix(text("m"));
  const auto expr = direct("p:a");
  expr->setExprLine(3);
  expr->bindInfoForProlog(*prolog);
  ASSERT_EQ(prolog->errors().size(), 1u);
  EXPECT_EQ(prolog->errors()[0]->description()->utf8(),
            "XQueryError:1 - \"can't resolve QName for \"p:a\"\" at line:4");
  EXPECT_TRUE(prolog->qNameReferences().empty());
}

TEST_F(ElementExpr, InALibraryModuleANameWithoutPrefixIsInNoNamespace) {
  prolog->setModulePrefix(text("m"));
  _internal(*context).addNamespace(text("urn:d"), text(""));
  EXPECT_EQ(made(*direct("a"))->URIView().utf8(), "");
}

TEST_F(ElementExpr, ANameThatWaitsMayGetADefaultNamespaceLater) {
  const auto expr = direct("a");
  EXPECT_EQ(made(*expr)->URIView().utf8(), "");
  EXPECT_EQ(prolog->qNameReferences().size(), 1u);
  _internal(*context).addNamespace(text("urn:d"), text(""));
  EXPECT_EQ(cast<NSXMLElement>(expr->evaluateWithContext(*context))->URIView().utf8(), "urn:d");
  _internal(*context).addNamespace(nullptr, text(""));
  EXPECT_EQ(cast<NSXMLElement>(expr->evaluateWithContext(*context))->URIView().utf8(), "");
}

// --- namespaces ----------------------------------------------------------------------------------

TEST_F(ElementExpr, APrefixOfThePrologIsDeclaredOnTheOutermostElementOnly) {
  prolog->addPrefix(text("p"), text("urn:p"));
  const auto a = made(*direct("p:a", {direct("p:b")}));
  EXPECT_EQ(namespacesOf(*a), "p=urn:p ");
  EXPECT_EQ(namespacesOf(*cast<NSXMLElement>(a->firstChild())), "");
}

TEST_F(ElementExpr, APrefixThatMeansSomethingElseIsDeclaredAnew) {
  const auto inner = direct("p:b", {}, {declaration("p", "urn:2")});
  const auto a = made(*direct("p:a", {inner}, {declaration("p", "urn:1")}));
  EXPECT_EQ(namespacesOf(*a), "p=urn:1 ");
  EXPECT_EQ(namespacesOf(*cast<NSXMLElement>(a->firstChild())), "p=urn:2 ");
}

TEST_F(ElementExpr, ADefaultNamespaceOfThePrologIsDeclaredOnce) {
  prolog->setDefaultElementNamespace(text("urn:d"));
  const auto a = made(*direct("a", {direct("b")}));
  EXPECT_EQ(namespacesOf(*a), "=urn:d ");
  EXPECT_EQ(namespacesOf(*cast<NSXMLElement>(a->firstChild())), "");
}

TEST_F(ElementExpr, PredefinedPrefixesAreNotDeclared) {
  for (const char* name : {"xml:a", "xs:a", "xsi:a"}) {
    EXPECT_EQ(namespacesOf(*made(*direct(name))), "") << name;
  }
  EXPECT_EQ(namespacesOf(*made(*direct("fn:a"))), "fn=http://www.w3.org/2004/10/xpath-functions ");
}

TEST_F(ElementExpr, AnAttributeBringsItsDeclaration) {
  prolog->addPrefix(text("p"), text("urn:p"));
  const auto a = made(*direct("a", {}, {attribute("p:b", "1"), attribute("p:c", "2")}));
  EXPECT_EQ(namespacesOf(*a), "p=urn:p ");
}

TEST_F(ElementExpr, EachElementHasCopiesOfItsDeclarations) {
  const auto expr = direct("a", {}, {declaration("p", "urn:p")});
  const auto first = made(*expr);
  const Value second = expr->evaluateWithContext(*context);
  EXPECT_EQ(first->firstNamespace()->parent(), first.get());
  EXPECT_EQ(cast<NSXMLElement>(second)->firstNamespace()->parent(), second.get());
}

TEST_F(ElementExpr, NamespacesGoWhenAnErrorEndsTheConstructor) {
  prolog->addPrefix(text("q"), text("urn:q"));
  const auto expr = direct("q:a", {XQueryCommentExpr::commentExprWithValue(string("--"))},
                           {declaration("p", "urn:p"), attribute("q:b", "1")});
  EXPECT_EQ(errorOf(*expr), "72 1 invalid comment");
  EXPECT_FALSE(_internal(*context).inScopeNamespaceForPrefix(view("p")));
  EXPECT_FALSE(_internal(*context).inScopeNamespaceForPrefix(view("q")));
}

TEST_F(ElementExpr, NamespacesOfAFormerParentAreKeptWhereTheyAreNotInherited) {
  const auto parsed = NSXMLDocument::documentWithData(
      "<o xmlns:o='urn:o'><r xmlns:p='urn:p' xmlns='urn:d'><p:a xmlns:q='urn:q'/></r></o>", 0);
  NSXMLNode* child = parsed->rootElement()->firstChild()->firstChild();
  const auto expr = direct("x", {constant(Value(child))}, {declaration("p", "urn:p")});
  EXPECT_EQ(namespacesOf(*cast<NSXMLElement>(made(*expr)->firstChild())), "q=urn:q ");
  prolog->setInheritNamespaces(false);
  EXPECT_EQ(namespacesOf(*cast<NSXMLElement>(made(*expr)->firstChild())),
            "q=urn:q =urn:d o=urn:o ");
  EXPECT_EQ(namespacesOf(*cast<NSXMLElement>(child)), "q=urn:q ") << "the original is as it was";
}

TEST_F(ElementExpr, KeepingManyNamespacesTakesTimeInProportion) {
  const auto query = XQuery::xqueryWithSource("declare inherit-namespaces no; <x>{//a}</x>");
  const auto secondsToKeep = [&](size_t count) {
    constexpr size_t mostInATag = 3000;
    std::string start;
    std::string end;
    for (size_t index = 0; index < count; ++index) {
      if (index % mostInATag == 0) {
        start += start.empty() ? "<e" : "><e";
        end += "</e>";
      }
      start += " xmlns:p" + std::to_string(index) + "='urn:p'";
    }
    const auto parsed = NSXMLDocument::documentWithData(start + "><a/>" + end, 0);
    Ref<NSArray> result;
    const double seconds =
        processorSecondsOf([&] { result = context->evaluateXQuery(*query, {}, parsed, nullptr); });
    const auto* a = cast<NSXMLElement>(cast<NSXMLNode>(result->objectAtIndex(0))->firstChild());
    size_t kept = 0;
    for (const auto* node = a->firstNamespace(); node; node = NSXMLElement::nextNamespace(node)) {
      ++kept;
    }
    EXPECT_EQ(kept, count);
    return seconds;
  };
  EXPECT_TRUE(growsInProportion(secondsToKeep, 24000));
}

// --- content -------------------------------------------------------------------------------------

TEST_F(ElementExpr, NamespacesAndOtherObjectsAreLeftOut) {
  const auto declared = NSXMLNode::namespaceWithName(view("p"), view("urn:p"));
  const auto expr = direct("a", {constant(sequence({text("x"), Value(declared), text("y")})),
                                 constant(NSData::dataWithBytes("x"))});
  EXPECT_EQ(xmlOf(*expr), "<a>xy</a>");
  EXPECT_FALSE(declared->parent());
}

TEST_F(ElementExpr, AnErrorAmongTheContentIsRaised) {
  const auto expr = direct("a", {constant(XQueryError::error(7, "seven"))});
  EXPECT_EQ(errorOf(*expr), "7 0 seven");
}

TEST_F(ElementExpr, SequencesWithinSequencesAreFlat) {
  const Value nested = sequence({text("1"), sequence({text("2"), NSNull::null()}), sequence({}),
                                 sequence({sequence({text("3")})})});
  EXPECT_EQ(xmlOf(*direct("a", {constant(nested)})), "<a>1 2 3</a>");
}

TEST_F(ElementExpr, AdoptionKeepsIdentity) {
  const auto child = element("b");
  const auto attribute = NSXMLNode::attributeWithName(view("c"), view("1"));
  const auto comment = NSXMLNode::commentWithStringValue(view("x"));
  const auto expr =
      direct("a", {constant(sequence({Value(attribute), Value(child), Value(comment)}))});
  const auto first = made(*expr);
  EXPECT_EQ(child->parent(), first.get());
  EXPECT_EQ(attribute->parent(), first.get());
  EXPECT_EQ(comment->parent(), first.get());
  const Value second = expr->evaluateWithContext(*context);
  EXPECT_EQ(child->parent(), first.get());
  EXPECT_EQ(cast<NSXMLNode>(second)->XMLString()->utf8(), "<a c=\"1\"><b/><!--x--></a>");
}

TEST_F(ElementExpr, TextNodesAreNeverAdopted) {
  const auto word = NSXMLNode::textWithStringValue(view("x"));
  const auto a = made(*direct("a", {constant(Value(word))}));
  EXPECT_FALSE(word->parent());
  EXPECT_EQ(a->childCount(), 1u);
}

TEST_F(ElementExpr, ThePrefixOfDeclarationsIsNoElements) {
  const Value name = XQueryQName::qname(text("xmlns:a"), text("urn:a"));
  const auto expr = XQueryElementExpr::elementExprWithNameExpr(constant(name), nullptr);
  EXPECT_EQ(errorOf(*expr), "6 1 invalid type");
}

TEST_F(ElementExpr, APrefixWithoutANamespaceNamesNoElement) {
  for (const auto& URI : {Ref<NSString>(), text("")}) {
    const Value name = XQueryQName::qname(text("p:a"), URI);
    const auto expr = XQueryElementExpr::elementExprWithNameExpr(constant(name), nullptr);
    EXPECT_EQ(errorOf(*expr), "6 1 invalid type");
  }
}

TEST_F(ElementExpr, AnAttributeWithThePrefixOfDeclarationsIsWrittenWithAnother) {
  const auto attribute = NSXMLNode::attributeWithName(view("xmlns:a"), view("1"), view("urn:a"));
  EXPECT_EQ(xmlOf(*direct("e", {constant(attribute)})), "<e xmlns:ns1=\"urn:a\" ns1:a=\"1\"/>");
}

TEST_F(ElementExpr, AttributesOfOnePrefixAndDifferentURIsAreBothKept) {
  const auto one = NSXMLNode::attributeWithName(view("p:b"), view("1"), view("urn:1"));
  const auto two = NSXMLNode::attributeWithName(view("p:b"), view("2"), view("urn:2"));
  const auto a = made(*direct("a", {constant(sequence({Value(one), Value(two)}))}));
  EXPECT_EQ(a->attributeCount(), 2u);
  EXPECT_EQ(a->attributeForLocalName(view("b"), view("urn:2"))->textView().utf8(), "2");
  const auto again = NSXMLDocument::documentWithData(a->XMLString()->utf8(), 0);
  ASSERT_TRUE(again) << a->XMLString()->utf8();
  EXPECT_EQ(again->rootElement()->attributeForLocalName(view("b"), view("urn:2"))->textView(), "2");
}

TEST_F(ElementExpr, ManyAttributesAreDistinctFromEachOther) {
  std::vector<Value> attributes;
  for (int index = 0; index < 1000; ++index) {
    const std::string name = "a" + std::to_string(index);
    attributes.push_back(NSXMLNode::attributeWithName(view(name), view(name)));
  }
  const auto a = made(*direct("a", {constant(sequence(attributes))}));
  EXPECT_EQ(a->attributeCount(), 1000u);
  EXPECT_EQ(a->attributeForName(view("a999"))->index(), -1) << "in the order of their arrival";
  for (const int again : {0, 15, 16, 17, 999}) {
    auto repeated = attributes;
    const std::string name = "a" + std::to_string(again);
    repeated.push_back(NSXMLNode::attributeWithName(view(name), view("x")));
    EXPECT_EQ(errorOf(*direct("a", {constant(sequence(repeated))})),
              "25 1 Attribute name not distinct")
        << again;
  }
}

// --- comments and CDATA sections that stand in the query -----------------------------------------

TEST_F(ElementExpr, ANodeThatStandsInTheQueryIsNeverMoved) {
  const auto comment = items("<!--x-->");
  ASSERT_EQ(comment.size(), 1u);
  const auto host = element("host");
  EXPECT_FALSE(host->addChild(cast<NSXMLNode>(comment[0])));
  EXPECT_TRUE(host->addChild(cast<NSXMLNode>(comment[0])->copy()));
  EXPECT_EQ(host->XMLString()->utf8(), "<host><!--x--></host>");

  const auto query = XQuery::xqueryWithSource("let $c := <!--x--> return (<a>{$c}</a>, $c)");
  for (int round = 0; round < 3; ++round) {
    const auto result = context->evaluateXQuery(*query, {}, nullptr, nullptr);
    ASSERT_TRUE(result);
    EXPECT_EQ(cast<NSXMLNode>(result->objectAtIndex(0))->XMLString()->utf8(), "<a><!--x--></a>");
    EXPECT_FALSE(cast<NSXMLNode>(result->objectAtIndex(1))->parent());
  }
}

TEST_F(ElementExpr, OneQueryServesSeveralThreads) {
  const auto query = XQuery::xqueryWithSource(
      "declare base-uri 'http://x/'; declare namespace q = 'urn:q';"
      "for $i in 1 to 50 return <q:a xmlns:p='urn:p' b='{$i}'><!--c--><![CDATA[<]]><p:b/>{"
      "<!--d-->, document {<!--e-->, <c/>}}</q:a>");
  const std::string expected =
      "<q:a xmlns:p=\"urn:p\" xmlns:q=\"urn:q\" b=\"50\"><!--c-->&lt;<p:b/><!--d--><!--e--><c/>"
      "</q:a>";
  std::vector<std::string> found(4);
  std::vector<std::thread> threads;
  for (std::string& last : found) {
    threads.emplace_back([&query, &last] {
      const auto own = XQueryContext::xqueryContext();
      for (int round = 0; round < 20; ++round) {
        const auto result = own->evaluateXQuery(*query, {}, nullptr, nullptr);
        last = cast<NSXMLNode>(result->objectAtIndex(49))->XMLString()->utf8();
      }
    });
  }
  for (std::thread& thread : threads) thread.join();
  for (const std::string& last : found) EXPECT_EQ(last, expected);
}

// --- memory --------------------------------------------------------------------------------------

// A small element and what belongs to it are one block as far as they fit. Whatever the lengths,
// the element is the one that is put together node by node.
TEST_F(ElementExpr, AttributesAndTextsAreTheSameHoweverTheyFit) {
  const std::string letters(300, 'x');
  for (const size_t first : {0u, 1u, 7u, 8u, 9u, 100u}) {
    for (const size_t second : {0u, 3u, 8u, 13u, 200u}) {
      for (const bool isWide : {false, true}) {
        std::string word = letters.substr(0, first);
        if (isWide) word += "\xC3\xA9";
        const std::string other = letters.substr(0, second);
        // The lengths of values are guessed at, the lengths of literals are known.
        const auto expr = XQueryElementExpr::elementeExprWithName(
            text("a"),
            {attribute("b", word),
             XQueryAttributeExpr::attributeExprWithName(text("c"), {constant(text(other))}, u'"')},
            {constant(text(word)), direct("d"), run("y"), constant(text(other))});
        const auto flat = XQueryElementExpr::elementeExprWithName(
            text("a"), {attribute("b", other)}, {run("y"), constant(text(word))});
        const auto expected = element("a");
        expected->addAttribute(NSXMLNode::attributeWithName(view("b"), text(word)->view()));
        expected->addAttribute(NSXMLNode::attributeWithName(view("c"), view(other)));
        if (!word.empty()) {
          expected->addChild(NSXMLNode::textWithStringValue(text(word)->view()));
        }
        expected->addChild(element("d"));
        expected->addChild(NSXMLNode::textWithStringValue(view("y" + other)));
        EXPECT_EQ(xmlOf(*expr), expected->XMLString()->utf8());
        EXPECT_EQ(xmlOf(*flat), "<a b=\"" + other + "\">y" + word + "</a>");
      }
    }
  }
}

TEST_F(ElementExpr, AStartTagOfManyAttributesIsNoBurden) {
  Exprs attributes;
  for (int index = 0; index < 5000; ++index) {
    attributes.push_back(attribute("a" + std::to_string(index), "some value"));
  }
  const auto a = made(*direct("a", {}, attributes));
  EXPECT_EQ(a->attributeCount(), 5000u);
  EXPECT_EQ(a->attributeForName(view("a4999"))->textView(), "some value");
}

// --- depth ---------------------------------------------------------------------------------------

TEST_F(ElementExpr, NestingIsBoundedByTheStackWhileBinding) {
  Ref<XQueryExpr> expr = direct("a");
  for (int depth = 0; depth < 200000; ++depth) expr = direct("a", {expr});
  expr->bindInfoForProlog(*prolog);
  ASSERT_FALSE(prolog->errors().empty());
  EXPECT_EQ(prolog->errors().back()->msg()->utf8(), "limit: expression nested too deeply");
}

TEST_F(ElementExpr, NestingIsBoundedByTheStackWhileEvaluating) {
  Ref<XQueryExpr> expr = direct("a");
  expr->bindInfoForProlog(*prolog);
  for (int depth = 0; depth < 200000; ++depth) {
    expr = XQueryElementExpr::elementExprWithNameExpr(
        XQueryQNameReference::qNameReferenceWithQName(XQueryQName::qname(text("a"), nullptr), 0),
        expr);
  }
  EXPECT_THROW(evaluatedOrThrown(*expr, *context), NSException);
  EXPECT_EQ(_internal(*context).error()->msg()->utf8(), "limit: expression nested too deeply");
}

// Each attribute declares a prefix of its own.
TEST_F(ElementExpr, ManyDeclarationsTakeLinearTime) {
  const auto secondsFor = [&](size_t count) {
    const std::string query = "count(in-scope-prefixes(<e>{for $i in 1 to " +
                              std::to_string(count) +
                              " return attribute {QName(concat('urn:', $i), "
                              "concat('p', $i, ':a'))} {1}}</e>))";
    return processorSecondsOf([&] {
      const auto counted = items(query);
      ASSERT_EQ(counted.size(), 1u);
      EXPECT_EQ(XQueryItemStringValue(*counted[0]), std::to_string(count + 1));
    });
  };
  EXPECT_TRUE(growsInProportion(secondsFor, 8000));
}

TEST_F(ElementExpr, SomeThousandLevelsAreFine) {
  std::string query;
  for (int depth = 0; depth < 2000; ++depth) query += "<a>";
  for (int depth = 0; depth < 2000; ++depth) query += "</a>";
  const auto result = items(query);
  ASSERT_EQ(result.size(), 1u);
  const NSXMLNode* node = cast<NSXMLNode>(result[0]);
  while (node->firstChild()) node = node->firstChild();
  EXPECT_EQ(node->level(), 1999);
}

}  // namespace
}  // namespace xquery

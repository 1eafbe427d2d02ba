// The shapes of what the builders make.
#include "Expr/Constructors/XQueryElementContentString.h"
#include "Expr/Operators/XQueryOperatorExpr.h"
#include "Expr/Paths/XQueryNameTest.h"
#include "Expr/Paths/XQueryPath.h"
#include "Expr/XQueryLeaves.h"
#include "Expr/XQueryLists.h"
#include "Functions/XQueryFunctionCall.h"
#include "Parser/Builders.h"
#include "Parser/ParserText.h"
#include "Parser/XQueryParser.h"
#include "Parser/XQueryTokens.h"
#include "Types/XQueryNumber.h"
#include "Types/XQueryString.h"
#include "xquery/Collection.h"

#include <gtest/gtest.h>

namespace xquery {
namespace {

Ref<XQueryParsedModule> module(std::string_view query) {
  const auto parser = XQueryParser::parserWithSource(NSString::stringWithUTF8(query));
  EXPECT_TRUE(parser->errors().empty())
      << query << "\n"
      << (parser->errors().empty() ? "" : parser->errors()[0]->msg()->utf8());
  return parser->parsedModule();
}
// Writes an expression in a form that shows its tree.
std::string shape(const XQueryExpr* expr);

std::string testShape(const XQueryExpr* test) {
  if (const auto* name = dyn_cast<XQueryNameTest>(test)) return name->name()->utf8();
  if (const auto* wild = dyn_cast<XQueryWildCardNameTest>(test)) {
    return (wild->prefix() ? wild->prefix()->utf8() : "*") + ":" +
           (wild->localName() ? wild->localName()->utf8() : "*");
  }
  return "kind" + std::to_string(cast<XQueryTypeDeclaration>(test)->type());
}

std::string stepShape(const XQueryStep* step) {
  std::string result;
  if (const auto* axis = dyn_cast<XQueryAxisStep>(step)) {
    result = std::to_string(axis->axis()) + "::" + testShape(axis->expr());
  } else if (isa<XQueryRootStep>(step)) {
    result = "root";
  } else {
    result = "filter(" + shape(step->expr()) + ")";
  }
  for (const auto& predicate : step->predicates()) result += "[" + shape(predicate.get()) + "]";
  return result;
}

std::string shape(const XQueryExpr* expr) {
  if (!expr) return "absent";
  if (const auto* list = dyn_cast<XQueryExprList>(expr)) {
    std::string result;
    for (size_t index = 0; index < list->count(); ++index) {
      result += (index ? "," : "") + shape(list->objectAtIndex(index));
    }
    return list->count() == 1 ? result : "{" + result + "}";
  }
  if (const auto* op = dyn_cast<XQueryOperatorExpr>(expr)) {
    const std::string right = shape(op->right());
    const std::string code = std::to_string(op->operatorType());
    return op->left() ? "(" + shape(op->left()) + " " + code + " " + right + ")"
                      : "(" + code + " " + right + ")";
  }
  if (const auto* path = dyn_cast<XQueryPathExpr>(expr)) {
    std::string result = "path:";
    for (const XQueryStep* step = path->step(); step; step = step->next()) {
      result += (step == path->step() ? "" : "/") + stepShape(step);
    }
    return result;
  }
  if (const auto* literal = dyn_cast<XQueryLiteral>(expr)) {
    if (isa<NSNull>(literal->literalValue())) return "()";
    if (const auto* text = dyn_cast<NSString>(literal->literalValue())) {
      return "'" + text->utf8() + "'";
    }
    return cast<NSNumber>(literal->literalValue())->stringValue();
  }
  if (isa<XQueryContextItem>(expr)) return ".";
  if (const auto* call = dyn_cast<XQueryFunctionCall>(expr)) {
    std::string result = call->name()->utf8() + "(";
    for (size_t index = 0; call->args() && index < call->args()->count(); ++index) {
      result += (index ? "; " : "") + shape(call->args()->objectAtIndex(index));
    }
    return result + ")";
  }
  if (isa<XQueryVariable>(expr)) return "$";
  return "?";
}

std::string bodyShape(std::string_view query) {
  const auto result = module(query);
  return result ? shape(result->body().get()) : "none";
}

// The only expression of a query's body.
const XQueryExpr* onlyExpr(const XQueryParsedModule& parsedModule) {
  return cast<XQueryExprList>(parsedModule.body().get())->objectAtIndex(0);
}

// --- lists and literals ------------------------------------------------------------------------

TEST(Builders, CommaListsKeepTheirOrder) {
  EXPECT_EQ(bodyShape("1, 2, 3"), "{1,2,3}");
  EXPECT_EQ(bodyShape("1, (2, 3), 4"), "{1,{2,3},4}");
  EXPECT_EQ(bodyShape("()"), "()");
}

TEST(Builders, LiteralsHaveTheirTypes) {
  const auto type = [](const char* query) {
    const auto result = module(query);
    const auto* literal = cast<XQueryLiteral>(onlyExpr(*result));
    return cast<XQueryNumber>(literal->literalValue())->typeID();
  };
  EXPECT_EQ(type("1"), XQueryTypeInteger);
  EXPECT_EQ(type("1.5"), XQueryTypeDecimal);
  EXPECT_EQ(type("1e3"), XQueryTypeDouble);
  const auto text = module("'a'");
  EXPECT_TRUE(isa<XQueryString>(cast<XQueryLiteral>(onlyExpr(*text))->literalValue()));
  EXPECT_EQ(bodyShape("123456789012345678901234567890"), "123456789012345678901234567890");
}

TEST(Builders, ValidateIsAnAbsentOperand) {
  EXPECT_EQ(bodyShape("validate { 1 }"), "()") << "in a list it becomes an empty literal";
  EXPECT_EQ(bodyShape("1, validate lax { 2 }, validate strict { 3 }"), "{1,(),()}");
  EXPECT_EQ(bodyShape("1 + validate { 2 }"), "(1 3 ())");
  EXPECT_EQ(bodyShape("(validate { 2 })"), "()");
}

TEST(Builders, VariablesAndTheContextItem) {
  EXPECT_EQ(bodyShape("$x"), "$");
  EXPECT_EQ(bodyShape("."), ".");
  EXPECT_EQ(onlyExpr(*module(".")), XQueryContextItem::contextItem());
}

// --- operators ---------------------------------------------------------------------------------

TEST(Builders, CallsKeepTheirNameAndTheirArguments) {
  EXPECT_EQ(bodyShape("f()"), "f()");
  EXPECT_EQ(bodyShape("p:f(1)"), "p:f(1)");
  EXPECT_EQ(bodyShape("f(1, (2, 3), (), $x)"), "f(1; {2,3}; (); $)");
  EXPECT_EQ(bodyShape("f(g(1, 2), h())"), "f(g(1; 2); h())");
}

TEST(Builders, ACallWithoutArgumentsHasNoList) {
  const auto result = module("f()");
  EXPECT_FALSE(cast<XQueryFunctionCall>(onlyExpr(*result))->args());
}

TEST(Builders, EveryOperatorHasItsCode) {
  const struct {
    const char* text;
    int code;
  } rows[] = {{"or", 1},   {"and", 2}, {"+", 3},     {"-", 4},   {"*", 5},          {"div", 6},
              {"idiv", 7}, {"mod", 8}, {"union", 9}, {"|", 9},   {"intersect", 10}, {"except", 11},
              {"to", 12},  {"=", 13},  {"!=", 14},   {"<", 15},  {"<=", 16},        {">", 17},
              {">=", 18},  {"eq", 19}, {"ne", 20},   {"lt", 21}, {"le", 22},        {"gt", 23},
              {"ge", 24},  {"is", 25}, {"<<", 26},   {">>", 27}};
  for (const auto& row : rows) {
    EXPECT_EQ(bodyShape(std::string("1 ") + row.text + " 2"),
              "(1 " + std::to_string(row.code) + " 2)");
  }
}

TEST(Builders, ChainsAreLeftAssociative) {
  EXPECT_EQ(bodyShape("1 - 2 - 3"), "((1 4 2) 4 3)");
  EXPECT_EQ(bodyShape("1 + 2 - 3 + 4"), "(((1 3 2) 4 3) 3 4)");
  EXPECT_EQ(bodyShape("1 * 2 div 3 idiv 4 mod 5"), "((((1 5 2) 6 3) 7 4) 8 5)");
  EXPECT_EQ(bodyShape("1 or 2 or 3"), "((1 1 2) 1 3)");
  EXPECT_EQ(bodyShape("1 and 2 and 3"), "((1 2 2) 2 3)");
  EXPECT_EQ(bodyShape("1 union 2 | 3"), "((1 9 2) 9 3)");
  EXPECT_EQ(bodyShape("1 intersect 2 except 3"), "((1 10 2) 11 3)");
}

TEST(Builders, PrecedenceIsThatOfTheLayers) {
  EXPECT_EQ(bodyShape("1 or 2 and 3 = 4 to 5 + 6 * 7 union 8 intersect 9"),
            "(1 1 (2 2 (3 13 (4 12 (5 3 (6 5 (7 9 (8 10 9))))))))");
  EXPECT_EQ(bodyShape("1 * 2 + 3"), "((1 5 2) 3 3)");
  EXPECT_EQ(bodyShape("(1 + 2) * 3"), "((1 3 2) 5 3)");
}

TEST(Builders, AChainAfterAnAbsentOperandKeepsItsOperators) {
  EXPECT_EQ(bodyShape("validate { 1 } - 2 - 3"), "((() 4 2) 4 3)");
}

TEST(Builders, SignsFoldIntoOne) {
  EXPECT_EQ(bodyShape("- 1"), "(4 1)");
  EXPECT_EQ(bodyShape("+ 1"), "(3 1)");
  EXPECT_EQ(bodyShape("- - 1"), "(3 1)");
  EXPECT_EQ(bodyShape("- + 1"), "(4 1)");
  EXPECT_EQ(bodyShape("+ - + - - 1"), "(4 1)");
  EXPECT_EQ(bodyShape("1 - - 2"), "(1 4 (4 2))");
  EXPECT_EQ(bodyShape("-1 + -2"), "((4 1) 3 (4 2))");
}

// --- paths -------------------------------------------------------------------------------------

TEST(Builders, EveryAxisHasItsCode) {
  const struct {
    const char* axis;
    int code;
  } rows[] = {
      {"child", 1},  {"descendant", 2},        {"descendant-or-self", 3}, {"attribute", 4},
      {"self", 5},   {"following-sibling", 6}, {"following", 7},          {"ancestor", 8},
      {"parent", 9}, {"preceding", 10},        {"preceding-sibling", 11}, {"ancestor-or-self", 12}};
  for (const auto& row : rows) {
    EXPECT_EQ(bodyShape(std::string(row.axis) + "::a"), "path:" + std::to_string(row.code) + "::a");
  }
}

TEST(Builders, Abbreviations) {
  EXPECT_EQ(bodyShape("a"), "path:1::a");
  EXPECT_EQ(bodyShape("@a"), "path:4::a");
  EXPECT_EQ(bodyShape(".."), "path:9::kind10");
  EXPECT_EQ(bodyShape("/"), "path:root");
  EXPECT_EQ(bodyShape("/a"), "path:root/1::a");
  EXPECT_EQ(bodyShape("//a"), "path:root/3::kind10/1::a");
  EXPECT_EQ(bodyShape("a//b"), "path:1::a/3::kind10/1::b");
  EXPECT_EQ(bodyShape("a/b//c/d"), "path:1::a/1::b/3::kind10/1::c/1::d");
  EXPECT_EQ(bodyShape("//a//b"), "path:root/3::kind10/1::a/3::kind10/1::b");
}

TEST(Builders, NodeTests) {
  EXPECT_EQ(bodyShape("p:a"), "path:1::p:a");
  EXPECT_EQ(bodyShape("*"), "path:1::*:*");
  EXPECT_EQ(bodyShape("p:*"), "path:1::p:*");
  EXPECT_EQ(bodyShape("*:a"), "path:1::*:a");
  EXPECT_EQ(bodyShape("text()/comment()/node()"), "path:1::kind9/1::kind8/1::kind10");
  EXPECT_EQ(bodyShape("element()/attribute()/processing-instruction()/document-node()"),
            "path:1::kind5/1::kind7/1::kind6/1::kind4");
}

TEST(Builders, ALoneFilterStepIsItsExpression) {
  EXPECT_EQ(bodyShape("(1, 2)"), "{1,2}");
  EXPECT_EQ(bodyShape("((1))"), "1");
  EXPECT_EQ(bodyShape("$x"), "$");
}

TEST(Builders, OtherFilterStepsStay) {
  EXPECT_EQ(bodyShape("$x[1]"), "path:filter($)[1]");
  EXPECT_EQ(bodyShape("$x/a"), "path:filter($)/1::a");
  EXPECT_EQ(bodyShape("a/(b, c)"), "path:1::a/filter({path:1::b,path:1::c})");
  EXPECT_EQ(bodyShape("/."), "path:root/filter(.)");
  EXPECT_EQ(bodyShape("./a"), "path:filter(.)/1::a");
}

TEST(Builders, PredicatesKeepTheirOrder) {
  EXPECT_EQ(bodyShape("a[1][2, 3]/b[c]"), "path:1::a[1][{2,3}]/1::b[path:1::c]");
  EXPECT_EQ(bodyShape("..[1]"), "path:9::kind10[1]");
  EXPECT_EQ(bodyShape("//book[price > 10]/title"),
            "path:root/3::kind10/1::book[(path:1::price 17 10)]/1::title");
}

// --- lines -------------------------------------------------------------------------------------

TEST(Builders, ExpressionsHaveTheLineOfTheirFirstToken) {
  const auto result = module("\n1,\n\n$x,\na\n/b,\n2\n+\n3");
  const auto* list = cast<XQueryExprList>(result->body().get());
  EXPECT_EQ(list->exprLine(), 1);
  EXPECT_EQ(list->objectAtIndex(0)->exprLine(), 1);
  EXPECT_EQ(list->objectAtIndex(1)->exprLine(), 3);
  const auto* path = cast<XQueryPathExpr>(list->objectAtIndex(2));
  EXPECT_EQ(path->exprLine(), 4);
  EXPECT_EQ(path->step()->next()->expr()->exprLine(), 5);
  // An operator is made with its right operand, so its first token is the sign.
  EXPECT_EQ(list->objectAtIndex(3)->exprLine(), 7);
}

TEST(Builders, ExprLineAndOperatorAccessors) {
  const auto result = module("1\n+ 2");
  auto* op = cast<XQueryExprList>(result->body().get())->objectAtIndex(0);
  EXPECT_EQ(XQExprLine(op), 1);
  EXPECT_EQ(XQExprLine(XQExprSetLine(op, 7)), 7);
  EXPECT_EQ(XQOperatorType(op), 3);
  EXPECT_EQ(shape(cast<XQueryExpr>(XQOperatorLeft(op))), "1");
  EXPECT_EQ(shape(cast<XQueryExpr>(XQOperatorRight(op))), "2");
}

// --- types -------------------------------------------------------------------------------------

// The declared type of "declare variable $x as ...".
Ref<XQueryTypeDeclaration> declaredType(const std::string& type) {
  const auto result = module("declare variable $x as " + type + " external; 1");
  return static_cast<const XQueryPrologItemVariableDeclaration&>(*result->prologItems().at(0))
      .type();
}

TEST(Builders, TypesHaveTheirKindsAndOccurrences) {
  const struct {
    const char* text;
    int type;
    int32_t occurrence;
  } rows[] = {
      {"xs:int", 1, 0},       {"xs:int?", 1, 1},
      {"xs:int*", 1, 2},      {"xs:int+", 1, 3},
      {"empty()", 2, 0},      {"item()", 3, 0},
      {"item()*", 3, 2},      {"document-node()", 4, 0},
      {"element()?", 5, 1},   {"processing-instruction()", 6, 0},
      {"attribute()+", 7, 3}, {"comment()", 8, 0},
      {"text()", 9, 0},       {"node()", 10, 0},
  };
  for (const auto& row : rows) {
    const auto type = declaredType(row.text);
    EXPECT_EQ(type->type(), row.type) << row.text;
    EXPECT_EQ(type->occuranceType(), row.occurrence) << row.text;
  }
}

TEST(Builders, TypesHoldTheirArguments) {
  const auto name = [](const char* type) {
    const auto declaration = declaredType(type);
    return cast<XQueryNameTest>(declaration->data())->name()->utf8();
  };
  EXPECT_EQ(cast<NSString>(declaredType("xs:int")->data())->utf8(), "xs:int");
  EXPECT_EQ(name("element(p:a)"), "p:a");
  EXPECT_EQ(name("element(a, xs:int?)"), "a");
  EXPECT_EQ(name("schema-element(a)"), "a");
  EXPECT_EQ(name("attribute(a, xs:int)"), "a");
  EXPECT_EQ(name("schema-attribute(a)"), "a");
  EXPECT_EQ(cast<NSString>(declaredType("processing-instruction(t)")->data())->utf8(), "t");
  EXPECT_EQ(cast<NSString>(declaredType("processing-instruction('t u')")->data())->utf8(), "t u");
  const auto document = declaredType("document-node(element(a))");
  const auto* element = cast<XQueryTypeDeclaration>(document->data());
  EXPECT_EQ(element->type(), 5);
  EXPECT_EQ(cast<XQueryNameTest>(element->data())->name()->utf8(), "a");
}

TEST(Builders, AnAsteriskInAKindTestIsNoNameTest) {
  for (const char* type : {"element(*)", "element(*, xs:int)", "attribute(*)", "element()",
                           "document-node()", "processing-instruction()"}) {
    EXPECT_EQ(declaredType(type)->data(), nullptr) << type;
  }
}

TEST(Builders, SchemaTestsAreElementAndAttributeTests) {
  EXPECT_EQ(declaredType("schema-element(a)")->type(), 5);
  EXPECT_EQ(declaredType("schema-attribute(a)")->type(), 7);
}

// --- prolog ------------------------------------------------------------------------------------

template <class T>
const T& item(const XQueryParsedModule& parsedModule, size_t index) {
  return static_cast<const T&>(*parsedModule.prologItems().at(index));
}

TEST(Builders, SettersComeFirstAndKeepTheirOrder) {
  const auto result = module(
      "declare construction strip;\ndeclare xmlspace preserve;\ndeclare ordering unordered;\n"
      "declare default order empty greatest;\ndeclare inherit-namespaces no;\n"
      "declare default collation 'c';\ndeclare base-uri 'b';\n"
      "declare namespace p = 'u';\ndeclare variable $x := 1;\n1");
  ASSERT_EQ(result->prologItems().size(), 9u);
  for (size_t index = 0; index < 9; ++index) {
    EXPECT_EQ(result->prologItems()[index]->line(), static_cast<int64_t>(index));
  }
  EXPECT_FALSE(item<XQueryPrologItemConstructionPerserve>(*result, 0).value());
  EXPECT_TRUE(item<XQueryPrologItemXMLSpacePerserve>(*result, 1).value());
  EXPECT_FALSE(item<XQueryPrologItemOrdered>(*result, 2).value());
  EXPECT_FALSE(item<XQueryPrologItemDefaultOrder>(*result, 3).value());
  EXPECT_FALSE(item<XQueryPrologItemInheritNamespaces>(*result, 4).value());
  EXPECT_EQ(item<XQueryPrologItemDefaultCollation>(*result, 5).collation()->utf8(), "c");
  EXPECT_EQ(item<XQueryPrologItemDefaultBaseURI>(*result, 6).baseURI()->utf8(), "b");
  EXPECT_EQ(item<XQueryPrologItemDeclareNamespace>(*result, 7).prefix()->utf8(), "p");
  EXPECT_EQ(item<XQueryPrologItemDeclareNamespace>(*result, 7).namespaceString()->utf8(), "u");
}

TEST(Builders, TheOtherValueOfEachSetter) {
  const auto result = module(
      "declare construction preserve; declare xmlspace strip; declare ordering ordered; "
      "declare default order empty least; declare inherit-namespaces yes; 1");
  EXPECT_TRUE(item<XQueryPrologItemConstructionPerserve>(*result, 0).value());
  EXPECT_FALSE(item<XQueryPrologItemXMLSpacePerserve>(*result, 1).value());
  EXPECT_TRUE(item<XQueryPrologItemOrdered>(*result, 2).value());
  EXPECT_TRUE(item<XQueryPrologItemDefaultOrder>(*result, 3).value());
  EXPECT_TRUE(item<XQueryPrologItemInheritNamespaces>(*result, 4).value());
}

TEST(Builders, DefaultNamespaces) {
  const auto result =
      module("declare default element namespace 'e'; declare default function namespace 'f'; 1");
  EXPECT_EQ(item<XQueryPrologItemDefaultElementNamespace>(*result, 0).namespaceString()->utf8(),
            "e");
  EXPECT_EQ(item<XQueryPrologItemDefaultFunctionNamespace>(*result, 1).namespaceString()->utf8(),
            "f");
}

TEST(Builders, AModuleNamespaceIsTheFirstItem) {
  const auto result =
      module("module namespace p = 'u'; declare ordering ordered; declare variable $p:x := 1;");
  ASSERT_EQ(result->prologItems().size(), 3u);
  EXPECT_EQ(item<XQueryPrologItemModuleNamespace>(*result, 0).prefix()->utf8(), "p");
  EXPECT_EQ(item<XQueryPrologItemModuleNamespace>(*result, 0).namespaceString()->utf8(), "u");
  EXPECT_EQ(module("module namespace p = 'u';")->prologItems().size(), 1u);
}

std::string locations(const XQueryPrologItemLocations& list) {
  if (!list) return "none";
  std::string result;
  for (const auto& location : *list) result += "<" + location->utf8() + ">";
  return result;
}

TEST(Builders, ModuleImportsKeepAllLocations) {
  const auto result = module(
      "import module namespace p = 'u' at 'a', 'b', 'c'; import module namespace q = 'u' at 'a'; "
      "import module namespace r = 'u'; import module 'v' at 'a', 'b'; import module 'v' at 'a'; "
      "import module 'v'; 1");
  const char* const expected[] = {"<a><b><c>", "<a>", "none", "<a><b>", "<a>", "none"};
  const char* const prefixes[] = {"p", "q", "r"};
  for (size_t index = 0; index < 6; ++index) {
    const auto& import = item<XQueryPrologItemModuleImport>(*result, index);
    EXPECT_EQ(locations(import.locations()), expected[index]) << index;
    EXPECT_EQ(import.namespaceString()->utf8(), index < 3 ? "u" : "v");
    if (index < 3) {
      EXPECT_EQ(import.prefix()->utf8(), prefixes[index]);
    } else {
      EXPECT_FALSE(import.prefix());
    }
  }
}

TEST(Builders, ASchemaImportWithoutPrefixKeepsItsFirstLocationOnly) {
  const auto result = module(
      "import schema namespace p = 'u' at 'a', 'b'; import schema namespace q = 'u' at 'a'; "
      "import schema namespace r = 'u'; import schema 'u' at 'a', 'b'; import schema 'u' at 'a'; "
      "import schema 'u'; 1");
  const char* const expected[] = {"<a><b>", "<a>", "none", "<a>", "<a>", "none"};
  for (size_t index = 0; index < 6; ++index) {
    EXPECT_EQ(locations(item<XQueryPrologItemSchemaImport>(*result, index).locations()),
              expected[index])
        << index;
  }
  EXPECT_EQ(item<XQueryPrologItemSchemaImport>(*result, 0).prefix()->utf8(), "p");
  EXPECT_FALSE(item<XQueryPrologItemSchemaImport>(*result, 3).prefix());
}

TEST(Builders, SchemaImportsOfTheDefaultElementNamespace) {
  const auto result = module(
      "import schema default element namespace 'u' at 'a', 'b'; "
      "import schema default element namespace 'u' at 'a'; "
      "import schema default element namespace 'u'; 1");
  const char* const expected[] = {"<a><b>", "<a>", "none"};
  for (size_t index = 0; index < 3; ++index) {
    EXPECT_EQ(
        locations(item<XQueryPrologItemSchemaImportDefaultElement>(*result, index).locations()),
        expected[index]);
  }
}

TEST(Builders, VariableDeclarations) {
  const auto result = module(
      "declare variable $p:a as xs:int := 1; declare variable $b := 2; "
      "declare variable $c as xs:int external; declare variable $d external; 1");
  const auto& a = item<XQueryPrologItemVariableDeclaration>(*result, 0);
  EXPECT_EQ(a.varName()->utf8(), "p:a");
  EXPECT_TRUE(a.type());
  EXPECT_EQ(shape(a.expr().get()), "1");
  EXPECT_FALSE(a.external());
  const auto& b = item<XQueryPrologItemVariableDeclaration>(*result, 1);
  EXPECT_FALSE(b.type());
  EXPECT_EQ(shape(b.expr().get()), "2");
  const auto& c = item<XQueryPrologItemVariableDeclaration>(*result, 2);
  EXPECT_TRUE(c.type());
  EXPECT_FALSE(c.expr());
  EXPECT_TRUE(c.external());
  const auto& d = item<XQueryPrologItemVariableDeclaration>(*result, 3);
  EXPECT_FALSE(d.type());
  EXPECT_TRUE(d.external());
}

TEST(Builders, FunctionDeclarations) {
  const auto result = module(
      "declare function local:a($x as xs:int, $p:y) as xs:int { 1, 2 }; "
      "declare function local:b() external; 1");
  const auto& a = item<XQueryPrologItemFunctionDeclaration>(*result, 0);
  EXPECT_EQ(a.name()->utf8(), "local:a");
  ASSERT_EQ(a.paramList().size(), 2u);
  EXPECT_EQ(a.paramList()[0]->name()->utf8(), "x");
  EXPECT_TRUE(a.paramList()[0]->type());
  EXPECT_EQ(a.paramList()[1]->name()->utf8(), "p:y");
  EXPECT_FALSE(a.paramList()[1]->type());
  EXPECT_TRUE(a.type());
  EXPECT_EQ(shape(a.expr().get()), "{1,2}");
  EXPECT_FALSE(a.external());
  const auto& b = item<XQueryPrologItemFunctionDeclaration>(*result, 1);
  EXPECT_TRUE(b.paramList().empty());
  EXPECT_FALSE(b.type());
  EXPECT_FALSE(b.expr());
  EXPECT_TRUE(b.external());
}

TEST(Builders, SchemaModeItemsCanBeMade) {
  const auto parser = XQueryParser::unparsedParserWithSource(NSString::empty());
  const XQueryParser::Session session(*parser);
  const auto* made = static_cast<XQueryPrologItemDeclareValidationSchemaMode*>(
      XQDeclareValidationSchemaMode(3, 7));
  EXPECT_EQ(made->mode(), 3);
  EXPECT_EQ(made->line(), 7);
}

// --- text of constructors ------------------------------------------------------------------------

// The lists of a direct constructor are looked at while their parse is going on.
class BuilderText : public testing::Test {
 protected:
  const Ref<XQueryParser> _parser = XQueryParser::unparsedParserWithSource(NSString::empty());
  const XQueryParser::Session _session{*_parser};

  static const NSArray& list(NSObject* items) { return *cast<NSArray>(items); }
};

TEST_F(BuilderText, CharactersOfAnAttributeValueJoinTheLastRun) {
  NSObject* items = XQAttributeValueCharsWithUnicode(u'a');
  EXPECT_EQ(XQAttributeValueCharsAddUnicode(items, u'b'), items);
  XQAttributeValueCharsAddExpr(items, XQContextExpr());
  XQAttributeValueCharsAddUnicode(items, u'c');
  ASSERT_EQ(list(items).count(), 3u);
  EXPECT_EQ(cast<XQueryParserText>(list(items).objectAtIndex(0))->string()->utf8(), "ab");
  EXPECT_TRUE(isa<XQueryContextItem>(list(items).objectAtIndex(1)));
  EXPECT_EQ(cast<XQueryParserText>(list(items).objectAtIndex(2))->string()->utf8(), "c");
  EXPECT_EQ(list(XQAttributeValueCharsWithExpr(XQContextExpr())).count(), 1u);
}

TEST_F(BuilderText, RunsOfElementContentKnowWhetherTheyAreWhiteSpace) {
  NSObject* items = XQElementContentWhiteSpace(u' ');
  XQElementContentAddWhiteSpace(items, u'\n');
  const auto* run = cast<XQueryElementContentString>(list(items).objectAtIndex(0));
  EXPECT_TRUE(run->isXMLSpace());
  XQElementContentAddUnicode(items, u'a');
  EXPECT_FALSE(run->isXMLSpace());
  XQElementContentAddWhiteSpace(items, u' ');
  EXPECT_FALSE(run->isXMLSpace()) << "white space leaves the mark alone";
  EXPECT_EQ(run->string()->utf8(), " \na ");
  XQElementContentAdd(items, XQContextExpr());
  XQElementContentAddWhiteSpace(items, u' ');
  ASSERT_EQ(list(items).count(), 3u);
  EXPECT_TRUE(cast<XQueryElementContentString>(list(items).objectAtIndex(2))->isXMLSpace());
  EXPECT_FALSE(
      cast<XQueryElementContentString>(list(XQElementContentWithUnicode(u'a')).objectAtIndex(0))
          ->isXMLSpace());
}

TEST_F(BuilderText, CharsGrowOneString) {
  NSObject* text = XQChars(u'a');
  EXPECT_EQ(XQCharsAdd(text, 0xD83D), text);
  EXPECT_EQ(cast<XQueryParserText>(text)->string()->view().utf16(), (std::u16string{u'a', 0xD83D}));
}

}  // namespace
}  // namespace xquery

#include "Prolog/PrologTesting.h"
#include "Prolog/XQueryPrologItems.h"

#include <gtest/gtest.h>

namespace xquery {
namespace {

using Errors = std::vector<std::string>;
using Locations = std::vector<Ref<NSString>>;

const char* const localURI = "http://www.w3.org/2004/10/xquery-local-functions";

std::string described(const Ref<XQueryPrologItem>& item) {
  return item->description()->utf8();
}

// --- module namespace ----------------------------------------------------------------------------

TEST(ModuleNamespaceItem, MakesALibraryModule) {
  const auto item = XQueryPrologItemModuleNamespace::moduleNamespace(text("urn:m"), text("m"), 7);
  EXPECT_EQ(shown(item->namespaceString()), "urn:m");
  EXPECT_EQ(shown(item->prefix()), "m");
  EXPECT_EQ(item->line(), 7);
  EXPECT_EQ(described(item), "prolog item module namespace:\"urn:m\" prefix:\"m\" line:7");
  const auto prolog = prologOf({item});
  EXPECT_TRUE(prolog->isModule());
  EXPECT_EQ(shown(prolog->modulePrefix()), "m");
  EXPECT_EQ(prolog->namespaceIDForPrefix(NSStringView::ascii("m")), 12);
  EXPECT_EQ(shown(prolog->prefixesForID(12)), "m");
}

// --- flags ---------------------------------------------------------------------------------------

TEST(XMLSpaceItem, SetsTheBoundarySpacePolicy) {
  const auto preserve = XQueryPrologItemXMLSpacePerserve::preserve(true, 1);
  const auto strip = XQueryPrologItemXMLSpacePerserve::preserve(false, 2);
  EXPECT_TRUE(preserve->value());
  EXPECT_FALSE(strip->value());
  EXPECT_EQ(described(preserve), "prolog item xmlspace:preserve line:1");
  EXPECT_EQ(described(strip), "prolog item xmlspace:strip line:2");
  EXPECT_TRUE(prologOf({preserve})->xmlSpacePreserve());
  EXPECT_FALSE(prologOf({preserve, strip})->xmlSpacePreserve());
}

TEST(DefaultOrderItem, SetsTheEmptyOrder) {
  const auto least = XQueryPrologItemDefaultOrder::emptyLeast(true, 1);
  const auto greatest = XQueryPrologItemDefaultOrder::emptyLeast(false, 2);
  EXPECT_TRUE(least->value());
  EXPECT_EQ(described(least), "prolog item empty least:YES line:1");
  EXPECT_EQ(described(greatest), "prolog item empty least:NO line:2");
  EXPECT_FALSE(prologOf({greatest})->emptyLeast());
  EXPECT_TRUE(prologOf({greatest, least})->emptyLeast());
}

TEST(InheritNamespacesItem, SetsInheritance) {
  const auto yes = XQueryPrologItemInheritNamespaces::inherit(true, 1);
  const auto no = XQueryPrologItemInheritNamespaces::inherit(false, 2);
  EXPECT_TRUE(yes->value());
  EXPECT_EQ(described(yes), "prolog item inherit namespaces:YES line:1");
  EXPECT_EQ(described(no), "prolog item inherit namespaces:NO line:2");
  EXPECT_FALSE(prologOf({no})->inheritNamespaces());
  EXPECT_TRUE(prologOf({no, yes})->inheritNamespaces());
}

TEST(OrderedItem, SetsTheOrderingMode) {
  const auto ordered = XQueryPrologItemOrdered::ordered(true, 1);
  const auto unordered = XQueryPrologItemOrdered::ordered(false, 2);
  EXPECT_TRUE(ordered->value());
  EXPECT_EQ(described(ordered), "prolog ordering:ordered line:1");
  EXPECT_EQ(described(unordered), "prolog ordering:unordered line:2");
  EXPECT_FALSE(prologOf({unordered})->ordered());
  EXPECT_TRUE(prologOf({unordered, ordered})->ordered());
}

TEST(ConstructionItem, SetsTheConstructionMode) {
  const auto preserve = XQueryPrologItemConstructionPerserve::preserve(true, 1);
  const auto strip = XQueryPrologItemConstructionPerserve::preserve(false, 2);
  EXPECT_TRUE(preserve->value());
  EXPECT_EQ(described(preserve), "prolog item declare construction:YES line:1");
  EXPECT_EQ(described(strip), "prolog item declare construction:NO line:2");
  EXPECT_FALSE(prologOf({strip})->constructionPreserve());
  EXPECT_TRUE(prologOf({strip, preserve})->constructionPreserve());
}

TEST(SchemaModeItem, SetsTheMode) {
  const auto item = XQueryPrologItemDeclareValidationSchemaMode::schemaMode(3, 9);
  EXPECT_EQ(item->mode(), 3);
  EXPECT_EQ(described(item), "prolog item validation:3 line:9");
  EXPECT_EQ(described(XQueryPrologItemDeclareValidationSchemaMode::schemaMode(-1, 0)),
            "prolog item validation:-1 line:0");
  EXPECT_EQ(prologOf({item})->schemaMode(), 3);
}

// --- collation and base URI ----------------------------------------------------------------------

TEST(DefaultCollationItem, IsTakenUnchecked) {
  const auto first = XQueryPrologItemDefaultCollation::collation(text("urn:c"), 1);
  const auto second = XQueryPrologItemDefaultCollation::collation(text(""), 2);
  EXPECT_EQ(shown(first->collation()), "urn:c");
  EXPECT_EQ(described(first), "prolog item default collation:\"urn:c\" line:1");
  EXPECT_EQ(shown(prologOf({first})->defaultCollation()), "urn:c");
  const auto prolog = prologOf({first, second});
  EXPECT_EQ(shown(prolog->defaultCollation()), "");
  EXPECT_EQ(errorsOf(*prolog), Errors{});
}

TEST(BaseURIItem, SetsTheBaseURI) {
  const auto item = XQueryPrologItemDefaultBaseURI::baseURI(text("http://a/b"), 3);
  EXPECT_EQ(shown(item->baseURI()), "http://a/b");
  EXPECT_EQ(described(item), "prolog item base uri:\"http://a/b\" line:3");
  EXPECT_EQ(shown(prologOf({item})->baseURI()), "http://a/b");
}

TEST(BaseURIItem, SecondOneIsError32AndChangesNothing) {
  const auto prolog = prologOf({XQueryPrologItemDefaultBaseURI::baseURI(text("http://a"), 1),
                                XQueryPrologItemDefaultBaseURI::baseURI(text("http://b"), 2)});
  EXPECT_EQ(errorsOf(*prolog),
            Errors{"32: base-uri already defined for prolog item base uri:\"http://b\" line:2"});
  EXPECT_EQ(shown(prolog->baseURI()), "http://a");
}

TEST(BaseURIItem, AnEmptyOneCountsAsDeclared) {
  const auto prolog = prologOf({XQueryPrologItemDefaultBaseURI::baseURI(text(""), 1),
                                XQueryPrologItemDefaultBaseURI::baseURI(text("http://b"), 2)});
  EXPECT_EQ(prolog->errors().size(), 1U);
}

// --- namespaces ----------------------------------------------------------------------------------

TEST(DeclareNamespaceItem, BindsAPrefix) {
  const auto item = XQueryPrologItemDeclareNamespace::declareNamespace(text("urn:a"), text("a"), 5);
  EXPECT_EQ(shown(item->namespaceString()), "urn:a");
  EXPECT_EQ(shown(item->prefix()), "a");
  EXPECT_EQ(described(item), "prolog item namespace:\"urn:a\" for prefix:\"a\" line:5");
  const auto prolog = prologOf({item});
  EXPECT_EQ(shown(prolog->namespaceForPrefix(NSStringView::ascii("a"))), "urn:a");
  EXPECT_EQ(errorsOf(*prolog), Errors{});
}

TEST(DeclareNamespaceItem, SameUserPrefixTwiceIsError33) {
  const auto prolog =
      prologOf({declareNamespace("a", "urn:a", 1), declareNamespace("a", "urn:b", 2)});
  EXPECT_EQ(errorsOf(*prolog), Errors{"33: invalid resuse of prefix for prolog item "
                                      "namespace:\"urn:b\" for prefix:\"a\" line:2"});
  EXPECT_EQ(shown(prolog->namespaceForPrefix(NSStringView::ascii("a"))), "urn:a");
  EXPECT_EQ(prolog->namespaceID(text("urn:b")), 0);
}

TEST(DeclareNamespaceItem, SamePrefixAndNamespaceTwiceIsError33Too) {
  const auto prolog = prologOf({declareNamespace("a", "urn:a"), declareNamespace("a", "urn:a")});
  ASSERT_EQ(prolog->errors().size(), 1U);
  EXPECT_EQ(prolog->errors()[0]->err(), 33);
}

TEST(DeclareNamespaceItem, XmlAndXmlnsAreError70) {
  const auto prolog =
      prologOf({declareNamespace("xml", "urn:a"), declareNamespace("xmlns", "urn:b"),
                declareNamespace("xml", "http://www.w3.org/XML/1998/namespace")});
  EXPECT_EQ(errorsOf(*prolog),
            (Errors{"70: prefix xml can't be redeclared", "70: prefix xmlns can't be redeclared",
                    "70: prefix xml can't be redeclared"}));
  EXPECT_EQ(prolog->namespaceIDForPrefix(NSStringView::ascii("xml")), 3);
  EXPECT_EQ(prolog->namespaceIDForPrefix(NSStringView::ascii("xmlns")), 0);
}

TEST(DeclareNamespaceItem, PrefixBoundToTheXMLNamespaceCannotBeRedeclared) {
  const auto prolog = prologOf({declareNamespace("x", "http://www.w3.org/XML/1998/namespace"),
                                declareNamespace("x", "urn:a")});
  EXPECT_EQ(errorsOf(*prolog), Errors{"70: prefix x can't be redeclared"});
}

TEST(DeclareNamespaceItem, OtherPredeclaredPrefixesMayBeReboundOnce) {
  for (const char* prefix : {"local", "xs", "xsi", "fn", "xdt", "err", "ext", "html"}) {
    const auto prolog = prologOf({declareNamespace(prefix, "urn:a")});
    EXPECT_EQ(errorsOf(*prolog), Errors{}) << prefix;
    EXPECT_EQ(shown(prolog->namespaceForPrefix(NSStringView::ascii(prefix))), "urn:a");
    const auto twice = prologOf({declareNamespace(prefix, "urn:a"), declareNamespace(prefix, "b")});
    ASSERT_EQ(twice->errors().size(), 1U) << prefix;
    EXPECT_EQ(twice->errors()[0]->err(), 33);
  }
}

TEST(DefaultElementNamespaceItem, IsSetAndRegistered) {
  const auto item = XQueryPrologItemDefaultElementNamespace::elementNamespace(text("urn:e"), 2);
  EXPECT_EQ(shown(item->namespaceString()), "urn:e");
  EXPECT_EQ(described(item), "prolog item default element namespace:\"urn:e\" line:2");
  const auto prolog = prologOf({item});
  EXPECT_EQ(shown(prolog->defaultElementNamespace()), "urn:e");
  EXPECT_EQ(prolog->namespaceID(text("urn:e")), 12);
}

TEST(DefaultElementNamespaceItem, EmptyURIIsError46) {
  const auto prolog =
      prologOf({XQueryPrologItemDefaultElementNamespace::elementNamespace(text(""), 2)});
  EXPECT_EQ(errorsOf(*prolog), Errors{"46: invalid namespace uri for prolog item default element "
                                      "namespace:\"\" line:2"});
  EXPECT_FALSE(prolog->defaultElementNamespace());
}

TEST(DefaultFunctionNamespaceItem, IsSetAndRegistered) {
  const auto item = XQueryPrologItemDefaultFunctionNamespace::functionNamespace(text("urn:f"), 2);
  EXPECT_EQ(shown(item->namespaceString()), "urn:f");
  EXPECT_EQ(described(item), "prolog item default function namespace:\"urn:f\" line:2");
  const auto prolog = prologOf({item});
  EXPECT_EQ(shown(prolog->defaultFunctionNamespace()), "urn:f");
  EXPECT_EQ(prolog->namespaceID(text("urn:f")), 12);
}

TEST(DefaultFunctionNamespaceItem, EmptyURIIsError46) {
  const auto prolog =
      prologOf({XQueryPrologItemDefaultFunctionNamespace::functionNamespace(text(""), 2)});
  EXPECT_EQ(errorsOf(*prolog), Errors{"46: invalid namespace uri for prolog item default function "
                                      "namespace:\"\" line:2"});
  EXPECT_EQ(shown(prolog->defaultFunctionNamespace()), "http://www.w3.org/2004/10/xpath-functions");
}

// --- variables -----------------------------------------------------------------------------------

TEST(VariableItem, KeepsItsParts) {
  const auto type = XQueryTypeDeclaration::item();
  const auto expr = nothing();
  const auto item =
      XQueryPrologItemVariableDeclaration::variable(text("p:x"), type, expr, false, 3);
  EXPECT_EQ(shown(item->varName()), "p:x");
  EXPECT_EQ(item->type(), type);
  EXPECT_EQ(item->expr(), expr);
  EXPECT_FALSE(item->external());
  EXPECT_EQ(described(item), "prolog item variable declaration:\"p:x\" external:NO line:3");
  const auto external =
      XQueryPrologItemVariableDeclaration::variable(text("x"), nullptr, nullptr, true, 4);
  EXPECT_TRUE(external->external());
  EXPECT_EQ(described(external), "prolog item variable declaration:\"x\" external:YES line:4");
}

TEST(VariableItem, DeclaresTheVariable) {
  const auto type = XQueryTypeDeclaration::item();
  const auto expr = nothing();
  const auto prolog =
      prologOf({XQueryPrologItemVariableDeclaration::variable(text("x"), type, expr, false, 0)});
  auto* declaration = prolog->variableInfoForQName(qName("x"));
  ASSERT_NE(declaration, nullptr);
  EXPECT_EQ(declaration->type(), type.get());
  EXPECT_EQ(declaration->expr(), expr.get());
  EXPECT_EQ(&declaration->prolog(), prolog.get());
  EXPECT_FALSE(declaration->name()->namespaceURI());
  EXPECT_EQ(prolog->declarations().size(), 1U);
}

TEST(VariableItem, TakesTheNamespaceOfItsPrefix) {
  const auto prolog = prologOf({declareNamespace("p", "urn:p"), variable("p:x"), variable("x")});
  EXPECT_EQ(errorsOf(*prolog), Errors{});
  EXPECT_NE(prolog->variableInfoForQName(qName("x", "urn:p")), nullptr);
  EXPECT_NE(prolog->variableInfoForQName(qName("x")), nullptr);
}

TEST(VariableItem, UnknownPrefixOfAMainModuleMeansNoNamespace) {
  const auto prolog = prologOf({variable("nowhere:x")});
  EXPECT_EQ(errorsOf(*prolog), Errors{});
  EXPECT_NE(prolog->variableInfoForQName(qName("x")), nullptr);
}

TEST(VariableItem, DeclaredTwiceIsError49AndTheFirstStays) {
  const auto first = nothing();
  const auto prolog = prologOf({variable("x", first), variable("x")});
  EXPECT_EQ(errorsOf(*prolog), Errors{"49: invalid variable declaration for prolog item variable "
                                      "declaration:\"x\" external:NO line:0"});
  EXPECT_EQ(prolog->declarations().size(), 1U);
  EXPECT_EQ(prolog->variableInfoForQName(qName("x"))->expr(), first.get());
}

TEST(VariableItem, OfALibraryModuleMustBeInItsNamespace) {
  const auto prolog = prologOf({moduleNamespace("m", "urn:m"), declareNamespace("o", "urn:o"),
                                variable("o:x"), variable("x"), variable("m:x")});
  EXPECT_EQ(errorsOf(*prolog), (Errors{"48: invalid variable declaration for prolog item variable "
                                       "declaration:\"o:x\" external:NO line:0",
                                       "48: invalid variable declaration for prolog item variable "
                                       "declaration:\"x\" external:NO line:0"}));
  EXPECT_EQ(prolog->declarations().size(), 1U);
  EXPECT_NE(prolog->variableInfoForQName(qName("x", "urn:m")), nullptr);
}

TEST(VariableItem, OfALibraryModuleMayUseAnotherPrefixOfItsNamespace) {
  const auto prolog =
      prologOf({moduleNamespace("m", "urn:m"), declareNamespace("n", "urn:m"), variable("n:x")});
  EXPECT_EQ(errorsOf(*prolog), Errors{});
  EXPECT_NE(prolog->variableInfoForQName(qName("x", "urn:m")), nullptr);
}

// --- functions -----------------------------------------------------------------------------------

TEST(FunctionItem, KeepsItsParts) {
  const auto type = XQueryTypeDeclaration::item();
  const auto expr = nothing();
  const auto list = params({"a"});
  const auto item =
      XQueryPrologItemFunctionDeclaration::function(text("local:f"), list, type, expr, false, 3);
  EXPECT_EQ(shown(item->name()), "local:f");
  EXPECT_EQ(item->paramList(), list);
  EXPECT_EQ(item->type(), type);
  EXPECT_EQ(item->expr(), expr);
  EXPECT_FALSE(item->external());
  EXPECT_EQ(described(item), "prolog item function declaration:\"local:f\" external:NO line:3");
  const auto external =
      XQueryPrologItemFunctionDeclaration::function(text("local:f"), {}, nullptr, nullptr, true, 4);
  EXPECT_TRUE(external->external());
  EXPECT_EQ(described(external),
            "prolog item function declaration:\"local:f\" external:YES line:4");
}

TEST(FunctionItem, DeclaresTheFunction) {
  const auto type = XQueryTypeDeclaration::item();
  const auto expr = nothing();
  const auto list = params({"a", "b"});
  const auto prolog = prologOf(
      {XQueryPrologItemFunctionDeclaration::function(text("local:f"), list, type, expr, false, 0)});
  auto* declaration = prolog->functionInfoForSignature({qName("f", localURI), 2});
  ASSERT_NE(declaration, nullptr);
  EXPECT_EQ(declaration->params(), list);
  EXPECT_EQ(declaration->type(), type.get());
  EXPECT_EQ(declaration->expr(), expr.get());
  EXPECT_EQ(&declaration->prolog(), prolog.get());
}

TEST(FunctionItem, MainModuleMayDeclareInTheLocalXHTMLAndDeclaredNamespaces) {
  const auto prolog = prologOf(
      {declareNamespace("p", "urn:p"), function("local:f"), function("html:f"), function("p:f")});
  EXPECT_EQ(errorsOf(*prolog), Errors{});
  EXPECT_NE(prolog->functionInfoForSignature({qName("f", localURI), 0}), nullptr);
  EXPECT_NE(prolog->functionInfoForSignature({qName("f", "http://www.w3.org/1999/xhtml"), 0}),
            nullptr);
  EXPECT_NE(prolog->functionInfoForSignature({qName("f", "urn:p"), 0}), nullptr);
}

TEST(FunctionItem, EveryOtherBuiltinNamespaceAndNoNamespaceIsError45) {
  for (const char* name :
       {"f", "nowhere:f", "xml:f", "xs:f", "xsi:f", "fn:f", "xdt:f", "err:f", "ext:f"}) {
    const auto prolog = prologOf({function(name)});
    EXPECT_EQ(errorsOf(*prolog),
              Errors{std::string("45: invalid function declaration for prolog item function "
                                 "declaration:\"") +
                     name + "\" external:NO line:0"});
    EXPECT_TRUE(prolog->declarations().empty());
  }
}

TEST(FunctionItem, PrefixesOfCollationAndXmlnsNamespacesAreError45) {
  for (const int64_t id : {1, 4}) {
    const auto URI = XQueryModules::builtinNamespaceForID(id);
    const auto prolog = prologOf(
        {XQueryPrologItemDeclareNamespace::declareNamespace(URI, text("p"), 0), function("p:f")});
    ASSERT_EQ(prolog->errors().size(), 1U) << id;
    EXPECT_EQ(prolog->errors()[0]->err(), 45);
  }
}

TEST(FunctionItem, EmptyDeclaredNamespaceIsError45) {
  const auto prolog = prologOf({declareNamespace("p", ""), function("p:f")});
  ASSERT_EQ(prolog->errors().size(), 1U);
  EXPECT_EQ(prolog->errors()[0]->err(), 45);
}

TEST(FunctionItem, DefaultFunctionNamespaceDoesNotHelpAnUnprefixedName) {
  const auto prolog =
      prologOf({XQueryPrologItemDefaultFunctionNamespace::functionNamespace(text("urn:f"), 0),
                function("f")});
  ASSERT_EQ(prolog->errors().size(), 1U);
  EXPECT_EQ(prolog->errors()[0]->err(), 45);
}

TEST(FunctionItem, ReboundPredeclaredPrefixIsADeclaredNamespace) {
  const auto prolog = prologOf({declareNamespace("fn", "urn:f"), function("fn:count")});
  EXPECT_EQ(errorsOf(*prolog), Errors{});
  EXPECT_NE(prolog->functionInfoForSignature({qName("count", "urn:f"), 0}), nullptr);
}

TEST(FunctionItem, OverloadsByCountAreAcceptedAndTheSameCountTwiceIsError34) {
  const auto prolog = prologOf({function("local:f"), function("local:f", params({"a"})),
                                function("local:f", params({"b"}))});
  EXPECT_EQ(errorsOf(*prolog), Errors{"34: invalid function declaration for prolog item function "
                                      "declaration:\"local:f\" external:NO line:0"});
  EXPECT_EQ(prolog->declarations().size(), 2U);
  EXPECT_EQ(shown(prolog->functionInfoForSignature({qName("f", localURI), 1})->params()[0]->name()),
            "a");
}

TEST(FunctionItem, OfALibraryModuleMustBeInItsNamespace) {
  const auto prolog = prologOf(
      {moduleNamespace("m", "urn:m"), function("local:f"), function("f"), function("m:f")});
  EXPECT_EQ(errorsOf(*prolog), (Errors{"48: invalid function declaration for prolog item function "
                                       "declaration:\"local:f\" external:NO line:0",
                                       "48: invalid function declaration for prolog item function "
                                       "declaration:\"f\" external:NO line:0"}));
  EXPECT_NE(prolog->functionInfoForSignature({qName("f", "urn:m"), 0}), nullptr);
  EXPECT_EQ(prolog->declarations().size(), 1U);
}

TEST(FunctionItem, OfALibraryModuleInABuiltinNamespaceIsAccepted) {
  const auto prolog = prologOf(
      {moduleNamespace("f", "http://www.w3.org/2004/10/xpath-functions"), function("f:mine")});
  EXPECT_EQ(errorsOf(*prolog), Errors{});
  EXPECT_EQ(prolog->declarations().size(), 1U);
}

// --- imports -------------------------------------------------------------------------------------

TEST(ModuleImportItem, KeepsItsParts) {
  const auto item = XQueryPrologItemModuleImport::moduleImport(
      text("urn:m"), Locations{text("a.xq"), text("b.xq")}, text("m"), 6);
  EXPECT_EQ(shown(item->namespaceString()), "urn:m");
  EXPECT_EQ(item->locations()->size(), 2U);
  EXPECT_EQ(shown(item->prefix()), "m");
  EXPECT_EQ(described(item),
            "prolog item module import:\"urn:m\" for prefix:\"m\" at locations:\"a.xq, b.xq\" "
            "line:6");
  const auto bare =
      XQueryPrologItemModuleImport::moduleImport(text("urn:m"), std::nullopt, nullptr, 0);
  EXPECT_FALSE(bare->locations());
  EXPECT_EQ(described(bare),
            "prolog item module import:\"urn:m\" for prefix:\"(null)\" at locations:\"\" line:0");
}

Ref<XQueryPrologItem> moduleImport(std::string_view URI, const char* prefix) {
  return XQueryPrologItemModuleImport::moduleImport(text(URI), Locations{},
                                                    prefix ? text(prefix) : nullptr, 1);
}

TEST(ModuleImportItem, BindsItsPrefixAndIsRecorded) {
  const auto item = moduleImport("urn:m", "m");
  const auto prolog = prologOf({item});
  EXPECT_EQ(prolog->namespaceIDForPrefix(NSStringView::ascii("m")), 12);
  ASSERT_EQ(prolog->moduleImports().size(), 1U);
  EXPECT_EQ(prolog->moduleImports()[0].get(), item.get());
}

TEST(ModuleImportItem, WithoutAPrefixOnlyRegistersTheNamespace) {
  const auto prolog = prologOf({moduleImport("urn:m", nullptr)});
  EXPECT_EQ(prolog->namespaceID(text("urn:m")), 12);
  EXPECT_FALSE(prolog->prefixesForID(12));
  EXPECT_EQ(prolog->moduleImports().size(), 1U);
}

TEST(ModuleImportItem, PrefixOfAnotherNamespaceIsError33AndNotRecorded) {
  const auto prolog = prologOf({declareNamespace("m", "urn:a"), moduleImport("urn:m", "m")});
  EXPECT_EQ(errorsOf(*prolog),
            Errors{"33: invalid resuse of prefix for prolog item module import:\"urn:m\" for "
                   "prefix:\"m\" at locations:\"\" line:1"});
  EXPECT_TRUE(prolog->moduleImports().empty());
  EXPECT_EQ(prolog->namespaceID(text("urn:m")), 13);
  EXPECT_EQ(shown(prolog->namespaceForPrefix(NSStringView::ascii("m"))), "urn:a");
}

TEST(ModuleImportItem, PredeclaredPrefixOfAnotherNamespaceIsError33) {
  const auto prolog = prologOf({moduleImport("urn:m", "fn")});
  ASSERT_EQ(prolog->errors().size(), 1U);
  EXPECT_EQ(prolog->errors()[0]->err(), 33);
}

TEST(ModuleImportItem, PrefixAlreadyBoundToTheSameNamespaceIsAccepted) {
  const auto prolog = prologOf({declareNamespace("m", "urn:m"), moduleImport("urn:m", "m")});
  EXPECT_EQ(prolog->moduleImports().size(), 1U);
  EXPECT_EQ(shown(prolog->prefixesForID(12)), "[m,m]");
}

TEST(ModuleImportItem, WithoutANamespaceIsOnlyRecorded) {
  const auto prolog =
      prologOf({XQueryPrologItemModuleImport::moduleImport(nullptr, Locations{}, text("fn"), 0)});
  EXPECT_EQ(prolog->moduleImports().size(), 1U);
  EXPECT_EQ(prolog->namespaceIDForPrefix(NSStringView::ascii("fn")), 7);
}

TEST(SchemaImportItem, KeepsItsParts) {
  const auto item = XQueryPrologItemSchemaImport::schemaImport(
      text("urn:s"), Locations{text("a.xsd"), text("b.xsd")}, text("s"), 6);
  EXPECT_EQ(shown(item->namespaceString()), "urn:s");
  EXPECT_EQ(item->locations()->size(), 2U);
  EXPECT_EQ(shown(item->prefix()), "s");
  EXPECT_EQ(described(item),
            "prolog item schema import:\"urn:s\" for prefix:\"s\" at locations:\"a.xsd, b.xsd\" "
            "line:6");
}

TEST(SchemaImportItem, BindsItsPrefixAndIsOnlyRecorded) {
  const auto item = XQueryPrologItemSchemaImport::schemaImport(
      text("urn:s"), Locations{text("file:///no")}, text("s"), 0);
  const auto prolog = prologOf({item});
  EXPECT_EQ(errorsOf(*prolog), Errors{});
  EXPECT_EQ(prolog->namespaceIDForPrefix(NSStringView::ascii("s")), 12);
  ASSERT_EQ(prolog->schemaImports().size(), 1U);
  EXPECT_EQ(prolog->schemaImports()[0], item);
  EXPECT_TRUE(prolog->moduleImports().empty());
}

TEST(SchemaImportItem, PrefixOfAnotherNamespaceIsError33AndNotRecorded) {
  const auto prolog = prologOf(
      {XQueryPrologItemSchemaImport::schemaImport(text("urn:s"), std::nullopt, text("xs"), 2)});
  EXPECT_EQ(errorsOf(*prolog),
            Errors{"33: invalid resuse of prefix for prolog item schema import:\"urn:s\" for "
                   "prefix:\"xs\" at locations:\"\" line:2"});
  EXPECT_TRUE(prolog->schemaImports().empty());
}

TEST(SchemaImportItem, WithoutAPrefixOnlyRegistersTheNamespace) {
  const auto prolog = prologOf(
      {XQueryPrologItemSchemaImport::schemaImport(text("urn:s"), std::nullopt, nullptr, 2)});
  EXPECT_EQ(prolog->namespaceID(text("urn:s")), 12);
  EXPECT_EQ(prolog->schemaImports().size(), 1U);
}

TEST(SchemaImportDefaultElementItem, ChangesNothing) {
  const auto item = XQueryPrologItemSchemaImportDefaultElement::defaultElement(
      text("urn:s"), Locations{text("a.xsd"), text("b.xsd")}, 8);
  const auto bare =
      XQueryPrologItemSchemaImportDefaultElement::defaultElement(text("urn:s"), std::nullopt, 9);
  EXPECT_EQ(shown(item->namespaceString()), "urn:s");
  EXPECT_EQ(item->locations()->size(), 2U);
  EXPECT_EQ(described(item),
            "prolog item schema import default element:\"urn:s\" at locations:\"a.xsd, b.xsd\" "
            "line:8");
  EXPECT_EQ(described(bare),
            "prolog item schema import default element:\"urn:s\" at locations:\"\" line:9");
  const auto prolog = prologOf({item, bare});
  EXPECT_FALSE(prolog->defaultElementNamespace());
  EXPECT_EQ(prolog->namespaceID(text("urn:s")), 0);
  EXPECT_TRUE(prolog->schemaImports().empty());
  EXPECT_EQ(errorsOf(*prolog), Errors{});
}

// --- what all items share ------------------------------------------------------------------------

TEST(PrologItems, ErrorsCarryNoLine) {
  const auto prolog =
      prologOf({declareNamespace("a", "urn:a", 3), declareNamespace("a", "urn:b", 4),
                declareNamespace("xml", "urn:c", 5), function("f")});
  ASSERT_EQ(prolog->errors().size(), 3U);
  for (const auto& error : prolog->errors()) EXPECT_EQ(error->line(), 0);
}

TEST(PrologItems, AFailureDoesNotStopTheNextItem) {
  const auto prolog = prologOf({function("f"), variable("x"), variable("x"), variable("y")});
  EXPECT_EQ(prolog->errors().size(), 2U);
  EXPECT_NE(prolog->variableInfoForQName(qName("y")), nullptr);
}

TEST(PrologItems, MessagesKeepTextOutsideASCII) {
  const auto URI = NSString::stringWithUTF8("urn:\xC3\xA9");
  const auto item = XQueryPrologItemDefaultBaseURI::baseURI(URI, 1);
  EXPECT_EQ(described(item), "prolog item base uri:\"urn:\xC3\xA9\" line:1");
}

}  // namespace
}  // namespace xquery

#include "Prolog/PrologTesting.h"
#include "Prolog/XQueryProlog.h"
#include "xquery/XMLNode.h"

#include <gtest/gtest.h>

namespace xquery {
namespace {

using Errors = std::vector<std::string>;

const char* const functionsURI = "http://www.w3.org/2004/10/xpath-functions";
const char* const localURI = "http://www.w3.org/2004/10/xquery-local-functions";

std::vector<std::string> allPrefixSlots(const XQueryProlog& prolog, int64_t last) {
  std::vector<std::string> result;
  for (int64_t id = 0; id <= last; ++id) result.push_back(shown(prolog.prefixesForID(id)));
  return result;
}

Ref<XQueryProlog> prologOfVersion(const char* version) {
  return XQueryProlog::prologWithItems({}, nullptr, nullptr, version ? text(version) : nullptr);
}

// --- construction --------------------------------------------------------------------------------

TEST(Prolog, FreshOneHasTheDefaults) {
  const auto prolog = prologOf({});
  EXPECT_FALSE(prolog->xmlSpacePreserve());
  EXPECT_TRUE(prolog->constructionPreserve());
  EXPECT_TRUE(prolog->ordered());
  EXPECT_TRUE(prolog->emptyLeast());
  EXPECT_TRUE(prolog->inheritNamespaces());
  EXPECT_FALSE(prolog->isModule());
  EXPECT_FALSE(prolog->modulePrefix());
  EXPECT_FALSE(prolog->defaultCollation());
  EXPECT_FALSE(prolog->defaultElementNamespace());
  EXPECT_FALSE(prolog->baseURI());
  EXPECT_FALSE(prolog->location());
  EXPECT_EQ(prolog->schemaMode(), 0);
  EXPECT_EQ(prolog->nextLocalVariableID(), 1);
  EXPECT_TRUE(prolog->errors().empty());
  EXPECT_TRUE(prolog->declarations().empty());
  EXPECT_TRUE(prolog->qNameReferences().empty());
  EXPECT_TRUE(prolog->moduleImports().empty());
  EXPECT_TRUE(prolog->schemaImports().empty());
}

TEST(Prolog, DefaultFunctionNamespaceIsTheStandardOneUntilDeclared) {
  const auto prolog = prologOf({});
  EXPECT_EQ(shown(prolog->defaultFunctionNamespace()), functionsURI);
  prolog->setDefaultFunctionNamespace(text("urn:f"));
  EXPECT_EQ(shown(prolog->defaultFunctionNamespace()), "urn:f");
}

TEST(Prolog, KeepsLocationAndRegistry) {
  const OwnRegistry modules;
  const auto prolog = XQueryProlog::prologWithItems({}, text("file:///m.xq"), modules, nullptr);
  EXPECT_EQ(shown(prolog->location()), "file:///m.xq");
  EXPECT_EQ(&prolog->modules(), modules.get());
}

TEST(Prolog, WithoutARegistryMakesOne) {
  const auto first = prologOf({});
  const auto second = prologOf({});
  EXPECT_NE(&first->modules(), &second->modules());
}

TEST(Prolog, VersionOneIsSupported) {
  EXPECT_TRUE(prologOfVersion("1.0")->errors().empty());
  EXPECT_TRUE(prologOfVersion(nullptr)->errors().empty());
}

TEST(Prolog, AnyOtherVersionIsError31) {
  EXPECT_EQ(errorsOf(*prologOfVersion("1.1")), Errors{"31: version \"1.1\" not supported"});
  EXPECT_EQ(errorsOf(*prologOfVersion("1.00")), Errors{"31: version \"1.00\" not supported"});
  EXPECT_EQ(errorsOf(*prologOfVersion("")), Errors{"31: version \"\" not supported"});
}

TEST(Prolog, AWrongVersionDoesNotKeepItemsFromBeingApplied) {
  const auto prolog = XQueryProlog::prologWithItems({variable("x")}, nullptr, nullptr, text("2.0"));
  EXPECT_EQ(prolog->errors().size(), 1U);
  EXPECT_EQ(prolog->declarations().size(), 1U);
}

TEST(Prolog, ErrorsAreKeptInTheOrderFound) {
  const auto prolog = XQueryProlog::prologWithItems(
      {declareNamespace("xml", "urn:a"), variable("x"), variable("x"), function("f")}, nullptr,
      nullptr, text("2.0"));
  std::vector<int64_t> numbers;
  for (const auto& error : prolog->errors()) numbers.push_back(error->err());
  EXPECT_EQ(numbers, (std::vector<int64_t>{31, 70, 49, 45}));
}

TEST(Prolog, LibraryModuleRegistersUnderItsNamespace) {
  const OwnRegistry modules;
  const auto prolog = prologOf({moduleNamespace("m", "urn:m")}, modules);
  EXPECT_TRUE(prolog->isModule());
  EXPECT_EQ(modules->prologForID(modules->namespaceID(text("urn:m"), false)), prolog.get());
}

TEST(Prolog, MainModuleDoesNotRegister) {
  const OwnRegistry modules;
  const auto prolog = prologOf({declareNamespace("m", "urn:m")}, modules);
  EXPECT_EQ(modules->prologForID(12), nullptr);
}

TEST(Prolog, SetDefaultSchemaDoesNothing) {
  const auto prolog = prologOf({});
  prolog->setDefaultSchema(text("urn:s"), text("s.xsd"));
  EXPECT_FALSE(prolog->defaultElementNamespace());
  EXPECT_EQ(prolog->namespaceID(text("urn:s")), 0);
  EXPECT_TRUE(prolog->schemaImports().empty());
}

TEST(Prolog, DescribesItself) {
  const auto prolog = prologOf({moduleNamespace("m", "urn:m")});
  EXPECT_NE(prolog->description()->view().find(NSStringView::ascii("module prefix:m")),
            NSStringView::notFound);
}

// --- prefixes ------------------------------------------------------------------------------------

TEST(PrologPrefixes, PredeclaredOnesHaveTheirIDs) {
  const std::pair<const char*, int64_t> rows[] = {{"local", 2}, {"xml", 3},  {"xs", 5},
                                                  {"xsi", 6},   {"fn", 7},   {"xdt", 8},
                                                  {"err", 9},   {"ext", 10}, {"html", 11}};
  const auto prolog = prologOf({});
  for (const auto& [prefix, id] : rows) {
    EXPECT_EQ(prolog->namespaceIDForPrefix(NSStringView::ascii(prefix)), id) << prefix;
    EXPECT_EQ(shown(prolog->namespaceForPrefix(NSStringView::ascii(prefix))),
              shown(XQueryModules::builtinNamespaceForID(id)));
  }
}

TEST(PrologPrefixes, OthersAreUnknown) {
  const auto prolog = prologOf({});
  for (const char* prefix : {"", "xmlns", "XS", "l", "localx"}) {
    EXPECT_EQ(prolog->namespaceIDForPrefix(NSStringView::ascii(prefix)), 0) << prefix;
    EXPECT_FALSE(prolog->namespaceForPrefix(NSStringView::ascii(prefix))) << prefix;
  }
}

TEST(PrologPrefixes, RowOfPredeclaredPrefixesIsShiftedFromTheFourthOn) {
  EXPECT_EQ(allPrefixSlots(*prologOf({}), 12),
            (std::vector<std::string>{"(none)", "(none)", "local", "xml", "xs", "xsi", "fn", "xdt",
                                      "err", "ext", "html", "(none)", "(none)"}));
}

TEST(PrologPrefixes, PrefixesForIDOutsideTheRowIsNull) {
  const auto prolog = prologOf({});
  for (const int64_t id : {INT64_MIN, int64_t{-1}, INT64_MAX}) {
    EXPECT_FALSE(prolog->prefixesForID(id)) << id;
  }
}

TEST(PrologPrefixes, FirstDeclaredOneTakesTheSlotOfItsNewID) {
  const auto prolog = prologOf({declareNamespace("a", "urn:a")});
  EXPECT_EQ(prolog->namespaceIDForPrefix(NSStringView::ascii("a")), 12);
  EXPECT_EQ(shown(prolog->prefixesForID(12)), "a");
  EXPECT_EQ(shown(prolog->prefixesForID(11)), "(none)");
  EXPECT_EQ(shown(prolog->namespaceForPrefix(NSStringView::ascii("a"))), "urn:a");
}

TEST(PrologPrefixes, FurtherOnesOfTheSameNamespaceMakeAList) {
  const auto prolog = prologOf({declareNamespace("a", "urn:a"), declareNamespace("b", "urn:a")});
  EXPECT_EQ(shown(prolog->prefixesForID(12)), "[a,b]");
  prolog->addPrefix(text("c"), text("urn:a"));
  EXPECT_EQ(shown(prolog->prefixesForID(12)), "[a,b,c]");
}

TEST(PrologPrefixes, OneForABuiltinNamespaceJoinsWhateverStandsInTheShiftedSlot) {
  const auto prolog = prologOf({declareNamespace("s", "http://www.w3.org/2001/XMLSchema")});
  EXPECT_EQ(shown(prolog->prefixesForID(5)), "[xsi,s]");
  EXPECT_EQ(prolog->namespaceIDForPrefix(NSStringView::ascii("s")), 5);
}

TEST(PrologPrefixes, ReboundPredeclaredOneClearsTheSlotOfItsOldID) {
  const auto prolog = prologOf({declareNamespace("fn", "urn:a")});
  EXPECT_EQ(shown(prolog->prefixesForID(7)), "(none)");
  EXPECT_EQ(shown(prolog->prefixesForID(6)), "fn");
  EXPECT_EQ(shown(prolog->prefixesForID(12)), "fn");
  EXPECT_EQ(prolog->namespaceIDForPrefix(NSStringView::ascii("fn")), 12);
}

TEST(PrologPrefixes, ReboundOneIsTakenOutOfAListAndTheRestStays) {
  const auto prolog = prologOf(
      {declareNamespace("s", "http://www.w3.org/2001/XMLSchema"), declareNamespace("s", "urn:a")});
  EXPECT_EQ(shown(prolog->prefixesForID(5)), "[xsi]");
  EXPECT_EQ(shown(prolog->prefixesForID(12)), "s");
}

TEST(PrologPrefixes, EveryOccurrenceIsTakenOutOfAList) {
  const auto prolog = prologOf({});
  const auto schema = XQueryModules::builtinNamespaceForID(5);
  prolog->addPrefix(text("s"), schema);
  static_cast<NSArray*>(prolog->prefixesForID(5).get())->objects().push_back(text("s"));
  prolog->addPrefix(text("s"), text("urn:a"));
  EXPECT_EQ(shown(prolog->prefixesForID(5)), "[xsi]");
}

TEST(PrologPrefixes, RebindingHtmlFindsNoSlotToClear) {
  const auto prolog = prologOf({declareNamespace("html", "urn:a")});
  EXPECT_EQ(shown(prolog->prefixesForID(10)), "html");
  EXPECT_EQ(shown(prolog->prefixesForID(11)), "(none)");
  EXPECT_EQ(shown(prolog->prefixesForID(12)), "html");
}

TEST(PrologPrefixes, RedeclaringHtmlAsItselfFillsItsSlot) {
  const auto prolog = prologOf({declareNamespace("html", "http://www.w3.org/1999/xhtml")});
  EXPECT_EQ(shown(prolog->prefixesForID(11)), "html");
}

TEST(PrologPrefixes, RedeclaringXsAsItselfReplacesWhatStoodInItsSlot) {
  const auto prolog = prologOf({declareNamespace("xs", "http://www.w3.org/2001/XMLSchema")});
  EXPECT_EQ(shown(prolog->prefixesForID(5)), "xs");
  EXPECT_EQ(shown(prolog->prefixesForID(4)), "xs");
}

TEST(PrologPrefixes, OldSlotOfAUserNamespaceIsNotCleared) {
  const auto prolog = prologOf({});
  prolog->addPrefix(text("a"), text("urn:a"));
  prolog->addPrefix(text("a"), text("urn:b"));
  EXPECT_EQ(shown(prolog->prefixesForID(12)), "a");
  EXPECT_EQ(shown(prolog->prefixesForID(13)), "a");
  EXPECT_EQ(prolog->namespaceIDForPrefix(NSStringView::ascii("a")), 13);
}

TEST(PrologPrefixes, AddNamespaceForPrefixIsAddPrefixTheOtherWayRound) {
  const auto prolog = prologOf({});
  prolog->addNamespace(text("urn:a"), text("a"));
  EXPECT_EQ(prolog->namespaceIDForPrefix(NSStringView::ascii("a")), 12);
}

TEST(PrologPrefixes, WithoutANamespaceNothingIsAdded) {
  const auto prolog = prologOf({});
  prolog->addPrefix(text("fn"), nullptr);
  EXPECT_EQ(prolog->namespaceIDForPrefix(NSStringView::ascii("fn")), 7);
  EXPECT_EQ(shown(prolog->prefixesForID(7)), "xdt");
}

TEST(PrologPrefixes, AnotherPrologKeepsThePredeclaredOnes) {
  const auto changed = prologOf(
      {declareNamespace("fn", "urn:a"), declareNamespace("s", "http://www.w3.org/2001/XMLSchema")});
  const auto fresh = prologOf({});
  EXPECT_EQ(fresh->namespaceIDForPrefix(NSStringView::ascii("fn")), 7);
  EXPECT_EQ(shown(fresh->prefixesForID(5)), "xsi");
  EXPECT_EQ(shown(fresh->prefixesForID(7)), "xdt");
}

TEST(PrologPrefixes, GapsBetweenSlotsAreEmpty) {
  const auto prolog = prologOf({});
  prolog->addNamespace(text("urn:a"));
  prolog->addNamespace(text("urn:b"));
  prolog->addPrefix(text("c"), text("urn:c"));
  EXPECT_EQ(shown(prolog->prefixesForID(12)), "(none)");
  EXPECT_EQ(shown(prolog->prefixesForID(13)), "(none)");
  EXPECT_EQ(shown(prolog->prefixesForID(14)), "c");
}

TEST(PrologNamespaces, AddingMakesAnIDAskingDoesNot) {
  const auto prolog = prologOf({});
  EXPECT_EQ(prolog->namespaceID(text("urn:a")), 0);
  EXPECT_EQ(prolog->addNamespace(text("urn:a")), 12);
  EXPECT_EQ(prolog->namespaceID(text("urn:a")), 12);
  EXPECT_EQ(shown(prolog->namespaceForID(12)), "urn:a");
}

TEST(PrologNamespaces, DefaultNamespacesAreRegistered) {
  const auto prolog = prologOf({});
  prolog->setDefaultElementNamespace(text("urn:e"));
  prolog->setDefaultFunctionNamespace(text("urn:f"));
  EXPECT_EQ(prolog->namespaceID(text("urn:e")), 12);
  EXPECT_EQ(prolog->namespaceID(text("urn:f")), 13);
}

// --- in-scope namespaces -------------------------------------------------------------------------

Ref<NSXMLNode> namespaceNode(const char* prefix, const char* URI) {
  return NSXMLNode::namespaceWithName(NSStringView::ascii(prefix), NSStringView::ascii(URI));
}

std::string scoped(const XQueryProlog& prolog, const char* prefix) {
  bool fromProlog = false;
  const auto URI = prolog.namespaceForPrefix(NSStringView::ascii(prefix), fromProlog);
  return shown(URI) + (fromProlog ? " prolog" : " scope");
}

TEST(PrologInScope, InnermostNamespaceWins) {
  const auto prolog = prologOf({declareNamespace("a", "urn:declared")});
  EXPECT_EQ(scoped(*prolog, "a"), "urn:declared prolog");
  prolog->pushInScopeNamespaces({namespaceNode("a", "urn:outer"), namespaceNode("b", "urn:b")});
  EXPECT_EQ(scoped(*prolog, "a"), "urn:outer scope");
  prolog->pushInScopeNamespaces({namespaceNode("a", "urn:inner")});
  EXPECT_EQ(scoped(*prolog, "a"), "urn:inner scope");
  EXPECT_EQ(scoped(*prolog, "b"), "urn:b scope");
  prolog->popInScopeNamespaces();
  EXPECT_EQ(scoped(*prolog, "a"), "urn:outer scope");
  prolog->popInScopeNamespaces();
  EXPECT_EQ(scoped(*prolog, "a"), "urn:declared prolog");
}

TEST(PrologInScope, FirstNodeOfAnEntryWins) {
  const auto prolog = prologOf({});
  prolog->pushInScopeNamespaces({namespaceNode("a", "urn:1"), namespaceNode("a", "urn:2")});
  EXPECT_EQ(scoped(*prolog, "a"), "urn:1 scope");
}

TEST(PrologInScope, UnknownPrefixIsNullFromTheProlog) {
  const auto prolog = prologOf({});
  prolog->pushInScopeNamespaces({namespaceNode("a", "urn:1")});
  EXPECT_EQ(scoped(*prolog, "b"), "(none) prolog");
}

TEST(PrologInScope, HidesPredeclaredPrefixesInNames) {
  const auto prolog = prologOf({});
  prolog->pushInScopeNamespaces({namespaceNode("fn", "urn:mine")});
  EXPECT_EQ(shown(prolog->functionQNameFromString(text("fn:count"))->namespaceURI()), "urn:mine");
  EXPECT_EQ(prolog->namespaceIDForPrefix(NSStringView::ascii("fn")), 7);
}

TEST(PrologInScope, PoppingAnEmptyStackDoesNothing) {
  const auto prolog = prologOf({});
  prolog->popInScopeNamespaces();
  EXPECT_EQ(scoped(*prolog, "fn"), std::string(functionsURI) + " prolog");
}

// --- names ---------------------------------------------------------------------------------------

std::string shownName(const Ref<XQueryQName>& name) {
  if (!name) return "(none)";
  return "{" + shown(name->namespaceURI()) + "}" + name->XQueryStringValue()->utf8();
}

TEST(PrologNames, UnprefixedVariableHasNoNamespace) {
  const auto prolog = prologOf({});
  prolog->setDefaultElementNamespace(text("urn:e"));
  EXPECT_EQ(shownName(prolog->variableQNameFromString(text("x"))), "{(none)}x");
}

TEST(PrologNames, VariablePrefixMustResolve) {
  const auto prolog = prologOf({declareNamespace("a", "urn:a")});
  EXPECT_EQ(shownName(prolog->variableQNameFromString(text("a:x"))), "{urn:a}x");
  EXPECT_EQ(shownName(prolog->variableQNameFromString(text("b:x"))), "(none)");
}

TEST(PrologNames, UnprefixedFunctionTakesTheDefaultFunctionNamespace) {
  const auto prolog = prologOf({});
  EXPECT_EQ(shownName(prolog->functionQNameFromString(text("count"))),
            std::string("{") + functionsURI + "}count");
  prolog->setDefaultFunctionNamespace(text("urn:f"));
  EXPECT_EQ(shownName(prolog->functionQNameFromString(text("count"))), "{urn:f}count");
}

TEST(PrologNames, FunctionPrefixMustResolve) {
  const auto prolog = prologOf({});
  EXPECT_EQ(shownName(prolog->functionQNameFromString(text("local:f"))),
            std::string("{") + localURI + "}f");
  EXPECT_EQ(shownName(prolog->functionQNameFromString(text("b:f"))), "(none)");
}

TEST(PrologNames, PrefixOfAnEmptyNamespaceDoesNotResolve) {
  const auto prolog = prologOf({declareNamespace("e", "")});
  EXPECT_EQ(prolog->namespaceIDForPrefix(NSStringView::ascii("e")), 12);
  EXPECT_EQ(shownName(prolog->variableQNameFromString(text("e:x"))), "(none)");
  EXPECT_EQ(shownName(prolog->functionQNameFromString(text("e:x"))), "(none)");
  EXPECT_EQ(shownName(prolog->xmlQNameFromString(text("e:x"))), "(none)");
}

TEST(PrologNames, XMLNameKeepsItsPrefix) {
  const auto prolog = prologOf({declareNamespace("a", "urn:a")});
  EXPECT_EQ(shownName(prolog->xmlQNameFromString(text("a:x"))), "{urn:a}a:x");
  EXPECT_EQ(shownName(prolog->xmlQNameFromString(text("b:x"))), "(none)");
}

TEST(PrologNames, UnprefixedXMLNameNeedsADefaultInAMainModule) {
  const auto prolog = prologOf({});
  EXPECT_EQ(shownName(prolog->xmlQNameFromString(text("x"))), "(none)");
  prolog->setDefaultElementNamespace(text("urn:e"));
  EXPECT_EQ(shownName(prolog->xmlQNameFromString(text("x"))), "{urn:e}x");
}

TEST(PrologNames, UnprefixedXMLNameOfALibraryModuleHasNoNamespace) {
  const auto prolog = prologOf({moduleNamespace("m", "urn:m")});
  EXPECT_EQ(shownName(prolog->xmlQNameFromString(text("x"))), "{(none)}x");
  prolog->setDefaultElementNamespace(text("urn:e"));
  EXPECT_EQ(shownName(prolog->xmlQNameFromString(text("x"))), "{urn:e}x");
}

TEST(PrologNames, XMLNameWithoutALocalPartIsNull) {
  const auto prolog = prologOf({moduleNamespace("m", "urn:m"), declareNamespace("abc", "urn:a")});
  EXPECT_EQ(shownName(prolog->xmlQNameFromString(text(""))), "(none)");
  EXPECT_EQ(shownName(prolog->xmlQNameFromString(text("abc:"))), "(none)");
  EXPECT_EQ(shownName(prolog->xmlQNameFromString(text("m:"))), "(none)");
}

// --- tables --------------------------------------------------------------------------------------

TEST(PrologTables, VariablesAreFoundByName) {
  const auto prolog = prologOf({});
  const auto declaration = XQueryVarDecl::varDecl(qName("x", "urn:a"), nullptr, nothing(), *prolog);
  EXPECT_EQ(prolog->variableInfoForQName(qName("x", "urn:a")), nullptr);
  prolog->setVariableInfo(declaration, declaration->name());
  EXPECT_EQ(prolog->variableInfoForQName(qName("x", "urn:a")), declaration.get());
  EXPECT_EQ(prolog->variableInfoForQName(qName("x")), nullptr);
  EXPECT_EQ(prolog->variableInfoForQName(qName("y", "urn:a")), nullptr);
}

TEST(PrologTables, FunctionsAreFoundByNameAndCount) {
  const auto prolog = prologOf({function("local:f", params({"a"})), function("local:f")});
  const auto name = qName("f", localURI);
  auto* none = prolog->functionInfoForSignature({name, 0});
  auto* one = prolog->functionInfoForSignature({name, 1});
  ASSERT_NE(none, nullptr);
  ASSERT_NE(one, nullptr);
  EXPECT_EQ(none->params().size(), 0U);
  EXPECT_EQ(one->params().size(), 1U);
  EXPECT_EQ(prolog->functionInfoForSignature({name, 2}), nullptr);
  EXPECT_EQ(prolog->functionInfoForSignature({qName("g", localURI), 1}), nullptr);
}

TEST(PrologTables, DeclarationsStandInTheOrderRegistered) {
  const auto prolog = prologOf({function("local:f"), variable("x"), function("local:g")});
  ASSERT_EQ(prolog->declarations().size(), 3U);
  EXPECT_TRUE(isa<XQueryFunctionDecl>(prolog->declarations()[0]));
  EXPECT_TRUE(isa<XQueryVarDecl>(prolog->declarations()[1]));
  EXPECT_EQ(dyn_cast<XQueryFunctionDecl>(prolog->declarations()[2])->name()->localPart()->utf8(),
            "g");
}

TEST(PrologTables, QNameReferencesAreCollected) {
  const auto prolog = prologOf({});
  const auto reference = XQueryQNameReference::qNameReferenceWithString(text("a:b"), 3);
  prolog->addQNameReference(reference);
  ASSERT_EQ(prolog->qNameReferences().size(), 1U);
  EXPECT_EQ(prolog->qNameReferences()[0], reference);
}

TEST(FunctionSignature, ComparesNameAndCount) {
  const XQueryFunctionSignature signature(qName("f", "urn:a"), 2);
  EXPECT_TRUE(signature == XQueryFunctionSignature(qName("f", "urn:a"), 2));
  EXPECT_FALSE(signature == XQueryFunctionSignature(qName("f", "urn:a"), 1));
  EXPECT_FALSE(signature == XQueryFunctionSignature(qName("f", "urn:b"), 2));
  EXPECT_FALSE(signature == XQueryFunctionSignature(qName("g", "urn:a"), 2));
  EXPECT_EQ(signature.name()->localPart()->utf8(), "f");
  EXPECT_EQ(signature.argCount(), 2U);
}

TEST(FunctionSignature, OverloadsShareTheHashOfTheName) {
  const auto name = qName("f", "urn:a");
  EXPECT_EQ(XQueryFunctionSignature(name, 0).hash(), name->hash());
  EXPECT_EQ(XQueryFunctionSignature(name, 5).hash(), name->hash());
}

}  // namespace
}  // namespace xquery

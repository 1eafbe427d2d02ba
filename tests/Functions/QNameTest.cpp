#include "Functions/FunctionsTesting.h"
#include "Functions/QName.h"

namespace xquery {
namespace {

using namespace functiontest;

Value name(std::string_view lexical, const char* URI) {
  return XQueryQName::qname(NSString::stringWithASCII(lexical),
                            URI ? NSString::stringWithASCII(URI) : nullptr);
}

// "{namespace}prefix|local", with "-" for no namespace.
std::string parts(const Value& value) {
  const auto* qName = dyn_cast<XQueryQName>(value.get());
  if (!qName) return show(value);
  const auto& URI = qName->namespaceURI();
  const auto& hint = qName->prefixHint();
  return "{" + (URI ? URI->utf8() : "-") + "}" + (hint ? hint->utf8() : "") + "|" +
         qName->localPart()->utf8();
}

std::string made(XQueryProcedure procedure, const Value& first, const Value& second) {
  const auto context = XQueryContext::xqueryContext();
  const Value arguments[] = {first, second};
  return parts(procedure(arguments, 2, *context));
}

// Outer and inner declare p; the inner one alone declares q and the default namespace.
Value scope() {
  return cast<NSXMLElement>(elementFrom("<a xmlns:p='urn:outer'>"
                                        "<b xmlns:p='urn:inner' xmlns:q='urn:q' xmlns='urn:d' "
                                        "x='1'/></a>"))
      ->firstChild();
}

Value plain() {
  return elementFrom("<a><b/></a>");
}

// --- QName ---------------------------------------------------------------------------------------

TEST(QNameFunction, IsMadeOfNamespaceAndLexicalName) {
  EXPECT_EQ(made(fn_QName, string("urn:n"), string("p:a")), "{urn:n}p|a");
  EXPECT_EQ(made(fn_QName, string("urn:n"), string("a")), "{urn:n}|a");
  EXPECT_EQ(made(fn_QName, untyped("urn:n"), elementFrom("<x>a</x>")), "{urn:n}|a");
  EXPECT_EQ(made(fn_QName, typed(XQueryTypeAnyURI, "urn:n"), string("a")), "{urn:n}|a");
}

TEST(QNameFunction, AnEmptyNamespaceIsNone) {
  EXPECT_EQ(made(fn_QName, string(""), string("a")), "{-}|a");
  EXPECT_EQ(made(fn_QName, empty(), string("a")), "{-}|a");
  EXPECT_EQ(made(fn_QName, string(" \t\n\r"), string("p:a")), "{-}p|a");
}

TEST(QNameFunction, BothAreTrimmed) {
  EXPECT_EQ(made(fn_QName, string(" urn:n\n"), string("\tp:a ")), "{urn:n}p|a");
  EXPECT_EQ(made(fn_QName, string("urn n"), string("a b")), "{urn n}|a b");
}

TEST(QNameFunction, TheNameIsNotChecked) {
  EXPECT_EQ(made(fn_QName, string("u"), string("")), "{u}|");
  EXPECT_EQ(made(fn_QName, string("u"), string(":a")), "{u}|:a");
  EXPECT_EQ(made(fn_QName, string("u"), string("p:")), "{u}p|");
  EXPECT_EQ(made(fn_QName, string("u"), string("p:a:b")), "{u}p|a:b");
  EXPECT_EQ(made(fn_QName, string("u"), string("1 <")), "{u}|1 <");
}

TEST(QNameFunction, PartsAreStrings) {
  EXPECT_EQ(call(fn_QName, {string("u"), integer(1)}), "error 6 not a string type - 1");
  EXPECT_EQ(call(fn_QName, {integer(1), string("u")}), "error 6 not a string type - 1");
}

TEST(QNameFunction, KeepsNoTypeOfItsArguments) {
  const auto context = XQueryContext::xqueryContext();
  const Value arguments[] = {string("u"), string("a")};
  const Value value = fn_QName(arguments, 2, *context);
  ASSERT_TRUE(isa<XQueryQName>(value));
  EXPECT_EQ(show(cast<XQueryQName>(value)->localPart()), "untypedAtomic a");
  EXPECT_EQ(show(cast<XQueryQName>(value)->namespaceURI()), "untypedAtomic u");
}

TEST(QNameFunction, TakesTwoArguments) {
  EXPECT_EQ(refusedCounts(fn_QName, string("a")), "0 1 3 4 5");
}

TEST(QNameFunction, EqualsTheNameOfAnElement) {
  EXPECT_EQ(answer("QName('urn:n', 'x:a') eq node-name(<p:a xmlns:p='urn:n'/>),"
                   "QName('', 'a') eq node-name(<a/>), QName('urn:n', 'a') eq node-name(<a/>)"),
            "true, true, false");
}

// --- local-name-from-QName and namespace-uri-from-QName ------------------------------------------

TEST(LocalNameFromQName, IsTheLocalPartAsAString) {
  EXPECT_EQ(call(fn_local_name_from_QName, {name("p:a", "urn:n")}), "string a");
  EXPECT_EQ(call(fn_local_name_from_QName, {name("p:", "urn:n")}), "string ");
}

TEST(NamespaceURIFromQName, IsTheNamespaceAsAURI) {
  EXPECT_EQ(call(fn_namespace_uri_from_QName, {name("p:a", "urn:n")}), "anyURI urn:n");
}

TEST(NamespaceURIFromQName, WithoutANamespaceIsTheEmptyURI) {
  EXPECT_EQ(call(fn_namespace_uri_from_QName, {name("a", nullptr)}), "anyURI ");
  EXPECT_EQ(call(fn_namespace_uri_from_QName, {name("a", "")}), "anyURI ");
}

TEST(NamespaceURIFromQName, OfWhatIsNoURIIsAFailedCast) {
  EXPECT_EQ(call(fn_namespace_uri_from_QName, {name("a", "no uri")}),
            "error 6 value does not match a required type");
}

TEST(PartsOfQNames, OfTheEmptySequenceAreEmpty) {
  EXPECT_EQ(call(fn_local_name_from_QName, {empty()}), "()");
  EXPECT_EQ(call(fn_namespace_uri_from_QName, {empty()}), "()");
}

TEST(PartsOfQNames, OfWhatIsNoQNameAreRefused) {
  for (const Value& argument : {string("p:a"), integer(1), elementFrom("<a/>"),
                                sequence({name("a", nullptr), name("b", nullptr)})}) {
    EXPECT_EQ(call(fn_local_name_from_QName, {argument}), "null");
    EXPECT_EQ(call(fn_namespace_uri_from_QName, {argument}), "null");
  }
}

TEST(PartsOfQNames, TakeOneArgument) {
  const Value argument = name("a", nullptr);
  EXPECT_EQ(refusedCounts(fn_local_name_from_QName, argument), "0 2 3 4 5");
  EXPECT_EQ(refusedCounts(fn_namespace_uri_from_QName, argument), "0 2 3 4 5");
}

// --- resolve-QName -------------------------------------------------------------------------------

TEST(ResolveQName, TakesTheNamespaceOfThePrefixAtTheNode) {
  EXPECT_EQ(made(fn_resolve_QName, string("q:a"), scope()), "{urn:q}|a");
  EXPECT_EQ(made(fn_resolve_QName, untyped("\n q:a "), scope()), "{urn:q}|a");
}

TEST(ResolveQName, TheOutermostDeclarationWins) {
  EXPECT_EQ(made(fn_resolve_QName, string("p:a"), scope()), "{urn:outer}|a");
}

TEST(ResolveQName, WithoutAPrefixTakesTheDefaultNamespaceOrNone) {
  EXPECT_EQ(made(fn_resolve_QName, string("a"), scope()), "{urn:d}|a");
  EXPECT_EQ(made(fn_resolve_QName, string("a"), plain()), "{-}|a");
}

TEST(ResolveQName, AnUnknownPrefixIsRefused) {
  EXPECT_EQ(made(fn_resolve_QName, string("z:a"), scope()), "null");
  EXPECT_EQ(made(fn_resolve_QName, string("xml:a"), plain()), "null");
  EXPECT_EQ(answer("resolve-QName('z:a', <a/>)"),
            "error 17 line 1 invalid arguments to function - resolve-QName");
}

TEST(ResolveQName, OnlyASecondColonLeavesAPrefix) {
  EXPECT_EQ(made(fn_resolve_QName, string("q:a:b"), scope()), "{urn:q}a|b");
  EXPECT_EQ(made(fn_resolve_QName, string(":a"), plain()), "{-}|:a");
  EXPECT_EQ(made(fn_resolve_QName, string("q:"), scope()), "{urn:q}|");
}

TEST(ResolveQName, OfTheEmptySequenceIsEmpty) {
  EXPECT_EQ(call(fn_resolve_QName, {empty(), scope()}), "()");
}

TEST(ResolveQName, TheSecondArgumentIsANode) {
  for (const Value& second : {empty(), string("a"), sequence({scope(), plain()})}) {
    EXPECT_EQ(call(fn_resolve_QName, {string("a"), second}), "null");
    EXPECT_EQ(call(fn_resolve_QName, {empty(), second}), "null");
  }
  const Value attribute = cast<NSXMLElement>(scope())->firstAttribute();
  EXPECT_EQ(made(fn_resolve_QName, string("q:a"), attribute), "{urn:q}|a");
}

TEST(ResolveQName, TheNameIsAString) {
  EXPECT_EQ(call(fn_resolve_QName, {integer(1), plain()}), "error 6 not a string type - 1");
}

TEST(ResolveQName, TakesTwoArguments) {
  EXPECT_EQ(refusedCounts(fn_resolve_QName, plain()), "0 1 3 4 5");
}

// --- namespace-uri-for-prefix --------------------------------------------------------------------

TEST(NamespaceURIForPrefix, IsWhatThePrefixIsBoundToAtTheNode) {
  EXPECT_EQ(call(fn_namespace_uri_for_prefix, {string("q"), scope()}), "anyURI urn:q");
  EXPECT_EQ(call(fn_namespace_uri_for_prefix, {untyped("p"), scope()}), "anyURI urn:outer");
  EXPECT_EQ(call(fn_namespace_uri_for_prefix, {string(""), scope()}), "anyURI urn:d");
  EXPECT_EQ(call(fn_namespace_uri_for_prefix, {empty(), scope()}), "anyURI urn:d");
}

TEST(NamespaceURIForPrefix, ThePrefixIsNotTrimmed) {
  EXPECT_EQ(call(fn_namespace_uri_for_prefix, {string(" q"), scope()}), "()");
}

TEST(NamespaceURIForPrefix, OfAnUnboundPrefixIsEmpty) {
  EXPECT_EQ(call(fn_namespace_uri_for_prefix, {string("z"), scope()}), "()");
  EXPECT_EQ(call(fn_namespace_uri_for_prefix, {string("xml"), scope()}), "()");
  EXPECT_EQ(call(fn_namespace_uri_for_prefix, {string(""), plain()}), "()");
}

TEST(NamespaceURIForPrefix, ADefaultNamespaceMayBeTakenBack) {
  EXPECT_EQ(call(fn_namespace_uri_for_prefix, {string(""), elementFrom("<a xmlns=''/>")}),
            "anyURI ");
}

TEST(NamespaceURIForPrefix, TheSecondArgumentIsANode) {
  for (const Value& second : {empty(), string("a"), sequence({scope(), plain()})}) {
    EXPECT_EQ(call(fn_namespace_uri_for_prefix, {string("p"), second}), "null");
  }
}

TEST(NamespaceURIForPrefix, ThePrefixIsAString) {
  EXPECT_EQ(call(fn_namespace_uri_for_prefix, {integer(1), plain()}),
            "error 6 not a string type - 1");
}

TEST(NamespaceURIForPrefix, TakesTwoArguments) {
  EXPECT_EQ(refusedCounts(fn_namespace_uri_for_prefix, plain()), "0 1 3 4 5");
}

// --- in-scope-prefixes ---------------------------------------------------------------------------

TEST(InScopePrefixes, NearerOnesComeFirstAndEachOnce) {
  EXPECT_EQ(call(fn_in_scope_prefixes, {scope()}),
            "(untypedAtomic p, untypedAtomic q, untypedAtomic , untypedAtomic xml)");
}

TEST(InScopePrefixes, WithoutDeclarationsThereIsNotEvenXml) {
  EXPECT_EQ(call(fn_in_scope_prefixes, {plain()}), "()");
  EXPECT_EQ(answer("count(in-scope-prefixes(/))", document("<a xmlns:p='u'/>")), "integer 0");
}

TEST(InScopePrefixes, XmlIsNotAddedASecondTime) {
  const Value node = elementFrom("<a xmlns:xml='http://www.w3.org/XML/1998/namespace'/>");
  const std::string found = call(fn_in_scope_prefixes, {node});
  EXPECT_TRUE(found == "untypedAtomic xml" || found == "()") << found;
}

TEST(InScopePrefixes, OfWhatIsNoNodeAreRefused) {
  for (const Value& argument : {empty(), string("a"), sequence({scope(), plain()})}) {
    EXPECT_EQ(call(fn_in_scope_prefixes, {argument}), "null");
  }
}

TEST(InScopePrefixes, TakeOneArgument) {
  EXPECT_EQ(refusedCounts(fn_in_scope_prefixes, plain()), "0 2 3 4 5");
}

}  // namespace
}  // namespace xquery

#include "Functions/FunctionsTesting.h"
#include "Functions/XQueryBuiltInFunction.h"
#include "Prolog/PrologTesting.h"
#include "Prolog/XQueryPrologItems.h"
#include "xquery/Exception.h"

#include <algorithm>
#include <set>
#include <sstream>

namespace xquery {
namespace {

using functiontest::answer;

constexpr std::string_view standardNames =
    "node-name nilled string data base-uri static-base-uri document-uri error trace "
    "codepoints-to-string string-to-codepoints compare concat string-join starts-with ends-with "
    "contains substring string-length substring-before substring-after normalize-space "
    "normalize-unicode upper-case lower-case translate escape-uri matches replace tokenize true "
    "false not abs floor ceiling round round-half-to-even resolve-QName QName "
    "local-name-from-QName namespace-uri-from-QName namespace-uri-for-prefix in-scope-prefixes "
    "resolve-uri name local-name namespace-uri number lang root zero-or-one one-or-more "
    "exactly-one boolean index-of empty exists distinct-values insert-before remove reverse "
    "subsequence unordered deep-equal count avg max min sum id idref doc collection position last "
    "years-from-duration months-from-duration days-from-duration hours-from-duration "
    "minutes-from-duration seconds-from-duration year-from-dateTime month-from-dateTime "
    "day-from-dateTime hours-from-dateTime minutes-from-dateTime seconds-from-dateTime "
    "timezone-from-dateTime year-from-date month-from-date day-from-date timezone-from-date "
    "hours-from-time minutes-from-time seconds-from-time timezone-from-time "
    "adjust-dateTime-to-timezone adjust-date-to-timezone adjust-time-to-timezone "
    "subtract-dateTimes-yielding-dayTimeDuration subtract-dates-yielding-dayTimeDuration "
    "subtract-times current-date current-dateTime current-time dateTime implicit-timezone "
    "default-collation";
constexpr std::string_view schemaNames =
    "string boolean decimal float double duration dateTime time date gYearMonth gYear gMonthDay "
    "gDay gMonth hexBinary base64Binary anyURI QName normalizedString token language NMTOKEN Name "
    "NCName ID IDREF ENTITY integer nonPositiveInteger negativeInteger long int short byte "
    "nonNegativeInteger unsignedLong unsignedInt unsignedShort unsignedByte positiveInteger "
    "NOTATION";
constexpr std::string_view datatypeNames = "yearMonthDuration dayTimeDuration untypedAtomic";
constexpr std::string_view extensionNames =
    "_test eval string-from-node node-from-string binary-from-string string-from-binary "
    "binary-hex-to-base64 binary-base64-to-hex binary-length binary-insert binary-remove "
    "binary-find binary-find-all real-date-time uri-body xslt xslt-uri node-xquery node-xpath "
    "xpath-for-node";

constexpr std::string_view standardURI = "http://www.w3.org/2004/10/xpath-functions";
constexpr std::string_view schemaURI = "http://www.w3.org/2001/XMLSchema";
constexpr std::string_view datatypeURI = "http://www.w3.org/2004/10/xpath-datatypes";
constexpr std::string_view extensionURI = "http://libxquery.example/xquery/2004/10/functions";

std::vector<std::string> words(std::string_view text) {
  std::istringstream in{std::string(text)};
  std::vector<std::string> result;
  for (std::string word; in >> word;) result.push_back(word);
  return result;
}

std::vector<std::string> registeredNames(XQueryNamespaceID namespaceID) {
  std::vector<std::string> names;
  for (const auto& row : XQueryBuiltInFunction::registrations()) {
    if (row.namespaceID == namespaceID) names.emplace_back(row.localName);
  }
  return names;
}

XQueryProcedure procedureNamed(std::string_view localName, std::string_view URI) {
  const Ref<NSString> namespaceURI = URI.empty() ? nullptr : NSString::stringWithASCII(URI);
  return XQueryBuiltInFunction::functionForQName(
      XQueryQName::qname(NSString::stringWithASCII(localName), namespaceURI));
}

TEST(Registry, HoldsEveryFunctionOfEachNamespaceInOrder) {
  EXPECT_EQ(registeredNames(XQueryNamespaceFN), words(standardNames));
  EXPECT_EQ(registeredNames(XQueryNamespaceXS), words(schemaNames));
  EXPECT_EQ(registeredNames(XQueryNamespaceXDT), words(datatypeNames));
  EXPECT_EQ(registeredNames(XQueryNamespaceExt), words(extensionNames));
}

TEST(Registry, CountsPerNamespaceAddUp) {
  EXPECT_EQ(registeredNames(XQueryNamespaceFN).size(), 109U);
  EXPECT_EQ(registeredNames(XQueryNamespaceXS).size(), 41U);
  EXPECT_EQ(registeredNames(XQueryNamespaceXDT).size(), 3U);
  EXPECT_EQ(registeredNames(XQueryNamespaceExt).size(), 20U);
  EXPECT_EQ(XQueryBuiltInFunction::registrations().size(), 173U);
}

TEST(Registry, StandardThenSchemaThenDatatypeThenExtensionFunctions) {
  const auto rows = XQueryBuiltInFunction::registrations();
  const XQueryNamespaceID order[] = {XQueryNamespaceFN, XQueryNamespaceXS, XQueryNamespaceXDT,
                                     XQueryNamespaceExt};
  const auto place = [&](XQueryNamespaceID id) {
    return std::find(std::begin(order), std::end(order), id) - std::begin(order);
  };
  EXPECT_TRUE(std::is_sorted(rows.begin(), rows.end(), [&](const auto& a, const auto& b) {
    return place(a.namespaceID) < place(b.namespaceID);
  }));
}

TEST(Registry, EveryNameIsFoundInItsNamespaceOnly) {
  const struct {
    std::string_view names;
    std::string_view URI;
  } families[] = {{standardNames, standardURI},
                  {schemaNames, schemaURI},
                  {datatypeNames, datatypeURI},
                  {extensionNames, extensionURI}};
  for (const auto& family : families) {
    for (const std::string& name : words(family.names)) {
      EXPECT_TRUE(procedureNamed(name, family.URI)) << name;
      EXPECT_FALSE(procedureNamed(name, "")) << name;
      EXPECT_FALSE(procedureNamed(name, "http://www.w3.org/2004/10/xquery-local-functions"))
          << name;
    }
  }
}

TEST(Registry, UnknownNamesHaveNoProcedure) {
  EXPECT_FALSE(procedureNamed("counts", standardURI));
  EXPECT_FALSE(procedureNamed("Count", standardURI));
  EXPECT_FALSE(procedureNamed("count", schemaURI));
  EXPECT_FALSE(procedureNamed("IDREFS", schemaURI));
  EXPECT_FALSE(procedureNamed("anyAtomicType", datatypeURI));
}

TEST(Registry, ThePrefixOfANameDoesNotMatter) {
  const Ref<NSString> URI = NSString::stringWithASCII(standardURI);
  EXPECT_EQ(XQueryBuiltInFunction::functionForQName(
                XQueryQName::qname(NSString::stringWithASCII("p:count"), URI)),
            procedureNamed("count", standardURI));
}

TEST(Registry, EveryFunctionHasAProcedureOfItsOwn) {
  std::set<XQueryProcedure> procedures;
  for (const auto& row : XQueryBuiltInFunction::registrations()) {
    EXPECT_TRUE(row.proc) << row.localName;
    procedures.insert(row.proc);
  }
  EXPECT_EQ(procedures.size(), XQueryBuiltInFunction::registrations().size());
}

TEST(Registry, SomeFunctionsHaveNoAnswerToAnyArguments) {
  for (const std::string name : {"fn:collection", "ext:binary-insert", "ext:binary-remove"}) {
    for (const char* arguments : {"()", "(1)", "('a', 'b')", "(1, 2, 3, 4)"}) {
      EXPECT_EQ(answer(name + arguments),
                "error 17 line 1 invalid arguments to function - " + name);
    }
  }
}

// --- traits --------------------------------------------------------------------------------------

// What the function answers, or the error that it raises.
Value answered(XQueryProcedure procedure, const std::vector<Value>& arguments,
               XQueryContext& context) {
  try {
    return procedure(arguments.data(), arguments.size(), context);
  } catch (const NSException&) {
    return _internal(context).error();
  }
}

std::vector<std::vector<Value>> sampleArguments(size_t count) {
  const Value samples[] = {
      functiontest::string("a"),
      functiontest::integer(1),
      functiontest::untyped("2004-10-29"),
      functiontest::empty(),
      functiontest::elementFrom("<a xml:lang='en' n='1'><b/>a</a>"),
      functiontest::sequence({functiontest::integer(2), functiontest::integer(1)})};
  std::vector<std::vector<Value>> lists = {{}};
  for (size_t index = 0; index < count; ++index) {
    std::vector<std::vector<Value>> longer;
    for (const auto& list : lists) {
      for (const Value& sample : samples) {
        longer.push_back(list);
        longer.back().push_back(sample);
      }
    }
    lists = std::move(longer);
  }
  return lists;
}

TEST(Traits, WhatAnswersTruthAnswersNothingElse) {
  const auto context = XQueryContext::xqueryContext();
  _internal(*context).setContextItem(functiontest::elementFrom("<a xml:lang='a'/>"), 1);
  for (const auto& row : XQueryBuiltInFunction::registrations()) {
    if (!row.answersTruth()) continue;
    bool isAnswered = false;
    for (size_t count = 0; count <= 3; ++count) {
      for (const auto& arguments : sampleArguments(count)) {
        const Value answer = answered(row.proc, arguments, *context);
        if (!answer || isa<XQueryError>(answer)) continue;
        isAnswered = true;
        EXPECT_EQ(XQueryObjectTypeID(answer.get()), XQueryTypeBoolean) << row.localName;
      }
    }
    EXPECT_TRUE(isAnswered) << row.localName;
  }
}

// Another focus and another default namespace make no difference.
TEST(Traits, WhatReadsItsArgumentsOnlyAnswersAlikeEverywhere) {
  const auto here = XQueryContext::xqueryContext();
  const auto there = XQueryContext::xqueryContext();
  const auto prolog = prologOf({XQueryPrologItemDefaultElementNamespace::elementNamespace(
      NSString::stringWithASCII("urn:d"), 0)});
  _internal(*there).setActiveProlog(prolog.get());
  _internal(*there).setContextItem(functiontest::elementFrom("<a xml:lang='a'/>"), 3);
  _internal(*there).setLast(5);
  const auto shown = [](const Value& value) {
    const auto* name = dyn_cast<XQueryQName>(value);
    return name ? name->description()->utf8() : functiontest::show(value);
  };
  std::set<std::string> differing;
  for (const auto& row : XQueryBuiltInFunction::registrations()) {
    for (size_t count = 1; count <= 3; ++count) {
      const bool readsOnly = row.readsArgumentsOnly(count);
      if (!readsOnly && row.namespaceID == XQueryNamespaceExt) continue;
      for (const auto& arguments : sampleArguments(count)) {
        if (shown(answered(row.proc, arguments, *here)) ==
            shown(answered(row.proc, arguments, *there))) {
          continue;
        }
        differing.emplace(row.localName);
        EXPECT_FALSE(readsOnly) << row.localName;
      }
    }
  }
  EXPECT_EQ(differing, (std::set<std::string>{"QName", "id", "idref", "lang"}));
}

TEST(Traits, OneFunctionAsksForDocuments) {
  for (const auto& row : XQueryBuiltInFunction::registrations()) {
    EXPECT_EQ(row.has(XQueryBuiltInFunction::LoadsDocuments),
              row.proc == procedureNamed("doc", standardURI))
        << row.localName;
  }
}

TEST(BuiltInFunction, KeepsItsProcedure) {
  const XQueryProcedure procedure = procedureNamed("count", standardURI);
  EXPECT_EQ(XQueryBuiltInFunction::builtInFunctionWithProc(procedure)->proc(), procedure);
}

}  // namespace
}  // namespace xquery

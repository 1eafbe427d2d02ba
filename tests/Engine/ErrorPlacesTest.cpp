// Where errors arise: for every row of the catalogue a query that raises it, with the place of the
// error and the calls that lead there, evaluated both ways.
#include "Types/XQueryErrors.h"
#include "xquery/xquery.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <chrono>
#include <fstream>
#include <map>
#include <memory>
#include <optional>
#include <set>
#include <string>
#include <string_view>
#include <vector>

namespace xquery {
namespace {

using Calls = std::vector<std::string>;

// Library modules by their URL.
const std::map<std::string, std::string>& modules() {
  static const std::map<std::string, std::string> texts = {
      {"m:f",
       "module namespace m = 'm';\n"
       "declare variable $m:v := 1;\n"
       "declare function m:f($x) { 1 idiv $x };"},
      {"m:g", "module namespace m = 'm';\ndeclare variable $m:v := 1 idiv 0;"},
      {"m:h", "module namespace m = 'm';\ndeclare function m:h() { 1 };"},
      {"m:syntax", "module namespace m = 'm';\ndeclare variable 1;"},
  };
  return texts;
}

class Loader : public XQueryLoader {
  std::optional<XQueryResource> load(const NSURL& URL, XQueryLoadPurpose) override {
    const auto found = modules().find(URL.absoluteString()->utf8());
    if (found == modules().end()) return std::nullopt;
    return XQueryResource{found->second, {}, {}, {}};
  }
};

XQueryLoading loading() {
  XQueryLoading result;
  result.policy.allowScheme("m");
  result.loader = std::make_shared<Loader>();
  return result;
}

Ref<XQueryError> errorOf(std::string_view query, XQueryWay way,
                         const XQueryLimits& limits = XQueryLimits()) {
  const auto compiled = XQuery::xqueryWithSource(query, loading(), XQueryLimits(), way);
  if (const auto errors = compiled->parseErrors()) {
    return Ref<XQueryError>(cast<XQueryError>(errors->objectAtIndex(0)));
  }
  const auto context = XQueryContext::xqueryContext();
  context->contextSetLimits(limits);
  Ref<XQueryError> error;
  const auto items = context->evaluateXQuery(*compiled, {}, nullptr, &error);
  const auto found = XQueryFirstError(items, error);
  return found ? Ref<XQueryError>(dyn_cast<XQueryError>(found)) : nullptr;
}

// The text at a place, which may go on over further lines.
std::string textAt(const XQuerySourcePlace& place, const std::string& query) {
  const std::string& text = place.moduleURL ? modules().at(place.moduleURL->utf8()) : query;
  size_t at = 0;
  for (int64_t line = 1; line < place.line; ++line) at = text.find('\n', at) + 1;
  return text.substr(at + static_cast<size_t>(place.column) - 1, static_cast<size_t>(place.length));
}

std::string shown(const XQuerySourcePlace& place) {
  return (place.moduleURL ? place.moduleURL->utf8() + " " : "") + std::to_string(place.line) + ":" +
         std::to_string(place.column) + "+" + std::to_string(place.length);
}

// A query in which "«" and "»" stand around the place.
struct Marked {
  explicit Marked(std::string_view marked) : text(marked) {
    const std::string open = "«", close = "»";
    start = text.find(open);
    if (start != text.npos) text.erase(start, open.size());
    const size_t end = text.find(close);
    if (end != text.npos) text.erase(end, close.size());
    if (start == text.npos || end == text.npos) return;
    const size_t lineStart = text.rfind('\n', start) + 1;
    place = std::to_string(std::count(text.begin(), text.begin() + static_cast<long>(start), '\n') +
                           1) +
            ":" + std::to_string(start - lineStart + 1) + "+" + std::to_string(end - start);
  }
  std::string text;
  std::string place = "none";
  size_t start;
};

std::string placeOf(const XQueryError& error) {
  const auto place = error.place();
  return place ? shown(*place) : "none";
}

// "function: the text of the call".
Calls callsOf(const XQueryError& error, const std::string& query) {
  Calls calls;
  for (const XQueryErrorCall& call : error.calls()) {
    calls.push_back(call.function->utf8() + ": " +
                    (call.place ? textAt(*call.place, query) : "nowhere"));
  }
  return calls;
}

void expectPlace(std::string_view marked, const Calls& calls, const std::string& place = "") {
  const Marked query(marked);
  for (const XQueryWay way : {XQueryWay::Plain, XQueryWay::Planned}) {
    SCOPED_TRACE(query.text + (way == XQueryWay::Plain ? "\nplain" : "\nplanned"));
    const auto error = errorOf(query.text, way);
    ASSERT_TRUE(error);
    EXPECT_EQ(placeOf(*error), place.empty() ? query.place : place) << error->description()->utf8();
    EXPECT_EQ(callsOf(*error, query.text), calls);
    EXPECT_EQ(error->callsLeftOut(), 0);
  }
}

// --- the catalogue -------------------------------------------------------------------------------

struct Row {
  std::string_view name;
  XQueryErrorCategory category;
  int64_t number;
  std::string_view text;
  std::string_view query;  // empty for a row without a place
  Calls calls;
  std::string_view why = {};
};

template <size_t places>
Row row(std::string_view name, const XQueryErrorText<places>& entry, std::string_view query,
        Calls calls = {}) {
  return {name, entry.category, entry.number, entry.text, query, std::move(calls)};
}

template <size_t places>
Row none(std::string_view name, const XQueryErrorText<places>& entry, std::string_view why) {
  return {name, entry.category, entry.number, entry.text, "", {}, why};
}

#define ROW(name, ...) row(#name, XQueryErrors::name, __VA_ARGS__)
#define NONE(name, why) none(#name, XQueryErrors::name, why)

// Each call doubles the number of digits, of which there may not be 200,000.
Calls squaringCalls() {
  Calls calls(17, "local:p: local:p($x * $x, $n - 1)");
  calls.emplace_back("local:p: local:p(10, 40)");
  return calls;
}

const std::vector<Row>& rows() {
  static const std::vector<Row> table = {
      NONE(nestedTooDeeply, "where the stack ends is nobody's choice: see the test of recursion"),
      NONE(outOfMemory, "no query comes to it before a ceiling: see the test of limits"),
      NONE(deadlinePassed, "how far an evaluation gets varies: see the test of limits"),
      NONE(evaluationCancelled, "the same"),
      NONE(memoryCeilingReached, "the same"),
      ROW(tooManyDigits,
          "declare function local:p($x, $n) {\n"
          "  if ($n = 0) then $x else local:p(«$x * $x», $n - 1) };\n"
          "local:p(10, 40)",
          squaringCalls()),
      ROW(rangeTooLong, "(«1 to 100000000000», 2)"),
      NONE(notAStream, "only where a stream is asked for: see the test of refused streams"),
      NONE(nodeOfAStreamKept, "a host keeps the node, behind the query's back"),
      NONE(noSource, "there is no text"),
      NONE(notUTF8, "there is no text"),
      ROW(scannerError, "1, 'salt «&» pepper'"),
      ROW(invalidToken, "1,\n  2 «]»"),
      NONE(parserFailure, "what the generated code fails with has no place"),
      ROW(mustUnderstandExtension, "«(:: extension fast:index yes ::)» 1"),
      NONE(unsupportedVersion, "the prolog is told the version and not where it stood"),
      NONE(baseURIDefined, "the parser finds the second declaration first"),
      ROW(secondBaseURI, "declare base-uri 'http://a/';\n«declare base-uri 'http://b/';» 1"),
      ROW(prefixReused, "declare namespace p = 'u:p'; «declare namespace p = 'u:q'»; 1"),
      ROW(functionDeclaredTwice,
          "declare function local:f($x) { 1 }; «declare function local:f($y) { 2 }»; 1"),
      ROW(duplicateVariable,
          "import module namespace m = 'm' at 'm:f';\n"
          "«import module namespace n = 'm' at 'm:f'»; 1"),
      ROW(duplicateFunction,
          "import module namespace m = 'm' at 'm:h';\n"
          "«import module namespace n = 'm' at 'm:h'»; 1"),
      ROW(secondDefaultCollation,
          "declare default collation 'u:a'; «declare default collation 'u:b';» 1"),
      ROW(duplicateParameter, "declare function local:f($x, «$x as item()») { 1 }; 1"),
      ROW(functionInReservedNamespace, "«declare function fn:f($x) { $x }»; 1"),
      ROW(invalidNamespaceURI, "«declare default element namespace ''»; 1"),
      ROW(moduleNotFound, "«import module namespace m = 'u:m' at 'missing:x'»; 1"),
      ROW(variableOutsideModule, "module namespace m = 'u:m'; «declare variable $x := 1»;"),
      ROW(functionOutsideModule, "module namespace m = 'u:m'; «declare function local:f() { 1 }»;"),
      ROW(variableDeclaredTwice, "declare variable $x := 1; «declare variable $x := 2»; $x"),
      ROW(secondInheritNamespaces,
          "declare inherit-namespaces yes; «declare inherit-namespaces no;» 1"),
      ROW(secondOrderingMode, "declare ordering ordered; «declare ordering unordered;» 1"),
      ROW(secondConstruction, "declare construction strip; «declare construction preserve;» 1"),
      ROW(secondXMLSpace, "declare xmlspace preserve; «declare xmlspace strip;» 1"),
      ROW(secondEmptyOrdering,
          "declare default order empty least; «declare default order empty greatest;» 1"),
      ROW(reservedPrefix, "«declare namespace xml = 'u:x'»; 1"),
      ROW(unresolvedQName, "1, <r>{ «<p:a/>» }</r>"),
      ROW(undefinedVariable, "declare function local:f($a) { $a + «$total» }; 1 + local:f(2)",
          {"local:f: local:f(2)"}),
      ROW(unresolvedExternalVariable, "«declare variable $limit external»; $limit"),
      ROW(unresolvedExternalFunction, "«declare function local:f() external»; 1"),
      ROW(invalidType, "for $«x as xs:string in 1» return 2"),
      ROW(invalidConversion, "1, «(1, 2) castable as xs:integer»"),
      ROW(invalidOperand, "(1,\n «1 = '1'», 3)"),
      ROW(invalidAtomization, "1, «xs:integer(())»"),
      ROW(notAString, "string-length(«upper-case(5)»)"),
      ROW(notANumber, "declare function local:f($x) { «floor($x)» };\nlocal:f('1.5')",
          {"local:f: local:f('1.5')"}),
      ROW(notAnInteger, "for $i in 1 return «1 to '3'»"),
      ROW(valueOfAnotherType, "let $d := '29.10.2004' return «xs:date($d)»"),
      ROW(divideByZero, "for $i in (2, 1, 0)\nreturn «1 idiv $i»"),
      ROW(divisionByZero,
          "declare function local:f($x) { «1 div $x» };\n"
          "declare function local:g($x) { (local:f($x), 1) };\nlocal:g(0)",
          {"local:f: local:f($x)", "local:g: local:g(0)"}),
      ROW(itemNotANode, "1, «<a/>/string()/b»"),
      ROW(itemNotAtomic, "1, «<a><b/></a>/b/(1, .)»"),
      ROW(itemNotANodeOrAtomic, "1, «<a/>/ext:binary-find('0102', '01', '02')»"),
      ROW(contextItemNotANode, "for $n in (1, 2) return «$n/title»"),
      ROW(attributeNotDistinct, "1, «<a b=\"1\" b=\"2\"/>»"),
      ROW(invalidInstruction, "1, «processing-instruction p { 'a?>b' }»"),
      ROW(invalidDocumentNode, "1, «document { <a/>, <b/> }»"),
      ROW(attributeIsXMLNS, "<a>{ «attribute xmlns { 'u:a' }» }</a>"),
      ROW(invalidNamespace, "<a «xmlns:xml=\"u:x\"»/>"),
      ROW(invalidComment, "<a>{ 1, «comment { 'a -- b' }» }</a>"),
      ROW(undefinedFunction, "1 + «counts((1, 2))»"),
      ROW(invalidArguments, "1 + «count(1, 2)»"),
      ROW(namedError, "declare function local:f() { «error()» }; local:f()",
          {"local:f: local:f()"}),
      ROW(describedError, "if (1) then «error((), 'none are left')» else 2"),
      ROW(notZeroOrOne, "1 + «zero-or-one((1, 2))»"),
      ROW(notOneOrMore, "1, «one-or-more(())»"),
      ROW(notExactlyOne, "let $x := (1, 2) return «exactly-one($x)»"),
      ROW(unsupportedNormalizationForm, "1, «normalize-unicode('a', 'nfc')»"),
  };
  return table;
}

TEST(ErrorPlaces, EveryRowOfTheCatalogueIsInTheTable) {
  std::ifstream in(XQUERY_SOURCE_DIR "/src/Types/XQueryErrors.h");
  constexpr std::string_view start = "inline constexpr XQueryErrorText<";
  std::set<std::string> names;
  for (std::string line; std::getline(in, line);) {
    if (!line.starts_with(start)) continue;
    const size_t name = line.find("> ") + 2;
    names.insert(line.substr(name, line.find('{') - name));
  }
  std::set<std::string> tested;
  for (const Row& row : rows()) tested.insert(std::string(row.name));
  EXPECT_EQ(tested, names);
}

TEST(ErrorPlaces, EveryRowHasItsPlaceAndCalls) {
  for (const Row& row : rows()) {
    SCOPED_TRACE(row.name);
    EXPECT_EQ(row.query.empty(), !row.why.empty());
    if (row.query.empty()) continue;
    expectPlace(row.query, row.calls);
    const auto error = errorOf(Marked(row.query).text, XQueryWay::Planned);
    ASSERT_TRUE(error);
    EXPECT_EQ(error->err(), row.number);
    EXPECT_EQ(static_cast<int64_t>(error->number()), row.number);
    EXPECT_EQ(error->category(), row.category);
    EXPECT_TRUE(error->msg()->utf8().starts_with(row.text.substr(0, row.text.find("%@"))));
  }
}

// --- how they arise ------------------------------------------------------------------------------

TEST(ErrorPlaces, OfArgumentsAreInTheCallerAndNotInTheCall) {
  expectPlace("declare function local:f($x) { $x }; 1 + local:f(«1 idiv 0»)", {});
}

TEST(ErrorPlaces, OfABodyThatGivesAnErrorAreThoseOfTheError) {
  expectPlace("declare function local:f($x) { «<!-- a -- b -->» }; local:f(1), 2",
              {"local:f: local:f(1)"});
}

TEST(ErrorPlaces, OfAnErrorThatIsTheResultAreThoseOfTheError) {
  expectPlace("«<!-- a -- b -->»", {});
  expectPlace("some $«x as xs:string in 1» satisfies 2", {});
}

TEST(ErrorPlaces, OfOperandsAreThoseOfTheInnermostExpression) {
  expectPlace("1 + (2 + («3 idiv 0») * 4)", {});
  expectPlace("(1 to 3)[. = 1], («2 treat as xs:string»)", {});
}

TEST(ErrorPlaces, OfWhatIsCountedOrComparedAreNotInTheQuestion) {
  expectPlace("for $n in (1, 2) return count(«$n/title»)", {});
  expectPlace("for $n in (1, 2) return exists((<a/>, «$n//title»))", {});
  expectPlace("for $n in (1, 2) return («$n/title»)[1]", {});
  expectPlace("count(for $i in 1 return «$i/a»)", {});
  expectPlace("1 = («1 to '3'»)", {});
  expectPlace("«<a>x</a> + 1» + 2 - 3", {});
  expectPlace("«1 + 2 - <a>x</a>» + 3", {});
  expectPlace("«<a>x</a> * 2» = 3 or 4", {});
  expectPlace("for $i in «1 to '3'» return $i", {});
  expectPlace("count(for $i in «1 to 100000000000» return $i)", {});
  expectPlace("some $i in 1, $j in «1 to 100000000000» satisfies $j = 'a'", {});
  expectPlace("for $i in (1, 'a') order by «$i descending» return $i", {});
  expectPlace("«for $i in (1, 'a') order by 1, $i return $i»", {});
  expectPlace("declare function local:f($n) { «$n//a» }; count(local:f(1))",
              {"local:f: local:f(1)"});
}

TEST(ErrorPlaces, OfGlobalVariablesAreInTheirInitializers) {
  expectPlace("declare variable $a := 1;\ndeclare variable $b := $a + («1 idiv 0»);\n$b", {});
}

TEST(ErrorPlaces, OfAModuleAreInTheModule) {
  expectPlace("import module namespace m = 'm' at 'm:f';\nm:f(0) + 1", {"m:f: m:f(0)"},
              "m:f 3:28+9");
  expectPlace("import module namespace m = 'm' at 'm:g';\n1", {}, "m:g 2:26+8");
}

TEST(ErrorPlaces, OfTheReasonWhyAModuleDoesNotDoAreInTheModule) {
  const auto query =
      XQuery::xqueryWithSource("import module namespace m = 'm' at 'm:syntax'; 1", loading());
  const auto errors = query->parseErrors();
  ASSERT_TRUE(errors);
  ASSERT_EQ(errors->count(), 2u);
  EXPECT_EQ(placeOf(*cast<XQueryError>(errors->objectAtIndex(0))), "1:1+45");
  EXPECT_EQ(placeOf(*cast<XQueryError>(errors->objectAtIndex(1))), "m:syntax 2:1+7");
}

TEST(ErrorPlaces, OfValuesThatAreKeptAreWhereTheyAroseFirst) {
  expectPlace(
      "declare function local:f($n) { «1 idiv $n» };\n"
      "let $zero := count(()) return (\n"
      "count(for $i in 1 to 5 return (1 to 3)[. = local:f($zero)]),\n"
      "sum(for $i in 1 to 5 return $i + local:f($zero)))",
      {"local:f: local:f($zero)"});
}

TEST(ErrorPlaces, OfErrorsThatArePassedOverAreForgotten) {
  expectPlace("declare function local:f($n) { $n idiv 0 };\n(1 to 3)[local:f(.)], «error()»", {});
}

TEST(ErrorPlaces, OfInnerQueriesAreThoseOfTheCall) {
  expectPlace("1, «ext:node-xpath(<a/>, '1')»", {});
}

TEST(ErrorPlaces, OfADeepRecursionKeepsTheEndsOfTheCalls) {
  const std::string query =
      "declare function local:f($n) {\n"
      "  if ($n = 0) then 1 idiv 0 else 1 + local:f($n - 1) };\n"
      "local:f(300)";
  for (const XQueryWay way : {XQueryWay::Plain, XQueryWay::Planned}) {
    const auto error = errorOf(query, way);
    ASSERT_TRUE(error);
    EXPECT_EQ(placeOf(*error), "2:20+8");
    const auto calls = callsOf(*error, query);
    ASSERT_EQ(calls.size(), 64u);
    EXPECT_EQ(error->callsLeftOut(), 301 - 64);
    EXPECT_EQ(calls.front(), "local:f: local:f($n - 1)");
    EXPECT_EQ(calls[62], "local:f: local:f($n - 1)");
    EXPECT_EQ(calls.back(), "local:f: local:f(300)");
  }
}

TEST(ErrorPlaces, OfAnEndlessRecursionAreKnown) {
  const std::string query = "declare function local:f($n) { 1 + local:f($n) }; local:f(1)";
  const auto error = errorOf(query, XQueryWay::Planned);
  ASSERT_TRUE(error);
  EXPECT_EQ(error->category(), XQueryErrorCategory::Limit);
  EXPECT_TRUE(error->place());
  EXPECT_EQ(error->calls().size(), 64u);
  EXPECT_GT(error->callsLeftOut(), 100);
  EXPECT_EQ(callsOf(*error, query).back(), "local:f: local:f(1)");
}

TEST(ErrorPlaces, OfLimitsAreWhereTheyWereReached) {
  XQueryLimits late;
  late.duration = std::chrono::milliseconds(20);
  XQueryLimits small;
  small.memoryCeiling = 1 << 20;
  const std::pair<const char*, XQueryLimits> cases[] = {
      {"declare function local:f() { count(for $i in 1 to 1000000000 return $i + 1) }; local:f()",
       late},
      {"declare function local:f() { for $i in 1 to 10000000 return <a/> }; count((1, local:f()))",
       small}};
  for (const auto& [query, limits] : cases) {
    const auto error = errorOf(query, XQueryWay::Planned, limits);
    ASSERT_TRUE(error) << query;
    EXPECT_EQ(error->category(), XQueryErrorCategory::Limit) << error->description()->utf8();
    ASSERT_TRUE(error->place()) << query;
    EXPECT_GT(error->place()->column, 28) << query;
    EXPECT_EQ(callsOf(*error, query), Calls{"local:f: local:f()"});
  }
}

TEST(ErrorPlaces, OfALimitThatIsReachedAtOnceAreUnknown) {
  XQueryLimits over;
  over.duration = std::chrono::nanoseconds(0);
  const auto error = errorOf("1", XQueryWay::Planned, over);
  ASSERT_TRUE(error);
  EXPECT_FALSE(error->place());
  EXPECT_TRUE(error->calls().empty());
}

TEST(ErrorPlaces, OutliveTheQuery) {
  const auto error = errorOf("1,\n 1 idiv 0", XQueryWay::Planned);
  ASSERT_TRUE(error);
  const auto place = error->place();
  ASSERT_TRUE(place);
  EXPECT_FALSE(place->moduleURL);
  EXPECT_EQ(place->sourceLine->utf8(), " 1 idiv 0");
}

TEST(ErrorPlaces, LeaveTheDescriptionAlone) {
  EXPECT_EQ(errorOf("1,\n $x", XQueryWay::Planned)->description()->utf8(),
            "XQueryError:8 - \"reference to undefined variable \"x\"\" at line:2");
  EXPECT_EQ(errorOf("1 idiv 0", XQueryWay::Planned)->description()->utf8(),
            "XQueryError:6 - \"divide by zero\" at line:1");
}

TEST(ErrorPlaces, OfRefusedStreamsAreWhereTheReasonIs) {
  for (const char* marked : {"for $b in /a/b return «$b/..»", "for $b in /a/b return «/a»"}) {
    const Marked query(marked);
    const auto error = errorOf(query.text, XQueryWay::Streamed);
    ASSERT_TRUE(error) << query.text;
    EXPECT_EQ(placeOf(*error), query.place) << error->description()->utf8();
    EXPECT_TRUE(error->calls().empty());
  }
}

// A query can imitate the text of a limit, and not its category.
TEST(ErrorPlaces, WhatAQueryRaisesIsItsOwn) {
  const auto error = errorOf("error((), 'limit: none')", XQueryWay::Planned);
  ASSERT_TRUE(error);
  EXPECT_EQ(error->category(), XQueryErrorCategory::RaisedByQuery);
}

TEST(ErrorPlaces, AHostsOwnErrorHasNone) {
  const auto error = XQueryError::error(7, "a host's");
  EXPECT_FALSE(error->place());
  EXPECT_TRUE(error->calls().empty());
  EXPECT_EQ(error->callsLeftOut(), 0);
  EXPECT_EQ(error->category(), XQueryErrorCategory::Internal);
}

}  // namespace
}  // namespace xquery

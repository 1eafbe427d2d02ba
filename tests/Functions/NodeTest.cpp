#include "Functions/FunctionsTesting.h"
#include "Functions/Node.h"
#include "Types/XQueryErrors.h"
#include "xquery/Data.h"
#include "xquery/URL.h"

#include <array>
#include <random>

namespace xquery {
namespace {

using namespace functiontest;

Value dataObject() {
  return NSData::dataWithBytes("ab");
}

// --- string --------------------------------------------------------------------------------------

TEST(String, OfAnAtomicValueIsItsStringForm) {
  EXPECT_EQ(call(fn_string, {integer(12)}), "string 12");
  EXPECT_EQ(call(fn_string, {boolean(true)}), "string true");
  EXPECT_EQ(call(fn_string, {untyped("u")}), "string u");
  EXPECT_EQ(call(fn_string, {string("s")}), "string s");
}

TEST(String, OfANodeIsItsStringValue) {
  EXPECT_EQ(call(fn_string, {elementFrom("<a>x<!--c--><b>y</b></a>")}), "string xy");
  EXPECT_EQ(answer("string(a/@b), string(a/comment())", document("<a b='v'><!--c--></a>")),
            "string v, string c");
}

TEST(String, OfTheEmptySequenceIsTheEmptyString) {
  EXPECT_EQ(call(fn_string, {empty()}), "string ");
}

TEST(String, WithoutArgumentsIsOfTheContextItem) {
  EXPECT_EQ(call(fn_string, {}, elementFrom("<a>x</a>")), "string x");
  EXPECT_EQ(call(fn_string, {}), "null");
}

TEST(String, OfSeveralItemsIsAnError) {
  EXPECT_EQ(call(fn_string, {sequence({integer(1), integer(2)})}),
            "error 6 invalid type for automization");
}

TEST(String, TakesUpToOneArgument) {
  EXPECT_EQ(refusedCounts(fn_string, string("a"), 5, integer(1)), "2 3 4 5");
}

// --- data ----------------------------------------------------------------------------------------

TEST(Data, OfAnAtomicValueIsTheValue) {
  const Value value = integer(12);
  const auto context = XQueryContext::xqueryContext();
  EXPECT_EQ(fn_data(&value, 1, *context), value);
}

TEST(Data, OfANodeIsItsTypedValue) {
  EXPECT_EQ(call(fn_data, {elementFrom("<a>12</a>")}), "untypedAtomic 12");
}

TEST(Data, OfTheEmptySequenceIsEmpty) {
  EXPECT_EQ(call(fn_data, {empty()}), "()");
}

TEST(Data, OfASequenceGathersTheValuesInOrder) {
  EXPECT_EQ(call(fn_data, {sequence({elementFrom("<a>x</a>"), integer(1), empty(), string("s")})}),
            "(untypedAtomic x, integer 1, string s)");
  EXPECT_EQ(call(fn_data, {sequence({empty(), integer(1)})}), "integer 1");
  EXPECT_EQ(call(fn_data, {sequence({empty(), empty()})}), "()");
}

TEST(Data, AMemberThatIsNeitherNodeNorAtomicRefusesTheWholeCall) {
  EXPECT_EQ(call(fn_data, {sequence({integer(1), dataObject()})}), "null");
  EXPECT_EQ(call(fn_data, {dataObject()}), "null");
}

TEST(Data, TakesOneArgument) {
  EXPECT_EQ(refusedCounts(fn_data, integer(1), 5, integer(1)), "0 2 3 4 5");
}

// --- number --------------------------------------------------------------------------------------

TEST(NumberFunction, IsTheItemAsADouble) {
  EXPECT_EQ(call(fn_number, {integer(12)}), "double 12");
  EXPECT_EQ(call(fn_number, {untyped(" 1.5x")}), "double 1.5");
  EXPECT_EQ(call(fn_number, {string("-INF")}), "double -INF");
  EXPECT_EQ(call(fn_number, {boolean(true)}), "double 1");
  EXPECT_EQ(call(fn_number, {elementFrom("<a>7</a>")}), "double 7");
}

TEST(NumberFunction, OfTheEmptySequenceIsTheSharedNaN) {
  const Value argument = empty();
  const auto context = XQueryContext::xqueryContext();
  EXPECT_EQ(fn_number(&argument, 1, *context), XQueryNumber::nan());
}

TEST(NumberFunction, OfWhatDoesNotCastIsTheSharedNaNAndLeavesNoError) {
  const auto context = XQueryContext::xqueryContext();
  for (const Value& argument :
       {string("x"), months(1), sequence({integer(1), integer(2)}), string("")}) {
    _internal(*context).setError(XQueryErrors::invalidType.error(), false);
    EXPECT_EQ(fn_number(&argument, 1, *context), XQueryNumber::nan()) << show(argument);
    EXPECT_FALSE(_internal(*context).error());
  }
}

TEST(NumberFunction, WithoutArgumentsIsOfTheContextItem) {
  EXPECT_EQ(call(fn_number, {}, elementFrom("<a>7</a>")), "double 7");
  EXPECT_EQ(call(fn_number, {}), "null");
}

TEST(NumberFunction, OfAURIIsTheErrorThatItsCastAnswers) {
  EXPECT_EQ(call(fn_number, {typed(XQueryTypeAnyURI, "urn:x")}),
            "record 6 value does not match a required type");
  EXPECT_EQ(answer("number(xs:anyURI('urn:x'))"),
            "error 6 line 0 value does not match a required type");
}

TEST(NumberFunction, OfATextIsWhatItsCastAnswersOrNaN) {
  constexpr std::string_view alphabet = "0123456789.+-eE NaINFx\t";
  std::mt19937 random(7);
  const auto context = XQueryContext::xqueryContext();
  for (int round = 0; round < 20000; ++round) {
    std::string text;
    for (size_t length = random() % 6; length > 0; --length) {
      text += alphabet[random() % alphabet.size()];
    }
    if (random() % 50 == 0) text = std::array{"NaN", "INF", "-INF", "+INF"}[random() % 4];
    const Value argument = random() % 2 ? string(text) : untyped(text);
    const Value answer = fn_number(&argument, 1, *context);
    const Value plain = XQueryDoubleOrNaN(argument, *context);
    ASSERT_EQ(show(answer), show(plain)) << text;
    ASSERT_EQ(XQueryNumber::isSpecial(answer.get()), XQueryNumber::isSpecial(plain.get())) << text;
  }
}

TEST(NumberFunction, TakesUpToOneArgument) {
  EXPECT_EQ(refusedCounts(fn_number, integer(1), 5, integer(1)), "2 3 4 5");
}

// --- name and local-name -------------------------------------------------------------------------

constexpr const char* named = "<p:a xmlns:p='urn:p' p:b='1' c='2'>t<?pi x?><!--c--></p:a>";

TEST(Name, IsTheQualifiedNameAsWritten) {
  const Value tree = document(named);
  EXPECT_EQ(answer("name(*), */@*/name(.), */processing-instruction()/name(.)", tree),
            "string p:a, string p:b, string c, string pi");
}

TEST(LocalName, IsTheNameWithoutPrefix) {
  const Value tree = document(named);
  EXPECT_EQ(
      answer("local-name(*), */@*/local-name(.), */processing-instruction()/local-name(.)", tree),
      "string a, string b, string c, string pi");
}

TEST(Name, OfANodeWithoutOneIsEmpty) {
  const Value tree = document(named);
  for (const char* function : {"name", "local-name"}) {
    const std::string call = std::string(function) + "(.)";
    EXPECT_EQ(answer(call + ", */text()/" + call + ", */comment()/" + call, tree),
              "string , string , string ");
  }
}

TEST(Name, OfTheEmptySequenceIsEmpty) {
  EXPECT_EQ(call(fn_name, {empty()}), "string ");
  EXPECT_EQ(call(fn_local_name, {empty()}), "string ");
}

TEST(Name, OfWhatIsNoNodeIsRefused) {
  for (const Value& argument :
       {integer(1), sequence({elementFrom("<a/>"), elementFrom("<b/>")}), string("a")}) {
    EXPECT_EQ(call(fn_name, {argument}), "null");
    EXPECT_EQ(call(fn_local_name, {argument}), "null");
  }
}

TEST(Name, WithoutArgumentsIsOfTheContextItem) {
  EXPECT_EQ(call(fn_name, {}, elementFrom("<a/>")), "string a");
  EXPECT_EQ(call(fn_local_name, {}, elementFrom("<p:a xmlns:p='urn:p'/>")), "string a");
  EXPECT_EQ(call(fn_name, {}), "null");
  EXPECT_EQ(call(fn_local_name, {}), "null");
}

TEST(Name, TakesUpToOneArgument) {
  const Value node = elementFrom("<a/>");
  EXPECT_EQ(refusedCounts(fn_name, node, 5, node), "2 3 4 5");
  EXPECT_EQ(refusedCounts(fn_local_name, node, 5, node), "2 3 4 5");
}

// --- namespace-uri -------------------------------------------------------------------------------

TEST(NamespaceURI, IsTheNodesNamespace) {
  const Value tree = document("<p:a xmlns:p='urn:p' xmlns='urn:d' p:b='1' c='2'><d/></p:a>");
  EXPECT_EQ(answer("namespace-uri(*), */@*/namespace-uri(.), namespace-uri(*/*)", tree),
            "anyURI urn:p, anyURI urn:p, anyURI , anyURI urn:d");
}

TEST(NamespaceURI, OfANodeWithoutOneIsEmpty) {
  const Value tree = document("<a>t<?pi x?><!--c--></a>");
  EXPECT_EQ(answer("namespace-uri(/), namespace-uri(a), a/node()/namespace-uri(.)", tree),
            "anyURI , anyURI , anyURI , anyURI , anyURI ");
}

TEST(NamespaceURI, OfTheEmptySequenceIsEmptyAndOfWhatIsNoNodeRefused) {
  EXPECT_EQ(call(fn_namespace_uri, {empty()}), "anyURI ");
  EXPECT_EQ(call(fn_namespace_uri, {string("a")}), "null");
  EXPECT_EQ(call(fn_namespace_uri, {sequence({elementFrom("<a/>"), elementFrom("<b/>")})}), "null");
}

TEST(NamespaceURI, ThatIsNoURIIsAFailedCast) {
  EXPECT_EQ(answer("namespace-uri(<a xmlns='a b'/>)"),
            "error 6 line 0 value does not match a required type");
}

TEST(NamespaceURI, WithoutArgumentsIsOfTheContextItem) {
  EXPECT_EQ(call(fn_namespace_uri, {}, elementFrom("<a xmlns='urn:d'/>")), "anyURI urn:d");
  EXPECT_EQ(call(fn_namespace_uri, {}, integer(1)), "null");
  EXPECT_EQ(call(fn_namespace_uri, {}), "null");
}

TEST(NamespaceURI, TakesUpToOneArgument) {
  const Value node = elementFrom("<a/>");
  EXPECT_EQ(refusedCounts(fn_namespace_uri, node, 5, node), "2 3 4 5");
}

// --- node-name and nilled ------------------------------------------------------------------------

TEST(NodeName, IsTheQNameOfAnElementOrAnAttribute) {
  const Value tree = document("<p:a xmlns:p='urn:p' p:b='1' c='2'/>");
  EXPECT_EQ(answer("for $n in (*, */@*) let $q := node-name($n) return "
                   "(local-name-from-QName($q), namespace-uri-from-QName($q))",
                   tree),
            "string a, anyURI urn:p, string b, anyURI urn:p, string c, anyURI ");
}

TEST(NodeName, HasNoPrefix) {
  EXPECT_EQ(call(fn_node_name, {elementFrom("<p:a xmlns:p='urn:p'/>")}), "QName a");
}

TEST(NodeName, OfAnythingElseIsEmpty) {
  const Value tree = document("<a>t<?pi x?><!--c--></a>");
  EXPECT_EQ(answer("count((node-name(/), for $n in a/node() return node-name($n)))", tree),
            "integer 0");
  for (const Value& argument :
       {empty(), integer(1), string("a"), sequence({elementFrom("<a/>"), elementFrom("<b/>")})}) {
    EXPECT_EQ(call(fn_node_name, {argument}), "()");
  }
}

TEST(NodeName, WithoutArgumentsIsEmptyWhateverTheContextItem) {
  EXPECT_EQ(call(fn_node_name, {}, elementFrom("<a/>")), "()");
  EXPECT_EQ(call(fn_node_name, {}), "()");
}

TEST(NodeName, TakesUpToOneArgument) {
  EXPECT_EQ(refusedCounts(fn_node_name, elementFrom("<a/>")), "2 3 4 5");
}

TEST(Nilled, OfAnElementIsFalse) {
  EXPECT_EQ(call(fn_nilled, {elementFrom("<a/>")}), "false");
  EXPECT_EQ(call(fn_nilled, {elementFrom("<a xmlns:xsi='http://www.w3.org/2001/XMLSchema-instance' "
                                         "xsi:nil='true'/>")}),
            "false");
}

TEST(Nilled, OfAnythingElseIsEmpty) {
  for (const Value& argument :
       {empty(), integer(1), document("<a/>"), sequence({elementFrom("<a/>"), integer(1)})}) {
    EXPECT_EQ(call(fn_nilled, {argument}), "()");
  }
  EXPECT_EQ(answer("count((nilled(a/@b), nilled(a/text())))", document("<a b='1'>t</a>")),
            "integer 0");
}

TEST(Nilled, TakesOneArgument) {
  EXPECT_EQ(refusedCounts(fn_nilled, elementFrom("<a/>"), 5, elementFrom("<a/>")), "0 2 3 4 5");
}

// --- lang ----------------------------------------------------------------------------------------

struct LanguageRow {
  const char* requested;
  const char* written;
  bool isFound;
};

TEST(Lang, ComparesPrimaryLanguagesIgnoringCase) {
  constexpr LanguageRow rows[] = {
      {"en", "en", true},       {"en", "en-GB", true},
      {"en-US", "en-GB", true}, {"en-US", "en", true},
      {"EN", "en", true},       {"en", "EN-gb", true},
      {"en", "de", false},      {"e", "en", false},
      {"en", "eng", false},     {"", "", true},
      {"", "en", false},        {"", "-x", true},
      {"en", "", false},        {"en ", "en", false},
      {"i-x", "i-y", true},     {"\xC3\x89", "\xC3\xA9-fr", true},
  };
  for (const LanguageRow& row : rows) {
    const Value node = elementFrom(std::string("<a xml:lang='") + row.written + "'/>");
    EXPECT_EQ(call(fn_lang, {string(row.requested), node}), row.isFound ? "true" : "false")
        << row.requested << " of " << row.written;
  }
}

TEST(Lang, IsThatOfTheNearestElementThatNamesOne) {
  const Value tree = document("<a xml:lang='en'><b xml:lang='de' c='1'>t<!--x--></b><d/></a>");
  EXPECT_EQ(answer("lang('de', a/b), lang('de', a/b/@c), lang('de', a/b/text()),"
                   "lang('en', a/b/text()), lang('en', a/d), lang('en', /)",
                   tree),
            "true, true, true, false, true, false");
}

TEST(Lang, OfANodeWithoutLanguageOrOfNoNodeIsFalse) {
  EXPECT_EQ(call(fn_lang, {string("en"), elementFrom("<a/>")}), "false");
  for (const Value& item : {empty(), string("en"), integer(1)}) {
    EXPECT_EQ(call(fn_lang, {string("en"), item}), "false");
    EXPECT_EQ(call(fn_lang, {integer(1), item}), "false");
  }
}

TEST(Lang, WithoutASecondArgumentIsOfTheContextItem) {
  EXPECT_EQ(call(fn_lang, {string("en")}, elementFrom("<a xml:lang='en'/>")), "true");
  EXPECT_EQ(call(fn_lang, {string("en")}, integer(1)), "false");
  EXPECT_EQ(call(fn_lang, {string("en")}), "false");
}

TEST(Lang, TheLanguageIsAString) {
  const Value node = elementFrom("<a xml:lang='en'/>");
  EXPECT_EQ(call(fn_lang, {untyped("en"), node}), "true");
  EXPECT_EQ(call(fn_lang, {empty(), node}), "false");
  EXPECT_EQ(call(fn_lang, {integer(1), node}), "error 6 not a string type - 1");
}

TEST(Lang, TakesOneOrTwoArguments) {
  EXPECT_EQ(refusedCounts(fn_lang, string("en")), "0 3 4 5");
}

// --- id and idref --------------------------------------------------------------------------------

TEST(Id, FindsNothingFromAnyNode) {
  const Value node = elementFrom("<a xml:id='x' id='y'><b idref='x'/></a>");
  for (const auto procedure : {fn_id, fn_idref}) {
    for (const auto* words : {"x", "", "  x \t y ", "z"}) {
      EXPECT_EQ(call(procedure, {string(words)}, node), "()") << words;
    }
    EXPECT_EQ(call(procedure, {empty()}, node), "()");
  }
}

TEST(Id, WithoutAContextNodeIsRefused) {
  for (const auto procedure : {fn_id, fn_idref}) {
    EXPECT_EQ(call(procedure, {string("x")}), "null");
    EXPECT_EQ(call(procedure, {string("x")}, integer(1)), "null");
    EXPECT_EQ(call(procedure, {integer(1)}), "null");
  }
}

TEST(Id, TakesOneString) {
  const Value node = elementFrom("<a/>");
  for (const auto procedure : {fn_id, fn_idref}) {
    EXPECT_EQ(call(procedure, {integer(1)}, node), "error 6 not a string type - 1");
    EXPECT_EQ(call(procedure, {sequence({string("x"), string("y")})}, node),
              "error 6 not a string type - (x, y)");
    EXPECT_EQ(refusedCounts(procedure, string("x"), 5, node), "0 2 3 4 5");
  }
}

// --- root ----------------------------------------------------------------------------------------

TEST(Root, IsTheTopmostAncestor) {
  const Value tree = document("<a x='1'><b/></a>");
  const auto context = XQueryContext::xqueryContext();
  for (const char* path : {"/", "a", "a/b", "a/@x"}) {
    const auto query = XQuery::xqueryWithSource("root(" + std::string(path) + ")");
    const auto items = context->evaluateXQuery(*query, {}, tree);
    ASSERT_TRUE(items) << path;
    EXPECT_EQ(items->objectAtIndex(0), tree.get()) << path;
  }
}

TEST(Root, OfAParentlessNodeIsTheNode) {
  const Value node = NSXMLElement::elementWithName(NSStringView::ascii("a"));
  const auto context = XQueryContext::xqueryContext();
  EXPECT_EQ(fn_root(&node, 1, *context), node);
}

TEST(Root, OfTheEmptySequenceIsEmptyAndOfWhatIsNoNodeRefused) {
  EXPECT_EQ(call(fn_root, {empty()}), "()");
  EXPECT_EQ(call(fn_root, {integer(1)}), "null");
}

TEST(Root, WithoutArgumentsIsOfTheContextItem) {
  const Value node = elementFrom("<a/>");
  EXPECT_EQ(call(fn_root, {}, node), "node ");
  EXPECT_EQ(call(fn_root, {}), "null");
}

TEST(Root, TakesUpToOneArgument) {
  const Value node = elementFrom("<a/>");
  EXPECT_EQ(refusedCounts(fn_root, node, 5, node), "2 3 4 5");
}

}  // namespace
}  // namespace xquery

#include "Functions/FunctionsNode.h"
#include "Functions/FunctionsTesting.h"
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
    EXPECT_EQ(fn_number(&argument, 1, *context), XQueryNumber::nan()) << show(argument);
    EXPECT_FALSE(context->_internal().error());
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

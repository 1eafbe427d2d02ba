// Where expressions stand in the text: for every kind of expression the piece of text that it is.
#include "Expr/XQueryParts.h"
#include "Parser/XQueryParser.h"
#include "Prolog/XQueryPrologItems.h"

#include <gtest/gtest.h>

#include <string>
#include <string_view>
#include <vector>

namespace xquery {
namespace {

using Pieces = std::vector<std::string>;

// The text of each expression, a whole before its parts. "?" is an expression that has no place of
// its own.
class PieceReader final : public XQueryPartVisitor {
 public:
  PieceReader(const XQueryPlaces& places, std::string_view text) : _places(places), _text(text) {}

  void read(XQueryExpr& expr) {
    const XQuerySpan span = _places.span(expr.exprPlace());
    pieces.push_back(
        expr.exprPlace() == 0 ? "?" : std::string(_text.substr(span.start, span.end - span.start)));
    expr.visitParts(*this);
  }
  void part(Ref<XQueryExpr>& part, XQueryRole) override {
    if (part) read(*part);
  }
  void ownPart(XQueryExpr* part, XQueryRole) override {
    if (part) read(*part);
  }

  Pieces pieces;

 private:
  const XQueryPlaces& _places;
  std::string_view _text;
};

Ref<XQueryParser> parsed(std::string_view text) {
  auto parser = XQueryParser::parserWithSource(NSString::stringWithUTF8(text));
  for (const auto& error : parser->errors()) ADD_FAILURE() << text << "\n" << error->msg()->utf8();
  return parser;
}

Pieces piecesOf(std::string_view text) {
  const auto parser = parsed(text);
  if (!parser->parsedModule()) return {};
  PieceReader reader(*parser->places(), text);
  reader.read(*parser->parsedModule()->body());
  return reader.pieces;
}

struct Case {
  std::string_view text;
  Pieces pieces;  // behind that of the whole, which is a list of one
};

const Case cases[] = {
    // literals, variables, the context item
    {"12", {"12"}},
    {" 1.5 ", {"1.5"}},
    {"1e3 (: a comment :)", {"1e3"}},
    {"'it''s'", {"'it''s'"}},
    {"\"a\nb\"", {"\"a\nb\""}},
    {"()", {"()"}},
    {"$x", {"$x"}},
    {"$ x", {"$ x"}},
    {".", {"?"}},
    {"validate { 1 }", {"validate { 1 }"}},
    // lists and parentheses
    {"1, 2", {"1", "2"}},
    {"( 1 , 2 )", {"1 , 2", "1", "2"}},
    // operators: from the left operand to the right one
    {"1 + 2", {"1 + 2", "1", "2"}},
    {"1+2 - 3", {"1+2 - 3", "1+2", "1", "2", "3"}},
    {"1 or 2 and 3 or 4", {"1 or 2 and 3 or 4", "1 or 2 and 3", "1", "2 and 3", "2", "3", "4"}},
    {"1 * 2 div 3", {"1 * 2 div 3", "1 * 2", "1", "2", "3"}},
    {"1 to 2", {"1 to 2", "1", "2"}},
    {"1 eq 2", {"1 eq 2", "1", "2"}},
    {"1 = 2", {"1 = 2", "1", "2"}},
    {"$a << $b", {"$a << $b", "$a", "$b"}},
    {"$a | $b union $c", {"$a | $b union $c", "$a | $b", "$a", "$b", "$c"}},
    {"$a intersect $b", {"$a intersect $b", "$a", "$b"}},
    {"- -1", {"- -1", "1"}},
    {"(1 + 2) * 3", {"(1 + 2) * 3", "1 + 2", "1 + 2", "1", "2", "3"}},
    // types
    {"1 instance of xs:integer?", {"1 instance of xs:integer?", "xs:integer", "1"}},
    {"1 treat as item()", {"1 treat as item()", "item()", "1"}},
    {"1 castable as xs:int", {"1 castable as xs:int", "xs:int", "1"}},
    {"1 cast as xs:int ?", {"1 cast as xs:int ?", "xs:int", "1"}},
    // paths
    {"/", {"/", "/"}},
    {"/a", {"/a", "/", "a"}},
    {"//a", {"//a", "//", "//", "a"}},
    {"a//@b", {"a//@b", "a", "//", "b"}},
    {"a/..", {"a/..", "a", ".."}},
    {"p:*/*:b/*", {"p:*/*:b/*", "p:*", "*:b", "*"}},
    {"child::text()[1]", {"child::text()[1]", "text()", "1", "1"}},
    {"$x[. = 1]/b", {"$x[. = 1]/b", "$x", ". = 1", ". = 1", "?", "1", "b"}},
    {"element(a)/attribute(b)",
     {"element(a)/attribute(b)", "element(a)", "a", "attribute(b)", "b"}},
    // calls
    {"f()", {"f()"}},
    {"f ( 1, 2 )", {"f ( 1, 2 )", "1, 2", "1", "2"}},
    {"f((1, 2))", {"f((1, 2))", "(1, 2)", "1, 2", "1", "2"}},
    // clauses
    {"for $x at $i in 1 let $y := 2 where 3 order by 4 descending return 5",
     {"for $x at $i in 1 let $y := 2 where 3 order by 4 descending return 5", "x at $i in 1", "1",
      "y := 2", "2", "3", "4 descending", "4", "5"}},
    {"for $x in 1, $y as xs:int in 2 return 3",
     {"for $x in 1, $y as xs:int in 2 return 3", "x in 1", "1", "y as xs:int in 2", "xs:int", "2",
      "3"}},
    {"some $x in 1, $y in 2 satisfies 3",
     {"some $x in 1, $y in 2 satisfies 3", "x in 1", "1", "y in 2", "2", "3"}},
    {"every $x in 1 satisfies 2", {"every $x in 1 satisfies 2", "x in 1", "1", "2"}},
    {"if (1) then 2 else 3", {"if (1) then 2 else 3", "1", "1", "2", "3"}},
    {"typeswitch (1) case $a as xs:int return 2 case item() return 3 default return 4",
     {"typeswitch (1) case $a as xs:int return 2 case item() return 3 default return 4", "1", "1",
      "case $a as xs:int return 2", "xs:int", "2", "case item() return 3", "item()", "3",
      "default return 4", "4"}},
    {"typeswitch (1) case item() return 2 default $d return 3",
     {"typeswitch (1) case item() return 2 default $d return 3", "1", "1", "case item() return 2",
      "item()", "2", "default $d return 3", "3"}},
    {"ordered { 1 }", {"ordered { 1 }", "1", "1"}},
    {"unordered { 1 }", {"unordered { 1 }", "1", "1"}},
    // constructors; what no name and no braces surround has no place of its own
    {"<a/>", {"<a/>"}},
    {"<a b='1{2}'>c{3}<d/></a>",
     {"<a b='1{2}'>c{3}<d/></a>", "b='1{2}'", "?", "2", "2", "?", "3", "3", "<d/>"}},
    {"<a xmlns:p='u'/>", {"<a xmlns:p='u'/>", "xmlns:p='u'", "?"}},
    {"<!-- a -->", {"<!-- a -->"}},
    {"<?a b?>", {"<?a b?>", "<?a b?>", "?"}},
    {"<a><![CDATA[b]]></a>", {"<a><![CDATA[b]]></a>", "<![CDATA[b]]>"}},
    {"document { 1 }", {"document { 1 }", "1", "1"}},
    {"element a { 1 }", {"element a { 1 }", "1", "1"}},
    {"element { 'a' } { 1 }", {"element { 'a' } { 1 }", "'a'", "'a'", "1", "1"}},
    {"attribute a { 1 }", {"attribute a { 1 }", "attribute a {", "1", "1"}},
    {"attribute { 'a' } {}", {"attribute { 'a' } {}", "'a'", "'a'"}},
    {"processing-instruction a { 1 }",
     {"processing-instruction a { 1 }", "processing-instruction a {", "1", "1"}},
    {"comment { 1 }", {"comment { 1 }", "1", "1"}},
    {"text { 1 }", {"text { 1 }", "1", "1"}},
};

TEST(Spans, AreTheTextOfTheExpression) {
  for (const Case& each : cases) {
    const Pieces pieces = piecesOf(each.text);
    ASSERT_FALSE(pieces.empty()) << each.text;
    EXPECT_EQ(Pieces(pieces.begin() + 1, pieces.end()), each.pieces) << each.text;
  }
}

// "line:column+length" of each expression, a whole before its parts.
std::string placesOf(std::string_view text) {
  struct PlaceReader final : XQueryPartVisitor {
    explicit PlaceReader(const XQueryPlaces& table) : places(table) {}
    void read(XQueryExpr& expr) {
      if (const auto place = places.place(expr.exprPlace())) {
        shown += (shown.empty() ? "" : " ") + std::to_string(place->line) + ":" +
                 std::to_string(place->column) + "+" + std::to_string(place->length);
      }
      expr.visitParts(*this);
    }
    void part(Ref<XQueryExpr>& part, XQueryRole) override {
      if (part) read(*part);
    }
    void ownPart(XQueryExpr* part, XQueryRole) override {
      if (part) read(*part);
    }

    const XQueryPlaces& places;
    std::string shown;
  };
  const auto parser = parsed(text);
  PlaceReader reader(*parser->places());
  reader.read(*parser->parsedModule()->body());
  return reader.shown;
}

TEST(Spans, CountCharactersAndLinesFromOne) {
  EXPECT_EQ(placesOf("1"), "1:1+1 1:1+1");
  EXPECT_EQ(placesOf("\n\n  12"), "3:3+2 3:3+2");
  EXPECT_EQ(placesOf("'é😀', 2"), "1:1+7 1:1+4 1:7+1");
  EXPECT_EQ(placesOf("\t\t1"), "1:3+1 1:3+1");
}

TEST(Spans, AreTheSameWhateverEndsALine) {
  EXPECT_EQ(placesOf("1,\n22,\n3"), "1:1+8 1:1+1 2:1+2 3:1+1");
  EXPECT_EQ(placesOf("1,\r\n22,\r3"), "1:1+8 1:1+1 2:1+2 3:1+1");
  EXPECT_EQ(placesOf("\xEF\xBB\xBF 12"), "1:2+2 1:2+2");
}

TEST(Spans, OfSeveralLinesCountAllCharacters) {
  EXPECT_EQ(placesOf("f(1,\n 2)"), "1:1+8 1:1+8 1:3+5 1:3+1 2:2+1");
}

TEST(Spans, OfDeclarationsEndBeforeTheSemicolon) {
  const std::string text =
      "declare variable $x := 1 ;\ndeclare function local:f($a as item()) {\n"
      "  $a\n};\n2";
  const auto parser = parsed(text);
  Pieces pieces;
  for (const auto& item : parser->parsedModule()->prologItems()) {
    const XQuerySpan span = parser->places()->span(item->place());
    pieces.push_back(text.substr(span.start, span.end - span.start));
  }
  EXPECT_EQ(pieces, (Pieces{"declare variable $x := 1",
                            "declare function local:f($a as item()) {\n  $a\n}"}));
}

// Chains are extended once for each operator and not once for each pair of them.
TEST(Spans, OfALongChainAreFoundInOneGo) {
  std::string text = "1";
  for (int i = 0; i < 20'000; ++i) text += "+1";
  const Pieces pieces = piecesOf(text);
  ASSERT_GT(pieces.size(), 3u);
  EXPECT_EQ(pieces[1], text);
  EXPECT_EQ(pieces[2], text.substr(0, text.size() - 2));
}

}  // namespace
}  // namespace xquery

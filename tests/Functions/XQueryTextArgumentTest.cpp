#include "Functions/StringTesting.h"
#include "Functions/XQueryTextArgument.h"

namespace xquery {
namespace {

using namespace functiontest;

// The text of the argument, or the error, read in place.
std::string readInPlace(const Value& argument) {
  return outcome([&](XQueryContext& context) {
    return Value(NSString::stringWithView(XQueryTextArgument(argument, context).view()));
  });
}

std::string promoted(const Value& argument) {
  return outcome([&](XQueryContext& context) {
    const Value text = XQueryPromoteToString(argument, context);
    return Value(NSString::stringWithView(cast<NSString>(text)->view()));
  });
}

TEST(TextArgument, IsTheTextOfThePromotedArgument) {
  const Value tree = document("<a p='attribute'>one<b>two</b><!--c--><?pi t?></a>");
  const auto* root = cast<NSXMLDocument>(tree)->rootElement();
  for (const Value& argument :
       {string("typed"), untyped("untyped"), typed(XQueryTypeNCName, "name"),
        typed(XQueryTypeAnyURI, "urn:x"), empty(), tree, Value(const_cast<NSXMLElement*>(root)),
        Value(root->attributeForName(NSStringView::ascii("p"))), elementFrom("<a/>"),
        elementFrom("<a><!--c--></a>"), elementFrom("<a>x<b>y</b>\xC3\xA9</a>"),
        sequence({string("alone")}), sequence({}), integer(1), boolean(false), months(3),
        sequence({string("a"), string("b")})}) {
    EXPECT_EQ(readInPlace(argument), promoted(argument)) << show(argument);
  }
  for (const NSXMLNode* node = root->firstChild(); node; node = node->nextSibling()) {
    const Value argument(const_cast<NSXMLNode*>(node));
    EXPECT_EQ(readInPlace(argument), promoted(argument));
  }
}

TEST(TextArgument, WithoutArgumentsTheContextItemIsTheArgument) {
  const auto context = XQueryContext::xqueryContext();
  const Value given = string("given");
  EXPECT_FALSE(XQueryArgumentOrContextItem(nullptr, 0, *context));
  const Value item = string("item");
  _internal(*context).setContextItem(item, 1);
  EXPECT_EQ(XQueryArgumentOrContextItem(nullptr, 0, *context), item);
  EXPECT_EQ(XQueryArgumentOrContextItem(&given, 1, *context), given);
  EXPECT_FALSE(XQueryArgumentOrContextItem(&given, 2, *context));
}

}  // namespace
}  // namespace xquery

// How warnings are made, placed and put in order.
#include "Check/Checking.h"
#include "CheckTesting.h"

#include <string>

namespace xquery {
namespace {

using namespace checktest;

TEST(Checking, QuotesTextsOfTheQueryOnOneLineAndShortly) {
  const std::string text = textOf("xs:integer('12 " + std::string(500, 'x') + "\n')");
  EXPECT_LT(text.size(), 300U);
  EXPECT_EQ(text.find('\n'), std::string::npos);
  const std::string name(400, 'v');
  EXPECT_LT(textOf("let $" + name + " := 1 return 2").size(), 300U);
}

TEST(Checking, CutsNoCharacterInTwo) {
  std::string name;
  for (int i = 0; i < 200; ++i) name += "\xC3\xA4";
  const auto warnings = XQueryWarnings(*explained("let $x" + name + " := 1 return 2"));
  ASSERT_EQ(warnings.size(), 1U);
  EXPECT_EQ(warnings.front().text->utf8().find("\xEF\xBF\xBD"), std::string::npos);
  EXPECT_EQ(warnings.front().name->utf8(), "x" + name);
}

TEST(Checking, GivesTheNearestLineToWhatHasNone) {
  // "." is one expression for all queries.
  EXPECT_EQ(warningsOf("declare function local:f() {\n1 +\n. };\nlocal:f()"), "2 reads-context");
}

TEST(Checking, NamesKinds) {
  EXPECT_EQ(XQueryNameOfKinds(XQueryItems::Integer), "a number");
  EXPECT_EQ(XQueryNameOfKinds(XQueryItems::Element | XQueryItems::Text), "a node");
  EXPECT_EQ(XQueryNameOfKinds(XQueryItems::Integer | XQueryItems::URI), "such a value");
}

}  // namespace
}  // namespace xquery

#include "Parser/XQueryParser.h"

#include <gtest/gtest.h>

#include <string>

namespace xquery {
namespace {

std::string firstError(const std::string& query) {
  const Ref<XQueryParser> parser = XQueryParser::parserWithSource(NSString::stringWithUTF8(query));
  return parser->errors().empty() ? "none"
                                  : parser->errors().front()->localizedDescription()->utf8();
}

TEST(NumberLiterals, OfTooManyDigitsAreAnErrorAtTheirLine) {
  const std::string digits(1000000, '7');
  const char* error = "XQueryError:0 - \"limit: number of too many digits\" at line:2";
  EXPECT_EQ(firstError("1,\n" + digits), error);
  EXPECT_EQ(firstError("1,\n0." + digits), error);
  EXPECT_EQ(firstError("1,\n" + digits + "e0"), "none");
  EXPECT_EQ(firstError(std::string(200000, '7')), "none");
}

}  // namespace
}  // namespace xquery

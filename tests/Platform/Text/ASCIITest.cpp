#include "Platform/Text/ASCII.h"

#include <gtest/gtest.h>

namespace xquery {
namespace {

TEST(ASCII, LowerCaseIsOfTheTwentySixLettersOnly) {
  EXPECT_EQ(lowerCase("Text/HTML; @[`{ AZaz09"), "text/html; @[`{ azaz09");
  EXPECT_EQ(lowerCase("\xC3\x84\xC9"), "\xC3\x84\xC9");
}

}  // namespace
}  // namespace xquery

#include "xquery/xquery.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <set>
#include <string>

namespace xquery {
namespace {

const char* const FN = "http://www.w3.org/2004/10/xpath-functions";

TEST(LibraryFunctions, HaveNamesAndNumbersOfArguments) {
  const auto functions = XQueryLibraryFunctions();
  const auto named = [&](const char* name) {
    return *std::find_if(functions.begin(), functions.end(), [&](const XQueryFunctionName& each) {
      return each.namespaceURI == FN && each.localName == name;
    });
  };
  EXPECT_EQ(named("substring").leastArguments, 2u);
  EXPECT_EQ(named("substring").mostArguments, 3u);
  EXPECT_EQ(named("concat").leastArguments, 2u);
  EXPECT_EQ(named("concat").mostArguments, std::nullopt);
}

// None is named that a query cannot call, and none twice.
TEST(LibraryFunctions, CanBeCalled) {
  std::set<std::pair<std::string, std::string>> names;
  for (const XQueryFunctionName& each : XQueryLibraryFunctions()) {
    EXPECT_TRUE(names.insert({each.namespaceURI, each.localName}).second) << each.localName;
    std::string call = "declare namespace p = '" + each.namespaceURI +
                       "'; if (1 = 1) then 'there'" + " else p:" + each.localName + "(";
    for (unsigned n = 0; n < each.leastArguments; ++n) call += n > 0 ? ", ()" : "()";
    const auto query = XQuery::xqueryWithSource(call + ")");
    EXPECT_FALSE(query->parseErrors()) << call;
  }
  EXPECT_GT(names.size(), 150u);
}

}  // namespace
}  // namespace xquery

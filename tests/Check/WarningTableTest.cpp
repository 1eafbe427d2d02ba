#include "Check/WarningTable.h"
#include "CheckTesting.h"

#include <algorithm>
#include <cctype>
#include <set>
#include <string>

namespace xquery {
namespace {

TEST(WarningTable, IdentifiersAreDifferentAndInLowerCase) {
  std::set<std::string_view> seen;
  for (const XQueryWarningRow& row : XQueryWarningRows()) {
    EXPECT_TRUE(seen.insert(row.identifier).second) << row.identifier;
    EXPECT_FALSE(row.identifier.empty());
    for (const char c : row.identifier) {
      EXPECT_TRUE(c == '-' || std::islower(static_cast<unsigned char>(c))) << row.identifier;
    }
  }
}

TEST(WarningTable, EachRowSaysWhatItIsAbout) {
  for (const XQueryWarningRow& row : XQueryWarningRows()) {
    EXPECT_FALSE(row.text.empty()) << row.identifier;
    EXPECT_FALSE(row.about.empty()) << row.identifier;
    EXPECT_EQ(row.text.find('\n'), std::string_view::npos) << row.identifier;
    EXPECT_EQ(&XQueryWarningRowOf(row.id), &row);
  }
}

}  // namespace
}  // namespace xquery

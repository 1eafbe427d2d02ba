// Every source type against every target type, as the casting table says.
#include "Types/CastingTable.h"
#include "Types/TypesTestSupport.h"
#include "Types/XQueryCasting.h"

#include <map>
#include <string>
#include <vector>

namespace xquery {
namespace {

using namespace castingtable;
using testing::printed;
using testing::raised;
using testing::text;
using testing::xsString;

class CastingCrossProduct : public ::testing::Test {
 protected:
  Ref<XQueryContext> context = XQueryContext::xqueryContext();

  Value source(const Row& row) {
    if (row.type == 8) return text(row.from);
    return XQueryCastAs(xsString(row.from), row.type, *context);
  }
  // "type text", or how it failed.
  std::string outcome(const Value& value, XQueryTypeID target) {
    std::string result;
    const std::string error = raised(*context, [&] {
      const Value cast = XQueryCastAs(value, target, *context);
      const XQueryTypeID type = XQueryObjectTypeID(cast.get());
      result = type == XQueryTypeError ? "record" : std::to_string(type) + " " + printed(cast);
    });
    if (error == "6 value does not match a required type") return "fails";
    return error == "no error" ? result : error;
  }
};

TEST_F(CastingCrossProduct, EveryPairEndsAsTheTableSays) {
  constexpr Targets stringFamily = tokens | names | nmtoken | types(9);
  for (const Row& row : table()) {
    const Value value = source(row);
    ASSERT_EQ(XQueryObjectTypeID(value.get()), row.type) << row.from;
    for (XQueryTypeID target = 0; target < 56; ++target) {
      const Targets bit = Targets{1} << target;
      // What a URI's text is no form of fails as the text does.
      std::string expected = row.type == 14 && !(bit & stringFamily) ? "record" : "fails";
      int matches = 0;
      for (const Outcome& entry : row.outcomes) {
        if (!(entry.targets & bit)) continue;
        ++matches;
        const bool isShared = (bit & floating) && isSharedDouble(entry.text);
        expected = std::to_string(isShared ? 11 : target) + " " + entry.text;
      }
      ASSERT_LE(matches, 1) << row.type << " " << row.from << " to " << target;
      EXPECT_EQ(outcome(value, target), expected)
          << row.type << " '" << row.from << "' to " << target;
    }
  }
}

TEST_F(CastingCrossProduct, EveryTypeThatAValueMayHaveIsASource) {
  std::map<int, int> rows;
  for (const Row& row : table()) ++rows[row.type];
  for (int type = 8; type <= 54; ++type) {
    const bool isList = type == 37 || type == 39 || type == 41;
    EXPECT_EQ(rows.contains(type), !isList) << type;
  }
}

}  // namespace
}  // namespace xquery

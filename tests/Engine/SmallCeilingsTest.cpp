// Ceilings that are reached by little: the answer is the value or the limit, and no other error.
#include "Engine/LimitsTestSupport.h"

namespace xquery {
namespace {

using limitstest::evaluate;

constexpr uint64_t KiB = 1024;

class SmallCeilings : public testing::TestWithParam<const char*> {};

TEST_P(SmallCeilings, GiveTheValueOrTheLimit) {
  const auto free = XQueryContext::xqueryContext();
  const limitstest::Outcome expected = evaluate(*free, GetParam());
  ASSERT_EQ(expected.error, "");
  unsigned ended = 0;
  for (uint64_t ceiling = 0; ceiling < 64 * KiB; ceiling += KiB) {
    const auto context = XQueryContext::xqueryContext();
    XQueryLimits limits;
    limits.memoryCeiling = ceiling;
    context->contextSetLimits(limits);
    const limitstest::Outcome found = evaluate(*context, GetParam());
    if (found.error.empty()) {
      EXPECT_EQ(found.result, expected.result) << ceiling;
    } else {
      EXPECT_EQ(found.error, "limit: memory ceiling reached") << ceiling;
      ++ended;
    }
  }
  EXPECT_GT(ended, 0U);
}

INSTANTIATE_TEST_SUITE_P(Limits, SmallCeilings,
                         testing::Values("count(ext:node-from-string('<p>a<br><b>c</b>', 'h')//*)",
                                         "count(ext:node-from-string('<a><b/>c</a>')//node())",
                                         "string-length(string-join(for $i in 1 to 99 return "
                                         "string($i), ', '))",
                                         "count(<a>{for $i in 1 to 99 return <b/>}</a>//b)"));

}  // namespace
}  // namespace xquery

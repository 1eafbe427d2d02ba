// What an evaluation that is ended had made does not hold up its end: freeing it takes a fraction
// of the time that making it took, not a third or more, and is not the evaluating thread's work.
#include "Engine/LimitsTestSupport.h"
#include "Platform/Base/ProcessorTime.h"

#include <gtest/gtest.h>

#include <memory>
#include <string>

namespace xquery {
namespace {

// Raises the flag when the query has traced something, and tells when that was.
class Canceller : public XQueryClient {
 public:
  explicit Canceller(std::shared_ptr<std::atomic<bool>> flag) : _flag(std::move(flag)) {}
  void XQueryClientTraceValue(const Value&, const Ref<NSString>&, XQueryContext&) override {
    then = processorSeconds();
    _flag->store(true);
  }
  double then = 0;

 private:
  std::shared_ptr<std::atomic<bool>> _flag;
};

struct Times {
  double making;
  double ending;
};

Times timesOf(const std::string& query) {
  const auto context = XQueryContext::xqueryContext();
  XQueryLimits limits;
  limits.cancelled = std::make_shared<std::atomic<bool>>(false);
  const auto client = std::make_shared<Canceller>(limits.cancelled);
  context->contextSetLimits(limits);
  context->contextSetClient(client);
  const double start = processorSeconds();
  EXPECT_EQ(limitstest::evaluate(*context, query).error, "limit: evaluation cancelled");
  return {client->then - start, processorSeconds() - client->then};
}

constexpr const char* afterwards =
    " let $t := trace((), 't') for $i in 1 to 100000000 where $i < 0 return $s";

constexpr const char* made[] = {
    "let $s := (1 to 300000, 1)",
    "let $s := for $i in 1 to 60000 return concat('text', $i)",
    ("let $s := string-to-codepoints(string-join(for $i in 1 to 4000 return "
     "'0123456789012345678901234567890123456789012345678901234567890123', ''))"),
    "let $s := for $i in 1 to 30000 return <a/>",
    "let $s := <a>{for $i in 1 to 30000 return element {concat('e', $i)} {()}}</a>",
};

class Freeing : public testing::TestWithParam<const char*> {};

TEST_P(Freeing, DoesNotHoldUpTheEnd) {
  const int64_t before = limitstest::valueBytes();
  double least = 1;
  for (int attempt = 0; attempt < 5 && least > 0.1; ++attempt) {
    const Times times = timesOf(std::string(GetParam()) + afterwards);
    least = std::min(least, times.ending / times.making);
  }
  EXPECT_LE(least, 0.1);
  EXPECT_LE(limitstest::valueBytes(), before + limitstest::keptByAContext);
}

INSTANTIATE_TEST_SUITE_P(Limits, Freeing, testing::ValuesIn(made));

TEST(Limits, GlobalVariablesDoNotHoldUpTheEndEither) {
  const Times times = timesOf("declare variable $s := (1 to 300000, 1); let $n := count($s)" +
                              std::string(afterwards));
  EXPECT_LE(times.ending, times.making / 4);
}

}  // namespace
}  // namespace xquery

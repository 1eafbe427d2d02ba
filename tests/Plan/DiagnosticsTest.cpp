// With diagnostics on, the log shows each error that is met, those that a predicate passes over
// too: as often, and in the order, in which the query meets them as it is written.
#include "Plan/PlanTesting.h"

#include <cstdlib>
#include <string>

namespace xquery {
namespace {

using namespace plantest;

// Enough elements with values for an index.
const Value& shelf() {
  static const Value parsed = [] {
    std::string text = "<r>";
    for (int i = 0; i < 100; ++i) {
      text += "<e id='e" + std::to_string(i) + "'><k>" + (i % 9 ? std::to_string(i) : "x") +
              "</k><s/></e>";
    }
    return document(text + "</r>");
  }();
  return parsed;
}

class Diagnostics : public testing::Test {
 protected:
  void TearDown() override { ::unsetenv("XQUERY_LOG"); }

  static std::string logOf(const XQuery& query) {
    ::setenv("XQUERY_LOG", "1", 1);
    testing::internal::CaptureStderr();
    outcomeOf(query, shelf());
    ::unsetenv("XQUERY_LOG");
    return testing::internal::GetCapturedStderr();
  }
  // Evaluated without diagnostics before, so that there are indexes. Answers how long the log is.
  static size_t expectSameLog(std::string_view text) {
    const auto plain = compiled(text);
    const auto planned = compiled(text, XQueryWay::Planned);
    for (int i = 0; i < 3; ++i) outcomeOf(*planned, shelf());
    const std::string log = logOf(*plain);
    EXPECT_EQ(logOf(*planned), log) << text;
    return log.size();
  }
};

TEST_F(Diagnostics, ShowWhatPredicatesPassOver) {
  for (const char* text : {
           "count(//e[xs:integer(k) > 3])",
           "exists(//e[xs:integer(k) > 3])",
           "//e[xs:integer(k) > 95]",
           "(//e[xs:integer(k) > 3])[1]",
           "subsequence(//e[xs:integer(k) > 3], 1, 2)",
           "//r//e[xs:integer(k) > 95]/s",
           "let $l := //e[xs:integer(k) > 3] return count($l)",
           "let $l := //e[xs:integer(k) > 3] return (exists($l), empty($l))",
           "let $l := for $e in //e[xs:integer(k) > 3] return $e return count($l)",
           "(for $e in //e[xs:integer(k) > 3] return $e/@id)[1]",
           "(for $e in //e[xs:integer(k) > 3] order by $e/k return $e/@id)[position() < 3]",
           "exists(for $e in //e[xs:integer(k) > 3] return $e)",
           "for $e at $n in //e[xs:integer(k) > 3] where $n <= 2 return $n",
           "let $l := //e return $l[xs:integer(k) > 95]",
           "//e[error()][@id = 'e3']",
           "//e[xs:integer(k) > 1 and @id = 'e3']",
           "(for $e in //e return $e[xs:integer(k) > 3])[1]",
           "let $l := //e/ancestor-or-self::*//e[xs:integer(k) > 95] return count($l)",
           "for $i in 1 to 3 return //e[xs:integer(k) = $i]/@id",
           "for $i in 1 to 2 return /r/e[xs:integer('x') + $i]",
           "for $e in //e where //e[xs:integer(k) = 7] intersect $e return $e",
       }) {
    EXPECT_GT(expectSameLog(text), 0U) << text;
  }
}

TEST_F(Diagnostics, ShowAnErrorOfAValueThatIsLookedUpAsOftenAsItIsMet) {
  for (const char* text : {
           "//e[@id = exactly-one(//none)]",
           "/r/e[@id = xs:integer('x')]/k",
           "for $e in /r/e where $e/@id = exactly-one(//none) return $e",
           "for $e in /r/e where $e/@id = string(exactly-one(//none)) and $e/s return $e",
           "count(/r/e[@id = error()])",
       }) {
    // What is asked otherwise makes the index.
    expectSameLog("(/r/e[@id = 'e1'], /r/e[@id = 'e2'], //e[@id = 'e3'])");
    EXPECT_GT(expectSameLog(text), 0U) << text;
  }
}

}  // namespace
}  // namespace xquery

#include "Planning.h"

#include "DataSets.h"
#include "Engine.h"
#include "Median.h"
#include "ProcessorTime.h"
#include "Queries.h"
#include "TimedQuery.h"

#include <algorithm>
#include <cstdio>
#include <string>
#include <vector>

namespace bench {
namespace {

using namespace xquery;

constexpr int turns = 9;
constexpr int compilations = 9;
constexpr double limit = 5;      // seconds of an evaluation
constexpr double allowed = 1.1;  // times the query as it is written

Ref<XQuery> compile(const std::string& text, XQueryWay way) {
  return XQuery::xqueryWithSource(std::string_view(text), XQueryLoading(), XQueryLimits(), way);
}

double secondsToCompile(const std::string& text, XQueryWay way) {
  std::vector<double> times;
  for (int i = 0; i < compilations; i++) {
    const double start = processorSeconds();
    const Ref<XQuery> query = compile(text, way);
    times.push_back(processorSeconds() - start);
  }
  return median(times);
}

// How many queries of a kind there are, with the times to compile them.
struct Totals {
  size_t queries = 0, slower = 0, different = 0;
  std::vector<double> compilePlanned, compilePlain;
};

void measure(const PhrasedQuery& query, const Value& document, Totals& totals) {
  totals.queries++;
  totals.compilePlanned.push_back(secondsToCompile(query.text, XQueryWay::Planned));
  totals.compilePlain.push_back(secondsToCompile(query.text, XQueryWay::Plain));
  TimedQuery planned(compile(query.text, XQueryWay::Planned), document, limit);
  TimedQuery plain(compile(query.text, XQueryWay::Plain), document, limit);
  for (int i = 0; i < turns; i++) {
    planned.takeTurn();
    plain.takeTurn();
  }
  const bool isDifferent = planned.answer() != plain.answer() && !plain.isOver();
  const bool isSlower = planned.seconds() > allowed * plain.seconds();
  totals.different += isDifferent;
  totals.slower += isSlower;
  if (!isDifferent && !isSlower) return;
  const std::string name = query.data + "/" + query.idea + "." + query.phrasing;
  std::printf("%-56s %10.4f %10.4f %6.2f%s\n", name.c_str(), planned.seconds() * 1e3,
              plain.seconds() * 1e3, planned.seconds() / plain.seconds(),
              isDifferent ? "  different answers" : "");
  std::fflush(stdout);
}

}  // namespace

int reportPlanning(double factor, const std::string& ideas) {
  Totals totals;
  std::string data;
  Value document;
  std::printf("%-56s %10s %10s %6s\n", "", "planned ms", "plain ms", "");
  for (const PhrasedQuery& query : phrasedQueries(XQUERY_BENCH_QUERIES)) {
    if ((query.data + "/" + query.idea).find(ideas) == std::string::npos) continue;
    if (query.data != data) {
      data = query.data;
      document = parse(generatedData(data, factor));
    }
    measure(query, document, totals);
  }
  if (totals.queries == 0) return 0;
  std::printf(
      "%zu of %zu queries take more than %.1f times as long planned; compiling takes %.1f "
      "microseconds instead of %.1f\n",
      totals.slower, totals.queries, allowed, median(totals.compilePlanned) * 1e6,
      median(totals.compilePlain) * 1e6);
  return totals.slower == 0 && totals.different == 0 ? 0 : 1;
}

}  // namespace bench

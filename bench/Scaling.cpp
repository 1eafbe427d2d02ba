#include "Scaling.h"

#include "AuctionData.h"
#include "Engine.h"

#include <algorithm>
#include <chrono>
#include <cstdio>
#include <limits>
#include <vector>

namespace bench {
namespace {

using namespace xquery;

struct Measurement {
  double milliseconds = std::numeric_limits<double>::infinity();
  size_t items = 0;
};

// The best of several runs.
Measurement measure(const char* text, const Value& document) {
  const auto query = compile(text);
  const auto context = XQueryContext::xqueryContext();
  Measurement best;
  for (int run = 0; run < 7; run++) {
    const auto start = std::chrono::steady_clock::now();
    best.items = evaluate(*context, *query, document);
    const std::chrono::duration<double, std::milli> taken =
        std::chrono::steady_clock::now() - start;
    best.milliseconds = std::min(best.milliseconds, taken.count());
  }
  return best;
}

}  // namespace

int reportScaling() {
  constexpr double factors[] = {0.09, 0.9};
  constexpr const char* queries[] = {"//item", "//item/.."};
  std::vector<Measurement> measurements[std::size(factors)];
  size_t sizes[std::size(factors)];
  for (size_t i = 0; i < std::size(factors); i++) {
    const std::string xml = auctionData(factors[i]);
    sizes[i] = xml.size();
    const Value document = parse(xml);
    for (const char* query : queries) measurements[i].push_back(measure(query, document));
  }
  const double growth = static_cast<double>(sizes[1]) / static_cast<double>(sizes[0]);
  std::printf("document %.1f MB -> %.1f MB, grows %.1f times\n",
              static_cast<double>(sizes[0]) / 1e6, static_cast<double>(sizes[1]) / 1e6, growth);
  bool proportional = true;
  for (size_t q = 0; q < std::size(queries); q++) {
    const Measurement &small = measurements[0][q], &large = measurements[1][q];
    const double ratio = large.milliseconds / small.milliseconds;
    std::printf("%-10s %8.2f ms -> %8.2f ms, grows %.1f times (%zu and %zu items)\n", queries[q],
                small.milliseconds, large.milliseconds, ratio, small.items, large.items);
    proportional = proportional && ratio <= 2 * growth;
  }
  return proportional ? 0 : 1;
}

}  // namespace bench

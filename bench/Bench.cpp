// xquery_bench [--factor=F] [--scaling | --functions | --threads] [Google Benchmark options]
//
// Measures the tree build, single steps (some with the memory that each takes at the peak), a table
// of paths, each beside the peer's figure from the same run, and the queries of bench/queries over
// auction data. The factor may also come from
// XQUERY_BENCH_FACTOR; 0.1 (about 11 MB) is the default. Before a path is measured, both sides must
// agree on the number of nodes it selects.
#include "AuctionData.h"
#include "Engine.h"
#include "FunctionBench.h"
#include "PeakMemory.h"
#include "Peer.h"
#include "Scaling.h"
#include "Threads.h"

#include <benchmark/benchmark.h>

#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <malloc.h>
#include <map>
#include <memory>
#include <optional>
#include <string>
#include <unistd.h>
#include <vector>

namespace {

using namespace xquery;

struct Inputs {
  std::string xml;
  Ref<NSXMLDocument> document;
  std::unique_ptr<bench::PeerDocument> peer;
  double nodes = 0;  // document, elements, texts and the like; no attributes
};

Inputs inputs;

// One row per measured query; without an XPath twin the peer is left out.
struct Row {
  const char* family;
  const char* query;
  bool peer = true;
};

constexpr Row rows[] = {
    {"descendant", "//name"},
    {"descendant", "//item"},
    {"descendant", "//item/.."},
    {"descendant", "//keyword"},
    {"descendant", "//listitem//keyword"},
    {"child", "/site/people/person/name"},
    {"child", "/site/regions/*/item/description/text/keyword"},
    {"child", "/site/closed_auctions/closed_auction/annotation/description/parlist/listitem"},
    {"attribute", "//person[@id = \"person11\"]/name"},
    {"attribute", "/site/people/person[@id = \"person11\"]/name"},
    {"attribute", "//item[@featured]/name"},
    {"comparison", "//profile[@income > 50000]"},
    {"comparison", "//closed_auction[price > 300]/date"},
    {"comparison", "//item[location = \"Germany\"]/name"},
    {"comparison", "//open_auction[initial + 0 < current]"},
    {"arithmetic", "//bidder[increase * 2 + 1 > 20]"},
    {"arithmetic", "//open_auction[current - initial > 10]/seller"},
    {"arithmetic", "(1 to 1000000)[. * 2 + 1 > 1999000]", false},
    {"join", "for $a in 1 to 2000, $b in 1 to 2000 where $a eq $b return $a", false},
    {"join",
     "for $p in //person, $a in //closed_auction where $a/buyer/@person = $p/@id return $a/price",
     false},
    {"join",
     "for $p in (//person)[position() <= 100] return count(//closed_auction[buyer/@person = "
     "$p/@id])",
     false},
    {"join",
     "for $p in //person let $a := for $t in //closed_auction where $t/seller/@person = $p/@id "
     "return $t where count($a) > 1 return $p/name",
     false},
};

// Queries that do one thing many times, measured by the time that it takes once.
struct StepRow {
  const char* name;
  const char* query;
  double steps;
  bool memory = false;  // measured as well
};

constexpr StepRow stepRows[] = {
    {"arithmetic in FLWOR", "for $x in 1 to 1000000 return $x * 2 + 1", 2e6},
    {"call with two arguments",
     "declare function local:sum($a, $b) { $a + $b }; for $x in 1 to 1000000 return local:sum($x, "
     "1)",
     1e6},
    {"quantified binding", "every $x in 1 to 1000000 satisfies $x > 0", 1e6},
    {"sorted integer", "for $x in 1 to 1000000 order by ($x * 7919) mod 1000003 return $x", 1e6},
    {"sorted string", "for $x in 1 to 1000000 order by string(($x * 7919) mod 1000003) return $x",
     1e6},
    {"constructed element", "for $x in 1 to 1000000 return <e>{$x}</e>", 1e6, true},
    {"constructed element with attributes",
     "for $x in 1 to 1000000 return <e n='{$x}' m='1'><f/></e>", 1e6, true},
    {"constructed element with a base URI",
     "declare base-uri 'http://h/'; count(for $x in 1 to 1000000 return <e n='1'/>)", 1e6, true},
    {"counted item", "count(for $x in 1 to 10000000 return $x)", 1e7, true},
    {"item", "for $x in 1 to 10000000 return $x", 1e7, true},
};

double residentBytes() {
  malloc_trim(0);
  long total = 0, resident = 0;
  if (FILE* file = std::fopen("/proc/self/statm", "r")) {
    if (std::fscanf(file, "%ld %ld", &total, &resident) != 2) resident = 0;
    std::fclose(file);
  }
  return static_cast<double>(resident) * static_cast<double>(sysconf(_SC_PAGESIZE));
}

// Builds both trees, noting what each takes in memory.
void prepare(double factor) {
  inputs.xml = bench::auctionData(factor);
  const auto size = static_cast<double>(inputs.xml.size());
  const double before = residentBytes();
  inputs.document = bench::parse(inputs.xml);
  const double between = residentBytes();
  inputs.peer = std::make_unique<bench::PeerDocument>(inputs.xml);
  const double after = residentBytes();
  for (const NSXMLNode* node = inputs.document.get(); node; node = node->nextNode()) inputs.nodes++;
  std::printf("document: %.1f MB, %.0f nodes\n", size / 1e6, inputs.nodes);
  std::printf("memory: %.2f bytes per byte of document; peer %.2f\n", (between - before) / size,
              (after - between) / size);
}

void setBytes(benchmark::State& state) {
  state.SetBytesProcessed(state.iterations() * static_cast<int64_t>(inputs.xml.size()));
}

void buildTree(benchmark::State& state) {
  for (auto _ : state) benchmark::DoNotOptimize(bench::parse(inputs.xml).get());
  setBytes(state);
}

void buildPeerTree(benchmark::State& state) {
  for (auto _ : state) bench::PeerDocument document(inputs.xml);
  setBytes(state);
}

void walkTree(benchmark::State& state) {
  for (auto _ : state) {
    size_t count = 0;
    for (const NSXMLNode* node = inputs.document.get(); node; node = node->nextNode()) count++;
    benchmark::DoNotOptimize(count);
  }
  state.SetItemsProcessed(state.iterations() * static_cast<int64_t>(inputs.nodes));
}

void compileQuery(benchmark::State& state, const std::string& text) {
  for (auto _ : state) benchmark::DoNotOptimize(bench::compile(text).get());
}

void setCounters(benchmark::State& state, const Row& row, size_t selected) {
  state.counters["selected"] = static_cast<double>(selected);
  if (std::strncmp(row.query, "//", 2) == 0) {
    state.counters["nodes/s"] =
        benchmark::Counter(inputs.nodes, benchmark::Counter::kIsIterationInvariantRate);
  }
}

void runEngine(benchmark::State& state, const Row& row) {
  const auto query = bench::compile(row.query);
  const auto context = XQueryContext::xqueryContext();
  size_t selected = bench::evaluate(*context, *query, inputs.document);
  if (row.peer && bench::PeerQuery(row.query).evaluate(*inputs.peer) != selected) {
    state.SkipWithError("the peer selects another number of nodes");
    return;
  }
  for (auto _ : state) selected = bench::evaluate(*context, *query, inputs.document);
  setCounters(state, row, selected);
}

void runPeer(benchmark::State& state, const Row& row) {
  const bench::PeerQuery query(row.query);
  size_t selected = 0;
  for (auto _ : state) selected = query.evaluate(*inputs.peer);
  setCounters(state, row, selected);
}

void runSteps(benchmark::State& state, const StepRow& row) {
  const auto query = bench::compile(row.query);
  const auto context = XQueryContext::xqueryContext();
  for (auto _ : state) bench::evaluate(*context, *query, {});
  using Counter = benchmark::Counter;
  state.counters["s/step"] =
      Counter(row.steps, Counter::kIsIterationInvariantRate | Counter::kInvert);
  if (row.memory) state.counters["peak bytes/step"] = bench::peakBytesOf(row.query) / row.steps;
}

// One of the queries in bench/queries, by the name of its file.
void runAuctionQuery(benchmark::State& state, const std::string& text) {
  const auto query = bench::compile(text);
  const auto context = XQueryContext::xqueryContext();
  size_t selected = 0;
  for (auto _ : state) selected = bench::evaluate(*context, *query, inputs.document);
  state.counters["items"] = static_cast<double>(selected);
}

std::map<std::string, std::string> auctionQueries() {
  std::map<std::string, std::string> queries;
  for (const auto& entry : std::filesystem::directory_iterator(XQUERY_BENCH_QUERIES)) {
    std::ifstream file(entry.path(), std::ios::binary);
    queries[entry.path().stem().string()].assign(std::istreambuf_iterator<char>(file), {});
  }
  return queries;
}

void registerAll() {
  const auto add = [](const std::string& name, auto&&... arguments) {
    benchmark::RegisterBenchmark(name.c_str(), arguments...)->Unit(benchmark::kMillisecond);
  };
  add("tree/build", buildTree);
  add("tree/build peer", buildPeerTree);
  add("tree/walk", walkTree);
  add("compile/one line", compileQuery, "//book[price > 10]/title");
  add("compile/one line of FLWOR", compileQuery,
      "for $b at $i in //book where $b/price > 10 order by $b/title return <t n='{$i}'/>");
  for (const StepRow& row : stepRows) add(std::string("step/") + row.name, runSteps, row);
  for (const Row& row : rows) {
    const std::string name = std::string(row.family) + " " + row.query;
    add(name, runEngine, row);
    if (row.peer) add(name + " peer", runPeer, row);
  }
  for (const auto& [name, text] : auctionQueries()) add("query " + name, runAuctionQuery, text);
}

// Takes our own options out of the arguments. Empty when one is wrong.
std::optional<double> takeFactor(int& argc, char** argv, bool& scaling) {
  const char* text = std::getenv("XQUERY_BENCH_FACTOR");
  int kept = 1;
  for (int i = 1; i < argc; i++) {
    if (std::strncmp(argv[i], "--factor=", 9) == 0) {
      text = argv[i] + 9;
    } else if (std::strcmp(argv[i], "--scaling") == 0) {
      scaling = true;
    } else {
      argv[kept++] = argv[i];
    }
  }
  argc = kept;
  if (!text || !*text) return 0.1;
  char* end = nullptr;
  const double factor = std::strtod(text, &end);
  if (*end || !(factor > 0 && factor <= 15)) return std::nullopt;
  return factor;
}

}  // namespace

int main(int argc, char** argv) {
  if (argc == 3 && std::strcmp(argv[1], "--peak") == 0) return bench::reportPeak(argv[2]);
  if (argc == 2 && std::strcmp(argv[1], "--functions") == 0) return bench::reportFunctions();
  if (argc == 2 && std::strcmp(argv[1], "--threads") == 0) return bench::reportThreads();
  bool scaling = false;
  const std::optional<double> factor = takeFactor(argc, argv, scaling);
  if (!factor) {
    std::fprintf(stderr, "the factor must be above 0 and at most 15\n");
    return 2;
  }
  if (scaling) return bench::reportScaling();
  benchmark::Initialize(&argc, argv);
  if (benchmark::ReportUnrecognizedArguments(argc, argv)) return 2;
  prepare(*factor);
  registerAll();
  benchmark::RunSpecifiedBenchmarks();
  benchmark::Shutdown();
  return 0;
}

// xquery_bench [--factor=F] [--scaling | --functions | --threads[=TEXT] | --reading]
//              [Google Benchmark options]
// xquery_bench [--factor=F] --phrasings [--limit=SECONDS] [--ideas=TEXT]
// xquery_bench [--factor=F] --planning [--ideas=TEXT]     (best with a factor of 0.001)
//
// Measures the tree build, single steps (some with the memory that each takes at the peak), a table
// of paths, each beside the peer's figure from the same run, and the twenty numbered queries of
// bench/queries over auction data. The factor may also come from XQUERY_BENCH_FACTOR; 0.1 (about
// 11 MB) is the default. Before a path is measured, both sides must agree on the number of nodes it
// selects. The other reports have headers of their own.
#include "AuctionData.h"
#include "Engine.h"
#include "FunctionBench.h"
#include "PeakMemory.h"
#include "Peer.h"
#include "Phrasings.h"
#include "Planning.h"
#include "Queries.h"
#include "Reading.h"
#include "Scaling.h"
#include "Threads.h"

#include <benchmark/benchmark.h>

#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <memory>
#include <optional>
#include <string>
#include <string_view>
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

// Builds both trees, noting what each takes in memory.
void prepare(double factor) {
  inputs.xml = bench::auctionData(factor);
  const auto size = static_cast<double>(inputs.xml.size());
  const double before = bench::residentBytes();
  inputs.document = bench::parse(inputs.xml);
  const double between = bench::residentBytes();
  inputs.peer = std::make_unique<bench::PeerDocument>(inputs.xml);
  const double after = bench::residentBytes();
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

void runAuctionQuery(benchmark::State& state, const std::string& text) {
  const auto query = bench::compile(text);
  const auto context = XQueryContext::xqueryContext();
  size_t selected = 0;
  for (auto _ : state) selected = bench::evaluate(*context, *query, inputs.document);
  state.counters["items"] = static_cast<double>(selected);
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
  for (const bench::PhrasedQuery& query : bench::phrasedQueries(XQUERY_BENCH_QUERIES)) {
    if (!query.isOfTheTwenty()) continue;
    if (query.phrasing != "plain" && query.phrasing != "published") continue;
    add("query " + query.idea + " " + query.phrasing, runAuctionQuery, query.text);
  }
}

struct Options {
  bench::PhrasingOptions measured;  // the factor is everybody's
  bool scaling = false, phrasings = false, planning = false, reading = false;
};

// Leaves `value` as it is when the text is no number within the bounds.
bool readNumber(const char* text, double greatest, double& value) {
  char* end = nullptr;
  const double number = std::strtod(text, &end);
  if (end == text || *end || !(number > 0 && number <= greatest)) return false;
  value = number;
  return true;
}

// Takes our own options out of the arguments. Empty when one is wrong.
std::optional<Options> takeOptions(int& argc, char** argv) {
  Options options;
  const char* factor = std::getenv("XQUERY_BENCH_FACTOR");
  int kept = 1;
  for (int i = 1; i < argc; i++) {
    const std::string_view argument = argv[i];
    if (argument.starts_with("--factor=")) {
      factor = argv[i] + 9;
    } else if (argument.starts_with("--limit=")) {
      if (!readNumber(argv[i] + 8, 1e6, options.measured.limit)) return std::nullopt;
    } else if (argument.starts_with("--ideas=")) {
      options.measured.ideas = argument.substr(8);
    } else if (argument == "--scaling") {
      options.scaling = true;
    } else if (argument == "--reading") {
      options.reading = true;
    } else if (argument == "--phrasings") {
      options.phrasings = true;
    } else if (argument == "--planning") {
      options.planning = true;
    } else {
      argv[kept++] = argv[i];
    }
  }
  argc = kept;
  if (factor && *factor && !readNumber(factor, 15, options.measured.factor)) return std::nullopt;
  return options;
}

}  // namespace

int main(int argc, char** argv) {
  if (argc == 3 && std::strcmp(argv[1], "--peak") == 0) return bench::reportPeak(argv[2]);
  if (argc == 2 && std::strcmp(argv[1], "--functions") == 0) return bench::reportFunctions();
  if (const std::string_view only = argc == 2 ? argv[1] : ""; only == "--threads") {
    return bench::reportThreads("");
  } else if (constexpr std::string_view some = "--threads="; only.starts_with(some)) {
    return bench::reportThreads(only.substr(some.size()));
  }
  const std::optional<Options> options = takeOptions(argc, argv);
  if (!options) {
    std::fprintf(stderr, "the factor must be above 0 and at most 15, the limit above 0\n");
    return 2;
  }
  if (options->scaling) return bench::reportScaling();
  if (options->reading) return bench::reportReading(options->measured.factor);
  if (options->phrasings) return bench::reportPhrasings(options->measured);
  if (options->planning) {
    return bench::reportPlanning(options->measured.factor, options->measured.ideas);
  }
  benchmark::Initialize(&argc, argv);
  if (benchmark::ReportUnrecognizedArguments(argc, argv)) return 2;
  prepare(options->measured.factor);
  registerAll();
  benchmark::RunSpecifiedBenchmarks();
  benchmark::Shutdown();
  return 0;
}

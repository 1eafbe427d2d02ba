// Evaluates all whole-query cases, and some queries that take longer, from several threads for as
// long as asked, in an order by chance: compiled once or anew, planned or plain, against documents
// that the threads share and contexts that are made, kept a while and dropped, with limits and
// cancellations that fire at random. Every answer is the one that the case has alone, or that a
// limit was reached; and after the first part of the time the process does not grow.
//
//   xquery_soak [--seconds N] [--threads N] [--seed N] [--growth MIB]
//
// The status is 1 when an answer differs, when not each kind of limit has ended an evaluation, and
// when the process has grown by more than `growth` (32 MiB unless given) since the first fifth of
// the time, or since two minutes had passed.
#include "SoakCases.h"
#include "xquery/Memory.h"
#include "xquery/xquery.h"

#include <algorithm>
#include <array>
#include <atomic>
#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <fstream>
#include <memory>
#include <mutex>
#include <random>
#include <string>
#include <string_view>
#include <thread>
#include <unistd.h>
#include <vector>

namespace bench {
namespace {

using Clock = std::chrono::steady_clock;
using std::chrono::microseconds;
using std::chrono::milliseconds;
using std::chrono::seconds;

struct Settings {
  int seconds = 60;
  int threads = 4;
  unsigned seed = 1;
  double growth = 32;  // MiB
};

double residentMiB() {
  xquery::XQueryReleaseIdleMemory();
  std::ifstream file("/proc/self/statm");
  double all = 0;
  double resident = 0;
  file >> all >> resident;
  return resident * static_cast<double>(::sysconf(_SC_PAGESIZE)) / (1 << 20);
}

// What fires at random, and what the answer tells of it.
struct Limit {
  const char* name;
  std::string_view text;
};
constexpr std::array limits = {Limit{"deadlines", " limit: deadline passed"},
                               Limit{"cancellations", " limit: evaluation cancelled"},
                               Limit{"memory ceilings", " limit: memory ceiling reached"}};

// What the threads share.
struct Run {
  const SoakCases& cases;
  Clock::time_point end;
  std::vector<std::shared_ptr<std::atomic<bool>>> flags;  // one for each thread, to be raised
  std::atomic<uint64_t> evaluations{0};
  std::array<std::atomic<uint64_t>, limits.size()> ended{};  // at each of the limits
  std::atomic<uint64_t> differences{0};
  std::mutex printing{};

  bool isOver() const { return Clock::now() >= end; }
  void report(const SoakCase& c, const std::string& found) {
    constexpr uint64_t most = 20;
    if (++differences > most) return;
    const std::lock_guard lock(printing);
    std::fprintf(stderr, "%s:%d\n  found\n%s  alone\n%s", c.text.file.c_str(), c.text.line,
                 found.c_str(), c.alone.c_str());
  }
};

class Worker {
 public:
  Worker(Run& run, size_t number, unsigned seed)
      : _run(run), _flag(run.flags[number]), _random(seed) {}

  void work() {
    while (!_run.isOver()) {
      const SoakCase& c = anyCase();
      // A context remembers the context item and base URIs: another case would see them.
      const auto context = xquery::XQueryContext::xqueryContextWithNamespaces(c.text.namespaces);
      for (size_t times = 1 + below(6); times > 0; --times) evaluate(c, *context);
    }
  }

 private:
  size_t below(size_t bound) {
    return std::uniform_int_distribution<size_t>(0, bound - 1)(_random);
  }

  // One in some that takes long, so that limits have something to end.
  const SoakCase& anyCase() {
    const auto& all = _run.cases.all();
    const size_t longCount = _run.cases.longCount();
    return below(64) == 0 ? all[all.size() - 1 - below(longCount)] : all[below(all.size())];
  }

  // Each of them seldom, and often none.
  xquery::XQueryLimits chosenLimits() {
    xquery::XQueryLimits chosen;
    switch (below(8)) {
      case 0:
        chosen.duration = microseconds(below(2000));
        break;
      case 1:
        chosen.cancelled = _flag;
        break;
      case 2:
        chosen.memoryCeiling = below(1 << 20);
        break;
      default:
        break;
    }
    return chosen;
  }

  xquery::Ref<xquery::XQuery> query(const SoakCase& c) {
    constexpr xquery::XQueryWay ways[] = {xquery::XQueryWay::Planned, xquery::XQueryWay::Plain,
                                          xquery::XQueryWay::Profiled};
    if (below(16) == 0) {
      return xquery::querytest::compiledCase(c.text, c.folderURL, ways[below(3)]);
    }
    return below(4) == 0 ? c.plain : c.planned;
  }

  void evaluate(const SoakCase& c, xquery::XQueryContext& context) {
    const auto compiled = query(c);
    const xquery::XQueryLimits chosen = chosenLimits();
    context.contextSetLimits(chosen);
    const std::string found = soakAnswer(*compiled, context, c);
    ++_run.evaluations;
    if (found == c.alone) return;
    const bool isChosen[] = {chosen.duration.has_value(), chosen.cancelled != nullptr,
                             chosen.memoryCeiling.has_value()};
    for (size_t i = 0; i < limits.size(); ++i) {
      if (!isChosen[i] || !isSoakLimit(found, limits[i].text)) continue;
      ++_run.ended[i];
      return;
    }
    _run.report(c, found);
  }

  Run& _run;
  const std::shared_ptr<std::atomic<bool>> _flag;
  std::mt19937 _random;
};

// Raises the flags of evaluations that are under way, and takes them back.
void cancel(Run& run, unsigned seed) {
  std::mt19937 random(seed);
  while (!run.isOver()) {
    auto& flag = *run.flags[random() % run.flags.size()];
    flag = true;
    std::this_thread::sleep_for(microseconds(random() % 500));
    flag = false;
    std::this_thread::sleep_for(microseconds(random() % 5000));
  }
}

int soak(const Settings& settings) {
  const SoakCases cases;
  const auto start = Clock::now();
  Run run{cases, start + seconds(settings.seconds), {}};
  for (int i = 0; i < settings.threads; ++i) {
    run.flags.push_back(std::make_shared<std::atomic<bool>>(false));
  }
  std::vector<std::thread> threads;
  for (size_t i = 0; i < run.flags.size(); ++i) {
    const auto seed = settings.seed * 1000 + static_cast<unsigned>(i);
    threads.emplace_back([&run, i, seed] { Worker(run, i, seed).work(); });
  }
  threads.emplace_back([&run, &settings] { cancel(run, settings.seed); });
  const auto first = std::min<Clock::duration>(seconds(120), (run.end - start) / 5);
  std::this_thread::sleep_until(start + first);
  const double before = residentMiB();
  // While the threads are at work: what they hold belongs to both.
  std::this_thread::sleep_until(run.end - milliseconds(50));
  const double after = residentMiB();
  for (std::thread& thread : threads) thread.join();
  const auto number = [](const std::atomic<uint64_t>& count) {
    return static_cast<unsigned long long>(count);
  };
  std::printf("%llu evaluations of %zu cases, %llu different\n", number(run.evaluations),
              cases.all().size(), number(run.differences));
  bool haveAllFired = true;
  for (size_t i = 0; i < limits.size(); ++i) {
    std::printf("%s: %llu\n", limits[i].name, number(run.ended[i]));
    haveAllFired = haveAllFired && run.ended[i] > 0;
  }
  if (!haveAllFired) std::printf("a limit that never fired shows nothing\n");
  std::printf("memory: %.1f MiB after %.0f s, %.1f MiB at the end\n", before,
              std::chrono::duration<double>(first).count(), after);
  const bool hasGrown = after - before > settings.growth;
  if (hasGrown) std::printf("grown by more than %.0f MiB\n", settings.growth);
  return run.differences || hasGrown || !haveAllFired ? EXIT_FAILURE : EXIT_SUCCESS;
}

bool readArguments(int count, char** arguments, Settings& settings) {
  for (int i = 1; i < count; i += 2) {
    const char* value = i + 1 < count ? arguments[i + 1] : nullptr;
    if (!value) return false;
    const std::string_view name = arguments[i];
    if (name == "--seconds") {
      settings.seconds = std::atoi(value);
    } else if (name == "--threads") {
      settings.threads = std::atoi(value);
    } else if (name == "--seed") {
      settings.seed = static_cast<unsigned>(std::atoi(value));
    } else if (name == "--growth") {
      settings.growth = std::atof(value);
    } else {
      return false;
    }
  }
  return settings.seconds > 0 && settings.threads > 0;
}

}  // namespace
}  // namespace bench

int main(int count, char** arguments) {
  bench::Settings settings;
  if (!bench::readArguments(count, arguments, settings)) {
    std::fprintf(stderr,
                 "usage: xquery_soak [--seconds N] [--threads N] [--seed N] [--growth MIB]\n");
    return 2;
  }
  return bench::soak(settings);
}

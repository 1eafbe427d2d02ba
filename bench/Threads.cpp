// Every figure is taken in a process of its own, which begins as a copy of this one: only a process
// that never had a second thread counts references the way a single thread does. The figures of a
// kind are taken in turn, again and again, and of each the median counts, so that what else the
// machine does falls on all of them alike.
//
// Two processors are seldom twice one: they share caches, memory and a clock. Two processes of one
// thread each, which share nothing else, show what the machine gives for a kind.
#include "Threads.h"

#include "AuctionData.h"
#include "Engine.h"
#include "ProcessorTime.h"

#include <algorithm>
#include <barrier>
#include <chrono>
#include <cstdint>
#include <cstdio>
#include <span>
#include <stdexcept>
#include <string>
#include <string_view>
#include <sys/wait.h>
#include <thread>
#include <unistd.h>
#include <utility>
#include <vector>

namespace bench {
namespace {

using namespace xquery;
using Clock = std::chrono::steady_clock;

struct KindRow {
  const char* kind;
  const char* query;
};

constexpr KindRow rows[] = {
    {"no query, a processor alone", nullptr},
    {"arithmetic", "sum(for $x in 1 to 5000 return $x * 2 + 1)"},
    {"comparisons", "count((1 to 5000)[. * 3 > 100 and . != 7])"},
    {"quantifiers", "every $x in 1 to 5000 satisfies $x > 0 and $x < 10000"},
    {"strings", "for $x in 1 to 1000 return if ($x = 7) then 'seven' else 'another'"},
    {"paths", "count(//keyword/..), /site/regions/*/item/description/text/keyword"},
    {"paths with predicates", "/site/people/person[profile/@income > 50000]/name, //item[3]"},
    {"nodes in variables",
     "for $p in /site/people/person let $n := $p/name return ($p, $n, $n/..)"},
    {"calls",
     "declare function local:sum($a, $b) { $a + $b }; sum(for $x in 1 to 3000 return local:sum($x, "
     "1))"},
    {"recursion",
     "declare function local:fib($n) { if ($n < 2) then $n else local:fib($n - 1) + local:fib($n - "
     "2) }; local:fib(14)"},
    {"sorting", "for $p in /site/people/person order by string($p/name) descending return $p/@id"},
    {"construction", "for $x in 1 to 1000 return <e n='{$x}' m='1'><f/>text {$x}</e>"},
    {"construction from a document",
     "<all>{for $p in /site/people/person return <p id='{$p/@id}'>{$p/name, "
     "string($p/emailaddress)}</p>}</all>"},
    {"construction with namespaces",
     "declare base-uri 'http://h/'; declare namespace p = 'urn:p'; for $x in 1 to 500 return "
     "<p:e xmlns:q='urn:q'><q:f a='1'/></p:e>"},
    {"comments and instructions", "for $x in 1 to 1000 return (<!-- c -->, <?p i?>)"},
    {"text",
     "for $n in //name return concat(upper-case($n), '-', substring($n, 2, 3), string-length($n))"},
    {"regular expressions",
     "for $n in //name return (matches($n, '^[A-Z].*s'), replace($n, 'a', 'b'))"},
    {"casts",
     "for $x in 1 to 1000 return (xs:decimal('1.5'), string($x), xs:double($x) instance of "
     "xs:double, $x cast as xs:string)"},
    {"dates", "for $x in 1 to 500 return xs:date('2004-05-06') + xdt:dayTimeDuration('P1D')"},
    {"globals",
     "declare variable $n := 3; declare variable $p := /site/people/person; sum(for $x in 1 to "
     "3000 "
     "return $x + $n), count($p)"},
    {"joins",
     "for $p in /site/people/person let $a := for $t in /site/closed_auctions/closed_auction where "
     "$t/buyer/@person = $p/@id return $t return count($a)"},
    {"errors passed over", "count((1 to 300)[error()])"},
};

enum Mode : int { Alone, Sharing, Apart, Processes, modeCount };
constexpr int processCount = 2;
constexpr int threadCount = 2;
constexpr int rounds = 7;
constexpr std::chrono::milliseconds warmUp{20};
constexpr std::chrono::milliseconds span{150};

struct Figure {
  double rate = 0;           // evaluations in a second
  double processorTime = 0;  // of one evaluation, in seconds
};

// How long the calling thread was ready to run and did not, for want of a processor. 0 where the
// kernel does not tell.
double secondsInQueue() {
  unsigned long long running = 0, waiting = 0;
  if (FILE* file = std::fopen("/proc/thread-self/schedstat", "r")) {
    if (std::fscanf(file, "%llu %llu", &running, &waiting) != 2) waiting = 0;
    std::fclose(file);
  }
  return static_cast<double>(waiting) * 1e-9;
}

// What touches no memory.
void keepProcessorBusy() {
  uint64_t state = 1;
  for (int step = 0; step < 20'000; step++)
    state = state * 6364136223846793005U + 1442695040888963407U;
  volatile uint64_t result = state;
  static_cast<void>(result);
}

// A thread's share of the work.
class Work {
 public:
  Work(const KindRow& row, const std::string& xml)
      : Work(row.query ? compile(row.query) : nullptr, parse(xml)) {}
  Work(Ref<XQuery> query, Value document)
      : _query(std::move(query)), _document(std::move(document)) {}

  size_t repeatFor(Clock::duration time) const {
    const auto end = Clock::now() + time;
    size_t count = 0;
    for (; Clock::now() < end; count++) doOnce();
    return count;
  }
  Work forAnotherThread() const { return {_query, _document}; }

 private:
  void doOnce() const {
    if (_query) {
      evaluate(*_context, *_query, _document);
    } else {
      keepProcessorBusy();
    }
  }

  const Ref<XQueryContext> _context = XQueryContext::xqueryContext();
  const Ref<XQuery> _query;
  const Value _document;
};

// Of the calling thread, the time apart that others took from it.
Figure figureOf(const Work& work) {
  work.repeatFor(warmUp);
  const double queuedBefore = secondsInQueue();
  const double processorBefore = processorSeconds();
  const auto start = Clock::now();
  const auto count = static_cast<double>(work.repeatFor(span));
  const double taken = std::chrono::duration<double>(Clock::now() - start).count();
  const double processor = processorSeconds() - processorBefore;
  const Figure figure = {count / (taken - (secondsInQueue() - queuedBefore)), processor / count};
  // Nobody measures while another is done already.
  work.repeatFor(warmUp);
  return figure;
}

// Together, of as many that each did a share.
Figure sumOf(std::span<const Figure> figures) {
  Figure sum;
  for (const Figure& figure : figures) {
    sum.rate += figure.rate;
    sum.processorTime += figure.processorTime / static_cast<double>(figures.size());
  }
  return sum;
}

Figure figureOfThreads(const KindRow& row, const std::string& xml, bool share) {
  const Work shared(row, xml);
  std::barrier together(threadCount);
  Figure figures[threadCount];
  std::vector<std::thread> threads;
  for (Figure& figure : figures) {
    threads.emplace_back([&] {
      const Work work = share ? shared.forAnotherThread() : Work(row, xml);
      together.arrive_and_wait();
      figure = figureOf(work);
    });
  }
  for (auto& thread : threads) thread.join();
  return sumOf(figures);
}

// A copy of this process that takes a figure.
class Measurement {
 public:
  Measurement(const KindRow& row, const std::string& xml, Mode mode) {
    int ends[2];
    if (pipe(ends) != 0) throw std::runtime_error("no pipe");
    _child = fork();
    if (_child < 0) throw std::runtime_error("no process");
    if (_child == 0) _exit(takeFigure(row, xml, mode, ends[1]));
    close(ends[1]);
    _result = ends[0];
  }
  Measurement(const Measurement&) = delete;
  Measurement& operator=(const Measurement&) = delete;
  ~Measurement() {
    close(_result);
    waitpid(_child, nullptr, 0);
  }

  Figure figure() const {
    Figure figure;
    if (read(_result, &figure, sizeof figure) != sizeof figure) {
      throw std::runtime_error("a kind cannot be measured");
    }
    return figure;
  }

 private:
  static int takeFigure(const KindRow& row, const std::string& xml, Mode mode, int result) try {
    const bool isOneThread = mode == Alone || mode == Processes;
    const Figure figure =
        isOneThread ? figureOf(Work(row, xml)) : figureOfThreads(row, xml, mode == Sharing);
    return write(result, &figure, sizeof figure) == sizeof figure ? 0 : 1;
  } catch (const std::exception& exception) {
    std::fprintf(stderr, "%s: %s\n", row.kind, exception.what());
    return 1;
  }

  pid_t _child = -1;
  int _result = -1;
};

Figure measured(const KindRow& row, const std::string& xml, Mode mode) {
  if (mode != Processes) return Measurement(row, xml, mode).figure();
  const Measurement first(row, xml, mode);
  const Measurement second(row, xml, mode);
  const Figure figures[processCount] = {first.figure(), second.figure()};
  return sumOf(figures);
}

// Of each member by itself.
Figure median(std::vector<Figure>& figures) {
  const auto middle = figures.begin() + figures.size() / 2;
  Figure result;
  for (double Figure::*member : {&Figure::rate, &Figure::processorTime}) {
    std::nth_element(figures.begin(), middle, figures.end(),
                     [member](const Figure& a, const Figure& b) { return a.*member < b.*member; });
    result.*member = *middle.*member;
  }
  return result;
}

}  // namespace

int reportThreads(std::string_view kinds) {
  const std::string xml = auctionData(0.01);
  bool isEnough = true;
  std::printf("%-30s %14s %8s %8s %10s %14s\n", "", "alone", "sharing", "apart", "processes",
              "processor time");
  for (const KindRow& row : rows) {
    if (std::string_view(row.kind).find(kinds) == std::string_view::npos) continue;
    std::vector<Figure> figures[modeCount];
    for (int round = 0; round < rounds; round++) {
      for (int mode = 0; mode < modeCount; mode++) {
        figures[mode].push_back(measured(row, xml, static_cast<Mode>(mode)));
      }
    }
    const Figure alone = median(figures[Alone]);
    const Figure shared = median(figures[Sharing]);
    const double sharing = shared.rate / alone.rate;
    const double apart = median(figures[Apart]).rate / alone.rate;
    const double processes = median(figures[Processes]).rate / alone.rate;
    const double wanted = std::min(1.8, 0.9 * processes);
    const bool keepsUp = sharing >= wanted && sharing >= apart * 0.95;
    std::printf("%-30s %12.1f/s %8.2f %8.2f %10.2f %14.2f%s\n", row.kind, alone.rate, sharing,
                apart, processes, shared.processorTime / alone.processorTime, keepsUp ? "" : "  !");
    std::fflush(stdout);
    isEnough = isEnough && keepsUp;
  }
  return isEnough ? 0 : 1;
}

}  // namespace bench

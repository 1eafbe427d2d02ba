// Every figure is taken in a process of its own, which begins as a copy of this one: only a process
// that never had a second thread counts references the way a single thread does. The three figures
// of a kind are taken in turn, again and again, and of each the median counts, so that what else
// the machine does falls on all of them alike.
#include "Threads.h"

#include "AuctionData.h"
#include "Engine.h"

#include <algorithm>
#include <barrier>
#include <chrono>
#include <cstdio>
#include <stdexcept>
#include <string>
#include <sys/wait.h>
#include <thread>
#include <time.h>
#include <unistd.h>
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

enum Mode : int { Alone, Sharing, Apart, modeCount };
constexpr int rounds = 7;
constexpr std::chrono::milliseconds warmUp{20};
constexpr std::chrono::milliseconds span{150};

struct Figure {
  double rate = 0;           // evaluations in a second
  double processorTime = 0;  // of one evaluation, in seconds
};

// What the calling thread has taken so far.
double processorSeconds() {
  timespec time = {};
  clock_gettime(CLOCK_THREAD_CPUTIME_ID, &time);
  return static_cast<double>(time.tv_sec) + static_cast<double>(time.tv_nsec) * 1e-9;
}

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

size_t evaluateFor(Clock::duration time, XQueryContext& context, const XQuery& query,
                   const Value& document) {
  const auto end = Clock::now() + time;
  size_t count = 0;
  for (; Clock::now() < end; count++) evaluate(context, query, document);
  return count;
}

// Of the calling thread, the time apart that others took from it.
Figure figureHere(XQueryContext& context, const XQuery& query, const Value& document) {
  evaluateFor(warmUp, context, query, document);
  const double queuedBefore = secondsInQueue();
  const double processorBefore = processorSeconds();
  const auto start = Clock::now();
  const auto count = static_cast<double>(evaluateFor(span, context, query, document));
  const double taken = std::chrono::duration<double>(Clock::now() - start).count();
  const double processor = processorSeconds() - processorBefore;
  const Figure figure = {count / (taken - (secondsInQueue() - queuedBefore)), processor / count};
  // Nobody measures while another is done already.
  evaluateFor(warmUp, context, query, document);
  return figure;
}

Figure figureAlone(const KindRow& row, const std::string& xml) {
  return figureHere(*XQueryContext::xqueryContext(), *compile(row.query), parse(xml));
}

Figure figureOfTwo(const KindRow& row, const std::string& xml, bool share) {
  constexpr int threadCount = 2;
  const auto sharedQuery = compile(row.query);
  const Value sharedDocument = parse(xml);
  std::barrier together(threadCount);
  Figure figures[threadCount];
  std::vector<std::thread> threads;
  for (Figure& figure : figures) {
    threads.emplace_back([&] {
      const auto query = share ? sharedQuery : compile(row.query);
      const Value document = share ? sharedDocument : Value(parse(xml));
      const auto context = XQueryContext::xqueryContext();
      together.arrive_and_wait();
      figure = figureHere(*context, *query, document);
    });
  }
  for (auto& thread : threads) thread.join();
  return {figures[0].rate + figures[1].rate,
          (figures[0].processorTime + figures[1].processorTime) / threadCount};
}

// The figure, from a copy of this process.
Figure measured(const KindRow& row, const std::string& xml, Mode mode) {
  int ends[2];
  if (pipe(ends) != 0) throw std::runtime_error("no pipe");
  const pid_t child = fork();
  if (child < 0) throw std::runtime_error("no process");
  if (child == 0) {
    int status = 1;
    try {
      const Figure figure =
          mode == Alone ? figureAlone(row, xml) : figureOfTwo(row, xml, mode == Sharing);
      status = write(ends[1], &figure, sizeof figure) == sizeof figure ? 0 : 1;
    } catch (const std::exception& exception) {
      std::fprintf(stderr, "%s: %s\n", row.kind, exception.what());
    }
    _exit(status);
  }
  close(ends[1]);
  Figure figure;
  const bool isRead = read(ends[0], &figure, sizeof figure) == sizeof figure;
  close(ends[0]);
  waitpid(child, nullptr, 0);
  if (!isRead) throw std::runtime_error("a kind cannot be measured");
  return figure;
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

int reportThreads() {
  const std::string xml = auctionData(0.01);
  bool isEnough = true;
  std::printf("%-30s %14s %8s %8s %14s\n", "", "alone", "sharing", "apart", "processor time");
  for (const KindRow& row : rows) {
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
    const bool keepsUp = sharing >= 1.8 || sharing >= apart * 0.95;
    std::printf("%-30s %12.1f/s %8.2f %8.2f %14.2f%s\n", row.kind, alone.rate, sharing, apart,
                shared.processorTime / alone.processorTime, keepsUp ? "" : "  !");
    std::fflush(stdout);
    isEnough = isEnough && keepsUp;
  }
  return isEnough ? 0 : 1;
}

}  // namespace bench

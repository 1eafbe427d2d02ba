// The phrasings of an idea are evaluated in turns, so that what else the machine does falls on all
// of them alike. A turn lasts at least some milliseconds: short evaluations are repeated in it.
#include "Phrasings.h"

#include "DataSets.h"
#include "Engine.h"
#include "Median.h"
#include "Queries.h"

#include <algorithm>
#include <chrono>
#include <cmath>
#include <cstdio>
#include <ctime>
#include <optional>
#include <string>
#include <utility>
#include <vector>

namespace bench {
namespace {

using namespace xquery;

constexpr double turn = 0.003;         // seconds that a turn lasts at least
constexpr int turns = 7;               // unless they take too long together:
constexpr double secondsForTurns = 2;  // of one phrasing; one turn there is always
constexpr double allowed = 2;          // times the fastest

double processorSeconds() {
  timespec time{};
  clock_gettime(CLOCK_THREAD_CPUTIME_ID, &time);
  return static_cast<double>(time.tv_sec) + static_cast<double>(time.tv_nsec) * 1e-9;
}

class Phrasing {
 public:
  Phrasing(const PhrasedQuery& query, const Value& document, double limit)
      : _name(query.phrasing),
        _document(document),
        _query(compile(query.text)),
        _context(XQueryContext::xqueryContext()) {
    XQueryLimits limits;
    limits.duration = std::chrono::nanoseconds(std::llround(limit * 1e9));
    _context->contextSetLimits(limits);
    const double start = processorSeconds();
    std::string error;
    const Ref<NSArray> items = evaluated(error);
    _first = processorSeconds() - start;
    if (items) {
      _answer = printed(*items);
    } else if (error.find("limit: deadline passed") == std::string::npos) {
      _answer = error;
    }
  }

  const std::string& name() const { return _name; }
  bool isOver() const { return !_answer; }
  // The printed result, or the error; nothing over the limit.
  const std::optional<std::string>& answer() const { return _answer; }
  // Of one evaluation; of one that is over the limit, what it took until it was ended.
  double seconds() const { return _turns.empty() ? _first : median(_turns); }

  void takeTurn() {
    if (isOver() || _spent > secondsForTurns) return;
    const int repeat = static_cast<int>(std::clamp(turn / std::max(_first, 1e-7), 1.0, 10000.0));
    std::string error;
    const double start = processorSeconds();
    for (int i = 0; i < repeat; i++) {
      if (!evaluated(error)) return;  // What is this close to the limit keeps its first time.
    }
    const double taken = processorSeconds() - start;
    _turns.push_back(taken / repeat);
    _spent += taken;
  }

 private:
  // Null with an error.
  Ref<NSArray> evaluated(std::string& message) {
    Ref<XQueryError> error;
    Ref<NSArray> items = _context->evaluateXQuery(*_query, {}, _document, &error);
    if (!items) message = error ? error->description()->utf8() : "no result";
    return items;
  }

  std::string _name;
  Value _document;
  Ref<XQuery> _query;
  Ref<XQueryContext> _context;
  std::optional<std::string> _answer;
  double _first = 0, _spent = 0;
  std::vector<double> _turns;
};

struct IdeaResult {
  std::string name;
  std::string fastest, slowest;
  double low = 0, high = 0;  // seconds
  size_t phrasings = 0, slow = 0;
  bool isOver = false;       // the slowest phrasing
  bool isUndecided = false;  // all of them
  bool answersDiffer = false;

  double ratio() const { return high / low; }
  bool isAllowed() const { return slow == 0 && !isUndecided && !answersDiffer; }
};

IdeaResult compared(const std::string& name, const std::vector<Phrasing>& phrasings) {
  const auto faster = [](const Phrasing& a, const Phrasing& b) {
    return a.isOver() != b.isOver() ? b.isOver() : a.seconds() < b.seconds();
  };
  const auto [low, high] = std::minmax_element(phrasings.begin(), phrasings.end(), faster);
  IdeaResult result;
  result.name = name;
  result.fastest = low->name(), result.slowest = high->name();
  result.low = low->seconds(), result.high = high->seconds();
  result.phrasings = phrasings.size();
  result.isOver = high->isOver(), result.isUndecided = low->isOver();
  for (const Phrasing& one : phrasings) {
    if (one.isOver() || one.seconds() > allowed * result.low) result.slow++;
    if (!one.isOver() && one.answer() != low->answer()) result.answersDiffer = true;
  }
  return result;
}

// The lines of an idea in the table.
void print(const IdeaResult& result, const std::vector<Phrasing>& phrasings) {
  std::printf("%s%s%s\n", result.name.c_str(), result.isAllowed() ? "" : "  !",
              result.answersDiffer ? " different answers" : "");
  for (const Phrasing& one : phrasings) {
    std::printf("  %-24s %s%12.3f ms %10.1f\n", one.name().c_str(), one.isOver() ? ">" : " ",
                one.seconds() * 1e3, one.seconds() / result.low);
  }
  std::fflush(stdout);
}

void summarize(std::vector<IdeaResult> results) {
  const size_t all = results.size();
  std::erase_if(results, [](const IdeaResult& result) { return result.isAllowed(); });
  std::sort(results.begin(), results.end(), [](const IdeaResult& a, const IdeaResult& b) {
    return a.isUndecided != b.isUndecided ? a.isUndecided : a.ratio() > b.ratio();
  });
  std::printf("\n%zu of %zu ideas have phrasings that take more than %.0f times the fastest one:\n",
              results.size(), all, allowed);
  for (const IdeaResult& result : results) {
    std::printf("%-34s %s%10.1f  %2zu of %2zu  %s %.3f ms, %s %s%.3f ms%s\n", result.name.c_str(),
                result.isOver ? ">" : " ", result.ratio(), result.slow, result.phrasings,
                result.fastest.c_str(), result.low * 1e3, result.slowest.c_str(),
                result.isOver ? "> " : "", result.high * 1e3,
                result.answersDiffer ? ", different answers" : "");
  }
}

using Queries = std::vector<PhrasedQuery>;

// Measures and prints one idea.
IdeaResult measured(Queries::const_iterator first, Queries::const_iterator last,
                    const Value& document, double limit) {
  std::vector<Phrasing> phrasings;
  for (auto query = first; query != last; ++query) phrasings.emplace_back(*query, document, limit);
  for (int i = 0; i < turns; i++) {
    for (Phrasing& one : phrasings) one.takeTurn();
  }
  IdeaResult result = compared(first->data + "/" + first->idea, phrasings);
  print(result, phrasings);
  return result;
}

}  // namespace

int reportPhrasings(const PhrasingOptions& options) {
  Queries queries = phrasedQueries(XQUERY_BENCH_QUERIES);
  std::erase_if(queries, [&options](const PhrasedQuery& query) {
    return (query.data + "/" + query.idea).find(options.ideas) == std::string::npos;
  });
  std::vector<IdeaResult> results;
  std::string data;
  Value document;
  for (auto query = queries.begin(); query != queries.end();) {
    if (query->data != data) {
      data = query->data;
      document = parse(generatedData(data, options.factor));
    }
    const auto next = std::find_if_not(query, queries.end(), [query](const PhrasedQuery& other) {
      return other.asksTheSameAs(*query);
    });
    results.push_back(measured(query, next, document, options.limit));
    query = next;
  }
  const bool isAllowed = std::all_of(results.begin(), results.end(),
                                     [](const IdeaResult& result) { return result.isAllowed(); });
  summarize(std::move(results));
  return isAllowed ? 0 : 1;
}

}  // namespace bench

#include "Phrasings.h"

#include "DataSets.h"
#include "Engine.h"
#include "Queries.h"
#include "TimedQuery.h"

#include <algorithm>
#include <cstdio>
#include <string>
#include <utility>
#include <vector>

namespace bench {
namespace {

using namespace xquery;

constexpr int turns = 7;       // unless they take too long together
constexpr double allowed = 2;  // times the fastest

class Phrasing : public TimedQuery {
 public:
  Phrasing(const PhrasedQuery& query, const Value& document, double limit)
      : TimedQuery(compile(query.text), document, limit), _name(query.phrasing) {}

  const std::string& name() const { return _name; }

 private:
  std::string _name;
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

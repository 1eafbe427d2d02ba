#include "TimedQuery.h"

#include "Engine.h"
#include "Median.h"
#include "ProcessorTime.h"

#include <algorithm>
#include <chrono>
#include <cmath>
#include <utility>

namespace bench {
namespace {

using namespace xquery;

constexpr double turn = 0.003;         // seconds that a turn lasts at least
constexpr double secondsForTurns = 2;  // of one query; one turn there is always

}  // namespace

TimedQuery::TimedQuery(Ref<XQuery> query, Value document, double limit)
    : _document(std::move(document)),
      _query(std::move(query)),
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

double TimedQuery::seconds() const {
  return _turns.empty() ? _first : median(_turns);
}

void TimedQuery::takeTurn() {
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

// Null with an error.
Ref<NSArray> TimedQuery::evaluated(std::string& message) {
  Ref<XQueryError> error;
  Ref<NSArray> items = _context->evaluateXQuery(*_query, {}, _document, &error);
  if (!items) message = error ? error->description()->utf8() : "no result";
  return items;
}

}  // namespace bench

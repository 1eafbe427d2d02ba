// A query whose evaluations are timed beside others that answer the same.
//
// Such queries are evaluated in turns, so that what else the machine does falls on all of them
// alike. A turn lasts at least some milliseconds: short evaluations are repeated in it.
#pragma once

#include "xquery/xquery.h"

#include <optional>
#include <string>
#include <vector>

namespace bench {

class TimedQuery {
 public:
  // Evaluates it once, which does not count. `limit`: seconds that an evaluation may take.
  TimedQuery(xquery::Ref<xquery::XQuery> query, xquery::Value document, double limit);

  bool isOver() const { return !_answer; }
  // The printed result, or the error; nothing over the limit.
  const std::optional<std::string>& answer() const { return _answer; }
  // Of the processor, for one evaluation; of one that is over the limit, what it took until it was
  // ended.
  double seconds() const;

  // None over the limit, nor where the turns before took too long together.
  void takeTurn();

 private:
  xquery::Ref<xquery::NSArray> evaluated(std::string& message);

  xquery::Value _document;
  xquery::Ref<xquery::XQuery> _query;
  xquery::Ref<xquery::XQueryContext> _context;
  std::optional<std::string> _answer;
  double _first = 0, _spent = 0;
  std::vector<double> _turns;
};

}  // namespace bench

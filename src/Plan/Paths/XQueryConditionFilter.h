// The conditions of a step with a position behind them, "item[price > 5][1]", asked of one item
// after another until no further one is wanted.
#pragma once

#include "Plan/Paths/XQueryWalkedStep.h"

#include <array>
#include <cstddef>
#include <cstdint>
#include <optional>

namespace xquery {

class XQueryConditionFilter {
 public:
  // Room for that many conditions of a step.
  static constexpr size_t mostConditions = 8;

  // `positions` are those of the step, and have conditions.
  XQueryConditionFilter(const XQueryStep& step, const XQueryStepPositions& positions,
                        XQueryContext& context);

  // The items are to come from the last to the first one.
  bool goesBackwards() const { return _goesBackwards; }

  // Whether the next item is wanted, which stands at that position among all that the first
  // condition is asked of. Not to be asked once it is over.
  bool keeps(NSObject* item, int64_t position);
  // Whether none of the items behind can be wanted, as after an error.
  bool isOver() const { return _isOver; }
  bool hasFailed() const { return _hasFailed; }
  // The first predicate that is left to be asked of the items that are kept.
  size_t predicatesDone() const {
    return _positions.conditions.position + (_isAskedOfEach ? 0 : 1);
  }

 private:
  bool meetsConditions(NSObject* item, int64_t position);
  bool keepsAt(uint64_t position);
  void findWanted();

  const XQueryStep& _step;
  const XQueryStepPositions& _positions;
  XQueryContext& _context;
  const bool _goesBackwards;
  bool _isOver = false;
  bool _hasFailed = false;
  bool _isAskedOfEach = false;  // the positions cannot be told beforehand
  // Of the items that meet the conditions, the positions that are wanted; none before the first.
  std::optional<XQueryPositionRange::Positions> _wanted;
  uint64_t _met = 0;
  // How many items each condition but the first one has been asked of.
  std::array<int64_t, mostConditions> _asked{};
};

}  // namespace xquery

#include "Plan/Paths/XQueryConditionFilter.h"

#include "Context/XQueryContextInternal.h"
#include "Plan/Operators/XQueryNodeQuestion.h"
#include "Plan/Paths/XQueryPathWalk.h"

namespace xquery {

XQueryConditionFilter::XQueryConditionFilter(const XQueryStep& step,
                                             const XQueryStepPositions& positions,
                                             XQueryContext& context)
    : _step(step),
      _positions(positions),
      _context(context),
      _goesBackwards(positions.fromBack.predicate == positions.conditions.position) {}

bool XQueryConditionFilter::keeps(NSObject* item, int64_t position) {
  const bool isItem = item && item->kind() != Kind::Null;
  if (!isItem || !meetsConditions(item, position)) return false;
  if (!_wanted && !_isAskedOfEach) findWanted();
  return !_hasFailed && (_isAskedOfEach || keepsAt(++_met));
}

bool XQueryConditionFilter::meetsConditions(NSObject* item, int64_t position) {
  auto* node = dyn_cast<NSXMLNode>(item);
  const size_t first = _positions.conditions.first;
  for (size_t index = first; index < _positions.conditions.position; ++index) {
    const XQueryExpr& condition = *_step.predicates()[index];
    if (index > first) position = ++_asked[index - first];
    const XQueryNodeQuestion* question = node ? XQueryNodeQuestionIn(&condition) : nullptr;
    const auto answer = question ? question->holdsFor(node, _context) : std::nullopt;
    if (answer ? *answer : XQueryStep::keeps(condition, item, position, _context)) continue;
    _hasFailed = !answer && _internal(_context).isFailing();
    _isOver = _hasFailed;
    return false;
  }
  return true;
}

bool XQueryConditionFilter::keepsAt(uint64_t position) {
  _isOver = position >= _wanted->last;
  return position >= _wanted->first && position <= _wanted->last && position != _wanted->hole;
}

// Without an item that meets the conditions, what asks for the position is not evaluated.
void XQueryConditionFilter::findWanted() {
  const size_t index = _positions.conditions.position;
  std::optional<uint64_t> position = _step.literalPosition(index);
  if (_goesBackwards) {
    position = _positions.fromBack.behind + 1;
  } else if (_positions.range.predicate == index) {
    _wanted = _positions.range.positions(_context);
    _isAskedOfEach = !_wanted;
    return;
  } else if (!position) {
    position = XQueryStep::positionIn(*_step.predicates()[index], _context);
    _hasFailed = _internal(_context).isFailing();
    _isOver = _hasFailed;
  }
  _wanted = XQueryPositionRange::Positions();
  if (position) _wanted = {*position, *position};
}

}  // namespace xquery

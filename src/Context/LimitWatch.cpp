#include "Context/LimitWatch.h"

#include "Context/XQueryContextInternal.h"
#include "xquery/Exception.h"

#include <algorithm>

namespace xquery {
namespace {

using Clock = std::chrono::steady_clock;

// A step is at most about ten microseconds: a look every few milliseconds at the latest, and at the
// earliest, with steps of a nanosecond, once in the time that reading the clock forty times takes.
constexpr int64_t stepsPerLook = 1024;

std::optional<Clock::time_point> deadlineOf(const XQueryLimits& limits) {
  std::optional<Clock::time_point> deadline = limits.deadline;
  if (!limits.duration) return deadline;
  const Clock::time_point now = Clock::now();
  // A duration that the clock cannot count is none.
  if (*limits.duration > Clock::time_point::max() - now) return deadline;
  const Clock::time_point end = now + *limits.duration;
  return deadline ? std::min(*deadline, end) : end;
}

int64_t mostBytes(const XQueryLimits& limits, int64_t inUse) {
  const uint64_t room = static_cast<uint64_t>(INT64_MAX) - static_cast<uint64_t>(inUse);
  if (!limits.memoryCeiling || *limits.memoryCeiling > room) return INT64_MAX;
  return static_cast<int64_t>(static_cast<uint64_t>(inUse) + *limits.memoryCeiling);
}

// The innermost on this thread.
thread_local XQueryLimitWatch* innermost = nullptr;

// What former evaluations have left behind is no part of a later one, so that its going may not
// show while there is one.
const WorkMeter& meterAtBeginning() {
  if (!innermost) settleAbandonedValues();
  return workMeter;
}

}  // namespace

XQueryLimitWatch::XQueryLimitWatch(XQueryContext& context)
    : XQueryLimitWatch(context.contextLimits(), &context) {}

XQueryLimitWatch::XQueryLimitWatch(const XQueryLimits& limits)
    : XQueryLimitWatch(limits, nullptr) {}

XQueryLimitWatch::XQueryLimitWatch(const XQueryLimits& limits, XQueryContext* context)
    : _context(context),
      _limits(limits),
      _deadline(deadlineOf(_limits)),
      _around(innermost),
      _outer(meterAtBeginning()),
      _outerAbandoned(abandonedValues),
      _abandoned(isOver, this),
      _mostBytes(mostBytes(_limits, workMeter.valueBytes)) {
  WorkMeter& meter = workMeter;
  meter.stepsLeft = stepsBetweenLooks();
  meter.mostValueBytes = std::min(_mostBytes, _outer.mostValueBytes);
  meter.wasRefused = false;
  meter.watcher = this;
  innermost = this;
  if (isLimited()) abandonedValues = &_abandoned;
}

XQueryLimitWatch::~XQueryLimitWatch() {
  WorkMeter& meter = workMeter;
  const bool outerRefused = meter.wasRefused && _outer.mostValueBytes <= _mostBytes;
  meter.stepsLeft = _outer.stepsLeft;
  meter.mostValueBytes = _outer.mostValueBytes;
  meter.wasRefused = _outer.wasRefused || outerRefused;
  meter.watcher = _outer.watcher;
  innermost = _around;
  abandonedValues = _outerAbandoned;
  if (!_around) return;
  _around->_reached ? _abandoned.passTo(_around->_abandoned) : _abandoned.freeHere();
}

bool XQueryLimitWatch::isLimited() const {
  return _deadline || _limits.cancelled || _limits.memoryCeiling;
}

// The ceiling plays no part: what is being freed still counts.
bool XQueryLimitWatch::isTimeUp() const {
  if (_limits.cancelled && _limits.cancelled->load(std::memory_order_relaxed)) return true;
  if (_deadline && Clock::now() >= *_deadline) return true;
  return _around && _around->isTimeUp();
}

bool XQueryLimitWatch::isOver(void* watch) noexcept {
  return static_cast<const XQueryLimitWatch*>(watch)->isTimeUp();
}

int64_t XQueryLimitWatch::stepsBetweenLooks() const {
  if (isLimited()) return stepsPerLook;
  return _around ? _around->stepsBetweenLooks() : WorkMeter::manySteps;
}

const XQueryErrorText<>* XQueryLimitWatch::ownLimit() const {
  if (_limits.cancelled && _limits.cancelled->load(std::memory_order_relaxed)) {
    return &XQueryErrors::evaluationCancelled;
  }
  if (_deadline && Clock::now() >= *_deadline) return &XQueryErrors::deadlinePassed;
  return workMeter.valueBytes > _mostBytes ? &XQueryErrors::memoryCeilingReached : nullptr;
}

const XQueryErrorText<>* XQueryLimitWatch::reachedLimit() {
  if (!_reached && workMeter.wasRefused && workMeter.watcher == this) {
    _reached = &XQueryErrors::memoryCeilingReached;
  }
  if (!_reached) _reached = ownLimit();
  if (!_reached && _around) _reached = _around->reachedLimit();
  return _reached;
}

void XQueryLimitWatch::lookAtWork() {
  workMeter.stepsLeft = stepsBetweenLooks();
  if (_isRaising) return;  // making the error is work, too
  if (!reachedLimit()) return;
  _isRaising = true;
  _error = _reached->error();
  _isRaising = false;
  abandonedValues = &_abandoned;
  _abandoned.setOver();
  workMeter.stepsLeft = 0;
  if (_context) _internal(*_context).raise(_error);
  throw NSException("XQueryError", _error->description());
}

const XQueryErrorText<>& XQueryLimitWatch::allocationFailure() const {
  return workMeter.wasRefused ? XQueryErrors::memoryCeilingReached : XQueryErrors::outOfMemory;
}

Ref<XQueryContext> XQueryNestedContext(const XQueryContext& outer) {
  auto inner = XQueryContext::xqueryContext();
  inner->contextSetLoading(outer.contextLoading());
  return inner;
}

}  // namespace xquery

// Limits, cancellation, and the way in which a query is compiled.
#include "C/Options.h"

#include <chrono>

using namespace xquery;
using namespace xquery::capi;

// --- cancellation --------------------------------------------------------------------------------

xq_status xq_cancel_new(xq_cancel** cancel) {
  if (!cancel) return XQ_USAGE;
  *cancel = nullptr;
  return guarded([&] { return giveNew(cancel); });
}

xq_status xq_cancel_raise(const xq_cancel* cancel) {
  if (!areGood(cancel)) return XQ_USAGE;
  cancel->flag->store(true);
  return XQ_OK;
}

xq_status xq_cancel_lower(const xq_cancel* cancel) {
  if (!areGood(cancel)) return XQ_USAGE;
  cancel->flag->store(false);
  return XQ_OK;
}

xq_status xq_cancel_is_raised(const xq_cancel* cancel, int* is_raised) {
  if (!is_raised) return XQ_USAGE;
  *is_raised = 0;
  if (!areGood(cancel)) return XQ_USAGE;
  *is_raised = cancel->flag->load();
  return XQ_OK;
}

xq_status xq_cancel_free(xq_cancel* cancel) {
  return freeHandle(cancel);
}

// --- options -------------------------------------------------------------------------------------

xq_status xq_options_new(xq_options** options) {
  if (!options) return XQ_USAGE;
  *options = nullptr;
  return guarded([&] { return giveNew(options); });
}

xq_status xq_options_free(xq_options* options) {
  return freeHandle(options);
}

static_assert(XQ_WAY_PLANNED == static_cast<int>(XQueryWay::Planned));
static_assert(XQ_WAY_PLAIN == static_cast<int>(XQueryWay::Plain));
static_assert(XQ_WAY_EXPLAINED == static_cast<int>(XQueryWay::Explained));
static_assert(XQ_WAY_STREAMED == static_cast<int>(XQueryWay::Streamed));
static_assert(XQ_WAY_PROFILED == static_cast<int>(XQueryWay::Profiled));

xq_status xq_options_set_way(xq_options* options, xq_way way) {
  if (way < XQ_WAY_PLANNED || way > XQ_WAY_PROFILED) return XQ_USAGE;
  return changeOptions(options, [&](xq_options& changed) {
    changed.way = static_cast<XQueryWay>(way);
    return XQ_OK;
  });
}

// --- limits --------------------------------------------------------------------------------------

xq_status xq_options_set_timeout(xq_options* options, int64_t nanoseconds) {
  return changeOptions(options, [&](xq_options& changed) {
    changed.limits.duration = std::chrono::nanoseconds(nanoseconds);
    return XQ_OK;
  });
}

xq_status xq_options_set_deadline(xq_options* options, int64_t nanoseconds_from_now) {
  return changeOptions(options, [&](xq_options& changed) {
    using Clock = std::chrono::steady_clock;
    const Clock::time_point now = Clock::now();
    const Clock::duration most = Clock::time_point::max() - now;
    const std::chrono::nanoseconds duration(nanoseconds_from_now);
    changed.limits.deadline = duration < most ? now + duration : Clock::time_point::max();
    return XQ_OK;
  });
}

xq_status xq_options_set_memory(xq_options* options, uint64_t bytes) {
  return changeOptions(options, [&](xq_options& changed) {
    changed.limits.memoryCeiling = bytes;
    return XQ_OK;
  });
}

xq_status xq_options_set_cancel(xq_options* options, const xq_cancel* cancel) {
  if (cancel && !areGood(cancel)) return XQ_USAGE;
  return changeOptions(options, [&](xq_options& changed) {
    changed.limits.cancelled = cancel ? cancel->flag : nullptr;
    return XQ_OK;
  });
}

xq_status xq_options_clear_limits(xq_options* options) {
  return changeOptions(options, [&](xq_options& changed) {
    changed.limits = {};
    return XQ_OK;
  });
}

// Evaluations under limits, and how late they end.
#pragma once

#include "Platform/Base/Abandoned.h"
#include "Platform/Base/WorkMeter.h"
#include "xquery/xquery.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <atomic>
#include <chrono>
#include <ctime>
#include <memory>
#include <pthread.h>
#include <string>
#include <thread>

namespace xquery::limitstest {

using Clock = std::chrono::steady_clock;
using std::chrono::milliseconds;

// The promise is a tenth of a second; it is kept by what is built for use.
#if defined(XQUERY_SANITIZED) || !defined(NDEBUG)
constexpr milliseconds mostLate(1500);
constexpr milliseconds mostWait(3000);
#else
constexpr milliseconds mostLate(100);
constexpr milliseconds mostWait(500);
#endif

// The last error, the focus and the like.
constexpr int64_t keptByAContext = 65536;

// What this thread has taken, when all that was left behind is free.
inline int64_t valueBytes() {
  waitForAbandonedValues();
  settleAbandonedValues();
  return workMeter.valueBytes;
}

struct Outcome {
  std::string result;  // the string values of the items, separated by spaces
  std::string error;   // its text
  milliseconds lateProcessor{};
  milliseconds lateWall{};
};

inline milliseconds processorTime(clockid_t clock) {
  timespec time = {};
  ::clock_gettime(clock, &time);
  return std::chrono::duration_cast<milliseconds>(std::chrono::seconds(time.tv_sec) +
                                                  std::chrono::nanoseconds(time.tv_nsec));
}

inline Outcome evaluate(XQueryContext& context, const std::string& query, const Value& item = {}) {
  Outcome outcome;
  const auto compiled = XQuery::xqueryWithSource(query);
  Ref<XQueryError> error;
  const auto items = context.evaluateXQuery(*compiled, {}, item, &error);
  if (error) outcome.error = error->msg()->utf8();
  if (!items) return outcome;
  for (const Value& each : items->objects()) {
    if (!outcome.result.empty()) outcome.result += ' ';
    outcome.result += XQueryItemStringValue(*each);
  }
  return outcome;
}

inline Outcome endedAfter(milliseconds duration, XQueryContext& context, const std::string& query,
                          const Value& item = {}) {
  XQueryLimits limits;
  limits.duration = duration;
  context.contextSetLimits(limits);
  const auto processorStart = processorTime(CLOCK_THREAD_CPUTIME_ID);
  const auto start = Clock::now();
  Outcome outcome = evaluate(context, query, item);
  const auto taken = std::chrono::duration_cast<milliseconds>(Clock::now() - start);
  outcome.lateWall = taken - duration;
  outcome.lateProcessor = processorTime(CLOCK_THREAD_CPUTIME_ID) - processorStart - duration;
  return outcome;
}

inline Outcome cancelledAfter(milliseconds wait, XQueryContext& context, const std::string& query,
                              const Value& item = {}) {
  XQueryLimits limits;
  limits.cancelled = std::make_shared<std::atomic<bool>>(false);
  context.contextSetLimits(limits);
  clockid_t processor = CLOCK_THREAD_CPUTIME_ID;
  ::pthread_getcpuclockid(pthread_self(), &processor);
  milliseconds processorThen{};
  Clock::time_point then;
  std::thread other([&] {
    std::this_thread::sleep_for(wait);
    processorThen = processorTime(processor);
    then = Clock::now();
    limits.cancelled->store(true);
  });
  Outcome outcome = evaluate(context, query, item);
  const auto processorEnd = processorTime(processor);
  const auto end = Clock::now();
  other.join();
  outcome.lateProcessor = processorEnd - processorThen;
  outcome.lateWall = std::chrono::duration_cast<milliseconds>(end - then);
  return outcome;
}

// The work of others on the machine can lengthen an attempt and never shortens one, so that the
// soonest end of three tells how late it is. An attempt that ends in another way counts at once.
template <class Attempt>
void expectSoon(Attempt attempt, const std::string& error, milliseconds Outcome::*late,
                milliseconds most) {
  milliseconds least = milliseconds::max();
  for (int times = 0; times < 3 && least > most; ++times) {
    const Outcome outcome = attempt();
    ASSERT_EQ(outcome.error, error);
    least = std::min(least, outcome.*late);
  }
  EXPECT_LE(least, most);
}

}  // namespace xquery::limitstest

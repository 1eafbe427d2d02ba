// Watches one evaluation on its thread and ends it at the limits of its context.
#pragma once

#include "Platform/WorkMeter.h"
#include "Types/XQueryErrors.h"
#include "xquery/Limits.h"
#include "xquery/XQuery.h"

namespace xquery {

class XQueryLimitWatch final : public WorkWatcher {
 public:
  // From here on, until it is destroyed, the thread works for this evaluation. An evaluation that
  // another one on the thread brought about (by calling its host) is watched by its own limits.
  explicit XQueryLimitWatch(XQueryContext& context);
  ~XQueryLimitWatch();
  XQueryLimitWatch(const XQueryLimitWatch&) = delete;
  XQueryLimitWatch& operator=(const XQueryLimitWatch&) = delete;

  // Raises the error of the limit that is reached; from then on it does so at every look, so that
  // an evaluation in which somebody passed over the error still ends.
  void lookAtWork() override;
  // What a failed allocation means.
  const XQueryErrorText<>& allocationFailure() const;

 private:
  const XQueryErrorText<>* reachedLimit() const;
  int64_t stepsBetweenLooks() const;

  XQueryContext& _context;
  const XQueryLimits _limits;  // a copy: the host may set others meanwhile
  std::optional<std::chrono::steady_clock::time_point> _deadline;
  const WorkMeter _outer;  // what was in force before
  const XQueryErrorText<>* _reached = nullptr;
  bool _isRaising = false;
};

}  // namespace xquery

// Watches one evaluation or compilation on its thread and ends it at its limits.
//
// Evaluations nest: a query may have another one compiled and evaluated, and a loader or client of
// the host may evaluate something of its own. Whatever runs on the thread inside an evaluation is
// part of its work, so it also ends at the limits of those around it: the earliest deadline, any
// flag, and the least memory left count. This needs nothing of whoever begins the inner one, but
// for what is not a limit:
//
//   const auto inner = XQueryNestedContext(outer);         // loads what the outer one may load
//   const auto query = XQuery::xqueryWithSource(text, inner->contextLoading());
//   inner->evaluateXQuery(*query, {}, item, &error);       // its error may be passed over
//
// Compiling without limits of its own throws, once a limit is reached, what ends the outer one. An
// inner evaluation, or compilation with limits, that reaches a limit of an outer one gives back the
// error like any other; passed over or not, the outer one ends at its next look.
#pragma once

#include "Platform/Base/Abandoned.h"
#include "Platform/Base/WorkMeter.h"
#include "Types/XQueryErrors.h"
#include "xquery/Limits.h"
#include "xquery/XQuery.h"

namespace xquery {

class XQueryLimitWatch final : public WorkWatcher {
 public:
  // From here on, until it is destroyed, the thread works for this evaluation.
  explicit XQueryLimitWatch(XQueryContext& context);
  // The same for a compilation, which has no context to keep its error.
  explicit XQueryLimitWatch(const XQueryLimits& limits);
  ~XQueryLimitWatch();
  XQueryLimitWatch(const XQueryLimitWatch&) = delete;
  XQueryLimitWatch& operator=(const XQueryLimitWatch&) = delete;

  // Raises the error of the limit that is reached; from then on it does so at every look, so that
  // an evaluation in which somebody passed over the error still ends.
  void lookAtWork() override;
  // The error of the limit that was reached last; null for none.
  const Ref<XQueryError>& error() const { return _error; }
  // What a failed allocation means.
  const XQueryErrorText<>& allocationFailure() const;

 private:
  const XQueryErrorText<>* ownLimit() const;
  const XQueryErrorText<>* reachedLimit();
  bool isLimited() const;
  bool isTimeUp() const;
  static bool isOver(void* watch) noexcept;
  int64_t stepsBetweenLooks() const;

  XQueryLimitWatch(const XQueryLimits& limits, XQueryContext* context);

  XQueryContext* const _context;  // null for a compilation
  const XQueryLimits _limits;     // a copy: the host may set others meanwhile
  const std::optional<std::chrono::steady_clock::time_point> _deadline;
  XQueryLimitWatch* const _around;  // the evaluation that this one is part of, if any
  const WorkMeter _outer;           // what was in force before
  AbandonedValues* const _outerAbandoned;
  AbandonedValues _abandoned;
  const int64_t _mostBytes;  // by the limits of this one alone
  const XQueryErrorText<>* _reached = nullptr;
  Ref<XQueryError> _error;
  bool _isRaising = false;
};

// A context for an evaluation that is part of another one: a new one that loads by the same rules.
[[nodiscard]] Ref<XQueryContext> XQueryNestedContext(const XQueryContext& outer);

}  // namespace xquery

// What a compilation or an evaluation may take and load.
#pragma once

#include "C/Handles.h"
#include "xquery/capi/options.h"
#include "xquery/Limits.h"
#include "xquery/Loading.h"
#include "xquery/XQuery.h"

#include <atomic>
#include <memory>

struct xq_cancel : xquery::capi::Handle<xquery::capi::Tag::Cancel> {
  const std::shared_ptr<std::atomic<bool>> flag = std::make_shared<std::atomic<bool>>(false);
};

// A signal handler may write it.
static_assert(std::atomic<bool>::is_always_lock_free);

struct xq_options : xquery::capi::Handle<xquery::capi::Tag::Options> {
  xquery::XQueryWay way = xquery::XQueryWay::Planned;
  xquery::XQueryLimits limits;
  xquery::XQueryLoading loading;
};

namespace xquery::capi {

// Changes a part of the options where they are such; what is thrown leaves them as they were.
template <class Change>
xq_status changeOptions(xq_options* options, Change change) {
  if (!areGood(options)) return XQ_USAGE;
  return guarded([&] { return change(*options); });
}

}  // namespace xquery::capi

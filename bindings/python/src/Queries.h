// Compiled queries and their evaluation.
#pragma once

#include "Settings.h"
#include <xquery/Profile.h>

#include <atomic>
#include <optional>

namespace xquery::python {

// xquery._xquery.Compiled
struct Compiled {
  Ref<XQuery> query;
};

// xquery._xquery.Session: a context of the library that serves several evaluations, one at a time.
struct Session {
  Ref<XQueryContext> context;  // null once closed
  std::atomic<bool> isBusy = false;
};

}  // namespace xquery::python

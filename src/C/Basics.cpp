// Statuses, the version, and memory that is given back.
#include "xquery/capi/basics.h"

#include "C/Handles.h"
#include "Platform/Base/WorkMeter.h"
#include "xquery/Exception.h"
#include "xquery/Memory.h"

#include <array>
#include <new>
#include <stdexcept>

namespace xquery::capi {

namespace {

// What ends the work of a query ends what is called meanwhile, too. Nothing else that a query may
// fail with has a reason to arise where there is none.
xq_status statusOf(const NSException& failure) noexcept {
  const NSStringView reason = failure.reason() ? failure.reason()->view() : NSStringView();
  if (reason == "limit: out of memory") return XQ_MEMORY;
  return reason.startsWith(NSStringView::ascii("limit: ")) ? XQ_ERROR : XQ_INTERNAL;
}

}  // namespace

xq_status statusOfFailure() noexcept {
  try {
    throw;
  } catch (const HostFailed&) {
    return XQ_HOST;
  } catch (const std::bad_alloc&) {
    return XQ_MEMORY;
  } catch (const std::length_error&) {  // of a text or a list longer than any memory
    return XQ_MEMORY;
  } catch (const NSException& failure) {
    return statusOf(failure);
  } catch (...) {
    return XQ_INTERNAL;
  }
}

namespace {

constexpr std::array statusTexts = {
    "ok",
    "there is none",
    "the query failed",
    "the input cannot be read",
    "wrong use of the interface",
    "out of memory",
    "a value of another type or out of range",
    "a callback failed",
    "internal failure",
};
static_assert(statusTexts.size() == XQ_INTERNAL + 1);

}  // namespace
}  // namespace xquery::capi

using namespace xquery::capi;

const char* xq_status_text(xq_status status) {
  if (status < 0 || static_cast<size_t>(status) >= statusTexts.size()) return "unknown status";
  return statusTexts[static_cast<size_t>(status)];
}

const char* xq_version(void) {
  return XQUERY_VERSION;
}

int xq_version_number(void) {
  return XQUERY_VERSION_NUMBER;
}

xq_status xq_release_idle_memory(void) {
  return guarded([] {
    xquery::XQueryReleaseIdleMemory();
    return XQ_OK;
  });
}

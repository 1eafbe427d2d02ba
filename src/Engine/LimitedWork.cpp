#include "xquery/LimitedWork.h"

#include "Context/LimitWatch.h"
#include "Types/XQueryErrors.h"
#include "xquery/Exception.h"

#include <new>

namespace xquery {

// A watch inside another one ends at the limits of both.
Ref<XQueryError> XQueryWithinLimits(const XQueryLimits& limits, const std::function<void()>& work) {
  XQueryLimitWatch watch(limits);
  try {
    watch.lookAtWork();
    work();
    watch.lookAtWork();
  } catch (const NSException&) {
    if (!watch.error()) throw;
    return watch.error();
  } catch (const std::bad_alloc&) {
    return watch.allocationFailure().error();
  }
  return nullptr;
}

}  // namespace xquery

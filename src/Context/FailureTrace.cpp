#include "Context/FailureTrace.h"

#include "Platform/Base/XQueryErrorTrace.h"

#include <algorithm>

namespace xquery {

Ref<XQueryError> XQueryFailureTrace::on(const XQueryError& error,
                                        const Ref<XQueryPlaces>& places) const {
  constexpr uint64_t most = XQueryErrorTrace::mostAtEachEnd;
  const XQueryErrorTrace* own = XQueryErrorTrace::of(error);
  if (own && _count == 0) return Ref<XQueryError>(const_cast<XQueryError*>(&error));
  const auto trace = own ? own->copy() : XQueryErrorTrace::traceInPlaces(places, _place);
  const auto add = [&](const Call& call) {
    trace->addCall({call.place, Ref<NSString>(const_cast<NSString*>(call.function))});
  };
  for (uint64_t index = 0; index < std::min(_count, most); ++index) add(_innermost[index]);
  const uint64_t firstKnown = std::max(most, _count - std::min(_count, most));
  if (_count > firstKnown) trace->addUnknown(static_cast<int64_t>(firstKnown - most));
  for (uint64_t index = firstKnown; index < _count; ++index) add(_outermost[index % most]);
  return XQueryErrorTrace::error(error, trace);
}

}  // namespace xquery

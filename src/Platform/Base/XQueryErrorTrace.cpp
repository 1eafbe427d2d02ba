#include "Platform/Base/XQueryErrorTrace.h"

namespace xquery {

Ref<XQueryErrorTrace> XQueryErrorTrace::copy() const {
  auto other = traceInPlaces(_places, _place);
  other->_calls = _calls;
  other->_leftOut = _leftOut;
  return other;
}

void XQueryErrorTrace::addCall(XQueryTracedCall call) {
  _calls.push_back(std::move(call));
  if (_calls.size() <= 2 * mostAtEachEnd) return;
  _calls.erase(_calls.begin() + mostAtEachEnd);
  ++_leftOut;
}

Ref<XQueryError> XQueryErrorTrace::error(const XQueryError& error,
                                         Ref<XQueryErrorTrace> withTrace) {
  return make<XQueryError>(error, error._moduleURL, std::move(withTrace));
}

}  // namespace xquery

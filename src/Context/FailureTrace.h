// Where the error that is on its way out arose, and the calls that it has passed.
//
// Errors are common where they are passed over, in a predicate over irregular data for each item,
// and an endless recursion passes a million calls. So a failure writes down numbers only, and what
// an error is told with is made of them when somebody takes the error.
#pragma once

#include "Platform/Base/XQueryErrorTrace.h"

#include <array>
#include <cstddef>
#include <cstdint>

namespace xquery {

class XQueryFailureTrace {
 public:
  void begin(XQueryPlaceNumber place) {
    _place = place;
    _count = 0;
  }
  // The function's name is kept by the call, which belongs to the program.
  void addCall(XQueryPlaceNumber place, const NSString* function) {
    constexpr size_t most = XQueryErrorTrace::mostAtEachEnd;
    Call& call = _count < most ? _innermost[_count] : _outermost[_count % most];
    call = {place, function};
    ++_count;
  }
  // The error with the place and the calls; those that it has already come first.
  Ref<XQueryError> on(const XQueryError& error, const Ref<XQueryPlaces>& places) const;

 private:
  struct Call {
    XQueryPlaceNumber place;
    const NSString* function;
  };
  using Calls = std::array<Call, XQueryErrorTrace::mostAtEachEnd>;

  XQueryPlaceNumber _place = 0;
  uint64_t _count = 0;
  Calls _innermost;
  Calls _outermost;  // a ring of those after them
};

}  // namespace xquery

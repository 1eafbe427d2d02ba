// What an error knows of the program that it arose in: its place there and the calls around it.
#pragma once

#include "Platform/Base/XQueryPlaces.h"
#include "xquery/Error.h"
#include "xquery/Object.h"
#include "xquery/String.h"

#include <cstdint>
#include <vector>

namespace xquery {

struct XQueryTracedCall {
  XQueryPlaceNumber place;
  Ref<NSString> function;
};

// Immutable once an error has it.
class XQueryErrorTrace : public NSCounted {
 public:
  // Of a long list of calls these are kept, of the innermost and as many of the outermost.
  static constexpr size_t mostAtEachEnd = 32;

  [[nodiscard]] static Ref<XQueryErrorTrace> traceInPlaces(Ref<XQueryPlaces> places,
                                                           XQueryPlaceNumber place) {
    return make<XQueryErrorTrace>(std::move(places), place);
  }
  Ref<XQueryErrorTrace> copy() const;
  // The trace of an error; null when it has none.
  static const XQueryErrorTrace* of(const XQueryError& error) {
    return static_cast<const XQueryErrorTrace*>(error._placeAndCalls.get());
  }

  // The same error with that trace, or with none.
  [[nodiscard]] static Ref<XQueryError> error(const XQueryError& error,
                                              Ref<XQueryErrorTrace> withTrace);

  const XQueryPlaces& places() const { return *_places; }
  XQueryPlaceNumber place() const { return _place; }
  // Innermost first. `leftOut` stood between the first and the last `mostAtEachEnd` of them.
  const std::vector<XQueryTracedCall>& calls() const { return _calls; }
  int64_t leftOut() const { return _leftOut; }
  // Adds a call around those that are known.
  void addCall(XQueryTracedCall call);
  // Adds so many calls that nobody knows.
  void addUnknown(int64_t count) { _leftOut += count; }

 protected:
  XQueryErrorTrace(Ref<XQueryPlaces> places, XQueryPlaceNumber place)
      : NSCounted(Kind::Internal), _places(std::move(places)), _place(place) {}
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  Ref<XQueryPlaces> _places;
  XQueryPlaceNumber _place;
  std::vector<XQueryTracedCall> _calls;
  int64_t _leftOut = 0;
};

}  // namespace xquery

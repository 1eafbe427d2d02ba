// The objects that a literal answers.
//
// A literal answers its stored object, the same one each time. A loop asks millions of times, and
// each answer is counted; two threads with one query would move the count between their processors
// at every step. So only the threads at the place where the query was compiled get the stored
// object itself, and those at any other place (ThreadPlace.h) a copy of it, made when the first of
// them asks and kept with the literal. Within an evaluation, which no thread leaves, the object is
// the same each time whichever it is, and like any other it lives as long as somebody holds it. A
// node is one for all threads, which count it in advance (Credit.h).
#pragma once

#include "Platform/Base/ThreadPlace.h"
#include "xquery/Object.h"

#include <atomic>
#include <cstdint>

namespace xquery {

class XQueryLiteralCopies {
 public:
  explicit XQueryLiteralCopies(Value stored);
  ~XQueryLiteralCopies();
  XQueryLiteralCopies(const XQueryLiteralCopies&) = delete;
  XQueryLiteralCopies& operator=(const XQueryLiteralCopies&) = delete;

  const Value& stored() const { return _stored; }
  // For the calling thread.
  Value own() const {
    if (_place == anyPlace || _place == threadPlace()) return _stored;
    return copyAt(threadPlace());
  }

 private:
  static constexpr uint32_t anyPlace = UINT32_MAX;
  static constexpr uint32_t inTree = UINT32_MAX - 1;
  using Place = std::atomic<NSObject*>;

  static uint32_t placeOf(const NSObject* stored);
  Value copyAt(uint32_t place) const;
  Place* places() const;

  const Value _stored;
  const uint32_t _place;                         // where the stored object itself is answered
  mutable std::atomic<Place*> _places{nullptr};  // each holds a reference, or nothing yet
};

}  // namespace xquery

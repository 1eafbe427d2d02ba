// Who takes what a FLWOR yields, value after value, in place of a list of it.
//
//   sum(for $i in 1 to 1000000 return $i * 2 + 1)
//
// makes no list of a million items, and no object for each: what the return clause computes with
// machine numbers is added as it is.
#pragma once

#include "xquery/Object.h"

#include <cstdint>

namespace xquery {

class XQueryContext;

class XQueryItemFold {
 public:
  // A value in one of its shapes, as it would be added to the list.
  virtual void add(Value value) = 0;
  // An xs:integer, or an xs:double, that nobody has made an object of.
  virtual void addInteger(int64_t number) = 0;
  virtual void addDouble(double number) = 0;

 protected:
  ~XQueryItemFold() = default;
};

// An expression whose value can be added to a fold without being made first.
class XQueryItemYielder {
 public:
  // False when an error has come up instead of the value. Throws nothing.
  virtual bool yieldTo(XQueryItemFold& fold, XQueryContext& context) const = 0;

 protected:
  ~XQueryItemYielder() = default;
};

}  // namespace xquery

// A set of atomic values under the values' own equality (XQueryObjectsEqual).
//
// That equality is no equivalence: two integers beyond the precision of a double differ although
// both equal the same double. The set answers exactly what comparing with every value in it one by
// one would answer, because each part of it holds values among which equality is one:
//
//   strings      equal by text, and equal to nothing that is no string
//   exact        integers, decimals and booleans, equal among each other by exact value
//   floating     doubles and floats, by their value as a double
//   exactDoubles the values in `exact` as doubles: what a floating number is compared with, and
//                filled only once there is one. An exact number meets floating ones as a double
//                too.
//   others       every other class, equal only within itself
//
// No choice of values makes it slow. Hashing exact numbers by their digits, not as doubles, keeps
// a million integers that share one double apart, as hashing QNames by their namespaces too does
// for a million of one local part; and each part has an order to fall back on.
#pragma once

#include "Functions/FlatSet.h"
#include "Platform/Numbers/NSDecimal.h"
#include "xquery/Object.h"
#include "xquery/String.h"

#include <cstddef>
#include <cstdint>
#include <functional>

namespace xquery {

// An order of the atomic values that are neither texts nor numbers, in which only equal ones are
// neither less nor greater.
bool XQueryIsOrderedBefore(const NSObject& a, const NSObject& b);

struct XQueryOtherValueHash {
  uint64_t operator()(const NSObject* value) const;
};

class XQueryValueSet {
 public:
  // Adds the value; false when an equal one is there already. The value must outlive the set.
  bool insert(const NSObject& value);

 private:
  struct TextHash {
    uint64_t operator()(NSStringView text) const { return text.hash(); }
  };
  struct TextLess {
    bool operator()(NSStringView a, NSStringView b) const { return a.compare(b) < 0; }
  };
  struct ExactHash {
    uint64_t operator()(const NSDecimal& value) const;
  };
  struct ExactEqual {
    bool operator()(const NSDecimal& a, const NSDecimal& b) const { return a.compare(b) == 0; }
  };
  struct ExactLess {
    bool operator()(const NSDecimal& a, const NSDecimal& b) const { return a.compare(b) < 0; }
  };
  struct BitsHash {
    uint64_t operator()(uint64_t bits) const { return bits; }
  };
  struct ObjectEqual {
    bool operator()(const NSObject* a, const NSObject* b) const;
  };
  struct ObjectLess {
    bool operator()(const NSObject* a, const NSObject* b) const {
      return XQueryIsOrderedBefore(*a, *b);
    }
  };

  bool insertNumber(const NSNumber& number);
  bool insertFloating(double value);
  bool insertExact(NSDecimal value);

  using BitsSet = FlatSet<uint64_t, BitsHash, std::equal_to<>, std::less<>>;

  FlatSet<NSStringView, TextHash, std::equal_to<>, TextLess> _strings;
  FlatSet<NSDecimal, ExactHash, ExactEqual, ExactLess> _exact;
  BitsSet _floating;      // doubles by their bits
  BitsSet _exactDoubles;  // complete once `_floating` holds anything
  FlatSet<const NSObject*, XQueryOtherValueHash, ObjectEqual, ObjectLess> _others;
};

}  // namespace xquery

// Numbers and truth values that are no objects, and what the operators answer for them.
#pragma once

#include "xquery/Object.h"

#include <cstdint>

namespace xquery {

// A number, a truth value, or an object that has not been looked at. Unknown: it takes evaluating
// the expression to tell.
struct XQueryScalar {
  enum Form : uint8_t { Unknown, Integer, Double, Truth, Object };

  Form form = Unknown;
  union {
    int64_t integer = 0;
    double number;
    bool truth;
    const NSObject* object;  // kept alive by whom it was taken from
  };

  static XQueryScalar ofInteger(int64_t value) {
    XQueryScalar scalar;
    scalar.form = Integer;
    scalar.integer = value;
    return scalar;
  }
  static XQueryScalar ofDouble(double value) {
    XQueryScalar scalar;
    scalar.form = Double;
    scalar.number = value;
    return scalar;
  }
  static XQueryScalar ofTruth(bool value) {
    XQueryScalar scalar;
    scalar.form = Truth;
    scalar.truth = value;
    return scalar;
  }
  // Unknown where there is none.
  static XQueryScalar ofObject(const NSObject* value) {
    XQueryScalar scalar;
    if (!value) return scalar;
    scalar.form = Object;
    scalar.object = value;
    return scalar;
  }
};

// Each is what the operator answers; Unknown where an operand is something else than it knows, an
// integer leaves its word, or there would be an error.

// `type`: an operator of arithmetic.
XQueryScalar XQueryScalarArithmetic(int type, const XQueryScalar& left, const XQueryScalar& right);
// `code`: that of a value comparison.
XQueryScalar XQueryScalarComparison(int code, const XQueryScalar& left, const XQueryScalar& right);
// The effective boolean value.
XQueryScalar XQueryScalarTruth(const XQueryScalar& value);

}  // namespace xquery

// Numbers, truth values and parts of texts and lists that are no objects, and what the operators
// answer for them.
#pragma once

#include "xquery/Object.h"

#include <cstddef>
#include <cstdint>
#include <utility>
#include <vector>

namespace xquery {

// A number, a truth value, or an object that has not been looked at, which is one item where it
// has come through XQueryScalar::ofValue. Unknown: it takes evaluating the expression to tell.
//
//   Text    an xs:string that no object has been made for: so many units of the string `object`
//   Items   so many items of the array `object`, two or more; or none, of whatever object
struct XQueryScalar {
  enum Form : uint8_t { Unknown, Integer, Double, Truth, Object, Text, Items };

  Form form : 8 = Unknown;
  uint32_t start : 24 = 0;  // of a text and of items: the first unit, the first item
  uint32_t length = 0;
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
  // Unknown behind the first sixteen million units.
  static XQueryScalar ofText(const NSObject* string, uint32_t start, uint32_t length) {
    return ofPart(Text, string, start, length);
  }
  // Of two items or more.
  static XQueryScalar ofItems(const NSObject* array, uint32_t start, uint32_t length) {
    return ofPart(Items, array, start, length);
  }
  static XQueryScalar ofNothing();
  // Of an argument or an item: Unknown for what is no atomic value, node or list of items.
  static XQueryScalar ofValue(const NSObject* value);
  bool isNothing() const { return form == Items && length == 0; }
  bool hasObject() const { return form >= Object; }
  // Unknown where there is none.
  static XQueryScalar ofObject(const NSObject* value) {
    XQueryScalar scalar;
    if (!value) return scalar;
    scalar.form = Object;
    scalar.object = value;
    return scalar;
  }

 private:
  static XQueryScalar ofPart(Form form, const NSObject* object, uint32_t start, uint32_t length) {
    constexpr uint32_t farthest = (uint32_t{1} << 24) - 1;
    XQueryScalar scalar;
    if (start > farthest) return scalar;
    scalar.form = form;
    scalar.start = start;
    scalar.length = length;
    scalar.object = object;
    return scalar;
  }
};
static_assert(sizeof(XQueryScalar) == 16);

// Objects that were made on the way and that values refer to.
using XQueryScalarsMade = std::vector<Value>;
// Adds one. Where there is one there are often more.
inline XQueryScalar XQueryScalarMade(Value object, XQueryScalarsMade& made) {
  constexpr size_t likely = 16;
  if (made.capacity() == 0) made.reserve(likely);
  made.push_back(std::move(object));
  return XQueryScalar::ofObject(made.back().get());
}

// Each is what the operator answers; Unknown where an operand is something else than it knows, an
// integer leaves its word, or there would be an error.

// `type`: an operator of arithmetic.
XQueryScalar XQueryScalarArithmetic(int type, const XQueryScalar& left, const XQueryScalar& right);
// The same where numbers are objects, or become some: decimals and large integers.
XQueryScalar XQueryScalarLongArithmetic(int type, const XQueryScalar& left,
                                        const XQueryScalar& right, XQueryScalarsMade& made);
// `code`: that of a value comparison. Of single items.
XQueryScalar XQueryScalarComparison(int code, const XQueryScalar& left, const XQueryScalar& right);
// The same of numbers alone.
XQueryScalar XQueryScalarNumberComparison(int code, const XQueryScalar& left,
                                          const XQueryScalar& right);
// A general comparison, by the code of the value comparison, of items and lists.
XQueryScalar XQueryScalarGeneralComparison(int code, const XQueryScalar& left,
                                           const XQueryScalar& right);
// The effective boolean value.
XQueryScalar XQueryScalarTruth(const XQueryScalar& value);
// The number that it is: an object that is an integer or a double becomes one, anything else but a
// number is Unknown.
XQueryScalar XQueryScalarNumber(const XQueryScalar& value);
// The item at an index, from 0.
XQueryScalar XQueryScalarItem(const XQueryScalar& list, uint32_t index);
// How many items it is.
inline uint32_t XQueryScalarCount(const XQueryScalar& value) {
  return value.form == XQueryScalar::Items ? value.length : 1;
}
// The object that it is, made where there is none; null where it is Unknown.
Value XQueryScalarValue(const XQueryScalar& value);

}  // namespace xquery

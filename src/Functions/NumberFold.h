// Sums, averages and extremes of numbers that are added one after the other.
//
// A fold keeps what the numbers added so far come to. At the first item that it does not know (no
// number, NaN, one of very many digits) it turns into a list: what it has kept is its first item,
// for the functions go through a list from its beginning, and what they have got by then is what
// has been kept. Nothing that a fold does by itself can fail.
#pragma once

#include "Expr/Clauses/XQueryItemFold.h"
#include "Expr/XQuerySequence.h"
#include "Platform/Numbers/NSDecimal.h"
#include "Types/XQueryNumber.h"
#include "Types/XQueryNumericOperand.h"
#include "xquery/Object.h"

#include <cstdint>
#include <optional>

namespace xquery {

class XQueryContext;

// Adds numbers unboxed. Two exact ones are added as decimals, which is what addition does in both
// of their types; from the first double on every sum is a double.
class XQuerySumming {
 public:
  // Not for NaN, nor for what is no number.
  void add(const XQueryNumericOperand& operand);
  void addInteger(int64_t number);
  void addDouble(double number);

  // Whether the next addition cannot come to too many digits.
  bool isShort() const { return !_isExact || _exact.isShort(); }
  // Of what has been added.
  Value value() const;

 private:
  NSDecimal _exact;
  double _number = 0;
  bool _isExact = true;
  bool _isInteger = true;
  // The first double is taken as it is: adding it to zero would lose the sign of a negative zero.
  bool _isEmpty = true;
};

// One that may be the greatest or least: a number, or an untyped item read as a double.
struct XQueryCandidate {
  NSObject* item = nullptr;
  const NSNumber* number = nullptr;
  double untyped = 0;

  static XQueryCandidate of(NSObject* item, const XQueryNumericOperand& operand) {
    return {item, dyn_cast<NSNumber>(item), operand.number};
  }
  double doubleValue() const { return number ? number->doubleValue() : untyped; }
  int order(const XQueryCandidate& other) const {
    if (number && other.number) return number->compare(*other.number);
    const double a = doubleValue();
    const double b = other.doubleValue();
    return a < b ? -1 : a > b ? 1 : 0;
  }
  Value value() const {
    return number ? Value(item) : Value(XQueryNumber::numberWithDouble(untyped));
  }
};

class XQueryNumberFold final : public XQueryItemFold {
 public:
  enum class Aim : uint8_t { Sum, Greatest, Least };

  explicit XQueryNumberFold(Aim aim) : _aim(aim) {}
  void add(Value value) override;
  void addInteger(int64_t number) override;
  void addDouble(double number) override;

  // What the function may be given in place of all that has been added, in one of the shapes.
  Value argument();
  // Whether that is a list with the items behind those that were taken.
  bool isList() const { return _list.has_value(); }
  // How many items that has been.
  uint64_t count();

 private:
  void addItem(Value item);
  bool takes(const Value& item);
  void goOnAsList();
  Value kept() const;

  const Aim _aim;
  uint64_t _taken = 0;
  // The first item of a sum, or null where that is no object; the greatest or least so far.
  Value _item;
  XQuerySumming _sum;
  XQueryCandidate _best;
  std::optional<XQueryGatherer> _list;  // what was kept, and all behind it
  Value _gathered;                      // the list, once it is asked for
};

}  // namespace xquery
